// errors.h: the engine's message handler.
#include "core/entry.h"
#include "core/messages.h"
#include "tarsel/errors.h"

T_ErrHandler T_set_err_handler(T_ErrHandler handler) {
  tarsel_ref::enter("T_set_err_handler", reinterpret_cast<const void *>(handler));
  return tarsel_ref::install_message_handler(handler);
}
