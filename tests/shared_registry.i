// A second binding module, built by the tests with the same SWIG as _renderlib.
// It names T_RasterInfo and RenderContext without wrapping them, so the types
// it uses are the ones _renderlib published in the shared type registry.
%module shared_registry

%{
#include "tarsel/raster_info.h"
#include "tarsel/render_context.h"

// Stand-ins for engine render contexts: the identity rule compares and hashes
// handles without reading through them.
alignas(16) static char context_storage[2][16];

typedef unsigned char uchar_t;
%}

struct T_RasterInfo;
class RenderContext;

%inline %{
int raster_width(const T_RasterInfo *info) { return info ? info->ds_xsize : -1; }
T_RasterInfo *same_raster(T_RasterInfo *info) { return info; }
RenderContext *context_handle(int which) { return reinterpret_cast<RenderContext *>(context_storage[which & 1]); }

// The address of byte `offset` of a writable buffer (a bytearray, say) as the
// uchar_t pointer proxy that base64decode takes.
uchar_t *byte_address(PyObject *buffer, int offset) {
  Py_buffer view;
  if (PyObject_GetBuffer(buffer, &view, PyBUF_WRITABLE) != 0) {
    PyErr_Clear();
    return 0;
  }
  uchar_t *address = static_cast<uchar_t *>(view.buf) + offset;
  PyBuffer_Release(&view);
  return address;
}

// The address of any Python object as a void * pointer proxy.
void *object_address(PyObject *object) { return object; }

bool negate(bool value) { return !value; }
float halve(float value) { return value / 2; }
unsigned int echo_unsigned(unsigned int value) { return value; }
%}
