// The flare-texture store.
#include "rendering/textures.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <limits>
#include <mutex>
#include <new>

namespace tarsel_ref {
namespace {

struct Store {
  std::mutex mutex;
  std::vector<std::shared_ptr<const Texture>> textures;
};

Store &store() {
  static Store *instance = new Store;  // kept to process exit: renders may still hold textures
  return *instance;
}

// Per thread, so that a host's threads each read the fate of their own call.
struct LastError {
  bool failed = false;
  std::string text;
};

LastError &last_error() {
  thread_local LastError error;
  return error;
}

void succeeded() { last_error().failed = false; }

int failed(const std::string &why) {
  last_error().failed = true;
  last_error().text = why;
  return -1;
}

float channel_value(const Texture &t, std::size_t i) {
  const unsigned char *p = t.bytes.data() + i * static_cast<std::size_t>(t.bytes_per_channel);
  switch (t.bytes_per_channel) {
    case 1: return static_cast<float>(*p) / 255.0f;
    case 2: {
      std::uint16_t v;
      std::memcpy(&v, p, sizeof v);
      return static_cast<float>(v) / 65535.0f;
    }
    default: {
      float v;
      std::memcpy(&v, p, sizeof v);
      return std::isfinite(v) ? std::max(v, 0.0f) : 0.0f;
    }
  }
}

// What the texture adds as light: its colour (grey for one or two channels)
// times its alpha.
void make_light(Texture &t) {
  const std::size_t n = static_cast<std::size_t>(t.xsize) * static_cast<std::size_t>(t.ysize);
  const std::size_t ch = static_cast<std::size_t>(t.n_channels);
  t.light.resize(n * 3);
  for (std::size_t i = 0; i < n; ++i) {
    float rgb[3];
    float alpha = 1.0f;
    if (ch <= 2) {
      rgb[0] = rgb[1] = rgb[2] = channel_value(t, i * ch);
      if (ch == 2) alpha = channel_value(t, i * ch + 1);
    } else {
      for (std::size_t c = 0; c < 3; ++c) rgb[c] = channel_value(t, i * ch + c);
      if (ch == 4) alpha = channel_value(t, i * ch + 3);
    }
    for (std::size_t c = 0; c < 3; ++c) t.light[i * 3 + c] = rgb[c] * alpha;
  }
}

int add(Texture texture) {
  make_light(texture);
  auto shared = std::make_shared<const Texture>(std::move(texture));
  std::lock_guard<std::mutex> lock(store().mutex);
  store().textures.push_back(std::move(shared));
  succeeded();
  return static_cast<int>(store().textures.size() - 1);
}

}  // namespace

std::shared_ptr<const Texture> find_texture(int index) {
  std::lock_guard<std::mutex> lock(store().mutex);
  if (index < 0 || static_cast<std::size_t>(index) >= store().textures.size()) return nullptr;
  return store().textures[static_cast<std::size_t>(index)];
}

int load_texture(const char *path) {
  try {
    tarsel_ref::Texture texture;
    std::string error;
    if (!tarsel_ref::read_png_file(path, &texture, &error)) return failed(error);
    return tarsel_ref::add(std::move(texture));
  } catch (const std::bad_alloc &) {
    return failed("not enough memory for the texture");
  }
}

const char *texture_error() {
  const tarsel_ref::LastError &error = tarsel_ref::last_error();
  return error.failed ? error.text.c_str() : nullptr;
}

int register_texture(int xsize, int ysize, int n_channels, int bytes_per_channel, RawImage pixels) {
  if (xsize <= 0 || ysize <= 0 || xsize > 16384 || ysize > 16384)
    return failed("a texture of " + std::to_string(xsize) + " x " + std::to_string(ysize) + " pixels is not possible");
  if (n_channels < 1 || n_channels > 4)
    return failed("a texture has 1 to 4 channels, not " + std::to_string(n_channels));
  if (bytes_per_channel != 1 && bytes_per_channel != 2 && bytes_per_channel != 4)
    return failed("a texture channel has 1, 2 or 4 bytes, not " + std::to_string(bytes_per_channel));
  if (!pixels) return failed("no pixels");
  try {
    tarsel_ref::Texture texture;
    texture.xsize = xsize;
    texture.ysize = ysize;
    texture.n_channels = n_channels;
    texture.bytes_per_channel = bytes_per_channel;
    const std::size_t n = static_cast<std::size_t>(xsize) * static_cast<std::size_t>(ysize) *
                          static_cast<std::size_t>(n_channels * bytes_per_channel);
    const auto *bytes = static_cast<const unsigned char *>(pixels);
    texture.bytes.assign(bytes, bytes + n);
    return tarsel_ref::add(std::move(texture));
  } catch (const std::bad_alloc &) {
    return failed("not enough memory for the texture");
  }
}

int texture_info(int index, int *xsize, int *ysize, int *n_channels, int *bytes_per_channel, size_t *n_bytes) {
  const auto texture = tarsel_ref::find_texture(index);
  if (!texture) return failed("no texture " + std::to_string(index));
  if (xsize) *xsize = texture->xsize;
  if (ysize) *ysize = texture->ysize;
  if (n_channels) *n_channels = texture->n_channels;
  if (bytes_per_channel) *bytes_per_channel = texture->bytes_per_channel;
  if (n_bytes) *n_bytes = texture->bytes.size();
  tarsel_ref::succeeded();
  return 0;
}

int texture_pixels(int index, void *dest, size_t dest_size) {
  const auto texture = tarsel_ref::find_texture(index);
  if (!texture) return failed("no texture " + std::to_string(index));
  const std::size_t n = std::min(
      {dest ? dest_size : 0, texture->bytes.size(), static_cast<std::size_t>(std::numeric_limits<int>::max())});
  if (n) std::memcpy(dest, texture->bytes.data(), n);
  tarsel_ref::succeeded();
  return static_cast<int>(n);
}

void free_textures() {
  std::vector<std::shared_ptr<const tarsel_ref::Texture>> released;
  {
    std::lock_guard<std::mutex> lock(tarsel_ref::store().mutex);
    released.swap(tarsel_ref::store().textures);
  }
  tarsel_ref::succeeded();
}

}  // namespace tarsel_ref
