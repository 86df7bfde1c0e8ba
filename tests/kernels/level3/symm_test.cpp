// symm and hemm in every tier, by the tiers' own procedures: the edges of tiles and steps, all options, the factors
// that are treated apart, memory that runs out; which products they are made of, and what they ask of the memory
// service.
#include "tests/kernels/level3/noted_products.h"

#define QTB_SYMM_ROUTINES(X) \
  X(ssymm, float) X(dsymm, double) X(csymm, cfloat) X(zsymm, cdouble) X(chemm, cfloat) X(zhemm, cdouble)

namespace qtb::surface {
namespace {

constexpr char sides[] = {'L', 'r'}, uplos[] = {'U', 'l'};

// One of the four forms, of a matrix of an order; the extent of the other dimension.
void set_form(Problem &p, int form, QtbInt order, QtbInt others) {
  p.side = sides[form % 2], p.uplo = uplos[form / 2 % 2];
  p.m = form % 2 == 0 ? order : others, p.n = form % 2 == 0 ? others : order;
}

struct OrdersUpTo40 {
  template <class P>
  void operator()(P &problems) const {
    int number = 0;
    for (QtbInt order = 1; order <= 40; ++order)
      for (int form = 0; form < 4; ++form) {
        Problem p = problems.draw();
        set_form(p, form, order, Draw(p.seed).one_in(3) ? order : 1 + ++number % 23);
        if (!problems.run_one(p)) return;
      }
  }
};

struct EdgesOfTiles {
  template <class P>
  void operator()(P &problems) const {
    for (const QtbInt order : {63, 64, 65, 127, 128, 129, 255, 256, 257, 513}) {
      const bool is_large = order > 200 && !is_long();
      for (int form = is_large ? static_cast<int>(order % 2) : 0; form < 4; form += is_large ? 3 : 1) {
        Problem p = problems.draw();
        set_form(p, form, order, order > 500 ? 1 : 3);
        if (!problems.run_one(p)) return;
      }
    }
  }
};

struct EdgesOfSteps {
  template <class P>
  void operator()(P &problems) const {
    for (const QtbInt others : {4999, 5000, 5001, 10001})
      for (int form = 0; form < 4; ++form) {
        if (others > 6000 && !is_long()) continue;
        Problem p = problems.draw();
        set_form(p, form, 1 + form, others);
        if (!problems.run_one(p)) return;
      }
  }
};

struct Factors {
  template <class P>
  void operator()(P &problems) const {
    int form = 0;
    for (const QtbInt order : {1, 4, 7, 33})
      for (const Scalar alpha : {none, minus_none, one, some})
        for (const Scalar beta : {none, minus_none, one, minus_one, other}) {
          Problem p = problems.draw();
          ++form;
          set_form(p, form, order, 1 + form % 9);
          p.alpha = alpha, p.beta = beta;
          if (!problems.run_one(p)) return;
        }
  }
};

struct WithoutMemory {
  template <class P>
  void operator()(P &problems) const {
    int form = 0;
    for (const QtbInt order : {1, 3, 4, 7, 31, 32, 33, 64, 65, 100})
      for (int turn = 0; turn < 2; ++turn) {
        Problem p = problems.draw();
        set_form(p, ++form, order, order > 60 ? 9 : 33);
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
    for (QtbInt order = 1; order <= 13; ++order)
      for (int form = 0; form < 4; ++form) {
        Problem p = problems.draw();
        set_form(p, form, order, 1 + order % 5);
        p.beta = form == 0 ? none : one;
        problems.run_within_the_range(p);
      }
  }
};

template <class T, class Function>
void register_routine(const char *name, Function *const (&tiers)[tier_count]) {
  const auto in_every_tier = [&](const char *test, auto body) {
    register_in_every_tier<"symm", T>(name, tiers, test, body);
  };
  in_every_tier("orders_up_to_40_lie_within_the_bound", OrdersUpTo40());
  in_every_tier("edges_of_tiles_lie_within_the_bound", EdgesOfTiles());
  in_every_tier("edges_of_steps_lie_within_the_bound", EdgesOfSteps());
  in_every_tier("factors_of_zero_and_one_are_as_published", Factors());
  in_every_tier("each_request_for_memory_may_fail", WithoutMemory());
  in_every_tier("results_in_whole_numbers_are_exact", WholeNumbers());
  in_every_tier("no_lane_leaves_the_range", WithinTheRange());
}

void register_all() {
#define QTB_REGISTER(name, T) register_routine<T, QTB_FUNCTION_TYPE(symm, T)>(#name, QTB_ALL_TIERS(name));
  QTB_SYMM_ROUTINES(QTB_REGISTER)
#undef QTB_REGISTER
}

}  // namespace
}  // namespace qtb::surface

namespace qtb::test {
namespace {

// ---- Memory, and what ends a call early ----

template <class T>
using Procedure = QTB_FUNCTION_TYPE(symm, T);

template <class T>
class EarlyExits {
 public:
  explicit EarlyExits(Procedure<T> *procedure) : procedure_(procedure) {}

  // Operands at addresses that nobody may touch.
  void expect_no_touch(QtbInt m, QtbInt n, Real<T> alpha, Real<T> beta) { call(m, n, alpha, beta, nullptr); }
  // An alpha of 0 with neither operand.
  void expect_scaled(Real<T> beta, Real<T> before, Real<T> after) {
    constexpr QtbInt m = 5, n = 3;
    std::vector<T> c(m * n);
    for (T &e : c) e = surface::scalar<T>({before, before});
    call(m, n, 0, beta, c.data());
    const T want = surface::scalar<T>({after, after});
    for (const T &e : c) EXPECT_EQ(std::memcmp(&e, &want, sizeof(T)), 0);
  }

 private:
  void call(QtbInt m, QtbInt n, Real<T> alpha, Real<T> beta, T *c) {
    const T wide_alpha = surface::scalar<T>({alpha, 0}), wide_beta = surface::scalar<T>({beta, 0});
    const QtbInt ld = 5;
    const std::uint64_t tile = sizeof(T) == 16 ? 1048576 : 524288;
    for (const char *side : {"L", "R"}) {
      if (c != nullptr && *side == 'R') break;  // C was scaled
      buffer_memory.requests.clear();
      procedure_(side, "U", &m, &n, &wide_alpha, nullptr, &ld, nullptr, &ld, &wide_beta, c, &ld);
      EXPECT_EQ(buffer_memory.requests, std::vector<std::uint64_t>{tile}) << "room for a tile, whatever its element";
      EXPECT_EQ(buffer_memory.outstanding, 0);
    }
  }

  Procedure<T> *procedure_;
};

template <class T>
void test_early_exits(Procedure<T> *const (&tiers)[tier_count]) {
  in_every_tier([&](int tier) {
    SCOPED_TRACE(tier_name(tier));
    EarlyExits<T> of(tiers[tier]);
    of.expect_no_touch(0, 3, 2, 3);
    of.expect_no_touch(3, 0, 2, 3);
    of.expect_no_touch(0, 0, 2, 0);
    of.expect_no_touch(4, 3, 0, 1);
    of.expect_scaled(0, NAN, 0);
    of.expect_scaled(-0.0, NAN, 0);
    of.expect_scaled(2, 3, 6);
  });
}

TEST(Symm, ReturnsItsMemoryAtEveryEarlyExit) {
#define QTB_TEST(name, T)                     \
  {                                           \
    SCOPED_TRACE(#name);                      \
    test_early_exits<T>(QTB_ALL_TIERS(name)); \
  }
  QTB_SYMM_ROUTINES(QTB_TEST)
#undef QTB_TEST
}

// ---- The products that it is made of ----

// The products of one call with operands of zeros.
template <class T>
std::vector<NotedProduct> products_of(Procedure<T> *procedure, const char *side, const char *uplo, QtbInt m, QtbInt n,
                                      const std::vector<T> &a, std::vector<T> &b, std::vector<T> &c) {
  const T alpha = surface::scalar<T>({0.5, 0.25}), beta = surface::scalar<T>({2, 0});
  const QtbInt order = *side == 'L' ? m : n;
  b.assign(static_cast<std::size_t>(m * n), T{}), c = b;
  noted_products.clear();
  notes_products = true;
  procedure(side, uplo, &m, &n, &alpha, a.data(), &order, b.data(), &m, &beta, c.data(), &m);
  notes_products = false;
  for (const NotedProduct &p : noted_products) EXPECT_EQ(p.beta, 1.0) << "C was scaled before";
  return noted_products;
}

// What the products must be: the part of A with its first element's place, in the triangle, or the tile.
struct Part {
  const char *ops;
  QtbInt m, n, k, row, column;  // a row of -1: the copy of a tile
  QtbInt c_row, c_column;
};

template <class T>
void expect_products(Procedure<T> *procedure, const char *side, const char *uplo, QtbInt m, QtbInt n,
                     const std::vector<Part> &want) {
  SCOPED_TRACE(std::string(side) + uplo);
  const bool left = *side == 'L';
  const QtbInt order = left ? m : n;
  const std::vector<T> a(static_cast<std::size_t>(order * order));
  std::vector<T> b, c;
  const std::vector<NotedProduct> got = products_of<T>(procedure, side, uplo, m, n, a, b, c);
  ASSERT_EQ(got.size(), want.size());
  const std::complex<double> alpha = is_complex<T> ? std::complex<double>(0.5, 0.25) : 0.5;
  for (std::size_t i = 0; i < want.size(); ++i) {
    SCOPED_TRACE(i);
    const NotedProduct &g = got[i];
    const Part &w = want[i];
    EXPECT_EQ(g.ops, w.ops);
    EXPECT_EQ(g.m, w.m);
    EXPECT_EQ(g.n, w.n);
    EXPECT_EQ(g.k, w.k);
    EXPECT_EQ(g.c, c.data() + w.c_row + w.c_column * m);
    const bool is_tile = w.row < 0;
    EXPECT_EQ(g.alpha, is_tile ? 1.0 : alpha);
    if (!is_tile) {
      EXPECT_EQ(left ? g.a : g.b, a.data() + w.row + w.column * order);
    } else if (left) {
      EXPECT_EQ(g.lda, w.k) << "the columns of the copy have no gaps";
    }
  }
}

TEST(Symm, MultipliesWhatIsStoredAndItsMirrorImageBesideEachTile) {
  if (!processor_runs(tier_sse42)) GTEST_SKIP();
  const auto symm = qtb_blas_sse42_xdsymm;
  expect_products<double>(symm, "L", "U", 513, 2,
                          {{"TN", 257, 2, 256, 0, 256, 256, 0},
                           {"NN", 256, 2, 256, -1, 0, 0, 0},
                           {"NN", 256, 2, 256, 0, 256, 0, 0},
                           {"TN", 1, 2, 256, 256, 512, 512, 0},
                           {"NN", 256, 2, 256, -1, 0, 256, 0},
                           {"NN", 512, 2, 1, 0, 512, 0, 0},
                           {"NN", 1, 2, 1, -1, 0, 512, 0}});
  expect_products<double>(symm, "L", "L", 513, 2,
                          {{"NN", 257, 2, 256, 256, 0, 256, 0},
                           {"NN", 256, 2, 256, -1, 0, 0, 0},
                           {"NN", 1, 2, 256, 512, 256, 512, 0},
                           {"TN", 256, 2, 256, 256, 0, 0, 0},
                           {"NN", 256, 2, 256, -1, 0, 256, 0},
                           {"TN", 512, 2, 1, 512, 0, 0, 0},
                           {"NN", 1, 2, 1, -1, 0, 512, 0}});
  expect_products<double>(symm, "R", "U", 2, 257,
                          {{"NN", 2, 1, 256, 0, 256, 0, 256},
                           {"NN", 2, 256, 256, -1, 0, 0, 0},
                           {"NT", 2, 256, 1, 0, 256, 0, 0},
                           {"NN", 2, 1, 1, -1, 0, 0, 256}});
  expect_products<double>(symm, "R", "L", 2, 257,
                          {{"NT", 2, 1, 256, 256, 0, 0, 256},
                           {"NN", 2, 256, 256, -1, 0, 0, 0},
                           {"NN", 2, 256, 1, 256, 0, 0, 0},
                           {"NN", 2, 1, 1, -1, 0, 0, 256}});
}

TEST(Hemm, MultipliesByTheConjugateOfWhatIsMirrored) {
  if (!processor_runs(tier_sse42)) GTEST_SKIP();
  const std::vector<Part> left = {{"CN", 1, 1, 256, 0, 256, 256, 0},
                                  {"NN", 256, 1, 256, -1, 0, 0, 0},
                                  {"NN", 256, 1, 1, 0, 256, 0, 0},
                                  {"NN", 1, 1, 1, -1, 0, 256, 0}};
  expect_products<cdouble>(qtb_blas_sse42_xzhemm, "L", "U", 257, 1, left);
  std::vector<Part> symmetric = left;
  symmetric[0].ops = "TN";
  expect_products<cdouble>(qtb_blas_sse42_xzsymm, "L", "U", 257, 1, symmetric);
}

TEST(Symm, TakesTheOtherDimensionInStepsOf5000) {
  if (!processor_runs(tier_sse42)) GTEST_SKIP();
  const auto symm = qtb_blas_sse42_xdsymm;
  expect_products<double>(symm, "L", "U", 2, 5000, {{"NN", 2, 5000, 2, -1, 0, 0, 0}});
  expect_products<double>(symm, "L", "U", 2, 5001, {{"NN", 2, 5000, 2, -1, 0, 0, 0}, {"NN", 2, 1, 2, -1, 0, 0, 5000}});
  expect_products<double>(symm, "R", "L", 5001, 2, {{"NN", 5000, 2, 2, -1, 0, 0, 0}, {"NN", 1, 2, 2, -1, 0, 5000, 0}});
}

TEST(Symm, WithoutMemoryTakesTilesOf32) {
  if (!processor_runs(tier_sse42)) GTEST_SKIP();
  buffer_memory.is_out = true;
  expect_products<double>(qtb_blas_sse42_xdsymm, "L", "L", 33, 2,
                          {{"NN", 1, 2, 32, 32, 0, 32, 0},
                           {"NN", 32, 2, 32, -1, 0, 0, 0},
                           {"TN", 32, 2, 1, 32, 0, 0, 0},
                           {"NN", 1, 2, 1, -1, 0, 32, 0}});
  buffer_memory.is_out = false;
}

}  // namespace
}  // namespace qtb::test

int main(int argc, char **argv) { return qtb::surface::run_suite(argc, argv, qtb::surface::register_all); }
