// A plain scalar tracker written from the header's description of the
// pyramidal Lucas-Kanade call: the derivative images, the bilinear windows,
// the four-lane sums and the iteration, one pixel at a time. The library
// must give the same statuses, positions and errors bit for bit.
#ifndef ZELCV_TESTS_OPTFLOW_REFERENCE_H
#define ZELCV_TESTS_OPTFLOW_REFERENCE_H

#include <algorithm>
#include <cfloat>
#include <cmath>
#include <cstdint>
#include <vector>

#include "zelcv.h"

namespace optref {

// One level of a pyramid as the reference reads it.
struct Level {
  std::vector<float> px;  // the pixels converted to float
  int width = 0, height = 0;
  float at(int64_t x, int64_t y) const {
    x = std::min<int64_t>(std::max<int64_t>(x, 0), width - 1);
    y = std::min<int64_t>(std::max<int64_t>(y, 0), height - 1);
    return px[size_t(y) * width + size_t(x)];
  }
};

template <typename T>
Level readLevel(const ZeliPyramid* p, int l) {
  Level v;
  v.width = p->roiSizes[l].width;
  v.height = p->roiSizes[l].height;
  v.px.resize(size_t(v.width) * v.height);
  for (int y = 0; y < v.height; ++y) {
    const T* row = reinterpret_cast<const T*>(p->images[l] + size_t(y) * p->steps[l]);
    for (int x = 0; x < v.width; ++x) v.px[size_t(y) * v.width + x] = float(row[x]);
  }
  return v;
}

// Scharr / 32 with replicated borders: a row pass in double rounded to float,
// then a column pass in float, taps in order (exact for integer images).
inline void scharr(const Level& im, Level* gx, Level* gy) {
  const int w = im.width, h = im.height;
  gx->width = gy->width = w;
  gx->height = gy->height = h;
  gx->px.assign(size_t(w) * h, 0.0f);
  gy->px.assign(size_t(w) * h, 0.0f);
  auto rowD = [&](int x, int y) {
    return float((-1.0 * im.at(x - 1, y) + 0.0 * im.at(x, y)) + 1.0 * im.at(x + 1, y));
  };
  auto rowS = [&](int x, int y) {
    return float((3.0 * im.at(x - 1, y) + 10.0 * im.at(x, y)) + 3.0 * im.at(x + 1, y));
  };
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      float a = 0.0f;
      a = a + 3.0f * rowD(x, y - 1);
      a = a + 10.0f * rowD(x, y);
      a = a + 3.0f * rowD(x, y + 1);
      float b = 0.0f;
      b = b + -1.0f * rowS(x, y - 1);
      b = b + 0.0f * rowS(x, y);
      b = b + 1.0f * rowS(x, y + 1);
      gx->px[size_t(y) * w + x] = a * (1.0f / 32);
      gy->px[size_t(y) * w + x] = b * (1.0f / 32);
    }
}

struct Window {
  int64_t ix = 0, iy = 0;
  float w00 = 0, w01 = 0, w10 = 0, w11 = 0;
  bool finite = false;
  ZeliRect inside{0, 0, 0, 0};
};

inline Window place(ZeliPoint_32f c, int n, int sw, int sh) {
  Window p;
  if (!std::isfinite(c.x) || !std::isfinite(c.y)) return p;
  p.finite = true;
  const float x0 = c.x - float(n - 1) * 0.5f, y0 = c.y - float(n - 1) * 0.5f;
  const float fx = std::floor(x0), fy = std::floor(y0);
  const float a = x0 - fx, b = y0 - fy;
  p.ix = int64_t(fx);
  p.iy = int64_t(fy);
  p.w00 = (1.0f - a) * (1.0f - b);
  p.w01 = a * (1.0f - b);
  p.w10 = (1.0f - a) * b;
  p.w11 = a * b;
  // Pixels whose taps of non-zero weight all lie inside.
  int x0i = -1, x1i = -1, y0i = -1, y1i = -1;
  for (int i = 0; i < n; ++i) {
    const bool in = p.ix + i >= 0 && p.ix + i + (a > 0) <= sw - 1;
    if (in && x0i < 0) x0i = i;
    if (in) x1i = i;
  }
  for (int j = 0; j < n; ++j) {
    const bool in = p.iy + j >= 0 && p.iy + j + (b > 0) <= sh - 1;
    if (in && y0i < 0) y0i = j;
    if (in) y1i = j;
  }
  if (x0i >= 0 && y0i >= 0) p.inside = {x0i, y0i, x1i - x0i + 1, y1i - y0i + 1};
  return p;
}

inline float sample(const Level& im, const Window& p, int i, int j) {
  const float s00 = im.at(p.ix + i, p.iy + j), s01 = im.at(p.ix + i + 1, p.iy + j);
  const float s10 = im.at(p.ix + i, p.iy + j + 1), s11 = im.at(p.ix + i + 1, p.iy + j + 1);
  return ((s00 * p.w00 + s01 * p.w01) + s10 * p.w10) + s11 * p.w11;
}

// Four lanes by column, (l0 + l1) + (l2 + l3).
struct Lanes {
  double l[4] = {0, 0, 0, 0};
  double total() const { return (l[0] + l[1]) + (l[2] + l[3]); }
};

struct Result {
  std::vector<ZeliPoint_32f> next;
  std::vector<int> status;
  std::vector<float> error;
};

// stateRoi decides which levels take whole-level derivatives.
inline Result track(const std::vector<Level>& first, const std::vector<Level>& second, const double* scales,
                    const std::vector<ZeliPoint_32f>& prev, std::vector<ZeliPoint_32f> next, int n, int maxLev,
                    int maxIter, float threshold, ZeliSize stateRoi) {
  const size_t count = prev.size();
  Result r;
  r.status.assign(count, maxLev + 1);
  r.error.assign(count, -1.0f);
  const double t2 = double(threshold) * double(threshold);
  for (int l = maxLev; l >= 0; --l) {
    const Level& I = first[size_t(l)];
    const Level& J = second[size_t(l)];
    const bool whole = I.width <= stateRoi.width && I.height <= stateRoi.height;
    Level gx, gy;
    if (whole) scharr(I, &gx, &gy);
    const double s = scales[l];
    for (size_t k = 0; k < count; ++k) {
      if (r.status[k] != l + 1) continue;
      r.status[k] = l;
      const ZeliPoint_32f p{float(double(prev[k].x) * s), float(double(prev[k].y) * s)};
      ZeliPoint_32f g{float(double(next[k].x) * s), float(double(next[k].y) * s)};
      std::vector<float> wi(size_t(n) * n), wx(size_t(n) * n), wy(size_t(n) * n), wj(size_t(n) * n);
      const Window pi = place(p, n, I.width, I.height);
      ZeliRect ri{0, 0, 0, 0};
      if (pi.finite) ri = pi.inside;
      if (ri.width > 0) {
        for (int j = 0; j < n; ++j)
          for (int i = 0; i < n; ++i) {
            const size_t at = size_t(j) * n + i;
            if (whole) {
              wi[at] = sample(I, pi, i, j);
              wx[at] = sample(gx, pi, i, j);
              wy[at] = sample(gy, pi, i, j);
            } else {
              // The (n + 2)-square window, one pixel up and left.
              auto m = [&](int di, int dj) { return sample(I, pi, i + di, j + dj); };
              const float h0 = m(1, -1) - m(-1, -1), h1 = m(1, 0) - m(-1, 0), h2 = m(1, 1) - m(-1, 1);
              const float v0 = (3.0f * m(-1, -1) + 10.0f * m(0, -1)) + 3.0f * m(1, -1);
              const float v2 = (3.0f * m(-1, 1) + 10.0f * m(0, 1)) + 3.0f * m(1, 1);
              wx[at] = ((3.0f * h0 + 10.0f * h1) + 3.0f * h2) * (1.0f / 32);
              wy[at] = (v2 - v0) * (1.0f / 32);
              wi[at] = m(0, 0);
            }
          }
      }
      bool lost = false, store = true;
      double pdx = 0, pdy = 0, e = 0;
      int area = 0;
      for (int it = 0;; ++it) {
        const Window pj = place(g, n, J.width, J.height);
        if (!pj.finite || pj.inside.width == 0) {
          lost = true;
          store = false;
          break;
        }
        for (int j = 0; j < n; ++j)
          for (int i = 0; i < n; ++i) wj[size_t(j) * n + i] = sample(J, pj, i, j);
        const int x0 = std::max(ri.x, pj.inside.x), y0 = std::max(ri.y, pj.inside.y);
        const int x1 = std::min(ri.x + ri.width, pj.inside.x + pj.inside.width);
        const int y1 = std::min(ri.y + ri.height, pj.inside.y + pj.inside.height);
        if (x1 <= x0 || y1 <= y0) {
          lost = true;
          break;
        }
        Lanes xx, xy, yy, bx, by, ee;
        for (int y = y0; y < y1; ++y)
          for (int x = x0; x < x1; ++x) {
            const size_t at = size_t(y) * n + x;
            const int c = (x - x0) & 3;
            const double ix = wx[at], iy = wy[at];
            const double d = double(wi[at] - wj[at]);
            xx.l[c] += ix * ix;
            xy.l[c] += ix * iy;
            yy.l[c] += iy * iy;
            bx.l[c] += d * ix;
            by.l[c] += d * iy;
            ee.l[c] += d * d;
          }
        const double gxx = xx.total(), gxy = xy.total(), gyy = yy.total(), vbx = bx.total(), vby = by.total();
        e = ee.total();
        area = (x1 - x0) * (y1 - y0);
        const double det = gxx * gyy - gxy * gxy;
        if (!(det >= 2.220446049250313e-16)) {
          lost = true;
          store = false;
          break;
        }
        const double dx = (gyy * vbx - gxy * vby) / det, dy = (gxx * vby - gxy * vbx) / det;
        g = {float(double(g.x) + dx), float(double(g.y) + dy)};
        if (dx * dx + dy * dy < t2) break;
        if (it > 0 && std::fabs(dx + pdx) < 0.0003452669770922512 && std::fabs(dy + pdy) < 0.0003452669770922512) {
          g = {float(double(g.x) - dx * 0.5), float(double(g.y) - dy * 0.5)};
          break;
        }
        pdx = dx;
        pdy = dy;
        if (it + 1 >= maxIter) break;
      }
      if (store) next[k] = l == 0 ? g : ZeliPoint_32f{float(double(g.x) / s), float(double(g.y) / s)};
      if (lost) {
        r.status[k] = l + 1;
        r.error[k] = 0.0f;
      } else {
        r.error[k] = e > 0 ? float(std::sqrt(e / double(area))) : 0.0f;
      }
    }
  }
  r.next = next;
  return r;
}

}  // namespace optref

#endif  // ZELCV_TESTS_OPTFLOW_REFERENCE_H
