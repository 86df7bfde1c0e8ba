// The list of slots and its table: which slots there are, which tiers have them, and what stands in them.

#include <gtest/gtest.h>

#include <set>
#include <string>

#include "blas/dispatch/slots.h"

namespace qtb::test {
namespace {

using namespace tier_set;
using Names = std::set<std::string>;

Names words(const char *text) {
  Names names;
  std::string word;
  for (const char *c = text;; ++c) {
    if (*c != ' ' && *c != 0) {
      word += *c;
      continue;
    }
    if (!word.empty()) names.insert(word);
    word.clear();
    if (*c == 0) return names;
  }
}

Names all_slots() {
  Names names;
  for (const SlotTargets &slot : slot_targets) names.insert(slot.name);
  return names;
}

int slots_with(unsigned tiers) {
  int count = 0;
  for (const SlotTargets &slot : slot_targets) count += (slot.tiers & ALL) == tiers;
  return count;
}

// The exported routines whose kernels are reached by a plain slot.
const char *const routine_slots =
    "caxpyi cdotci cdotu cdotui cgbmv cgerc cgeru cgthr cgthrz chbmv chemv cher cher2 chpmv chpr chpr2 crotg cscal "
    "csctr csscal ctbmv ctbsv ctpmv ctpsv ctrsv dasum daxpyi dcabs1 ddoti dgbmv dger dgthr dgthrz dnrm2 drotg droti "
    "drotm drotmg dsbmv dscal dsctr dsdot dspmv dspr dspr2 dtbmv dtbsv dtpmv dtpsv dtrsv dzasum dznrm2 icamax icamin "
    "idamax idamin isamax isamin izamax izamin sasum saxpyi scasum scnrm2 sdoti sdsdot sgbmv sger sgthr sgthrz snrm2 "
    "srotg sroti srotm srotmg ssbmv sscal ssctr sspmv sspr sspr2 stbmv stbsv stpmv stpsv strsv zaxpyi zdotc zdotci "
    "zdotu zdotui zdscal zgbmv zgerc zgeru zgthr zgthrz zhbmv zhemv zher zher2 zhpmv zhpr zhpr2 zrotg zscal zsctr "
    "ztbmv ztbsv ztpmv ztpsv ztrsv caxpy ccopy cdotc";

// The vector routines behind a front end, apart from the last three above.
const char *const front_end_slots =
    "csrot cswap daxpy dcopy ddot drot dswap saxpy scopy sdot srot sswap zaxpy zcopy zdrot zswap";

TEST(SlotList, Holds250SlotsOfDifferentNames) {
  EXPECT_EQ(slot_count, 250);
  EXPECT_EQ(all_slots().size(), 250U);
}

TEST(SlotList, HasTheRoutinesThatArePlainSlots) {
  const Names names = words(routine_slots), slots = all_slots();
  EXPECT_EQ(names.size(), 115U);
  for (const std::string &name : names) EXPECT_EQ(slots.count(name), 1U) << name;
}

TEST(SlotList, HasTheVectorRoutinesBehindFrontEnds) {
  const Names names = words(front_end_slots), slots = all_slots();
  EXPECT_EQ(names.size(), 16U);
  for (const std::string &name : names) EXPECT_EQ(slots.count(name), 1U) << name;
}

TEST(SlotList, TheRoutesOfTheEntriesNameThePlainSlots) {
  Names routed = {"caxpy", "ccopy", "cdotc"};
#define QTB_NAMED_SLOT(name) routed.insert(#name);
#define QTB_NAMED_CHECK_SLOT(name) QTB_NAMED_SLOT(name)
#define QTB_NAMED_DRIVER(name)
#define QTB_NAMED_CHECK_DRIVER(name)
#define QTB_ROUTINE(name, NAME, shape, T, route) QTB_NAMED_##route(name)
#include "blas/routines.def"
#undef QTB_ROUTINE
  EXPECT_EQ(routed, words(routine_slots));
}

TEST(SlotList, EverySlotOfARoutineIsInAllTiers) {
  const Names routines = words((std::string(routine_slots) + " " + front_end_slots).c_str());
  for (const SlotTargets &slot : slot_targets)
    EXPECT_TRUE(routines.count(slot.name) == 0 || (slot.tiers & ALL) == ALL) << slot.name;
}

TEST(SlotList, TheSetsOfTiersHaveTheirSizes) {
  EXPECT_EQ(slots_with(ALL), 185);
  EXPECT_EQ(slots_with(SSSE3), 32);
  EXPECT_EQ(slots_with(PIECES), 27);
  EXPECT_EQ(PIECES, SSSE3 | SSE42 | AVX)
      << "a tier that is said to have the building blocks, or not to, is written here";
  EXPECT_EQ(slots_with(DEF), 4);
  EXPECT_EQ(slots_with(SSE42), 1);
  EXPECT_EQ(slots_with(SSSE3 | SSE42), 1);
}

TEST(SlotTable, ATierThatLacksASlotHasTheEmptyRoutineInItAndNoOther) {
  for (const SlotTargets &slot : slot_targets)
    for (int tier = 0; tier < tier_count; ++tier)
      EXPECT_EQ(slot.target[tier] == &qtb_blas_noop, (slot.tiers >> tier & 1) == 0) << slot.name << " tier " << tier;
}

TEST(SlotTable, TheTwoHighestTiersShareSscal) {
  EXPECT_EQ(slot_targets[slot_sscal].target[tier_avx], slot_targets[slot_sscal].target[tier_sse42]);
}

TEST(SlotTable, AllOtherTargetsAreRoutinesOfTheirOwn) {
  std::set<CodePointer> seen;
  int targets = 0;
  for (const SlotTargets &slot : slot_targets)
    for (int tier = 0; tier < tier_count; ++tier) {
      if (slot.target[tier] == &qtb_blas_noop) continue;
      if (&slot == &slot_targets[slot_sscal] && tier == tier_avx) continue;
      ASSERT_NE(slot.target[tier], nullptr) << slot.name;
      EXPECT_TRUE(seen.insert(slot.target[tier]).second) << slot.name << " tier " << tier;
      ++targets;
    }
  std::printf("%d targets\n", targets);
}

}  // namespace
}  // namespace qtb::test
