// How a routine of each Level-3 shape is tested on one problem: the arguments made, the call, the judgement.
#pragma once

#include "tests/product/surface/session.h"
#include "tests/reference/level3.h"

namespace qtb::surface {

using reference::full;
using reference::is_letter;
using reference::triangle;

// C := alpha*(A, B) + beta*C. Layouts and structures of the operands; call(alpha, a, b, beta, c) and want(...) as
// Level 2. Alpha and beta are real where the routine says so.
template <class T, class Alpha, class Beta, class Call, class Want>
void test_two_matrices(const Problem &p, Session &s, const Layout &la, Structure structure_a, const Layout &lb,
                       const Layout &lc, Structure structure_c, Call call, Want want) {
  Draw draw(p.seed);
  Operand<T> a(la, draw), b(lb, draw), c(lc, draw);
  const Alpha alpha = scalar<Alpha>(p.alpha);
  const Beta beta = scalar<Beta>(p.beta);
  prepare_input(a, structure_a, p, draw, !is_zero(alpha));
  prepare_input(b, Structure::general, p, draw, !is_zero(alpha));
  prepare_output(c, structure_c, p, draw, !is_zero(beta));
  call(&alpha, a.data(), b.data(), &beta, c.data());
  s.judge(c, want(alpha, a.before(), b.before(), beta, c.before()));
}

template <class T, class R>
void run(Shape<"gemm">, const R &routine, const Problem &p, Session &s) {
  const bool plain_a = is_letter(p.transa, 'N'), plain_b = is_letter(p.transb, 'N');
  const QtbInt lda = p.leading(0, plain_a ? p.m : p.k), ldb = p.leading(1, plain_b ? p.k : p.n),
               ldc = p.leading(2, p.m);
  test_two_matrices<T, T, T>(
      p, s, plain_a ? full(p.m, p.k, lda) : full(p.k, p.m, lda), Structure::general,
      plain_b ? full(p.k, p.n, ldb) : full(p.n, p.k, ldb), full(p.m, p.n, ldc), Structure::general,
      [&](const T *alpha, const T *a, const T *b, const T *beta, T *c) {
        s.call(routine, &p.transa, &p.transb, &p.m, &p.n, &p.k, alpha, a, &lda, b, &ldb, beta, c, &ldc);
      },
      [&](T alpha, const T *a, const T *b, T beta, const T *c) {
        return reference::gemm(p.transa, p.transb, p.m, p.n, p.k, alpha, a, lda, b, ldb, beta, c, ldc);
      });
}

template <class T, class R>
void run(Shape<"symm">, const R &routine, const Problem &p, Session &s) {
  const Structure structure = routine.is_hermitian() ? Structure::hermitian : Structure::symmetric;
  const QtbInt order = is_letter(p.side, 'L') ? p.m : p.n;
  const QtbInt lda = p.leading(0, order), ldb = p.leading(1, p.m), ldc = p.leading(2, p.m);
  test_two_matrices<T, T, T>(
      p, s, triangle(p.uplo, order, lda), structure, full(p.m, p.n, ldb), full(p.m, p.n, ldc), Structure::general,
      [&](const T *alpha, const T *a, const T *b, const T *beta, T *c) {
        s.call(routine, &p.side, &p.uplo, &p.m, &p.n, alpha, a, &lda, b, &ldb, beta, c, &ldc);
      },
      [&](T alpha, const T *a, const T *b, T beta, const T *c) {
        return reference::symm(structure, p.side, p.uplo, p.m, p.n, alpha, a, lda, b, ldb, beta, c, ldc);
      });
}

// The rank-k updates know "N" and one or both of the others: real ones both, complex symmetric ones "T", Hermitian "C".
template <class T>
char rank_k_trans(bool hermitian, char trans) {
  if (!is_complex<T> || is_letter(trans, 'N')) return trans;
  const bool lower = trans != reference::upper_case(trans);
  if (hermitian) return lower ? 'c' : 'C';
  return lower ? 't' : 'T';
}

// syrk and herk; Factor is the type of alpha and beta.
template <class T, class Factor, class R>
void test_rank_k(const R &routine, const Problem &p, Session &s) {
  const bool hermitian = routine.is_hermitian();
  const char trans = rank_k_trans<T>(hermitian, p.transa);
  const bool plain = is_letter(trans, 'N');
  const QtbInt lda = p.leading(0, plain ? p.n : p.k), ldc = p.leading(2, p.n);
  test_two_matrices<T, Factor, Factor>(
      p, s, plain ? full(p.n, p.k, lda) : full(p.k, p.n, lda), Structure::general, full(0, 0, 1),
      triangle(p.uplo, p.n, ldc), hermitian ? Structure::hermitian : Structure::symmetric,
      [&](const Factor *alpha, const T *a, const T *, const Factor *beta, T *c) {
        s.call(routine, &p.uplo, &trans, &p.n, &p.k, alpha, a, &lda, beta, c, &ldc);
      },
      [&](Factor alpha, const T *a, const T *, Factor beta, const T *c) {
        return reference::rank_k(hermitian, p.uplo, trans, p.n, p.k, test::widen(alpha), a, lda, test::widen(beta), c,
                                 ldc);
      });
}
template <class T, class R>
void run(Shape<"syrk">, const R &routine, const Problem &p, Session &s) {
  test_rank_k<T, T>(routine, p, s);
}
template <class T, class R>
void run(Shape<"herk">, const R &routine, const Problem &p, Session &s) {
  test_rank_k<T, Real<T>>(routine, p, s);
}

// syr2k and her2k; Beta is the type of beta.
template <class T, class Beta, class R>
void test_rank_2k(const R &routine, const Problem &p, Session &s) {
  const bool hermitian = routine.is_hermitian();
  const char trans = rank_k_trans<T>(hermitian, p.transa);
  const bool plain = is_letter(trans, 'N');
  const QtbInt lda = p.leading(0, plain ? p.n : p.k), ldb = p.leading(1, plain ? p.n : p.k), ldc = p.leading(2, p.n);
  test_two_matrices<T, T, Beta>(
      p, s, plain ? full(p.n, p.k, lda) : full(p.k, p.n, lda), Structure::general,
      plain ? full(p.n, p.k, ldb) : full(p.k, p.n, ldb), triangle(p.uplo, p.n, ldc),
      hermitian ? Structure::hermitian : Structure::symmetric,
      [&](const T *alpha, const T *a, const T *b, const Beta *beta, T *c) {
        s.call(routine, &p.uplo, &trans, &p.n, &p.k, alpha, a, &lda, b, &ldb, beta, c, &ldc);
      },
      [&](T alpha, const T *a, const T *b, Beta beta, const T *c) {
        return reference::rank_2k(hermitian, p.uplo, trans, p.n, p.k, test::widen(alpha), a, lda, b, ldb,
                                  test::widen(beta), c, ldc);
      });
}
template <class T, class R>
void run(Shape<"syr2k">, const R &routine, const Problem &p, Session &s) {
  test_rank_2k<T, T>(routine, p, s);
}
template <class T, class R>
void run(Shape<"her2k">, const R &routine, const Problem &p, Session &s) {
  test_rank_2k<T, Real<T>>(routine, p, s);
}

// trmm and trsm. B is not read where alpha is zero.
template <class T, class R>
void run(Shape<"trmm">, const R &routine, const Problem &p, Session &s) {
  const bool left = is_letter(p.side, 'L');
  const QtbInt order = left ? p.m : p.n, lda = p.leading(0, order), ldb = p.leading(1, p.m);
  Draw draw(p.seed);
  Operand<T> a(triangle(p.uplo, order, lda), draw), b(full(p.m, p.n, ldb), draw);
  const T alpha = scalar<T>(p.alpha);
  prepare_input(a, reference::triangular(p.diag), p, draw, !is_zero(alpha));
  Expectation expected;
  const bool exact_solve = routine.is_solve() && s.exact() && !is_zero(alpha);
  if (!is_zero(alpha)) b.fill(Structure::general, p.values, draw);
  if (exact_solve) {  // the right-hand side of a solution in whole numbers, over alpha, a power of two along an axis
    expected = solution(b);
    const Expectation right =
        reference::trmm(p.side, p.uplo, p.transa, p.diag, p.m, p.n, scalar<T>({1, 0}), a.before(), lda, b.after(), ldb);
    const double square = p.alpha.re * p.alpha.re + p.alpha.im * p.alpha.im;
    const QuadComplex inverse{is_complex<T> ? Quad(p.alpha.re / square) : 1 / Quad(p.alpha.re),
                              is_complex<T> ? Quad(-p.alpha.im / square) : Quad(0)};
    for (QtbInt j = 0; j < p.n; ++j)
      for (QtbInt i = 0; i < p.m; ++i)
        b.store(i, j, narrow<T>(reference::product(right.at(i, j).value, inverse, is_complex<T>)));
  }
  b.seal(Access::write);
  s.call(routine, &p.side, &p.uplo, &p.transa, &p.diag, &p.m, &p.n, &alpha, a.data(), &lda, b.data(), &ldb);
  if (!routine.is_solve())
    expected = reference::trmm(p.side, p.uplo, p.transa, p.diag, p.m, p.n, alpha, a.before(), lda, b.before(), ldb);
  else if (!exact_solve)
    expected = reference::trsm_residual(p.side, p.uplo, p.transa, p.diag, p.m, p.n, alpha, a.before(), lda, b.before(),
                                        b.after(), ldb);
  s.judge(b, expected);
}

}  // namespace qtb::surface
