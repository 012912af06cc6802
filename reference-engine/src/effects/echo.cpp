// Echo: earlier (or later) frames of the input laid over the current one,
// each fainter than the one before.
#include "effects/registry.h"

namespace tarsel_ref {
namespace {

DescriptorDefinition echo() {
  DescriptorDefinition d;
  d.name = "Echo";
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
