// The oracle of Levels 2 and 3: its storage forms hold beside tables written out by hand, its compensated sums agree
// with 113-bit ones far below any bound, and small products come out as on paper.

#include <gtest/gtest.h>

#include <random>

#include "tests/reference/level2.h"
#include "tests/reference/level3.h"
#include "tests/reference/sums.h"

namespace {

using namespace qtb::reference;

// The position of every kept element, row by row; -1 where none is kept.
std::vector<QtbInt> positions(const Layout &layout) {
  std::vector<QtbInt> result;
  for (QtbInt i = 0; i < layout.rows; ++i)
    for (QtbInt j = 0; j < layout.cols; ++j) result.push_back(layout.stores(i, j) ? layout.position(i, j) : -1);
  return result;
}
using Table = std::vector<QtbInt>;

TEST(storage, of_a_full_matrix_is_column_by_column) {
  EXPECT_EQ(positions(full(2, 3, 5)), (Table{0, 5, 10, 1, 6, 11}));
  EXPECT_EQ(full(2, 3, 5).extent(), 12);
  EXPECT_EQ(full(0, 3, 5).extent(), 0);
}

TEST(storage, of_a_triangle_keeps_one_side) {
  EXPECT_EQ(positions(triangle('u', 3, 4)), (Table{0, 4, 8, -1, 5, 9, -1, -1, 10}));
  EXPECT_EQ(positions(triangle('L', 3, 4)), (Table{0, -1, -1, 1, 5, -1, 2, 6, 10}));
}

TEST(storage, of_a_band_runs_down_from_the_highest_diagonal) {
  EXPECT_EQ(positions(band(4, 3, 1, 1, 3)), (Table{1, 3, -1, 2, 4, 6, -1, 5, 7, -1, -1, 8}));
  EXPECT_EQ(positions(band_triangle('U', 3, 1, 2)), (Table{1, 2, -1, -1, 3, 4, -1, -1, 5}));
  EXPECT_EQ(positions(band_triangle('L', 3, 1, 2)), (Table{0, -1, -1, 1, 2, -1, -1, 3, 4}));
}

TEST(storage, of_a_packed_triangle_has_no_gaps) {
  EXPECT_EQ(positions(packed_triangle('U', 3)), (Table{0, 1, 3, -1, 2, 4, -1, -1, 5}));
  EXPECT_EQ(positions(packed_triangle('L', 3)), (Table{0, -1, -1, 1, 3, -1, 2, 4, 5}));
}

TEST(storage, of_a_vector_with_a_negative_increment_starts_at_the_far_end) {
  EXPECT_EQ(positions(strided(3, 2)), (Table{0, 2, 4}));
  EXPECT_EQ(positions(strided(3, -2)), (Table{4, 2, 0}));
}

TEST(a_matrix, is_completed_as_its_structure_says) {
  const cdouble a[] = {{1, 9}, {2, 3}, {7, 7}, {4, 9}};  // column by column, order 2
  const Dense hermitian = read(triangle('L', 2, 2), a, Structure::hermitian);
  EXPECT_TRUE(hermitian.value(0, 0).re == 1 && hermitian.value(0, 0).im == 0);
  EXPECT_TRUE(hermitian.value(1, 0).re == 2 && hermitian.value(1, 0).im == 3);
  EXPECT_TRUE(hermitian.value(0, 1).re == 2 && hermitian.value(0, 1).im == -3);
  const Dense symmetric = read(triangle('U', 2, 2), a, Structure::symmetric);
  EXPECT_TRUE(symmetric.value(1, 0).re == 7 && symmetric.value(1, 0).im == 7);
  const Dense unit = read(triangle('U', 2, 2), a, Structure::unit_triangular);
  EXPECT_TRUE(unit.value(1, 1).re == 1 && unit.value(1, 1).im == 0 && unit.has[unit.at(1, 0)] == 0);
}

// Compensated sums and 113-bit sums of the same products, over many magnitudes, in units of the sum of magnitudes.
template <class T>
double worst_disagreement(int spread) {
  std::mt19937_64 bits(7);
  std::uniform_real_distribution<double> mantissa(-1, 1);
  std::uniform_int_distribution<int> exponent(-spread, spread);
  double worst = 0;
  for (QtbInt k = 1; k <= 1000; k += 37) {
    const auto count = static_cast<std::size_t>(k);
    std::vector<double> v[4];
    for (int part = 0; part < 4; ++part) {
      v[part].resize(count);
      if (!is_complex<T> && part % 2 == 1) continue;  // a real number has no imaginary part
      for (double &x : v[part]) x = static_cast<Real<T>>(std::ldexp(mantissa(bits), exponent(bits)));
    }
    const Strip x{v[0].data(), v[1].data()}, y{v[2].data(), v[3].data()};
    constexpr bool exact = sizeof(Real<T>) == sizeof(float);
    const CompensatedSum got = compensated_sum(0, k, x, y, is_complex<T>, exact);
    const WideSum want = wide_sum(0, k, x, y, is_complex<T>);
    const QuadComplex value = got.value();
    const Quad error = magnitude(QuadComplex{value.re - want.value.re, value.im - want.value.im});
    worst = std::fmax(worst, static_cast<double>(error / Quad(want.gauge)));
    EXPECT_NEAR(got.gauge / want.gauge, 1, 1e-12);
  }
  return worst;
}

TEST(compensated_sums, agree_with_wide_ones_far_below_any_bound) {
  EXPECT_LT(worst_disagreement<float>(30), 0x1p-85);
  EXPECT_LT(worst_disagreement<double>(30), 0x1p-85);
  EXPECT_LT(worst_disagreement<double>(250), 0x1p-85);
  EXPECT_LT(worst_disagreement<cfloat>(30), 0x1p-85);
  EXPECT_LT(worst_disagreement<cdouble>(30), 0x1p-85);
}

TEST(wide_sums, are_taken_where_products_leave_the_range_of_double) {
  const double huge = 0x1p1000, tiny = 0x1p-1000;
  const double a[] = {huge, tiny}, x[] = {huge, tiny}, y[] = {0};
  const Expectation e = gemv('N', 1, 2, tiny, a, 1, x, 1, 0.0, y, 1);
  EXPECT_TRUE(e.at(0, 0).value.re == Quad(0x1p1000));
}

// alpha*A*B + beta*C beside the same in 113 bits, in units of the gauge.
template <class T>
double worst_error_of_a_product() {
  std::mt19937_64 bits(11);
  std::uniform_real_distribution<double> part(-1, 1);
  const auto draw = [&] {
    if constexpr (is_complex<T>)
      return T{static_cast<Real<T>>(part(bits)), static_cast<Real<T>>(part(bits))};
    else
      return static_cast<T>(part(bits));
  };
  double worst = 0;
  for (QtbInt k = 1; k <= 40; k += 3) {
    const T alpha = draw(), beta = draw(), c = draw();
    std::vector<T> a, b;
    QuadComplex sum;
    for (QtbInt l = 0; l < k; ++l) {
      a.push_back(draw()), b.push_back(draw());
      const QuadComplex p = product(qtb::test::widen(a.back()), qtb::test::widen(b.back()), is_complex<T>);
      sum.re += p.re, sum.im += p.im;
    }
    const Expectation e = gemm('N', 'N', 1, 1, k, alpha, a.data(), 1, b.data(), k, beta, &c, 1);
    const QuadComplex x = product(qtb::test::widen(alpha), sum, is_complex<T>),
                      y = product(qtb::test::widen(beta), qtb::test::widen(c), is_complex<T>), got = e.at(0, 0).value;
    const Quad error = magnitude(QuadComplex{got.re - x.re - y.re, got.im - x.im - y.im});
    worst = std::fmax(worst, static_cast<double>(error / Quad(e.at(0, 0).gauge)));
  }
  return worst;
}

TEST(products, with_factors_lie_far_below_any_bound) {
  EXPECT_LT(worst_error_of_a_product<float>(), 0x1p-85);
  EXPECT_LT(worst_error_of_a_product<double>(), 0x1p-85);
  EXPECT_LT(worst_error_of_a_product<cfloat>(), 0x1p-85);
  EXPECT_LT(worst_error_of_a_product<cdouble>(), 0x1p-85);
}

// Results around the bound, of all magnitudes, judged in doubles and in 113 bits.
template <class R>
void expect_same_judgement(int least, int most) {
  std::mt19937_64 bits(13);
  std::uniform_real_distribution<double> part(-1, 1);
  std::uniform_int_distribution<int> exponent(least, most), error(-3, 3);
  for (int i = 0; i < 20000; ++i) {
    const double scale = std::ldexp(1, exponent(bits));
    const Quad want = Quad(part(bits)) * scale + Quad(part(bits)) * scale * Quad(0x1p-54);
    const Quad gauge = (want < 0 ? -want : want) * Quad(1 + std::fabs(part(bits)));
    const double c = 1 + i % 50;
    const R got = static_cast<R>(static_cast<double>(want) +
                                 part(bits) * c * qtb::test::unit_roundoff<R> * scale * std::ldexp(1, error(bits)));
    const double ratio = qtb::test::error_ratio(got, want, gauge, c),
                 wide = qtb::test::wide_error_ratio(got, want, gauge, c, 1);
    EXPECT_EQ(ratio <= 1, wide <= 1);
    if (std::isfinite(wide))
      EXPECT_LE(std::fabs(ratio - wide), 0x1p-40 * wide);
    else
      EXPECT_EQ(ratio, wide);
  }
}

TEST(error_ratios, in_doubles_decide_as_wide_ones_do) {
  expect_same_judgement<float>(-160, 128);
  expect_same_judgement<double>(-1074, 1023);
}

TEST(products, come_out_as_on_paper) {
  const cdouble a[] = {{1, 1}, {2, 0}}, b[] = {{0, 1}, {3, 0}};
  const cdouble c{1, 0};
  // conj(1 + i) i + 2 * 3 = 7 + i; times 2i, plus 1.
  const Expectation e = gemm('C', 'N', 1, 1, 2, cdouble{0, 2}, a, 2, b, 2, cdouble{1, 0}, &c, 1);
  EXPECT_TRUE(e.at(0, 0).value.re == -1 && e.at(0, 0).value.im == 14);
  EXPECT_EQ(e.at(0, 0).gauge, 2 * (2 * 1 + 2 * 3) + 1);
  EXPECT_EQ(e.roundings, 8);
}

TEST(products, of_a_triangle_take_in_no_structural_zero) {
  const double nan = std::numeric_limits<double>::quiet_NaN();
  const double a[] = {1, nan, 2, 3}, x[] = {5, nan};
  const Expectation e = trmv('L', 'N', 'N', 2, a, 2, x, 1);
  EXPECT_TRUE(e.at(0, 0).value.re == 5);
  EXPECT_TRUE(qtb::test::is_nan(e.at(1, 0).value.re));
}

TEST(updates, of_a_triangle_leave_the_other_one) {
  const double x[] = {2, 3}, a[] = {1, 1, 1, 1};
  const Expectation e = syr('U', 2, 1.0, x, 1, a, 2);
  EXPECT_EQ(e.at(1, 0).outcome, Outcome::unchanged);
  EXPECT_TRUE(e.at(0, 1).value.re == 7 && e.at(1, 1).value.re == 10);
}

TEST(residuals, vanish_for_the_solution_and_show_an_error) {
  const double t[] = {2, 1, 0, 4}, b[] = {2, 9}, right[] = {1, 2}, wrong[] = {1, 2.5};
  EXPECT_TRUE(trsv_residual('L', 'N', 'N', 2, t, 2, b, right, 1).at(1, 0).value.re == 0);
  EXPECT_TRUE(trsv_residual('L', 'N', 'N', 2, t, 2, b, wrong, 1).at(1, 0).value.re == 2);
}

}  // namespace
