// The pieces of a triangle that parallel drivers call, cut and put together again: trmv_block, syr_block, syr2_block;
// and the bodies of the rank-k updates.
//
// The other triangle, a unit diagonal and the imaginary parts of a Hermitian diagonal hold NaN.
#include <vector>

#include "tests/kernels/level3/pieces.h"

namespace qtb::test {
namespace {

constexpr int block_tiers[] = {tier_ssse3, tier_sse42, tier_avx};
static_assert(tier_set::PIECES == (tier_set::SSSE3 | tier_set::SSE42 | tier_set::AVX),
              "tests/kernels/level3/triangle_pieces_test.cpp: write the new tier into block_tiers, and after SSSE3, "
              "SSE42 and AVX wherever they stand below");
#define QTB_BLOCK_TIERS(name) \
  { qtb_blas_ssse3_x##name, qtb_blas_sse42_x##name, qtb_blas_avx_x##name }

template <class T>
struct Procedures {
  using TrmvBlock = QTB_FUNCTION_TYPE(trmv_block, T);
  const char *name;
  TrmvBlock *trmv_block[3];
};
template <class T>
constexpr Procedures<T> procedures;
template <>
constexpr Procedures<float> procedures<float> = {"strmv_block", QTB_BLOCK_TIERS(strmv_block)};
template <>
constexpr Procedures<double> procedures<double> = {"dtrmv_block", QTB_BLOCK_TIERS(dtrmv_block)};
template <>
constexpr Procedures<cfloat> procedures<cfloat> = {"ctrmv_block", QTB_BLOCK_TIERS(ctrmv_block)};
template <>
constexpr Procedures<cdouble> procedures<cdouble> = {"ztrmv_block", QTB_BLOCK_TIERS(ztrmv_block)};

bool is_stored(bool upper, QtbInt i, QtbInt j) { return upper ? i <= j : i >= j; }

// An n x n matrix of which one triangle may be touched.
template <class T>
struct HalfMatrix : Stored<T> {
  bool upper;
  HalfMatrix(QtbInt n, bool up) : Stored<T>(n, n), upper(up) {
    for (QtbInt j = 0; j < n; j++)
      for (QtbInt i = 0; i < n; i++)
        if (!is_stored(up, i, j)) *this->at(i, j) = value<T>(NAN, NAN);
  }
};

// A vector of the interface: element i of n at increment inc, NaN between.
template <class T>
struct Spread {
  QtbInt n, inc;
  Guarded<T> array;
  Spread(QtbInt count, QtbInt increment)
      : n(count), inc(increment), array(count > 0 ? static_cast<std::size_t>((count - 1) * std::abs(inc) + 1) : 0) {
    for (std::size_t i = 0; i < array.size(); i++) array[i] = value<T>(NAN, NAN);
    for (QtbInt i = 0; i < n; i++) *at(i) = draw<T>();
  }
  T *at(QtbInt i) { return array.data() + (inc < 0 ? (i + 1 - n) * inc : i * inc); }
  // What a piece of len elements from start is called with.
  T *piece(QtbInt start, QtbInt len) { return len == 0 ? array.data() : inc < 0 ? at(start + len - 1) : at(start); }
};

// Cuts of n columns into pieces.
std::vector<std::vector<QtbInt>> cuts(QtbInt n) {
  return {{n}, {n / 3, n - n / 3}, {n / 2, 0, n / 4, n - n / 2 - n / 4}};
}

template <class T>
class TrianglePieces : public Seeded {};
using Types = testing::Types<float, double, cfloat, cdouble>;
TYPED_TEST_SUITE(TrianglePieces, Types);

TYPED_TEST(TrianglePieces, OfATriangularProductTakeWhatLiesOutsideFromTheCopy) {
  using T = TypeParam;
  for (int which = 0; which < 3; which++) {
    if (!processor_runs(block_tiers[which])) continue;
    Tally &tally = TallyReport::of(procedures<T>.name);
    for (const char *uplo : {"U", "l"})
      for (const char *trans : {"n", "T", "C"})
        for (const char *diag : {"N", "u"})
          for (QtbInt n : {1, 4, 9, 41, 150})
            for (QtbInt incx : {1, -1, 3, -2})
              for (const std::vector<QtbInt> &cut : cuts(n)) {
                const bool upper = *uplo == 'U', unit = *diag == 'u', by_columns = *trans == 'n';
                HalfMatrix<T> a(n, upper);
                Spread<T> x(n, incx);
                if (unit)
                  for (QtbInt i = 0; i < n; i++) *a.at(i, i) = value<T>(NAN, NAN);
                Guarded<T> work(static_cast<std::size_t>(n));
                for (QtbInt i = 0; i < n; i++) work[static_cast<std::size_t>(i)] = *x.at(i);
                work.read_only();
                a.array.read_only();
                QtbInt s = 0;
                for (const QtbInt w : cut) {
                  const bool leads = upper == by_columns;
                  const QtbInt extent = leads ? n - s : s + w, from = leads ? s : 0;
                  const QtbInt row = by_columns || leads ? s : 0, column = !by_columns || leads ? s : 0;
                  if (w > 0)
                    procedures<T>.trmv_block[which](uplo, trans, diag, &extent, a.at(row, column), &a.ld, x.piece(s, w),
                                                    &incx, &w, work.data() + from);
                  s += w;
                }
                const double c = static_cast<double>(is_complex<T> ? 2 * n + 4 : n + 2);
                double worst = 0;
                for (QtbInt i = 0; i < n; i++) {
                  QuadComplex want;
                  Quad gauge = 0;
                  for (QtbInt j = 0; j < n; j++) {
                    const QtbInt r = by_columns ? i : j, q = by_columns ? j : i;
                    if (!is_stored(upper, r, q)) continue;
                    QuadComplex t = unit && r == q ? QuadComplex{1, 0} : widen(*a.at(r, q));
                    if (*trans == 'C') t.im = -t.im;
                    const QuadComplex old = widen(work[static_cast<std::size_t>(j)]);
                    want = plus(want, times(t, old));
                    gauge += magnitude(t) * magnitude(old);
                  }
                  const double ratio = error_ratio(*x.at(i), want, gauge, c);
                  worst = std::fmax(worst, ratio);
                  ASSERT_LE(ratio, 1) << uplo << trans << diag << " n " << n << " incx " << incx << " element " << i;
                }
                tally.within(block_tiers[which], worst);
              }
  }
}

template <class T>
class RealTrianglePieces : public TrianglePieces<T> {};
using RealTypes = testing::Types<float, double>;
TYPED_TEST_SUITE(RealTrianglePieces, RealTypes);

template <class T>
struct Updates {
  using SyrBlock = QTB_FUNCTION_TYPE(syr_block, T);
  using Syr2Block = QTB_FUNCTION_TYPE(syr2_block, T);
  const char *syr_name, *syr2_name;
  SyrBlock *syr_block[3];
  Syr2Block *syr2_block[3];
};
template <class T>
constexpr Updates<T> updates;
template <>
constexpr Updates<float> updates<float> = {"ssyr_block", "ssyr2_block", QTB_BLOCK_TIERS(ssyr_block),
                                           QTB_BLOCK_TIERS(ssyr2_block)};
template <>
constexpr Updates<double> updates<double> = {"dsyr_block", "dsyr2_block", QTB_BLOCK_TIERS(dsyr_block),
                                             QTB_BLOCK_TIERS(dsyr2_block)};

TYPED_TEST(RealTrianglePieces, OfARankUpdateMakeTheWholeUpdate) {
  using T = TypeParam;
  for (int which = 0; which < 3; which++) {
    if (!processor_runs(block_tiers[which])) continue;
    for (const bool two : {false, true}) {
      Tally &tally = TallyReport::of(two ? updates<T>.syr2_name : updates<T>.syr_name);
      for (const char *uplo : {"U", "u", "L", "l"})
        for (QtbInt n : {1, 4, 9, 41, 90})
          for (QtbInt incx : {1, -1, 3})
            for (QtbInt incy : {1, -2})
              for (const T alpha : {T(0), T(1), T(-0.75)})
                for (const std::vector<QtbInt> &cut : cuts(n)) {
                  const bool upper = *uplo == 'U' || *uplo == 'u';
                  HalfMatrix<T> before(n, upper), a(n, upper);
                  a.take(before);
                  Spread<T> x(n, incx), y(n, incy);
                  if (n > 2) *x.at(2) = *y.at(2) = *x.at(0) = 0;
                  double worst = 0;
                  QtbInt s = 0;
                  for (const QtbInt w : cut) {
                    const QtbInt other = upper ? s : n - s - w, start = upper ? 0 : s, length = w + other;
                    T *first = w == 0 ? a.array.data() : upper ? a.at(0, s) : a.at(s, s);
                    if (two)
                      updates<T>.syr2_block[which](uplo, &w, &alpha, x.piece(start, length), &incx,
                                                   y.piece(start, length), &incy, first, &a.ld, &other);
                    else
                      updates<T>.syr_block[which](uplo, &w, &alpha, x.piece(start, length), &incx, first, &a.ld,
                                                  &other);
                    s += w;
                  }
                  for (QtbInt j = 0; j < n; j++)
                    for (QtbInt i = 0; i < n; i++) {
                      if (!is_stored(upper, i, j)) {
                        ASSERT_TRUE(same_bits(*a.at(i, j), *before.at(i, j))) << "the other triangle";
                        continue;
                      }
                      const Quad xi = *x.at(i), xj = *x.at(j), yi = *y.at(i), yj = *y.at(j), old = *before.at(i, j);
                      const Quad sum = two ? xi * yj + yi * xj : xi * xj;
                      const Quad added = two ? magnitude(xi * yj) + magnitude(yi * xj) : magnitude(sum);
                      const double ratio = error_ratio(*a.at(i, j), Quad(alpha) * sum + old,
                                                       magnitude(Quad(alpha)) * added + magnitude(old), two ? 5 : 3);
                      worst = std::fmax(worst, ratio);
                      ASSERT_LE(ratio, 1) << uplo << " n " << n << " element (" << i << ", " << j << ")";
                    }
                  tally.within(block_tiers[which], worst);
                }
    }
  }
}

// The bodies of rank-k updates: of one shape per kind, with S the type of alpha and beta.
template <class T, class S>
void expect_rank_k(const char *routine, int tier,
                   void (*body)(const char *, const char *, const QtbInt *, const QtbInt *, const S *, const T *,
                                const QtbInt *, const S *, T *, const QtbInt *),
                   bool hermitian, std::initializer_list<QtbInt> orders) {
  if (!processor_runs(tier)) return;
  Tally &tally = TallyReport::of(routine);
  const S scalars[][2] = {{value<S>(1, 0), value<S>(1, 0)},       {value<S>(0, 0), value<S>(1, 0)},
                          {value<S>(0, 0), value<S>(0, 0)},       {value<S>(0, 0), value<S>(0.5, -0.25)},
                          {value<S>(-0.75, 0.5), value<S>(0, 0)}, {value<S>(-0.75, 0.5), value<S>(0.5, 0.25)}};
  const QtbInt large = 40;  // from here on each form takes one pair of scalars, in turn
  int turn = 0;
  for (const char *uplo : {"U", "u", "L", "l"})
    for (const char *trans = *uplo < 'a' ? (hermitian ? "NC" : "NT") : (hermitian ? "nc" : "nt"); *trans != 0; trans++)
      for (const QtbInt n : orders)
        for (const QtbInt k : {0, 1, 5, 33})
          for (const auto &[alpha, beta] : scalars) {
            if (n >= large && ++turn % 7 != 0) continue;
            const bool upper = *uplo == 'U' || *uplo == 'u', transposed = *trans != 'N' && *trans != 'n';
            Stored<T> a(transposed ? k : n, transposed ? n : k);
            const QuadComplex wide_alpha = widen(alpha), wide_beta = widen(beta);
            const bool nothing = (k == 0 || magnitude(wide_alpha) == 0) && wide_beta.re == 1 && wide_beta.im == 0;
            HalfMatrix<T> before(n, upper), c(n, upper);
            if constexpr (is_complex<T>)
              for (QtbInt j = 0; hermitian && j < n; j++) before.at(j, j)->im = static_cast<Real<T>>(NAN);
            c.take(before);
            if (magnitude(wide_beta) == 0)
              for (QtbInt j = 0; j < n; j++)
                for (QtbInt i = 0; i < n; i++) *c.at(i, j) = value<T>(NAN, NAN);
            body(uplo, trans, &n, &k, &alpha, a.array.data(), &a.ld, &beta, c.array.data(), &c.ld);
            double worst = 0;
            const double bound = static_cast<double>(is_complex<T> ? 2 * k + 4 : k + 3);
            for (QtbInt j = 0; j < n; j++)
              for (QtbInt i = 0; i < n; i++) {
                if (!is_stored(upper, i, j) || nothing) {
                  if (magnitude(wide_beta) != 0) {
                    ASSERT_TRUE(same_bits(*c.at(i, j), *before.at(i, j))) << routine << " wrote where it may not";
                  }
                  continue;
                }
                QuadComplex sum;
                Quad gauge = 0;
                for (QtbInt l = 0; l < k; l++) {
                  QuadComplex p = widen(transposed ? *a.at(l, i) : *a.at(i, l));
                  QuadComplex q = widen(transposed ? *a.at(l, j) : *a.at(j, l));
                  if (hermitian) (transposed ? p : q).im *= -1;
                  sum = plus(sum, times(p, q));
                  gauge += magnitude(p) * magnitude(q);
                }
                QuadComplex want = times(wide_alpha, sum);
                gauge *= magnitude(wide_alpha);
                if (magnitude(wide_beta) != 0) {
                  QuadComplex old = widen(*before.at(i, j));
                  if (hermitian && i == j) old.im = 0;
                  want = plus(want, times(wide_beta, old));
                  gauge += magnitude(wide_beta) * magnitude(old);
                }
                const double ratio = error_ratio(*c.at(i, j), want, gauge, bound);
                worst = std::fmax(worst, ratio);
                ASSERT_LE(ratio, 1) << routine << " " << uplo << *trans << " n " << n << " k " << k << " element (" << i
                                    << ", " << j << ")";
                if constexpr (is_complex<T>)
                  if (hermitian && i == j) {
                    ASSERT_EQ(c.at(i, j)->im, 0) << routine << " diagonal";
                  }
              }
            tally.within(tier, worst);
          }
}

class RankKBodies : public Seeded {};

TEST_F(RankKBodies, UpdateTheirTriangleAlone) {
  const std::initializer_list<QtbInt> orders = {0, 1, 3, 4, 5, 12, 19, 73};
#define QTB_EXPECT_BODIES(tier)                                                                             \
  expect_rank_k<float, float>("ssyrk_body", tier_##tier, qtb_blas_##tier##_xssyrk_body, false, orders);     \
  expect_rank_k<double, double>("dsyrk_body", tier_##tier, qtb_blas_##tier##_xdsyrk_body, false, orders);   \
  expect_rank_k<cfloat, cfloat>("csyrk_body", tier_##tier, qtb_blas_##tier##_xcsyrk_body, false, orders);   \
  expect_rank_k<cdouble, cdouble>("zsyrk_body", tier_##tier, qtb_blas_##tier##_xzsyrk_body, false, orders); \
  expect_rank_k<cfloat, float>("cherk_body", tier_##tier, qtb_blas_##tier##_xcherk_body, true, orders);     \
  expect_rank_k<cdouble, double>("zherk_body", tier_##tier, qtb_blas_##tier##_xzherk_body, true, orders);   \
  expect_rank_k<double, double>("dsyrk_n4", tier_##tier, qtb_blas_##tier##_xdsyrk_n4, false, {4});
  QTB_EXPECT_BODIES(ssse3)
  QTB_EXPECT_BODIES(sse42)
  QTB_EXPECT_BODIES(avx)
#undef QTB_EXPECT_BODIES
}

}  // namespace
}  // namespace qtb::test
