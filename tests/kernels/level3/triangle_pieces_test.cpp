// The pieces of a triangle that parallel drivers call, cut and put together again: trmv_block, syr_block, syr2_block.
//
// The other triangle and a unit diagonal hold NaN. The oracle works once for all increments, cuts and tiers.
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

// A vector of the interface: its elements at increment inc, NaN between.
template <class T>
struct Spread {
  QtbInt n, inc;
  Guarded<T> array;
  Spread(const std::vector<T> &elements, QtbInt increment)
      : n(static_cast<QtbInt>(elements.size())),
        inc(increment),
        array(n > 0 ? static_cast<std::size_t>((n - 1) * std::abs(inc) + 1) : 0) {
    for (std::size_t i = 0; i < array.size(); i++) array[i] = value<T>(NAN, NAN);
    for (QtbInt i = 0; i < n; i++) *at(i) = elements[static_cast<std::size_t>(i)];
  }
  T *at(QtbInt i) { return array.data() + (inc < 0 ? (i + 1 - n) * inc : i * inc); }
  // What a piece of len elements from start is called with.
  T *piece(QtbInt start, QtbInt len) { return len == 0 ? array.data() : inc < 0 ? at(start + len - 1) : at(start); }
};

template <class T>
std::vector<T> draw_elements(QtbInt n) {
  std::vector<T> elements(static_cast<std::size_t>(n));
  for (T &e : elements) e = draw<T>();
  return elements;
}

// Cuts of n columns into pieces.
std::vector<std::vector<QtbInt>> cuts(QtbInt n) {
  return {{n}, {n / 3, n - n / 3}, {n / 2, 0, n / 4, n - n / 2 - n / 4}};
}

template <class T>
class TrianglePieces : public Seeded {};
using Types = testing::Types<float, double, cfloat, cdouble>;
TYPED_TEST_SUITE(TrianglePieces, Types);

// op(A)*x, and the magnitudes that go into it.
struct Wanted {
  std::vector<QuadComplex> value;
  std::vector<Quad> gauge;
};
template <class T>
Wanted product_with_triangle(HalfMatrix<T> &a, char trans, bool unit, const std::vector<T> &x) {
  const QtbInt n = a.rows;
  const bool by_columns = trans == 'n';
  Wanted want{std::vector<QuadComplex>(x.size()), std::vector<Quad>(x.size())};
  for (QtbInt i = 0; i < n; i++)
    for (QtbInt j = 0; j < n; j++) {
      const QtbInt r = by_columns ? i : j, q = by_columns ? j : i;
      if (!is_stored(a.upper, r, q)) continue;
      QuadComplex t = unit && r == q ? QuadComplex{1, 0} : widen(*a.at(r, q));
      if (trans == 'C') t.im = -t.im;
      const std::size_t row = static_cast<std::size_t>(i);
      const QuadComplex old = widen(x[static_cast<std::size_t>(j)]);
      want.value[row] = plus(want.value[row], times(t, old));
      want.gauge[row] += magnitude(t) * magnitude(old);
    }
  return want;
}

TYPED_TEST(TrianglePieces, OfATriangularProductTakeWhatLiesOutsideFromTheCopy) {
  using T = TypeParam;
  Tally &tally = TallyReport::of(procedures<T>.name);
  for (const char *uplo : {"U", "l"})
    for (const char *trans : {"n", "T", "C"})
      for (const char *diag : {"N", "u"})
        for (QtbInt n : {1, 4, 9, 41, 150}) {
          const bool upper = *uplo == 'U', unit = *diag == 'u', by_columns = *trans == 'n';
          HalfMatrix<T> a(n, upper);
          if (unit)
            for (QtbInt i = 0; i < n; i++) *a.at(i, i) = value<T>(NAN, NAN);
          a.array.read_only();
          const std::vector<T> elements = draw_elements<T>(n);
          Spread<T> work(elements, 1);
          work.array.read_only();
          const Wanted want = product_with_triangle(a, *trans, unit, elements);
          const double c = static_cast<double>(is_complex<T> ? 2 * n + 4 : n + 2);
          for (int which = 0; which < 3; which++) {
            if (!processor_runs(block_tiers[which])) continue;
            for (QtbInt incx : {1, -1, 3, -2})
              for (const std::vector<QtbInt> &cut : cuts(n)) {
                Spread<T> x(elements, incx);
                QtbInt s = 0;
                for (const QtbInt w : cut) {
                  const bool leads = upper == by_columns;
                  const QtbInt extent = leads ? n - s : s + w, from = leads ? s : 0;
                  const QtbInt row = by_columns || leads ? s : 0, column = !by_columns || leads ? s : 0;
                  if (w > 0)
                    procedures<T>.trmv_block[which](uplo, trans, diag, &extent, a.at(row, column), &a.ld, x.piece(s, w),
                                                    &incx, &w, work.at(from));
                  s += w;
                }
                double worst = 0;
                for (QtbInt i = 0; i < n; i++) {
                  const std::size_t row = static_cast<std::size_t>(i);
                  const double ratio = error_ratio(*x.at(i), want.value[row], want.gauge[row], c);
                  worst = std::fmax(worst, ratio);
                  ASSERT_LE(ratio, 1) << uplo << trans << diag << " n " << n << " incx " << incx << " element " << i;
                }
                tally.within(block_tiers[which], worst);
              }
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
  for (const bool two : {false, true}) {
    Tally &tally = TallyReport::of(two ? updates<T>.syr2_name : updates<T>.syr_name);
    for (const char *uplo : {"U", "u", "L", "l"})
      for (QtbInt n : {1, 4, 9, 41, 90})
        for (const T alpha : {T(0), T(1), T(-0.75)}) {
          const bool upper = *uplo == 'U' || *uplo == 'u';
          HalfMatrix<T> before(n, upper);
          std::vector<T> of_x = draw_elements<T>(n), of_y = draw_elements<T>(n);
          if (n > 2) of_x[2] = of_y[2] = of_x[0] = 0;
          std::vector<QuadComplex> want(static_cast<std::size_t>(n * n));
          std::vector<Quad> gauge(static_cast<std::size_t>(n * n));
          for (QtbInt j = 0; j < n; j++)
            for (QtbInt i = 0; i < n; i++) {
              if (!is_stored(upper, i, j)) continue;
              const std::size_t row = static_cast<std::size_t>(i), column = static_cast<std::size_t>(j);
              const Quad xi = of_x[row], xj = of_x[column], yi = of_y[row], yj = of_y[column], old = *before.at(i, j);
              const Quad sum = two ? xi * yj + yi * xj : xi * xj;
              const Quad added = two ? magnitude(xi * yj) + magnitude(yi * xj) : magnitude(sum);
              const std::size_t element = static_cast<std::size_t>(i + j * n);
              want[element] = {Quad(alpha) * sum + old, 0};
              gauge[element] = magnitude(Quad(alpha)) * added + magnitude(old);
            }
          for (int which = 0; which < 3; which++) {
            if (!processor_runs(block_tiers[which])) continue;
            for (QtbInt incx : {1, -1, 3})
              for (QtbInt incy : {1, -2}) {
                if (!two && incy != 1) continue;  // it has no y
                for (const std::vector<QtbInt> &cut : cuts(n)) {
                  HalfMatrix<T> a(n, upper);
                  a.take(before);
                  Spread<T> x(of_x, incx), y(of_y, incy);
                  QtbInt s = 0;
                  for (const QtbInt w : cut) {
                    const QtbInt outside = upper ? s : n - s - w, start = upper ? 0 : s, length = w + outside;
                    T *first = w == 0 ? a.array.data() : upper ? a.at(0, s) : a.at(s, s);
                    if (two)
                      updates<T>.syr2_block[which](uplo, &w, &alpha, x.piece(start, length), &incx,
                                                   y.piece(start, length), &incy, first, &a.ld, &outside);
                    else
                      updates<T>.syr_block[which](uplo, &w, &alpha, x.piece(start, length), &incx, first, &a.ld,
                                                  &outside);
                    s += w;
                  }
                  double worst = 0;
                  for (QtbInt j = 0; j < n; j++)
                    for (QtbInt i = 0; i < n; i++) {
                      if (!is_stored(upper, i, j)) {
                        ASSERT_TRUE(same_bits(*a.at(i, j), *before.at(i, j))) << "the other triangle";
                        continue;
                      }
                      const std::size_t element = static_cast<std::size_t>(i + j * n);
                      const double ratio = error_ratio(*a.at(i, j), want[element], gauge[element], two ? 5 : 3);
                      worst = std::fmax(worst, ratio);
                      ASSERT_LE(ratio, 1) << uplo << " n " << n << " element (" << i << ", " << j << ")";
                    }
                  tally.within(block_tiers[which], worst);
                }
              }
          }
        }
  }
}

}  // namespace
}  // namespace qtb::test
