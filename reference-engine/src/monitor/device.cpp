#include "monitor/device.h"

#include <cstring>

#include "monitor/folder_device.h"
#include "monitor/frame_pixels.h"
#include "monitor/preview_device.h"

namespace qrv_ref {
namespace {

std::vector<Mode> modes_named(std::initializer_list<const char *> names) {
  std::vector<Mode> modes;
  for (const char *name : names) {
    Mode mode{name, 0, 0, 0};
    std::sscanf(name, "%dx%dp%d", &mode.width, &mode.height, &mode.rate);
    modes.push_back(mode);
  }
  return modes;
}

}  // namespace

Device::Device(std::string name, std::vector<Mode> modes) : name_(std::move(name)), modes_(std::move(modes)) {
  for (const Mode &mode : modes_) mode_names_.push_back(mode.name.c_str());
}

EM_SInt32 Device::connect(const char *mode_name) {
  for (const Mode &mode : modes_) {
    if (mode.name != mode_name) continue;
    disconnect();
    EM_SInt32 status = open(mode);
    if (status == EM_errorNone) {
      connected_ = &mode;
      frames_ = 0;
    }
    return status;
  }
  return EM_errorNotFound;
}

void Device::disconnect() {
  if (connected_) close();
  connected_ = nullptr;
  frames_ = 0;
}

EM_SInt32 Device::show(const WrappedImage &image) {
  if (!connected_) return EM_errorDevice;
  const ImageValues &values = image.values();
  if (values.width != connected_->width || values.height != connected_->height) return EM_errorParam;
  frame_from_image(values, scratch_);
  EM_SInt32 status = deliver(scratch_, values);
  if (status == EM_errorNone) ++frames_;
  return status;
}

EM_SInt32 Device::set_option(const char *, const char *) { return EM_errorParam; }

std::vector<std::unique_ptr<Device>> make_devices() {
  std::vector<std::unique_ptr<Device>> devices;
  devices.push_back(std::make_unique<PreviewDevice>(
      modes_named({"1920x1080p25", "1920x1080p50", "1280x720p50", "1280x720p25", "640x360p25"})));
  devices.push_back(
      std::make_unique<FolderDevice>(modes_named({"1920x1080p25", "1280x720p25", "640x360p25", "320x180p25"})));
  return devices;
}

}  // namespace qrv_ref
