// Internal routines of the frame: argument checks, allocation and the load
// routine.
#include <gtest/gtest.h>

#include <cstdint>
#include <type_traits>

#include "core/alloc.h"
#include "core/checks.h"
#include "core/load.h"
#include "kernels/dispatch.h"
#include "support/fault_injection.h"
#include "zelcore.h"

namespace {

using zelcv::checkImages;
using zelcv::image;
using zelcv::maskImage;

// A typical two-source masked operation: 8u source, mask, 32f accumulator.
ZelStatus checkMaskedAccumulate(const Zel8u* src, int srcStep, const Zel8u* mask, int maskStep,
                                const Zel32f* acc, int accStep, ZeliSize roi) {
  return checkImages({image(src, srcStep), maskImage(mask, maskStep), image(acc, accStep)}, roi);
}

TEST(Checks, FixedOrderOnRepresentativeArguments) {
  Zel8u bytes[64] = {};
  Zel32f floats[64] = {};
  const ZeliSize roi{4, 2};
  EXPECT_EQ(checkMaskedAccumulate(bytes, 4, bytes, 4, floats, 16, roi), zelStatusOk);
  // Pointers first, whatever else is wrong.
  EXPECT_EQ(checkMaskedAccumulate(nullptr, 0, bytes, 0, floats, 3, {0, 0}), zelStatusNullPointer);
  EXPECT_EQ(checkMaskedAccumulate(bytes, 4, nullptr, 4, floats, 16, roi), zelStatusNullPointer);
  EXPECT_EQ(checkMaskedAccumulate(bytes, 4, bytes, 4, nullptr, 16, roi), zelStatusNullPointer);
  // Then the size, before any step.
  EXPECT_EQ(checkMaskedAccumulate(bytes, 0, bytes, 0, floats, 3, {0, 2}), zelStatusBadSize);
  EXPECT_EQ(checkMaskedAccumulate(bytes, 0, bytes, 0, floats, 3, {4, -1}), zelStatusBadSize);
  // Steps against row bytes; equality is fine, zero or negative never.
  EXPECT_EQ(checkMaskedAccumulate(bytes, 3, bytes, 4, floats, 16, roi), zelStatusBadStep);
  EXPECT_EQ(checkMaskedAccumulate(bytes, 4, bytes, 3, floats, 16, roi), zelStatusBadStep);
  EXPECT_EQ(checkMaskedAccumulate(bytes, 4, bytes, 4, floats, 15, roi), zelStatusBadStep);
  EXPECT_EQ(checkMaskedAccumulate(bytes, -4, bytes, 4, floats, 16, roi), zelStatusBadStep);
  // A bad step wins over a misaligned one.
  EXPECT_EQ(checkMaskedAccumulate(bytes, 3, bytes, 4, floats, 18, roi), zelStatusBadStep);
  // Alignment: only the 32f step; odd 8u and mask steps pass.
  EXPECT_EQ(checkMaskedAccumulate(bytes, 5, bytes, 7, floats, 18, roi), zelStatusMisalignedStep);
  EXPECT_EQ(checkMaskedAccumulate(bytes, 5, bytes, 7, floats, 20, roi), zelStatusOk);
}

TEST(Checks, ElementSizesChannelsAndBitImages) {
  Zel16u words[64] = {};
  Zel8u bytes[64] = {};
  const ZeliSize roi{5, 1};
  EXPECT_EQ(checkImages({image(words, 10)}, roi), zelStatusOk);
  EXPECT_EQ(checkImages({image(words, 11)}, roi), zelStatusMisalignedStep);
  EXPECT_EQ(checkImages({image(words, 30, 3)}, roi), zelStatusOk);
  EXPECT_EQ(checkImages({image(words, 28, 3)}, roi), zelStatusBadStep);
  EXPECT_EQ(checkImages({zelcv::bitImage(bytes, 1)}, roi), zelStatusOk);
  EXPECT_EQ(checkImages({zelcv::bitImage(bytes, 1)}, {9, 1}), zelStatusBadStep);
  // Other pointers (states, outputs) are tested with the images, before the size.
  EXPECT_EQ(checkImages({image(bytes, 5)}, {0, 0}, {nullptr}), zelStatusNullPointer);
  // Size queries: the output pointer before the size.
  int out = 0;
  EXPECT_EQ(zelcv::checkSizeQuery({0, 0}, nullptr), zelStatusNullPointer);
  EXPECT_EQ(zelcv::checkSizeQuery({0, 1}, &out), zelStatusBadSize);
  EXPECT_EQ(zelcv::checkSizeQuery({1, 1}, &out), zelStatusOk);
}

TEST(Allocation, RoutinesGoThroughTheSupportLibrary) {
  zeltest::FaultInjection faults;
  EXPECT_EQ(zelcv::allocBytes(0), nullptr);
  EXPECT_EQ(zelcv::allocBytes(-3), nullptr);
  EXPECT_EQ(zelcv::alloc16(0), nullptr);
  EXPECT_EQ(zelcv::alloc32(-1), nullptr);
  EXPECT_EQ(faults.allocations(), 0) << "non-positive counts must not reach zelMalloc";
  void* blocks[3] = {zelcv::allocBytes(3), zelcv::alloc16(5), zelcv::alloc32(7)};
  for (void* b : blocks) {
    ASSERT_NE(b, nullptr);
    EXPECT_EQ(reinterpret_cast<uintptr_t>(b) % ZELCORE_ALIGNMENT, 0u);
  }
  // Writing the whole requested extent is valid (checked by the sanitizers).
  static_cast<uint8_t*>(blocks[0])[2] = 1;
  static_cast<uint16_t*>(blocks[1])[4] = 1;
  static_cast<uint32_t*>(blocks[2])[6] = 1;
  for (void* b : blocks) zelcv::release(b);
  EXPECT_EQ(faults.liveBlocks(), 0);
  faults.failAllocationsFrom(faults.allocations());
  EXPECT_EQ(zelcv::allocBytes(10), nullptr);
}

TEST(Allocation, AlignUpPlacesInsideTheBlock) {
  alignas(64) uint8_t block[128];
  for (int offset = 0; offset < 64; ++offset) {
    uint8_t* p = zelcv::alignUp(block + offset, 32);
    EXPECT_EQ(reinterpret_cast<uintptr_t>(p) % 32, 0u);
    EXPECT_GE(p, block + offset);
    EXPECT_LT(p, block + offset + 32);
  }
  EXPECT_EQ(zelcv::alignSize(1, 16), 16);
  EXPECT_EQ(zelcv::alignSize(32, 16), 32);
}

}  // namespace

namespace {

// 0, 1 or 2 for the SSE2, AVX2 or AVX-512 kernels that a family with kernels
// up to kWidest runs.
template <zelcv::IsaLevel kWidest>
int chosenLevel() {
  return zelcv::withChosenIsa<kWidest>([](auto isa) {
    using Isa = typename decltype(isa)::Isa;
    return std::is_same<Isa, zelcv::avx512::Isa>::value ? 2 : std::is_same<Isa, zelcv::avx2::Isa>::value ? 1 : 0;
  });
}

TEST(LoadRoutine, ActsOnProcessAttachOnlyAndAlwaysSucceeds) {
  struct Case {
    uint32_t mask;
    int flag;
    bool avx2, avx512;
  } cases[] = {{0x30, 1, false, false},   {0xFFFFFFFF, 1, true, true}, {0x10, 0, false, false},
               {0x20, 0, false, false},   {0, 0, false, false},        {0x3F, 1, false, false},
               {0x700, 0, true, false},   {0x500, 0, false, false},    {0x600, 0, false, false},
               {0x300, 0, false, false},  {0x400, 0, false, false},    {0x1F00, 0, true, true},
               {0x1800, 0, false, false}, {0xF00, 0, true, false},     {0x1700, 0, true, false},
               {0x1B00, 0, false, false}};
  for (const Case& c : cases) {
    zeltest::FaultInjection faults;
    faults.setCpuFeatures(c.mask);
    EXPECT_EQ(zelcv::onLibraryLoad(nullptr, zelcv::kProcessAttach, nullptr), 1);
    EXPECT_EQ(faults.cpuFeatureQueries(), 1);
    EXPECT_EQ(zelcv::cpuFeatureFlag(), c.flag) << std::hex << c.mask;
    EXPECT_EQ(zelcv::useAvx2Kernels(), c.avx2) << std::hex << c.mask;
    EXPECT_EQ(zelcv::useAvx512Kernels(), c.avx512) << std::hex << c.mask;
    // A family gets the widest of its own kernels that the choice allows.
    EXPECT_EQ(chosenLevel<zelcv::IsaLevel::Avx512>(), c.avx512 ? 2 : c.avx2 ? 1 : 0) << std::hex << c.mask;
    EXPECT_EQ(chosenLevel<zelcv::IsaLevel::Avx2>(), c.avx2 ? 1 : 0) << std::hex << c.mask;
    EXPECT_EQ(chosenLevel<zelcv::IsaLevel::Sse2>(), 0);
    // Every other reason leaves the choices and makes no query.
    faults.setCpuFeatures(~c.mask);
    for (uint32_t reason : {0u, 2u, 3u, 4u, 99u}) {
      EXPECT_EQ(zelcv::onLibraryLoad(nullptr, reason, nullptr), 1);
      EXPECT_EQ(zelcv::cpuFeatureFlag(), c.flag);
      EXPECT_EQ(zelcv::useAvx2Kernels(), c.avx2);
      EXPECT_EQ(zelcv::useAvx512Kernels(), c.avx512);
    }
    EXPECT_EQ(faults.cpuFeatureQueries(), 1);
  }
  // Back to what this processor has, for the tests that follow.
  zelcv::onLibraryLoad(nullptr, zelcv::kProcessAttach, nullptr);
}

}  // namespace
