// The tile cut of an update of a triangle: 2*t blocks of rows and columns for a team of t, of equal size but for the
// last, and each thread the same number of whole tiles. Pure functions of the order, the team and the rank.
//
// A diagonal tile counts as half of one, since half of it is stored. Diagonal tiles are dealt in pairs, and the
// t*(2*t - 1) others, numbered column by column in the upper triangle (in the lower one from the diagonal down), in t
// groups of 2*t - 1 that follow one another: so each thread has 2*t tiles, and long runs of a column among them.
#pragma once

#include "blas/thread/32e/level3/gemm_share.h"

namespace qtb {

struct SyrkTiles {
  QtbInt team, blocks;
  QtbInt size, last;  // the rows of a block, and of the last one

  constexpr QtbInt rows(QtbInt block) const { return block == blocks - 1 ? last : size; }
  constexpr QtbInt first(QtbInt block) const { return block * size; }

  // The thread that has tile (j, i), block row j and block column i, of the stored triangle.
  constexpr QtbInt owner(bool upper, QtbInt j, QtbInt i) const {
    const QtbInt two_groups = 4 * team - 2;  // tiles; the numbers below are twice those of the tiles
    const QtbInt group = j == i  ? j / 2
                         : upper ? (i * i - i + 2 * j) / two_groups
                                 : (2 * j - 3 * i + 4 * team * i - i * i - 2) / two_groups;
    return (group + 1) % team;
  }
};

// Block rows of a team's tiles are multiples of this, as the kernels like them.
inline constexpr QtbInt syrk_block_unit = 4;

// For a team of at least 2 and a block unit of rows for each block, at least.
constexpr SyrkTiles syrk_tiles(QtbInt n, QtbInt team) {
  const QtbInt blocks = 2 * team, size = multiple_below(n / blocks, syrk_block_unit);
  return {team, blocks, size, n - (blocks - 1) * size};
}

// Calls piece(rectangle) for all that thread rank has, column by column: the diagonal tiles, whose row is their column,
// and the runs of other tiles that follow one another in a column, each run as one rectangle.
template <class Piece>
constexpr void for_each_syrk_piece(const SyrkTiles &tiles, bool upper, QtbInt rank, const Piece &piece) {
  for (QtbInt i = 0; i < tiles.blocks; i++) {
    const QtbInt top = upper ? 0 : i, end = upper ? i + 1 : tiles.blocks;
    for (QtbInt j = top; j < end; j++) {
      if (tiles.owner(upper, j, i) != rank) continue;
      GemmTile run = {tiles.first(j), tiles.rows(j), tiles.first(i), tiles.rows(i)};
      if (j != i)
        while (j + 1 < end && j + 1 != i && tiles.owner(upper, j + 1, i) == rank) run.rows += tiles.rows(++j);
      piece(run);
    }
  }
}

}  // namespace qtb
