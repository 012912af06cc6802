// Enumerations of the parameter model: parameter types, screen modes,
// automatic animation and automatic transition.

%{
#include "tarsel/param.h"
%}

enum param_type {
  ptype_unknown = 0,
  ptype_float = 1,
  ptype_int = 2,
  ptype_color = 3,
  ptype_popup = 4,
  ptype_boolean = 5,
  ptype_pushbutton = 6,
  ptype_string = 7,
  ptype_label = 8,
  ptype_flare = 9,
  ptype_pellam_data = 10,
  ptype_none = 11
};

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
