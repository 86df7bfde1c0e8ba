// The descriptions of calls, by value: arithmetic and elements moved against counts made by hand, and the arguments of
// every routine against the list that blas/shapes.h has for its shape.

#include <gtest/gtest.h>

#include <set>
#include <string>

#include "calls/level1.h"
#include "calls/level3.h"

namespace {

using namespace qtb::calls;

constexpr QtbInt m = 7, n = 5, k = 3;

Problem problem() {
  Problem p;
  p.m = m, p.n = n, p.k = k, p.kl = 2, p.ku = 1;
  p.alpha = {2, 1}, p.beta = {1, 0};
  return p;
}

template <ShapeName shape>
Description real(const Problem &p, const Kind &kind = {}) {
  return describe<shape>(p, kind);
}
Kind complex_kind() {
  Kind kind;
  kind.complex = true;
  return kind;
}
// Flops of a real and of a complex routine.
template <ShapeName shape>
void expect_flops(double real_flops, double complex_flops, const Kind &kind = complex_kind()) {
  EXPECT_EQ(describe<shape>(problem(), {}).work.flops(false), real_flops) << shape.text;
  EXPECT_EQ(describe<shape>(problem(), kind).work.flops(true), complex_flops) << shape.text;
}

TEST(Descriptions, flops_of_vectors_are_the_usual_counts) {
  expect_flops<"axpy">(2 * n, 8 * n);
  expect_flops<"dot">(2 * n, 8 * n);
  expect_flops<"copy">(0, 0);
  expect_flops<"scal">(n, 6 * n);
  expect_flops<"real_scal">(n, 2 * n);
  expect_flops<"rot">(6 * n, 12 * n);
  expect_flops<"search">(n, 2 * n);
  expect_flops<"norm">(n, 2 * n);
  Kind squares = complex_kind();
  squares.squares = true;
  EXPECT_EQ(describe<"norm">(problem(), squares).work.flops(true), 4 * n);
}

TEST(Descriptions, flops_of_matrices_are_the_usual_counts) {
  expect_flops<"gemv">(2 * m * n, 8 * m * n);
  expect_flops<"ger">(2 * m * n, 8 * m * n);
  expect_flops<"symv">(2 * n * n, 8 * n * n);
  expect_flops<"spmv">(2 * n * n, 8 * n * n);
  expect_flops<"syr">(n * (n + 1), 4 * n * (n + 1));
  expect_flops<"spr2">(2 * n * (n + 1), 8 * n * (n + 1));
  expect_flops<"trmv">(n * (n + 1), 4 * n * (n + 1));
  expect_flops<"tpmv">(n * (n + 1), 4 * n * (n + 1));
  // Of 7 by 5 with two diagonals below and one above: 3, 4, 4, 4 and 4 elements by column.
  expect_flops<"gbmv">(2 * 19, 8 * 19);
  // Five on the diagonal, four and three beside it.
  expect_flops<"tbmv">(2 * 12, 8 * 12);
  expect_flops<"sbmv">(2 * (5 + 2 * 7), 8 * (5 + 2 * 7));
  expect_flops<"gemm">(2 * m * n * k, 8 * m * n * k);
  expect_flops<"symm">(2 * m * m * n, 8 * m * m * n);
  expect_flops<"syrk">(n * (n + 1) * k, 4 * n * (n + 1) * k);
  expect_flops<"syr2k">(2 * n * (n + 1) * k, 8 * n * (n + 1) * k);
  expect_flops<"trmm">(m * (m + 1) * n, 4 * m * (m + 1) * n);
  Problem right = problem();
  right.side = 'R';
  EXPECT_EQ(real<"symm">(right).work.flops(false), 2 * m * n * n);
  EXPECT_EQ(real<"trmm">(right).work.flops(false), m * n * (n + 1));
}

TEST(Descriptions, each_element_counts_once_in_each_direction) {
  const auto expect = [](const Description &d, double read, double written) {
    EXPECT_EQ(d.read(), read);
    EXPECT_EQ(d.written(), written);
  };
  expect(real<"axpy">(problem()), 2 * n, n);
  expect(real<"copy">(problem()), n, n);
  expect(real<"swap">(problem()), 2 * n, 2 * n);
  expect(real<"gemv">(problem()), m * n + n + m, m);
  expect(real<"ger">(problem()), m * n + n + m, m * n);
  expect(real<"spr">(problem()), n * (n + 1) / 2 + n, n * (n + 1) / 2);
  expect(real<"trmv">(problem()), n * (n + 1) / 2 + n, n);
  expect(real<"tbmv">(problem()), 12 + n, n);
  expect(real<"syrk">(problem()), n * k + n * (n + 1) / 2, n * (n + 1) / 2);
}

TEST(Descriptions, what_a_factor_of_zero_leaves_is_not_read) {
  Problem p = problem();
  p.alpha = {}, p.beta = {};
  const Description product = real<"gemm">(p), vector = real<"gemv">(p), triangular = real<"trmm">(p);
  EXPECT_EQ(product.read() + vector.read() + triangular.read(), 0);
  EXPECT_EQ(product.written(), m * n);
  // An imaginary part is no factor of a real routine, nor of one whose factor is real.
  p.alpha = {0, 1};
  EXPECT_EQ(real<"gemm">(p).read(), 0);
  EXPECT_GT(describe<"gemm">(p, complex_kind()).read(), 0);
  EXPECT_EQ(describe<"her">(p, complex_kind()).x.is_read, false);
  EXPECT_EQ(describe<"herk">(p, complex_kind()).read(), 0);
}

TEST(Descriptions, transposition_turns_operands_over) {
  Problem p = problem();
  p.transa = 'T', p.transb = 'C', p.spare[0] = 4;
  const Description d = real<"gemm">(p);
  EXPECT_EQ(d.a.layout.rows, k);
  EXPECT_EQ(d.a.layout.cols, m);
  EXPECT_EQ(d.a.layout.step, k + 4);
  EXPECT_EQ(d.b.layout.rows, n);
  EXPECT_EQ(d.c.layout.rows, m);
  const Description v = real<"gemv">(p);
  EXPECT_EQ(v.x.layout.rows, m);
  EXPECT_EQ(v.y.layout.rows, n);
}

TEST(Descriptions, letters_of_trans_are_those_that_the_routine_knows) {
  Kind hermitian = complex_kind();
  hermitian.hermitian = true;
  for (const char trans : {'N', 'T', 'C'}) {
    Problem p = problem();
    p.transa = trans;
    EXPECT_EQ(describe<"syrk">(p, {}).problem.transa, trans);
    EXPECT_EQ(describe<"syrk">(p, complex_kind()).problem.transa, trans == 'N' ? 'N' : 'T');
    EXPECT_EQ(describe<"her2k">(p, hermitian).problem.transa, trans == 'N' ? 'N' : 'C');
    EXPECT_EQ(describe<"trmm">(p, complex_kind()).problem.transa, trans);
  }
}

TEST(Descriptions, layouts_end_where_their_last_element_lies) {
  EXPECT_EQ(full(m, n, 9).extent(), 4 * 9 + m);
  EXPECT_EQ(triangle('U', n, 9).extent(), 4 * 9 + n);
  EXPECT_EQ(triangle('L', n, 9).extent(), 4 * 9 + n);
  EXPECT_EQ(packed_triangle('U', n).extent(), n * (n + 1) / 2);
  EXPECT_EQ(packed_triangle('L', n).extent(), n * (n + 1) / 2);
  EXPECT_EQ(strided(n, -3).extent(), 4 * 3 + 1);
  EXPECT_EQ(strided(n, 0).extent(), 1);
  EXPECT_EQ(full(0, n, 1).extent(), 0);
  for (const QtbInt rows : {1, 4, 9})
    for (const QtbInt cols : {1, 5, 8})
      for (const QtbInt kl : {0, 2, 12})
        for (const QtbInt ku : {0, 1, 12}) {
          const Layout layout = band(rows, cols, kl, ku, kl + ku + 1);
          QtbInt end = 0, count = 0;
          for (QtbInt j = 0; j < cols; ++j)
            for (QtbInt i = 0; i < rows; ++i)
              if (layout.stores(i, j)) end = std::max(end, layout.position(i, j) + 1), ++count;
          EXPECT_EQ(layout.extent(), end);
          EXPECT_EQ(layout.count(), count);
        }
}

// Argument i of a call holds address i: a call passes each name of the list, once.
template <ShapeName shape, class T>
void expect_every_argument_is_passed(const char *routine) {
  Problem p = problem();
  const QtbInt index[n] = {1, 2, 3, 4, 5};
  p.index = index;
  Scalars<T> scalars(describe<shape>(p, kind_of<T>(routine)));
  T arrays[5];
  const Arguments arguments =
      scalars.template arguments<shape>(&arrays[0], &arrays[1], &arrays[2], &arrays[3], &arrays[4], index);
  typename Shape<shape>::Call call(arguments);
  call([&](auto... passed) {
    std::set<void *> different{static_cast<void *>(passed)...};
    EXPECT_EQ(different.size(), sizeof...(passed)) << routine;
    EXPECT_EQ(different.count(nullptr), 0U) << routine;
  });
}

TEST(Descriptions, every_routine_has_all_its_arguments) {
#define QTB_ROUTINE(name, NAME, shape, T, route) expect_every_argument_is_passed<#shape, T>(#name);
#include "blas/routines.def"
#undef QTB_ROUTINE
}

TEST(Descriptions, names_tell_what_shapes_do_not) {
  EXPECT_TRUE(kind_of<cdouble>("zhemm").hermitian);
  EXPECT_FALSE(kind_of<cdouble>("zsymm").hermitian);
  EXPECT_TRUE(kind_of<cfloat>("cgerc").conjugated);
  EXPECT_FALSE(kind_of<cfloat>("cgeru").conjugated);
  EXPECT_TRUE(kind_of<double>("dtrsv").solve);
  EXPECT_FALSE(kind_of<double>("dtrmv").solve);
  EXPECT_TRUE(kind_of<cdouble>("dznrm2").squares);
  EXPECT_FALSE(kind_of<cdouble>("dzasum").squares);
}

}  // namespace
