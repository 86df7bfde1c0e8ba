// The number of threads of a Level-1 call, over the whole space of routines, tiers, thread counts, caches and lengths,
// against a second transcription of the rules; and that the questions are put in their order and only when they count.

#include "blas/thread/32e/level1/xf_l1_decision.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstdio>
#include <limits>
#include <map>
#include <optional>
#include <sstream>
#include <string>
#include <vector>

namespace {

constexpr std::uint32_t mebibyte = 1024 * 1024;

// ---- A process whose answers are given, and which notes what it is asked ----

enum Question : char { ask_tier = 't', ask_threads = 'n', ask_dynamic = 'd', ask_cache = 'c' };

struct Answers {
  ProcessorTier tier = tier_sse42;
  std::int32_t max_threads = 8;
  std::int32_t dynamic = 1;
  std::uint32_t cache[5] = {3, 32768, 256 * 1024, 8 * mebibyte, 0};
};

struct Asked {
  char questions[8] = {};
  int count = 0;
  void note(Question question) { questions[count++] = question; }
  std::string text() const { return std::string(questions, static_cast<std::size_t>(count)); }
};

struct FakeProcess {
  const Answers &answers;
  Asked &asked;
  ProcessorTier tier() { return asked.note(ask_tier), answers.tier; }
  QtbInt max_threads() { return asked.note(ask_threads), answers.max_threads; }
  bool dynamic() { return asked.note(ask_dynamic), answers.dynamic == 1; }
  void cache_sizes(std::uint32_t *table) {
    asked.note(ask_cache);
    std::copy(std::begin(answers.cache), std::end(answers.cache), table);
  }
};

struct Outcome {
  QtbInt threads;
  Asked asked;
};

// The library's decision for a routine by name.
struct Routine {
  const char *name;
  Outcome (*decide)(QtbInt n, QtbInt incx, QtbInt incy, const Answers &answers);
};

#define QTB_DECIDE(routine)                                                                                    \
  {#routine, [](QtbInt n, QtbInt incx, QtbInt incy, const Answers &answers) {                                  \
     Outcome outcome{0, {}};                                                                                   \
     outcome.threads =                                                                                         \
         qtb::level1_threads(qtb::level1_limits::routine, n, incx, incy, FakeProcess{answers, outcome.asked}); \
     return outcome;                                                                                           \
   }},
const Routine routines[] = {
#define QTB_LEVEL1_SIZED(name, shape, T, ...) QTB_DECIDE(name)
#define QTB_LEVEL1_PAIR(name, shape, T, min_n) QTB_DECIDE(name)
#include "blas/thread/32e/level1/xf_l1.def"
#undef QTB_LEVEL1_SIZED
#undef QTB_LEVEL1_PAIR
};

const Routine &routine(const std::string &name) {
  return *std::find_if(std::begin(routines), std::end(routines), [&](const Routine &r) { return r.name == name; });
}

QtbInt threads(const std::string &name, QtbInt n, const Answers &answers, QtbInt incx = 1, QtbInt incy = 1) {
  return routine(name).decide(n, incx, incy, answers).threads;
}

std::string questions(const std::string &name, QtbInt n, const Answers &answers, QtbInt incx = 1, QtbInt incy = 1) {
  return routine(name).decide(n, incx, incy, answers).asked.text();
}

Answers on_sse42(std::int32_t max_threads, std::int32_t dynamic = 1) {
  Answers answers;
  answers.max_threads = max_threads;
  answers.dynamic = dynamic;
  return answers;
}

Answers on_ssse3(std::int32_t max_threads, std::uint32_t second_level, std::uint32_t levels = 2) {
  Answers answers;
  answers.tier = tier_ssse3;
  answers.max_threads = max_threads;
  answers.cache[0] = levels;
  answers.cache[2] = second_level;
  return answers;
}

// ---- The second transcription: rules over a table in text, "-" for a rule that is absent ----

constexpr char rule_table[] = R"(
  routine  min_n  min_n_ssse3  sse42_cap_n  sse42_two_n  wide_n  cap16_n  two_n  low_n  mid_n
  caxpy    2001   3001         20000        3000         20000   40000    3000   5000   15000
  ccopy    2501   3001         20000        -            25000   -        3000   4000   8000
  cdotc    2001   3001         20000        2500         25000   40000    4000   4000   15000
  cswap    2001   3001         15000        -            15000   25000    3000   4000   10000
  daxpy    2001   2501         15000        4000         25000   35000    3000   2900   15000
  dcopy    2001   3001         20000        2500         25000   30000    3000   4000   10000
  ddot     2501   -            20000        -            15000   40000    3000   5000   10000
  drot     1001   2001         10000        -            20000   -        2500   2000   15000
  dswap    2001   2501         15000        2500         25000   30000    2500   4000   10000
  saxpy    4001   4901         25000        6000         30000   55000    5000   6000   18000
  scopy    5001   6001         45000        -            55000   -        6000   8000   20000
  sdot     5001   -            30000        -            35000   60000    6000   8000   20000
  srot     2001   5001         20000        -            35000   40000    4000   8000   30000
  sswap    5001   -            20000        -            30000   55000    -      8000   20000
  zaxpy    2001
  zcopy    1601
  zswap    1601
)";

struct Rules {
  std::optional<QtbInt> min_n, min_n_ssse3, sse42_cap_n, sse42_two_n, wide_n, cap16_n, two_n, low_n, mid_n;
  bool pair = false;

  std::vector<QtbInt> lengths() const {
    std::vector<QtbInt> found;
    for (const auto &limit : {min_n, min_n_ssse3, sse42_cap_n, sse42_two_n, wide_n, cap16_n, two_n, low_n, mid_n})
      if (limit) found.push_back(*limit);
    return found;
  }
};

std::map<std::string, Rules> read_rules() {
  std::map<std::string, Rules> rules;
  std::istringstream text(rule_table);
  std::string line;
  while (std::getline(text, line)) {
    std::istringstream words(line);
    std::string name, word;
    if (!(words >> name) || name == "routine") continue;
    std::vector<std::optional<QtbInt>> cells;
    while (words >> word) cells.push_back(word == "-" ? std::nullopt : std::optional<QtbInt>(std::stoll(word)));
    Rules row;
    row.pair = cells.size() == 1;
    cells.resize(9);
    row.min_n = cells[0], row.min_n_ssse3 = cells[1], row.sse42_cap_n = cells[2], row.sse42_two_n = cells[3];
    row.wide_n = cells[4], row.cap16_n = cells[5], row.two_n = cells[6], row.low_n = cells[7], row.mid_n = cells[8];
    rules[name] = row;
  }
  return rules;
}

Outcome transcription(const Rules &rules, QtbInt n, QtbInt incx, QtbInt incy, const Answers &answers) {
  Outcome outcome{1, {}};
  const auto below = [n](const std::optional<QtbInt> &limit) { return limit.has_value() && n < limit.value(); };
  const auto ask = [&](Question question) { outcome.asked.note(question); };
  const auto serial = [&] { return outcome; };
  const auto driver = [&](QtbInt nt) { return outcome.threads = nt, outcome; };

  if (below(rules.min_n)) return serial();
  ask(ask_tier);
  switch (answers.tier) {
    case tier_def:
    case tier_sse3:
    case tier_avx: return serial();
    case tier_ssse3:
      if (below(rules.min_n_ssse3)) return serial();
      break;
    default: break;
  }
  if (incx * incy == 0) return serial();
  ask(ask_threads);
  QtbInt nt = answers.max_threads;
  if (nt <= 1) return serial();
  ask(ask_dynamic);
  const bool dynamic = answers.dynamic == 1;
  if (rules.pair) return dynamic ? driver(2) : serial();
  if (!dynamic) return driver(nt);

  if (answers.tier == tier_sse42) {
    const bool capped = below(rules.sse42_cap_n) && nt > 4;
    if (capped) {
      nt = rules.sse42_two_n ? 4 : std::min<QtbInt>(nt, 4);
    } else if (nt == 2 && below(rules.sse42_two_n)) {
      return serial();
    }
    return driver(nt);
  }

  ask(ask_cache);
  const long long second = answers.cache[2] >= 0x80000000U ? static_cast<long long>(answers.cache[2]) - 0x100000000LL
                                                           : static_cast<long long>(answers.cache[2]);
  if (answers.cache[0] != 0 && second <= 3145728) {
    if (!below(rules.wide_n)) {
      if (nt > 16 && below(rules.cap16_n)) nt = 16;
    } else if (nt > 4) {
      return driver(4);
    }
    if (nt == 2 && below(rules.two_n)) return serial();
  } else if (below(rules.low_n)) {
    if (nt >= 3) nt = 2;
  } else if (below(rules.mid_n)) {
    if (nt > 4) nt = 4;
  }
  return driver(nt);
}

// ---- The whole space ----

TEST(Level1Decision, EqualsTheTranscriptionEverywhere) {
  const auto rules = read_rules();
  ASSERT_EQ(rules.size(), std::size(routines));

  std::vector<std::array<std::uint32_t, 2>> caches;  // levels, bytes of the second
  for (const std::uint32_t levels : {0U, 1U, 3U, 0x80000000U})
    for (const std::uint32_t bytes : {0U, 262144U, 3145727U, 3145728U, 3145729U, 4194304U, 0x7fffffffU, 0x80000000U})
      caches.push_back({levels, bytes});

  std::map<int, long> cases;
  for (const Routine &r : routines) {
    const Rules &rule = rules.at(r.name);
    std::vector<QtbInt> lengths = {std::numeric_limits<QtbInt>::min(), -1, 0, 1, 1000000,
                                   std::numeric_limits<QtbInt>::max()};
    for (const QtbInt limit : rule.lengths())
      for (const QtbInt n : {limit - 1, limit, limit + 1}) lengths.push_back(n);
    std::sort(lengths.begin(), lengths.end());
    lengths.erase(std::unique(lengths.begin(), lengths.end()), lengths.end());

    for (int tier = 0; tier < tier_count; ++tier)
      for (std::int32_t count = -1; count <= 200; ++count)
        for (const std::int32_t dynamic : {-1, 0, 1, 2})
          for (const auto &cache : caches) {
            if (tier != tier_ssse3 && &cache != &caches.front()) break;
            Answers answers;
            answers.tier = static_cast<ProcessorTier>(tier);
            answers.max_threads = count;
            answers.dynamic = dynamic;
            answers.cache[0] = cache[0];
            answers.cache[2] = cache[1];
            for (const QtbInt n : lengths)
              for (const auto &[incx, incy] : {std::pair<QtbInt, QtbInt>{1, 1}, {-3, 2}, {0, 1}, {1, 0}, {0, 0}}) {
                const Outcome got = r.decide(n, incx, incy, answers);
                const Outcome want = transcription(rule, n, incx, incy, answers);
                ++cases[tier];
                if (got.threads != want.threads || got.asked.text() != want.asked.text())
                  FAIL() << r.name << " tier " << tier << " n " << n << " incx " << incx << " incy " << incy
                         << " threads " << count << " dynamic " << dynamic << " levels " << cache[0] << " second "
                         << cache[1] << ": got " << got.threads << " asking '" << got.asked.text() << "', want "
                         << want.threads << " asking '" << want.asked.text() << "'";
              }
          }
  }
  for (const auto &[tier, count] : cases) std::printf("decision: tier %d, %ld cases\n", tier, count);
}

// ---- What the rules come to, case by case ----

TEST(Level1Decision, SeventeenRoutinesHaveAParallelPath) { EXPECT_EQ(std::size(routines), 17U); }

TEST(Level1Decision, ShortVectorAsksNothing) {
  EXPECT_EQ(questions("daxpy", 2000, on_sse42(8)), "");
  EXPECT_EQ(questions("daxpy", 2001, on_sse42(8)), "tnd");
  EXPECT_EQ(questions("zcopy", 1600, on_sse42(8)), "");
  EXPECT_EQ(questions("zcopy", 1601, on_sse42(8)), "tnd");
}

TEST(Level1Decision, OnlyTierSsse3AsksForTheCache) {
  EXPECT_EQ(questions("daxpy", 100000, on_ssse3(8, mebibyte)), "tndc");
  EXPECT_EQ(questions("daxpy", 100000, on_sse42(8)), "tnd");
  EXPECT_EQ(questions("zaxpy", 100000, on_ssse3(8, mebibyte)), "tnd");
}

TEST(Level1Decision, SecondThresholdOfSsse3ComesBeforeTheThreadCount) {
  EXPECT_EQ(questions("daxpy", 2500, on_ssse3(8, mebibyte)), "t");
  EXPECT_EQ(questions("daxpy", 2501, on_ssse3(8, mebibyte)), "tndc");
  EXPECT_EQ(questions("ddot", 2501, on_ssse3(8, mebibyte)), "tndc");
}

TEST(Level1Decision, OneThreadEndsTheQuestions) {
  EXPECT_EQ(questions("daxpy", 100000, on_ssse3(1, mebibyte)), "tn");
  EXPECT_EQ(threads("daxpy", 100000, on_ssse3(1, mebibyte)), 1);
}

TEST(Level1Decision, DynamicModeOffSkipsTheTables) {
  EXPECT_EQ(threads("daxpy", 10000, on_sse42(8)), 4);
  EXPECT_EQ(threads("daxpy", 10000, on_sse42(8, 0)), 8);
  Answers answers = on_ssse3(8, mebibyte);
  answers.dynamic = 0;
  EXPECT_EQ(questions("daxpy", 10000, answers), "tnd");
  EXPECT_EQ(threads("daxpy", 10000, answers), 8);
}

TEST(Level1Decision, TwoThreadsDoNotPayBelowTheirLimitButThreeDo) {
  EXPECT_EQ(threads("daxpy", 3000, on_sse42(2)), 1);
  EXPECT_EQ(threads("daxpy", 3000, on_sse42(3)), 3);
  EXPECT_EQ(threads("daxpy", 4000, on_sse42(2)), 2);
}

TEST(Level1Decision, LargeSecondLevelCacheTakesTwoThreadsBelowLow) {
  EXPECT_EQ(threads("daxpy", 2600, on_ssse3(8, 4 * mebibyte)), 2);
  EXPECT_EQ(threads("daxpy", 2900, on_ssse3(8, 4 * mebibyte)), 4);
  EXPECT_EQ(threads("daxpy", 15000, on_ssse3(8, 4 * mebibyte)), 8);
}

TEST(Level1Decision, SmallSecondLevelCacheTakesSixteenThreadsBelowItsCap) {
  EXPECT_EQ(threads("daxpy", 30000, on_ssse3(32, 2 * mebibyte)), 16);
  EXPECT_EQ(threads("daxpy", 35000, on_ssse3(32, 2 * mebibyte)), 32);
}

TEST(Level1Decision, SecondLevelOfThreeMebibytesIsSmallAndOneByteMoreIsNot) {
  EXPECT_EQ(threads("daxpy", 2600, on_ssse3(8, 3145728)), 4);
  EXPECT_EQ(threads("daxpy", 2600, on_ssse3(8, 3145729)), 2);
}

TEST(Level1Decision, TableOfNoLevelsIsNotASmallCache) {
  EXPECT_EQ(threads("daxpy", 2600, on_ssse3(8, mebibyte, 0)), 2);
  EXPECT_EQ(threads("daxpy", 2600, on_ssse3(8, mebibyte, 1)), 4);
}

TEST(Level1Decision, CacheSizesCompareAsSignedNumbers) {
  EXPECT_EQ(threads("daxpy", 2600, on_ssse3(8, 0x80000000U)), 4);
}

TEST(Level1Decision, SomeCopiesAndRotationsHaveNoCapAtSixteen) {
  for (const char *name : {"ccopy", "scopy", "drot"})
    EXPECT_EQ(threads(name, 56000, on_ssse3(32, mebibyte)), 32) << name;
  EXPECT_EQ(threads("dcopy", 29999, on_ssse3(32, mebibyte)), 16);
}

TEST(Level1Decision, PairRoutinesTakeTwoThreadsAndOneWithDynamicModeOff) {
  for (const QtbInt n : {QtbInt{2001}, QtbInt{50000}, QtbInt{100000000}})
    for (const std::int32_t count : {2, 3, 64}) {
      EXPECT_EQ(threads("zaxpy", n, on_sse42(count)), 2);
      EXPECT_EQ(threads("zaxpy", n, on_ssse3(count, mebibyte)), 2);
      EXPECT_EQ(threads("zaxpy", n, on_sse42(count, 0)), 1);
    }
}

TEST(Level1Decision, OtherTiersNeverTakeThreads) {
  for (const Routine &r : routines)
    for (const ProcessorTier tier : {tier_def, tier_sse3, tier_avx})
      for (const std::int32_t dynamic : {0, 1}) {
        Answers answers = on_sse42(64, dynamic);
        answers.tier = tier;
        EXPECT_EQ(threads(r.name, 10000000, answers), 1) << r.name;
        EXPECT_EQ(questions(r.name, 10000000, answers), "t") << r.name;
      }
}

TEST(Level1Decision, ZeroIncrementIsSerialAtAnyLength) {
  for (const Routine &r : routines)
    for (const ProcessorTier tier : {tier_ssse3, tier_sse42}) {
      Answers answers = on_sse42(64);
      answers.tier = tier;
      EXPECT_EQ(threads(r.name, 10000000, answers, 0, 1), 1) << r.name;
      EXPECT_EQ(threads(r.name, 10000000, answers, 1, 0), 1) << r.name;
      EXPECT_EQ(questions(r.name, 10000000, answers, 1, 0), "t") << r.name;
      EXPECT_GT(threads(r.name, 10000000, answers, -1, 1), 1) << r.name;
    }
}

}  // namespace
