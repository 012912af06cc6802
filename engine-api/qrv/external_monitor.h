// Output of frames to an external monitor device: the display and image
// interfaces of the QRVExternalMonitor library.
#pragma once

#include <cstdint>

#include "tarsel/export.h"

// The library's 32-bit signed integer.
typedef int32_t EM_SInt32;

// Status codes of the display operations. Both enumerations are 32-bit with
// a fixed underlying type, so any 32-bit value a caller passes is a valid
// value to compare (a library must not assume only the named ones arrive).
enum EM_error : int32_t {
  EM_errorNone = 0,      // success
  EM_errorParam = 1,     // an argument is not valid
  EM_errorNotFound = 2,  // no such device or mode
  EM_errorAllocate = 3,  // out of memory
  EM_errorLast = 4,      // end of the general codes
  EM_errorDevice = 2000  // the device reported a failure
};

// Pixel layout of an image handed to a display.
enum EM_ImageFormat : int32_t {
  EM_ImageFormat_32BitIntBGRA = 0,  // 32-bit pixels, bytes B, G, R, A
  EM_ImageFormat_32BitIntARGB = 1   // 32-bit pixels, bytes A, R, G, B
};

// Reference-counted image over caller pixels, made by EM_Display::EM_XIImageWrapper.
class EM_XIImage {
protected:
  // Destroys the image; images free themselves when their last reference goes.
  virtual ~EM_XIImage() {}

public:
  // Takes one more reference; returns the new count.
  virtual EM_SInt32 addRef() = 0;

  // Drops one reference, freeing the image with the last; returns the new count.
  virtual EM_SInt32 removeRef() = 0;

  // Address of the first pixel (not called by the Python binding).
  virtual void *getPixels() const = 0;

  // Pixel layout (not called by the Python binding).
  virtual EM_ImageFormat getFormat() const = 0;

  // Width in pixels.
  virtual EM_SInt32 getWidth() const = 0;

  // Height in pixels.
  virtual EM_SInt32 getHeight() const = 0;

  // Length of one row in bytes.
  virtual EM_SInt32 getRowBytes() const = 0;
};

// An external display: lists devices and modes, connects a device in a mode
// and shows frames on it.
class EM_Display {
public:
  // Destroys the display; `delete` on a display releases it.
  virtual ~EM_Display() {}

  // Sets *names to the library-owned array of device names; returns their count.
  virtual EM_SInt32 devices(const char ***names) = 0;

  // Sets *names to the library-owned array of a device's mode names; returns their count.
  virtual EM_SInt32 device_modes(const char *device, const char ***names) = 0;

  // Opens `device` in `mode`; a null mode disconnects it. Returns an EM_error status.
  virtual EM_SInt32 connect(const char *device, const char *mode) = 0;

  // Shows one frame on a connected device; returns an EM_error status.
  virtual EM_SInt32 display_frame(const char *device, const EM_XIImage *image) = 0;

  // Sets a named device option (not called by the Python binding).
  virtual EM_SInt32 set_output_option(const char *device, const char *option, const char *value) = 0;

  // Status of a device (not called by the Python binding).
  virtual EM_SInt32 get_status(const char *device) = 0;

  // Pushes pending output of a device out (not called by the Python binding).
  virtual EM_SInt32 flush_output(const char *device) = 0;

  // Frame width of the connected device.
  virtual EM_SInt32 get_width(const char *device) = 0;

  // Frame height of the connected device.
  virtual EM_SInt32 get_height(const char *device) = 0;

  // Refresh rate of the connected device (not called by the Python binding).
  virtual EM_SInt32 get_refresh_rate(const char *device) = 0;

  // Makes an image over caller pixels without copying them; the caller holds
  // one reference. The exact meaning of each argument is documented with the
  // library's display implementation.
  virtual EM_XIImage *EM_XIImageWrapper(void *pixels,           // first pixel
                                        EM_SInt32 width,        // width in pixels
                                        EM_SInt32 height,       // height in pixels
                                        EM_SInt32 row_bytes,    // length of one row in bytes
                                        char *name,             // image name
                                        bool flip_y,            // rows stored bottom-up
                                        EM_ImageFormat format,  // pixel layout
                                        double pixel_aspect,    // pixel aspect ratio
                                        double gamma,           // gamma of the pixel values
                                        bool premultiplied,     // colour premultiplied by alpha
                                        bool full_range) = 0;   // full-range (not video-range) values
};

// Makes a display object; null when none can be made. Release it with delete.
QRV_API EM_Display *EM_DisplayInit();

static_assert(sizeof(EM_SInt32) == 4, "EM_SInt32 is 32-bit");
static_assert(sizeof(EM_ImageFormat) == 4 && sizeof(EM_error) == 4, "EM enumerations are 32-bit");
