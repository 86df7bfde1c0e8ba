// The front ends of the Level-3 routines beside gemm, between stand-ins.

#include "tests/thread/front_ends.h"

#include <limits>

#include "blas/thread/32/level3/symm_omp.h"
#include "blas/thread/32/level3/syr2k_omp.h"
#include "blas/thread/32e/level3/syrk_omp.h"
#include "blas/thread/32e/level3/trmm_omp.h"
#include "blas/thread/drivers.h"

namespace {
QtbInt driver_threads = 0, driver_unit = 0;
}

extern "C" {
#define QTB_DRIVER(name, text, shape, T)                         \
  void qtb_blas_##name(QtbInt nthreads, QTB_PARAMS_##shape(T)) { \
    driver_threads = nthreads;                                   \
    return QTB_STAND_IN(text, shape, T, nullptr);                \
  }
#define QTB_SYRK_DRIVERS(name, shape, T)         \
  QTB_DRIVER(name##_omp, #name "_omp", shape, T) \
  QTB_DRIVER(name##_strips_omp, #name "_strips_omp", shape, T)
#define QTB_SYMM_DRIVER(name, T) QTB_DRIVER(name##_omp, #name "_omp", symm, T)
#define QTB_SYR2K_DRIVER(name, T) QTB_DRIVER(name##_omp, #name "_omp", syr2k, T)
#define QTB_HER2K_DRIVER(name, T) QTB_DRIVER(name##_omp, #name "_omp", her2k, T)
#define QTB_TRMM_DRIVER(name, T)                                                      \
  void qtb_blas_##name##_omp(const qtb::TrmmDecision *decision, QTB_PARAMS_trmm(T)) { \
    driver_threads = decision->threads;                                               \
    driver_unit = decision->unit;                                                     \
    return QTB_STAND_IN(#name "_omp", trmm, T, nullptr);                              \
  }
QTB_FOR_EACH_SYRK(QTB_SYRK_DRIVERS)
QTB_FOR_EACH_SYMM(QTB_SYMM_DRIVER)
QTB_FOR_EACH_HEMM(QTB_SYMM_DRIVER)
QTB_FOR_EACH_SYR2K(QTB_SYR2K_DRIVER)
QTB_FOR_EACH_HER2K(QTB_HER2K_DRIVER)
QTB_FOR_EACH_TRMM(QTB_TRMM_DRIVER)
QTB_FOR_EACH_TRSM(QTB_TRMM_DRIVER)
}

namespace qtb::test {
namespace {

struct FrontEnd {
  std::string name;
  char type;
  std::string (*reaches)(const std::map<std::string, QtbInt> &given);
  std::string slot() const { return "x" + name; }
  std::string driver() const { return name + "_omp"; }
  bool is_real() const { return type == 's' || type == 'd'; }
  bool is_hermitian() const { return name.substr(1, 2) == "he"; }
};

#define QTB_FRONT_END(name, shape)                                          \
  {#name, #name[0], [](const std::map<std::string, QtbInt> &given) {        \
     return reached_by(&qtb_blas_##name, QTB_TEXT(QTB_ARGS(shape)), given); \
   }},
#define QTB_OF_SHAPE(name, shape, T) QTB_FRONT_END(name, shape)
#define QTB_OF_SYMM(name, T) QTB_FRONT_END(name, symm)
#define QTB_OF_SYR2K(name, T) QTB_FRONT_END(name, syr2k)
#define QTB_OF_TRMM(name, T) QTB_FRONT_END(name, trmm)
const FrontEnd trmm_front_ends[] = {QTB_FOR_EACH_TRMM(QTB_OF_TRMM) QTB_FOR_EACH_TRSM(QTB_OF_TRMM)};
const FrontEnd symm_front_ends[] = {QTB_FOR_EACH_SYMM(QTB_OF_SYMM) QTB_FOR_EACH_HEMM(QTB_OF_SYMM)};
const FrontEnd syr2k_front_ends[] = {QTB_FOR_EACH_SYR2K(QTB_OF_SYR2K)};
const FrontEnd syrk_front_ends[] = {QTB_FOR_EACH_SYRK(QTB_OF_SHAPE)};

using Level3FrontEnds = FrontEnds;
constexpr double nan = std::numeric_limits<double>::quiet_NaN();
constexpr QtbInt large = 1000;  // parallel on 8 threads, for every routine

// ---- trmm, trsm ----

TEST_F(Level3FrontEnds, TrmmWithoutColumnsReachesNothingAndWithoutRowsItDoes) {
  for (const FrontEnd &f : trmm_front_ends) {
    EXPECT_EQ(f.reaches({{"m", large}, {"n", 0}}), "");
    EXPECT_EQ(process_asked, "");
    EXPECT_EQ(f.reaches({{"m", 0}, {"n", large}, {"side", 'L'}}), f.slot());
    process_answers.tier = tier_def;
    EXPECT_EQ(f.reaches({{"m", 0}, {"n", large}, {"side", 'R'}}), f.name[3] == 's' ? f.driver() : f.slot());
    process_answers.tier = tier_sse42;
  }
}

TEST_F(Level3FrontEnds, TrmmAsksForThreadsAndThenForTheTier) {
  for (const FrontEnd &f : trmm_front_ends)
    for (const char side : {'L', 'l', 'R', 'r'}) {
      EXPECT_EQ(f.reaches({{"m", large}, {"n", large}, {"side", side}}), f.driver());
      EXPECT_EQ(process_asked, "nt");
      EXPECT_EQ(driver_threads, 8);
      const bool left = side == 'L' || side == 'l';
      EXPECT_EQ(driver_unit, f.type == 'z' || (left && f.type == 'c') ? 1 : !left && f.type == 's' ? 8 : 4) << f.name;
    }
}

TEST_F(Level3FrontEnds, TrmmOnOneThreadOrTooSmallIsTheSlots) {
  for (const FrontEnd &f : trmm_front_ends) {
    EXPECT_EQ(f.reaches({{"m", 10}, {"n", 10}, {"side", 'L'}}), f.slot());
    EXPECT_EQ(process_asked, "");
    EXPECT_EQ(f.reaches({{"m", 9}, {"n", 11}, {"side", 'L'}}), f.slot());
    EXPECT_EQ(process_asked, "nt");
    process_answers.max_threads = 1;
    EXPECT_EQ(f.reaches({{"m", large}, {"n", large}, {"side", 'L'}}), f.slot());
    EXPECT_EQ(process_asked, "n");
    process_answers.max_threads = 8;
  }
}

// The side decides which dimension is cut, a solve is told from a product.
TEST_F(Level3FrontEnds, TrmmIsDecidedByItsSideAndItsKind) {
  for (const FrontEnd &f : trmm_front_ends) {
    EXPECT_EQ(f.reaches({{"m", large}, {"n", 1}, {"side", 'R'}}), f.slot());
    EXPECT_EQ(f.reaches({{"m", 1}, {"n", 1}, {"side", 'L'}}), f.slot());
    EXPECT_EQ(f.reaches({{"m", large}, {"n", 8}, {"side", 'l'}}), f.driver());
    process_answers.tier = tier_sse3;
    EXPECT_EQ(f.reaches({{"m", 20}, {"n", 20}, {"side", 'L'}}), f.name == "dtrsm" ? f.slot() : f.driver());
    process_answers.tier = tier_sse42;
  }
}

// ---- symm, hemm ----

TEST_F(Level3FrontEnds, SymmThatChangesNothingReachesNothing) {
  for (const FrontEnd &f : symm_front_ends) {
    for (const auto &[m, n] : {std::pair<QtbInt, QtbInt>{0, large}, {large, 0}})
      EXPECT_EQ(f.reaches({{"m", m}, {"n", n}}), "");
    factors = {{0, 0}, {1, 0}};
    EXPECT_EQ(f.reaches({{"m", large}, {"n", large}}), "") << f.name;
    EXPECT_EQ(process_asked, "");
    factors = {};
  }
}

TEST_F(Level3FrontEnds, RealSymmWithAlphaZeroScalesOnOneThreadHoweverLargeAndComplexGoesOn) {
  for (const FrontEnd &f : symm_front_ends)
    for (const double beta : {0.0, 0.5, nan}) {
      factors = {{-0.0, 0}, {beta, 0}};
      if (!f.is_real()) {
        EXPECT_EQ(f.reaches({{"m", large}, {"n", large}}), f.driver());
        continue;
      }
      EXPECT_EQ(f.reaches({{"m", large}, {"n", large - 1}, {"ldc", large + 1}}),
                f.slot().substr(0, 2) + "gemm_scale_c");
      const Call &call = stand_ins.calls[0];
      EXPECT_EQ(call.number("m"), large);
      EXPECT_EQ(call.number("n"), large - 1);
      EXPECT_EQ(call.number("ldc"), large + 1);
      EXPECT_EQ(call.pointer("c"), reinterpret_cast<const void *>(16 * 11));  // where reached_by puts the eleventh
      EXPECT_EQ(call["beta"].bytes, f.type == 's' ? bytes_of(static_cast<float>(beta)) : bytes_of(beta));
      EXPECT_EQ(process_asked, "");
    }
}

TEST_F(Level3FrontEnds, SymmFromSeventeenOnGoesToAllThreadsWhateverTheTier) {
  factors = {{2, 0}, {3, 0}};
  for (const ProcessorTier tier : {tier_def, tier_sse3, tier_ssse3, tier_sse42, tier_avx})
    for (const FrontEnd &f : symm_front_ends) {
      process_answers.tier = tier;
      EXPECT_EQ(f.reaches({{"m", 16}, {"n", 16}}), f.slot());
      EXPECT_EQ(process_asked, "");
      for (const auto &[m, n] : {std::pair<QtbInt, QtbInt>{17, 1}, {1, 17}}) {
        EXPECT_EQ(f.reaches({{"m", m}, {"n", n}}), f.driver());
        EXPECT_EQ(process_asked, "n");
        EXPECT_EQ(driver_threads, 8);
      }
      process_answers.max_threads = 1;
      EXPECT_EQ(f.reaches({{"m", 17}, {"n", 17}}), f.slot());
      process_answers.max_threads = 8;
    }
}

// Factors of which one part is special are not.
TEST_F(Level3FrontEnds, ComplexFactorsAreZeroOrOneInBothParts) {
  const Factors others[] = {{{0, 1}, {1, 0}}, {{0, 0}, {1, 1}}, {{0, nan}, {1, 0}}, {{0, 0}, {1, nan}}};
  for (const Factors &given : others) {
    factors = given;
    for (const FrontEnd &f : symm_front_ends)
      EXPECT_TRUE(f.is_real() || f.reaches({{"m", large}, {"n", large}}) == f.driver()) << f.name;
    for (const FrontEnd &f : syr2k_front_ends)
      EXPECT_TRUE(f.is_real() || f.reaches({{"n", large}}) == f.driver()) << f.name;
  }
}

// ---- syrk, herk ----

TEST_F(Level3FrontEnds, SyrkByTilesIsDecidedByItsOrderWhateverTheFactors) {
  for (const Factors &given : {Factors{{0, 0}, {0, 0}}, {{0, 0}, {1, 0}}, {{2, 0}, {3, 0}}})
    for (const ProcessorTier tier : {tier_ssse3, tier_sse42, tier_avx})
      for (const FrontEnd &f : syrk_front_ends)
        for (const QtbInt k : {0, 9}) {
          factors = given;
          process_answers.tier = tier;
          EXPECT_EQ(f.reaches({{"n", 4}, {"k", k}}), f.slot() + (f.name == "dsyrk" ? "_n4" : "_body"));
          EXPECT_EQ(process_asked, "t");
          for (const QtbInt n : {QtbInt{0}, QtbInt{3}, QtbInt{5}, QtbInt{63}}) {
            EXPECT_EQ(f.reaches({{"n", n}, {"k", k}}), f.slot() + "_body");
            EXPECT_EQ(process_asked, n < 8 ? "t" : "tn");
          }
          EXPECT_EQ(f.reaches({{"n", 64}, {"k", k}}), f.driver());
          EXPECT_EQ(driver_threads, 8);
          process_answers.max_threads = 1;
          EXPECT_EQ(f.reaches({{"n", 7}, {"k", k}}), f.slot() + "_body");
          EXPECT_EQ(f.reaches({{"n", 8}, {"k", k}}), f.slot());
          process_answers.max_threads = 8;
        }
}

TEST_F(Level3FrontEnds, SyrkByStripsReturnsWhereNothingChangesAndGoesOnOtherwise) {
  for (const ProcessorTier tier : {tier_def, tier_sse3})
    for (const FrontEnd &f : syrk_front_ends) {
      if (f.is_hermitian()) continue;
      process_answers.tier = tier;
      const std::string strips = f.name + "_strips_omp";
      factors = {{0, 0}, {1, 0}};
      EXPECT_EQ(f.reaches({{"n", large}}), "");
      factors = {{2, 0}, {1, 0}};
      EXPECT_EQ(f.reaches({{"n", large}, {"k", 0}}), "");
      EXPECT_EQ(f.reaches({{"n", 0}}), "");
      EXPECT_EQ(process_asked, "t");
      EXPECT_EQ(f.reaches({{"n", large}}), strips);
      EXPECT_EQ(driver_threads, 8);
      factors = {{0, 0}, {3, 0}};  // beta is the slots' matter
      EXPECT_EQ(f.reaches({{"n", large}}), strips);
      EXPECT_EQ(f.reaches({{"n", large}, {"k", 0}}), strips);
      EXPECT_EQ(f.reaches({{"n", 4}}), f.slot());
      EXPECT_EQ(f.reaches({{"n", 16}}), f.slot());
      EXPECT_EQ(process_asked, "t");
      EXPECT_EQ(f.reaches({{"n", 17}}), strips);
      EXPECT_EQ(process_asked, "tn");
      process_answers.max_threads = 1;
      EXPECT_EQ(f.reaches({{"n", 17}}), f.slot());
      process_answers.max_threads = 8;
      if (f.is_real()) continue;
      factors = {{0, 1}, {1, 0}};
      EXPECT_EQ(f.reaches({{"n", large}}), strips);
      factors = {{0, 0}, {1, 1}};
      EXPECT_EQ(f.reaches({{"n", large}}), strips);
    }
}

// ---- syr2k ----

TEST_F(Level3FrontEnds, Syr2kIsDecidedByItsOrderOnEveryTier) {
  for (const ProcessorTier tier : {tier_def, tier_sse3, tier_ssse3, tier_sse42, tier_avx})
    for (const FrontEnd &f : syr2k_front_ends) {
      process_answers.tier = tier;
      factors = {{2, 0}, {3, 0}};
      EXPECT_EQ(f.reaches({{"n", 0}}), "");
      EXPECT_EQ(f.reaches({{"n", 16}}), f.slot());
      EXPECT_EQ(process_asked, "");
      EXPECT_EQ(f.reaches({{"n", 17}}), f.driver());
      EXPECT_EQ(process_asked, "n");
      EXPECT_EQ(driver_threads, 8);
      process_answers.max_threads = 1;
      EXPECT_EQ(f.reaches({{"n", 17}}), f.slot());
      process_answers.max_threads = 8;
    }
}

TEST_F(Level3FrontEnds, Syr2kWithoutDepthIsTheSlotsInRealTypesAndGoesOnInComplexOnes) {
  for (const FrontEnd &f : syr2k_front_ends) {
    factors = {{2, 0}, {3, 0}};
    EXPECT_EQ(f.reaches({{"n", large}, {"k", 0}}), f.is_real() ? f.slot() : f.driver());
    factors = {{2, 0}, {1, 0}};
    EXPECT_EQ(f.reaches({{"n", large}, {"k", 0}}), "");
    factors = {{0, 0}, {1, 0}};
    EXPECT_EQ(f.reaches({{"n", large}, {"k", 5}}), "");
    factors = {{0, 0}, {3, 0}};  // alpha 0 goes through all stages
    EXPECT_EQ(f.reaches({{"n", large}, {"k", 5}}), f.driver());
  }
}

// ---- herk by strips, her2k: the front end applies beta ----

template <class T>
struct Hermitian {
  QtbInt n, k = 3, ld = n + 2;
  char uplo = 'U', trans = 'N';
  Real<T> real_alpha = 2, beta = 3;
  T alpha = {2, 1};
  std::vector<T> c, before;

  explicit Hermitian(QtbInt order) : n(order), c(static_cast<std::size_t>(ld * n)) {
    for (std::size_t i = 0; i < c.size(); ++i)
      c[i] = {static_cast<Real<T>>(i % 13) - 6, static_cast<Real<T>>(i % 11) - 5};
    before = c;
  }
  void call(QTB_FUNCTION(herk, T, (*herk))) {
    stand_ins.calls.clear();
    herk(&uplo, &trans, &n, &k, &real_alpha, nullptr, &ld, &beta, c.data(), &ld);
  }
  void call(QTB_FUNCTION(her2k, T, (*her2k))) {
    stand_ins.calls.clear();
    her2k(&uplo, &trans, &n, &k, &alpha, nullptr, &ld, nullptr, &ld, &beta, c.data(), &ld);
  }
  // The triangle times beta with a real diagonal, and all else as it was.
  void expect_scaled() const {
    for (QtbInt j = 0; j < n; ++j)
      for (QtbInt i = 0; i < ld; ++i) {
        const auto at = static_cast<std::size_t>(i + j * ld);
        const bool stored = i < n && (uplo == 'U' ? i <= j : i >= j);
        const T old = before[at];
        T want = !stored ? old : beta == 0 ? T{0, 0} : T{old.re * beta, old.im * beta};
        if (i == j) want.im = 0;
        ASSERT_TRUE(c[at].re == want.re && c[at].im == want.im) << i << ' ' << j;
      }
  }
  void expect_reached(const std::string &routine) const {
    ASSERT_EQ(stand_ins.calls.size(), routine.empty() ? 0U : 1U);
    if (routine.empty()) return;
    EXPECT_EQ(stand_ins.calls[0].routine, routine);
    EXPECT_EQ(stand_ins.calls[0]["beta"].bytes, bytes_of(Real<T>(1)));
    EXPECT_EQ(stand_ins.calls[0].pointer("c"), c.data());
  }
};

template <class T, class F>
void test_hermitian(F *front_end, const std::string &name, const std::string &driver) {
  for (const char uplo : {'U', 'L'})
    for (const double beta : {0.0, 1.0, 3.0})
      for (const QtbInt n : {1, 16, 17, 40}) {
        Hermitian<T> p(n);
        p.uplo = uplo;
        p.beta = static_cast<Real<T>>(beta);
        p.call(front_end);
        p.expect_scaled();
        p.expect_reached(n < 17 ? "x" + name : driver);
        // Without a product the triangle is all; with a beta of 1, nothing is.
        for (const bool no_depth : {false, true}) {
          Hermitian<T> none(n);
          none.uplo = uplo;
          none.beta = static_cast<Real<T>>(beta);
          if (no_depth) none.k = 0;
          if (!no_depth) none.real_alpha = 0, none.alpha = {0, 0};
          none.call(front_end);
          none.expect_reached("");
          if (beta == 1)
            EXPECT_EQ(std::memcmp(static_cast<void *>(none.c.data()), none.before.data(), none.c.size() * sizeof(T)),
                      0);
          else
            none.expect_scaled();
        }
      }
  // An alpha with one part is none of zero; a beta of zero reads nothing.
  Hermitian<T> p(20);
  p.alpha = {0, 1};
  p.beta = 0;
  for (T &v : p.c) v = {static_cast<Real<T>>(nan), static_cast<Real<T>>(nan)};
  p.call(front_end);
  p.expect_reached(driver);
  for (QtbInt j = 0; j < p.n; ++j)
    for (QtbInt i = 0; i <= j; ++i) EXPECT_TRUE(is_zero(p.c[static_cast<std::size_t>(i + j * p.ld)]));
}

TEST_F(Level3FrontEnds, HerkByStripsScalesTheTriangleClearsTheDiagonalAndAddsToIt) {
  for (const ProcessorTier tier : {tier_def, tier_sse3}) {
    process_answers.tier = tier;
    test_hermitian<cfloat>(qtb_blas_cherk, "cherk", "cherk_strips_omp");
    test_hermitian<cdouble>(qtb_blas_zherk, "zherk", "zherk_strips_omp");
  }
}

TEST_F(Level3FrontEnds, Her2kScalesTheTriangleClearsTheDiagonalAndAddsToIt) {
  for (const ProcessorTier tier : {tier_def, tier_sse42}) {
    process_answers.tier = tier;
    test_hermitian<cfloat>(qtb_blas_cher2k, "cher2k", "cher2k_omp");
    test_hermitian<cdouble>(qtb_blas_zher2k, "zher2k", "zher2k_omp");
  }
}

}  // namespace
}  // namespace qtb::test
