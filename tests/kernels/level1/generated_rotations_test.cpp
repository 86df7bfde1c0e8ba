// Generated rotations, plane and modified, in every tier.

#include <gtest/gtest.h>

#include "tests/reference/rotations.h"
#include "tests/support/placed.h"
#include "tests/support/random.h"
#include "tests/support/tally.h"

namespace {

using namespace qtb::test;
using qtb::reference::Matrix;

template <class T>
using Rotg = void (*)(T *, T *, Real<T> *, T *);
template <class T>
using Rotmg = void (*)(T *, T *, T *, const T *, T *);

const Rotg<float> srotg[] = QTB_ALL_TIERS(srotg);
const Rotg<double> drotg[] = QTB_ALL_TIERS(drotg);
const Rotg<cfloat> crotg[] = QTB_ALL_TIERS(crotg);
const Rotg<cdouble> zrotg[] = QTB_ALL_TIERS(zrotg);
const Rotmg<float> srotmg[] = QTB_ALL_TIERS(srotmg);
const Rotmg<double> drotmg[] = QTB_ALL_TIERS(drotmg);

constexpr double infinity = std::numeric_limits<double>::infinity();

// ---- rotg ----

template <class T>
qtb::reference::Generated<T> generated(Rotg<T> routine, T a, T b) {
  qtb::reference::Generated<T> g{a, b, -99, {}};
  routine(&g.a, &g.b, &g.c, &g.s);
  return g;
}

template <class T>
bool same(const qtb::reference::Generated<T> &g, const qtb::reference::Generated<T> &h) {
  return same_bits(g.a, h.a) && same_bits(g.b, h.b) && same_bits(g.c, h.c) && same_bits(g.s, h.s);
}

// r against the hypotenuse, and the three identities, over their bounds.
template <class R>
double rotg_ratio(const qtb::reference::Generated<R> &g, R a, R b) {
  const Quad qa = a, qb = b, c = g.c, s = g.s, r = g.a, u = unit_roundoff<R>;
  const Quad length_error = magnitude(r * r - (qa * qa + qb * qb)) / (r * r) / 2;  // relative, to first order
  Quad worst = length_error / (6 * u);
  for (const Quad error : {c * c + s * s - 1, (c * qa + s * qb - r) / r, (c * qb - s * qa) / r})
    worst = worst > magnitude(error) / (12 * u) ? worst : magnitude(error) / (12 * u);
  return static_cast<double>(worst);
}

template <class R, class Routines>
void check_rotg(const char *name, const Routines &routines) {
  RandomBits bits(10);
  constexpr int top = sizeof(R) == sizeof(float) ? 60 : 500;
  for (int trial = 0; trial < 20000; ++trial) {
    const int spread = trial % 3 == 0 ? top : 3;
    auto v = random_vector<R>(bits, 2, -spread, spread);
    if (trial % 10 == 1) v[trial % 20 == 1] = 0;
    if (trial % 10 == 2) v[0] = trial % 20 == 2 ? v[1] : -v[1];
    in_every_tier([&](int tier) {
      const auto got = generated<R>(routines[tier], v[0], v[1]);
      const double ratio = rotg_ratio(got, v[0], v[1]);
      TallyReport::of(name).within(tier, ratio);
      ASSERT_LE(ratio, 1) << name << " " << tier_name(tier) << " of " << v[0] << ", " << v[1];
      ASSERT_TRUE(same(got, qtb::reference::rotg(v[0], v[1]))) << name << " " << tier_name(tier);
    });
  }
}
TEST(rotg, rotates_within_its_bounds_and_by_the_published_formulas) {
  check_rotg<float>("srotg", srotg);
  check_rotg<double>("drotg", drotg);
}

TEST(rotg, of_small_whole_numbers_is_as_on_paper) {
  struct Case {
    double a, b, r, z, c, s;
  };
  const Case cases[] = {{3, 4, 5, 1 / 0.6, 0.6, 0.8},
                        {-3, 4, 5, 1 / -0.6, -0.6, 0.8},
                        {3, -4, -5, 1 / -0.6, -0.6, 0.8},
                        {4, 3, 5, 0.6, 0.8, 0.6},
                        {-4, 3, -5, -0.6, 0.8, -0.6},
                        {0, 2, 2, 1, 0, 1},
                        {0, -2, -2, 1, 0, 1},
                        {2, 0, 2, 0, 1, 0},
                        {-2, 0, -2, 0, 1, 0},
                        {0, 0, 0, 0, 1, 0}};
  in_every_tier([&](int tier) {
    for (const Case &k : cases) {
      const auto d = generated<double>(drotg[tier], k.a, k.b);
      const auto s = generated<float>(srotg[tier], static_cast<float>(k.a), static_cast<float>(k.b));
      const auto expect = [&](auto got, double want, double u) {
        EXPECT_LE(std::fabs(got - want), 12 * u * std::fabs(want)) << tier_name(tier) << " of " << k.a << " " << k.b;
      };
      expect(d.a, k.r, unit_roundoff<double>), expect(s.a, k.r, unit_roundoff<float>);
      expect(d.b, k.z, unit_roundoff<double>), expect(s.b, k.z, unit_roundoff<float>);
      expect(d.c, k.c, unit_roundoff<double>), expect(s.c, k.c, unit_roundoff<float>);
      expect(d.s, k.s, unit_roundoff<double>), expect(s.s, k.s, unit_roundoff<float>);
    }
  });
}

TEST(rotg, at_the_ends_of_the_range_neither_overflows_nor_underflows) {
  in_every_tier([&](int tier) {
    const auto large = generated<double>(drotg[tier], 3e307, 4e307),
               small = generated<double>(drotg[tier], 3e-307, 4e-307);
    EXPECT_NEAR(large.a / 5e307, 1, 1e-15) << tier_name(tier);
    EXPECT_NEAR(small.a / 5e-307, 1, 1e-15) << tier_name(tier);
    EXPECT_NEAR(large.c, 0.6, 1e-15);
    EXPECT_NEAR(small.s, 0.8, 1e-15);
  });
}

// c*c + |s|^2 - 1, c*a + s*b - r and c*b - conj(s)*a over |r|, over their bounds. a and b moderate.
template <class R>
double rotg_ratio(const qtb::reference::Generated<Complex<R>> &g, Complex<R> a, Complex<R> b) {
  const QuadComplex qa = widen(a), qb = widen(b), s = widen(g.s), r = widen(g.a);
  const Quad c = g.c, bound = Quad(24 * unit_roundoff<R>);
  const Quad length = magnitude(r);
  const QuadComplex first{c * qa.re + s.re * qb.re - s.im * qb.im - r.re,
                          c * qa.im + s.re * qb.im + s.im * qb.re - r.im};
  const QuadComplex second{c * qb.re - (s.re * qa.re + s.im * qa.im), c * qb.im - (s.re * qa.im - s.im * qa.re)};
  Quad worst = magnitude(c * c + s.re * s.re + s.im * s.im - 1);
  for (const Quad error : {magnitude(first) / length, magnitude(second) / length})
    worst = worst > error ? worst : error;
  return static_cast<double>(worst / bound);
}

template <class R, class Routines>
void check_complex_rotg(const char *name, const Routines &routines) {
  RandomBits bits(11);
  constexpr int top = sizeof(R) == sizeof(float) ? 20 : 200;
  long in_last_bits = 0;
  for (int trial = 0; trial < 20000; ++trial) {
    const int spread = trial % 3 == 0 ? top : 3;
    auto v = random_vector<Complex<R>>(bits, 2, -spread, spread);
    if (trial % 10 == 1) v[1] = {0, 0};
    if (trial % 10 == 2) v[trial % 4 / 2].im = 0;
    in_every_tier([&](int tier) {
      const auto got = generated<Complex<R>>(routines[tier], v[0], v[1]);
      const double ratio = rotg_ratio(got, v[0], v[1]);
      TallyReport::of(name).within(tier, ratio);
      ASSERT_LE(ratio, 1) << name << " " << tier_name(tier);
      const auto in_double = qtb::reference::rotg<double>(v[0], v[1]), as_given = qtb::reference::rotg<R>(v[0], v[1]);
      ASSERT_TRUE(same(got, tier == tier_def ? as_given : in_double)) << name << " " << tier_name(tier);
      in_last_bits += !same(as_given, in_double);
    });
  }
  EXPECT_EQ(in_last_bits > 0, sizeof(R) == sizeof(float)) << name;
}
TEST(complex_rotg, rotates_within_its_bounds_and_by_the_published_formulas) {
  check_complex_rotg<float>("crotg", crotg);
  check_complex_rotg<double>("zrotg", zrotg);
}

TEST(complex_rotg, of_a_zero_a_exchanges) {
  in_every_tier([&](int tier) {
    const auto c = generated<cfloat>(crotg[tier], {0, -0.0F}, {3, -4});
    EXPECT_TRUE(c.a.re == 3 && c.a.im == -4 && c.c == 0 && c.s.re == 1 && c.s.im == 0) << tier_name(tier);
    const auto z = generated<cdouble>(zrotg[tier], {0, 0}, {3, -4});
    EXPECT_TRUE(z.a.re == 3 && z.a.im == -4 && z.c == 0 && z.s.re == 1 && z.s.im == 0) << tier_name(tier);
    // The modulus is taken without a guard, so that one whose square underflows counts as zero.
    const auto tiny = generated<cfloat>(crotg[tier], {1e-30F, 0}, {1, 0});
    EXPECT_TRUE(tiny.c == 0 && tiny.s.re == 1 && tiny.a.re == 1) << tier_name(tier);
  });
}

// ---- rotmg ----

template <class R>
qtb::reference::GeneratedModified<R> generated(Rotmg<R> routine, R d1, R d2, R x1, R y1, const R *before) {
  qtb::reference::GeneratedModified<R> g{d1, d2, x1, {before[0], before[1], before[2], before[3], before[4]}};
  routine(&g.d1, &g.d2, &g.x1, &y1, g.param);
  return g;
}

// How far H (x1, y1) is from (new x1, 0), and d1*x1*x1 + d2*y1*y1 from what it was, over bounds that count roundings:
// three in an element of H against what it stands for, three more in u and in the new x1; twelve in the weighted sum.
template <class R>
double rotmg_ratio(const qtb::reference::GeneratedModified<R> &g, R d1, R d2, R x1, R y1) {
  const Matrix<R> h = qtb::reference::matrix(g.param);
  const auto first = qtb::reference::row(h.h11, x1, h.h12, y1), second = qtb::reference::row(h.h21, x1, h.h22, y1);
  double worst = error_ratio(g.x1, first.value, first.gauge, 6);
  worst = std::fmax(worst, error_ratio(R(0), second.value, second.gauge, 4));
  if (g.param[0] >= 0) {
    const Quad p = Quad(d1) * Quad(x1) * Quad(x1), q = Quad(d2) * Quad(y1) * Quad(y1);
    const Quad error = magnitude(Quad(g.d1) * Quad(g.x1) * Quad(g.x1) - (p + q));
    worst =
        std::fmax(worst, static_cast<double>(error / (12 * Quad(unit_roundoff<R>) * (magnitude(p) + magnitude(q)))));
  }
  return worst;
}

template <class R, class Routines>
void check_rotmg(const char *name, const Routines &routines) {
  RandomBits bits(12);
  constexpr bool single = sizeof(R) == sizeof(float);
  R before[5];
  for (R &v : before) store_signalling_nan<R>(&v);
  long flags[4] = {};
  for (int trial = 0; trial < 60000; ++trial) {
    const int spread = trial % 4 == 0 ? (single ? 40 : 200) : trial % 4 == 1 ? 30 : 6;
    auto v = random_vector<R>(bits, 4, -spread, spread);
    if (trial % 16 != 5) v[0] = std::fabs(v[0]);
    if (trial % 3 != 0) v[1] = std::fabs(v[1]);
    if (trial % 32 < 4) v[static_cast<std::size_t>(trial % 4)] = 0;
    const auto want = qtb::reference::rotmg(v[0], v[1], v[2], v[3], before);
    in_every_tier([&](int tier) {
      const auto got = generated<R>(routines[tier], v[0], v[1], v[2], v[3], before);
      if (want.endless) return;
      bool equal = same_bits(got.d1, want.d1) && same_bits(got.d2, want.d2) && same_bits(got.x1, want.x1);
      for (int k = 0; k < 5; ++k) equal = equal && same_bits(got.param[k], want.param[k]);
      ASSERT_TRUE(equal) << name << " " << tier_name(tier) << " trial " << trial;
      // Scaling is by powers of two in double only; single's rgam is not one. Extreme data lose bits below the range.
      const bool judged = got.param[0] != -2 && (got.param[0] >= 0 || !single) && spread <= 30 && got.d1 != 0;
      if (judged) {
        const double ratio = rotmg_ratio(got, v[0], v[1], v[2], v[3]);
        TallyReport::of(name).within(tier, ratio);
        ASSERT_LE(ratio, 1) << name << " " << tier_name(tier) << " trial " << trial << " flag " << got.param[0];
      } else {
        TallyReport::of(name).exact(tier);
      }
    });
    ++flags[static_cast<int>(want.param[0]) + 2];
  }
  for (const long count : flags) EXPECT_GT(count, 1000) << name;
}
TEST(rotmg, rotates_within_its_bounds_and_by_the_stated_formulas) {
  check_rotmg<float>("srotmg", srotmg);
  check_rotmg<double>("drotmg", drotmg);
}

template <class R>
void expect_modified(Rotmg<R> routine, R d1, R d2, R x1, R y1, const qtb::reference::GeneratedModified<R> &want) {
  const R before[] = {9, 9, 9, 9, 9};
  const auto got = generated<R>(routine, d1, d2, x1, y1, before);
  EXPECT_EQ(got.d1, want.d1);
  EXPECT_EQ(got.d2, want.d2);
  EXPECT_EQ(got.x1, want.x1);
  for (int k = 0; k < 5; ++k) EXPECT_EQ(got.param[k], want.param[k]) << k;
}

TEST(rotmg, of_a_negative_d1_is_all_zero) {
  in_every_tier([&](int tier) {
    expect_modified<double>(drotmg[tier], -1, 2, 3, 4, {0, 0, 0, {-1, 0, 0, 0, 0}});
    expect_modified<float>(srotmg[tier], -1, 2, 3, 4, {0, 0, 0, {-1, 0, 0, 0, 0}});
  });
}

TEST(rotmg, of_a_negative_d2_that_outweighs_is_all_zero) {
  in_every_tier([&](int tier) { expect_modified<double>(drotmg[tier], 1, -2, 3, 4, {0, 0, 0, {-1, 0, 0, 0, 0}}); });
}

TEST(rotmg, with_nothing_to_rotate_writes_only_the_flag) {
  in_every_tier([&](int tier) {
    expect_modified<double>(drotmg[tier], 1, 2, 3, 0, {1, 2, 3, {-2, 9, 9, 9, 9}});
    expect_modified<double>(drotmg[tier], 1, 0, 3, 4, {1, 0, 3, {-2, 9, 9, 9, 9}});
    expect_modified<float>(srotmg[tier], 1, 2, 3, 0, {1, 2, 3, {-2, 9, 9, 9, 9}});
  });
}

TEST(rotmg, stores_only_the_diagonal_that_its_flag_needs) {
  in_every_tier([&](int tier) {
    expect_modified<double>(drotmg[tier], 1, 1, 2, 1, {0.8, 0.8, 2.5, {0, 9, -0.5, 0.5, 9}});
    expect_modified<double>(drotmg[tier], 1, 1, 1, 2, {0.8, 0.8, 2.5, {1, 0.5, 9, 9, 0.5}});
  });
}

// Where d1*x1*x1 and d2*y1*y1 are equal in magnitude neither outweighs the other: the form is that of the second, and a
// negative second resets.
template <class R>
void expect_equal_weights(Rotmg<R> routine) {
  expect_modified<R>(routine, 1, 1, 1, 1, {R(0.5), R(0.5), 2, {1, 1, 9, 9, 1}});
  expect_modified<R>(routine, 1, 1, -3, 3, {R(0.5), R(0.5), 6, {1, -1, 9, 9, -1}});
  expect_modified<R>(routine, 4, 1, 1, 2, {R(0.5), 2, 4, {1, 2, 9, 9, R(0.5)}});
  expect_modified<R>(routine, 1, -1, 1, 1, {0, 0, 0, {-1, 0, 0, 0, 0}});
  expect_modified<R>(routine, 4, -1, 1, -2, {0, 0, 0, {-1, 0, 0, 0, 0}});
}
TEST(rotmg, of_equal_magnitudes_takes_the_form_of_the_second) {
  in_every_tier([&](int tier) {
    expect_equal_weights<float>(srotmg[tier]);
    expect_equal_weights<double>(drotmg[tier]);
  });
}

TEST(rotmg, scales_a_small_d1_up_and_a_large_one_down) {
  const double rgamsq = 5.960464477539e-8;  // not exactly 2**-24
  in_every_tier([&](int tier) {
    expect_modified<double>(drotmg[tier], 0x1p-30, 0x1p-30, 2, 1,
                            {0.8 * 0x1p-6, 0.8 * 0x1p-6, 2.5 * 0x1p-12, {-1, 0x1p-12, -0x1p-13, 0x1p-13, 0x1p-12}});
    expect_modified<double>(drotmg[tier], 0x1p30, 1, 1, 0x1p-20,
                            {0x1p30 * rgamsq, 1, 4096, {-1, 4096, -0x1p-20, 0x1p-50 * 4096, 1}});
    const float rgam = 0.000244141F;  // not exactly 2**-12
    expect_modified<float>(srotmg[tier], 0x1p-30F, 0x1p-30F, 2, 1,
                           {0.8F * 0x1p-6F, 0.8F * 0x1p-6F, 2.5F * rgam, {-1, rgam, -0.5F * rgam, 0.5F * rgam, rgam}});
  });
}

TEST(rotmg, passes_a_large_d2_in_the_zero_flag_form_once_through_the_scaling_of_a_small_one) {
  const double u = 1 + 0x1p-10;
  in_every_tier([&](int tier) {
    expect_modified<double>(drotmg[tier], 1, 0x1p30, 1, 0x1p-20,
                            {1 / u, 0x1p30 * (1 / u) * 0x1p24, u, {-1, 1, -0x1p-32, 0x1p10, 0x1p-12}});
    const float us = 1 + 0x1p-10F, rgam = 0.000244141F;
    expect_modified<float>(srotmg[tier], 1, 0x1p30F, 1, 0x1p-20F,
                           {1 / us, 0x1p30F * (1 / us) * 0x1p24F, us, {-1, 1, -0x1p-20F * rgam, 0x1p10F, rgam}});
  });
}

TEST(rotmg, scales_a_large_d2_down_in_the_other_forms) {
  const double rgamsq = 5.960464477539e-8;
  in_every_tier([&](int tier) {
    // d1 and d2 change places: the new d2 is large.
    expect_modified<double>(drotmg[tier], 0x1p30, 1, 0x1p-20, 1,
                            {1 / (1 + 0x1p-10),
                             0x1p30 * (1 / (1 + 0x1p-10)) * rgamsq,
                             1 + 0x1p-10,
                             {-1, 0x1p10, -4096, 1, 0x1p-20 * 4096}});
  });
}

// A weight that meets a limit exactly, at first or after a pass, is scaled once more. In single gam**2 is exact.
TEST(rotmg, scales_weights_at_the_limits_themselves) {
  const float rgam = 0.000244141F, y1 = 0x1p-50F;
  in_every_tier([&](int tier) {
    for (const int passes : {1, 2}) {
      const float up = std::ldexp(1.0F, 12 * passes), down = passes == 1 ? rgam : rgam * rgam;
      const float large = std::ldexp(1.0F, 24 * passes), small = std::ldexp(1.0F, -24 * passes);
      // y1 is so small that u is 1 and d1, d2 and x1 are only scaled: d1 in these two, d2 behind it in the next.
      expect_modified<float>(srotmg[tier], large, 1, 1, y1, {1, 1, up, {-1, up, -y1, y1 / large * up, 1}});
      expect_modified<float>(srotmg[tier], small, 1, 1, y1, {1, 1, down, {-1, down, -y1, y1 / small * down, 1}});
      expect_modified<float>(srotmg[tier], 1, small, 1, y1, {1, 1, 1, {-1, 1, -y1 * down, y1 * small, down}});
      // x1 is so small that they only change places: the new d2 is the old d1.
      expect_modified<float>(srotmg[tier], large, 1, y1, 1, {1, 1, 1, {-1, large * y1, -up, 1, y1 * up}});
    }
    // A large d2 at the limit in the zero-flag form.
    expect_modified<float>(srotmg[tier], 1, 0x1p24F, 1, y1, {1, 0x1p48F, 1, {-1, 1, -y1 * rgam, y1 * 0x1p24F, rgam}});
  });
}

// Where rounding makes the determinant zero or negative no factor brings d1 into range.
TEST(rotmg, ends_whatever_it_is_given) {
  RandomBits bits(13);
  const double special[] = {0,     1,      -1,    infinity, -infinity, std::numeric_limits<double>::quiet_NaN(),
                            1e308, 5e-324, 1e-200};
  const double before[5] = {};
  in_every_tier([&](int tier) {
    for (const double d1 : special)
      for (const double d2 : special)
        for (const double x1 : special)
          for (const double y1 : special) generated<double>(drotmg[tier], d1, d2, x1, y1, before);
    for (int trial = 0; trial < 100000; ++trial) {
      const auto v = random_vector<double>(bits, 3, 0, 0);
      const double d1 = std::fabs(v[0]), x1 = v[1], y1 = v[2];
      generated<double>(drotmg[tier], d1, -d1 * x1 * x1 / y1 / y1, x1, y1, before);
    }
  });
}

}  // namespace
