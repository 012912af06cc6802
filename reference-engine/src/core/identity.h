// The engine's identity texts (the version text as the test probe may change
// it) and the colour-management configuration it reads.
#pragma once

#include <optional>
#include <string>

namespace tarsel_ref {

// The text get_tarsel_version_info gives from now on; none: the engine's own.
void set_version_text(std::optional<std::string> text);

// The version text: the one set, else the engine's own with its build identifier.
std::string version_text();

// The build identifier the engine was built with.
const char *build_id();

// The colour-management configuration the environment names ($OCIO); "" when none.
std::string ocio_config_path();

}  // namespace tarsel_ref
