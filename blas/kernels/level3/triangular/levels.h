// The level tables of trmm and trsm: how large the blocks on the diagonal are that a walk takes, level by level, and
// how far it steps along the other dimension of B.
//
// Blocks are counted in elements, a complex one as one. A walk enters at the first level whose block the triangle fills
// and descends where the triangle is larger than the next level's block; the last level's blocks go to the base
// kernels. What stands here is data and arithmetic, the same in every tier's build and outside of them.
#pragma once

#include "blas/kernels/level3/gemm/tiles.h"

namespace qtb::levels {

// One level of one call. A table of them goes with the number of its last index.
template <class T>
struct TriLevel {
  QtbInt tri_block;        // rows or columns of a diagonal block
  QtbInt other_block;      // step along the other dimension of B; whole: all of it at once
  bool gemm_first;         // the product with the panel beside a block comes before the block
  T *a_buffer, *b_buffer;  // regions of the work buffer, for the base kernels; null where memory is out
};

namespace {

using tiles::smaller;

enum class Routine { trmm, trsm };

// With or without SSE4.1, where that makes a difference.
enum class Sse41 { any, present, absent };

// The level at which a walk enters; at the first one where none answers.
enum class Entry {
  at_least,  // the first whose block has at most as many elements as the triangle
  above,     // the first whose block has fewer elements than the triangle
  only       // the first if the triangle is larger than its block, otherwise the last, and the walk does not descend
};

constexpr int most_levels = 3;
constexpr QtbInt whole = -1;   // the other dimension at once
constexpr QtbInt by_rows = 0;  // a block that depends on the rows of B

struct LevelRow {
  Routine routine;
  char side;
  const char *kinds;
  unsigned tiers;
  Sse41 sse41;
  QtbInt tri_block[most_levels];  // those in use stand first
  int count;
  QtbInt other_block;
  Entry entry;
};

// clang-format off
using tiles::tiers_from_sse42;
constexpr LevelRow level_rows[] = {
  // routine, side, types, tiers                           blocks by level, and how many  step   entered
  {Routine::trmm, 'L', "d",    tiers_from_sse42, Sse41::any,     {256, 128, 64}, 3,       1000,  Entry::at_least},
  {Routine::trmm, 'L', "s",    tiers_from_sse42, Sse41::any,     {256, 64, 16}, 3,        1000,  Entry::at_least},
  {Routine::trmm, 'L', "cz",   tiers_from_sse42, Sse41::any,     {256, 32, 8}, 3,         1000,  Entry::at_least},
  {Routine::trmm, 'R', "ds",   tiers_from_sse42, Sse41::any,     {256, 64, 16}, 3,        whole, Entry::above},
  {Routine::trmm, 'R', "cz",   tiers_from_sse42, Sse41::any,     {256, 32, 8}, 3,         whole, Entry::above},
  {Routine::trsm, 'L', "d",    tiers_from_sse42, Sse41::any,     {128, 32}, 2,            1000,  Entry::at_least},
  {Routine::trsm, 'L', "sz",   tiers_from_sse42, Sse41::any,     {256, 64, 16}, 3,        1000,  Entry::at_least},
  {Routine::trsm, 'L', "c",    tiers_from_sse42, Sse41::any,     {256, 32, 8}, 3,         1000,  Entry::at_least},
  {Routine::trsm, 'R', "d",    tiers_from_sse42, Sse41::any,     {by_rows, 32}, 2,        512,   Entry::above},
  {Routine::trsm, 'R', "sc",   tiers_from_sse42, Sse41::any,     {by_rows, 64, 16}, 3,    512,   Entry::above},
  {Routine::trsm, 'R', "z",    tiers_from_sse42, Sse41::any,     {by_rows, 32, 8}, 3,     512,   Entry::above},
  {Routine::trmm, 'L', "sdcz", tier_set::SSSE3,  Sse41::any,     {128}, 1,                whole, Entry::at_least},
  {Routine::trmm, 'R', "sdcz", tier_set::SSSE3,  Sse41::any,     {128}, 1,                whole, Entry::above},
  {Routine::trsm, 'L', "sdcz", tier_set::SSSE3,  Sse41::present, {128, 32}, 2,            1000,  Entry::at_least},
  {Routine::trsm, 'R', "sdcz", tier_set::SSSE3,  Sse41::present, {by_rows, 32}, 2,        1000,  Entry::above},
  {Routine::trsm, 'L', "sdcz", tier_set::SSSE3,  Sse41::absent,  {128, 32}, 2,            whole, Entry::only},
  {Routine::trsm, 'R', "sdcz", tier_set::SSSE3,  Sse41::absent,  {by_rows, 32}, 2,        512,   Entry::above},
};

// What a call asks of the memory service: room for blocks of mb and nb by kb. The packed triangle takes the region of A,
// a strip of B that of B.
struct BufferRow {
  Routine routine;
  unsigned tiers;
  QtbInt mb, nb, kb;
};
constexpr BufferRow buffer_rows[] = {
  {Routine::trmm, tiers_from_sse42,                    640, 1000, 128},
  {Routine::trmm, tier_set::SSSE3,                     512, 1000, 128},
  {Routine::trsm, tiers_from_sse42 | tier_set::SSSE3,  512, 1000, 256},
};
// clang-format on

constexpr bool has_kind(const char *kinds, char kind) {
  for (; *kinds != '\0'; kinds++)
    if (*kinds == kind) return true;
  return false;
}

// The rows of a type and tier; one that does not exist is an error at compile time.
constexpr LevelRow find_levels(Routine routine, char side, char kind, ProcessorTier tier, Sse41 sse41) {
  for (const LevelRow &row : level_rows)
    if (row.routine == routine && row.side == side && has_kind(row.kinds, kind) && (row.tiers >> tier & 1U) != 0 &&
        (row.sse41 == Sse41::any || row.sse41 == sse41))
      return row;
  __builtin_unreachable();
}
constexpr BufferRow find_buffers(Routine routine, ProcessorTier tier) {
  for (const BufferRow &row : buffer_rows)
    if (row.routine == routine && (row.tiers >> tier & 1U) != 0) return row;
  __builtin_unreachable();
}

// The levels of one call: their blocks, where it enters and which is the last to which it may descend.
struct LevelPlan {
  QtbInt tri_block[most_levels];
  QtbInt other_block;
  QtbInt entry, last;
};

constexpr QtbInt first_block_by_rows(QtbInt m) {
  constexpr QtbInt many_rows = 2000;
  return m < many_rows ? 128 : 256;
}

// B is m x n.
constexpr LevelPlan plan_levels(const LevelRow &row, QtbInt m, QtbInt n) {
  LevelPlan plan{{row.tri_block[0], row.tri_block[1], row.tri_block[2]}, row.other_block, 0, row.count - 1};
  const QtbInt t = row.side == 'L' ? m : n;
  if (plan.tri_block[0] == by_rows) plan.tri_block[0] = first_block_by_rows(m);
  if (row.entry == Entry::only) {
    plan.entry = t > plan.tri_block[0] ? 0 : plan.last;
    plan.last = plan.entry;
    return plan;
  }
  for (int level = 0; level < row.count; level++)
    if (row.entry == Entry::at_least ? t >= plan.tri_block[level] : t > plan.tri_block[level]) {
      plan.entry = level;
      break;
    }
  return plan;
}

// ---- The order ----
//
// A walk takes the blocks in the direction in which what a block reads is still, or already, what it should be: for
// trmm the operand, for trsm the solution.

// Whether op(T), from the left, or its transpose, from the right, is an upper triangle: one column of B, or one row, is
// multiplied by it.
constexpr bool acts_as_upper(bool left, bool upper, bool not_trans) { return (upper == not_trans) == left; }

constexpr bool walks_up(Routine routine, bool left, bool upper, bool not_trans) {
  return acts_as_upper(left, upper, not_trans) == (routine == Routine::trmm);
}

// Whether the product with the panel beside a diagonal block, which is what the triangle stores above the block or
// below it, comes before the block itself. The panel either spreads the block over the rest of B or gathers the rest
// into the block.
constexpr bool spreads(bool left, bool not_trans) { return left == not_trans; }
constexpr bool gemm_comes_first(Routine routine, bool left, bool not_trans) {
  return spreads(left, not_trans) == (routine == Routine::trmm);
}

}  // namespace
}  // namespace qtb::levels

// A level walk from the left multiplies B, m x n, by op(T), one from the right by op(T) behind it; a solve undoes the
// same. In place, from a level on. not_trans, upper and is_transpose point to flags: whether op(T) is T itself, whether
// T is an upper triangle, and, of a complex T that is not itself, whether it is not conjugated; diag is the option.
// alpha is 1 for a product from the left and not looked at by a solve.
#define QTB_LEVEL_PARAMS(T)                                                                                         \
  const bool *not_trans, const bool *upper, const bool *is_transpose, const char *diag, const QtbInt *m,            \
      const QtbInt *n, const T *alpha, const T *a, const QtbInt *lda, T *b, const QtbInt *ldb, const QtbInt *level, \
      const QtbInt *last, const qtb::levels::TriLevel<T> *table
#define QTB_LEVEL_ARGS not_trans, upper, is_transpose, diag, m, n, alpha, a, lda, b, ldb, level, last, table

// A base kernel from the left: the same for one diagonal block of m rows. The buffers are those of a level.
#define QTB_BASE_PARAMS(T)                                                                               \
  const bool *not_trans, const bool *upper, const bool *is_transpose, const char *diag, const QtbInt *m, \
      const QtbInt *n, const T *a, const QtbInt *lda, T *b, const QtbInt *ldb, T *a_buffer, T *b_buffer
#define QTB_BASE_ARGS not_trans, upper, is_transpose, diag, m, n, a, lda, b, ldb, a_buffer, b_buffer
