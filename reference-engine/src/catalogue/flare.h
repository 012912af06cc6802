// Lens-flare descriptions: the elements a flare or glare parameter holds.
//
// Text form: the elements separated by "; ", each written as
//   <kind> <size> <brightness> <position> <red> <green> <blue>
// kind: glow, ring, disc, streak, star or iris, or texture:<index> (the flare
// texture of that index, scaled to the element and tinted by its colour,
// see tarsel_load_flare_texture); size: radius as a fraction of
// the image diagonal; brightness: multiplier (1 = as drawn); position: place
// on the axis from the flare's source (0) through the image centre (1) and on
// (negative values lie behind the source); red, green, blue: the element's
// colour. An empty text is a flare without elements.
#pragma once

#include <string>
#include <vector>

struct cJSON;

namespace tarsel_ref {

struct FlareElement {
  std::string kind;
  float size = 0.1f;
  float brightness = 1.0f;
  float position = 0.0f;
  float color[3] = {1.0f, 1.0f, 1.0f};
};

// Most elements one flare can hold.
constexpr int kMaxFlareElements = 32;

// The drawn kinds an element can be, in the engine's order (textures aside).
const std::vector<std::string> &flare_kinds();

// Whether `kind` is "texture:<index>", and the index when it is.
bool texture_kind(const std::string &kind, int *index = nullptr);

std::string format_flare(const std::vector<FlareElement> &elements);

// Parses a flare's text form; false (and `elements` unchanged) when malformed.
bool parse_flare(const std::string &text, std::vector<FlareElement> *elements);

// JSON form: an array of {"kind", "size", "brightness", "position", "color": [r, g, b]}.
cJSON *flare_to_json(const std::vector<FlareElement> &elements);
bool flare_from_json(const cJSON *json, std::vector<FlareElement> *elements);

}  // namespace tarsel_ref
