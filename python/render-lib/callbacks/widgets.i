// On-screen widgets: the engine draws an effect's controls through a host
// drawing object (a Python subclass of GfxInterface) and reacts to the mouse.
// Both widget calls keep the interpreter lock: the engine draws on the calling
// thread, inside the call.

%{
#include "tarsel/gfx.h"

// The drawing object last given to the engine, or null. The engine holds it
// by plain pointer; the module remembers it only to take it back from the
// engine when it goes away.
static GfxInterface *installed_drawing = NULL;

static void install_gfx_impl(GfxInterface *gfx)
{
  tarsel_set_gfx_impl(gfx);
  installed_drawing = gfx;
}

// A widget call, from its argument check to its return. The engine runs the
// drawing object's Python methods on the calling thread inside the call, so
// the thread counts as running host callbacks (refused once the interpreter
// is ending), and the installed drawing object is held: a drawing method that
// uninstalls it and drops the last reference, or another thread that replaces
// it, does not free it while the engine draws through it.
class WidgetCall {
public:
  WidgetCall() : drawing_(NULL) {}
  ~WidgetCall() { Py_XDECREF(drawing_); }
  bool begin()
  {
    if (!callbacks_.open())
      return false;
    Swig::Director *director = dynamic_cast<Swig::Director *>(installed_drawing);
    drawing_ = director ? director->swig_get_self() : NULL;
    Py_XINCREF(drawing_);
    return true;
  }
  WidgetCall(const WidgetCall &) = delete;
  WidgetCall &operator=(const WidgetCall &) = delete;
private:
  HostCallbacksOnThisThread callbacks_;
  PyObject *drawing_;
};

// A vector of the engine's that a drawing method receives. The Python object
// refers to the engine's own vector, which is gone once the method returns:
// the object is then cut off (its pointer set to null), so a host that kept it
// gets an error instead of reading freed memory.
class LentToPython {
public:
  explicit LentToPython(PyObject *object) : object_(object) {}
  ~LentToPython()
  {
    SwigPyObject *wrapped = object_ ? SWIG_Python_GetSwigThis(object_) : NULL;
    if (wrapped)
      wrapped->ptr = NULL;
  }
  LentToPython(const LentToPython &) = delete;
  LentToPython &operator=(const LentToPython &) = delete;
private:
  PyObject *object_;
};
%}

// EffectGlobals_t *WidgetInstance
// The instance whose widgets a widget call draws or moves: held for the call
// as every instance argument is, with the call itself (see WidgetCall).
%typemap(check, noblock=1) EffectGlobals_t *WidgetInstance (InstanceUse use, WidgetCall call) {
  if ($1 && !use.enter($1, proxy$argnum))
    SWIG_exception_fail(SWIG_ValueError,
                        "in method '$symname', argument $argnum of type '$1_type': "
                        "no effect instance (freed by free_tarsel_effect)");
  if (!call.begin())
    SWIG_exception_fail(SWIG_RuntimeError,
                        "in method '$symname': the interpreter is ending; "
                        "widgets are drawn only on the thread that ends it");
}

// std::vector<float> &LentVector
// A drawing method's view of an engine vector, cut off when the method returns.
%typemap(directorin, noblock=1) std::vector<float> &LentVector {
  $input = SWIG_NewPointerObj(SWIG_as_voidptr(&$1), $descriptor(std::vector<float> *), 0);
  LentToPython lent_$1_name($input);
}

// Kinds of mouse event passed to an effect's on-screen widgets.
enum class MouseEventType {
  MOVE = 0,
  DRAG = 1,
  PRESS = 2,
  RELEASE = 3
};

%feature("director") GfxInterface;

// A drawing object that goes away is taken back from the engine first, so the
// engine never draws through a freed object.
%feature("action") GfxInterface::~GfxInterface {
  if (installed_drawing == arg1) {
    installed_drawing = NULL;
    try {
      tarsel_set_gfx_impl(NULL);
    } catch (const TarselAbortException &) {
      // A collected object cannot report an abort; the object goes all the same.
    }
  }
  delete arg1;
}

%apply std::vector<float> &LentVector { std::vector<float> &xs, std::vector<float> &ys };
class GfxInterface {
public:
  virtual ~GfxInterface();
  virtual void set_graphics_context(void *context) = 0;
  virtual void start_drawing(int mode) = 0;
  virtual void end_drawing() = 0;
  virtual void begin_line() = 0;
  virtual void end_line() = 0;
  virtual void line(float x1, float y1, float x2, float y2) = 0;
  virtual void lines(std::vector<float> &xs, std::vector<float> &ys) = 0;
  virtual void color_3f(float red, float green, float blue) = 0;
  virtual void stipple_on() = 0;
  virtual void stipple_off() = 0;
  virtual void stipple_pattern(unsigned short pattern) = 0;
  virtual void line_width(float width) = 0;
  virtual void flush() = 0;
  virtual void circle(float x, float y, float r) = 0;
  virtual void dot(float x, float y, float size) = 0;
  virtual void rect_filled(float x1, float y1, float x2, float y2) = 0;
  virtual void draw_text(const char *text, float x, float y) = 0;
  virtual long get_text_length_in_pixels(const char *text) = 0;
};

%clear std::vector<float> &xs, std::vector<float> &ys;

%rename(tarsel_set_gfx_impl) install_gfx_impl;
void install_gfx_impl(GfxInterface *gfx);

%apply EffectGlobals_t *WidgetInstance { EffectGlobals_t *globals };
void tarsel_widget_draw(EffectGlobals_t *globals, const char *param_name,
                        int view_xsize, int view_ysize,
                        float view_x, float view_y, float view_scale_x, float view_scale_y,
                        std::vector<float> values);

%apply T_WidgetResult WidgetResult { T_WidgetResult };
T_WidgetResult tarsel_widget_mouse_event(EffectGlobals_t *globals, const char *param_name,
                                         int view_xsize, int view_ysize,
                                         float view_x, float view_y, float view_scale_x, float view_scale_y,
                                         std::vector<float> values,
                                         int mouse_x, int mouse_y, MouseEventType event);
%clear EffectGlobals_t *globals;
