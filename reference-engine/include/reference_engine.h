// What the reference engine makes of the values the contract leaves to the
// engine. Host authors read this beside engine-api/.
#pragma once

// Identity (get_tarsel_version_info, get_tarsel_build_id, Tarsel::get_ocio_path)
//   The version text reads "tarsel_ps reference engine <version> (build <id>)".
//   The build identifier is drawn when the engine is configured; a module built
//   in the same tree carries the same one.
//   The colour-management configuration is the path named by the OCIO
//   environment variable, read at each call; empty when it is not set (the
//   engine then works in its built-in linear/sRGB handling).
#define TARSEL_REFERENCE_VERSION "0.1.0"

// Messages (T_set_err_handler)
//   The engine sends every message to the installed handler, from the thread
//   that produces it (render worker threads included). With no handler
//   installed a message is dropped.

// Abort (tarsel_abort_render, tarsel_clear_abort)
//   An abort request stays set until tarsel_clear_abort: every engine call that
//   polls it meanwhile throws TarselAbortException.
