// The step of the tile of two vectors by four columns, s[j][v] += a[v]*b[j], as instructions of the machine.
//
// Compilers do not write it: they load all operands into registers, and copy sums besides. With two pipes for products
// and two for sums a step takes four cycles, unless it has many more than 24 instructions or eight loads. Sixteen are
// the products and sums; the others bring factors to registers and copy those that another product needs, since a
// product takes the place of one of its factors: those of a column the places of b and of a copy of it, those of the
// last column the places of b and of a[0], or of both a. The forms differ in what stays an operand in memory:
//
//   none             25 instructions, 6 loads
//   last_column      24 instructions, 7 loads: b[3], which must lie there in all lanes
//   second_vector    24 instructions, 9 loads: a[1], which must be aligned
//
// The fastest are mixtures whose loads just fit: last_column and second_vector in turn, and where an instruction
// doubles b on its way, one step of none and two of second_vector. A mixture takes 4.1 to 4.2 cycles a step, none and
// last_column by themselves 4.9 and 4.6, in whatever order their instructions stand.
#pragma once

#include "blas/kernels/simd/vec.h"

namespace qtb::QTB_TIER {
namespace {

// p and q are a, x and y an element of b and its copy.
// clang-format off
#define QTB_COLUMN(arithmetic, load_b, j, a1, s0, s1)                                                         \
  load_b " %[b" #j "], %[x]\n\tmovaps %[x], %[y]\n\tmul" arithmetic " %[p], %[x]\n\tadd" arithmetic " %[x], " \
         "%[" #s0 "]\n\tmul" arithmetic " " a1 ", %[y]\n\tadd" arithmetic " %[y], %[" #s1 "]\n\t"
#define QTB_FIRST_COLUMNS(arithmetic, load_b, a1)     \
  QTB_COLUMN(arithmetic, load_b, 0, a1, s00, s01)     \
  QTB_COLUMN(arithmetic, load_b, 1, a1, s10, s11)     \
  QTB_COLUMN(arithmetic, load_b, 2, a1, s20, s21)
#define QTB_PRODUCT(arithmetic, factor, place, s) \
  "mul" arithmetic " " factor ", " place "\n\tadd" arithmetic " " place ", %[" #s "]\n\t"

#define QTB_STEP_NONE(arithmetic, load_a, load_b)                                \
  load_a " %[a0], %[p]\n\t" load_a " %[a1], %[q]\n\t"                            \
  QTB_FIRST_COLUMNS(arithmetic, load_b, "%[q]") load_b " %[b3], %[x]\n\t"        \
  QTB_PRODUCT(arithmetic, "%[x]", "%[p]", s30) QTB_PRODUCT(arithmetic, "%[q]", "%[x]", s31)
#define QTB_STEP_LAST_COLUMN(arithmetic, load_a, load_b)  \
  load_a " %[a0], %[p]\n\t" load_a " %[a1], %[q]\n\t"     \
  QTB_FIRST_COLUMNS(arithmetic, load_b, "%[q]")           \
  QTB_PRODUCT(arithmetic, "%[b3]", "%[p]", s30) QTB_PRODUCT(arithmetic, "%[b3]", "%[q]", s31)
#define QTB_STEP_SECOND_VECTOR(arithmetic, load_a, load_b)                    \
  load_a " %[a0], %[p]\n\t"                                                   \
  QTB_FIRST_COLUMNS(arithmetic, load_b, "%[a1]") load_b " %[b3], %[x]\n\t"    \
  QTB_PRODUCT(arithmetic, "%[x]", "%[p]", s30) QTB_PRODUCT(arithmetic, "%[a1]", "%[x]", s31)

// clang-format on

// A vector of which an instruction reads all or a part, at any address.
template <class R>
struct [[gnu::packed, gnu::may_alias]] Operand {
  R parts[lanes<R>];
};
template <class R>
[[gnu::always_inline]] inline const Operand<R> &operand_at(const R *at) {
  return *reinterpret_cast<const Operand<R> *>(at);
}

// name(s, a, b, column): both vectors of A side by side at a, what load_b takes of column j of B at b + j*column.
#define QTB_STEP(name, R, text, arithmetic, load_a, load_b)                                                  \
  [[gnu::always_inline]] inline void name(Vec<R>(&s)[4][2], const R *a, const R *b, QtbInt column) {         \
    Vec<R> p, q, x, y;                                                                                       \
    __asm__ volatile(text(arithmetic, load_a, load_b)                                                        \
                     : [s00] "+x"(s[0][0]), [s01] "+x"(s[0][1]), [s10] "+x"(s[1][0]), [s11] "+x"(s[1][1]),   \
                       [s20] "+x"(s[2][0]), [s21] "+x"(s[2][1]), [s30] "+x"(s[3][0]), [s31] "+x"(s[3][1]),   \
                       [p] "=&x"(p), [q] "=&x"(q), [x] "=&x"(x), [y] "=&x"(y)                                \
                     : [a0] "m"(operand_at(a)), [a1] "m"(operand_at(a + lanes<R>)), [b0] "m"(operand_at(b)), \
                       [b1] "m"(operand_at(b + column)), [b2] "m"(operand_at(b + 2 * column)),               \
                       [b3] "m"(operand_at(b + 3 * column)));                                                \
  }

}  // namespace
}  // namespace qtb::QTB_TIER
