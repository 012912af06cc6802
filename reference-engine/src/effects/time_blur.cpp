// Time Blur: the source blended with the average of its neighbouring frames,
// where a matte (moving with the clip) lets it.
#include <algorithm>
#include <memory>

#include "catalogue/catalogue.h"
#include "rendering/buffers.h"
#include "rendering/kernels/kernel.h"
#include "rendering/pixels.h"

namespace tarsel_ref {
namespace {

// The kernel: the source blended with the average of its frames around the
// current one, by the amount times the matte's luma over the same frames.
int render_time_blur(const KernelContext &ctx, WorkImage &out) {
  const ParamReader &p = ctx.p();
  const int before = std::clamp(p.whole("frames_before"), 0, 16);
  const int after = std::clamp(p.whole("frames_after"), 0, 16);
  const float amount = std::clamp(p.number("amount"), 0.0f, 1.0f);
  // Without frame requests only the current frame is at hand: its average is itself.
  if (amount <= 0.0f || before + after == 0 || !ctx.requests) return 0;

  const std::size_t n = static_cast<std::size_t>(ctx.width) * 4;
  // Sums over the frames present, one frame at a time: the source's in
  // `out`, the matte's luma (within 0..1) in `matte`.
  FloatBuffer matte = acquire_floats(static_cast<std::size_t>(ctx.width) * static_cast<std::size_t>(ctx.height));
  int n_frames = 0, n_mattes = 0;
  const int first_frame = offset_frame(ctx.frame, -before), last_frame = offset_frame(ctx.frame, after);
  for (long long f = first_frame; f <= last_frame; ++f) {
    const int frame = static_cast<int>(f);
    std::shared_ptr<const WorkImage> source = ctx.other_frame(0, frame);
    if (!source) continue;
    const bool initial = n_frames++ == 0;
    ctx.rows([&](int y) {
      float *r = out.row(y);
      const float *s = source->row(y);
      for (std::size_t i = 0; i < n; ++i) r[i] = initial ? s[i] : r[i] + s[i];
    });
    source.reset();
    std::shared_ptr<const WorkImage> mask = ctx.other_frame(1, frame);
    if (!mask) continue;
    const bool first_matte = n_mattes++ == 0;
    ctx.rows([&](int y) {
      float *m = matte.get() + static_cast<std::size_t>(y) * static_cast<std::size_t>(ctx.width);
      const float *s = mask->row(y);
      for (int x = 0; x < ctx.width; ++x) {
        const float *px = s + x * 4;
        const float luma = std::clamp(kLumaR * px[0] + kLumaG * px[1] + kLumaB * px[2], 0.0f, 1.0f);
        m[x] = first_matte ? luma : m[x] + luma;
      }
    });
  }
  if (n_frames <= 1) return 0;  // only the current frame

  const WorkImage &current = ctx.input(0);
  ctx.rows([&](int y) {
    float *r = out.row(y);
    const float *s = current.row(y);
    const float *m = matte.get() + static_cast<std::size_t>(y) * static_cast<std::size_t>(ctx.width);
    for (int x = 0; x < ctx.width; ++x) {
      const float w = n_mattes > 0 ? amount * m[x] / static_cast<float>(n_mattes) : amount;
      for (int c = 0; c < 4; ++c) {
        const std::size_t i = static_cast<std::size_t>(x) * 4 + static_cast<std::size_t>(c);
        r[i] = s[i] * (1.0f - w) + r[i] / static_cast<float>(n_frames) * w;
      }
    }
  });
  return kWrote;
}

DescriptorDefinition time_blur() {
  DescriptorDefinition d;
  d.name = "Time Blur";
  d.kernel = render_time_blur;
  d.popup_name = "Time Blur";
  // An unconnected matte blurs the whole frame.
  d.inputs = {{"Source", "src"}, {"Matte", "matte", true, kFallbackConstant, 1.0f}};
  d.mask_color = true;
  d.need_other_frames = true;
  d.node_flags = kNodeReadsOtherFrames;
  d.params = {
      int_param("Frames Before", "frames_before", 2, 0, 16).shown_as(format_frames),
      int_param("Frames After", "frames_after", 2, 0, 16).shown_as(format_frames),
      float_param("Amount", "amount", 1.0f).bounds(0.0f, 1.0f).shown_as(format_percent, 100.0f),
  };
  return d;
}

}  // namespace

const PluginDefinition &time_blur_plugin() {
  static const PluginDefinition plugin{"T_TimeBlur", "Time", false, false, {time_blur()}, nullptr};
  return plugin;
}

}  // namespace tarsel_ref
