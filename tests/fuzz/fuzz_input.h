// Reads a fuzzer's bytes as small decisions; past the end every read is 0.
#ifndef ZELCV_TESTS_FUZZ_INPUT_H
#define ZELCV_TESTS_FUZZ_INPUT_H

#include <cstddef>
#include <cstdint>

namespace zelfuzz {

class Input {
 public:
  Input(const uint8_t* data, size_t size) : data_(data), size_(size) {}
  uint8_t byte() { return at_ < size_ ? data_[at_++] : 0; }
  // A value in [lo, hi].
  int range(int lo, int hi) {
    unsigned v = unsigned(byte()) | unsigned(byte()) << 8;
    return lo + int(v % unsigned(hi - lo + 1));
  }
  // Fills with the remaining bytes, repeated (zeros when none are left).
  void fill(uint8_t* out, size_t n) {
    size_t left = size_ - at_;
    for (size_t i = 0; i < n; ++i) out[i] = left ? data_[at_ + i % left] : 0;
  }

 private:
  const uint8_t* data_;
  size_t size_;
  size_t at_ = 0;
};

}  // namespace zelfuzz

#endif  // ZELCV_TESTS_FUZZ_INPUT_H
