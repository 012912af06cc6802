// The colour look-up tables set with set_tarsel_luts, for the image
// conversions: an input table applied to incoming values and a display table
// applied to outgoing ones, with the exposure factor between them.
//
// A table file is text with one number per line (blank lines and lines
// starting with '#' are skipped), at least 2 and at most 65536 entries, all
// finite. Entry i is the output for the input i / (entries - 1); inputs in
// between are interpolated linearly, inputs outside 0..1 take the end entries.
#pragma once

#include <memory>
#include <string>
#include <vector>

namespace tarsel_ref {

struct LutSet {
  std::vector<float> input;    // empty: values pass unchanged
  std::vector<float> display;  // empty: values pass unchanged
  float exposure = 1.0f;       // linear values are multiplied by it before the display table
};

// The tables in force; a snapshot that later changes do not touch.
std::shared_ptr<const LutSet> current_luts();

void install_luts(LutSet luts);

// Back to no tables and an exposure of 1.
void clear_luts();

// Reads a table file; false with `error` set when it cannot be used.
bool load_lut_file(const std::string &path, std::vector<float> *table, std::string *error);

// `value` looked up in `table` (unchanged when the table is empty).
float apply_lut(const std::vector<float> &table, float value);

}  // namespace tarsel_ref
