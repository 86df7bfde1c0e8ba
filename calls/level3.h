// The shapes of Level 3.
#pragma once

#include "calls/level2.h"

namespace qtb::calls {

inline double count_of(QtbInt m, QtbInt n, QtbInt k) {
  return static_cast<double>(m) * static_cast<double>(n) * static_cast<double>(k);
}

// C := alpha*(A, B) + beta*C.
inline void describe_two_matrices(const Problem &p, const Form &a, const Layout &b, const Form &c, double products,
                                  Description &d) {
  const bool is_read = !p.alpha.is_zero();
  d.a = input(a.layout, is_read, a.structure);
  if (b.rows > 0 || b.cols > 0) d.b = input(b, is_read);
  d.c = result(c.layout, !p.beta.is_zero(), c.structure);
  d.work = products_and_sums(products);
}

// A matrix that is passed as it is or transposed.
inline Layout as_it_is_or_transposed(char trans, QtbInt rows, QtbInt cols, const Problem &p, int which) {
  if (!is_letter(trans, 'N')) std::swap(rows, cols);
  return full(rows, cols, p.leading(which, rows));
}

template <>
struct Shape<"gemm"> : ShapeBase<3> {
  static constexpr std::string_view axes = "mnkAB+*";
  QTB_CALL(gemm);
  static void describe(const Problem &p, const Kind &, Description &d) {
    describe_two_matrices(p, {as_it_is_or_transposed(p.transa, p.m, p.k, p, 0)},
                          as_it_is_or_transposed(p.transb, p.k, p.n, p, 1), {full(p.m, p.n, p.leading(2, p.m))},
                          count_of(p.m, p.n, p.k), d);
  }
};

template <>
struct Shape<"symm"> : ShapeBase<3> {
  static constexpr std::string_view axes = "mnSU+*";
  QTB_CALL(symm);
  static void describe(const Problem &p, const Kind &kind, Description &d) {
    const QtbInt order = is_letter(p.side, 'L') ? p.m : p.n;
    describe_two_matrices(
        p, {triangle(p.uplo, order, p.leading(0, order)), kind.hermitian ? Structure::hermitian : Structure::symmetric},
        full(p.m, p.n, p.leading(1, p.m)), {full(p.m, p.n, p.leading(2, p.m))}, count_of(p.m, p.n, order), d);
  }
};

// The updates of a triangle know "N" and one or both of the others: real ones both, complex symmetric ones "T",
// Hermitian ones "C".
inline char rank_k_trans(char trans, const Kind &kind) {
  if (!kind.complex || is_letter(trans, 'N')) return trans;
  const bool lower = trans >= 'a';
  if (kind.hermitian) return lower ? 'c' : 'C';
  return lower ? 't' : 'T';
}
inline Form updated_triangle(const Problem &p, const Kind &kind) {
  return {triangle(p.uplo, p.n, p.leading(2, p.n)), kind.hermitian ? Structure::hermitian : Structure::symmetric};
}

template <>
struct Shape<"syrk"> : ShapeBase<3> {
  static constexpr std::string_view axes = "nkUA+*";
  QTB_CALL(syrk);
  static char legal_trans(char trans, const Kind &kind) { return rank_k_trans(trans, kind); }
  static void describe(const Problem &p, const Kind &kind, Description &d) {
    describe_two_matrices(p, {as_it_is_or_transposed(p.transa, p.n, p.k, p, 0)}, full(0, 0, 1),
                          updated_triangle(p, kind), triangle_count(p.n) * static_cast<double>(p.k), d);
  }
};
template <>
struct Shape<"herk"> : Shape<"syrk"> {
  static constexpr bool real_alpha = true, real_beta = true;
};

template <>
struct Shape<"syr2k"> : ShapeBase<3> {
  static constexpr std::string_view axes = "nkUA+*";
  QTB_CALL(syr2k);
  static char legal_trans(char trans, const Kind &kind) { return rank_k_trans(trans, kind); }
  static void describe(const Problem &p, const Kind &kind, Description &d) {
    describe_two_matrices(p, {as_it_is_or_transposed(p.transa, p.n, p.k, p, 0)},
                          as_it_is_or_transposed(p.transa, p.n, p.k, p, 1), updated_triangle(p, kind),
                          2 * triangle_count(p.n) * static_cast<double>(p.k), d);
  }
};
template <>
struct Shape<"her2k"> : Shape<"syr2k"> {
  static constexpr bool real_beta = true;
};

// trmm and trsm. B is not read where alpha is zero.
template <>
struct Shape<"trmm"> : ShapeBase<3> {
  static constexpr std::string_view axes = "mnSUAD+";
  QTB_CALL(trmm);
  static void describe(const Problem &p, const Kind &, Description &d) {
    const bool left = is_letter(p.side, 'L'), is_read = !p.alpha.is_zero();
    const QtbInt order = left ? p.m : p.n;
    d.a = input(triangle(p.uplo, order, p.leading(0, order)), is_read, triangular(p.diag));
    d.b = result(full(p.m, p.n, p.leading(1, p.m)), is_read);
    d.work = products_and_sums(triangle_count(order) * static_cast<double>(left ? p.n : p.m));
  }
};

}  // namespace qtb::calls
