// The small right kernels, where the sweeps do not look: what is not touched, and how complex quotients are rounded.
#include <gtest/gtest.h>

#include <cmath>

#include "tests/kernels/level3/pieces.h"

#define TYPES_OF(X) X(s, float) X(d, double) X(c, cfloat) X(z, cdouble)
#define DECLARE(t, T)                                           \
  QTB_FUNCTION(trmm, T, qtb_blas_ssse3_x##t##trmm_small_right); \
  QTB_FUNCTION(trmm, T, qtb_blas_sse42_x##t##trmm_small_right); \
  QTB_FUNCTION(trmm, T, qtb_blas_avx_x##t##trmm_small_right);   \
  QTB_FUNCTION(trmm, T, qtb_blas_ssse3_x##t##trsm_small_right); \
  QTB_FUNCTION(trmm, T, qtb_blas_sse42_x##t##trsm_small_right); \
  QTB_FUNCTION(trmm, T, qtb_blas_avx_x##t##trsm_small_right);
extern "C" {
TYPES_OF(DECLARE)
}
#undef DECLARE

namespace qtb::test {
namespace {

constexpr int tiers[] = {tier_ssse3, tier_sse42, tier_avx};
template <class T>
using Triangular = QTB_FUNCTION_TYPE(trmm, T);
template <class T>
struct Kernels;
#define NAME(t, T)                                                                      \
  template <>                                                                           \
  struct Kernels<T> {                                                                   \
    static constexpr Triangular<T> *product[] = {qtb_blas_ssse3_x##t##trmm_small_right, \
                                                 qtb_blas_sse42_x##t##trmm_small_right, \
                                                 qtb_blas_avx_x##t##trmm_small_right};  \
    static constexpr Triangular<T> *solve[] = {qtb_blas_ssse3_x##t##trsm_small_right,   \
                                               qtb_blas_sse42_x##t##trsm_small_right,   \
                                               qtb_blas_avx_x##t##trsm_small_right};    \
  };
TYPES_OF(NAME)
#undef NAME

template <class T>
class SmallRight : public Seeded {};
using Types = testing::Types<float, double, cfloat, cdouble>;
TYPED_TEST_SUITE(SmallRight, Types);

TYPED_TEST(SmallRight, ProductOfOneColumnByOneTouchesNothing) {
  using T = TypeParam;
  for (int which = 0; which < 3; which++) {
    if (!processor_runs(tiers[which])) continue;
    Guarded<T> a(1), b(40);
    a.unreadable(), b.unreadable();
    const QtbInt m = 40, n = 1, lda = 1;
    const T one = value<T>(1, 0);
    for (const char *uplo : {"U", "L"})
      for (const char *transa : {"N", "T", "C"})
        Kernels<T>::product[which]("R", uplo, transa, "U", &m, &n, &one, a.data(), &lda, b.data(), &m);
  }
}

TYPED_TEST(SmallRight, ProductOfOneColumnIsMultipliedByTheDiagonalWhateverAlpha) {
  using T = TypeParam;
  for (int which = 0; which < 3; which++) {
    if (!processor_runs(tiers[which])) continue;
    for (const double alpha : {1.0, 2.0})
      for (const double element : {1.0, 3.0}) {
        Guarded<T> a(1), b(21);
        a[0] = value<T>(element, 0);
        for (std::size_t i = 0; i < b.size(); i++) b[i] = value<T>(static_cast<double>(i), 1);
        const QtbInt m = 21, n = 1, lda = 1;
        const T factor = value<T>(alpha, 0);
        Kernels<T>::product[which]("R", "U", "N", "N", &m, &n, &factor, a.data(), &lda, b.data(), &m);
        for (std::size_t i = 0; i < b.size(); i++) {
          const QuadComplex v = widen(b[i]);
          EXPECT_EQ(static_cast<double>(v.re), alpha * element * static_cast<double>(i));
          EXPECT_EQ(static_cast<double>(v.im), is_complex<T> ? alpha * element : 0);
        }
      }
  }
}

TYPED_TEST(SmallRight, SolveByZeroGivesInfinitiesAndNansInItsColumnsAlone) {
  using T = TypeParam;
  for (int which = 0; which < 3; which++) {
    if (!processor_runs(tiers[which])) continue;
    const QtbInt m = 11, n = 6, zero_at = 3;
    Guarded<T> a(static_cast<std::size_t>(n * n)), b(static_cast<std::size_t>(m * n));
    for (std::size_t i = 0; i < a.size(); i++) a[i] = value<T>(1, 0);
    for (std::size_t i = 0; i < b.size(); i++) b[i] = value<T>(static_cast<double>(i % 7) + 0.5, 0);
    a[static_cast<std::size_t>(zero_at * (n + 1))] = value<T>(0, 0);
    const T one = value<T>(1, 0);
    Kernels<T>::solve[which]("R", "U", "N", "N", &m, &n, &one, a.data(), &n, b.data(), &m);
    for (QtbInt j = 0; j < n; j++)
      for (QtbInt i = 0; i < m; i++) {
        const QuadComplex v = widen(b[static_cast<std::size_t>(i + j * m)]);
        const double re = static_cast<double>(v.re), im = static_cast<double>(v.im);
        EXPECT_EQ(std::isfinite(re) && std::isfinite(im), j < zero_at) << i << " " << j;
      }
  }
}

// Both parts of a quotient lie within half a unit in their last place, up to what double precision adds, even where
// they are differences of almost equal products.
TEST(ComplexQuotients, OfSingleParts_AreRoundedOnce) {
  constexpr double half_unit = 0x1p-24 * (1 + 0x1p-24);
  for (int which = 0; which < 3; which++) {
    if (!processor_runs(tiers[which])) continue;
    for (const char *transa : {"N", "T", "C"})
      for (QtbInt n = 1; n <= 8; n++)
        for (int turn = 0; turn < 40; turn++) {
          const QtbInt m = 19;
          Guarded<cfloat> a(static_cast<std::size_t>(n * n)), b(static_cast<std::size_t>(m * n)), x(b.size());
          for (std::size_t i = 0; i < a.size(); i++) a[i] = {0, 0};
          for (QtbInt j = 0; j < n; j++) a[static_cast<std::size_t>(j * (n + 1))] = draw<cfloat>();
          for (std::size_t i = 0; i < b.size(); i++) {
            b[i] = draw<cfloat>();
            const cfloat d = a[i / static_cast<std::size_t>(m) * static_cast<std::size_t>(n + 1)];
            if (turn % 2 == 0) b[i] = {d.im * b[i].im, -d.re * b[i].im};  // a real part of almost nothing
            x[i] = b[i];
          }
          const cfloat one = {1, 0};
          Kernels<cfloat>::solve[which]("R", "U", transa, "N", &m, &n, &one, a.data(), &n, x.data(), &m);
          for (std::size_t i = 0; i < b.size(); i++) {
            QuadComplex d = widen(a[i / static_cast<std::size_t>(m) * static_cast<std::size_t>(n + 1)]);
            if (*transa == 'C') d.im = -d.im;
            const QuadComplex v = widen(b[i]);
            const Quad square = d.re * d.re + d.im * d.im;
            const double re = static_cast<double>((v.re * d.re + v.im * d.im) / square);
            const double im = static_cast<double>((v.im * d.re - v.re * d.im) / square);
            const auto within = [&](float got, double want) {
              return std::fabs(static_cast<double>(got) - want) <=
                     std::ldexp(half_unit, std::ilogb(std::fmax(std::fabs(want), 0x1p-126)));
            };
            ASSERT_TRUE(within(x[i].re, re)) << x[i].re << " for " << re;
            ASSERT_TRUE(within(x[i].im, im)) << x[i].im << " for " << im;
          }
        }
  }
}

}  // namespace
}  // namespace qtb::test
