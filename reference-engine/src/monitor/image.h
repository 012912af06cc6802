// The library's image: caller pixels by address, with the eleven values they
// were described by, reference counted.
#pragma once

#include <atomic>
#include <string>

#include "qrv/external_monitor.h"

namespace qrv_ref {

struct ImageValues {
  void *pixels;
  EM_SInt32 width, height, row_bytes;
  std::string name;
  bool flip_y;
  EM_ImageFormat format;
  double pixel_aspect, gamma;
  bool premultiplied, full_range;
};

class WrappedImage final : public EM_XIImage {
public:
  // A new image holding one reference, or null when the values describe no
  // image this library can read.
  static WrappedImage *make(const ImageValues &values);

  EM_SInt32 addRef() override;
  EM_SInt32 removeRef() override;
  void *getPixels() const override;
  EM_ImageFormat getFormat() const override;
  EM_SInt32 getWidth() const override;
  EM_SInt32 getHeight() const override;
  EM_SInt32 getRowBytes() const override;

  const ImageValues &values() const { return values_; }
  int refs() const { return refs_.load(); }
  // Reference changes that do not go to the call log (the library's own use).
  // Takes a reference unless the image is already on its way out.
  bool try_hold();
  void drop();

private:
  explicit WrappedImage(const ImageValues &values) : values_(values) {}
  ~WrappedImage() override;

  ImageValues values_;
  std::atomic<int> refs_{1};
};

}  // namespace qrv_ref
