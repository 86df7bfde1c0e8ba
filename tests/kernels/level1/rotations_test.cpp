// Applied rotations, plane and modified, in every tier.

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
const Rot<float> srot[] = QTB_ALL_TIERS(srot);
const Rot<double> drot[] = QTB_ALL_TIERS(drot);
const Rot<cfloat> csrot[] = QTB_ALL_TIERS(csrot);
const Rot<cdouble> zdrot[] = QTB_ALL_TIERS(zdrot);
const Rotm<float> srotm[] = QTB_ALL_TIERS(srotm);
const Rotm<double> drotm[] = QTB_ALL_TIERS(drotm);

using Rotg = void (*)(double *, double *, double *, double *);
const Rotg drotg[] = QTB_ALL_TIERS(drotg);

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

// rot with a (c, s), rotm with a param, as one kind of thing ----

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

}  // namespace
