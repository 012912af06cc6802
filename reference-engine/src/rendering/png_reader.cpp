// PNG files as flare textures: 8 or 16 bits a channel, kept at their depth;
// palettes and transparency chunks become RGB(A), low-depth grey becomes 8 bits.
#include <png.h>

#include <cerrno>
#include <csetjmp>
#include <cstdio>
#include <cstring>
#include <memory>
#include <new>

#include "rendering/textures.h"

namespace tarsel_ref {
namespace {

struct ReadState {
  char message[256] = "";
};

void on_error(png_structp png, png_const_charp text) {
  auto *state = static_cast<ReadState *>(png_get_error_ptr(png));
  std::snprintf(state->message, sizeof state->message, "%s", text ? text : "unknown error");
  png_longjmp(png, 1);
}

void on_warning(png_structp, png_const_charp) {}  // a usable image with a flaw is still usable

struct FileCloser {
  void operator()(std::FILE *f) const { std::fclose(f); }
};

// Everything libpng may jump out of lives here, with no objects that need
// destroying between the jump and its landing.
bool decode(std::FILE *file, png_structp png, png_infop info, ReadState &state, Texture *texture,
            std::vector<png_bytep> &rows) {
  if (setjmp(png_jmpbuf(png))) return false;
  png_init_io(png, file);
  png_read_info(png, info);
  const int colour = png_get_color_type(png, info);
  const int depth = png_get_bit_depth(png, info);
  if (colour == PNG_COLOR_TYPE_PALETTE) png_set_palette_to_rgb(png);
  if (colour == PNG_COLOR_TYPE_GRAY && depth < 8) png_set_expand_gray_1_2_4_to_8(png);
  if (png_get_valid(png, info, PNG_INFO_tRNS)) png_set_tRNS_to_alpha(png);
  if (depth == 16) png_set_swap(png);  // files are big-endian, textures native
  png_set_interlace_handling(png);
  png_read_update_info(png, info);
  const png_uint_32 width = png_get_image_width(png, info), height = png_get_image_height(png, info);
  const int channels = png_get_channels(png, info);
  const int bytes = png_get_bit_depth(png, info) == 16 ? 2 : 1;
  if (width == 0 || height == 0 || width > 16384 || height > 16384 || channels < 1 || channels > 4) {
    std::snprintf(state.message, sizeof state.message, "an image of %u x %u pixels with %d channels is not a texture",
                  static_cast<unsigned>(width), static_cast<unsigned>(height), channels);
    return false;
  }
  const std::size_t line = static_cast<std::size_t>(width) * static_cast<std::size_t>(channels * bytes);
  if (png_get_rowbytes(png, info) != line) {
    std::snprintf(state.message, sizeof state.message, "unexpected line length");
    return false;
  }
  texture->bytes.resize(line * height);
  rows.resize(height);
  for (png_uint_32 y = 0; y < height; ++y) rows[y] = texture->bytes.data() + line * y;
  png_read_image(png, rows.data());
  png_read_end(png, nullptr);
  texture->xsize = static_cast<int>(width);
  texture->ysize = static_cast<int>(height);
  texture->n_channels = channels;
  texture->bytes_per_channel = bytes;
  return true;
}

}  // namespace

bool read_png_file(const char *path, Texture *texture, std::string *error) {
  if (!path || !*path) {
    *error = "no file named";
    return false;
  }
  std::unique_ptr<std::FILE, FileCloser> file(std::fopen(path, "rb"));
  if (!file) {
    *error = std::string("cannot open \"") + path + "\": " + std::strerror(errno);
    return false;
  }
  unsigned char signature[8];
  if (std::fread(signature, 1, sizeof signature, file.get()) != sizeof signature ||
      png_sig_cmp(signature, 0, sizeof signature) != 0) {
    *error = std::string("\"") + path + "\" is not a PNG file";
    return false;
  }
  ReadState state;
  png_structp png = png_create_read_struct(PNG_LIBPNG_VER_STRING, &state, on_error, on_warning);
  png_infop info = png ? png_create_info_struct(png) : nullptr;
  if (!png || !info) {
    png_destroy_read_struct(png ? &png : nullptr, nullptr, nullptr);
    *error = "not enough memory to read a PNG file";
    return false;
  }
  png_set_sig_bytes(png, sizeof signature);
  std::vector<png_bytep> rows;
  bool ok = false;
  try {
    ok = decode(file.get(), png, info, state, texture, rows);
  } catch (const std::bad_alloc &) {
    std::snprintf(state.message, sizeof state.message, "not enough memory for the image");
  }
  png_destroy_read_struct(&png, &info, nullptr);
  if (!ok) *error = std::string("\"") + path + "\": " + state.message;
  return ok;
}

}  // namespace tarsel_ref
