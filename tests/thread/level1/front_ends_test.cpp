// The front ends of the Level-1 routines with a parallel path, between stand-ins.

#include "tests/thread/front_ends.h"
#include "blas/thread/32e/level1/xf_l1_omp.h"
#include "blas/thread/drivers.h"

namespace {
QtbInt driver_threads = 0;
}

extern "C" {
#define QTB_DRIVER(name, shape, T)                        \
  QTB_OMP_FUNCTION(shape, T, name) {                      \
    driver_threads = nthreads;                            \
    return QTB_STAND_IN(#name "_omp", shape, T, nullptr); \
  }
#define QTB_LEVEL1_SIZED(name, shape, T, ...) QTB_DRIVER(name, shape, T)
#define QTB_LEVEL1_PAIR(name, shape, T, min_n) QTB_DRIVER(name, shape, T)
#include "blas/thread/32e/level1/xf_l1.def"
#undef QTB_LEVEL1_SIZED
#undef QTB_LEVEL1_PAIR
}

namespace qtb::test {
namespace {

struct FrontEnd {
  std::string name;
  QtbInt min_n;
  bool pair;
  std::string (*reaches)(const std::map<std::string, QtbInt> &given);
  std::string slot() const { return "x" + name; }
  std::string driver() const { return name + "_omp"; }
};

#define QTB_FRONT_END(name, shape, min_n, pair)                             \
  {#name, min_n, pair, [](const std::map<std::string, QtbInt> &given) {     \
     return reached_by(&qtb_blas_##name, QTB_TEXT(QTB_ARGS(shape)), given); \
   }},
const FrontEnd front_ends[] = {
#define QTB_LEVEL1_SIZED(name, shape, T, min_n, ...) QTB_FRONT_END(name, shape, min_n, false)
#define QTB_LEVEL1_PAIR(name, shape, T, min_n) QTB_FRONT_END(name, shape, min_n, true)
#include "blas/thread/32e/level1/xf_l1.def"
#undef QTB_LEVEL1_SIZED
#undef QTB_LEVEL1_PAIR
};

using Level1FrontEnds = FrontEnds;

TEST_F(Level1FrontEnds, ShortVectorGoesToTheSlotAndAsksNothing) {
  for (const FrontEnd &f : front_ends)
    for (const QtbInt n : {f.min_n - 1, QtbInt{1}, QtbInt{0}, QtbInt{-1}}) {
      EXPECT_EQ(f.reaches({{"n", n}}), f.slot()) << n;
      EXPECT_EQ(process_asked, "") << f.name << n;
    }
}

TEST_F(Level1FrontEnds, LongVectorGoesToTheDriverWithTheDecisionsThreads) {
  for (const FrontEnd &f : front_ends) {
    EXPECT_EQ(f.reaches({{"n", 1000000}, {"incx", -2}, {"incy", 3}}), f.driver());
    EXPECT_EQ(driver_threads, f.pair ? 2 : 8) << f.name;
    EXPECT_EQ(process_asked, "tnd") << f.name;
    EXPECT_EQ(f.reaches({{"n", f.min_n}}), f.driver());
    EXPECT_EQ(driver_threads, f.pair ? 2 : 4) << f.name;
  }
  process_answers.tier = tier_ssse3;
  process_answers.max_threads = 3;
  for (const FrontEnd &f : front_ends) {
    EXPECT_EQ(f.reaches({{"n", 1000000}}), f.driver());
    EXPECT_EQ(driver_threads, f.pair ? 2 : 3) << f.name;
    EXPECT_EQ(process_asked, f.pair ? "tnd" : "tndc") << f.name;
  }
}

TEST_F(Level1FrontEnds, SerialDecisionsGoToTheSlot) {
  for (const FrontEnd &f : front_ends) {
    for (const auto &[incx, incy] : {std::pair<QtbInt, QtbInt>{0, 1}, {1, 0}, {0, 0}})
      EXPECT_EQ(f.reaches({{"n", 1000000}, {"incx", incx}, {"incy", incy}}), f.slot());
    for (const ProcessorTier tier : {tier_def, tier_sse3, tier_avx}) {
      process_answers.tier = tier;
      EXPECT_EQ(f.reaches({{"n", 1000000}}), f.slot());
      EXPECT_EQ(process_asked, "t") << f.name;
    }
    process_answers.tier = tier_sse42;
  }
}

// The service's answer is 1 in dynamic mode; any other number is none.
TEST_F(Level1FrontEnds, DynamicModeOffTakesAllThreadsAndThePairRoutinesNone) {
  for (const std::int32_t dynamic : {0, -1, 2})
    for (const FrontEnd &f : front_ends) {
      process_answers.dynamic = dynamic;
      driver_threads = 0;
      EXPECT_EQ(f.reaches({{"n", f.min_n}}), f.pair ? f.slot() : f.driver());
      EXPECT_EQ(driver_threads, f.pair ? 0 : 8) << f.name;
    }
}

}  // namespace
}  // namespace qtb::test
