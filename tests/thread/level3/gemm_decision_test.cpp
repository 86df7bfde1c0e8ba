// What a parallel GEMM decides ahead of its region, by value: the machine class, the problems too small for threads,
// and whether threads pay, against a second transcription of the rules; and the questions that each decision costs.

#include "blas/thread/32e/level3/gemm_decision.h"

#include <gtest/gtest.h>

#include <array>
#include <limits>
#include <random>
#include <vector>

#include "tests/thread/asked_process.h"
#include "tests/thread/level3/gemm_rules.h"

namespace qtb::test {
namespace {

constexpr char types[] = {'s', 'd', 'c', 'z'};

GemmDecision decide(char type, Int m, Int n, Int k, const Answers &answers, std::string *asked) {
  const AskedProcess process{answers, *asked};
  switch (type) {
    case 's': return gemm_decision<float>(m, n, k, AskedProcess(process));
    case 'd': return gemm_decision<double>(m, n, k, AskedProcess(process));
    case 'c': return gemm_decision<cfloat>(m, n, k, AskedProcess(process));
    default: return gemm_decision<cdouble>(m, n, k, AskedProcess(process));
  }
}

// ---- The whole decision ----

// On every machine, for every number of threads, in and out of a region: the class, the road, and the questions in
// their order. The product is one for which threads pay, or do not.
static_assert(tier_count == 5,
              "tests/thread/level3/gemm_rules.h: write the machine class of the new tier into class_of");

TEST(GemmDecision, EveryMachineMatchesTheTranscriptionAndAsksInOrder) {
  constexpr std::uint32_t small_l2 = 3145728;
  for (int tier = -2; tier <= 7; ++tier)
    for (int bits = 0; bits < 8; ++bits)
      for (const std::uint32_t levels : {0u, 1u, 2u, 4u})
        for (const std::uint32_t second :
             {0u, small_l2 - 1, small_l2, small_l2 + 1, 0x7fffffffu, 0x80000000u, 0xffffffffu})
          for (const std::int32_t threads : {-1, 0, 1, 2, 3, 64})
            for (const char type : types)
              for (const Int size : {10, 300}) {
                Answers answers{static_cast<ProcessorTier>(tier), threads, 1, {levels, 32768, second, 1, 2}};
                answers.sse41 = (bits & 1) != 0, answers.family16 = (bits & 2) != 0;
                answers.in_parallel = (bits & 4) != 0;
                std::string asked;
                const GemmDecision got = decide(type, size, size, 17, answers, &asked);
                const int machine = class_of(tier, answers.sse41, answers.family16, levels, second);
                SCOPED_TRACE(testing::Message() << type << size << " tier " << tier << " bits " << bits << " levels "
                                                << levels << " second " << second << " threads " << threads);
                ASSERT_EQ(got.machine_class, machine);
                ASSERT_EQ(got.threads, threads);
                ASSERT_TRUE(std::equal(std::begin(got.cache), std::end(got.cache), answers.cache));
                const bool slices = threads < 2 && machine == 4 && !is_complex_type(type);
                ASSERT_EQ(asked, std::string("ntc") + (tier == 2 ? "4" : tier == 0 ? "f" : "") + (slices ? "p" : ""));
                const bool tuned = machine >= 1 && machine <= 4;
                GemmRoad road = slices && answers.in_parallel ? gemm_in_slices : gemm_serial;
                if (threads > 1 && (!tuned || worth(type, threads, size, size, 17).pays())) road = gemm_parallel;
                ASSERT_EQ(got.road, road);
                if (threads > 1) {
                  ASSERT_EQ(got.tuned, tuned);
                }
              }
}

// ---- Too small for threads ----

TEST(GemmTiny, EverySmallProblemMatchesTheTranscription) {
  for (Int m = 1; m <= 40; ++m)
    for (Int n = 1; n <= 40; ++n)
      for (Int k = -3; k <= 40; ++k) ASSERT_EQ(gemm_is_tiny(m, n, k), too_small(m, n, k)) << m << ' ' << n << ' ' << k;
  EXPECT_TRUE(gemm_is_tiny(5, 1000, 1000));  // two rows for one of two threads
  EXPECT_FALSE(gemm_is_tiny(6, 1000, 1000));
  EXPECT_TRUE(gemm_is_tiny(1000000, 1000000, 4));
  EXPECT_TRUE(gemm_is_tiny(1000, 1000, std::numeric_limits<QtbInt>::min()));
}

// ---- Whether threads pay ----

bool library_pays(char type, Int threads, Int m, Int n, Int k) {
  switch (type) {
    case 's': return gemm_threads_pay<float>(m, n, k, threads);
    case 'd': return gemm_threads_pay<double>(m, n, k, threads);
    case 'c': return gemm_threads_pay<cfloat>(m, n, k, threads);
    default: return gemm_threads_pay<cdouble>(m, n, k, threads);
  }
}

// Each line is a measure that reaches its limit alone, at an extent, and does not below it.
TEST(GemmWorth, EachLimitByHand) {
  const struct {
    char type;
    Int threads, m, n, k;
    char moved;  // the extent that is one less in the problem that does not pay
  } cases[] = {
      {'d', 2, 6, 2, 513, 'k'},                                     // depth above 512
      {'d', 2, 16, 37, 64, 'k'},                                    // 37*64*8 = 37*512: work above 36
      {'d', 2, 16, 37, 64, 'm'},                                    // half of 15 is 7
      {'d', 2, 22, 2, 481, 'k'},                                    // (11+481)*2 + 11*481 = 6275: traffic above 48
      {'d', 2, 1000, 2, 600, 'n'},                                  // one column is not enough, whatever the rest
      {'d', 3, 16, 37, 64, 'k'},                                    // three threads are one pair, as two are
      {'d', 64, 6, 64, 17, 'k'},                                    // 32 pairs: depth above 16
      {'d', 64, 1000, 64, 1000, 'n'}, {'d', 7, 6, 6, 171, 'k'},     // three pairs: 512/3 is 170
      {'d', 74, 6, 74, 14, 'k'},                                    // 37 pairs: 36/37 is 0, 512/37 is 13
      {'s', 2, 10, 1000, 1000, 'm'},                                // nine rows are not enough
      {'s', 2, 10, 2, 257, 'k'},      {'s', 64, 10, 64, 257, 'k'},  // the limits do not shrink
      {'s', 2, 16, 19, 64, 'k'},                                    // 19*64*8 = 19*512
      {'s', 2, 1598, 2, 6, 'm'},  // (799+6)*2 + 799*6 = 6404, above 24 in units of 256
      {'c', 2, 6, 1, 257, 'k'},   // no least number of columns
      {'c', 2, 56, 8, 28, 'k'},   // 8*28*28 = 49*128
      {'c', 2, 192, 1, 64, 'm'},  // (96+1)*64 + 96 = 6304, above 48 in units of 128
      {'c', 64, 6, 5, 9, 'k'},    // no column for a pair: depth above 256/32 alone
      {'z', 2, 40, 8, 20, 'k'},   // 8*20*20 = 25*128
      {'z', 2, 96, 1, 32, 'm'},   // (48+1)*32 + 48 = 1616, above 24 in units of 64
      {'z', 64, 6, 5, 9, 'k'},
  };
  for (const auto &[type, threads, m, n, k, moved] : cases) {
    SCOPED_TRACE(testing::Message() << type << ' ' << threads << ' ' << m << ' ' << n << ' ' << k << moved);
    EXPECT_TRUE(library_pays(type, threads, m, n, k));
    EXPECT_FALSE(library_pays(type, threads, m - (moved == 'm'), n - (moved == 'n'), k - (moved == 'k')));
  }
}

// 5 to 40 one by one, then in steps that grow to 700, then sizes that only a few matrices have.
std::vector<Int> extents(Int least) {
  std::vector<Int> all;
  for (Int v = least; v <= 40; ++v) all.push_back(v);
  for (Int v = 41; v <= 700; v += 3 + v / 12) all.push_back(v);
  for (const Int v : {Int{1000}, Int{4097}, Int{65536}, Int{1000003}, Int{1} << 31, (Int{1} << 31) + 1})
    all.push_back(v);
  return all;
}

class GemmWorthSweep : public testing::TestWithParam<char> {
 protected:
  // Points by what decided them.
  long no_room = 0, none = 0, work_alone = 0, traffic_alone = 0, depth_alone = 0;

  void compare(Int threads, Int m, Int n, Int k) {
    const Worth w = worth(GetParam(), threads, m, n, k);
    ASSERT_EQ(library_pays(GetParam(), threads, m, n, k), w.pays()) << threads << ' ' << m << ' ' << n << ' ' << k;
    no_room += !w.room && (w.volume || w.surface || w.depth);
    none += w.room && !w.pays();
    work_alone += w.room && w.volume && !w.surface && !w.depth;
    traffic_alone += w.room && !w.volume && w.surface && !w.depth;
    depth_alone += w.room && !w.volume && !w.surface && w.depth;
  }
};
INSTANTIATE_TEST_SUITE_P(Types, GemmWorthSweep, testing::ValuesIn(types),
                         [](const auto &type) { return std::string(1, type.param); });

// All extents, and for random teams and two extents the third at which threads begin to pay, and its neighbours: every
// measure grows with every extent, so that one search finds the place.
TEST_P(GemmWorthSweep, AllTeamsMatchTheTranscription) {
  const std::vector<Int> ms = extents(6), ns = extents(1), ks = extents(5);
  for (const Int threads : {2, 3, 4, 5, 6, 7, 8, 9, 10, 12, 15, 16, 17, 24, 25, 31, 32, 33, 48, 63, 64})
    for (const Int m : ms)
      for (const Int n : ns)
        for (const Int k : ks) ASSERT_NO_FATAL_FAILURE(compare(threads, m, n, k));
  std::mt19937_64 bits(20240611);
  const auto below = [&](Int limit) { return static_cast<Int>(bits() % static_cast<std::uint64_t>(limit)); };
  for (int round = 0; round < 100000; ++round) {
    const Int threads = 2 + below(round % 50 == 0 ? 200 : 63);
    std::array<Int, 3> mnk = {6 + below(round % 2 ? 100 : 700), 1 + below(round % 3 ? 100 : 700), 5 + below(600)};
    Int &moved = mnk[static_cast<std::size_t>(round % 3)];
    Int low = 0, high = 1 << 20;  // never pays, may pay
    while (high - low > 1) {
      moved = (low + high) / 2;
      (worth(GetParam(), threads, mnk[0], mnk[1], mnk[2]).pays() ? high : low) = moved;
    }
    for (const Int v : {high - 1, high, high + 1}) {
      moved = v;
      if (v < 1) continue;
      ASSERT_NO_FATAL_FAILURE(compare(threads, mnk[0], mnk[1], mnk[2]));
    }
  }
  for (const long count : {none, work_alone, traffic_alone, depth_alone}) EXPECT_GT(count, 0);
  EXPECT_EQ(no_room > 0, !is_complex_type(GetParam()));
}

}  // namespace
}  // namespace qtb::test
