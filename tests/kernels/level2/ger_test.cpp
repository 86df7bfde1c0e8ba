// ger, geru and gerc in every tier, on whole numbers whose results are exact: sizes, addresses, increments, and the
// columns that are skipped.

#include <cmath>
#include <limits>

#include "tests/kernels/level2/whole_numbers.h"

namespace {

using namespace qtb::test;

template <class T>
using Ger = QTB_FUNCTION_TYPE(ger, T);

struct Plain {
  static constexpr bool conjugated = false;
};
struct Conjugated {
  static constexpr bool conjugated = true;
};
template <class T, class How>
struct Tiers;
#define TIERS_OF(T, How, name)                            \
  template <>                                             \
  struct Tiers<T, How> {                                  \
    using Element = T;                                    \
    static constexpr bool conjugated = How::conjugated;   \
    static constexpr Ger<T> *ger[] = QTB_ALL_TIERS(name); \
  };
TIERS_OF(float, Plain, sger)
TIERS_OF(double, Plain, dger)
TIERS_OF(cfloat, Plain, cgeru)
TIERS_OF(cdouble, Plain, zgeru)
TIERS_OF(cfloat, Conjugated, cgerc)
TIERS_OF(cdouble, Conjugated, zgerc)

template <class Routine>
class GerTest : public testing::Test {};
using Routines = testing::Types<Tiers<float, Plain>, Tiers<double, Plain>, Tiers<cfloat, Plain>, Tiers<cdouble, Plain>,
                                Tiers<cfloat, Conjugated>, Tiers<cdouble, Conjugated>>;
TYPED_TEST_SUITE(GerTest, Routines);

struct Case {
  QtbInt m, n, spare, incx, incy;
  std::size_t phase_a, phase_x, phase_y;
};

template <class T>
struct Operands {
  Buffer<T> a{8000}, x{400}, y{400};
};

template <class Routine, class T>
void check(int tier, const Case &c, Operands<T> &o) {
  WholeNumbers draw(static_cast<std::uint32_t>(c.m * 64 + c.n));
  const QtbInt lda = std::max<QtbInt>(c.m, 1) + c.spare;
  T *const a = o.a.place(static_cast<std::size_t>(lda * c.n), c.phase_a);
  const T *const x = o.x.place(extent(c.m, c.incx), c.phase_x), *const y = o.y.place(extent(c.n, c.incy), c.phase_y);
  std::vector<T> rows(static_cast<std::size_t>(c.m)), columns(static_cast<std::size_t>(c.n));
  for (QtbInt i = 0; i < c.m; ++i)
    o.x.set(position(i, c.m, c.incx), rows[static_cast<std::size_t>(i)] = draw.element<T>());
  for (QtbInt j = 0; j < c.n; ++j)
    o.y.set(position(j, c.n, c.incy), columns[static_cast<std::size_t>(j)] = draw.element<T>());
  const T alpha = plus(draw.element<T>(), whole<T>(5));
  // The columns of zeros in y stay as they are: full of NaNs.
  std::vector<T> old(static_cast<std::size_t>(c.m * c.n));
  for (QtbInt j = 0; j < c.n; ++j)
    for (QtbInt i = 0; i < c.m; ++i)
      if (!is_zero(columns[static_cast<std::size_t>(j)]))
        o.a.set(static_cast<std::size_t>(i + j * lda), old[static_cast<std::size_t>(i + j * c.m)] = draw.element<T>());
  o.a.expect_kept(), o.x.expect_kept(), o.y.expect_kept();
  for (QtbInt j = 0; j < c.n; ++j)
    for (QtbInt i = 0; i < c.m; ++i)
      if (const T element = columns[static_cast<std::size_t>(j)]; !is_zero(element)) {
        const T factor = times(alpha, conjugate_if(Routine::conjugated, element));
        o.a.expect(static_cast<std::size_t>(i + j * lda),
                   plus(old[static_cast<std::size_t>(i + j * c.m)], times(factor, rows[static_cast<std::size_t>(i)])));
      }
  {
    FiniteOnly finite;
    Routine::ger[tier](&c.m, &c.n, &alpha, x, &c.incx, y, &c.incy, a, &lda);
  }
  if (!o.a.as_expected() || !o.x.as_expected() || !o.y.as_expected())
    ADD_FAILURE() << tier_name(tier) << " m " << c.m << " n " << c.n << " lda " << lda << " incx " << c.incx << " incy "
                  << c.incy << " phases " << c.phase_a << " " << c.phase_x << " " << c.phase_y;
}

TYPED_TEST(GerTest, every_size_address_and_increment_gives_the_result_and_skips_zeros) {
  Operands<typename TypeParam::Element> o;
  in_every_tier([&](int tier) {
    for (QtbInt m = 0; m <= 70; ++m)
      for (const QtbInt n : {0, 1, 2, 4, 5, 8, 11})
        for (const QtbInt incx : {1, -1, 2, -3})
          for (const QtbInt incy : {1, -3}) {
            if (testing::Test::HasFailure()) return;
            const auto phase = static_cast<std::size_t>(m * 3 + n) % 16;
            check<TypeParam>(tier, {m, n, n % 3, incx, incy, phase, phase * 7 % 16, phase * 5 % 16}, o);
          }
    for (std::size_t phases = 0; phases < 16 * 16; ++phases)
      check<TypeParam>(tier, {19, 6, 1, 1, 1, phases % 16, phases / 16, phases % 8}, o);
  });
}

TYPED_TEST(GerTest, increments_beyond_32_bits_reach_their_elements) {
  using T = typename TypeParam::Element;
  FarVector<T> far_x, far_y;
  if (!far_x.is_there() || !far_y.is_there()) GTEST_SKIP() << "no address space";
  in_every_tier([&](int tier) {
    for (const QtbInt incx : {far_x.increment, -far_x.increment})
      for (const QtbInt incy : {far_y.increment, -far_y.increment}) {
        const QtbInt n = 3, near = 1;
        WholeNumbers draw(5);
        const T alpha = whole<T>(2);
        std::vector<T> x, y, want;
        for (int i = 0; i < 3; ++i) x.push_back(draw.element<T>()), y.push_back(draw.element<T>());
        for (int i = 0; i < 9; ++i) want.push_back(draw.element<T>());
        std::vector<T> got = want;
        far_x.set(x, incx), far_y.set(y, incy);
        TypeParam::ger[tier](&n, &n, &alpha, x.data(), &near, y.data(), &near, want.data(), &n);
        TypeParam::ger[tier](&n, &n, &alpha, far_x.data(), &incx, far_y.data(), &incy, got.data(), &n);
        EXPECT_TRUE(equal(got, want)) << tier_name(tier) << " incx " << incx << " incy " << incy;
      }
  });
}

TYPED_TEST(GerTest, a_y_of_zeros_touches_neither_x_nor_the_matrix) {
  using T = typename TypeParam::Element;
  in_every_tier([](int tier) {
    const QtbInt m = 5, n = 7, inc = 1, lda = 5;
    const T alpha = whole<T>(2), y[7] = {};
    TypeParam::ger[tier](&m, &n, &alpha, nullptr, &inc, y, &inc, nullptr, &lda);
    const T zero{}, ones[7] = {whole<T>(1)};
    TypeParam::ger[tier](&m, &n, &zero, nullptr, &inc, ones, &inc, nullptr, &lda);
  });
}

TYPED_TEST(GerTest, a_nan_in_x_or_y_reaches_the_columns_that_are_not_skipped) {
  using T = typename TypeParam::Element;
  in_every_tier([](int tier) {
    const QtbInt m = 3, n = 4, inc = 1, lda = 3;
    const T alpha = whole<T>(1);
    const Real<T> nan = std::numeric_limits<Real<T>>::quiet_NaN();
    T x[3] = {whole<T>(1), whole<T>(1), whole<T>(1)}, y[4] = {whole<T>(1), T{}, T{}, whole<T>(1)}, a[12] = {};
    std::memcpy(static_cast<void *>(x), &nan, sizeof nan);
    std::memcpy(static_cast<void *>(&y[2]), &nan, sizeof nan);
    TypeParam::ger[tier](&m, &n, &alpha, x, &inc, y, &inc, a, &lda);
    const auto is_nan = [&](int i) {
      Real<T> part;
      std::memcpy(&part, static_cast<const void *>(&a[i]), sizeof part);
      return std::isnan(part);
    };
    EXPECT_TRUE(is_nan(0)) << tier_name(tier);  // a NaN in x
    EXPECT_FALSE(is_nan(1)) << tier_name(tier);
    EXPECT_FALSE(is_nan(3)) << tier_name(tier);  // a zero in y: skipped, whatever x holds
    EXPECT_TRUE(is_nan(7)) << tier_name(tier);   // a NaN in y is not zero
  });
}

// A product that rounds to zero is no update in most tiers: the columns of a group take what they would take alone.
TYPED_TEST(GerTest, a_factor_that_rounds_to_zero_does_to_a_group_what_it_does_to_a_column) {
  using T = typename TypeParam::Element;
  in_every_tier([](int tier) {
    const QtbInt m = 3, n = 4, one = 1, lda = 3;
    const Real<T> nan = std::numeric_limits<Real<T>>::quiet_NaN(), least = std::numeric_limits<Real<T>>::min();
    T alpha{}, x[3] = {whole<T>(1), whole<T>(1), whole<T>(1)}, y[4] = {whole<T>(1), T{}, whole<T>(1), whole<T>(1)};
    std::memcpy(static_cast<void *>(&alpha), &least, sizeof least);
    std::memcpy(static_cast<void *>(x), &nan, sizeof nan);
    std::memcpy(static_cast<void *>(&y[1]), &least, sizeof least);
    T together[12] = {}, alone[12] = {};
    TypeParam::ger[tier](&m, &n, &alpha, x, &one, y, &one, together, &lda);
    for (int j = 0; j < 4; ++j) TypeParam::ger[tier](&m, &one, &alpha, x, &one, y + j, &one, alone + 3 * j, &lda);
    const auto first_part_is_nan = [](const T &element) {
      Real<T> part;
      std::memcpy(&part, static_cast<const void *>(&element), sizeof part);
      return std::isnan(part);
    };
    for (int i = 0; i < 12; ++i)
      EXPECT_EQ(first_part_is_nan(together[i]), first_part_is_nan(alone[i])) << tier_name(tier) << " element " << i;
    EXPECT_TRUE(first_part_is_nan(together[0])) << tier_name(tier);
  });
}

}  // namespace
