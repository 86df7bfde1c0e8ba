// The number of threads of a Level-1 call, over the whole space of routines, tiers, thread counts, caches and lengths,
// against a second transcription of the rules; and that the questions are put in their order and only when they count.

#include "blas/thread/32e/level1/xf_l1_decision.h"

#include <gtest/gtest.h>

#include <array>
#include <limits>
#include <map>
#include <optional>
#include <set>
#include <sstream>
#include <vector>

#include "tests/thread/asked_process.h"

namespace qtb::test {
namespace {

struct Outcome {
  QtbInt threads = level1_serial;
  std::string asked = {};
  bool operator==(const Outcome &) const = default;
};
std::ostream &operator<<(std::ostream &out, const Outcome &o) {
  return out << o.threads << " asking '" << o.asked << "'";
}

// The library's decision for a routine by name.
using Decide = Outcome (*)(QtbInt n, QtbInt incx, QtbInt incy, const Answers &answers);
#define QTB_DECIDE(routine)                                                                                         \
  {#routine, [](QtbInt n, QtbInt incx, QtbInt incy, const Answers &answers) {                                       \
     Outcome outcome;                                                                                               \
     outcome.threads = level1_threads(level1_limits::routine, n, incx, incy, AskedProcess{answers, outcome.asked}); \
     return outcome;                                                                                                \
   }},
const std::map<std::string, Decide> routines = {
#define QTB_LEVEL1_SIZED(name, shape, T, ...) QTB_DECIDE(name)
#define QTB_LEVEL1_PAIR(name, shape, T, min_n) QTB_DECIDE(name)
#include "blas/thread/32e/level1/xf_l1.def"
#undef QTB_LEVEL1_SIZED
#undef QTB_LEVEL1_PAIR
};

// ---- The second transcription: rules over a table in text, "-" for a rule that is absent ----

constexpr char rule_table[] = R"(
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
enum Column { min_n, min_n_ssse3, sse42_cap_n, sse42_two_n, wide_n, cap16_n, two_n, low_n, mid_n, column_count };
using Rules = std::vector<std::optional<QtbInt>>;  // by column; one alone for a routine that takes a pair of threads

std::map<std::string, Rules> read_rules() {
  std::map<std::string, Rules> rules;
  std::istringstream text(rule_table);
  for (std::string line; std::getline(text, line);) {
    std::istringstream words(line);
    std::string name, word;
    if (!(words >> name)) continue;
    while (words >> word) rules[name].push_back(word == "-" ? std::nullopt : std::optional<QtbInt>(std::stoll(word)));
  }
  return rules;
}

static_assert(tier_count == 5,
              "tests/thread/level1/decision_test.cpp: say in the transcription how calls of the new tier take threads, "
              "and list it in front_ends_test.cpp beside it");
Outcome transcription(const Rules &rules, QtbInt n, QtbInt incx, QtbInt incy, const Answers &answers) {
  const auto below = [&](Column column) { return rules[column].has_value() && n < *rules[column]; };
  if (below(min_n)) return {};
  const bool sse42 = answers.tier == tier_sse42;
  if (!sse42 && answers.tier != tier_ssse3) return {1, "t"};
  const bool pair = rules.size() == 1;
  if ((!sse42 && !pair && below(min_n_ssse3)) || incx * incy == 0) return {1, "t"};
  const QtbInt nt = answers.max_threads;
  if (nt <= 1) return {1, "tn"};
  const bool dynamic = answers.dynamic == 1;
  if (pair) return {dynamic ? 2 : 1, "tnd"};
  if (!dynamic) return {nt, "tnd"};
  if (sse42) return {below(sse42_cap_n) && nt > 4 ? 4 : nt == 2 && below(sse42_two_n) ? 1 : nt, "tnd"};
  const long long second = static_cast<std::int32_t>(answers.cache[2]);
  if (answers.cache[0] == 0 || second > 3145728)
    return {below(low_n) ? std::min<QtbInt>(nt, 2) : below(mid_n) ? std::min<QtbInt>(nt, 4) : nt, "tndc"};
  if (below(wide_n) && nt > 4) return {4, "tndc"};
  if (!below(wide_n) && nt > 16 && below(cap16_n)) return {16, "tndc"};
  return {nt == 2 && below(two_n) ? 1 : nt, "tndc"};
}

// ---- The whole space ----

TEST(Level1Decision, EqualsTheTranscriptionEverywhere) {
  const auto rules = read_rules();
  ASSERT_EQ(rules.size(), 17U);
  ASSERT_EQ(routines.size(), 17U);
  std::vector<std::array<std::uint32_t, 2>> caches;  // levels, bytes of the second
  for (const std::uint32_t levels : {0U, 1U, 3U, 0x80000000U})
    for (const std::uint32_t bytes : {0U, 262144U, 3145727U, 3145728U, 3145729U, 4194304U, 0x7fffffffU, 0x80000000U})
      caches.push_back({levels, bytes});
  for (const auto &[name, decide] : routines) {
    const Rules &rule = rules.at(name);
    std::set<QtbInt> lengths = {std::numeric_limits<QtbInt>::min(), -1, 0, 1, 1000000,
                                std::numeric_limits<QtbInt>::max()};
    for (const std::optional<QtbInt> &limit : rule)
      if (limit) lengths.insert({*limit - 1, *limit, *limit + 1});
    for (int tier = 0; tier < tier_count; ++tier)
      for (std::int32_t count = -1; count <= 200; ++count)
        for (const std::int32_t dynamic : {-1, 0, 1, 2})
          for (const auto &[levels, second] : caches) {
            Answers answers;
            answers.tier = static_cast<ProcessorTier>(tier);
            answers.max_threads = count;
            answers.dynamic = dynamic;
            answers.cache[0] = levels;
            answers.cache[2] = second;
            for (const QtbInt n : lengths)
              for (const auto &[incx, incy] : {std::pair<QtbInt, QtbInt>{1, 1}, {-3, 2}, {0, 1}, {1, 0}, {0, 0}})
                ASSERT_EQ(decide(n, incx, incy, answers), transcription(rule, n, incx, incy, answers))
                    << name << " tier " << tier << " n " << n << " incx " << incx << " incy " << incy << " threads "
                    << count << " dynamic " << dynamic << " levels " << levels << " second " << second;
            if (tier != tier_ssse3) break;
          }
  }
}

// ---- What the rules come to, case by case ----

TEST(Level1Decision, EachRuleByHand) {
  constexpr std::uint32_t mebibyte = 1024 * 1024;
  const struct {
    const char *routine;
    QtbInt n;
    ProcessorTier tier;
    std::int32_t max_threads, dynamic;
    std::uint32_t levels, second;
    Outcome want;
  } cases[] = {
      {"daxpy", 2000, tier_sse42, 8, 1, 3, 262144, {1, ""}},  // a short vector asks nothing
      {"daxpy", 2001, tier_sse42, 8, 1, 3, 262144, {4, "tnd"}},
      {"zcopy", 1600, tier_sse42, 8, 1, 3, 262144, {1, ""}},
      {"zcopy", 1601, tier_sse42, 8, 1, 3, 262144, {2, "tnd"}},
      {"daxpy", 10000, tier_sse42, 8, 1, 3, 262144, {4, "tnd"}},
      {"daxpy", 10000, tier_sse42, 8, 0, 3, 262144, {8, "tnd"}},  // dynamic mode off skips the tables
      {"daxpy", 3000, tier_sse42, 2, 1, 3, 262144, {1, "tnd"}},   // two threads do not pay, three do
      {"daxpy", 3000, tier_sse42, 3, 1, 3, 262144, {3, "tnd"}},
      {"daxpy", 4000, tier_sse42, 2, 1, 3, 262144, {2, "tnd"}},
      {"daxpy", 2500, tier_ssse3, 8, 1, 2, mebibyte, {1, "t"}},  // its own least length comes ahead of the threads
      {"daxpy", 100000, tier_ssse3, 1, 1, 2, mebibyte, {1, "tn"}},
      {"daxpy", 10000, tier_ssse3, 8, 0, 2, mebibyte, {8, "tnd"}},
      {"daxpy", 2600, tier_ssse3, 8, 1, 2, 4 * mebibyte, {2, "tndc"}},
      {"daxpy", 2900, tier_ssse3, 8, 1, 2, 4 * mebibyte, {4, "tndc"}},
      {"daxpy", 15000, tier_ssse3, 8, 1, 2, 4 * mebibyte, {8, "tndc"}},
      {"daxpy", 30000, tier_ssse3, 32, 1, 2, 2 * mebibyte, {16, "tndc"}},
      {"daxpy", 35000, tier_ssse3, 32, 1, 2, 2 * mebibyte, {32, "tndc"}},
      {"daxpy", 2600, tier_ssse3, 8, 1, 2, 3145728, {4, "tndc"}},  // three mebibytes are small
      {"daxpy", 2600, tier_ssse3, 8, 1, 2, 3145729, {2, "tndc"}},
      {"daxpy", 2600, tier_ssse3, 8, 1, 0, mebibyte, {2, "tndc"}},     // a table of no levels tells nothing
      {"daxpy", 2600, tier_ssse3, 8, 1, 2, 0x80000000U, {4, "tndc"}},  // sizes compare as signed numbers
      {"ccopy", 56000, tier_ssse3, 32, 1, 2, mebibyte, {32, "tndc"}},  // without a cap at 16
      {"dcopy", 29999, tier_ssse3, 32, 1, 2, mebibyte, {16, "tndc"}},
      {"zaxpy", 100000000, tier_ssse3, 64, 1, 2, mebibyte, {2, "tnd"}},  // never more than a pair
      {"zaxpy", 100000000, tier_sse42, 64, 0, 2, mebibyte, {1, "tnd"}},
      {"daxpy", 10000000, tier_avx, 64, 0, 2, mebibyte, {1, "t"}},
  };
  for (const auto &c : cases) {
    Answers answers{c.tier, c.max_threads, c.dynamic, {c.levels, 32768, c.second, 0, 0}};
    EXPECT_EQ(routines.at(c.routine)(c.n, 1, 1, answers), c.want) << c.routine << ' ' << c.n << ' ' << c.max_threads;
  }
}

}  // namespace
}  // namespace qtb::test
