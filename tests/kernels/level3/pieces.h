// What the tests of pieces share: matrices with trapping ends, the oracle of a product.
#pragma once

#include <gtest/gtest.h>

#include <random>
#include <string>

#include "tests/reference/level3.h"
#include "tests/support/bounds.h"
#include "tests/support/guarded.h"
#include "tests/support/placed.h"
#include "tests/support/tally.h"
#include "tests/support/tiers.h"

namespace qtb::test {
namespace {

constexpr char letters[3] = {'N', 'T', 'C'};

std::mt19937_64 generator(20);

template <class T>
T draw() {
  std::uniform_real_distribution<Real<T>> part(-1, 1);
  if constexpr (is_complex<T>) {
    const Real<T> re = part(generator), im = part(generator);
    return {re, im};
  } else {
    return part(generator);
  }
}

template <class T>
T value(double re, double im) {
  if constexpr (is_complex<T>)
    return {static_cast<Real<T>>(re), static_cast<Real<T>>(im)};
  else
    return static_cast<T>(re);
}

// A rows x cols matrix with one spare row per column, filled with NaN; its last byte touches a trapping page.
template <class T>
struct Stored {
  QtbInt rows, cols, ld;
  Guarded<T> array;
  Stored(QtbInt r, QtbInt c)
      : rows(r), cols(c), ld(r + 1), array(r > 0 && c > 0 ? static_cast<std::size_t>(ld * (c - 1) + r) : 0) {
    for (std::size_t i = 0; i < array.size(); i++)
      array[i] = static_cast<QtbInt>(i) % ld < rows ? draw<T>() : value<T>(NAN, NAN);
  }
  T *at(QtbInt i, QtbInt j) { return array.data() + i + j * ld; }
  void poison() {
    for (QtbInt j = 0; j < cols; j++)
      for (QtbInt i = 0; i < rows; i++) *at(i, j) = value<T>(NAN, NAN);
  }
  void take(const Stored &other) { std::memcpy(array.data(), other.array.data(), array.size() * sizeof(T)); }
};

// A stored matrix read as op(A).
template <class T>
struct Operand {
  int op;
  Stored<T> stored;
  Operand(int o, QtbInt rows, QtbInt cols) : op(o), stored(o == 0 ? rows : cols, o == 0 ? cols : rows) {}
  T at(QtbInt i, QtbInt j) {
    T v = op == 0 ? *stored.at(i, j) : *stored.at(j, i);
    if constexpr (is_complex<T>)
      if (op == 2) v.im = -v.im;
    return v;
  }
  T *block(QtbInt i, QtbInt j) { return op == 0 ? stored.at(i, j) : stored.at(j, i); }
};

inline QuadComplex times(QuadComplex a, QuadComplex b) {
  return {a.re * b.re - a.im * b.im, a.re * b.im + a.im * b.re};
}
inline QuadComplex plus(QuadComplex a, QuadComplex b) { return {a.re + b.re, a.im + b.im}; }

// Every test draws the same data, whatever ran before it.
class Seeded : public testing::Test {
 protected:
  void SetUp() override { generator.seed(20); }
};

// C against alpha*op(A)*op(B) + beta*before in higher precision, and its spare rows bit by bit.
template <class T>
void expect_product(const std::string &what, int tier, QtbInt k, T alpha, Operand<T> &a, Operand<T> &b, T beta,
                    Stored<T> &before, Stored<T> &after) {
  const reference::Expectation want =
      reference::gemm(letters[a.op], letters[b.op], after.rows, after.cols, k, alpha, a.stored.array.data(),
                      a.stored.ld, b.stored.array.data(), b.stored.ld, beta, before.array.data(), after.ld);
  double worst = 0;
  for (QtbInt j = 0; j < after.cols; j++) {
    for (QtbInt i = 0; i < after.rows; i++) {
      const reference::Expected &e = want.at(i, j);
      const double ratio = e.outcome == reference::Outcome::unchanged
                               ? (same_bits(*after.at(i, j), *before.at(i, j)) ? 0 : 2)
                               : error_ratio(*after.at(i, j), e.value, e.gauge, want.roundings, want.alpha_magnitude);
      worst = std::fmax(worst, ratio);
      ASSERT_LE(ratio, 1) << tier_name(tier) << " " << what << " C(" << i << ", " << j << ") of " << after.rows << " x "
                          << after.cols << " x " << k;
    }
    if (after.rows > 0 && j + 1 < after.cols) {
      ASSERT_TRUE(same_bits(*after.at(after.rows, j), *before.at(after.rows, j)))
          << tier_name(tier) << " " << what << " wrote a spare row";
    }
  }
  TallyReport::of(what.c_str()).within(tier, worst);
}

}  // namespace
}  // namespace qtb::test
