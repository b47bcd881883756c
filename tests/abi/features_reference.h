// Plain references for the corner measures, peaks, FAST, Hough lines and
// line suppression, written pixel by pixel from their documented
// definitions (whole-image arrays, no streaming, no vectors).
#ifndef ZELCV_TESTS_ABI_FEATURES_REFERENCE_H
#define ZELCV_TESTS_ABI_FEATURES_REFERENCE_H

#include <algorithm>
#include <cfloat>
#include <cmath>
#include <cstdint>
#include <vector>

#include "zelcv.h"

namespace featref {

inline int resolve(int i, int n, int kind) {
  if (kind == zelBorderReplicate) return i < 0 ? 0 : i >= n ? n - 1 : i;
  if (kind == zelBorderWrap) return ((i % n) + n) % n;
  if (n == 1) return 0;
  while (i < 0 || i >= n) {
    if (kind == zelBorderMirror)
      i = i < 0 ? -i : 2 * (n - 1) - i;
    else
      i = i < 0 ? -i - 1 : 2 * n - 1 - i;
  }
  return i;
}

// A plain image: w x h values, row after row.
template <typename T>
struct Plain {
  int w = 0, h = 0;
  std::vector<T> v;
  T& at(int x, int y) { return v[size_t(y) * w + x]; }
  const T& at(int x, int y) const { return v[size_t(y) * w + x]; }
};

template <typename T>
T sourcePixel(const Plain<T>& src, int x, int y, int kind, T value) {
  if (y < 0 || y >= src.h) {
    if (kind == zelBorderConstant) return value;
    y = resolve(y, src.h, kind);
  }
  if (x < 0 || x >= src.w) {
    if (kind == zelBorderConstant) return value;
    x = resolve(x, src.w, kind);
  }
  return src.at(x, y);
}

struct Taps {
  int k;
  float smooth[5], first[5];
};

inline Taps tapsFor(int filter, int mask) {
  if (mask == zelMaskSize5x5) return {5, {1, 4, 6, 4, 1}, {-1, -2, 0, 2, 1}};
  if (filter == zelFilterScharr) return {3, {3, 10, 3, 0, 0}, {-1, 0, 1, 0, 0}};
  return {3, {1, 2, 1, 0, 0}, {-1, 0, 1, 0, 0}};
}

inline float scaleFor(int filter, int mask, int block, bool eightBit) {
  double d = mask == zelMaskSize5x5 ? 16.0 : filter == zelFilterScharr ? 8.0 : 4.0;
  d *= block;
  if (eightBit) d *= 255.0;
  return float(1.0 / d);
}

// Scaled derivatives of every pixel. 8u: exact integers times the scale;
// 32f: the 32f derivative filters' sums (row taps in double, then column
// taps in float) times the scale.
template <typename T>
void derivatives(const Plain<T>& src, int filter, int mask, int block, int kind, T value, Plain<float>& fx,
                 Plain<float>& fy) {
  const Taps t = tapsFor(filter, mask);
  const int r = t.k / 2;
  const bool eightBit = sizeof(T) == 1;
  const float s = scaleFor(filter, mask, block, eightBit);
  fx = {src.w, src.h, std::vector<float>(src.v.size())};
  fy = fx;
  for (int y = 0; y < src.h; ++y)
    for (int x = 0; x < src.w; ++x) {
      if (eightBit) {
        long dx = 0, dy = 0;
        for (int i = 0; i < t.k; ++i)
          for (int j = 0; j < t.k; ++j) {
            const long p = long(sourcePixel(src, x - r + j, y - r + i, kind, value));
            dx += long(t.smooth[i]) * long(t.first[j]) * p;
            dy += long(t.first[i]) * long(t.smooth[j]) * p;
          }
        fx.at(x, y) = float(dx) * s;
        fy.at(x, y) = float(dy) * s;
      } else {
        // Per window row, the row taps in double (tap 0 first, every tap)
        // rounded to float, then the column taps over those in float.
        float dx = 0.0f, dy = 0.0f;
        for (int i = 0; i < t.k; ++i) {
          double a = 0.0, b = 0.0;
          for (int j = 0; j < t.k; ++j) {
            const double p = double(sourcePixel(src, x - r + j, y - r + i, kind, value));
            const double pa = double(t.first[j]) * p, pb = double(t.smooth[j]) * p;
            a = j == 0 ? pa : a + pa;
            b = j == 0 ? pb : b + pb;
          }
          const float ca = t.smooth[i] * float(a), cb = t.first[i] * float(b);
          dx = i == 0 ? ca : dx + ca;
          dy = i == 0 ? cb : dy + cb;
        }
        fx.at(x, y) = dx * s;
        fy.at(x, y) = dy * s;
      }
    }
}

enum class Measure { kMinEigenVal, kHarris, kEigenValsVecs };

inline void eigenVector(double a, double b, double c, double l, float* out) {
  double x = b, y = l - a, e = std::fabs(x);
  if (e + std::fabs(y) < 1e-4) {
    y = b;
    x = l - c;
    e = std::fabs(x);
    if (e + std::fabs(y) < 1e-4) {
      e = 1.0 / (e + std::fabs(y) + FLT_EPSILON);
      x *= e;
      y *= e;
    }
  }
  const double d = 1.0 / std::sqrt(x * x + y * y + DBL_EPSILON);
  out[0] = float(x * d);
  out[1] = float(y * d);
}

// The response image: 1 value a pixel, or 6 for the eigen decomposition.
template <typename T>
std::vector<float> cornerResponse(const Plain<T>& src, int filter, int mask, int block, int kind, T value,
                                  Measure m, float k) {
  Plain<float> fx, fy;
  derivatives(src, filter, mask, block, kind, value, fx, fy);
  const int w = src.w, h = src.h, half = block / 2;
  auto product = [&](int plane, int x, int y) -> float {
    const float a = fx.at(x, y), b = fy.at(x, y);
    return plane == 0 ? a * a : plane == 1 ? a * b : b * b;
  };
  // Column sums of plane p at column x (inside) for output row y.
  auto column = [&](int p, int x, int y) {
    float acc = 0.0f;
    for (int i = 0; i < block; ++i) {
      int m = y - half + i;
      float v;
      if (m < 0 || m >= h) {
        if (kind == zelBorderConstant) v = 0.0f;
        else v = product(p, x, resolve(m, h, kind));
      } else {
        v = product(p, x, m);
      }
      acc = i == 0 ? v : acc + v;
    }
    return acc;
  };
  const int per = m == Measure::kEigenValsVecs ? 6 : 1;
  std::vector<float> out(size_t(w) * h * per);
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      float s[3];
      for (int p = 0; p < 3; ++p) {
        float acc = 0.0f;
        for (int j = 0; j < block; ++j) {
          const int c = x - half + j;
          float v;
          if (c < 0 || c >= w)
            v = kind == zelBorderConstant ? 0.0f : column(p, resolve(c, w, kind), y);
          else
            v = column(p, c, y);
          acc = j == 0 ? v : acc + v;
        }
        s[p] = acc;
      }
      float* o = &out[(size_t(y) * w + x) * per];
      if (m == Measure::kMinEigenVal) {
        const float a = s[0] * 0.5f, c = s[2] * 0.5f, d = a - c;
        o[0] = (a + c) - std::sqrt(d * d + s[1] * s[1]);
      } else if (m == Measure::kHarris) {
        const float t = s[0] + s[2];
        o[0] = (s[0] * s[2] - s[1] * s[1]) - k * (t * t);
      } else {
        const double a = s[0], b = s[1], c = s[2];
        const double u = (a + c) * 0.5, v = std::sqrt((a - c) * (a - c) * 0.25 + b * b);
        o[0] = float(u + v);
        o[1] = float(u - v);
        eigenVector(a, b, c, u + v, o + 2);
        eigenVector(a, b, c, u - v, o + 4);
      }
    }
  return out;
}

// ---- FAST ---------------------------------------------------------------------

inline std::vector<int> circle(int radius) {
  if (radius == 3) return {0, -3, 1, -3, 2, -2, 3, -1, 3, 0, 3, 1, 2, 2, 1, 3, 0, 3, -1, 3, -2, 2, -3, 1, -3, 0, -3, -1, -2, -2, -1, -3};
  if (radius == 2) return {0, -2, 1, -2, 2, -1, 2, 0, 2, 1, 1, 2, 0, 2, -1, 2, -2, 1, -2, 0, -2, -1, -1, -2};
  return {0, -1, 1, -1, 1, 0, 1, 1, 0, 1, -1, 1, -1, 0, -1, -1};
}

// Score + 1 of a corner, 0 if the pixel is not one.
inline int fastRaw(const Plain<uint8_t>& img, int x, int y, int radius, int arc, int t) {
  const std::vector<int> c = circle(radius);
  const int n = int(c.size()) / 2, v = img.at(x, y);
  std::vector<int> d(n);
  for (int k = 0; k < n; ++k) d[k] = img.at(x + c[2 * k], y + c[2 * k + 1]) - v;
  int best = -1000;
  bool corner = false;
  for (int s = 0; s < n; ++s) {
    bool allBright = true, allDark = true;
    int lo = 1000, hi = -1000;
    for (int i = 0; i < arc; ++i) {
      const int e = d[(s + i) % n];
      allBright = allBright && e > t;
      allDark = allDark && e < -t;
      lo = std::min(lo, e);
      hi = std::max(hi, e);
    }
    corner = corner || allBright || allDark;
    best = std::max(best, std::max(lo, -hi));
  }
  return corner ? best : 0;  // best - 1 is the score
}

inline void fast(const Plain<uint8_t>& img, int radius, int arc, int t, bool suppress, Plain<uint8_t>& corner,
                 Plain<uint8_t>& score) {
  const int w = img.w, h = img.h;
  Plain<int> raw{w, h, std::vector<int>(size_t(w) * h, 0)};
  for (int y = radius; y < h - radius; ++y)
    for (int x = radius; x < w - radius; ++x) raw.at(x, y) = fastRaw(img, x, y, radius, arc, t);
  corner = {w, h, std::vector<uint8_t>(size_t(w) * h, 0)};
  score = corner;
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      if (!raw.at(x, y)) continue;
      const int s = raw.at(x, y) - 1;
      bool keep = true;
      if (suppress)
        for (int dy = -1; dy <= 1; ++dy)
          for (int dx = -1; dx <= 1; ++dx) {
            if (!dx && !dy) continue;
            const int nx = x + dx, ny = y + dy;
            const int ns = (nx < 0 || ny < 0 || nx >= w || ny >= h || !raw.at(nx, ny)) ? 0 : raw.at(nx, ny) - 1;
            keep = keep && s > ns;
          }
      if (keep) {
        corner.at(x, y) = 255;
        score.at(x, y) = uint8_t(s);
      }
    }
}

// ---- Hough lines ----------------------------------------------------------------

struct Line {
  float rho, theta;
};

inline std::vector<Line> hough(const Plain<uint8_t>& img, float drho, float dtheta, int threshold, float thetaMin,
                               double span, float rhoMin, float rhoMax) {
  const int rhos = int(std::nearbyint(float(2 * (img.w + img.h) + 1) / drho));
  const int angles = int(std::nearbyint(span / double(dtheta)));
  const float irho = 1.0f / drho;
  std::vector<float> c(angles), s(angles);
  float a = thetaMin;
  for (int n = 0; n < angles; ++n, a += dtheta) {
    c[n] = float(std::cos(double(a)) * irho);
    s[n] = float(std::sin(double(a)) * irho);
  }
  std::vector<int> acc(size_t(angles) * rhos, 0);
  for (int y = 0; y < img.h; ++y)
    for (int x = 0; x < img.w; ++x)
      if (img.at(x, y))
        for (int n = 0; n < angles; ++n) {
          const float t = float(x) * c[n] + float(y) * s[n];
          const int r = int(std::nearbyint(t)) + (rhos - 1) / 2;
          acc[size_t(n) * rhos + r]++;
        }
  auto at = [&](int n, int r) { return (n < 0 || n >= angles || r < 0 || r >= rhos) ? 0 : acc[size_t(n) * rhos + r]; };
  struct Cell {
    int votes, n, r;
  };
  std::vector<Cell> cells;
  for (int n = 0; n < angles; ++n)
    for (int r = 0; r < rhos; ++r) {
      const int v = at(n, r);
      if (v > threshold && v > at(n, r - 1) && v >= at(n, r + 1) && v > at(n - 1, r) && v >= at(n + 1, r)) {
        const float rho = (float(r) - float(rhos - 1) * 0.5f) * drho;
        if (rho >= rhoMin && rho <= rhoMax) cells.push_back({v, n, r});
      }
    }
  std::stable_sort(cells.begin(), cells.end(), [](const Cell& p, const Cell& q) { return p.votes > q.votes; });
  std::vector<Line> lines;
  for (const Cell& cell : cells)
    lines.push_back({(float(cell.r) - float(rhos - 1) * 0.5f) * drho, thetaMin + float(cell.n) * dtheta});
  return lines;
}

// ---- probabilistic Hough ------------------------------------------------------------

struct ProbSegment {
  int x0, y0, x1, y1;
};

// Pixels picked by the seeded generator, votes counted cell by cell, the
// strongest of the pixel's cells found by a scan after its vote, segments
// walked in 16-bit fixed point.
inline std::vector<ProbSegment> houghProb(const Plain<uint8_t>& img, float drho, float dtheta, uint32_t seed,
                                          int threshold, int length, int gap, int capacity) {
  const int rhos = int(std::nearbyint(float(2 * (img.w + img.h) + 1) / drho));
  const int angles = int(std::nearbyint(3.14159265358979323846 / double(dtheta)));
  const int offset = (rhos - 1) / 2;
  const float irho = 1.0f / drho;
  std::vector<float> c(angles), s(angles);
  float a = 0.0f;
  for (int n = 0; n < angles; ++n, a += dtheta) {
    c[n] = float(std::cos(double(a)) * irho);
    s[n] = float(std::sin(double(a)) * irho);
  }
  std::vector<int> acc(size_t(angles) * rhos, 0);
  auto cell = [&](int n, int x, int y) -> int& {
    return acc[size_t(n) * rhos + size_t(int(std::nearbyint(float(x) * c[n] + float(y) * s[n])) + offset)];
  };
  std::vector<uint8_t> mask(size_t(img.w) * img.h, 0);  // 0 empty, 1 set, 2 voted
  std::vector<std::pair<int, int>> list;
  for (int y = 0; y < img.h; ++y)
    for (int x = 0; x < img.w; ++x)
      if (img.at(x, y)) {
        mask[size_t(y) * img.w + x] = 1;
        list.push_back({x, y});
      }
  uint64_t state = uint64_t(seed) ^ 0x9E3779B97F4A7C15ull;
  if (!state) state = 0x9E3779B97F4A7C15ull;
  std::vector<ProbSegment> out;
  while (!list.empty() && int(out.size()) < capacity) {
    state ^= state >> 12;
    state ^= state << 25;
    state ^= state >> 27;
    const uint32_t r = uint32_t((state * 0x2545F4914F6CDD1Dull) >> 32);
    const size_t pick = r % uint32_t(list.size());
    const int px = list[pick].first, py = list[pick].second;
    list[pick] = list.back();
    list.pop_back();
    uint8_t& here = mask[size_t(py) * img.w + px];
    if (!here) continue;
    for (int n = 0; n < angles; ++n) cell(n, px, py)++;
    here = 2;
    int best = threshold - 1, bestAngle = -1;
    for (int n = 0; n < angles; ++n)
      if (cell(n, px, py) > best) {
        best = cell(n, px, py);
        bestAngle = n;
      }
    if (bestAngle < 0) continue;
    const float theta = float(bestAngle) * dtheta;
    const float ax = -std::sin(theta), ay = std::cos(theta);
    const bool alongX = std::fabs(ax) > std::fabs(ay);
    int dx, dy, x0, y0;
    if (alongX) {
      dx = ax > 0 ? 1 : -1;
      dy = int(std::lround(ay * 65536 / std::fabs(ax)));
      x0 = px;
      y0 = (py << 16) + (1 << 15);
    } else {
      dy = ay > 0 ? 1 : -1;
      dx = int(std::lround(ax * 65536 / std::fabs(ay)));
      x0 = (px << 16) + (1 << 15);
      y0 = py;
    }
    auto pixel = [&](int fx, int fy) { return alongX ? std::make_pair(fx, fy >> 16) : std::make_pair(fx >> 16, fy); };
    std::pair<int, int> end[2] = {{px, py}, {px, py}};
    for (int k = 0; k < 2; ++k) {
      int misses = 0;
      for (int fx = x0, fy = y0;; fx += k ? -dx : dx, fy += k ? -dy : dy) {
        const auto q = pixel(fx, fy);
        if (q.first < 0 || q.first >= img.w || q.second < 0 || q.second >= img.h) break;
        if (mask[size_t(q.second) * img.w + q.first]) {
          misses = 0;
          end[k] = q;
        } else if (++misses > gap) {
          break;
        }
      }
    }
    if (std::abs(end[1].first - end[0].first) < length && std::abs(end[1].second - end[0].second) < length) continue;
    for (int k = 0; k < 2; ++k)
      for (int fx = x0, fy = y0;; fx += k ? -dx : dx, fy += k ? -dy : dy) {
        const auto q = pixel(fx, fy);
        uint8_t& m = mask[size_t(q.second) * img.w + q.first];
        if (m == 2)
          for (int n = 0; n < angles; ++n) cell(n, q.first, q.second)--;
        m = 0;
        if (q == end[k]) break;
      }
    out.push_back({end[0].first, end[0].second, end[1].first, end[1].second});
  }
  return out;
}

// ---- line suppression ---------------------------------------------------------------

inline Plain<uint8_t> suppressLines(const Plain<uint8_t>& src, const Plain<uint8_t>& feature, int window, float ratio) {
  const int w = src.w, h = src.h, half = window / 2;
  Plain<int> dx{w, h, std::vector<int>(size_t(w) * h)}, dy = dx;
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      auto p = [&](int i, int j) { return int(sourcePixel<uint8_t>(src, x + i, y + j, zelBorderReplicate, 0)); };
      dx.at(x, y) = (p(1, -1) + 2 * p(1, 0) + p(1, 1)) - (p(-1, -1) + 2 * p(-1, 0) + p(-1, 1));
      dy.at(x, y) = (p(-1, 1) + 2 * p(0, 1) + p(1, 1)) - (p(-1, -1) + 2 * p(0, -1) + p(1, -1));
    }
  Plain<uint8_t> out{w, h, std::vector<uint8_t>(size_t(w) * h, 0)};
  const double r = ratio;
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      if (!feature.at(x, y)) continue;
      int64_t sxx = 0, sxy = 0, syy = 0;
      for (int j = std::max(0, y - half); j <= std::min(h - 1, y + half); ++j)
        for (int i = std::max(0, x - half); i <= std::min(w - 1, x + half); ++i) {
          sxx += int64_t(dx.at(i, j)) * dx.at(i, j);
          sxy += int64_t(dx.at(i, j)) * dy.at(i, j);
          syy += int64_t(dy.at(i, j)) * dy.at(i, j);
        }
      const int64_t det = sxx * syy - sxy * sxy, tr = sxx + syy;
      const double t = double(tr);
      if ((r * t) * t < ((r + 1.0) * (r + 1.0)) * double(det)) out.at(x, y) = feature.at(x, y);
    }
  return out;
}

}  // namespace featref

#endif  // ZELCV_TESTS_ABI_FEATURES_REFERENCE_H
