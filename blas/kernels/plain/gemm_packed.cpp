// gemm_bpacked, gemm_apacked, gemm_packed: C := alpha*op(A)*op(B) + beta*C where a caller has packed B, A or both into
// panels (level3/tiles.h).
//
// A packed A holds alpha, and lacks the rows beyond a multiple of mr: these come from op(A) itself, with alpha. Of an
// operand that is packed whole the matrix is not read, only its panel, without the padding.
#include "blas/kernels/level3/tiles.h"
#include "blas/kernels/plain/product.h"

#if QTB_TIER_AT_LEAST(ssse3)

namespace qtb::QTB_TIER {
namespace {

template <class T>
struct PackedA {
  const T *panels;
  QtbInt ldp, mr;
  T at(QtbInt i, QtbInt l) const { return panels[i / mr * ldp + l * mr + i % mr]; }
};

template <class T>
struct PackedB {
  const T *panels;
  QtbInt ldp, nr, n;
  T at(QtbInt l, QtbInt j) const {
    QtbInt q = j / nr, j0 = q * nr, width = panel_width(nr, n - j0);
    for (; j >= j0 + width; q++) {
      j0 += width;
      width = panel_width(nr, n - j0);
    }
    return panels[q * ldp + l * width + j - j0];
  }
};

template <class T, Family family = Family::base>
void product_with_packed_b(const char *transa, const char *, const QtbInt *m, const QtbInt *n, const QtbInt *k,
                           const T *alpha, const T *a, const QtbInt *lda, const T *, const QtbInt *, const T *bp,
                           const QtbInt *ldbp, const T *beta, T *c, const QtbInt *ldc) {
  scaled_product(*m, *n, *k, *alpha, Matrix<T>{a, *lda, read_op<T>(transa)},
                 PackedB<T>{bp, *ldbp, rules_of<T, family>.nr, *n}, *beta, c, *ldc);
}

// The rows of the panel, whose alpha is folded in, and then those that it lacks.
template <Family family, class T, class B>
void product_with_packed_a(QtbInt m, QtbInt n, QtbInt k, T alpha, Matrix<T> a, const T *ap, QtbInt ldap, B b, T beta,
                           T *c, QtbInt ldc) {
  constexpr QtbInt mr = rules_of<T, family>.mr;
  if (m <= 0 || n <= 0) return;
  scale_part(Part::whole, m, n, beta, c, ldc);
  if (is_zero(alpha)) return;
  const QtbInt packed = round_down(m, mr);
  add_product(Part::whole, packed, n, k, Real<T>{1}, PackedA<T>{ap, ldap, mr}, b, c, ldc);
  a.a += a.op == Op::none ? packed : packed * a.ld;
  add_product(Part::whole, m - packed, n, k, alpha, a, b, c + packed, ldc);
}

#if QTB_TIER_IS(sse42)
template <class T>
QTB_FUNCTION(gemm_apacked, T, apacked) {
  product_with_packed_a<Family::base>(*m, *n, *k, *alpha, Matrix<T>{a, *lda, read_op<T>(transa)}, ap, *ldap,
                                      Matrix<T>{b, *ldb, read_op<T>(transb)}, *beta, c, *ldc);
}
#endif

#if QTB_TIER_IS(ssse3)
template <class T>
void packed(const char *transa, const char *, const QtbInt *m, const QtbInt *n, const QtbInt *k, const T *alpha,
            const T *a, const QtbInt *lda, const T *ap, const QtbInt *ldap, const T *, const QtbInt *, const T *bp,
            const QtbInt *ldbp, const T *beta, T *c, const QtbInt *ldc) {
  product_with_packed_a<Family::sse41>(*m, *n, *k, *alpha, Matrix<T>{a, *lda, read_op<T>(transa)}, ap, *ldap,
                                       PackedB<T>{bp, *ldbp, rules_of<T, Family::sse41>.nr, *n}, *beta, c, *ldc);
}
#endif

}  // namespace

QTB_KERNEL(dgemm_bpacked, gemm_bpacked, double, product_with_packed_b<double>)
QTB_KERNEL(cgemm_bpacked, gemm_bpacked, cfloat, product_with_packed_b<cfloat>)
QTB_KERNEL(zgemm_bpacked, gemm_bpacked, cdouble, product_with_packed_b<cdouble>)
#if QTB_TIER_IS(sse42)
QTB_KERNEL(dgemm_apacked, gemm_apacked, double, apacked<double>)
#endif
#if QTB_TIER_IS(ssse3)
QTB_KERNEL(sgemm_sse41_packed, gemm_packed, float, packed<float>)
QTB_KERNEL(dgemm_sse41_packed, gemm_packed, double, packed<double>)
QTB_KERNEL(cgemm_sse41_packed, gemm_packed, cfloat, packed<cfloat>)
QTB_KERNEL(zgemm_sse41_packed, gemm_packed, cdouble, packed<cdouble>)
QTB_KERNEL(cgemm_sse41, gemm_bpacked, cfloat, (product_with_packed_b<cfloat, Family::sse41>))
QTB_KERNEL(zgemm_sse41, gemm_bpacked, cdouble, (product_with_packed_b<cdouble, Family::sse41>))
#endif

}  // namespace qtb::QTB_TIER

#endif
