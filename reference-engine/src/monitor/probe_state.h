// What the monitor library records for its probe: the call log, the live
// displays and images with their numbers, and the fault switches.
#pragma once

#include <string>

class EM_Display;
class EM_XIImage;

namespace qrv_ref {

class ReferenceDisplay;
class WrappedImage;

// Appends "<object><N>.<text>" to the call log.
void log_call(const void *object, const std::string &text);

// Live objects, numbered from 1 in order of making. Registering gives the number.
int register_display(ReferenceDisplay *display);
void unregister_display(ReferenceDisplay *display);
int register_image(WrappedImage *image);
void unregister_image(WrappedImage *image);
// The number of a live display or image, -1 for anything else.
int object_number(const void *object);

// The live image at this address, or null: images handed in by a caller are
// checked here before use, so a stale pointer is refused, not followed.
// The image is given an extra reference held by `ImageUse`.
class ImageUse {
public:
  explicit ImageUse(const EM_XIImage *image);
  ~ImageUse();
  ImageUse(const ImageUse &) = delete;
  ImageUse &operator=(const ImageUse &) = delete;
  WrappedImage *get() const { return image_; }
private:
  WrappedImage *image_;
};

bool init_fails();
bool no_devices();

// Text of a possibly null argument for the log.
inline std::string text_arg(const char *text) { return text ? text : "null"; }

}  // namespace qrv_ref
