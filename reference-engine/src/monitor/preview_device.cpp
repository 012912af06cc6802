#include "monitor/preview_device.h"

namespace qrv_ref {

EM_SInt32 PreviewDevice::open(const Mode &) {
  last_.clear();
  last_name_.clear();
  return EM_errorNone;
}

EM_SInt32 PreviewDevice::deliver(const std::vector<uint8_t> &bgra, const ImageValues &image) {
  last_.assign(bgra.begin(), bgra.end());
  last_name_ = image.name;
  return EM_errorNone;
}

void PreviewDevice::close() {
  last_.clear();
  last_name_.clear();
}

}  // namespace qrv_ref
