// Caption: a line of text over the input, set in the face the host supplies;
// "{n}" in the text stands for a counter that counts frames from 1.
#include <algorithm>
#include <cmath>
#include <string>
#include <vector>

#include "catalogue/catalogue.h"
#include "rendering/font.h"
#include "rendering/kernels/kernel.h"

namespace tarsel_ref {
namespace {

// The kernel: the text in the built-in bitmap font, "{n}" standing for the
// counter, over the background. Size is the height of a line's glyph cell
// (capitals take seven eighths of it); position is the text's anchor relative
// to the frame's centre, y downwards; align says whether the anchor is the
// lines' left end, centre or right end, and the block of lines is centred on
// it vertically. Coverage is found by sampling each pixel on a grid, finer
// at higher quality.
// Lines of single-byte glyphs: '\n' breaks lines, and every character beyond
// ASCII (a UTF-8 sequence) becomes one unknown glyph.
std::vector<std::string> glyph_lines(const std::string &text) {
  std::vector<std::string> lines(1);
  for (std::size_t i = 0; i < text.size(); ++i) {
    const unsigned char c = static_cast<unsigned char>(text[i]);
    if (c == '\n') {
      lines.emplace_back();
    } else if (c < 0x80) {
      if (c >= 32) lines.back() += static_cast<char>(c);
    } else if ((c & 0xc0) != 0x80) {
      lines.back() += '?';
    }
  }
  return lines;
}

std::string with_counter(std::string text, int counter) {
  const std::string mark = "{n}", value = std::to_string(counter);
  for (std::size_t at = text.find(mark); at != std::string::npos; at = text.find(mark, at + value.size()))
    text.replace(at, mark.size(), value);
  return text;
}

bool dot_at(const std::string &line, double gx, double gy) {
  if (gx < 0.0 || gy < 0.0 || gy >= kGlyphHeight) return false;
  const auto column = static_cast<long long>(std::floor(gx));
  const long long index = column / kGlyphAdvance;
  const int dot = static_cast<int>(column % kGlyphAdvance);
  if (index >= static_cast<long long>(line.size()) || dot >= kGlyphWidth) return false;
  const std::uint8_t bits =
      glyph_row(static_cast<unsigned char>(line[static_cast<std::size_t>(index)]), static_cast<int>(gy));
  return (bits >> (kGlyphWidth - 1 - dot)) & 1u;
}

int render_caption(const KernelContext &ctx, WorkImage &out) {
  const ParamReader &p = ctx.p();
  const std::vector<std::string> lines = glyph_lines(with_counter(p.text("text"), p.whole("counter")));
  const double size = ctx.length(std::max(0.0f, p.number("size")));
  const double dot_h = size / kGlyphHeight, dot_w = dot_h / ctx.pixel_aspect;
  const int align = std::clamp(p.whole("align"), 0, 2);
  float colour[4];
  for (int c = 0; c < 4; ++c) colour[c] = std::clamp(p.number("color", c), 0.0f, 1.0f);
  for (int c = 0; c < 3; ++c) colour[c] *= colour[3];
  const double anchor_x = ctx.frame_width / 2.0 + ctx.length(p.number("position", 0)) / ctx.pixel_aspect - ctx.x0;
  const double anchor_y = ctx.frame_height / 2.0 + ctx.length(p.number("position", 1)) - ctx.y0;
  const double block_h = ((static_cast<double>(lines.size()) - 1.0) * kLineAdvance + kGlyphHeight) * dot_h;
  const double top = anchor_y - block_h / 2.0;
  std::vector<double> lefts;
  for (const std::string &line : lines) {
    const double w = (line.empty() ? 0.0 : static_cast<double>(line.size()) * kGlyphAdvance - 1.0) * dot_w;
    lefts.push_back(align == 0 ? anchor_x : align == 1 ? anchor_x - w / 2.0 : anchor_x - w);
  }
  const int grid = ctx.quality == 0 ? 2 : ctx.quality == 1 ? 4 : 8;
  const WorkImage &background = ctx.input(0);

  ctx.rows([&](int y) {
    const float *b = background.row(y);
    float *d = out.row(y);
    std::copy(b, b + static_cast<std::size_t>(ctx.width) * 4, d);
    if (dot_h <= 0.0) return;
    for (std::size_t l = 0; l < lines.size(); ++l) {
      const std::string &line = lines[l];
      const double line_top = top + static_cast<double>(l) * kLineAdvance * dot_h;
      if (line.empty() || y + 1 <= line_top || y >= line_top + kGlyphHeight * dot_h) continue;
      const double width = static_cast<double>(line.size()) * kGlyphAdvance * dot_w;
      const int x_begin = std::max(0, static_cast<int>(std::floor(lefts[l])));
      const int x_end = std::min(ctx.width, static_cast<int>(std::ceil(lefts[l] + width)) + 1);
      for (int x = x_begin; x < x_end; ++x) {
        int hits = 0;
        for (int sy = 0; sy < grid; ++sy)
          for (int sx = 0; sx < grid; ++sx) {
            const double gx = (x + (sx + 0.5) / grid - lefts[l]) / dot_w;
            const double gy = (y + (sy + 0.5) / grid - line_top) / dot_h;
            hits += dot_at(line, gx, gy) ? 1 : 0;
          }
        if (!hits) continue;
        const float cover = static_cast<float>(hits) / static_cast<float>(grid * grid);
        float *px = d + x * 4;
        const float keep = 1.0f - colour[3] * cover;
        for (int c = 0; c < 4; ++c) px[c] = colour[c] * cover + px[c] * keep;
      }
    }
  });
  return kWrote;
}

DescriptorDefinition caption() {
  DescriptorDefinition d;
  d.name = "Caption";
  d.kernel = render_caption;
  d.popup_name = "Caption";
  d.inputs = {{"Background", "bg", true, kFallbackTransparent, 0.0f}};
  d.host_data = true;
  d.node_flags = kNodeUsesHostData;
  d.params = {
      label_param("Text Settings", "text_settings"),
      string_param("Text", "text", "Shot {n}"),
      float_param("Size", "size", 48.0f).bounds(1.0f, 1000.0f).sliders(8.0f, 200.0f).shown_as(format_pixels),
      color_param("Color", "color", {1.0f, 1.0f, 1.0f, 1.0f}).bounds(0.0f, 1.0f),
      pair_param("Position", "position", screen_mode_screen_center, 0.0f, -200.0f)
          .sliders(-960.0f, 960.0f)
          .big_sliders(-4000.0f, 4000.0f),
      int_param("Counter", "counter", 1, 1, 1000000 - 1).animated(auto_anim_floor1),
      popup_param("Align", "align", {"Left", "Center", "Right"}, 1),
  };
  return d;
}

}  // namespace

const PluginDefinition &caption_plugin() {
  static const PluginDefinition plugin{"T_Caption", "Stylize", false, false, {caption()}, nullptr};
  return plugin;
}

}  // namespace tarsel_ref
