#include "rendering/render_call.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <memory>
#include <utility>
#include <vector>

#include "catalogue/param_store.h"
#include "rendering/instance.h"
#include "rendering/pixels.h"

namespace tarsel_ref {
namespace {

struct Spaces {
  ColourSpace input, output, working;
};

Genotype *select_descriptor(EffectInstance &instance, const char *name) {
  if (!name || !*name) return instance.effect_genotype;
  for (int i = 0; i < instance.n_effects; ++i) {
    Genotype *g = instance.genotypes[i];
    if (g && std::string(g->name, strnlen(g->name, MAX_EFFECT_NAME_LEN)) == name) return g;
  }
  return nullptr;
}

// The engine's descriptor behind one of the instance's genotypes: it carries
// the kernel. Null for a genotype the instance did not build.
const Descriptor *descriptor_behind(const EffectInstance &instance, const Genotype *g) {
  for (const std::unique_ptr<Descriptor> &d : instance.descriptors)
    if (&d->genotype == g) return d.get();
  return nullptr;
}

// The "Effect Mix" slot of the plug-in's first descriptor, which scales the
// call's mix; 1 when the plug-in has none.
float slot_mix(const EffectInstance &instance) {
  const Genotype *first = instance.genotypes[0];
  if (!first || first->n_instance_param_slots < 1) return 1.0f;
  const Param *param = first->instance_param_slots[0].param;
  if (!param || !param->canonical_name || std::strcmp(param->canonical_name, "effect_mix") != 0) return 1.0f;
  const float value = store_of(*param).value[0];
  return std::isfinite(value) ? std::clamp(value, 0.0f, 1.0f) : 1.0f;
}

bool check_settings(const RenderCall &call, Spaces *spaces, std::string *error) {
  if (call.field < 0 || call.field > 2) {
    *error = "field " + std::to_string(call.field) + " is not 0 (whole frame), 1 or 2";
    return false;
  }
  if (call.downsample < 0) {
    *error = "downsample " + std::to_string(call.downsample) + " is not a resolution factor";
    return false;
  }
  if (!std::isfinite(call.mix)) {
    *error = "mix is not a number";
    return false;
  }
  if (!std::isfinite(call.pixel_aspect) || call.pixel_aspect < 0.0f) {
    *error = "pixel aspect must be a positive number (or 0 for square pixels)";
    return false;
  }
  if (call.frame_rate < 0) {
    *error = "frame rate " + std::to_string(call.frame_rate) + " is not possible";
    return false;
  }
  const char *names[3] = {call.input_colorspace, call.output_colorspace, call.working_colorspace};
  ColourSpace *targets[3] = {&spaces->input, &spaces->output, &spaces->working};
  const char *roles[3] = {"input", "output", "working"};
  for (int i = 0; i < 3; ++i)
    if (!parse_colour_space(names[i], targets[i])) {
      *error = std::string("unknown ") + roles[i] + " colour space \"" + names[i] + "\" (known: \"linear\", \"srgb\")";
      return false;
    }
  return true;
}

// Buffers at another resolution than the render would need resampling; the
// host renders at the resolution of its buffers.
bool check_resolution(const T_RasterInfo &info, int downsample, const std::string &what, std::string *error) {
  const int factor = info.res_factor == 0 ? 1 : info.res_factor;
  if (factor != 1 && factor != downsample) {
    *error = what + " is at resolution factor " + std::to_string(factor) + " but the render at " +
             std::to_string(downsample);
    return false;
  }
  return true;
}

std::shared_ptr<WorkImage> read_image(const RasterView &src, const KernelContext &ctx, const Spaces &spaces,
                                      ColourSpace space, bool premultiplied) {
  auto image = std::make_shared<WorkImage>(ctx.width, ctx.height);
  ctx.rows([&](int y) {
    float *row = image->row(y);
    std::fill(row, row + static_cast<std::size_t>(ctx.width) * 4, 0.0f);
    const int sy = ctx.y0 + y - src.y_origin;
    if (sy < 0 || sy >= src.height) return;
    const int begin = std::max(ctx.x0, src.x_origin);
    const int end = std::min(ctx.x0 + ctx.width, src.x_origin + src.width);
    if (begin >= end) return;
    float *part = row + static_cast<std::size_t>(begin - ctx.x0) * 4;
    const int n = end - begin;
    read_pixels(src, sy, begin - src.x_origin, n, part, premultiplied);
    convert_colour(part, n, space, spaces.working, premultiplied);
    if (!premultiplied) premultiply(part, n);
  });
  return image;
}

std::shared_ptr<const WorkImage> fallback(const Genotype &g, int input, const KernelContext &ctx,
                                          const std::vector<std::shared_ptr<const WorkImage>> &loaded) {
  const short rule = g.input_default_to.data[input];
  if (rule == 2 && input > 0 && loaded[0]) return loaded[0];
  float value[4] = {0.0f, 0.0f, 0.0f, 0.0f};
  if (rule == 1 && input < MAX_INPUT_DEFAULT_VALUES) std::fill(value, value + 4, g.input_default_value[input]);
  return WorkImage::constant(ctx.width, ctx.height, value);
}

// Mix, alpha rules, colour space and pixel layout of one finished line.
void finish_line(const RenderCall &call, const KernelContext &ctx, const RasterView &dest, const Spaces &spaces,
                 const Genotype &g, float mix, const WorkImage &result, int y, std::vector<float> &line) {
  const int w = ctx.width;
  const std::size_t n = static_cast<std::size_t>(w) * 4;
  const bool in_field = call.field == 0 || ((ctx.y0 + y) & 1) == call.field - 1;
  if (!in_field) {
    if (call.flags & kRenderClearDest) {
      std::fill(line.begin(), line.end(), 0.0f);
      write_pixels(dest, y, 0, w, line.data());
    }
    return;
  }
  const float *r = result.row(y);
  if (!g.n_inputs || mix >= 1.0f) {
    const float m = g.n_inputs ? 1.0f : mix;
    for (std::size_t i = 0; i < n; ++i) line[i] = r[i] * m;
  } else {
    const float *base = ctx.input(0).row(y);
    if (mix <= 0.0f)
      std::copy(base, base + n, line.begin());
    else
      for (std::size_t i = 0; i < n; ++i) line[i] = r[i] * mix + base[i] * (1.0f - mix);
  }
  if (g.rgba_mode == 2)
    for (int x = 0; x < w; ++x) line[static_cast<std::size_t>(x) * 4 + 3] = 1.0f;
  if (call.flags & kRenderKeepAlpha && dest.layout->has_alpha()) {
    std::vector<float> existing(n);
    if (call.flags & kRenderClearDest)
      std::fill(existing.begin(), existing.end(), 0.0f);
    else
      read_pixels(dest, y, 0, w, existing.data(), call.premultiplied);
    unpremultiply(line.data(), w);
    for (std::size_t i = 3; i < n; i += 4) line[i] = existing[i];
    premultiply(line.data(), w);
  }
  convert_colour(line.data(), w, spaces.working, spaces.output, true);
  if (!call.premultiplied) unpremultiply(line.data(), w);
  write_pixels(dest, y, 0, w, line.data());
}

std::pair<const unsigned char *, const unsigned char *> extent(const RasterView &v) {
  const unsigned char *first = v.base;
  const std::size_t bytes = v.height > 0 ? v.line_bytes * static_cast<std::size_t>(v.height) : 0;
  return {first, first + bytes};
}

bool overlaps(const RasterView &a, const RasterView &b) {
  const auto ea = extent(a), eb = extent(b);
  return ea.first < eb.second && eb.first < ea.second;
}

// A line of an input copied to the destination as it is, converted only
// between colour spaces and layouts: the exact result of effects that leave
// their input alone.
void copy_line(const RenderCall &call, const KernelContext &ctx, const RasterView &dest, const RasterView &src,
               const Spaces &spaces, int y, std::vector<float> &line) {
  const bool in_field = call.field == 0 || ((ctx.y0 + y) & 1) == call.field - 1;
  if (!in_field && !(call.flags & kRenderClearDest)) return;
  std::fill(line.begin(), line.end(), 0.0f);
  const int sy = ctx.y0 + y - src.y_origin;
  const int begin = std::max(ctx.x0, src.x_origin);
  const int end = std::min(ctx.x0 + ctx.width, src.x_origin + src.width);
  if (in_field && sy >= 0 && sy < src.height && begin < end) {
    float *part = line.data() + static_cast<std::size_t>(begin - ctx.x0) * 4;
    read_pixels(src, sy, begin - src.x_origin, end - begin, part, call.premultiplied);
    convert_colour(part, end - begin, spaces.input, spaces.output, call.premultiplied);
  }
  write_pixels(dest, y, 0, ctx.width, line.data());
}

// The previous output a render was not given, rebuilt as the renders of the
// `history` frames before it would have left it: from the oldest, which has
// no previous output, each frame is rendered from the frames of its inputs
// that the host returns, written in the destination's layout and read back
// as a previous output is read. A frame the host does not have ends the
// history there: the frame after it starts again with no previous output.
std::shared_ptr<const WorkImage> rebuild_previous(const RenderCall &call, const KernelContext &ctx,
                                                  const RasterView &dest, const Spaces &spaces, const Genotype &g,
                                                  Kernel kernel, float mix, int history) {
  const std::size_t n_inputs = ctx.inputs.size();
  RasterView written = dest;
  std::vector<unsigned char> pixels(image_bytes(*dest.layout, dest.width, dest.height, 0));
  written.base = pixels.data();
  written.line_bytes = image_bytes(*dest.layout, dest.width, 1, 0);
  written.flip = false;
  std::shared_ptr<const WorkImage> previous;
  for (int frame = offset_frame(ctx.frame, -history); frame < ctx.frame; ++frame) {
    KernelContext step = ctx;
    step.frame = frame;
    step.previous = std::move(previous);
    std::vector<std::shared_ptr<const WorkImage>> loaded(n_inputs);
    bool missing = false;
    for (std::size_t i = 0; i < n_inputs && !missing; ++i)
      if (ctx.connected[i]) {
        loaded[i] = ctx.requests->request(static_cast<int>(i), frame, kRequestPreviousOutput);
        missing = !loaded[i];
      }
    if (missing) continue;
    for (std::size_t i = 0; i < n_inputs; ++i)
      step.inputs[i] = loaded[i] ? loaded[i] : fallback(g, static_cast<int>(i), step, loaded);
    const ParamReader params(g, ctx.connected, frame, step.seconds());
    step.params = &params;
    std::unique_ptr<WorkImage> made;
    int unchanged = 0;
    if (n_inputs == 0 || mix > 0.0f) {
      made = std::make_unique<WorkImage>(ctx.width, ctx.height);
      unchanged = kernel(step, *made);
    }
    const WorkImage &result = unchanged < 0 ? *made : step.input(unchanged);
    const float line_mix = unchanged != 0 ? mix : 1.0f;
    step.rows([&](int y) {
      std::vector<float> line(static_cast<std::size_t>(ctx.width) * 4);
      finish_line(call, step, written, spaces, g, line_mix, result, y, line);
    });
    previous = read_image(written, ctx, spaces, spaces.output, call.premultiplied);
  }
  return previous;
}

// What the checks of a call settle: the descriptor to render, the colour
// spaces, the resolution factor and the destination.
struct Checked {
  const Genotype *g = nullptr;
  Spaces spaces{};
  int downsample = 1;
  RasterView dest;
};

// The call's inputs: entries 1.. of its lists (lens flares always read a
// background there), and which of them it connects.
struct Inputs {
  std::vector<RasterView> sources;
  std::vector<bool> connected;
  int count() const { return static_cast<int>(sources.size()); }
};

bool check_call(const RenderCall &call, EffectInstance &instance, Checked *checked, std::string *error) {
  checked->g = select_descriptor(instance, call.descriptor);
  if (!checked->g) {
    *error = std::string("the effect has no descriptor named \"") + call.descriptor + "\"";
    return false;
  }
  if (call.flare_call && !checked->g->flare_param) {
    *error = std::string("\"") + checked->g->name + "\" has no flare to draw";
    return false;
  }
  if (!check_settings(call, &checked->spaces, error)) return false;
  checked->downsample = std::max(call.downsample, 1);
  if (call.n_rasters < 1 || !call.rasters || !call.rasters[0]) {
    *error = "no descriptor for the destination (rasters[0])";
    return false;
  }
  if (!describe_raster(*call.rasters[0], call.dest, &checked->dest, error)) {
    *error = "destination: " + *error;
    return false;
  }
  return check_resolution(*call.rasters[0], checked->downsample, "the destination", error);
}

bool describe_inputs(const RenderCall &call, const Checked &checked, Inputs *inputs, std::string *error) {
  const int n_inputs = call.flare_call ? 1 : checked.g->n_inputs;
  inputs->sources.assign(static_cast<std::size_t>(n_inputs), RasterView());
  inputs->connected.assign(static_cast<std::size_t>(n_inputs), false);
  for (int i = 0; i < n_inputs; ++i) {
    const int k = i + 1;
    if (k >= call.n_rasters || !call.images || !call.images[k]) continue;
    const std::string what = "input " + std::to_string(k);
    if (!call.rasters[k]) {
      *error = what + " has pixels but no descriptor";
      return false;
    }
    if (!describe_raster(*call.rasters[k], call.images[k], &inputs->sources[static_cast<std::size_t>(i)], error)) {
      *error = what + ": " + *error;
      return false;
    }
    if (!check_resolution(*call.rasters[k], checked.downsample, what, error)) return false;
    inputs->connected[static_cast<std::size_t>(i)] = true;
  }
  return true;
}

KernelContext kernel_context(const RenderCall &call, const Checked &checked, const Inputs &inputs) {
  const T_RasterInfo &info = *call.rasters[0];
  const RasterView &dest = checked.dest;
  KernelContext ctx;
  ctx.genotype = checked.g;
  ctx.width = dest.width;
  ctx.height = dest.height;
  ctx.x0 = dest.x_origin;
  ctx.y0 = dest.y_origin;
  ctx.frame_width = info.world_xsize > 0 ? static_cast<double>(info.world_xsize) / checked.downsample : dest.width;
  ctx.frame_height = info.world_ysize > 0 ? static_cast<double>(info.world_ysize) / checked.downsample : dest.height;
  ctx.downsample = checked.downsample;
  ctx.quality = std::clamp(call.quality, 0, 2);
  ctx.pixel_aspect = call.pixel_aspect > 0.0f ? call.pixel_aspect : 1.0f;
  ctx.frame = call.frame;
  ctx.frame_rate = call.frame_rate > 0 ? call.frame_rate : 25;
  ctx.seed = call.seed;
  ctx.n_threads = std::max(call.n_threads, 0);
  ctx.working = checked.spaces.working;
  ctx.connected = inputs.connected;
  ctx.flare_call = call.flare_call;
  return ctx;
}

// The inputs read into working images, a stand-in for each one not
// connected, and the previous output when the call gives it.
void load_inputs(const RenderCall &call, const Checked &checked, const Inputs &inputs, KernelContext *ctx) {
  std::vector<std::shared_ptr<const WorkImage>> loaded(static_cast<std::size_t>(inputs.count()));
  for (int i = 0; i < inputs.count(); ++i)
    if (inputs.connected[static_cast<std::size_t>(i)])
      loaded[static_cast<std::size_t>(i)] = read_image(inputs.sources[static_cast<std::size_t>(i)], *ctx,
                                                       checked.spaces, checked.spaces.input, call.premultiplied);
  for (int i = 0; i < inputs.count(); ++i)
    ctx->inputs.push_back(loaded[static_cast<std::size_t>(i)] ? loaded[static_cast<std::size_t>(i)]
                                                              : fallback(*checked.g, i, *ctx, loaded));
  if (checked.g->flags.use_prev_dest_p && call.images && call.images[0]) {
    RasterView previous = checked.dest;  // the previous output has the destination's layout
    previous.base = static_cast<unsigned char *>(call.images[0]);
    ctx->previous = read_image(previous, *ctx, checked.spaces, checked.spaces.output, call.premultiplied);
  }
}

// Other frames of the inputs, asked of the host by effects that read them or
// rebuild their previous output; read like the inputs. None when no host
// answers requests or the effect needs none. `ctx` must outlive the result.
std::unique_ptr<OtherFrames> frames_from_host(const RenderCall &call, const Checked &checked, const Inputs &inputs,
                                              KernelContext *ctx) {
  const Genotype &g = *checked.g;
  if (!call.other_frames || call.flare_call || !(g.flags.need_other_frames_p || g.flags.use_prev_dest_p))
    return nullptr;
  T_RenderState state;
  std::memset(&state, 0, sizeof state);
  for (int i = 0; i < inputs.count() && i < MAX_INPUTS; ++i)
    if (inputs.connected[static_cast<std::size_t>(i)]) state.input_info[i] = *call.rasters[i + 1];
  auto read_frame = [&call, &checked, ctx](const T_RasterInfo &frame_info, void *pixels,
                                           std::string *why) -> std::shared_ptr<const WorkImage> {
    RasterView frame;
    if (!describe_raster(frame_info, pixels, &frame, why)) return nullptr;
    if (!check_resolution(frame_info, checked.downsample, "the frame", why)) return nullptr;
    return read_image(frame, *ctx, checked.spaces, checked.spaces.input, call.premultiplied);
  };
  return call.other_frames(state, call.instance, g, read_frame);
}

// Runs the kernel (unless the mix leaves input 1 as it is) and writes every
// line of the result to the destination.
void write_result(const RenderCall &call, const KernelContext &ctx, const Checked &checked, const Inputs &inputs,
                  Kernel kernel, float mix) {
  std::unique_ptr<WorkImage> made;
  int unchanged = kWrote;  // the input that is the result as it is
  if (inputs.count() > 0 && mix <= 0.0f) {
    unchanged = 0;
  } else {
    made = std::make_unique<WorkImage>(ctx.width, ctx.height);
    unchanged = kernel(ctx, *made);
    if (unchanged >= 0) made.reset();
  }
  // Any mix of input 1 with itself is input 1; another input is blended with
  // it. An input sharing the destination's memory is taken from its working
  // copy, as lines written may be lines still to be read.
  const RasterView &dest = checked.dest;
  const bool copy_pixels = unchanged >= 0 && inputs.connected[static_cast<std::size_t>(unchanged)] &&
                           !overlaps(inputs.sources[static_cast<std::size_t>(unchanged)], dest) &&
                           (mix >= 1.0f || unchanged == 0) && checked.g->rgba_mode != 2 &&
                           !((call.flags & kRenderKeepAlpha) && dest.layout->has_alpha());
  const WorkImage &result = made ? *made : ctx.input(unchanged);
  const float line_mix = made || unchanged != 0 ? mix : 1.0f;
  ctx.rows([&](int y) {
    std::vector<float> line(static_cast<std::size_t>(ctx.width) * 4);
    if (copy_pixels)
      copy_line(call, ctx, dest, inputs.sources[static_cast<std::size_t>(unchanged)], checked.spaces, y, line);
    else
      finish_line(call, ctx, dest, checked.spaces, *checked.g, line_mix, result, y, line);
  });
}

}  // namespace

std::shared_ptr<const WorkImage> KernelContext::other_frame(int input, int wanted) const {
  const std::size_t i = static_cast<std::size_t>(input);
  if (wanted == frame) return inputs[i];
  if (!requests) return nullptr;
  if (!connected[i]) return inputs[i];  // every frame of an unconnected input is its fallback
  return requests->request(input, wanted, kRequestOtherFrame);
}

bool render(const RenderCall &call, std::string *error) {
  const InstanceUse use(call.instance);  // the instance outlives this render, whoever frees it meanwhile
  EffectInstance *instance = use.get();
  if (!instance) {
    *error = "not a live effect instance of this engine";
    return false;
  }
  Checked checked;
  Inputs inputs;
  if (!check_call(call, *instance, &checked, error) || !describe_inputs(call, checked, &inputs, error)) return false;
  if (checked.dest.empty()) return true;

  const Genotype &g = *checked.g;
  KernelContext ctx = kernel_context(call, checked, inputs);
  const ParamReader params(g, inputs.connected, ctx.frame, ctx.seconds());
  ctx.params = &params;
  load_inputs(call, checked, inputs, &ctx);
  const Descriptor *descriptor = descriptor_behind(*instance, &g);
  const Kernel kernel = call.flare_call ? render_flare_call : descriptor ? descriptor->kernel : nullptr;
  if (!kernel) {
    *error = std::string("the engine cannot render \"") + g.name + "\"";
    return false;
  }
  const float mix = call.flare_call ? 1.0f : std::clamp(call.mix, 0.0f, 1.0f) * slot_mix(*instance);
  const std::unique_ptr<OtherFrames> requests = frames_from_host(call, checked, inputs, &ctx);
  ctx.requests = requests.get();
  if (g.flags.use_prev_dest_p && !ctx.previous && ctx.requests)
    if (const History history = descriptor ? descriptor->history : nullptr) {
      const int frames = history(ctx);
      if (frames > 0) ctx.previous = rebuild_previous(call, ctx, checked.dest, checked.spaces, g, kernel, mix, frames);
    }
  write_result(call, ctx, checked, inputs, kernel, mix);
  return true;
}

}  // namespace tarsel_ref
