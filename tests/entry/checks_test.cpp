// The argument checkers, each against the rules of rules.h: every rule on both sides, every option byte, the lowest
// illegal parameter of many at once. What a checker has no rule for lies in memory that cannot be read, and what it
// reads in memory that cannot be written.

#include "blas/entry/checks.h"

#include <gtest/gtest.h>

#include <cstring>
#include <map>
#include <random>
#include <set>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "blas/entry/xerbla.h"
#include "tests/entry/rules.h"
#include "tests/support/guarded.h"

namespace {

struct Report {
  int count = 0;
  std::string name;
  std::size_t name_length = 0;
  QtbInt info = 0;
  std::int32_t length = 0;
};
Report reported;

}  // namespace

// Stands in for the reporter.
void qtb_serv_xerbla(const char *name, const QtbInt *info, std::int32_t length) {
  ++reported.count;
  reported.name = name;
  reported.info = *info;
  reported.length = length;
}

namespace {

using qtb::test::family_rules;
using qtb::test::FamilyRules;

// ---- The checkers under their names ----

template <class... Parameters, std::size_t... position>
std::int32_t call(std::int32_t (*checker)(Parameters...), void *const *arguments, std::index_sequence<position...>) {
  return checker(static_cast<Parameters>(arguments[position])...);
}

using CheckerCall = std::int32_t (*)(void *const *arguments);

struct Checker {
  const char *name, *upper_name, *parameters;
  CheckerCall call;
};

template <auto checker>
struct Caller;
template <class... Parameters, std::int32_t (*checker)(Parameters...)>
struct Caller<checker> {
  static std::int32_t run(void *const *arguments) {
    return call(checker, arguments, std::index_sequence_for<Parameters...>());
  }
};

#define QTB_TEXT(...) QTB_TEXT_OF(__VA_ARGS__)
#define QTB_TEXT_OF(...) #__VA_ARGS__
#define QTB_LIST_SLOT(name, NAME, shape)
#define QTB_LIST_DRIVER(name, NAME, shape)
#define QTB_LIST_CHECK_SLOT(name, NAME, shape) \
  {#name, #NAME, QTB_TEXT(QTB_ARGS(shape)), &Caller<&qtb_blas_errchk_##name>::run},
#define QTB_LIST_CHECK_DRIVER(name, NAME, shape) QTB_LIST_CHECK_SLOT(name, NAME, shape)
#define QTB_ROUTINE(name, NAME, shape, T, route) QTB_LIST_##route(name, NAME, shape)
const Checker checkers[] = {
#include "blas/routines.def"
};
#undef QTB_ROUTINE

std::vector<std::string> words(const std::string &text) {
  std::istringstream stream(text);
  std::vector<std::string> result;
  for (std::string word; stream >> word;) result.push_back(word);
  return result;
}

const FamilyRules *rules_of(const std::string &routine) {
  for (const FamilyRules &family : family_rules)
    for (const std::string &name : words(family.routines))
      if (name == routine) return &family;
  return nullptr;
}

// ---- The rules, read from their text ----

struct Call {
  std::map<std::string, unsigned char> options;
  std::map<std::string, QtbInt> integers;
};

bool matches(unsigned char option, char letter) {
  return option == static_cast<unsigned char>(letter) || option == static_cast<unsigned char>(letter - 'A' + 'a');
}

// The least value that a rule such as "lda>=max1(side=L?m:n)" or "lda>=kl+ku+1" allows, in 64 bits that wrap around.
QtbInt least_value(const std::string &rule, const Call &call) {
  std::string formula = rule.substr(rule.find(">=") + 2);
  if (formula.rfind("max1(", 0) == 0) {
    formula = formula.substr(5, formula.size() - 6);
    const std::size_t question = formula.find('?');
    if (question != std::string::npos) {
      const std::size_t equals = formula.find('='), colon = formula.find(':');
      const bool first = matches(call.options.at(formula.substr(0, equals)), formula[equals + 1]);
      formula = first ? formula.substr(question + 1, colon - question - 1) : formula.substr(colon + 1);
    }
    return std::max<QtbInt>(1, call.integers.at(formula));
  }
  unsigned __int128 sum = 0;
  for (std::size_t begin = 0; begin < formula.size();) {
    const std::size_t end = std::min(formula.find('+', begin), formula.size());
    const std::string term = formula.substr(begin, end - begin);
    sum += static_cast<std::uint64_t>(term == "1" ? 1 : call.integers.at(term));
    begin = end + 1;
  }
  return static_cast<QtbInt>(static_cast<std::uint64_t>(sum));
}

QtbInt position(const FamilyRules &family, const std::string &parameter) {
  const std::vector<std::string> all = words(family.parameters);
  return std::find(all.begin(), all.end(), parameter) - all.begin() + 1;
}

// The number that must be reported for a call, 0 if it is legal.
QtbInt expected_info(const FamilyRules &family, const Call &call) {
  for (const std::string &rule : words(family.options)) {
    const std::size_t colon = rule.find(':');
    bool legal = false;
    for (char letter : rule.substr(colon + 1)) legal |= matches(call.options.at(rule.substr(0, colon)), letter);
    if (!legal) return position(family, rule.substr(0, colon));
  }
  for (const std::string &dimension : words(family.dimensions))
    if (call.integers.at(dimension) < 0) return position(family, dimension);
  for (const std::string &rule : words(family.others)) {
    const std::string parameter = rule.substr(0, rule.find_first_of(">!"));
    const QtbInt value = call.integers.at(parameter);
    if (rule.find("!=0") != std::string::npos ? value == 0 : value < least_value(rule, call))
      return position(family, parameter);
  }
  return 0;
}

// ---- Calls ----

// A legal call with every option at a letter and every dimension at a size.
Call legal_call(const FamilyRules &family, unsigned letter, QtbInt size) {
  Call call;
  for (const std::string &rule : words(family.options)) {
    const std::size_t colon = rule.find(':');
    const std::string letters = rule.substr(colon + 1);
    call.options[rule.substr(0, colon)] = static_cast<unsigned char>(letters[letter % letters.size()]);
  }
  for (const std::string &dimension : words(family.dimensions)) call.integers[dimension] = size++;
  for (const std::string &rule : words(family.others)) {
    const std::string parameter = rule.substr(0, rule.find_first_of(">!"));
    call.integers[parameter] = rule.find("!=0") != std::string::npos ? 1 : least_value(rule, call);
  }
  return call;
}

// Memory for a call's arguments: what the checker may read in read-only pages, all else out of reach.
class Arguments {
 public:
  explicit Arguments(const FamilyRules &family)
      : parameters_(words(family.parameters)), integers_(parameters_.size()), options_(4), nothing_(0) {}

  // Calls the checker and returns the number that it reported, 0 for none. The parameters of beyond are null.
  QtbInt check(const Checker &checker, const Call &call, const std::set<std::string> &beyond = {}) {
    integers_.writable();
    options_.writable();
    std::vector<void *> pointers;
    std::size_t option = options_.size() - call.options.size();  // the last one ends at a trapping page
    for (std::size_t i = 0; i < parameters_.size(); ++i) {
      if (beyond.count(parameters_[i]) != 0) {
        pointers.push_back(nullptr);
      } else if (const auto found = call.options.find(parameters_[i]); found != call.options.end()) {
        options_[option] = found->second;
        pointers.push_back(&options_[option++]);
      } else if (const auto integer = call.integers.find(parameters_[i]); integer != call.integers.end()) {
        integers_[i] = integer->second;
        pointers.push_back(&integers_[i]);
      } else {
        pointers.push_back(nothing_.data() + page_inside_the_guard);
      }
    }
    integers_.read_only();
    options_.read_only();
    reported = {};
    const std::int32_t value = checker.call(pointers.data());
    EXPECT_EQ(value, reported.count) << checker.name;
    if (reported.count != 0) {
      std::string padded = checker.upper_name;
      padded.resize(6, ' ');
      EXPECT_EQ(reported.name, padded);
      EXPECT_EQ(reported.length, 6);
    }
    ++calls;
    return reported.count == 0 ? 0 : reported.info;
  }

  static inline long calls = 0;

 private:
  // data() of an empty array lies at the end of its pages: what follows traps.
  static constexpr std::size_t page_inside_the_guard = 64;
  std::vector<std::string> parameters_;
  qtb::test::Guarded<QtbInt> integers_;
  qtb::test::Guarded<unsigned char> options_;
  qtb::test::Guarded<unsigned char> nothing_;
};

class ChecksEnvironment : public testing::Environment {
  void TearDown() override {
    std::printf("argument checks: %zu routines, %ld calls\n", std::size(checkers), Arguments::calls);
  }
};
const auto *const environment = testing::AddGlobalTestEnvironment(new ChecksEnvironment);

const Checker &checker_of(const std::string &name) {
  for (const Checker &checker : checkers)
    if (checker.name == name) return checker;
  std::abort();
}

// What a routine reports for a legal call with some integers and options changed.
QtbInt info_of(const std::string &routine, std::map<std::string, QtbInt> integers,
               std::map<std::string, char> options = {}) {
  const FamilyRules &family = *rules_of(routine);
  Call call = legal_call(family, 0, 4);
  for (const auto &[name, value] : integers) call.integers.at(name) = value;
  for (const auto &[name, value] : options) call.options.at(name) = static_cast<unsigned char>(value);
  return Arguments(family).check(checker_of(routine), call);
}

// ---- Tests ----

TEST(Checks, there_are_96_and_each_has_rules) {
  EXPECT_EQ(std::size(checkers), 96U);
  for (const Checker &checker : checkers) EXPECT_NE(rules_of(checker.name), nullptr) << checker.name;
}

TEST(Checks, parameters_stand_in_the_published_order) {
  for (const Checker &checker : checkers) {
    std::string joined;
    for (const std::string &parameter : words(rules_of(checker.name)->parameters))
      joined += (joined.empty() ? "" : ", ") + parameter;
    EXPECT_EQ(joined, checker.parameters) << checker.name;
  }
}

TEST(Checks, legal_calls_report_nothing_also_with_dimensions_of_zero) {
  for (const Checker &checker : checkers) {
    const FamilyRules &family = *rules_of(checker.name);
    Arguments arguments(family);
    for (unsigned letter = 0; letter < 6; ++letter)
      for (QtbInt size : {0, 1, 7}) EXPECT_EQ(arguments.check(checker, legal_call(family, letter, size)), 0);
    Call zeros = legal_call(family, 0, 1);
    for (const std::string &dimension : words(family.dimensions)) zeros.integers[dimension] = 0;
    EXPECT_EQ(arguments.check(checker, zeros), 0);
  }
}

TEST(Checks, every_byte_as_every_option) {
  for (const Checker &checker : checkers) {
    const FamilyRules &family = *rules_of(checker.name);
    Arguments arguments(family);
    for (const auto &[option, letter] : legal_call(family, 0, 4).options)
      for (unsigned byte = 0; byte < 256; ++byte) {
        Call call = legal_call(family, 0, 4);
        for (auto &[name, value] : call.integers) value = 40;
        call.options[option] = static_cast<unsigned char>(byte);
        ASSERT_EQ(arguments.check(checker, call), expected_info(family, call)) << checker.name << " " << option << byte;
      }
  }
}

TEST(Checks, every_integer_on_both_sides_of_its_limit) {
  for (const Checker &checker : checkers) {
    const FamilyRules &family = *rules_of(checker.name);
    Arguments arguments(family);
    for (unsigned letter = 0; letter < 6; ++letter)
      for (QtbInt size : {0, 1, 2, 5}) {
        const Call legal = legal_call(family, letter, size);
        for (const auto &[name, value] : legal.integers)
          for (QtbInt changed : {value - 1, value + 1, QtbInt{0}, QtbInt{-1}, QtbInt{1}, INT64_MIN, INT64_MAX,
                                 QtbInt{1} << 32, -(QtbInt{1} << 32), (QtbInt{1} << 32) + 1}) {
            Call call = legal;
            call.integers[name] = changed;
            ASSERT_EQ(arguments.check(checker, call), expected_info(family, call))
                << checker.name << " " << name << "=" << changed;
          }
      }
  }
}

// Any number of parameters illegal at once: the lowest is reported.
TEST(Checks, the_lowest_illegal_parameter_of_many) {
  std::mt19937_64 random(1979);
  const std::string letters = "NTCULRDXntculrdx ";
  for (const Checker &checker : checkers) {
    const FamilyRules &family = *rules_of(checker.name);
    Arguments arguments(family);
    std::map<QtbInt, int> seen;
    for (int i = 0; i < 3000; ++i) {
      Call call = legal_call(family, static_cast<unsigned>(random() % 6), static_cast<QtbInt>(random() % 4));
      for (auto &[name, value] : call.options)
        if (random() % 8 == 0) value = static_cast<unsigned char>(letters[random() % letters.size()]);
      for (auto &[name, value] : call.integers)
        if (random() % 6 == 0) value = static_cast<QtbInt>(random() % 9) - 4;
      const QtbInt info = arguments.check(checker, call);
      ASSERT_EQ(info, expected_info(family, call)) << checker.name;
      ++seen[info];
    }
    const std::size_t rules =
        words(family.options).size() + words(family.dimensions).size() + words(family.others).size();
    EXPECT_EQ(seen.size(), rules + 1) << checker.name << ": every rule must have been the first broken one";
  }
}

// Each rule broken alone, and nothing behind it: whoever got one argument wrong may have passed nothing for the others.
TEST(Checks, nothing_behind_the_first_illegal_parameter_is_read) {
  for (const Checker &checker : checkers) {
    const FamilyRules &family = *rules_of(checker.name);
    Arguments arguments(family);
    std::vector<std::string> order;  // of the tests
    for (const std::string &rule : words(family.options)) order.push_back(rule.substr(0, rule.find(':')));
    for (const std::string &dimension : words(family.dimensions)) order.push_back(dimension);
    for (const std::string &rule : words(family.others)) order.push_back(rule.substr(0, rule.find_first_of(">!")));
    for (unsigned letter = 0; letter < 6; ++letter)
      for (std::size_t broken = 0; broken < order.size(); ++broken) {
        Call call = legal_call(family, letter, 4);
        const bool is_increment = order[broken].rfind("inc", 0) == 0;
        if (call.options.count(order[broken]) != 0)
          call.options[order[broken]] = 'X';
        else
          call.integers[order[broken]] = is_increment ? 0 : -1;
        const auto behind = order.begin() + static_cast<std::ptrdiff_t>(broken) + 1;
        ASSERT_EQ(arguments.check(checker, call, {behind, order.end()}), position(family, order[broken]))
            << checker.name << " " << order[broken];
      }
  }
}

TEST(Checks, dgemm_with_an_unknown_option_reports_parameter_1_also_without_any_other_argument) {
  reported = {};
  EXPECT_EQ(qtb_blas_errchk_dgemm("X", nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr,
                                  nullptr, nullptr, nullptr),
            1);
  EXPECT_EQ(reported.info, 1);
}

TEST(Checks, dgemm_with_an_unknown_option_reports_parameter_1) {
  EXPECT_EQ(info_of("dgemm", {}, {{"transa", 'X'}}), 1);
  EXPECT_EQ(reported.name, "DGEMM ");
}

TEST(Checks, dgemm_with_a_negative_m_and_a_short_lda_reports_m) {
  EXPECT_EQ(info_of("dgemm", {{"m", -1}, {"lda", 0}}), 3);
}

TEST(Checks, dgemm_with_no_rows_still_reports_a_short_lda) { EXPECT_EQ(info_of("dgemm", {{"m", 0}, {"lda", 0}}), 8); }

TEST(Checks, dtrsm_on_the_right_compares_lda_with_n) {
  EXPECT_EQ(info_of("dtrsm", {{"m", 2}, {"n", 9}, {"lda", 8}, {"ldb", 2}}, {{"side", 'R'}}), 9);
  EXPECT_EQ(info_of("dtrsm", {{"m", 2}, {"n", 9}, {"lda", 9}, {"ldb", 2}}, {{"side", 'R'}}), 0);
  EXPECT_EQ(info_of("dtrsm", {{"m", 2}, {"n", 9}, {"lda", 2}, {"ldb", 2}}, {{"side", 'l'}}), 0);
}

TEST(Checks, the_conjugate_transpose_is_for_real_and_hermitian_updates) {
  const std::map<std::string, QtbInt> room = {{"lda", 9}};
  EXPECT_EQ(info_of("dsyrk", room, {{"trans", 'C'}}), 0);
  EXPECT_EQ(info_of("csyrk", room, {{"trans", 'C'}}), 2);
  EXPECT_EQ(info_of("cherk", room, {{"trans", 'T'}}), 2);
  EXPECT_EQ(info_of("cherk", room, {{"trans", 'C'}}), 0);
}

TEST(Checks, dgbmv_needs_a_row_for_every_diagonal) {
  EXPECT_EQ(info_of("dgbmv", {{"kl", 2}, {"ku", 3}, {"lda", 5}}), 8);
  EXPECT_EQ(info_of("dgbmv", {{"kl", 2}, {"ku", 3}, {"lda", 6}}), 0);
}

TEST(Checks, the_count_of_diagonals_wraps_around) {
  EXPECT_EQ(info_of("dgbmv", {{"kl", INT64_MAX}, {"ku", 0}, {"lda", INT64_MIN}}), 0);
  EXPECT_EQ(info_of("dgbmv", {{"kl", INT64_MAX}, {"ku", INT64_MAX}, {"lda", -1}}), 0);
  EXPECT_EQ(info_of("dgbmv", {{"kl", INT64_MAX}, {"ku", INT64_MAX}, {"lda", -2}}), 8);
  EXPECT_EQ(info_of("dtbsv", {{"k", INT64_MAX}, {"lda", INT64_MIN}}), 0);
}

TEST(Checks, names_are_padded_to_six_characters) {
  info_of("cher", {{"n", -1}});
  EXPECT_EQ(reported.name, "CHER  ");
  info_of("cher2k", {{"n", -1}});
  EXPECT_EQ(reported.name, "CHER2K");
  info_of("dger", {{"n", -1}});
  EXPECT_EQ(reported.name, "DGER  ");
}

}  // namespace
