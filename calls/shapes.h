// What a call of each argument shape is made of: what varies, the arrays and what is done with them, the arithmetic,
// and the arguments in their order. Tests and benchmarks make their calls from this alone, so that a routine of a known
// shape costs neither of them a line. level1.h, level2.h and level3.h have the shapes.
//
//   Problem problem;                                        sizes, options, factors
//   Description d = describe<"gemv">(problem, kind);        arrays and arithmetic
//   Scalars<T> scalars(d);                                  what the scalar arguments point to
//   arguments = scalars.arguments<"gemv">(a, b, c, x, y);   every argument under its name in blas/shapes.h
//   Shape<"gemv">::Call(arguments)(procedure);              procedure(trans, m, n, alpha, a, lda, ...)
#pragma once

#include <string_view>

#include "blas/shapes.h"
#include "calls/layout.h"
#include "calls/problem.h"

namespace qtb::calls {

// ---- names ----

template <std::size_t length>
struct ShapeName {
  char text[length];
  constexpr ShapeName(const char (&name)[length]) {  // NOLINT: a literal is meant to convert
    for (std::size_t i = 0; i < length; ++i) text[i] = name[i];
  }
};
// A shape of blas/shapes.h as a type.
template <ShapeName name>
struct Shape;

// What a routine's name and element type tell, and its shape does not.
struct Kind {
  bool complex = false;
  bool hermitian = false;
  bool conjugated = false;  // cdotc, cgerc and the like
  bool solve = false;       // trsv, tbsv, tpsv, trsm
  bool squares = false;     // a norm that squares its elements
};
template <class T>
constexpr Kind kind_of(std::string_view routine) {
  Kind kind;
  kind.complex = is_complex<T>;
  kind.hermitian = routine[1] == 'h';
  kind.conjugated = routine.size() > 4 && routine[4] == 'c';
  kind.solve = routine[3] == 's';
  kind.squares = routine.ends_with("nrm2");
  return kind;
}

// ---- the description of a call ----

// An array argument.
struct Form {
  Layout layout;
  Structure structure = Structure::general;
  bool is_read = false, is_written = false;
  bool is_argument = false;  // whether the shape has it
};

// Operations in the element type, and operations on its parts one by one. A complex product is four real products and
// two sums, a complex sum is two.
struct Work {
  double products = 0, sums = 0, of_parts = 0;

  double flops(bool complex) const {
    return complex ? 6 * products + 2 * sums + 2 * of_parts : products + sums + of_parts;
  }
};
// So many products, each added to a sum.
inline Work products_and_sums(double count) { return {count, count, 0}; }

struct Description {
  Problem problem;  // with what this shape makes of it: the factor is real, the letter is legal
  Form a, b, c, x, y;
  Work work;

  // Elements read and written.
  double read() const {
    double sum = 0;
    for (const Form *form : {&a, &b, &c, &x, &y})
      if (form->is_read) sum += static_cast<double>(form->layout.count());
    return sum;
  }
  double written() const {
    double sum = 0;
    for (const Form *form : {&a, &b, &c, &x, &y})
      if (form->is_written) sum += static_cast<double>(form->layout.count());
    return sum;
  }
};

inline Form input(const Layout &layout, bool is_read = true, Structure structure = Structure::general) {
  return {layout, structure, is_read, false, true};
}
// Read where the routine adds to what is there.
inline Form result(const Layout &layout, bool is_read, Structure structure = Structure::general) {
  return {layout, structure, is_read, true, true};
}

// ---- arguments ----

// An argument: an address, passed as what the shape's parameter of that name points to.
struct Argument {
  void *address = nullptr;

  Argument() = default;
  template <class U>
  Argument(U *at) : address(const_cast<void *>(static_cast<const void *>(at))) {}  // NOLINT: meant to convert
  template <class U>
  operator U *() const {  // NOLINT: meant to convert
    return static_cast<U *>(address);
  }
};

// Every name that blas/shapes.h gives an argument of a published routine.
struct Arguments {
  Argument side, uplo, trans, transa, transb, diag;
  Argument m, n, k, kl, ku, nz, lda, ldb, ldc, incx, incy, indx;
  Argument alpha, beta, sb, a, ap, b, c, x, y;
  Argument result, s, z, param, d1, d2, x1, y1;
};

// The arguments of a shape, in its order. Stands in each Shape.
#define QTB_CALL(shape)                                                 \
  template <class T>                                                    \
  using Function = QTB_FUNCTION_TYPE(shape, T);                         \
  struct Call : Arguments {                                             \
    explicit Call(const Arguments &arguments) : Arguments(arguments) {} \
    template <class Procedure>                                          \
    decltype(auto) operator()(Procedure &&procedure) const {            \
      return procedure(QTB_ARGS(shape));                                \
    }                                                                   \
  }

constexpr std::string_view size_axes = "mnk", option_axes = "SUABD";

// What a shape has unless it says otherwise. Each has, besides, its QTB_CALL; describe(problem, kind, description); and
// axes, what varies: m n k sizes, l both bandwidths, b one, x y increments, S side, U uplo, A transa or trans, B
// transb, D diag, + alpha, * beta. The letters of options stand in the order of the arguments.
template <int of_level>
struct ShapeBase {
  static constexpr int level = of_level;
  static constexpr bool sparse = false;                         // takes problem.index
  static constexpr bool real_alpha = false, real_beta = false;  // also where the elements are complex
  static constexpr bool changes_scalars = false;                // results stand in scalar arguments
  // The letter for trans that the routine knows, in the place of any letter.
  static char legal_trans(char trans, const Kind &) { return trans; }
  // Factors by which what the arrays hold stays bounded over any number of calls.
  static constexpr Scalar steady_alpha{1, 0}, steady_beta{0, 0};
  // Arguments that stand elsewhere than under their names.
  template <class Scalars>
  static void bind(Scalars &, Arguments &) {}
  // Values, of a kind that programs have, for scalars that no problem gives.
  template <class Scalars>
  static void set_steady(Scalars &) {}
};

template <ShapeName shape>
Description describe(Problem problem, const Kind &kind) {
  using S = Shape<shape>;
  if (!kind.complex || S::real_alpha) problem.alpha.im = 0;
  if (!kind.complex || S::real_beta) problem.beta.im = 0;
  problem.transa = S::legal_trans(problem.transa, kind);
  Description d;
  d.problem = problem;
  S::describe(problem, kind, d);
  return d;
}

// What the scalar arguments of a call point to.
template <class T>
struct Scalars {
  explicit Scalars(const Description &d)
      : side(d.problem.side),
        uplo(d.problem.uplo),
        transa(d.problem.transa),
        transb(d.problem.transb),
        diag(d.problem.diag),
        m(d.problem.m),
        n(d.problem.n),
        k(d.problem.k),
        kl(d.problem.kl),
        ku(d.problem.ku),
        lda(d.a.layout.step),
        ldb(d.b.layout.step),
        ldc(d.c.layout.step),
        incx(d.problem.incx),
        incy(d.problem.incy),
        alpha(scalar<T>(d.problem.alpha)),
        beta(scalar<T>(d.problem.beta)) {}

  // The arguments on these arrays, for as long as this object stays where it is.
  template <ShapeName shape>
  Arguments arguments(T *a, T *b, T *c, T *x, T *y, const QtbInt *indx = nullptr) {
    Arguments to;
    to.side = &side, to.uplo = &uplo, to.trans = to.transa = &transa, to.transb = &transb, to.diag = &diag;
    to.m = &m, to.n = to.nz = &n, to.k = &k, to.kl = &kl, to.ku = &ku;
    to.lda = &lda, to.ldb = &ldb, to.ldc = &ldc, to.incx = &incx, to.incy = &incy, to.indx = indx;
    to.alpha = to.sb = to.z = &alpha, to.beta = &beta;
    to.a = to.ap = a, to.b = b, to.c = c, to.x = x, to.y = y;
    to.result = &result, to.s = &sine, to.param = param, to.d1 = &d1, to.d2 = &d2, to.x1 = &x1, to.y1 = &y1;
    Shape<shape>::bind(*this, to);
    return to;
  }

  char side, uplo, transa, transb, diag;
  QtbInt m, n, k, kl, ku, lda, ldb, ldc, incx, incy;
  T alpha, beta;  // a real factor is the first part
  // What follows is written by calls that have it.
  T result{}, sine{};
  Real<T> cosine{};
  T param[5]{}, d1{}, d2{}, x1{}, y1{};
};

}  // namespace qtb::calls
