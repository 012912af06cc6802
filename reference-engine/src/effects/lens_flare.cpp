// Lens Flare: the glows, rings and ghosts a bright light makes in a lens,
// drawn over the input along the axis from the light through the centre.
#include <algorithm>

#include "catalogue/catalogue.h"
#include "catalogue/flare.h"
#include "catalogue/param_store.h"
#include "rendering/kernels/flare_draw.h"
#include "rendering/kernels/kernel.h"

namespace tarsel_ref {
namespace {

// The kernel: the flare parameter's elements lit from the position (a point
// of the frame given in fractions of its size), at the brightness and scale
// the parameters set, over the background.
int render_lens_flare(const KernelContext &ctx, WorkImage &out) {
  const ParamReader &p = ctx.p();
  FlareLight light;
  light.x = p.number("position", 0) * ctx.frame_width;
  light.y = p.number("position", 1) * ctx.frame_height;
  FlareLook look;
  look.elements = flare_elements(p.text("flare"));
  look.scale = std::max(0.0f, p.number("scale"));
  look.brightness = std::max(0.0f, p.number("brightness"));
  draw_flares(ctx, {light}, look, ctx.input(0), out);
  return kWrote;
}

const char *const kBuiltInFlare = "glow 0.12 1 0 1 0.95 0.85; ring 0.3 0.25 0 1 0.9 0.8; disc 0.05 0.3 0.6 0.6 0.8 1";

// The flare starts as the first preset the engine ships.
std::string first_preset() {
  const FromFileList &presets = from_file_list(kFlarePresets);
  std::vector<FlareElement> elements;
  if (!presets.values.empty() && !presets.values[0].empty() && parse_flare(presets.values[0], &elements))
    return presets.values[0];
  return kBuiltInFlare;
}

DescriptorDefinition lens_flare() {
  DescriptorDefinition d;
  d.name = "Lens Flare";
  d.kernel = render_lens_flare;
  d.popup_name = "Lens Flare";
  d.inputs = {{"Background", "bg", true, kFallbackTransparent, 0.0f}};
  d.node_flags = kNodeDrawsFlare;
  d.flare_param = "flare";
  d.params = {
      pair_param("Position", "position", screen_mode_normalize, 0.3f, 0.3f)
          .sliders(0.0f, 1.0f)
          .big_sliders(-1.0f, 2.0f),
      float_param("Brightness", "brightness", 1.0f)
          .bounds(0.0f, 10.0f)
          .sliders(0.0f, 2.0f)
          .shown_as(format_percent, 100.0f),
      float_param("Scale", "scale", 1.0f).bounds(0.01f, 10.0f).sliders(0.25f, 4.0f),
      fromfile_popup("Preset", "preset", kFlarePresets),
      flare_param("Flare", "flare", first_preset(), false),
  };
  return d;
}

}  // namespace

const PluginDefinition &lens_flare_plugin() {
  static const PluginDefinition plugin{"T_LensFlare", "Light", false, false, {lens_flare()}, nullptr};
  return plugin;
}

}  // namespace tarsel_ref
