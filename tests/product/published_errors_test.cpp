// The error exits of the published testers of Levels 2 and 3: every illegal argument of every routine is reported under
// its number, the lowest first, before any array is touched, and the routine returns.

#include <gtest/gtest.h>

#include <array>
#include <sstream>
#include <string>
#include <tuple>
#include <vector>

#include "blas/shapes.h"
#include "tests/support/guarded.h"

extern "C" {
#define QTB_ROUTINE(name, NAME, shape, T, route) QTB_FUNCTION(shape, T, name);
#include "blas/routines.def"
#undef QTB_ROUTINE
}

namespace {

// The arguments of a call by name: options and numbers, legal until spoiled; arrays lie in unreadable memory.
class Arguments {
 public:
  Arguments(const char *list, QtbInt dimension, QtbInt leading) {
    std::istringstream names{list};
    for (std::string name; std::getline(names >> std::ws, name, ',');) {
      names_.push_back(name);
      letters_.push_back(name == "side" ? 'L' : name == "uplo" ? 'U' : 'N');
      numbers_.push_back(is_leading(name) ? leading : is_increment(name) ? 1 : dimension);
    }
    arrays_.unreadable();
  }
  std::size_t count() const { return names_.size(); }
  bool can_be_illegal(std::size_t i) const {
    return is_option(names_[i]) || is_dimension(names_[i]) || is_leading(names_[i]) || is_increment(names_[i]);
  }
  void spoil(std::size_t i, QtbInt illegal_leading) {
    letters_[i] = '/';
    numbers_[i] = is_leading(names_[i]) ? illegal_leading : is_increment(names_[i]) ? 0 : -1;
  }

  template <class A>
  A get(std::size_t i) {
    if constexpr (std::is_same_v<A, const char *>)
      return &letters_[i];
    else if constexpr (std::is_same_v<A, const QtbInt *>)
      return &numbers_[i];
    else
      return reinterpret_cast<A>(names_[i] == "alpha" || names_[i] == "beta" ? scalar_ : arrays_.data());
  }

 private:
  static bool is_option(const std::string &n) {
    return n == "side" || n == "uplo" || n == "trans" || n == "transa" || n == "transb" || n == "diag";
  }
  static bool is_dimension(const std::string &n) { return n == "m" || n == "n" || n == "k" || n == "kl" || n == "ku"; }
  static bool is_leading(const std::string &n) { return n == "lda" || n == "ldb" || n == "ldc"; }
  static bool is_increment(const std::string &n) { return n == "incx" || n == "incy"; }

  std::vector<std::string> names_;
  std::vector<char> letters_;
  std::vector<QtbInt> numbers_;
  alignas(16) unsigned char scalar_[16] = {};
  qtb::test::Guarded<unsigned char> arrays_{64};
};

template <class... A, std::size_t... i>
void call(void (*routine)(A...), Arguments &arguments, std::index_sequence<i...>) {
  routine(arguments.get<A>(i)...);
}

struct ErrorExits {
  std::string name;
  long cases = 0;

  template <class... A>
  void expect_report(void (*routine)(A...), Arguments &arguments, std::size_t lowest) {
    testing::internal::CaptureStdout();
    call(routine, arguments, std::index_sequence_for<A...>());
    const std::string printed = testing::internal::GetCapturedStdout();
    std::string padded = name;
    padded.resize(6, ' ');
    const std::string text =
        "QTB ERROR: Parameter " + std::to_string(lowest + 1) + " was incorrect on entry to " + padded;
    EXPECT_NE(printed.find(text), std::string::npos) << name << ": expected " << text << ", printed " << printed;
    EXPECT_EQ(printed.find("Parameter"), printed.rfind("Parameter")) << name << " reported twice";
    ++cases;
  }

  // Each argument illegal by itself and with each later one: with empty dimensions, and with leading dimensions that
  // are too small for dimensions of 2.
  template <class... A>
  void check(void (*routine)(A...), const char *list) {
    constexpr QtbInt settings[][3] = {{0, 1, 0}, {2, 8, 1}};  // dimension, leading dimension, an illegal one
    for (const auto &[dimension, leading, illegal] : settings) {
      const Arguments legal(list, dimension, leading);
      ASSERT_EQ(legal.count(), sizeof...(A));
      for (std::size_t i = 0; i < legal.count(); ++i)
        for (std::size_t j = i; j < legal.count(); ++j) {
          if (!legal.can_be_illegal(i) || !legal.can_be_illegal(j)) continue;
          Arguments arguments(list, dimension, leading);
          arguments.spoil(i, illegal);
          arguments.spoil(j, illegal);
          expect_report(routine, arguments, i);
        }
    }
  }
};

#define QTB_TEXT(...) #__VA_ARGS__
#define QTB_EXPANDED_TEXT(...) QTB_TEXT(__VA_ARGS__)
#define QTB_ERRORS_SLOT(name, NAME, shape)
#define QTB_ERRORS_DRIVER(name, NAME, shape)
#define QTB_ERRORS_CHECK_SLOT(name, NAME, shape)               \
  TEST(every_illegal_argument_is_reported, name) {             \
    ErrorExits exits{#NAME};                                   \
    exits.check(&::name, QTB_EXPANDED_TEXT(QTB_ARGS_##shape)); \
    RecordProperty("cases", static_cast<int>(exits.cases));    \
  }
#define QTB_ERRORS_CHECK_DRIVER(name, NAME, shape) QTB_ERRORS_CHECK_SLOT(name, NAME, shape)
#define QTB_ROUTINE(name, NAME, shape, T, route) QTB_ERRORS_##route(name, NAME, shape)
#include "blas/routines.def"
#undef QTB_ROUTINE

}  // namespace
