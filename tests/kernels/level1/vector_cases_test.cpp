// The cases of the basic vector kernels that have a rule of their own: quick returns, special values of alpha, zero and
// negative increments, which tiers do what.

#include <cfloat>
#include <cmath>
#include <limits>

#include "tests/kernels/level1/vector_routines.h"
#include "tests/support/address.h"

namespace qtb::test {
namespace {

constexpr double infinity = std::numeric_limits<double>::infinity();

template <class F>
void in_each_tier(F &&f) {
  for_each_tier([&](int tier) {
    SCOPED_TRACE(tier_name(tier));
    f(tier);
  });
}

std::uint64_t bits_of(double v) {
  std::uint64_t bits;
  std::memcpy(&bits, &v, sizeof bits);
  return bits;
}
bool is_quiet_nan(double v) { return std::isnan(v) && (bits_of(v) >> 51 & 1) != 0; }

TEST(VectorCases, dots_of_no_elements_are_positive_zero) {
  in_each_tier([](int tier) {
    for (const QtbInt n : {0, -5}) {
      const QtbInt one = 1;
      const double x = 3;
      EXPECT_EQ(bits_of(ddot_tiers[tier](&n, &x, &one, &x, &one)), 0u);
      const cdouble z{1, 2};
      cdouble result{7, 7};
      EXPECT_EQ(zdotc_tiers[tier](&result, &n, &z, &one, &z, &one), &result);
      EXPECT_TRUE(bits_of(result.re) == 0 && bits_of(result.im) == 0);
    }
  });
}

TEST(VectorCases, complex_dots_store_their_result_at_any_address) {
  in_each_tier([](int tier) {
    for (int offset = 0; offset < 16; ++offset) {
      alignas(16) unsigned char room[48];
      std::memset(room, 0x5A, sizeof room);
      const QtbInt n = 2, one = 1;
      const cdouble x[] = {{1, 2}, {3, -1}}, y[] = {{2, 5}, {-1, 4}};
      cdouble *at = reinterpret_cast<cdouble *>(room + offset);
      EXPECT_EQ(zdotu_tiers[tier](at, &n, x, &one, y, &one), at);
      const cdouble got = reference::element(at);
      EXPECT_EQ(got.re, (1 * 2 - 2 * 5) + (3 * -1 - -1 * 4));
      EXPECT_EQ(got.im, (1 * 5 + 2 * 2) + (3 * 4 + -1 * -1));
      for (int i = 0; i < 48; ++i)
        if (i < offset || i >= offset + 16) {
          EXPECT_EQ(room[i], 0x5A);
        }
    }
  });
}

TEST(VectorCases, dot_with_both_increments_minus_one_pairs_as_with_one) {
  in_each_tier([](int tier) {
    const double x[] = {1, 2, 3, 4, 5}, y[] = {10, 200, 3000, 40000, 500000};
    const QtbInt n = 5, forward = 1, backward = -1;
    const double want = 10 + 400 + 9000 + 160000 + 2500000;
    EXPECT_EQ(ddot_tiers[tier](&n, x, &forward, y, &forward), want);
    EXPECT_EQ(ddot_tiers[tier](&n, x, &backward, y, &backward), want);
  });
}

TEST(VectorCases, dot_with_increments_of_opposite_sign_pairs_first_with_last) {
  in_each_tier([](int tier) {
    const double x[] = {1, 2, 3}, y[] = {10, 200, 3000};
    const QtbInt n = 3, forward = 1, backward = -1;
    EXPECT_EQ(ddot_tiers[tier](&n, x, &forward, y, &backward), 3000 + 400 + 30);
  });
}

TEST(VectorCases, axpy_with_a_nan_alpha_computes) {
  in_each_tier([](int tier) {
    const QtbInt n = 21, one = 1;
    const double nan = std::nan("");
    std::vector<double> x(21, 1.0), y(21, 2.0);
    daxpy_tiers[tier](&n, &nan, x.data(), &one, y.data(), &one);
    for (const double v : y) EXPECT_TRUE(std::isnan(v));
    const cfloat half_zero{0, std::nanf("")};
    std::vector<cfloat> a(21, cfloat{1, 1}), b(21, cfloat{2, 2});
    caxpy_tiers[tier](&n, &half_zero, a.data(), &one, b.data(), &one);
    for (const cfloat v : b) EXPECT_TRUE(std::isnan(v.re) && std::isnan(v.im));
  });
}

TEST(VectorCases, complex_axpy_with_one_part_of_alpha_zero_computes) {
  in_each_tier([](int tier) {
    const QtbInt n = 19, one = 1;
    const cdouble imaginary{0, 2}, real{2, 0};
    std::vector<cdouble> x(19, cdouble{3, 5}), y(19, cdouble{1, 1});
    zaxpy_tiers[tier](&n, &imaginary, x.data(), &one, y.data(), &one);
    for (const cdouble v : y) EXPECT_TRUE(v.re == 1 - 10 && v.im == 1 + 6);
    zaxpy_tiers[tier](&n, &real, x.data(), &one, y.data(), &one);
    for (const cdouble v : y) EXPECT_TRUE(v.re == -9 + 6 && v.im == 7 + 10);
  });
}

TEST(VectorCases, axpy_with_a_zero_increment_adds_to_one_element_every_time) {
  in_each_tier([](int tier) {
    for (QtbInt n = 1; n <= 40; ++n) {
      const QtbInt zero = 0, one = 1, two = 2;
      std::vector<double> x(80);
      for (std::size_t i = 0; i < x.size(); ++i) x[i] = static_cast<double>(i + 1);
      const double alpha = 3, sum = static_cast<double>(n * (n + 1) / 2), odd_sum = static_cast<double>(n * n);
      double y = 7;
      daxpy_tiers[tier](&n, &alpha, x.data(), &one, &y, &zero);
      EXPECT_EQ(y, 7 + 3 * sum);
      y = 7;
      daxpy_tiers[tier](&n, &alpha, x.data(), &two, &y, &zero);
      EXPECT_EQ(y, 7 + 3 * odd_sum);
      y = 7;
      daxpy_tiers[tier](&n, &alpha, x.data() + 4, &zero, &y, &zero);
      EXPECT_EQ(y, 7 + 15 * static_cast<double>(n));
      cdouble z{1, 2};
      const cdouble w{1, -1}, i{0, 1};
      zaxpy_tiers[tier](&n, &i, &w, &zero, &z, &zero);
      EXPECT_TRUE(z.re == 1 + static_cast<double>(n) && z.im == 2 + static_cast<double>(n));
      cfloat c{1, 2};
      const cfloat v{1, -1}, j{0, 1};
      caxpy_tiers[tier](&n, &j, &v, &zero, &c, &zero);
      EXPECT_TRUE(c.re == 1 + static_cast<float>(n) && c.im == 2 + static_cast<float>(n));
    }
  });
}

TEST(VectorCases, copy_to_a_zero_increment_leaves_the_walks_last_element) {
  in_each_tier([](int tier) {
    const QtbInt n = 9, zero = 0, one = 1, backward = -1;
    const double x[] = {1, 2, 3, 4, 5, 6, 7, 8, 9};
    double y = 0;
    dcopy_tiers[tier](&n, x, &one, &y, &zero);
    EXPECT_EQ(y, 9);
    dcopy_tiers[tier](&n, x, &backward, &y, &zero);
    EXPECT_EQ(y, 1);
    double all[9] = {};
    dcopy_tiers[tier](&n, x + 4, &zero, all, &one);
    for (const double v : all) EXPECT_EQ(v, 5);
  });
}

TEST(VectorCases, swap_with_a_zero_increment_passes_the_element_along) {
  in_each_tier([](int tier) {
    const QtbInt n = 6, zero = 0, one = 1;
    double x = 0, y[] = {1, 2, 3, 4, 5, 6};
    dswap_tiers[tier](&n, &x, &zero, y, &one);
    EXPECT_EQ(x, 6);
    for (int i = 0; i < 6; ++i) EXPECT_EQ(y[i], i);
  });
}

TEST(VectorCases, scal_with_a_zero_increment_multiplies_one_element_n_times) {
  in_each_tier([](int tier) {
    for (const QtbInt n : {1, 3, 4, 12, 20}) {
      const QtbInt zero = 0;
      const double alpha = 2, want = std::ldexp(5, static_cast<int>(n));
      double d[] = {5, 1};
      dscal_tiers[tier](&n, &alpha, d, &zero);
      EXPECT_EQ(d[0], want);
      EXPECT_EQ(d[1], 1);
      const float single_alpha = 2;
      float s[] = {5, 1};
      sscal_tiers[tier](&n, &single_alpha, s, &zero);
      EXPECT_EQ(s[0], want);
      EXPECT_EQ(s[1], 1);
      const cdouble complex_alpha{0, 2};  // a quarter turn and a doubling
      cdouble z{5, 0};
      zscal_tiers[tier](&n, &complex_alpha, &z, &zero);
      const double re[] = {want, 0, -want, 0};
      EXPECT_TRUE(z.re == re[n % 4] && z.im == re[(n + 3) % 4]);
      const cfloat complex_single{0, 2};
      cfloat c{5, 0};
      cscal_tiers[tier](&n, &complex_single, &c, &zero);
      EXPECT_TRUE(c.re == re[n % 4] && c.im == re[(n + 3) % 4]);
      cfloat by_real{5, -5};
      csscal_tiers[tier](&n, &single_alpha, &by_real, &zero);
      EXPECT_TRUE(by_real.re == want && by_real.im == -want);
      cdouble by_double{5, -5};
      zdscal_tiers[tier](&n, &alpha, &by_double, &zero);
      EXPECT_TRUE(by_double.re == want && by_double.im == -want);
    }
  });
}

TEST(VectorCases, scal_with_a_negative_increment_scales_the_elements_of_its_absolute_value) {
  in_each_tier([](int tier) {
    const QtbInt n = 3, two_back = -2, one_back = -1;
    const double alpha = 10;
    double x[] = {1, 2, 3, 4, 5};
    dscal_tiers[tier](&n, &alpha, x, &two_back);
    EXPECT_TRUE(x[0] == 10 && x[1] == 2 && x[2] == 30 && x[3] == 4 && x[4] == 50);
    dscal_tiers[tier](&n, &alpha, x, &one_back);
    EXPECT_TRUE(x[0] == 100 && x[1] == 20 && x[2] == 300 && x[3] == 4 && x[4] == 50);
    cdouble z[] = {{1, 2}, {3, 4}, {5, 6}, {7, 8}, {9, 10}};
    zdscal_tiers[tier](&n, &alpha, z, &two_back);
    EXPECT_TRUE(z[0].im == 20 && z[1].im == 4 && z[2].im == 60 && z[3].im == 8 && z[4].im == 100);
  });
}

TEST(VectorCases, scal_with_a_zero_alpha_multiplies) {
  in_each_tier([](int tier) {
    for (const QtbInt inc : {1, 2}) {
      const QtbInt n = 20;
      const double zero = 0;
      std::vector<double> x(40, -3.0);
      x[8] = std::nan("");
      x[10] = infinity;
      x[12] = 3;
      dscal_tiers[tier](&n, &zero, x.data(), &inc);
      EXPECT_TRUE(std::isnan(x[8]));
      EXPECT_TRUE(std::isnan(x[10]));
      EXPECT_EQ(bits_of(x[12]), bits_of(0.0));
      EXPECT_EQ(bits_of(x[0]), bits_of(-0.0));
    }
  });
}

// A multiplication by one makes a signalling NaN quiet; a return at once leaves it.
TEST(VectorCases, only_the_tiers_that_say_so_return_at_once_for_an_alpha_of_one) {
  in_each_tier([](int tier) {
    for (const QtbInt inc : {1, 2}) {
      const QtbInt n = 12;
      const double one = 1;
      std::vector<double> d(24, untouchable<double>());
      dscal_tiers[tier](&n, &one, d.data(), &inc);
      EXPECT_EQ(is_quiet_nan(d[2]), tier == tier_def);

      std::vector<cdouble> z(24, cdouble{untouchable<double>(), untouchable<double>()});
      const cdouble complex_one{1, 0};
      zscal_tiers[tier](&n, &complex_one, z.data(), &inc);
      EXPECT_EQ(is_quiet_nan(z[2].re), tier != tier_ssse3);
      z.assign(24, cdouble{untouchable<double>(), untouchable<double>()});
      zdscal_tiers[tier](&n, &one, z.data(), &inc);
      EXPECT_EQ(is_quiet_nan(z[2].im), tier == tier_def || inc != 1);

      const float single_one = 1;
      std::vector<float> s(24, untouchable<float>());
      sscal_tiers[tier](&n, &single_one, s.data(), &inc);
      EXPECT_FALSE(same_bits(s[2], untouchable<float>()));
      std::vector<cfloat> c(24, cfloat{untouchable<float>(), untouchable<float>()});
      const cfloat complex_single{1, 0};
      cscal_tiers[tier](&n, &complex_single, c.data(), &inc);
      EXPECT_FALSE(same_bits(c[2].re, untouchable<float>()));
    }
  });
}

TEST(VectorCases, zscal_in_ssse3_computes_unless_alpha_is_exactly_one) {
  if (!processor_runs(tier_ssse3)) GTEST_SKIP();
  const QtbInt n = 3, one = 1;
  const cdouble i{0, 1}, one_and_i{1, 1};
  cdouble z[] = {{1, 2}, {3, 4}, {5, 6}};
  zscal_tiers[tier_ssse3](&n, &i, z, &one);
  EXPECT_TRUE(z[1].re == -4 && z[1].im == 3);
  zscal_tiers[tier_ssse3](&n, &one_and_i, z, &one);
  EXPECT_TRUE(z[1].re == -7 && z[1].im == -1);
}

TEST(VectorCases, the_two_upper_tiers_share_one_sscal) {
  EXPECT_EQ(address_of(sscal_tiers[tier_avx]), address_of(sscal_tiers[tier_sse42]));
  EXPECT_NE(address_of(dscal_tiers[tier_avx]), address_of(dscal_tiers[tier_sse42]));
}

TEST(VectorCases, overflow_and_infinity_come_out_as_in_plain_arithmetic) {
  in_each_tier([](int tier) {
    for (const QtbInt n : {1, 7, 40}) {
      const QtbInt one = 1;
      const double two = 2, negative = -1;
      std::vector<double> x(40, DBL_MAX), y(40, -DBL_MAX);
      daxpy_tiers[tier](&n, &two, x.data(), &one, y.data(), &one);
      EXPECT_EQ(y[static_cast<std::size_t>(n - 1)], infinity);
      dscal_tiers[tier](&n, &two, x.data(), &one);
      EXPECT_EQ(x[0], infinity);
      daxpy_tiers[tier](&n, &negative, x.data(), &one, y.data(), &one);
      EXPECT_TRUE(std::isnan(y[0]));
      EXPECT_TRUE(std::isnan(ddot_tiers[tier](&n, y.data(), &one, x.data(), &one)));
      EXPECT_EQ(ddot_tiers[tier](&n, x.data(), &one, x.data(), &one), infinity);
    }
  });
}

TEST(VectorCases, subnormal_elements_are_scaled_exactly) {
  in_each_tier([](int tier) {
    const QtbInt n = 33, one = 1;
    const double four = 4;
    std::vector<double> x(33, std::numeric_limits<double>::denorm_min());
    dscal_tiers[tier](&n, &four, x.data(), &one);
    for (const double v : x) EXPECT_EQ(v, 4 * std::numeric_limits<double>::denorm_min());
  });
}

}  // namespace
}  // namespace qtb::test
