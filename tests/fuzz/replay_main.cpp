// A main for the C++ fuzz targets when libFuzzer is not at hand (the short
// run of the test suite builds them with g++): runs every file named on the
// command line (or found in a named folder), then --inputs N inputs drawn
// from a generator seeded by --seed S: random bytes, and the files changed a
// little. Prints "replayed C corpus inputs and G generated inputs" at the end.
#include <dirent.h>
#include <sys/stat.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <iterator>
#include <random>
#include <string>
#include <vector>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, std::size_t size);

namespace {

void collect(const std::string &path, std::vector<std::string> *files) {
  struct stat info;
  if (stat(path.c_str(), &info) != 0) {
    std::fprintf(stderr, "replay: no such file or folder: %s\n", path.c_str());
    std::exit(2);
  }
  if (!S_ISDIR(info.st_mode)) {
    files->push_back(path);
    return;
  }
  DIR *dir = opendir(path.c_str());
  std::vector<std::string> names;
  while (dirent *entry = readdir(dir))
    if (entry->d_name[0] != '.') names.push_back(entry->d_name);
  closedir(dir);
  std::sort(names.begin(), names.end());
  for (const std::string &name : names) collect(path + "/" + name, files);
}

}  // namespace

int main(int argc, char **argv) {
  std::size_t inputs = 2000, max_len = 4200;
  unsigned seed = 0;
  std::vector<std::string> files;
  for (int i = 1; i < argc; ++i) {
    const std::string arg = argv[i];
    if (arg == "--inputs" && i + 1 < argc) inputs = std::strtoul(argv[++i], nullptr, 10);
    else if (arg == "--seed" && i + 1 < argc) seed = static_cast<unsigned>(std::strtoul(argv[++i], nullptr, 10));
    else if (arg == "--max-len" && i + 1 < argc) max_len = std::strtoul(argv[++i], nullptr, 10);
    else collect(arg, &files);
  }
  std::vector<std::vector<uint8_t>> corpus;
  for (const std::string &file : files) {
    std::ifstream in(file, std::ios::binary);
    corpus.emplace_back(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    LLVMFuzzerTestOneInput(corpus.back().data(), corpus.back().size());
  }
  std::mt19937 rng(seed);
  auto below = [&rng](std::size_t n) { return n ? static_cast<std::size_t>(rng() % n) : 0; };
  for (std::size_t n = 0; n < inputs; ++n) {
    std::vector<uint8_t> data;
    if (!corpus.empty() && below(10) < 6) {
      data = corpus[below(corpus.size())];
      for (std::size_t edits = 1 + below(8); edits > 0; --edits) {
        const std::size_t what = below(4);
        if (what == 0 && !data.empty()) data[below(data.size())] = static_cast<uint8_t>(rng());
        else if (what == 1) data.insert(data.begin() + below(data.size() + 1), static_cast<uint8_t>(rng()));
        else if (what == 2 && !data.empty()) data.erase(data.begin() + below(data.size()));
        else if (!data.empty()) {  // flip one bit of a word: sizes and counts
          data[below(data.size())] ^= static_cast<uint8_t>(1u << below(8));
        }
      }
      if (data.size() > max_len) data.resize(max_len);
    } else {
      data.resize(below(max_len + 1));
      for (uint8_t &byte : data) byte = static_cast<uint8_t>(rng());
    }
    LLVMFuzzerTestOneInput(data.data(), data.size());
  }
  std::printf("replayed %zu corpus inputs and %zu generated inputs\n", corpus.size(), inputs);
  return 0;
}
