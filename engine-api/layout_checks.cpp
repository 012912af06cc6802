// Compile-time checks of the packed records' bit positions (C++20). Each
// check sets one field of a value-initialised record, takes the record's
// bytes and requires exactly the expected bits to be set. The byte sizes and
// member offsets are checked by the headers themselves, all included here.
#include <array>
#include <bit>
#include <cstddef>
#include <initializer_list>

#include "qrv/external_monitor.h"
#include "tarsel/catalogue.h"
#include "tarsel/effect.h"
#include "tarsel/effect_globals.h"
#include "tarsel/errors.h"
#include "tarsel/export.h"
#include "tarsel/genotype.h"
#include "tarsel/gfx.h"
#include "tarsel/identity.h"
#include "tarsel/image_utils.h"
#include "tarsel/ipc.h"
#include "tarsel/limits.h"
#include "tarsel/load_frame.h"
#include "tarsel/param.h"
#include "tarsel/param_flags.h"
#include "tarsel/param_queries.h"
#include "tarsel/raster_info.h"
#include "tarsel/render_context.h"
#include "tarsel/tarsel.h"
#include "tarsel/wrapped_array.h"

namespace {

// One expected byte of a record image: its index and its exact value.
struct ExpectedByte {
  std::size_t index;
  unsigned char value;
};

// The bytes of a value-initialised T after `set` has changed it.
template <typename T, typename Set>
constexpr std::array<unsigned char, sizeof(T)> image_after(Set set) {
  T record{};
  set(record);
  return std::bit_cast<std::array<unsigned char, sizeof(T)>>(record);
}

// Whether `image` holds exactly the expected bytes and zero everywhere else.
template <std::size_t N>
constexpr bool holds_exactly(const std::array<unsigned char, N> &image, std::initializer_list<ExpectedByte> expected) {
  for (std::size_t i = 0; i < N; ++i) {
    unsigned char want = 0;
    for (const ExpectedByte &e : expected)
      if (e.index == i) want = e.value;
    if (image[i] != want) return false;
  }
  return true;
}

// A value-initialised record is all zero bytes.
static_assert(holds_exactly(image_after<ParamFlags>([](ParamFlags &) {}), {}));
static_assert(holds_exactly(image_after<GenotypeFlags>([](GenotypeFlags &) {}), {}));

// ParamFlags: byte N bit B of the 36-byte record.
static_assert(holds_exactly(image_after<ParamFlags>([](ParamFlags &f) { f.wenable_p = 1; }), {{0, 0x40}}));
static_assert(holds_exactly(image_after<ParamFlags>([](ParamFlags &f) { f.glare_p = 1; }), {{1, 0x10}}));
static_assert(holds_exactly(image_after<ParamFlags>([](ParamFlags &f) { f.fromfile_popup_p = 1; }), {{2, 0x01}}));
static_assert(holds_exactly(image_after<ParamFlags>([](ParamFlags &f) { f.screen_mode = 15; }), {{2, 0x1E}}));
static_assert(holds_exactly(image_after<ParamFlags>([](ParamFlags &f) { f.screen_mode = screen_mode_screen_y; }),
                            {{2, 9 << 1}}));
static_assert(holds_exactly(image_after<ParamFlags>([](ParamFlags &f) { f.autotrans_type = 3; }),
                            {{2, 0x80}, {3, 0x01}}));
static_assert(holds_exactly(image_after<ParamFlags>([](ParamFlags &f) { f.autotrans_type = autotrans_linear; }),
                            {{2, 0x80}}));
static_assert(holds_exactly(image_after<ParamFlags>([](ParamFlags &f) { f.autotrans_type = autotrans_spline; }),
                            {{3, 0x01}}));
static_assert(holds_exactly(image_after<ParamFlags>([](ParamFlags &f) { f.hidden_p = 1; }), {{3, 0x10}}));
static_assert(holds_exactly(image_after<ParamFlags>([](ParamFlags &f) { f.group_start_p = 7; }), {{5, 0x1C}}));
static_assert(holds_exactly(image_after<ParamFlags>([](ParamFlags &f) { f.group_start_open_p = 1; }), {{5, 0x20}}));
static_assert(holds_exactly(image_after<ParamFlags>([](ParamFlags &f) { f.group_end_p = 7; }), {{5, 0xC0}, {6, 0x01}}));
static_assert(holds_exactly(image_after<ParamFlags>([](ParamFlags &f) { f.group_end_p = 4; }), {{6, 0x01}}));
static_assert(holds_exactly(image_after<ParamFlags>([](ParamFlags &f) { f.doc_group_p = 1; }), {{6, 0x02}}));
static_assert(holds_exactly(image_after<ParamFlags>([](ParamFlags &f) { f.needs_input_n = -1; }),
                            {{10, 0xFF}, {11, 0xFF}}));
static_assert(holds_exactly(image_after<ParamFlags>([](ParamFlags &f) { f.needs_input_n = 0x0201; }),
                            {{10, 0x01}, {11, 0x02}}));
static_assert(holds_exactly(image_after<ParamFlags>([](ParamFlags &f) { f.auto_animation_type = auto_anim_ramp_up; }),
                            {{16, 0x03}}));
static_assert(holds_exactly(image_after<ParamFlags>([](ParamFlags &f) { f.auto_animation_type = -1; }),
                            {{16, 0xFF}, {17, 0xFF}}));
static_assert(holds_exactly(image_after<ParamFlags>([](ParamFlags &f) { f.dont_publish_p = 1; }), {{20, 0x02}}));
static_assert(holds_exactly(image_after<ParamFlags>([](ParamFlags &f) { f.builder_disable_p = 1; }), {{20, 0x04}}));
static_assert(holds_exactly(image_after<ParamFlags>([](ParamFlags &f) { f.builder_disable_one_p = 1; }), {{20, 0x08}}));

// GenotypeFlags: the 8 bytes at offset 1240 of a Genotype; index 0 is byte 1240.
static_assert(holds_exactly(image_after<GenotypeFlags>([](GenotypeFlags &f) { f.need_other_frames_p = 1; }),
                            {{0, 0x02}}));
static_assert(holds_exactly(image_after<GenotypeFlags>([](GenotypeFlags &f) { f.use_prev_dest_p = 1; }), {{0, 0x04}}));
static_assert(holds_exactly(image_after<GenotypeFlags>([](GenotypeFlags &f) { f.mask_color_p = 1; }), {{1, 0x40}}));
static_assert(holds_exactly(image_after<GenotypeFlags>([](GenotypeFlags &f) { f.transition_p = 1; }), {{3, 0x04}}));
static_assert(holds_exactly(image_after<GenotypeFlags>([](GenotypeFlags &f) { f.use_reduce_p = 1; }), {{4, 0x01}}));
static_assert(offsetof(Genotype, flags) == 1240);

}  // namespace
