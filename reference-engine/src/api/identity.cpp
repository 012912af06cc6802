// identity.h: the engine's version text, build identifier and colour configuration.
#include <algorithm>
#include <cstring>
#include <string>

#include "core/entry.h"
#include "core/identity.h"
#include "tarsel/identity.h"

void get_tarsel_version_info(char *buffer, int max_chars) {
  tarsel_ref::enter("get_tarsel_version_info", static_cast<const void *>(buffer), max_chars);
  if (!buffer || max_chars < 0) return;
  const std::string text = tarsel_ref::version_text();
  const std::size_t n = std::min(text.size(), static_cast<std::size_t>(max_chars));
  std::memcpy(buffer, text.data(), n);
  buffer[n] = '\0';
}

const char *get_tarsel_build_id() {
  tarsel_ref::enter("get_tarsel_build_id");
  return tarsel_ref::build_id();
}

std::string Tarsel::get_ocio_path() {
  tarsel_ref::enter("Tarsel::get_ocio_path");
  return tarsel_ref::ocio_config_path();
}
