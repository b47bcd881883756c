// Segmentation references written from the definitions, pixel by pixel and
// with other data structures than the library: a pixel union-find labelling,
// a breadth-first speckle search, a watershed on a std::priority_queue, and
// boundary marking on a copy. Images are plain row-major vectors.
#ifndef ZELCV_TESTS_SEGMENTATION_REFERENCE_H
#define ZELCV_TESTS_SEGMENTATION_REFERENCE_H

#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <functional>
#include <numeric>
#include <queue>
#include <random>
#include <tuple>
#include <vector>

namespace zeltest {

struct Grid {
  int w = 0, h = 0;
  std::vector<int64_t> v;
  int64_t& at(int x, int y) { return v[size_t(y) * w + x]; }
  int64_t at(int x, int y) const { return v[size_t(y) * w + x]; }
  bool inside(int x, int y) const { return x >= 0 && y >= 0 && x < w && y < h; }
};

// Random blobs of a few values: `values` distinct non-zero values plus 0,
// painted as rectangles of random sizes over noise, so regions of every
// shape and size occur.
inline Grid blobGrid(std::mt19937& rng, int w, int h, int values) {
  Grid g{w, h, std::vector<int64_t>(size_t(w) * h)};
  std::uniform_int_distribution<int> value(0, values);
  for (auto& v : g.v) v = value(rng);
  const int rects = std::uniform_int_distribution<int>(0, 12)(rng);
  for (int r = 0; r < rects; ++r) {
    const int x0 = int(rng() % w), y0 = int(rng() % h);
    const int x1 = std::min(w, x0 + 1 + int(rng() % 12)), y1 = std::min(h, y0 + 1 + int(rng() % 12));
    const int v = value(rng);
    for (int y = y0; y < y1; ++y)
      for (int x = x0; x < x1; ++x) g.at(x, y) = v;
  }
  return g;
}

// Neighbour offsets: left, up, right, down, then the diagonals.
inline const int kDx[8] = {-1, 0, 1, 0, -1, 1, -1, 1};
inline const int kDy[8] = {0, -1, 0, 1, -1, -1, 1, 1};

// Regions of equal non-zero value numbered in raster order of first pixel.
// Returns the labels (0 background) and the region count.
inline std::pair<Grid, int64_t> labelReference(const Grid& g, bool conn8, int64_t minLabel, int64_t maxLabel) {
  const size_t n = g.v.size();
  std::vector<size_t> parent(n);
  std::iota(parent.begin(), parent.end(), size_t(0));
  std::function<size_t(size_t)> find = [&](size_t i) { return parent[i] == i ? i : parent[i] = find(parent[i]); };
  for (int y = 0; y < g.h; ++y)
    for (int x = 0; x < g.w; ++x) {
      if (g.at(x, y) == 0) continue;
      for (int k = 0; k < (conn8 ? 8 : 4); ++k) {
        const int nx = x + kDx[k], ny = y + kDy[k];
        if (!g.inside(nx, ny) || g.at(nx, ny) != g.at(x, y)) continue;
        const size_t a = find(size_t(y) * g.w + x), b = find(size_t(ny) * g.w + nx);
        parent[std::max(a, b)] = std::min(a, b);
      }
    }
  Grid out{g.w, g.h, std::vector<int64_t>(n, 0)};
  std::vector<int64_t> labelOfRoot(n, -1);
  int64_t count = 0;
  for (size_t i = 0; i < n; ++i) {
    if (g.v[i] == 0) continue;
    const size_t r = find(i);
    if (labelOfRoot[r] < 0) labelOfRoot[r] = std::min(minLabel + count++, maxLabel);
    out.v[i] = labelOfRoot[r];
  }
  return {out, count};
}

// Speckles: breadth-first search over 4-neighbours joined by `near`.
template <typename T, typename Near>
std::vector<T> speckleReference(std::vector<T> img, int w, int h, T speckle, int maxSize, Near near) {
  auto active = [&](T v) { return !(v == speckle); };
  const std::vector<T> in = img;
  std::vector<int> seen(in.size(), 0);
  for (size_t start = 0; start < in.size(); ++start) {
    if (seen[start] || !active(in[start])) continue;
    std::vector<size_t> region = {start};
    seen[start] = 1;
    for (size_t i = 0; i < region.size(); ++i) {
      const int x = int(region[i] % w), y = int(region[i] / w);
      for (int k = 0; k < 4; ++k) {
        const int nx = x + kDx[k], ny = y + kDy[k];
        if (nx < 0 || ny < 0 || nx >= w || ny >= h) continue;
        const size_t j = size_t(ny) * w + nx;
        if (seen[j] || !active(in[j]) || !near(in[region[i]], in[j])) continue;
        seen[j] = 1;
        region.push_back(j);
      }
    }
    if (int64_t(region.size()) <= maxSize)
      for (size_t j : region) img[j] = speckle;
  }
  return img;
}

// Flooding with a priority queue of (level, arrival): `prio(q, p)` is the
// priority of q queued from p (pixel indices).
inline Grid floodReference(Grid markers, bool conn8, bool lines, int64_t boundary,
                           const std::function<int(size_t, size_t)>& prio, bool reliefOnly) {
  const int w = markers.w, h = markers.h, nb = conn8 ? 8 : 4;
  using Entry = std::tuple<int, int64_t, size_t>;
  std::priority_queue<Entry, std::vector<Entry>, std::greater<Entry>> queue;
  std::vector<char> queued(markers.v.size(), 0);
  int64_t arrival = 0;
  auto labelled = [&](int64_t v) { return v != 0 && v != boundary; };
  for (int y = 0; y < h; ++y)
    for (int x = 0; x < w; ++x) {
      if (markers.at(x, y) != 0) continue;
      int best = 1 << 30;
      for (int k = 0; k < nb; ++k) {
        const int nx = x + kDx[k], ny = y + kDy[k];
        if (!markers.inside(nx, ny) || !labelled(markers.at(nx, ny))) continue;
        best = std::min(best, prio(size_t(y) * w + x, size_t(ny) * w + nx));
        if (reliefOnly) break;
      }
      if (best == (1 << 30)) continue;
      queue.emplace(best, arrival++, size_t(y) * w + x);
      queued[size_t(y) * w + x] = 1;
    }
  while (!queue.empty()) {
    const auto [level, order, q] = queue.top();
    (void)order;
    queue.pop();
    const int x = int(q % w), y = int(q / w);
    int64_t label = 0;
    bool conflict = false;
    for (int k = 0; k < nb; ++k) {
      const int nx = x + kDx[k], ny = y + kDy[k];
      if (!markers.inside(nx, ny) || !labelled(markers.at(nx, ny))) continue;
      if (label == 0)
        label = markers.at(nx, ny);
      else if (markers.at(nx, ny) != label)
        conflict = true;
    }
    if (lines && conflict) {
      markers.at(x, y) = boundary;
      continue;
    }
    markers.at(x, y) = label;
    for (int k = 0; k < nb; ++k) {
      const int nx = x + kDx[k], ny = y + kDy[k];
      if (!markers.inside(nx, ny)) continue;
      const size_t j = size_t(ny) * w + nx;
      if (queued[j] || markers.at(nx, ny) != 0) continue;
      queued[j] = 1;
      queue.emplace(std::max(level, prio(j, q)), arrival++, j);
    }
  }
  return markers;
}

// Boundaries on a copy: compare with the right and lower neighbours (and the
// lower diagonals with 8-connectivity) of the original.
inline Grid boundReference(const Grid& g, bool conn8, int64_t val) {
  Grid out = g;
  for (int y = 0; y < g.h; ++y)
    for (int x = 0; x < g.w; ++x) {
      const int dx[4] = {1, 0, -1, 1}, dy[4] = {0, 1, 1, 1};
      for (int k = 0; k < (conn8 ? 4 : 2); ++k)
        if (g.inside(x + dx[k], y + dy[k]) && g.at(x + dx[k], y + dy[k]) != g.at(x, y)) out.at(x, y) = val;
    }
  return out;
}

}  // namespace zeltest

#endif  // ZELCV_TESTS_SEGMENTATION_REFERENCE_H
