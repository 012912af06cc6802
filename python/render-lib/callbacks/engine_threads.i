// Engine threads that call into Python, and the end of the interpreter.
//
// When the interpreter ends, a thread that asks for its lock afterwards is
// ended on the spot by unwinding it, and unwinding through the engine (or
// through a destructor of the director code) aborts the process. So the
// module closes the way in first: at exit, before the interpreter starts to
// end, it stops engine threads from entering Python and waits (a bounded
// time) for those inside a callback to leave. An engine thread that comes
// later never enters: a frame request waits for the process to end, a
// message is dropped.

%{
#include <atomic>
#include <chrono>
#include <thread>

static std::atomic<int> engine_threads_in_python(0);
static std::atomic<bool> engine_threads_shut_out(false);

// Held by an engine thread for the whole of a callback, before it takes the
// interpreter lock. `open()` is false once the interpreter is ending.
class EngineCallbackEntry {
public:
  EngineCallbackEntry() : open_(true)
  {
    ++engine_threads_in_python;
    if (engine_threads_shut_out.load() || interpreter_finalizing()) {
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

// For a request that can never be answered: the thread waits, holding what it
// holds, until the process is gone.
[[noreturn]] static void park_engine_thread()
{
  for (;;)
    std::this_thread::sleep_for(std::chrono::hours(1));
}

// Run by the interpreter's atexit, while it still runs every thread.
static PyObject *shut_engine_threads_out(PyObject *, PyObject *)
{
  engine_threads_shut_out = true;
  Py_BEGIN_ALLOW_THREADS
  const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(2);
  while (engine_threads_in_python.load() > 0 && std::chrono::steady_clock::now() < deadline)
    std::this_thread::sleep_for(std::chrono::milliseconds(1));
  Py_END_ALLOW_THREADS
  Py_RETURN_NONE;
}

// Registered with atexit directly, so it is no function of the module.
static PyMethodDef shut_engine_threads_out_method = {
  "shut_engine_threads_out", shut_engine_threads_out, METH_NOARGS,
  "Keeps engine threads out of Python from here to the interpreter's end."
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
