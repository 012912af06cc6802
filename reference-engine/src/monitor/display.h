// The library's display: its own virtual devices (device.h), reached through
// the contract's virtual operations. Every operation goes to the probe's call log.
#pragma once

#include <memory>
#include <mutex>
#include <vector>

#include "monitor/device.h"
#include "qrv/external_monitor.h"

namespace qrv_ref {

class PreviewDevice;

class ReferenceDisplay final : public EM_Display {
public:
  ReferenceDisplay();
  ~ReferenceDisplay() override;

  EM_SInt32 devices(const char ***names) override;
  EM_SInt32 device_modes(const char *device, const char ***names) override;
  EM_SInt32 connect(const char *device, const char *mode) override;
  EM_SInt32 display_frame(const char *device, const EM_XIImage *image) override;
  EM_SInt32 set_output_option(const char *device, const char *option, const char *value) override;
  EM_SInt32 get_status(const char *device) override;
  EM_SInt32 flush_output(const char *device) override;
  EM_SInt32 get_width(const char *device) override;
  EM_SInt32 get_height(const char *device) override;
  EM_SInt32 get_refresh_rate(const char *device) override;
  EM_XIImage *EM_XIImageWrapper(void *pixels, EM_SInt32 width, EM_SInt32 height, EM_SInt32 row_bytes, char *name,
                                bool flip_y, EM_ImageFormat format, double pixel_aspect, double gamma,
                                bool premultiplied, bool full_range) override;

  // For the probe: runs `read` on the preview device under the display's lock.
  template <class Read>
  void read_preview(Read read) {
    std::lock_guard<std::mutex> hold(mutex_);
    read(*preview_);
  }

private:
  Device *find(const char *device) const;

  std::mutex mutex_;  // hosts may call from several threads
  std::vector<std::unique_ptr<Device>> devices_;
  std::vector<const char *> device_names_;
  PreviewDevice *preview_;
};

}  // namespace qrv_ref
