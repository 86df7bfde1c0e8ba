// trmv, trsv and the pieces of trmv in every tier, on whole numbers whose results are exact: every case, order and
// address, both parities of the leading dimension, and what must not be read or called.

#include <cmath>

#include "tests/kernels/level2/whole_numbers.h"

namespace {

using namespace qtb::test;

// ---- the procedures ----

template <class T>
using Trmv = QTB_FUNCTION_TYPE(trmv, T);
template <class T>
using TrmvBlock = QTB_FUNCTION_TYPE(trmv_block, T);

template <class T>
struct Tiers;
#define TIERS_OF(T, prefix)                                                                                \
  template <>                                                                                              \
  struct Tiers<T> {                                                                                        \
    static constexpr Trmv<T> *trmv[] = QTB_ALL_TIERS(prefix##trmv), *trsv[] = QTB_ALL_TIERS(prefix##trsv); \
    static constexpr TrmvBlock<T> *block[] = {nullptr, nullptr, qtb_blas_ssse3_x##prefix##trmv_block,      \
                                              qtb_blas_sse42_x##prefix##trmv_block,                        \
                                              qtb_blas_avx_x##prefix##trmv_block};                         \
  };
TIERS_OF(float, s)
TIERS_OF(double, d)
TIERS_OF(cfloat, c)
TIERS_OF(cdouble, z)

// Calls of dgemv's front end, as long as they are counted.
int front_end_calls;
QtbInt front_end_rows;

}  // namespace

extern "C" {
QTB_FUNCTION(gemv, double, __real_qtb_blas_dgemv);
QTB_FUNCTION(gemv, double, __wrap_qtb_blas_dgemv);
QTB_FUNCTION(gemv, double, __wrap_qtb_blas_dgemv) {
  ++front_end_calls;
  front_end_rows = *m;
  __real_qtb_blas_dgemv(QTB_ARGS(gemv));
}
}

namespace {

struct Case {
  char uplo = 'U', trans = 'N', diag = 'N';
  QtbInt n = 0, spare = 0, inc = 1;
  std::size_t phase_a = 0, phase_x = 0;
};
std::ostream &operator<<(std::ostream &out, const Case &c) {
  return out << c.uplo << c.trans << c.diag << " n " << c.n << " spare " << c.spare << " inc " << c.inc << " phases "
             << c.phase_a << " " << c.phase_x;
}

std::size_t at(QtbInt i) { return static_cast<std::size_t>(i); }

// A triangle with few elements beside the diagonal, so that whole numbers stay small in a solve; its diagonal is 1 or
// -1. Read as op(T) it has element(i, j) everywhere; in the array, NaNs stand where nothing may be read.
template <class T>
class Triangle {
 public:
  Triangle(const Case &c, Buffer<T> &buffer) : n_(c.n), full_(at(c.n * c.n), T{}) {
    WholeNumbers draw(static_cast<std::uint32_t>(c.n * 8 + c.spare));
    const QtbInt lda = std::max<QtbInt>(c.n, 1) + c.spare;
    array_ = buffer.place(at(lda * c.n), c.phase_a);
    for (QtbInt j = 0; j < n_; ++j)
      for (QtbInt i = 0; i < n_; ++i) {
        if (i != j && (c.uplo == 'U') != (i < j)) continue;
        T v = i == j ? whole<T>(j % 3 == 0 ? -1 : 1) : T{};
        if (i != j && (i * 7 + j * 3) % 29 == 0) v = draw.element<T>();
        const bool unit = i == j && c.diag == 'U';
        if (!unit) buffer.set(at(i + j * lda), v);
        if (unit) v = whole<T>(1);
        const bool plain = c.trans == 'N';
        full_[at(plain ? i + j * n_ : j + i * n_)] = conjugate_if(c.trans == 'C', v);
      }
    buffer.expect_kept();
  }
  const T *array() const { return array_; }
  std::vector<T> times_vector(const std::vector<T> &x) const {
    std::vector<T> y(x.size(), T{});
    for (QtbInt j = 0; j < n_; ++j)
      for (QtbInt i = 0; i < n_; ++i) y[at(i)] = plus(y[at(i)], times(full_[at(i + j * n_)], x[at(j)]));
    return y;
  }
  T element(QtbInt i, QtbInt j) const { return full_[at(i + j * n_)]; }

 private:
  QtbInt n_;
  std::vector<T> full_;
  T *array_;
};

template <class T>
bool small_enough(const std::vector<T> &values) {
  for (const T &v : values)
    if constexpr (is_complex<T>) {
      if (std::fabs(v.re) > 4e6 || std::fabs(v.im) > 4e6) return false;
    } else {
      if (std::fabs(v) > 4e6) return false;
    }
  return true;
}

// The product of fresh whole numbers, and the solve that takes it back.
template <class T>
void check(int tier, const Case &c, Buffer<T> &a, Buffer<T> &x) {
  const Triangle<T> triangle(c, a);
  WholeNumbers draw(static_cast<std::uint32_t>(c.n));
  std::vector<T> values(at(c.n));
  for (T &v : values) v = draw.element<T>();
  const std::vector<T> product = triangle.times_vector(values);
  ASSERT_TRUE(small_enough(product));
  const QtbInt lda = std::max<QtbInt>(c.n, 1) + c.spare;
  for (const bool solves : {false, true}) {
    T *const data = x.place(extent(c.n, c.inc), c.phase_x);
    const std::vector<T> &from = solves ? product : values, &to = solves ? values : product;
    for (QtbInt i = 0; i < c.n; ++i) x.set(position(i, c.n, c.inc), from[at(i)]);
    x.expect_kept();
    for (QtbInt i = 0; i < c.n; ++i) x.expect(position(i, c.n, c.inc), to[at(i)]);
    {
      FiniteOnly finite(FE_INVALID);
      (solves ? Tiers<T>::trsv : Tiers<T>::trmv)[tier](&c.uplo, &c.trans, &c.diag, &c.n, triangle.array(), &lda, data,
                                                       &c.inc);
    }
    if (!x.as_expected() || !a.as_expected()) ADD_FAILURE() << tier_name(tier) << (solves ? " trsv " : " trmv ") << c;
  }
}

template <class T>
class TriangularTest : public testing::Test {};
using Types = testing::Types<float, double, cfloat, cdouble>;
TYPED_TEST_SUITE(TriangularTest, Types);

// f(c) for every case of a triangle.
template <class F>
void in_every_case(F f) {
  for (const char uplo : {'U', 'L'})
    for (const char trans : {'N', 'T', 'C'})
      for (const char diag : {'N', 'U'}) {
        if (testing::Test::HasFailure()) return;
        Case c;
        c.uplo = uplo, c.trans = trans, c.diag = diag;
        f(c);
      }
}

TYPED_TEST(TriangularTest, every_order_gives_the_result_with_both_parities_of_the_leading_dimension) {
  Buffer<TypeParam> a(210 * 212), x(1000);
  in_every_tier([&](int tier) {
    in_every_case([&](Case c) {
      for (c.n = 0; c.n <= 70; ++c.n)
        for (c.spare = 0; c.spare < 2; ++c.spare) check(tier, c, a, x);
      for (const QtbInt n : {95, 96, 97, 127, 128, 129, 192, 193, 200}) {
        c.n = n, c.spare = n % 2;
        check(tier, c, a, x);
      }
    });
  });
}

TYPED_TEST(TriangularTest, every_increment_and_address_gives_the_result) {
  Buffer<TypeParam> a(80 * 82), x(1000);
  in_every_tier([&](int tier) {
    in_every_case([&](Case c) {
      for (const QtbInt n : {5, 33, 70})
        for (const QtbInt inc : {1, -1, 2, -3})
          for (std::size_t phase = 0; phase < 16; ++phase) {
            c.n = n, c.inc = inc, c.phase_x = phase, c.phase_a = (phase * 5 + 4) % 16;
            check(tier, c, a, x);
          }
    });
  });
}

TYPED_TEST(TriangularTest, increments_beyond_32_bits_reach_their_elements) {
  using T = TypeParam;
  Buffer<T> a(9);
  FarVector<T> x;
  if (!x.is_there()) GTEST_SKIP() << "no address space";
  in_every_tier([&](int tier) {
    in_every_case([&](Case c) {
      c.n = 3;
      const Triangle<T> triangle(c, a);
      const std::vector<T> values = {whole<T>(1), whole<T>(-2), whole<T>(3)}, product = triangle.times_vector(values);
      for (const QtbInt inc : {x.increment, -x.increment}) {
        x.set(values, inc);
        Tiers<T>::trmv[tier](&c.uplo, &c.trans, &c.diag, &c.n, triangle.array(), &c.n, x.data(), &inc);
        EXPECT_TRUE(equal(x.values(inc), product)) << tier_name(tier) << " trmv " << c << " inc " << inc;
        Tiers<T>::trsv[tier](&c.uplo, &c.trans, &c.diag, &c.n, triangle.array(), &c.n, x.data(), &inc);
        EXPECT_TRUE(equal(x.values(inc), values)) << tier_name(tier) << " trsv " << c << " inc " << inc;
      }
    });
  });
}

TEST(trsv, leaves_to_gemv_what_lies_beside_blocks_of_32_and_nothing_else) {
  Buffer<double> a(70 * 70), x(200);
  in_every_tier([&](int tier) {
    Case c;
    c.uplo = 'L';
    const auto calls = [&](QtbInt n) {
      c.n = n;
      const Triangle<double> triangle(c, a);
      const QtbInt lda = std::max<QtbInt>(n, 1), inc = 1;
      std::vector<double> values(at(n), 1);
      front_end_calls = 0;
      Tiers<double>::trsv[tier](&c.uplo, &c.trans, &c.diag, &n, triangle.array(), &lda, values.data(), &inc);
      return front_end_calls;
    };
    EXPECT_EQ(calls(0), 0) << tier_name(tier);
    EXPECT_EQ(calls(32), 0) << tier_name(tier);
    EXPECT_EQ(calls(33), 1) << tier_name(tier);
    EXPECT_EQ(front_end_rows, 1) << tier_name(tier);
    EXPECT_EQ(calls(65), 2) << tier_name(tier);
    c.trans = 'T';
    EXPECT_EQ(calls(32), 0) << tier_name(tier);
    EXPECT_EQ(calls(33), 1) << tier_name(tier);
  });
}

TYPED_TEST(TriangularTest, a_zero_on_the_diagonal_gives_an_infinity_and_no_error) {
  in_every_tier([](int tier) {
    for (const char uplo : {'U', 'L'})
      for (const char trans : {'N', 'T'}) {
        const QtbInt n = 1, lda = 1, inc = 1;
        const TypeParam zero{};
        TypeParam x = whole<TypeParam>(3);
        Tiers<TypeParam>::trsv[tier](&uplo, &trans, "N", &n, &zero, &lda, &x, &inc);
        Real<TypeParam> part;
        std::memcpy(&part, static_cast<const void *>(&x), sizeof part);
        EXPECT_FALSE(std::isfinite(part)) << tier_name(tier);
      }
  });
}

// One thread's piece of a product: len elements of x, from where the driver has the first one, and the old elements
// that they depend on in work.
TYPED_TEST(TriangularTest, a_piece_of_a_product_takes_what_it_does_not_own_from_work) {
  using T = TypeParam;
  Buffer<T> a(150 * 152), x(1000), work(400);
  in_every_tier([&](int tier) {
    if (Tiers<T>::block[tier] == nullptr) return;
    in_every_case([&](Case c) {
      const bool plain = c.trans == 'N';
      for (const QtbInt n : {1, 5, 64, 65, 130})
        for (const QtbInt first : {QtbInt{0}, n / 3, n - 1})
          for (const QtbInt len : {QtbInt{0}, QtbInt{1}, (n - first + 1) / 2, n - first})
            for (const QtbInt inc : {1, -1, 2}) {
              c.n = n, c.inc = inc, c.spare = n % 2, c.phase_x = at(len % 2 * 8);
              const Triangle<T> triangle(c, a);
              const QtbInt lda = n + c.spare;
              WholeNumbers draw(7);
              std::vector<T> values(at(n));
              for (T &v : values) v = draw.element<T>();
              const std::vector<T> product = triangle.times_vector(values);
              // op(T) is upper where the piece depends on what comes after it.
              const bool leads = (c.uplo == 'U') == plain;
              const QtbInt extent_of_piece = leads ? n - first : first + len, from = leads ? first : 0;
              const QtbInt row = plain ? first : from, column = plain ? from : first;
              T *const old = work.place(at(extent_of_piece), 0);
              for (QtbInt i = 0; i < extent_of_piece; ++i) work.set(at(i), values[at(from + i)]);
              work.expect_kept();
              T *const piece = x.place(extent(len, inc), c.phase_x);
              for (QtbInt i = 0; i < len; ++i) x.set(position(i, len, inc), values[at(first + i)]);
              x.expect_kept();
              for (QtbInt i = 0; i < len; ++i) x.expect(position(i, len, inc), product[at(first + i)]);
              {
                FiniteOnly finite(FE_INVALID);
                Tiers<T>::block[tier](&c.uplo, &c.trans, &c.diag, &extent_of_piece,
                                      triangle.array() + row + column * lda, &lda, piece, &inc, &len, old);
              }
              if (!x.as_expected() || !a.as_expected() || !work.as_expected()) {
                ADD_FAILURE() << tier_name(tier) << " " << c << " first " << first << " len " << len;
                return;
              }
            }
    });
  });
}

}  // namespace
