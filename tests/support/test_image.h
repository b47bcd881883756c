// A test image whose rows sit inside a larger block: guard bytes before and
// after the image, and padding at the end of every row, all holding a
// sentinel. Every test checks that a call left the sentinel intact, so a
// kernel that writes one element too far is caught where it happens.
#ifndef ZELCV_TESTS_TEST_IMAGE_H
#define ZELCV_TESTS_TEST_IMAGE_H

#include <cstdint>
#include <cstring>
#include <random>
#include <vector>

#include "zelcv.h"

namespace zeltest {

constexpr uint8_t kSentinel = 0xA5;
constexpr int kGuardBytes = 64;

struct Layout {
  int width = 1;
  int height = 1;
  int channels = 1;
  int padBytes = 0;     // extra bytes at the end of each row (any count)
  int offsetBytes = 0;  // start address = 64-byte aligned base + offset
};

template <typename T>
class TestImage {
 public:
  explicit TestImage(const Layout& layout) : layout_(layout) {
    rowBytes_ = layout.width * layout.channels * int(sizeof(T));
    step_ = rowBytes_ + layout.padBytes;
    size_t bytes = size_t(kGuardBytes) * 2 + size_t(step_) * layout.height + 128;
    block_.assign(bytes, kSentinel);
    uintptr_t base = reinterpret_cast<uintptr_t>(block_.data()) + kGuardBytes;
    base = (base + 63) & ~uintptr_t(63);
    start_ = reinterpret_cast<uint8_t*>(base) + layout.offsetBytes;
    for (int y = 0; y < layout.height; ++y) std::memset(row(y), 0, rowBytes_);
  }

  int width() const { return layout_.width; }
  int height() const { return layout_.height; }
  int channels() const { return layout_.channels; }
  int step() const { return step_; }
  ZeliSize size() const { return {layout_.width, layout_.height}; }
  T* data() { return reinterpret_cast<T*>(start_); }
  const T* data() const { return reinterpret_cast<const T*>(start_); }
  T* row(int y) { return reinterpret_cast<T*>(start_ + size_t(y) * step_); }
  const T* row(int y) const { return reinterpret_cast<const T*>(start_ + size_t(y) * step_); }
  T& at(int x, int y, int c = 0) { return row(y)[x * layout_.channels + c]; }
  const T& at(int x, int y, int c = 0) const { return row(y)[x * layout_.channels + c]; }

  // Uniform values over [lo, hi] (integers) or [lo, hi) (floats).
  template <typename V>
  void fillRandom(std::mt19937& rng, V lo, V hi) {
    for (int y = 0; y < height(); ++y)
      for (int i = 0; i < width() * channels(); ++i) row(y)[i] = draw<V>(rng, lo, hi);
  }

  // True when every byte outside the image's rows still holds the sentinel.
  bool sentinelIntact() const {
    const uint8_t* first = block_.data();
    const uint8_t* last = block_.data() + block_.size();
    for (const uint8_t* p = first; p < start_; ++p)
      if (*p != kSentinel) return false;
    for (int y = 0; y < layout_.height; ++y) {
      const uint8_t* pad = start_ + size_t(y) * step_ + rowBytes_;
      for (int i = 0; i < layout_.padBytes; ++i)
        if (pad[i] != kSentinel) return false;
    }
    for (const uint8_t* p = start_ + size_t(step_) * layout_.height; p < last; ++p)
      if (*p != kSentinel) return false;
    return true;
  }

  // Bitwise comparison of the image contents.
  bool sameAs(const TestImage& other) const {
    if (width() != other.width() || height() != other.height()) return false;
    for (int y = 0; y < height(); ++y)
      if (std::memcmp(row(y), other.row(y), rowBytes_) != 0) return false;
    return true;
  }

 private:
  template <typename V>
  static T draw(std::mt19937& rng, V lo, V hi) {
    if constexpr (std::is_floating_point<V>::value)
      return T(std::uniform_real_distribution<V>(lo, hi)(rng));
    else
      return T(std::uniform_int_distribution<long long>(lo, hi)(rng));
  }

  Layout layout_;
  int rowBytes_ = 0;
  int step_ = 0;
  std::vector<uint8_t> block_;
  uint8_t* start_ = nullptr;
};

// A random layout: width and height in [1, maxWidth] x [1, maxHeight], row
// padding 0..rowPadMax bytes (keeping the step a multiple of `stepMultiple`),
// start offset a multiple of `offsetMultiple` below 16.
inline Layout randomLayout(std::mt19937& rng, int maxWidth, int maxHeight, int channels,
                           int stepMultiple, int offsetMultiple = 1, int rowPadMax = 19) {
  Layout l;
  l.width = std::uniform_int_distribution<int>(1, maxWidth)(rng);
  l.height = std::uniform_int_distribution<int>(1, maxHeight)(rng);
  l.channels = channels;
  l.padBytes = std::uniform_int_distribution<int>(0, rowPadMax / stepMultiple)(rng) * stepMultiple;
  l.offsetBytes = std::uniform_int_distribution<int>(0, 15 / offsetMultiple)(rng) * offsetMultiple;
  return l;
}

}  // namespace zeltest

#endif  // ZELCV_TESTS_TEST_IMAGE_H
