#include "monitor/display.h"

#include <cinttypes>
#include <cstdio>
#include <string>

#include "monitor/preview_device.h"
#include "monitor/live_objects.h"

namespace qrv_ref {
namespace {

std::string status_text(EM_SInt32 status) { return " -> " + std::to_string(status); }

}  // namespace

ReferenceDisplay::ReferenceDisplay() : devices_(make_devices()) {
  preview_ = static_cast<PreviewDevice *>(devices_.front().get());
  if (!no_devices())
    for (const auto &device : devices_) device_names_.push_back(device->name().c_str());
  register_display(this);
}

ReferenceDisplay::~ReferenceDisplay() {
  log_call(this, "~EM_Display()");
  for (const auto &device : devices_) device->disconnect();
  unregister_display(this);
}

Device *ReferenceDisplay::find(const char *device) const {
  if (!device) return nullptr;
  for (size_t i = 0; i < device_names_.size(); ++i)
    if (devices_[i]->name() == device) return devices_[i].get();
  return nullptr;
}

EM_SInt32 ReferenceDisplay::devices(const char ***names) {
  std::lock_guard<std::mutex> hold(mutex_);
  if (names) *names = device_names_.data();
  EM_SInt32 count = EM_SInt32(device_names_.size());
  log_call(this, "devices()" + status_text(count));
  return count;
}

EM_SInt32 ReferenceDisplay::device_modes(const char *device, const char ***names) {
  std::lock_guard<std::mutex> hold(mutex_);
  Device *found = find(device);
  if (names) *names = found ? found->mode_names() : nullptr;
  EM_SInt32 count = found ? found->mode_count() : 0;
  log_call(this, "device_modes(" + text_arg(device) + ")" + status_text(count));
  return count;
}

EM_SInt32 ReferenceDisplay::connect(const char *device, const char *mode) {
  std::lock_guard<std::mutex> hold(mutex_);
  Device *found = find(device);
  EM_SInt32 status = EM_errorNone;
  if (!device)
    status = EM_errorParam;
  else if (!found)
    status = EM_errorNotFound;
  else if (!mode)
    found->disconnect();
  else
    status = found->connect(mode);
  log_call(this, "connect(" + text_arg(device) + ", " + text_arg(mode) + ")" + status_text(status));
  return status;
}

EM_SInt32 ReferenceDisplay::display_frame(const char *device, const EM_XIImage *image) {
  std::lock_guard<std::mutex> hold(mutex_);
  Device *found = find(device);
  ImageUse use(image);
  EM_SInt32 status;
  if (!device || !image || !use.get())
    status = EM_errorParam;
  else if (!found)
    status = EM_errorNotFound;
  else
    status = found->show(*use.get());
  char address[32];
  std::snprintf(address, sizeof address, "%p", static_cast<const void *>(image));
  log_call(this, "display_frame(" + text_arg(device) + ", " + (image ? address : "null") + ")" + status_text(status));
  return status;
}

EM_SInt32 ReferenceDisplay::set_output_option(const char *device, const char *option, const char *value) {
  std::lock_guard<std::mutex> hold(mutex_);
  Device *found = find(device);
  EM_SInt32 status = found ? found->set_option(option, value) : EM_errorNotFound;
  log_call(this, "set_output_option(" + text_arg(device) + ", " + text_arg(option) + ", " + text_arg(value) + ")" +
                     status_text(status));
  return status;
}

EM_SInt32 ReferenceDisplay::get_status(const char *device) {
  std::lock_guard<std::mutex> hold(mutex_);
  Device *found = find(device);
  EM_SInt32 status = !found ? EM_errorNotFound : found->mode() ? EM_errorNone : EM_errorDevice;
  log_call(this, "get_status(" + text_arg(device) + ")" + status_text(status));
  return status;
}

EM_SInt32 ReferenceDisplay::flush_output(const char *device) {
  std::lock_guard<std::mutex> hold(mutex_);
  EM_SInt32 status = find(device) ? EM_errorNone : EM_errorNotFound;
  log_call(this, "flush_output(" + text_arg(device) + ")" + status_text(status));
  return status;
}

EM_SInt32 ReferenceDisplay::get_width(const char *device) {
  std::lock_guard<std::mutex> hold(mutex_);
  Device *found = find(device);
  EM_SInt32 width = found && found->mode() ? found->mode()->width : 0;
  log_call(this, "get_width(" + text_arg(device) + ")" + status_text(width));
  return width;
}

EM_SInt32 ReferenceDisplay::get_height(const char *device) {
  std::lock_guard<std::mutex> hold(mutex_);
  Device *found = find(device);
  EM_SInt32 height = found && found->mode() ? found->mode()->height : 0;
  log_call(this, "get_height(" + text_arg(device) + ")" + status_text(height));
  return height;
}

EM_SInt32 ReferenceDisplay::get_refresh_rate(const char *device) {
  std::lock_guard<std::mutex> hold(mutex_);
  Device *found = find(device);
  EM_SInt32 rate = found && found->mode() ? found->mode()->rate : 0;
  log_call(this, "get_refresh_rate(" + text_arg(device) + ")" + status_text(rate));
  return rate;
}

EM_XIImage *ReferenceDisplay::EM_XIImageWrapper(void *pixels, EM_SInt32 width, EM_SInt32 height, EM_SInt32 row_bytes,
                                                char *name, bool flip_y, EM_ImageFormat format, double pixel_aspect,
                                                double gamma, bool premultiplied, bool full_range) {
  WrappedImage *image = nullptr;
  try {
    image = WrappedImage::make({pixels, width, height, row_bytes, name ? name : "", flip_y, format, pixel_aspect, gamma,
                                premultiplied, full_range});
  } catch (const std::bad_alloc &) {
    // no image: the contract's null
  }
  char text[512];
  std::snprintf(text, sizeof text, "EM_XIImageWrapper(%p, %d, %d, %d, %s, %d, %d, %g, %g, %d, %d) -> ", pixels,
                int(width), int(height), int(row_bytes), text_arg(name).c_str(), int(flip_y), int(format), pixel_aspect,
                gamma, int(premultiplied), int(full_range));
  std::string result = image ? "image" + std::to_string(object_number(image)) : "null";
  log_call(this, text + result);
  return image;
}

}  // namespace qrv_ref
