// The shared library as a program calls it: options in either case and with more text, hidden lengths or none, empty
// problems, and what an illegal argument of every routine that tests its arguments prints.

#include <gtest/gtest.h>

#include <string>
#include <utility>
#include <vector>

#include "include/qtb.h"
#include "tests/support/address.h"
#include "tests/support/child.h"
#include "tests/support/guarded.h"

namespace {

using qtb::test::capture_child;
using qtb::test::Guarded;

constexpr QtbInt size = 5;
const std::vector<double> a = {1, 2, 3, 4, 5, 6, 7, 8, 9, 1, 2, 3, 4, 5, 6, 7, 8, 9, 1, 2, 3, 4, 5, 6, 7};
const std::vector<double> b = {2, 7, 1, 8, 2, 8, 1, 8, 2, 8, 4, 5, 9, 0, 4, 5, 2, 3, 5, 3, 6, 0, 2, 8, 7};

using Gemm = decltype(&dgemm);

// A product of small integers, which every order of summation gives exactly.
std::vector<double> product(Gemm gemm, const char *transa, const char *transb) {
  const double alpha = 2, beta = 1;
  std::vector<double> c(size * size, 1);
  gemm(transa, transb, &size, &size, &size, &alpha, a.data(), &size, b.data(), &size, &beta, c.data(), &size);
  return c;
}

std::vector<double> expected_product(bool transpose_a, bool transpose_b) {
  std::vector<double> c(size * size, 1);
  for (QtbInt i = 0; i < size; ++i)
    for (QtbInt j = 0; j < size; ++j)
      for (QtbInt k = 0; k < size; ++k)
        c[i + j * size] +=
            2 * (transpose_a ? a[k + i * size] : a[i + k * size]) * (transpose_b ? b[j + k * size] : b[k + j * size]);
  return c;
}

TEST(Interface, options_count_in_either_case_and_by_their_first_letter) {
  const std::vector<std::pair<const char *, bool>> options = {{"N", false}, {"n", false}, {"No transpose", false},
                                                              {"T", true},  {"t", true},  {"Transpose", true},
                                                              {"C", true},  {"c", true},  {"conjugate", true}};
  for (const auto &[transa, transpose_a] : options)
    for (const auto &[transb, transpose_b] : options)
      for (const Gemm gemm : {&dgemm, &DGEMM})
        EXPECT_EQ(product(gemm, transa, transb), expected_product(transpose_a, transpose_b)) << transa << " " << transb;
}

TEST(Interface, an_option_is_one_byte) {
  Guarded<char> transa(1), transb(1);
  transa[0] = 't';
  transb[0] = 'N';
  EXPECT_EQ(product(&dgemm, transa.data(), transb.data()), expected_product(true, false));
}

TEST(Interface, hidden_lengths_change_nothing) {
  using WithLengths = void (*)(const char *, const char *, const QtbInt *, const QtbInt *, const QtbInt *,
                               const double *, const double *, const QtbInt *, const double *, const QtbInt *,
                               const double *, double *, const QtbInt *, std::size_t, std::size_t);
  const auto with_lengths = reinterpret_cast<WithLengths>(reinterpret_cast<void *>(&dgemm));
  const double alpha = 2, beta = 1;
  for (const std::size_t length : {std::size_t{0}, std::size_t{1}, std::size_t{9}, SIZE_MAX}) {
    std::vector<double> c(size * size, 1);
    with_lengths("T", "N", &size, &size, &size, &alpha, a.data(), &size, b.data(), &size, &beta, c.data(), &size,
                 length, length);
    EXPECT_EQ(c, expected_product(true, false));
  }
}

TEST(Interface, both_cases_are_one_address) {
  EXPECT_EQ(qtb::test::address_of(&dgemm), qtb::test::address_of(&DGEMM));
  EXPECT_EQ(qtb::test::address_of(&lsame), qtb::test::address_of(&LSAME));
  EXPECT_EQ(qtb::test::address_of(&xerbla), qtb::test::address_of(&XERBLA));
}

TEST(Interface, complex_functions_store_zero_for_empty_vectors) {
  const QtbInt one = 1;
  for (const QtbInt n : {QtbInt{0}, QtbInt{-3}}) {
    for (const auto dot : {&cdotu, &cdotc}) {
      QtbFloatComplex result = {7, 7};
      EXPECT_EQ(dot(&result, &n, nullptr, &one, nullptr, &one), &result);
      EXPECT_EQ(result, QtbFloatComplex(0));
    }
    for (const auto dot : {&zdotu, &zdotc}) {
      QtbDoubleComplex result = {7, 7};
      EXPECT_EQ(dot(&result, &n, nullptr, &one, nullptr, &one), &result);
      EXPECT_EQ(result, QtbDoubleComplex(0));
    }
    for (const auto dot : {&cdotui, &cdotci}) {
      QtbFloatComplex result = {7, 7};
      EXPECT_EQ(dot(&result, &n, nullptr, nullptr, nullptr), &result);
      EXPECT_EQ(result, QtbFloatComplex(0));
    }
    for (const auto dot : {&zdotui, &zdotci}) {
      QtbDoubleComplex result = {7, 7};
      EXPECT_EQ(dot(&result, &n, nullptr, nullptr, nullptr), &result);
      EXPECT_EQ(result, QtbDoubleComplex(0));
    }
  }
}

TEST(Interface, a_negative_length_reports_nothing_and_changes_nothing) {
  Guarded<double> y(4);
  for (std::size_t i = 0; i < 4; ++i) y[i] = 3;
  y.read_only();
  const auto result = capture_child([&] {
    const QtbInt n = -4, one = 1;
    const double alpha = 2;
    daxpy(&n, &alpha, a.data(), &one, y.data(), &one);
    std::fflush(stdout);
  });
  EXPECT_EQ(result.exit_status, 0);
  EXPECT_EQ(result.output, "");
}

TEST(Interface, a_short_leading_dimension_of_an_empty_product_is_reported_and_c_stays) {
  Guarded<double> c(4);
  c.read_only();
  const auto result = capture_child([&] {
    const QtbInt none = 0, two = 2;
    const double alpha = 2, beta = 0;
    dgemm("N", "N", &none, &two, &two, &alpha, a.data(), &none, b.data(), &two, &beta, c.data(), &two);
  });
  EXPECT_EQ(result.exit_status, 0);
  EXPECT_EQ(result.output, "\nQTB ERROR: Parameter 8 was incorrect on entry to DGEMM \n");
}

// ---- Every routine with a checker ----

// The arguments of a call whose first parameter is illegal: options are no letter at all, integers are -1, and every
// array lies out of reach.
template <class Parameter>
Parameter illegal_argument(void *out_of_reach) {
  static const char no_option[] = "?";
  static const QtbInt negative = -1;
  if constexpr (std::is_same_v<Parameter, const char *>)
    return no_option;
  else if constexpr (std::is_same_v<Parameter, const QtbInt *>)
    return &negative;
  else
    return static_cast<Parameter>(out_of_reach);
}

template <class... Parameters>
void call_with_illegal_arguments(void (*routine)(Parameters...), void *out_of_reach) {
  routine(illegal_argument<Parameters>(out_of_reach)...);
}

struct Checked {
  const char *upper_name;
  void (*call)(void *out_of_reach);
};

#define QTB_CALL_SLOT(name, NAME)
#define QTB_CALL_DRIVER(name, NAME)
#define QTB_CALL_CHECK_SLOT(name, NAME)                                                  \
  {#NAME, [](void *out_of_reach) { call_with_illegal_arguments(&name, out_of_reach); }}, \
      {#NAME, [](void *out_of_reach) { call_with_illegal_arguments(&NAME, out_of_reach); }},
#define QTB_CALL_CHECK_DRIVER(name, NAME) QTB_CALL_CHECK_SLOT(name, NAME)
#define QTB_ROUTINE(name, NAME, shape, T, route) QTB_CALL_##route(name, NAME)
const Checked checked[] = {
#include "blas/routines.def"
};
#undef QTB_ROUTINE

TEST(Interface, every_routine_of_levels_2_and_3_reports_its_first_argument_and_touches_nothing) {
  Guarded<double> nothing(0);
  std::string expected;
  for (const Checked &routine : checked) {
    std::string name = routine.upper_name;
    name.resize(6, ' ');
    expected += "\nQTB ERROR: Parameter 1 was incorrect on entry to " + name + "\n";
  }
  const auto result = capture_child([&] {
    for (const Checked &routine : checked) routine.call(nothing.data());
  });
  EXPECT_EQ(std::size(checked), 2 * 96U);
  EXPECT_EQ(result.exit_status, 0);
  EXPECT_EQ(result.output, expected);
}

}  // namespace
