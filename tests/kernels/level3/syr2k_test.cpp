// syr2k and her2k in every tier, by the tiers' own procedures: the edges of tiles, all options, the factors that are
// treated apart, memory that runs out; and which products they are made of.
#include "tests/kernels/level3/noted_products.h"

namespace qtb::surface {
namespace {

constexpr char uplos[] = {'U', 'l'}, transes[] = {'n', 'C'};  // the shape makes a legal letter of it

// One of the four forms.
void set_form(Problem &p, int form, QtbInt n, QtbInt k) {
  p.uplo = uplos[form % 2], p.transa = transes[form / 2 % 2];
  p.n = n, p.k = k;
}

struct OrdersUpTo40 {
  template <class P>
  void operator()(P &problems) const {
    for (QtbInt n = 1; n <= 40; ++n)
      for (int form = static_cast<int>(n) / 2 % 2; form < 4; form += is_long() ? 1 : 2) {
        Problem p = problems.draw();
        set_form(p, form, n, Draw(p.seed).one_in(3) ? n : (n * 4 + form) % 23);
        if (!problems.run_one(p)) return;
      }
  }
};

struct EdgesOfTiles {
  template <class P>
  void operator()(P &problems) const {
    for (const QtbInt n : {63, 64, 65, 127, 128, 129, 255, 256, 257}) {
      // Half of the forms, and of large triangles one.
      const int step = is_long() ? 1 : n < 200 ? 2 : 4;
      for (int form = static_cast<int>(n) % step; form < 4; form += step) {
        Problem p = problems.draw();
        set_form(p, form, n, n < 200 ? 1 + form % 3 : 1);
        if (!problems.run_one(p)) return;
      }
    }
  }
};

struct LargeDepths {
  template <class P>
  void operator()(P &problems) const {
    int form = 0;
    for (const QtbInt k : {127, 128, 129, 255, 256, 257, 513})
      for (const QtbInt n : {3, 9}) {
        Problem p = problems.draw();
        set_form(p, ++form, n, k);
        if (!problems.run_one(p)) return;
      }
  }
};

struct Factors {
  template <class P>
  void operator()(P &problems) const {
    int form = 0;
    for (const QtbInt n : {1, 4, 33, 129})
      for (const QtbInt k : {0, 1, 5})
        for (const Scalar alpha : {none, minus_none, one, some})
          for (const Scalar beta : {none, minus_none, one, minus_one, other}) {
            if (n > 100 && ++form % 7 != 0 && !is_long()) continue;
            Problem p = problems.draw();
            set_form(p, ++form, n, k);
            p.alpha = alpha, p.beta = beta;
            if (!problems.run_one(p)) return;
          }
  }
};

struct WithoutMemory {
  template <class P>
  void operator()(P &problems) const {
    int form = 0;
    for (const QtbInt n : {1, 3, 4, 7, 33, 65, 130})
      for (int turn = 0; turn < 2; ++turn) {
        Problem p = problems.draw();
        set_form(p, ++form, n, n > 60 ? 9 : 33);
        if (!problems.run_without_memory(p)) return;
      }
  }
};

struct WholeNumbers {
  template <class P>
  void operator()(P &problems) const {
    for (int number = 0; number < times(60); ++number)
      if (!problems.run_one(problems.draw(Values::exact))) return;
  }
};

struct WithinTheRange {
  template <class P>
  void operator()(P &problems) const {
    for (QtbInt n = 1; n <= 13; ++n)
      for (int form = 0; form < 4; ++form) {
        Problem p = problems.draw();
        set_form(p, form, n, 1 + n % 5);
        p.beta = form % 2 == 0 ? none : one;
        problems.run_within_the_range(p);
      }
  }
};

template <ShapeName shape, class T, class Function>
void register_routine(const char *name, Function *const (&tiers)[tier_count]) {
  const auto in_every_tier = [&](const char *test, auto body) {
    register_in_every_tier<shape, T>(name, tiers, test, body);
  };
  in_every_tier("orders_up_to_40_lie_within_the_bound", OrdersUpTo40());
  in_every_tier("edges_of_tiles_lie_within_the_bound", EdgesOfTiles());
  in_every_tier("large_depths_lie_within_the_bound", LargeDepths());
  in_every_tier("factors_of_zero_and_one_are_as_published", Factors());
  in_every_tier("each_request_for_memory_may_fail", WithoutMemory());
  in_every_tier("results_in_whole_numbers_are_exact", WholeNumbers());
  in_every_tier("no_lane_leaves_the_range", WithinTheRange());
}

void register_all() {
#define QTB_REGISTER(name, shape, T) \
  register_routine<#shape, T, QTB_FUNCTION_TYPE(shape, T)>(#name, QTB_ALL_TIERS(name));
  QTB_REGISTER(ssyr2k, syr2k, float)
  QTB_REGISTER(dsyr2k, syr2k, double)
  QTB_REGISTER(csyr2k, syr2k, cfloat)
  QTB_REGISTER(zsyr2k, syr2k, cdouble)
  QTB_REGISTER(cher2k, her2k, cfloat)
  QTB_REGISTER(zher2k, her2k, cdouble)
#undef QTB_REGISTER
}

}  // namespace
}  // namespace qtb::surface

namespace qtb::test {
namespace {

// ---- The products that it is made of ----

// Operands of zeros.
template <class T>
struct Operands {
  QtbInt n, k, ld;
  T alpha = surface::scalar<T>({0.5, 0.25});
  std::vector<T> a, b, c;
  Operands(const char *trans, QtbInt order, QtbInt depth)
      : n(order),
        k(depth),
        ld(*trans == 'N' ? order : depth),
        a(static_cast<std::size_t>(order * depth)),
        b(a),
        c(static_cast<std::size_t>(order * order)) {}
  const T *row(const std::vector<T> &matrix, QtbInt i) const { return matrix.data() + (ld == n ? i : i * ld); }
};

// The two products of the tile at row i0 and column j0: into C, or on the diagonal into a buffer.
template <class T>
void expect_tile(const Operands<T> &of, const char *ops, std::size_t first, QtbInt i0, QtbInt rows, QtbInt j0,
                 QtbInt columns, std::complex<double> second_alpha) {
  SCOPED_TRACE(first);
  ASSERT_LE(first + 2, noted_products.size());
  const NotedProduct &one = noted_products[first], &two = noted_products[first + 1];
  for (const NotedProduct *p : {&one, &two}) {
    EXPECT_EQ(p->ops, ops);
    EXPECT_EQ(p->m, rows);
    EXPECT_EQ(p->n, columns);
    EXPECT_EQ(p->k, of.k);
    if (i0 != j0) {
      EXPECT_EQ(p->c, of.c.data() + i0 + j0 * of.n);
    }
  }
  EXPECT_EQ(one.a, of.row(of.a, i0));
  EXPECT_EQ(one.b, of.row(of.b, j0));
  EXPECT_EQ(two.a, of.row(of.b, i0));
  EXPECT_EQ(two.b, of.row(of.a, j0));
  EXPECT_EQ(one.alpha, noted_factor(of.alpha));
  EXPECT_EQ(two.alpha, second_alpha);
  EXPECT_EQ(one.beta, i0 == j0 ? 0.0 : 1.0);
  EXPECT_EQ(two.beta, 1.0);
  EXPECT_EQ(one.c, two.c);
}

template <class T, class Function, class S>
void expect_tiles(Function *procedure, const char *uplo, const char *trans, const char *ops, S beta,
                  std::complex<double> second_alpha) {
  SCOPED_TRACE(std::string(uplo) + trans);
  const QtbInt tile = 128, n = 258, rest = 2;
  Operands<T> of(trans, n, 3);
  noted_products.clear();
  notes_products = true;
  procedure(uplo, trans, &of.n, &of.k, &of.alpha, of.a.data(), &of.ld, of.b.data(), &of.ld, &beta, of.c.data(), &of.n);
  notes_products = false;
  ASSERT_EQ(noted_products.size(), 12U);
  const auto expect = [&](std::size_t number, QtbInt i0, QtbInt j0) {
    expect_tile(of, ops, 2 * number, i0, i0 == 2 * tile ? rest : tile, j0, j0 == 2 * tile ? rest : tile, second_alpha);
  };
  if (*uplo == 'U') {
    expect(0, 0, 0);
    expect(1, 0, tile), expect(2, tile, tile);
    expect(3, 0, 2 * tile), expect(4, tile, 2 * tile), expect(5, 2 * tile, 2 * tile);
  } else {
    expect(0, tile, 0), expect(1, 2 * tile, 0), expect(2, 0, 0);
    expect(3, 2 * tile, tile), expect(4, tile, tile);
    expect(5, 2 * tile, 2 * tile);
  }
}

TEST(Syr2k, MultipliesTwicePerTileOf128) {
  if (!processor_runs(tier_sse42)) GTEST_SKIP();
  for (const char *uplo : {"U", "L"}) {
    expect_tiles<double>(qtb_blas_sse42_xdsyr2k, uplo, "N", "NT", 2.0, 0.5);
    expect_tiles<double>(qtb_blas_sse42_xdsyr2k, uplo, "T", "TN", 2.0, 0.5);
    expect_tiles<cdouble>(qtb_blas_sse42_xzsyr2k, uplo, "N", "NT", cdouble{2, 0}, {0.5, 0.25});
    expect_tiles<cdouble>(qtb_blas_sse42_xzsyr2k, uplo, "T", "TN", cdouble{2, 0}, {0.5, 0.25});
  }
}

TEST(Her2k, MultipliesByTheConjugateOfAlphaInTheSecondProduct) {
  if (!processor_runs(tier_sse42)) GTEST_SKIP();
  for (const char *uplo : {"U", "L"}) {
    expect_tiles<cdouble>(qtb_blas_sse42_xzher2k, uplo, "N", "NC", 2.0, {0.5, -0.25});
    expect_tiles<cdouble>(qtb_blas_sse42_xzher2k, uplo, "C", "CN", 2.0, {0.5, -0.25});
  }
}

// Nothing to add and nothing to scale: also the imaginary parts of a Hermitian diagonal stay.
template <class T, class Function, class S>
void expect_untouched(Function *const (&tiers)[tier_count], S one) {
  const QtbInt n = 3, k = 2, no = 0;
  const T zero{}, alpha = surface::scalar<T>({2, 1});
  in_every_tier([&](int tier) {
    SCOPED_TRACE(tier_name(tier));
    tiers[tier]("U", "N", &no, &k, &alpha, nullptr, &n, nullptr, &n, &one, nullptr, &n);
    tiers[tier]("U", "N", &n, &no, &alpha, nullptr, &n, nullptr, &n, &one, nullptr, &n);
    tiers[tier]("L", "N", &n, &k, &zero, nullptr, &n, nullptr, &n, &one, nullptr, &n);
  });
}

TEST(Syr2k, TouchesNothingWhereNothingIsToBeDone) {
  expect_untouched<float, QTB_FUNCTION_TYPE(syr2k, float)>(QTB_ALL_TIERS(ssyr2k), 1.0F);
  expect_untouched<double, QTB_FUNCTION_TYPE(syr2k, double)>(QTB_ALL_TIERS(dsyr2k), 1.0);
  expect_untouched<cfloat, QTB_FUNCTION_TYPE(syr2k, cfloat)>(QTB_ALL_TIERS(csyr2k), cfloat{1, 0});
  expect_untouched<cdouble, QTB_FUNCTION_TYPE(syr2k, cdouble)>(QTB_ALL_TIERS(zsyr2k), cdouble{1, 0});
  expect_untouched<cfloat, QTB_FUNCTION_TYPE(her2k, cfloat)>(QTB_ALL_TIERS(cher2k), 1.0F);
  expect_untouched<cdouble, QTB_FUNCTION_TYPE(her2k, cdouble)>(QTB_ALL_TIERS(zher2k), 1.0);
}

}  // namespace
}  // namespace qtb::test

int main(int argc, char **argv) { return qtb::surface::run_suite(argc, argv, qtb::surface::register_all); }
