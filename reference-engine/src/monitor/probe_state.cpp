// The monitor library's probe (qrv_probe.h) and the state behind it.
#include "monitor/probe_state.h"

#include <atomic>
#include <cstring>
#include <map>
#include <mutex>

#include "probe/call_log.h"
#include "monitor/display.h"
#include "monitor/image.h"
#include "monitor/preview_device.h"
#include "qrv_probe.h"

namespace qrv_ref {
namespace {

struct ProbeState {
  std::mutex mutex;
  tarsel_ref::CallLog calls{QRV_PROBE_LOG_CAPACITY};
  int made = 0;  // objects numbered so far
  std::map<const void *, int> displays, images;  // live objects and their numbers
};

ProbeState &state() {
  static ProbeState *probe = new ProbeState;  // never destroyed: objects may outlive static destruction
  return *probe;
}

std::atomic<bool> init_fails_switch{false}, no_devices_switch{false};

}  // namespace

void log_call(const void *object, const std::string &text) {
  ProbeState &probe = state();
  std::lock_guard<std::mutex> hold(probe.mutex);  // numbers and log in one order
  std::string entry = "object?";
  if (auto display = probe.displays.find(object); display != probe.displays.end())
    entry = "display" + std::to_string(display->second);
  else if (auto image = probe.images.find(object); image != probe.images.end())
    entry = "image" + std::to_string(image->second);
  probe.calls.append(entry + "." + text);
}

int register_display(ReferenceDisplay *display) {
  ProbeState &probe = state();
  std::lock_guard<std::mutex> hold(probe.mutex);
  return probe.displays[display] = ++probe.made;
}

void unregister_display(ReferenceDisplay *display) {
  ProbeState &probe = state();
  std::lock_guard<std::mutex> hold(probe.mutex);
  probe.displays.erase(display);
}

int register_image(WrappedImage *image) {
  ProbeState &probe = state();
  std::lock_guard<std::mutex> hold(probe.mutex);
  return probe.images[image] = ++probe.made;
}

void unregister_image(WrappedImage *image) {
  ProbeState &probe = state();
  std::lock_guard<std::mutex> hold(probe.mutex);
  probe.images.erase(image);
}

int object_number(const void *object) {
  ProbeState &probe = state();
  std::lock_guard<std::mutex> hold(probe.mutex);
  if (auto found = probe.displays.find(object); found != probe.displays.end())
    return found->second;
  if (auto found = probe.images.find(object); found != probe.images.end())
    return found->second;
  return -1;
}

ImageUse::ImageUse(const EM_XIImage *image) : image_(nullptr) {
  ProbeState &probe = state();
  std::lock_guard<std::mutex> hold(probe.mutex);
  if (probe.images.count(image)) {
    auto *live = static_cast<WrappedImage *>(const_cast<EM_XIImage *>(image));
    if (live->try_hold())
      image_ = live;
  }
}

ImageUse::~ImageUse() {
  if (image_)
    image_->drop();
}

bool init_fails() { return init_fails_switch.load(); }
bool no_devices() { return no_devices_switch.load(); }

}  // namespace qrv_ref

using namespace qrv_ref;

extern "C" {

int qrv_probe_call_count(void) { return state().calls.count(); }

const char *qrv_probe_call(int index) { return state().calls.at(index); }

void qrv_probe_clear_calls(void) { state().calls.clear(); }

int qrv_probe_live_displays(void) {
  std::lock_guard<std::mutex> hold(state().mutex);
  return int(state().displays.size());
}

int qrv_probe_live_images(void) {
  std::lock_guard<std::mutex> hold(state().mutex);
  return int(state().images.size());
}

int qrv_probe_image_refs(const void *image) {
  ProbeState &probe = state();
  std::lock_guard<std::mutex> hold(probe.mutex);
  if (!probe.images.count(image))
    return -1;
  return static_cast<const WrappedImage *>(static_cast<const EM_XIImage *>(image))->refs();
}

int qrv_probe_object_number(const void *object) { return object_number(object); }

int qrv_probe_preview_frame(const void *display, void *bgra, int capacity, int *width, int *height,
                            long long *frames, char *name, int name_capacity) {
  {
    std::lock_guard<std::mutex> hold(state().mutex);
    if (!state().displays.count(display))
      return -1;
  }
  // A display is deleted only by its host; a probe call racing that is a test fault.
  auto *live = static_cast<ReferenceDisplay *>(static_cast<EM_Display *>(const_cast<void *>(display)));
  int bytes = 0;
  live->read_preview([&](const PreviewDevice &preview) {
    const std::vector<uint8_t> &frame = preview.last_frame();
    bytes = int(frame.size());
    if (bgra && bytes > 0 && capacity >= bytes)
      std::memcpy(bgra, frame.data(), frame.size());
    const Mode *mode = preview.mode();
    if (width)
      *width = mode ? mode->width : 0;
    if (height)
      *height = mode ? mode->height : 0;
    if (frames)
      *frames = preview.frames_shown();
    if (name && name_capacity > 0)
      std::snprintf(name, size_t(name_capacity), "%s", preview.last_name().c_str());
  });
  return bytes;
}

void qrv_probe_set_init_fails(int on) { init_fails_switch = on != 0; }
void qrv_probe_set_no_devices(int on) { no_devices_switch = on != 0; }

}  // extern "C"
