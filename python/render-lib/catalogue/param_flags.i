// A parameter's behaviour flags: the 36-byte packed record every Param carries
// in place. Every field reads by its byte and bit position; only screen_mode
// can be written. A ParamFlags taken from a Param is a view into it.

%{
#include "tarsel/param_flags.h"

static screen_mode ParamFlags_screen_mode_get(ParamFlags *self)
{
  return (screen_mode)packed_field(self, 2, 1, 4);
}

// Keeps the low 4 bits, with no check against the named modes; the byte's
// other bits are left alone.
static void ParamFlags_screen_mode_set(ParamFlags *self, screen_mode mode)
{
  set_packed_field(self, 2, 1, 4, (unsigned int)mode);
}
%}

struct ParamFlags {
%immutable;
  short needs_input_n;
  short auto_animation_type;
%mutable;
};

%extend ParamFlags {
  screen_mode screen_mode;
}
%packed_field(ParamFlags, wenable_p, 0, 6, 1)
%packed_field(ParamFlags, fromfile_popup_p, 2, 0, 1)
%packed_field(ParamFlags, autotrans_type, 2, 7, 2)
%packed_field(ParamFlags, hidden_p, 3, 4, 1)
%packed_field(ParamFlags, group_start_p, 5, 2, 3)
%packed_field(ParamFlags, group_start_open_p, 5, 5, 1)
%packed_field(ParamFlags, group_end_p, 4, 14, 3)
%packed_field(ParamFlags, doc_group_p, 6, 1, 1)
%packed_field(ParamFlags, dont_publish_p, 20, 1, 1)
%packed_field(ParamFlags, builder_disable_p, 20, 2, 1)
%packed_field(ParamFlags, builder_disable_one_p, 20, 3, 1)
