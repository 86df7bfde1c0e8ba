// How many threads the Level-2 routines get, by value over every limit, one below and one above it, for teams of 1 to
// 64. The rules are written out here once more, from the sizes that one would say aloud.

#include <gtest/gtest.h>

#include <vector>

#include "blas/thread/32e/level2/gemv_decision.h"
#include "blas/thread/32e/level2/l2_decision.h"
#include "tests/thread/asked_process.h"

namespace qtb::test {
namespace {

constexpr std::int32_t most_threads = 64;

// ---- gemv ----

struct GemvRule {
  const char *name;
  GemvLimits limits;
  QtbInt small_dim, row_wide, row_work, row_work_narrow, col_wide, col_work, col_work_narrow;
  bool eight_rows_are_serial;
};

const GemvRule gemv_rules[] = {
    {"sgemv", gemv_limits::sgemv, 128, 32, 3072, 1536, 32, 4096, 2048, true},
    {"dgemv", gemv_limits::dgemv, 64, 64, 3072, 1536, 64, 4096, 2048, false},
    {"cgemv", gemv_limits::cgemv, 256, 64, 2048, 1024, 64, 2048, 1024, false},
    {"zgemv", gemv_limits::zgemv, 64, 32, 1024, 512, 32, 1024, 512, false},
};

static_assert(
    tier_count == 5,
    "tests/thread/level2/decision_test.cpp: say in the two rules and in the tiers that are listed how calls of "
    "the new tier take threads, and list it in front_ends_test.cpp beside it");
QtbInt ruled_threads(const GemvRule &r, char trans, QtbInt m, QtbInt n, const Answers &answers, std::string &asked) {
  asked = "";
  if (m < r.small_dim && n < r.small_dim) return 1;
  asked = "t";
  if (answers.tier != tier_ssse3 && answers.tier != tier_sse42) return 1;
  asked = "tn";
  const QtbInt threads = answers.max_threads;
  if (threads < 2) return 1;
  if (trans == 'N' || trans == 'n') {
    const QtbInt chunk = m / threads - m / threads % 8;
    const QtbInt work = r.eight_rows_are_serial && chunk == 8 ? 0 : chunk * n;
    return work >= (chunk >= r.row_wide ? r.row_work : r.row_work_narrow) ? threads : 1;
  }
  const QtbInt chunk = n / threads;
  return m * chunk >= (chunk >= r.col_wide ? r.col_work : r.col_work_narrow) ? threads : 1;
}

// Sizes from which a share of one of these many threads changes its rule.
std::vector<QtbInt> sizes_around_limits(const GemvRule &r, QtbInt threads) {
  std::vector<QtbInt> sizes = {1, 2, 7, 8, 9, 13, 100, 1000, 10000};
  const auto around = [&](QtbInt n) {
    for (QtbInt d = -1; d <= 1; ++d)
      if (n + d > 0) sizes.push_back(n + d);
  };
  around(r.small_dim);
  for (const QtbInt chunk : {QtbInt{8}, QtbInt{16}, r.row_wide, r.col_wide}) around(chunk * threads);
  return sizes;
}

TEST(GemvDecision, FollowsTheRulesAroundEveryLimitForEveryTeamAndTier) {
  for (const GemvRule &r : gemv_rules)
    for (const ProcessorTier tier : {tier_def, tier_sse3, tier_ssse3, tier_sse42, tier_avx})
      for (std::int32_t threads = 1; threads <= most_threads; ++threads) {
        Answers answers;
        answers.tier = tier;
        answers.max_threads = threads;
        const std::vector<QtbInt> sizes = sizes_around_limits(r, threads);
        for (const char trans : {'N', 'n', 'T', 't', 'C', 'c'})
          for (const QtbInt m : sizes)
            for (const QtbInt n : sizes) {
              std::string asked, expected_asked;
              const QtbInt expected = ruled_threads(r, trans, m, n, answers, expected_asked);
              ASSERT_EQ(gemv_threads(r.limits, gemv_split(trans), m, n, AskedProcess{answers, asked}), expected)
                  << r.name << " " << trans << " " << m << " x " << n << " on " << threads;
              ASSERT_EQ(asked, expected_asked) << r.name;
            }
      }
}

// The amount of work itself: the most columns that are serial, and one more.
TEST(GemvDecision, ChangesAtTheAmountOfWork) {
  for (const GemvRule &r : gemv_rules)
    for (const std::int32_t threads : {2, 3, 7, 16, most_threads})
      for (const QtbInt chunk : {QtbInt{16}, r.row_wide - 8, r.row_wide, r.row_wide + 8}) {
        Answers answers;
        answers.max_threads = threads;
        std::string asked;
        const auto by_rows = [&](QtbInt n) {
          return gemv_threads(r.limits, GemvSplit::rows, chunk * threads, n, AskedProcess{answers, asked});
        };
        const QtbInt work = chunk >= r.row_wide ? r.row_work : r.row_work_narrow, enough = (work + chunk - 1) / chunk;
        if (chunk * threads < r.small_dim) continue;
        EXPECT_EQ(by_rows(enough - 1), 1) << r.name << " " << threads << " threads, " << chunk << " rows each";
        EXPECT_EQ(by_rows(enough), threads) << r.name << " " << threads << " threads, " << chunk << " rows each";
      }
}

QtbInt dgemv_threads(char trans, QtbInt m, QtbInt n, std::int32_t threads) {
  Answers answers;
  answers.max_threads = threads;
  std::string asked;
  return gemv_threads(gemv_limits::dgemv, gemv_split(trans), m, n, AskedProcess{answers, asked});
}
QtbInt sgemv_threads(QtbInt m, QtbInt n, std::int32_t threads) {
  Answers answers;
  answers.max_threads = threads;
  std::string asked;
  return gemv_threads(gemv_limits::sgemv, GemvSplit::rows, m, n, AskedProcess{answers, asked});
}

TEST(GemvDecision, SmallSquareIsSerialOnAnyNumberOfThreads) {
  for (std::int32_t threads = 1; threads <= most_threads; ++threads) EXPECT_EQ(dgemv_threads('N', 63, 63, threads), 1);
}

TEST(GemvDecision, FewColumnsAreSerialAndThirteenAreNot) {
  EXPECT_EQ(dgemv_threads('N', 1000, 2, 4), 1);   // 248 rows each: 496 elements
  EXPECT_EQ(dgemv_threads('N', 1000, 13, 4), 4);  // 3224
}

TEST(GemvDecision, ColumnSplitOnThreeThreads) { EXPECT_EQ(dgemv_threads('T', 100, 1000, 3), 3); }

TEST(GemvDecision, MoreThreadsThanEightRowsEachIsSerial) { EXPECT_EQ(dgemv_threads('N', 200, 1000000, 32), 1); }

TEST(GemvDecision, SharesOfEightRowsAreSerialInSingleHoweverManyColumns) {
  EXPECT_EQ(sgemv_threads(64, 10000, 8), 1);
  EXPECT_EQ(sgemv_threads(72, 10000, 8), 1);
  EXPECT_EQ(sgemv_threads(127, 1000000, 8), 1);
  EXPECT_EQ(sgemv_threads(128, 10000, 8), 8);
  EXPECT_EQ(dgemv_threads('N', 64, 10000, 8), 8);
}

// ---- symv, syr, syr2, trmv ----

struct Level2Rule {
  const char *name;
  Level2Limits limits;
  QtbInt min_n;
  QtbInt serial_to;    // with more than 8 threads; 0: no such rule
  QtbInt serial_from;  // with up to 8; 0: no such rule
};

const Level2Rule level2_rules[] = {
    {"ssymv", level2_limits::ssymv, 256, 300, 4001}, {"dsymv", level2_limits::dsymv, 144, 190, 3001},
    {"ssyr", level2_limits::ssyr, 1500, 0, 0},       {"dsyr", level2_limits::dsyr, 1500, 0, 0},
    {"ssyr2", level2_limits::ssyr2, 1500, 0, 0},     {"dsyr2", level2_limits::dsyr2, 1500, 0, 0},
    {"strmv", level2_limits::strmv, 200, 300, 0},    {"dtrmv", level2_limits::dtrmv, 128, 190, 0},
    {"ctrmv", level2_limits::ctrmv, 128, 160, 0},    {"ztrmv", level2_limits::ztrmv, 96, 120, 0},
};

TEST(Level2Decision, FollowsTheRulesForEveryOrderTeamAndTier) {
  constexpr QtbInt beyond_all = 4100;
  for (const Level2Rule &r : level2_rules)
    for (const ProcessorTier tier : {tier_def, tier_sse3, tier_ssse3, tier_sse42, tier_avx})
      for (std::int32_t threads = 1; threads <= most_threads; ++threads) {
        Answers answers;
        answers.tier = tier;
        answers.max_threads = threads;
        for (QtbInt n = 1; n <= beyond_all; n = n == beyond_all ? 1000000000 : n + 1) {
          const bool known = tier == tier_ssse3 || tier == tier_sse42;
          bool parallel = n >= r.min_n && known && threads >= 2;
          if (threads > 8 && n <= r.serial_to) parallel = false;
          if (threads <= 8 && r.serial_from != 0 && n >= r.serial_from) parallel = false;
          std::string asked;
          ASSERT_EQ(level2_threads(r.limits, n, AskedProcess{answers, asked}), parallel ? threads : 1)
              << r.name << " " << n << " on " << threads << " threads, tier " << tier;
          ASSERT_EQ(asked, n < r.min_n ? "" : known ? "tn" : "t") << r.name << " " << n;
        }
      }
}

TEST(Level2Decision, SymvOnFewThreadsIsSerialWhereItIsLargeAndOnManyWhereItIsSmall) {
  Answers answers;
  std::string asked;
  const auto threads_of = [&](QtbInt n, std::int32_t threads) {
    answers.max_threads = threads;
    return level2_threads(level2_limits::dsymv, n, AskedProcess{answers, asked});
  };
  EXPECT_EQ(threads_of(3000, 8), 8);
  EXPECT_EQ(threads_of(3001, 8), 1);
  EXPECT_EQ(threads_of(190, 16), 1);
  EXPECT_EQ(threads_of(191, 16), 16);
  EXPECT_EQ(threads_of(3001, 16), 16);
}

}  // namespace
}  // namespace qtb::test
