// Echo: earlier (or later) frames of the input laid over the current one,
// each fainter than the one before.
#include <algorithm>
#include <cmath>
#include <limits>
#include <memory>
#include <vector>

#include "catalogue/catalogue.h"
#include "rendering/kernels/kernel.h"

namespace tarsel_ref {
namespace {

// The kernel: frames of the input a step apart laid together with the current one,
// each weighted by the decay once more than the one before it.
// Frame `frame` of input `input` in the render's working form, or null when
// it cannot be had: the current frame from the call, others from the host's
// frame requests.
std::shared_ptr<const WorkImage> fetch_frame(const KernelContext &ctx, int input, int frame) {
  return ctx.other_frame(input, frame);
}

enum Combine { kAdd = 0, kMaximum = 1, kAverage = 2, kOver = 3 };

int render_echo(const KernelContext &ctx, WorkImage &out) {
  const ParamReader &p = ctx.p();
  const int echoes = std::clamp(p.whole("echoes"), 1, 32);
  const float decay = std::clamp(p.number("decay"), 0.0f, 1.0f);
  const double step = p.number("frame_step");
  const int combine = std::clamp(p.whole("combine"), 0, 3);

  // Echo k shows frames[k] at weights[k]. Counted wide: an echo before the
  // first or after the last frame an int can name is a frame the host lacks.
  std::vector<long long> frames;
  std::vector<float> weights;
  float weight = 1.0f;
  for (int k = 0; k < echoes; ++k, weight *= decay) {
    frames.push_back(static_cast<long long>(ctx.frame) + std::llround(k * step));
    weights.push_back(weight);
  }
  const std::size_t n = static_cast<std::size_t>(ctx.width) * 4;

  // Layers are laid into `out` as they come, so that only one fetched frame
  // is held at a time: Over from the oldest up, the others newest first. The
  // first layer waits until a second one comes, as it may be the result.
  std::shared_ptr<const WorkImage> first;
  float first_weight = 0.0f;
  int n_layers = 0;
  auto lay = [&](const WorkImage &image, float w, bool initial) {
    ctx.rows([&](int y) {
      float *r = out.row(y);
      const float *s = image.row(y);
      if (combine == kOver) {  // each newer layer over what is below it
        if (initial) std::fill(r, r + n, 0.0f);
        for (std::size_t i = 0; i < n; i += 4) {
          const float cover = 1.0f - s[i + 3] * w;
          for (int c = 0; c < 4; ++c) r[i + c] = s[i + c] * w + r[i + c] * cover;
        }
        return;
      }
      for (std::size_t i = 0; i < n; ++i) {
        const float v = s[i] * w;
        r[i] = initial ? v : combine == kMaximum ? std::max(r[i], v) : r[i] + v;
      }
    });
  };
  float total = 0.0f;  // weights of the layers present, in the order they come
  auto add = [&](std::shared_ptr<const WorkImage> image, float w) {
    total += w;
    if (++n_layers == 1) {
      first = std::move(image);
      first_weight = w;
      return;
    }
    if (first) {
      lay(*first, first_weight, true);
      first.reset();
    }
    lay(*image, w, false);
  };

  // Neighbouring echoes can show the same frame: it is fetched once.
  long long last_frame = 0;
  std::shared_ptr<const WorkImage> last;
  for (int j = 0; j < echoes; ++j) {
    const std::size_t k = static_cast<std::size_t>(combine == kOver ? echoes - 1 - j : j);
    if (j == 0 || frames[k] != last_frame) {
      last.reset();
      if (frames[k] >= std::numeric_limits<int>::min() && frames[k] <= std::numeric_limits<int>::max())
        last = fetch_frame(ctx, 0, static_cast<int>(frames[k]));
      last_frame = frames[k];
    }
    if (last) add(last, weights[k]);
  }
  last.reset();

  if (n_layers == 0) {
    ctx.rows([&](int y) { std::fill(out.row(y), out.row(y) + n, 0.0f); });
    return kWrote;
  }
  if (first) {  // the only layer
    if (first_weight == 1.0f && first == ctx.inputs[0]) return 0;
    lay(*first, first_weight, true);
  }
  if (combine == kAverage && total > 0.0f && total != 1.0f)
    ctx.rows([&](int y) {
      float *r = out.row(y);
      for (std::size_t i = 0; i < n; ++i) r[i] /= total;
    });
  return kWrote;
}

DescriptorDefinition echo() {
  DescriptorDefinition d;
  d.name = "Echo";
  d.kernel = render_echo;
  d.popup_name = "Echo";
  d.inputs = {{"Source", "src"}};
  d.need_other_frames = true;
  d.node_flags = kNodeReadsOtherFrames;
  d.params = {
      int_param("Echoes", "echoes", 4, 1, 32),
      float_param("Decay", "decay", 0.5f).bounds(0.0f, 1.0f).shown_as(format_percent, 100.0f),
      float_param("Frame Step", "frame_step", -1.0f)
          .bounds(-100.0f, 100.0f)
          .sliders(-10.0f, 10.0f)
          .shown_as(format_frames)
          .stepping(1.0f),
      popup_param("Combine", "combine", {"Add", "Maximum", "Average", "Over"}, 2),
  };
  return d;
}

}  // namespace

const PluginDefinition &echo_plugin() {
  static const PluginDefinition plugin{"T_Echo", "Time", false, false, {echo()}, nullptr};
  return plugin;
}

}  // namespace tarsel_ref
