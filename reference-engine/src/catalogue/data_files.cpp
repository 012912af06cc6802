#include "catalogue/data_files.h"

#include <dlfcn.h>

#include <fstream>
#include <mutex>

#include "catalogue/number_text.h"
#include "core/messages.h"
#include "tarsel/errors.h"

namespace tarsel_ref {
namespace {

const char *list_file(FromFileListId id) {
  switch (id) {
    case kFlarePresets: return "flare_presets.txt";
    default: return nullptr;
  }
}

FromFileList read_list(FromFileListId id) {
  FromFileList list;
  const char *file_name = list_file(id);
  if (!file_name) return list;
  const std::string path = data_directory() + "/" + file_name;
  std::ifstream file(path);
  std::string line;
  while (file && std::getline(file, line)) {
    const std::string_view text = trim(line);
    if (text.empty() || text.front() == '#') continue;
    const std::size_t bar = text.find('|');
    const std::string_view name = trim(text.substr(0, bar));
    if (name.empty()) continue;
    list.names.emplace_back(name);
    list.values.emplace_back(bar == std::string_view::npos ? std::string_view() : trim(text.substr(bar + 1)));
  }
  if (list.names.empty()) {
    const std::string warning = "cannot read the popup entries of \"" + path + "\"; offering \"Default\" alone";
    emit_message(Err_Warning, warning.c_str());
    list.names.emplace_back("Default");
    list.values.emplace_back();
  }
  for (std::string &name : list.names) list.name_pointers.push_back(name.data());
  return list;
}

}  // namespace

std::string data_directory() {
  Dl_info info{};
  if (dladdr(reinterpret_cast<void *>(&data_directory), &info) && info.dli_fname) {
    std::string library = info.dli_fname;
    const std::size_t slash = library.rfind('/');
    const std::string folder = slash == std::string::npos ? "." : library.substr(0, slash);
    return folder + "/tarsel-data";
  }
  return "tarsel-data";
}

const FromFileList &from_file_list(FromFileListId id) {
  static std::once_flag once;
  static FromFileList presets;
  static const FromFileList none;
  if (id != kFlarePresets) return none;
  std::call_once(once, [] { presets = read_list(kFlarePresets); });
  return presets;
}

}  // namespace tarsel_ref
