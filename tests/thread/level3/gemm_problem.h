// A GEMM on matrices between trapping pages, and the two ways to judge its result: by the oracle, under the derived
// bound, or, for whole numbers, exactly. Spare rows, and what may not be read, hold signalling NaN.
#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <string>
#include <vector>

#include "blas/shapes.h"
#include "blas/thread/drivers.h"
#include "tests/reference/level3.h"
#include "tests/reference/sums.h"
#include "tests/support/guarded.h"
#include "tests/support/placed.h"

namespace qtb::test {

template <class T>
T number(double re, double im = 0) {
  if constexpr (is_complex<T>)
    return {static_cast<Real<T>>(re), static_cast<Real<T>>(im)};
  else
    return static_cast<T>(re);
}

struct GemmShape {
  char transa = 'N', transb = 'N';
  QtbInt m = 1, n = 1, k = 1;
  bool whole_numbers = false;  // small ones, so that all sums are exact
  Flush flush = Flush::back;
  std::uint64_t seed = 1;
};

inline std::string text_of(const GemmShape &s) {
  return std::string("op ") + s.transa + s.transb + " m " + std::to_string(s.m) + " n " + std::to_string(s.n) + " k " +
         std::to_string(s.k) + " seed " + std::to_string(s.seed);
}

template <class T>
class GemmProblem {
 public:
  GemmShape shape;
  T alpha, beta;
  QtbInt lda, ldb, ldc;
  Guarded<T> a, b, c;
  std::vector<T> before;

  GemmProblem(const GemmShape &s, T alpha_, T beta_)
      : shape(s),
        alpha(alpha_),
        beta(beta_),
        lda((is_n(s.transa) ? s.m : s.k) + 1),
        ldb((is_n(s.transb) ? s.k : s.n) + 2),
        ldc(s.m + 3),
        a(extent(lda - 1, is_n(s.transa) ? s.k : s.m, lda), s.flush),
        b(extent(ldb - 2, is_n(s.transb) ? s.n : s.k, ldb), s.flush),
        c(extent(s.m, s.n, ldc), s.flush) {
    std::mt19937_64 random(s.seed * 977 + 5);
    const bool reads_operands = !reference::is_value(widen(alpha), 0);
    const bool reads_c = !reference::is_value(widen(beta), 0);
    fill(a, lda - 1, lda, reads_operands, random);
    fill(b, ldb - 2, ldb, reads_operands, random);
    fill(c, s.m, ldc, reads_c, random);
    before.assign(c.data(), c.data() + c.size());
  }

  void restore() { std::memcpy(static_cast<void *>(c.data()), before.data(), before.size() * sizeof(T)); }

  // The largest error over its bound; fails where that is above 1, or where a spare row is not what it was.
  double expect_within_bound() {
    expect_spare_rows();
    const reference::Expectation want = reference::gemm(shape.transa, shape.transb, shape.m, shape.n, shape.k, alpha,
                                                        a.data(), lda, b.data(), ldb, beta, before.data(), ldc);
    double worst = 0;
    for (QtbInt j = 0; j < shape.n; ++j)
      for (QtbInt i = 0; i < shape.m; ++i) {
        const T got = c.data()[i + j * ldc];
        const reference::Expected &expected = want.at(i, j);
        if (expected.outcome == reference::Outcome::unchanged) {
          const bool same = same_bits(got, before[static_cast<std::size_t>(i + j * ldc)]);
          EXPECT_TRUE(same) << text_of(shape) << ": C(" << i << ", " << j << ") is not what it was";
          if (!same) return 2;
          continue;
        }
        const double ratio = error_ratio(got, expected.value, expected.gauge, want.roundings, want.alpha_magnitude);
        worst = std::fmax(worst, ratio);
        if (!(ratio <= 1)) {
          ADD_FAILURE() << text_of(shape) << ": C(" << i << ", " << j << ") is " << ratio << " times its bound off";
          return ratio;
        }
      }
    return worst;
  }

  // For whole numbers: every element is the exact one. alpha and beta have to be whole, too. The product is computed by
  // the first call: what it is made of may not change between calls.
  void expect_exact() {
    expect_spare_rows();
    if (exact.empty()) exact = exact_product();
    for (QtbInt j = 0; j < shape.n; ++j)
      for (QtbInt i = 0; i < shape.m; ++i)
        if (!equal(c.data()[i + j * ldc], exact[static_cast<std::size_t>(i + j * shape.m)])) {
          ADD_FAILURE() << text_of(shape) << ": C(" << i << ", " << j << ") is not the exact value";
          return;
        }
  }

 private:
  std::vector<T> exact;

  std::vector<T> exact_product() const {
    const auto m = static_cast<std::size_t>(shape.m), k = static_cast<std::size_t>(shape.k);
    using R = Real<T>;
    std::vector<R> a_re(m * k), a_im(is_complex<T> ? m * k : 0), y_re(k), y_im(is_complex<T> ? k : 0), re(m), im(m);
    std::vector<T> product;
    product.reserve(m * static_cast<std::size_t>(shape.n));
    for (std::size_t l = 0; l < k; ++l)
      for (std::size_t i = 0; i < m; ++i)
        put(operand(shape.transa, a, lda, static_cast<QtbInt>(i), static_cast<QtbInt>(l)), a_re, a_im, i + l * m);
    const bool adds = !reference::is_value(widen(beta), 0);
    for (QtbInt j = 0; j < shape.n; ++j) {
      for (std::size_t l = 0; l < k; ++l) put(operand(shape.transb, b, ldb, static_cast<QtbInt>(l), j), y_re, y_im, l);
      std::fill(re.begin(), re.end(), R(0));
      reference::add_columns(m, k, a_re.data(), y_re.data(), re.data());
      if constexpr (is_complex<T>) {
        std::fill(im.begin(), im.end(), R(0));
        reference::add_columns(m, k, a_re.data(), y_im.data(), im.data());
        reference::add_columns(m, k, a_im.data(), y_re.data(), im.data());
        for (R &y : y_im) y = -y;
        reference::add_columns(m, k, a_im.data(), y_im.data(), re.data());
      }
      const T *const old = before.data() + j * ldc;
      for (std::size_t i = 0; i < m; ++i) {
        if constexpr (is_complex<T>)
          product.push_back(plus(times(alpha, T{re[i], im[i]}), adds ? times(beta, old[i]) : number<T>(0)));
        else
          product.push_back(alpha * re[i] + (adds ? beta * old[i] : 0));
      }
    }
    return product;
  }

  static bool is_n(char trans) { return trans == 'N' || trans == 'n'; }
  static std::size_t extent(QtbInt rows, QtbInt cols, QtbInt ld) {
    return cols < 1 ? 0 : static_cast<std::size_t>(ld * (cols - 1) + rows);
  }
  static T times(T x, T y) requires is_complex<T> { return {x.re * y.re - x.im * y.im, x.re * y.im + x.im * y.re}; }
  static T plus(T x, T y) requires is_complex<T> { return {x.re + y.re, x.im + y.im}; }
  static bool equal(T x, T y) {
    if constexpr (is_complex<T>)
      return x.re == y.re && x.im == y.im;
    else
      return x == y;
  }
  static void put(T v, std::vector<Real<T>> &re, std::vector<Real<T>> &im, std::size_t at) {
    if constexpr (is_complex<T>) {
      re[at] = v.re;
      im[at] = v.im;
    } else {
      re[at] = v;
    }
  }
  static T operand(char trans, const Guarded<T> &array, QtbInt ld, QtbInt i, QtbInt j) {
    T v = array.data()[is_n(trans) ? i + j * ld : j + i * ld];
    if constexpr (is_complex<T>)
      if (trans == 'C' || trans == 'c') v.im = -v.im;
    return v;
  }
  void fill(Guarded<T> &array, QtbInt rows, QtbInt ld, bool is_read, std::mt19937_64 &random) {
    std::uniform_real_distribution<double> part(-1, 1);
    std::uniform_int_distribution<int> whole(-4, 4);
    const auto draw = [&] { return shape.whole_numbers ? whole(random) : part(random); };
    const std::size_t column = static_cast<std::size_t>(ld), read = is_read ? static_cast<std::size_t>(rows) : 0;
    for (std::size_t j = 0; j < array.size(); j += column) {
      const std::size_t end = std::min(column, array.size() - j);
      for (std::size_t i = 0; i < end; ++i) {
        if (i < read) {
          const double re = draw();
          array[j + i] = number<T>(re, is_complex<T> ? draw() : 0);
        } else {
          store_signalling_nan<T>(array.data() + j + i);
        }
      }
    }
  }
  void expect_spare_rows() {
    const auto m = static_cast<std::size_t>(shape.m), column = static_cast<std::size_t>(ldc);
    for (std::size_t j = 0; j < c.size(); j += column)
      for (std::size_t i = j + m; i < std::min(j + column, c.size()); ++i)
        if (!same_bits(c[i], before[i])) {
          ADD_FAILURE() << text_of(shape) << ": a spare row of C was written";
          return;
        }
  }
};

template <class T>
struct GemmFrontEnd;
#define QTB_TEST_FRONT_END(t, T)                      \
  template <>                                         \
  struct GemmFrontEnd<T> {                            \
    static constexpr auto call = &qtb_blas_##t##gemm; \
    static constexpr const char *name = #t "gemm";    \
  };
QTB_TEST_FRONT_END(s, float)
QTB_TEST_FRONT_END(d, double)
QTB_TEST_FRONT_END(c, cfloat)
QTB_TEST_FRONT_END(z, cdouble)

template <class T>
void call(GemmProblem<T> &p) {
  const GemmShape &s = p.shape;
  GemmFrontEnd<T>::call(&s.transa, &s.transb, &s.m, &s.n, &s.k, &p.alpha, p.a.data(), &p.lda, p.b.data(), &p.ldb,
                        &p.beta, p.c.data(), &p.ldc);
}

}  // namespace qtb::test
