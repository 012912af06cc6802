#include "rendering/luts.h"

#include <cmath>
#include <fstream>
#include <mutex>

#include "catalogue/number_text.h"

namespace tarsel_ref {
namespace {

constexpr std::size_t kMaxLutEntries = 65536;

std::mutex lut_mutex;
std::shared_ptr<const LutSet> installed;

}  // namespace

std::shared_ptr<const LutSet> current_luts() {
  std::lock_guard<std::mutex> lock(lut_mutex);
  if (!installed) installed = std::make_shared<const LutSet>();
  return installed;
}

void install_luts(LutSet luts) {
  auto replacement = std::make_shared<const LutSet>(std::move(luts));
  std::lock_guard<std::mutex> lock(lut_mutex);
  installed = std::move(replacement);
}

void clear_luts() {
  std::lock_guard<std::mutex> lock(lut_mutex);
  installed.reset();
}

bool load_lut_file(const std::string &path, std::vector<float> *table, std::string *error) {
  std::ifstream file(path);
  if (!file) {
    *error = "cannot open the look-up table \"" + path + "\"";
    return false;
  }
  std::vector<float> entries;
  std::string line;
  int line_number = 0;
  while (std::getline(file, line)) {
    ++line_number;
    const std::string_view text = trim(line);
    if (text.empty() || text.front() == '#') continue;
    float value;
    if (!parse_number(text, &value) || !std::isfinite(value)) {
      *error = "look-up table \"" + path + "\", line " + std::to_string(line_number) + ": not a finite number";
      return false;
    }
    if (entries.size() == kMaxLutEntries) {
      *error = "look-up table \"" + path + "\" has more than " + std::to_string(kMaxLutEntries) + " entries";
      return false;
    }
    entries.push_back(value);
  }
  if (entries.size() < 2) {
    *error = "look-up table \"" + path + "\" needs at least 2 entries";
    return false;
  }
  *table = std::move(entries);
  return true;
}

float apply_lut(const std::vector<float> &table, float value) {
  if (table.empty() || std::isnan(value)) return value;
  if (value <= 0.0f) return table.front();
  if (value >= 1.0f) return table.back();
  const float position = value * static_cast<float>(table.size() - 1);
  const std::size_t below = static_cast<std::size_t>(position);
  const float t = position - static_cast<float>(below);
  return table[below] + (table[below + 1] - table[below]) * t;
}

}  // namespace tarsel_ref
