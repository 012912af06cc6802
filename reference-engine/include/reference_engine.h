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
//                     star, iris, and texture:<index> for a flare texture);
//                     "" for none
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
//   its process-wide caches (stamps, look-up tables, kept pixel buffers) and
//   its worker threads, and stays usable: the next render makes them again.

// Pixel buffers (T_RasterInfo)
//   Layouts read and written: pixel_a8, rgb8, bgr8, rgba8, bgra8, argb8, a16,
//   rgb16, rgba16, bgra16, argb16, af, rgbf, rgbaf, argbf, l8, l16, lf, la8,
//   la16, laf, rgb16f, rgba16f and a16f (16f: IEEE half floats). Not
//   supported: pixel_rgba16z, pixel_rgb10 and the unnamed values.
//   Integers span 0..1 (v / 255, v / 65535), 16-bit values in native byte
//   order. A buffer is ds_ysize lines of ds_xsize pixels of sizeof_pixel
//   bytes (0: the layout's own size; any other value must be that size),
//   each line followed by extra_line_stride_elts elements of the layout's
//   channel size; flip_y_p stores the lines bottom-up. x_origin and y_origin
//   place the buffer's top-left pixel in the frame, in the buffer's pixels;
//   world_xsize and world_ysize give the frame in full-resolution pixels
//   (0: the destination is the frame). res_factor 0 and 1 mean full
//   resolution; a buffer with another factor must be at the render's
//   downsample. clamp_p keeps float results within 0..1 (integer layouts
//   always are). Channels a layout lacks read as 1 (alpha) or, for alpha-only
//   layouts, as white (the alpha itself when premultiplied); luminance
//   layouts store the Rec. 709 luma. An unsupported layout or sizes that do
//   not add up fail the call with an Err_Error message saying which buffer.

// Rendering (render_tarsel_effect_to_native_image; arguments in effect.h)
//   The frame is measured in render pixels (full-resolution pixels divided
//   by downsample), y downwards. Inputs are read where they overlap the
//   destination; elsewhere, outside the destination included, they are
//   transparent. An unconnected input follows its descriptor's
//   input_default_to. Effects compute on premultiplied colour in the working
//   space; inputs are decoded from the input space, the previous output
//   (images[0], laid out as the destination) from the output space, and the
//   result encoded into the output space. The call's mix is scaled by the
//   instance's "Effect Mix" slot; for an effect without inputs it is the
//   result's opacity. Effects that leave their input as it is (mix 0, a blur
//   of radius 0, a dissolve at 0 or 1, an identity transform, an echo of the
//   current frame only) copy its pixels exactly. Fields count frame lines
//   (y_origin + line). Flag bit 0 clears the whole destination first, also
//   the lines of the other field. Parameter values are read as they stand;
//   counters the engine animates (auto_anim_floor0/1) add the frame number,
//   ramps (auto_anim_ramp_up) are per second (frame / frame_rate); a
//   parameter that needs an unconnected input reads as its default.
//   Lengths named in pixels are full-resolution pixels, divided by downsample.
//   What each effect draws:
//     Gradient     start to end colour (premultiplied blend); Linear along the
//                  angle (0 left to right, 90 top to bottom) with the first
//                  and last pixel centres exactly at the two colours; Radial
//                  and Diamond from the centre to the farthest corner;
//                  Conical once around from the angle; spread stretches it;
//                  an ordered dither below half an 8-bit step breaks bands.
//     Blur         n box passes (iterations) approaching a Gaussian whose
//                  standard deviation is half the radius; vertical scale
//                  multiplies the vertical radius; edges Transparent, Repeat
//                  (edge pixels repeated) or Mirror; whole-pixel boxes in
//                  draft (the lower of the call's and the parameter's
//                  quality); Blur Alpha off keeps the source's alpha.
//     Blur Fast    one box pass on a copy reduced by a quarter of the radius,
//                  scaled back up bilinearly.
//     Glow         luma above the threshold, blurred (standard deviation half
//                  the radius), tinted, times intensity and the mask's luma
//                  (an unconnected mask: 1), added as light.
//     Dissolve     per grain cell (grain size) a switch moment drawn from the
//                  seed parameter (plus the frame) and the call's seed;
//                  softness widens the switch into a fade.
//     Echo         frames frame + k * frame_step (k < echoes) weighted by
//                  decay^k, added, maximum, averaged or laid over; frames
//                  other than the current one are not yet fetched.
//     Trails       previous output times persistence plus the fade colour
//                  times the rest, blended under (Over, Add, Lighten, Screen)
//                  the current frame.
//     Lens Flare   the flare's elements lit from the position (fractions of
//                  the frame), scaled by scale, times brightness, added over
//                  the background. The preset only names where a flare came
//                  from: the flare parameter is what is drawn.
//     Glare        the glare's elements drawn at up to 48 brightest points
//                  (local maxima of 32-pixel cells above the threshold), in
//                  their colour, sized by size, turned by rotation.
//     Caption      the text ("{n}": the counter) in the built-in 5 x 8 bitmap
//                  font (printable ASCII; others draw as '?'; '\n' breaks
//                  lines); size is a line's glyph cell height; position is
//                  the anchor from the frame's centre; align picks the lines'
//                  left end, centre or right end; the block is centred on it
//                  vertically. The host's face is not used.
//     Transform    the pivot (fractions of the frame) plus the anchor moves
//                  to position + offset + (target - 0.5) and origin times the
//                  frame, scaled by scale times stretch, skewed, turned by
//                  rotation plus spin per second; crop keeps the source
//                  between its edges; Nearest, Bilinear or Bicubic
//                  (Catmull-Rom; bilinear in draft); edges Transparent,
//                  Repeat (tiled), Mirror, Clamp. The defaults leave a
//                  1920 x 1080 frame as it is; other frames set position to
//                  their centre and the crop to their size.
//     Builder Mix  front over back by the blend mode at the opacity, then
//                  levels (black, white, gamma) on straight colour.
//     Builder Matte colours within half the tolerance of the key are keyed
//                  out, beyond it kept; choke shrinks (grows, negative) the
//                  matte by that many pixels, softness blurs it; remove spill
//                  limits the key's main channel to the mean of the others.
//   Failures (a dead instance, an unknown descriptor or colour space, a
//   field other than 0..2, a negative downsample or frame rate, a bad pixel
//   aspect, a bad buffer) return 0 with an Err_Error message; nothing is
//   written then.

// Lens flares (render_tarsel_lensflare_to_native_image; arguments in effect.h)
//   Draws the descriptor's flare parameter (flare or glare; a descriptor
//   without one fails) from the centre given in destination pixels, its
//   elements' brightness times the call's, sizes times the descriptor's
//   "scale" and turned by its "rotation" where it has them, added over the
//   background (images[1]). Element geometry: a flare's elements lie on the
//   axis from the light through the frame's centre; size is a radius in
//   fractions of the frame's diagonal. The drawn kinds use the cached stamps
//   (finer stamps for elements over 96 pixels in radius).

// Flare textures (tarsel_load_flare_texture ... tarsel_free_all_flare_textures)
//   A process-wide, thread-safe store; indices count from 0 in the order
//   textures are added and start again after tarsel_free_all_flare_textures.
//   PNG files (8 or 16 bits; grey, grey and alpha, RGB, RGBA; palettes and
//   transparency chunks become RGB(A), low-depth grey 8 bits) keep their
//   depth: bytes_per_channel 1 or 2, 16-bit channels in native byte order.
//   Registered pixels are copied: 1 to 4 channels of 1, 2 or 4 (float)
//   bytes, lines top to bottom without padding, at most 16384 pixels a side.
//   tarsel_get_flare_texture_error reports the last texture call of the
//   calling thread (null when it succeeded). A flare element
//   "texture:<index>" draws the texture, its longer side across the
//   element's diameter, as light: colour (grey for one or two channels)
//   times alpha, tinted by the element's colour and brightness. A missing
//   texture draws nothing and sends one Err_Warning per render.

// Image utilities (image_utils.h, make_tarsel_raster_info)
//   Resizes filter stored values (no colour conversion), premultiplied when
//   the source has straight alpha; shrinking widens the filter by the
//   reduction, so every source pixel counts; edges repeat. Box is an area
//   average (a linear blend when enlarging); bicubic sharpness walks the
//   cubics with B + 2C = 1 from the B-spline (0) to Catmull-Rom (1). A resize
//   to the same size that moves nothing copies the pixels exactly. The result
//   descriptor is filled as make_tarsel_raster_info fills one, top-down, with
//   the source's is_premultiplied.
//   tarsel_convert_to_bgra_8: each pixel's straight colour goes through the
//   input table, is decoded from the source colour space, multiplied by the
//   exposure, encoded for the display and looked up in the display table.
//   The conversion does not depend on the instance argument.
//   tarsel_comp_bgra_8: straight-alpha "over"; the lighter checker colour is
//   half-way to white; cell (0, 0) has the background colour.

// Worker threads and abort
//   Renders, resizes, conversions and composites run on a process-wide pool
//   with one thread per core (made on first use), the calling thread
//   working too; renders from several threads share it. Results do not
//   depend on the number of threads. Work polls the abort request at every
//   line, so tarsel_abort_render ends even a 3840 x 2160 float render within
//   a few milliseconds: the call throws TarselAbortException on its calling
//   thread once every worker has stopped. Frame-sized working buffers are
//   kept for reuse (up to 768 MB) until tarsel_shutdown_apps.
