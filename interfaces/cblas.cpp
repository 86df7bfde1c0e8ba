// The C face, by argument shape: how each is declared, and what it is on transposes.
#include "interfaces/cblas_call.h"
#include "interfaces/cblas_shapes.h"

namespace qtb::face {
namespace {

// The update without a conjugate.
template <class T>
constexpr auto plain_update = qtb_blas_xcgeru;
template <>
constexpr auto plain_update<cdouble> = qtb_blas_xzgeru;

// ---- Level 2 ----
//
// The equivalents differ in how a matrix is told, so that each function gets the call itself as a callable:
// with(f, what changes...) calls f with all the arguments of the routine.

// y := alpha*op(A)*x + beta*y, where y has m elements in the caller's view.
template <class T, class F, class With>
void general_product(const F &f, CBLAS_TRANSPOSE transpose, Int m, Int n, Scalar<T> alpha, In<T> x, Int incx,
                     Scalar<T> beta, Out<T> y, Int incy, With with) {
  const Letter trans = read(transpose, "TransA");
  if (!f.accepts_options(trans)) return;
  if (!f.row_major()) return with(f, &trans.letter, alpha, x, incx, beta);
  const char other = trans.letter == 'N' ? 'T' : 'N';
  if constexpr (is_complex<T>) {
    if (trans.letter == 'C') {  // conj(A^T) with no transpose to do: conj(y) := conj(alpha)*A^T*conj(x) + ...
      bool legal = false;
      with([&](auto... given) { legal = f.accepts(given...); }, &other, alpha, x, incx, beta);
      if (!legal || m == 0 || n == 0) return;
      const ConjugatedCopy<T> copy(m, x, incx);
      if (copy.data == nullptr) return f.report_no_memory();
      const T alpha_c = conjugated<T>(alpha), beta_c = conjugated<T>(beta);
      conjugate_in_place<T>(n, y, incy);
      with(f, &other, &alpha_c, copy.data, 1, &beta_c);
      return conjugate_in_place<T>(n, y, incy);
    }
  }
  with(f, &other, alpha, x, incx, beta);
}

// y := alpha*A*x + beta*y for a symmetric A, a Hermitian one if T is complex: its transpose is its conjugate.
template <class T, class F, class With>
void symmetric_product(const F &f, CBLAS_UPLO triangle, Int n, Scalar<T> alpha, In<T> x, Int incx, Scalar<T> beta,
                       Out<T> y, Int incy, With with) {
  const Letter uplo = read(triangle);
  if (!f.accepts_options(uplo)) return;
  if (!f.row_major()) return with(f, &uplo.letter, alpha, x, incx, beta);
  const char other = other_triangle(uplo.letter);
  if constexpr (is_complex<T>) {
    bool legal = false;
    with([&](auto... given) { legal = f.accepts(given...); }, &other, alpha, x, incx, beta);
    if (!legal || n == 0) return;
    const ConjugatedCopy<T> copy(n, x, incx);
    if (copy.data == nullptr) return f.report_no_memory();
    const T alpha_c = conjugated<T>(alpha), beta_c = conjugated<T>(beta);
    conjugate_in_place<T>(n, y, incy);
    with(f, &other, &alpha_c, copy.data, 1, &beta_c);
    conjugate_in_place<T>(n, y, incy);
  } else {
    with(f, &other, alpha, x, incx, beta);
  }
}

template <class T, class F>
void gemv(const F &f, CBLAS_TRANSPOSE trans, Int m, Int n, Scalar<T> alpha, In<T> a, Int lda, In<T> x, Int incx,
          Scalar<T> beta, Out<T> y, Int incy) {
  const Int rows = f.row_major() ? n : m, columns = f.row_major() ? m : n;
  general_product<T>(f, trans, m, n, alpha, x, incx, beta, y, incy,
                     [&](const auto &g, const char *op, auto alpha_now, auto x_now, Int inc_now, auto beta_now) {
                       g(op, rows, columns, alpha_now, a, lda, x_now, inc_now, beta_now, y, incy);
                     });
}
template <class T, class F>
void gbmv(const F &f, CBLAS_TRANSPOSE trans, Int m, Int n, Int kl, Int ku, Scalar<T> alpha, In<T> a, Int lda, In<T> x,
          Int incx, Scalar<T> beta, Out<T> y, Int incy) {
  const Int rows = f.row_major() ? n : m, columns = f.row_major() ? m : n;
  const Int below = f.row_major() ? ku : kl, above = f.row_major() ? kl : ku;
  general_product<T>(f, trans, m, n, alpha, x, incx, beta, y, incy,
                     [&](const auto &g, const char *op, auto alpha_now, auto x_now, Int inc_now, auto beta_now) {
                       g(op, rows, columns, below, above, alpha_now, a, lda, x_now, inc_now, beta_now, y, incy);
                     });
}
template <class T, class F>
void symv(const F &f, CBLAS_UPLO uplo, Int n, Scalar<T> alpha, In<T> a, Int lda, In<T> x, Int incx, Scalar<T> beta,
          Out<T> y, Int incy) {
  symmetric_product<T>(f, uplo, n, alpha, x, incx, beta, y, incy,
                       [&](const auto &g, const char *half, auto alpha_now, auto x_now, Int inc_now, auto beta_now) {
                         g(half, n, alpha_now, a, lda, x_now, inc_now, beta_now, y, incy);
                       });
}
template <class T, class F>
void sbmv(const F &f, CBLAS_UPLO uplo, Int n, Int k, Scalar<T> alpha, In<T> a, Int lda, In<T> x, Int incx,
          Scalar<T> beta, Out<T> y, Int incy) {
  symmetric_product<T>(f, uplo, n, alpha, x, incx, beta, y, incy,
                       [&](const auto &g, const char *half, auto alpha_now, auto x_now, Int inc_now, auto beta_now) {
                         g(half, n, k, alpha_now, a, lda, x_now, inc_now, beta_now, y, incy);
                       });
}
template <class T, class F>
void spmv(const F &f, CBLAS_UPLO uplo, Int n, Scalar<T> alpha, In<T> ap, In<T> x, Int incx, Scalar<T> beta, Out<T> y,
          Int incy) {
  symmetric_product<T>(f, uplo, n, alpha, x, incx, beta, y, incy,
                       [&](const auto &g, const char *half, auto alpha_now, auto x_now, Int inc_now, auto beta_now) {
                         g(half, n, alpha_now, ap, x_now, inc_now, beta_now, y, incy);
                       });
}

// x := op(A)*x or op(A)^-1*x; matrix is what stands between n and x.
template <class T, class F, class... Matrix>
void triangular_in_place(const F &f, CBLAS_UPLO triangle, CBLAS_TRANSPOSE transpose, CBLAS_DIAG diagonal, Int n,
                         Out<T> x, Int incx, Matrix... matrix) {
  const Letter uplo = read(triangle), trans = read(transpose, "TransA"), diag = read(diagonal);
  if (!f.accepts_options(uplo, trans, diag)) return;
  if (!f.row_major()) return f(&uplo.letter, &trans.letter, &diag.letter, n, matrix..., x, incx);
  const char other = other_triangle(uplo.letter), other_trans = trans.letter == 'N' ? 'T' : 'N';
  if constexpr (is_complex<T>) {
    if (trans.letter == 'C') {
      if (!f.accepts(&other, &other_trans, &diag.letter, n, matrix..., x, incx) || n == 0) return;
      conjugate_in_place<T>(n, x, incx);
      f(&other, &other_trans, &diag.letter, n, matrix..., x, incx);
      return conjugate_in_place<T>(n, x, incx);
    }
  }
  f(&other, &other_trans, &diag.letter, n, matrix..., x, incx);
}
template <class T, class F>
void trmv(const F &f, CBLAS_UPLO uplo, CBLAS_TRANSPOSE trans, CBLAS_DIAG diag, Int n, In<T> a, Int lda, Out<T> x,
          Int incx) {
  triangular_in_place<T>(f, uplo, trans, diag, n, x, incx, a, lda);
}
template <class T, class F>
void tbmv(const F &f, CBLAS_UPLO uplo, CBLAS_TRANSPOSE trans, CBLAS_DIAG diag, Int n, Int k, In<T> a, Int lda, Out<T> x,
          Int incx) {
  triangular_in_place<T>(f, uplo, trans, diag, n, x, incx, k, a, lda);
}
template <class T, class F>
void tpmv(const F &f, CBLAS_UPLO uplo, CBLAS_TRANSPOSE trans, CBLAS_DIAG diag, Int n, In<T> ap, Out<T> x, Int incx) {
  triangular_in_place<T>(f, uplo, trans, diag, n, x, incx, ap);
}

// A := alpha*x*y^T + A, or alpha*x*y^H + A, which on transposes is a plain update by conj(y).
template <class T, class F>
void ger(const F &f, Int m, Int n, Scalar<T> alpha, In<T> x, Int incx, In<T> y, Int incy, Out<T> a, Int lda) {
  if (!f.accepts_options()) return;
  if (!f.row_major()) return f(m, n, alpha, x, incx, y, incy, a, lda);
  if constexpr (is_complex<T>) {
    if (f.conjugates()) {
      if (!f.accepts(n, m, alpha, y, incy, x, incx, a, lda) || m == 0 || n == 0) return;
      const ConjugatedCopy<T> copy(n, y, incy);
      if (copy.data == nullptr) return f.report_no_memory();
      return f.with(plain_update<T>)(n, m, alpha, copy.data, 1, x, incx, a, lda);
    }
  }
  f(n, m, alpha, y, incy, x, incx, a, lda);
}

// A := alpha*x*x^T + A, or alpha*x*x^H + A if T is complex.
template <class T, class F, class... Matrix>
void symmetric_update(const F &f, CBLAS_UPLO triangle, Int n, Real<T> alpha, In<T> x, Int incx, Matrix... matrix) {
  const Letter uplo = read(triangle);
  if (!f.accepts_options(uplo)) return;
  if (!f.row_major()) return f(&uplo.letter, n, alpha, x, incx, matrix...);
  const char other = other_triangle(uplo.letter);
  if constexpr (is_complex<T>) {
    if (!f.accepts(&other, n, alpha, x, incx, matrix...) || n == 0) return;
    const ConjugatedCopy<T> copy(n, x, incx);
    if (copy.data == nullptr) return f.report_no_memory();
    f(&other, n, alpha, copy.data, 1, matrix...);
  } else {
    f(&other, n, alpha, x, incx, matrix...);
  }
}

// A := alpha*x*y^T + alpha*y*x^T + A, or alpha*x*y^H + conj(alpha)*y*x^H + A if T is complex.
template <class T, class F, class... Matrix>
void symmetric_update_2(const F &f, CBLAS_UPLO triangle, Int n, Scalar<T> alpha, In<T> x, Int incx, In<T> y, Int incy,
                        Matrix... matrix) {
  const Letter uplo = read(triangle);
  if (!f.accepts_options(uplo)) return;
  if (!f.row_major()) return f(&uplo.letter, n, alpha, x, incx, y, incy, matrix...);
  const char other = other_triangle(uplo.letter);
  if constexpr (is_complex<T>) {
    if (!f.accepts(&other, n, alpha, y, incy, x, incx, matrix...) || n == 0) return;
    const ConjugatedCopy<T> x_c(n, x, incx), y_c(n, y, incy);
    if (x_c.data == nullptr || y_c.data == nullptr) return f.report_no_memory();
    f(&other, n, alpha, y_c.data, 1, x_c.data, 1, matrix...);
  } else {
    f(&other, n, alpha, x, incx, y, incy, matrix...);
  }
}

template <class T, class F>
void her(const F &f, CBLAS_UPLO uplo, Int n, Real<T> alpha, In<T> x, Int incx, Out<T> a, Int lda) {
  symmetric_update<T>(f, uplo, n, alpha, x, incx, a, lda);
}
template <class T, class F>
void hpr(const F &f, CBLAS_UPLO uplo, Int n, Real<T> alpha, In<T> x, Int incx, Out<T> ap) {
  symmetric_update<T>(f, uplo, n, alpha, x, incx, ap);
}
// The real ones are those of a real type.
template <class T, class F, class... A>
void syr(const F &f, A... given) {
  her<T>(f, given...);
}
template <class T, class F, class... A>
void spr(const F &f, A... given) {
  hpr<T>(f, given...);
}
template <class T, class F>
void syr2(const F &f, CBLAS_UPLO uplo, Int n, Scalar<T> alpha, In<T> x, Int incx, In<T> y, Int incy, Out<T> a,
          Int lda) {
  symmetric_update_2<T>(f, uplo, n, alpha, x, incx, y, incy, a, lda);
}
template <class T, class F>
void spr2(const F &f, CBLAS_UPLO uplo, Int n, Scalar<T> alpha, In<T> x, Int incx, In<T> y, Int incy, Out<T> ap) {
  symmetric_update_2<T>(f, uplo, n, alpha, x, incx, y, incy, ap);
}

// ---- Level 3 ----

template <class T, class F>
void gemm(const F &f, CBLAS_TRANSPOSE transpose_a, CBLAS_TRANSPOSE transpose_b, Int m, Int n, Int k, Scalar<T> alpha,
          In<T> a, Int lda, In<T> b, Int ldb, Scalar<T> beta, Out<T> c, Int ldc) {
  const Letter transa = read(transpose_a, "TransA"), transb = read(transpose_b, "TransB");
  if (!f.accepts_options(transa, transb)) return;
  if (f.row_major())
    f(&transb.letter, &transa.letter, n, m, k, alpha, b, ldb, a, lda, beta, c, ldc);
  else
    f(&transa.letter, &transb.letter, m, n, k, alpha, a, lda, b, ldb, beta, c, ldc);
}

template <class T, class F>
void symm(const F &f, CBLAS_SIDE which, CBLAS_UPLO triangle, Int m, Int n, Scalar<T> alpha, In<T> a, Int lda, In<T> b,
          Int ldb, Scalar<T> beta, Out<T> c, Int ldc) {
  const Letter side = read(which), uplo = read(triangle);
  if (!f.accepts_options(side, uplo)) return;
  const char other = other_side(side.letter), other_uplo = other_triangle(uplo.letter);
  if (f.row_major())
    f(&other, &other_uplo, n, m, alpha, a, lda, b, ldb, beta, c, ldc);
  else
    f(&side.letter, &uplo.letter, m, n, alpha, a, lda, b, ldb, beta, c, ldc);
}

// Updates of one triangle of C. A is transposed by T in the symmetric ones, where C is as good if they are real, and by
// C in the Hermitian ones; an illegal letter stays for the rules to find. operands is what stands behind k.
template <class T, bool hermitian, class F, class... Operands>
void rank_k(const F &f, CBLAS_UPLO triangle, CBLAS_TRANSPOSE transpose, Int n, Int k, Operands... operands) {
  const Letter uplo = read(triangle), trans = read(transpose);
  if (!f.accepts_options(uplo, trans)) return;
  if (!f.row_major()) return f(&uplo.letter, &trans.letter, n, k, operands...);
  const char other_uplo = other_triangle(uplo.letter);
  char other_trans = hermitian ? 'C' : 'T';
  if (trans.letter == other_trans || (!is_complex<T> && trans.letter == 'C'))
    other_trans = 'N';
  else if (trans.letter != 'N')
    other_trans = trans.letter;
  f(&other_uplo, &other_trans, n, k, operands...);
}
template <class T, class F>
void syrk(const F &f, CBLAS_UPLO uplo, CBLAS_TRANSPOSE trans, Int n, Int k, Scalar<T> alpha, In<T> a, Int lda,
          Scalar<T> beta, Out<T> c, Int ldc) {
  rank_k<T, false>(f, uplo, trans, n, k, alpha, a, lda, beta, c, ldc);
}
template <class T, class F>
void herk(const F &f, CBLAS_UPLO uplo, CBLAS_TRANSPOSE trans, Int n, Int k, Real<T> alpha, In<T> a, Int lda,
          Real<T> beta, Out<T> c, Int ldc) {
  rank_k<T, true>(f, uplo, trans, n, k, alpha, a, lda, beta, c, ldc);
}
template <class T, class F>
void syr2k(const F &f, CBLAS_UPLO uplo, CBLAS_TRANSPOSE trans, Int n, Int k, Scalar<T> alpha, In<T> a, Int lda, In<T> b,
           Int ldb, Scalar<T> beta, Out<T> c, Int ldc) {
  rank_k<T, false>(f, uplo, trans, n, k, alpha, a, lda, b, ldb, beta, c, ldc);
}
// On transposes the two products change places, and with them alpha and its conjugate.
template <class T, class F>
void her2k(const F &f, CBLAS_UPLO uplo, CBLAS_TRANSPOSE trans, Int n, Int k, const void *alpha, In<T> a, Int lda,
           In<T> b, Int ldb, Real<T> beta, Out<T> c, Int ldc) {
  const T alpha_c = conjugated<T>(alpha);
  rank_k<T, true>(f, uplo, trans, n, k, f.row_major() ? &alpha_c : alpha, a, lda, b, ldb, beta, c, ldc);
}

template <class T, class F>
void trmm(const F &f, CBLAS_SIDE which, CBLAS_UPLO triangle, CBLAS_TRANSPOSE transpose, CBLAS_DIAG diagonal, Int m,
          Int n, Scalar<T> alpha, In<T> a, Int lda, Out<T> b, Int ldb) {
  const Letter side = read(which), uplo = read(triangle), trans = read(transpose), diag = read(diagonal);
  if (!f.accepts_options(side, uplo, trans, diag)) return;
  const char other = other_side(side.letter), other_uplo = other_triangle(uplo.letter);
  if (f.row_major())
    f(&other, &other_uplo, &trans.letter, &diag.letter, n, m, alpha, a, lda, b, ldb);
  else
    f(&side.letter, &uplo.letter, &trans.letter, &diag.letter, m, n, alpha, a, lda, b, ldb);
}

}  // namespace
}  // namespace qtb::face

extern "C" {

// A function of the C face is its shape's parameters, with which it is declared in cblas.h too, and its shape's body.
#define QTB_FACE(name, NAME, shape, T, route) QTB_CBLAS_##shape(name, NAME, shape, T, QTB_CORE_##route(name))
#define QTB_ROUTINE(name, NAME, shape, T, route) QTB_WITH_FACE(shape, QTB_FACE)(name, NAME, shape, T, route)
#include "blas/routines.def"
#undef QTB_ROUTINE

float QTB_C_NAME(scabs1)(const void *z) { return QTB_FORTRAN_NAME(scabs1)(static_cast<const cfloat *>(z)); }
QTB_SECOND_NAME(scabs1)

}  // extern "C"
