// Files the engine ships beside its library, in the folder "tarsel-data"
// next to the library file (found at run time from the library's own path),
// and the popup entries read from them.
#pragma once

#include <string>
#include <vector>

namespace tarsel_ref {

// The folder of the engine's data files, without a trailing "/".
std::string data_directory();

// Lists that from-file popups read (ParamStore::list_id).
enum FromFileListId : unsigned char {
  kNoList = 0,
  kFlarePresets = 1,  // flare_presets.txt
};

// Entries of a list file: one per line, "<name> | <value>" or "<name>"
// alone; blank lines and lines starting with '#' are skipped.
struct FromFileList {
  std::vector<std::string> names;
  std::vector<std::string> values;    // the text after " | ", "" when none
  std::vector<char *> name_pointers;  // names as the engine hands them out
};

// The list, read on first use and kept for the life of the engine. A list
// whose file cannot be read holds the single entry "Default" (and the engine
// sends a warning saying so).
const FromFileList &from_file_list(FromFileListId id);

}  // namespace tarsel_ref
