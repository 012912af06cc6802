// The working image every kernel reads and writes: four floats per pixel,
// premultiplied R G B A in the render's working colour space, lines top to
// bottom. A constant image (an unconnected input's fallback) keeps one line
// and hands it out for every line.
#pragma once

#include <cstddef>
#include <memory>

#include "rendering/buffers.h"

namespace tarsel_ref {

class WorkImage {
public:
  // Pixels are left unset: whoever makes the image fills every line.
  WorkImage(int width, int height) : width_(width), height_(height), pixels_(acquire_floats(count(width, height))) {}

  static std::shared_ptr<WorkImage> constant(int width, int height, const float rgba[4]) {
    std::shared_ptr<WorkImage> image(new WorkImage(width, height, true));
    const std::size_t n = static_cast<std::size_t>(width) * 4;
    for (std::size_t i = 0; i < n; ++i) image->pixels_[i] = rgba[i % 4];
    return image;
  }

  int width() const { return width_; }
  int height() const { return height_; }
  bool is_constant() const { return constant_; }

  float *row(int y) { return pixels_.get() + offset(y); }
  const float *row(int y) const { return pixels_.get() + offset(y); }

  WorkImage(const WorkImage &) = delete;
  WorkImage &operator=(const WorkImage &) = delete;

private:
  WorkImage(int width, int height, bool constant)
      : width_(width), height_(height), constant_(constant),
        pixels_(acquire_floats(count(width, constant ? 1 : height))) {}

  static std::size_t count(int width, int height) {
    return static_cast<std::size_t>(width) * static_cast<std::size_t>(height) * 4 + 4;
  }
  std::size_t offset(int y) const {
    return constant_ ? 0 : static_cast<std::size_t>(y) * static_cast<std::size_t>(width_) * 4;
  }

  int width_;
  int height_;
  bool constant_ = false;
  FloatBuffer pixels_;
};

}  // namespace tarsel_ref
