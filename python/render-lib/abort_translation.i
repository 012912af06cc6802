// How an engine abort reaches Python, and what it carries.
//
// The abort guard of every wrapper turns TarselAbortException into
// RuntimeError "Tarsel Abort". When the abort was caused by a host callback
// that failed (a frame loader on an engine thread, a drawing method on the
// calling thread), the callback's own exception becomes the RuntimeError's
// __cause__, so the host sees what went wrong in its code.

%{
#include <atomic>

// The exception of a host callback that failed on an engine thread, kept
// until the render call that the engine ends as an abort collects it. Guarded
// by the interpreter lock. Only the first failure is kept: later ones are
// consequences of the same abort.
static PyObject *failed_callback_exception = NULL;

// Set when a frame request was refused because the interpreter is ending, so
// that the render the engine ends as an abort says why.
static std::atomic<bool> frame_request_refused_at_exit(false);

// Whether the interpreter is shutting down (then no thread state may be made
// or dropped from a foreign thread).
static bool interpreter_finalizing()
{
#if PY_VERSION_HEX >= 0x030D0000
  return Py_IsFinalizing();
#else
  return _Py_IsFinalizing();
#endif
}

// Takes the interpreter lock for a scope and gives it back on every path out,
// an exception unwinding into the engine included.
class GilHeld {
public:
  GilHeld() : state_(PyGILState_Ensure()) {}
  ~GilHeld() { PyGILState_Release(state_); }
  GilHeld(const GilHeld &) = delete;
  GilHeld &operator=(const GilHeld &) = delete;
private:
  PyGILState_STATE state_;
};

// The pending Python exception as one normalised object with its traceback;
// clears the error indicator. Null when none is pending.
static PyObject *take_pending_exception()
{
  PyObject *type, *value, *traceback;
  PyErr_Fetch(&type, &value, &traceback);
  if (!type)
    return NULL;
  PyErr_NormalizeException(&type, &value, &traceback);
  if (traceback && value)
    PyException_SetTraceback(value, traceback);
  Py_XDECREF(type);
  Py_XDECREF(traceback);
  return value;
}

// Called with the lock held when a callback on an engine thread failed: the
// thread's error indicator goes with its temporary thread state, so the
// exception is moved where the render call will find it.
static void keep_callback_failure()
{
  PyObject *exception = take_pending_exception();
  if (!exception)
    exception = PyObject_CallFunction(PyExc_RuntimeError, "s", "a frame request failed in the host");
  if (failed_callback_exception)
    Py_XDECREF(exception);
  else
    failed_callback_exception = exception;
}

// Sets RuntimeError "Tarsel Abort", chained to the callback failure that
// caused it: one pending on this thread (a drawing method) or one kept from
// an engine thread (a frame loader).
static void raise_tarsel_abort()
{
  PyObject *cause = take_pending_exception();
  if (!cause) {
    cause = failed_callback_exception;
    failed_callback_exception = NULL;
  }
  if (frame_request_refused_at_exit.exchange(false) && !cause)
    cause = PyObject_CallFunction(PyExc_RuntimeError, "s", "a frame request was refused: the interpreter is ending");
  PyErr_SetString(PyExc_RuntimeError, "Tarsel Abort");
  if (!cause)
    return;
  PyObject *abort = take_pending_exception();
  if (abort) {
    Py_INCREF(cause);
    PyException_SetContext(abort, cause);
    PyException_SetCause(abort, cause);
    Py_INCREF(PyExc_RuntimeError);
    PyErr_Restore(PyExc_RuntimeError, abort, NULL);
  } else {
    Py_DECREF(cause);
  }
}
%}
