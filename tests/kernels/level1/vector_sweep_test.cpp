// The basic vector kernels over lengths, increments and alignments, in every tier: within the error bounds of the
// oracle, bit for bit independent of an element's place, and without a byte changed that is not an element's.

#include <algorithm>

#include "tests/kernels/level1/vector_routines.h"

namespace qtb::test {
namespace {

constexpr QtbInt longest = 4099;

// The pairs of phases that a length is tried at: all of them for short vectors, where every way through a kernel ends
// somewhere, and an eighth, in turn, for longer ones.
bool tries_phases(QtbInt n, int phase_x, int phase_y) {
  if (n <= 72) return true;
  if (n <= 300) return (phase_x * 3 + phase_y + n) % 8 == 0;
  return phase_x % 4 == 0 && phase_y % 4 == 0;
}

std::vector<QtbInt> lengths() {
  std::vector<QtbInt> all;
  for (QtbInt n = 0; n <= 300; ++n) all.push_back(n);
  for (QtbInt n : {511, 1000, 2048, 4099}) all.push_back(n);
  return all;
}

template <class T>
std::vector<T> values_for(const Elementwise<T> &routine, std::uint64_t seed) {
  return routine.oracle ? random_values<T>(longest, seed) : random_bits<T>(longest, seed);
}

// Calls for one element each, which the routine's longer calls must equal.
template <class T>
void single_calls(const Elementwise<T> &routine, int tier, QtbInt n, std::vector<T> &x, QtbInt incx, std::vector<T> &y,
                  QtbInt incy) {
  for (QtbInt i = 0; i < n; ++i) {
    T &a = x[static_cast<std::size_t>(reference::place(i, n, incx))];
    T &b = y[static_cast<std::size_t>(reference::place(i, n, incy))];
    routine.call(tier, 1, &a, 1, &b, 1);
  }
}

template <class T>
void judge_single_elements(const Elementwise<T> &routine, int tier, const std::vector<T> &x, const std::vector<T> &y,
                           const std::vector<T> &new_x, const std::vector<T> &new_y, Tally &tally) {
  for (std::size_t i = 0; i < y.size(); ++i) {
    if (!routine.oracle) {
      ASSERT_TRUE(same_bits(new_y[i], x[i])) << routine.name << ' ' << tier_name(tier);
      ASSERT_TRUE(same_bits(new_x[i], routine.stores_x ? y[i] : x[i])) << routine.name << ' ' << tier_name(tier);
      continue;
    }
    const reference::Judged want = routine.oracle(x[i], y[i]);
    const double ratio = error_ratio(new_y[i], want.value, want.gauge, routine.roundings);
    tally.error(routine.name, ratio);
    ASSERT_LE(ratio, 1) << routine.name << ' ' << tier_name(tier);
    ASSERT_TRUE(same_bits(new_x[i], x[i])) << routine.name << ' ' << tier_name(tier);
  }
}

TEST(VectorSweep, contiguous_elements_are_those_of_single_calls_at_every_phase) {
  Tally tally;
  for_each_elementwise([&]<class T>(const Elementwise<T> &routine) {
    const std::vector<T> x = values_for(routine, 1), y = values_for(routine, 2);
    Room room_x(longest * sizeof(T) + 256), room_y(longest * sizeof(T) + 256);
    for_each_tier([&](int tier) {
      std::vector<T> new_x = x, new_y = y;
      for (std::size_t i = 0; i < y.size(); ++i) routine.call(tier, 1, &new_x[i], 1, &new_y[i], 1);
      judge_single_elements(routine, tier, x, y, new_x, new_y, tally);
      for (const QtbInt n : lengths())
        for (const QtbInt inc : {1, -1}) {
          if (inc < 0 && n % 3 != 0) continue;
          const Image<T> before_x(n, inc, x.data()), before_y(n, inc, y.data());
          const Image<T> after_x(n, inc, new_x.data()), after_y(n, inc, new_y.data());
          for (int phase_x = 0; phase_x < (routine.one_vector ? 1 : 16); ++phase_x)
            for (int phase_y = 0; phase_y < 16; ++phase_y) {
              if (!routine.one_vector && !tries_phases(n, phase_x, phase_y)) continue;
              unsigned char *at_x = room_x.at(phase_x), *at_y = room_y.at(phase_y);
              routine.call(tier, n, before_x.put(at_x), inc, before_y.put(at_y), inc);
              ASSERT_TRUE(after_x.is_at(at_x) && after_y.is_at(at_y))
                  << routine.name << ' ' << tier_name(tier) << " n " << n << " inc " << inc << " phases " << phase_x
                  << ' ' << phase_y;
              tally.count(tier);
            }
        }
    });
  });
}

TEST(VectorSweep, increments_of_either_sign_and_zero_equal_single_calls_in_the_published_order) {
  Tally tally;
  for_each_elementwise([&]<class T>(const Elementwise<T> &routine) {
    const std::vector<T> x = values_for(routine, 3), y = values_for(routine, 4);
    Room room_x(1024 * sizeof(T)), room_y(1024 * sizeof(T));
    int turn = 0;
    for_each_tier([&](int tier) {
      for (QtbInt n = 0; n <= 70; ++n)
        for (QtbInt incx = -3; incx <= 3; ++incx)
          for (QtbInt incy = -3; incy <= 3; ++incy) {
            if (routine.one_vector && incx != 1) continue;
            std::vector<T> all_x(220), all_y(220);
            const Image<T> before_x(n, incx, x.data()), before_y(n, incy, y.data());
            Image<T> after_x = before_x, after_y = before_y;
            for (QtbInt i = 0; i < n; ++i) {
              all_x[static_cast<std::size_t>(reference::place(i, n, incx))] = x[static_cast<std::size_t>(i)];
              all_y[static_cast<std::size_t>(reference::place(i, n, incy))] = y[static_cast<std::size_t>(i)];
            }
            single_calls(routine, tier, n, all_x, incx, all_y, incy);
            for (QtbInt i = 0; i < n; ++i) {
              const QtbInt px = reference::place(i, n, incx), py = reference::place(i, n, incy);
              after_x.set(px, all_x[static_cast<std::size_t>(px)]);
              after_y.set(py, all_y[static_cast<std::size_t>(py)]);
            }
            for (int repeat = 0; repeat < 3; ++repeat) {
              turn += 7;
              unsigned char *at_x = room_x.at(turn % 16), *at_y = room_y.at(turn / 16 % 16);
              routine.call(tier, n, before_x.put(at_x), incx, before_y.put(at_y), incy);
              ASSERT_TRUE(after_x.is_at(at_x) && after_y.is_at(at_y))
                  << routine.name << ' ' << tier_name(tier) << " n " << n << " increments " << incx << ' ' << incy
                  << " phases " << turn % 16 << ' ' << turn / 16 % 16;
              tally.count(tier);
            }
          }
    });
  });
}

template <class T>
double dot_ratio(T got, const reference::Judged &want, QtbInt n) {
  return error_ratio(got, want.value, want.gauge, static_cast<double>(is_complex<T> ? 2 * n : n));
}

TEST(VectorSweep, contiguous_dots_are_within_their_bound_at_every_phase) {
  Tally tally;
  for_each_dot([&]<class T>(const Dot<T> &routine) {
    const std::vector<T> x = random_values<T>(longest, 5), y = random_values<T>(longest, 6);
    Room room_x(longest * sizeof(T) + 256), room_y(longest * sizeof(T) + 256);
    for (const QtbInt n : lengths())
      for (const QtbInt inc : {1, -1}) {
        if (inc < 0 && n % 3 != 0) continue;
        const reference::Judged want = reference::dot(n, x.data(), 1, y.data(), 1, routine.conjugated);
        const Image<T> image_x(n, inc, x.data()), image_y(n, inc, y.data());
        for (int phase_x = 0; phase_x < 16; ++phase_x)
          for (int phase_y = 0; phase_y < 16; ++phase_y) {
            if (!tries_phases(n, phase_x, phase_y)) continue;
            const T *at_x = image_x.put(room_x.at(phase_x)), *at_y = image_y.put(room_y.at(phase_y));
            for_each_tier([&](int tier) {
              const double ratio = dot_ratio(routine.call(tier, n, at_x, inc, at_y, inc), want, n);
              tally.error(routine.name, ratio);
              tally.count(tier);
              ASSERT_LE(ratio, 1) << routine.name << ' ' << tier_name(tier) << " n " << n << " inc " << inc
                                  << " phases " << phase_x << ' ' << phase_y;
            });
            if (testing::Test::HasFatalFailure()) return;
          }
      }
  });
}

TEST(VectorSweep, dots_pair_elements_by_the_published_convention_for_every_increment) {
  Tally tally;
  for_each_dot([&]<class T>(const Dot<T> &routine) {
    const std::vector<T> x = random_values<T>(70, 7), y = random_values<T>(70, 8);
    Room room_x(1024 * sizeof(T)), room_y(1024 * sizeof(T));
    int turn = 0;
    for (QtbInt n = 0; n <= 70; ++n)
      for (QtbInt incx = -3; incx <= 3; ++incx)
        for (QtbInt incy = -3; incy <= 3; ++incy) {
          turn += 7;
          const T *at_x = Image<T>(n, incx, x.data()).put(room_x.at(turn % 16));
          const T *at_y = Image<T>(n, incy, y.data()).put(room_y.at(turn / 16 % 16));
          const reference::Judged want = reference::dot(n, at_x, incx, at_y, incy, routine.conjugated);
          for_each_tier([&](int tier) {
            const double ratio = dot_ratio(routine.call(tier, n, at_x, incx, at_y, incy), want, n);
            tally.error(routine.name, ratio);
            tally.count(tier);
            ASSERT_LE(ratio, 1) << routine.name << ' ' << tier_name(tier) << " n " << n << " increments " << incx << ' '
                                << incy << " phases " << turn % 16 << ' ' << turn / 16 % 16;
          });
          if (testing::Test::HasFatalFailure()) return;
        }
  });
}

TEST(VectorSweep, integer_valued_dots_are_exact_in_every_tier) {
  Tally tally;
  for_each_dot([&]<class T>(const Dot<T> &routine) {
    const std::vector<T> x = random_integers<T>(longest, 9), y = random_integers<T>(longest, 10);
    Room room_x(longest * sizeof(T) + 256), room_y(longest * sizeof(T) + 256);
    for (const QtbInt n : lengths()) {
      const reference::Judged want = reference::dot(n, x.data(), 1, y.data(), 1, routine.conjugated);
      const Image<T> image_x(n, 1, x.data()), image_y(n, 1, y.data());
      for (int phase = 0; phase < 16; ++phase) {
        const int other = static_cast<int>((n * 5 + phase * 3) % 16);
        const T *at_x = image_x.put(room_x.at(phase)), *at_y = image_y.put(room_y.at(other));
        for_each_tier([&](int tier) {
          const QuadComplex got = widen(routine.call(tier, n, at_x, 1, at_y, 1));
          tally.count(tier);
          ASSERT_TRUE(got.re == want.value.re && got.im == want.value.im)
              << routine.name << ' ' << tier_name(tier) << " n " << n << " phases " << phase << ' ' << other;
        });
      }
      if (testing::Test::HasFatalFailure()) return;
    }
  });
}

}  // namespace
}  // namespace qtb::test
