// Reads the role strings of the torture table and makes calls from them:
// memory for every image, buffer and state, one argument frame, optional
// mutations, and what the call did to that memory and to the allocator.
#ifndef ZELCV_TESTS_TORTURE_ENGINE_H
#define ZELCV_TESTS_TORTURE_ENGINE_H

#include <cstdint>
#include <string>
#include <vector>

#include "torture/torture.h"

namespace zeltorture {

enum class Role {
  Image,     // pointer and step (in, out, io, mask)
  BitImage,  // pointer, step and bit offset (bin, bout)
  Rows,      // array of row pointers (rin, rout)
  Roi,       // ZeliSize ROI
  RoiWidth,  // int ROI width
  Size,      // other ZeliSize (sz=)
  Point,     // pt=
  Rect,      // rect=
  Scalar,    // =value
  Border,    // border=first[,alternatives]
  Array,     // arr=count[:value]
  Result,    // int* result (res)
  Buffer,    // work buffer (buf)
  Block,     // caller block an Init builds into (blk)
  State,     // state=maker
  New,       // InitAlloc output, new=maker
  Object,    // object a Free releases, obj=maker
  Null       // always null
};

struct Arg {
  Role role = Role::Scalar;
  int param = 0;        // index of the first parameter it covers
  char dir = 'i';       // images: 'i' in, 'o' out, 'b' both, 'm' mask
  int channels = 1;
  int elemSize = 1;
  bool floating = false;
  int extraCols = 0;    // columns beyond the ROI counted by the step check
  int extraRows = 0;
  int readCols = 0;     // columns beyond those read but not counted by the step check
  int scale = 1;        // images and roi: 2 doubles the ROI (:x2), -2 halves it rounding up (:d2)
  int rowsExtra = 0;    // Rows: height + rowsExtra pointers
  bool alignChecked = true;
  char rank = 'p';      // null check: 'p' with the pointers, 's' after the size, 't' after the steps
  bool nullable = true; // the pointer is tested for null
  bool boundW = false;  // ROI: a width above the state's gives -6
  bool boundH = false;  // ROI: heights near INT_MAX give -6 (a state's or buffer's limit)
  bool boundHuge = false;  // ROI: widths near INT_MAX give -6 once the steps hold them
  std::vector<double> values;
  int count = 0;
  std::size_t bytes = 0;
  std::string maker;
  ZeliSize size{0, 0};
  ZeliPoint point{0, 0};
  ZeliRect rect{0, 0, 0, 0};

  bool isImage() const { return role == Role::Image || role == Role::BitImage; }
  bool stepped() const { return isImage(); }
  bool pointer() const;
  // A ROI dimension as this image or size sees it.
  int64_t scaled(int64_t n) const { return scale == 2 ? 2 * n : scale == -2 ? (n + 1) / 2 : n; }
  // Bytes the step of an image must reach for a ROI width.
  int64_t checkedRowBytes(int64_t width) const;
  bool readsPixels() const { return (role == Role::Image && dir != 'o') || (role == Role::Rows && dir == 'i') ||
                                    (role == Role::BitImage && dir == 'i'); }
  bool writesPixels() const { return dir == 'o' || dir == 'b'; }
};

// Parses an entry's roles against its parameters; an error message or "".
std::string parseRoles(const Entry& e, std::vector<Arg>& args);

enum class Placement { Guarded, PageEnd, PageBegin };

struct Mutation {
  enum Kind { Null, RowEntryNull, Width, Height, RoiWidth, Step, BitOffset } kind;
  int arg = -1;           // which argument (Null, RowEntryNull, Step, BitOffset)
  long long value = 0;
};

struct Variant {
  ZeliSize roi{13, 7};          // what the memory is made for
  int pageArg = -1;             // this image's rows end (or begin) at an inaccessible page
  bool pageBegin = false;
  bool odd = false;             // odd steps where accepted, odd buffer and state addresses
  int border = 0;               // which border alternative
  std::vector<Mutation> mutations;
  bool catchFaults = false;     // a fault inside the call returns (rows against a page)
  bool countAllocations = true; // false: no fault injection, so that threads may run calls at once
};

constexpr ZelStatus kFaulted = -100000;

struct Outcome {
  ZelStatus status = 0;
  bool faulted = false;         // the call touched inaccessible memory (status is then kFaulted)
  std::string setupError;       // a state maker failed, or similar
  bool untouched = true;        // every image, result and block holds what it held before
  bool imagesUntouched = true;  // the same, leaving out the blocks an Init builds into
  bool guardsIntact = true;     // nothing written outside any image, buffer or block
  int liveBlocks = 0;           // allocations left behind (after releasing a New object)
  int allocations = 0;          // zelMalloc calls made by the call
  std::vector<std::vector<uint8_t>> outputs;  // output pixels and results, row by row
  std::vector<long long> results;             // the int results
};

// Calls the export; failAllocationsFrom >= 0 makes that allocation fail.
Outcome run(const Entry& e, const std::vector<Arg>& args, const Variant& v, int failAllocationsFrom = -1);

// All entries, parsed; fails the calling test on a parse error.
struct Described {
  const Entry* entry;
  std::vector<Arg> args;
};
const std::vector<Described>& described();

}  // namespace zeltorture

#endif  // ZELCV_TESTS_TORTURE_ENGINE_H
