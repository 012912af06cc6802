#include "rendering/kernels/box_blur.h"

#include <algorithm>
#include <cmath>
#include <vector>

#include "core/abort.h"
#include "tarsel/errors.h"

namespace tarsel_ref {
namespace {

// Columns per vertical strip: wide enough for whole cache lines, narrow
// enough that a strip of a tall image stays in cache.
constexpr int kStripWidth = 32;

// Index of sample k of a line of n, or -1 for nothing.
int edge_index(int k, int n, Edge edge) {
  if (k >= 0 && k < n) return k;
  switch (edge) {
    case Edge::transparent: return -1;
    case Edge::repeat: return k < 0 ? 0 : n - 1;
    case Edge::mirror: {
      const int period = 2 * n;
      int m = k % period;
      if (m < 0) m += period;
      return m < n ? m : period - 1 - m;
    }
  }
  return -1;
}

struct Window {
  int left, right;               // whole samples on each side of the centre
  double left_frac, right_frac;  // weight of the partial sample beyond them
  double scale;                  // one over the box's total weight
};

Window window_for(double radius, double bias, bool whole) {
  double left = std::max(0.0, radius * (1.0 + bias));
  double right = std::max(0.0, radius * (1.0 - bias));
  if (whole) {
    left = std::round(left);
    right = std::round(right);
  }
  Window w;
  w.left = static_cast<int>(std::floor(left));
  w.right = static_cast<int>(std::floor(right));
  w.left_frac = left - w.left;
  w.right_frac = right - w.right;
  w.scale = 1.0 / (left + right + 1.0);
  return w;
}

// One box pass along a line of n positions, each holding `lanes` floats
// (a pixel's channels, or a line of a strip). Checks the abort request at
// every position: a position of a strip is a line of the image.
void box_pass(const float *src, float *dst, int n, int lanes, const Window &w, Edge edge, std::vector<double> &sum) {
  sum.assign(static_cast<std::size_t>(lanes), 0.0);
  auto add = [&](int k, double weight) {
    const int i = edge_index(k, n, edge);
    if (i < 0 || weight == 0.0) return;
    const float *s = src + static_cast<std::size_t>(i) * static_cast<std::size_t>(lanes);
    for (int l = 0; l < lanes; ++l) sum[static_cast<std::size_t>(l)] += weight * s[l];
  };
  for (int k = -w.left; k <= w.right; ++k) add(k, 1.0);
  const bool partial = w.left_frac > 0.0 || w.right_frac > 0.0;
  std::vector<double> edges;
  if (partial) edges.resize(static_cast<std::size_t>(lanes));
  for (int x = 0; x < n; ++x) {
    if (abort_requested()) throw TarselAbortException();
    float *d = dst + static_cast<std::size_t>(x) * static_cast<std::size_t>(lanes);
    if (partial) {
      std::fill(edges.begin(), edges.end(), 0.0);
      const int a = edge_index(x - w.left - 1, n, edge), b = edge_index(x + w.right + 1, n, edge);
      const float *sa = a >= 0 ? src + static_cast<std::size_t>(a) * static_cast<std::size_t>(lanes) : nullptr;
      const float *sb = b >= 0 ? src + static_cast<std::size_t>(b) * static_cast<std::size_t>(lanes) : nullptr;
      for (int l = 0; l < lanes; ++l) {
        double e = 0.0;
        if (sa) e += w.left_frac * sa[l];
        if (sb) e += w.right_frac * sb[l];
        d[l] = static_cast<float>((sum[static_cast<std::size_t>(l)] + e) * w.scale);
      }
    } else {
      for (int l = 0; l < lanes; ++l) d[l] = static_cast<float>(sum[static_cast<std::size_t>(l)] * w.scale);
    }
    // Slide: the sample entering on the right, the one leaving on the left.
    const int in = edge_index(x + w.right + 1, n, edge), out = edge_index(x - w.left, n, edge);
    const float *si = in >= 0 ? src + static_cast<std::size_t>(in) * static_cast<std::size_t>(lanes) : nullptr;
    const float *so = out >= 0 ? src + static_cast<std::size_t>(out) * static_cast<std::size_t>(lanes) : nullptr;
    for (int l = 0; l < lanes; ++l) {
      double &s = sum[static_cast<std::size_t>(l)];
      if (si) s += si[l];
      if (so) s -= so[l];
    }
  }
}

}  // namespace

double box_radius_for_sigma(double sigma, int passes) {
  if (sigma <= 0.0 || passes < 1) return 0.0;
  return (std::sqrt(12.0 * sigma * sigma / passes + 1.0) - 1.0) / 2.0;
}

void box_blur(const KernelContext &ctx, const WorkImage &src, WorkImage &dst, const BoxBlur &blur) {
  const int w = src.width(), h = src.height();
  const Window wx = window_for(blur.radius_x, blur.bias, blur.whole_pixels);
  const Window wy = window_for(blur.radius_y, blur.bias, blur.whole_pixels);
  const bool across = blur.radius_x > 0.0 && !(blur.whole_pixels && wx.left == 0 && wx.right == 0);
  const bool down = blur.radius_y > 0.0 && !(blur.whole_pixels && wy.left == 0 && wy.right == 0);
  const std::size_t line = static_cast<std::size_t>(w) * 4;

  // Across: every pass of a line in a scratch line of its own.
  run_rows(h, ctx.n_threads, [&](int y) {
    const float *s = src.row(y);
    float *d = dst.row(y);
    if (!across) {
      if (s != d) std::copy(s, s + line, d);
      return;
    }
    std::vector<float> a(s, s + line), b(line);
    std::vector<double> sum;
    for (int p = 0; p < blur.passes; ++p) {
      box_pass(a.data(), b.data(), w, 4, wx, blur.edge, sum);
      a.swap(b);
    }
    std::copy(a.begin(), a.end(), d);
  });
  if (!down) return;

  // Down: a strip of columns copied out, every pass run on it, copied back.
  const int n_strips = (w + kStripWidth - 1) / kStripWidth;
  run_tasks(n_strips, ctx.n_threads, [&](int strip) {
    const int x0 = strip * kStripWidth;
    const int sw = std::min(kStripWidth, w - x0);
    const int lanes = sw * 4;
    std::vector<float> a(static_cast<std::size_t>(lanes) * static_cast<std::size_t>(h)), b(a.size());
    for (int y = 0; y < h; ++y) {
      const float *r = dst.row(y) + static_cast<std::size_t>(x0) * 4;
      std::copy(r, r + lanes, a.begin() + static_cast<std::ptrdiff_t>(y) * lanes);
    }
    std::vector<double> sum;
    for (int p = 0; p < blur.passes; ++p) {
      box_pass(a.data(), b.data(), h, lanes, wy, blur.edge, sum);
      a.swap(b);
    }
    for (int y = 0; y < h; ++y)
      std::copy(a.begin() + static_cast<std::ptrdiff_t>(y) * lanes,
                a.begin() + static_cast<std::ptrdiff_t>(y + 1) * lanes, dst.row(y) + static_cast<std::size_t>(x0) * 4);
  });
}

}  // namespace tarsel_ref
