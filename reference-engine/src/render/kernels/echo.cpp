// Echo: frames of the input a step apart laid together with the current one,
// each weighted by the decay once more than the one before it.
#include <algorithm>
#include <cmath>
#include <memory>
#include <vector>

#include "render/kernels/kernel.h"

namespace tarsel_ref {
namespace {

// Frame `frame` of input `input` in the render's working form, or null when
// it cannot be had. Only the frame being rendered is at hand for now; frame
// requests to the host come in here.
std::shared_ptr<const WorkImage> fetch_frame(const KernelContext &ctx, int input, int frame) {
  if (frame == ctx.frame) return ctx.inputs[static_cast<std::size_t>(input)];
  return nullptr;
}

enum Combine { kAdd = 0, kMaximum = 1, kAverage = 2, kOver = 3 };

}  // namespace

int render_echo(const KernelContext &ctx, WorkImage &out) {
  const ParamReader &p = ctx.p();
  const int echoes = std::clamp(p.whole("echoes"), 1, 32);
  const float decay = std::clamp(p.number("decay"), 0.0f, 1.0f);
  const double step = p.number("frame_step");
  const int combine = std::clamp(p.whole("combine"), 0, 3);

  struct Layer {
    std::shared_ptr<const WorkImage> image;
    float weight;
  };
  std::vector<Layer> layers;  // newest first
  float weight = 1.0f;
  for (int k = 0; k < echoes; ++k, weight *= decay) {
    const int frame = ctx.frame + static_cast<int>(std::lround(k * step));
    if (auto image = fetch_frame(ctx, 0, frame)) layers.push_back({image, weight});
  }
  if (layers.size() == 1 && layers[0].weight == 1.0f && layers[0].image == ctx.inputs[0]) return 0;
  float total = 0.0f;
  for (const Layer &l : layers) total += l.weight;

  ctx.rows([&](int y) {
    float *r = out.row(y);
    const std::size_t n = static_cast<std::size_t>(ctx.width) * 4;
    if (combine == kOver) {  // oldest at the bottom, each newer one over it
      std::fill(r, r + n, 0.0f);
      for (auto l = layers.rbegin(); l != layers.rend(); ++l) {
        const float *s = l->image->row(y);
        for (std::size_t i = 0; i < n; i += 4) {
          const float cover = 1.0f - s[i + 3] * l->weight;
          for (int c = 0; c < 4; ++c) r[i + c] = s[i + c] * l->weight + r[i + c] * cover;
        }
      }
      return;
    }
    if (layers.empty()) {
      std::fill(r, r + n, 0.0f);
      return;
    }
    for (std::size_t k = 0; k < layers.size(); ++k) {
      const float *s = layers[k].image->row(y);
      const float weight = layers[k].weight;
      for (std::size_t i = 0; i < n; ++i) {
        const float v = s[i] * weight;
        r[i] = k == 0 ? v : combine == kMaximum ? std::max(r[i], v) : r[i] + v;
      }
    }
    if (combine == kAverage && total > 0.0f && total != 1.0f)
      for (std::size_t i = 0; i < n; ++i) r[i] /= total;
  });
  return kWrote;
}

}  // namespace tarsel_ref
