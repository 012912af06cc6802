// Custom typemaps of the module, named by what the argument means. SWIG's own
// typemaps serve everywhere else.
//
// Who frees what:
// | typemap                | memory                              | freed by                               |
// |------------------------|-------------------------------------|----------------------------------------|
// | EngineHeapText         | a text member of an engine record,  | the engine, with free(); the old value |
// |                        | on the C heap                       | here when it is replaced               |
// | RawImage,              | none: the caller's buffer, by       | nobody; the view is released at once   |
// | RenderDestination      | address                             |                                        |
// | RasterInfoList         | the array of descriptor pointers    | the wrapper, on every path             |
// |                        | and a snapshot of the list          |                                        |
// | RawImageList           | the address array, one view per     | the wrapper: views after the call,     |
// |                        | buffer and a snapshot of the list   | on every path                          |
// | (TYPEMAP, SIZE)        | none: the caller's buffer           | nobody; the view is released at once   |
// | ByteCount32            | an output on the wrapper's stack    | nothing to free                        |
// | ZeroedOutput           | an output on the wrapper's stack    | nothing to free                        |
// | RequiredRecord,        | none: refuses None                  | nothing to free                        |
// | RequiredText,          |                                     |                                        |
// | DecodeText/Dest/Length |                                     |                                        |
// | %vector_element_access | none: refuses an empty vector       | nothing to free                        |
// | OwnedProcessId         | a new pid_t                         | its proxy, as it dies                  |
// | get_allocator          | none: one static allocator per type | nothing to free                        |
// | RasterImageBytes       | the UTF-8 copy of the str           | the wrapper, on every path             |
// | WidgetResult           | the engine's result, by value       | the wrapper, after conversion          |
// | NameList               | the library's array of names        | the library; the module frees nothing  |
// | LiveDisplay, LiveImage,| none: checks against the module's   | nothing to free                        |
// | LiveImageOrNone        | record of objects it handed out     |                                        |

// char *EngineHeapText
// A text member that the engine releases with free(). Assignment frees the old
// text and stores a malloc'd copy of exactly strlen + 1 bytes (None stores
// null), so engine and module agree on the heap.
%typemap(memberin, noblock=1) char *EngineHeapText {
  {
    char *copy = 0;
    if ($input) {
      size_t size = strlen((const char *)$input) + 1;
      copy = (char *)malloc(size);
      if (!copy)
        SWIG_exception_fail(SWIG_MemoryError, "out of memory copying a parameter name");
      memcpy(copy, $input, size);
    }
    free($1);
    $1 = copy;
  }
}

%{
#include <vector>
%}

// SWIGTYPE *self
// The object a method is called on. A pointer argument accepts None as null,
// and a member call through null would crash the interpreter, so a None (or
// null) self is refused the way a null reference is.
%typemap(check, noblock=1) SWIGTYPE *self, SWIGTYPE const *self {
  if (!$1)
    SWIG_exception_fail(SWIG_ValueError,
                        "invalid null reference in method '$symname', argument $argnum of type '$1_type'");
}

// RawImage pixels
// Any object exporting the buffer protocol; its start address goes to the
// engine. The view (PyBUF_ND: contiguous, writability not requested) is
// released at once, so the exporter must keep its memory in place, unresized,
// for the whole call; a read-only object is accepted even where the engine
// writes. A failed request keeps its own error class (TypeError when it set
// none), with the argument message.
%{
// The start address of `input`'s buffer, or null with `message` set as the
// error; its class is the request's own, or `refusal` when that is given.
static void *raw_image_address(PyObject *input, const char *message, PyObject *refusal)
{
  Py_buffer view;
  if (PyObject_GetBuffer(input, &view, PyBUF_ND) != 0) {
    PyObject *type, *value, *traceback;
    PyErr_Fetch(&type, &value, &traceback);
    Py_XDECREF(value);
    Py_XDECREF(traceback);
    PyErr_SetString(refusal ? refusal : type ? type : PyExc_TypeError, message);
    Py_XDECREF(type);
    return NULL;
  }
  void *address = view.buf;
  PyBuffer_Release(&view);
  return address;
}
%}
%typemap(in, noblock=1) RawImage {
  $1 = raw_image_address($input, "in method '$symname', argument $argnum of type '(RawImage)'", NULL);
  if (!$1 && PyErr_Occurred())
    SWIG_fail;
}

// RawImage RenderDestination
// The destination of a render call: as RawImage, but a failed request is
// always TypeError, whatever the exporter raised.
%typemap(in, noblock=1) RawImage RenderDestination {
  $1 = raw_image_address($input, "in method '$symname', argument $argnum of type '(RawImage)'", PyExc_TypeError);
  if (!$1 && PyErr_Occurred())
    SWIG_fail;
}

%{
// A copy of a list argument's items, each referenced, so that Python code run
// while the items convert (a property, a buffer export) can neither shorten
// the list under the conversion nor free an item the engine is given.
static PyObject *list_argument_snapshot(PyObject *input)
{
  return PyList_GetSlice(input, 0, PY_SSIZE_T_MAX);
}

// The wrapped pointer object at the end of `item`'s chain of `this`
// attributes (a new reference), or null if there is none within a few steps.
// SWIG's own conversion follows the chain without end, so an object naming
// itself as its `this` would never come back, and it lets go of an
// attribute's value before using it.
static PyObject *wrapped_this(PyObject *item)
{
  PyObject *object = item;
  Py_INCREF(object);
  for (int step = 0; step < 8 && object; ++step) {
    if (SwigPyObject_Check(object))
      return object;
    PyObject *next = PyObject_GetAttr(object, SWIG_This());
    if (!next)
      PyErr_Clear();
    Py_DECREF(object);
    object = next;
  }
  Py_XDECREF(object);
  return NULL;
}
%}

// T_RasterInfo **RasterInfoList
// A list (or list subclass) of T_RasterInfo proxies and None, passed as an
// array of record pointers (null for None); an empty list passes a null
// array. Items are recognised by their class name "T_RasterInfo", not by
// inheritance. The items are held (a snapshot of the list) until the call
// has returned.
%typemap(in) T_RasterInfo **RasterInfoList (std::vector<T_RasterInfo *> rasters, PyObject *held = NULL) {
  if (!PyList_Check($input)) {
    PyErr_SetString(PyExc_TypeError, "in $symname, arg $argnum of type T_RasterInfo **: expected list.");
    SWIG_fail;
  }
  held = list_argument_snapshot($input);
  if (!held)
    SWIG_fail;
  rasters.resize((size_t)PyList_GET_SIZE(held));
  for (size_t i = 0; i < rasters.size(); ++i) {
    PyObject *item = PyList_GET_ITEM(held, (Py_ssize_t)i);
    if (std::strcmp(Py_TYPE(item)->tp_name, "T_RasterInfo") == 0) {
      void *pointer = 0;
      PyObject *wrapped = wrapped_this(item);
      int res = wrapped ? SWIG_ConvertPtr(wrapped, &pointer, $*1_descriptor, 0) : SWIG_ERROR;
      if (wrapped && PyList_Append(held, wrapped) != 0)  // held too: a `this` made on the spot
        res = SWIG_ERROR;
      Py_XDECREF(wrapped);
      if (!SWIG_IsOK(res))
        SWIG_exception_fail(
            SWIG_ArgError(res),
            "in method '$symname', argument $argnum of type 'T_RasterInfo **': cannot convert to T_RasterInfo");
      rasters[i] = static_cast<T_RasterInfo *>(pointer);
    } else if (item == Py_None) {
      rasters[i] = NULL;
    } else {
      PyErr_SetString(PyExc_TypeError, "in $symname, arg $argnum of type T_RasterInfo **, elts should be T_RasterInfo");
      SWIG_fail;
    }
  }
  $1 = rasters.empty() ? NULL : rasters.data();
}
%typemap(freearg) T_RasterInfo **RasterInfoList {
  Py_XDECREF(held$argnum);
}

// RawImage *RawImageList
// A list of writable buffer exporters and None, passed as an array of start
// addresses (null for None); an empty list passes a null array. Unlike a
// single RawImage, each view (PyBUF_WRITABLE) is held until the engine call
// has returned, so these buffers cannot be resized meanwhile.
%typemap(in) RawImage *RawImageList (std::vector<void *> addresses, std::vector<Py_buffer> views, PyObject *held = NULL) {
  if (!PyList_Check($input)) {
    PyErr_SetString(PyExc_TypeError, "in $symname, arg $argnum of type RawImage *: expected list.");
    SWIG_fail;
  }
  held = list_argument_snapshot($input);
  if (!held)
    SWIG_fail;
  const Py_ssize_t count = PyList_GET_SIZE(held);
  addresses.assign((size_t)count, NULL);
  views.reserve((size_t)count);
  for (Py_ssize_t i = 0; i < count; ++i) {
    PyObject *item = PyList_GET_ITEM(held, i);
    if (PyObject_CheckBuffer(item)) {
      Py_buffer view;
      if (PyObject_GetBuffer(item, &view, PyBUF_WRITABLE) != 0) {
        PyErr_Clear();
        PyErr_SetString(PyExc_TypeError, "in $symname, arg $argnum, cannot get Py_buffer view; maybe has no size?");
        SWIG_fail;
      }
      views.push_back(view);
      addresses[(size_t)i] = view.buf;
    } else if (item != Py_None) {
      PyErr_SetString(PyExc_TypeError,
                      "in $symname, arg $argnum, list must contain objects that support the buffer protocol");
      SWIG_fail;
    }
  }
  $1 = addresses.empty() ? NULL : reinterpret_cast<RawImage *>(addresses.data());
}
%typemap(freearg) RawImage *RawImageList {
  for (size_t i = 0; i < views$argnum.size(); ++i)
    PyBuffer_Release(&views$argnum[i]);
  views$argnum.clear();
  Py_XDECREF(held$argnum);
}

// int n_rasters (%render_list_count(RASTERS, IMAGES))
// The number of entries the engine reads from each of the two lists (the
// arguments numbered RASTERS and IMAGES); more than a non-empty list holds
// would have it read past the list's array.
%define %render_list_count(RASTERS, IMAGES)
%typemap(check, noblock=1) int n_rasters {
  if ($1 > 0 && ((!rasters##RASTERS.empty() && (size_t)$1 > rasters##RASTERS.size()) ||
                 (!addresses##IMAGES.empty() && (size_t)$1 > addresses##IMAGES.size())))
    SWIG_exception_fail(SWIG_ValueError, "in method '$symname', argument $argnum of type 'int': more entries than the rasters or images list holds");
}
%enddef

// (void *BufferAddress, size_t BufferSize)
// Any object with a buffer, by address and length, as the read-only buffer
// interface gives them (no writability check, no view kept). The engine
// writes through the address.
%typemap(in) (void *BufferAddress, size_t BufferSize) {
  Py_buffer view;
  if (PyObject_GetBuffer($input, &view, PyBUF_SIMPLE) != 0) {
    PyErr_Clear();
    SWIG_exception_fail(SWIG_TypeError, "in method '$symname', argument $argnum of type '(TYPEMAP, SIZE)'");
  }
  $1 = view.buf;
  $2 = (size_t)view.len;
  PyBuffer_Release(&view);
}

// size_t *ByteCount32
// A size_t output appended to the result as a signed 32-bit int: its low 32
// bits, so a count of 2**31 or more reads negative.
%typemap(in, numinputs=0) size_t *ByteCount32 (size_t count = 0) "$1 = &count;"
%typemap(argout) size_t *ByteCount32 {
  $result = SWIG_Python_AppendOutput($result, SWIG_From_int((int)(uint32_t)*$1));
}

// T_RasterInfo *RequiredRecord, char const *RequiredText
// An argument the function reads or writes through without a null check of
// its own: None is refused the way a null reference is, instead of crashing.
%typemap(check, noblock=1) T_RasterInfo *RequiredRecord, char const *RequiredText {
  if (!$1)
    SWIG_exception_fail(SWIG_ValueError,
                        "invalid null reference in method '$symname', argument $argnum of type '$1_type'");
}

// (char const *DecodeText, uchar_t *DecodeDest, int DecodeLength)
// A decode of `length` bytes reads the text and writes the destination, so
// both must be there unless the length is 0 (which touches neither); a
// negative length would zero (size_t)length bytes.
%typemap(check, noblock=1) (char const *DecodeText, uchar_t *DecodeDest, int DecodeLength) {
  if ($3 < 0)
    SWIG_exception_fail(SWIG_ValueError, "in method '$symname', argument 3 of type 'int' must not be negative");
  if ($3 > 0 && !$1)
    SWIG_exception_fail(SWIG_ValueError,
                        "invalid null reference in method '$symname', argument 1 of type 'char const *'");
  if ($3 > 0 && !$2)
    SWIG_exception_fail(SWIG_ValueError, "invalid null reference in method '$symname', argument 2 of type 'uchar_t *'");
}

// std::vector<TYPE> *self (%vector_element_access(TYPE))
// The vector a container method is called on. front, back and pop_back of an
// empty vector would read or shrink past its storage: they raise IndexError.
%{
static bool vector_method_needs_element(const char *symname)
{
  const char *ends[] = {"_front", "_back", "_pop_back"};
  const size_t length = std::strlen(symname);
  for (const char *end : ends) {
    const size_t size = std::strlen(end);
    if (length >= size && std::strcmp(symname + length - size, end) == 0)
      return true;
  }
  return false;
}
%}
%define %vector_element_access(TYPE)
%typemap(check, noblock=1) std::vector< TYPE > *self, std::vector< TYPE > const *self {
  if (!$1)
    SWIG_exception_fail(SWIG_ValueError, "invalid null reference in method '$symname', argument $argnum of type '$1_type'");
  if ($1->empty() && vector_method_needs_element("$symname"))
    SWIG_exception_fail(SWIG_IndexError, "in method '$symname': the vector is empty");
}
%enddef

// int *ZeroedOutput
// An int output appended to the result, starting at 0: an engine that fails
// without writing it gives 0, never whatever the wrapper's stack held.
%typemap(in, numinputs=0) int *ZeroedOutput (int value = 0) "$1 = &value;"
%typemap(argout) int *ZeroedOutput {
  $result = SWIG_Python_AppendOutput($result, SWIG_From_int(*$1));
}

// pid_t OwnedProcessId
// A process identifier returned as an opaque pid_t pointer proxy that owns a
// new pid_t. pid_t is no class, so SWIG has no function to free it with and
// an owning proxy would print a leak warning as it dies instead; the module
// gives the type one as it starts (kept out of the module's functions), so
// the proxy frees its copy silently. The proxy stays a bare pointer object.
%{
static PyObject *free_process_id(PyObject *, PyObject *dying)
{
  delete static_cast<pid_t *>(reinterpret_cast<SwigPyObject *>(dying)->ptr);
  Py_RETURN_NONE;
}

static void give_process_ids_a_destroy_function(swig_type_info *type)
{
  static PyMethodDef free_method = {"free_process_id", free_process_id, METH_O, "frees a pid_t"};
  static SwigPyClientData client_data;  // klass, newraw and pytype stay null
  if (type->clientdata || !(client_data.destroy = PyCFunction_New(&free_method, NULL)))
    return;
  type->clientdata = &client_data;
}
%}
%typemap(out) pid_t OwnedProcessId
  "$result = SWIG_NewPointerObj(new pid_t($1), $&1_descriptor, SWIG_POINTER_OWN | SWIG_POINTER_NOSHADOW);"
%init %{
  give_process_ids_a_destroy_function(SWIGTYPE_p_pid_t);
%}

// SWIGTYPE get_allocator
// A container's allocator. std::allocator has no state, so one shared
// instance per container type stands for every one of them and the proxy
// owns nothing; SWIG would hand it a new allocator it has no destructor for.
%typemap(out, noblock=1) SWIGTYPE get_allocator {
  static $1_ltype shared_allocator;
  $result = SWIG_NewPointerObj(&shared_allocator, $&1_descriptor, 0);
}

// char const *RasterImageBytes
// The 104-byte image of a raster descriptor, by the text rule of every
// char const * argument (a str, as UTF-8), keeping the encoded length: an
// image shorter than 104 bytes is refused, not over-read.
%typemap(in) char const *RasterImageBytes (char *buffer = 0, size_t size = 0, int alloc = 0) {
  int res = SWIG_AsCharPtrAndSize($input, &buffer, &size, &alloc);
  if (!SWIG_IsOK(res))
    SWIG_exception_fail(SWIG_ArgError(res), "in method '$symname', argument $argnum of type 'char const *'");
  if (!buffer || size < RASTER_INFO_IMAGE_SIZE + 1)
    SWIG_exception_fail(SWIG_ValueError,
                        "in method '$symname', argument $argnum: a raster descriptor image is 104 bytes");
  $1 = buffer;
}
%typemap(freearg) char const *RasterImageBytes "if (alloc$argnum == SWIG_NEWOBJ) delete[] buffer$argnum;"

// T_WidgetResult WidgetResult
// What a widget interaction set, as (status, ((name, (v0, v1, v2, v3)), ...)):
// the names decoded like every text result, each value all four channels.
%typemap(out) T_WidgetResult WidgetResult {
  const T_WidgetResult &interaction = $1;
  const std::vector<std::pair<std::string, T_WidgetValue> > &values = interaction.second;
  if (values.size() > (size_t)INT_MAX)
    SWIG_exception_fail(SWIG_OverflowError, "sequence size not valid in python");
  PyOwned changed(PyTuple_New((Py_ssize_t)values.size()));
  if (!changed.get())
    SWIG_fail;
  for (size_t i = 0; i < values.size(); ++i) {
    const T_WidgetValue &value = values[i].second;
    PyObject *entry = Py_BuildValue("(N(dddd))", engine_text(values[i].first.data(), values[i].first.size()),
                                    (double)value[0], (double)value[1], (double)value[2], (double)value[3]);
    if (!entry)
      SWIG_fail;
    PyTuple_SET_ITEM(changed.get(), (Py_ssize_t)i, entry);
  }
  $result = Py_BuildValue("(iN)", interaction.first, changed.release());
}

// const char ***NameList
// An operation that points a library-owned array at its argument and returns
// the number of names in it: the count (the wrapper's result) and the array
// become one list of str (UTF-8). Nothing is freed.
%typemap(in, numinputs=0, noblock=1) const char ***NameList (const char **names = 0) {
  $1 = ($1_ltype)&names;
}
%typemap(argout, noblock=1) const char ***NameList {
  {
    const Py_ssize_t count = result > 0 ? (Py_ssize_t)result : 0;
    PyOwned list(PyList_New(count));
    if (!list.get())
      SWIG_fail;
    for (Py_ssize_t i = 0; i < count; ++i) {
      const char *name = *$1 ? (const char *)(*$1)[i] : NULL;
      if (!name)
        SWIG_exception_fail(SWIG_SystemError, "in method '$symname': the library listed a null name");
      PyObject *text = PyUnicode_FromString(name);
      if (!text)
        SWIG_fail;
      PyList_SET_ITEM(list.get(), i, text);
    }
    Py_DECREF($result);
    $result = list.release();
  }
}

%{
#include <unordered_set>
#include "qrv/external_monitor.h"

// Displays and images that the module handed out and that are still alive.
// A display lives from EM_DisplayInit to release_external_monitor, an image
// from EM_XIImageWrapper to the removeRef that leaves no reference; a proxy
// used after that is refused instead of followed into freed memory. The
// interpreter lock guards both sets: no monitor function runs without it.
struct MonitorObjects {
  std::unordered_set<const void *> displays, images;
};
static MonitorObjects &monitor_objects()
{
  static MonitorObjects *objects = new MonitorObjects;  // outlives module teardown
  return *objects;
}
%}

// EM_Display *LiveDisplay
// A display from EM_DisplayInit that release_external_monitor has not
// destroyed; None, or a released display, is refused with ValueError.
%typemap(check, noblock=1) EM_Display *LiveDisplay {
  if (!$1 || !monitor_objects().displays.count($1))
    SWIG_exception_fail(SWIG_ValueError,
                        "in method '$symname', argument $argnum of type '$1_type': "
                        "no display (None, or released by release_external_monitor)");
}
// EM_Display * (a result): recorded as alive.
%typemap(ret, noblock=1) EM_Display * {
  if ($1)
    monitor_objects().displays.insert($1);
}

// EM_XIImage *LiveImage
// An image from EM_XIImageWrapper with a reference left; None, or an image
// whose last reference was removed, is refused with ValueError.
%typemap(check, noblock=1) EM_XIImage *LiveImage {
  if (!$1 || !monitor_objects().images.count($1))
    SWIG_exception_fail(SWIG_ValueError,
                        "in method '$symname', argument $argnum of type '$1_type': "
                        "no image (None, or its last reference was removed)");
}
// EM_XIImage *LiveImageOrNone
// As LiveImage, but None passes as null (the library answers it with a status).
%typemap(check, noblock=1) EM_XIImage *LiveImageOrNone {
  if ($1 && !monitor_objects().images.count($1))
    SWIG_exception_fail(SWIG_ValueError,
                        "in method '$symname', argument $argnum of type '$1_type': "
                        "its last reference was removed");
}
// EM_XIImage * (a result): recorded as alive.
%typemap(ret, noblock=1) EM_XIImage * {
  if ($1)
    monitor_objects().images.insert($1);
}
