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
//   | T_TimeBlur   | Time           | Source, Matte*        | int x2, float                                    |
//   Effect-builder catalogue (descriptors assembled per instance)
//   | T_BuilderMix   | Builder      | Front, Back*          | popup, float x4; groups "Blend", "Levels"        |
//   | T_BuilderMatte | Builder      | Source, Matte*        | colour (3 ch), float x3, boolean; groups "Key",  |
//   |                |              |                       | "Edge", "Spill"                                  |
//   T_Trails reads its previous output (use_prev_dest_p); T_Echo and
//   T_TimeBlur read other frames (need_other_frames_p); T_Dissolve is a
//   transition; T_Caption takes data from the host.

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
//   current frame only, a time blur with no other frame at hand) copy its
//   pixels exactly. Fields count frame lines (y_origin + line). Flag bit 0
//   clears the whole destination first, also the lines of the other field.
//   Parameter values are read as they stand; counters the engine animates
//   (auto_anim_floor0/1) add the frame number, ramps (auto_anim_ramp_up) are
//   per second (frame / frame_rate); a parameter that needs an unconnected
//   input reads as its default.
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
//     Echo         frames frame + k * frame_step (k < echoes, the step
//                  rounded to whole frames) weighted by decay^k, added,
//                  maximum, averaged (over the weights present) or laid over,
//                  the oldest lowest. The current frame comes from the call,
//                  the others through frame requests (flag 0, in the order
//                  they are laid together: newest first, oldest first for
//                  Over; neighbouring echoes of one frame ask for it once); a
//                  frame the host does not have is left out. Without a
//                  callback only the current frame is at hand.
//     Trails       previous output times persistence plus the fade colour
//                  times the rest, blended under (Over, Add, Lighten, Screen)
//                  the current frame. Given no previous output (images[0]
//                  null) while a frame-request callback is installed, the
//                  render rebuilds it: it requests frames frame - K to
//                  frame - 1 of Source, oldest first, with flag 1, K being
//                  the fewest frames after which persistence^K is below
//                  1/1024 (at most 16; none for persistence 0), and renders
//                  them in turn, the oldest with no previous output, each
//                  written in the destination's layout and read back as a
//                  previous output is. The result is that of the same frame
//                  in a sequence of renders (same arguments, whole frames)
//                  begun at frame - K. A frame the host does not have ends
//                  the history there: the sequence begins at the frame after
//                  it. Without a callback a render given no previous output
//                  starts afresh: the trail is the fade colour alone.
//     Time Blur    the source blended towards the average of its frames
//                  frame - frames_before to frame + frames_after
//                  (premultiplied; frames the host does not have left out)
//                  by amount times the Matte's luma (Rec. 709, each frame's
//                  within 0..1) averaged over the same frames: the Matte
//                  moves with the clip. Frames come through frame requests
//                  (flag 0), oldest first, each frame of Source followed by
//                  that frame of Matte when it is connected (unconnected: 1
//                  everywhere, nothing requested); a frame of Matte the host
//                  does not have is left out of its average. Without a
//                  callback only the current frame is at hand and the source
//                  is copied as it is.
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
//   aspect, a bad buffer, a frame request answered with a bad descriptor)
//   return 0 with an Err_Error message; nothing is written then.

// Frame requests (set_load_other_frame_into_buffer_fun)
//   The callback is process-wide: installing one replaces the one before,
//   null removes it. A render takes the callback installed when it starts.
//   Without one only the current frame is at hand (the call's images) and
//   effects render with that alone. Requests are made for effects that read
//   other frames (Echo, Time Blur) or rebuild their previous output (Trails),
//   and only for connected inputs: every frame of an unconnected input is its
//   fallback. The current frame is never requested.
//   fun(render_state, input, frame, flag, engine_data1, engine_data2, out_info):
//     render_state  a T_RenderState of the render: input_info[i] is the
//                   call's descriptor of input i (rasters[i + 1]), zeroed for
//                   an unconnected input; the engine bytes are 0. One per
//                   render, valid until the render returns.
//     input         the input, counted from 0 (rasters[input + 1]).
//     frame         the frame wanted.
//     flag          0: another frame of the input, for the effect to read;
//                   1: a frame of the input the effect's previous output is
//                   rebuilt from.
//     engine_data1  the instance being rendered (EffectGlobals_t *).
//     engine_data2  the descriptor being rendered (Genotype *).
//     out_info      filled by the host: the descriptor of the pixels it
//                   returns.
//   The result is the first byte of the frame's pixels, read like an input:
//   from the call's input colour space, premultiplied as the call says,
//   placed by its origin where it overlaps the destination (transparent
//   elsewhere), at the render's resolution (res_factor 0, 1 or the
//   downsample). Null means the host has no such frame: each effect leaves
//   it out as "What each effect draws" says.
//   Threads: requests are made from a thread the render starts for them
//   (one per render, for all its requests, ended when the render returns),
//   never from the thread that called the render (it waits meanwhile),
//   whatever n_threads says. Within one render they are made one at a time,
//   and each returned frame is read into the render's working form before
//   the next request is made, so the host's buffer needs to stay valid only
//   until then (the render's next request or its return). Renders running
//   at the same time make their requests independently, each from its own
//   thread, so the callback may be entered from several threads at once.
//   A standing abort request (tarsel_abort_render) is honoured before each
//   request.
//   Failure: a callback that throws, whatever it throws (TarselAbortException
//   included), ends the render as an abort: no further request is made, and
//   the render call throws TarselAbortException on its calling thread once
//   its workers have stopped. The abort request is not set, so the next
//   render runs. A descriptor in out_info that does not describe readable
//   pixels (an unsupported layout, another resolution factor, sizes that do
//   not add up) fails the render: it returns 0 with an Err_Error message
//   naming the input and the frame ("... the host's answer for frame 11 of
//   input 0 ("Source"): pixel type 99 is not supported").

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

// Widgets (tarsel_set_gfx_impl, tarsel_widget_draw, tarsel_widget_mouse_event)
//   tarsel_set_gfx_impl keeps one plain pointer for the process (null removes
//   it); the host keeps the object alive while it is installed. Both widget
//   calls run on the calling thread, inside the call, and take: the instance
//   (not a live one: an Err_Error); the canonical name of the one parameter
//   whose widget is meant (null or "": every widget of the descriptor in use;
//   an unknown name: an Err_Warning, nothing drawn or hit); the viewer's size
//   in screen pixels; the frame position (full-resolution pixels) shown at
//   the viewer's top-left corner (finite); screen pixels per frame pixel
//   (positive and finite); and [frame width, frame height, frame number]
//   (missing entries: the view size over the scale, frame 0; the sizes
//   positive and finite, the frame rounded to a whole frame). Arguments
//   outside these: an Err_Error and nothing done. A frame point (fx, fy) is
//   shown at ((fx - view_x) * scale_x, (fy - view_y) * scale_y), y downwards.
//   Values are read at the frame: counters (auto_anim_floor0/1) add the frame
//   number; ramps are taken as they stand (the calls have no frame rate).
//   Widgets, in parameter table order, for parameters not hidden (geometry
//   in screen pixels):
//     point   a float or int parameter shown as one two-channel point (screen
//             modes screen, screen_center, normalize, screen_to_norm,
//             screen_center_to_norm), placed in the frame by its mode: frame
//             pixels; pixels from the frame's centre; fractions of the
//             frame; fractions of the frame; fractions from the centre.
//             color_3f(1, 1, 0), line_width, line(x - 14, y, x + 14, y),
//             line(x, y - 14, x, y + 14), circle(x, y, 10),
//             get_text_length_in_pixels(name) = w,
//             draw_text(name, x - w / 2, y + 24).
//     colour  a swatch in slot k, k counting the descriptor's colour
//             parameters that are not hidden (whichever widgets a call asks
//             for): the rectangle (10, 10 + 24k) to (34, 26 + 24k).
//             color_3f(its red, green, blue clamped to 0..1), line_width,
//             rect_filled, color_3f(1, 1, 1), the stippled outline (top-left,
//             top-right, bottom-right, bottom-left, top-left),
//             draw_text(name, 40, 24 + 24k).
//     flare   a flare or glare parameter: its elements on the axis from the
//             light (the descriptor's first point parameter, else the frame's
//             centre) through the frame's centre. color_3f(0.5, 0.75, 1),
//             line_width(1), the stippled axis (two points: axis positions
//             min(0, element positions) and max(1, element positions)),
//             dot(light, 6), then per element circle(light + position *
//             (centre - light), size * factor * frame diagonal * scale_x),
//             factor the descriptor's "scale" ("size" for a glare), 1 without.
//   name is the display name (the canonical name when it has none). A
//   stippled line is stipple_pattern(0x0F0F), stipple_on, begin_line, lines,
//   end_line, stipple_off. line_width is 2 for the widget a drag holds, else 1.
//   A draw is one pass: set_graphics_context(instance),
//   start_drawing(number of widgets), the widgets, flush, end_drawing (a pass
//   without widgets too). With no drawing implementation installed: an
//   Err_Error and nothing drawn. T_Gradient (two swatches, a point) uses
//   every operation but dot; T_LensFlare (a point, a flare) every one but
//   rect_filled.
//   Widgets per effect: T_Gradient start_color, end_color, center; T_Glow
//   tint; T_Trails fade colour; T_LensFlare position, flare; T_Glare glare;
//   T_Caption color, position; T_Transform position, anchor, pivot, target,
//   origin; T_BuilderMatte key colour; the others none.
//   Mouse events (position in viewer pixels) hit the topmost (last drawn)
//   widget under the mouse: a point within 10 pixels of its centre, a swatch
//   inside its rectangle, edges included; flares are never hit. PRESS on a
//   widget takes it, keeping the press position and the parameter's value
//   with the instance, and gives 1; elsewhere it lets go of any held widget
//   and gives 0. DRAG moves the held widget and gives 1. With (dx, dy) the
//   mouse's travel since the press in screen pixels, a point becomes its
//   value at the press plus (dx / scale_x, dy / scale_y) frame pixels,
//   divided by the frame's width and height where the point is in fractions;
//   a swatch's red, green and blue become those at the press times
//   2^(dx / 100), alpha unchanged. The value is stored as set_values stores
//   it (bounds apply); one beyond the float range is not stored. RELEASE
//   moves the held widget to its position the same way, lets go and gives 2.
//   MOVE gives 1 over a widget or while one is held; DRAG and RELEASE with
//   nothing held give 1 over a widget; otherwise 0. The list names each
//   parameter whose value the event changed (canonical name, four channels,
//   those it lacks 0); empty when none did. The held widget lives in the
//   instance and ends with it; a change of the descriptor in use lets go.
//   Failures of the host: the first exception out of any drawing operation
//   ends the draw (the host is called no further) and the call throws
//   TarselAbortException; the abort request stays as it was. A pending abort
//   request makes both calls throw TarselAbortException before they do
//   anything.

// Worker threads and abort
//   Renders, resizes, conversions and composites run on a process-wide pool
//   with one thread per core (made on first use), the calling thread
//   working too; renders from several threads share it. Results do not
//   depend on the number of threads. Work polls the abort request at every
//   line, so tarsel_abort_render ends even a 3840 x 2160 float render within
//   a few milliseconds: the call throws TarselAbortException on its calling
//   thread once every worker has stopped. Frame-sized working buffers are
//   kept for reuse (up to 768 MB) until tarsel_shutdown_apps.

// Shared-memory transport (ShmemManager, ShmemTransport)
//   Names: 1 to 200 characters after an optional leading "/" ("/x" and "x"
//   name the same segment), no other "/". The segment is the POSIX
//   shared-memory object "/tarsel-ipc.<name>" (/dev/shm/tarsel-ipc.<name>),
//   mode 0600 whatever the umask, its memory allocated when it is made (a
//   full /dev/shm refuses it then). An invalid name: serve and connect give
//   null, reset does nothing.
//   serve(name, size1, size2): size1 is the capacity in bytes of the queue
//   from server to client, size2 of the queue from client to server, each
//   rounded down to a multiple of 64, which must then lie within 4096 and
//   1 GiB (else null); the segment takes 4096 + both capacities. A name in
//   use is reclaimed when it holds a segment of this layout whose server
//   process is dead (that one is marked removed, so ends still attached to
//   it see INVALID_SEGMENT, and unlinked); a live server's segment, or
//   anything else under the name, is refused (null). A segment is never
//   reused: reclaiming makes a new one.
//   connect(name): null unless the segment is of this layout, not removed,
//   its server process alive and no other client attached. One client at a
//   time: a client that frees its end leaves the place free; a dead client's
//   place is taken over (a restarted client works again, and reads what the
//   server wrote and the dead one did not read). Server and client may be
//   one process. ShmemManager objects hold nothing.
//   Messages: the server writes the queue to the client and reads the other,
//   the client the opposite. A message is its MessageHeader_t and its body,
//   contiguous in the ring, padded to a multiple of 64 bytes: a body of n
//   bytes takes 64 + n rounded up to 64. An empty queue starts again at the
//   ring's start, so a queue of capacity C takes bodies of up to C - 64
//   bytes; a larger one fails at once with MSG_TOO_LARGE, changing nothing.
//   id counts the writer's messages in that direction from 1 (its low 32
//   bits; a client taking over a dead one's place goes on counting); size is
//   the body's size; desc the writer's desc cut to 24 bytes, NUL-terminated
//   when shorter, not terminated when it fills the field, all zeros for a
//   null desc; padding and reserved are zeros.
//   Waiting: read, reserve, write and write_string wait as long as it takes;
//   the try_ forms never wait (RETRY when they would); the timed_ forms wait
//   at most `timeout` seconds (a float; 0 or less: not at all), failing with
//   TIMEOUT when that time has run out. On a machine with more than one
//   processor a wait first watches the queue for about 20 microseconds (a
//   busy lock for 5), yielding its processor between looks after the first
//   2; then it sleeps until the peer publishes a message, frees room or
//   releases the lock, waking at least every 50 ms to look at the segment
//   and the peer: when the peer process has ended (for a server, its
//   connected client's; for a client, the server's; a dead process that its
//   parent has not reaped yet has ended) the wait ends with RETRY, so a
//   survivor never hangs. A server with no client connected waits for one.
//   While a call waits, the signals a host handles are held back (faults
//   excepted); one that comes ends the wait within a slice, with RETRY and
//   nothing taken or sent, and is let through as the call returns, so that
//   the host acts on it at once (a wait for the lock is not ended so). Reads, reservations and writes that need not wait make
//   no system call (wake-ups go to sleepers only).
//   Reads: read(&data, &header) takes the next message and returns its body
//   size, *data pointing to its body and *header to its header, both inside
//   the segment (read only); either may be null. The message's space stays
//   the reader's, and the pointers valid, until that transport's next read
//   or its freeing: every read first releases the messages read before (also
//   one that then finds nothing). With null data and a non-null header a
//   read is a header query: it returns the next message's size and header
//   without taking it (the next read returns that message) and releases
//   nothing, so a writer waiting for the room of the message read last goes
//   on waiting. An empty body is a message: read returns 0 for it with
//   get_last_error SHMEM_NO_ERROR (*data pointing just past its header);
//   nothing to read returns 0 with RETRY or TIMEOUT (*data, *header null).
//   read_and_retry(timeout) is timed_read that, failing with RETRY (the peer
//   gone) or LOCK_ERROR, tries again every millisecond until the timeout has
//   passed; its error is then that of its last attempt.
//   Reservations: reserve(size, desc) waits for room for one message of a
//   body of `size` bytes and returns that body inside the segment (writable,
//   `size` bytes; not null also for 0), touching none of it, so its cost
//   does not depend on the size. commit() publishes it: the write position
//   moves in one store, so a writer that dies before committing delivers
//   nothing. commit with nothing reserved returns false and changes nothing,
//   get_last_error included. A transport has one reservation: a reserve or
//   write that succeeds while one is open takes its place (the open one is
//   never delivered); one that fails leaves it open.
//   Writes: write copies the `size` bytes once (memcpy into the ring, under
//   the queue's lock) and publishes them as one message; write_string sends
//   strlen(text) + 1 bytes, the NUL included. Null data with a size other
//   than 0, or a null text, returns false and changes nothing.
//   Errors: get_last_error is the outcome of the calling thread's last call
//   on that transport (SHMEM_NO_ERROR after a success); a thread that made
//   none sees the transport's last outcome on any thread.
//     MSG_TOO_LARGE    64 + the padded body exceeds the queue's capacity.
//     RETRY            a try_ form would wait (for a message, room or the
//                      lock); a waiting call's peer process has ended; a
//                      signal came while a call waited.
//     TIMEOUT          a timed form ran out of time (waiting for a message,
//                      room or the lock).
//     LOCK_ERROR       the queue's lock cannot be taken: it was left
//                      unrecoverable. A lock whose holder died (a process
//                      or a thread) is taken over and the call goes on: the
//                      queue's positions change in single stores, so the
//                      holder left them consistent.
//     INVALID_SEGMENT  the segment was removed (remove, reset, a new server
//                      reclaiming the name: every sleeper of both ends wakes
//                      with it, at once, or within 50 ms one waiting for a
//                      lock), its header no longer reads as one of this
//                      layout, its positions or message headers are
//                      inconsistent, or its object was truncated under this
//                      process (ipc/truncation.h: a touch of a lost page gets
//                      zero pages instead of SIGBUS; waits and
//                      is_segment_valid look at the object's size). The mapping stays until the transport
//                      is freed, so a removed segment never faults.
//   remove(): marks the segment removed, wakes every sleeper and unlinks the
//   name; true when it did; false (INVALID_SEGMENT) when the segment was
//   removed already or its name leads elsewhere. is_segment_valid(): the
//   header reads as a segment of this layout with the capacities this end
//   mapped, not removed.
//   get_server_pid(): the serving process as the segment records it (also
//   after the server freed its end). client_pid_exists(): a client is
//   attached and its process exists (kill(pid, 0) succeeds or fails with
//   EPERM). print_stats() writes to standard output the name, this end, the
//   process ids and, per direction: capacity, bytes in use, messages and
//   body bytes written and read, calls that had to sleep (writing, reading),
//   failed calls (writing, reading; RETRY and TIMEOUT included) and locks
//   taken over from dead holders.
//   free_tarsel_ipc_shmemtransport: releases what the end read, detaches a
//   client end, unmaps and frees; the segment stays until remove or reset.
//   Null does nothing; a pointer that is not a live transport gives an
//   Err_Error message and nothing else. Nothing else here sends messages.
//   reset(name, flag): flag false unlinks the segment only when it is stale
//   (of this layout, its server process dead); true unlinks whatever the
//   name holds, a segment of this layout being marked removed first (its
//   attached ends see INVALID_SEGMENT). reset_all(flag): the same for every
//   /dev/shm/tarsel-ipc.* object of the effective user.
//   shmem_error_to_string: a text per code, engine-owned; null for others.
//   Threads: a transport may be used from several threads at once (calls on
//   one queue take turns at its lock; a thread asleep holds no lock). The
//   reservation belongs to the transport, so threads reserving on one
//   transport take turns from reserve to commit. A transport is freed only
//   when no thread uses it.
//   Segment layout: a 4096-byte header (the magic number "TRSLIPC\x01" in
//   its first 8 bytes, layout version 1, sizes and ring offsets, server and
//   client process ids, the removed flag, and per queue a robust
//   process-shared mutex, futex words, positions and statistics), then the
//   server-to-client ring, then the client-to-server ring.
