// The cuts of the parallel Level-2 routines, without threads: every element of the result has exactly one owner, for
// every order up to 3000 and every team up to 64.

#include <gtest/gtest.h>

#include <vector>

#include "blas/thread/32e/level2/gemv_share.h"
#include "blas/thread/32e/level2/l2_share.h"

namespace qtb {
namespace {

constexpr QtbInt most_threads = 64, largest_n = 3000;

// Shares that follow one another from 0 to n, in multiples of unit but for the last; empty ones start inside.
template <class ShareOf>
void expect_one_owner(QtbInt n, QtbInt threads, QtbInt unit, ShareOf share_of) {
  QtbInt next = 0;
  for (QtbInt rank = 0; rank < threads; ++rank) {
    const Level1Share share = share_of(rank);
    ASSERT_GE(share.len, 0) << n << " on " << threads << " rank " << rank;
    ASSERT_TRUE(share.start >= 0 && share.start < n) << n << " on " << threads << " rank " << rank;
    ASSERT_TRUE(share.len == 0 || share.start == next) << n << " on " << threads << " rank " << rank;
    ASSERT_TRUE(rank == threads - 1 || share.len % unit == 0) << n << " on " << threads << " rank " << rank;
    next += share.len;
  }
  ASSERT_EQ(next, n) << "on " << threads;
}

// ---- gemv ----

TEST(GemvShare, EveryElementOfTheResultHasOneOwner) {
  for (QtbInt threads = 1; threads <= most_threads; ++threads)
    for (QtbInt n = 1; n <= largest_n; ++n) {
      expect_one_owner(n, threads, 8, [&](QtbInt r) { return gemv_share(GemvSplit::rows, n, 5, threads, r); });
      expect_one_owner(n, threads, 1, [&](QtbInt r) { return gemv_share(GemvSplit::columns, 5, n, threads, r); });
    }
}

TEST(GemvShare, ThousandRowsOnFourThreadsAndThousandColumnsOnThree) {
  for (QtbInt rank = 0; rank < 4; ++rank)
    EXPECT_EQ(gemv_share(GemvSplit::rows, 1000, 13, 4, rank).len, rank == 3 ? 256 : 248);
  for (QtbInt rank = 0; rank < 3; ++rank)
    EXPECT_EQ(gemv_share(GemvSplit::columns, 100, 1000, 3, rank).len, rank == 2 ? 334 : 333);
}

TEST(GemvShare, TheLetterNAloneSplitsRows) {
  for (const char trans : {'N', 'n'}) EXPECT_EQ(gemv_split(trans), GemvSplit::rows);
  for (const char trans : {'T', 't', 'C', 'c'}) EXPECT_EQ(gemv_split(trans), GemvSplit::columns);
}

// ---- symv ----

TEST(SymvBlocks, EveryBlockHasOneOwnerAndAnOddTeamOneThreadWithout) {
  for (QtbInt threads = 2; threads <= most_threads; ++threads)
    for (QtbInt n = 1; n <= largest_n; ++n) {
      const SymvBlocks cut = symv_blocks(n, threads);
      ASSERT_EQ(cut.blocks, threads - threads % 2);
      expect_one_owner(n, cut.blocks, 8, [&](QtbInt b) { return cut.block(b); });
    }
}

TEST(SymvBlocks, ABlockRowIsItsLeftPartItsDiagonalBlockAndItsRightPart) {
  for (const QtbInt threads : {2, 3, 4, 5, 16, 63})
    for (const QtbInt n : {1, 15, 16, 17, 144, 1000, 3000}) {
      const SymvBlocks cut = symv_blocks(n, threads);
      for (QtbInt b = 0; b < cut.blocks; ++b) {
        EXPECT_EQ(cut.left(b).start, 0);
        EXPECT_EQ(cut.left(b).len, cut.block(b).start);
        if (b == cut.blocks - 1) continue;
        EXPECT_EQ(cut.right(b).start, cut.block(b).start + cut.block(b).len);
        EXPECT_EQ(cut.right(b).start + cut.right(b).len, n);
      }
    }
}

// ---- syr, syr2, trmv ----

TEST(TriangleShare, EveryColumnHasOneOwner) {
  for (QtbInt threads = 2; threads <= most_threads; ++threads)
    for (QtbInt n = 1; n <= largest_n; ++n)
      for (const bool first_are_short : {false, true})
        expect_one_owner(n, threads, 8, [&](QtbInt r) { return triangle_share(n, first_are_short, threads, r); });
}

TEST(TriangleShare, FirstPartIsHalfBelow1025AndOneOrTwoThirdsFromThere) {
  for (const bool first_are_short : {false, true})
    for (QtbInt n = 1; n < 1025; ++n) ASSERT_EQ(triangle_first_part(n, first_are_short), n / 2);
  EXPECT_EQ(triangle_first_part(1025, true), 683);
  EXPECT_EQ(triangle_first_part(1025, false), 341);
  EXPECT_EQ(triangle_first_part(2000, true), 1333);
  EXPECT_EQ(triangle_first_part(2000, false), 666);
}

TEST(TriangleShare, WidthsOf2000And1024OnFourThreads) {
  const QtbInt wide[] = {664, 664, 336, 336}, even[] = {256, 256, 256, 256};
  for (QtbInt rank = 0; rank < 4; ++rank) {
    EXPECT_EQ(triangle_share(2000, syr_first_are_short('U'), 4, rank).len, wide[rank]);
    EXPECT_EQ(triangle_share(1024, syr_first_are_short('U'), 4, rank).len, even[rank]);
  }
}

TEST(TriangleShare, TheShortEndFollowsTheTriangleAndTheOperation) {
  EXPECT_TRUE(syr_first_are_short('U') && syr_first_are_short('u'));
  EXPECT_FALSE(syr_first_are_short('L') || syr_first_are_short('l'));
  for (const char trans : {'T', 'c'}) {
    EXPECT_TRUE(trmv_first_are_short('U', trans));
    EXPECT_FALSE(trmv_first_are_short('l', trans));
  }
  EXPECT_FALSE(trmv_first_are_short('u', 'N'));
  EXPECT_TRUE(trmv_first_are_short('L', 'n'));
}

// What a share of op(A)*x needs, from the definition: the elements of op(A) that are not zero in its rows.
TEST(TrmvReach, IsThePartOfTheOldVectorThatTheShareNeedsAndNoMore) {
  const QtbInt n = 40;
  for (const char uplo : {'U', 'l'})
    for (const char trans : {'n', 'T', 'C'})
      for (const Level1Share share : {Level1Share{0, 8}, {8, 16}, {24, 16}, {0, 40}, {39, 1}}) {
        const TrmvReach reach = trmv_reach(n, uplo, trans, share);
        const bool upper_operator = (uplo == 'U') == (trans == 'n');
        EXPECT_EQ(reach.x.start, upper_operator ? share.start : 0);
        EXPECT_EQ(reach.x.start + reach.x.len, upper_operator ? n : share.start + share.len);
        // A's first element: where the operator's rows are the share's and its columns those of x.
        EXPECT_EQ(reach.row, trans == 'n' ? share.start : reach.x.start);
        EXPECT_EQ(reach.column, trans == 'n' ? reach.x.start : share.start);
      }
}

TEST(TrmvCopy, TakesEveryElementOnce) {
  for (QtbInt threads = 1; threads <= 4; ++threads)
    for (QtbInt n = 1; n <= largest_n + 9; ++n)
      expect_one_owner(n, threads, 1, [&](QtbInt r) { return trmv_copy_share(n, threads, r); });
}

}  // namespace
}  // namespace qtb
