// The front ends of the parallel GEMM between stand-ins.

#include "blas/thread/32e/level3/gemm_omp.h"
#include "blas/thread/drivers.h"
#include "tests/thread/front_ends.h"

namespace {
qtb::GemmDecision handed_on;  // to a driver
}

extern "C" {
#define QTB_DRIVER(t, T)                                                               \
  void qtb_blas_##t##gemm_omp(const qtb::GemmDecision *decision, QTB_PARAMS_gemm(T)) { \
    handed_on = *decision;                                                             \
    QTB_STAND_IN(#t "gemm_omp", gemm, T, nullptr);                                     \
  }
QTB_FOR_EACH_GEMM(QTB_DRIVER)
}

namespace qtb::test {
namespace {

using Given = std::map<std::string, QtbInt>;

struct FrontEnd {
  std::string name;
  bool is_complex;
  std::int64_t width;  // bytes of an element
  std::string (*reaches)(const Given &given);
};
#define QTB_FRONT_END(t, T)             \
  {#t "gemm", is_complex<T>, sizeof(T), \
   [](const Given &given) { return reached_by(&qtb_blas_##t##gemm, QTB_TEXT(QTB_ARGS(gemm)), given); }},
const FrontEnd front_ends[] = {QTB_FOR_EACH_GEMM(QTB_FRONT_END)};

using GemmFrontEnds = FrontEnds;

TEST_F(GemmFrontEnds, AnEmptyResultAsksAndDoesNothing) {
  for (const FrontEnd &f : front_ends)
    for (const auto &[m, n] : {std::pair<QtbInt, QtbInt>{0, 300}, {300, 0}, {-1, 300}, {300, -5}, {0, 0}})
      for (const QtbInt k : {300, 0, -1}) {
        EXPECT_EQ(f.reaches({{"m", m}, {"n", n}, {"k", k}}), "") << m << ' ' << n;
        EXPECT_EQ(process_asked, "");
      }
}

TEST_F(GemmFrontEnds, TinyProblemsGoToTheSlotAndAskNothing) {
  for (const FrontEnd &f : front_ends)
    for (const auto &[m, n, k] :
         {std::array<QtbInt, 3>{5, 1000, 1000}, {1000, 1000, 4}, {1000, 1000, 0}, {16, 16, 16}}) {
      EXPECT_EQ(f.reaches({{"m", m}, {"n", n}, {"k", k}}), "x" + f.name);
      EXPECT_EQ(process_asked, "");
    }
}

TEST_F(GemmFrontEnds, TheDecisionChoosesTheSlotOrTheDriverAndGoesOnToIt) {
  for (const FrontEnd &f : front_ends) {
    process_answers.max_threads = 1;
    EXPECT_EQ(f.reaches({{"m", 300}, {"n", 300}, {"k", 300}}), "x" + f.name);
    EXPECT_EQ(process_asked, "ntc");
    process_answers.max_threads = 7;
    EXPECT_EQ(f.reaches({{"m", 300}, {"n", 300}, {"k", 300}}), f.name + "_omp");
    EXPECT_EQ(process_asked, "ntc");
    EXPECT_EQ(handed_on.threads, 7);
    EXPECT_EQ(handed_on.machine_class, machine_sse42);
    EXPECT_TRUE(handed_on.tuned);
    EXPECT_TRUE(std::equal(std::begin(handed_on.cache), std::end(handed_on.cache), process_answers.cache));
    EXPECT_EQ(f.reaches({{"m", 10}, {"n", 10}, {"k", 17}}), "x" + f.name) << "threads do not pay";
    process_answers.tier = tier_avx;
    EXPECT_EQ(f.reaches({{"m", 10}, {"n", 10}, {"k", 17}}), f.name + "_omp") << "where they always do";
    EXPECT_FALSE(handed_on.tuned);
    process_answers.tier = tier_sse42;
  }
}

// Two regions of the caller's, the call made by one of their threads.
TEST_F(GemmFrontEnds, OneThreadInARegionTakesSlicesOfRowsOnTheSmallL2ClassInRealTypes) {
  process_answers.tier = tier_ssse3;
  process_answers.max_threads = 1;
  constexpr QtbInt lda = 1000, ldc = 1002;
  const std::uintptr_t a = 16 * 7, c = 16 * 12;  // where reached_by puts the seventh and the twelfth argument
  for (const FrontEnd &f : front_ends)
    for (const char transa : {'N', 'n', 'T', 't', 'C', 'c'})
      for (const QtbInt m : {129, 255, 256, 257, 300}) {
        std::string reached;
        const Given given = {{"transa", transa}, {"m", m}, {"n", 300}, {"k", 300}, {"lda", lda}, {"ldc", ldc}};
#pragma omp parallel num_threads(2)
#pragma omp single
        reached = f.reaches(given);
        EXPECT_EQ(process_asked, "ntc4");
        const QtbInt slices = f.is_complex ? 1 : (m + 127) / 128, step = transa == 'N' || transa == 'n' ? 1 : lda;
        ASSERT_EQ(stand_ins.calls.size(), static_cast<std::size_t>(slices)) << reached;
        for (QtbInt i = 0; i < slices && !f.is_complex; ++i) {
          const Call &call = stand_ins.calls[static_cast<std::size_t>(i)];
          EXPECT_EQ(call.routine, "x" + f.name);
          EXPECT_EQ(call.number("m"), std::min<QtbInt>(128, m - 128 * i));
          EXPECT_EQ(call.number("n"), 300);
          EXPECT_EQ(call.number("k"), 300);
          EXPECT_EQ(call.number("transa"), transa);
          EXPECT_EQ(reinterpret_cast<std::uintptr_t>(call.pointer("a")), a + std::uintptr_t(128 * i * step * f.width));
          EXPECT_EQ(reinterpret_cast<std::uintptr_t>(call.pointer("c")), c + std::uintptr_t(128 * i * f.width));
          EXPECT_EQ(call["beta"].bytes, std::string(static_cast<std::size_t>(f.width), '\0'));
        }
      }
  for (const FrontEnd &f : front_ends) EXPECT_EQ(f.reaches({{"m", 300}, {"n", 300}, {"k", 300}}), "x" + f.name);
}

}  // namespace
}  // namespace qtb::test
