// The "folder" device: writes each frame it is shown as a PNG file.
#pragma once

#include "monitor/device.h"

namespace qrv_ref {

class FolderDevice final : public Device {
public:
  explicit FolderDevice(std::vector<Mode> modes) : Device("folder", std::move(modes)) {}

  // "folder": the folder to write into from the next connect on.
  EM_SInt32 set_option(const char *option, const char *value) override;

protected:
  EM_SInt32 open(const Mode &mode) override;
  EM_SInt32 deliver(const std::vector<uint8_t> &bgra, const ImageValues &image) override;

private:
  std::string chosen_folder_;  // set by set_option; empty: the library's setting
  std::string folder_;         // where the current connection writes
  std::vector<uint8_t> rgba_;
};

// Writes 8-bit RGBA pixels as a PNG file with the image's name, aspect and
// gamma; false when the file cannot be written.
bool write_png_file(const std::string &path, int width, int height, const std::vector<uint8_t> &rgba,
                    const ImageValues &image);

}  // namespace qrv_ref
