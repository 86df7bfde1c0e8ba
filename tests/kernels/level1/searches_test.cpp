// Index searches, in every tier, against a scalar model of the published rule.

#include <gtest/gtest.h>

#include <cmath>

#include "tests/support/placed.h"
#include "tests/support/random.h"
#include "tests/support/tally.h"

namespace {

using namespace qtb::test;

template <class T>
using Search = QtbInt (*)(const QtbInt *, const T *, const QtbInt *);

template <class T>
struct Routine {
  const char *name;
  bool largest;
  Search<T> tiers[tier_count];
};
const Routine<float> isamax{"isamax", true, QTB_ALL_TIERS(isamax)}, isamin{"isamin", false, QTB_ALL_TIERS(isamin)};
const Routine<double> idamax{"idamax", true, QTB_ALL_TIERS(idamax)}, idamin{"idamin", false, QTB_ALL_TIERS(idamin)};
const Routine<cfloat> icamax{"icamax", true, QTB_ALL_TIERS(icamax)}, icamin{"icamin", false, QTB_ALL_TIERS(icamin)};
const Routine<cdouble> izamax{"izamax", true, QTB_ALL_TIERS(izamax)}, izamin{"izamin", false, QTB_ALL_TIERS(izamin)};

template <class F>
void for_each_routine(F f) {
  f(isamax), f(isamin), f(idamax), f(idamin), f(icamax), f(icamin), f(izamax), f(izamin);
}

template <class T>
QtbInt call(const Routine<T> &routine, int tier, QtbInt n, const T *x, QtbInt incx) {
  return routine.tiers[tier](&n, x, &incx);
}

template <class T>
T element_of(double re, double im = 0) {
  if constexpr (is_complex<T>)
    return {static_cast<Real<T>>(re), static_cast<Real<T>>(im)};
  else
    return static_cast<T>(re);
}

template <class T>
Real<T> magnitude_of(T v) {
  if constexpr (is_complex<T>)
    return std::fabs(v.re) + std::fabs(v.im);
  else
    return std::fabs(v);
}

// The best so far stays only where an ordered comparison says that it is at least as good.
template <class T>
QtbInt model(const std::vector<T> &x, QtbInt n, bool largest) {
  if (n < 1) return 0;
  QtbInt index = 1;
  for (QtbInt i = 2; i <= n; ++i) {
    const Real<T> best = magnitude_of(x[static_cast<std::size_t>(index - 1)]);
    const Real<T> value = magnitude_of(x[static_cast<std::size_t>(i - 1)]);
    if (std::isnan(best) || std::isnan(value) || (largest ? value > best : value < best)) index = i;
  }
  return index;
}

constexpr double nan = std::numeric_limits<double>::quiet_NaN();
constexpr double infinity = std::numeric_limits<double>::infinity();

// One placement: the model's index, in every tier.
template <class T>
void expect_model(const Routine<T> &routine, Arena &arena, const std::vector<T> &values, QtbInt n, QtbInt incx,
                  Flush flush, std::size_t offset, bool finite) {
  const Placed<T> x(arena, values, n, incx, flush, offset);
  const QtbInt want = model(values, n, routine.largest);
  in_every_tier([&](int tier) {
    QtbInt got;
    if (finite) {
      FiniteOnly guard;
      got = call(routine, tier, n, x.data(), incx);
    } else {
      got = call(routine, tier, n, x.data(), incx);
    }
    TallyReport::of(routine.name).exact(tier);
    ASSERT_EQ(got, want) << routine.name << " tier " << tier_name(tier) << " n " << n << " incx " << incx << " offset "
                         << offset;
  });
}

// Magnitudes from 1 to distinct, so that short vectors have none twice and long ones have ties.
template <class T>
std::vector<T> few_magnitudes(RandomBits &bits, QtbInt n, unsigned distinct) {
  std::vector<T> v(static_cast<std::size_t>(n));
  const auto part = [&] { return (bits() % 2 ? 1 : -1) * static_cast<double>(1 + bits() % distinct); };
  for (T &e : v) {
    const double re = part();
    e = element_of<T>(re, part());
  }
  return v;
}

TEST(searches, find_the_first_best_element_at_every_place) {
  RandomBits bits(2);
  Arena arena(arena_bytes);
  for_each_routine([&]<class T>(const Routine<T> &routine) {
    for (const unsigned distinct : {3U, 1000000U}) {
      const std::vector<T> values = few_magnitudes<T>(bits, 5003, distinct);
      for (const QtbInt incx : {1, 2, 3}) {
        for (QtbInt n = 0; n <= 300; n += incx == 1 || n < 20 ? 1 : 10)
          for (std::size_t offset = 0; offset < 16; ++offset)
            for (const Flush flush : {Flush::back, Flush::front})
              expect_model(routine, arena, values, n, incx, flush, offset, true);
        for (const QtbInt n : {1000, 5003}) expect_model(routine, arena, values, n, incx, Flush::back, 0, true);
      }
    }
  });
}

TEST(searches, find_the_best_element_in_every_place) {
  Arena arena(arena_bytes);
  for_each_routine([&]<class T>(const Routine<T> &routine) {
    for (const QtbInt n : {2, 3, 4, 5, 8, 33})
      for (QtbInt at = 0; at < n; ++at) {
        std::vector<T> values(static_cast<std::size_t>(n), element_of<T>(2, -2));
        values[static_cast<std::size_t>(at)] = routine.largest ? element_of<T>(-2, 3) : element_of<T>(1, -2);
        if (!is_complex<T> && routine.largest) values[static_cast<std::size_t>(at)] = element_of<T>(-3);
        for (const QtbInt incx : {1, 2}) {
          expect_model(routine, arena, values, n, incx, Flush::back, 0, true);
          ASSERT_EQ(model(values, n, routine.largest), at + 1);
        }
      }
  });
}

TEST(searches, let_a_nan_take_over_and_give_way_wherever_it_stands) {
  RandomBits bits(3);
  Arena arena(arena_bytes);
  for_each_routine([&]<class T>(const Routine<T> &routine) {
    for (QtbInt n = 1; n <= 10; ++n)
      for (QtbInt first = 0; first < n; ++first)
        for (QtbInt second = first; second < n; ++second)
          for (const QtbInt incx : {1, 2}) {
            std::vector<T> values = few_magnitudes<T>(bits, n, 9);
            values[static_cast<std::size_t>(first)] = element_of<T>(nan, 1);
            values[static_cast<std::size_t>(second)] = is_complex<T> ? element_of<T>(1, -nan) : element_of<T>(-nan);
            expect_model(routine, arena, values, n, incx, Flush::back, 0, false);
          }
  });
}

TEST(searches, take_the_element_behind_a_nan_whatever_it_is) {
  const double x[] = {1, nan, 0}, y[] = {1, nan, 5}, last[] = {5, 1, nan};
  in_every_tier([&](int tier) {
    EXPECT_EQ(call(idamax, tier, 3, x, 1), 3) << tier_name(tier);
    EXPECT_EQ(call(idamin, tier, 3, x, 1), 3) << tier_name(tier);
    EXPECT_EQ(call(idamin, tier, 3, y, 1), 3) << tier_name(tier);
    EXPECT_EQ(call(idamax, tier, 3, last, 1), 3) << tier_name(tier);
  });
}

TEST(searches, give_ties_to_the_first) {
  const float x[] = {1, 3, -3, 2};
  const double y[] = {2, -1, 1, 3};
  in_every_tier([&](int tier) {
    EXPECT_EQ(call(isamax, tier, 4, x, 1), 2) << tier_name(tier);
    EXPECT_EQ(call(idamin, tier, 4, y, 1), 2) << tier_name(tier);
  });
  for_each_routine([&]<class T>(const Routine<T> &routine) {
    std::vector<T> values(9, element_of<T>(0.0, -0.0));
    for (std::size_t i = 1; i < values.size(); i += 2) values[i] = element_of<T>(-0.0, 0.0);
    in_every_tier([&](int tier) { EXPECT_EQ(call(routine, tier, 9, values.data(), 1), 1) << routine.name; });
  });
}

TEST(searches, measure_a_complex_element_by_the_sum_of_its_parts_in_its_own_precision) {
  const cfloat x[] = {{5, 1}, {3, 4}};
  const cfloat same[] = {{1, 0}, {1, 0x1p-25F}};  // the sum rounds to 1
  const cdouble same_in_double[] = {{1, 0}, {1, 0x1p-54}}, not_same[] = {{1, 0}, {1, 0x1p-25}};
  in_every_tier([&](int tier) {
    EXPECT_EQ(call(icamax, tier, 2, x, 1), 2) << tier_name(tier);
    EXPECT_EQ(call(icamax, tier, 2, same, 1), 1) << tier_name(tier);
    EXPECT_EQ(call(izamax, tier, 2, same_in_double, 1), 1) << tier_name(tier);
    EXPECT_EQ(call(izamax, tier, 2, not_same, 1), 2) << tier_name(tier);
  });
}

TEST(searches, order_infinities) {
  const double x[] = {1, -infinity, infinity, 2};
  const cdouble z[] = {{1, 1}, {1e308, 1e308}, {0, -infinity}};  // the second sum overflows
  in_every_tier([&](int tier) {
    EXPECT_EQ(call(idamax, tier, 4, x, 1), 2) << tier_name(tier);
    EXPECT_EQ(call(idamin, tier, 4, x, 1), 1) << tier_name(tier);
    EXPECT_EQ(call(izamax, tier, 3, z, 1), 2) << tier_name(tier);
  });
}

TEST(searches, return_0_and_read_nothing_where_n_or_incx_is_below_1) {
  Arena nothing(0);
  for_each_routine([&]<class T>(const Routine<T> &routine) {
    const T *unreadable = reinterpret_cast<const T *>(nothing.data());
    in_every_tier([&](int tier) {
      for (const QtbInt n : {0, -1, -9})
        for (const QtbInt incx : {1, 0, -1}) EXPECT_EQ(call(routine, tier, n, unreadable, incx), 0) << routine.name;
      for (const QtbInt n : {1, 2, 9})
        for (const QtbInt incx : {0, -1, -3}) EXPECT_EQ(call(routine, tier, n, unreadable, incx), 0) << routine.name;
    });
  });
}

TEST(searches, of_one_element_return_1_unread) {
  Arena nothing(0);
  for_each_routine([&]<class T>(const Routine<T> &routine) {
    const T *unreadable = reinterpret_cast<const T *>(nothing.data());
    in_every_tier([&](int tier) {
      for (const QtbInt incx : {1, 7}) EXPECT_EQ(call(routine, tier, 1, unreadable, incx), 1) << routine.name;
    });
  });
}

TEST(searches, do_not_write_their_vector) {
  Arena arena(4096);
  RandomBits bits(4);
  for_each_routine([&]<class T>(const Routine<T> &routine) {
    arena.writable();
    Placed<T> x(arena, few_magnitudes<T>(bits, 50, 1000), 50, 1, Flush::back, 0);
    arena.read_only();
    in_every_tier([&](int tier) { EXPECT_GT(call(routine, tier, 50, x.data(), 1), 0); });
  });
}

}  // namespace
