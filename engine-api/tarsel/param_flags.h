// The packed behaviour flags that every parameter descriptor carries in place.
#pragma once

#include <cstddef>

#include "tarsel/export.h"

// How a parameter's value relates to image space.
enum screen_mode : int {
  screen_mode_normal = 0,                 // the value as it is
  screen_mode_screen = 1,                 // screen coordinates
  screen_mode_screen_center = 2,          // screen coordinates relative to the centre
  screen_mode_screen_center0 = 3,         // relative to the centre, zero at the centre
  screen_mode_normalize = 4,              // normalised coordinates
  screen_mode_normalize_scale = 5,        // normalised scale
  screen_mode_screen_to_norm = 6,         // entered in screen, stored normalised
  screen_mode_screen_center_to_norm = 7,  // entered relative to the centre, stored normalised
  screen_mode_screen_x = 8,               // horizontal screen axis alone
  screen_mode_screen_y = 9                // vertical screen axis alone
};

// Automatic animation of a parameter.
enum auto_anim_type : int {
  auto_anim_none = 0,    // not animated automatically
  auto_anim_floor0 = 1,  // floor, starting from 0
  auto_anim_floor1 = 2,  // floor, starting from 1
  auto_anim_ramp_up = 3  // ramps up over time
};

// Automatic transition of a parameter.
enum autotrans_type : int {
  autotrans_none = 0,    // no automatic transition
  autotrans_linear = 1,  // linear transition
  autotrans_spline = 2   // spline transition
};

// Behaviour flags of one parameter, 36 bytes, laid out by the engine. Bit
// positions count from the least significant bit of the little-endian 32-bit
// word named in each group; the reserved fields are the engine's own bits.
// All bit-fields use unsigned int units so that every compiler packs them the
// same way.
struct ParamFlags {
  // Word at byte 0.
  unsigned int reserved0_b0 : 6;      // engine bits 0-5
  unsigned int wenable_p : 1;         // bit 6: parameter enabled (instance slots list only enabled ones)
  unsigned int reserved0_b7 : 5;      // engine bits 7-11
  unsigned int glare_p : 1;           // bit 12 (byte 1 bit 4): a flare parameter describes a glare
  unsigned int reserved0_b13 : 3;     // engine bits 13-15
  unsigned int fromfile_popup_p : 1;  // bit 16 (byte 2 bit 0): popup whose entries come from a file
  unsigned int screen_mode : 4;       // bits 17-20 (byte 2 bits 1-4): a screen_mode value
  unsigned int reserved0_b21 : 2;     // engine bits 21-22
  unsigned int autotrans_type : 2;    // bits 23-24 (byte 2 bit 7, byte 3 bit 0): an autotrans_type value
  unsigned int reserved0_b25 : 3;     // engine bits 25-27
  unsigned int hidden_p : 1;          // bit 28 (byte 3 bit 4): parameter not shown
  unsigned int reserved0_b29 : 3;     // engine bits 29-31

  // Word at byte 4.
  unsigned int reserved4_b0 : 10;       // engine bits 0-9
  unsigned int group_start_p : 3;       // bits 10-12 (byte 5 bits 2-4): a parameter group opens here
  unsigned int group_start_open_p : 1;  // bit 13 (byte 5 bit 5): that group is shown expanded
  unsigned int group_end_p : 3;         // bits 14-16: number of groups closing after this parameter
  unsigned int doc_group_p : 1;         // bit 17 (byte 6 bit 1): parameter only documents a group
  unsigned int reserved4_b18 : 14;      // engine bits 18-31

  short reserved_8;           // engine bytes 8-9
  short needs_input_n;        // byte 10: the effect input this parameter needs
  unsigned int reserved_12;   // engine bytes 12-15
  short auto_animation_type;  // byte 16: an auto_anim_type value
  short reserved_18;          // engine bytes 18-19

  // Word at byte 20.
  unsigned int reserved20_b0 : 1;          // engine bit 0
  unsigned int dont_publish_p : 1;         // bit 1: parameter not published to the host
  unsigned int builder_disable_p : 1;      // bit 2: the effect builder disables the parameter
  unsigned int builder_disable_one_p : 1;  // bit 3: the effect builder disables it for one instance
  unsigned int reserved20_b4 : 28;         // engine bits 4-31

  unsigned int reserved_24[3];  // engine bytes 24-35
};

static_assert(sizeof(ParamFlags) == 36, "ParamFlags is 36 bytes");
static_assert(alignof(ParamFlags) == 4, "ParamFlags is 4-byte aligned");
static_assert(offsetof(ParamFlags, reserved_8) == 8, "ParamFlags layout");
static_assert(offsetof(ParamFlags, needs_input_n) == 10, "needs_input_n at byte 10");
static_assert(offsetof(ParamFlags, reserved_12) == 12, "ParamFlags layout");
static_assert(offsetof(ParamFlags, auto_animation_type) == 16, "auto_animation_type at byte 16");
static_assert(offsetof(ParamFlags, reserved_18) == 18, "ParamFlags layout");
static_assert(offsetof(ParamFlags, reserved_24) == 24, "ParamFlags layout");
static_assert(sizeof(screen_mode) == 4 && sizeof(auto_anim_type) == 4 && sizeof(autotrans_type) == 4,
              "flag enumerations are 32-bit");
