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
// lock: an engine thread's frame request fails (its render ends as an
// abort), an engine message is dropped, a Python thread returning from an
// engine call waits for the process to end, and a Python thread is refused
// a widget call (whose drawing methods would run Python inside the engine).
// The thread that ends the interpreter is never shut out: its atexit
// functions, finalizers and __del__ methods may still render.

%begin %{
// Import enables thread support last; see renderlib_initialize_threads.
#define SWIG_PYTHON_INITIALIZE_THREADS renderlib_initialize_threads()
%}

%{
// From Python 3.9 on the interpreter always runs with thread support and
// PyEval_InitThreads is deprecated; before that the module must enable it so
// that wrappers can release the lock and engine threads can re-enter Python.
static void renderlib_initialize_threads()
{
#if PY_VERSION_HEX < 0x03090000
  PyEval_InitThreads();
#endif
}
%}

%{
#include <atomic>
#include <chrono>
#include <deque>
#include <exception>
#include <thread>
#include <vector>

static std::atomic<int> engine_threads_in_python(0);
static std::atomic<int> threads_taking_lock_back(0);
static std::atomic<int> python_threads_in_host_callbacks(0);
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

// Counts a thread in `count` for a scope, unless the way back is closed.
// `open()` is false (and nothing counted) once the interpreter is ending.
class ThreadCountedIn {
public:
  ThreadCountedIn(std::atomic<int> &count, bool engine_thread) : count_(count), open_(true)
  {
    ++count_;  // counted before the look, so the atexit step cannot miss it
    if (way_back_closed(engine_thread)) {
      --count_;
      open_ = false;
    }
  }
  ~ThreadCountedIn()
  {
    if (open_)
      --count_;
  }
  ThreadCountedIn(const ThreadCountedIn &) = delete;
  ThreadCountedIn &operator=(const ThreadCountedIn &) = delete;
  bool open() const { return open_; }
private:
  std::atomic<int> &count_;
  bool open_;
};

// Held by an engine thread for the whole of a callback, before it takes the
// interpreter lock.
class EngineCallbackEntry : public ThreadCountedIn {
public:
  EngineCallbackEntry() : ThreadCountedIn(engine_threads_in_python, true) {}
};

// Held by a Python thread for an engine call during which the engine calls
// Python methods on that thread (the widget calls). Such a thread runs
// Python inside engine frames: were the interpreter to end it there, the
// unwinding would pass through director code that needs the interpreter.
class HostCallbacksOnThisThread : public ThreadCountedIn {
public:
  HostCallbacksOnThisThread() : ThreadCountedIn(python_threads_in_host_callbacks, false) {}
};

// What a frame request throws into the engine once the interpreter is
// ending: the request fails without the interpreter, and the render ends as
// an abort. Caught by the engine, never by Python.
struct InterpreterEnding : std::exception {
  const char *what() const noexcept override { return "the interpreter is ending"; }
};

// For a thread that may not come back: it waits, holding what it holds,
// until the process is gone.
[[noreturn]] static void park_engine_thread()
{
  for (;;)
    std::this_thread::sleep_for(std::chrono::hours(1));
}

// The engine calls that run without the interpreter lock, and Python objects
// the engine may read during them (a frame request's pixels). Such an object
// is kept until every call that was under way when it was kept has returned:
// the engine reads a frame only inside a call, and the host may drop its own
// reference as soon as its callback returns. Guarded by the interpreter lock.
class CallsWithoutLock {
public:
  unsigned long long begin()
  {
    under_way_.push_back(++started_);
    return started_;
  }
  void end(unsigned long long call)
  {
    for (size_t i = 0; i < under_way_.size(); ++i) {
      if (under_way_[i] == call) {
        under_way_[i] = under_way_.back();
        under_way_.pop_back();
        break;
      }
    }
    unsigned long long oldest = started_ + 1;
    for (unsigned long long other : under_way_)
      oldest = other < oldest ? other : oldest;
    while (!kept_.empty() && kept_.front().first < oldest) {
      PyObject *object = kept_.front().second;
      kept_.pop_front();
      Py_DECREF(object);  // may run host code: the queue is consistent first
    }
  }
  // Takes a reference to `object` for the calls under way; false when none is.
  bool keep(PyObject *object)
  {
    if (under_way_.empty())
      return false;
    Py_INCREF(object);
    kept_.push_back(std::make_pair(started_, object));
    return true;
  }
private:
  unsigned long long started_ = 0;
  std::vector<unsigned long long> under_way_;
  std::deque<std::pair<unsigned long long, PyObject *> > kept_;
};
static CallsWithoutLock &calls_without_lock()
{
  static CallsWithoutLock *calls = new CallsWithoutLock;  // kept objects may outlive module teardown
  return *calls;
}

// SWIG's release of the interpreter lock around an engine call (%threadallow),
// with the way back closed at the interpreter's end.
class ThreadAllowed {
public:
  ThreadAllowed() : released_(true), call_(calls_without_lock().begin()), save_(PyEval_SaveThread()) {}
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
    calls_without_lock().end(call_);
  }
  ThreadAllowed(const ThreadAllowed &) = delete;
  ThreadAllowed &operator=(const ThreadAllowed &) = delete;
private:
  bool released_;
  unsigned long long call_;
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
  while ((engine_threads_in_python.load() > 0 || threads_taking_lock_back.load() > 0 ||
          python_threads_in_host_callbacks.load() > 0) &&
         std::chrono::steady_clock::now() < deadline)
    std::this_thread::sleep_for(std::chrono::milliseconds(1));
  Py_END_ALLOW_THREADS
  Py_RETURN_NONE;
}

// Registered with atexit directly, so it is no function of the module.
static PyMethodDef shut_engine_threads_out_method = {
    "shut_engine_threads_out", shut_engine_threads_out, METH_NOARGS,
    "Keeps threads in native code out of Python from here to the interpreter's end."};

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
