// The monitor library's live displays and images, numbered from 1 in order
// of making, and what it tells an observer (the test probe installs one)
// about the calls made on them; also the fault switches the probe sets.
#pragma once

#include <string>

class EM_Display;
class EM_XIImage;

namespace qrv_ref {

class ReferenceDisplay;
class WrappedImage;

// Tells the observer "<object><N>.<text>" (display3.connect(...)), in the
// order the objects are numbered in.
void log_call(const void *object, const std::string &text);

// Installs `observer` (null: none) for every call from now on.
void set_call_observer(void (*observer)(const std::string &entry));

// Live objects. Registering gives the number.
int register_display(ReferenceDisplay *display);
void unregister_display(ReferenceDisplay *display);
int register_image(WrappedImage *image);
void unregister_image(WrappedImage *image);
// The number of a live display or image, -1 for anything else.
int object_number(const void *object);
int live_display_count();
int live_image_count();
// The live display at this address, or null.
ReferenceDisplay *live_display(const void *display);
// The reference count of the live image at this address, -1 for anything else.
int live_image_refs(const void *image);

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

// Fault switches: making a display fails; a display has no devices.
bool init_fails();
bool no_devices();
void set_init_fails(bool on);
void set_no_devices(bool on);

// Text of a possibly null argument for the log.
inline std::string text_arg(const char *text) { return text ? text : "null"; }

}  // namespace qrv_ref
