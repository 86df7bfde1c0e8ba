// lsame and LSAME: equality of option characters in either case.

#include <gtest/gtest.h>

#include "blas/entry/lsame.h"
#include "tests/support/address.h"
#include "tests/support/guarded.h"

extern "C" {
std::int64_t lsame(const char *a, const char *b);
std::int64_t LSAME(const char *a, const char *b);
}

namespace {

TEST(Lsame, upper_and_lower_case_are_equal) {
  EXPECT_EQ(lsame("a", "A"), 1);
  EXPECT_EQ(lsame("Z", "z"), 1);
  EXPECT_EQ(LSAME("n", "N"), 1);
}

TEST(Lsame, equal_digits_are_equal) { EXPECT_EQ(lsame("7", "7"), 1); }

TEST(Lsame, letters_beyond_ascii_do_not_fold) { EXPECT_EQ(lsame("\xE1", "\xC1"), 0); }

TEST(Lsame, neighbours_of_the_letters_do_not_fold) {
  EXPECT_EQ(lsame("@", "`"), 0);
  EXPECT_EQ(lsame("[", "{"), 0);
}

// Two bytes are the same option if they are equal, or letters of the alphabet below at the same place.
TEST(Lsame, every_pair_of_bytes) {
  const std::string lower = "abcdefghijklmnopqrstuvwxyz", upper = "ABCDEFGHIJKLMNOPQRSTUVWXYZ";
  int pairs = 0;
  for (int i = 0; i < 256; ++i)
    for (int j = 0; j < 256; ++j) {
      const char a = static_cast<char>(i), b = static_cast<char>(j);
      const std::size_t a_place = std::min(lower.find(a), upper.find(a)),
                        b_place = std::min(lower.find(b), upper.find(b));
      const bool same = i == j || (a_place != std::string::npos && a_place == b_place);
      ASSERT_EQ(lsame(&a, &b), same ? 1 : 0) << i << " " << j;
      ASSERT_EQ(qtb_serv_lsame(&a, &b), same ? 1 : 0) << i << " " << j;
      ++pairs;
    }
  RecordProperty("pairs", pairs);
}

TEST(Lsame, reads_one_byte_of_each_argument) {
  qtb::test::Guarded<char> a(1), b(1);
  a[0] = 't';
  b[0] = 'T';
  EXPECT_EQ(lsame(a.data(), b.data()), 1);
}

TEST(Lsame, further_arguments_are_ignored) {
  using WithLengths = std::int64_t (*)(const char *, const char *, std::int64_t, std::int64_t);
  const auto with_lengths = reinterpret_cast<WithLengths>(reinterpret_cast<void *>(&lsame));
  EXPECT_EQ(with_lengths("Transpose", "t", 9, 1), 1);
  EXPECT_EQ(with_lengths("Transpose", "n", 0, -1), 0);
}

TEST(Lsame, both_forms_are_one_routine) { EXPECT_EQ(qtb::test::address_of(&lsame), qtb::test::address_of(&LSAME)); }

}  // namespace
