// The cuts of the parallel Level-3 routines beside gemm, without threads: every element of the result has exactly one
// owner, for every order up to 2000 and every team up to 64.

#include <gtest/gtest.h>

#include <algorithm>
#include <utility>
#include <vector>

#include "blas/thread/32e/level3/slabs.h"
#include "blas/thread/32e/level3/strips.h"
#include "blas/thread/32e/level3/syrk_tiles.h"

namespace qtb {
namespace {

constexpr QtbInt most_threads = 64, largest_n = 2000;

// ---- Slabs ----

TEST(Slabs, FollowOneAnotherFromFirstToLastInMultiplesOfTheUnit) {
  for (QtbInt team = 1; team <= most_threads; ++team)
    for (QtbInt extent = 0; extent <= largest_n; ++extent)
      for (const QtbInt unit : {1, 4, 8}) {
        QtbInt next = 0;
        for (QtbInt rank = 0; rank < team; ++rank) {
          const GemmRange slab = slab_of(extent, unit, team, rank);
          ASSERT_TRUE(slab.count == 0 || slab.first == next) << extent << " on " << team << " rank " << rank;
          ASSERT_TRUE(slab.first >= 0 && slab.first < std::max<QtbInt>(extent, 1)) << extent << " on " << team;
          ASSERT_TRUE(rank == team - 1 || slab.count == extent / team - extent / team % unit) << extent;
          next += slab.count;
        }
        ASSERT_EQ(next, extent) << "on " << team;
      }
}

TEST(Slabs, WithAShareOfZeroTheLastThreadHasAllAndTheOthersBeginInside) {
  for (QtbInt rank = 0; rank < 4; ++rank) {
    const GemmRange slab = slab_of(31, 8, 4, rank);
    EXPECT_EQ(slab.first, 0);
    EXPECT_EQ(slab.count, rank == 3 ? 31 : 0);
  }
}

TEST(Slabs, ColumnsOnTheLeftAndRowsOnTheRight) {
  EXPECT_EQ(slab_extent(true, 3, 5), 5);
  EXPECT_EQ(slab_extent(false, 3, 5), 3);
  EXPECT_EQ(slab_order(true, 3, 5), 3);
  EXPECT_EQ(slab_order(false, 3, 5), 5);
}

// ---- The diagonal and strips ----

TEST(Strips, BlocksFollowOneAnotherAndEachStripIsWhatIsBesideItsBlock) {
  for (QtbInt team = 1; team <= most_threads; ++team)
    for (QtbInt n = 1; n <= largest_n; ++n) {
      QtbInt next = 0;
      for (QtbInt p = 0; p < team; ++p) {
        const DiagonalBlock block = diagonal_block(n, team, p);
        ASSERT_EQ(block.first, next) << n << " on " << team;
        ASSERT_EQ(block.operand_row, std::min(block.first, n - 1));
        ASSERT_TRUE(p == team - 1 || block.rows == n / team);
        next += block.rows;
        if (p == team - 1) break;
        const GemmTile upper = strip_tile(n, team, p, true), lower = strip_tile(n, team, p, false);
        ASSERT_EQ(upper.row, block.first);
        ASSERT_EQ(upper.rows, block.rows);
        ASSERT_EQ(upper.column, next);
        ASSERT_EQ(upper.columns, n - next);
        ASSERT_TRUE(lower.row == upper.column && lower.rows == upper.columns && lower.column == upper.row &&
                    lower.columns == upper.rows);
      }
      ASSERT_EQ(next, n) << "on " << team;
    }
}

// ---- Tiles ----

// The pieces of a team by the thread that has them.
std::vector<std::vector<GemmTile>> pieces_of(const SyrkTiles &tiles, bool upper) {
  std::vector<std::vector<GemmTile>> all(static_cast<std::size_t>(tiles.team));
  for (QtbInt rank = 0; rank < tiles.team; ++rank)
    for_each_syrk_piece(tiles, upper, rank,
                        [&](const GemmTile &piece) { all[static_cast<std::size_t>(rank)].push_back(piece); });
  return all;
}

// The owner of each off-diagonal tile by counting: groups of 2*t - 1 in the order of the numbers, the first one the
// second thread's.
TEST(SyrkTiles, OwnersAreGroupsOfTilesThatFollowOneAnotherAndPairsOfTheDiagonal) {
  for (QtbInt team = 1; team <= most_threads; ++team) {
    const SyrkTiles tiles = syrk_tiles(8 * team, team);
    for (const bool upper : {false, true}) {
      QtbInt number = 0;
      for (QtbInt i = 0; i < 2 * team; ++i)
        for (QtbInt j = upper ? 0 : i + 1; j < (upper ? i : 2 * team); ++j)
          ASSERT_EQ(tiles.owner(upper, j, i), (number++ / (2 * team - 1) + 1) % team)
              << j << ' ' << i << " of " << team;
      ASSERT_EQ(number, team * (2 * team - 1));
      for (QtbInt j = 0; j < 2 * team; ++j) ASSERT_EQ(tiles.owner(upper, j, j), (j / 2 + 1) % team);
    }
  }
}

TEST(SyrkTiles, EachTileHasOneOwnerAndEachThreadTwiceTheTeamInArea) {
  for (QtbInt team = 1; team <= most_threads; ++team) {
    const QtbInt blocks = 2 * team;
    const SyrkTiles tiles = syrk_tiles(4 * blocks, team);  // all blocks of four
    for (const bool upper : {false, true}) {
      std::vector<int> owners(static_cast<std::size_t>(blocks * blocks));
      for (const std::vector<GemmTile> &pieces : pieces_of(tiles, upper)) {
        QtbInt halves = 0;
        for (const GemmTile &piece : pieces) {
          halves += piece.row == piece.column ? 1 : 2 * piece.rows / 4;
          ASSERT_EQ(piece.columns, 4);
          for (QtbInt row = piece.row; row < piece.row + piece.rows; row += 4)
            ++owners[static_cast<std::size_t>(row / 4 * blocks + piece.column / 4)];
        }
        ASSERT_EQ(halves, 2 * 2 * team) << "of a team of " << team;
      }
      for (QtbInt j = 0; j < blocks; ++j)
        for (QtbInt i = 0; i < blocks; ++i)
          ASSERT_EQ(owners[static_cast<std::size_t>(j * blocks + i)], (upper ? j <= i : j >= i)) << j << ' ' << i;
    }
  }
}

TEST(SyrkTiles, BlocksAreMultiplesOfFourAndTheLastOneHasTheRest) {
  for (QtbInt team = 1; team <= most_threads; ++team)
    for (QtbInt n = 0; n <= largest_n; ++n) {
      const SyrkTiles tiles = syrk_tiles(n, team);
      ASSERT_EQ(tiles.blocks, 2 * team);
      ASSERT_EQ(tiles.size, n / (2 * team) / 4 * 4);
      ASSERT_GE(tiles.last, tiles.size);
      ASSERT_EQ(tiles.first(tiles.blocks - 1) + tiles.last, n);
      ASSERT_EQ(tiles.rows(tiles.blocks - 1), tiles.last);
      ASSERT_TRUE(team == 1 || tiles.rows(0) == tiles.size);
      ASSERT_TRUE(n < 8 * team || tiles.size >= 4);
    }
}

TEST(SyrkTiles, EveryElementOfTheTriangleIsInOnePiece) {
  for (const QtbInt team : {2, 3, 4, 5, 7, 8, 16})
    for (QtbInt n = 8 * team; n <= std::max<QtbInt>(140, 8 * team + 9); n += 1 + n % 5)
      for (const bool upper : {false, true}) {
        std::vector<int> times(static_cast<std::size_t>(n * n));
        for (const std::vector<GemmTile> &pieces : pieces_of(syrk_tiles(n, team), upper))
          for (const GemmTile &piece : pieces)
            for (QtbInt i = piece.column; i < piece.column + piece.columns; ++i)
              for (QtbInt j = piece.row; j < piece.row + piece.rows; ++j)
                if (piece.row != piece.column || (upper ? j <= i : j >= i))
                  ++times[static_cast<std::size_t>(j * n + i)];
        for (QtbInt j = 0; j < n; ++j)
          for (QtbInt i = 0; i < n; ++i)
            ASSERT_EQ(times[static_cast<std::size_t>(j * n + i)], (upper ? j <= i : j >= i))
                << j << ' ' << i << " of " << n << " on " << team;
      }
}

// No two pieces of a thread could be one: they are not neighbours in a column but at the diagonal.
TEST(SyrkTiles, RunsAreMergedAsFarAsTheyGo) {
  for (QtbInt team = 2; team <= most_threads; ++team)
    for (const bool upper : {false, true})
      for (const std::vector<GemmTile> &pieces : pieces_of(syrk_tiles(8 * team + 3, team), upper))
        for (std::size_t p = 1; p < pieces.size(); ++p) {
          const GemmTile &a = pieces[p - 1], &b = pieces[p];
          ASSERT_TRUE(a.column < b.column || (a.column == b.column && a.row + a.rows <= b.row)) << "not in order";
          ASSERT_FALSE(a.column == b.column && a.row + a.rows == b.row && a.row != a.column && b.row != b.column)
              << team << " column " << a.column << " row " << b.row;
        }
}

TEST(SyrkTiles, ATeamOfTwoHasThreeTilesEachAndTwoOfTheDiagonal) {
  const SyrkTiles tiles = syrk_tiles(100, 2);
  const QtbInt diagonal[] = {1, 1, 0, 0};
  for (QtbInt j = 0; j < 4; ++j) EXPECT_EQ(tiles.owner(true, j, j), diagonal[j]);
  for (const bool upper : {false, true}) {
    QtbInt count[2] = {};
    for (QtbInt i = 0; i < 4; ++i)
      for (QtbInt j = upper ? 0 : i + 1; j < (upper ? i : 4); ++j) ++count[tiles.owner(upper, j, i)];
    EXPECT_EQ(count[0], 3);
    EXPECT_EQ(count[1], 3);
  }
}

TEST(SyrkTiles, HundredOnThreeThreads) {
  const SyrkTiles tiles = syrk_tiles(100, 3);
  EXPECT_EQ(tiles.blocks, 6);
  EXPECT_EQ(tiles.size, 16);
  EXPECT_EQ(tiles.last, 20);
}

TEST(SyrkTiles, ThirtyTwoOnFourThreadsHasEightBlocksOfFour) {
  const SyrkTiles tiles = syrk_tiles(32, 4);
  EXPECT_EQ(tiles.blocks, 8);
  EXPECT_EQ(tiles.size, 4);
  EXPECT_EQ(tiles.last, 4);
}

// 35 rows on two threads: blocks of 8 and a last one of 11. Lower, by columns: thread 1 has rows 8 to 34 of the first
// column, thread 0 the rest.
TEST(SyrkTiles, ARunToTheLastBlockIsTallerAndTheLastTileOfTheDiagonalLarger) {
  const auto pieces = pieces_of(syrk_tiles(35, 2), false);
  const auto has = [&](std::size_t rank, const GemmTile &want) {
    return std::any_of(pieces[rank].begin(), pieces[rank].end(), [&](const GemmTile &p) {
      return p.row == want.row && p.rows == want.rows && p.column == want.column && p.columns == want.columns;
    });
  };
  EXPECT_TRUE(has(1, {8, 27, 0, 8}));
  EXPECT_TRUE(has(0, {16, 19, 8, 8}));
  EXPECT_TRUE(has(0, {24, 11, 16, 8}));
  EXPECT_TRUE(has(0, {24, 11, 24, 11}));
}

}  // namespace
}  // namespace qtb
