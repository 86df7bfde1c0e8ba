// What surrounds the walk of this tier's GEMM bodies, by type: the small path and the scaling of C.
//
// small_path<T>: C := alpha*op(A)*op(B) + beta*C with the arguments of gemm, without packing (small.cpp).
// scale_columns<T>: C := beta*C (scale_c.cpp).
// one<T>: a factor of 1.
#pragma once

#include "blas/kernels/kernel.h"

namespace qtb::QTB_TIER {

#define QTB_PARTS(X) X(s, float) X(d, double) X(c, cfloat) X(z, cdouble)

// No slot has the small path.
#define QTB_DECLARE_SMALL(t, T) extern "C" QTB_HIDDEN QTB_FUNCTION(gemm, T, QTB_TIER_NAME(x##t##gemm_small));
QTB_PARTS(QTB_DECLARE_SMALL)
#undef QTB_DECLARE_SMALL

namespace {

template <class T>
using GemmProcedure = QTB_FUNCTION_TYPE(gemm, T);
template <class T>
using ScaleProcedure = QTB_FUNCTION_TYPE(scale_c, T);
template <class T>
constexpr GemmProcedure<T> *small_path = nullptr;
template <class T>
constexpr ScaleProcedure<T> *scale_columns = nullptr;
#define QTB_NAME_PARTS(t, T)                                                   \
  template <>                                                                  \
  constexpr GemmProcedure<T> *small_path<T> = QTB_TIER_NAME(x##t##gemm_small); \
  template <>                                                                  \
  constexpr ScaleProcedure<T> *scale_columns<T> = QTB_TIER_NAME(x##t##gemm_scale_c);
QTB_PARTS(QTB_NAME_PARTS)
#undef QTB_NAME_PARTS

// An object, so that its address can be passed: compilers make a constant on the stack by instructions that no tier
// has.
template <class T>
constexpr T one = 1;
template <class R>
constexpr Complex<R> one<Complex<R>> = {1, 0};

}  // namespace
}  // namespace qtb::QTB_TIER
