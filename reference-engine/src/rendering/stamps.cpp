#include "rendering/stamps.h"

#include <algorithm>
#include <cmath>
#include <map>
#include <mutex>

namespace tarsel_ref {
namespace {

struct StampCache {
  std::mutex mutex;
  std::map<std::string, std::shared_ptr<const Stamp>> stamps;
};

StampCache &cache() {
  static StampCache *instance = new StampCache;  // kept to process exit: renders may still ask for stamps
  return *instance;
}

float smoothstep(float edge0, float edge1, float x) {
  const float t = std::clamp((x - edge0) / (edge1 - edge0), 0.0f, 1.0f);
  return t * t * (3.0f - 2.0f * t);
}

// Coverage of a thin line through the centre at `angle`, fading to the tips.
float ray(float u, float v, float angle, float width) {
  const float distance = std::fabs(-std::sin(angle) * u + std::cos(angle) * v);
  const float r = std::sqrt(u * u + v * v);
  return std::exp(-(distance * distance) / (width * width)) * std::max(0.0f, 1.0f - r);
}

// u, v from -1 to 1 across the stamp; r the distance from its centre.
float element_coverage(const std::string &kind, float u, float v) {
  const float r = std::sqrt(u * u + v * v);
  const float pi = 3.14159265f;
  if (kind == "glow") return std::exp(-4.0f * r * r) * (1.0f - smoothstep(0.8f, 1.0f, r));
  if (kind == "ring") {
    const float d = (r - 0.8f) / 0.08f;
    return std::exp(-d * d);
  }
  if (kind == "disc") return 1.0f - smoothstep(0.85f, 1.0f, r);
  if (kind == "streak") return ray(u, v, 0.0f, 0.04f);
  if (kind == "star") {
    float c = 0.0f;
    for (int i = 0; i < 4; ++i) c = std::max(c, ray(u, v, static_cast<float>(i) * pi / 4.0f, 0.03f));
    return c;
  }
  if (kind == "iris") {
    float edge = 0.0f;  // distance to the hexagon's farthest side
    for (int i = 0; i < 6; ++i) {
      const float a = static_cast<float>(i) * pi / 3.0f;
      edge = std::max(edge, u * std::cos(a) + v * std::sin(a));
    }
    return 1.0f - smoothstep(0.8f, 0.9f, edge);
  }
  return 0.0f;
}

}  // namespace

std::shared_ptr<const Stamp> get_or_make_stamp(const std::string &key, const std::function<Stamp()> &make) {
  StampCache &c = cache();
  {
    std::lock_guard<std::mutex> lock(c.mutex);
    auto found = c.stamps.find(key);
    if (found != c.stamps.end()) return found->second;
  }
  // Made outside the lock so that one slow stamp does not hold up the others;
  // when two threads race, the first one stored wins.
  auto made = std::make_shared<const Stamp>(make());
  std::lock_guard<std::mutex> lock(c.mutex);
  return c.stamps.emplace(key, std::move(made)).first->second;
}

std::shared_ptr<const Stamp> element_stamp(const std::string &kind, int size) {
  size = std::clamp(size, 1, 1024);
  return get_or_make_stamp("element:" + kind + ":" + std::to_string(size), [&] {
    Stamp stamp;
    stamp.size = size;
    stamp.coverage.resize(static_cast<std::size_t>(size) * static_cast<std::size_t>(size));
    for (int y = 0; y < size; ++y)
      for (int x = 0; x < size; ++x) {
        const float u = (static_cast<float>(x) + 0.5f) / static_cast<float>(size) * 2.0f - 1.0f;
        const float v = (static_cast<float>(y) + 0.5f) / static_cast<float>(size) * 2.0f - 1.0f;
        stamp.coverage[static_cast<std::size_t>(y) * static_cast<std::size_t>(size) + static_cast<std::size_t>(x)] =
            std::clamp(element_coverage(kind, u, v), 0.0f, 1.0f);
      }
    return stamp;
  });
}

void clear_stamps() {
  std::map<std::string, std::shared_ptr<const Stamp>> released;
  {
    std::lock_guard<std::mutex> lock(cache().mutex);
    released.swap(cache().stamps);
  }
}

int stamp_count() {
  std::lock_guard<std::mutex> lock(cache().mutex);
  return static_cast<int>(cache().stamps.size());
}

}  // namespace tarsel_ref
