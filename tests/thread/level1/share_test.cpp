// The cut of a vector over a team and the joining of partial results, without threads.

#include "blas/thread/32e/level1/xf_l1_share.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <random>
#include <vector>

#include "tests/thread/level1/sum_model.h"

namespace {

using qtb::level1_offset;
using qtb::level1_share;
using qtb::level1_sum;
using qtb::Level1Share;

std::vector<QtbInt> lengths_around_chunks(QtbInt team) {
  std::vector<QtbInt> lengths;
  for (QtbInt n = 0; n <= 20; ++n) lengths.push_back(n);
  for (const QtbInt chunks : {1, 2, 3, 17})
    for (QtbInt d = -1; d <= 1; ++d) lengths.push_back(team * 8 * chunks + d);
  for (QtbInt d = -1; d <= 1; ++d) lengths.push_back(team + d);
  lengths.push_back(1000003);
  return lengths;
}

TEST(Level1Share, EqualMultiplesOfEightCoverTheVectorAndTheLastTakesTheRest) {
  for (QtbInt team = 1; team <= 200; ++team)
    for (const QtbInt n : lengths_around_chunks(team)) {
      SCOPED_TRACE(testing::Message() << n << " on " << team);
      QtbInt chunk = 0, next = 0;
      while ((chunk + 8) * team <= n) chunk += 8;
      for (QtbInt rank = 0; rank < team; ++rank) {
        const Level1Share share = level1_share(n, team, rank);
        ASSERT_EQ(share.len, rank < team - 1 ? chunk : n - chunk * (team - 1));
        if (share.len > 0) {
          ASSERT_EQ(share.start, next);
        }
        ASSERT_TRUE(n == 0 || (share.start >= 0 && share.start < n)) << "an empty share starts inside, too";
        next += share.len;
      }
    }
}

TEST(Level1Share, ThreeThreadsOn4099Elements) {
  for (QtbInt rank = 0; rank < 3; ++rank) EXPECT_EQ(level1_share(4099, 3, rank).len, rank < 2 ? 1360 : 1379);
}

TEST(Level1Share, TeamsOfOneAndLengthsBelowOneStayAtTheCallersPointer) {
  for (const QtbInt inc : {-3, -1, 0, 1, 2}) {
    for (const QtbInt n : {1, 2, 7, 8, 9, 1000}) ASSERT_EQ(level1_offset(level1_share(n, 1, 0), n, inc), 0);
    for (const QtbInt n : {0, -1, -5, -8, -100, -100000})
      for (QtbInt team = 1; team <= 40; ++team)
        for (QtbInt rank = 0; rank < team; ++rank) {
          ASSERT_LE(level1_share(n, team, rank).len, 0);
          ASSERT_EQ(level1_offset(level1_share(n, team, rank), n, inc), 0);
        }
  }
}

// The element that the published convention gives a place in memory: number i of n, from the vector's pointer.
QtbInt place(QtbInt i, QtbInt n, QtbInt inc) { return inc > 0 ? i * inc : (i - n + 1) * inc; }

TEST(Level1Share, PieceVisitsTheElementsOfTheWholeAtEitherSign) {
  for (const QtbInt inc : {-3, -2, -1, 1, 2, 3})
    for (const QtbInt team : {1, 2, 3, 5, 8, 33})
      for (const QtbInt n : lengths_around_chunks(team))
        for (QtbInt rank = 0; rank < team; ++rank) {
          const Level1Share share = level1_share(n, team, rank);
          if (share.len < 1) continue;
          const QtbInt offset = level1_offset(share, n, inc);
          for (const QtbInt i : {QtbInt{0}, share.len / 2, share.len - 1})
            ASSERT_EQ(offset + place(i, share.len, inc), place(share.start + i, n, inc))
                << "n " << n << " team " << team << " rank " << rank << " inc " << inc;
        }
}

// ---- Sums ----

// Values whose sum depends on its order: magnitudes over many binary orders, both signs.
template <class T>
T rough_value(std::mt19937_64 &random) {
  if constexpr (is_complex<T>) {
    const auto re = rough_value<Real<T>>(random);
    return {re, rough_value<Real<T>>(random)};
  } else {
    const double fraction = std::uniform_real_distribution<double>(-1, 1)(random);
    return static_cast<T>(std::ldexp(fraction, static_cast<int>(random() % 20)));
  }
}

template <class T>
bool same_bits(T a, T b) {
  return std::memcmp(&a, &b, sizeof(T)) == 0;
}

template <class T>
class Level1Sum : public testing::Test {};
using DotTypes = testing::Types<double, float, cfloat>;
TYPED_TEST_SUITE(Level1Sum, DotTypes);

TYPED_TEST(Level1Sum, EqualsTheModelForEveryTeamAndAddress) {
  using T = TypeParam;
  std::mt19937_64 random(1);
  alignas(16) unsigned char store[210 * sizeof(T)];
  long cases = 0;
  for (const std::size_t offset : {0U, 4U, 8U, 12U, 1U, 2U, 6U, 15U})
    for (int team = 2; team <= 200; ++team)
      for (int repeat = 0; repeat < 5; ++repeat, ++cases) {
        T *const partial = reinterpret_cast<T *>(store + offset);
        for (int i = 0; i < team; ++i) {
          const T value = rough_value<T>(random);
          std::memcpy(partial + i, &value, sizeof(T));
        }
        ASSERT_TRUE(same_bits(level1_sum(partial, team), qtb::test::model_sum(partial, team)))
            << "team " << team << " offset " << offset;
      }
  std::printf("sum: %zu-byte entries, %ld cases\n", sizeof(T), cases);
}

// The order by hand, on entries where each addition of another order loses something else.
TEST(Level1SumOrder, TwoLanesOfTwoAccumulatorsFromNineThreads) {
  alignas(16) double p[10];
  for (int i = 0; i < 10; ++i) p[i] = std::ldexp(1.0 + i / 16.0, i % 2 == 0 ? 53 - 3 * i : 2 * i);
  EXPECT_EQ(level1_sum(p, 8), ((((((p[0] + p[1]) + p[2]) + p[3]) + p[4]) + p[5]) + p[6]) + p[7]);
  const double lane0 = (p[0] + p[4]) + (p[2] + p[6]), lane1 = (p[1] + p[5]) + (p[3] + p[7]);
  EXPECT_EQ(level1_sum(p, 9), (lane0 + lane1) + p[8]);
  const double late0 = ((p[1] + p[2]) + p[6]) + (p[4] + p[8]), late1 = (p[3] + p[7]) + (p[5] + p[9]);
  alignas(16) double shifted[11];
  std::memcpy(shifted + 1, p + 1, 9 * sizeof(double));
  EXPECT_EQ(level1_sum(shifted + 1, 9), late0 + late1);
}

TEST(Level1SumOrder, FourLanesOfTwoAccumulatorsFromElevenThreads) {
  alignas(16) float p[12];
  for (int i = 0; i < 12; ++i) p[i] = std::ldexp(1.0F + static_cast<float>(i) / 16.0F, i % 2 == 0 ? 24 - 2 * i : i);
  float plain = 0;
  for (int i = 0; i < 10; ++i) plain += p[i];
  EXPECT_EQ(level1_sum(p, 10), plain);
  const float lane0 = p[0] + p[4], lane1 = p[1] + p[5], lane2 = p[2] + p[6], lane3 = p[3] + p[7];
  const float groups = (lane0 + lane2) + (lane1 + lane3);
  EXPECT_EQ(level1_sum(p, 11), ((groups + p[8]) + p[9]) + p[10]);
}

}  // namespace
