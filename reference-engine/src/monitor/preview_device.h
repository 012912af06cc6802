// The "preview" device: keeps the last frame it was shown in memory.
#pragma once

#include "monitor/device.h"

namespace qrv_ref {

class PreviewDevice final : public Device {
public:
  explicit PreviewDevice(std::vector<Mode> modes) : Device("preview", std::move(modes)) {}

  // The last frame since connect (empty when none), its name and the count.
  const std::vector<uint8_t> &last_frame() const { return last_; }
  const std::string &last_name() const { return last_name_; }
  long long frames_shown() const { return frames_since_connect(); }

protected:
  EM_SInt32 open(const Mode &) override;
  EM_SInt32 deliver(const std::vector<uint8_t> &bgra, const ImageValues &image) override;
  void close() override;

private:
  std::vector<uint8_t> last_;
  std::string last_name_;
};

}  // namespace qrv_ref
