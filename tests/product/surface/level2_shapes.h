// How a routine of each Level-2 shape is tested on one problem: the arguments made,
// the call, the judgement.
#pragma once

#include "tests/product/surface/session.h"
#include "tests/reference/level2.h"

namespace qtb::surface {

using reference::is_letter;
using reference::symmetric_or_hermitian;

// y := alpha*op(A)*x + beta*y. call(a, x, y) makes the call, want() gives the expectation.
template <class T, class Call, class Want>
void test_matrix_vector(const Problem &p, Session &s, const Layout &layout, Structure structure, bool plain, Call call,
                        Want want) {
  Draw draw(p.seed);
  Operand<T> a(layout, draw), x(reference::strided(plain ? layout.cols : layout.rows, p.incx), draw),
      y(reference::strided(plain ? layout.rows : layout.cols, p.incy), draw);
  const T alpha = scalar<T>(p.alpha), beta = scalar<T>(p.beta);
  prepare_input(a, structure, p, draw, !is_zero(alpha));
  prepare_input(x, Structure::general, p, draw, !is_zero(alpha));
  prepare_output(y, Structure::general, p, draw, !is_zero(beta));
  call(&alpha, a.data(), x.data(), &beta, y.data());
  s.judge(y, want(alpha, a.before(), x.before(), beta, y.before()));
}

template <class T, class R>
void run(Shape<"gemv">, const R &routine, const Problem &p, Session &s) {
  const QtbInt lda = p.leading(0, p.m);
  test_matrix_vector<T>(
      p, s, reference::full(p.m, p.n, lda), Structure::general, is_letter(p.transa, 'N'),
      [&](const T *alpha, const T *a, const T *x, const T *beta, T *y) {
        s.call(routine, &p.transa, &p.m, &p.n, alpha, a, &lda, x, &p.incx, beta, y, &p.incy);
      },
      [&](T alpha, const T *a, const T *x, T beta, const T *y) {
        return reference::gemv(p.transa, p.m, p.n, alpha, a, lda, x, p.incx, beta, y, p.incy);
      });
}

template <class T, class R>
void run(Shape<"gbmv">, const R &routine, const Problem &p, Session &s) {
  const QtbInt lda = p.leading(0, p.kl + p.ku + 1);
  test_matrix_vector<T>(
      p, s, reference::band(p.m, p.n, p.kl, p.ku, lda), Structure::general, is_letter(p.transa, 'N'),
      [&](const T *alpha, const T *a, const T *x, const T *beta, T *y) {
        s.call(routine, &p.transa, &p.m, &p.n, &p.kl, &p.ku, alpha, a, &lda, x, &p.incx, beta, y, &p.incy);
      },
      [&](T alpha, const T *a, const T *x, T beta, const T *y) {
        return reference::gbmv(p.transa, p.m, p.n, p.kl, p.ku, alpha, a, lda, x, p.incx, beta, y, p.incy);
      });
}

template <class T, class R>
void run(Shape<"symv">, const R &routine, const Problem &p, Session &s) {
  const QtbInt lda = p.leading(0, p.n);
  test_matrix_vector<T>(
      p, s, reference::triangle(p.uplo, p.n, lda), symmetric_or_hermitian<T>, true,
      [&](const T *alpha, const T *a, const T *x, const T *beta, T *y) {
        s.call(routine, &p.uplo, &p.n, alpha, a, &lda, x, &p.incx, beta, y, &p.incy);
      },
      [&](T alpha, const T *a, const T *x, T beta, const T *y) {
        return reference::symv(p.uplo, p.n, alpha, a, lda, x, p.incx, beta, y, p.incy);
      });
}

template <class T, class R>
void run(Shape<"sbmv">, const R &routine, const Problem &p, Session &s) {
  const QtbInt lda = p.leading(0, p.kl + 1);
  test_matrix_vector<T>(
      p, s, reference::band_triangle(p.uplo, p.n, p.kl, lda), symmetric_or_hermitian<T>, true,
      [&](const T *alpha, const T *a, const T *x, const T *beta, T *y) {
        s.call(routine, &p.uplo, &p.n, &p.kl, alpha, a, &lda, x, &p.incx, beta, y, &p.incy);
      },
      [&](T alpha, const T *a, const T *x, T beta, const T *y) {
        return reference::sbmv(p.uplo, p.n, p.kl, alpha, a, lda, x, p.incx, beta, y, p.incy);
      });
}

template <class T, class R>
void run(Shape<"spmv">, const R &routine, const Problem &p, Session &s) {
  test_matrix_vector<T>(
      p, s, reference::packed_triangle(p.uplo, p.n), symmetric_or_hermitian<T>, true,
      [&](const T *alpha, const T *a, const T *x, const T *beta, T *y) {
        s.call(routine, &p.uplo, &p.n, alpha, a, x, &p.incx, beta, y, &p.incy);
      },
      [&](T alpha, const T *a, const T *x, T beta, const T *y) {
        return reference::spmv(p.uplo, p.n, alpha, a, x, p.incx, beta, y, p.incy);
      });
}

// A := alpha*x*x^H + A. Alpha is real also where A is complex.
template <class T, class Call>
void test_rank_one(const Problem &p, Session &s, const Layout &layout, Call call) {
  Draw draw(p.seed);
  Operand<T> x(reference::strided(p.n, p.incx), draw), a(layout, draw);
  const Real<T> alpha = scalar<Real<T>>(p.alpha);
  prepare_input(x, Structure::general, p, draw, !is_zero(alpha));
  prepare_output(a, symmetric_or_hermitian<T>, p, draw, true);
  call(&alpha, x.data(), a.data());
  s.judge(a, reference::rank_one(layout, alpha, x.before(), p.incx, a.before()));
}

template <class T, class R>
void run(Shape<"syr">, const R &routine, const Problem &p, Session &s) {
  const QtbInt lda = p.leading(0, p.n);
  test_rank_one<T>(p, s, reference::triangle(p.uplo, p.n, lda), [&](const Real<T> *alpha, const T *x, T *a) {
    s.call(routine, &p.uplo, &p.n, alpha, x, &p.incx, a, &lda);
  });
}
template <class T, class R>
void run(Shape<"her">, const R &routine, const Problem &p, Session &s) {
  run<T>(Shape<"syr">(), routine, p, s);
}

template <class T, class R>
void run(Shape<"spr">, const R &routine, const Problem &p, Session &s) {
  test_rank_one<T>(p, s, reference::packed_triangle(p.uplo, p.n), [&](const Real<T> *alpha, const T *x, T *a) {
    s.call(routine, &p.uplo, &p.n, alpha, x, &p.incx, a);
  });
}
template <class T, class R>
void run(Shape<"hpr">, const R &routine, const Problem &p, Session &s) {
  run<T>(Shape<"spr">(), routine, p, s);
}

// A := alpha*x*y^T + A and the updates of a triangle by two vectors.
template <class T, class Call, class Want>
void test_two_vectors(const Problem &p, Session &s, const Layout &layout, Structure structure, Call call, Want want) {
  Draw draw(p.seed);
  Operand<T> x(reference::strided(layout.rows, p.incx), draw), y(reference::strided(layout.cols, p.incy), draw),
      a(layout, draw);
  const T alpha = scalar<T>(p.alpha);
  prepare_input(x, Structure::general, p, draw, !is_zero(alpha));
  prepare_input(y, Structure::general, p, draw, !is_zero(alpha));
  prepare_output(a, structure, p, draw, true);
  call(&alpha, x.data(), y.data(), a.data());
  s.judge(a, want(alpha, x.before(), y.before(), a.before()));
}

template <class T, class R>
void run(Shape<"ger">, const R &routine, const Problem &p, Session &s) {
  const QtbInt lda = p.leading(0, p.m);
  test_two_vectors<T>(
      p, s, reference::full(p.m, p.n, lda), Structure::general,
      [&](const T *alpha, const T *x, const T *y, T *a) {
        s.call(routine, &p.m, &p.n, alpha, x, &p.incx, y, &p.incy, a, &lda);
      },
      [&](T alpha, const T *x, const T *y, const T *a) {
        return reference::ger(routine.is_conjugated(), p.m, p.n, alpha, x, p.incx, y, p.incy, a, lda);
      });
}

template <class T, class R>
void run(Shape<"syr2">, const R &routine, const Problem &p, Session &s) {
  const QtbInt lda = p.leading(0, p.n);
  test_two_vectors<T>(
      p, s, reference::triangle(p.uplo, p.n, lda), symmetric_or_hermitian<T>,
      [&](const T *alpha, const T *x, const T *y, T *a) {
        s.call(routine, &p.uplo, &p.n, alpha, x, &p.incx, y, &p.incy, a, &lda);
      },
      [&](T alpha, const T *x, const T *y, const T *a) {
        return reference::syr2(p.uplo, p.n, alpha, x, p.incx, y, p.incy, a, lda);
      });
}

template <class T, class R>
void run(Shape<"spr2">, const R &routine, const Problem &p, Session &s) {
  test_two_vectors<T>(
      p, s, reference::packed_triangle(p.uplo, p.n), symmetric_or_hermitian<T>,
      [&](const T *alpha, const T *x, const T *y, T *a) {
        s.call(routine, &p.uplo, &p.n, alpha, x, &p.incx, y, &p.incy, a);
      },
      [&](T alpha, const T *x, const T *y, const T *a) {
        return reference::spr2(p.uplo, p.n, alpha, x, p.incx, y, p.incy, a);
      });
}

// x := op(T) x, or the solve of op(T) x = b where the name says so. call(a, x) makes the call.
template <class T, class R, class Call>
void test_triangular_vector(const R &routine, const Problem &p, Session &s, const Layout &layout, QtbInt terms,
                            Call call) {
  Draw draw(p.seed);
  Operand<T> a(layout, draw), x(reference::strided(p.n, p.incx), draw);
  prepare_input(a, reference::triangular(p.diag), p, draw, true);
  x.fill(Structure::general, p.values, draw);
  const bool exact_solve = routine.is_solve() && s.exact();
  Expectation expected;
  if (exact_solve) {  // the right-hand side of a solution in whole numbers
    expected = solution(x);
    const Expectation right =
        reference::triangle_times_vector(layout, a.before(), p.transa, p.diag, x.after(), p.incx, terms);
    for (QtbInt i = 0; i < p.n; ++i) x.store(i, 0, narrow<T>(right.at(i, 0).value));
  }
  x.seal(Access::write);
  call(a.data(), x.data());
  if (!routine.is_solve())
    expected = reference::triangle_times_vector(layout, a.before(), p.transa, p.diag, x.before(), p.incx, terms);
  else if (!exact_solve)
    expected = reference::vector_residual(layout, a.before(), p.transa, p.diag, x.before(), x.after(), p.incx, terms);
  s.judge(x, expected);
}

template <class T, class R>
void run(Shape<"trmv">, const R &routine, const Problem &p, Session &s) {
  const QtbInt lda = p.leading(0, p.n);
  test_triangular_vector<T>(routine, p, s, reference::triangle(p.uplo, p.n, lda), p.n, [&](const T *a, T *x) {
    s.call(routine, &p.uplo, &p.transa, &p.diag, &p.n, a, &lda, x, &p.incx);
  });
}

template <class T, class R>
void run(Shape<"tbmv">, const R &routine, const Problem &p, Session &s) {
  const QtbInt lda = p.leading(0, p.kl + 1);
  test_triangular_vector<T>(
      routine, p, s, reference::band_triangle(p.uplo, p.n, p.kl, lda), std::min(p.n, p.kl + 1),
      [&](const T *a, T *x) { s.call(routine, &p.uplo, &p.transa, &p.diag, &p.n, &p.kl, a, &lda, x, &p.incx); });
}

template <class T, class R>
void run(Shape<"tpmv">, const R &routine, const Problem &p, Session &s) {
  test_triangular_vector<T>(routine, p, s, reference::packed_triangle(p.uplo, p.n), p.n, [&](const T *a, T *x) {
    s.call(routine, &p.uplo, &p.transa, &p.diag, &p.n, a, x, &p.incx);
  });
}

}  // namespace qtb::surface
