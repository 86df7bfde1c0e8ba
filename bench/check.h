// Whether a call of Level 2 or 3 gives the right result, exactly and in the time of a few sweeps over its operands.
//
// The operands are small integers, so that every product and sum is a number of the type, whatever the order of
// summation. A result that is a matrix C is looked at as C*w for a vector w of random integers: an element that is
// wrong escapes with a probability of about one in a thousand per row. Where beta is zero the result holds NaN before
// the call. Factors are rounded to integers for this call, away from zero.
#pragma once

#include <cmath>
#include <complex>
#include <random>
#include <vector>

#include "bench/operand.h"
#include "calls/level3.h"

namespace qtb::bench {

using Vector = std::vector<Number>;

constexpr unsigned largest_weight = 1023;

// Without the special cases of the operator of std::complex, which takes care of infinities.
inline Number times(Number x, Number y) {
  return {x.real() * y.real() - x.imag() * y.imag(), x.real() * y.imag() + x.imag() * y.real()};
}
inline Vector times(Number x, Vector v) {
  for (Number &element : v) element = times(x, element);
  return v;
}
inline Vector plus(Vector v, const Vector &w) {
  for (std::size_t i = 0; i < v.size(); ++i) v[i] += w[i];
  return v;
}
inline Number dot(const Vector &v, const Vector &w) {
  Number sum;
  for (std::size_t i = 0; i < v.size(); ++i) sum += times(v[i], w[i]);
  return sum;
}
inline Vector conjugate(Vector v) {
  for (Number &element : v) element = std::conj(element);
  return v;
}

// op(matrix)*v, for the matrix that the operand's structure makes of what is kept.
template <class T>
Vector apply(const Operand<T> &matrix, char op, const Vector &v) {
  using calls::Structure;
  const Structure structure = matrix.form().structure;
  const bool as_it_is = op == 'N', conjugated = op == 'C', hermitian = structure == Structure::hermitian;
  const bool mirrored = hermitian || structure == Structure::symmetric;
  Vector result(static_cast<std::size_t>(as_it_is ? matrix.rows() : matrix.columns()));
  const auto add = [&](QtbInt row, QtbInt column, Number element) {
    const auto i = static_cast<std::size_t>(row), j = static_cast<std::size_t>(column);
    if (as_it_is)
      result[i] += times(element, v[j]);
    else
      result[j] += times(conjugated ? std::conj(element) : element, v[i]);
  };
  matrix.for_each([&](QtbInt i, QtbInt j) {
    const Number element = i == j && structure == Structure::unit_triangular ? 1.0 : matrix.at(i, j);
    add(i, j, element);
    if (mirrored && i != j) add(j, i, hermitian ? std::conj(element) : element);
  });
  return result;
}

template <class T>
Vector elements(const Operand<T> &vector) {
  Vector result;
  for (QtbInt i = 0; i < vector.rows(); ++i) result.push_back(vector.at(i, 0));
  return result;
}

inline Vector random_weights(QtbInt count, std::mt19937 &random) {
  Vector weights;
  for (QtbInt i = 0; i < count; ++i) weights.emplace_back(1 + random() % largest_weight);
  return weights;
}

// ---- by shape: call() makes one call, with bound's operands and scalars as they are then ----

using calls::Shape;

template <class T>
Number number(T value) {
  if constexpr (is_complex<T>)
    return {static_cast<double>(value.re), static_cast<double>(value.im)};
  else
    return static_cast<double>(value);
}

template <class T>
void fill_result(Operand<T> &result, Number beta, std::mt19937 &random) {
  if (beta == 0.0)
    result.fill_with_nan();
  else
    result.fill_integers(random);
}

// y := alpha*op(A)*x + beta*y
template <class B, class Call>
bool check_matrix_vector(B &bound, char op, Call &&call) {
  std::mt19937 random(54321);
  const Number alpha = number(bound.scalars.alpha), beta = number(bound.scalars.beta);
  bound.a.fill_integers(random);
  bound.x.fill_integers(random);
  fill_result(bound.y, beta, random);
  Vector expected = times(alpha, apply(bound.a, op, elements(bound.x)));
  if (beta != 0.0) expected = plus(std::move(expected), times(beta, elements(bound.y)));
  call();
  return elements(bound.y) == expected;
}
template <class B, class Call>
bool check(Shape<"gemv">, B &bound, Call &&call) {
  return check_matrix_vector(bound, bound.scalars.transa, call);
}
template <class B, class Call>
bool check(Shape<"gbmv">, B &bound, Call &&call) {
  return check_matrix_vector(bound, bound.scalars.transa, call);
}
template <class B, class Call>
bool check(Shape<"symv">, B &bound, Call &&call) {
  return check_matrix_vector(bound, 'N', call);
}
template <class B, class Call>
bool check(Shape<"sbmv">, B &bound, Call &&call) {
  return check_matrix_vector(bound, 'N', call);
}
template <class B, class Call>
bool check(Shape<"spmv">, B &bound, Call &&call) {
  return check_matrix_vector(bound, 'N', call);
}

// A := A + update. update(w) is the update times w.
template <class B, class Call, class Update>
bool check_update(B &bound, Call &&call, Update &&update) {
  std::mt19937 random(54321);
  for (auto *operand : {&bound.a, &bound.x, &bound.y}) operand->fill_integers(random);
  const Vector w = random_weights(bound.a.columns(), random);
  const Vector expected = plus(apply(bound.a, 'N', w), update(w));
  call();
  return apply(bound.a, 'N', w) == expected;
}
// The vector on the right of a product, as op says: transposed, or conjugated as well.
inline Vector right(bool conjugated, Vector v) { return conjugated ? conjugate(std::move(v)) : v; }

template <class B, class Call>
bool check_rank_one(B &bound, Call &&call) {
  return check_update(bound, call, [&](const Vector &w) {
    const Vector x = elements(bound.x);
    return times(times(number(bound.scalars.alpha), dot(right(bound.kind.complex, x), w)), x);
  });
}
template <class B, class Call>
bool check(Shape<"syr">, B &bound, Call &&call) {
  return check_rank_one(bound, call);
}
template <class B, class Call>
bool check(Shape<"spr">, B &bound, Call &&call) {
  return check_rank_one(bound, call);
}
template <class B, class Call>
bool check(Shape<"ger">, B &bound, Call &&call) {
  return check_update(bound, call, [&](const Vector &w) {
    const Number factor = dot(right(bound.kind.conjugated, elements(bound.y)), w);
    return times(times(number(bound.scalars.alpha), factor), elements(bound.x));
  });
}
template <class B, class Call>
bool check_rank_two(B &bound, Call &&call) {
  return check_update(bound, call, [&](const Vector &w) {
    const Vector x = elements(bound.x), y = elements(bound.y);
    const bool complex = bound.kind.complex;
    const Number alpha = number(bound.scalars.alpha), other = complex ? std::conj(alpha) : alpha;
    return plus(times(times(alpha, dot(right(complex, y), w)), x), times(times(other, dot(right(complex, x), w)), y));
  });
}
template <class B, class Call>
bool check(Shape<"syr2">, B &bound, Call &&call) {
  return check_rank_two(bound, call);
}
template <class B, class Call>
bool check(Shape<"spr2">, B &bound, Call &&call) {
  return check_rank_two(bound, call);
}

// x := op(T) x, or its inverse.
template <class B, class Call>
bool check_triangular_vector(B &bound, Call &&call) {
  std::mt19937 random(54321);
  bound.a.fill_integers(random);
  bound.x.fill_integers(random);
  const Vector x = elements(bound.x), product = apply(bound.a, bound.scalars.transa, x);
  if (bound.kind.solve)
    for (QtbInt i = 0; i < bound.x.rows(); ++i) bound.x.set(i, 0, product[static_cast<std::size_t>(i)]);
  call();
  return elements(bound.x) == (bound.kind.solve ? x : product);
}
template <class B, class Call>
bool check(Shape<"trmv">, B &bound, Call &&call) {
  return check_triangular_vector(bound, call);
}
template <class B, class Call>
bool check(Shape<"tbmv">, B &bound, Call &&call) {
  return check_triangular_vector(bound, call);
}
template <class B, class Call>
bool check(Shape<"tpmv">, B &bound, Call &&call) {
  return check_triangular_vector(bound, call);
}

// C := product + beta*C. product(w) is the product times w.
template <class B, class Call, class Product>
bool check_matrix(B &bound, Call &&call, Product &&product) {
  std::mt19937 random(54321);
  const Number beta = number(bound.scalars.beta);
  bound.a.fill_integers(random);
  bound.b.fill_integers(random);
  fill_result(bound.c, beta, random);
  const Vector w = random_weights(bound.c.columns(), random);
  Vector expected = product(w);
  if (beta != 0.0) expected = plus(std::move(expected), times(beta, apply(bound.c, 'N', w)));
  call();
  return apply(bound.c, 'N', w) == expected;
}
template <class B, class Call>
bool check(Shape<"gemm">, B &bound, Call &&call) {
  return check_matrix(bound, call, [&](const Vector &w) {
    const auto &s = bound.scalars;
    return times(number(s.alpha), apply(bound.a, s.transa, apply(bound.b, s.transb, w)));
  });
}
template <class B, class Call>
bool check(Shape<"symm">, B &bound, Call &&call) {
  return check_matrix(bound, call, [&](const Vector &w) {
    const auto &first = bound.scalars.side == 'L' ? bound.b : bound.a, &last = &first == &bound.a ? bound.b : bound.a;
    return times(number(bound.scalars.alpha), apply(last, 'N', apply(first, 'N', w)));
  });
}
// alpha*op(A)*op(B)^T, with the letters of both steps: a transposition, or the conjugate as well.
template <class B, class T>
Vector rank_k_product(const B &bound, Number alpha, const Operand<T> &a, const Operand<T> &b, const Vector &w) {
  const char transposed = bound.kind.hermitian ? 'C' : 'T';
  const bool plain = bound.scalars.transa == 'N';
  return times(alpha, apply(a, plain ? 'N' : transposed, apply(b, plain ? transposed : 'N', w)));
}
template <class B, class Call>
bool check(Shape<"syrk">, B &bound, Call &&call) {
  return check_matrix(bound, call, [&](const Vector &w) {
    return rank_k_product(bound, number(bound.scalars.alpha), bound.a, bound.a, w);
  });
}
template <class B, class Call>
bool check(Shape<"syr2k">, B &bound, Call &&call) {
  return check_matrix(bound, call, [&](const Vector &w) {
    const Number alpha = number(bound.scalars.alpha), other = bound.kind.hermitian ? std::conj(alpha) : alpha;
    return plus(rank_k_product(bound, alpha, bound.a, bound.b, w), rank_k_product(bound, other, bound.b, bound.a, w));
  });
}

// B := alpha*op(T)*B or alpha*B*op(T), or the inverse of T in its place. What is solved for is of rank one, so that its
// product with T costs no more than that of a vector.
template <class B, class Call>
bool check(Shape<"trmm">, B &bound, Call &&call) {
  std::mt19937 random(54321);
  const Number alpha = number(bound.scalars.alpha);
  const char op = bound.scalars.transa;
  const bool left = bound.scalars.side == 'L';
  auto &t = bound.a, &b = bound.b;
  t.fill_integers(random);
  b.fill_integers(random);
  const Vector w = random_weights(b.columns(), random);
  if (!bound.kind.solve) {
    const Vector expected = times(alpha, left ? apply(t, op, apply(b, 'N', w)) : apply(b, 'N', apply(t, op, w)));
    call();
    return apply(b, 'N', w) == expected;
  }
  Vector column(static_cast<std::size_t>(b.rows())), row(static_cast<std::size_t>(b.columns()));
  for (Number &element : column) element = 1.0 + static_cast<double>(random() % 2U);
  for (Number &element : row) element = 1.0 + static_cast<double>(random() % 2U);
  // row*op(T) is the transpose of what T does to a real vector the other way round.
  const auto from_right = [&] {
    if (op == 'C') return conjugate(apply(t, 'N', row));
    return apply(t, op == 'N' ? 'T' : 'N', row);
  };
  const Vector first = left ? apply(t, op, column) : column, last = left ? row : from_right();
  b.for_each([&](QtbInt i, QtbInt j) {
    b.set(i, j, times(first[static_cast<std::size_t>(i)], last[static_cast<std::size_t>(j)]));
  });
  call();
  return apply(b, 'N', w) == times(times(alpha, dot(row, w)), column);
}

template <class S, class B, class Call>
bool is_correct(S shape, B &bound, Call &&call) {
  if constexpr (requires { check(shape, bound, call); }) {
    const auto alpha = bound.scalars.alpha, beta = bound.scalars.beta;
    const auto away_from_zero = [](auto &value) {
      const auto round = [](auto &part) { part = part < 0 ? std::floor(part) : std::ceil(part); };
      if constexpr (is_complex<std::remove_reference_t<decltype(value)>>)
        round(value.re), round(value.im);
      else
        round(value);
    };
    away_from_zero(bound.scalars.alpha);
    away_from_zero(bound.scalars.beta);
    const bool correct = check(shape, bound, call);
    bound.scalars.alpha = alpha, bound.scalars.beta = beta;
    return correct;
  } else {
    return true;
  }
}

}  // namespace qtb::bench
