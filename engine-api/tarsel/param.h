// The engine's descriptor of one effect parameter.
#pragma once

#include <cstddef>

#include "tarsel/export.h"
#include "tarsel/limits.h"
#include "tarsel/param_flags.h"
#include "tarsel/render_context.h"
#include "tarsel/wrapped_array.h"

// Node of the cJSON library; parameters exchange their values as JSON through it.
struct cJSON;

// What kind of value a parameter carries.
enum param_type : int {
  ptype_unknown = 0,       // not set
  ptype_float = 1,         // floating-point value, one per channel
  ptype_int = 2,           // integer value
  ptype_color = 3,         // colour
  ptype_popup = 4,         // choice among named states (see PopupParam)
  ptype_boolean = 5,       // on or off
  ptype_pushbutton = 6,    // button, carries no value
  ptype_string = 7,        // text
  ptype_label = 8,         // label, carries no value
  ptype_flare = 9,         // lens-flare description
  ptype_pellam_data = 10,  // opaque effect data
  ptype_none = 11          // no value
};

// How the engine formats a parameter's value for display.
enum const_format_tag : int {
  format_plain = 0,    // plain number
  format_integer = 1,  // whole number
  format_percent = 2,  // percentage
  format_angle = 3,    // angle in degrees
  format_pixels = 4,   // distance in pixels
  format_frames = 5,   // time in frames
  format_seconds = 6   // time in seconds
};

// One effect parameter: type, names, channels, defaults, bounds, slider
// ranges, flags and group. 240 bytes laid out by the engine; the bytes not
// named here are the engine's.
class TARSEL_API Param {
public:
  // Default-constructs an empty parameter; defined in the engine.
  Param();

  // Destroys the parameter and what it owns (its name among others).
  virtual ~Param();

  // Whether the parameter holds a numeric value.
  virtual bool numeric_p();

  // How the value is formatted for display.
  virtual const_format_tag format();

  // The object that holds the value, without synchronising it from the interface.
  virtual void *get_value_object_nosync();

  // Sets channel `channel` to `value`; returns the engine's status.
  virtual int set_value(RenderContext *ctx, int channel, float value, unsigned int flags);

  // Sets `n` channels from `first_channel` on from `values`; returns the engine's status.
  virtual int set_values(RenderContext *ctx, int first_channel, int n, float *values, unsigned int flags);

  // Restores the default value; true when the value changed.
  virtual bool set_to_default(RenderContext *ctx, unsigned int flags);

  // Applies the old default when a project of `version` needs it; true when applied.
  virtual bool maybe_set_to_old_default(RenderContext *ctx, float version, unsigned int flags = 0);

  // Brings the host's controls in line with the value.
  virtual void update_ui(RenderContext *ctx);

  // The value as text.
  virtual char *to_string(RenderContext *ctx, bool flag = false);

  // Sets the value from its text form; returns the engine's status.
  virtual int set_value_from_string(RenderContext *ctx, const char *text, unsigned int flags);

  // The value as a JSON node.
  virtual cJSON *to_json(RenderContext *ctx, bool flag = false);

  // Sets the value from a JSON node; returns the engine's status.
  virtual int set_value_from_json(RenderContext *ctx, cJSON *json, unsigned int flags);

  // Copies the host-side properties of another parameter.
  virtual void clone_host_properties(const Param *other);

  // Whether a project of `version` needs the old default.
  bool needs_old_default(float version);

  // The value as constant text: the text to_string gives for the same arguments.
  const char *to_string_const(RenderContext *ctx, bool flag = false) { return to_string(ctx, flag); }

  // Name of the parameter's type.
  const char *ptype_name() const;

  // The stable, script-facing name.
  const char *get_canonical_name() const;

  // Copies another parameter's description into this one.
  Param &operator=(const Param &other);

protected:
  // A new parameter of the same kind and value; the engine's copy operation.
  virtual Param *clone_impl();

  // Reads the value back from the host's controls; true when it changed.
  virtual bool get_value_from_buttons(RenderContext *ctx);

public:
  enum param_type ptype;  // offset 8: what kind of value the parameter carries
protected:
  unsigned char reserved_12[4];  // engine bytes 12-15
public:
  char *name;            // offset 16: display name, owned (C heap)
  char *canonical_name;  // offset 24: stable, script-facing name
protected:
  unsigned char reserved_32[8];  // engine bytes 32-39
public:
  unsigned char n_channels;     // offset 40: number of value channels
  unsigned char n_channels_c1;  // offset 41: channels shown to the user
protected:
  unsigned char reserved_42[2];  // engine bytes 42-43
public:
  ValueArray default_value;         // offset 44: default, one float per channel
  ValueArray old_default_value;     // offset 60: default that older projects used
  short use_old_default_p;          // offset 76: non-zero when the old default applies
  short old_default_version_limit;  // offset 78: version below which the old default applies
  float min_bound;                  // offset 80: lowest value accepted
  float max_bound;                  // offset 84: highest value accepted
  float step;                       // offset 88: increment of one step
  float normalize_scale;            // offset 92: factor between stored and displayed value
protected:
  unsigned char reserved_96[60];  // engine bytes 96-155
public:
  ParamFlags flags;         // offset 156: behaviour flags, in place
  float slider_min;         // offset 192: lower end of the ordinary slider
  float slider_max;         // offset 196: upper end of the ordinary slider
  float big_slider_min;     // offset 200: lower end of the wide slider
  float big_slider_max;     // offset 204: upper end of the wide slider
  signed char param_group;  // offset 208: index into the effect's group table, -1 for none
protected:
  unsigned char reserved_209[7];  // engine bytes 209-215
public:
  char *flags_string;  // offset 216: the flags as the effect definition writes them
protected:
  unsigned char reserved_224[16];  // engine bytes 224-239

private:
  // Arrays of parameters are never deleted as arrays.
  void operator delete[](void *);
};

// A popup parameter (ptype_popup): the common layout followed by its states.
// The engine fills n_states entries of state_names.
class PopupParam : public Param {
public:
  signed char n_states;                 // offset 240: number of states
  char *state_names[MAX_POPUP_STATES];  // offset 248: state names, in order (at most MAX_POPUP_STATES)
};

// A copy of `text` made on the C heap (release it with free()); null for null.
TARSEL_API char *tarsel_malloc_copy_string_func(const char *text);

static_assert(sizeof(Param) == 240, "Param is 240 bytes");
static_assert(alignof(Param) == 8, "Param is 8-byte aligned");
static_assert(sizeof(param_type) == 4, "param_type is 32-bit");
static_assert(sizeof(const_format_tag) == 4, "const_format_tag is 32-bit");

#if defined(__GNUC__)
#  pragma GCC diagnostic push
#  pragma GCC diagnostic ignored "-Winvalid-offsetof"
#endif
static_assert(offsetof(Param, ptype) == 8, "Param::ptype at 8");
static_assert(offsetof(Param, name) == 16, "Param::name at 16");
static_assert(offsetof(Param, canonical_name) == 24, "Param::canonical_name at 24");
static_assert(offsetof(Param, n_channels) == 40, "Param::n_channels at 40");
static_assert(offsetof(Param, n_channels_c1) == 41, "Param::n_channels_c1 at 41");
static_assert(offsetof(Param, default_value) == 44, "Param::default_value at 44");
static_assert(offsetof(Param, old_default_value) == 60, "Param::old_default_value at 60");
static_assert(offsetof(Param, use_old_default_p) == 76, "Param::use_old_default_p at 76");
static_assert(offsetof(Param, old_default_version_limit) == 78, "Param::old_default_version_limit at 78");
static_assert(offsetof(Param, min_bound) == 80, "Param::min_bound at 80");
static_assert(offsetof(Param, max_bound) == 84, "Param::max_bound at 84");
static_assert(offsetof(Param, step) == 88, "Param::step at 88");
static_assert(offsetof(Param, normalize_scale) == 92, "Param::normalize_scale at 92");
static_assert(offsetof(Param, flags) == 156, "Param::flags at 156");
static_assert(offsetof(Param, slider_min) == 192, "Param::slider_min at 192");
static_assert(offsetof(Param, slider_max) == 196, "Param::slider_max at 196");
static_assert(offsetof(Param, big_slider_min) == 200, "Param::big_slider_min at 200");
static_assert(offsetof(Param, big_slider_max) == 204, "Param::big_slider_max at 204");
static_assert(offsetof(Param, param_group) == 208, "Param::param_group at 208");
static_assert(offsetof(Param, flags_string) == 216, "Param::flags_string at 216");
static_assert(offsetof(PopupParam, n_states) == 240, "PopupParam::n_states at 240");
static_assert(offsetof(PopupParam, state_names) == 248, "PopupParam::state_names at 248");
#if defined(__GNUC__)
#  pragma GCC diagnostic pop
#endif
static_assert(sizeof(PopupParam) == 248 + 8 * MAX_POPUP_STATES, "PopupParam size");
