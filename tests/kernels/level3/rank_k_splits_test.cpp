// How syrk and herk cut the triangle: the strips by value, and the calls that the split makes, of GEMM, of the body and
// of the kernel for four rows.
//
// Linked so that the calls among the kernels of one tier come by here.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "blas/dispatch/slots.h"
#include "blas/kernels/level3/rank_k/strips.h"
#include "tests/support/tiers.h"

namespace qtb::test {
namespace {

using strips::beside_diagonal;
using strips::chunks;
using strips::equal_strips;
using strips::narrow_strips;
using strips::Rectangle;
using strips::Strips;
using strips::wide_strips;

// ---- The strips ----

std::vector<QtbInt> extents(const Strips &s) {
  std::vector<QtbInt> list;
  for (QtbInt i = 0; i < s.count; ++i) list.push_back(s.extent(i));
  return list;
}
using Extents = std::vector<QtbInt>;

TEST(Strips, AreFiveFromTwentyRowsOnInMultiplesOfFour) {
  EXPECT_EQ(extents(equal_strips(4, wide_strips)), Extents({4}));
  EXPECT_EQ(extents(equal_strips(19, wide_strips)), Extents({19}));
  EXPECT_EQ(extents(equal_strips(20, wide_strips)), Extents({4, 4, 4, 4, 4}));
  EXPECT_EQ(extents(equal_strips(21, wide_strips)), Extents({4, 4, 4, 4, 5}));
  EXPECT_EQ(extents(equal_strips(39, wide_strips)), Extents({4, 4, 4, 4, 23}));
  EXPECT_EQ(extents(equal_strips(40, wide_strips)), Extents({8, 8, 8, 8, 8}));
  EXPECT_EQ(extents(equal_strips(1000, wide_strips)), Extents({200, 200, 200, 200, 200}));
}

TEST(Strips, AreThreeInsideFromTwelveRowsOnInMultiplesOfFour) {
  EXPECT_EQ(extents(equal_strips(11, narrow_strips)), Extents({11}));
  EXPECT_EQ(extents(equal_strips(12, narrow_strips)), Extents({4, 4, 4}));
  EXPECT_EQ(extents(equal_strips(13, narrow_strips)), Extents({4, 4, 5}));
  EXPECT_EQ(extents(equal_strips(19, narrow_strips)), Extents({4, 4, 11}));
  EXPECT_EQ(extents(equal_strips(23, narrow_strips)), Extents({4, 4, 15}));
  EXPECT_EQ(extents(equal_strips(24, narrow_strips)), Extents({8, 8, 8}));
  EXPECT_EQ(extents(equal_strips(200, narrow_strips)), Extents({64, 64, 72}));
}

TEST(Chunks, HaveAtMostSeventyTwoRows) {
  EXPECT_EQ(extents(chunks(1)), Extents({1}));
  EXPECT_EQ(extents(chunks(71)), Extents({71}));
  EXPECT_EQ(extents(chunks(72)), Extents({72}));
  EXPECT_EQ(extents(chunks(73)), Extents({72, 1}));
  EXPECT_EQ(extents(chunks(145)), Extents({72, 72, 1}));
}

// Counts how often each element is covered by the rectangles of a cut and by what diagonal(first, order) says.
class Cover {
 public:
  Cover(QtbInt n, bool upper) : n_(n), upper_(upper), times_(static_cast<std::size_t>(n * n)) {}
  void add(QtbInt i0, QtbInt rows, QtbInt j0, QtbInt columns) {
    ASSERT_TRUE(i0 >= 0 && j0 >= 0 && rows > 0 && columns > 0 && i0 + rows <= n_ && j0 + columns <= n_);
    for (QtbInt j = j0; j < j0 + columns; ++j)
      for (QtbInt i = i0; i < i0 + rows; ++i) ++times_[static_cast<std::size_t>(i + j * n_)];
  }
  void add_triangle(QtbInt first, QtbInt order) {
    for (QtbInt j = first; j < first + order; ++j)
      upper_ ? add(first, j + 1 - first, j, 1) : add(j, first + order - j, j, 1);
  }
  bool is_triangle() const {
    for (QtbInt j = 0; j < n_; ++j)
      for (QtbInt i = 0; i < n_; ++i)
        if (times_[static_cast<std::size_t>(i + j * n_)] != ((upper_ ? i <= j : i >= j) ? 1 : 0)) return false;
    return true;
  }

 private:
  QtbInt n_;
  bool upper_;
  std::vector<int> times_;
};

template <class Diagonal>
void walk(const Strips &s, QtbInt first, bool upper, Cover &cover, Diagonal diagonal) {
  for (QtbInt i = 0; i < s.count; ++i) {
    if (i > 0) {
      const Rectangle r = beside_diagonal(s, i, upper);
      cover.add(first + r.i0, r.rows, first + r.j0, r.columns);
    }
    diagonal(first + s.begin(i), s.extent(i));
  }
}

TEST(Strips, CoverEveryElementOfTheTriangleOnceWithAtMostTwentyFiveBlocks) {
  for (QtbInt n = 1; n <= 400; n += n < 150 ? 1 : 37)
    for (const bool upper : {false, true}) {
      Cover cover(n, upper);
      int blocks = 0;
      walk(equal_strips(n, wide_strips), 0, upper, cover, [&](QtbInt first, QtbInt order) {
        walk(equal_strips(order, narrow_strips), first, upper, cover, [&](QtbInt begin, QtbInt rows) {
          ++blocks;
          walk(chunks(rows), begin, upper, cover, [&](QtbInt i0, QtbInt m) {
            ASSERT_LE(m, strips::chunk_rows);
            cover.add_triangle(i0, m);
          });
        });
      });
      ASSERT_TRUE(cover.is_triangle()) << "n " << n << " upper " << upper;
      ASSERT_LE(blocks, 25);
    }
}

// ---- The calls ----

std::vector<std::string> calls;

template <class... A>
void note(const char *format, A... values) {
  char text[100];
  std::snprintf(text, sizeof text, format, values...);
  calls.emplace_back(text);
}

}  // namespace
}  // namespace qtb::test

extern "C" {
#define QTB_WATCH_TRIANGLE(name, shape, T, word)                           \
  QTB_FUNCTION(shape, T, __real_##name);                                   \
  QTB_FUNCTION(shape, T, __wrap_##name);                                   \
  QTB_FUNCTION(shape, T, __wrap_##name) {                                  \
    qtb::test::note(word " %c%c %d", *uplo, *trans, static_cast<int>(*n)); \
    __real_##name(QTB_ARGS(shape));                                        \
  }
#define QTB_WATCH_GEMM(name, T)                                                                       \
  QTB_FUNCTION(gemm, T, __real_##name);                                                               \
  QTB_FUNCTION(gemm, T, __wrap_##name);                                                               \
  QTB_FUNCTION(gemm, T, __wrap_##name) {                                                              \
    qtb::test::note("gemm %c%c %dx%d", *transa, *transb, static_cast<int>(*m), static_cast<int>(*n)); \
    __real_##name(QTB_ARGS(gemm));                                                                    \
  }
QTB_WATCH_TRIANGLE(qtb_blas_sse42_xdsyrk_body, syrk, double, "body")
QTB_WATCH_TRIANGLE(qtb_blas_sse42_xdsyrk_n4, syrk, double, "four")
QTB_WATCH_TRIANGLE(qtb_blas_sse42_xssyrk_body, syrk, float, "body")
QTB_WATCH_TRIANGLE(qtb_blas_sse42_xcsyrk_body, syrk, cfloat, "body")
QTB_WATCH_TRIANGLE(qtb_blas_sse42_xzherk_body, herk, cdouble, "body")
QTB_WATCH_GEMM(qtb_blas_sse42_xdgemm, double)
QTB_WATCH_GEMM(qtb_blas_sse42_xcgemm, cfloat)
QTB_WATCH_GEMM(qtb_blas_sse42_xzgemm, cdouble)
QTB_WATCH_GEMM(qtb_blas_def_xdgemm, double)
QTB_WATCH_GEMM(qtb_blas_def_xzgemm, cdouble)
}

namespace qtb::test {
namespace {

// The calls that a routine makes for a triangle of order n, in their order.
template <class T, class S>
std::vector<std::string> calls_of(void (*routine)(const char *, const char *, const QtbInt *, const QtbInt *, const S *,
                                                  const T *, const QtbInt *, const S *, T *, const QtbInt *),
                                  const char *uplo, const char *trans, QtbInt n, QtbInt k) {
  const QtbInt ld = std::max(n, k);
  std::vector<T> a(static_cast<std::size_t>(ld * ld)), c(static_cast<std::size_t>(ld * ld));
  S half{};
  reinterpret_cast<Real<S> &>(half) = 0.5;
  calls.clear();
  routine(uplo, trans, &n, &k, &half, a.data(), &ld, &half, c.data(), &ld);
  return calls;
}
using Calls = std::vector<std::string>;

class Splits : public testing::Test {
 protected:
  void SetUp() override {
    if (!processor_runs(tier_sse42)) GTEST_SKIP();
  }
};

TEST_F(Splits, OfFourRowsAreTheKernelOfFourInDoublePrecisionAlone) {
  EXPECT_EQ(calls_of(qtb_blas_sse42_xdsyrk, "u", "n", 4, 3), Calls({"four UN 4"}));
  EXPECT_EQ(calls_of(qtb_blas_sse42_xdsyrk, "L", "c", 4, 3), Calls({"four LT 4"}));
  EXPECT_EQ(calls_of(qtb_blas_sse42_xdsyrk, "u", "n", 3, 3), Calls({"body UN 3"}));
  EXPECT_EQ(calls_of(qtb_blas_sse42_xdsyrk, "u", "n", 5, 3), Calls({"body UN 5"}));
  EXPECT_EQ(calls_of(qtb_blas_sse42_xssyrk, "u", "t", 4, 3), Calls({"body UT 4"}));
  EXPECT_EQ(calls_of(qtb_blas_sse42_xcsyrk, "l", "n", 4, 3), Calls({"body LN 4"}));
  EXPECT_EQ(calls_of(qtb_blas_sse42_xzherk, "u", "c", 4, 3), Calls({"body UC 4"}));
}

TEST_F(Splits, OfNoDepthAreTheBodyWhichScales) {
  for (const QtbInt n : {3, 4, 20, 100}) {
    const std::string order = std::to_string(n);
    EXPECT_EQ(calls_of(qtb_blas_sse42_xdsyrk, "U", "N", n, 0), Calls({"body UN " + order}));
    EXPECT_EQ(calls_of(qtb_blas_sse42_xzherk, "L", "C", n, 0), Calls({"body LC " + order}));
  }
}

TEST_F(Splits, OfTwelveRowsAreThreeStrips) {
  EXPECT_EQ(calls_of(qtb_blas_sse42_xdsyrk, "U", "N", 11, 2), Calls({"body UN 11"}));
  EXPECT_EQ(calls_of(qtb_blas_sse42_xdsyrk, "U", "N", 12, 2),
            Calls({"four UN 4", "gemm NT 4x4", "four UN 4", "gemm NT 8x4", "four UN 4"}));
  EXPECT_EQ(calls_of(qtb_blas_sse42_xcsyrk, "L", "T", 12, 2),
            Calls({"body LT 4", "gemm TN 4x4", "body LT 4", "gemm TN 4x8", "body LT 4"}));
}

TEST_F(Splits, OfNineteenRowsAreThreeStripsAndOfTwentyFive) {
  EXPECT_EQ(calls_of(qtb_blas_sse42_xdsyrk, "L", "T", 19, 2),
            Calls({"four LT 4", "gemm TN 4x4", "four LT 4", "gemm TN 11x8", "body LT 11"}));
  EXPECT_EQ(calls_of(qtb_blas_sse42_xdsyrk, "U", "N", 20, 2),
            Calls({"four UN 4", "gemm NT 4x4", "four UN 4", "gemm NT 8x4", "four UN 4", "gemm NT 12x4", "four UN 4",
                   "gemm NT 16x4", "four UN 4"}));
  EXPECT_EQ(calls_of(qtb_blas_sse42_xzherk, "L", "N", 21, 2),
            Calls({"body LN 4", "gemm NC 4x4", "body LN 4", "gemm NC 4x8", "body LN 4", "gemm NC 4x12", "body LN 4",
                   "gemm NC 5x16", "body LN 5"}));
}

TEST_F(Splits, OfTheBodyAreItsChunksAndGemmBetweenThem) {
  EXPECT_EQ(calls_of(qtb_blas_sse42_xdsyrk_body, "U", "T", 72, 2), Calls({"body UT 72"}));
  EXPECT_EQ(calls_of(qtb_blas_sse42_xdsyrk_body, "U", "T", 73, 2), Calls({"body UT 73", "gemm TN 72x1"}));
  EXPECT_EQ(calls_of(qtb_blas_sse42_xzherk_body, "L", "N", 150, 2),
            Calls({"body LN 150", "gemm NC 72x72", "gemm NC 6x144"}));
}

TEST(Tiles, OnTheDiagonalAreWholeSquaresOfGemmAndOffItRectangles) {
  EXPECT_EQ(calls_of(qtb_blas_def_xdsyrk, "U", "N", 128, 2), Calls({"gemm NT 128x128"}));
  EXPECT_EQ(calls_of(qtb_blas_def_xdsyrk, "U", "N", 129, 2),
            Calls({"gemm NT 128x128", "gemm NT 128x1", "gemm NT 1x1"}));
  EXPECT_EQ(calls_of(qtb_blas_def_xzherk, "L", "C", 66, 2),
            Calls({"gemm CN 32x32", "gemm CN 2x32", "gemm CN 32x32", "gemm CN 2x32", "gemm CN 32x32", "gemm CN 2x2"}));
  EXPECT_EQ(calls_of(qtb_blas_def_xzherk, "L", "C", 255, 1).front(), "gemm CN 32x32");
  EXPECT_EQ(calls_of(qtb_blas_def_xzherk, "L", "C", 256, 1).front(), "gemm CN 64x64");
  EXPECT_EQ(calls_of(qtb_blas_def_xdsyrk, "U", "N", 129, 0), Calls());
}

}  // namespace
}  // namespace qtb::test
