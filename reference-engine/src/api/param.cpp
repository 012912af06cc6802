// param.h: the engine's string copy for parameter texts. The members of Param
// are the catalogue's (catalogue/param.cpp, param_kinds.cpp, param_text.cpp).
#include "catalogue/param_values.h"
#include "core/entry.h"
#include "tarsel/param.h"

char *tarsel_malloc_copy_string_func(const char *text) {
  auto scope = tarsel_ref::enter("tarsel_malloc_copy_string_func", text);
  char *copy = nullptr;
  tarsel_ref::replace_text(copy, text);
  return copy;
}
