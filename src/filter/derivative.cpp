#include "filter/derivative.h"

#include <cstring>

#include "core/alloc.h"
#include "filter/derivative_ops.h"

namespace zelcv {

namespace {

template <class Smooth, class First>
void gradientRow(const deriv::SourceRows& rows, int y, Zel16s* a, Zel16s* b, Zel16s* dx, Zel16s* dy) {
  deriv::engineRow(rows, y, a, b, deriv::GradientSink<Smooth, First>{dx, dy});
}

}  // namespace

size_t DerivativeRows::scratchBytes(DerivativeKernel kernel, int width) {
  return 1 + 2 * deriv::scratchColumns(width, derivativeRadius(kernel)) * sizeof(Zel16s) + size_t(width);
}

DerivativeRows::DerivativeRows(const Zel8u* src, int srcStep, ZeliSize roi, DerivativeKernel kernel,
                               ZeliBorderType border, Zel8u borderValue, void* scratch)
    : src_(src),
      srcStep_(srcStep),
      roi_(roi),
      kernel_(kernel),
      border_(border),
      borderValue_(borderValue) {
  const size_t columns = deriv::scratchColumns(roi.width, derivativeRadius(kernel));
  smooth_ = reinterpret_cast<Zel16s*>(alignUp(scratch, sizeof(Zel16s)));
  diff_ = smooth_ + columns;
  constantRow_ = reinterpret_cast<Zel8u*>(diff_ + columns);
  if (borderKind(border) == zelBorderConstant) std::memset(constantRow_, borderValue, size_t(roi.width));
}

void DerivativeRows::row(int y, Zel16s* dx, Zel16s* dy) const {
  const deriv::SourceRows rows{src_, srcStep_, roi_, border_, borderValue_, constantRow_};
  switch (kernel_) {
    case DerivativeKernel::kSobel3x3:
      gradientRow<deriv::Smooth3, deriv::First3>(rows, y, smooth_, diff_, dx, dy);
      break;
    case DerivativeKernel::kScharr3x3:
      gradientRow<deriv::ScharrSmooth3, deriv::First3>(rows, y, smooth_, diff_, dx, dy);
      break;
    case DerivativeKernel::kSobel5x5:
      gradientRow<deriv::Smooth5, deriv::First5>(rows, y, smooth_, diff_, dx, dy);
      break;
  }
}

}  // namespace zelcv
