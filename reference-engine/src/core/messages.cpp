#include "core/messages.h"

#include <atomic>

#include "core/entry.h"
#include "tarsel/errors.h"

namespace tarsel_ref {
namespace {
std::atomic<T_ErrHandler> installed_handler{nullptr};
}

void emit_message(int level, const char *text) {
  if (T_ErrHandler handler = installed_handler.load()) handler(level, text);
}

}  // namespace tarsel_ref

T_ErrHandler T_set_err_handler(T_ErrHandler handler) {
  tarsel_ref::enter("T_set_err_handler", reinterpret_cast<const void *>(handler));
  return tarsel_ref::installed_handler.exchange(handler);
}
