// Time Blur: the source blended with the average of its neighbouring frames,
// where a matte (moving with the clip) lets it.
#include "effects/registry.h"

namespace tarsel_ref {
namespace {

DescriptorDefinition time_blur() {
  DescriptorDefinition d;
  d.name = "Time Blur";
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
