// Transform: moves, scales, rotates and crops the input. Its two-channel
// parameters show every way a value can sit in image space.
#include "effects/registry.h"

namespace tarsel_ref {
namespace {

DescriptorDefinition transform() {
  DescriptorDefinition d;
  d.name = "Transform";
  d.popup_name = "Transform";
  d.inputs = {{"Source", "src"}};
  d.transform_with_warp = 1;
  d.params = {
      label_param("Coordinates", "coordinates").in_group("Image Space", "doc_group,no_publish"),
      pair_param("Scale", "scale", screen_mode_normal, 1.0f, 1.0f).sliders(0.0f, 2.0f).big_sliders(0.0f, 10.0f),
      pair_param("Position", "position", screen_mode_screen, 960.0f, 540.0f)
          .sliders(0.0f, 1920.0f)
          .big_sliders(-4000.0f, 6000.0f)
          .shown_as(format_pixels),
      pair_param("Anchor", "anchor", screen_mode_screen_center, 0.0f, 0.0f)
          .sliders(-960.0f, 960.0f)
          .big_sliders(-4000.0f, 4000.0f)
          .shown_as(format_pixels),
      pair_param("Offset", "offset", screen_mode_screen_center0, 0.0f, 0.0f)
          .sliders(-100.0f, 100.0f)
          .big_sliders(-2000.0f, 2000.0f)
          .shown_as(format_pixels),
      pair_param("Pivot", "pivot", screen_mode_normalize, 0.5f, 0.5f).sliders(0.0f, 1.0f).big_sliders(-1.0f, 2.0f),
      pair_param("Stretch", "stretch", screen_mode_normalize_scale, 1.0f, 1.0f)
          .bounds(0.0f, 100.0f)
          .sliders(0.0f, 2.0f),
      pair_param("Target", "target", screen_mode_screen_to_norm, 0.5f, 0.5f).sliders(0.0f, 1.0f),
      pair_param("Origin", "origin", screen_mode_screen_center_to_norm, 0.0f, 0.0f).sliders(-0.5f, 0.5f),
      pair_param("Crop X", "crop_x", screen_mode_screen_x, 0.0f, 1920.0f)
          .sliders(0.0f, 1920.0f)
          .shown_as(format_pixels),
      pair_param("Crop Y", "crop_y", screen_mode_screen_y, 0.0f, 1080.0f)
          .sliders(0.0f, 1080.0f)
          .shown_as(format_pixels),
      float_param("Rotation", "rotation", 0.0f)
          .shown_as(format_angle)
          .sliders(-180.0f, 180.0f)
          .big_sliders(-3600.0f, 3600.0f),
      // Degrees added per second of the clip: the rotation keeps turning.
      float_param("Spin", "spin", 0.0f).shown_as(format_angle).sliders(-360.0f, 360.0f).animated(auto_anim_ramp_up),
      float_param("Skew", "skew", 0.0f).bounds(-89.0f, 89.0f).shown_as(format_angle),
      popup_param("Edges", "edges", {"Transparent", "Repeat", "Mirror", "Clamp"})
          .in_group("Sampling", "group_start,open"),
      popup_param("Filter", "filter", {"Nearest", "Bilinear", "Bicubic"}, 2),
      bool_param("Motion Vectors", "motion_vectors", false).with_flags("group_end,builder_disable"),
  };
  return d;
}

}  // namespace

const PluginDefinition &transform_plugin() {
  static const PluginDefinition plugin{"T_Transform", "Distort", false, false, {transform()}, nullptr};
  return plugin;
}

}  // namespace tarsel_ref
