// Every export under bad arguments, generated from the torture table: each
// failure gives its documented code in the library's check order, writes
// nothing and leaves no allocation behind; valid calls read no byte outside
// their rows (rows against an inaccessible page) and take odd steps and odd
// buffer addresses.
#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <set>
#include <string>

#include "support/exports.h"
#include "torture/engine.h"

namespace zeltorture {
namespace {

using Kind = Mutation::Kind;

bool hasImages(const Described& d) {
  for (const Arg& s : d.args)
    if (s.isImage() || s.role == Role::Rows) return true;
  return false;
}

int firstStepped(const Described& d) {
  for (std::size_t i = 0; i < d.args.size(); ++i)
    if (d.args[i].stepped()) return int(i);
  return -1;
}

bool has(const Described& d, Role r) {
  for (const Arg& s : d.args)
    if (s.role == r) return true;
  return false;
}

// A width or height mutation that the entry understands, or none.
std::vector<Mutation> badSize(const Described& d, long long value, bool height = false) {
  if (has(d, Role::Roi)) return {{height ? Kind::Height : Kind::Width, -1, value}};
  if (has(d, Role::RoiWidth) && !height) return {{Kind::RoiWidth, -1, value}};
  return {};
}

std::string describeMutations(const Variant& v) {
  static const char* names[] = {"null", "row entry null", "width", "height", "roi width", "step", "bit offset"};
  std::string out = "roi " + std::to_string(v.roi.width) + "x" + std::to_string(v.roi.height);
  for (const Mutation& m : v.mutations)
    out += std::string(", ") + names[m.kind] + (m.arg >= 0 ? " of argument " + std::to_string(m.arg) : "") + " = " +
           std::to_string(m.value);
  return out;
}

// The call fails with `code`, writes nothing and keeps nothing.
void expectRefused(const Described& d, const Variant& v, ZelStatus code) {
  Outcome o = run(*d.entry, d.args, v);
  ASSERT_EQ(o.setupError, "") << d.entry->name;
  EXPECT_FALSE(o.faulted) << d.entry->name << " faulted: " << describeMutations(v);
  if (o.faulted) return;
  EXPECT_EQ(o.status, code) << d.entry->name << ": " << describeMutations(v);
  EXPECT_TRUE(o.untouched) << d.entry->name << " wrote on failure: " << describeMutations(v);
  EXPECT_TRUE(o.guardsIntact) << d.entry->name << ": " << describeMutations(v);
  EXPECT_EQ(o.liveBlocks, 0) << d.entry->name << " leaked: " << describeMutations(v);
}

TEST(Torture, EveryExportIsDescribed) {
  std::set<std::string> names;
  for (const Described& d : described()) names.insert(d.entry->name);
  for (const zeltest::ExportEntry& e : zeltest::exportListing())
    EXPECT_TRUE(names.count(e.name)) << e.name << " has no line in the torture table (tests/torture/)";
}

TEST(Torture, DescribedCallsSucceed) {
  for (const Described& d : described()) {
    Outcome o = run(*d.entry, d.args, Variant{});
    ASSERT_EQ(o.setupError, "") << d.entry->name;
    EXPECT_EQ(o.status, zelStatusOk) << d.entry->name << " refuses the described call";
    EXPECT_TRUE(o.guardsIntact) << d.entry->name;
    EXPECT_EQ(o.liveBlocks, 0) << d.entry->name;
  }
}

TEST(Torture, NullPointers) {
  for (const Described& d : described()) {
    const int stepped = firstStepped(d);
    for (std::size_t i = 0; i < d.args.size(); ++i) {
      const Arg& s = d.args[i];
      if (!s.pointer() || !s.nullable) continue;
      std::vector<Mutation> kinds = {{Kind::Null, int(i), 0}};
      if (s.role == Role::Rows) kinds.push_back({Kind::RowEntryNull, int(i), 0});
      for (const Mutation& m : kinds) {
        const char rank = m.kind == Kind::RowEntryNull ? 's' : s.rank;
        Variant v;
        v.mutations = {m};
        expectRefused(d, v, zelStatusNullPointer);
        // Against a bad size: pointers first, unless this one is tested later.
        std::vector<Mutation> size = badSize(d, 0);
        if (!size.empty()) {
          v.mutations = {m, size[0]};
          expectRefused(d, v, rank == 'p' ? zelStatusNullPointer : zelStatusBadSize);
        }
        if (stepped >= 0) {
          v.mutations = {m, {Kind::Step, stepped, 0}};
          expectRefused(d, v, rank == 't' ? zelStatusBadStep : zelStatusNullPointer);
        }
      }
    }
  }
}

TEST(Torture, SizesZeroAndNegative) {
  for (const Described& d : described()) {
    const int stepped = firstStepped(d);
    for (long long value : {0LL, -1LL, (long long)INT_MIN}) {
      for (bool height : {false, true}) {
        std::vector<Mutation> size = badSize(d, value, height);
        if (size.empty()) continue;
        Variant v;
        v.mutations = size;
        expectRefused(d, v, zelStatusBadSize);
        if (stepped >= 0) {
          v.mutations.push_back({Kind::Step, stepped, 0});
          expectRefused(d, v, zelStatusBadSize);
        }
      }
    }
    for (std::size_t i = 0; i < d.args.size(); ++i)
      if (d.args[i].role == Role::BitImage) {
        Variant v;
        v.mutations = {{Kind::BitOffset, int(i), -1}};
        expectRefused(d, v, zelStatusBadSize);
      }
  }
}

TEST(Torture, StepsBelowTheRowAndMisaligned) {
  for (const Described& d : described()) {
    Variant base;
    for (std::size_t i = 0; i < d.args.size(); ++i) {
      const Arg& s = d.args[i];
      if (!s.stepped()) continue;
      const long long rowBytes = s.checkedRowBytes(base.roi.width);
      for (long long step : {0LL, -rowBytes, (long long)INT_MIN, rowBytes - 1}) {
        Variant v;
        v.mutations = {{Kind::Step, int(i), step}};
        expectRefused(d, v, zelStatusBadStep);
      }
      if (s.alignChecked && s.elemSize > 1) {
        for (int add = 1; add < s.elemSize; add *= 2) {
          Variant v;
          v.mutations = {{Kind::Step, int(i), rowBytes + add}};
          expectRefused(d, v, zelStatusMisalignedStep);
        }
      }
    }
  }
}

// Widths whose row bytes do not fit in 32 bits for some element size and
// channel count, and the largest widths.
const long long kHugeWidths[] = {INT_MAX, INT_MAX - 1, 0x40000001, 0x20000001, 0x10000001, 0x55555556, 0x2AAAAAAB};

TEST(Torture, SizesNearIntMax) {
  for (const Described& d : described()) {
    if (firstStepped(d) >= 0) {
      // Any huge width with the steps of a small image fails the step test.
      for (long long w : kHugeWidths) {
        Variant v;
        v.mutations = badSize(d, w);
        expectRefused(d, v, zelStatusBadStep);
      }
      const Arg* roi = nullptr;
      for (const Arg& s : d.args)
        if (s.role == Role::Roi) roi = &s;
      if (!roi) continue;
      // A width above the state's with steps that hold it, up to INT_MAX.
      if (roi->boundW || roi->boundHuge) {
        for (long long w : {14LL, (long long)INT_MAX - 1, (long long)INT_MAX}) {
          if (w == 14 && !roi->boundW) continue;
          Variant v;
          v.roi = {13, 1};
          v.mutations = badSize(d, w);
          bool fits = true;
          for (std::size_t i = 0; i < d.args.size(); ++i)
            if (d.args[i].stepped()) {
              long long bytes = d.args[i].checkedRowBytes(w);
              if (bytes > INT_MAX) fits = false;
              v.mutations.push_back({Kind::Step, int(i), bytes});
            }
          if (fits) expectRefused(d, v, zelStatusBadSize);
        }
      }
      // Heights that a state's intermediate image cannot hold, for every
      // border the entry names.
      if (roi->boundH) {
        std::size_t borders = 1;
        for (const Arg& s : d.args)
          if (s.role == Role::Border) borders = s.values.size();
        for (long long hgt : {(long long)INT_MAX, (long long)INT_MAX - 1, (long long)INT_MAX / 2 + 1})
          for (std::size_t b = 0; b < borders; ++b) {
            Variant v;
            v.border = int(b);
            v.mutations = badSize(d, hgt, true);
            expectRefused(d, v, zelStatusBadSize);
          }
      }
      continue;
    }
    // Queries, Init and InitAlloc: refused as too big, or answered with no
    // less than for a small size (a wrapped size would be smaller).
    Outcome small = run(*d.entry, d.args, Variant{});
    for (bool height : {false, true})
      for (long long n : kHugeWidths) {
        Variant v;
        v.mutations = badSize(d, n, height);
        if (v.mutations.empty()) continue;
        Outcome o = run(*d.entry, d.args, v);
        SCOPED_TRACE(d.entry->name + ": " + describeMutations(v));
        EXPECT_TRUE(o.status == zelStatusOk || o.status == zelStatusBadSize || o.status == zelStatusOutOfMemory)
            << o.status;
        EXPECT_TRUE(o.guardsIntact);
        EXPECT_EQ(o.liveBlocks, 0);
        if (o.status != zelStatusOk) {
          EXPECT_TRUE(o.untouched);
        } else {
          for (std::size_t k = 0; k < o.results.size(); ++k) EXPECT_GE(o.results[k], small.results[k]);
        }
      }
  }
}

TEST(Torture, RowsAgainstAnInaccessiblePage) {
  for (const Described& d : described()) {
    if (!hasImages(d)) continue;
    for (int w = 1; w <= 70; ++w)
      for (std::size_t i = 0; i < d.args.size(); ++i) {
        if (!d.args[i].readsPixels()) continue;
        for (bool begin : {false, true}) {
          Variant v;
          v.roi = {w, 1};
          v.pageArg = int(i);
          v.pageBegin = begin;
          v.catchFaults = true;
          Outcome o = run(*d.entry, d.args, v);
          ASSERT_EQ(o.setupError, "") << d.entry->name;
          const std::string where = d.entry->name + " width " + std::to_string(w) + ", argument " +
                                    std::to_string(i) + (begin ? " beginning at" : " ending at") +
                                    " an inaccessible page";
          EXPECT_FALSE(o.faulted) << where << ": faulted";
          if (o.faulted) continue;
          EXPECT_EQ(o.status, zelStatusOk) << where;
          EXPECT_TRUE(o.guardsIntact) << where;
        }
      }
  }
}

TEST(Torture, OddStepsAndBufferAddresses) {
  for (const Described& d : described()) {
    if (!hasImages(d)) continue;
    for (ZeliSize roi : {ZeliSize{13, 7}, ZeliSize{1, 1}, ZeliSize{70, 3}, ZeliSize{5, 9}}) {
      Variant aligned;
      aligned.roi = roi;
      Variant odd = aligned;
      odd.odd = true;
      Outcome a = run(*d.entry, d.args, aligned);
      Outcome b = run(*d.entry, d.args, odd);
      ASSERT_EQ(b.setupError, "") << d.entry->name;
      EXPECT_EQ(a.status, zelStatusOk) << d.entry->name;
      EXPECT_EQ(b.status, zelStatusOk) << d.entry->name << " refuses odd steps or buffers";
      EXPECT_TRUE(b.guardsIntact) << d.entry->name;
      EXPECT_TRUE(a.outputs == b.outputs) << d.entry->name << " " << roi.width << "x" << roi.height
                                          << ": odd steps or buffers change the result";
    }
  }
}

TEST(Torture, AllocationFailuresReleaseEverything) {
  for (const Described& d : described()) {
    Outcome full = run(*d.entry, d.args, Variant{});
    for (int k = 0; k < full.allocations; ++k) {
      Outcome o = run(*d.entry, d.args, Variant{}, k);
      EXPECT_EQ(o.status, zelStatusOutOfMemory) << d.entry->name << " allocation " << k;
      // An Init may have built part of a state into the caller's block.
      EXPECT_TRUE(o.imagesUntouched) << d.entry->name << " allocation " << k;
      EXPECT_EQ(o.liveBlocks, 0) << d.entry->name << " allocation " << k;
    }
  }
}

}  // namespace
}  // namespace zeltorture
