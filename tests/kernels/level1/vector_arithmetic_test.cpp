// The arithmetic of the basic vector kernels: the same bits in the same place, and no kernel depends on or disturbs the
// floating-point state, or raises an exception that its elements do not.

#include <xmmintrin.h>

#include <algorithm>
#include <limits>

#include "tests/kernels/level1/vector_routines.h"
#include "tests/support/finite_only.h"

namespace qtb::test {
namespace {

TEST(VectorArithmetic, a_dot_gives_the_same_bits_for_the_same_alignment) {
  for_each_dot([]<class T>(const Dot<T> &routine) {
    const QtbInt n = 333;
    const Image<T> x(n, 1, random_values<T>(n, 1).data()), y(n, 1, random_values<T>(n, 2).data());
    Room room_x(x.size() + 512), room_y(y.size() + 512);
    for_each_tier([&](int tier) {
      // The upper tiers do not look at the alignment of contiguous operands at all.
      const bool any_phase = tier >= tier_sse42;
      const T at_boundaries = routine.call(tier, n, x.put(room_x.at(0)), 1, y.put(room_y.at(0)), 1);
      for (int phase_x = 0; phase_x < 16; ++phase_x)
        for (int phase_y = 0; phase_y < 16; ++phase_y) {
          const T want = any_phase ? at_boundaries
                                   : routine.call(tier, n, x.put(room_x.at(phase_x)), 1, y.put(room_y.at(phase_y)), 1);
          for (int distance = 0; distance < 512; distance += 176) {
            const T got = routine.call(tier, n, x.put(room_x.at(phase_x) + distance), 1,
                                       y.put(room_y.at(phase_y) + 512 - 16 - distance), 1);
            ASSERT_TRUE(same_bits(got, want)) << routine.name << ' ' << tier_name(tier);
          }
        }
    });
  });
}

// ---- The floating-point state ----

constexpr QtbInt increments[][2] = {{1, 1}, {-1, -1}, {1, -2}, {3, 1}, {2, 2}};

// f(n, incx, incy, phase_x, phase_y) over lengths, increments and, for contiguous operands, all phases.
template <class F>
void for_each_way(QtbInt longest, F &&f) {
  for (QtbInt n = 0; n <= longest; ++n)
    for (const auto &[incx, incy] : increments)
      for (int phase_x = 0; phase_x < 16; ++phase_x)
        for (int phase_y = 0; phase_y < 16; ++phase_y)
          if ((phase_x * 5 + phase_y + n) % (incx == 1 && incy == 1 ? 4 : 32) == 0) f(n, incx, incy, phase_x, phase_y);
}

template <class T>
void call_among_signalling_nans(const Elementwise<T> &routine, Tally &tally) {
  const std::vector<T> x = random_values<T>(140, 1), y = random_values<T>(140, 2);
  Room room_x(1024 * sizeof(T)), room_y(1024 * sizeof(T));
  for_each_way(140, [&](QtbInt n, QtbInt incx, QtbInt incy, int phase_x, int phase_y) {
    const Image<T> image_x(n, incx, x.data()), image_y(n, incy, y.data());
    for_each_tier([&](int tier) {
      T *at_x = image_x.put(room_x.at(phase_x)), *at_y = image_y.put(room_y.at(phase_y));
      const FiniteOnly guard;
      routine.call(tier, n, at_x, incx, at_y, incy);
      tally.count(tier);
    });
  });
}

TEST(VectorArithmetic, finite_operands_raise_no_exception_among_signalling_nans) {
  Tally tally;
  for_each_elementwise([&](const auto &routine) { call_among_signalling_nans(routine, tally); });
  for_each_dot([&]<class T>(const Dot<T> &routine) {
    const std::vector<T> x = random_values<T>(140, 3), y = random_values<T>(140, 4);
    Room room_x(1024 * sizeof(T)), room_y(1024 * sizeof(T));
    for_each_way(140, [&](QtbInt n, QtbInt incx, QtbInt incy, int phase_x, int phase_y) {
      const T *at_x = Image<T>(n, incx, x.data()).put(room_x.at(phase_x));
      const T *at_y = Image<T>(n, incy, y.data()).put(room_y.at(phase_y));
      for_each_tier([&](int tier) {
        const FiniteOnly guard;
        routine.call(tier, n, at_x, incx, at_y, incy);
        tally.count(tier);
      });
    });
  });
}

// Spare lanes that held zeros would become NaN, and say so.
TEST(VectorArithmetic, an_infinite_factor_of_nonzero_elements_raises_no_exception) {
  Tally tally;
  constexpr float single = std::numeric_limits<float>::infinity();
  constexpr double wide = std::numeric_limits<double>::infinity();
  call_among_signalling_nans(axpy_of<float>("saxpy", saxpy_tiers, single), tally);
  call_among_signalling_nans(axpy_of<double>("daxpy", daxpy_tiers, wide), tally);
  call_among_signalling_nans(scal_of<float, float>("sscal", sscal_tiers, single), tally);
  call_among_signalling_nans(scal_of<double, double>("dscal", dscal_tiers, wide), tally);
  call_among_signalling_nans(axpy_of<cfloat>("caxpy", caxpy_tiers, {single, 2}), tally);
  call_among_signalling_nans(axpy_of<cdouble>("zaxpy", zaxpy_tiers, {2, wide}), tally);
  call_among_signalling_nans(scal_of<cfloat, cfloat>("cscal", cscal_tiers, {2, single}), tally);
  call_among_signalling_nans(scal_of<cdouble, cdouble>("zscal", zscal_tiers, {wide, 2}), tally);
  call_among_signalling_nans(scal_of<cfloat, float>("csscal", csscal_tiers, single), tally);
  call_among_signalling_nans(scal_of<cdouble, double>("zdscal", zdscal_tiers, wide), tally);
}

template <class T>
std::vector<T> ones_of(std::size_t count) {
  std::vector<T> values(count);
  for (T &v : values) std::fill_n(reinterpret_cast<Real<T> *>(&v), sizeof(T) / sizeof(Real<T>), Real<T>{1});
  return values;
}

// An element of extreme magnitude in every place, among ones: the results are finite and normal, so that only a lane
// that is no part of them could leave the range.
template <class T, class F>
void for_each_extreme(F &&f) {
  using R = Real<T>;
  const QtbInt parts_of_element = sizeof(T) / sizeof(R);
  for (const QtbInt n : {1, 2, 3, 4, 5, 6, 7, 8, 9, 12, 17, 33, 70})
    for (const R extreme :
         {std::numeric_limits<R>::max(), -std::numeric_limits<R>::max(), std::numeric_limits<R>::min()})
      for (QtbInt at = 0; at < n * parts_of_element; ++at) {
        std::vector<R> parts(static_cast<std::size_t>(n * parts_of_element), R{1});
        parts[static_cast<std::size_t>(at)] = extreme;
        std::vector<T> values(static_cast<std::size_t>(n));
        std::memcpy(static_cast<void *>(values.data()), parts.data(), parts.size() * sizeof(R));
        f(n, values);
      }
}

// The increments, and phases of whole and of halved vectors.
template <class T, class F>
void for_each_place(F &&f) {
  for (const auto &[incx, incy] : increments)
    for (const int phase_x : {0, static_cast<int>(sizeof(Real<T>))})
      for (const int phase_y : {0, static_cast<int>(sizeof(Real<T>))}) f(incx, incy, phase_x, phase_y);
}

TEST(VectorArithmetic, the_largest_or_smallest_element_in_any_lane_raises_no_exception) {
  Tally tally;
  for_each_dot([&]<class T>(const Dot<T> &routine) {
    Room room_x(1024 * sizeof(T)), room_y(1024 * sizeof(T));
    const std::vector<T> ones = ones_of<T>(70);
    for_each_extreme<T>([&](QtbInt n, const std::vector<T> &values) {
      for_each_place<T>([&](QtbInt incx, QtbInt incy, int phase_x, int phase_y) {
        const T *at_x = Image<T>(n, incx, values.data()).put(room_x.at(phase_x));
        const T *at_y = Image<T>(n, incy, ones.data()).put(room_y.at(phase_y));
        for_each_tier([&](int tier) {
          const FiniteOnly guard;
          routine.call(tier, n, at_x, incx, at_y, incy);
          routine.call(tier, n, at_y, incy, at_x, incx);
          tally.count(tier, 2);
        });
      });
    });
  });
  const auto expect_quiet = [&]<class T>(const Elementwise<T> &routine) {
    Room room_x(1024 * sizeof(T)), room_y(1024 * sizeof(T));
    const std::vector<T> ones = ones_of<T>(70);
    for_each_extreme<T>([&](QtbInt n, const std::vector<T> &values) {
      for_each_place<T>([&](QtbInt incx, QtbInt incy, int phase_x, int phase_y) {
        for (const bool in_x : {false, true}) {
          if (in_x && routine.one_vector) continue;
          const Image<T> image_x(n, incx, in_x ? values.data() : ones.data());
          const Image<T> image_y(n, incy, in_x ? ones.data() : values.data());
          for_each_tier([&](int tier) {
            T *at_x = image_x.put(room_x.at(phase_x)), *at_y = image_y.put(room_y.at(phase_y));
            const FiniteOnly guard;
            routine.call(tier, n, at_x, incx, at_y, incy);
            tally.count(tier);
          });
        }
      });
    });
  };
  // A factor of -1, which no tier takes for special and which leaves every magnitude in the range.
  expect_quiet(axpy_of<float>("saxpy", saxpy_tiers, -1.0F));
  expect_quiet(axpy_of<double>("daxpy", daxpy_tiers, -1.0));
  expect_quiet(axpy_of<cfloat>("caxpy", caxpy_tiers, {-1, 0}));
  expect_quiet(axpy_of<cdouble>("zaxpy", zaxpy_tiers, {-1, 0}));
  expect_quiet(scal_of<float, float>("sscal", sscal_tiers, -1.0F));
  expect_quiet(scal_of<double, double>("dscal", dscal_tiers, -1.0));
  expect_quiet(scal_of<cfloat, cfloat>("cscal", cscal_tiers, {-1, 0}));
  expect_quiet(scal_of<cdouble, cdouble>("zscal", zscal_tiers, {-1, 0}));
  expect_quiet(scal_of<cfloat, float>("csscal", csscal_tiers, -1.0F));
  expect_quiet(scal_of<cdouble, double>("zdscal", zdscal_tiers, -1.0));
}

constexpr unsigned control_bits = 0xFFC0;  // of MXCSR: rounding, masks, flush to zero, denormals are zero

// Runs f in a floating-point state and says whether the state was left alone.
template <class F>
bool keeps_state(unsigned control, F &&f) {
  const unsigned before = _mm_getcsr();
  _mm_setcsr((before & ~control_bits) | control);
  f();
  const unsigned after = _mm_getcsr();
  _mm_setcsr(before);
  return (after & control_bits) == control;
}

constexpr unsigned all_masked = 0x1F80;
constexpr unsigned states[] = {all_masked | _MM_ROUND_NEAREST, all_masked | _MM_ROUND_DOWN, all_masked | _MM_ROUND_UP,
                               all_masked | _MM_ROUND_TOWARD_ZERO, all_masked | _MM_FLUSH_ZERO_ON | 0x40};

// A directed rounding errs by twice the roundoff of the nearest.
constexpr double directed = 2;

TEST(VectorArithmetic, elements_round_alike_in_every_place_in_all_rounding_modes) {
  Tally tally;
  for_each_elementwise([&]<class T>(const Elementwise<T> &routine) {
    const std::vector<T> x = random_values<T>(140, 5), y = random_values<T>(140, 6);
    Room room_x(1024 * sizeof(T)), room_y(1024 * sizeof(T));
    for_each_tier([&](int tier) {
      for (const unsigned state : states) {
        std::vector<T> new_x = x, new_y = y;
        const bool kept_by_single = keeps_state(state, [&] {
          for (std::size_t i = 0; i < y.size(); ++i) routine.call(tier, 1, &new_x[i], 1, &new_y[i], 1);
        });
        ASSERT_TRUE(kept_by_single) << routine.name << ' ' << tier_name(tier);
        for (std::size_t i = 0; routine.oracle && i < y.size(); ++i) {
          const reference::Judged want = routine.oracle(x[i], y[i]);
          const double ratio = error_ratio(new_y[i], want.value, want.gauge, directed * routine.roundings);
          tally.error(routine.name, ratio);
          ASSERT_LE(ratio, 1) << routine.name << ' ' << tier_name(tier);
        }
        for_each_way(140, [&](QtbInt n, QtbInt incx, QtbInt incy, int phase_x, int phase_y) {
          if (n % 7 != 0 && n > 20) return;
          const QtbInt used_incx = routine.one_vector ? 1 : incx;
          unsigned char *at_x = room_x.at(phase_x), *at_y = room_y.at(phase_y);
          T *put_x = Image<T>(n, used_incx, x.data()).put(at_x);
          T *put_y = Image<T>(n, incy, y.data()).put(at_y);
          const bool kept = keeps_state(state, [&] { routine.call(tier, n, put_x, used_incx, put_y, incy); });
          tally.count(tier);
          ASSERT_TRUE(kept && Image<T>(n, incy, new_y.data()).is_at(at_y) &&
                      Image<T>(n, used_incx, new_x.data()).is_at(at_x))
              << routine.name << ' ' << tier_name(tier) << " n " << n << " increments " << used_incx << ' ' << incy
              << " phases " << phase_x << ' ' << phase_y << " state " << state;
        });
      }
    });
  });
}

TEST(VectorArithmetic, dots_keep_their_bound_and_the_state_in_all_rounding_modes) {
  Tally tally;
  for_each_dot([&]<class T>(const Dot<T> &routine) {
    const std::vector<T> x = random_values<T>(140, 7), y = random_values<T>(140, 8);
    Room room_x(1024 * sizeof(T)), room_y(1024 * sizeof(T));
    for_each_way(140, [&](QtbInt n, QtbInt incx, QtbInt incy, int phase_x, int phase_y) {
      if (n % 7 != 0 && n > 20) return;
      const T *at_x = Image<T>(n, incx, x.data()).put(room_x.at(phase_x));
      const T *at_y = Image<T>(n, incy, y.data()).put(room_y.at(phase_y));
      const reference::Judged want = reference::dot(n, at_x, incx, at_y, incy, routine.conjugated);
      for_each_tier([&](int tier) {
        for (const unsigned state : states) {
          T got;
          ASSERT_TRUE(keeps_state(state, [&] { got = routine.call(tier, n, at_x, incx, at_y, incy); }));
          const double terms = static_cast<double>(is_complex<T> ? 2 * n : n);
          const double ratio = error_ratio(got, want.value, want.gauge, directed * terms);
          tally.error(routine.name, ratio);
          tally.count(tier);
          ASSERT_LE(ratio, 1) << routine.name << ' ' << tier_name(tier) << " n " << n << " increments " << incx << ' '
                              << incy << " phases " << phase_x << ' ' << phase_y << " state " << state;
        }
      });
    });
  });
}

}  // namespace
}  // namespace qtb::test
