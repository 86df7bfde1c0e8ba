// The sizes that tell the tiers of the basic vector kernels apart.
//
// A kernel takes its row and the column that its tier's row in blas/tiers.h names; nothing else about unrolling or
// about operands of different alignment is decided elsewhere. Sizes are elements per pass. The sse42 and avx tiers have
// one column: the same code in 16-byte vectors.
#pragma once

#include "blas/kernels/kernel.h"

namespace qtb::QTB_TIER {
namespace {

// What a contiguous kernel does about operands whose distance above a 16-byte boundary, their phase, differs. Except
// with no_peel, y is on a boundary by then: single elements have been peeled until it was.
enum Treatment {
  singles,       // single elements
  scalar_moves,  // single moves, as many per pass as the table says
  halves,        // x is read in two halves of 8 bytes
  halves_at_8,   // the same, if x is 8 bytes above a boundary; else single elements
  unaligned,     // x is read by unaligned loads
  rejoin,        // x is read by aligned loads, and neighbouring vectors are joined
  no_peel,       // alignment does not matter: unaligned loads and stores in one loop from the first element
  one_operand,   // there is one vector only, and peeling brings it to a boundary
};

struct Tuning {
  QtbInt same;             // both operands in the same phase
  QtbInt different;        // operands in different phases; 0: no such loop
  QtbInt strided;          // increments that are not contiguous; 1: no more than single elements
  Treatment treatment;     // of different phases
  QtbInt short_limit = 0;  // if above 0: single elements below this length, or at an address between elements
};

// The columns, in the order of the tiers that have them first.
enum Column { column_def, column_sse3, column_ssse3, column_sse42, column_count };
#define QTB_TIER_COLUMN(tier, TIER, flags, processor, taken, vectors, ...) column_##vectors,
constexpr Column tier_columns[tier_count] = {QTB_TIER_ROWS(QTB_TIER_COLUMN)};
#undef QTB_TIER_COLUMN
constexpr Column this_column = tier_columns[this_tier];

enum Row {
  row_ddot,
  row_sdot,
  row_daxpy,
  row_saxpy,
  row_dcopy,
  row_scopy,
  row_dswap,
  row_sswap,
  row_cswap,
  row_zswap,
  row_dscal,
  row_sscal,
  row_cscal,
  row_zscal,
  row_caxpy,
  row_zaxpy,
  row_cdot,
  row_zdot,
  row_count
};

// clang-format off
constexpr Tuning tuning_table[row_count][column_count] = {
  //           def                            sse3                           ssse3                          sse42 and avx
  /* ddot  */ {{16,  8, 2, halves},          {32,  8, 2, halves},           {32, 32, 4, rejoin},           {32, 32, 1, no_peel}},
  /* sdot  */ {{32,  1, 1, singles},         {32,  1, 1, singles},          {32, 32, 4, halves},           {64, 64, 1, no_peel}},
  /* daxpy */ {{16,  8, 2, halves},          {16,  8, 2, halves},           {64, 32, 4, rejoin},           {64, 32, 4, unaligned}},
  /* saxpy */ {{ 8,  8, 2, unaligned},       { 8,  8, 2, unaligned},        {64, 64, 2, rejoin},           {64, 64, 2, no_peel}},
  /* dcopy */ {{ 8,  8, 2, halves, 9},       { 8,  0, 1, singles},          {32, 32, 4, rejoin},           {32, 32, 4, unaligned}},
  /* scopy */ {{32, 32, 1, halves_at_8},     {32, 32, 1, halves_at_8},      {32, 32, 1, halves_at_8},      {32, 32, 1, no_peel}},
  /* dswap */ {{ 8,  8, 2, halves, 9},       { 8,  0, 1, singles},          {32, 16, 4, rejoin},           {32, 16, 4, unaligned}},
  /* sswap */ {{32, 32, 5, scalar_moves},    {32, 32, 5, scalar_moves},     {32, 32, 5, scalar_moves},     {32, 32, 5, scalar_moves}},
  /* cswap */ {{16, 16, 4, unaligned},       {16, 16, 4, unaligned},        {16, 16, 4, unaligned},        {16, 16, 4, unaligned}},
  /* zswap */ {{ 1,  1, 1, singles},         { 1,  1, 1, singles},          { 1,  1, 1, singles},          { 1,  1, 1, singles}},
  /* dscal */ {{ 8,  0, 1, one_operand},     {16,  0, 1, one_operand},      {32,  0, 4, one_operand},      {32,  0, 4, one_operand}},
  /* sscal */ {{ 8,  0, 2, one_operand, 11}, { 8,  0, 2, one_operand, 11},  { 8,  0, 2, one_operand, 11},  {64,  0, 1, no_peel, 11}},
  /* cscal */ {{24,  0, 1, one_operand},     {24,  0, 1, one_operand},      {16,  0, 2, one_operand},      {16,  0, 1, no_peel}},
  /* zscal */ {{ 8,  0, 1, one_operand},     {16,  0, 1, one_operand},      {16,  0, 4, one_operand},      { 8,  0, 1, no_peel}},
  /* caxpy */ {{16, 16, 4, unaligned},       {16, 16, 4, unaligned},        {32, 16, 4, rejoin},           {64, 64, 1, no_peel}},
  /* zaxpy */ {{ 8,  8, 4, unaligned},       {16,  8, 2, unaligned},        {16,  8, 4, rejoin},           {32, 32, 1, no_peel}},
  /* cdot  */ {{16,  2, 1, unaligned},       {16, 16, 4, unaligned},        {32, 16, 4, rejoin},           {32, 32, 1, no_peel}},
  /* zdot  */ {{ 8,  1, 1, singles},         {64, 16, 4, unaligned},        {16,  8, 4, rejoin},           {16, 16, 1, no_peel}},
};
// clang-format on

consteval bool tuning_table_is_full() {
  for (const auto &row : tuning_table)
    for (const Tuning &sizes : row)
      if (sizes.same == 0) return false;
  return true;
}
static_assert(tuning_table_is_full(), "blas/kernels/level1/tuning.h: write the sizes of every column into every row");

template <Row row>
constexpr Tuning tuning = tuning_table[row][this_column];

// How a dot product joins its four accumulators: one after the other, ((a0 + a1) + a2) + a3, and single elements before
// that in lane 0 of a0; or in pairs, (a3 + a2) + (a1 + a0), and single elements after the sum of the lanes.
enum Joining { in_a_chain, in_pairs };
constexpr Joining joining = this_column < column_sse42 ? in_a_chain : in_pairs;

// Whether two increments equal to -1 run the contiguous path, which pairs the same elements. Dot products and complex
// axpy of the upper tiers walk them backwards instead.
constexpr bool backward_is_contiguous_in_dots = this_column < column_sse42;

// Whether the loops of complex dot products duplicate the parts of x, rather than swap them.
constexpr bool duplicates_parts = this_column == column_sse3 || this_column == column_ssse3;

// Whether a scal returns at once for an alpha of one.
template <Row row>
constexpr bool returns_for_one = (row == row_dscal && this_column >= column_sse3) ||
                                 (row == row_zscal && this_column == column_ssse3);

}  // namespace
}  // namespace qtb::QTB_TIER
