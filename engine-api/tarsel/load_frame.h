// Loading of other frames of an input during a render.
#pragma once

#include <cstddef>

#include "tarsel/export.h"
#include "tarsel/limits.h"
#include "tarsel/raster_info.h"

// The Python object type, declared without the Python headers. Python.h
// declares it as `typedef struct _object {...} PyObject;`, which agrees with
// this declaration whichever comes first.
struct _object;
typedef struct _object PyObject;

// Host-side source of frames: returns the pixels of a frame of an input and
// the descriptor of those pixels.
class LoadFrameInterface {
public:
  // Pixels of `frame` of `input`, requested at width by height: a Python bytearray.
  virtual PyObject *load_frame(int input, int frame, int width, int height) = 0;

  // Descriptor of the pixels that the last load_frame for `input` returned.
  virtual T_RasterInfo current_raster_info(int input) = 0;

  // Destroys the frame source.
  virtual ~LoadFrameInterface() {}
};

// The engine's per-render state as a frame request sees it: one descriptor
// per input, starting 384 bytes into the state.
struct T_RenderState {
  unsigned char reserved_0[384];        // engine bytes 0-383
  T_RasterInfo input_info[MAX_INPUTS];  // offset 384: descriptor of each input
};

// Frame request of the engine: the per-render state (a T_RenderState), the
// input, the frame wanted, a request flag and two engine values; fills
// *out_info and returns the first byte of the frame's pixels, or null when
// there is no such frame.
typedef void *(*T_LoadOtherFrameFun)(void *render_state, int input, int frame, unsigned char flag, void *engine_data1,
                                     void *engine_data2, T_RasterInfo *out_info);

// Installs the process-wide frame-request callback (null removes it).
TARSEL_API void set_load_other_frame_into_buffer_fun(T_LoadOtherFrameFun fun);

static_assert(offsetof(T_RenderState, input_info) == 384, "T_RenderState::input_info at 384");
static_assert(sizeof(T_RenderState) == 384 + 104 * MAX_INPUTS, "T_RenderState size");
