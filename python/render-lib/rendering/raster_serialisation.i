// A T_RasterInfo as plain data: its 104-byte memory image (fields in order,
// 32-bit little-endian, the unnamed words included) and that image as base64
// text. The module decodes base64 itself; any standard encoder makes the text.

%{
#include <algorithm>
#include <vector>

typedef unsigned char uchar_t;

static const size_t RASTER_INFO_IMAGE_SIZE = 104;

// The value of one base64 character; a byte outside the alphabet is its own
// value ('=' gives 61), there is no error value. The decoder's own: not a
// function of the module.
static uchar_t DEC(uchar_t c)
{
  if (c >= 'A' && c <= 'Z')
    return (uchar_t)(c - 65);
  if (c >= 'a' && c <= 'z')
    return (uchar_t)(c - 71);
  if (c >= '0' && c <= '9')
    return (uchar_t)(c + 4);
  if (c == '+')
    return 62;
  if (c == '/')
    return 63;
  return c;
}

// Decodes `text` into the first `length` bytes of `dest` (zeroed first),
// stopping at the first NUL or '='. Characters outside the alphabet are
// merged by their DEC value; only the second write of the phases that carry
// into the next byte is bounded by `length`, so the caller gives at least
// three quarters of the text's length.
static void base64decode(const char *text, uchar_t *dest, int length)
{
  if (length == 0)
    return;
  std::memset(dest, 0, (size_t)length);
  int j = 0;
  for (int i = 0; text[i] != '\0' && text[i] != '='; ++i) {
    const uchar_t v = DEC((uchar_t)text[i]);
    switch (i % 4) {
      case 0: dest[j] |= (uchar_t)(v << 2); break;
      case 1:
        dest[j] |= (uchar_t)((v & 0x30) >> 4);
        if (++j < length)
          dest[j] |= (uchar_t)((v & 0x0F) << 4);
        break;
      case 2:
        dest[j] |= (uchar_t)((v & 0x3C) >> 2);
        if (++j < length)
          dest[j] |= (uchar_t)((v & 0x03) << 6);
        break;
      default: dest[j] |= (uchar_t)(v & 0x3F); ++j;
    }
  }
}

// The scratch buffer holds at least a whole image, so a short text leaves the
// bytes it does not reach zero instead of reading past the buffer.
static void make_tarsel_raster_info_from_base64(T_RasterInfo *info, const char *text)
{
  const size_t length = std::strlen(text);
  std::vector<uchar_t> scratch(std::max(length, RASTER_INFO_IMAGE_SIZE));
  base64decode(text, scratch.data(), (int)length);
  std::memcpy(info, scratch.data(), RASTER_INFO_IMAGE_SIZE);
}

// Overwrites the whole record, the unnamed words included, with the first
// 104 bytes of `bits`.
static void make_tarsel_raster_info_from_bits(T_RasterInfo *info, char const *bits)
{
  std::memcpy(info, bits, RASTER_INFO_IMAGE_SIZE);
}

static PyObject *raster_info_to_bytearray(T_RasterInfo *info)
{
  return PyByteArray_FromStringAndSize(reinterpret_cast<const char *>(info), (Py_ssize_t)RASTER_INFO_IMAGE_SIZE);
}
%}

%apply char const *RasterImageBytes { char const *bits };
%apply T_RasterInfo *RequiredRecord { T_RasterInfo *info };
%apply char const *RequiredText { char const *text };

void make_tarsel_raster_info_from_bits(T_RasterInfo *info, char const *bits);
PyObject *raster_info_to_bytearray(T_RasterInfo *info);
void make_tarsel_raster_info_from_base64(T_RasterInfo *info, char const *text);
%clear char const *text;
%apply (char const *DecodeText, uchar_t *DecodeDest, int DecodeLength) { (char const *text, uchar_t *dest, int length) };
void base64decode(char const *text, uchar_t *dest, int length);
%clear T_RasterInfo *info;

