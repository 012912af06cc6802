// Value operations shared by the base parameter and its kinds: what a type
// holds, how a channel is stored (bounds, rounding), and the C-heap texts.
#pragma once

#include <string>

#include "catalogue/param_store.h"
#include "tarsel/param.h"

namespace tarsel_ref {

// Whether parameters of this type hold numbers, one per channel.
bool holds_numbers(param_type type);

// Whether parameters of this type hold text (strings and flare descriptions).
bool holds_text(param_type type);

// Channels of the value a parameter keeps: its n_channels, at most
// MAX_CHANNELS, for float, int and colour; 1 for popup and boolean; 0 for
// the others.
int value_channels(const Param &param);

// The value `value` becomes when stored in one channel: bounded (unless a
// bound is the no-limit value), rounded for whole-number types; false when
// the parameter cannot hold it (not a number, or a non-finite whole number).
bool storable_value(const Param &param, float value, float *stored);

// Replaces a C-heap text: frees the old one, stores a copy (null for null).
void replace_text(char *&slot, const char *text);

// The parameter's name for messages.
std::string param_label(const Param &param);

// Sends an Err_Warning naming the parameter.
void warn_about(const Param &param, const std::string &what);

// Number of Param objects alive in the process.
int live_params();

}  // namespace tarsel_ref
