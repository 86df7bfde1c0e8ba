// The parallel Level-1 drivers on real teams, more threads than processors included.
//
// The dispatch slots are the test's own: they note which piece a thread got and call the tier under test. So every tier
// can be run in one process, and the pieces themselves can be checked. The memory service is the test's own too.

#include <gtest/gtest.h>
#include <omp.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <map>
#include <random>
#include <string>
#include <thread>
#include <vector>

#include "blas/dispatch/slots.h"
#include "blas/thread/floating_state.h"
#include "service/memory.h"
#include "tests/support/bounds.h"
#include "tests/support/guarded.h"
#include "tests/thread/level1_routines.h"
#include "tests/thread/level1_sum_model.h"

namespace {

using namespace qtb::test;

// ---- The slots ----

struct Piece {
  const void *x, *y;
  QtbInt len;
  int rank, team;
};

constexpr int most_pieces = 1024;
std::atomic<int> tier_under_test{0};
std::atomic<bool> recording{false};
std::atomic<int> pieces_seen{0};
Piece pieces[most_pieces];
thread_local int last_team = 0;
// Where not null, what the dots' slots return in place of a kernel's result: one entry per thread.
std::atomic<const void *> forced_partials{nullptr};

void note(const QtbInt *n, const void *x, const void *y) {
  last_team = omp_get_num_threads();
  if (!recording) return;
  const int index = pieces_seen.fetch_add(1);
  if (index < most_pieces) pieces[index] = {x, y, *n, omp_get_thread_num(), last_team};
}

template <class T>
const T *forced_partial() {
  const auto *const forced = static_cast<const T *>(forced_partials.load());
  return forced == nullptr ? nullptr : forced + omp_get_thread_num();
}

// ---- The memory service ----

enum class Memory { plain, none, shifted };  // what a request for memory gets
Memory memory = Memory::plain;
std::size_t memory_shift = 0;                // bytes beyond a 16-byte boundary, with Memory::shifted
std::vector<std::uint64_t> memory_requests;  // sizes asked for
int memory_alignment = -1;                   // of the last request
std::map<void *, void *> memory_held;        // buffer -> what free takes

}  // namespace

extern "C" {
void *qtb_serv_malloc(std::uint64_t size, std::int32_t alignment) {
  memory_requests.push_back(size);
  memory_alignment = alignment;
  if (memory == Memory::none) return nullptr;
  void *const raw = std::malloc(size + 16);
  void *const given = static_cast<char *>(raw) + (memory == Memory::shifted ? memory_shift : 0);
  memory_held[given] = raw;
  return given;
}

void qtb_serv_free(void *pointer) {
  if (pointer == nullptr) return;
  ASSERT_EQ(memory_held.count(pointer), 1U);
  std::free(memory_held[pointer]);
  memory_held.erase(pointer);
}

#define QTB_FORCED_axpy(T)
#define QTB_FORCED_copy(T)
#define QTB_FORCED_swap(T)
#define QTB_FORCED_rot(T)
#define QTB_FORCED_dot(T) \
  if (const T *forced = forced_partial<T>()) return *forced;
#define QTB_FORCED_cdot(T) \
  if (const T *forced = forced_partial<T>()) return *result = *forced, result;

#define QTB_NOTING_SLOT(name, shape, T)                                                                     \
  QTB_FUNCTION(shape, T, qtb_blas_x##name) {                                                                \
    static constexpr QTB_RESULT_##shape(T) (*const targets[])(QTB_PARAMS_##shape(T)) = QTB_ALL_TIERS(name); \
    note(n, x, y);                                                                                          \
    QTB_FORCED_##shape(T) return targets[tier_under_test](QTB_ARGS(shape));                                 \
  }
#define QTB_LEVEL1_SIZED(name, shape, T, ...) QTB_NOTING_SLOT(name, shape, T)
#define QTB_LEVEL1_PAIR(name, shape, T, min_n) QTB_NOTING_SLOT(name, shape, T)
#include "blas/thread/32e/level1/xf_l1.def"
#undef QTB_LEVEL1_SIZED
#undef QTB_LEVEL1_PAIR
}

namespace {

// ---- Vectors ----

// Element number i of n stands here, from the vector's pointer, by the published convention.
QtbInt place(QtbInt i, QtbInt n, QtbInt inc) { return inc > 0 ? i * inc : (i - n + 1) * inc; }

std::size_t extent(QtbInt n, QtbInt inc) {
  return n < 1 ? 0 : static_cast<std::size_t>(1 + (n - 1) * (inc < 0 ? -inc : inc));
}

template <class T>
T random_value(std::mt19937_64 &random) {
  std::uniform_real_distribution<double> uniform(-1, 1);
  if constexpr (is_complex<T>) {
    const auto re = static_cast<Real<T>>(uniform(random));
    return {re, static_cast<Real<T>>(uniform(random))};
  } else {
    return static_cast<T>(uniform(random));
  }
}

// A vector between trapping pages. What lies between its elements is signalling NaN with a payload.
template <class T>
struct Vector {
  Guarded<T> store;

  Vector(QtbInt n, QtbInt inc, Flush flush, std::size_t offset, std::mt19937_64 &random)
      : store(extent(n, inc), flush, offset) {
    if constexpr (sizeof(Real<T>) == 4)
      fill<std::uint32_t>(0x7fa12345U);
    else
      fill<std::uint64_t>(0x7ff4123456789abcU);
    for (QtbInt i = 0; i < n; ++i) store.data()[place(i, n, inc)] = random_value<T>(random);
  }

  template <class Word>
  void fill(Word word) {
    for (std::size_t i = 0; i < store.size() * sizeof(T) / sizeof(Word); ++i)
      std::memcpy(reinterpret_cast<char *>(store.data()) + i * sizeof(Word), &word, sizeof(Word));
  }
  bool same_bits(const Vector &other) const {
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

template <class T>
bool same_bits(const T &a, const T &b) {
  return std::memcmp(&a, &b, sizeof(T)) == 0;
}

// ---- Oracles ----

QuadComplex product(QuadComplex a, QuadComplex b) { return {a.re * b.re - a.im * b.im, a.re * b.im + a.im * b.re}; }
QuadComplex conjugate(QuadComplex a) { return {a.re, -a.im}; }

// error / bound of a dot of n terms on the operands.
template <class T>
double dot_ratio(const Operands<T> &o, T got) {
  const Level1Call<T> &a = o.call;
  QuadComplex want;
  Quad gauge = 0;
  for (QtbInt i = 0; i < a.n; ++i) {
    const QuadComplex x = widen(a.x[place(i, a.n, a.incx)]), y = widen(a.y[place(i, a.n, a.incy)]);
    const QuadComplex term = product(conjugate(x), y);
    want = {want.re + term.re, want.im + term.im};
    gauge += magnitude(x) * magnitude(y);
  }
  return error_ratio(got, want, gauge, static_cast<double>(is_complex<T> ? 2 * a.n : a.n));
}

// ---- One call, checked in every respect ----

long cases_of_tier[tier_count];
std::map<std::string, double> worst_ratio;

constexpr int any_team = 0;

// The length and pointers that thread rank of a team must get, by counting.
struct Share {
  QtbInt start, len;
};
Share expected_share(QtbInt n, int team, int rank) {
  QtbInt chunk = 0;
  while ((chunk + 8) * team <= n) chunk += 8;
  return {chunk * rank, rank == team - 1 ? n - chunk * rank : chunk};
}
template <class T>
T *expected_pointer(T *vector, QtbInt n, QtbInt inc, Share share) {
  return vector + place(share.start, n, inc) - place(0, share.len, inc);
}

// Every rank of the team got its piece, once.
template <class T>
void check_pieces(const Level1Call<T> &a, int count, int team) {
  ASSERT_EQ(count, team);
  std::vector<bool> seen(static_cast<std::size_t>(team));
  for (int i = 0; i < count; ++i) {
    const Piece &piece = pieces[i];
    ASSERT_EQ(piece.team, team);
    ASSERT_LT(piece.rank, team);
    ASSERT_FALSE(seen[static_cast<std::size_t>(piece.rank)]);
    seen[static_cast<std::size_t>(piece.rank)] = true;
    const Share share = expected_share(a.n, team, piece.rank);
    ASSERT_EQ(piece.len, share.len) << "rank " << piece.rank;
    if (share.len == 0) continue;
    ASSERT_EQ(piece.x, expected_pointer(a.x, a.n, a.incx, share)) << "rank " << piece.rank;
    ASSERT_EQ(piece.y, expected_pointer(a.y, a.n, a.incy, share)) << "rank " << piece.rank;
  }
}

// The driver's dot equals the tier's own partial results, joined by the model.
template <class T>
void check_dot(const Level1Routine<T> &r, int tier, const Operands<T> &o, int team, T got) {
  std::vector<T> store(static_cast<std::size_t>(team) + 2);
  T *const partial = store.data() + (multiple_of(store.data(), 16) ? 0 : 1);
  for (int rank = 0; rank < team; ++rank) {
    Level1Call<T> piece = o.call;
    const Share share = expected_share(o.call.n, team, rank);
    piece.n = share.len;
    if (share.len > 0) {
      piece.x = expected_pointer(o.call.x, o.call.n, o.call.incx, share);
      piece.y = expected_pointer(o.call.y, o.call.n, o.call.incy, share);
    }
    r.tier(tier, piece);
    partial[rank] = piece.result;
  }
  const T want = team == 1 ? partial[0] : model_sum(partial, team);
  ASSERT_TRUE(same_bits(got, want)) << "the order of summation differs from the model's";
  const double ratio = dot_ratio(o, got);
  worst_ratio[r.name] = std::max(worst_ratio[r.name], ratio);
  ASSERT_LE(ratio, 1.0);
}

// Runs the driver and the tier's serial routine on like operands. Elementwise results are equal to the bit: each
// element is computed alone, so that the team cannot change it. So are the gaps and what is only read.
template <class T>
void check(const Level1Routine<T> &r, int tier, QtbInt nthreads, const Problem &p, int expected_team) {
  SCOPED_TRACE(std::string(r.name) + " on " + tier_name(tier) + ": threads " + std::to_string(nthreads) + " n " +
               std::to_string(p.n) + " incx " + std::to_string(p.incx) + " incy " + std::to_string(p.incy) +
               " offsets " + std::to_string(p.offset_x) + " " + std::to_string(p.offset_y) + " seed " +
               std::to_string(p.seed));
  Operands<T> parallel(p), serial(p);
  tier_under_test = tier;
  pieces_seen = 0;
  recording = true;
  r.driver(nthreads, parallel.call);
  recording = false;
  const int team = pieces[0].team;
  if (expected_team != any_team) {
    ASSERT_EQ(team, expected_team);
  }
  ASSERT_GE(team, 1);
  ASSERT_LE(team, nthreads);
  if (p.n > 0) check_pieces(parallel.call, pieces_seen, team);

  if (r.is_dot()) check_dot(r, tier, parallel, team, parallel.call.result);
  r.tier(tier, serial.call);
  ASSERT_TRUE(parallel.x.same_bits(serial.x)) << "x differs from the serial routine's";
  ASSERT_TRUE(parallel.y.same_bits(serial.y)) << "y differs from the serial routine's";
  ++cases_of_tier[tier];
}

// The tier of the tests whose subject is not the tier.
const int one_tier = processor_runs(tier_sse42) ? tier_sse42 : tier_def;

bool long_run() { return std::getenv("QTB_TEST_LONG") != nullptr; }

class Level1Drivers : public testing::Test {
 protected:
  static constexpr unsigned seconds_per_test = 120;

  void SetUp() override {
    alarm(seconds_per_test);
    memory = Memory::plain;
    memory_requests.clear();
    forced_partials = nullptr;
  }
  void TearDown() override {
    EXPECT_TRUE(memory_held.empty()) << "memory was not given back";
    alarm(0);
  }
  static void TearDownTestSuite() {
    for (int tier = 0; tier < tier_count; ++tier)
      std::printf("drivers: %s, %ld cases\n", tier_name(tier), cases_of_tier[tier]);
    for (const auto &[name, ratio] : worst_ratio)
      std::printf("drivers: %s, worst error/bound %.3g\n", name.c_str(), ratio);
  }
};

template <class Visit>
void for_each_tier(Visit visit) {
  for (int tier = 0; tier < tier_count; ++tier)
    if (processor_runs(tier)) visit(tier);
}

Problem random_problem(std::mt19937_64 &random, QtbInt n, std::size_t step) {
  const auto pick = [&](std::uint64_t count) { return random() % count; };
  constexpr QtbInt increments[] = {1, -1, 1, -1, 2, -2, 3, -3};
  return {n,
          increments[pick(8)],
          increments[pick(8)],
          pick(2) == 0 ? Flush::front : Flush::back,
          pick(64 / step) * step,
          pick(64 / step) * step,
          random()};
}

TEST_F(Level1Drivers, EveryTeamAndTierEqualsTheSerialRoutine) {
  const int repeats = long_run() ? 50 : 2;
  std::mt19937_64 random(20);
  for (const int team : {1, 2, 3, 4, 5, 7, 8, 9, 10, 11, 16, 24, 33, 129})
    for (int repeat = 0; repeat < repeats; ++repeat)
      for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
        for_each_tier([&](int tier) {
          const QtbInt lengths[] = {team - 1, team, 8 * team - 1, 8 * team, 8 * team + 1, 16 * team + 5, 997};
          for (int k = 0; k < 3; ++k) {
            const QtbInt n = lengths[random() % std::size(lengths)];
            ASSERT_NO_FATAL_FAILURE(check(r, tier, team, random_problem(random, n, sizeof(Real<T>)), team));
          }
        });
      });
}

TEST_F(Level1Drivers, LengthsAroundTheChunksAtEveryIncrement) {
  for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
    for (const int team : {2, 5})
      for (const QtbInt n : {0, 1, team - 1, 8 * team - 1, 8 * team, 8 * team + 1, 40 * team + 7})
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
        if (r.is_dot()) {
          EXPECT_TRUE(same_bits(o.call.result, T{})) << r.name;
        }
      }
  });
}

TEST_F(Level1Drivers, ThreeThreadsOn4099ElementsWithTheRemainderOnTheLast) {
  for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
    ASSERT_NO_FATAL_FAILURE(check(r, one_tier, 3, {4099, 1, 1}, 3));
    for (int i = 0; i < 3; ++i) EXPECT_EQ(pieces[i].len, pieces[i].rank == 2 ? 1379 : 1360) << r.name;
  });
}

// ---- Exact data ----

TEST_F(Level1Drivers, WholeNumbersGiveTheExactDotForEveryTeam) {
  for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
    if (!r.is_dot()) return;
    for_each_tier([&](int tier) {
      tier_under_test = tier;
      for (const int team : {1, 2, 3, 8, 9, 11, 12, 16, 40}) {
        Operands<T> o({1003, 1, -2});
        long long re = 0, im = 0;
        for (QtbInt i = 0; i < 1003; ++i) {
          const int xr = static_cast<int>(i % 7) - 3, xi = static_cast<int>(i % 5) - 1;
          const int yr = static_cast<int>(i % 11) - 2, yi = static_cast<int>(i % 3) - 1;
          T &x = o.call.x[place(i, 1003, 1)], &y = o.call.y[place(i, 1003, -2)];
          if constexpr (is_complex<T>) {
            x = {Real<T>(xr), Real<T>(xi)}, y = {Real<T>(yr), Real<T>(yi)};
            re += xr * yr + xi * yi, im += xr * yi - xi * yr;
          } else {
            x = T(xr), y = T(yr);
            re += xr * yr;
          }
        }
        r.driver(team, o.call);
        const QuadComplex got = widen(o.call.result);
        EXPECT_TRUE(got.re == Quad(re) && got.im == Quad(im)) << r.name << " team " << team;
      }
    });
  });
}

// ---- Joining ----

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

template <class T>
T joined(const Level1Routine<T> &r, int nthreads, const std::vector<T> &partials) {
  Operands<T> o({64, 1, 1});
  forced_partials = partials.data();
  r.driver(nthreads, o.call);
  forced_partials = nullptr;
  return o.call.result;
}

// The model's sum of the first entries, at an address so many bytes beyond a 16-byte boundary.
template <class T>
T model(const std::vector<T> &partials, int team, std::size_t shift) {
  Guarded<T> store(partials.size(), Flush::front, shift);
  std::copy(partials.begin(), partials.end(), store.data());
  return model_sum(store.data(), team);
}

TEST_F(Level1Drivers, PartialResultsAreJoinedInTheModelsOrder) {
  for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
    if (!r.is_dot()) return;
    for (const int team : {2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 16, 17, 18, 19, 24, 31, 33, 64})
      for (int seed = 0; seed < 5; ++seed) {
        const auto partials = rough_partials<T>(team, static_cast<std::uint64_t>(seed));
        EXPECT_TRUE(same_bits(joined(r, team, partials), model(partials, team, 0))) << r.name << " team " << team;
      }
  });
}

TEST_F(Level1Drivers, ResultOfATeamOfOneStandsAsItIs) {
  for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
    if (!r.is_dot()) return;
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
  for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
    const auto partials = rough_partials<T>(129, 3);
    memory_requests.clear();
    if (!r.is_dot()) {
      ASSERT_NO_FATAL_FAILURE(check(r, one_tier, 129, {2000, 1, 1}, 129));
      EXPECT_TRUE(memory_requests.empty()) << r.name;
      return;
    }
    EXPECT_TRUE(same_bits(joined(r, 128, partials), model(partials, 128, 0))) << r.name;
    EXPECT_TRUE(memory_requests.empty()) << r.name;
    EXPECT_TRUE(same_bits(joined(r, 129, partials), model(partials, 129, 0))) << r.name;
    EXPECT_EQ(memory_requests, std::vector<std::uint64_t>{129 * sizeof(T)}) << r.name;
    EXPECT_EQ(memory_alignment, 0);
    EXPECT_TRUE(memory_held.empty());
  });
}

TEST_F(Level1Drivers, SumFollowsTheAddressThatTheMemoryServiceGives) {
  memory = Memory::shifted;
  for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
    if (!r.is_dot()) return;
    for (memory_shift = 0; memory_shift < 16; memory_shift += sizeof(Real<T>)) {
      const auto partials = rough_partials<T>(131, 4);
      EXPECT_TRUE(same_bits(joined(r, 131, partials), model(partials, 131, memory_shift)))
          << r.name << " shift " << memory_shift;
    }
  });
}

TEST_F(Level1Drivers, WithoutMemoryTheTeamIsAsLargeAsTheLocalArray) {
  memory = Memory::none;
  for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
    if (!r.is_dot()) return;
    ASSERT_NO_FATAL_FAILURE(check(r, one_tier, 200, {3000, 1, 1}, 128));
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
          check(r, one_tier, 8, {2003, 1, -1}, 3);
          check(r, one_tier, 3, {2003, 1, -1}, 3);
          if (r.is_dot()) check(r, one_tier, 129, {2003, 1, 1}, 3);
        });
        std::exit(HasFailure() ? 1 : 0);
      },
      testing::ExitedWithCode(0), "");
  unsetenv("OMP_THREAD_LIMIT");
}

// ---- Calls inside parallel regions and from several threads ----

// Results of one call on a team and of the serial routine, without the notes that only one caller at a time can use.
template <class T>
bool equals_serial(const Level1Routine<T> &r, int tier, QtbInt nthreads, const Problem &p) {
  Operands<T> parallel(p), serial(p);
  r.driver(nthreads, parallel.call);
  r.tier(tier, serial.call);
  if (r.is_dot()) return dot_ratio(serial, parallel.call.result) <= 1;
  return parallel.x.same_bits(serial.x) && parallel.y.same_bits(serial.y);
}

TEST_F(Level1Drivers, RegionThatMayNotNestRunsTheWholeProblemOnEachCaller) {
  const int levels = omp_get_max_active_levels();
  omp_set_max_active_levels(1);
  tier_under_test = one_tier;
  for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
    std::atomic<int> wrong{0}, forked{0};
#pragma omp parallel num_threads(4)
    {
      const auto seed = static_cast<std::uint64_t>(omp_get_thread_num());
      if (!equals_serial(r, one_tier, 3, {2001, 1, -1, Flush::back, 0, 0, seed})) ++wrong;
      if (last_team != 1) ++forked;
    }
    EXPECT_EQ(wrong, 0) << r.name;
    EXPECT_EQ(forked, 0) << r.name;
  });
  omp_set_max_active_levels(levels);
}

TEST_F(Level1Drivers, NestedTeamsAreRight) {
  const int levels = omp_get_max_active_levels();
  omp_set_max_active_levels(2);
  tier_under_test = one_tier;
  for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
    std::atomic<int> wrong{0}, unforked{0};
#pragma omp parallel num_threads(3)
    {
      const auto seed = static_cast<std::uint64_t>(omp_get_thread_num());
      if (!equals_serial(r, one_tier, 3, {2001, 1, -1, Flush::back, 0, 0, seed})) ++wrong;
      if (last_team != 3) ++unforked;
    }
    EXPECT_EQ(wrong, 0) << r.name;
    EXPECT_EQ(unforked, 0) << r.name;
  });
  omp_set_max_active_levels(levels);
}

TEST_F(Level1Drivers, SeveralApplicationThreadsCallAtOnce) {
  tier_under_test = one_tier;
  std::atomic<int> wrong{0};
  std::vector<std::thread> callers;
  for (int caller = 0; caller < 6; ++caller)
    callers.emplace_back([&wrong, caller] {
      for (int round = 0; round < 5; ++round)
        for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
          const auto seed = static_cast<std::uint64_t>(100 * caller + round);
          if (!equals_serial(r, one_tier, 2 + (caller + round) % 4, {1500 + caller, 1, 1, Flush::back, 0, 0, seed}))
            ++wrong;
        });
    });
  for (std::thread &caller : callers) caller.join();
  EXPECT_EQ(wrong, 0);
}

// The threads of the runtime are made by the first call, in the default state.
TEST_F(Level1Drivers, CallersRoundingAndFlushToZeroHoldOnEveryThread) {
  constexpr int team = 4;
  const Problem p = {4099, 1, 1, Flush::back, 0, 0, 11};
  tier_under_test = one_tier;
  const unsigned saved = _mm_getcsr();
  for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
    if (r.is_dot()) return;
    ASSERT_TRUE(equals_serial(r, one_tier, team, p)) << r.name;
    for (const unsigned mode : {_MM_ROUND_DOWN, _MM_ROUND_UP, _MM_ROUND_TOWARD_ZERO, _MM_FLUSH_ZERO_ON}) {
      _mm_setcsr(saved | mode);
      const bool equal = equals_serial(r, one_tier, team, p);
      _mm_setcsr(saved);
      EXPECT_TRUE(equal) << r.name << " with state " << mode;
    }
  });
  int changed = 0;
#pragma omp parallel num_threads(team) reduction(+ : changed)
  changed += (_mm_getcsr() & ~qtb::floating_flags) != (saved & ~qtb::floating_flags);
  EXPECT_EQ(changed, 0) << "a thread did not get its own state back";
}

TEST_F(Level1Drivers, SameTeamTierAndAlignmentGiveTheSameBitsUnderLoad) {
  std::atomic<bool> stop{false};
  std::vector<std::thread> load;
  for (int i = 0; i < 2; ++i)
    load.emplace_back([&stop] {
      while (!stop) {
      }
    });
  for_each_level1_routine([&]<class T>(const Level1Routine<T> &r) {
    for (const int team : {3, 12}) {
      const Problem p = {2003, 1, 1, Flush::back, 0, 0, 7};
      tier_under_test = one_tier;
      Operands<T> first(p);
      r.driver(team, first.call);
      for (int run = 1; run < 100; ++run) {
        Operands<T> again(p);
        r.driver(team, again.call);
        ASSERT_TRUE(same_bits(again.call.result, first.call.result)) << r.name << " team " << team << " run " << run;
        ASSERT_TRUE(again.x.same_bits(first.x) && again.y.same_bits(first.y)) << r.name << " run " << run;
      }
    }
  });
  stop = true;
  for (std::thread &thread : load) thread.join();
}

}  // namespace
