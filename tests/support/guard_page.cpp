#include "support/guard_page.h"

#if defined(_WIN32)
#include <windows.h>
#else
#include <sys/mman.h>
#include <unistd.h>
#endif

namespace zeltest {

size_t pageSize() {
#if defined(_WIN32)
  SYSTEM_INFO info;
  GetSystemInfo(&info);
  return size_t(info.dwPageSize);
#else
  long size = sysconf(_SC_PAGESIZE);
  return size > 0 ? size_t(size) : 4096;
#endif
}

GuardedPages::GuardedPages(size_t pages) {
  if (pages == 0) return;
  size_t bytes = pages * pageSize();
#if defined(_WIN32)
  void* p = VirtualAlloc(nullptr, bytes, MEM_RESERVE | MEM_COMMIT, PAGE_READWRITE);
  if (!p) return;
#else
  void* p = mmap(nullptr, bytes, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
  if (p == MAP_FAILED) return;
#endif
  base_ = static_cast<uint8_t*>(p);
  bytes_ = bytes;
}

GuardedPages::~GuardedPages() {
  if (!base_) return;
#if defined(_WIN32)
  VirtualFree(base_, 0, MEM_RELEASE);
#else
  munmap(base_, bytes_);
#endif
}

bool GuardedPages::protect(size_t page) {
  size_t size = pageSize();
  if (!base_ || (page + 1) * size > bytes_) return false;
  uint8_t* at = base_ + page * size;
#if defined(_WIN32)
  DWORD old = 0;
  return VirtualProtect(at, size, PAGE_NOACCESS, &old) != 0;
#else
  return mprotect(at, size, PROT_NONE) == 0;
#endif
}

namespace {
size_t pagesCovering(size_t bytes) {
  size_t page = pageSize();
  return (bytes + page - 1) / page;
}
}  // namespace

size_t GuardedRows::pagesFor(size_t rowBytes, int height, size_t step, bool everyRow) {
  if (rowBytes == 0 || height <= 0) return 0;
  if (everyRow) return (pagesCovering(rowBytes) + 1) * size_t(height);
  return pagesCovering(step * size_t(height - 1) + rowBytes) + 1;
}

GuardedRows::GuardedRows(size_t rowBytes, int height, GuardSide side, size_t step, bool everyRow)
    : pages_(pagesFor(rowBytes, height, step ? step : rowBytes, everyRow)),
      rowBytes_(rowBytes),
      step_(step ? step : rowBytes),
      height_(height) {
  if (!pages_.ok() || step_ < rowBytes_) return;
  size_t page = pageSize();
  if (everyRow) {
    // One period per row: the row's pages and one guard page, the guard
    // after the row (After) or before it (Before).
    size_t rowPages = pagesCovering(rowBytes);
    step_ = (rowPages + 1) * page;
    for (int y = 0; y < height; ++y) {
      size_t first = size_t(y) * (rowPages + 1);
      if (!pages_.protect(side == GuardSide::After ? first + rowPages : first)) return;
    }
    start_ = side == GuardSide::After ? pages_.base() + rowPages * page - rowBytes
                                      : pages_.base() + page;
    return;
  }
  size_t total = pages_.bytes() / page;
  if (side == GuardSide::After) {
    if (!pages_.protect(total - 1)) return;
    start_ = pages_.base() + (total - 1) * page - (step_ * size_t(height - 1) + rowBytes);
  } else {
    if (!pages_.protect(0)) return;
    start_ = pages_.base() + page;
  }
}

}  // namespace zeltest
