// What a kernel gets to work with. Each effect's kernel is in its file in
// src/effects/, named by its definition.
//
// A kernel computes the effect for every pixel of the destination into a
// working image of the destination's size; the render around it reads the
// inputs, applies the mix and writes the result out. Coordinates: the frame
// is measured in render pixels (full-resolution pixels divided by the
// downsample factor), y downwards; the destination's pixel (x, y) covers the
// frame square whose top-left corner is (x0 + x, y0 + y).
#pragma once

#include <algorithm>
#include <functional>
#include <limits>
#include <memory>
#include <vector>

#include "catalogue/definition.h"
#include "rendering/colour.h"
#include "rendering/image.h"
#include "rendering/kernels/params.h"
#include "rendering/workers.h"
#include "tarsel/genotype.h"

namespace tarsel_ref {

// Set by the lens-flare render call: where its light is and how bright.
struct FlareCall {
  double center_x = 0.0, center_y = 0.0;  // frame position
  float brightness = 1.0f;
};

// The request flag: why a frame is wanted.
constexpr unsigned char kRequestOtherFrame = 0;      // another frame of an input
constexpr unsigned char kRequestPreviousOutput = 1;  // a frame of an input the previous output is rebuilt from

// Frames of the inputs other than those a render call hands over, asked of
// the host during the render (made by callbacks/frame_requests.h).
class OtherFrames {
public:
  virtual ~OtherFrames() = default;
  // Frame `frame` of input `input` (counted from 0) as the host returns it,
  // in working form; null when the host has no such frame. Throws
  // TarselAbortException when the host's callback threw (this request or an
  // earlier one: none is made after a failure) or an abort is requested, and
  // std::runtime_error when the answer's descriptor does not read.
  virtual std::shared_ptr<const WorkImage> request(int input, int frame, unsigned char flag) = 0;
};

// frame + offset, kept within the frames an int can name: a run of frames
// around the first or last one stops there instead of wrapping.
inline int offset_frame(int frame, long long offset) {
  return static_cast<int>(
      std::clamp<long long>(frame + offset, std::numeric_limits<int>::min(), std::numeric_limits<int>::max()));
}

struct KernelContext {
  const Genotype *genotype = nullptr;
  const ParamReader *params = nullptr;
  int width = 0, height = 0;
  int x0 = 0, y0 = 0;
  double frame_width = 0.0, frame_height = 0.0;
  int downsample = 1;
  int quality = 1;            // 0 draft, 1 normal, 2 best
  float pixel_aspect = 1.0f;  // pixel width over height
  int frame = 0;
  int frame_rate = 25;
  int seed = 0;
  int n_threads = 0;
  ColourSpace working = ColourSpace::linear;
  // One per descriptor input, never null: unconnected inputs hold their fallback.
  std::vector<std::shared_ptr<const WorkImage>> inputs;
  std::vector<bool> connected;
  std::shared_ptr<const WorkImage> previous;  // the previous output; null when none was given
  const FlareCall *flare_call = nullptr;
  OtherFrames *requests = nullptr;  // the host's frames; null when only the current frame is at hand

  const ParamReader &p() const { return *params; }
  const WorkImage &input(int i) const { return *inputs[static_cast<std::size_t>(i)]; }
  // Frame `frame` of input `i`: the call's image for the frame being
  // rendered, the fallback (every frame) of an unconnected input, otherwise
  // the host's answer to a frame request; null when the host has no such
  // frame or takes no requests. Call it outside rows(): requests are made
  // one at a time and may end the render (see OtherFrames::request).
  std::shared_ptr<const WorkImage> other_frame(int i, int frame) const;
  // A length in full-resolution pixels as render pixels.
  double length(double full_resolution) const { return full_resolution / downsample; }
  double seconds() const { return static_cast<double>(frame) / frame_rate; }
  // Runs row(y) for every destination line on the worker threads.
  void rows(const std::function<void(int)> &row) const { run_rows(height, n_threads, row); }
};

// What a kernel made (Kernel, catalogue/definition.h): its result in `out`
// (kWrote), or the number of an input that is the result unchanged (the
// render then copies that input's pixels as they are, so an effect that does
// nothing gives back exactly what it got).
constexpr int kWrote = -1;

// The lens-flare render call's kernel: the descriptor's flare parameter,
// lit at ctx.flare_call's position, over input 1.
int render_flare_call(const KernelContext &ctx, WorkImage &out);

}  // namespace tarsel_ref
