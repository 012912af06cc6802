// A hand-written extension that parses the same twenty arguments as the
// module's render wrapper and calls the same engine entry, with the
// interpreter's vectorcall convention (METH_FASTCALL) and no generated code:
// the yardstick for the binding's own overhead. Built by render_binding.py.
#define PY_SSIZE_T_CLEAN
#include <Python.h>

#include <cstring>
#include <vector>

#include "tarsel/effect.h"

namespace {

void *proxy_address(PyObject *object) {
  PyObject *proxy = PyObject_GetAttrString(object, "this");
  if (!proxy) return nullptr;
  PyObject *number = PyNumber_Long(proxy);
  Py_DECREF(proxy);
  if (!number) return nullptr;
  void *address = PyLong_AsVoidPtr(number);
  Py_DECREF(number);
  return address;
}

bool to_int(PyObject *object, int *value) {
  const long v = PyLong_AsLong(object);
  if (v == -1 && PyErr_Occurred()) return false;
  *value = (int)v;
  return true;
}

bool to_float(PyObject *object, float *value) {
  const double v = PyFloat_AsDouble(object);
  if (v == -1.0 && PyErr_Occurred()) return false;
  *value = (float)v;
  return true;
}

PyObject *render(PyObject *, PyObject *const *args, Py_ssize_t nargs) {
  if (nargs != 20) {
    PyErr_Format(PyExc_TypeError, "render expected 20 arguments, got %zd", nargs);
    return nullptr;
  }
  EffectGlobals_t *instance = static_cast<EffectGlobals_t *>(proxy_address(args[0]));
  const char *texts[4] = {PyUnicode_AsUTF8(args[1]), PyUnicode_AsUTF8(args[17]), PyUnicode_AsUTF8(args[18]),
                          PyUnicode_AsUTF8(args[19])};
  int ints[8];
  const int int_positions[8] = {3, 4, 5, 6, 10, 12, 13, 14};
  float floats[2];
  const int float_positions[2] = {9, 11};
  for (int i = 0; i < 8; ++i)
    if (!to_int(args[int_positions[i]], &ints[i])) return nullptr;
  for (int i = 0; i < 2; ++i)
    if (!to_float(args[float_positions[i]], &floats[i])) return nullptr;
  int frame_rate;
  if (!instance || !texts[0] || !texts[1] || !texts[2] || !texts[3] || !to_int(args[15], &frame_rate)) return nullptr;
  Py_buffer dest;
  if (PyObject_GetBuffer(args[2], &dest, PyBUF_ND) != 0) return nullptr;
  void *dest_address = dest.buf;
  PyBuffer_Release(&dest);

  std::vector<T_RasterInfo *> rasters;
  for (Py_ssize_t i = 0; i < PyList_GET_SIZE(args[7]); ++i) {
    PyObject *item = PyList_GET_ITEM(args[7], i);
    rasters.push_back(item == Py_None ? nullptr : static_cast<T_RasterInfo *>(proxy_address(item)));
  }
  std::vector<Py_buffer> views(PyList_GET_SIZE(args[8]));
  std::vector<void *> images(views.size());
  for (size_t i = 0; i < views.size(); ++i) {
    PyObject *item = PyList_GET_ITEM(args[8], (Py_ssize_t)i);
    if (item == Py_None || PyObject_GetBuffer(item, &views[i], PyBUF_WRITABLE) != 0) {
      for (size_t j = 0; j < i; ++j) PyBuffer_Release(&views[j]);
      return nullptr;
    }
    images[i] = views[i].buf;
  }
  int result = 0;
  Py_BEGIN_ALLOW_THREADS
  result = render_tarsel_effect_to_native_image(
      instance, texts[0], dest_address, ints[0], ints[1], ints[2], ints[3], rasters.data(), images.data(), floats[0],
      ints[4], floats[1], ints[5], ints[6], ints[7], frame_rate, args[16] == Py_True, texts[1], texts[2], texts[3]);
  Py_END_ALLOW_THREADS
  for (Py_buffer &view : views) PyBuffer_Release(&view);
  return PyBool_FromLong(result != 0);
}

PyMethodDef methods[] = {
    {"render", (PyCFunction)(void (*)(void))render, METH_FASTCALL, nullptr},
    {nullptr, nullptr, 0, nullptr},
};

PyModuleDef module = {PyModuleDef_HEAD_INIT, "fastcall_render", nullptr, -1, methods};

}  // namespace

PyMODINIT_FUNC PyInit_fastcall_render() { return PyModule_Create(&module); }
