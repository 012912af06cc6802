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

// Catalogues (get_tarsel_plugin_info_i, get_tarsel_builder_info_i)
//   Entries live as long as the engine; an index outside a catalogue gives
//   null. Instances run descriptor 0 of their plug-in (effect_genotype).
//
//   Effect catalogue
//   | Plug-in      | Category       | Inputs (optional*)    | Parameter types                                  |
//   |--------------|----------------|-----------------------|--------------------------------------------------|
//   | T_Gradient   | Generators     | none                  | colour (4 ch) x2, float, point, popup, float     |
//   | T_Blur       | Blur & Sharpen | Source                | float (old default), int, float, popup, boolean, |
//   |              |                |                       | popup, 2 hidden floats; group "Advanced";        |
//   |              |                |                       | descriptors "Blur" and "Blur Fast"               |
//   | T_Glow       | Light          | Source, Mask*         | float x3, colour (3 ch), boolean, push button    |
//   | T_Dissolve   | Transitions    | From, To              | float (automatic transition) x3, int (animated)  |
//   | T_Echo       | Time           | Source                | int, float x2, popup                             |
//   | T_Trails     | Time           | Source                | float, popup, colour (4 ch)                      |
//   | T_LensFlare  | Light          | Background*           | point, float x2, from-file popup, flare          |
//   | T_Glare      | Light          | Source                | float x3, flare (glare)                          |
//   | T_Caption    | Stylize        | Background*           | label, string, float, colour (4 ch), point,      |
//   |              |                |                       | int (animated), popup                            |
//   | T_Transform  | Distort        | Source                | label (documents a group), two-channel floats in |
//   |              |                |                       | screen modes 0-9, float x3 (one animated),       |
//   |              |                |                       | popup x2, boolean; group "Sampling"              |
//   Effect-builder catalogue (descriptors assembled per instance)
//   | T_BuilderMix   | Builder      | Front, Back*          | popup, float x4; groups "Blend", "Levels"        |
//   | T_BuilderMatte | Builder      | Source, Matte*        | colour (3 ch), float x3, boolean; groups "Key",  |
//   |                |              |                       | "Edge", "Spill"                                  |
//   T_Trails reads its previous output (use_prev_dest_p); T_Echo reads other
//   frames; T_Dissolve is a transition; T_Caption takes data from the host.

// Descriptors (Genotype)
//   input_default_to: 0 transparent black, 1 every channel at the input's
//   input_default_value, 2 the effect's first input.
//   rgba_mode: 0 colour only (alpha from alpha_z_source_input), 1 all four
//   channels, 2 an opaque result. alpha_z_source_input is -1 for effects
//   without inputs.
//   Every descriptor has disable_gpu 1 and gpu_disable_reason 1 (this engine
//   has no graphics-processor path).
//   old_default_effect is -1 when none; otherwise older projects (version
//   below old_default_version_limit) took their defaults from that descriptor.
//   Descriptor 0 of every plug-in carries three instance parameter slots:
//   "Effect Mix" (enabled), an empty slot, and "Motion Blur" (present, not
//   enabled: this engine renders no motion blur).
//   host_data of T_Caption points to the engine's text settings (face and size).
//   needs_input_n of a parameter counts inputs from 1; 0 means none.

// Parameters (Param)
//   A Param the host constructs keeps a value of whatever ptype it is given.
//   Defaults of a bare Param: no name, ptype_unknown, 1 channel, group -1,
//   bounds -1000000 and 1000000 (no limit), slider 0..1, wide slider 0..100,
//   step 0.01, normalize_scale 1, all flags clear.
//   Values are kept within min_bound and max_bound (a bound of the no-limit
//   value is not applied), rounded for int, popup and boolean; NaN is refused.
//   Text forms (to_string, set_value_from_string, tarsel_param_to_string):
//     float, colour   channels as numbers with "%.9g" digits, one blank apart
//     int             channels as whole numbers
//     popup           the state's name (its index for a popup without names)
//     boolean         "true" or "false"
//     string          the text itself
//     flare           elements "kind size brightness position red green blue"
//                     separated by "; " (kinds: glow, ring, disc, streak,
//                     star, iris); "" for none
//     label, push button: ""
//   to_string's text belongs to the Param until its next to_string or its
//   destruction; callers never free it. set_value_from_string returns 1, or
//   0 and an Err_Warning naming the parameter when the text does not read.
//   The bool of to_string and the flag 1 of set_value, set_values,
//   set_value_from_string and set_value_from_json mean display units (the
//   stored value times normalize_scale).
//   to_json gives a node the caller frees with cJSON_Delete: a number (one
//   channel), an array of numbers, the state name, true/false, the text, or
//   an array of flare elements {"kind", "size", "brightness", "position",
//   "color": [r, g, b]}; null for labels and buttons. With its bool the node
//   is {"name", "type", "value"}. set_value_from_json reads all of these and
//   the text forms as JSON strings.
//   set_value and set_values return 1 when stored, 0 otherwise (nothing is
//   stored then). Setting a push button's channel to non-zero presses it.
//   set_to_default returns whether the value changed; maybe_set_to_old_default
//   applies the old default when needs_old_default(version) holds.
//   update_ui copies the value into the controls the host's widgets show;
//   get_value_from_buttons takes the controls' values back.
//   clone_host_properties copies the display name, hidden and enabled flags,
//   screen mode, group expansion and slider ranges.
//   get_canonical_name of a Param without a canonical name derives one from
//   its name (lowercase letters and digits, other runs as "_").
//   flags_string lists the flags as the effect's definition writes them:
//   hidden, group_start, open, group_end, doc_group, no_publish,
//   builder_disable, builder_disable_one, fromfile, glare, disabled.

// Queries (param_queries.h)
//   tarsel_get_param_title: a one-channel parameter and a point show one
//   title, the name; other channels are the name and "Red", "Green", "Blue",
//   "Alpha" for colours, "Left"/"Right" (screen_mode_screen_x) or
//   "Top"/"Bottom" (screen_mode_screen_y), else "X", "Y", "Z", "W". A channel
//   not shown gives "". At most size - 1 bytes and a NUL are written; size 0
//   writes nothing. The buffer is returned.
//   tarsel_get_param_bounds2(param, scale, channel, lo, hi, third, fourth,
//   flags): lo/hi are the bounds times scale (the no-limit values unscaled),
//   third/fourth the slider range times scale. flags 1: the wide slider's
//   range instead; flags 2: display units (also times normalize_scale). All
//   channels share one range; a channel the parameter lacks gives no limits
//   and a 0..0 slider range. Any output may be null.
//   tarsel_get_fromfile_popup_names: the entries of the file beside the
//   library in tarsel-data/ (flare_presets.txt for the lens flare's
//   "Preset"), engine-owned and stable; 0 and null for other parameters.
//   tarsel_any_nodes_get_flag(genotype, mask): the descriptor's node flags
//   and mask: 0x1 reads other frames, 0x2 reads its previous output, 0x4
//   draws a flare, 0x8 mixes inputs, 0x20000 takes data from the host.

// Instances (init_tarsel_effect, init_tarsel_effect_from_string, free_tarsel_effect)
//   init_tarsel_effect(name, builder): builder false looks the name up in the
//   effect catalogue, true in the effect builder's. An unknown name gives null
//   and an Err_Error message. Every instance has its own descriptors,
//   parameters and definitions.
//   Saved text, as init_tarsel_effect_from_string reads it:
//     {"effect": "<plug-in name>", "builder": false,
//      "params": {"<canonical name>": "<value as to_string gives it>", ...}}
//   "builder" defaults to false and "params" may be left out; a value may also
//   be given in its JSON form. Parameters of the descriptor in use named there
//   are set with set_value_from_string; an unknown name is skipped with an
//   Err_Warning. Malformed JSON or an unknown effect gives null and an Err_Error.
//   free_tarsel_effect(null) does nothing; a pointer that is not a live
//   instance is refused with an Err_Error.
//   generate_all_tarsel_effect_params reports the parameters of the descriptor
//   in use that are published (no dont_publish_p), in table order, and stops
//   at the first non-zero answer of the collector.

// Controls
//   set_tarsel_luts(input, display, exposure): each path names a text file of
//   one number per line ('#' lines and blank lines skipped, 2 to 65536 finite
//   entries, spanning inputs 0 to 1, interpolated linearly). Null or "" clears
//   that table; a file that does not read leaves it as it was and sends an
//   Err_Error. exposure multiplies linear values before the display table (a
//   finite factor of 0 or more; otherwise an Err_Error and the old one stays).
//   tarsel_effect_is_time_varying(effect, text, frame): text null or "" asks
//   about the effect as a whole (1 when it reads other frames or its previous
//   output or a parameter animates), otherwise about the parameter with that
//   canonical name (1 when it animates automatically or by transition). An
//   unknown name or instance gives -1. The answers hold for every frame.
//   tarsel_get_gpu_status: engine-owned text, stable for the instance's life,
//   saying that the engine renders on the CPU.
//   Stamps: pre-rendered coverage images of flare and glow elements, cached
//   process-wide; instances prepare those their defaults draw.
//   tarsel_free_all_stamp_collections empties that cache.
//   tarsel_shutdown_apps: the engine runs no helper applications; it releases
//   its process-wide caches (stamps, look-up tables) and stays usable.
