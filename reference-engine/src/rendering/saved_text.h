// The saved text of an instance, as init_tarsel_effect_from_string reads it:
//   {"effect": "<plug-in name>", "builder": false,
//    "params": {"<canonical name>": "<value as to_string gives it>", ...}}
// "builder" (default false) picks the effect builder's catalogue; "params"
// may be left out. A value may also be written in the JSON form to_json gives.
#pragma once

#include "rendering/instance.h"

namespace tarsel_ref {

// The instance the text describes; null (after an Err_Error message) when
// the text is not such JSON or names no known effect. Parameters the effect
// does not have are skipped with an Err_Warning message, and so are values
// that do not read.
EffectInstance *instance_from_saved_text(const char *text);

}  // namespace tarsel_ref
