// Rotations, applied and generated, in every tier.

#include <gtest/gtest.h>

#include "tests/reference/rotations.h"
#include "tests/support/placed.h"
#include "tests/support/random.h"
#include "tests/support/tally.h"

namespace {

using namespace qtb::test;
using qtb::reference::Matrix;

template <class T>
using Rot = void (*)(const QtbInt *, T *, const QtbInt *, T *, const QtbInt *, const Real<T> *, const Real<T> *);
template <class T>
using Rotm = void (*)(const QtbInt *, T *, const QtbInt *, T *, const QtbInt *, const T *);
template <class T>
using Rotg = void (*)(T *, T *, Real<T> *, T *);
template <class T>
using Rotmg = void (*)(T *, T *, T *, const T *, T *);

const Rot<float> srot[] = QTB_ALL_TIERS(srot);
const Rot<double> drot[] = QTB_ALL_TIERS(drot);
const Rot<cfloat> csrot[] = QTB_ALL_TIERS(csrot);
const Rot<cdouble> zdrot[] = QTB_ALL_TIERS(zdrot);
const Rotm<float> srotm[] = QTB_ALL_TIERS(srotm);
const Rotm<double> drotm[] = QTB_ALL_TIERS(drotm);
const Rotg<float> srotg[] = QTB_ALL_TIERS(srotg);
const Rotg<double> drotg[] = QTB_ALL_TIERS(drotg);
const Rotg<cfloat> crotg[] = QTB_ALL_TIERS(crotg);
const Rotg<cdouble> zrotg[] = QTB_ALL_TIERS(zrotg);
const Rotmg<float> srotmg[] = QTB_ALL_TIERS(srotmg);
const Rotmg<double> drotmg[] = QTB_ALL_TIERS(drotmg);

constexpr double infinity = std::numeric_limits<double>::infinity();

template <class T>
Real<T> *parts(T &v) {
  return reinterpret_cast<Real<T> *>(&v);
}
template <class T>
const Real<T> *parts(const T &v) {
  return reinterpret_cast<const Real<T> *>(&v);
}
template <class T>
constexpr int width = is_complex<T> ? 2 : 1;

// ---- applied rotations: rot with a (c, s), rotm with a param, as one kind of thing ----

template <class T>
struct Applied {
  const char *name;
  Rot<T> rot[tier_count];  // null in a rotm
  Rotm<Real<T>> rotm[tier_count];
  Real<T> param[5];  // of a rot: c and s

  Matrix<Real<T>> matrix() const {
    if (rot[0] != nullptr) return {param[0], -param[1], param[1], param[0]};
    return qtb::reference::matrix(param);
  }
  void operator()(int tier, QtbInt n, T *x, QtbInt incx, T *y, QtbInt incy) const {
    if constexpr (!is_complex<T>)
      if (rot[0] == nullptr) return rotm[tier](&n, x, &incx, y, &incy, param);
    rot[tier](&n, x, &incx, y, &incy, &param[0], &param[1]);
  }
};

template <class T, class Routines>
Applied<T> rot_of(const char *name, const Routines &routines, Real<T> c, Real<T> s) {
  Applied<T> applied{name, {}, {}, {c, s}};
  for (int tier = 0; tier < tier_count; ++tier) applied.rot[tier] = routines[tier];
  return applied;
}
// The coefficients that the flag does not need are signalling NaNs.
template <class T, class Routines>
Applied<T> rotm_of(const char *name, const Routines &routines, T flag) {
  Applied<T> applied{name, {}, {}, {flag, T(1.25), T(-0.3), T(0.7), T(-1.1)}};
  for (const int k : {1, 4})
    if (flag == 0) store_signalling_nan<T>(&applied.param[k]);
  for (const int k : {2, 3})
    if (flag > 0) store_signalling_nan<T>(&applied.param[k]);
  for (int tier = 0; tier < tier_count; ++tier) applied.rotm[tier] = routines[tier];
  return applied;
}

template <class F>
void for_each_applied(F f) {
  f(rot_of<float>("srot", srot, 0.6F, 0.8F)), f(rot_of<double>("drot", drot, 0.6, -0.8));
  f(rot_of<cfloat>("csrot", csrot, -0.6F, 0.8F)), f(rot_of<cdouble>("zdrot", zdrot, 1.7, 0.3));
  f(rotm_of<float>("srotm", srotm, -1)), f(rotm_of<float>("srotm", srotm, 0)), f(rotm_of<float>("srotm", srotm, 1));
  f(rotm_of<double>("drotm", drotm, -1)), f(rotm_of<double>("drotm", drotm, 0)), f(rotm_of<double>("drotm", drotm, 1));
}

// error / bound of a pair that was (x, y).
template <class T>
double worst_ratio(const Matrix<Real<T>> &h, const T &x, const T &y, const T &got_x, const T &got_y) {
  double worst = 0;
  for (int k = 0; k < width<T>; ++k) {
    const auto first = qtb::reference::row(h.h11, parts(x)[k], h.h12, parts(y)[k]);
    const auto second = qtb::reference::row(h.h21, parts(x)[k], h.h22, parts(y)[k]);
    constexpr double c = qtb::reference::rotation_roundings;
    worst = std::fmax(worst, error_ratio(parts(got_x)[k], first.value, first.gauge, c));
    worst = std::fmax(worst, error_ratio(parts(got_y)[k], second.value, second.gauge, c));
  }
  return worst;
}

// What a call leaves behind, pair by pair in order, so that a zero increment acts on its element again and again.
template <class T>
void model(const Matrix<Real<T>> &h, QtbInt n, std::vector<T> &x, QtbInt incx, std::vector<T> &y, QtbInt incy) {
  for (QtbInt i = 0; i < n; ++i) {
    T &u = x[static_cast<std::size_t>(incx == 0 ? 0 : i)], &v = y[static_cast<std::size_t>(incy == 0 ? 0 : i)];
    for (int k = 0; k < width<T>; ++k) qtb::reference::transform(h, parts(u)[k], parts(v)[k]);
  }
}

TEST(applied_rotations, are_within_their_bound) {
  RandomBits bits(5);
  for_each_applied([&]<class T>(const Applied<T> &rotation) {
    constexpr int top = sizeof(Real<T>) == sizeof(float) ? 120 : 1000;
    for (const auto &[least, most] : {std::pair{-8, 8}, {-top, top}, {-top - 20, -top}})
      for (const QtbInt n : {1, 8, 64, 301}) {
        const auto x = random_vector<T>(bits, n, least, most), y = random_vector<T>(bits, n, least, most);
        in_every_tier([&](int tier) {
          auto got_x = x, got_y = y;
          rotation(tier, n, got_x.data(), 1, got_y.data(), 1);
          double worst = 0;
          for (std::size_t i = 0; i < x.size(); ++i)
            worst = std::fmax(worst, worst_ratio(rotation.matrix(), x[i], y[i], got_x[i], got_y[i]));
          TallyReport::of(rotation.name).within(tier, worst);
          ASSERT_LE(worst, 1) << rotation.name << " " << tier_name(tier) << " n " << n;
        });
      }
  });
}

struct Places {
  Arena x{arena_bytes}, y{arena_bytes};
};

template <class T>
void expect_model(const Applied<T> &rotation, Places &places, const std::vector<T> &x, const std::vector<T> &y,
                  QtbInt n, QtbInt incx, QtbInt incy, Flush flush, std::size_t offset_x, std::size_t offset_y) {
  Placed<T> px(places.x, x, n, incx, flush, offset_x), py(places.y, y, n, incy, flush, offset_y);
  std::vector<T> want_x = x, want_y = y;
  model(rotation.matrix(), n, want_x, incx, want_y, incy);
  in_every_tier([&](int tier) {
    px.restore(), py.restore();
    {
      FiniteOnly guard;
      rotation(tier, n, px.data(), incx, py.data(), incy);
    }
    TallyReport::of(rotation.name).within(tier, 0);
    bool same = px.gaps_untouched() && py.gaps_untouched();
    for (QtbInt i = 0; i < n; ++i) {
      const auto at_x = static_cast<std::size_t>(incx == 0 ? 0 : i), at_y = static_cast<std::size_t>(incy == 0 ? 0 : i);
      same = same && same_bits(px[i], want_x[at_x]) && same_bits(py[i], want_y[at_y]);
    }
    ASSERT_TRUE(same) << rotation.name << " flag " << rotation.param[0] << " " << tier_name(tier) << " n " << n
                      << " increments " << incx << " " << incy << " offsets " << offset_x << " " << offset_y;
  });
}

// The bits of an element pair are those of the formula, wherever the pair stands.
TEST(applied_rotations, do_not_depend_on_phases) {
  RandomBits bits(6);
  Places places;
  for_each_applied([&]<class T>(const Applied<T> &rotation) {
    const auto x = random_vector<T>(bits, 300, -8, 8), y = random_vector<T>(bits, 300, -8, 8);
    for (const QtbInt n : {1, 8, 9, 10, 12, 17, 29, 41, 67})
      for (std::size_t offset_x = 0; offset_x < 16; ++offset_x)
        for (std::size_t offset_y = 0; offset_y < 16; ++offset_y)
          expect_model(rotation, places, x, y, n, 1, 1, Flush::back, offset_x, offset_y);
  });
}

TEST(applied_rotations, do_not_depend_on_length) {
  RandomBits bits(7);
  Places places;
  for_each_applied([&]<class T>(const Applied<T> &rotation) {
    const auto x = random_vector<T>(bits, 2000, -8, 8), y = random_vector<T>(bits, 2000, -8, 8);
    for (const Flush flush : {Flush::back, Flush::front})
      for (const auto &[offset_x, offset_y] : {std::pair{0U, 0U}, {0U, 8U}, {4U, 4U}, {8U, 3U}}) {
        for (QtbInt n = 0; n <= 300; ++n) expect_model(rotation, places, x, y, n, 1, 1, flush, offset_x, offset_y);
        expect_model(rotation, places, x, y, 2000, 1, 1, flush, offset_x, offset_y);
      }
  });
}

TEST(applied_rotations, do_not_depend_on_increments) {
  RandomBits bits(8);
  Places places;
  for_each_applied([&]<class T>(const Applied<T> &rotation) {
    const auto x = random_vector<T>(bits, 40, -8, 8), y = random_vector<T>(bits, 40, -8, 8);
    for (QtbInt incx = -3; incx <= 3; ++incx)
      for (QtbInt incy = -3; incy <= 3; ++incy)
        for (const QtbInt n : {0, 1, 2, 3, 4, 5, 9, 10, 40})
          for (const std::size_t offset : {0, 4, 8, 13})
            for (const Flush flush : {Flush::back, Flush::front})
              expect_model(rotation, places, x, y, n, incx, incy, flush, offset, 12 - offset % 8);
  });
}

TEST(applied_rotations, of_nothing_touch_nothing_and_read_no_scalar) {
  Arena nothing(0);
  for_each_applied([&]<class T>(const Applied<T> &rotation) {
    T *v = reinterpret_cast<T *>(nothing.data());
    const auto *scalar = reinterpret_cast<const Real<T> *>(nothing.data());
    in_every_tier([&](int tier) {
      for (const QtbInt n : {0, -1, -20})
        for (const QtbInt incx : {1, -1, 0}) {
          if (rotation.rot[tier] != nullptr) {
            rotation.rot[tier](&n, v, &incx, v, &incx, scalar, scalar);
          } else if constexpr (!is_complex<T>) {
            rotation.rotm[tier](&n, v, &incx, v, &incx, scalar);
          }
        }
    });
  });
}

TEST(rot, with_c_0_and_s_1_exchanges_x_and_minus_y) {
  const double c = 0, s = 1;
  const QtbInt n = 11, inc = 1;
  in_every_tier([&](int tier) {
    double x[11], y[11];
    for (int i = 0; i < 11; ++i) x[i] = i + 1, y[i] = 100 + i;
    drot[tier](&n, x, &inc, y, &inc, &c, &s);
    for (int i = 0; i < 11; ++i) EXPECT_TRUE(x[i] == 100 + i && y[i] == -(i + 1)) << tier_name(tier);
  });
}

TEST(rot, with_c_1_and_s_0_still_multiplies) {
  in_every_tier([&](int tier) {
    const QtbInt n = 20, inc = 1;
    std::vector<double> x(20, 1.0), y(20, infinity);
    const double c = 1, s = 0;
    drot[tier](&n, x.data(), &inc, y.data(), &inc, &c, &s);
    for (int i = 0; i < 20; ++i) EXPECT_TRUE(std::isnan(x[i]) && y[i] == infinity) << tier_name(tier);
  });
}

// What comes back differs from what was by the rounding of two rotations and by the rounding of (c, s) itself.
TEST(rot, undone_by_the_opposite_angle_gives_back_what_was) {
  RandomBits bits(9);
  const QtbInt n = 100, inc = 1;
  for (int trial = 0; trial < 50; ++trial) {
    const auto angle = random_vector<double>(bits, 2, -3, 3);
    const auto x = random_vector<double>(bits, n, -4, 4), y = random_vector<double>(bits, n, -4, 4);
    in_every_tier([&](int tier) {
      double a = angle[0], b = angle[1], c, s;
      drotg[tier](&a, &b, &c, &s);
      const double opposite = -s;
      auto u = x, v = y;
      drot[tier](&n, u.data(), &inc, v.data(), &inc, &c, &s);
      drot[tier](&n, u.data(), &inc, v.data(), &inc, &c, &opposite);
      for (std::size_t i = 0; i < x.size(); ++i) {
        const double p = std::fabs(c), q = std::fabs(s), ax = std::fabs(x[i]), ay = std::fabs(y[i]);
        const double gauge_x = p * (p * ax + q * ay) + q * (p * ay + q * ax);
        const double gauge_y = p * (p * ay + q * ax) + q * (p * ax + q * ay);
        const double unit = unit_roundoff<double>;
        ASSERT_LE(std::fabs(u[i] - x[i]), unit * (12 * ax + 4.001 * gauge_x)) << tier_name(tier);
        ASSERT_LE(std::fabs(v[i] - y[i]), unit * (12 * ay + 4.001 * gauge_y)) << tier_name(tier);
      }
    });
  }
}

TEST(rotm, undone_by_the_inverse_matrix_gives_back_whole_numbers) {
  const double param[] = {-1, 2, 1, 1, 1}, inverse[] = {-1, 1, -1, -1, 2};
  const QtbInt n = 37;
  in_every_tier([&](int tier) {
    for (const QtbInt inc : {1, 2}) {
      std::vector<double> x(80), y(80);
      for (int i = 0; i < 80; ++i) x[i] = i * i, y[i] = 7 * i - 100;
      auto u = x, v = y;
      drotm[tier](&n, u.data(), &inc, v.data(), &inc, param);
      EXPECT_NE(u, x);
      drotm[tier](&n, u.data(), &inc, v.data(), &inc, inverse);
      EXPECT_TRUE(u == x && v == y) << tier_name(tier);
    }
  });
}

template <class T, class Routines>
void identity_touches_nothing(const Routines &routines) {
  Arena x(4096), y(4096), p(64);
  const Placed<T> px(x, std::vector<T>(30, T(1)), 30, 1, Flush::back, 0);
  const Placed<T> param(p, {T(-2)}, 1, 1, Flush::back, 0);  // the rest of it cannot be read
  x.read_only(), y.read_only();
  const QtbInt n = 30, inc = 1;
  in_every_tier([&](int tier) {
    routines[tier](&n, const_cast<T *>(px.data()), &inc, reinterpret_cast<T *>(y.data()), &inc, param.data());
  });
}
TEST(rotm, with_flag_minus_2_touches_nothing_and_reads_only_the_flag) {
  identity_touches_nothing<float>(srotm);
  identity_touches_nothing<double>(drotm);
}

TEST(rotm, takes_any_flag_by_its_sign) {
  const QtbInt n = 20, inc = 1;
  const double flags[] = {1, 2.5, 1e-300, infinity, -1, -1.5, -2.0000000001, -infinity, 0, -0.0};
  for (const double flag : flags) {
    double param[] = {flag, 2, 3, 5, 7};
    const double as_stated[] = {flag > 0 ? 1.0 : flag < 0 ? -1.0 : 0.0, 2, 3, 5, 7};
    const Matrix<double> h = qtb::reference::matrix(as_stated);
    in_every_tier([&](int tier) {
      std::vector<double> x(20, 10), y(20, 100), want_x = x, want_y = y;
      model(h, n, want_x, 1, want_y, 1);
      drotm[tier](&n, x.data(), &inc, y.data(), &inc, param);
      EXPECT_TRUE(x == want_x && y == want_y) << tier_name(tier) << " flag " << flag;
    });
  }
}

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
