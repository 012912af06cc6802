// Threads that come back into Python from native code, and the end of the
// interpreter.
//
// When the interpreter ends, a thread that asks for its lock afterwards is
// ended on the spot by unwinding it, and unwinding through the engine, or
// through a destructor (the director code's, or the one that takes the lock
// back while an engine exception unwinds a wrapper), aborts the process. So
// the module closes the way back first: at exit, before the interpreter
// starts to end, it stops threads from coming back and waits (a bounded
// time) for those on their way. A thread that comes later never takes the
// lock: an engine thread's frame request, or a Python thread returning from
// an engine call, waits for the process to end; an engine message is
// dropped.

%{
#include <atomic>
#include <chrono>
#include <thread>

static std::atomic<int> engine_threads_in_python(0);
static std::atomic<int> threads_taking_lock_back(0);
static std::atomic<bool> engine_threads_shut_out(false);
// The thread that ends the interpreter: it alone may still come back.
static std::atomic<std::thread::id> interpreter_ending_thread;

// Whether this thread may no longer take the interpreter lock. Past the
// atexit step only the ending thread may; an engine thread (never the ending
// one) also not once the interpreter is finalizing, should the step not have
// run.
static bool way_back_closed(bool engine_thread)
{
  const bool closed = engine_threads_shut_out.load() || (engine_thread && interpreter_finalizing());
  return closed && std::this_thread::get_id() != interpreter_ending_thread.load();
}

// Held by an engine thread for the whole of a callback, before it takes the
// interpreter lock. `open()` is false once the interpreter is ending.
class EngineCallbackEntry {
public:
  EngineCallbackEntry() : open_(true)
  {
    ++engine_threads_in_python;
    if (way_back_closed(true)) {
      --engine_threads_in_python;
      open_ = false;
    }
  }
  ~EngineCallbackEntry()
  {
    if (open_)
      --engine_threads_in_python;
  }
  EngineCallbackEntry(const EngineCallbackEntry &) = delete;
  EngineCallbackEntry &operator=(const EngineCallbackEntry &) = delete;
  bool open() const { return open_; }
private:
  bool open_;
};

// For a thread that may not come back: it waits, holding what it holds,
// until the process is gone.
[[noreturn]] static void park_engine_thread()
{
  for (;;)
    std::this_thread::sleep_for(std::chrono::hours(1));
}

// SWIG's release of the interpreter lock around an engine call (%threadallow),
// with the way back closed at the interpreter's end.
class ThreadAllowed {
public:
  ThreadAllowed() : released_(true), save_(PyEval_SaveThread()) {}
  ~ThreadAllowed() { end(); }
  void end()
  {
    if (!released_)
      return;
    released_ = false;
    ++threads_taking_lock_back;
    if (way_back_closed(false)) {
      --threads_taking_lock_back;
      park_engine_thread();
    }
    PyEval_RestoreThread(save_);
    --threads_taking_lock_back;
  }
  ThreadAllowed(const ThreadAllowed &) = delete;
  ThreadAllowed &operator=(const ThreadAllowed &) = delete;
private:
  bool released_;
  PyThreadState *save_;
};
#undef SWIG_PYTHON_THREAD_BEGIN_ALLOW
#undef SWIG_PYTHON_THREAD_END_ALLOW
#define SWIG_PYTHON_THREAD_BEGIN_ALLOW ThreadAllowed _swig_thread_allow
#define SWIG_PYTHON_THREAD_END_ALLOW _swig_thread_allow.end()

// Run by the interpreter's atexit, while it still runs every thread.
static PyObject *shut_engine_threads_out(PyObject *, PyObject *)
{
  interpreter_ending_thread = std::this_thread::get_id();
  engine_threads_shut_out = true;
  Py_BEGIN_ALLOW_THREADS
  const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(2);
  while ((engine_threads_in_python.load() > 0 || threads_taking_lock_back.load() > 0) &&
         std::chrono::steady_clock::now() < deadline)
    std::this_thread::sleep_for(std::chrono::milliseconds(1));
  Py_END_ALLOW_THREADS
  Py_RETURN_NONE;
}

// Registered with atexit directly, so it is no function of the module.
static PyMethodDef shut_engine_threads_out_method = {
  "shut_engine_threads_out", shut_engine_threads_out, METH_NOARGS,
  "Keeps threads in native code out of Python from here to the interpreter's end."
};

static void register_engine_thread_shutdown()
{
  PyObject *atexit_module = PyImport_ImportModule("atexit");
  PyObject *function = PyCFunction_New(&shut_engine_threads_out_method, NULL);
  PyObject *done = atexit_module && function ? PyObject_CallMethod(atexit_module, "register", "O", function) : NULL;
  Py_XDECREF(done);
  Py_XDECREF(function);
  Py_XDECREF(atexit_module);
  if (!done)
    PyErr_Clear();  // the module works without it; only the end of the process is less tidy
}
%}

%init %{
  register_engine_thread_shutdown();
%}
