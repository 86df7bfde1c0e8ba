// The error reporter: what each code prints, how names are cut, and the handler that only the exported form consults.

#include <gtest/gtest.h>

#include <climits>
#include <string>

#include "blas/entry/xerbla.h"
#include "tests/platform/fake_messages.h"
#include "tests/support/address.h"
#include "tests/support/child.h"
#include "tests/support/guarded.h"

extern "C" {
int xerbla(const char *name, const QtbInt *info, std::int32_t length);
int XERBLA(const char *name, const QtbInt *info, std::int32_t length);
}

namespace {

std::string report(const char *name, QtbInt info, std::int32_t length) {
  return qtb::test::capture_child([&] { xerbla(name, &info, length); }).output;
}

std::string parameter_3(const std::string &name) {
  return "\nQTB ERROR: Parameter 3 was incorrect on entry to " + name + "\n";
}

TEST(Xerbla, prints_an_empty_line_and_the_parameter) { EXPECT_EQ(report("DGEMM ", 3, 6), parameter_3("DGEMM ")); }

TEST(Xerbla, zero_is_condition_zero) {
  EXPECT_EQ(report("DGEMM ", 0, 6), "\nQTB INTERNAL ERROR: Condition 0 detected in function DGEMM \n");
}

TEST(Xerbla, a_negative_code_is_shown_without_its_sign) {
  EXPECT_EQ(report("DGEMM ", -5, 6), "\nQTB INTERNAL ERROR: Condition 5 detected in function DGEMM \n");
}

TEST(Xerbla, the_smallest_code_is_its_own_negation) {
  EXPECT_EQ(report("X", INT32_MIN, 1), "\nQTB INTERNAL ERROR: Condition -2147483648 detected in function X\n");
}

TEST(Xerbla, three_codes_have_texts_of_their_own) {
  EXPECT_EQ(report("DGEMM ", 1000, 6), "\nQTB INTERNAL ERROR: Not enough work memory in function DGEMM \n");
  EXPECT_EQ(report("DGEMM ", 1001, 6), "\nQTB ERROR: Incompatible optional parameters on entry to DGEMM \n");
  EXPECT_EQ(report("DGEMM ", 1079, 6), "\nQTB INTERNAL ERROR: Not enough work memory in function DGEMM \n");
}

TEST(Xerbla, their_neighbours_are_parameters) {
  for (int code : {1, 13, 999, 1002, 1078, 1080, INT_MAX})
    EXPECT_EQ(report("F", code, 1),
              "\nQTB ERROR: Parameter " + std::to_string(code) + " was incorrect on entry to F\n");
}

TEST(Xerbla, only_the_low_half_of_info_counts) {
  EXPECT_EQ(report("DGEMM ", static_cast<QtbInt>(0x7BADBAD100000003), 6), parameter_3("DGEMM "));
  qtb::test::Guarded<std::int32_t> low_half(1);
  low_half[0] = 3;
  const auto *const info = reinterpret_cast<const QtbInt *>(low_half.data());
  EXPECT_EQ(qtb::test::capture_child([&] { xerbla("DGEMM ", info, 6); }).output, parameter_3("DGEMM "));
}

TEST(Xerbla, shows_at_most_20_characters_of_a_name) {
  EXPECT_EQ(report("ABCDEFGHIJKLMNOPQRSTUVWXY", 3, 25), parameter_3("ABCDEFGHIJKLMNOPQRST"));
  EXPECT_EQ(report("ABCDEFGHIJKLMNOPQRSTU", 3, 21), parameter_3("ABCDEFGHIJKLMNOPQRST"));
  EXPECT_EQ(report("ABCDEFGHIJKLMNOPQRST", 3, 20), parameter_3("ABCDEFGHIJKLMNOPQRST"));
  EXPECT_EQ(report(std::string(600, 'N').c_str(), 3, 600), parameter_3(std::string(20, 'N')));
}

TEST(Xerbla, shows_no_more_of_a_name_than_its_length) {
  EXPECT_EQ(report("DGEMM ", 3, 2), parameter_3("DG"));
  EXPECT_EQ(report("DGEMM ", 3, 0), parameter_3(""));
}

TEST(Xerbla, a_name_ends_at_a_zero_byte) { EXPECT_EQ(report("AB\0CD", 3, 5), parameter_3("AB")); }

TEST(Xerbla, a_negative_length_stands_for_a_terminated_name) {
  EXPECT_EQ(report("DGEMM", 3, -1), parameter_3("DGEMM"));
  EXPECT_EQ(report(std::string(600, 'N').c_str(), 3, -1), parameter_3(std::string(20, 'N')));
  EXPECT_EQ(report(std::string(600, 'N').c_str(), 3, INT32_MIN), parameter_3(std::string(20, 'N')));
}

TEST(Xerbla, reads_no_more_of_a_name_than_its_length) {
  for (std::size_t length = 0; length <= 20; ++length) {
    qtb::test::Guarded<char> name(length);
    for (std::size_t i = 0; i < length; ++i) name[i] = 'N';
    EXPECT_EQ(report(name.data(), 3, static_cast<std::int32_t>(length)), parameter_3(std::string(length, 'N')));
  }
}

TEST(Xerbla, conversions_in_a_name_are_text) {
  EXPECT_EQ(report("%s%n%d", 3, 6), parameter_3("%s%n%d"));
  EXPECT_EQ(report("%1$n%*d%", 3, 8), parameter_3("%1$n%*d%"));
  EXPECT_EQ(report("%999999999d", 3, 11), parameter_3("%999999999d"));
}

TEST(Xerbla, a_pair_of_percent_signs_in_a_name_prints_as_one) {
  EXPECT_EQ(report("A%%B", 3, 4), parameter_3("A%B"));
  EXPECT_EQ(report("A%%%B", 3, 5), parameter_3("A%%B"));
  EXPECT_EQ(report("A%%%%B", 3, 6), parameter_3("A%%B"));
}

TEST(Xerbla, returns_to_its_caller) {
  const auto result = qtb::test::capture_child([] {
    const QtbInt info = 3;
    if (xerbla("DGEMM ", &info, 6) == 0) _exit(77);
  });
  EXPECT_EQ(result.exit_status, 77);
}

TEST(Xerbla, both_forms_are_one_address) { EXPECT_EQ(qtb::test::address_of(&xerbla), qtb::test::address_of(&XERBLA)); }

TEST(Xerbla, no_handler_is_set) { EXPECT_EQ(qtb_serv_xerbla_handler, nullptr); }

struct HandlerCall {
  const char *name;
  const QtbInt *info;
  std::int32_t length;
};
HandlerCall handler_call;

int handler(const char *name, const QtbInt *info, std::int32_t length) {
  handler_call = {name, info, length};
  return 42;
}

TEST(Xerbla, a_handler_gets_the_arguments_as_they_came_and_nothing_is_printed) {
  const QtbInt info = 3;
  const char name[] = "DGEMM ";
  const auto result = qtb::test::capture_child([&] {
    qtb_serv_xerbla_handler = &handler;
    const int value = xerbla(name, &info, -7);
    const bool as_they_came = handler_call.name == name && handler_call.info == &info && handler_call.length == -7;
    _exit(as_they_came ? value : 1);
  });
  EXPECT_EQ(result.exit_status, 42);
  EXPECT_EQ(result.output, "");
}

TEST(Xerbla, the_internal_form_never_calls_the_handler) {
  const auto result = qtb::test::capture_child([] {
    const QtbInt info = 3;
    qtb_serv_xerbla_handler = &handler;
    qtb_serv_xerbla("DGEMM ", &info, 6);
    _exit(handler_call.name == nullptr ? 0 : 1);
  });
  EXPECT_EQ(result.exit_status, 0);
  EXPECT_EQ(result.output, parameter_3("DGEMM "));
}

}  // namespace
