// The strategy and plan that a GEMM's team takes: points to be read beside the rules, a sweep over teams, classes and
// extents against a second transcription of them, and that a plan depends on nothing but what it is for.

#include <algorithm>
#include <cstdlib>
#include <set>
#include <tuple>

#include <random>

#include "tests/support/together.h"
#include "tests/thread/level3/gemm_selection.h"

namespace {

const bool block_queries_used = (use_block_queries(), true);

// ---- Points by hand, one or two of each rule: they hold the transcription, and the library, to numbers ----

struct ByHand {
  const char *types;
  std::vector<int> classes;
  Int t, m, n, k;
  Outcome outcome;
  std::uint32_t cache_count = 3, third_size = 8u << 20;
};
// clang-format off
const std::vector<ByHand> points = {
  {"sdcz", {0, 5},  1,   100,    50,   20, row(1)},              // rows if m is greater than n, else columns
  {"sdcz", {0, 5},  3,   100,   100,   20, col(3)},
  {"scz",  {6},    64,  1000,  2001,   20, col(64)},
  {"d",    {6},     7,   400,  2694,   50, grid_fb(1, 7)},       // 2694/7 is 384
  {"d",    {6},     7,   400,  2695,   50, grid_fa(1, 7)},
  {"d",    {6},     8,  2000,  1000,   50, grid_fa(4, 2)},       // a side of more than twice the other is cut alone
  {"d",    {6},     8,  2001,  1000,   50, grid_fa(8, 1)},
  {"d",    {6},    10,  1000,  1000,   50, grid_fb(2, 5)},
  {"d",    {1},     8,  8000,  3000,  512, bcopy_1d(8)},
  {"d",    {1},     8,  7999,  3000,  512, grid_t(2, 4)},
  {"d",    {1},     9,  9000,  4000,    5, bcopy_1d(8)},
  {"s",    {1},     7, 90000,    10,  100, grid_t(2, 3)},
  {"cz",   {1},    25,   100, 90000,  100, bcopy(24)},
  {"d",    {3},     7,   100,   200, 1000, col(7)},              // seven slabs
  {"d",    {3},     7,   200,   100, 1000, grid_t(2, 3)},        // 200/7 is 28; the seventh thread idles
  {"d",    {3},     7,   224,   100,  100, row(7)},              // 224/7 is 32
  {"d",    {3},     6,   401,   100, 1000, grid_t(6, 1)},
  {"d",    {3},     6,   100,   601, 1000, grid_t(1, 6)},
  {"d",    {3},     8,   199,  1000,  300, grid_t(2, 4)},
  {"d",    {3},     8,   200,  1000,  300, acopy(4, 2, 1000)},
  {"d",    {3},    10,  1500,  1500,  500, acopy(2, 5, 1000)},
  {"d",    {3},    16,   512,  1000,  500, acopy(2, 8, 1000)},   // two groups even for 16 threads
  {"d",    {3},    16,   513,  1000,  500, acopy(4, 4, 1000)},
  {"d",    {3},     8,  1500,  1500,  500, acopy(4, 2, 384), 3, 4194304},
  {"d",    {3},     8,  1500,  1500,  500, acopy(4, 2, 1000), 3, 4194305},
  {"d",    {3},     8,  1500,  1500,  500, acopy(4, 2, 384), 2, 0},   // no third cache counts as a small one
  {"d",    {3},     8,  1500,  1500,  500, acopy(4, 2, 1000), 0, 0},  // no table at all does not
  {"s",    {3},     8,  4001,  1000,  300, grid_t(8, 1)},
  {"cz",   {3},     3,   201,   100,   10, row(2)},
  {"cz",   {3},     8,   400, 10000,  400, bcopy(8)},
  {"d",    {2},     3,   100,   100,  100, grid_41(2, 1)},       // three become two
  {"d",    {4},     3,  7001,  3000,  512, row(3)},              // and are three here
  {"d",    {2},     4,  7001,  3000,  256, abcopy(4, 704)},
  {"d",    {2},     4,  7000,  3000,  256, abcopy(4, 1024)},
  {"d",    {2},    24,   500,   500,  150, grid_41(2, 12)},      // the rules of 24 threads are of class 4
  {"d",    {4},    25,   500,   500,  150, abcopy(24, 448)},     // 25 are made 24 first
  {"d",    {4},    24,   600,  1999,  300, xgemm(24)},
  {"d",    {4},    24,   600,  2000,  300, grid_41(2, 12)},
  {"d",    {4},    24, 14000,   512,  513, grid_41(24, 1)},
  {"d",    {4},    24, 10000,  5000, 90000, abcopy(24, 448)},    // both multiples of 5000, whatever the depth
  {"d",    {4},    24,   601, 14425,  300, grid_41(1, 24)},
  {"s",    {2, 4},  3,  2048,  2048,  512, abcopy(2, 1024)},
  {"s",    {4},    24,   700,   700,  512, xgemm(24)},
  {"s",    {4},    24,  4800,  4000,  600, abcopy(24, 1024)},
  {"cz",   {2, 4},  3,   100,    50,  100, bcopy_41(2)},
  {"c",    {2},     7,   193,    96,   10, abcopy(6, 1024)},     // tall, with 16 columns for each thread
  {"c",    {4},     4,   800,   800,  150, abcopy(4, 448)},
  {"z",    {2},     4,   400,   400,  200, abcopy(4, 512)},
  {"z",    {4},     4,   600,   600,  128, abcopy(4, 256)},
};
// clang-format on

// use(point, outcome) for each type and class.
template <class Use>
void for_each_point(Use use) {
  for (const ByHand &p : points)
    for (const char *type = p.types; *type != 0; ++type)
      for (const int machine_class : p.classes)
        use(Point{*type, machine_class, p.t, p.m, p.n, p.k, p.cache_count, p.third_size}, p.outcome);
}

TEST(GemmSelect, EveryPointByHand) {
  stand_ins.recording = true;
  for_each_point([&](const Point &p, const Outcome &want) {
    stand_ins.calls.clear();
    EXPECT_TRUE(selects(p, want));
    EXPECT_EQ(expected(p), want) << text(p) << ": " << text(expected(p)) << " by the transcription";
    EXPECT_EQ(stand_ins.calls.size(), static_cast<std::size_t>(query_count)) << "only block queries are called";
  });
  stand_ins.recording = false;
}

// Threads select at the same time, each for itself, twice.
TEST(GemmSelect, EveryThreadSelectsTheSamePlan) {
  constexpr int thread_count = 4;
  std::vector<std::string> plans[thread_count];
  on_threads(thread_count, [&](int i) {
    for (int round = 0; round < 2; ++round)
      for_each_point([&](const Point &p, const Outcome &) {
        with_type(p.type, [&](auto *s) {
          select(p, tile_rows(p.type), s);
          plans[i].push_back(bytes_of(*s));
        });
      });
  });
  const std::size_t count = plans[0].size() / 2;
  for (const std::vector<std::string> &of_thread : plans)
    for (std::size_t j = 0; j < of_thread.size(); ++j) ASSERT_EQ(of_thread[j], plans[0][j % count]) << "point " << j;
}

// The tiers that a class is of.
unsigned tiers_of(int machine_class) {
  using namespace qtb::tier_set;
  constexpr unsigned tiers[qtb::machine_class_count] = {DEF | SSE3, SSSE3, SSSE3, SSE42, SSSE3, AVX, DEF};
  static_assert((tiers[0] | tiers[1] | tiers[2] | tiers[3] | tiers[4] | tiers[5] | tiers[6]) == ALL,
                "tests/thread/level3/gemm_select_test.cpp: write every tier into the set of its machine class");
  return tiers[machine_class];
}

// ---- The sweep ----

// Positive numbers one below, at and one above each limit, without repetition.
std::vector<Int> around(const std::vector<Int> &limits) {
  std::vector<Int> all;
  all.reserve(3 * limits.size());
  for (const Int limit : limits)
    for (const Int v : {limit - 1, limit, limit + 1})
      if (v > 0) all.push_back(v);
  std::sort(all.begin(), all.end());
  all.erase(std::unique(all.begin(), all.end()), all.end());
  return all;
}

// Every number that a rule compares an extent with, and some beyond.
const std::vector<Int> m_limits = {6,    100,  200,  256,  400,  500,  512,  600,  700,   800,   1000,
                                   1200, 2048, 4700, 4800, 5000, 5400, 7000, 8000, 10000, 14000, 15000};
const std::vector<Int> n_limits = {1,    100,  128,  400,  500,  512,  600,  700,  800,
                                   1000, 1200, 2000, 2048, 3000, 4000, 5000, 10000};
const std::vector<Int> k_limits = {5, 120, 128, 150, 200, 256, 400, 512, 2000};

std::vector<Int> joined(std::vector<Int> a, const std::vector<Int> &b) {
  a.insert(a.end(), b.begin(), b.end());
  return a;
}

// Points of one type and class. Stops at the first failure.
struct Sweep {
  char type;
  int machine_class;
  std::set<Kind> kinds = {};

  void at(Int t, Int m, Int n, Int k, std::uint32_t cache_count = 3, std::uint32_t third_size = 8u << 20) {
    const Point p{type, machine_class, t, m, n, k, cache_count, third_size};
    const Outcome want = expected(p);
    with_type(type, [&](auto *s) {
      select(p, tile_rows(type), s);
      if (!is_outcome(*s, p, want)) FAIL() << text(p) << ": " << text(*s, type) << ", not " << text(want);
    });
    kinds.insert(want.kind);
  }

  // Every combination of limits for a team, or one in so many of them.
  void team(Int t, std::mt19937_64 *bits, std::uint64_t one_in) {
    for (const Int m : around(joined(m_limits, {32 * t}))) {
      if (testing::Test::HasFailure()) return;
      // Where the quotients of m and n, t and the columns of a grid meet a limit.
      const std::vector<Int> ns = around(joined(n_limits, {m / 4, m / 2, m, 2 * m, m / t, m * t, m * (t - t % 2),
                                                           16 * t, 384, 385 * t, 385 * (t / 2), 385 * (t / 4)}));
      for (const Int n : ns)
        for (const Int k : around(joined(k_limits, {2 * m, 5 * n})))
          if (one_in == 1 || (*bits)() % one_in == 0) at(t, m, n, k);
    }
  }
};

class GemmSelectSweep : public testing::TestWithParam<std::tuple<char, int>> {};
INSTANTIATE_TEST_SUITE_P(All, GemmSelectSweep, testing::Combine(testing::ValuesIn(types), testing::Range(0, 7)),
                         [](const auto &point) {
                           return std::string(1, std::get<0>(point.param)) + "_class" +
                                  std::to_string(std::get<1>(point.param));
                         });

TEST_P(GemmSelectSweep, MatchesTheTranscriptionWithRoutinesThatTheTierHas) {
  const auto [type, machine_class] = GetParam();
  Sweep sweep{type, machine_class};
  std::mt19937_64 bits(20241103);
  const bool one_rule = machine_class == 0 || machine_class == 5;
  // Every combination for each team that the rules look for, and beside it; with QTB_TEST_LONG for twice as many.
  std::set<Int> whole = {2, 3, 7, 8, 24, 25};
  if (std::getenv("QTB_TEST_LONG") != nullptr) whole.merge(std::set<Int>{4, 5, 6, 16, 23, 64});
  // A team of one is no team, but where the rules allow for any.
  const bool any_team = one_rule || machine_class == 6;
  for (Int t = any_team ? 1 : 2; t <= 64; ++t) sweep.team(t, &bits, one_rule || whole.count(t) == 0 ? 40 : 1);
  for (const std::uint32_t count : {0u, 1u, 2u, 3u, 4u})
    for (const std::uint32_t third : {0u, 4194303u, 4194304u, 4194305u, 4294967295u})
      for (const Int t : {2, 8, 10, 24})
        for (const Int m : {512, 1500, 2500})
          for (const Int k : {100, 500}) sweep.at(t, m, 1500, k, count, third);

  // Slots of other tiers hold an empty routine.
  for (const Kind kind : sweep.kinds) {
    const KindInType &routines = kind_in_type(type, kind);
    EXPECT_TRUE(routines.exists) << kind_routines[kind].name;
    EXPECT_EQ(routines.tiers & tiers_of(machine_class), tiers_of(machine_class)) << kind_routines[kind].name;
  }
  // Every point by hand has a kind that the sweep meets, too.
  for_each_point([&](const Point &p, const Outcome &want) {
    EXPECT_TRUE(p.type != type || p.machine_class != machine_class || sweep.kinds.count(want.kind) != 0) << text(p);
  });
}

// ---- Teams of hundreds ----

// A cut by rows leaves each thread a register tile at least; a team too large for that takes slabs of rows or columns.
TEST(GemmSelectLargeTeams, ACutByRowsLeavesEachThreadATile) {
  long cuts = 0, slabs = 0;
  for (const char type : types)
    for (const int machine_class : {2, 4})
      for (Int t = 2; t <= 700; ++t)
        for (const Int m : around({16 * t, 8 * t, 4 * t, 2 * t, 700, 800, 1000, 2048, 7000}))
          for (const Int n : around({600, 1000, 2048, m}))
            for (const Int mu : {1, 2, 4, 8, 16}) {
              const Point p{type, machine_class, t, m, n, 512};
              const Outcome chosen = expected(p);
              if (chosen.kind != k_abcopy) continue;
              with_type(type, [&](auto *s) {
                select(p, mu, s);
                if (m >= chosen.nthreads * mu) {
                  ASSERT_TRUE(is_outcome(*s, p, chosen)) << text(p) << " mu " << mu << ": " << text(*s, type);
                  ++cuts;
                  return;
                }
                const Routines found = routines_in(*s), &want = kind_in_type(type, m > n ? k_row : k_col).routines;
                ASSERT_EQ(found.strategy, want.strategy) << text(p) << " mu " << mu << ": " << text(*s, type);
                ASSERT_EQ(found.kernel, want.kernel) << text(p);
                ASSERT_EQ(s->plan.nthreads, chosen.nthreads) << text(p);
                ASSERT_EQ(s->plan.a_buffers + s->plan.b_buffers, 0) << text(p);
                ++slabs;
              });
              if (HasFatalFailure()) return;
            }
  EXPECT_GT(cuts, 0);
  EXPECT_GT(slabs, 0);
}

}  // namespace
