#include "rendering/buffers.h"

#include <mutex>
#include <vector>

namespace tarsel_ref {
namespace {

// Smaller buffers come cheaply from the allocator's own free lists.
constexpr std::size_t kSmallest = (std::size_t{1} << 20) / sizeof(float);
// Enough for the working images of a few renders of a 4K float frame.
constexpr std::size_t kBudget = (std::size_t{768} << 20) / sizeof(float);

struct Kept {
  float *buffer;
  std::size_t capacity;
};

struct Cache {
  std::mutex mutex;
  std::vector<Kept> kept;  // oldest first
  std::size_t total = 0;   // floats kept
};

Cache &cache() {
  static Cache *instance = new Cache;  // kept to process exit: buffers may come back late
  return *instance;
}

}  // namespace

void BufferReturn::operator()(float *buffer) const {
  if (!buffer) return;
  if (capacity >= kSmallest) {
    Cache &c = cache();
    std::lock_guard<std::mutex> lock(c.mutex);
    if (c.total + capacity <= kBudget) {
      c.kept.push_back({buffer, capacity});
      c.total += capacity;
      return;
    }
  }
  delete[] buffer;
}

FloatBuffer acquire_floats(std::size_t count) {
  if (count >= kSmallest) {
    Cache &c = cache();
    std::lock_guard<std::mutex> lock(c.mutex);
    // The smallest kept buffer that fits, if it is not wastefully large.
    std::size_t best = c.kept.size();
    for (std::size_t i = 0; i < c.kept.size(); ++i)
      if (c.kept[i].capacity >= count && c.kept[i].capacity <= count * 2 &&
          (best == c.kept.size() || c.kept[i].capacity < c.kept[best].capacity))
        best = i;
    if (best != c.kept.size()) {
      const Kept found = c.kept[best];
      c.kept.erase(c.kept.begin() + static_cast<std::ptrdiff_t>(best));
      c.total -= found.capacity;
      return FloatBuffer(found.buffer, BufferReturn{found.capacity});
    }
  }
  return FloatBuffer(new float[count], BufferReturn{count});
}

void release_buffer_cache() {
  std::vector<Kept> released;
  {
    Cache &c = cache();
    std::lock_guard<std::mutex> lock(c.mutex);
    released.swap(c.kept);
    c.total = 0;
  }
  for (const Kept &k : released) delete[] k.buffer;
}

std::size_t cached_buffer_bytes() {
  Cache &c = cache();
  std::lock_guard<std::mutex> lock(c.mutex);
  return c.total * sizeof(float);
}

}  // namespace tarsel_ref
