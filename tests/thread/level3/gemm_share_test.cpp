// The shares of a parallel GEMM by value: edges, and for every small extent and team, that the shares of a cut neither
// overlap nor leave anything out.

#include "blas/thread/32e/level3/gemm_share.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <vector>

namespace qtb {
namespace {

void expect_range(GemmRange got, QtbInt first, QtbInt count) {
  EXPECT_EQ(got.first, first);
  EXPECT_EQ(got.count, count);
}

void expect_tile(GemmTile got, QtbInt row, QtbInt rows, QtbInt column, QtbInt columns) {
  EXPECT_EQ(got.row, row);
  EXPECT_EQ(got.rows, rows);
  EXPECT_EQ(got.column, column);
  EXPECT_EQ(got.columns, columns);
}

// ---- By value ----

TEST(GemmShare, RangesAreEqualButTheLast) {
  for (QtbInt i = 0; i < 3; ++i) expect_range(gemm_range(7, 4, i), i, 1);
  expect_range(gemm_range(7, 4, 3), 3, 4);
  // Fewer than threads all go to the last; addresses stay inside.
  for (QtbInt i = 0; i < 4; ++i) expect_range(gemm_range(3, 5, i), 0, 0);
  expect_range(gemm_range(3, 5, 4), 0, 3);
  expect_range(gemm_range(9, 1, 0), 0, 9);
}

TEST(GemmShare, GridRunsDownItsColumnsAndTheLastTakeTheRest) {
  EXPECT_EQ(gemm_grid_columns, 4);
  // 2 rows of 8 and 13, 3 columns of 4, 4 and 9.
  expect_tile(gemm_grid_tile(21, 17, 2, 3, 4, 4, 0), 0, 8, 0, 4);
  expect_tile(gemm_grid_tile(21, 17, 2, 3, 4, 4, 1), 8, 13, 0, 4);
  expect_tile(gemm_grid_tile(21, 17, 2, 3, 4, 4, 5), 8, 13, 8, 9);
  // Less than a unit a thread all goes to the last.
  expect_tile(gemm_grid_tile(40, 15, 2, 4, 4, 4, 5), 20, 20, 0, 0);
  expect_tile(gemm_grid_tile(40, 15, 2, 4, 4, 4, 6), 0, 20, 0, 15);
  expect_tile(gemm_grid_tile(7, 16, 2, 2, 4, 4, 1), 0, 7, 0, 8);
  // Blocks cut columns anywhere.
  expect_tile(gemm_grid_tile(16, 17, 2, 3, 8, 1, 2), 0, 8, 5, 5);
}

TEST(GemmShare, PlacesOfAPassTakeEqualSharesAndTheLastTheRest) {
  EXPECT_EQ(gemm_place_share(100, 3, 8), 32);
  EXPECT_EQ(gemm_place_share(95, 3, 8), 24);
  EXPECT_EQ(gemm_place_share(-100, 3, 8), 0);
  expect_range(gemm_place(100, 32, 3, 1), 32, 32);
  expect_range(gemm_place(100, 32, 3, 2), 64, 36);
  for (QtbInt p = 0; p < 3; ++p) expect_range(gemm_place(-100, 0, 3, p), 0, 0);
}

TEST(GemmShare, RowsAndPairsHaveWholeTilesAndTheLastTheRest) {
  // 31 / 3 is 10, of which 8 are whole tiles.
  expect_range(gemm_rows(31, 3, 4, 1), 8, 8);
  expect_range(gemm_rows(31, 3, 4, 2), 16, 15);
  expect_range(gemm_rows(11, 3, 4, 2), 0, 11);
  const GemmPairs pairs = gemm_pairs(27, 23, 3, 4, 2);
  EXPECT_EQ(pairs.rows, 12);
  EXPECT_EQ(pairs.share, 6);
  EXPECT_EQ(pairs.last, 11);
  EXPECT_EQ(multiple_above(5, 4), 8);
  EXPECT_EQ(multiple_above(4, 4), 4);
}

TEST(GemmShare, ExtentsBeyondThirtyTwoBitsDoNotWrap) {
  const QtbInt n = QtbInt{5} << 32;
  expect_range(gemm_range(n + 3, 4, 3), n / 4 * 3, n / 4 + 3);
  expect_range(gemm_rows(n + 3, 4, 4, 3), n / 4 * 3, n / 4 + 3);
}

// ---- All small extents on all teams ----

constexpr QtbInt largest_extent = 80, largest_team = 64;
constexpr QtbInt units[] = {1, 2, 4, 8};

// Ranges that begin where the one before ends, from 0 to the extent; empty ones lie anywhere in it.
class Coverage {
 public:
  explicit Coverage(QtbInt extent) : extent_(extent) {}
  void take(GemmRange range) {
    ASSERT_GE(range.count, 0);
    ASSERT_GE(range.first, 0);
    ASSERT_LT(range.first, extent_);
    if (range.count == 0) return;
    ASSERT_EQ(range.first, end_);
    end_ += range.count;
  }
  void expect_whole() const { ASSERT_EQ(end_, extent_); }

 private:
  QtbInt extent_, end_ = 0;
};

TEST(GemmShare, EveryRangeIsCoveredOnce) {
  for (QtbInt n = 1; n <= largest_extent; ++n)
    for (QtbInt t = 1; t <= largest_team; ++t) {
      SCOPED_TRACE(testing::Message() << n << " on " << t);
      Coverage coverage(n);
      for (QtbInt i = 0; i < t; ++i) {
        const GemmRange range = gemm_range(n, t, i);
        ASSERT_NO_FATAL_FAILURE(coverage.take(range));
        if (i < t - 1) {
          ASSERT_EQ(range.count, n / t);
        }
      }
      ASSERT_NO_FATAL_FAILURE(coverage.expect_whole());
    }
}

TEST(GemmShare, EveryCutIntoRowsIsCoveredOnceInWholeTiles) {
  for (const QtbInt mu : units)
    for (QtbInt m = 1; m <= largest_extent; ++m)
      for (QtbInt t = 1; t <= largest_team; ++t) {
        SCOPED_TRACE(testing::Message() << m << " on " << t << " in tiles of " << mu);
        Coverage coverage(m);
        for (QtbInt i = 0; i < t; ++i) {
          const GemmRange range = gemm_rows(m, t, mu, i);
          ASSERT_NO_FATAL_FAILURE(coverage.take(range));
          ASSERT_EQ(range.first % mu, 0);
          if (i < t - 1) {
            ASSERT_EQ(range.count, m / t / mu * mu);
          }
        }
        ASSERT_NO_FATAL_FAILURE(coverage.expect_whole());
      }
}

TEST(GemmShare, EveryPassOverPlacesIsCoveredOnceInWholeUnits) {
  for (const QtbInt unit : units)
    for (QtbInt width = 1; width <= largest_extent; ++width)
      for (QtbInt places = 1; places <= largest_team; ++places) {
        SCOPED_TRACE(testing::Message() << width << " in " << places << " places of " << unit);
        const QtbInt share = gemm_place_share(width, places, unit);
        ASSERT_EQ(share, width / places / unit * unit);
        Coverage coverage(width);
        for (QtbInt p = 0; p < places; ++p) ASSERT_NO_FATAL_FAILURE(coverage.take(gemm_place(width, share, places, p)));
        ASSERT_NO_FATAL_FAILURE(coverage.expect_whole());
      }
}

TEST(GemmShare, EveryGridCoversEveryTileOnce) {
  for (const QtbInt mu : {QtbInt{1}, QtbInt{4}})
    for (QtbInt t = 1; t <= largest_team; ++t)
      for (QtbInt rows = 1; rows <= t; ++rows) {
        if (t % rows != 0) continue;
        for (QtbInt m = 1; m <= largest_extent; m += 1 + m / 9)
          for (QtbInt n = 1; n <= largest_extent; n += 1 + n / 9) {
            SCOPED_TRACE(testing::Message() << m << " x " << n << " on " << rows << " x " << t / rows);
            std::vector<int> covered(static_cast<std::size_t>(m * n));
            for (QtbInt i = 0; i < t; ++i) {
              const GemmTile tile = gemm_grid_tile(m, n, rows, t / rows, mu, gemm_grid_columns, i);
              ASSERT_GE(tile.rows, 0);
              ASSERT_GE(tile.columns, 0);
              ASSERT_LE(tile.row + tile.rows, m);
              ASSERT_LE(tile.column + tile.columns, n);
              ASSERT_EQ(tile.row % mu, 0);
              ASSERT_EQ(tile.column % gemm_grid_columns, 0);
              for (QtbInt c = tile.column; c < tile.column + tile.columns; ++c)
                for (QtbInt r = tile.row; r < tile.row + tile.rows; ++r) ++covered[static_cast<std::size_t>(r + c * m)];
            }
            ASSERT_TRUE(std::all_of(covered.begin(), covered.end(), [](int times) { return times == 1; }));
          }
      }
}

TEST(GemmShare, EveryCutIntoPairsIsWhole) {
  for (const QtbInt mu : units)
    for (const QtbInt nu : units)
      for (QtbInt m = 1; m <= largest_extent; ++m)
        for (QtbInt n = 1; n <= largest_extent; ++n)
          for (QtbInt pairs = 1; pairs <= largest_team / 2; ++pairs) {
            const GemmPairs cut = gemm_pairs(m, n, pairs, mu, nu);
            ASSERT_EQ(cut.rows, m / 2 / mu * mu);
            ASSERT_EQ(cut.share, n / pairs / nu * nu);
            ASSERT_EQ((pairs - 1) * cut.share + cut.last, n);
            ASSERT_GE(cut.last, cut.share);
          }
}

}  // namespace
}  // namespace qtb
