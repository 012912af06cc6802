// The free query functions on parameters and descriptors.
#include "catalogue/param_queries.h"

#include <algorithm>
#include <cstring>
#include <string>

#include "catalogue/data_files.h"
#include "catalogue/descriptor.h"
#include "catalogue/param_store.h"

namespace tarsel_ref {
namespace {

// tarsel_get_param_bounds2 flags.
constexpr int kBoundsBigSlider = 1;     // third and fourth give the wide slider's range
constexpr int kBoundsDisplayUnits = 2;  // values times normalize_scale, as the host shows them

bool is_point(const Param &param) {
  switch (param.flags.screen_mode) {
    case screen_mode_screen:
    case screen_mode_screen_center:
    case screen_mode_normalize:
    case screen_mode_screen_to_norm:
    case screen_mode_screen_center_to_norm: return param.n_channels_c1 == 2;
    default: return false;
  }
}

const char *channel_word(const Param &param, int channel) {
  static const char *const colour[] = {"Red", "Green", "Blue", "Alpha"};
  static const char *const axes[] = {"X", "Y", "Z", "W"};
  static const char *const across[] = {"Left", "Right"};
  static const char *const down[] = {"Top", "Bottom"};
  if (param.ptype == ptype_color) return channel < 4 ? colour[channel] : nullptr;
  if (param.flags.screen_mode == screen_mode_screen_x && channel < 2) return across[channel];
  if (param.flags.screen_mode == screen_mode_screen_y && channel < 2) return down[channel];
  return channel < 4 ? axes[channel] : nullptr;
}

// A point and a one-channel parameter show one control, titled with the
// name; the channels of the others are the name and the channel's word.
std::string title_of(const Param &param, int channel) {
  const std::string name = param.name ? param.name : "";
  const int shown = is_point(param) ? 1 : param.n_channels_c1;
  if (channel < 0 || channel >= shown) return "";
  if (shown == 1) return name;
  const char *word = channel_word(param, channel);
  if (!word) return "";
  return name.empty() ? word : name + " " + word;
}

float scaled_bound(float bound, float no_limit, float factor) { return bound == no_limit ? bound : bound * factor; }

}  // namespace

int fromfile_popup_names(const Param *param, char ***names) {
  if (names) *names = nullptr;
  if (!param || param->ptype != ptype_popup || !param->flags.fromfile_popup_p) return 0;
  const auto id = static_cast<tarsel_ref::FromFileListId>(tarsel_ref::store_of(*param).list_id);
  const tarsel_ref::FromFileList &list = tarsel_ref::from_file_list(id);
  if (list.names.empty()) return 0;
  if (names) *names = const_cast<char **>(list.name_pointers.data());
  return static_cast<int>(list.names.size());
}

// scale multiplies every value but the no-limit bounds; channel is the
// channel asked about (all of a parameter's channels share one range; one it
// does not have gets no limits and an empty slider range); flags as above.
void param_bounds(const Param *param, float scale, int channel, float *min_bound, float *max_bound, float *slider_min,
                  float *slider_max, int flags) {
  float lo = tarsel_ref::kNoLowerBound, hi = tarsel_ref::kNoUpperBound, third = 0.0f, fourth = 0.0f;
  if (param && channel >= 0 && channel < std::max<int>(1, param->n_channels)) {
    const float factor = scale * ((flags & tarsel_ref::kBoundsDisplayUnits) ? param->normalize_scale : 1.0f);
    lo = tarsel_ref::scaled_bound(param->min_bound, tarsel_ref::kNoLowerBound, factor);
    hi = tarsel_ref::scaled_bound(param->max_bound, tarsel_ref::kNoUpperBound, factor);
    const bool big = flags & tarsel_ref::kBoundsBigSlider;
    third = (big ? param->big_slider_min : param->slider_min) * factor;
    fourth = (big ? param->big_slider_max : param->slider_max) * factor;
    if (factor < 0.0f) {  // a negative scale turns the ranges round
      if (lo != tarsel_ref::kNoLowerBound && hi != tarsel_ref::kNoUpperBound) std::swap(lo, hi);
      std::swap(third, fourth);
    }
  }
  if (min_bound) *min_bound = lo;
  if (max_bound) *max_bound = hi;
  if (slider_min) *slider_min = third;
  if (slider_max) *slider_max = fourth;
}

char *param_title(const Param *param, int channel, char *buffer, size_t buffer_size) {
  if (!buffer || buffer_size == 0) return buffer;
  const std::string title = param ? tarsel_ref::title_of(*param, channel) : "";
  const std::size_t n = std::min(title.size(), buffer_size - 1);
  std::memcpy(buffer, title.data(), n);
  buffer[n] = '\0';
  return buffer;
}

int any_node_flags(Genotype *genotype, int mask) { return genotype ? tarsel_ref::node_flags(*genotype) & mask : 0; }

// The text is the parameter's (see Param::to_string); the caller never frees it.
char *param_text(Param *param) { return param ? param->to_string(nullptr, false) : nullptr; }

}  // namespace tarsel_ref
