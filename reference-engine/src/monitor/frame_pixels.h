// Frames as devices receive them: B, G, R, A bytes, top row first, straight
// colour, full range.
#pragma once

#include <cstdint>
#include <vector>

#include "monitor/image.h"

namespace qrv_ref {

// Converts an image's pixels into `bgra` (resized to width * height * 4).
void frame_from_image(const ImageValues &image, std::vector<uint8_t> &bgra);

}  // namespace qrv_ref
