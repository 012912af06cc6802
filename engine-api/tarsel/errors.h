// Message reporting and render abort of the tarsel_ps engine.
#pragma once

#include "tarsel/export.h"

// Severity of an engine message, rising from log-only to fatal.
enum ErrLevel {
  Err_LogOnly = 0,  // written to the log only
  Err_NoHdrNoBeep,  // shown without a header line, silently
  Err_InfoNoBeep,   // information, silently
  Err_NoteNoBeep,   // note, silently
  Err_Info,         // information
  Err_Note,         // note
  Err_NoHdr,        // shown without a header line
  Err_Alert,        // alert
  Err_Warning,      // warning
  Err_Error,        // error
  Err_Fatal         // fatal error
};

// Receives every engine message: its ErrLevel and its NUL-terminated text.
// The engine may call it from any thread, render worker threads included.
typedef void (*T_ErrHandler)(int level, const char *message);

// Installs the process-wide message handler and returns the one it replaces;
// a null handler removes it (messages are then dropped).
TARSEL_API T_ErrHandler T_set_err_handler(T_ErrHandler handler);

// Thrown by value out of any engine entry point when a render is aborted
// (see tarsel_abort_render) or the engine gives up on a call.
class TARSEL_API TarselAbortException {
public:
  // Destroys the exception; defined in the engine, so that its type
  // information is emitted and exported there alone.
  virtual ~TarselAbortException();

  // Short text describing the abort.
  const char *what() const;
};
