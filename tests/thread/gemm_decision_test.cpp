// What a parallel GEMM decides ahead of its region, by value: the machine class with the questions that it costs, the
// problems too small for threads, and whether threads pay, against a second transcription of the rules.

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstdio>
#include <limits>
#include <random>
#include <string>
#include <vector>

#include "blas/thread/32e/level3/gemm_class.h"
#include "blas/thread/32e/level3/gemm_decision.h"
#include "tests/thread/gemm_rules.h"

namespace {

using qtb::test::class_of;
using qtb::test::Int;
using qtb::test::Machine;
using qtb::test::too_small;
using qtb::test::Worth;
using qtb::test::worth;

// ---- The machine class ----

// A processor whose answers are given, and which notes what it is asked.
struct AskedProcessor {
  const Machine &machine;
  std::string &asked;
  bool has_sse41() { return asked += "sse41 ", machine.sse41; }
  bool is_amd_family16() { return asked += "family16 ", machine.family16; }
};

struct Classified {
  int machine_class;
  std::string asked;
};

Classified classify(const Machine &machine) {
  const std::uint32_t cache[cache_size_entries] = {machine.cache_count, 32768, machine.second_size, 1, 1};
  Classified found{-1, ""};
  found.machine_class =
      qtb::gemm_machine_class(static_cast<ProcessorTier>(machine.tier), cache, AskedProcessor{machine, found.asked});
  return found;
}

constexpr std::uint32_t small_l2 = 3145728;

TEST(GemmMachineClass, EachClassByHand) {
  const struct {
    Machine machine;
    int machine_class;
    const char *asked;
  } cases[] = {
      // tier, sse41, family16, levels, second level
      {{tier_def, true, false, 2, small_l2}, 0, "family16 "},
      {{tier_def, true, true, 2, small_l2}, 6, "family16 "},
      {{tier_sse3, true, true, 2, small_l2}, 0, ""},
      {{tier_ssse3, false, true, 2, small_l2}, 1, "sse41 "},
      {{tier_ssse3, false, true, 0, 0}, 1, "sse41 "},
      {{tier_ssse3, true, true, 2, small_l2 - 1}, 4, "sse41 "},
      {{tier_ssse3, true, true, 2, small_l2}, 4, "sse41 "},
      {{tier_ssse3, true, true, 2, small_l2 + 1}, 2, "sse41 "},
      {{tier_ssse3, true, true, 2, 4294967295u}, 2, "sse41 "},
      {{tier_ssse3, true, true, 1, 0}, 4, "sse41 "},  // one level only: the second has size 0
      {{tier_ssse3, true, true, 0, small_l2}, 2, "sse41 "},
      {{tier_ssse3, true, true, 0, 0}, 2, "sse41 "},
      {{tier_sse42, true, true, 2, small_l2}, 3, ""},
      {{tier_avx, true, true, 2, small_l2}, 5, ""},
      {{-1, true, true, 2, small_l2}, 0, ""},
      {{tier_count, true, true, 2, small_l2}, 0, ""},
      {{100, true, true, 2, small_l2}, 0, ""},
  };
  for (const auto &[machine, machine_class, asked] : cases) {
    const Classified found = classify(machine);
    EXPECT_EQ(found.machine_class, machine_class) << machine.tier << ' ' << machine.second_size;
    EXPECT_EQ(found.asked, asked) << machine.tier;
    EXPECT_EQ(class_of(machine), machine_class);
  }
}

TEST(GemmMachineClass, EveryMachineMatchesTheTranscription) {
  long count = 0;
  for (int tier = -2; tier <= 7; ++tier)
    for (const bool sse41 : {false, true})
      for (const bool family16 : {false, true})
        for (const std::uint32_t levels : {0u, 1u, 2u, 3u, 4u})
          for (const std::uint32_t second :
               {0u, 1u, small_l2 - 1, small_l2, small_l2 + 1, 0x7fffffffu, 0x80000000u, 0xffffffffu}) {
            const Machine machine{tier, sse41, family16, levels, second};
            const Classified found = classify(machine);
            ASSERT_EQ(found.machine_class, class_of(machine)) << tier << sse41 << family16 << levels << ' ' << second;
            ASSERT_EQ(found.asked, tier == tier_ssse3 ? "sse41 " : tier == tier_def ? "family16 " : "") << tier;
            ++count;
          }
  std::printf("machines %ld\n", count);
}

// ---- Too small for threads ----

TEST(GemmTiny, EachLimitByHand) {
  EXPECT_TRUE(qtb::gemm_is_tiny(5, 1000, 1000));  // two rows for one of two threads
  EXPECT_FALSE(qtb::gemm_is_tiny(6, 1000, 1000));
  EXPECT_TRUE(qtb::gemm_is_tiny(1000000, 1000000, 4));
  EXPECT_FALSE(qtb::gemm_is_tiny(1000000, 1000000, 5));
  EXPECT_TRUE(qtb::gemm_is_tiny(1000, 1000, 0));
  EXPECT_TRUE(qtb::gemm_is_tiny(1000, 1000, -1));
  EXPECT_TRUE(qtb::gemm_is_tiny(1000, 1000, std::numeric_limits<QtbInt>::min()));
  EXPECT_TRUE(qtb::gemm_is_tiny(16, 16, 16));
  EXPECT_FALSE(qtb::gemm_is_tiny(17, 16, 16));
  EXPECT_FALSE(qtb::gemm_is_tiny(16, 17, 16));
  EXPECT_FALSE(qtb::gemm_is_tiny(16, 16, 17));
  EXPECT_FALSE(qtb::gemm_is_tiny(6, 1, 17));
  EXPECT_TRUE(qtb::gemm_is_tiny(6, 1, 16));
}

TEST(GemmTiny, EverySmallProblemMatchesTheTranscription) {
  for (Int m = 1; m <= 40; ++m)
    for (Int n = 1; n <= 40; ++n)
      for (Int k = -3; k <= 40; ++k)
        ASSERT_EQ(qtb::gemm_is_tiny(m, n, k), too_small(m, n, k)) << m << ' ' << n << ' ' << k;
}

// ---- Whether threads pay ----

bool library_pays(char type, Int threads, Int m, Int n, Int k) {
  switch (type) {
    case 's': return qtb::gemm_threads_pay<float>(m, n, k, threads);
    case 'd': return qtb::gemm_threads_pay<double>(m, n, k, threads);
    case 'c': return qtb::gemm_threads_pay<cfloat>(m, n, k, threads);
    default: return qtb::gemm_threads_pay<cdouble>(m, n, k, threads);
  }
}

// Each line is a limit reached by a measure alone, with the other two below theirs.
TEST(GemmWorth, EachLimitByHand) {
  const struct {
    char type;
    Int threads, m, n, k;
    bool pays;
  } cases[] = {
      // Double: a pair of threads has n / h columns, h half the threads.
      {'d', 2, 1000, 1, 1000, false},  // one column is not enough, whatever the rest
      {'d', 2, 6, 2, 513, true},       // depth above 512
      {'d', 2, 6, 2, 512, false},
      {'d', 2, 16, 37, 64, true},  // 37*64*8 = 37*512: work above 36
      {'d', 2, 16, 37, 63, false},
      {'d', 2, 15, 37, 64, false},  // half of 15 is 7
      {'d', 2, 22, 2, 481, true},   // (11+481)*2 + 11*481 = 6275: traffic above 48
      {'d', 2, 22, 2, 480, false},
      {'d', 3, 16, 37, 64, true},  // three threads are one pair, as two are
      {'d', 3, 16, 37, 63, false},
      {'d', 64, 6, 64, 17, true},  // 32 pairs: depth above 16
      {'d', 64, 6, 64, 16, false},
      {'d', 64, 1000, 63, 1000, false},
      {'d', 7, 6, 6, 171, true},  // three pairs: 512/3 is 170
      {'d', 7, 6, 6, 170, false},
      {'d', 74, 6, 74, 29, true},  // 37 pairs: 36/37 is 0, 512/37 is 13
      {'d', 74, 6, 74, 13, false},
      // Single: the limits do not shrink, and nine rows are not enough.
      {'s', 2, 9, 1000, 1000, false},
      {'s', 2, 10, 1000, 1000, true},
      {'s', 2, 1000, 1, 1000, false},
      {'s', 2, 10, 2, 257, true},
      {'s', 2, 10, 2, 256, false},
      {'s', 64, 10, 64, 257, true},
      {'s', 64, 10, 64, 256, false},
      {'s', 64, 1000, 63, 1000, false},
      {'s', 2, 16, 19, 64, true},  // 19*64*8 = 19*512
      {'s', 2, 16, 19, 63, false},
      {'s', 2, 1598, 2, 6, true},  // (799+6)*2 + 799*6 = 6404, above 24 in units of 256
      {'s', 2, 1597, 2, 6, false},
      {'s', 64, 16, 19 * 32, 64, true},
      {'s', 64, 16, 19 * 32, 63, false},
      // Complex: no least number of rows or columns.
      {'c', 2, 6, 1, 257, true},
      {'c', 2, 6, 1, 256, false},
      {'c', 2, 56, 8, 28, true},  // 8*28*28 = 49*128
      {'c', 2, 56, 8, 27, false},
      {'c', 2, 192, 1, 64, true},  // (96+1)*64 + 96 = 6304, above 48 in units of 128
      {'c', 2, 191, 1, 64, false},
      {'c', 64, 6, 5, 9, true},  // no column for a pair: depth above 256/32 alone
      {'c', 64, 6, 5, 8, false},
      {'z', 2, 6, 1, 257, true},
      {'z', 2, 6, 1, 256, false},
      {'z', 2, 40, 8, 20, true},  // 8*20*20 = 25*128
      {'z', 2, 40, 8, 19, false},
      {'z', 2, 96, 1, 32, true},  // (48+1)*32 + 48 = 1616, above 24 in units of 64
      {'z', 2, 95, 1, 32, false},
      {'z', 64, 6, 5, 9, true},
      {'z', 64, 6, 5, 8, false},
  };
  for (const auto &[type, threads, m, n, k, pays] : cases) {
    EXPECT_EQ(library_pays(type, threads, m, n, k), pays) << type << ' ' << threads << ' ' << m << ' ' << n << ' ' << k;
    EXPECT_EQ(worth(type, threads, m, n, k).pays(), pays) << type << ' ' << threads << ' ' << m << ' ' << n << ' ' << k;
  }
}

// Points that a sweep met, by what decided them.
struct Deciders {
  long points = 0, no_room = 0, volume_alone = 0, surface_alone = 0, depth_alone = 0, none = 0;
  void note(const Worth &w) {
    ++points;
    no_room += !w.room && (w.volume || w.surface || w.depth);
    if (!w.room) return;
    volume_alone += w.volume && !w.surface && !w.depth;
    surface_alone += !w.volume && w.surface && !w.depth;
    depth_alone += !w.volume && !w.surface && w.depth;
    none += !w.pays();
  }
  void print(const char *sweep, char type) const {
    std::printf("%s %c: %ld points; no room %ld, none %ld; alone: work %ld, traffic %ld, depth %ld\n", sweep, type,
                points, no_room, none, volume_alone, surface_alone, depth_alone);
  }
};

class GemmWorthSweep : public testing::TestWithParam<char> {};
INSTANTIATE_TEST_SUITE_P(Types, GemmWorthSweep, testing::Values('s', 'd', 'c', 'z'),
                         [](const auto &type) { return std::string(1, type.param); });

// 5 to 40 one by one, then in steps that grow to 700, then sizes that only a few matrices have.
std::vector<Int> extents(Int least) {
  std::vector<Int> all;
  for (Int v = least; v <= 40; ++v) all.push_back(v);
  for (Int v = 41; v <= 700; v += 3 + v / 12) all.push_back(v);
  for (const Int v : {Int{1000}, Int{4097}, Int{65536}, Int{1000003}, Int{1} << 31, (Int{1} << 31) + 1})
    all.push_back(v);
  return all;
}

TEST_P(GemmWorthSweep, ExtentsForAllTeamsMatchTheTranscription) {
  const char type = GetParam();
  Deciders deciders;
  const std::vector<Int> ms = extents(6), ns = extents(1), ks = extents(5);
  for (Int threads = 2; threads <= 64; ++threads)
    for (const Int m : ms)
      for (const Int n : ns)
        for (const Int k : ks) {
          const Worth w = worth(type, threads, m, n, k);
          ASSERT_EQ(library_pays(type, threads, m, n, k), w.pays()) << threads << ' ' << m << ' ' << n << ' ' << k;
          deciders.note(w);
        }
  deciders.print("grid", type);
  EXPECT_GT(deciders.volume_alone, 0);
  EXPECT_GT(deciders.surface_alone, 0);
  EXPECT_GT(deciders.depth_alone, 0);
  EXPECT_GT(deciders.none, 0);
  const bool has_room_test = type == 's' || type == 'd';
  EXPECT_EQ(deciders.no_room > 0, has_room_test);
}

// For a team and two extents, the third at which threads begin to pay, and its neighbours: every measure grows with
// every extent, so that one search finds the place.
TEST_P(GemmWorthSweep, WhereThreadsBeginToPayMatchesTheTranscription) {
  const char type = GetParam();
  std::mt19937_64 bits(20240611);
  const auto below = [&](Int limit) { return static_cast<Int>(bits() % static_cast<std::uint64_t>(limit)); };
  Deciders deciders;
  for (int round = 0; round < 300000; ++round) {
    const Int threads = 2 + below(round % 50 == 0 ? 200 : 63);
    std::array<Int, 3> mnk = {6 + below(round % 2 ? 100 : 700), 1 + below(round % 3 ? 100 : 700), 5 + below(600)};
    Int &moved = mnk[static_cast<std::size_t>(round % 3)];
    const auto w = [&] { return worth(type, threads, mnk[0], mnk[1], mnk[2]); };
    Int low = 0, high = 1 << 20;  // never pays, may pay
    while (high - low > 1) {
      moved = (low + high) / 2;
      (w().pays() ? high : low) = moved;
    }
    for (const Int v : {high - 1, high, high + 1}) {
      moved = v;
      if (v < 1) continue;
      ASSERT_EQ(library_pays(type, threads, mnk[0], mnk[1], mnk[2]), w().pays())
          << threads << ' ' << mnk[0] << ' ' << mnk[1] << ' ' << mnk[2];
      deciders.note(w());
    }
  }
  deciders.print("edges", type);
  EXPECT_GT(deciders.volume_alone, 0);
  EXPECT_GT(deciders.surface_alone, 0);
  EXPECT_GT(deciders.depth_alone, 0);
}

}  // namespace
