// The accumulation and difference exports as data: what each computes, its
// element types, its image arguments in order and its bytes-per-pixel factor
// of the cache rule, with a uniform way to call it. The generic tests in
// arith_test.cpp run over this table.
#ifndef ZELCV_TESTS_ARITH_TABLE_H
#define ZELCV_TESTS_ARITH_TABLE_H

#include <ostream>
#include <vector>

#include "zelcv.h"

namespace arithtest {

enum class Op { Add, Square, Product, Weighted, WeightedTo, AbsDiff, AbsDiffC };
enum class Type { U8, S8, U16, F32 };

inline int elementBytes(Type t) { return t == Type::U16 ? 2 : t == Type::F32 ? 4 : 1; }

// Arguments in a uniform shape: image pointers and steps in argument order.
struct Args {
  void* image[4] = {};
  int step[4] = {};
  ZeliSize roi = {0, 0};
  float alpha = 0.5f;
  double value = 0;  // AbsDiffC: converted to int (8u, 16u) or float (32f)
};

struct Export {
  const char* name;
  Op op;
  Type type;    // source type; also the result type of the differences
  bool masked;
  int channels;
  int bytesPerPixel;  // the cache rule's factor; 0: single path, no query
  ZelStatus (*call)(const Args&);

  bool accumulates() const { return op != Op::AbsDiff && op != Op::AbsDiffC; }
  int sources() const { return op == Op::Product || op == Op::WeightedTo || op == Op::AbsDiff ? 2 : 1; }
};

inline void PrintTo(const Export& e, std::ostream* os) { *os << e.name; }

// One image argument of an export, as the checks see it.
struct Slot {
  int elementBytes;
  int channels;
  bool mask;
};

// Image arguments in order: the sources, the mask, the written image.
inline std::vector<Slot> slotsOf(const Export& e) {
  std::vector<Slot> slots;
  for (int i = 0; i < e.sources(); ++i) slots.push_back({elementBytes(e.type), e.channels, false});
  if (e.masked) slots.push_back({1, 1, true});
  slots.push_back({e.accumulates() ? 4 : elementBytes(e.type), e.channels, false});
  return slots;
}

template <typename T>
T* arg(const Args& a, int i) {
  return static_cast<T*>(a.image[i]);
}

// Adapters from Args to each shape of argument list.
#define ARITH_IR(fn, T)                                                                              \
  [](const Args& a) { return fn(arg<const T>(a, 0), a.step[0], arg<Zel32f>(a, 1), a.step[1], a.roi); }
#define ARITH_IMR(fn, T)                                                                                   \
  [](const Args& a) {                                                                                      \
    return fn(arg<const T>(a, 0), a.step[0], arg<const Zel8u>(a, 1), a.step[1], arg<Zel32f>(a, 2), a.step[2], \
              a.roi);                                                                                      \
  }
#define ARITH_PRODUCT_IR(fn, T)                                                                            \
  [](const Args& a) {                                                                                      \
    return fn(arg<const T>(a, 0), a.step[0], arg<const T>(a, 1), a.step[1], arg<Zel32f>(a, 2), a.step[2], \
              a.roi);                                                                                      \
  }
#define ARITH_PRODUCT_IMR(fn, T)                                                                           \
  [](const Args& a) {                                                                                      \
    return fn(arg<const T>(a, 0), a.step[0], arg<const T>(a, 1), a.step[1], arg<const Zel8u>(a, 2),       \
              a.step[2], arg<Zel32f>(a, 3), a.step[3], a.roi);                                             \
  }
#define ARITH_WEIGHTED_IR(fn, T)                                                                           \
  [](const Args& a) {                                                                                      \
    return fn(arg<const T>(a, 0), a.step[0], arg<Zel32f>(a, 1), a.step[1], a.roi, a.alpha);                \
  }
#define ARITH_WEIGHTED_IMR(fn, T)                                                                          \
  [](const Args& a) {                                                                                      \
    return fn(arg<const T>(a, 0), a.step[0], arg<const Zel8u>(a, 1), a.step[1], arg<Zel32f>(a, 2),        \
              a.step[2], a.roi, a.alpha);                                                                  \
  }
#define ARITH_DIFF(fn, T)                                                                                  \
  [](const Args& a) {                                                                                      \
    return fn(arg<const T>(a, 0), a.step[0], arg<const T>(a, 1), a.step[1], arg<T>(a, 2), a.step[2], a.roi); \
  }
#define ARITH_DIFF_C(fn, T, V)                                                                             \
  [](const Args& a) { return fn(arg<const T>(a, 0), a.step[0], arg<T>(a, 1), a.step[1], a.roi, V(a.value)); }

inline const std::vector<Export>& exports() {
  static const std::vector<Export> table = {
      {"zeliAbsDiffC_16u_C1R", Op::AbsDiffC, Type::U16, false, 1, 6, ARITH_DIFF_C(zeliAbsDiffC_16u_C1R, Zel16u, int)},
      {"zeliAbsDiffC_32f_C1R", Op::AbsDiffC, Type::F32, false, 1, 8, ARITH_DIFF_C(zeliAbsDiffC_32f_C1R, Zel32f, float)},
      {"zeliAbsDiffC_8u_C1R", Op::AbsDiffC, Type::U8, false, 1, 0, ARITH_DIFF_C(zeliAbsDiffC_8u_C1R, Zel8u, int)},
      {"zeliAbsDiff_16u_C1R", Op::AbsDiff, Type::U16, false, 1, 6, ARITH_DIFF(zeliAbsDiff_16u_C1R, Zel16u)},
      {"zeliAbsDiff_32f_C1R", Op::AbsDiff, Type::F32, false, 1, 12, ARITH_DIFF(zeliAbsDiff_32f_C1R, Zel32f)},
      {"zeliAbsDiff_8u_C1R", Op::AbsDiff, Type::U8, false, 1, 0, ARITH_DIFF(zeliAbsDiff_8u_C1R, Zel8u)},
      {"zeliAbsDiff_8u_C3R", Op::AbsDiff, Type::U8, false, 3, 0, ARITH_DIFF(zeliAbsDiff_8u_C3R, Zel8u)},
      {"zeliAddProduct_16u32f_C1IMR", Op::Product, Type::U16, true, 1, 9,
       ARITH_PRODUCT_IMR(zeliAddProduct_16u32f_C1IMR, Zel16u)},
      {"zeliAddProduct_16u32f_C1IR", Op::Product, Type::U16, false, 1, 0,
       ARITH_PRODUCT_IR(zeliAddProduct_16u32f_C1IR, Zel16u)},
      {"zeliAddProduct_32f_C1IMR", Op::Product, Type::F32, true, 1, 13,
       ARITH_PRODUCT_IMR(zeliAddProduct_32f_C1IMR, Zel32f)},
      {"zeliAddProduct_32f_C1IR", Op::Product, Type::F32, false, 1, 0,
       ARITH_PRODUCT_IR(zeliAddProduct_32f_C1IR, Zel32f)},
      {"zeliAddProduct_8s32f_C1IMR", Op::Product, Type::S8, true, 1, 7,
       ARITH_PRODUCT_IMR(zeliAddProduct_8s32f_C1IMR, Zel8s)},
      {"zeliAddProduct_8s32f_C1IR", Op::Product, Type::S8, false, 1, 0,
       ARITH_PRODUCT_IR(zeliAddProduct_8s32f_C1IR, Zel8s)},
      {"zeliAddProduct_8u32f_C1IMR", Op::Product, Type::U8, true, 1, 7,
       ARITH_PRODUCT_IMR(zeliAddProduct_8u32f_C1IMR, Zel8u)},
      {"zeliAddProduct_8u32f_C1IR", Op::Product, Type::U8, false, 1, 0,
       ARITH_PRODUCT_IR(zeliAddProduct_8u32f_C1IR, Zel8u)},
      {"zeliAddSquare_16u32f_C1IMR", Op::Square, Type::U16, true, 1, 0, ARITH_IMR(zeliAddSquare_16u32f_C1IMR, Zel16u)},
      {"zeliAddSquare_16u32f_C1IR", Op::Square, Type::U16, false, 1, 0, ARITH_IR(zeliAddSquare_16u32f_C1IR, Zel16u)},
      {"zeliAddSquare_32f_C1IMR", Op::Square, Type::F32, true, 1, 0, ARITH_IMR(zeliAddSquare_32f_C1IMR, Zel32f)},
      {"zeliAddSquare_32f_C1IR", Op::Square, Type::F32, false, 1, 0, ARITH_IR(zeliAddSquare_32f_C1IR, Zel32f)},
      {"zeliAddSquare_8s32f_C1IMR", Op::Square, Type::S8, true, 1, 0, ARITH_IMR(zeliAddSquare_8s32f_C1IMR, Zel8s)},
      {"zeliAddSquare_8s32f_C1IR", Op::Square, Type::S8, false, 1, 0, ARITH_IR(zeliAddSquare_8s32f_C1IR, Zel8s)},
      {"zeliAddSquare_8u32f_C1IMR", Op::Square, Type::U8, true, 1, 0, ARITH_IMR(zeliAddSquare_8u32f_C1IMR, Zel8u)},
      {"zeliAddSquare_8u32f_C1IR", Op::Square, Type::U8, false, 1, 0, ARITH_IR(zeliAddSquare_8u32f_C1IR, Zel8u)},
      {"zeliAddWeighted_16u32f_C1IMR", Op::Weighted, Type::U16, true, 1, 7,
       ARITH_WEIGHTED_IMR(zeliAddWeighted_16u32f_C1IMR, Zel16u)},
      {"zeliAddWeighted_16u32f_C1IR", Op::Weighted, Type::U16, false, 1, 0,
       ARITH_WEIGHTED_IR(zeliAddWeighted_16u32f_C1IR, Zel16u)},
      {"zeliAddWeighted_32f_C1IMR", Op::Weighted, Type::F32, true, 1, 9,
       ARITH_WEIGHTED_IMR(zeliAddWeighted_32f_C1IMR, Zel32f)},
      {"zeliAddWeighted_32f_C1IR", Op::Weighted, Type::F32, false, 1, 0,
       ARITH_WEIGHTED_IR(zeliAddWeighted_32f_C1IR, Zel32f)},
      {"zeliAddWeighted_32f_C1R", Op::WeightedTo, Type::F32, false, 1, 0,
       [](const Args& a) {
         return zeliAddWeighted_32f_C1R(arg<const Zel32f>(a, 0), a.step[0], arg<const Zel32f>(a, 1), a.step[1],
                                        arg<Zel32f>(a, 2), a.step[2], a.roi, a.alpha);
       }},
      {"zeliAddWeighted_8s32f_C1IMR", Op::Weighted, Type::S8, true, 1, 5,
       ARITH_WEIGHTED_IMR(zeliAddWeighted_8s32f_C1IMR, Zel8s)},
      {"zeliAddWeighted_8s32f_C1IR", Op::Weighted, Type::S8, false, 1, 0,
       ARITH_WEIGHTED_IR(zeliAddWeighted_8s32f_C1IR, Zel8s)},
      {"zeliAddWeighted_8u32f_C1IMR", Op::Weighted, Type::U8, true, 1, 5,
       ARITH_WEIGHTED_IMR(zeliAddWeighted_8u32f_C1IMR, Zel8u)},
      {"zeliAddWeighted_8u32f_C1IR", Op::Weighted, Type::U8, false, 1, 0,
       ARITH_WEIGHTED_IR(zeliAddWeighted_8u32f_C1IR, Zel8u)},
      {"zeliAdd_16u32f_C1IMR", Op::Add, Type::U16, true, 1, 0, ARITH_IMR(zeliAdd_16u32f_C1IMR, Zel16u)},
      {"zeliAdd_16u32f_C1IR", Op::Add, Type::U16, false, 1, 0, ARITH_IR(zeliAdd_16u32f_C1IR, Zel16u)},
      {"zeliAdd_32f_C1IMR", Op::Add, Type::F32, true, 1, 0, ARITH_IMR(zeliAdd_32f_C1IMR, Zel32f)},
      {"zeliAdd_8s32f_C1IMR", Op::Add, Type::S8, true, 1, 0, ARITH_IMR(zeliAdd_8s32f_C1IMR, Zel8s)},
      {"zeliAdd_8s32f_C1IR", Op::Add, Type::S8, false, 1, 0, ARITH_IR(zeliAdd_8s32f_C1IR, Zel8s)},
      {"zeliAdd_8u32f_C1IMR", Op::Add, Type::U8, true, 1, 0, ARITH_IMR(zeliAdd_8u32f_C1IMR, Zel8u)},
      {"zeliAdd_8u32f_C1IR", Op::Add, Type::U8, false, 1, 0, ARITH_IR(zeliAdd_8u32f_C1IR, Zel8u)},
  };
  return table;
}

}  // namespace arithtest

#endif  // ZELCV_TESTS_ARITH_TABLE_H
