// The parallel drivers of Level 3 beside gemm, on real teams: every call that they make is noted by stand-ins and laid
// out on the result, of which each element has to be covered once, from the right rows and columns of the operands. The
// matrices are addresses that nothing touches.
//
// The run small_team allows five threads: the drivers then cut for the team that comes.

#include <xmmintrin.h>

#include <functional>
#include <map>

#include "blas/thread/32/level3/symm_omp.h"
#include "blas/thread/32/level3/syr2k_omp.h"
#include "blas/thread/32e/level3/syrk_omp.h"
#include "blas/thread/32e/level3/trmm_omp.h"
#include "blas/thread/drivers.h"
#include "tests/thread/recorded_memory.h"
#include "tests/thread/stand_ins.h"

QTB_RECORDED_MEMORY_SERVICE

extern "C" {
#define QTB_PRODUCT(t, T) \
  QTB_FUNCTION(gemm, T, qtb_blas_##t##gemm) { return QTB_STAND_IN(#t "gemm", gemm, T, nullptr); }
QTB_PRODUCT(s, float)
QTB_PRODUCT(d, double)
QTB_PRODUCT(c, cfloat)
QTB_PRODUCT(z, cdouble)
}

namespace qtb::test {
namespace {

// ---- A problem and what is made of it ----

template <class T>
T value(double re, double im) {
  if constexpr (is_complex<T>)
    return {static_cast<Real<T>>(re), static_cast<Real<T>>(im)};
  else
    return static_cast<T>(re);
}

// An element of one of the matrices.
struct Place {
  QtbInt row, column;
  char matrix;
};

constexpr QtbInt lda = 1009, ldb = 1013, ldc = 1019;

template <class T>
struct Matrices {
  const T *a = reinterpret_cast<const T *>(std::uintptr_t{1} << 40);
  T *b = reinterpret_cast<T *>(std::uintptr_t{2} << 40);
  T *c = reinterpret_cast<T *>(std::uintptr_t{3} << 40);
  T alpha = value<T>(2, 1), beta = value<T>(3, -2);
  Real<T> real_alpha = 2, real_beta = 3;

  Place place(const void *pointer) const {
    const auto address = reinterpret_cast<std::uintptr_t>(pointer);
    const auto of = static_cast<QtbInt>((address & ((std::uintptr_t{1} << 40) - 1)) / sizeof(T));
    const auto number = static_cast<std::size_t>(address >> 40) - 1;
    const QtbInt ld = std::array{lda, ldb, ldc}[number];
    return {of % ld, of / ld, "abc"[number]};
  }
};

// How often each element of an m x n result is covered.
class Cover {
 public:
  Cover(QtbInt m, QtbInt n) : m_(m), times_(static_cast<std::size_t>(m * n)) {}
  // A rectangle, which lies in the result; if it is empty, where it begins does.
  void add(Place at, QtbInt rows, QtbInt columns) {
    ASSERT_TRUE(rows >= 0 && columns >= 0 && at.row >= 0 && at.row < m_ && at.row + rows <= m_);
    ASSERT_TRUE(at.column >= 0 && (at.column + columns) * m_ <= static_cast<QtbInt>(times_.size()));
    for (QtbInt j = at.column; j < at.column + columns; ++j)
      for (QtbInt i = at.row; i < at.row + rows; ++i) ++times_[static_cast<std::size_t>(i + j * m_)];
  }
  void add_triangle(Place at, QtbInt order, bool upper) {
    ASSERT_EQ(at.row, at.column);
    for (QtbInt j = 0; j < order; ++j)
      add({at.row + (upper ? 0 : j), at.column + j, at.matrix}, upper ? j + 1 : order - j, 1);
  }
  template <class Is>
  void expect(Is is) const {
    for (QtbInt at = 0; at < static_cast<QtbInt>(times_.size()); ++at)
      ASSERT_EQ(times_[static_cast<std::size_t>(at)], is(at % m_, at / m_)) << at % m_ << ' ' << at / m_;
  }

 private:
  QtbInt m_;
  std::vector<int> times_;
};

// The threads that the runtime delivers where so many are asked for.
int team_of(QtbInt asked) { return std::min(static_cast<int>(asked), omp_get_thread_limit()); }

class Level3Drivers : public testing::Test {
 protected:
  void SetUp() override {
    stand_ins = StandIns{};
    recorded_memory.forget();
  }
  // Whatever a test did: each call had the caller's rounding, and nobody asked for memory.
  void TearDown() override { EXPECT_TRUE(recorded_memory.requests.empty()); }
};

constexpr QtbInt asked_teams[] = {1, 2, 3, 4, 7, 8, 13, 16};

// The calls of a routine, all in a team of that size.
std::vector<Call> calls_in_team(const std::string &routine, int team) {
  std::vector<Call> calls = stand_ins.calls_of(routine);
  for (const Call &call : calls) {
    EXPECT_EQ(call.team, team);
    EXPECT_EQ(call.floating_choice, floating_choice());
  }
  return calls;
}
// One of each thread.
std::vector<Call> calls_of_team(const std::string &routine, int team) {
  std::vector<Call> calls = calls_in_team(routine, team);
  EXPECT_EQ(calls.size(), static_cast<std::size_t>(team));
  for (std::size_t i = 0; i < calls.size(); ++i) EXPECT_EQ(calls[i].thread, static_cast<int>(i));
  return calls;
}

// ---- Slabs ----

// The calls of a driver whose threads have slabs of the matrix named last, with the rest of the arguments the caller's.
template <class T>
void expect_slabs(const std::string &routine, const Matrices<T> &p, char side, QtbInt m, QtbInt n, QtbInt asked,
                  QtbInt unit, const std::map<std::string, const void *> &sent, bool has_c) {
  SCOPED_TRACE(routine + ' ' + side + ' ' + std::to_string(m) + " x " + std::to_string(n) + " on " +
               std::to_string(asked));
  const bool left = side == 'L' || side == 'l';
  const int team = team_of(asked);
  Cover cover(m, n);
  for (const Call &call : calls_of_team(routine, team)) {
    for (const auto &[name, pointer] : sent) EXPECT_EQ(call.pointer(name), pointer) << name;
    EXPECT_EQ(call.number(left ? "m" : "n"), left ? m : n);
    const Place at = p.place(call.pointer("b"));
    ASSERT_NO_FATAL_FAILURE(cover.add(at, call.number("m"), call.number("n")));
    EXPECT_TRUE(call.thread == team - 1 || call.number(left ? "n" : "m") == (left ? n : m) / team / unit * unit);
    if (!has_c) continue;
    const Place at_c = p.place(call.pointer("c"));
    EXPECT_TRUE(at_c.row == at.row && at_c.column == at.column);
  }
  cover.expect([](QtbInt, QtbInt) { return 1; });
}

template <class T>
void test_trmm(void (*driver)(const TrmmDecision *, QTB_PARAMS_trmm(T)), const char *routine) {
  const Matrices<T> p;
  const char uplo = 'L', transa = 'T', diag = 'U';
  for (const QtbInt asked : asked_teams)
    for (const char side : {'L', 'r'})
      for (const QtbInt unit : {1, 4, 8})
        for (const auto &[m, n] : {std::pair<QtbInt, QtbInt>{3, 100}, {100, 3}, {65, 67}, {1, 1}}) {
          const TrmmDecision decision = {asked, unit};
          stand_ins.calls.clear();
          driver(&decision, &side, &uplo, &transa, &diag, &m, &n, &p.alpha, p.a, &lda, p.b, &ldb);
          expect_slabs(routine, p, side, m, n, asked, unit,
                       {{"side", &side},
                        {"uplo", &uplo},
                        {"transa", &transa},
                        {"diag", &diag},
                        {"alpha", &p.alpha},
                        {"a", p.a},
                        {"lda", &lda},
                        {"ldb", &ldb}},
                       false);
          if (testing::Test::HasFailure()) return;
        }
}

TEST_F(Level3Drivers, TrmmAndTrsmCutBAndReadAllOfTheTriangle) {
#define QTB_TEST_TRMM(name, T) test_trmm<T>(qtb_blas_##name##_omp, "x" #name);
  QTB_FOR_EACH_TRMM(QTB_TEST_TRMM)
  QTB_FOR_EACH_TRSM(QTB_TEST_TRMM)
}

// Below the unit each, all but the last thread have no columns, at an address inside.
TEST_F(Level3Drivers, AShareBelowTheUnitLeavesAllToTheLastThread) {
  const Matrices<double> p;
  const TrmmDecision decision = {4, 8};
  const char side = 'L', letter = 'U';
  const QtbInt m = 5, n = 31;
  qtb_blas_dtrsm_omp(&decision, &side, &letter, &letter, &letter, &m, &n, &p.alpha, p.a, &lda, p.b, &ldb);
  for (const Call &call : calls_of_team("xdtrsm", 4)) {
    EXPECT_EQ(call.number("n"), call.thread == 3 ? 31 : 0);
    EXPECT_EQ(call.pointer("b"), p.b);
  }
}

// Rows that are none: every thread calls with none of them, at the matrix itself.
TEST_F(Level3Drivers, NoRowsAreCutIntoNone) {
  const Matrices<float> p;
  const TrmmDecision decision = {3, 1};
  const char side = 'R', letter = 'U';
  const QtbInt m = 0, n = 31;
  qtb_blas_strsm_omp(&decision, &side, &letter, &letter, &letter, &m, &n, &p.alpha, p.a, &lda, p.b, &ldb);
  for (const Call &call : calls_of_team("xstrsm", 3)) {
    EXPECT_EQ(call.number("m"), 0);
    EXPECT_EQ(call.pointer("b"), p.b);
  }
}

template <class T>
void test_symm(void (*driver)(QtbInt, QTB_PARAMS_symm(T)), const char *routine) {
  const Matrices<T> p;
  const char uplo = 'L';
  for (const QtbInt asked : asked_teams)
    for (const char side : {'l', 'R'})
      for (const auto &[m, n] : {std::pair<QtbInt, QtbInt>{17, 3}, {3, 17}, {65, 67}}) {
        stand_ins.calls.clear();
        driver(asked, &side, &uplo, &m, &n, &p.alpha, p.a, &lda, p.b, &ldb, &p.beta, p.c, &ldc);
        expect_slabs(routine, p, side, m, n, asked, 1,
                     {{"side", &side},
                      {"uplo", &uplo},
                      {"alpha", &p.alpha},
                      {"a", p.a},
                      {"lda", &lda},
                      {"ldb", &ldb},
                      {"beta", &p.beta},
                      {"ldc", &ldc}},
                     true);
        if (testing::Test::HasFailure()) return;
      }
}

TEST_F(Level3Drivers, SymmAndHemmCutBAndCAndReadAllOfTheSymmetricMatrix) {
#define QTB_TEST_SYMM(name, T) test_symm<T>(qtb_blas_##name##_omp, "x" #name);
  QTB_FOR_EACH_SYMM(QTB_TEST_SYMM)
  QTB_FOR_EACH_HEMM(QTB_TEST_SYMM)
}

// ---- Updates of a triangle ----

// An update of op(A), or of op(A) and op(B), and what its calls have to be made of.
template <class T, class Alpha, class Beta>
struct Update {
  char uplo, trans;
  QtbInt n;
  Alpha alpha;
  Beta beta;
  QtbInt k = 23;
  Matrices<T> p = {};
  Cover cover{n, n};

  bool upper() const { return uplo == 'U' || uplo == 'u'; }
  bool plain() const { return trans == 'N' || trans == 'n'; }
  template <class Factor>
  static T wide(Factor factor) {
    if constexpr (std::is_same_v<Factor, T>)
      return factor;
    else
      return {factor, 0};
  }

  // Row block f of an operand: rows of the matrix for "N", columns otherwise.
  void expect_row_block(const void *pointer, char matrix, QtbInt f) const {
    const Place at = p.place(pointer);
    EXPECT_EQ(at.matrix, matrix);
    EXPECT_EQ(plain() ? at.row : at.column, f);
    EXPECT_EQ(plain() ? at.column : at.row, 0);
  }
  void add_diagonal(const Call &call) {
    EXPECT_TRUE(call.pointer("uplo") == &uplo && call.pointer("trans") == &trans && call.pointer("k") == &k);
    EXPECT_TRUE(call.pointer("lda") == &lda && call.pointer("ldc") == &ldc);
    EXPECT_TRUE(call["alpha"].bytes == bytes_of(alpha) && call["beta"].bytes == bytes_of(beta));
    const Place at = p.place(call.pointer("c"));
    expect_row_block(call.pointer("a"), 'a', at.row);
    cover.add_triangle(at, call.number("n"), upper());
  }
  // A product of op(left) and op(right)', where the letters of both operations are given.
  void add_product(const Call &call, char left, char right, std::string operations, T with_alpha, T with_beta) {
    const std::string letters = {static_cast<char>(call.number("transa")), static_cast<char>(call.number("transb"))};
    EXPECT_EQ(letters, operations);
    EXPECT_TRUE(call["alpha"].bytes == bytes_of(with_alpha) && call["beta"].bytes == bytes_of(with_beta));
    EXPECT_TRUE(call.number("k") == k && call.pointer("ldc") == &ldc);
    EXPECT_EQ(call.pointer("lda"), left == 'a' ? &lda : &ldb);
    EXPECT_EQ(call.pointer("ldb"), right == 'a' ? &lda : &ldb);
    const Place at = p.place(call.pointer("c"));
    expect_row_block(call.pointer("a"), left, at.row);
    expect_row_block(call.pointer("b"), right, at.column);
    cover.add(at, call.number("m"), call.number("n"));
  }
  // Elements of the triangle once on the diagonal blocks, and so many times in the rectangles.
  void expect_covered(int products, const std::function<bool(QtbInt, QtbInt)> &is_diagonal) const {
    cover.expect([&](QtbInt i, QtbInt j) {
      if (upper() ? i > j : i < j) return 0;
      return is_diagonal(i, j) ? 1 : products;
    });
  }
};

constexpr char trans_of_update[] = {'N', 'n', 'T', 'c'};
constexpr QtbInt orders[] = {64, 100, 131};

template <class T, class Factor, class Driver>
void test_tiles(Driver *driver, const std::string &name, Factor alpha, Factor beta) {
  for (const QtbInt asked : asked_teams)
    for (const char uplo : {'U', 'l'})
      for (const char trans : trans_of_update)
        for (const QtbInt n : orders) {
          if (asked > 8 && n < 8 * asked) continue;
          SCOPED_TRACE(name + ' ' + uplo + trans + ' ' + std::to_string(n) + " on " + std::to_string(asked));
          Update<T, Factor, Factor> u{uplo, trans, n, alpha, beta};
          stand_ins.calls.clear();
          driver(asked, &u.uplo, &u.trans, &u.n, &u.k, &u.alpha, u.p.a, &lda, &u.beta, u.p.c, &ldc);
          const int team = team_of(asked);
          const char other = is_complex<T> && std::is_same_v<T, Factor> ? 'T' : 'C';
          const std::string operations = u.plain() ? std::string{trans, other} : std::string{trans, 'N'};
          const std::vector<Call> triangles = calls_in_team("x" + name, team);
          EXPECT_EQ(triangles.size(), team == 1 ? 1U : 2U * static_cast<unsigned>(team));
          for (const Call &call : triangles) u.add_diagonal(call);
          for (const Call &call : calls_in_team("x" + name.substr(0, 1) + "gemm", team))
            u.add_product(call, 'a', 'a', operations, u.wide(alpha), u.wide(beta));
          u.expect_covered(1, [](QtbInt, QtbInt) { return true; });
          if (testing::Test::HasFailure()) return;
        }
}

// The factors of each shape: a Hermitian update has real ones.
#define QTB_FACTOR_syrk(T) T
#define QTB_FACTOR_herk(T) Real<T>

TEST_F(Level3Drivers, SyrkByTilesCoversTheTriangleOnceWithinTheTeam) {
#define QTB_TEST_TILES(name, shape, T)                                                                   \
  test_tiles<T, QTB_FACTOR_##shape(T)>(qtb_blas_##name##_omp, #name, value<QTB_FACTOR_##shape(T)>(2, 1), \
                                       value<QTB_FACTOR_##shape(T)>(3, -2));
  QTB_FOR_EACH_SYRK(QTB_TEST_TILES)
}

// The calls of the two stages, on the threads of a team and then on the caller's: the diagonal blocks all before the
// first product.
template <class U, class Products>
void expect_stages(U &u, const std::string &name, QtbInt asked, int per_strip, const Products &add_products) {
  const int team = team_of(asked);
  const std::string product = name.substr(0, 1) + "gemm";
  for (const Call &call : calls_of_team("x" + name, team)) u.add_diagonal(call);
  const std::vector<Call> products = calls_in_team(product, 1);
  ASSERT_EQ(products.size(), static_cast<std::size_t>((team - 1) * per_strip));
  for (std::size_t at = 0; at < stand_ins.calls.size(); ++at)
    EXPECT_EQ(stand_ins.calls[at].routine, at < static_cast<std::size_t>(team) ? "x" + name : product);
  for (std::size_t at = 0; at < products.size(); at += static_cast<std::size_t>(per_strip)) add_products(&products[at]);
  const QtbInt share = u.n / team;
  u.expect_covered(per_strip, [=](QtbInt i, QtbInt j) {
    const auto block = [=](QtbInt r) { return share == 0 ? 0 : std::min<QtbInt>(r / share, team - 1); };
    return block(i) == block(j);
  });
}

constexpr QtbInt strip_orders[] = {17, 63, 64, 100};

template <class T, class Factor, class Driver>
void test_strips(Driver *driver, const std::string &name) {
  const char other = is_complex<T> && !std::is_same_v<T, Factor> ? 'C' : 'T';
  for (const QtbInt asked : asked_teams)
    for (const char uplo : {'u', 'L'})
      for (const char trans : trans_of_update)
        for (const QtbInt n : strip_orders) {
          SCOPED_TRACE(name + ' ' + uplo + trans + ' ' + std::to_string(n) + " on " + std::to_string(asked));
          Update<T, Factor, Factor> u{uplo, trans, n, value<Factor>(2, 1), value<Factor>(3, -2)};
          stand_ins.calls.clear();
          driver(asked, &u.uplo, &u.trans, &u.n, &u.k, &u.alpha, u.p.a, &lda, &u.beta, u.p.c, &ldc);
          expect_stages(u, name, asked, 1, [&](const Call *call) {
            u.add_product(*call, 'a', 'a', u.plain() ? std::string{'N', other} : std::string{other, 'N'},
                          u.wide(u.alpha), u.wide(u.beta));
          });
          if (testing::Test::HasFailure()) return;
        }
}

TEST_F(Level3Drivers, SyrkByStripsHasTheDiagonalInTheTeamAndThenProductsOnTheCaller) {
#define QTB_TEST_STRIPS(name, shape, T) test_strips<T, QTB_FACTOR_##shape(T)>(qtb_blas_##name##_strips_omp, #name);
  QTB_FOR_EACH_SYRK(QTB_TEST_STRIPS)
}

// The second product of a strip adds to what the first has made, with the conjugate of alpha where C is Hermitian.
template <class T, class Beta, class Driver>
void test_syr2k(Driver *driver, const std::string &name) {
  constexpr bool hermitian = is_complex<T> && !std::is_same_v<T, Beta>;
  const char other = hermitian ? 'C' : 'T';
  for (const QtbInt asked : asked_teams)
    for (const char uplo : {'u', 'L'})
      for (const char trans : trans_of_update)
        for (const QtbInt n : strip_orders) {
          SCOPED_TRACE(name + ' ' + uplo + trans + ' ' + std::to_string(n) + " on " + std::to_string(asked));
          Update<T, T, Beta> u{uplo, trans, n, value<T>(2, 1), value<Beta>(3, -2)};
          stand_ins.calls.clear();
          driver(asked, &u.uplo, &u.trans, &u.n, &u.k, &u.alpha, u.p.a, &lda, u.p.b, &ldb, &u.beta, u.p.c, &ldc);
          for (const Call &call : stand_ins.calls_of("x" + name))
            u.expect_row_block(call.pointer("b"), 'b', u.p.place(call.pointer("c")).row);
          const std::string operations = u.plain() ? std::string{'N', other} : std::string{other, 'N'};
          expect_stages(u, name, asked, 2, [&](const Call *calls) {
            u.add_product(calls[0], 'a', 'b', operations, u.alpha, u.wide(u.beta));
            u.add_product(calls[1], 'b', 'a', operations, hermitian ? value<T>(2, -1) : u.alpha, value<T>(1, 0));
            EXPECT_EQ(calls[0].pointer("c"), calls[1].pointer("c"));
          });
          if (testing::Test::HasFailure()) return;
        }
}

TEST_F(Level3Drivers, Syr2kAndHer2kHaveTwoProductsForEachStrip) {
#define QTB_TEST_SYR2K(name, T) test_syr2k<T, T>(qtb_blas_##name##_omp, #name);
#define QTB_TEST_HER2K(name, T) test_syr2k<T, Real<T>>(qtb_blas_##name##_omp, #name);
  QTB_FOR_EACH_SYR2K(QTB_TEST_SYR2K)
  QTB_FOR_EACH_HER2K(QTB_TEST_HER2K)
}

// More threads than rows: all but the last have an empty block, and the strips are empty.
TEST_F(Level3Drivers, MoreThreadsThanRowsLeaveAllToTheLastThread) {
  Update<double, double, double> u{'L', 'N', 3, 2, 3};
  qtb_blas_dsyrk_strips_omp(5, &u.uplo, &u.trans, &u.n, &u.k, &u.alpha, u.p.a, &lda, &u.beta, u.p.c, &ldc);
  for (const Call &call : calls_of_team("xdsyrk", 5)) EXPECT_EQ(call.number("n"), call.thread == 4 ? 3 : 0);
  for (const Call &call : stand_ins.calls_of("dgemm")) EXPECT_TRUE(call.number("n") == 0 && call.number("m") == 3);
}

// ---- Teams and surroundings ----

TEST_F(Level3Drivers, EveryThreadHasTheCallersRounding) {
  const unsigned before = _mm_getcsr();
  _mm_setcsr((before & ~unsigned{_MM_ROUND_MASK}) | _MM_ROUND_UP | _MM_FLUSH_ZERO_ON);
  const Matrices<double> p;
  const TrmmDecision decision = {4, 1};
  const char side = 'L', uplo = 'U', letter = 'N';
  const QtbInt n = 64;
  qtb_blas_dtrmm_omp(&decision, &side, &uplo, &letter, &letter, &n, &n, &p.alpha, p.a, &lda, p.b, &ldb);
  qtb_blas_dsyrk_omp(4, &uplo, &letter, &n, &n, &p.alpha, p.a, &lda, &p.beta, p.c, &ldc);
  qtb_blas_dsyr2k_omp(4, &uplo, &letter, &n, &n, &p.alpha, p.a, &lda, p.b, &ldb, &p.beta, p.c, &ldc);
  for (const Call &call : stand_ins.calls) EXPECT_EQ(call.floating_choice, floating_choice()) << call.routine;
  _mm_setcsr(before);
}

// Inside a region of the caller the runtime gives a team of one, which is the slot on the whole problem.
TEST_F(Level3Drivers, InsideTheCallersRegionEachCallIsOneOfTheSlot) {
  const Matrices<cdouble> p;
  const char side = 'R', uplo = 'U', letter = 'N';
  const QtbInt n = 64;
#pragma omp parallel num_threads(3)
  {
    const TrmmDecision decision = {4, 1};
    qtb_blas_ztrsm_omp(&decision, &side, &uplo, &letter, &letter, &n, &n, &p.alpha, p.a, &lda, p.b, &ldb);
    qtb_blas_zhemm_omp(4, &side, &uplo, &n, &n, &p.alpha, p.a, &lda, p.b, &ldb, &p.beta, p.c, &ldc);
    qtb_blas_zherk_omp(4, &uplo, &letter, &n, &n, &p.real_alpha, p.a, &lda, &p.real_beta, p.c, &ldc);
    qtb_blas_zherk_strips_omp(4, &uplo, &letter, &n, &n, &p.real_alpha, p.a, &lda, &p.real_beta, p.c, &ldc);
    qtb_blas_zher2k_omp(4, &uplo, &letter, &n, &n, &p.alpha, p.a, &lda, p.b, &ldb, &p.real_beta, p.c, &ldc);
  }
  for (const char *routine : {"xztrsm", "xzhemm", "xzherk", "xzher2k"}) {
    const std::vector<Call> calls = stand_ins.calls_of(routine);
    EXPECT_EQ(calls.size(), routine == std::string("xzherk") ? 6U : 3U);
    for (const Call &call : calls) EXPECT_EQ(call.number("n"), n) << routine;
  }
  EXPECT_EQ(stand_ins.calls.size(), 15U);
}

}  // namespace
}  // namespace qtb::test
