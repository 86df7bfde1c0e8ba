// Norms, sums of magnitudes and dcabs1, in every tier, against the oracle.

#include <gtest/gtest.h>

#include <initializer_list>
#include <type_traits>

#include "tests/reference/norms.h"
#include "tests/support/placed.h"
#include "tests/support/random.h"
#include "tests/support/tally.h"

namespace {

using namespace qtb::test;
using qtb::reference::Bounded;
using qtb::reference::RunningSums;

template <class T>
using Norm = Real<T> (*)(const QtbInt *, const T *, const QtbInt *);

const Norm<float> snrm2[] = QTB_ALL_TIERS(snrm2), sasum[] = QTB_ALL_TIERS(sasum);
const Norm<double> dnrm2[] = QTB_ALL_TIERS(dnrm2), dasum[] = QTB_ALL_TIERS(dasum);
const Norm<cfloat> scnrm2[] = QTB_ALL_TIERS(scnrm2), scasum[] = QTB_ALL_TIERS(scasum);
const Norm<cdouble> dznrm2[] = QTB_ALL_TIERS(dznrm2), dzasum[] = QTB_ALL_TIERS(dzasum);

template <class T>
Real<T> call(Norm<T> routine, QtbInt n, const T *x, QtbInt incx) {
  return routine(&n, x, &incx);
}
template <class T, std::size_t count>
Real<T> call(Norm<T> routine, const T (&x)[count]) {
  return call(routine, static_cast<QtbInt>(count), x, 1);
}
template <class T>
Real<T> call(Norm<T> routine, std::initializer_list<std::type_identity_t<T>> x) {
  return call(routine, static_cast<QtbInt>(x.size()), x.begin(), 1);
}

// ---- data ----

std::vector<QtbInt> lengths(QtbInt dense_up_to) {
  std::vector<QtbInt> n;
  for (QtbInt i = 0; i <= dense_up_to; ++i) n.push_back(i);
  return n;
}

// ---- sweeps ----

// The error / bound of got, by the way its routine computes.
template <class T>
double ratio(Real<T> got, const Bounded &want, bool rounded_once) {
  if constexpr (std::is_same_v<Real<T>, float>)
    if (rounded_once) return qtb::reference::ratio_of_rounded(got, want);
  return error_ratio(got, want.value, want.gauge, want.roundings);
}

template <class T>
struct Routine {
  const char *name;
  const Norm<T> *tiers;
  Bounded (*oracle)(const RunningSums &, QtbInt);
  bool rounded_once;  // floats summed in double
};

// Every length up to longest, at every increment, byte offset and end of the arena, on the same elements.
template <class T>
void sweep(const Routine<T> &routine, const std::vector<T> &values, QtbInt longest, std::size_t offset_step,
           int exceptions = spurious_exceptions) {
  Arena arena(arena_bytes);
  std::vector<RunningSums> sums(values.size() + 1);
  for (std::size_t i = 0; i < values.size(); ++i) {
    sums[i + 1] = sums[i];
    sums[i + 1].add(values[i]);
  }
  Tally &tally = TallyReport::of(routine.name);
  for (const QtbInt inc : {1, -1, 2, -2, 3, -3})
    for (const QtbInt n : lengths(inc == 1 || inc == -1 ? longest : longest / 4))
      for (const Flush flush : {Flush::back, Flush::front})
        for (std::size_t offset = 0; offset < 16; offset += offset_step) {
          const Bounded want = routine.oracle(sums[static_cast<std::size_t>(n)], n);
          Placed<T> x(arena, values, n, inc, flush, offset);
          in_every_tier([&](int tier) {
            Real<T> got;
            {
              FiniteOnly guard(exceptions);
              got = call(routine.tiers[tier], n, x.data(), inc);
            }
            const double r = ratio<T>(got, want, routine.rounded_once);
            tally.within(tier, r);
            ASSERT_LE(r, 1) << routine.name << " tier " << tier_name(tier) << " n " << n << " inc " << inc << " offset "
                            << offset << (flush == Flush::back ? " back" : " front");
          });
        }
}

template <class T>
void sweep_all(const Routine<T> &routine, const std::vector<std::pair<int, int>> &exponents) {
  RandomBits bits(1);
  const QtbInt dense = 300, sparse = 40;
  sweep(routine, random_vector<T>(bits, dense, -8, 8), dense, 1);
  for (const auto &[least, most] : exponents)
    sweep(routine, random_vector<T>(bits, sparse, least, most), sparse, 4, exceptions_beyond_range);
  // Some thousands: one length each, all offsets.
  Arena arena(arena_bytes);
  for (const QtbInt n : {1000, 2047, 5003}) {
    const std::vector<T> values = random_vector<T>(bits, n, -8, 8);
    RunningSums sums;
    for (const T v : values) sums.add(v);
    const Bounded want = routine.oracle(sums, n);
    for (const QtbInt inc : {1, -1, 2, -3})
      for (std::size_t offset = 0; offset < 16; ++offset) {
        Placed<T> x(arena, values, n, inc, Flush::back, offset);
        in_every_tier([&](int tier) {
          const double r = ratio<T>(call(routine.tiers[tier], n, x.data(), inc), want, routine.rounded_once);
          TallyReport::of(routine.name).within(tier, r);
          ASSERT_LE(r, 1) << routine.name << " tier " << tier_name(tier) << " n " << n << " inc " << inc;
        });
      }
  }
}

template <class T>
constexpr Bounded (*nrm2_of)(const RunningSums &, QtbInt) = qtb::reference::nrm2<T>;
template <class T>
constexpr Bounded (*asum_of)(const RunningSums &, QtbInt) = qtb::reference::asum<T>;

// The ends of the range: subnormal, near overflow, and everything at once.
const std::vector<std::pair<int, int>> single_ends = {{-149, -140}, {-149, -100}, {118, 123}, {-149, 123}};
const std::vector<std::pair<int, int>> double_ends = {{-1074, -1060}, {-1074, -500}, {1010, 1018}, {-1074, 1018}};

TEST(snrm2, is_within_its_bound_at_every_place) {
  sweep_all<float>({"snrm2", snrm2, nrm2_of<float>, true}, single_ends);
}
TEST(scnrm2, is_within_its_bound_at_every_place) {
  sweep_all<cfloat>({"scnrm2", scnrm2, nrm2_of<cfloat>, true}, single_ends);
}
TEST(dnrm2, is_within_its_bound_at_every_place) {
  sweep_all<double>({"dnrm2", dnrm2, nrm2_of<double>, false}, double_ends);
}
TEST(dznrm2, is_within_its_bound_at_every_place) {
  sweep_all<cdouble>({"dznrm2", dznrm2, nrm2_of<cdouble>, false}, double_ends);
}
TEST(sasum, is_within_its_bound_at_every_place) {
  sweep_all<float>({"sasum", sasum, asum_of<float>, false}, single_ends);
}
TEST(dasum, is_within_its_bound_at_every_place) {
  sweep_all<double>({"dasum", dasum, asum_of<double>, false}, double_ends);
}
TEST(scasum, is_within_its_bound_at_every_place) {
  sweep_all<cfloat>({"scasum", scasum, asum_of<cfloat>, false}, single_ends);
}
TEST(dzasum, is_within_its_bound_at_every_place) {
  sweep_all<cdouble>({"dzasum", dzasum, asum_of<cdouble>, false}, double_ends);
}

// ---- edges ----

constexpr double infinity = std::numeric_limits<double>::infinity();
constexpr double nan = std::numeric_limits<double>::quiet_NaN();

// f(routine) for each of the four norms and of the four sums, f generic over the element type.
template <class F>
void for_each_norm(int tier, F f) {
  f(snrm2[tier]), f(scnrm2[tier]), f(dnrm2[tier]), f(dznrm2[tier]);
}
template <class F>
void for_each_sum(int tier, F f) {
  f(sasum[tier]), f(scasum[tier]), f(dasum[tier]), f(dzasum[tier]);
}
template <class F>
void for_each_routine(int tier, F f) {
  for_each_norm(tier, f), for_each_sum(tier, f);
}
template <class T>
T element_of(double re, double im = 0) {
  if constexpr (is_complex<T>)
    return {static_cast<Real<T>>(re), static_cast<Real<T>>(im)};
  else
    return static_cast<T>(re);
}
template <class R, class T>
T argument_of(R (*)(const QtbInt *, const T *, const QtbInt *));

TEST(norms_and_sums, of_nothing_are_zero_and_read_nothing) {
  Arena nothing(0);
  in_every_tier([&](int tier) {
    for_each_routine(tier, [&](auto routine) {
      using T = decltype(argument_of(routine));
      const T *unreadable = reinterpret_cast<const T *>(nothing.data());
      for (const QtbInt n :
           {QtbInt{0}, QtbInt{-1}, QtbInt{-7}, (QtbInt{-1} << 62) - 1, std::numeric_limits<QtbInt>::min()})
        for (const QtbInt incx : {1, 2, 0, -1}) EXPECT_EQ(call<T>(routine, n, unreadable, incx), 0) << tier_name(tier);
    });
  });
}

TEST(norms_and_sums, of_zeros_are_zero) {
  in_every_tier([](int tier) {
    for_each_routine(tier, [&](auto routine) {
      using T = decltype(argument_of(routine));
      const std::vector<T> x(67, element_of<T>(-0.0));
      for (const QtbInt incx : {1, -1, 2, 0}) {
        const auto got = call<T>(routine, incx == 2 ? 33 : 67, x.data(), incx);
        EXPECT_TRUE(got == 0 && !std::signbit(got)) << tier_name(tier);
      }
    });
  });
}

TEST(norms_and_sums, of_a_vector_with_a_nan_anywhere_are_nan) {
  in_every_tier([](int tier) {
    for_each_routine(tier, [&](auto routine) {
      using T = decltype(argument_of(routine));
      for (std::size_t n : {1, 2, 5, 67})
        for (std::size_t at = 0; at < n; ++at) {
          std::vector<T> x(n, element_of<T>(1));
          x[at] = is_complex<T> ? element_of<T>(1, nan) : element_of<T>(nan);
          const auto count = static_cast<QtbInt>(n);
          for (const QtbInt incx : {1, -1}) EXPECT_TRUE(std::isnan(call<T>(routine, count, x.data(), incx)));
          const QtbInt pairs = (count + 1) / 2;
          EXPECT_EQ(std::isnan(call<T>(routine, pairs, x.data(), 2)), at % 2 == 0);
        }
    });
  });
}

TEST(norms_and_sums, of_a_vector_with_one_infinity_are_infinite) {
  in_every_tier([](int tier) {
    for_each_routine(tier, [&](auto routine) {
      using T = decltype(argument_of(routine));
      for (std::size_t at = 0; at < 67; ++at) {
        std::vector<T> x(67, element_of<T>(1));
        x[at] = element_of<T>(-infinity);
        EXPECT_EQ(call<T>(routine, 67, x.data(), 1), infinity) << tier_name(tier) << " at " << at;
      }
    });
  });
}

TEST(norms_and_sums, take_element_0_n_times_at_increment_0) {
  in_every_tier([](int tier) {
    for_each_norm(tier, [&](auto routine) {
      using T = decltype(argument_of(routine));
      const T x[] = {element_of<T>(-3), element_of<T>(100)};
      EXPECT_EQ(call<T>(routine, 4, x, 0), 6) << tier_name(tier);
      EXPECT_EQ(call<T>(routine, 9, x, 0), 9) << tier_name(tier);
    });
    for_each_sum(tier, [&](auto routine) {
      using T = decltype(argument_of(routine));
      const T x[] = {element_of<T>(-3), element_of<T>(100)};
      EXPECT_EQ(call<T>(routine, 4, x, 0), 12) << tier_name(tier);
      EXPECT_EQ(call<T>(routine, 9, x, 0), 27) << tier_name(tier);
    });
    const double x[] = {-2};
    EXPECT_EQ(call(dasum[tier], 5, x, 0), 10);
  });
}

TEST(norms_and_sums, do_not_write_their_vector) {
  RandomBits bits(3);
  Arena arena(4096);
  in_every_tier([&](int tier) {
    for_each_routine(tier, [&](auto routine) {
      using T = decltype(argument_of(routine));
      arena.writable();
      const std::vector<T> values = random_vector<T>(bits, 50, -4, 4);
      Placed<T> x(arena, values, 50, 1, Flush::back, 0);
      arena.read_only();
      EXPECT_GT(call<T>(routine, 50, x.data(), 1), 0);
    });
  });
}

TEST(norms, of_whole_numbers_with_a_whole_norm_are_exact) {
  in_every_tier([](int tier) {
    EXPECT_EQ(call(dnrm2[tier], {3, 4}), 5);
    EXPECT_EQ(call(snrm2[tier], {3, 4}), 5);
    EXPECT_EQ(call(dznrm2[tier], {{3, 4}, {0, 12}}), 13);
    EXPECT_EQ(call(scnrm2[tier], {{3, 4}, {0, 12}}), 13);
    EXPECT_EQ(call(snrm2[tier], {2, 4, -4, 5, 7, 1, -3, 1}), 11);
  });
}

TEST(norms, are_the_same_in_every_tier_bit_for_bit) {
  RandomBits bits(4);
  for (const QtbInt n : {2, 31, 100, 301}) {
    const auto s = random_vector<float>(bits, n, -20, 20);
    const auto d = random_vector<double>(bits, n, -20, 20);
    const auto c = random_vector<cfloat>(bits, n, -20, 20);
    const auto z = random_vector<cdouble>(bits, n, -20, 20);
    in_every_tier([&](int tier) {
      EXPECT_EQ(call(snrm2[tier], n, s.data(), 1), call(snrm2[tier_def], n, s.data(), 1));
      EXPECT_EQ(call(dnrm2[tier], n, d.data(), 1), call(dnrm2[tier_def], n, d.data(), 1));
      EXPECT_EQ(call(scnrm2[tier], n, c.data(), 1), call(scnrm2[tier_def], n, c.data(), 1));
      EXPECT_EQ(call(dznrm2[tier], n, z.data(), 1), call(dznrm2[tier_def], n, z.data(), 1));
    });
  }
}

TEST(dnrm2, near_the_largest_double_does_not_overflow) {
  const double x[] = {1e308, -1e308};
  in_every_tier([&](int tier) { EXPECT_NEAR(call(dnrm2[tier], x) / 1e308, std::sqrt(2.0), 1e-15) << tier_name(tier); });
}

TEST(dnrm2, of_the_smallest_doubles_does_not_underflow) {
  constexpr double least = std::numeric_limits<double>::denorm_min();
  const double x[] = {3 * least, -4 * least};
  in_every_tier([&](int tier) { EXPECT_EQ(call(dnrm2[tier], x), 5 * least) << tier_name(tier); });
}

TEST(dnrm2, of_one_element_is_its_magnitude_without_arithmetic) {
  double signalling;
  store_signalling_nan<double>(&signalling);
  const double x[] = {-7};
  double negative_signalling = signalling;
  reinterpret_cast<unsigned char *>(&negative_signalling)[7] |= 0x80;
  in_every_tier([&](int tier) {
    FiniteOnly guard;
    for (const QtbInt incx : {1, -1, 0, 5, -5}) {
      EXPECT_EQ(call(dnrm2[tier], 1, x, incx), 7) << tier_name(tier);
      const double got = call(dnrm2[tier], 1, &negative_signalling, incx);
      EXPECT_TRUE(same_bits(got, signalling)) << tier_name(tier);
    }
  });
}

TEST(snrm2, squares_in_double) {
  const std::vector<float> large(100, 1e30F), small(100, 1e-30F);
  in_every_tier([&](int tier) {
    EXPECT_FLOAT_EQ(call(snrm2[tier], 100, large.data(), 1), 1e31F) << tier_name(tier);
    EXPECT_FLOAT_EQ(call(snrm2[tier], 100, small.data(), 1), 1e-29F) << tier_name(tier);
    EXPECT_FLOAT_EQ(call(scnrm2[tier], 50, reinterpret_cast<const cfloat *>(large.data()), 1), 1e31F);
  });
}

TEST(dasum, with_increment_minus_1_sums_n_elements_from_x_on) {
  const double x[] = {1, -2, 4, -8, 1000};
  const float y[] = {1, -2, 4, -8, 1000};
  in_every_tier([&](int tier) {
    EXPECT_EQ(call(dasum[tier], 4, x, -1), 15) << tier_name(tier);
    EXPECT_EQ(call(sasum[tier], 4, y, -1), 15) << tier_name(tier);
  });
}

TEST(sums, of_whole_numbers_are_exact) {
  in_every_tier([](int tier) {
    for_each_sum(tier, [&](auto routine) {
      using T = decltype(argument_of(routine));
      std::vector<T> x(300);
      Real<T> sum = 0;
      for (std::size_t i = 0; i < x.size(); ++i) {
        x[i] = element_of<T>(i % 2 ? -static_cast<double>(i) : static_cast<double>(i), static_cast<double>(i % 7));
        sum += static_cast<Real<T>>(i + (is_complex<T> ? i % 7 : 0));
        const auto n = static_cast<QtbInt>(i + 1);
        EXPECT_EQ(call<T>(routine, n, x.data(), 1), sum) << tier_name(tier);
      }
    });
  });
}

// Both are the contiguous walk, forward from x.
TEST(real_norms_and_sums, at_increment_minus_1_have_the_bits_of_increment_1) {
  RandomBits bits(7);
  for (const QtbInt n : {5, 50, 301}) {
    const auto s = random_vector<float>(bits, n, -9, 9);
    const auto d = random_vector<double>(bits, n, -9, 9);
    in_every_tier([&](int tier) {
      EXPECT_EQ(call(sasum[tier], n, s.data(), -1), call(sasum[tier], n, s.data(), 1)) << tier_name(tier);
      EXPECT_EQ(call(dasum[tier], n, d.data(), -1), call(dasum[tier], n, d.data(), 1)) << tier_name(tier);
      EXPECT_EQ(call(snrm2[tier], n, s.data(), -1), call(snrm2[tier], n, s.data(), 1)) << tier_name(tier);
      EXPECT_EQ(call(dnrm2[tier], n, d.data(), -1), call(dnrm2[tier], n, d.data(), 1)) << tier_name(tier);
    });
  }
}

TEST(complex_sums, at_increment_1_are_the_sums_of_their_parts) {
  RandomBits bits(5);
  for (const QtbInt n : {1, 7, 50, 301}) {
    const auto c = random_vector<cfloat>(bits, n, -9, 9);
    const auto z = random_vector<cdouble>(bits, n, -9, 9);
    in_every_tier([&](int tier) {
      EXPECT_EQ(call(dzasum[tier], n, z.data(), 1), call(dasum[tier], 2 * n, &z[0].re, 1)) << tier_name(tier);
      EXPECT_EQ(call(scasum[tier], n, c.data(), 1), call(sasum[tier], 2 * n, &c[0].re, 1)) << tier_name(tier);
    });
  }
}

// A lane that the sum has no part in must not double the largest element.
TEST(sums, with_the_largest_element_in_any_lane_raise_no_exception) {
  in_every_tier([](int tier) {
    for_each_sum(tier, [&](auto routine) {
      using T = decltype(argument_of(routine));
      using R = Real<T>;
      const R largest = std::numeric_limits<R>::max();
      Arena arena(4096);
      for (const QtbInt n : {1, 2, 3, 4, 7, 16, 33, 70})
        for (QtbInt at = 0; at < n; ++at) {
          std::vector<T> values(static_cast<std::size_t>(n), element_of<T>(1));
          values[static_cast<std::size_t>(at)] = element_of<T>(-largest);
          for (const QtbInt inc : {1, -1, 2})
            for (const std::size_t offset : {std::size_t{0}, sizeof(R)}) {
              Placed<T> x(arena, values, n, inc, Flush::back, offset);
              FiniteOnly guard;
              ASSERT_EQ(call<T>(routine, n, x.data(), inc), largest) << tier_name(tier) << " n " << n << " at " << at;
            }
        }
    });
  });
}

TEST(dcabs1, is_the_sum_of_the_magnitudes_of_the_parts) {
  using Cabs1 = double (*)(const cdouble *);
  const Cabs1 dcabs1[] = QTB_ALL_TIERS(dcabs1);
  Arena arena(64);
  in_every_tier([&](int tier) {
    const cdouble plain = {-3, 4}, not_a_number = {1, nan};
    EXPECT_EQ(dcabs1[tier](&plain), 7) << tier_name(tier);
    EXPECT_TRUE(std::isnan(dcabs1[tier](&not_a_number))) << tier_name(tier);
    for (std::size_t offset = 0; offset < 16; ++offset) {
      Placed<cdouble> z(arena, {{0.1, -0.2}}, 1, 1, Flush::back, offset);
      EXPECT_EQ(dcabs1[tier](z.data()), 0.1 + 0.2);
      TallyReport::of("dcabs1").exact(tier);
    }
  });
}

}  // namespace
