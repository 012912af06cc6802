// The engine's message channel: everything the engine reports goes through the
// handler installed with T_set_err_handler, from whichever thread reports it.
#pragma once

namespace tarsel_ref {

// Sends one message to the installed handler; dropped when none is installed.
void emit_message(int level, const char *text);

}  // namespace tarsel_ref
