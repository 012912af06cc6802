// PNG output of the folder device, through libpng.
#include <png.h>

#include <cmath>
#include <csetjmp>
#include <cstdio>
#include <memory>

#include "monitor/folder_device.h"

namespace qrv_ref {
namespace {

void on_error(png_structp png, png_const_charp) { png_longjmp(png, 1); }
void on_warning(png_structp, png_const_charp) {}

struct FileCloser {
  void operator()(std::FILE *f) const { std::fclose(f); }
};

// Everything that setjmp may return to lives outside the function that calls
// it, so no destructor is skipped by the jump.
bool write_with(png_structp png, png_infop info, std::FILE *file, int width, int height,
                const std::vector<uint8_t> &rgba, const ImageValues &image) {
  if (setjmp(png_jmpbuf(png))) return false;
  png_init_io(png, file);
  png_set_IHDR(png, info, png_uint_32(width), png_uint_32(height), 8, PNG_COLOR_TYPE_RGB_ALPHA, PNG_INTERLACE_NONE,
               PNG_COMPRESSION_TYPE_DEFAULT, PNG_FILTER_TYPE_DEFAULT);
  png_set_compression_level(png, 1);  // a monitor keeps up with frames; size matters less
  if (image.gamma > 0) png_set_gAMA(png, info, 1.0 / image.gamma);
  if (image.pixel_aspect != 1.0) {
    // Pixels per metre in x and y, in the ratio height : width of one pixel.
    double x = 10000, y = 10000 * image.pixel_aspect;
    png_set_pHYs(png, info, png_uint_32(std::lround(x)), png_uint_32(std::lround(y)), PNG_RESOLUTION_UNKNOWN);
  }
  png_text title{};
  if (!image.name.empty()) {
    title.compression = PNG_TEXT_COMPRESSION_NONE;
    title.key = const_cast<char *>("Title");
    title.text = const_cast<char *>(image.name.c_str());
    png_set_text(png, info, &title, 1);
  }
  png_write_info(png, info);
  for (int y = 0; y < height; ++y)
    png_write_row(png, const_cast<png_bytep>(rgba.data() + size_t(y) * size_t(width) * 4));
  png_write_end(png, info);
  return true;
}

}  // namespace

bool write_png_file(const std::string &path, int width, int height, const std::vector<uint8_t> &rgba,
                    const ImageValues &image) {
  std::unique_ptr<std::FILE, FileCloser> file(std::fopen(path.c_str(), "wb"));
  if (!file) return false;
  png_structp png = png_create_write_struct(PNG_LIBPNG_VER_STRING, nullptr, on_error, on_warning);
  png_infop info = png ? png_create_info_struct(png) : nullptr;
  bool written = info && write_with(png, info, file.get(), width, height, rgba, image);
  png_destroy_write_struct(&png, &info);
  return written && std::fflush(file.get()) == 0;
}

}  // namespace qrv_ref
