// The table of pass lengths and alignment treatments of the basic vector kernels, against a second transcription. A
// length that slipped changes no result and no other test would tell.

#include <gtest/gtest.h>

#include <map>
#include <sstream>
#include <string>

// The table holds all tiers and can be read in any tier's build.
#define QTB_TIER def
#include "blas/kernels/level1/tuning.h"

namespace {

using namespace qtb::def;

// Elements per pass: operands in the same phase, in different phases, with increments; "-" for no such loop. Then what
// is done about different phases and, where short vectors go singly, the length from which on they do not.
constexpr char transcription[] = R"(
  routine  def                     sse3                    ssse3                   sse42_and_avx
  ddot     16,8,2,halves           32,8,2,halves           32,32,4,rejoin          32,32,1,no_peel
  sdot     32,1,1,singles          32,1,1,singles          32,32,4,halves          64,64,1,no_peel
  daxpy    16,8,2,halves           16,8,2,halves           64,32,4,rejoin          64,32,4,unaligned
  saxpy    8,8,2,unaligned         8,8,2,unaligned         64,64,2,rejoin          64,64,2,no_peel
  dcopy    8,8,2,halves,9          8,-,1,singles           32,32,4,rejoin          32,32,4,unaligned
  scopy    32,32,1,halves_at_8     32,32,1,halves_at_8     32,32,1,halves_at_8     32,32,1,no_peel
  dswap    8,8,2,halves,9          8,-,1,singles           32,16,4,rejoin          32,16,4,unaligned
  sswap    32,32,5,scalar_moves    32,32,5,scalar_moves    32,32,5,scalar_moves    32,32,5,scalar_moves
  cswap    16,16,4,unaligned       16,16,4,unaligned       16,16,4,unaligned       16,16,4,unaligned
  zswap    1,1,1,singles           1,1,1,singles           1,1,1,singles           1,1,1,singles
  dscal    8,-,1,one_operand       16,-,1,one_operand      32,-,4,one_operand      32,-,4,one_operand
  sscal    8,-,2,one_operand,11    8,-,2,one_operand,11    8,-,2,one_operand,11    64,-,1,no_peel,11
  cscal    24,-,1,one_operand      24,-,1,one_operand      16,-,2,one_operand      16,-,1,no_peel
  zscal    8,-,1,one_operand       16,-,1,one_operand      16,-,4,one_operand      8,-,1,no_peel
  caxpy    16,16,4,unaligned       16,16,4,unaligned       32,16,4,rejoin          64,64,1,no_peel
  zaxpy    8,8,4,unaligned         16,8,2,unaligned        16,8,4,rejoin           32,32,1,no_peel
  cdot     16,2,1,unaligned        16,16,4,unaligned       32,16,4,rejoin          32,32,1,no_peel
  zdot     8,1,1,singles           64,16,4,unaligned       16,8,4,rejoin           16,16,1,no_peel
)";

#define QTB_WORD(word) \
  { word, #word }
const std::map<Treatment, std::string> treatments = {QTB_WORD(singles),     QTB_WORD(scalar_moves), QTB_WORD(halves),
                                                     QTB_WORD(halves_at_8), QTB_WORD(unaligned),    QTB_WORD(rejoin),
                                                     QTB_WORD(no_peel),     QTB_WORD(one_operand)};
const std::map<std::string, Row> rows = {
#define QTB_NAMED(routine) \
  { #routine, row_##routine }
    QTB_NAMED(ddot),  QTB_NAMED(sdot),  QTB_NAMED(daxpy), QTB_NAMED(saxpy), QTB_NAMED(dcopy), QTB_NAMED(scopy),
    QTB_NAMED(dswap), QTB_NAMED(sswap), QTB_NAMED(cswap), QTB_NAMED(zswap), QTB_NAMED(dscal), QTB_NAMED(sscal),
    QTB_NAMED(cscal), QTB_NAMED(zscal), QTB_NAMED(caxpy), QTB_NAMED(zaxpy), QTB_NAMED(cdot),  QTB_NAMED(zdot)};

// An entry of the table as the transcription writes it.
std::string text_of(const Tuning &sizes) {
  std::ostringstream text;
  const auto length = [](QtbInt n) { return n == 0 ? std::string("-") : std::to_string(n); };
  text << length(sizes.same) << ',' << length(sizes.different) << ',' << length(sizes.strided) << ','
       << treatments.at(sizes.treatment);
  if (sizes.short_limit != 0) text << ',' << sizes.short_limit;
  return text.str();
}

TEST(tuning_table, agrees_with_its_second_transcription) {
  std::istringstream text(transcription);
  std::string line, name, cell;
  std::size_t found = 0;
  while (std::getline(text, line)) {
    std::istringstream words(line);
    if (!(words >> name) || name == "routine") continue;
    ++found;
    int column = 0;
    for (; words >> cell; ++column)
      EXPECT_EQ(text_of(tuning_table[rows.at(name)][column]), cell) << name << ' ' << column;
    EXPECT_EQ(column, 4) << name;
  }
  EXPECT_EQ(found, std::size_t{row_count});
  EXPECT_EQ(rows.size(), std::size_t{row_count});
}

}  // namespace
