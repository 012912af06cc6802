// Enumerations held by a parameter's flag record.

%{
#include "tarsel/param_flags.h"
%}

// How a parameter's value relates to image space.
enum screen_mode {
  screen_mode_normal = 0,
  screen_mode_screen = 1,
  screen_mode_screen_center = 2,
  screen_mode_screen_center0 = 3,
  screen_mode_normalize = 4,
  screen_mode_normalize_scale = 5,
  screen_mode_screen_to_norm = 6,
  screen_mode_screen_center_to_norm = 7,
  screen_mode_screen_x = 8,
  screen_mode_screen_y = 9
};

// Automatic animation of a parameter.
enum auto_anim_type {
  auto_anim_none = 0,
  auto_anim_floor0 = 1,
  auto_anim_floor1 = 2,
  auto_anim_ramp_up = 3
};

// Automatic transition of a parameter.
enum autotrans_type {
  autotrans_none = 0,
  autotrans_linear = 1,
  autotrans_spline = 2
};
