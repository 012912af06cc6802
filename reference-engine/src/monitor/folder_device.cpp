#include "monitor/folder_device.h"

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <string>

#include <sys/stat.h>

namespace qrv_ref {
namespace {

// The library's setting (reference_monitor.h), read at each connect.
std::string configured_folder() {
  if (const char *folder = std::getenv("QRV_MONITOR_FOLDER"); folder && *folder) return folder;
  const char *tmp = std::getenv("TMPDIR");
  return std::string(tmp && *tmp ? tmp : "/tmp") + "/qrv-monitor";
}

// mkdir -p: true when the folder exists afterwards.
bool make_folders(const std::string &path) {
  for (size_t at = 1; at <= path.size(); ++at) {
    if (at != path.size() && path[at] != '/') continue;
    std::string part = path.substr(0, at);
    if (mkdir(part.c_str(), 0777) != 0 && errno != EEXIST) return false;
  }
  struct stat info;
  return stat(path.c_str(), &info) == 0 && S_ISDIR(info.st_mode);
}

}  // namespace

EM_SInt32 FolderDevice::set_option(const char *option, const char *value) {
  if (!option || !value || std::string(option) != "folder") return EM_errorParam;
  chosen_folder_ = value;
  return EM_errorNone;
}

EM_SInt32 FolderDevice::open(const Mode &) {
  folder_ = chosen_folder_.empty() ? configured_folder() : chosen_folder_;
  return make_folders(folder_) ? EM_errorNone : EM_errorDevice;
}

EM_SInt32 FolderDevice::deliver(const std::vector<uint8_t> &bgra, const ImageValues &image) {
  rgba_.resize(bgra.size());
  for (size_t i = 0; i < bgra.size(); i += 4) {
    rgba_[i] = bgra[i + 2];
    rgba_[i + 1] = bgra[i + 1];
    rgba_[i + 2] = bgra[i];
    rgba_[i + 3] = bgra[i + 3];
  }
  char file[32];
  std::snprintf(file, sizeof file, "/frame-%06lld.png", frames_since_connect());
  bool written = write_png_file(folder_ + file, mode()->width, mode()->height, rgba_, image);
  return written ? EM_errorNone : EM_errorDevice;
}

}  // namespace qrv_ref
