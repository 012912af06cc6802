#include "monitor/image.h"

#include <cmath>
#include <new>

#include "monitor/live_objects.h"

namespace qrv_ref {

WrappedImage *WrappedImage::make(const ImageValues &v) {
  bool valid = v.pixels && v.width >= 1 && v.height >= 1 && v.width <= (1 << 28) / 4 && v.row_bytes >= v.width * 4 &&
               (v.format == EM_ImageFormat_32BitIntBGRA || v.format == EM_ImageFormat_32BitIntARGB) &&
               std::isfinite(v.pixel_aspect) && v.pixel_aspect > 0 && std::isfinite(v.gamma) && v.gamma >= 0;
  if (!valid) return nullptr;
  auto *image = new WrappedImage(v);
  register_image(image);
  return image;
}

WrappedImage::~WrappedImage() { unregister_image(this); }

EM_SInt32 WrappedImage::addRef() {
  int count = refs_.fetch_add(1) + 1;
  log_call(this, "addRef() -> " + std::to_string(count));
  return count;
}

EM_SInt32 WrappedImage::removeRef() {
  int count = refs_.fetch_sub(1) - 1;
  log_call(this, "removeRef() -> " + std::to_string(count));
  if (count == 0) delete this;
  return count;
}

bool WrappedImage::try_hold() {
  int count = refs_.load();
  while (count > 0)
    if (refs_.compare_exchange_weak(count, count + 1)) return true;
  return false;
}

void WrappedImage::drop() {
  if (refs_.fetch_sub(1) == 1) delete this;
}

void *WrappedImage::getPixels() const {
  log_call(this, "getPixels()");
  return values_.pixels;
}

EM_ImageFormat WrappedImage::getFormat() const {
  log_call(this, "getFormat() -> " + std::to_string(values_.format));
  return values_.format;
}

EM_SInt32 WrappedImage::getWidth() const {
  log_call(this, "getWidth() -> " + std::to_string(values_.width));
  return values_.width;
}

EM_SInt32 WrappedImage::getHeight() const {
  log_call(this, "getHeight() -> " + std::to_string(values_.height));
  return values_.height;
}

EM_SInt32 WrappedImage::getRowBytes() const {
  log_call(this, "getRowBytes() -> " + std::to_string(values_.row_bytes));
  return values_.row_bytes;
}

}  // namespace qrv_ref
