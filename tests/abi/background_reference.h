// Plain scalar models of the foreground models, the mixture model and the
// super-resolution operations, written from the header's rules one pixel at
// a time; the library's vector paths must agree with them bit for bit.
#ifndef ZELCV_TESTS_BACKGROUND_REFERENCE_H
#define ZELCV_TESTS_BACKGROUND_REFERENCE_H

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <vector>

#include "zelcv.h"

namespace bgref {

// Pixels as rows of interleaved channels, no padding.
struct Frame {
  int width = 0, height = 0, channels = 1;
  std::vector<uint8_t> px;
  uint8_t at(int x, int y, int c) const { return px[(size_t(y) * width + x) * channels + c]; }
};

struct Histogram {
  int width, height, channels;
  uint32_t q;
  std::vector<uint8_t> counts;  // 16 per element

  Histogram(const Frame& f, float threshold, int initCount)
      : width(f.width), height(f.height), channels(f.channels), counts(f.px.size() * 16, 0) {
    const double r = std::floor(double(threshold) * 65536.0 + 0.5);
    q = r < 1 ? 1u : uint32_t(r);
    for (size_t e = 0; e < f.px.size(); ++e) counts[e * 16 + (f.px[e] >> 4)] = uint8_t(initCount);
  }
  std::vector<uint8_t> detect(const Frame& f) const {
    std::vector<uint8_t> mask(size_t(width) * height);
    for (size_t p = 0; p < mask.size(); ++p) {
      bool fg = false;
      for (int c = 0; c < channels; ++c) {
        const size_t e = p * channels + c;
        uint32_t total = 0;
        for (int b = 0; b < 16; ++b) total += counts[e * 16 + b];
        fg = fg || uint32_t(counts[e * 16 + (f.px[e] >> 4)]) * 65536u < q * total;
      }
      mask[p] = fg ? 255 : 0;
    }
    return mask;
  }
  void update(const Frame& f) {
    for (size_t e = 0; e < f.px.size(); ++e) {
      uint8_t* h = &counts[e * 16];
      const int b = f.px[e] >> 4;
      if (h[b] == 255)
        for (int i = 0; i < 16; ++i) h[i] = uint8_t(h[i] >> 1);
      ++h[b];
    }
  }
};

struct Gaussian {
  int width, height, channels;
  float alpha, k2, minVar;
  std::vector<float> mean, var;

  Gaussian(const Frame& f, const ZeliFGGaussianParams& p)
      : width(f.width), height(f.height), channels(f.channels), alpha(p.alpha), k2(p.k * p.k),
        minVar(p.minVariance), mean(f.px.begin(), f.px.end()), var(f.px.size(), p.initVariance) {}
  std::vector<uint8_t> detect(const Frame& f) const {
    std::vector<uint8_t> mask(size_t(width) * height);
    for (size_t p = 0; p < mask.size(); ++p) {
      bool fg = false;
      for (int c = 0; c < channels; ++c) {
        const size_t e = p * channels + c;
        const float d = float(f.px[e]) - mean[e];
        fg = fg || d * d > k2 * var[e];
      }
      mask[p] = fg ? 255 : 0;
    }
    return mask;
  }
  void update(const Frame& f) {
    for (size_t e = 0; e < f.px.size(); ++e) {
      const float d = float(f.px[e]) - mean[e];
      mean[e] = mean[e] + alpha * d;
      const float v = var[e] + alpha * (d * d - var[e]);
      var[e] = v > minVar ? v : minVar;
    }
  }
};

struct Mixture {
  struct Component {
    float w = 0, u[3] = {0, 0, 0}, v = 0;
  };
  int width, height, K;
  ZeliFGMMParams p;
  uint32_t frames = 0;
  std::vector<Component> comps;  // K per pixel

  Mixture(int w, int h, int k, const ZeliFGMMParams& params)
      : width(w), height(h), K(k), p(params), comps(size_t(w) * h * k) {}

  // Returns the mask and updates the model.
  std::vector<uint8_t> apply(const Frame& f) {
    const float first = 1.0f / float(2 * frames + 2);
    const float a = p.alpha > first ? p.alpha : first;
    const float b = 1.0f - a, c = a * p.complexity;
    std::vector<uint8_t> mask(size_t(width) * height);
    for (size_t px = 0; px < mask.size(); ++px) {
      Component* g = &comps[px * K];
      float x[3], e[8][3], D[8];
      for (int j = 0; j < 3; ++j) x[j] = f.px[px * 3 + j];
      for (int k = 0; k < K; ++k) {
        for (int j = 0; j < 3; ++j) e[k][j] = x[j] - g[k].u[j];
        D[k] = (e[k][0] * e[k][0] + e[k][1] * e[k][1]) + e[k][2] * e[k][2];
      }
      bool background = false;
      int match = -1;
      for (int k = 0; k < K; ++k) {
        if (!(g[k].w > 0)) continue;
        float ranked = 0;
        for (int j = 0; j < K; ++j)
          if (j != k && (g[j].w > g[k].w || (g[j].w == g[k].w && j < k))) ranked = ranked + g[j].w;
        if (D[k] < p.varThreshold * g[k].v && ranked < p.backgroundRatio) background = true;
        if (D[k] < p.varThresholdGen * g[k].v && (match < 0 || g[k].w > g[match].w)) match = k;
      }
      mask[px] = background ? 0 : 255;
      for (int k = 0; k < K; ++k) {
        const float t = ((g[k].w * b) - c) + (k == match ? a : 0.0f);
        g[k].w = t > 0 ? t : 0.0f;
      }
      if (match >= 0) {
        Component& m = g[match];
        const float r = std::min(a / m.w, 1.0f);
        for (int j = 0; j < 3; ++j) m.u[j] = m.u[j] + r * e[match][j];
        m.v = std::min(std::max(m.v + r * (D[match] - m.v), p.varMin), p.varMax);
      } else {
        int light = 0;
        for (int k = 1; k < K; ++k)
          if (g[k].w < g[light].w) light = k;
        g[light].w = a;
        for (int j = 0; j < 3; ++j) g[light].u[j] = x[j];
        g[light].v = p.varInit;
      }
      float s = g[0].w;
      for (int k = 1; k < K; ++k) s = s + g[k].w;
      for (int k = 0; k < K; ++k) g[k].w = g[k].w / s;
    }
    if (frames < (1u << 30)) ++frames;
    return mask;
  }

  std::vector<uint8_t> background() const {
    std::vector<uint8_t> out(size_t(width) * height * 3);
    for (size_t px = 0; px < size_t(width) * height; ++px) {
      const Component* g = &comps[px * K];
      int best = -1;
      float bestW = 0;
      for (int k = 0; k < K; ++k)
        if (g[k].w > bestW) bestW = g[k].w, best = k;
      for (int j = 0; j < 3; ++j) {
        const float v = best < 0 ? 0.0f : std::floor(g[best].u[j] + 0.5f);
        out[px * 3 + j] = uint8_t(std::min(std::max(v, 0.0f), 255.0f));
      }
    }
    return out;
  }
};

inline int64_t clampTo(int64_t v, int64_t n) { return v < 0 ? 0 : v >= n ? n - 1 : v; }

// Low-resolution residual and gradient over plain row-major float images.
inline std::vector<float> residual(const Frame& lr, const std::vector<float>& hr, int hrW, int hrH, int P,
                                   const float* psf, int scale, ZeliPoint off) {
  std::vector<float> r(size_t(lr.width) * lr.height);
  for (int y = 0; y < lr.height; ++y)
    for (int x = 0; x < lr.width; ++x) {
      float acc = 0;
      for (int j = 0; j < P; ++j)
        for (int i = 0; i < P; ++i) {
          const int64_t X = clampTo(int64_t(scale) * x + off.x + i, hrW);
          const int64_t Y = clampTo(int64_t(scale) * y + off.y + j, hrH);
          acc = acc + psf[j * P + i] * hr[size_t(Y) * hrW + X];
        }
      r[size_t(y) * lr.width + x] = float(lr.at(x, y, 0)) - acc;
    }
  return r;
}

inline void gradient(const std::vector<float>& r, int w, int h, std::vector<float>& grad, int hrW, int hrH, int P,
                     const float* psf, int scale, ZeliPoint off) {
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x)
      for (int j = 0; j < P; ++j)
        for (int i = 0; i < P; ++i) {
          const int64_t X = clampTo(int64_t(scale) * x + off.x + i, hrW);
          const int64_t Y = clampTo(int64_t(scale) * y + off.y + j, hrH);
          float& g = grad[size_t(Y) * hrW + X];
          g = g + psf[j * P + i] * r[size_t(y) * w + x];
        }
}

}  // namespace bgref

#endif  // ZELCV_TESTS_BACKGROUND_REFERENCE_H
