// Identity of the tarsel_ps build and its environment.
#pragma once

#include <string>

#include "tarsel/export.h"

// Writes the engine's version text into buffer: at most max_chars characters,
// then a terminating NUL (so buffer holds at least max_chars + 1 bytes).
TARSEL_API void get_tarsel_version_info(char *buffer, int max_chars);

// The engine's build identifier: 16 lowercase hexadecimal digits, engine-owned.
TARSEL_API const char *get_tarsel_build_id();

namespace Tarsel {

// Path of the colour-management (OpenColorIO) configuration the engine uses.
TARSEL_API std::string get_ocio_path();

}  // namespace Tarsel
