// The monitor library's test probe (qrv_probe.h): its call log, fed by the
// observer it installs as the library loads, and what it reads and switches
// in the library. Nothing in the library includes it.
#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

#include "monitor/display.h"
#include "monitor/live_objects.h"
#include "monitor/preview_device.h"
#include "probe/call_log.h"
#include "qrv_probe.h"

namespace qrv_ref {
namespace {

tarsel_ref::CallLog &calls() {
  static tarsel_ref::CallLog *log = new tarsel_ref::CallLog(QRV_PROBE_LOG_CAPACITY);  // never destroyed, as above
  return *log;
}

void called(const std::string &entry) { calls().append(entry); }

const bool observing = (set_call_observer(called), true);

}  // namespace
}  // namespace qrv_ref

using namespace qrv_ref;

extern "C" {

int qrv_probe_call_count(void) { return calls().count(); }

const char *qrv_probe_call(int index) { return calls().at(index); }

void qrv_probe_clear_calls(void) { calls().clear(); }

int qrv_probe_live_displays(void) { return live_display_count(); }

int qrv_probe_live_images(void) { return live_image_count(); }

int qrv_probe_image_refs(const void *image) { return live_image_refs(image); }

int qrv_probe_object_number(const void *object) { return object_number(object); }

int qrv_probe_preview_frame(const void *display, void *bgra, int capacity, int *width, int *height, long long *frames,
                            char *name, int name_capacity) {
  // A display is deleted only by its host; a probe call racing that is a test fault.
  ReferenceDisplay *live = live_display(display);
  if (!live) return -1;
  int bytes = 0;
  live->read_preview([&](const PreviewDevice &preview) {
    const std::vector<uint8_t> &frame = preview.last_frame();
    bytes = int(frame.size());
    if (bgra && bytes > 0 && capacity >= bytes) std::memcpy(bgra, frame.data(), frame.size());
    const Mode *mode = preview.mode();
    if (width) *width = mode ? mode->width : 0;
    if (height) *height = mode ? mode->height : 0;
    if (frames) *frames = preview.frames_shown();
    if (name && name_capacity > 0) std::snprintf(name, size_t(name_capacity), "%s", preview.last_name().c_str());
  });
  return bytes;
}

void qrv_probe_set_init_fails(int on) { set_init_fails(on != 0); }
void qrv_probe_set_no_devices(int on) { set_no_devices(on != 0); }

}  // extern "C"
