// How a routine of each Level-3 shape is tested on one problem: the call, and what the oracle expects of it.
#pragma once

#include "tests/product/surface/called.h"
#include "tests/reference/level3.h"

namespace qtb::surface {

using reference::is_letter;

// C := alpha*(A, B) + beta*C. want(o) gives the expectation of the call o.
template <ShapeName shape, class T, class R, class Want>
void test_two_matrices(const R &routine, const Problem &p, Session &s, Want want) {
  Called<shape, T> o(p, routine.kind());
  o.call(s, routine);
  s.judge(o.c.operand(), want(o));
}

template <class T, class R>
void run(Shape<"gemm">, const R &routine, const Problem &p, Session &s) {
  test_two_matrices<"gemm", T>(routine, p, s, [&](const auto &o) {
    return reference::gemm(p.transa, p.transb, p.m, p.n, p.k, o.scalars.alpha, o.a.before(), o.scalars.lda,
                           o.b.before(), o.scalars.ldb, o.scalars.beta, o.c.before(), o.scalars.ldc);
  });
}

template <class T, class R>
void run(Shape<"symm">, const R &routine, const Problem &p, Session &s) {
  const Structure structure = routine.kind().hermitian ? Structure::hermitian : Structure::symmetric;
  test_two_matrices<"symm", T>(routine, p, s, [&](const auto &o) {
    return reference::symm(structure, p.side, p.uplo, p.m, p.n, o.scalars.alpha, o.a.before(), o.scalars.lda,
                           o.b.before(), o.scalars.ldb, o.scalars.beta, o.c.before(), o.scalars.ldc);
  });
}

// syrk and herk.
template <ShapeName shape, class T, class R>
void test_rank_k(const R &routine, const Problem &p, Session &s) {
  test_two_matrices<shape, T>(routine, p, s, [&](const auto &o) {
    return reference::rank_k(routine.kind().hermitian, p.uplo, o.problem().transa, p.n, p.k,
                             test::widen(o.scalars.alpha), o.a.before(), o.scalars.lda, test::widen(o.scalars.beta),
                             o.c.before(), o.scalars.ldc);
  });
}
template <class T, class R>
void run(Shape<"syrk">, const R &routine, const Problem &p, Session &s) {
  test_rank_k<"syrk", T>(routine, p, s);
}
template <class T, class R>
void run(Shape<"herk">, const R &routine, const Problem &p, Session &s) {
  test_rank_k<"herk", T>(routine, p, s);
}

// syr2k and her2k.
template <ShapeName shape, class T, class R>
void test_rank_2k(const R &routine, const Problem &p, Session &s) {
  test_two_matrices<shape, T>(routine, p, s, [&](const auto &o) {
    return reference::rank_2k(routine.kind().hermitian, p.uplo, o.problem().transa, p.n, p.k,
                              test::widen(o.scalars.alpha), o.a.before(), o.scalars.lda, o.b.before(), o.scalars.ldb,
                              test::widen(o.scalars.beta), o.c.before(), o.scalars.ldc);
  });
}
template <class T, class R>
void run(Shape<"syr2k">, const R &routine, const Problem &p, Session &s) {
  test_rank_2k<"syr2k", T>(routine, p, s);
}
template <class T, class R>
void run(Shape<"her2k">, const R &routine, const Problem &p, Session &s) {
  test_rank_2k<"her2k", T>(routine, p, s);
}

// trmm and trsm.
template <class T, class R>
void run(Shape<"trmm">, const R &routine, const Problem &p, Session &s) {
  Called<"trmm", T> o(p, routine.kind());
  const QtbInt lda = o.scalars.lda, ldb = o.scalars.ldb;
  const T alpha = o.scalars.alpha;
  const bool solve = routine.kind().solve, exact_solve = solve && s.exact() && !is_zero(alpha);
  Expectation expected;
  if (exact_solve) {  // the right-hand side of a solution in whole numbers, over alpha, a power of two along an axis
    expected = solution(o.b.operand());
    const Expectation right = reference::trmm(p.side, p.uplo, p.transa, p.diag, p.m, p.n, scalar<T>({1, 0}),
                                              o.a.before(), lda, o.b.after(), ldb);
    const double square = p.alpha.re * p.alpha.re + p.alpha.im * p.alpha.im;
    const QuadComplex inverse{is_complex<T> ? Quad(p.alpha.re / square) : 1 / Quad(p.alpha.re),
                              is_complex<T> ? Quad(-p.alpha.im / square) : Quad(0)};
    for (QtbInt j = 0; j < p.n; ++j)
      for (QtbInt i = 0; i < p.m; ++i)
        o.b.operand().store(i, j, narrow<T>(reference::product(right.at(i, j).value, inverse, is_complex<T>)));
    o.b.operand().seal(Access::write);
  }
  o.call(s, routine);
  if (!solve)
    expected = reference::trmm(p.side, p.uplo, p.transa, p.diag, p.m, p.n, alpha, o.a.before(), lda, o.b.before(), ldb);
  else if (!exact_solve)
    expected = reference::trsm_residual(p.side, p.uplo, p.transa, p.diag, p.m, p.n, alpha, o.a.before(), lda,
                                        o.b.before(), o.b.after(), ldb);
  s.judge(o.b.operand(), expected);
}

}  // namespace qtb::surface
