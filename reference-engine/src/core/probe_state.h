// State the test probe sets and the engine reads.
#pragma once

#include <optional>
#include <string>

namespace tarsel_ref::probe {

// The version text set with tarsel_probe_set_version_text, if any.
std::optional<std::string> version_text_override();

}  // namespace tarsel_ref::probe
