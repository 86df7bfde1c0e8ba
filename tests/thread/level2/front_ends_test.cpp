// The front ends of the Level-2 routines with a parallel path, between stand-ins.

#include "tests/thread/front_ends.h"

#include "blas/thread/32e/level2/gemv_omp.h"
#include "blas/thread/32e/level2/l2_omp.h"
#include "blas/thread/drivers.h"

namespace {
QtbInt driver_threads = 0;
}

extern "C" {
#define QTB_DRIVER(name, shape, T)                                     \
  void qtb_blas_##name##_omp(QtbInt nthreads, QTB_PARAMS_##shape(T)) { \
    driver_threads = nthreads;                                         \
    return QTB_STAND_IN(#name "_omp", shape, T, nullptr);              \
  }
#define QTB_GEMV(name, T, ...) QTB_DRIVER(name, gemv, T)
#include "blas/thread/32e/level2/gemv.def"
#undef QTB_GEMV
#define QTB_LEVEL2(name, shape, T, ...) QTB_DRIVER(name, shape, T)
#include "blas/thread/32e/level2/l2.def"
#undef QTB_LEVEL2
}

namespace qtb::test {
namespace {

struct FrontEnd {
  std::string name;
  bool has_rows;    // m beside n
  QtbInt smallest;  // the order from which on the process is asked
  std::string (*reaches)(const std::map<std::string, QtbInt> &given);
  std::string slot() const { return "x" + name; }
  std::string driver() const { return name + "_omp"; }
  std::string of_order(QtbInt n) const { return reaches({{"m", n}, {"n", n}}); }
};

#define QTB_FRONT_END(name, shape, has_rows, smallest)                         \
  {#name, has_rows, smallest, [](const std::map<std::string, QtbInt> &given) { \
     return reached_by(&qtb_blas_##name, QTB_TEXT(QTB_ARGS(shape)), given);    \
   }},
const FrontEnd front_ends[] = {
#define QTB_GEMV(name, T, small_dim, ...) QTB_FRONT_END(name, gemv, true, small_dim)
#include "blas/thread/32e/level2/gemv.def"
#undef QTB_GEMV
#define QTB_LEVEL2(name, shape, T, min_n, ...) QTB_FRONT_END(name, shape, false, min_n)
#include "blas/thread/32e/level2/l2.def"
#undef QTB_LEVEL2
};

using Level2FrontEnds = FrontEnds;

constexpr QtbInt large = 2000;  // parallel on 8 threads, for every routine

TEST_F(Level2FrontEnds, NothingToComputeReachesNothingWhateverTheScalars) {
  for (const FrontEnd &f : front_ends)
    for (const QtbInt none : {QtbInt{0}, QtbInt{-1}}) {
      EXPECT_EQ(f.of_order(none), "") << f.name;
      EXPECT_EQ(f.reaches({{"m", large}, {"n", none}}), "") << f.name;
      EXPECT_TRUE(!f.has_rows || f.reaches({{"m", none}, {"n", large}}).empty()) << f.name;
      EXPECT_EQ(process_asked, "") << f.name;
    }
}

TEST_F(Level2FrontEnds, SmallProblemGoesToTheSlotAndAsksNothing) {
  for (const FrontEnd &f : front_ends)
    for (const QtbInt n : {f.smallest - 1, QtbInt{1}}) {
      EXPECT_EQ(f.of_order(n), f.slot()) << n;
      EXPECT_EQ(process_asked, "") << f.name << n;
    }
}

TEST_F(Level2FrontEnds, LargeProblemGoesToTheDriverWithAllThreadsWhateverTheDynamicMode) {
  for (const std::int32_t dynamic : {0, 1})
    for (const ProcessorTier tier : {tier_ssse3, tier_sse42})
      for (const FrontEnd &f : front_ends) {
        process_answers.dynamic = dynamic;
        process_answers.tier = tier;
        driver_threads = 0;
        EXPECT_EQ(f.of_order(large), f.driver());
        EXPECT_EQ(driver_threads, 8) << f.name;
        EXPECT_EQ(process_asked, "tn") << f.name;
      }
}

TEST_F(Level2FrontEnds, SerialDecisionsGoToTheSlot) {
  for (const FrontEnd &f : front_ends) {
    for (const ProcessorTier tier : {tier_def, tier_sse3, tier_avx}) {
      process_answers.tier = tier;
      EXPECT_EQ(f.of_order(large), f.slot());
      EXPECT_EQ(process_asked, "t") << f.name;
    }
    process_answers.tier = tier_sse42;
    process_answers.max_threads = 1;
    EXPECT_EQ(f.of_order(large), f.slot());
    process_answers.max_threads = 8;
  }
}

TEST_F(Level2FrontEnds, GemvIsCutByTheLetterOfTheOperation) {
  for (const FrontEnd &f : front_ends) {
    if (!f.has_rows) continue;
    // 7 rows cannot be cut by eights, many columns can; and the reverse.
    EXPECT_EQ(f.reaches({{"m", 7}, {"n", 10 * large}, {"trans", 'n'}}), f.slot());
    EXPECT_EQ(f.reaches({{"m", 7}, {"n", 10 * large}, {"trans", 't'}}), f.driver());
    EXPECT_EQ(f.reaches({{"m", 10 * large}, {"n", 7}, {"trans", 'C'}}), f.slot());
    EXPECT_EQ(f.reaches({{"m", 10 * large}, {"n", 7}, {"trans", 'N'}}), f.driver());
  }
}

}  // namespace
}  // namespace qtb::test
