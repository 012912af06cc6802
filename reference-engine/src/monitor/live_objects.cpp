#include "monitor/live_objects.h"

#include <atomic>
#include <map>
#include <mutex>

#include "monitor/display.h"
#include "monitor/image.h"

namespace qrv_ref {
namespace {

struct LiveObjects {
  std::mutex mutex;
  int made = 0;                                  // objects numbered so far
  std::map<const void *, int> displays, images;  // live objects and their numbers
  void (*observer)(const std::string &entry) = nullptr;
};

LiveObjects &live() {
  static LiveObjects *objects = new LiveObjects;  // never destroyed: objects may outlive static destruction
  return *objects;
}

std::atomic<bool> init_fails_switch{false}, no_devices_switch{false};

}  // namespace

void set_call_observer(void (*observer)(const std::string &entry)) {
  std::lock_guard<std::mutex> hold(live().mutex);
  live().observer = observer;
}

void log_call(const void *object, const std::string &text) {
  LiveObjects &objects = live();
  std::lock_guard<std::mutex> hold(objects.mutex);  // numbers and log in one order
  if (!objects.observer) return;
  std::string entry = "object?";
  if (auto display = objects.displays.find(object); display != objects.displays.end())
    entry = "display" + std::to_string(display->second);
  else if (auto image = objects.images.find(object); image != objects.images.end())
    entry = "image" + std::to_string(image->second);
  objects.observer(entry + "." + text);
}

namespace {

using Kind = std::map<const void *, int> LiveObjects::*;  // displays or images

int number(Kind kind, const void *object) {
  std::lock_guard<std::mutex> hold(live().mutex);
  return (live().*kind)[object] = ++live().made;
}

void forget(Kind kind, const void *object) {
  std::lock_guard<std::mutex> hold(live().mutex);
  (live().*kind).erase(object);
}

}  // namespace

int register_display(ReferenceDisplay *display) { return number(&LiveObjects::displays, display); }
void unregister_display(ReferenceDisplay *display) { forget(&LiveObjects::displays, display); }
int register_image(WrappedImage *image) { return number(&LiveObjects::images, image); }
void unregister_image(WrappedImage *image) { forget(&LiveObjects::images, image); }

int object_number(const void *object) {
  LiveObjects &objects = live();
  std::lock_guard<std::mutex> hold(objects.mutex);
  if (auto found = objects.displays.find(object); found != objects.displays.end()) return found->second;
  if (auto found = objects.images.find(object); found != objects.images.end()) return found->second;
  return -1;
}

int live_display_count() {
  std::lock_guard<std::mutex> hold(live().mutex);
  return int(live().displays.size());
}

int live_image_count() {
  std::lock_guard<std::mutex> hold(live().mutex);
  return int(live().images.size());
}

ReferenceDisplay *live_display(const void *display) {
  std::lock_guard<std::mutex> hold(live().mutex);
  if (!live().displays.count(display)) return nullptr;
  return static_cast<ReferenceDisplay *>(static_cast<EM_Display *>(const_cast<void *>(display)));
}

int live_image_refs(const void *image) {
  std::lock_guard<std::mutex> hold(live().mutex);
  if (!live().images.count(image)) return -1;
  return static_cast<const WrappedImage *>(static_cast<const EM_XIImage *>(image))->refs();
}

ImageUse::ImageUse(const EM_XIImage *image) : image_(nullptr) {
  LiveObjects &objects = live();
  std::lock_guard<std::mutex> hold(objects.mutex);
  if (objects.images.count(image)) {
    auto *image_here = static_cast<WrappedImage *>(const_cast<EM_XIImage *>(image));
    if (image_here->try_hold()) image_ = image_here;
  }
}

ImageUse::~ImageUse() {
  if (image_) image_->drop();
}

bool init_fails() { return init_fails_switch.load(); }
bool no_devices() { return no_devices_switch.load(); }
void set_init_fails(bool on) { init_fails_switch.store(on); }
void set_no_devices(bool on) { no_devices_switch.store(on); }

}  // namespace qrv_ref
