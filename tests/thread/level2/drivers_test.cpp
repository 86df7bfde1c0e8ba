// The parallel Level-2 drivers on real teams, more threads than processors included. The dispatch slots are stand-ins
// that note their calls and hand them on to the tier under test; the services are the test's own.
//
// Operands are small integers, so that every sum is exact in every element type and order: a result has to be that of
// the published definition to the last bit, for every team. What may not be read is NaN.

#include <complex>
#include <limits>

#include "blas/thread/32e/level2/gemv_omp.h"
#include "blas/thread/32e/level2/l2_omp.h"
#include "tests/support/tiers.h"
#include "tests/thread/front_ends.h"
#include "tests/thread/recorded_memory.h"

QTB_RECORDED_MEMORY_SERVICE

namespace qtb::test {
namespace {

// ---- Exact numbers ----

using Number = std::complex<double>;

template <class T>
T narrowed(Number v) {
  if constexpr (is_complex<T>)
    return {static_cast<Real<T>>(v.real()), static_cast<Real<T>>(v.imag())};
  else
    return static_cast<T>(v.real());
}
template <class T>
Number widened(T v) {
  if constexpr (is_complex<T>)
    return {static_cast<double>(v.re), static_cast<double>(v.im)};
  else
    return v;
}
template <class T>
T not_a_number() {
  constexpr double nan = std::numeric_limits<double>::quiet_NaN();
  return narrowed<T>({nan, nan});
}

// A vector of n elements inc apart with NaN between them, and the numbers that it stands for.
template <class T>
struct Vector {
  QtbInt n, inc;
  std::vector<T> memory;

  Vector(QtbInt length, QtbInt increment, unsigned seed) : n(length), inc(increment) {
    memory.assign(static_cast<std::size_t>((n - 1) * std::abs(inc) + 1), not_a_number<T>());
    for (QtbInt i = 0; i < n; ++i) (*this)[i] = narrowed<T>(small_number(seed, i));
  }
  static Number small_number(unsigned seed, QtbInt i) {
    const QtbInt a = (i * 7 + seed * 13 + i / 5) % 7 - 3, b = (i * 5 + seed * 11 + i / 3) % 5 - 2;
    return {static_cast<double>(a), is_complex<T> ? static_cast<double>(b) : 0};
  }
  T &operator[](QtbInt i) { return memory[static_cast<std::size_t>(inc > 0 ? i * inc : (i - n + 1) * inc)]; }
  std::vector<Number> numbers() {
    std::vector<Number> all;
    for (QtbInt i = 0; i < n; ++i) all.push_back(widened((*this)[i]));
    return all;
  }
  T *data() { return memory.data(); }

  // Holds these numbers, and NaN everywhere else.
  void expect(const std::vector<Number> &want, const std::string &what) {
    QtbInt values = 0;
    for (const T &v : memory) values += !(widened(v) != widened(v));
    ASSERT_EQ(values, n) << what;
    for (QtbInt i = 0; i < n; ++i)
      ASSERT_EQ(widened((*this)[i]), want[static_cast<std::size_t>(i)]) << what << " " << i;
  }
};

// An m by n matrix, or a triangle of it, with NaN everywhere else.
template <class T>
struct Matrix {
  QtbInt m, n, ld;
  std::vector<T> memory;

  template <class Stored>
  Matrix(QtbInt rows, QtbInt columns, unsigned seed, Stored stored) : m(rows), n(columns), ld(rows + 3) {
    memory.assign(static_cast<std::size_t>(ld * n), not_a_number<T>());
    for (QtbInt j = 0; j < n; ++j)
      for (QtbInt i = 0; i < m; ++i)
        if (stored(i, j)) at(i, j) = narrowed<T>(Vector<T>::small_number(seed, i + 3 * j));
  }
  T &at(QtbInt i, QtbInt j) { return memory[static_cast<std::size_t>(i + j * ld)]; }
  Number operator()(QtbInt i, QtbInt j) { return widened(at(i, j)); }
  T *data() { return memory.data(); }
};

bool in_triangle(char uplo, QtbInt i, QtbInt j) { return uplo == 'U' ? i <= j : i >= j; }

// ---- The world of a test ----

// A tier's procedures behind the slots that the drivers call. The block slots begin with tier ssse3.
static_assert(tier_set::PIECES == (tier_set::SSSE3 | tier_set::SSE42 | tier_set::AVX),
              "tests/thread/level2/drivers_test.cpp: write the block of the new tier into QTB_BLOCK_TARGETS");
#define QTB_BLOCK_TARGETS(name) \
  { qtb_blas_ssse3_x##name, qtb_blas_sse42_x##name, qtb_blas_avx_x##name }
void put_behind_slots(int tier) {
#define QTB_BEHIND(name)                                                          \
  {                                                                               \
    static constexpr decltype(&qtb_blas_x##name) targets[] = QTB_ALL_TIERS(name); \
    stand_ins.behind[slot_##name] = code_pointer(targets[tier]);                  \
  }
#define QTB_BEHIND_BLOCK(name)                                                        \
  if (tier >= tier_ssse3) {                                                           \
    static constexpr decltype(&qtb_blas_x##name) targets[] = QTB_BLOCK_TARGETS(name); \
    stand_ins.behind[slot_##name] = code_pointer(targets[tier - tier_ssse3]);         \
  }
#define QTB_BEHIND_symv(name)
#define QTB_BEHIND_syr(name) QTB_BEHIND_BLOCK(name##_block)
#define QTB_BEHIND_syr2(name) QTB_BEHIND_BLOCK(name##_block)
#define QTB_BEHIND_trmv(name) QTB_BEHIND_BLOCK(name##_block)
#define QTB_GEMV(name, T, ...) QTB_BEHIND(name)
#include "blas/thread/32e/level2/gemv.def"
#undef QTB_GEMV
#define QTB_LEVEL2(name, shape, T, ...) QTB_BEHIND(name) QTB_BEHIND_##shape(name)
#include "blas/thread/32e/level2/l2.def"
#undef QTB_LEVEL2
}

class Level2Drivers : public testing::TestWithParam<int> {
 protected:
  void SetUp() override {
    if (!processor_runs(GetParam())) GTEST_SKIP();
    stand_ins = StandIns{};
    put_behind_slots(GetParam());
    recorded_memory.fails = {};
    recorded_memory.forget();
  }
  void TearDown() override {
    EXPECT_TRUE(recorded_memory.held.empty());
    EXPECT_EQ(recorded_memory.faults, 0);
  }
};

// Teams from one thread to many more than there are processors; the odd ones leave a thread without a block.
constexpr QtbInt teams[] = {1, 2, 3, 4, 5, 8, 15, 16};
constexpr QtbInt orders[] = {1, 7, 8, 9, 16, 17, 63, 64, 65, 130, 257};
constexpr std::pair<QtbInt, QtbInt> increments[] = {{1, 1}, {-1, 2}, {2, -1}, {-3, -2}};

template <class F>
void for_each_case(F f) {
  for (const QtbInt team : teams)
    for (const QtbInt n : orders)
      for (const auto &[incx, incy] : increments) {
        stand_ins.calls.clear();
        f(team, n, incx, incy);
        if (testing::Test::HasFatalFailure()) return;
      }
}

// Every thread worked with the caller's choice of rounding and exceptions.
void expect_callers_choice() {
  for (const Call &call : stand_ins.calls) ASSERT_EQ(call.floating_choice, floating_choice()) << call.routine;
}

template <class T>
using GemvDriver = void(QtbInt, QTB_PARAMS_gemv(T));
template <class T>
using SymvDriver = void(QtbInt, QTB_PARAMS_symv(T));
template <class T>
using SyrDriver = void(QtbInt, QTB_PARAMS_syr(T));
template <class T>
using Syr2Driver = void(QtbInt, QTB_PARAMS_syr2(T));
template <class T>
using TrmvDriver = void(QtbInt, QTB_PARAMS_trmv(T));

Number operated(char trans, Number v) { return trans == 'C' ? std::conj(v) : v; }

// ---- gemv ----

template <class T>
void test_gemv(GemvDriver<T> *driver) {
  for_each_case([&](QtbInt team, QtbInt n, QtbInt incx, QtbInt incy) {
    for (const char trans : {'N', 'T', 'C'})
      for (const QtbInt m : {n, n + 5}) {
        const QtbInt rows = trans == 'N' ? m : n, columns = trans == 'N' ? n : m;
        Matrix<T> a(m, n, 1, [](QtbInt, QtbInt) { return true; });
        Vector<T> x(columns, incx, 2), y(rows, incy, 3);
        const Number alpha = is_complex<T> ? Number(2, -1) : Number(2), beta(-1);
        std::vector<Number> want = y.numbers();
        const std::vector<Number> from = x.numbers();
        for (QtbInt i = 0; i < rows; ++i) {
          Number sum = 0;
          for (QtbInt j = 0; j < columns; ++j)
            sum += (trans == 'N' ? a(i, j) : operated(trans, a(j, i))) * from[static_cast<std::size_t>(j)];
          want[static_cast<std::size_t>(i)] = beta * want[static_cast<std::size_t>(i)] + alpha * sum;
        }
        const T alpha_t = narrowed<T>(alpha), beta_t = narrowed<T>(beta);
        driver(team, &trans, &m, &n, &alpha_t, a.data(), &a.ld, x.data(), &incx, &beta_t, y.data(), &incy);
        y.expect(want, std::string(1, trans) + " on " + std::to_string(team));
      }
    expect_callers_choice();
  });
}

TEST_P(Level2Drivers, Gemv) {
  test_gemv<float>(qtb_blas_sgemv_omp);
  test_gemv<double>(qtb_blas_dgemv_omp);
  test_gemv<cfloat>(qtb_blas_cgemv_omp);
  test_gemv<cdouble>(qtb_blas_zgemv_omp);
}

// ---- symv ----

template <class T>
void test_symv(SymvDriver<T> *driver) {
  for_each_case([&](QtbInt team, QtbInt n, QtbInt incx, QtbInt incy) {
    for (const char uplo : {'U', 'L'}) {
      Matrix<T> a(n, n, 1, [&](QtbInt i, QtbInt j) { return in_triangle(uplo, i, j); });
      Vector<T> x(n, incx, 2), y(n, incy, 3);
      const T alpha = 2, beta = -3;
      std::vector<Number> want = y.numbers();
      const std::vector<Number> from = x.numbers();
      for (QtbInt i = 0; i < n; ++i) {
        Number sum = 0;
        for (QtbInt j = 0; j < n; ++j)
          sum += (in_triangle(uplo, i, j) ? a(i, j) : a(j, i)) * from[static_cast<std::size_t>(j)];
        want[static_cast<std::size_t>(i)] = -3.0 * want[static_cast<std::size_t>(i)] + 2.0 * sum;
      }
      driver(team, &uplo, &n, &alpha, a.data(), &a.ld, x.data(), &incx, &beta, y.data(), &incy);
      y.expect(want, std::string(1, uplo) + " on " + std::to_string(team));
    }
    expect_callers_choice();
  });
}

TEST_P(Level2Drivers, Symv) {
  test_symv<float>(qtb_blas_ssymv_omp);
  test_symv<double>(qtb_blas_dsymv_omp);
}

TEST_P(Level2Drivers, SymvOnFiveThreadsHasFourOwnersOfBlocks) {
  const QtbInt n = 300, inc = 1;
  const char uplo = 'L';
  Matrix<double> a(n, n, 1, [](QtbInt i, QtbInt j) { return i >= j; });
  Vector<double> x(n, inc, 2), y(n, inc, 3);
  const double one = 1;
  qtb_blas_dsymv_omp(5, &uplo, &n, &one, a.data(), &a.ld, x.data(), &inc, &one, y.data(), &inc);
  const std::vector<Call> diagonal = stand_ins.calls_of("xdsymv"), rest = stand_ins.calls_of("xdgemv");
  ASSERT_EQ(diagonal.size(), 4U);
  for (int b = 0; b < 4; ++b) EXPECT_EQ(diagonal[static_cast<std::size_t>(b)].thread, b);
  EXPECT_EQ(rest.size(), 2U * 3);  // every block row but the outer ones has a part on either side
  for (const Call &call : rest) EXPECT_LT(call.thread, 4);
}

// ---- syr, syr2 ----

template <class T>
void expect_triangle(Matrix<T> &a, char uplo, const std::vector<Number> &want, const std::string &what) {
  for (QtbInt j = 0; j < a.n; ++j)
    for (QtbInt i = 0; i < a.ld; ++i) {
      const T got = a.at(i, j);
      if (i < a.n && in_triangle(uplo, i, j))
        ASSERT_EQ(widened(got), want[static_cast<std::size_t>(i + j * a.n)]) << what << " " << i << " " << j;
      else
        ASSERT_TRUE(got != got) << what << " " << i << " " << j;
    }
}

template <class T>
void test_syr(SyrDriver<T> *syr, Syr2Driver<T> *syr2) {
  for_each_case([&](QtbInt team, QtbInt n, QtbInt incx, QtbInt incy) {
    for (const char uplo : {'U', 'L'})
      for (const bool two : {false, true}) {
        Matrix<T> a(n, n, 1, [&](QtbInt i, QtbInt j) { return in_triangle(uplo, i, j); });
        Vector<T> x(n, incx, 2), y(n, incy, 3);
        const std::vector<Number> u = x.numbers(), v = y.numbers();
        std::vector<Number> want(static_cast<std::size_t>(n * n));
        for (QtbInt j = 0; j < n; ++j)
          for (QtbInt i = 0; i < n; ++i) {
            const auto p = static_cast<std::size_t>(i), q = static_cast<std::size_t>(j);
            want[static_cast<std::size_t>(i + j * n)] = a(i, j) + 2.0 * (two ? u[p] * v[q] + v[p] * u[q] : u[p] * u[q]);
          }
        const T alpha = 2;
        if (two)
          syr2(team, &uplo, &n, &alpha, x.data(), &incx, y.data(), &incy, a.data(), &a.ld);
        else
          syr(team, &uplo, &n, &alpha, x.data(), &incx, a.data(), &a.ld);
        expect_triangle(a, uplo, want, std::string(1, uplo) + " on " + std::to_string(team));
      }
    expect_callers_choice();
  });
}

TEST_P(Level2Drivers, SyrAndSyr2) {
  if (GetParam() < tier_ssse3) GTEST_SKIP() << "no block slots";
  test_syr<float>(qtb_blas_ssyr_omp, qtb_blas_ssyr2_omp);
  test_syr<double>(qtb_blas_dsyr_omp, qtb_blas_dsyr2_omp);
}

// ---- trmv ----

template <class T>
void test_trmv_case(TrmvDriver<T> *driver, QtbInt team, QtbInt n, QtbInt incx) {
  for (const char uplo : {'U', 'L'})
    for (const char trans : {'N', 'T', 'C'})
      for (const char diag : {'N', 'U'}) {
        const bool unit = diag == 'U';
        Matrix<T> a(n, n, 1, [&](QtbInt i, QtbInt j) { return in_triangle(uplo, i, j) && !(unit && i == j); });
        Vector<T> x(n, incx, 2);
        const std::vector<Number> old = x.numbers();
        std::vector<Number> want(old.size());
        for (QtbInt i = 0; i < n; ++i)
          for (QtbInt j = 0; j < n; ++j) {
            const bool stored = trans == 'N' ? in_triangle(uplo, i, j) : in_triangle(uplo, j, i);
            if (!stored) continue;
            const Number element = unit && i == j ? 1 : trans == 'N' ? a(i, j) : operated(trans, a(j, i));
            want[static_cast<std::size_t>(i)] += element * old[static_cast<std::size_t>(j)];
          }
        driver(team, &uplo, &trans, &diag, &n, a.data(), &a.ld, x.data(), &incx);
        x.expect(want, std::string{uplo, trans, diag} + " " + std::to_string(n) + " on " + std::to_string(team));
        if (testing::Test::HasFatalFailure()) return;
      }
}

template <class T>
void test_trmv(TrmvDriver<T> *driver) {
  for_each_case([&](QtbInt team, QtbInt n, QtbInt incx, QtbInt) {
    test_trmv_case(driver, team, n, incx);
    expect_callers_choice();
  });
}

TEST_P(Level2Drivers, Trmv) {
  if (GetParam() < tier_ssse3) GTEST_SKIP() << "no block slots";
  test_trmv<float>(qtb_blas_strmv_omp);
  test_trmv<double>(qtb_blas_dtrmv_omp);
  test_trmv<cfloat>(qtb_blas_ctrmv_omp);
  test_trmv<cdouble>(qtb_blas_ztrmv_omp);
}

// From this length on a team copies the old vector. The work memory holds NaN, so that an element that is not copied
// shows in every result that it belongs to.
TEST_P(Level2Drivers, TrmvOfLongVectorsReadsEveryElementOfTheOldOne) {
  if (GetParam() < tier_ssse3) GTEST_SKIP() << "no block slots";
  for (const QtbInt n : {2999, 3000, 3001})
    for (const QtbInt team : {2, 5, 16}) {
      const char uplo = 'U', trans = 'N', diag = 'N';
      const QtbInt incx = 1;
      Matrix<double> a(n, n, 1, [](QtbInt i, QtbInt j) { return i <= j; });
      Vector<double> x(n, incx, 2);
      const std::vector<Number> old = x.numbers();
      std::vector<Number> want(old.size());
      for (QtbInt j = 0; j < n; ++j)
        for (QtbInt i = 0; i <= j; ++i) want[static_cast<std::size_t>(i)] += a(i, j) * old[static_cast<std::size_t>(j)];
      qtb_blas_dtrmv_omp(team, &uplo, &trans, &diag, &n, a.data(), &a.ld, x.data(), &incx);
      x.expect(want, std::to_string(n) + " on " + std::to_string(team));
    }
}

TEST_P(Level2Drivers, TrmvAsksForOneCopyOnTheCallersThread) {
  if (GetParam() < tier_ssse3) GTEST_SKIP() << "no block slots";
  test_trmv_case<double>(qtb_blas_dtrmv_omp, 4, 100, -2);
  for (const MemoryRequest &request : recorded_memory.requests) {
    EXPECT_EQ(request.bytes, 800U);
    EXPECT_EQ(request.alignment, 128);
    EXPECT_EQ(request.thread, 0);
  }
  EXPECT_EQ(recorded_memory.requests.size(), 12U);
  EXPECT_EQ(recorded_memory.releases.size(), 12U);
}

TEST_P(Level2Drivers, TrmvWithoutMemoryIsTheSlotsOnTheCallersThread) {
  recorded_memory.fails = [](long, int, int) { return true; };
  test_trmv_case<double>(qtb_blas_dtrmv_omp, 4, 100, 3);
  EXPECT_EQ(stand_ins.calls.size(), 12U);
  for (const Call &call : stand_ins.calls) {
    EXPECT_EQ(call.routine, "xdtrmv");
    EXPECT_EQ(call.team, 1);
  }
}

// ---- Teams that are not what was asked for ----

// Inside a region of the caller the runtime gives a team of one, which is the slot on the whole problem.
TEST_P(Level2Drivers, InsideTheCallersRegionEachCallIsTheSlots) {
  if (GetParam() < tier_ssse3) GTEST_SKIP() << "no block slots";
#pragma omp parallel num_threads(3)
  {
    const QtbInt n = 200, inc = 1;
    const char uplo = 'U', trans = 'T', diag = 'N';
    const double one = 1;
    Matrix<double> a(n, n, 1, [](QtbInt, QtbInt) { return true; });
    Vector<double> x(n, inc, 2), y(n, inc, 3);
    qtb_blas_dgemv_omp(4, &trans, &n, &n, &one, a.data(), &a.ld, x.data(), &inc, &one, y.data(), &inc);
    qtb_blas_dsymv_omp(4, &uplo, &n, &one, a.data(), &a.ld, x.data(), &inc, &one, y.data(), &inc);
    qtb_blas_dsyr_omp(4, &uplo, &n, &one, x.data(), &inc, a.data(), &a.ld);
    qtb_blas_dsyr2_omp(4, &uplo, &n, &one, x.data(), &inc, y.data(), &inc, a.data(), &a.ld);
    qtb_blas_dtrmv_omp(4, &uplo, &trans, &diag, &n, a.data(), &a.ld, x.data(), &inc);
  }
  for (const char *routine : {"xdgemv", "xdsymv", "xdsyr", "xdsyr2", "xdtrmv"}) {
    EXPECT_EQ(stand_ins.calls_of(routine).size(), 3U) << routine;
    for (const Call &call : stand_ins.calls_of(routine))
      EXPECT_EQ(call.number(routine == std::string("xdgemv") ? "m" : "n"), 200);
  }
  EXPECT_EQ(stand_ins.calls.size(), 15U);
}

// The run small_team allows five threads: all that ask for more are cut by the team that comes.
TEST_P(Level2Drivers, ATeamSmallerThanAskedForIsTheOneThatIsCutFor) {
  const QtbInt n = 80, inc = 1;
  const char trans = 'N';
  const double one = 1;
  Matrix<double> a(n, n, 1, [](QtbInt, QtbInt) { return true; });
  Vector<double> x(n, inc, 2), y(n, inc, 3);
  qtb_blas_dgemv_omp(16, &trans, &n, &n, &one, a.data(), &a.ld, x.data(), &inc, &one, y.data(), &inc);
  const std::vector<Call> calls = stand_ins.calls_of("xdgemv");
  const bool limited = std::getenv("OMP_THREAD_LIMIT") != nullptr;
  ASSERT_EQ(calls.size(), limited ? 5U : 16U);
  for (const Call &call : calls) EXPECT_EQ(call.number("m"), limited || call.thread == 15 ? (limited ? 16 : 80) : 0);
}

INSTANTIATE_TEST_SUITE_P(EveryTier, Level2Drivers, testing::Range(0, int{tier_count}),
                         [](const auto &info) { return std::string(tier_name(info.param)); });

}  // namespace
}  // namespace qtb::test
