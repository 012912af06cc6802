// Parameter types: what kind of value a parameter carries.

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
