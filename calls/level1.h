// The shapes of Level 1 and of the sparse vectors. The index list of a sparse vector is of problem.index.
#pragma once

#include "calls/shapes.h"

namespace qtb::calls {

inline Layout vector_x(const Problem &p) { return strided(p.n, p.incx); }
inline Layout vector_y(const Problem &p) { return strided(p.n, p.incy); }
inline Layout compressed(const Problem &p) { return strided(p.n, 1); }
inline Layout scattered(const Problem &p) { return indexed(p.n, p.index); }

// ---- updates and moves ----

// y := alpha*x + y.
inline void describe_update(const Problem &p, const Layout &x, const Layout &y, Description &d) {
  d.x = input(x, !p.alpha.is_zero());
  d.y = result(y, true);
  d.work = products_and_sums(static_cast<double>(p.n));
}

template <>
struct Shape<"axpy"> : ShapeBase<1> {
  static constexpr std::string_view axes = "n+xy";
  static constexpr Scalar steady_alpha{1e-6, 1e-6};
  QTB_CALL(axpy);
  static void describe(const Problem &p, const Kind &, Description &d) {
    describe_update(p, vector_x(p), vector_y(p), d);
  }
};

template <>
struct Shape<"copy"> : ShapeBase<1> {
  static constexpr std::string_view axes = "nxy";
  QTB_CALL(copy);
  static void describe(const Problem &p, const Kind &, Description &d) {
    d.x = input(vector_x(p));
    d.y = result(vector_y(p), false);
  }
};

template <>
struct Shape<"swap"> : ShapeBase<1> {
  static constexpr std::string_view axes = "nxy";
  QTB_CALL(swap);
  static void describe(const Problem &p, const Kind &, Description &d) {
    d.x = result(vector_x(p), true);
    d.y = result(vector_y(p), true);
  }
};

template <>
struct Shape<"scal"> : ShapeBase<1> {
  static constexpr std::string_view axes = "n+x";
  static constexpr Scalar steady_alpha{-1, 0};
  QTB_CALL(scal);
  static void describe(const Problem &p, const Kind &, Description &d) {
    d.x = result(vector_x(p), true);
    d.work.products = static_cast<double>(p.n);
  }
};
template <>
struct Shape<"real_scal"> : Shape<"scal"> {
  static constexpr bool real_alpha = true;
  static void describe(const Problem &p, const Kind &, Description &d) {
    d.x = result(vector_x(p), true);
    d.work.of_parts = static_cast<double>(p.n);
  }
};

// ---- dot products ----

inline void describe_dot(const Problem &p, const Layout &x, const Layout &y, Description &d) {
  d.x = input(x);
  d.y = input(y);
  d.work = products_and_sums(static_cast<double>(p.n));
}

template <>
struct Shape<"dot"> : ShapeBase<1> {
  static constexpr std::string_view axes = "nxy";
  QTB_CALL(dot);
  static void describe(const Problem &p, const Kind &, Description &d) { describe_dot(p, vector_x(p), vector_y(p), d); }
};
template <>
struct Shape<"dsdot"> : Shape<"dot"> {};
template <>
struct Shape<"cdot"> : Shape<"dot"> {
  QTB_CALL(cdot);
};
template <>
struct Shape<"sdsdot"> : Shape<"dot"> {
  static constexpr std::string_view axes = "n+xy";
  QTB_CALL(sdsdot);
};

// ---- rotations ----

// Two vectors by a map of the plane.
inline void describe_plane_map(const Problem &p, const Layout &x, const Layout &y, Description &d) {
  d.x = result(x, true);
  d.y = result(y, true);
  d.work.of_parts = 6 * static_cast<double>(p.n);
}

// The cosine is alpha and the sine beta, both real.
template <>
struct Shape<"rot"> : ShapeBase<1> {
  static constexpr std::string_view axes = "n+*xy";
  static constexpr bool real_alpha = true, real_beta = true;
  static constexpr Scalar steady_alpha{0.6, 0}, steady_beta{0.8, 0};
  QTB_CALL(rot);
  template <class Scalars>
  static void bind(Scalars &scalars, Arguments &to) {
    to.c = &scalars.alpha, to.s = &scalars.beta;
  }
  static void describe(const Problem &p, const Kind &, Description &d) {
    describe_plane_map(p, vector_x(p), vector_y(p), d);
  }
};

// By the five numbers of param.
template <>
struct Shape<"rotm"> : ShapeBase<1> {
  static constexpr std::string_view axes = "nxy";
  QTB_CALL(rotm);
  // A rotation.
  template <class Scalars>
  static void set_steady(Scalars &scalars) {
    constexpr double rotation[] = {-1, 0.6, -0.8, 0.8, 0.6};
    for (int i = 0; i < 5; ++i)
      scalars.param[i] = static_cast<std::remove_reference_t<decltype(scalars.d1)>>(rotation[i]);
  }
  static void describe(const Problem &p, const Kind &, Description &d) {
    describe_plane_map(p, vector_x(p), vector_y(p), d);
  }
};

// a is alpha and b beta.
template <>
struct Shape<"rotg"> : ShapeBase<1> {
  static constexpr std::string_view axes = "+*";
  static constexpr bool changes_scalars = true;
  static constexpr Scalar steady_alpha{3, 1}, steady_beta{4, 2};
  QTB_CALL(rotg);
  template <class Scalars>
  static void bind(Scalars &scalars, Arguments &to) {
    to.a = &scalars.alpha, to.b = &scalars.beta, to.c = &scalars.cosine;
  }
  static void describe(const Problem &, const Kind &, Description &d) { d.work.of_parts = 8; }
};

// d1, d2, x1 and y1 are set by whoever calls.
template <>
struct Shape<"rotmg"> : ShapeBase<1> {
  static constexpr std::string_view axes = "";
  static constexpr bool changes_scalars = true;
  QTB_CALL(rotmg);
  template <class Scalars>
  static void set_steady(Scalars &scalars) {
    scalars.d1 = 2, scalars.d2 = 3, scalars.x1 = 1.5, scalars.y1 = 0.5;
  }
  static void describe(const Problem &, const Kind &, Description &d) { d.work.of_parts = 12; }
};

// ---- norms, sums, searches ----

template <>
struct Shape<"norm"> : ShapeBase<1> {
  static constexpr std::string_view axes = "nx";
  QTB_CALL(norm);
  static void describe(const Problem &p, const Kind &kind, Description &d) {
    d.x = input(vector_x(p));
    d.work.of_parts = (kind.squares ? 2 : 1) * static_cast<double>(p.n);
  }
};

template <>
struct Shape<"search"> : ShapeBase<1> {
  static constexpr std::string_view axes = "nx";
  QTB_CALL(search);
  static void describe(const Problem &p, const Kind &, Description &d) {
    d.x = input(vector_x(p));
    d.work.of_parts = static_cast<double>(p.n);
  }
};

template <>
struct Shape<"cabs1"> : ShapeBase<1> {
  static constexpr std::string_view axes = "+";
  QTB_CALL(cabs1);
  static void describe(const Problem &, const Kind &, Description &d) { d.work.of_parts = 1; }
};

// ---- sparse vectors ----

struct SparseShape : ShapeBase<1> {
  static constexpr bool sparse = true;
};

template <>
struct Shape<"axpyi"> : SparseShape {
  static constexpr std::string_view axes = "n+";
  static constexpr Scalar steady_alpha{1e-6, 1e-6};
  QTB_CALL(axpyi);
  template <class Scalars>
  static void bind(Scalars &scalars, Arguments &to) {
    to.a = &scalars.alpha;
  }
  static void describe(const Problem &p, const Kind &, Description &d) {
    describe_update(p, compressed(p), scattered(p), d);
  }
};

template <>
struct Shape<"doti"> : SparseShape {
  static constexpr std::string_view axes = "n";
  QTB_CALL(doti);
  static void describe(const Problem &p, const Kind &, Description &d) {
    describe_dot(p, compressed(p), scattered(p), d);
  }
};
template <>
struct Shape<"cdoti"> : Shape<"doti"> {
  QTB_CALL(cdoti);
};

template <>
struct Shape<"gthr"> : SparseShape {
  static constexpr std::string_view axes = "n";
  QTB_CALL(gthr);
  static void describe(const Problem &p, const Kind &, Description &d) {
    d.x = result(compressed(p), false);
    d.y = input(scattered(p));
  }
};
// The one that leaves zeros behind.
template <>
struct Shape<"gthrz"> : SparseShape {
  static constexpr std::string_view axes = "n";
  QTB_CALL(gthrz);
  static void describe(const Problem &p, const Kind &, Description &d) {
    d.x = result(compressed(p), false);
    d.y = result(scattered(p), true);
  }
};

template <>
struct Shape<"sctr"> : SparseShape {
  static constexpr std::string_view axes = "n";
  QTB_CALL(sctr);
  static void describe(const Problem &p, const Kind &, Description &d) {
    d.x = input(compressed(p));
    d.y = result(scattered(p), false);
  }
};

template <>
struct Shape<"roti"> : SparseShape {
  static constexpr std::string_view axes = "n+*";
  static constexpr Scalar steady_alpha{0.6, 0}, steady_beta{0.8, 0};
  QTB_CALL(roti);
  template <class Scalars>
  static void bind(Scalars &scalars, Arguments &to) {
    to.c = &scalars.alpha, to.s = &scalars.beta;
  }
  static void describe(const Problem &p, const Kind &, Description &d) {
    describe_plane_map(p, compressed(p), scattered(p), d);
  }
};

}  // namespace qtb::calls
