// Pre-rendered stamps: small square coverage images of lens-flare and glow
// elements, made once and shared by every render that draws the element.
// The cache is process-wide and thread-safe; a stamp stays valid for whoever
// holds it even after the cache lets go of it.
#pragma once

#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace tarsel_ref {

struct Stamp {
  int size = 0;                 // width and height in pixels
  std::vector<float> coverage;  // size * size values from 0 to 1, rows top to bottom
};

// The stamp cached under `key`, made with `make` when there is none.
std::shared_ptr<const Stamp> get_or_make_stamp(const std::string &key, const std::function<Stamp()> &make);

// The stamp of one flare element kind (flare.h) at `size` pixels, cached
// under "element:<kind>:<size>".
std::shared_ptr<const Stamp> element_stamp(const std::string &kind, int size);

// Stamp size the engine prepares elements at.
constexpr int kElementStampSize = 64;

void clear_stamps();
int stamp_count();

}  // namespace tarsel_ref
