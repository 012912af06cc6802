// The engine's message channel to Python: one process-wide handler, a Python
// callable taking (level, message), installed with set_error_handler.

%{
#include "tarsel/errors.h"
%}

// Message levels, rising with severity. "NoBeep" levels are the quiet forms of
// their namesakes; "NoHdr" levels are shown without a header line. The module
// passes the level through; the handler decides what it means for display.
enum ErrLevel {
  Err_LogOnly = 0,
  Err_NoHdrNoBeep = 1,
  Err_InfoNoBeep = 2,
  Err_NoteNoBeep = 3,
  Err_Info = 4,
  Err_Note = 5,
  Err_NoHdr = 6,
  Err_Alert = 7,
  Err_Warning = 8,
  Err_Error = 9,
  Err_Fatal = 10
};

%{
// A proxy made while an exception is pending (a handler that raised during
// the engine call whose result it is) would lose that exception: making the
// proxy calls into Python. The exception is set aside and put back, so the
// call surfaces it as every other call does (a SystemError caused by it),
// and the result goes with the failed call.
static PyObject *new_pointer_object(void *pointer, swig_type_info *type, int flags)
{
  if (!PyErr_Occurred())
    return SWIG_Python_NewPointerObj(NULL, pointer, type, flags);
  PyObject *error_type, *value, *traceback;
  PyErr_Fetch(&error_type, &value, &traceback);
  PyObject *object = SWIG_Python_NewPointerObj(NULL, pointer, type, flags);
  if (object) {
    PyErr_Restore(error_type, value, traceback);
  } else {
    Py_XDECREF(error_type);
    Py_XDECREF(value);
    Py_XDECREF(traceback);
  }
  return object;
}
#undef SWIG_NewPointerObj
#define SWIG_NewPointerObj(pointer, type, flags) new_pointer_object(pointer, type, flags)

// The installed handler, or null. The module owns one reference to it.
static PyObject *installed_error_handler = NULL;

// Called by the engine from any thread, with or without a Python thread state.
// The handler's result is deliberately neither inspected nor released, and an
// exception it raises is left pending in the calling thread's state.
static void forward_engine_message(int level, const char *message)
{
  if (!installed_error_handler)
    return;
  EngineCallbackEntry entry;
  if (!entry.open())
    return;  // the interpreter is ending: the message has nowhere to go
  PyGILState_STATE gil = PyGILState_Ensure();
  // Read again under the lock: the handler may have been removed meanwhile.
  // Held for the call, which may replace it (the handler itself, or another
  // thread while the handler runs) and so drop the module's reference.
  PyObject *handler = installed_error_handler;
  if (handler) {
    Py_INCREF(handler);
    PyObject_CallFunction(handler, "(is)", level, message);
    Py_DECREF(handler);
  }
  PyGILState_Release(gil);
}

static PyObject *set_error_handler(PyObject *callback)
{
  if (callback != Py_None && !PyCallable_Check(callback)) {
    PyErr_SetString(PyExc_TypeError, "Callback must be callable");
    return NULL;
  }
  // The engine is told first, so an abort leaves the old handler in place.
  T_set_err_handler(callback == Py_None ? NULL : forward_engine_message);
  PyObject *previous = installed_error_handler;
  if (callback == Py_None) {
    installed_error_handler = NULL;
  } else {
    Py_INCREF(callback);
    installed_error_handler = callback;
  }
  Py_XDECREF(previous);
  Py_RETURN_NONE;
}
%}

PyObject *set_error_handler(PyObject *callback);
