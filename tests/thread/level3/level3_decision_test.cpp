// Which of the Level-3 routines beside gemm take threads, by value over every limit, one below and one above it. The
// rules are written out here once more, from the sizes that one would say aloud.

#include <gtest/gtest.h>

#include <vector>

#include "blas/thread/32/level3/symm_decision.h"
#include "blas/thread/32e/level3/strips.h"
#include "blas/thread/32e/level3/syrk_decision.h"
#include "blas/thread/32e/level3/trmm_decision.h"
#include "tests/thread/asked_process.h"

namespace qtb::test {
namespace {

constexpr std::int32_t most_threads = 64;
constexpr ProcessorTier tiers[] = {tier_def, tier_sse3, tier_ssse3, tier_sse42, tier_avx};
static_assert(tier_count == 5, "tests/thread/level3/level3_decision_test.cpp: list the new tier, with its rules");

// ---- trmm, trsm ----

struct Ruled {
  bool serial;
  QtbInt unit;
};

template <class T>
constexpr char letter_of = 's';
template <>
constexpr char letter_of<double> = 'd';
template <>
constexpr char letter_of<cfloat> = 'c';
template <>
constexpr char letter_of<cdouble> = 'z';

Ruled ruled_with_estimates(char type, bool left, QtbInt m, QtbInt n, QtbInt threads, bool rounds) {
  const QtbInt g = (left ? n : m) / threads;
  const auto share = [&](QtbInt unit) { return static_cast<double>(rounds ? g - g % unit : g); };
  const auto order = static_cast<double>(left ? m : n), whole = static_cast<double>(g);
  if (left && (type == 'd' || type == 's')) {
    const QtbInt unit = m <= 512 ? 1 : 4;
    const double w1 = (order + 1) * order / 256, w2 = order * share(unit) / 128;
    return {(w1 < 1 && w2 < 6) || w1 + w2 <= 6, unit};
  }
  if (left && type == 'c') return {(order + 1) * order / 256 < 1 && order * whole / 128 < 2, 1};
  if (left) return {(order + 1) * order / 128 < 1 && order * whole / 64 < 2, 1};
  if (type == 'd') {
    const double w1 = (order + 1) * order / 256, w2 = order * share(4) / 128;
    return {w1 <= 1 || w2 < 4 || w1 + w2 <= 10, 4};
  }
  if (type == 's') return {g < 16 || (order + 1) * order / 512 + order * share(8) / 256 < 8, 8};
  if (type == 'c') return {g < 5 || order * whole / 128 < 3, 4};
  return {g < 3 || order * whole / 64 < 3, 1};
}

Ruled ruled(char type, bool solve, bool left, QtbInt m, QtbInt n, ProcessorTier tier, QtbInt threads) {
  const bool tiny = m < 17 && n < 17;
  if (tier == tier_sse3 && solve && type == 'd') {
    Ruled rule = ruled_with_estimates(type, left, m, n, threads, false);
    rule.serial = rule.serial || tiny || (left && m >= 513 && n / threads < 8);
    return {rule.serial, 1};
  }
  if (tier == tier_def || tier == tier_sse3) return {tiny || (!solve && m == 0), 1};
  Ruled rule = ruled_with_estimates(type, left, m, n, threads, true);
  if (solve && type == 'd' && tiny) rule.serial = true;
  return rule;
}

template <class T>
TrmmDecision decided(bool solve, bool left, QtbInt m, QtbInt n, ProcessorTier tier, std::int32_t threads) {
  Answers answers;
  answers.tier = tier;
  answers.max_threads = threads;
  std::string asked;
  const TrmmDecision decision = trmm_decision<T>({solve, left, m, n}, AskedProcess{answers, asked});
  EXPECT_EQ(asked, m <= 10 && n <= 10 ? "" : threads < 2 ? "n" : "nt");
  return decision;
}

// How many threads tier ssse3 asks for: a product on the left, or right.
template <class T>
QtbInt left_product(QtbInt m, QtbInt n, std::int32_t threads) {
  return decided<T>(false, true, m, n, tier_ssse3, threads).threads;
}
template <class T>
QtbInt right_product(QtbInt m, QtbInt n, std::int32_t threads) {
  return decided<T>(false, false, m, n, tier_ssse3, threads).threads;
}

template <class T>
class TrmmDecisions : public testing::Test {};
using Types = testing::Types<float, double, cfloat, cdouble>;
TYPED_TEST_SUITE(TrmmDecisions, Types);

// Orders and extents around all limits, and the extents at which a share changes.
std::vector<QtbInt> orders() {
  std::vector<QtbInt> all;
  for (QtbInt n = 0; n <= 70; ++n) all.push_back(n);
  for (const QtbInt n : {127, 128, 129, 255, 256, 257, 511, 512, 513, 514, 1000, 2000}) all.push_back(n);
  return all;
}
std::vector<QtbInt> extents(QtbInt threads) {
  std::vector<QtbInt> all;
  for (QtbInt n = 0; n <= 40; ++n) all.push_back(n);
  for (QtbInt share = 1; share <= 68; ++share)
    for (const QtbInt more : {QtbInt{-1}, QtbInt{0}}) all.push_back(share * threads + more);
  return all;
}

TYPED_TEST(TrmmDecisions, FollowTheRulesAroundEveryLimitForEveryTeamAndTier) {
  constexpr char type = letter_of<TypeParam>;
  for (const std::int32_t threads : {2, 3, 4, 5, 8, 16, 63, most_threads})
    for (const ProcessorTier tier : tiers)
      for (const bool solve : {false, true})
        for (const bool left : {false, true})
          for (const QtbInt order : orders())
            for (const QtbInt extent : extents(threads)) {
              const QtbInt m = left ? order : extent, n = left ? extent : order;
              const Ruled want = ruled(type, solve, left, m, n, tier, threads);
              ASSERT_EQ(trmm_is_serial<TypeParam>({solve, left, m, n}, tier, threads), want.serial)
                  << type << solve << left << ' ' << m << " x " << n << " on " << threads << " tier " << tier;
              ASSERT_EQ(trmm_unit<TypeParam>({solve, left, m, n}, tier), want.unit);
            }
}

// So that nothing need be asked.
TYPED_TEST(TrmmDecisions, TenRowsAndColumnsAreSerialOnEveryTierAndTeam) {
  for (std::int32_t threads = 2; threads <= 2 * most_threads; ++threads)
    for (const ProcessorTier tier : tiers)
      for (QtbInt m = 0; m <= 10; ++m)
        for (QtbInt n = 0; n <= 10; ++n)
          for (const bool solve : {false, true})
            for (const bool left : {false, true}) {
              ASSERT_TRUE(ruled(letter_of<TypeParam>, solve, left, m, n, tier, threads).serial);
              ASSERT_EQ(decided<TypeParam>(solve, left, m, n, tier, threads).threads, 1);
            }
}

TYPED_TEST(TrmmDecisions, OneThreadIsSerialAndAsksNoMore) {
  for (const ProcessorTier tier : tiers) EXPECT_EQ(decided<TypeParam>(true, true, 1000, 1000, tier, 1).threads, 1);
}

TYPED_TEST(TrmmDecisions, ADecisionHasAllThreadsAndTheUnit) {
  const auto decision = decided<TypeParam>(true, false, 1000, 1000, tier_avx, 7);
  EXPECT_EQ(decision.threads, 7);
  EXPECT_EQ(decision.unit, letter_of<TypeParam> == 's' ? 8 : letter_of<TypeParam> == 'z' ? 1 : 4);
}

TYPED_TEST(TrmmDecisions, BelowTheTiersWithEstimatesOnlyTinyIsSerial) {
  for (const bool solve : {false, true}) {
    EXPECT_EQ(decided<TypeParam>(solve, true, 16, 16, tier_def, 64).threads, 1);
    EXPECT_EQ(decided<TypeParam>(solve, true, 17, 1, tier_def, 64).threads, 64);
    EXPECT_EQ(decided<TypeParam>(solve, true, 1, 17, tier_def, 64).threads, 64);
  }
  EXPECT_EQ(decided<TypeParam>(false, true, 0, 17, tier_def, 4).threads, 1);
  EXPECT_EQ(decided<TypeParam>(true, true, 0, 17, tier_def, 4).threads, 4);
}

TEST(TrmmDecision, InDoubleOnTheLeftSharesAreRoundedFrom513RowsOn) {
  for (const ProcessorTier tier : {tier_ssse3, tier_sse42, tier_avx}) {
    EXPECT_EQ(decided<double>(false, true, 512, 1000, tier, 4).unit, 1);
    EXPECT_EQ(decided<double>(false, true, 513, 1000, tier, 4).unit, 4);
  }
  EXPECT_EQ(decided<double>(true, true, 513, 1000, tier_sse3, 4).unit, 1);
}

TEST(TrmmDecision, SixteenRowsAndThousandColumnsInDoubleOnTheLeftAreSplit) {
  EXPECT_EQ(left_product<double>(16, 1000, 4), 4);
}

TEST(TrmmDecision, InComplexSingleOnTheRightAShareOfFourRowsIsSerialAndOneOfFiveIsEstimated) {
  EXPECT_EQ(right_product<cfloat>(9, 1000, 2), 1);
  EXPECT_EQ(right_product<cfloat>(10, 1000, 2), 2);
  EXPECT_EQ(right_product<cfloat>(10, 76, 2), 1);  // 380/128, which is below 3
  EXPECT_EQ(right_product<cfloat>(10, 77, 2), 2);
}

TEST(TrmmDecision, InComplexDoubleOnTheRightTwoRowsEachAreSerial) {
  for (std::int32_t threads = 2; threads <= most_threads; ++threads) {
    EXPECT_EQ(right_product<cdouble>(2 * threads, 100000, threads), 1);
    EXPECT_EQ(right_product<cdouble>(3 * threads, 100000, threads), threads);
  }
}

TEST(TrmmDecision, InDoubleOnTheRightTheRoundedShareCountsAndInComplexTheWholeOne) {
  // 7 rows each: 4 of them in whole fours.
  EXPECT_EQ(right_product<double>(14, 127, 2), 1);  // 127*4/128 is below 4
  EXPECT_EQ(right_product<double>(14, 128, 2), 2);
  EXPECT_EQ(right_product<cfloat>(14, 54, 2), 1);  // 54*7/128 is below 3
  EXPECT_EQ(right_product<cfloat>(14, 55, 2), 2);
}

TEST(TrmmDecision, OnSse3OnlySolvesInDoubleAreEstimated) {
  EXPECT_EQ(decided<double>(true, true, 20, 20, tier_sse3, 4).threads, 1);
  EXPECT_EQ(decided<double>(false, true, 20, 20, tier_sse3, 4).threads, 4);
  EXPECT_EQ(decided<float>(true, true, 20, 20, tier_sse3, 4).threads, 4);
  // Slabs of seven columns do not pay beside a large triangle.
  EXPECT_EQ(decided<double>(true, true, 512, 31, tier_sse3, 4).threads, 4);
  EXPECT_EQ(decided<double>(true, true, 513, 31, tier_sse3, 4).threads, 1);
  EXPECT_EQ(decided<double>(true, true, 513, 32, tier_sse3, 4).threads, 4);
  EXPECT_EQ(decided<double>(true, true, 513, 31, tier_ssse3, 4).threads, 4);
}

// ---- syrk, herk ----

SyrkDecision syrk_decided(QtbInt n, std::int32_t threads) {
  Answers answers;
  answers.max_threads = threads;
  std::string asked;
  const SyrkDecision decision = syrk_decision(n, AskedProcess{answers, asked});
  EXPECT_EQ(asked, n < 8 ? "" : "n");
  return decision;
}

TEST(SyrkDecision, FollowsTheRulesForEveryOrderAndTeam) {
  for (std::int32_t threads = 1; threads <= most_threads; ++threads)
    for (QtbInt n = 0; n <= 2000; ++n) {
      const SyrkRoad want = n == 4            ? syrk_of_order_4
                            : n < 8 * threads ? syrk_small
                            : threads == 1    ? syrk_serial
                                              : syrk_parallel;
      const SyrkDecision decision = syrk_decided(n, threads);
      ASSERT_EQ(decision.road, want) << n << " on " << threads;
      ASSERT_TRUE(want != syrk_parallel || decision.threads == threads);
    }
}

TEST(SyrkDecision, OrderFourHasItsKernelWhateverTheThreads) {
  for (const std::int32_t threads : {1, 2, 64}) EXPECT_EQ(syrk_decided(4, threads).road, syrk_of_order_4);
}

TEST(SyrkDecision, OnFourThreads31IsSmallAnd32IsTiles) {
  EXPECT_EQ(syrk_decided(31, 4).road, syrk_small);
  EXPECT_EQ(syrk_decided(32, 4).road, syrk_parallel);
}

TEST(SyrkDecision, TiersWithBuildingBlocksTakeTiles) {
  for (const ProcessorTier tier : tiers) {
    Answers answers;
    answers.tier = tier;
    std::string asked;
    EXPECT_EQ(syrk_takes_tiles(AskedProcess{answers, asked}), tier >= tier_ssse3);
    EXPECT_EQ(asked, "t");
  }
}

// ---- strips, symm ----

TEST(StripThreads, SixteenIsSerialAndSeventeenIsNotFromTwoThreadsOn) {
  for (std::int32_t threads = 1; threads <= most_threads; ++threads)
    for (QtbInt n = 1; n <= 40; ++n) {
      Answers answers;
      answers.max_threads = threads;
      std::string asked;
      ASSERT_EQ(strip_threads(n, AskedProcess{answers, asked}), n < 17 ? 1 : threads) << n;
      ASSERT_EQ(asked, n < 17 ? "" : "n") << n;
    }
}

TEST(SymmThreads, OneSideOf17IsEnough) {
  for (std::int32_t threads = 1; threads <= most_threads; ++threads)
    for (QtbInt m = 1; m <= 18; ++m)
      for (QtbInt n = 1; n <= 18; ++n) {
        Answers answers;
        answers.max_threads = threads;
        std::string asked;
        const bool tiny = m <= 16 && n <= 16;
        ASSERT_EQ(symm_threads(m, n, AskedProcess{answers, asked}), tiny ? 1 : threads) << m << " x " << n;
        ASSERT_EQ(asked, tiny ? "" : "n");
      }
}

}  // namespace
}  // namespace qtb::test
