// gemv in every tier, on whole numbers whose results are exact: every size, address and parity of the leading
// dimension, tiles, far increments, and what must not be read.

#include <cmath>
#include <limits>

#include "tests/kernels/level2/whole_numbers.h"

namespace {

using namespace qtb::test;

template <class T>
using Gemv = QTB_FUNCTION_TYPE(gemv, T);

template <class T>
struct Tiers;
#define TIERS_OF(T, name)                                   \
  template <>                                               \
  struct Tiers<T> {                                         \
    static constexpr Gemv<T> *gemv[] = QTB_ALL_TIERS(name); \
  };
TIERS_OF(float, sgemv)
TIERS_OF(double, dgemv)
TIERS_OF(cfloat, cgemv)
TIERS_OF(cdouble, zgemv)

struct Case {
  char trans = 'N';
  QtbInt m = 0, n = 0, spare = 0, incx = 1, incy = 1;
  std::size_t phase_a = 0, phase_x = 0, phase_y = 0;
  bool zero_beta = false;
};

template <class T>
struct Operands {
  Buffer<T> a, x, y;
  explicit Operands(std::size_t matrix, std::size_t vectors = 8000) : a(matrix), x(vectors), y(vectors) {}
};

// One call on fresh whole numbers; the result to the bit, and nothing written but y.
template <class T>
void check(int tier, const Case &c, Operands<T> &o) {
  const bool plain = c.trans == 'N';
  const QtbInt lenx = plain ? c.n : c.m, leny = plain ? c.m : c.n, lda = std::max<QtbInt>(c.m, 1) + c.spare;
  WholeNumbers draw(static_cast<std::uint32_t>(c.m * 131 + c.n * 7 + c.spare));
  const T *const a = o.a.place(static_cast<std::size_t>(lda * c.n), c.phase_a);
  const T *const x = o.x.place(extent(lenx, c.incx), c.phase_x);
  T *const y = o.y.place(extent(leny, c.incy), c.phase_y);
  std::vector<T> matrix(static_cast<std::size_t>(c.m * c.n)), from(static_cast<std::size_t>(lenx)),
      to(static_cast<std::size_t>(leny));
  const auto at = [&](QtbInt i, QtbInt j) { return static_cast<std::size_t>(i + j * c.m); };
  for (QtbInt j = 0; j < c.n; ++j)
    for (QtbInt i = 0; i < c.m; ++i)
      o.a.set(static_cast<std::size_t>(i + j * lda), matrix[at(i, j)] = draw.element<T>());
  for (QtbInt i = 0; i < lenx; ++i)
    o.x.set(position(i, lenx, c.incx), from[static_cast<std::size_t>(i)] = draw.element<T>());
  const T alpha = plus(draw.element<T>(), whole<T>(5)), beta = c.zero_beta ? T{} : whole<T>(2);
  for (QtbInt i = 0; i < leny; ++i) {
    to[static_cast<std::size_t>(i)] = c.zero_beta ? T{} : draw.element<T>();
    if (!c.zero_beta) o.y.set(position(i, leny, c.incy), to[static_cast<std::size_t>(i)]);
  }
  o.a.expect_kept(), o.x.expect_kept(), o.y.expect_kept();
  if (c.m > 0 && c.n > 0)
    for (QtbInt i = 0; i < leny; ++i) {
      T sum{};
      for (QtbInt j = 0; j < lenx; ++j)
        sum = plus(sum, times(conjugate_if(c.trans == 'C', plain ? matrix[at(i, j)] : matrix[at(j, i)]),
                              from[static_cast<std::size_t>(j)]));
      o.y.expect(position(i, leny, c.incy), plus(times(alpha, sum), times(beta, to[static_cast<std::size_t>(i)])));
    }
  {
    FiniteOnly finite;
    Tiers<T>::gemv[tier](&c.trans, &c.m, &c.n, &alpha, a, &lda, x, &c.incx, &beta, y, &c.incy);
  }
  if (!o.y.as_expected() || !o.a.as_expected() || !o.x.as_expected())
    ADD_FAILURE() << tier_name(tier) << " " << c.trans << " m " << c.m << " n " << c.n << " lda " << lda << " incx "
                  << c.incx << " incy " << c.incy << " phases " << c.phase_a << " " << c.phase_x << " " << c.phase_y;
}

template <class T>
class GemvTest : public testing::Test {};
using Types = testing::Types<float, double, cfloat, cdouble>;
TYPED_TEST_SUITE(GemvTest, Types);

constexpr char operations[] = {'N', 'T', 'C'};

// f(tier) for each until something fails.
template <class F>
void until_a_failure(F f) {
  in_every_tier([&](int tier) {
    if (!testing::Test::HasFailure()) f(tier);
  });
}

TYPED_TEST(GemvTest, every_address_of_the_three_operands_gives_the_result) {
  Operands<TypeParam> o(4000);
  until_a_failure([&](int tier) {
    for (const char trans : operations)
      for (const QtbInt spare : {0, 1})
        for (std::size_t phases = 0; phases < 16 * 16 * 16; ++phases) {
          Case c;
          c.trans = trans, c.spare = spare;
          // Odd phases are alike: each is met, but not with each other one.
          c.phase_a = phases % 16, c.phase_x = phases / 16 % 16, c.phase_y = phases / 256;
          const std::size_t odd = c.phase_a % 2 + c.phase_x % 2 + c.phase_y % 2;
          if (odd > 1) continue;
          c.m = trans == 'N' ? 21 : 27, c.n = 7;
          check<TypeParam>(tier, c, o);
        }
  });
}

TYPED_TEST(GemvTest, every_size_up_to_70_gives_the_result_with_both_parities_of_the_leading_dimension) {
  Operands<TypeParam> o(80000);
  until_a_failure([&](int tier) {
    for (const char trans : operations)
      for (QtbInt size = 0; size <= 70; ++size)
        for (const QtbInt other : {1, 2, 3, 4, 5, 8, 15})
          for (const QtbInt spare : {0, 1})
            for (const std::size_t phase : {std::size_t{0}, std::size_t{8}})
              for (const bool swapped : {false, true}) {
                Case c;
                c.trans = trans, c.m = swapped ? other : size, c.n = swapped ? size : other, c.spare = spare;
                c.phase_a = phase, c.phase_x = c.phase_y = size % 2 == 0 ? 0 : 8;
                c.zero_beta = other % 2 == 0;
                check<TypeParam>(tier, c, o);
              }
  });
}

TYPED_TEST(GemvTest, every_pair_of_increments_gives_the_result) {
  Operands<TypeParam> o(10000);
  until_a_failure([&](int tier) {
    for (const char trans : operations)
      for (const QtbInt m : {1, 2, 7, 16, 33})
        for (const QtbInt n : {1, 4, 6, 11})
          for (const QtbInt incx : {1, -1, 2, -3})
            for (const QtbInt incy : {1, -1, 2, -3})
              for (const std::size_t phase : {std::size_t{0}, std::size_t{8}, std::size_t{4}}) {
                Case c;
                c.trans = trans, c.m = m, c.n = n, c.incx = incx, c.incy = incy, c.spare = n % 2;
                c.phase_a = phase, c.phase_y = m % 2 == 0 ? phase : 0;
                check<TypeParam>(tier, c, o);
              }
  });
}

TYPED_TEST(GemvTest, sizes_around_the_tiles_give_the_result) {
  Operands<TypeParam> o(2600 * 310);
  until_a_failure([&](int tier) {
    for (const char trans : operations) {
      for (const QtbInt m : {999, 1000, 1001})
        for (const QtbInt n : {127, 128, 129}) {
          Case c;
          c.trans = trans, c.m = m, c.n = n, c.incx = 2, c.incy = m == 1000 ? 1 : -3;
          if ((m + n + tier) % 3 == 0) check<TypeParam>(tier, c, o);
        }
      Case c;
      c.trans = trans, c.m = 2500, c.n = 300, c.incx = -2, c.incy = 3, c.spare = 1;
      check<TypeParam>(tier, c, o);
    }
  });
}

TYPED_TEST(GemvTest, nothing_is_read_for_an_alpha_of_zero) {
  in_every_tier([](int tier) {
    for (const char trans : operations) {
      const QtbInt m = 20, n = 20, lda = 20, inc = 1;
      const TypeParam zero{};
      std::vector<TypeParam> y(20);
      for (TypeParam &v : y) store_signalling_nan<TypeParam>(&v);
      FiniteOnly finite;
      Tiers<TypeParam>::gemv[tier](&trans, &m, &n, &zero, nullptr, &lda, nullptr, &inc, &zero, y.data(), &inc);
      for (const TypeParam &v : y) EXPECT_TRUE(is_zero(v)) << tier_name(tier);
    }
  });
}

TYPED_TEST(GemvTest, empty_matrices_change_nothing) {
  in_every_tier([](int tier) {
    for (const char trans : operations)
      for (const QtbInt m : {0, 3}) {
        const QtbInt n = 3 - m, lda = 3, inc = 1;
        const TypeParam zero{};
        TypeParam y[3];
        for (TypeParam &v : y) store_signalling_nan<TypeParam>(&v);
        TypeParam before[3];
        std::memcpy(static_cast<void *>(before), y, sizeof y);
        Tiers<TypeParam>::gemv[tier](&trans, &m, &n, &zero, nullptr, &lda, nullptr, &inc, &zero, y, &inc);
        EXPECT_EQ(0, std::memcmp(before, y, sizeof y)) << tier_name(tier);
      }
  });
}

TYPED_TEST(GemvTest, a_nan_in_y_stays_unless_beta_is_zero) {
  in_every_tier([](int tier) {
    for (const QtbInt inc : {1, 2})
      for (const bool by_zero : {false, true}) {
        const QtbInt m = 17, n = 1, lda = 17, one = 1;
        const TypeParam alpha = whole<TypeParam>(1), beta = whole<TypeParam>(by_zero ? 0 : 2);
        const std::vector<TypeParam> a(17, whole<TypeParam>(1)), x(1, whole<TypeParam>(1));
        std::vector<TypeParam> y(40, whole<TypeParam>(1));
        const Real<TypeParam> nan = std::numeric_limits<Real<TypeParam>>::quiet_NaN();
        std::memcpy(static_cast<void *>(&y[static_cast<std::size_t>(5 * inc)]), &nan, sizeof nan);
        Tiers<TypeParam>::gemv[tier]("n", &m, &n, &alpha, a.data(), &lda, x.data(), &one, &beta, y.data(), &inc);
        Real<TypeParam> got;
        std::memcpy(&got, static_cast<const void *>(&y[static_cast<std::size_t>(5 * inc)]), sizeof got);
        EXPECT_EQ(std::isnan(got), !by_zero) << tier_name(tier) << " inc " << inc;
      }
  });
}

TYPED_TEST(GemvTest, increments_beyond_32_bits_reach_their_elements) {
  FarVector<TypeParam> x, y;
  if (!x.is_there() || !y.is_there()) GTEST_SKIP() << "no address space";
  in_every_tier([&](int tier) {
    for (const char trans : operations)
      for (const QtbInt inc : {x.increment, -x.increment}) {
        const QtbInt n = 3, lda = 3;
        const TypeParam one = whole<TypeParam>(1);
        std::vector<TypeParam> a(9, whole<TypeParam>(1)), from, to, want;
        for (QtbInt i = 0; i < n; ++i) {
          from.push_back(whole<TypeParam>(i + 1));
          to.push_back(whole<TypeParam>(10 * i));
          want.push_back(whole<TypeParam>(10 * i + 6 + i + 1));
          a[static_cast<std::size_t>(4 * i)] = whole<TypeParam>(2);
        }
        x.set(from, inc), y.set(to, inc);
        Tiers<TypeParam>::gemv[tier](&trans, &n, &n, &one, a.data(), &lda, x.data(), &inc, &one, y.data(), &inc);
        EXPECT_TRUE(equal(y.values(inc), want)) << tier_name(tier) << " " << trans << " inc " << inc;
      }
  });
}

}  // namespace
