// Where a parameter keeps its value. Every Param, the bare ones a host
// constructs included, carries this record in its engine bytes 96-155 (and
// the canonical name it derives from its display name in bytes 224-231), so the base class can hold and convert a
// value of whatever type it is given.
#pragma once

#include <cstddef>
#include <new>

#include "tarsel/param.h"

namespace tarsel_ref {

// Bounds of this value mean "no limit" and are never applied.
constexpr float kNoLowerBound = -1000000.0f;
constexpr float kNoUpperBound = 1000000.0f;

// The form flag of set_value, set_values, set_value_from_string and
// set_value_from_json: the value is given in display units (stored value
// times normalize_scale), as to_string and to_json give it with their flag.
constexpr unsigned int kDisplayUnits = 1u;

struct ParamStore {
  float value[MAX_CHANNELS];     // the current value, one float per channel
  float controls[MAX_CHANNELS];  // the value as the host's controls last showed it
  char *text;                    // value of string and flare parameters (C heap), null for ""
  char *shown;                   // text last handed out by to_string (C heap)
  signed char format;            // a const_format_tag, or -1: the type's own
  unsigned char list_id;         // the data-file list of a from-file popup, 0 for none
};
static_assert(sizeof(ParamStore) <= 60, "the value record fits the engine bytes 96-155");
static_assert(alignof(ParamStore) <= 8, "the value record is at most 8-byte aligned");

// Reaches the engine bytes of any Param from engine code outside its members.
class ParamAccess : public Param {
public:
  static ParamStore &store(Param &param) {
    return *std::launder(reinterpret_cast<ParamStore *>(param.*(&ParamAccess::reserved_96)));
  }
  static const ParamStore &store(const Param &param) {
    return *std::launder(reinterpret_cast<const ParamStore *>(param.*(&ParamAccess::reserved_96)));
  }
  // Canonical name made from the display name (C heap), for a Param without one.
  static char *&derived_name(Param &param) {
    return *std::launder(reinterpret_cast<char **>(param.*(&ParamAccess::reserved_224)));
  }
  static Param *clone(Param &param) { return (param.*(&ParamAccess::clone_impl))(); }
  static bool read_controls(Param &param, RenderContext *ctx) {
    return (param.*(&ParamAccess::get_value_from_buttons))(ctx);
  }
};

inline ParamStore &store_of(Param &param) { return ParamAccess::store(param); }
inline const ParamStore &store_of(const Param &param) { return ParamAccess::store(param); }

}  // namespace tarsel_ref
