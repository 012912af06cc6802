#include "core/messages.h"

#include <atomic>

#include "tarsel/errors.h"

namespace tarsel_ref {
namespace {
std::atomic<T_ErrHandler> installed_handler{nullptr};
}

void emit_message(int level, const char *text) {
  if (T_ErrHandler handler = installed_handler.load()) handler(level, text);
}

T_ErrHandler install_message_handler(T_ErrHandler handler) { return installed_handler.exchange(handler); }

}  // namespace tarsel_ref
