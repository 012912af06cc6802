// The engine's message channel: everything the engine reports goes through the
// handler installed with T_set_err_handler, from whichever thread reports it.
#pragma once

#include "tarsel/errors.h"

namespace tarsel_ref {

// Sends one message to the installed handler; dropped when none is installed.
void emit_message(int level, const char *text);

// Installs `handler` (null: none); returns the one it replaces.
T_ErrHandler install_message_handler(T_ErrHandler handler);

}  // namespace tarsel_ref
