// The flare-texture store: images that flare elements of kind
// "texture:<index>" draw with, loaded from PNG files or copied from a host's
// pixels. Process-wide and thread-safe; a render holds the textures it draws
// with, so emptying the store during a render is safe.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "tarsel/raster_info.h"

namespace tarsel_ref {

struct Texture {
  int xsize = 0, ysize = 0;
  int n_channels = 0;                // 1 grey, 2 grey and alpha, 3 RGB, 4 RGBA
  int bytes_per_channel = 0;         // 1, 2 (native byte order) or 4 (float)
  std::vector<unsigned char> bytes;  // lines top to bottom, no padding
  std::vector<float> light;          // per pixel R G B times alpha: what a flare adds
};

// The texture of that index; null when there is none.
std::shared_ptr<const Texture> find_texture(int index);

// Reads a PNG file into `texture` (bytes only); false with `error` set when
// it cannot.
bool read_png_file(const char *path, Texture *texture, std::string *error);

// The store's operations. The calls that add or describe a texture record on
// the calling thread whether they failed and why (texture_error); those that
// fail return -1.
int load_texture(const char *path);
const char *texture_error();
int register_texture(int xsize, int ysize, int n_channels, int bytes_per_channel, RawImage pixels);
int texture_info(int index, int *xsize, int *ysize, int *n_channels, int *bytes_per_channel, size_t *n_bytes);
int texture_pixels(int index, void *dest, size_t dest_size);
void free_textures();

}  // namespace tarsel_ref
