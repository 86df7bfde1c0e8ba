// The shapes of Level 2.
#pragma once

#include "calls/shapes.h"

namespace qtb::calls {

inline Structure symmetric_or_hermitian(const Kind &kind) {
  return kind.complex ? Structure::hermitian : Structure::symmetric;
}
inline double triangle_count(QtbInt n) { return static_cast<double>(n) * static_cast<double>(n + 1) / 2; }

// y := alpha*op(A)*x + beta*y with so many products.
inline void describe_matrix_vector(const Problem &p, const Layout &layout, Structure structure, bool plain,
                                   double products, Description &d) {
  const bool is_read = !p.alpha.is_zero();
  d.a = input(layout, is_read, structure);
  d.x = input(strided(plain ? layout.cols : layout.rows, p.incx), is_read);
  d.y = result(strided(plain ? layout.rows : layout.cols, p.incy), !p.beta.is_zero());
  d.work = products_and_sums(products);
}

template <>
struct Shape<"gemv"> : ShapeBase<2> {
  static constexpr std::string_view axes = "mnA+*xy";
  QTB_CALL(gemv);
  static void describe(const Problem &p, const Kind &, Description &d) {
    const Layout layout = full(p.m, p.n, p.leading(0, p.m));
    describe_matrix_vector(p, layout, Structure::general, is_letter(p.transa, 'N'), static_cast<double>(layout.count()),
                           d);
  }
};

template <>
struct Shape<"gbmv"> : ShapeBase<2> {
  static constexpr std::string_view axes = "mnlA+*xy";
  QTB_CALL(gbmv);
  static void describe(const Problem &p, const Kind &, Description &d) {
    const Layout layout = band(p.m, p.n, p.kl, p.ku, p.leading(0, p.kl + p.ku + 1));
    describe_matrix_vector(p, layout, Structure::general, is_letter(p.transa, 'N'), static_cast<double>(layout.count()),
                           d);
  }
};

// A triangle stands for the whole matrix: each element but the diagonal's takes part twice.
inline void describe_symmetric_vector(const Problem &p, const Kind &kind, const Layout &layout, Description &d) {
  describe_matrix_vector(p, layout, symmetric_or_hermitian(kind), true,
                         2 * static_cast<double>(layout.count()) - static_cast<double>(p.n), d);
}

template <>
struct Shape<"symv"> : ShapeBase<2> {
  static constexpr std::string_view axes = "nU+*xy";
  QTB_CALL(symv);
  static void describe(const Problem &p, const Kind &kind, Description &d) {
    describe_symmetric_vector(p, kind, triangle(p.uplo, p.n, p.leading(0, p.n)), d);
  }
};

template <>
struct Shape<"sbmv"> : ShapeBase<2> {
  static constexpr std::string_view axes = "nbU+*xy";
  QTB_CALL(sbmv);
  static void describe(const Problem &p, const Kind &kind, Description &d) {
    d.problem.k = p.kl;
    describe_symmetric_vector(p, kind, band_triangle(p.uplo, p.n, p.kl, p.leading(0, p.kl + 1)), d);
  }
};

template <>
struct Shape<"spmv"> : ShapeBase<2> {
  static constexpr std::string_view axes = "nU+*xy";
  QTB_CALL(spmv);
  static void describe(const Problem &p, const Kind &kind, Description &d) {
    describe_symmetric_vector(p, kind, packed_triangle(p.uplo, p.n), d);
  }
};

// A := alpha*x*x^H + A.
inline void describe_rank_one(const Problem &p, const Kind &kind, const Layout &layout, Description &d) {
  d.x = input(strided(p.n, p.incx), !p.alpha.is_zero());
  d.a = result(layout, true, symmetric_or_hermitian(kind));
  d.work = products_and_sums(triangle_count(p.n));
}

template <>
struct Shape<"syr"> : ShapeBase<2> {
  static constexpr std::string_view axes = "nU+x";
  static constexpr bool real_alpha = true;
  QTB_CALL(syr);
  static void describe(const Problem &p, const Kind &kind, Description &d) {
    describe_rank_one(p, kind, triangle(p.uplo, p.n, p.leading(0, p.n)), d);
  }
};
template <>
struct Shape<"her"> : Shape<"syr"> {};

template <>
struct Shape<"spr"> : ShapeBase<2> {
  static constexpr std::string_view axes = "nU+x";
  static constexpr bool real_alpha = true;
  QTB_CALL(spr);
  static void describe(const Problem &p, const Kind &kind, Description &d) {
    describe_rank_one(p, kind, packed_triangle(p.uplo, p.n), d);
  }
};
template <>
struct Shape<"hpr"> : Shape<"spr"> {};

// A := alpha*x*y^T + A and the updates of a triangle by two vectors.
inline void describe_two_vectors(const Problem &p, const Layout &layout, Structure structure, double products,
                                 Description &d) {
  d.x = input(strided(layout.rows, p.incx), !p.alpha.is_zero());
  d.y = input(strided(layout.cols, p.incy), !p.alpha.is_zero());
  d.a = result(layout, true, structure);
  d.work = products_and_sums(products);
}

template <>
struct Shape<"ger"> : ShapeBase<2> {
  static constexpr std::string_view axes = "mn+xy";
  QTB_CALL(ger);
  static void describe(const Problem &p, const Kind &, Description &d) {
    const Layout layout = full(p.m, p.n, p.leading(0, p.m));
    describe_two_vectors(p, layout, Structure::general, static_cast<double>(layout.count()), d);
  }
};

template <>
struct Shape<"syr2"> : ShapeBase<2> {
  static constexpr std::string_view axes = "nU+xy";
  QTB_CALL(syr2);
  static void describe(const Problem &p, const Kind &kind, Description &d) {
    describe_two_vectors(p, triangle(p.uplo, p.n, p.leading(0, p.n)), symmetric_or_hermitian(kind),
                         2 * triangle_count(p.n), d);
  }
};

template <>
struct Shape<"spr2"> : ShapeBase<2> {
  static constexpr std::string_view axes = "nU+xy";
  QTB_CALL(spr2);
  static void describe(const Problem &p, const Kind &kind, Description &d) {
    describe_two_vectors(p, packed_triangle(p.uplo, p.n), symmetric_or_hermitian(kind), 2 * triangle_count(p.n), d);
  }
};

// x := op(T) x, or the solve of op(T) x = b.
inline void describe_triangular_vector(const Problem &p, const Layout &layout, Description &d) {
  d.a = input(layout, true, triangular(p.diag));
  d.x = result(strided(p.n, p.incx), true);
  d.work = products_and_sums(static_cast<double>(layout.count()));
}

template <>
struct Shape<"trmv"> : ShapeBase<2> {
  static constexpr std::string_view axes = "nUADx";
  QTB_CALL(trmv);
  static void describe(const Problem &p, const Kind &, Description &d) {
    describe_triangular_vector(p, triangle(p.uplo, p.n, p.leading(0, p.n)), d);
  }
};

template <>
struct Shape<"tbmv"> : ShapeBase<2> {
  static constexpr std::string_view axes = "nbUADx";
  QTB_CALL(tbmv);
  static void describe(const Problem &p, const Kind &, Description &d) {
    d.problem.k = p.kl;
    describe_triangular_vector(p, band_triangle(p.uplo, p.n, p.kl, p.leading(0, p.kl + 1)), d);
  }
};

template <>
struct Shape<"tpmv"> : ShapeBase<2> {
  static constexpr std::string_view axes = "nUADx";
  QTB_CALL(tpmv);
  static void describe(const Problem &p, const Kind &, Description &d) {
    describe_triangular_vector(p, packed_triangle(p.uplo, p.n), d);
  }
};

}  // namespace qtb::calls
