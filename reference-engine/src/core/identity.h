// The engine's identity texts, as the test probe may change them.
#pragma once

#include <optional>
#include <string>

namespace tarsel_ref {

// The text get_tarsel_version_info gives from now on; none: the engine's own.
void set_version_text(std::optional<std::string> text);

}  // namespace tarsel_ref
