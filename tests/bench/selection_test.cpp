// Which calls a comparison makes of names, letters, sizes and shapes.

#include "bench/selection.h"

#include <gtest/gtest.h>

namespace {

using namespace qtb::bench;

std::vector<Selected> select(const Selection &selection) {
  std::string unknown;
  std::vector<Selected> calls = select_calls(selection, unknown);
  EXPECT_EQ(unknown, "");
  return calls;
}
const Routine &routine(std::string_view name) {
  for (const Routine &r : routines)
    if (r.name == name) return r;
  ADD_FAILURE() << name;
  return routines.front();
}
using Words = std::vector<std::string>;

TEST(Selection, a_routine_knows_its_letters_in_the_order_of_its_arguments) {
  EXPECT_EQ(all_letters(routine("dgemv")), (Words{"N", "T"}));
  EXPECT_EQ(all_letters(routine("zgemv")), (Words{"N", "T", "C"}));
  EXPECT_EQ(all_letters(routine("dger")), (Words{""}));
  EXPECT_EQ(all_letters(routine("cherk")), (Words{"UN", "UC", "LN", "LC"}));
  EXPECT_EQ(all_letters(routine("csyrk")), (Words{"UN", "UT", "LN", "LT"}));
  EXPECT_EQ(all_letters(routine("dtrsv")).size(), 8U);
  EXPECT_EQ(all_letters(routine("ztrmm")).size(), 24U);
  EXPECT_EQ(all_letters(routine("ztrmm")).front(), "LUNN");
}

TEST(Selection, names_are_routines_operations_or_levels) {
  Selection s;
  s.sizes = {10};
  s.routines = {"dgemv"};
  EXPECT_EQ(select(s).size(), 1U);
  s.routines = {"gemv"};
  EXPECT_EQ(select(s).size(), 4U);
  std::size_t of_levels = 0;
  for (const char *level : {"level1", "level2", "level3"}) {
    s.routines = {level};
    of_levels += select(s).size();
  }
  EXPECT_EQ(of_levels, routines.size());
  std::string unknown;
  s.routines = {"dgemv", "dfoo"};
  EXPECT_EQ(select_calls(s, unknown).size(), 1U);
  EXPECT_EQ(unknown, "dfoo");
}

TEST(Selection, a_routine_takes_the_words_that_it_knows) {
  Selection s;
  s.sizes = {10};
  s.routines = {"dgemv", "dtrmv", "dger"};
  s.letters = {"T", "LTU", "C"};
  const std::vector<Selected> calls = select(s);
  ASSERT_EQ(calls.size(), 3U);
  EXPECT_EQ(calls[0].problem.transa, 'T');
  EXPECT_EQ(calls[1].problem.uplo, 'L');
  EXPECT_EQ(calls[1].problem.transa, 'T');
  EXPECT_EQ(calls[1].problem.diag, 'U');
  EXPECT_EQ(calls[2].letters, "");
  s.letters = {"all"};
  EXPECT_EQ(select(s).size(), 2U + 8U + 1U);
}

TEST(Selection, sizes_are_square_and_shapes_go_to_routines_with_as_many_dimensions) {
  Selection s;
  s.routines = {"dgemm", "dgemv", "dsyrk"};
  s.sizes = {6};
  s.shapes = {{1, 2, 3}, {4, 5}};
  const std::vector<Selected> calls = select(s);
  ASSERT_EQ(calls.size(), 6U);
  EXPECT_EQ(calls[0].problem.m, 1);
  EXPECT_EQ(calls[0].problem.n, 2);
  EXPECT_EQ(calls[0].problem.k, 3);
  EXPECT_EQ(calls[1].problem.k, 6);
  EXPECT_EQ(calls[2].problem.m, 4);
  EXPECT_EQ(calls[2].problem.n, 5);
  EXPECT_EQ(calls[4].problem.n, 4);  // n x k
  EXPECT_EQ(calls[4].problem.k, 5);
}

TEST(Selection, bands_and_increments_multiply_where_a_routine_has_them) {
  Selection s;
  s.routines = {"dgbmv", "dgemm", "srotg"};
  s.sizes = {6, 7};
  s.bands = {1, 2, 3};
  s.increments = {1, -2};
  EXPECT_EQ(select(s).size(), 2U * 3U * 2U + 2U + 1U);
}

TEST(Selection, factors_are_the_routines_own_unless_given) {
  Selection s;
  s.sizes = {6};
  s.routines = {"dscal"};
  EXPECT_EQ(select(s)[0].problem.alpha.re, -1);
  s.alpha = qtb::calls::Scalar{3, 0};
  EXPECT_EQ(select(s)[0].problem.alpha.re, 3);
}

}  // namespace
