// Numbers as the engine writes and reads them in text: enough digits to give
// back the same float, and independent of the process's locale.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace tarsel_ref {

// Shortest "%.9g"-style text of a float.
std::string format_number(float value);

// A whole number written without a fraction.
std::string format_whole(float value);

// Parses all of `text` as one float.
bool parse_number(std::string_view text, float *value);

// The blank-separated words of `text`.
std::vector<std::string_view> split_words(std::string_view text);

// `text` without leading and trailing white space.
std::string_view trim(std::string_view text);

}  // namespace tarsel_ref
