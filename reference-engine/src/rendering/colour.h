// Colour spaces the engine renders in and converts between: linear light and
// the sRGB encoding. Conversions act on straight (not premultiplied) colour.
#pragma once

#include <string>

namespace tarsel_ref {

enum class ColourSpace { linear, srgb };

// Reads a colour-space name: null or "" is linear; "linear" and "srgb" in any
// letter case. False for anything else.
bool parse_colour_space(const char *name, ColourSpace *space);

float srgb_to_linear(float v);
float linear_to_srgb(float v);

// Converts the colour of `count` RGBA pixels from one space to the other.
// `premultiplied`: the pixels carry premultiplied colour, which is divided by
// alpha around the conversion.
void convert_colour(float *rgba, int count, ColourSpace from, ColourSpace to, bool premultiplied);

// Multiplies colour by alpha, or divides it (pixels without alpha become black).
void premultiply(float *rgba, int count);
void unpremultiply(float *rgba, int count);

}  // namespace tarsel_ref
