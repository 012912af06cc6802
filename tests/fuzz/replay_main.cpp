// The main of a C++ fuzz target in the short run of the test suite, built
// with g++ (libFuzzer's own drives the long runs): runs the inputs on
// standard input, each a 4-byte little-endian length and that many bytes, and
// prints "replayed N inputs".
#include <cstdint>
#include <cstdio>
#include <vector>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, std::size_t size);

int main() {
  std::size_t count = 0;
  for (uint32_t size; std::fread(&size, sizeof size, 1, stdin) == 1; ++count) {
    std::vector<uint8_t> data(size);  // exactly the input's bytes
    if (std::fread(data.data(), 1, size, stdin) != size) return 2;
    LLVMFuzzerTestOneInput(data.data(), size);
  }
  std::printf("replayed %zu inputs\n", count);
  return 0;
}
