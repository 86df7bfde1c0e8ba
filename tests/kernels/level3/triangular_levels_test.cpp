// What trmm and trsm decide, by value: the tables of their levels, where a walk enters, the order of its blocks, and
// whether the product beside a block comes first.
#include <gtest/gtest.h>

#include <string>

#include "blas/kernels/level3/triangular/levels.h"
#include "tests/support/tiers.h"

namespace qtb::test {
namespace {

using levels::Entry, levels::LevelPlan, levels::LevelRow, levels::Routine, levels::Sse41, levels::whole;

const LevelRow *find(Routine routine, char side, char kind, int tier, Sse41 sse41) {
  const LevelRow *found = nullptr;
  for (const LevelRow &row : levels::level_rows)
    if (row.routine == routine && row.side == side && std::string(row.kinds).find(kind) != std::string::npos &&
        (row.tiers >> tier & 1U) != 0 && (row.sse41 == Sse41::any || row.sse41 == sse41)) {
      EXPECT_EQ(found, nullptr) << "two rows";
      found = &row;
    }
  return found;
}

// "256/128/64 step 1000 from 1": the blocks, the step and the level of entry; in brackets where nothing deeper follows.
std::string plan(Routine routine, char side, char kind, int tier, Sse41 sse41, QtbInt m, QtbInt n) {
  const LevelRow *row = find(routine, side, kind, tier, sse41);
  if (row == nullptr) return "none";
  const LevelPlan p = levels::plan_levels(*row, m, n);
  std::string text;
  for (int level = 0; level < row->count; level++) text += (level > 0 ? "/" : "") + std::to_string(p.tri_block[level]);
  text +=
      " step " + std::to_string(p.other_block) + " from " + std::to_string(p.entry) + " to " + std::to_string(p.last);
  return text;
}

// The level of entry for each extent of the triangle, as "extent:level" where it changes, from 1 to 3000.
std::string entries(Routine routine, char side, char kind, int tier, Sse41 sse41 = Sse41::present) {
  const LevelRow *row = find(routine, side, kind, tier, sse41);
  if (row == nullptr) return "none";
  std::string text;
  QtbInt before = -1;
  for (QtbInt t = 1; t <= 3000; t++) {
    const QtbInt level = levels::plan_levels(*row, side == 'L' ? t : 100, side == 'L' ? 100 : t).entry;
    if (level != before) text += (text.empty() ? "" : " ") + std::to_string(t) + ":" + std::to_string(level);
    before = level;
  }
  return text;
}

constexpr int from_sse42[] = {tier_sse42, tier_avx};

TEST(TriangularLevels, TheTablesOfProducts) {
  for (const int tier : from_sse42)
    for (const Sse41 sse41 : {Sse41::present, Sse41::absent}) {
      const auto of = [&](char side, char kind) { return plan(Routine::trmm, side, kind, tier, sse41, 3000, 3000); };
      EXPECT_EQ(of('L', 'd'), "256/128/64 step 1000 from 0 to 2");
      EXPECT_EQ(of('L', 's'), "256/64/16 step 1000 from 0 to 2");
      EXPECT_EQ(of('L', 'c'), "256/32/8 step 1000 from 0 to 2");
      EXPECT_EQ(of('L', 'z'), "256/32/8 step 1000 from 0 to 2");
      EXPECT_EQ(of('R', 'd'), "256/64/16 step -1 from 0 to 2");
      EXPECT_EQ(of('R', 's'), "256/64/16 step -1 from 0 to 2");
      EXPECT_EQ(of('R', 'c'), "256/32/8 step -1 from 0 to 2");
      EXPECT_EQ(of('R', 'z'), "256/32/8 step -1 from 0 to 2");
    }
}

TEST(TriangularLevels, TheTablesOfSolves) {
  for (const int tier : from_sse42)
    for (const Sse41 sse41 : {Sse41::present, Sse41::absent}) {
      const auto of = [&](char side, char kind, QtbInt m) {
        return plan(Routine::trsm, side, kind, tier, sse41, m, 3000);
      };
      EXPECT_EQ(of('L', 'd', 3000), "128/32 step 1000 from 0 to 1");
      EXPECT_EQ(of('L', 's', 3000), "256/64/16 step 1000 from 0 to 2");
      EXPECT_EQ(of('L', 'z', 3000), "256/64/16 step 1000 from 0 to 2");
      EXPECT_EQ(of('L', 'c', 3000), "256/32/8 step 1000 from 0 to 2");
      EXPECT_EQ(of('R', 'd', 1999), "128/32 step 512 from 0 to 1");
      EXPECT_EQ(of('R', 'd', 2000), "256/32 step 512 from 0 to 1");
      EXPECT_EQ(of('R', 's', 1999), "128/64/16 step 512 from 0 to 2");
      EXPECT_EQ(of('R', 's', 2001), "256/64/16 step 512 from 0 to 2");
      EXPECT_EQ(of('R', 'c', 1), "128/64/16 step 512 from 0 to 2");
      EXPECT_EQ(of('R', 'c', 2000), "256/64/16 step 512 from 0 to 2");
      EXPECT_EQ(of('R', 'z', 1999), "128/32/8 step 512 from 0 to 2");
      EXPECT_EQ(of('R', 'z', 2000), "256/32/8 step 512 from 0 to 2");
    }
}

TEST(TriangularLevels, TheTablesOfSsse3DependOnSse41InSolvesOnly) {
  for (const char kind : {'s', 'd', 'c', 'z'}) {
    for (const Sse41 sse41 : {Sse41::present, Sse41::absent})
      for (const char side : {'L', 'R'})
        for (const QtbInt t : {1, 127, 128, 129, 3000})
          EXPECT_EQ(plan(Routine::trmm, side, kind, tier_ssse3, sse41, t, t), "128 step -1 from 0 to 0");
    const auto solve = [&](char side, Sse41 sse41, QtbInt m, QtbInt n) {
      return plan(Routine::trsm, side, kind, tier_ssse3, sse41, m, n);
    };
    EXPECT_EQ(solve('L', Sse41::present, 129, 5), "128/32 step 1000 from 0 to 1");
    EXPECT_EQ(solve('L', Sse41::present, 127, 5), "128/32 step 1000 from 1 to 1");
    EXPECT_EQ(solve('R', Sse41::present, 5, 3000), "128/32 step 1000 from 0 to 1");
    EXPECT_EQ(solve('R', Sse41::present, 2000, 3000), "256/32 step 1000 from 0 to 1");
    EXPECT_EQ(solve('R', Sse41::absent, 1999, 3000), "128/32 step 512 from 0 to 1");
    // One of two sizes, and no walk inside a block.
    EXPECT_EQ(solve('L', Sse41::absent, 129, 5), "128/32 step -1 from 0 to 0");
    EXPECT_EQ(solve('L', Sse41::absent, 128, 5), "128/32 step -1 from 1 to 1");
    EXPECT_EQ(solve('L', Sse41::absent, 1, 5), "128/32 step -1 from 1 to 1");
  }
}

TEST(TriangularLevels, TheLowTiersHaveNone) {
  for (const int tier : {tier_def, tier_sse3})
    for (const Routine routine : {Routine::trmm, Routine::trsm})
      for (const char side : {'L', 'R'})
        for (const char kind : {'s', 'd', 'c', 'z'})
          EXPECT_EQ(find(routine, side, kind, tier, Sse41::present), nullptr) << side << kind;
}

// From the left a triangle enters at the first level whose block it fills, from the right at the first whose block it
// exceeds; a smaller one at the first level.
TEST(TriangularLevels, WhereAWalkEnters) {
  for (const int tier : from_sse42) {
    EXPECT_EQ(entries(Routine::trmm, 'L', 'd', tier), "1:0 64:2 128:1 256:0");
    EXPECT_EQ(entries(Routine::trmm, 'L', 's', tier), "1:0 16:2 64:1 256:0");
    EXPECT_EQ(entries(Routine::trmm, 'L', 'c', tier), "1:0 8:2 32:1 256:0");
    EXPECT_EQ(entries(Routine::trmm, 'L', 'z', tier), "1:0 8:2 32:1 256:0");
    EXPECT_EQ(entries(Routine::trmm, 'R', 'd', tier), "1:0 17:2 65:1 257:0");
    EXPECT_EQ(entries(Routine::trmm, 'R', 's', tier), "1:0 17:2 65:1 257:0");
    EXPECT_EQ(entries(Routine::trmm, 'R', 'c', tier), "1:0 9:2 33:1 257:0");
    EXPECT_EQ(entries(Routine::trmm, 'R', 'z', tier), "1:0 9:2 33:1 257:0");
    EXPECT_EQ(entries(Routine::trsm, 'L', 'd', tier), "1:0 32:1 128:0");
    EXPECT_EQ(entries(Routine::trsm, 'L', 's', tier), "1:0 16:2 64:1 256:0");
    EXPECT_EQ(entries(Routine::trsm, 'L', 'z', tier), "1:0 16:2 64:1 256:0");
    EXPECT_EQ(entries(Routine::trsm, 'L', 'c', tier), "1:0 8:2 32:1 256:0");
    EXPECT_EQ(entries(Routine::trsm, 'R', 'd', tier), "1:0 33:1 129:0");
    EXPECT_EQ(entries(Routine::trsm, 'R', 's', tier), "1:0 17:2 65:1 129:0");
    EXPECT_EQ(entries(Routine::trsm, 'R', 'c', tier), "1:0 17:2 65:1 129:0");
    EXPECT_EQ(entries(Routine::trsm, 'R', 'z', tier), "1:0 9:2 33:1 129:0");
  }
  EXPECT_EQ(entries(Routine::trsm, 'L', 'd', tier_ssse3), "1:0 32:1 128:0");
  EXPECT_EQ(entries(Routine::trsm, 'R', 'd', tier_ssse3), "1:0 33:1 129:0");
  EXPECT_EQ(entries(Routine::trsm, 'L', 'd', tier_ssse3, Sse41::absent), "1:1 129:0");
  EXPECT_EQ(entries(Routine::trsm, 'R', 'd', tier_ssse3, Sse41::absent), "1:0 33:1 129:0");
}

// Left or right, upper or lower, as it is or transposed: true is from the first block to the last.
TEST(TriangularLevels, TheOrderOfTheBlocks) {
  struct Row {
    bool left, upper, not_trans, product_up;
  };
  constexpr Row rows[] = {
      {true, true, true, true},   {true, true, false, false}, {true, false, true, false}, {true, false, false, true},
      {false, true, true, false}, {false, true, false, true}, {false, false, true, true}, {false, false, false, false},
  };
  for (const Row &row : rows) {
    EXPECT_EQ(levels::walks_up(Routine::trmm, row.left, row.upper, row.not_trans), row.product_up);
    EXPECT_EQ(levels::walks_up(Routine::trsm, row.left, row.upper, row.not_trans), !row.product_up);
  }
}

TEST(TriangularLevels, WhetherTheProductBesideABlockComesFirstDependsOnTheTranspositionAlone) {
  EXPECT_TRUE(levels::gemm_comes_first(Routine::trmm, true, true));
  EXPECT_FALSE(levels::gemm_comes_first(Routine::trmm, true, false));
  EXPECT_FALSE(levels::gemm_comes_first(Routine::trmm, false, true));
  EXPECT_TRUE(levels::gemm_comes_first(Routine::trmm, false, false));
  EXPECT_FALSE(levels::gemm_comes_first(Routine::trsm, true, true));
  EXPECT_TRUE(levels::gemm_comes_first(Routine::trsm, true, false));
  EXPECT_TRUE(levels::gemm_comes_first(Routine::trsm, false, true));
  EXPECT_FALSE(levels::gemm_comes_first(Routine::trsm, false, false));
}

TEST(TriangularLevels, WhatACallAsksOfTheMemoryService) {
  const auto request = [](Routine routine, int tier) {
    std::string text;
    for (const levels::BufferRow &row : levels::buffer_rows)
      if (row.routine == routine && (row.tiers >> tier & 1U) != 0)
        text += std::to_string(row.mb) + " " + std::to_string(row.nb) + " " + std::to_string(row.kb);
    return text;
  };
  for (const int tier : from_sse42) EXPECT_EQ(request(Routine::trmm, tier), "640 1000 128");
  EXPECT_EQ(request(Routine::trmm, tier_ssse3), "512 1000 128");
  for (const int tier : {tier_ssse3, tier_sse42, tier_avx}) EXPECT_EQ(request(Routine::trsm, tier), "512 1000 256");
}

}  // namespace
}  // namespace qtb::test
