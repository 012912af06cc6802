// Frame loading: the engine asks the host for other frames of an input during
// a render. The host subclasses LoadFrameInterface in Python and installs it
// with set_load_frame_impl; the adapter below turns each engine request into
// calls of its load_frame and current_raster_info methods.

%{
#include "tarsel/load_frame.h"

// The installed frame source, or null. Held by plain pointer: the host keeps
// its object alive (or disowns it) while it is installed.
static LoadFrameInterface *installed_frame_loader = NULL;
%}

%feature("director") LoadFrameInterface;

// PyObject *load_frame (a director's result)
// The director hands its result on as a new reference: the Python-visible
// wrapper returns it as its own, and the adapter drops it once it has the
// pixels' address.
%typemap(directorout) PyObject *load_frame "$result = $1; Py_XINCREF($result);"

// A source that goes away stops being the installed one, so the engine never
// calls a freed object.
%feature("action") LoadFrameInterface::~LoadFrameInterface {
  if (installed_frame_loader == arg1)
    installed_frame_loader = NULL;
  delete arg1;
}

class LoadFrameInterface {
public:
  virtual ~LoadFrameInterface();
  virtual PyObject *load_frame(int input, int frame, int width, int height) = 0;
  virtual T_RasterInfo current_raster_info(int input) = 0;
};

%{
// The address of a frame that load_frame returned, checked against the
// descriptor that current_raster_info gave for it. The engine reads the
// pixels after the interpreter lock is given back. The module holds the
// bytearray for the engine calls under way, but a request can come from an
// engine thread outside any module call, so the host must hold it too.
static void *frame_pixels_for_engine(PyObject *pixels, const T_RasterInfo &info)
{
  if (!PyByteArray_Check(pixels)) {
    PyErr_Format(PyExc_TypeError, "load_frame must return a bytearray, not '%.200s'", Py_TYPE(pixels)->tp_name);
    return NULL;
  }
  if (Py_REFCNT(pixels) < 2) {
    PyErr_SetString(PyExc_ValueError,
                    "load_frame's bytearray must stay referenced by the host until the render returns");
    return NULL;
  }
  T_RasterInfo layout = info;
  const int needed = make_tarsel_raster_info(&layout, info.ds_xsize, info.ds_ysize);
  if (needed > 0 && PyByteArray_GET_SIZE(pixels) < needed) {
    PyErr_Format(PyExc_ValueError, "load_frame returned %zd bytes; its descriptor describes %d",
                 PyByteArray_GET_SIZE(pixels), needed);
    return NULL;
  }
  return PyByteArray_AS_STRING(pixels);
}

// An engine thread that makes frame requests keeps its Python thread state
// from its first request until it ends: making and dropping one per request
// would cost more than the request itself. Kept by holding one extra count
// of PyGILState_Ensure, given back when the thread exits.
class EngineThreadState {
public:
  // Called with the interpreter lock held by this thread's own Ensure.
  void keep()
  {
    if (!kept_) {
      state_ = PyGILState_Ensure();
      kept_ = true;
    }
  }
  ~EngineThreadState()
  {
    if (!kept_ || !Py_IsInitialized())
      return;
    EngineCallbackEntry entry;
    if (!entry.open())
      return;  // the interpreter is ending: the state goes with it
    PyGILState_STATE taken = PyGILState_Ensure();
    PyGILState_Release(state_);  // the kept count; the lock stays
    PyGILState_Release(taken);   // the last count: the state goes, the lock with it
  }
private:
  bool kept_ = false;
  PyGILState_STATE state_ = PyGILState_LOCKED;
};
static thread_local EngineThreadState engine_thread_state;

// The engine's frame request. Runs on an engine thread, takes the interpreter
// lock for the whole request and gives it back on every path. The source's
// Python object is held for the request, so a host that drops its last
// reference meanwhile does not free it under the engine, and the frame's
// bytearray is held until the engine calls under way have returned, so a
// source that lets go of it (or of itself) does not free the pixels the
// engine reads. A failure (the host's exception, a wrong result) is kept for
// the render call, which the engine ends as an abort, and goes on into the
// engine as the native exception it is. Once the interpreter is ending, the
// request fails without taking the lock.
static void *load_frame_for_engine(void *render_state, int input, int frame, unsigned char, void *, void *,
                                   T_RasterInfo *out_info)
{
  EngineCallbackEntry entry;
  if (!entry.open()) {
    frame_request_refused_at_exit = true;
    throw InterpreterEnding();
  }
  GilHeld gil;
  engine_thread_state.keep();
  LoadFrameInterface *loader = installed_frame_loader;
  if (!loader)
    return NULL;
  Swig::Director *director = dynamic_cast<Swig::Director *>(loader);
  PyObject *self = director ? director->swig_get_self() : NULL;
  Py_XINCREF(self);
  PyOwned held(self);
  try {
    if (input < 0 || input >= MAX_INPUTS) {
      PyErr_Format(PyExc_IndexError, "the engine asked a frame loader for input %d", input);
      throw Swig::DirectorMethodException();
    }
    const T_RasterInfo &wanted = static_cast<T_RenderState *>(render_state)->input_info[input];
    PyOwned pixels(loader->load_frame(input, frame, wanted.ds_xsize, wanted.ds_ysize));
    *out_info = loader->current_raster_info(input);
    void *address = frame_pixels_for_engine(pixels.get(), *out_info);
    if (!address)
      throw Swig::DirectorMethodException();
    calls_without_lock().keep(pixels.get());
    return address;
  } catch (const TarselAbortException &) {
    throw;  // the engine's own abort, raised inside the request: no host failure to report
  } catch (...) {
    keep_callback_failure();
    throw;
  }
}

static void set_load_frame_impl(LoadFrameInterface *loader)
{
  // The engine is told first, so an abort leaves the installed source as it was.
  set_load_other_frame_into_buffer_fun(load_frame_for_engine);
  installed_frame_loader = loader;
}
%}

void set_load_frame_impl(LoadFrameInterface *loader);
