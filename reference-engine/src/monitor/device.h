// A virtual monitor device: a name, its modes, the mode it is connected in,
// and what it does with a frame.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "monitor/image.h"

namespace qrv_ref {

struct Mode {
  std::string name;  // "<width>x<height>p<rate>"
  int width, height, rate;
};

class Device {
public:
  Device(std::string name, std::vector<Mode> modes);
  virtual ~Device() = default;

  const std::string &name() const { return name_; }
  // The mode names, as the library-owned array the contract hands out.
  const char **mode_names() { return mode_names_.data(); }
  int mode_count() const { return int(modes_.size()); }

  // EM_error statuses, as reference_monitor.h lists them.
  EM_SInt32 connect(const char *mode);
  void disconnect();
  EM_SInt32 show(const WrappedImage &image);
  virtual EM_SInt32 set_option(const char *option, const char *value);

  const Mode *mode() const { return connected_; }

protected:
  // Prepares output in `mode`; an EM_error status.
  virtual EM_SInt32 open(const Mode &mode) = 0;
  // Takes one converted frame (B, G, R, A, top row first); an EM_error status.
  virtual EM_SInt32 deliver(const std::vector<uint8_t> &bgra, const ImageValues &image) = 0;
  virtual void close() {}
  long long frames_since_connect() const { return frames_; }

private:
  std::string name_;
  std::vector<Mode> modes_;
  std::vector<const char *> mode_names_;
  const Mode *connected_ = nullptr;
  long long frames_ = 0;
  std::vector<uint8_t> scratch_;  // kept between frames: no allocation per frame
};

// The devices of a new display (reference_monitor.h).
std::vector<std::unique_ptr<Device>> make_devices();

}  // namespace qrv_ref
