// The parallel Level-1 drivers on real teams, more threads than processors included.
//
// The dispatch slots note which piece a thread got and call the tier under test, so that every tier can be run in one
// process, and the pieces themselves can be checked.

#include <gtest/gtest.h>
#include <omp.h>
#include <unistd.h>
#include <xmmintrin.h>

#include <atomic>
#include <cstdio>
#include <random>
#include <thread>

#include "tests/support/bounds.h"
#include "tests/support/guarded.h"
#include "tests/support/placed.h"
#include "tests/thread/level1/routines.h"
#include "tests/thread/level1/sum_model.h"
#include "tests/thread/recorded_memory.h"
#include "tests/thread/stand_ins.h"

QTB_RECORDED_MEMORY_SERVICE

namespace {

using namespace qtb::test;

// ---- Vectors ----

// Element number i of n stands here, from the vector's pointer, by the published convention.
QtbInt place(QtbInt i, QtbInt n, QtbInt inc) { return inc > 0 ? i * inc : (i - n + 1) * inc; }

template <class T>
T random_value(std::mt19937_64 &random) {
  std::uniform_real_distribution<double> uniform(-1, 1);
  const auto re = static_cast<Real<T>>(uniform(random));
  if constexpr (is_complex<T>)
    return {re, static_cast<Real<T>>(uniform(random))};
  else
    return re;
}

template <class T>
bool same_bits(const T &a, const T &b) {
  return std::memcmp(&a, &b, sizeof(T)) == 0;
}

// A vector between trapping pages. What lies between its elements is signalling NaN.
template <class T>
struct Vector {
  Guarded<T> store;

  Vector(QtbInt n, QtbInt inc, Flush flush, std::size_t offset, std::mt19937_64 &random)
      : store(n < 1 ? 0 : static_cast<std::size_t>(1 + (n - 1) * std::abs(inc)), flush, offset) {
    for (std::size_t i = 0; i < store.size(); ++i) store_signalling_nan<T>(store.data() + i);
    for (QtbInt i = 0; i < n; ++i) store.data()[place(i, n, inc)] = random_value<T>(random);
  }
  bool operator==(const Vector &other) const {
    return std::memcmp(store.data(), other.store.data(), store.size() * sizeof(T)) == 0;
  }
};

struct Problem {
  QtbInt n, incx, incy;
  Flush flush = Flush::back;
  std::size_t offset_x = 0, offset_y = 0;  // bytes away from the trapping page
  std::uint64_t seed = 1;
};

// x and y, and the arguments of a call on them. Two of the same problem are alike to the bit and to the alignment.
template <class T>
struct Operands {
  std::mt19937_64 random;
  Vector<T> x, y;
  Level1Call<T> call;

  explicit Operands(const Problem &p)
      : random(p.seed),
        x(p.n, p.incx, p.flush, p.offset_x, random),
        y(p.n, p.incy, p.flush, p.offset_y, random),
        call{p.n, p.incx, p.incy, x.store.data(), y.store.data(), {}, Real<T>(0.6), Real<T>(0.8), {}} {
    call.alpha = random_value<T>(random);
    std::memset(&call.result, 0xA5, sizeof(T));
  }
};

// error / bound of a dot on the operands.
template <class T>
double dot_ratio(const Level1Call<T> &a, T got) {
  QuadComplex want;
  Quad gauge = 0;
  for (QtbInt i = 0; i < a.n; ++i) {
    const QuadComplex x = widen(a.x[place(i, a.n, a.incx)]), y = widen(a.y[place(i, a.n, a.incy)]);
    want = {want.re + x.re * y.re + x.im * y.im, want.im + x.re * y.im - x.im * y.re};
    gauge += magnitude(x) * magnitude(y);
  }
  return error_ratio(got, want, gauge, static_cast<double>(is_complex<T> ? 2 * a.n : a.n));
}

// ---- One call, checked in every respect ----

constexpr int any_team = 0;

// The call of the slot that thread rank of a team must make, by counting.
template <class T>
Level1Call<T> expected_piece(Level1Call<T> call, int team, int rank) {
  QtbInt chunk = 0;
  while ((chunk + 8) * team <= call.n) chunk += 8;
  const QtbInt whole = call.n, start = chunk * rank;
  call.n = rank == team - 1 ? whole - start : chunk;
  if (call.n < 1) return call;
  call.x += place(start, whole, call.incx) - place(0, call.n, call.incx);
  call.y += place(start, whole, call.incy) - place(0, call.n, call.incy);
  return call;
}

// Runs the driver and the tier's serial routine on like operands. Every rank of the team gets its piece, once.
// Elementwise results are equal to the bit: each element is computed alone, so that the team cannot change it. So are
// the gaps and what is only read. A dot equals the tier's own partial results, joined by the model.
template <class T>
void check(const Level1Routine<T> &r, int tier, QtbInt nthreads, const Problem &p, int expected_team) {
  SCOPED_TRACE(std::string(r.name) + " on " + tier_name(tier) + ": threads " + std::to_string(nthreads) + " n " +
               std::to_string(p.n) + " incx " + std::to_string(p.incx) + " incy " + std::to_string(p.incy) +
               " offsets " + std::to_string(p.offset_x) + " " + std::to_string(p.offset_y) + " seed " +
               std::to_string(p.seed));
  Operands<T> parallel(p), serial(p);
  stand_ins.behind[r.slot] = r.targets[tier];
  stand_ins.calls.clear();
  r.driver(nthreads, parallel.call);
  const std::vector<Call> pieces = stand_ins.calls_of(std::string("x") + r.name);
  const int team = pieces.at(0).team;
  if (expected_team != any_team) {
    ASSERT_EQ(team, expected_team);
  }
  ASSERT_TRUE(team >= 1 && team <= nthreads);
  ASSERT_EQ(stand_ins.calls.size(), static_cast<std::size_t>(team));
  std::vector<T> store(static_cast<std::size_t>(team) + 2);
  T *const partial = store.data() + (multiple_of(store.data(), 16) ? 0 : 1);
  for (int rank = 0; rank < team; ++rank) {
    const Call &got = pieces[static_cast<std::size_t>(rank)];
    Level1Call<T> want = expected_piece(parallel.call, team, rank);
    ASSERT_EQ(got.thread, rank);
    ASSERT_EQ(got.number("n"), want.n) << "rank " << rank;
    if (want.n > 0) {
      ASSERT_EQ(got.pointer("x"), want.x) << "rank " << rank;
      ASSERT_EQ(got.pointer("y"), want.y) << "rank " << rank;
    }
    if (!r.is_dot()) continue;
    r.serial(tier, want);
    partial[rank] = want.result;
  }
  if (r.is_dot()) {
    const T result = parallel.call.result;
    ASSERT_TRUE(same_bits(result, team == 1 ? partial[0] : model_sum(partial, team))) << "not the model's order";
    ASSERT_LE(dot_ratio(parallel.call, result), 1.0);
  }
  r.serial(tier, serial.call);
  ASSERT_TRUE(parallel.x == serial.x) << "x differs from the serial routine's";
  ASSERT_TRUE(parallel.y == serial.y) << "y differs from the serial routine's";
}

// The tier of the tests whose subject is not the tier.
const int one_tier = processor_runs(tier_sse42) ? tier_sse42 : tier_def;

class Level1Drivers : public testing::Test {
 protected:
  void SetUp() override {
    alarm(120);
    recorded_memory = RecordedMemory{};
    stand_ins = StandIns{};
    for_each_level1_routine([&](const auto &r) { stand_ins.behind[r.slot] = r.targets[one_tier]; });
  }
  void TearDown() override {
    EXPECT_TRUE(recorded_memory.held.empty()) << "memory was not given back";
    EXPECT_EQ(recorded_memory.faults, 0);
    alarm(0);
  }
};

TEST_F(Level1Drivers, EveryTeamAndTierEqualsTheSerialRoutine) {
  const int repeats = std::getenv("QTB_TEST_LONG") != nullptr ? 50 : 2;
  std::mt19937_64 random(20);
  const auto pick = [&](std::uint64_t count) { return random() % count; };
  constexpr QtbInt increments[] = {1, -1, 1, -1, 2, -2, 3, -3};
  for (const int team : {1, 2, 3, 4, 5, 7, 8, 9, 10, 11, 16, 24, 33, 129})
    for (int repeat = 0; repeat < repeats; ++repeat)
      for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
        in_every_tier([&](int tier) {
          const QtbInt lengths[] = {team - 1, team, 8 * team - 1, 8 * team, 8 * team + 1, 16 * team + 5, 997};
          for (int k = 0; k < 3; ++k) {
            const auto offset = [&] { return pick(64 / sizeof(Real<T>)) * sizeof(Real<T>); };
            const Problem p = {lengths[pick(7)],
                               increments[pick(8)],
                               increments[pick(8)],
                               pick(2) == 0 ? Flush::front : Flush::back,
                               offset(),
                               offset(),
                               random()};
            ASSERT_NO_FATAL_FAILURE(check(r, tier, team, p, team));
          }
        });
      });
}

TEST_F(Level1Drivers, LengthsAroundTheChunksAtEveryIncrement) {
  for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
    for (const int team : {2, 5})
      for (const QtbInt n : {1, team - 1, 8 * team - 1, 8 * team, 8 * team + 1, 40 * team + 7})
        for (const QtbInt incx : {-2, -1, 1, 3})
          for (const QtbInt incy : {-3, 1, 2}) ASSERT_NO_FATAL_FAILURE(check(r, one_tier, team, {n, incx, incy}, team));
  });
}

TEST_F(Level1Drivers, NothingIsDoneForLengthsBelowOneAndNoVectors) {
  for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
    for (const QtbInt n : {0, -1, -5, -1000})
      for (const QtbInt inc : {1, -2}) {
        Operands<T> o({0, inc, inc});
        o.call.n = n;
        o.call.x = o.call.y = nullptr;
        r.driver(4, o.call);
        for (const Call &call : stand_ins.calls) EXPECT_EQ(call.pointer("x"), nullptr);
        if (r.is_dot()) {
          EXPECT_TRUE(same_bits(o.call.result, T{})) << r.name;
        }
      }
    stand_ins.calls.clear();
  });
}

// ---- Joining ----

// What each thread's slot returns in place of a kernel's result.
const void *partials_of_threads = nullptr;
template <class T>
T partial_of_thread(QTB_PARAMS_dot(T)) {
  (void)n, (void)x, (void)incx, (void)y, (void)incy;
  return static_cast<const T *>(partials_of_threads)[omp_get_thread_num()];
}
cfloat *complex_partial_of_thread(QTB_PARAMS_cdot(cfloat)) {
  *result = partial_of_thread<cfloat>(n, x, incx, y, incy);
  return result;
}

// use(routine) for the dots, whose slots return partials_of_threads.
template <class Use>
void for_each_dot(Use use) {
  stand_ins.behind[qtb::slot_sdot] = code_pointer(&partial_of_thread<float>);
  stand_ins.behind[qtb::slot_ddot] = code_pointer(&partial_of_thread<double>);
  stand_ins.behind[qtb::slot_cdotc] = code_pointer(&complex_partial_of_thread);
  for_each_level1_routine([&](const auto &r) {
    if (r.is_dot()) use(r);
  });
}

template <class T>
T joined(const Level1Routine<T> &r, int nthreads, const std::vector<T> &partials) {
  Operands<T> o({64, 1, 1});
  partials_of_threads = partials.data();
  r.driver(nthreads, o.call);
  return o.call.result;
}

// Sums of these depend on their order.
template <class T>
std::vector<T> rough_partials(int team, std::uint64_t seed) {
  std::mt19937_64 random(seed);
  std::vector<T> values(static_cast<std::size_t>(team));
  for (T &value : values) {
    value = random_value<T>(random);
    const auto scale = static_cast<Real<T>>(1U << random() % 20);
    if constexpr (is_complex<T>)
      value = {value.re * scale, value.im / scale};
    else
      value *= scale;
  }
  return values;
}

// The model's sum of the first entries, at an address so many bytes beyond a 16-byte boundary.
template <class T>
T model(const std::vector<T> &partials, int team, std::size_t shift) {
  Guarded<T> store(partials.size(), Flush::front, shift);
  std::copy(partials.begin(), partials.end(), store.data());
  return model_sum(store.data(), team);
}

TEST_F(Level1Drivers, PartialResultsAreJoinedInTheModelsOrder) {
  for_each_dot([&]<class T>(const Level1Routine<T> &r) {
    for (const int team : {2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 16, 17, 18, 19, 24, 31, 33, 64})
      for (int seed = 0; seed < 5; ++seed) {
        const auto partials = rough_partials<T>(team, static_cast<std::uint64_t>(seed));
        EXPECT_TRUE(same_bits(joined(r, team, partials), model(partials, team, 0))) << r.name << " team " << team;
      }
  });
}

TEST_F(Level1Drivers, ResultOfATeamOfOneStandsAsItIs) {
  for_each_dot([&]<class T>(const Level1Routine<T> &r) {
    T minus_zero = {};
    if constexpr (is_complex<T>)
      minus_zero = {-0.0F, -0.0F};
    else
      minus_zero = T(-0.0);
    EXPECT_TRUE(same_bits(joined(r, 1, std::vector<T>{minus_zero}), minus_zero)) << r.name;
    EXPECT_TRUE(same_bits(joined(r, 2, std::vector<T>{minus_zero, minus_zero}), T{})) << r.name;
  });
}

TEST_F(Level1Drivers, PartialsOf128ThreadsNeedNoMemoryAndThoseOf129Do) {
  for_each_dot([&]<class T>(const Level1Routine<T> &r) {
    const auto partials = rough_partials<T>(129, 3);
    recorded_memory.forget();
    EXPECT_TRUE(same_bits(joined(r, 128, partials), model(partials, 128, 0))) << r.name;
    EXPECT_TRUE(recorded_memory.requests.empty()) << r.name;
    // The order follows the address that the service gives.
    for (recorded_memory.distance = 128; recorded_memory.distance < 144; recorded_memory.distance += sizeof(Real<T>)) {
      recorded_memory.forget();
      EXPECT_TRUE(same_bits(joined(r, 129, partials), model(partials, 129, recorded_memory.distance % 16))) << r.name;
      ASSERT_EQ(recorded_memory.requests.size(), 1U) << r.name;
      EXPECT_EQ(recorded_memory.requests[0].bytes, 129 * sizeof(T)) << r.name;
      EXPECT_EQ(recorded_memory.requests[0].alignment, 0) << r.name;
    }
  });
}

TEST_F(Level1Drivers, WithoutMemoryTheTeamIsAsLargeAsTheLocalArray) {
  recorded_memory.fails = [](long, int, int) { return true; };
  for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
    ASSERT_NO_FATAL_FAILURE(check(r, one_tier, 200, {3000, 1, 1}, r.is_dot() ? 128 : 200));
  });
}

// ---- Runtimes that give fewer threads ----

TEST_F(Level1Drivers, TeamThatTheRuntimeAdjustsItself) {
  omp_set_dynamic(1);
  for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
    ASSERT_NO_FATAL_FAILURE(check(r, one_tier, 16, {2003, 1, -1}, any_team));
    ASSERT_NO_FATAL_FAILURE(check(r, one_tier, 200, {2003, 2, 1}, any_team));
  });
  omp_set_dynamic(0);
}

// The limit is read when the runtime starts, so that this runs in a process of its own.
TEST_F(Level1Drivers, ThreadLimitOfTheEnvironment) {
  testing::GTEST_FLAG(death_test_style) = "threadsafe";
  setenv("OMP_THREAD_LIMIT", "3", 1);
  EXPECT_EXIT(
      {
        for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
          for (const QtbInt nthreads : {3, 8, 129}) check(r, one_tier, nthreads, {2003, 1, -1}, 3);
        });
        std::exit(HasFailure() ? 1 : 0);
      },
      testing::ExitedWithCode(0), "");
  unsetenv("OMP_THREAD_LIMIT");
}

// ---- Calls inside parallel regions and from several threads ----

// Whether a call on a team equals one of the serial routine, without the notes that only one caller at a time can use.
template <class T>
bool equals_serial(const Level1Routine<T> &r, QtbInt nthreads, const Problem &p) {
  Operands<T> parallel(p), serial(p);
  r.driver(nthreads, parallel.call);
  r.serial(one_tier, serial.call);
  if (r.is_dot()) return dot_ratio(serial.call, parallel.call.result) <= 1;
  return parallel.x == serial.x && parallel.y == serial.y;
}

TEST_F(Level1Drivers, InsideARegionTeamsAreOfOneOrNested) {
  stand_ins.recording = false;
  const int before = omp_get_max_active_levels();
  for (const int levels : {1, 2}) {
    omp_set_max_active_levels(levels);
    for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
      std::atomic<int> wrong{0}, other_team{0};
#pragma omp parallel num_threads(3)
      {
        const auto seed = static_cast<std::uint64_t>(omp_get_thread_num());
        if (!equals_serial(r, 3, {2001, 1, -1, Flush::back, 0, 0, seed})) ++wrong;
        if (team_of_last_call != (levels == 1 ? 1 : 3)) ++other_team;
      }
      EXPECT_EQ(wrong, 0) << r.name;
      EXPECT_EQ(other_team, 0) << r.name;
    });
  }
  omp_set_max_active_levels(before);
}

TEST_F(Level1Drivers, SeveralApplicationThreadsCallAtOnce) {
  stand_ins.recording = false;
  std::atomic<int> wrong{0};
  std::vector<std::thread> callers;
  for (int caller = 0; caller < 6; ++caller)
    callers.emplace_back([&wrong, caller] {
      for (int round = 0; round < 5; ++round)
        for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
          const auto seed = static_cast<std::uint64_t>(100 * caller + round);
          if (!equals_serial(r, 2 + (caller + round) % 4, {1500 + caller, 1, 1, Flush::back, 0, 0, seed})) ++wrong;
        });
    });
  for (std::thread &caller : callers) caller.join();
  EXPECT_EQ(wrong, 0);
}

// The threads of the runtime are made by the first call, in the default state.
TEST_F(Level1Drivers, CallersRoundingAndFlushToZeroHoldOnEveryThread) {
  constexpr int team = 4;
  const unsigned saved = _mm_getcsr();
  for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
    ASSERT_TRUE(equals_serial(r, team, {4099, 1, 1})) << r.name;
    for (const unsigned mode : {_MM_ROUND_DOWN, _MM_ROUND_UP, _MM_ROUND_TOWARD_ZERO, _MM_FLUSH_ZERO_ON}) {
      stand_ins.calls.clear();
      _mm_setcsr(saved | mode);
      const bool equal = equals_serial(r, team, {4099, 1, 1});
      const unsigned choice = qtb::floating_choice();
      _mm_setcsr(saved);
      EXPECT_TRUE(equal || r.is_dot()) << r.name << " with state " << mode;
      EXPECT_EQ(stand_ins.calls.size(), static_cast<std::size_t>(team));
      for (const Call &call : stand_ins.calls) EXPECT_EQ(call.floating_choice, choice) << r.name;
    }
  });
  int changed = 0;
#pragma omp parallel num_threads(team) reduction(+ : changed)
  changed += (_mm_getcsr() & ~qtb::floating_flags) != (saved & ~qtb::floating_flags);
  EXPECT_EQ(changed, 0) << "a thread did not get its own state back";
}

TEST_F(Level1Drivers, SameTeamTierAndAlignmentGiveTheSameBits) {
  stand_ins.recording = false;
  for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
    for (const int team : {3, 12}) {
      const Problem p = {2003, 1, 1, Flush::back, 0, 0, 7};
      Operands<T> first(p);
      r.driver(team, first.call);
      for (int run = 1; run < 100; ++run) {
        Operands<T> again(p);
        r.driver(team, again.call);
        ASSERT_TRUE(same_bits(again.call.result, first.call.result)) << r.name << " team " << team << " run " << run;
        ASSERT_TRUE(again.x == first.x && again.y == first.y) << r.name << " run " << run;
      }
    }
  });
}

}  // namespace
