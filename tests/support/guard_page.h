// Memory that ends (or begins) exactly at an inaccessible page, so that a
// kernel reading or writing even one byte outside an image's rows faults at
// once instead of reading a neighbour's bytes unnoticed.
//
//   zeltest::GuardedImage<Zel32f> img(width, height, channels, zeltest::GuardSide::After);
//   ASSERT_TRUE(img.ok());
//   fill img.row(y)[0 .. width*channels-1] ...
//   zeliSomething(img.data(), img.step(), ...);      // a read past the last row faults
//
// Layouts:
//  - packed (default): rows follow each other at img.step() (the row bytes,
//    or any larger step you pass); with GuardSide::After the last row ends
//    exactly where an inaccessible page begins, with GuardSide::Before the
//    first row begins exactly where one ends.
//  - every row (everyRow = true): each row gets its own guard page, so every
//    row (not only the last or first) ends (After) or begins (Before) at one.
//    The step is then a multiple of the page size (> row bytes).
//
// Memory comes from mmap + mprotect (POSIX) or VirtualAlloc + VirtualProtect
// (Windows); nothing is allocated through the library's allocator. ok() is
// false only when the system refused the pages. Contents start zeroed.
#ifndef ZELCV_TESTS_GUARD_PAGE_H
#define ZELCV_TESTS_GUARD_PAGE_H

#include <cstddef>
#include <cstdint>

namespace zeltest {

// Bytes in one page of the running system.
size_t pageSize();

// `pages` read/write pages; protect(i) makes page i inaccessible.
class GuardedPages {
 public:
  explicit GuardedPages(size_t pages);
  ~GuardedPages();
  GuardedPages(const GuardedPages&) = delete;
  GuardedPages& operator=(const GuardedPages&) = delete;

  bool ok() const { return base_ != nullptr; }
  uint8_t* base() const { return base_; }
  size_t bytes() const { return bytes_; }
  bool protect(size_t page);

 private:
  uint8_t* base_ = nullptr;
  size_t bytes_ = 0;
};

enum class GuardSide { After, Before };

// Byte layout of an image inside guarded pages (type-free; GuardedImage
// below adds the element type).
class GuardedRows {
 public:
  // rowBytes > 0, height > 0; step = 0 means step = rowBytes (ignored when
  // everyRow is set). Under GuardSide::After with a packed layout, the
  // addresses are placed so that start + step*(height-1) + rowBytes is the
  // first inaccessible byte.
  GuardedRows(size_t rowBytes, int height, GuardSide side, size_t step = 0, bool everyRow = false);

  bool ok() const { return pages_.ok() && start_ != nullptr; }
  uint8_t* start() const { return start_; }
  uint8_t* row(int y) const { return start_ + size_t(y) * step_; }
  size_t step() const { return step_; }
  size_t rowBytes() const { return rowBytes_; }
  int height() const { return height_; }

 private:
  static size_t pagesFor(size_t rowBytes, int height, size_t step, bool everyRow);
  GuardedPages pages_;
  uint8_t* start_ = nullptr;
  size_t rowBytes_;
  size_t step_;
  int height_;
};

template <typename T>
class GuardedImage {
 public:
  // width pixels of `channels` elements of T per row; stepBytes as for GuardedRows.
  GuardedImage(int width, int height, int channels, GuardSide side, size_t stepBytes = 0,
               bool everyRow = false)
      : rows_(size_t(width) * size_t(channels) * sizeof(T), height, side, stepBytes, everyRow),
        width_(width), channels_(channels) {}

  bool ok() const { return rows_.ok(); }
  int width() const { return width_; }
  int height() const { return rows_.height(); }
  int channels() const { return channels_; }
  int step() const { return int(rows_.step()); }
  T* data() const { return reinterpret_cast<T*>(rows_.start()); }
  T* row(int y) const { return reinterpret_cast<T*>(rows_.row(y)); }

 private:
  GuardedRows rows_;
  int width_;
  int channels_;
};

}  // namespace zeltest

#endif
