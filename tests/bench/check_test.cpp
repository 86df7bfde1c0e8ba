// The check that a comparison makes of a call before it is timed: every routine of Levels 2 and 3 passes it, and fails
// it with one wrong element, or when nothing is computed.

#include "bench/check.h"

#include <gtest/gtest.h>

#include "bench/bound.h"
#include "blas/shapes.h"
#include "calls/level1.h"

extern "C" {
#define QTB_ROUTINE(name, NAME, shape, T, route) QTB_FUNCTION(shape, T, name);
#include "blas/routines.def"
#undef QTB_ROUTINE
}

namespace {

using namespace qtb::calls;
using qtb::bench::Bound;
using qtb::bench::is_correct;

template <class B>
auto &written(B &bound) {
  for (auto *operand : {&bound.a, &bound.b, &bound.c, &bound.x, &bound.y})
    if (operand->form().is_written) return *operand;
  return bound.a;
}

// The types differ in nothing that the check does: two of them stand for four.
template <ShapeName shape, class T, class Procedure>
void expect_the_check_tells(const char *name, Procedure *procedure) {
  if constexpr (Shape<shape>::level > 1 && sizeof(Real<T>) == sizeof(double)) {
    const Kind kind = kind_of<T>(name);
    for (const char letter : {'N', 'T', 'C'})
      for (const char side : {'L', 'R'})
        for (const Scalar beta : {Scalar{0, 0}, Scalar{-2, 1}}) {
          Problem p;
          p.m = 7, p.n = 6, p.k = 5, p.kl = 2, p.ku = 1, p.incx = 2, p.incy = -1;
          p.spare[0] = p.spare[1] = p.spare[2] = 2;
          p.transa = p.transb = letter, p.side = side, p.uplo = side == 'L' ? 'U' : 'L';
          p.alpha = {2, -1}, p.beta = beta;
          Bound<shape, T> bound(p, kind, {});
          const typename Shape<shape>::Call call(bound.arguments);
          const auto text = testing::Message() << name << ' ' << letter << side << ' ' << beta.re;
          EXPECT_TRUE(is_correct(Shape<shape>(), bound, [&] { call(procedure); })) << text;
          EXPECT_FALSE(is_correct(Shape<shape>(), bound, [&] {
            call(procedure);
            auto &out = written(bound);
            const QtbInt i = out.rows() - 1, j = out.columns() > 1 ? i < out.columns() ? i : out.columns() - 1 : 0;
            out.set(i, j, out.at(i, j) + 1.0);
          })) << text;
          EXPECT_FALSE(is_correct(Shape<shape>(), bound, [] {})) << text;
        }
  }
}

TEST(CheckOfACall, every_routine_of_levels_2_and_3_passes_and_one_wrong_element_fails) {
#define QTB_ROUTINE(name, NAME, shape, T, route) expect_the_check_tells<#shape, T>(#name, &name);
#include "blas/routines.def"
#undef QTB_ROUTINE
}

}  // namespace
