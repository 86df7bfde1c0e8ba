// The step of the tile of two vectors by four columns, s[j][v] += a[v]*b[j], as instructions of the machine.
//
// Compilers do not write it: they load all operands into registers, and copy sums besides. Sixteen instructions are the
// products and sums, and fill two pipes for either for four cycles. Others bring the factors to registers, a second
// time where a product has taken the place of a factor that another one needs: those of a column take the places of b
// and of b again, those of the last column the places of b and of a[0], or of both a. What is there again may be a copy
// or another load. Instructions cost little up to 24 or 25, loads up to eight, copies up to two; beyond, each costs a
// part of a cycle, whatever the order. The forms, with the cycles of a step that they or their mixture take:
//
//   loaded_again   25 instructions, 8 loads, 1 copy      4.3   any two operands
//   last_column    24 instructions, 8 loads, 2 copies    4.1   b[3] stays in memory, where it lies in all lanes
//   two_copies     25 instructions, 7 loads, 2 copies    4.2   one step of these and two
//   second_vector  24 instructions, 9 loads, 3 copies          of these, whose a[1] stays in memory, aligned
#pragma once

#include "blas/kernels/simd/vec.h"

namespace qtb::QTB_TIER {
namespace {

// p and q are a, x and y an element of b and that element again.
// clang-format off
#define QTB_LOADED(load_b, j) load_b " %[b" #j "], %[y]\n\t"
#define QTB_COPIED(load_b, j) "movaps %[x], %[y]\n\t"
#define QTB_COLUMN(arithmetic, load_b, again, j, a1)                                \
  load_b " %[b" #j "], %[x]\n\t" again(load_b, j)                                   \
  "mul" arithmetic " %[p], %[x]\n\tadd" arithmetic " %[x], %[s" #j "0]\n\t"         \
  "mul" arithmetic " " a1 ", %[y]\n\tadd" arithmetic " %[y], %[s" #j "1]\n\t"
#define QTB_PRODUCT(arithmetic, factor, place, sum) \
  "mul" arithmetic " " factor ", " place "\n\tadd" arithmetic " " place ", %[" sum "]\n\t"
#define QTB_BOTH_VECTORS(load_a) load_a " %[a0], %[p]\n\t" load_a " %[a1], %[q]\n\t"

#define QTB_LOADED_AGAIN(arithmetic, load_a, load_b)         \
  QTB_BOTH_VECTORS(load_a)                                   \
  QTB_COLUMN(arithmetic, load_b, QTB_LOADED, 0, "%[q]")      \
  QTB_COLUMN(arithmetic, load_b, QTB_LOADED, 1, "%[q]")      \
  QTB_COLUMN(arithmetic, load_b, QTB_COPIED, 2, "%[q]")      \
  load_b " %[b3], %[x]\n\t"                                  \
  QTB_PRODUCT(arithmetic, "%[x]", "%[p]", "s30")             \
  QTB_PRODUCT(arithmetic, "%[q]", "%[x]", "s31")
#define QTB_TWO_COPIES(arithmetic, load_a, load_b)           \
  QTB_BOTH_VECTORS(load_a)                                   \
  QTB_COLUMN(arithmetic, load_b, QTB_LOADED, 0, "%[q]")      \
  QTB_COLUMN(arithmetic, load_b, QTB_COPIED, 1, "%[q]")      \
  QTB_COLUMN(arithmetic, load_b, QTB_COPIED, 2, "%[q]")      \
  load_b " %[b3], %[x]\n\t"                                  \
  QTB_PRODUCT(arithmetic, "%[x]", "%[p]", "s30")             \
  QTB_PRODUCT(arithmetic, "%[q]", "%[x]", "s31")
#define QTB_LAST_COLUMN(arithmetic, load_a, load_b)          \
  QTB_BOTH_VECTORS(load_a)                                   \
  QTB_COLUMN(arithmetic, load_b, QTB_LOADED, 0, "%[q]")      \
  QTB_COLUMN(arithmetic, load_b, QTB_COPIED, 1, "%[q]")      \
  QTB_COLUMN(arithmetic, load_b, QTB_COPIED, 2, "%[q]")      \
  QTB_PRODUCT(arithmetic, "%[b3]", "%[p]", "s30")            \
  QTB_PRODUCT(arithmetic, "%[b3]", "%[q]", "s31")
#define QTB_SECOND_VECTOR(arithmetic, load_a, load_b)        \
  load_a " %[a0], %[p]\n\t"                                  \
  QTB_COLUMN(arithmetic, load_b, QTB_COPIED, 0, "%[a1]")     \
  QTB_COLUMN(arithmetic, load_b, QTB_COPIED, 1, "%[a1]")     \
  QTB_COLUMN(arithmetic, load_b, QTB_COPIED, 2, "%[a1]")     \
  load_b " %[b3], %[x]\n\t"                                  \
  QTB_PRODUCT(arithmetic, "%[x]", "%[p]", "s30")             \
  QTB_PRODUCT(arithmetic, "%[a1]", "%[x]", "s31")
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
