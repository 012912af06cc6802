// Conversions of a parameter's value to and from its text and JSON forms.
//
// Text forms (to_string, set_value_from_string):
//   float, colour   the channels as numbers ("%.9g" digits), separated by one blank
//   int             the channels as whole numbers
//   popup           the name of the chosen state (its index when the
//                   parameter has no state names)
//   boolean         "true" or "false"
//   string          the text itself
//   flare           the description of its elements (flare.h)
//   label, push button and types without a value: ""
// With the display flag, numbers are given times normalize_scale.
#pragma once

#include <string>

#include "tarsel/param.h"

struct cJSON;

namespace tarsel_ref {

// The state names of a popup parameter; none for a parameter the host made.
struct StateList {
  int count = 0;
  char *const *names = nullptr;
};
StateList popup_states(const Param &param);

std::string value_text(const Param &param, bool display_units);

// Sets the value from its text form; false (value unchanged) when malformed.
bool read_value_text(Param &param, const char *text, unsigned int flags);

// Sets every channel from `values` (one per value channel); all or nothing.
bool store_numbers(Param &param, const float *values, int count, unsigned int flags);

// JSON forms: a number for one channel, an array of numbers for several, the
// state name for a popup, true/false, the text for a string, an array of
// element objects for a flare, null for the types without a value. With the
// description flag the node is {"name": canonical name, "type": type name,
// "value": value node}; set_value_from_json accepts either.
cJSON *value_json(const Param &param);
bool read_value_json(Param &param, const cJSON *json, unsigned int flags);

}  // namespace tarsel_ref
