// gemm_acopy, gemm_bcopy: packing of a block of op(A) or op(B) into the panel of its GEMM family (level3/tiles.h).
//
// A panel is a sequence of micro-panels that begin ldp elements apart; an edge of B is one or two narrower ones.
// Element (i, l) of one of w rows is at i + l*w, (l, j) of one of w columns at l*w + j. The depth is filled up with
// zeros to a multiple of ku. A is multiplied by alpha, once; its rows beyond a multiple of mr are not packed. B is
// copied bit by bit, but for the sign of a conjugated imaginary part. src is the block's first element as it lies in
// memory.
#include "blas/kernels/level3/tiles.h"
#include "blas/kernels/plain/product.h"

namespace qtb::QTB_TIER {
namespace {

#if QTB_TIER_AT_LEAST(ssse3)
template <class T, Op op, Family family = Family::base>
QTB_FUNCTION(panel_copy, T, copy_a) {
  constexpr GemmRules rules = rules_of<T, family>;
  if (*rows <= 0 || *cols <= 0) return;
  const Matrix<T> a{src, *ld, op};
  for (QtbInt i0 = 0; i0 + rules.mr <= *rows; i0 += rules.mr) {
    T *panel = dst + i0 / rules.mr * *ldp;
    for (QtbInt l = 0; l < *cols; l++)
      for (QtbInt i = 0; i < rules.mr; i++) *panel++ = *alpha * a.at(i0 + i, l);
    for (QtbInt rest = (round_up(*cols, rules.ku) - *cols) * rules.mr; rest > 0; rest--) *panel++ = {};
  }
}
#endif

template <class T, Op op, Family family = Family::base>
void copy_b(const QtbInt *rows, const QtbInt *cols, const T *src, const QtbInt *ld, T *dst, const QtbInt *ldp,
            const T *) {
  constexpr GemmRules rules = rules_of<T, family>;
  if (*rows <= 0 || *cols <= 0) return;
  const Matrix<T> b{src, *ld, op};
  QtbInt q = 0;
  for (QtbInt j0 = 0, width; j0 < *cols; j0 += width, q++) {
    width = panel_width(rules.nr, *cols - j0);
    T *panel = dst + q * *ldp;
    for (QtbInt l = 0; l < *rows; l++)
      for (QtbInt j = 0; j < width; j++) *panel++ = b.at(l, j0 + j);
    for (QtbInt rest = (round_up(*rows, rules.ku) - *rows) * width; rest > 0; rest--) *panel++ = {};
  }
}

}  // namespace

QTB_KERNEL(cgemm_bcopy_n, panel_copy, cfloat, (copy_b<cfloat, Op::none>))
QTB_KERNEL(cgemm_bcopy_t, panel_copy, cfloat, (copy_b<cfloat, Op::transpose>))
QTB_KERNEL(cgemm_bcopy_c, panel_copy, cfloat, (copy_b<cfloat, Op::conjugate>))
QTB_KERNEL(zgemm_bcopy_n, panel_copy, cdouble, (copy_b<cdouble, Op::none>))
QTB_KERNEL(zgemm_bcopy_t, panel_copy, cdouble, (copy_b<cdouble, Op::transpose>))
QTB_KERNEL(zgemm_bcopy_c, panel_copy, cdouble, (copy_b<cdouble, Op::conjugate>))
#if QTB_TIER_AT_LEAST(ssse3)
QTB_KERNEL(dgemm_acopy_n, panel_copy, double, (copy_a<double, Op::none>))
QTB_KERNEL(dgemm_acopy_t, panel_copy, double, (copy_a<double, Op::transpose>))
QTB_KERNEL(dgemm_bcopy_n, panel_copy, double, (copy_b<double, Op::none>))
QTB_KERNEL(dgemm_bcopy_t, panel_copy, double, (copy_b<double, Op::transpose>))
#endif
#if QTB_TIER_IS(ssse3)
QTB_KERNEL(sgemm_sse41_acopy_n, panel_copy, float, (copy_a<float, Op::none, Family::sse41>))
QTB_KERNEL(sgemm_sse41_acopy_t, panel_copy, float, (copy_a<float, Op::transpose, Family::sse41>))
QTB_KERNEL(sgemm_sse41_bcopy_n, panel_copy, float, (copy_b<float, Op::none, Family::sse41>))
QTB_KERNEL(sgemm_sse41_bcopy_t, panel_copy, float, (copy_b<float, Op::transpose, Family::sse41>))
QTB_KERNEL(dgemm_sse41_acopy_n, panel_copy, double, (copy_a<double, Op::none, Family::sse41>))
QTB_KERNEL(dgemm_sse41_acopy_t, panel_copy, double, (copy_a<double, Op::transpose, Family::sse41>))
QTB_KERNEL(dgemm_sse41_bcopy_n, panel_copy, double, (copy_b<double, Op::none, Family::sse41>))
QTB_KERNEL(dgemm_sse41_bcopy_t, panel_copy, double, (copy_b<double, Op::transpose, Family::sse41>))
QTB_KERNEL(cgemm_sse41_acopy_n, panel_copy, cfloat, (copy_a<cfloat, Op::none, Family::sse41>))
QTB_KERNEL(cgemm_sse41_acopy_t, panel_copy, cfloat, (copy_a<cfloat, Op::transpose, Family::sse41>))
QTB_KERNEL(cgemm_sse41_acopy_c, panel_copy, cfloat, (copy_a<cfloat, Op::conjugate, Family::sse41>))
QTB_KERNEL(cgemm_sse41_bcopy_n, panel_copy, cfloat, (copy_b<cfloat, Op::none, Family::sse41>))
QTB_KERNEL(cgemm_sse41_bcopy_t, panel_copy, cfloat, (copy_b<cfloat, Op::transpose, Family::sse41>))
QTB_KERNEL(cgemm_sse41_bcopy_c, panel_copy, cfloat, (copy_b<cfloat, Op::conjugate, Family::sse41>))
QTB_KERNEL(zgemm_sse41_acopy_n, panel_copy, cdouble, (copy_a<cdouble, Op::none, Family::sse41>))
QTB_KERNEL(zgemm_sse41_acopy_t, panel_copy, cdouble, (copy_a<cdouble, Op::transpose, Family::sse41>))
QTB_KERNEL(zgemm_sse41_acopy_c, panel_copy, cdouble, (copy_a<cdouble, Op::conjugate, Family::sse41>))
QTB_KERNEL(zgemm_sse41_bcopy_n, panel_copy, cdouble, (copy_b<cdouble, Op::none, Family::sse41>))
QTB_KERNEL(zgemm_sse41_bcopy_t, panel_copy, cdouble, (copy_b<cdouble, Op::transpose, Family::sse41>))
QTB_KERNEL(zgemm_sse41_bcopy_c, panel_copy, cdouble, (copy_b<cdouble, Op::conjugate, Family::sse41>))
#endif

}  // namespace qtb::QTB_TIER
