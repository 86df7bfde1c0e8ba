// How a routine of each Level-2 shape is tested on one problem: the call, and what the oracle expects of it.
#pragma once

#include "tests/product/surface/called.h"
#include "tests/reference/level2.h"

namespace qtb::surface {

using reference::is_letter;

// y := alpha*op(A)*x + beta*y. want(alpha, a, lda, x, beta, y) gives the expectation.
template <ShapeName shape, class T, class R, class Want>
void test_matrix_vector(const R &routine, const Problem &p, Session &s, Want want) {
  Called<shape, T> o(p, routine.kind());
  o.call(s, routine);
  s.judge(o.y.operand(),
          want(o.scalars.alpha, o.a.before(), o.scalars.lda, o.x.before(), o.scalars.beta, o.y.before()));
}

template <class T, class R>
void run(Shape<"gemv">, const R &routine, const Problem &p, Session &s) {
  test_matrix_vector<"gemv", T>(routine, p, s, [&](T alpha, const T *a, QtbInt lda, const T *x, T beta, const T *y) {
    return reference::gemv(p.transa, p.m, p.n, alpha, a, lda, x, p.incx, beta, y, p.incy);
  });
}
template <class T, class R>
void run(Shape<"gbmv">, const R &routine, const Problem &p, Session &s) {
  test_matrix_vector<"gbmv", T>(routine, p, s, [&](T alpha, const T *a, QtbInt lda, const T *x, T beta, const T *y) {
    return reference::gbmv(p.transa, p.m, p.n, p.kl, p.ku, alpha, a, lda, x, p.incx, beta, y, p.incy);
  });
}
template <class T, class R>
void run(Shape<"symv">, const R &routine, const Problem &p, Session &s) {
  test_matrix_vector<"symv", T>(routine, p, s, [&](T alpha, const T *a, QtbInt lda, const T *x, T beta, const T *y) {
    return reference::symv(p.uplo, p.n, alpha, a, lda, x, p.incx, beta, y, p.incy);
  });
}
template <class T, class R>
void run(Shape<"sbmv">, const R &routine, const Problem &p, Session &s) {
  test_matrix_vector<"sbmv", T>(routine, p, s, [&](T alpha, const T *a, QtbInt lda, const T *x, T beta, const T *y) {
    return reference::sbmv(p.uplo, p.n, p.kl, alpha, a, lda, x, p.incx, beta, y, p.incy);
  });
}
template <class T, class R>
void run(Shape<"spmv">, const R &routine, const Problem &p, Session &s) {
  test_matrix_vector<"spmv", T>(routine, p, s, [&](T alpha, const T *a, QtbInt, const T *x, T beta, const T *y) {
    return reference::spmv(p.uplo, p.n, alpha, a, x, p.incx, beta, y, p.incy);
  });
}

// A := alpha*x*x^H + A. Alpha is real also where A is complex.
template <ShapeName shape, class T, class R>
void test_rank_one(const R &routine, const Problem &p, Session &s) {
  Called<shape, T> o(p, routine.kind());
  o.call(s, routine);
  s.judge(o.a.operand(),
          reference::rank_one(o.a.layout(), scalar<Real<T>>(p.alpha), o.x.before(), p.incx, o.a.before()));
}
template <class T, class R>
void run(Shape<"syr">, const R &routine, const Problem &p, Session &s) {
  test_rank_one<"syr", T>(routine, p, s);
}
template <class T, class R>
void run(Shape<"her">, const R &routine, const Problem &p, Session &s) {
  test_rank_one<"her", T>(routine, p, s);
}
template <class T, class R>
void run(Shape<"spr">, const R &routine, const Problem &p, Session &s) {
  test_rank_one<"spr", T>(routine, p, s);
}
template <class T, class R>
void run(Shape<"hpr">, const R &routine, const Problem &p, Session &s) {
  test_rank_one<"hpr", T>(routine, p, s);
}

// A := alpha*x*y^T + A and the updates of a triangle by two vectors. want(alpha, x, y, a, lda) gives the expectation.
template <ShapeName shape, class T, class R, class Want>
void test_two_vectors(const R &routine, const Problem &p, Session &s, Want want) {
  Called<shape, T> o(p, routine.kind());
  o.call(s, routine);
  s.judge(o.a.operand(), want(o.scalars.alpha, o.x.before(), o.y.before(), o.a.before(), o.scalars.lda));
}

template <class T, class R>
void run(Shape<"ger">, const R &routine, const Problem &p, Session &s) {
  test_two_vectors<"ger", T>(routine, p, s, [&](T alpha, const T *x, const T *y, const T *a, QtbInt lda) {
    return reference::ger(routine.kind().conjugated, p.m, p.n, alpha, x, p.incx, y, p.incy, a, lda);
  });
}
template <class T, class R>
void run(Shape<"syr2">, const R &routine, const Problem &p, Session &s) {
  test_two_vectors<"syr2", T>(routine, p, s, [&](T alpha, const T *x, const T *y, const T *a, QtbInt lda) {
    return reference::syr2(p.uplo, p.n, alpha, x, p.incx, y, p.incy, a, lda);
  });
}
template <class T, class R>
void run(Shape<"spr2">, const R &routine, const Problem &p, Session &s) {
  test_two_vectors<"spr2", T>(routine, p, s, [&](T alpha, const T *x, const T *y, const T *a, QtbInt) {
    return reference::spr2(p.uplo, p.n, alpha, x, p.incx, y, p.incy, a);
  });
}

// x := op(T) x, or the solve of op(T) x = b where the name says so; so many terms to a sum.
template <ShapeName shape, class T, class R>
void test_triangular_vector(const R &routine, const Problem &p, Session &s, QtbInt terms) {
  Called<shape, T> o(p, routine.kind());
  const bool solve = routine.kind().solve, exact_solve = solve && s.exact();
  Expectation expected;
  if (exact_solve) {  // the right-hand side of a solution in whole numbers
    expected = solution(o.x.operand());
    const Expectation right =
        reference::triangle_times_vector(o.a.layout(), o.a.before(), p.transa, p.diag, o.x.after(), p.incx, terms);
    for (QtbInt i = 0; i < p.n; ++i) o.x.operand().store(i, 0, narrow<T>(right.at(i, 0).value));
    o.x.operand().seal(Access::write);
  }
  o.call(s, routine);
  if (!solve)
    expected =
        reference::triangle_times_vector(o.a.layout(), o.a.before(), p.transa, p.diag, o.x.before(), p.incx, terms);
  else if (!exact_solve)
    expected = reference::vector_residual(o.a.layout(), o.a.before(), p.transa, p.diag, o.x.before(), o.x.after(),
                                          p.incx, terms);
  s.judge(o.x.operand(), expected);
}

template <class T, class R>
void run(Shape<"trmv">, const R &routine, const Problem &p, Session &s) {
  test_triangular_vector<"trmv", T>(routine, p, s, p.n);
}
template <class T, class R>
void run(Shape<"tbmv">, const R &routine, const Problem &p, Session &s) {
  test_triangular_vector<"tbmv", T>(routine, p, s, std::min(p.n, p.kl + 1));
}
template <class T, class R>
void run(Shape<"tpmv">, const R &routine, const Problem &p, Session &s) {
  test_triangular_vector<"tpmv", T>(routine, p, s, p.n);
}

}  // namespace qtb::surface
