#include <cstring>

#include "rendering/kernels/kernel.h"

namespace tarsel_ref {
namespace {

struct Entry {
  const char *descriptor;
  Kernel kernel;
  History history = nullptr;  // null: the previous output is not rebuilt
};

// Keyed by descriptor name: a plug-in's descriptors are different effects
// (the two blurs), and builder descriptors are named after their entry.
constexpr Entry kKernels[] = {
    {"Gradient", render_gradient},
    {"Blur", render_blur},
    {"Blur Fast", render_blur_fast},
    {"Glow", render_glow},
    {"Dissolve", render_dissolve},
    {"Echo", render_echo},
    {"Trails", render_trails, trails_history},
    {"Time Blur", render_time_blur},
    {"Lens Flare", render_lens_flare},
    {"Glare", render_glare},
    {"Caption", render_caption},
    {"Transform", render_transform},
    {"Builder Mix", render_builder_mix},
    {"Builder Matte", render_builder_matte},
};

}  // namespace

Kernel find_kernel(const char *descriptor_name) {
  for (const Entry &entry : kKernels)
    if (std::strcmp(entry.descriptor, descriptor_name) == 0) return entry.kernel;
  return nullptr;
}

History find_history(const char *descriptor_name) {
  for (const Entry &entry : kKernels)
    if (std::strcmp(entry.descriptor, descriptor_name) == 0) return entry.history;
  return nullptr;
}

}  // namespace tarsel_ref
