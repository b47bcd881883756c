// The argument-torture table: one line per export says what each argument is
// (image and step, ROI, buffer, state, scalar ...); the generated tests call
// every export with bad pointers, sizes and steps, with rows against an
// inaccessible page and with odd steps and buffers. See README.md beside this
// file for the role language.
#ifndef ZELCV_TESTS_TORTURE_H
#define ZELCV_TESTS_TORTURE_H

#include <cstddef>
#include <functional>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include "zelcv.h"

namespace zeltorture {

// One argument value, whatever its C type.
struct Value {
  void* p = nullptr;
  long long i = 0;
  double f = 0;
  ZeliSize size{0, 0};
  ZeliPoint point{0, 0};
  ZeliRect rect{0, 0, 0, 0};
};
using Frame = std::vector<Value>;

// What the C type of a parameter allows: 'p' pointer, 'i' integer, 'f' float,
// 'S' ZeliSize, 'P' ZeliPoint, 'R' ZeliRect.
struct ParamInfo {
  char kind;
  int depth;     // pointer levels
  int elemSize;  // bytes of the arithmetic element at the innermost level, 0 if none
  bool floating; // that element is a floating type
};

// Size of an arithmetic element; 0 for anything else (opaque states too).
// Points and rectangles count as arrays of their 32-bit fields (arr=2 for
// one ZeliPoint or ZeliPoint_32f, arr=4 for one ZeliRect).
template <typename P>
constexpr int elementSize() {
  if constexpr (std::is_arithmetic<P>::value) return int(sizeof(P));
  else if constexpr (std::is_same<P, ZeliPoint>::value || std::is_same<P, ZeliRect>::value ||
                     std::is_same<P, ZeliPoint_32f>::value)
    return 4;
  else return 0;
}

template <typename P>
constexpr bool floatingElements() {
  return std::is_floating_point<P>::value || std::is_same<P, ZeliPoint_32f>::value;
}

template <typename T>
ParamInfo paramInfo() {
  if constexpr (std::is_pointer<T>::value) {
    using P = std::remove_cv_t<std::remove_pointer_t<T>>;
    if constexpr (std::is_pointer<P>::value) {
      using Q = std::remove_cv_t<std::remove_pointer_t<P>>;
      return {'p', 2, elementSize<Q>(), floatingElements<Q>()};
    } else {
      return {'p', 1, elementSize<P>(), floatingElements<P>()};
    }
  } else if constexpr (std::is_same<T, ZeliSize>::value) {
    return {'S', 0, 0, false};
  } else if constexpr (std::is_same<T, ZeliPoint>::value || std::is_same<T, ZeliPoint_32f>::value) {
    return {'P', 0, 0, false};
  } else if constexpr (std::is_same<T, ZeliRect>::value) {
    return {'R', 0, 0, false};
  } else if constexpr (std::is_floating_point<T>::value) {
    return {'f', 0, int(sizeof(T)), true};
  } else {
    static_assert(std::is_integral<T>::value, "unsupported argument type");
    return {'i', 0, int(sizeof(T)), false};
  }
}

template <typename T>
T argument(const Value& v) {
  if constexpr (std::is_pointer<T>::value) {
    return reinterpret_cast<T>(v.p);
  } else if constexpr (std::is_same<T, ZeliSize>::value) {
    return v.size;
  } else if constexpr (std::is_same<T, ZeliPoint>::value) {
    return v.point;
  } else if constexpr (std::is_same<T, ZeliPoint_32f>::value) {
    return ZeliPoint_32f{float(v.point.x), float(v.point.y)};
  } else if constexpr (std::is_same<T, ZeliRect>::value) {
    return v.rect;
  } else if constexpr (std::is_floating_point<T>::value) {
    return T(v.f);
  } else {
    return T(v.i);
  }
}

struct Entry {
  std::string name;
  std::string roles;
  std::vector<ParamInfo> params;
  std::function<ZelStatus(const Frame&)> call;
};

template <typename... A, std::size_t... I>
ZelStatus callWith(ZelStatus(ZELCV_CALL* fn)(A...), const Frame& f, std::index_sequence<I...>) {
  return fn(argument<A>(f[I])...);
}

// The version query: no arguments, a record instead of a status (0 when the
// record is there).
inline Entry describe(const char* name, const ZelLibraryVersion*(ZELCV_CALL* fn)(void), const char* roles) {
  Entry e;
  e.name = name;
  e.roles = roles;
  e.call = [fn](const Frame&) { return fn() ? zelStatusOk : zelStatusBadArgument; };
  return e;
}

template <typename... A>
Entry describe(const char* name, ZelStatus(ZELCV_CALL* fn)(A...), const char* roles) {
  Entry e;
  e.name = name;
  e.roles = roles;
  e.params = {paramInfo<A>()...};
  e.call = [fn](const Frame& f) { return callWith(fn, f, std::index_sequence_for<A...>{}); };
  return e;
}

// Builders of states and objects that entries name (state=..., obj=...,
// new=...). A maker gets the ROI the images were made for and where to put
// the memory it needs; it returns the state, or null when it failed.
class Arena {
 public:
  virtual ~Arena() = default;
  // A zero-filled block that lives until the call is over; at an odd
  // address when the test asks for odd buffers.
  virtual void* block(std::size_t bytes) = 0;
  virtual bool odd() const = 0;
};

struct Maker {
  // Builds the state for images of `roi`.
  std::function<void*(Arena&, ZeliSize roi)> make;
  // Releases what make or an InitAlloc call returned (objects only).
  std::function<void(void*)> release;
};

struct Registry {
  std::vector<Entry> entries;
  std::vector<std::pair<std::string, Maker>> makers;
};
Registry& registry();

struct Registrar {
  explicit Registrar(std::vector<Entry> (*entries)());
  Registrar(const char* name, Maker maker);
};

}  // namespace zeltorture

// One entry of the table: the export and the roles of its arguments.
#define TORTURE(fn, roles) ::zeltorture::describe(#fn, &fn, roles)

// A family's entries: TORTURE_FAMILY(accumulate) { return { TORTURE(...), ... }; }
#define TORTURE_FAMILY(id)                                                          \
  static std::vector<::zeltorture::Entry> tortureEntries_##id();                    \
  static const ::zeltorture::Registrar tortureRegistrar_##id(&tortureEntries_##id); \
  static std::vector<::zeltorture::Entry> tortureEntries_##id()

// A named state or object builder.
#define TORTURE_MAKER(id, ...) \
  static const ::zeltorture::Registrar tortureMaker_##id(#id, ::zeltorture::Maker{__VA_ARGS__})

#endif  // ZELCV_TESTS_TORTURE_H
