// The chief internal header: public types, the entry-definition macro and the
// argument checks that every family uses.
#ifndef ZELCV_CORE_STATUS_H
#define ZELCV_CORE_STATUS_H

#include "zelcv.h"
#include "core/checks.h"

namespace zelcv {

template <typename F> struct ReturnOf;
template <typename R, typename... A> struct ReturnOf<R(A...)> { using type = R; };

}  // namespace zelcv

// Defines the implementation behind the export `name`. Exports are assembler
// stubs that jump through the entry table; the table's slot for `name` holds
// zelcvImpl_<name>. The leading declaration makes the compiler reject a
// definition whose parameters differ from the public prototype.
//
//   ZELCV_ENTRY(zeliFoo_8u_C1R)(const Zel8u* src, int srcStep, ...) { ... }
#define ZELCV_ENTRY(name)                              \
  extern "C" decltype(::name) zelcvImpl_##name;        \
  extern "C" typename ::zelcv::ReturnOf<decltype(::name)>::type zelcvImpl_##name

// Defines an implementation that several exports share (an alias group). The
// entry list names it after '=' and the function takes the widest argument
// types of the group (for example void* for a state of any family).
#define ZELCV_SHARED_ENTRY(name) extern "C" ZelStatus zelcvImpl_##name

#endif  // ZELCV_CORE_STATUS_H
