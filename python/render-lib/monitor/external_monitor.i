// Output of frames to an external monitor device through the
// QRVExternalMonitor library: its status codes and image formats, the image
// and display interfaces, and the factory. Nothing here releases the
// interpreter lock; frames go out with it held.

%{
#include "qrv/external_monitor.h"
%}

enum EM_error {
  EM_errorNone = 0,
  EM_errorParam = 1,
  EM_errorNotFound = 2,
  EM_errorAllocate = 3,
  EM_errorLast = 4,
  EM_errorDevice = 2000
};

// 32-bit integer pixels with byte orders B, G, R, A and A, R, G, B.
enum EM_ImageFormat {
  EM_ImageFormat_32BitIntBGRA = 0,
  EM_ImageFormat_32BitIntARGB = 1
};

typedef int EM_SInt32;

%apply EM_Display *LiveDisplay { EM_Display *self, EM_Display *display };
%apply EM_XIImage *LiveImage { EM_XIImage *self, EM_XIImage const *self };
%apply EM_XIImage *LiveImageOrNone { EM_XIImage const *image };
%apply const char ***NameList { const char ***names };

// A reference-counted image over caller pixels. Its proxy owns the one
// reference EM_XIImageWrapper gives; addRef and removeRef pass straight
// through and leave that ownership alone.
%{
// removeRef through the proxy or its deletion: an image with no reference
// left has freed itself.
static EM_SInt32 remove_image_reference(EM_XIImage *image)
{
  EM_SInt32 left = image->removeRef();
  if (left <= 0)
    monitor_objects().images.erase(image);
  return left;
}
%}

%nodefaultctor EM_XIImage;
class EM_XIImage {
public:
  EM_SInt32 addRef();
  %extend {
    EM_SInt32 removeRef() { return remove_image_reference($self); }
  }
  EM_SInt32 getWidth() const;
  EM_SInt32 getHeight() const;
  EM_SInt32 getRowBytes() const;
  %extend {
    // Deleting the proxy gives its reference back.
    ~EM_XIImage() { remove_image_reference($self); }
  }
};

// A display of the library: made only by EM_DisplayInit, destroyed only by
// release_external_monitor, never by its proxy.
%nodefaultctor EM_Display;
%nodefaultdtor EM_Display;
%newobject EM_Display::EM_XIImageWrapper;

class EM_Display {
public:
  EM_SInt32 connect(const char *device, const char *mode);
  %extend {
    // The library has no disconnect: connect with a null mode closes the device.
    EM_SInt32 disconnect(const char *device) { return $self->connect(device, NULL); }
  }
  EM_SInt32 display_frame(const char *device, EM_XIImage const *image);
  EM_SInt32 get_width(const char *device);
  EM_SInt32 get_height(const char *device);
  EM_SInt32 devices(const char ***names);
  EM_SInt32 device_modes(const char *device, const char ***names);
  // The pixels go by address (never copied); the caller keeps them alive and
  // unchanged while the library may read them.
  EM_XIImage *EM_XIImageWrapper(RawImage pixels, EM_SInt32 width, EM_SInt32 height, EM_SInt32 row_bytes,
                                char *name, bool bottom_up, EM_ImageFormat format, double pixel_aspect,
                                double gamma, bool premultiplied, bool full_range);
};

EM_Display *EM_DisplayInit();

%{
static void release_external_monitor(EM_Display *display)
{
  monitor_objects().displays.erase(display);
  delete display;
}
%}
void release_external_monitor(EM_Display *display);
