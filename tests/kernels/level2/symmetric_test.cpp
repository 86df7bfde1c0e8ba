// What the kernels of symmetric and Hermitian matrices promise beyond their results: what they skip, what they do not
// read, which bits do not depend on addresses, and increments that no array can fill.

#include <fenv.h>
#include <gtest/gtest.h>
#include <sys/mman.h>

#include <cmath>
#include <cstring>
#include <vector>

#include "tests/kernels/level2/numbers.h"
#include "tests/reference/level2.h"
#include "tests/support/tiers.h"

namespace qtb::test {
namespace {

template <class Function>
using Target = Function *;

template <class T>
struct Procedures {
  Target<QTB_FUNCTION_TYPE(symv, T)> symv[tier_count];
  Target<QTB_FUNCTION_TYPE(spmv, T)> spmv[tier_count];
  Target<QTB_FUNCTION_TYPE(sbmv, T)> sbmv[tier_count];
  Target<QTB_FUNCTION_TYPE(her, T)> syr[tier_count];
  Target<QTB_FUNCTION_TYPE(hpr, T)> spr[tier_count];
  Target<QTB_FUNCTION_TYPE(syr2, T)> syr2[tier_count];
  Target<QTB_FUNCTION_TYPE(spr2, T)> spr2[tier_count];
};
template <class T>
constexpr Procedures<T> procedures;
template <>
constexpr Procedures<float> procedures<float> = {QTB_ALL_TIERS(ssymv), QTB_ALL_TIERS(sspmv), QTB_ALL_TIERS(ssbmv),
                                                 QTB_ALL_TIERS(ssyr),  QTB_ALL_TIERS(sspr),  QTB_ALL_TIERS(ssyr2),
                                                 QTB_ALL_TIERS(sspr2)};
template <>
constexpr Procedures<double> procedures<double> = {QTB_ALL_TIERS(dsymv), QTB_ALL_TIERS(dspmv), QTB_ALL_TIERS(dsbmv),
                                                   QTB_ALL_TIERS(dsyr),  QTB_ALL_TIERS(dspr),  QTB_ALL_TIERS(dsyr2),
                                                   QTB_ALL_TIERS(dspr2)};
template <>
constexpr Procedures<cfloat> procedures<cfloat> = {QTB_ALL_TIERS(chemv), QTB_ALL_TIERS(chpmv), QTB_ALL_TIERS(chbmv),
                                                   QTB_ALL_TIERS(cher),  QTB_ALL_TIERS(chpr),  QTB_ALL_TIERS(cher2),
                                                   QTB_ALL_TIERS(chpr2)};
template <>
constexpr Procedures<cdouble> procedures<cdouble> = {QTB_ALL_TIERS(zhemv), QTB_ALL_TIERS(zhpmv), QTB_ALL_TIERS(zhbmv),
                                                     QTB_ALL_TIERS(zher),  QTB_ALL_TIERS(zhpr),  QTB_ALL_TIERS(zher2),
                                                     QTB_ALL_TIERS(zhpr2)};

const QtbInt one = 1;

template <class T>
std::vector<T> nans(std::size_t count) {
  return std::vector<T>(count, element<T>(NAN, NAN));
}

template <class T>
class Symmetric : public testing::Test {};
using Types = testing::Types<float, double, cfloat, cdouble>;
TYPED_TEST_SUITE(Symmetric, Types);

TYPED_TEST(Symmetric, an_order_of_zero_changes_nothing) {
  using T = TypeParam;
  const Procedures<T> &p = procedures<T>;
  const QtbInt none = 0, band = 2;
  const T alpha = element<T>(2, 1), beta = element<T>(0, 0);
  const Real<T> real_alpha = 2;
  in_every_tier([&](int tier) {
    for (const char *uplo : {"U", "L"}) {
      const std::vector<T> before = nans<T>(3);
      std::vector<T> out = before;
      p.symv[tier](uplo, &none, &alpha, nullptr, &one, nullptr, &one, &beta, out.data(), &one);
      p.spmv[tier](uplo, &none, &alpha, nullptr, nullptr, &one, &beta, out.data(), &one);
      p.sbmv[tier](uplo, &none, &band, &alpha, nullptr, &band, nullptr, &one, &beta, out.data(), &one);
      p.syr[tier](uplo, &none, &real_alpha, nullptr, &one, out.data(), &one);
      p.spr[tier](uplo, &none, &real_alpha, nullptr, &one, out.data());
      p.syr2[tier](uplo, &none, &alpha, nullptr, &one, nullptr, &one, out.data(), &one);
      p.spr2[tier](uplo, &none, &alpha, nullptr, &one, nullptr, &one, out.data());
      EXPECT_TRUE(same(out, before)) << tier_name(tier);
    }
  });
}

TYPED_TEST(Symmetric, an_alpha_of_zero_reads_no_operand) {
  using T = TypeParam;
  const Procedures<T> &p = procedures<T>;
  const QtbInt n = 13, k = 3;
  const T zero{}, unit = element<T>(1, 0);
  const Real<T> real_zero = 0;
  in_every_tier([&](int tier) {
    for (const char *uplo : {"U", "L"}) {
      const std::vector<T> before = nans<T>(static_cast<std::size_t>(n * n));
      std::vector<T> kept = before, cleared = before;
      p.symv[tier](uplo, &n, &zero, nullptr, &n, nullptr, &one, &unit, kept.data(), &one);
      p.spmv[tier](uplo, &n, &zero, nullptr, nullptr, &one, &unit, kept.data(), &one);
      p.sbmv[tier](uplo, &n, &k, &zero, nullptr, &n, nullptr, &one, &unit, kept.data(), &one);
      p.syr[tier](uplo, &n, &real_zero, nullptr, &one, kept.data(), &n);
      p.spr[tier](uplo, &n, &real_zero, nullptr, &one, kept.data());
      p.syr2[tier](uplo, &n, &zero, nullptr, &one, nullptr, &one, kept.data(), &n);
      p.spr2[tier](uplo, &n, &zero, nullptr, &one, nullptr, &one, kept.data());
      EXPECT_TRUE(same(kept, before)) << tier_name(tier);
      const std::vector<T> zeros(static_cast<std::size_t>(n));
      for (int storage = 0; storage < 3; ++storage) {
        cleared = nans<T>(static_cast<std::size_t>(n));
        if (storage == 0) p.symv[tier](uplo, &n, &zero, nullptr, &n, nullptr, &one, &zero, cleared.data(), &one);
        if (storage == 1) p.spmv[tier](uplo, &n, &zero, nullptr, nullptr, &one, &zero, cleared.data(), &one);
        if (storage == 2) p.sbmv[tier](uplo, &n, &k, &zero, nullptr, &n, nullptr, &one, &zero, cleared.data(), &one);
        EXPECT_TRUE(same(cleared, zeros)) << tier_name(tier);
      }
    }
  });
}

// One group of four columns and a single one, of small whole numbers: the sums are exact.
TYPED_TEST(Symmetric, a_product_of_order_five_reads_one_triangle_alone) {
  using T = TypeParam;
  const QtbInt n = 5;
  const T unit = element<T>(1, 0), zero{};
  in_every_tier([&](int tier) {
    for (const char *uplo : {"U", "L"}) {
      std::vector<T> a = nans<T>(25), x, want, y = nans<T>(5);
      const auto entry = [](QtbInt i, QtbInt j) {  // of a Hermitian matrix
        const double im = i == j ? 0 : i < j ? double(i + 2 * j) : -double(j + 2 * i);
        return element<T>(double(1 + i + j), im);
      };
      for (QtbInt j = 0; j < n; ++j)
        for (QtbInt i = 0; i < n; ++i)
          if (*uplo == 'U' ? i <= j : i >= j) a[static_cast<std::size_t>(i + 5 * j)] = entry(i, j);
      if constexpr (is_complex<T>)  // the imaginary parts on the diagonal count for nothing
        for (std::size_t j = 0; j < 5; ++j) a[6 * j].im = NAN;
      for (QtbInt i = 0; i < n; ++i) x.push_back(element<T>(double(i - 2), double(3 - i)));
      for (QtbInt i = 0; i < n; ++i) {
        QuadComplex sum;
        for (QtbInt j = 0; j < n; ++j) {
          const QuadComplex t =
              reference::product(widen(entry(i, j)), widen(x[static_cast<std::size_t>(j)]), is_complex<T>);
          sum.re += t.re, sum.im += t.im;
        }
        want.push_back(element<T>(double(sum.re), double(sum.im)));
      }
      procedures<T>.symv[tier](uplo, &n, &unit, a.data(), &n, x.data(), &one, &zero, y.data(), &one);
      EXPECT_TRUE(same(y, want)) << tier_name(tier) << *uplo;
    }
  });
}

// Columns of NaNs whose elements of the vectors are zero; the imaginary part of a Hermitian diagonal is cleared even
// there. The neighbours of a skipped column are updated: their order is 1, alone or in a pair.
TYPED_TEST(Symmetric, an_update_skips_the_columns_of_zeros) {
  using T = TypeParam;
  const Procedures<T> &p = procedures<T>;
  const Real<T> real_alpha = 2;
  const T alpha = element<T>(2, 0);
  in_every_tier([&](int tier) {
    for (const QtbInt n : {1, 2, 5, 12, 13})
      for (const QtbInt skipped : {QtbInt{0}, n / 2, n - 1})
        for (const bool upper : {true, false})
          for (const bool packed : {true, false})
            for (const bool two : {true, false}) {
              const char *const uplo = upper ? "u" : "L";
              const reference::Layout layout =
                  packed ? reference::packed_triangle(*uplo, n) : reference::triangle(*uplo, n, n);
              std::vector<T> x(static_cast<std::size_t>(n), element<T>(1, 1)), a(static_cast<std::size_t>(n * n));
              for (QtbInt i = 0; i < n; ++i)
                if (layout.stores(i, skipped))
                  a[static_cast<std::size_t>(layout.position(i, skipped))] = element<T>(NAN, NAN);
              x[static_cast<std::size_t>(skipped)] = element<T>(0, -0.0);
              const std::vector<T> before = a;
              if (two && packed) p.spr2[tier](uplo, &n, &alpha, x.data(), &one, x.data(), &one, a.data());
              if (two && !packed) p.syr2[tier](uplo, &n, &alpha, x.data(), &one, x.data(), &one, a.data(), &n);
              if (!two && packed) p.spr[tier](uplo, &n, &real_alpha, x.data(), &one, a.data());
              if (!two && !packed) p.syr[tier](uplo, &n, &real_alpha, x.data(), &one, a.data(), &n);
              for (QtbInt j = 0; j < n; ++j)
                for (QtbInt i = 0; i < n; ++i) {
                  if (!layout.stores(i, j)) continue;
                  const auto at = static_cast<std::size_t>(layout.position(i, j));
                  T want = element<T>(0, 0);  // of a zero in x
                  if (i != skipped && j != skipped) {
                    const double products = is_complex<T> ? 2 : 1;
                    want = element<T>(2 * products * (two ? 2 : 1), 0);
                  } else if (j == skipped) {
                    want = before[at];
                    if constexpr (is_complex<T>)
                      if (i == j) want.im = 0;
                  }
                  const bool is_nan = std::isnan(double(widen(want).re));
                  EXPECT_TRUE(is_nan ? std::isnan(double(widen(a[at]).re)) : widen(a[at]).re == widen(want).re)
                      << tier_name(tier) << uplo << packed << two << " n " << n << " (" << i << ", " << j << ")";
                  if constexpr (is_complex<T>) {
                    EXPECT_TRUE(std::isnan(want.im) ? std::isnan(a[at].im) : a[at].im == want.im)
                        << tier_name(tier) << uplo << packed << two << " n " << n << " (" << i << ", " << j << ")";
                  }
                }
            }
  });
}

// The other elements of the vectors are NaNs, which a product with zero would carry into the column.
TYPED_TEST(Symmetric, a_skipped_column_takes_no_nan_from_the_vectors) {
  using T = TypeParam;
  const Procedures<T> &p = procedures<T>;
  const Real<T> real_alpha = 2;
  const T alpha = element<T>(2, 1);
  in_every_tier([&](int tier) {
    for (const QtbInt n : {2, 3, 12, 13})
      for (const QtbInt inc : {1, 2})
        for (QtbInt skipped = 0; skipped < n; ++skipped)
          for (const char *uplo : {"U", "L"})
            for (int form = 0; form < 4; ++form) {
              const bool packed = form >= 2;
              const reference::Layout layout =
                  packed ? reference::packed_triangle(*uplo, n) : reference::triangle(*uplo, n, n);
              std::vector<T> x = nans<T>(static_cast<std::size_t>(n * inc)), a = numbers<T>(n * n, 7), want = a;
              x[static_cast<std::size_t>(skipped * inc)] = T{};
              if (form == 0) p.syr[tier](uplo, &n, &real_alpha, x.data(), &inc, a.data(), &n);
              if (form == 1) p.syr2[tier](uplo, &n, &alpha, x.data(), &inc, x.data(), &inc, a.data(), &n);
              if (form == 2) p.spr[tier](uplo, &n, &real_alpha, x.data(), &inc, a.data());
              if (form == 3) p.spr2[tier](uplo, &n, &alpha, x.data(), &inc, x.data(), &inc, a.data());
              for (QtbInt i = 0; i < n; ++i) {
                if (!layout.stores(i, skipped)) continue;
                const auto at = static_cast<std::size_t>(layout.position(i, skipped));
                if constexpr (is_complex<T>)
                  if (i == skipped) want[at].im = 0;
                EXPECT_EQ(std::memcmp(&a[at], &want[at], sizeof(T)), 0)
                    << tier_name(tier) << uplo << form << " n " << n << " (" << i << ", " << skipped << ")";
              }
            }
  });
}

// A NaN is not zero: its column is updated.
TYPED_TEST(Symmetric, an_update_takes_a_nan_for_no_zero) {
  using T = TypeParam;
  const Procedures<T> &p = procedures<T>;
  const QtbInt n = 3;
  const Real<T> real_alpha = 1;
  const T alpha = element<T>(1, 0);
  in_every_tier([&](int tier) {
    const std::vector<T> x = {element<T>(0, 0), element<T>(NAN, 0), element<T>(0, 0)}, y(3);
    for (int form = 0; form < 4; ++form) {
      std::vector<T> a(9);
      if (form == 0) p.syr[tier]("U", &n, &real_alpha, x.data(), &one, a.data(), &n);
      if (form == 1) p.syr2[tier]("U", &n, &alpha, x.data(), &one, y.data(), &one, a.data(), &n);
      if (form == 2) p.syr2[tier]("U", &n, &alpha, y.data(), &one, x.data(), &one, a.data(), &n);
      if (form == 3) p.spr[tier]("U", &n, &real_alpha, x.data(), &one, a.data());
      const std::size_t diagonal = form == 3 ? 2 : 4;
      EXPECT_TRUE(std::isnan(double(widen(a[diagonal]).re))) << tier_name(tier) << form;
      EXPECT_EQ(double(widen(a[0]).re), 0) << tier_name(tier) << form;
    }
  });
}

TYPED_TEST(Symmetric, an_update_by_zeros_clears_the_imaginary_diagonal) {
  using T = TypeParam;
  const Procedures<T> &p = procedures<T>;
  const Real<T> real_alpha = 1;
  const T alpha = element<T>(1, 1);
  in_every_tier([&](int tier) {
    for (const QtbInt n : {1, 4, 11})
      for (const char *uplo : {"U", "L"})
        for (int form = 0; form < 4; ++form) {
          const std::vector<T> x(static_cast<std::size_t>(n));
          std::vector<T> a = numbers<T>(n * n, 5), want = a;
          const bool packed = form >= 2;
          const reference::Layout layout =
              packed ? reference::packed_triangle(*uplo, n) : reference::triangle(*uplo, n, n);
          if constexpr (is_complex<T>)
            for (QtbInt j = 0; j < n; ++j) want[static_cast<std::size_t>(layout.position(j, j))].im = 0;
          if (form == 0) p.syr[tier](uplo, &n, &real_alpha, x.data(), &one, a.data(), &n);
          if (form == 1) p.syr2[tier](uplo, &n, &alpha, x.data(), &one, x.data(), &one, a.data(), &n);
          if (form == 2) p.spr[tier](uplo, &n, &real_alpha, x.data(), &one, a.data());
          if (form == 3) p.spr2[tier](uplo, &n, &alpha, x.data(), &one, x.data(), &one, a.data());
          EXPECT_TRUE(same(a, want)) << tier_name(tier) << uplo << form;
        }
  });
}

// ---- Addresses ----

// count elements at a byte offset from a 64-byte boundary.
template <class T>
class Shifted {
 public:
  Shifted(const std::vector<T> &values, std::size_t offset) : count_(values.size()), bytes_(values.size() * sizeof(T)) {
    memory_.resize(bytes_ + 128);
    first_ = memory_.data() + (64 - reinterpret_cast<std::uintptr_t>(memory_.data()) % 64) + offset;
    std::memcpy(first_, static_cast<const void *>(values.data()), bytes_);
  }
  T *data() { return reinterpret_cast<T *>(first_); }
  std::vector<T> values() const {
    std::vector<T> v(count_);
    std::memcpy(static_cast<void *>(v.data()), first_, bytes_);
    return v;
  }

 private:
  std::size_t count_, bytes_;
  std::vector<unsigned char> memory_;
  unsigned char *first_;
};

TYPED_TEST(Symmetric, the_bits_of_an_update_do_not_depend_on_addresses) {
  using T = TypeParam;
  const Procedures<T> &p = procedures<T>;
  const Real<T> real_alpha = static_cast<Real<T>>(0.7);
  const T alpha = element<T>(0.7, -0.3);
  in_every_tier([&](int tier) {
    for (const QtbInt n : {3, 19})
      for (const char *uplo : {"U", "L"})
        for (const QtbInt lda : {n, n + 1}) {
          const std::vector<T> x = numbers<T>(n, 1), y = numbers<T>(n, 2), a = numbers<T>(n * lda, 3);
          std::vector<T> first[4];
          for (std::size_t offset_a = 0; offset_a < 16; ++offset_a)
            for (const std::size_t offset : {0, 1, 4, 8, 12})
              for (std::size_t form = 0; form < 4; ++form) {
                Shifted<T> sx(x, offset), sy(y, 16 - offset), sa(a, offset_a);
                if (form == 0) p.syr[tier](uplo, &n, &real_alpha, sx.data(), &one, sa.data(), &lda);
                if (form == 1) p.syr2[tier](uplo, &n, &alpha, sx.data(), &one, sy.data(), &one, sa.data(), &lda);
                if (form == 2) p.spr[tier](uplo, &n, &real_alpha, sx.data(), &one, sa.data());
                if (form == 3) p.spr2[tier](uplo, &n, &alpha, sx.data(), &one, sy.data(), &one, sa.data());
                if (first[form].empty()) first[form] = sa.values();
                ASSERT_TRUE(same(sa.values(), first[form]))
                    << tier_name(tier) << uplo << form << " n " << n << " offsets " << offset_a << ", " << offset;
              }
        }
  });
}

TYPED_TEST(Symmetric, products_lie_within_the_bound_at_every_phase) {
  using T = TypeParam;
  const Procedures<T> &p = procedures<T>;
  const T alpha = element<T>(0.7, -0.3), beta = element<T>(0.9, -0.2);
  const QtbInt k = 12;
  in_every_tier([&](int tier) {
    for (const QtbInt n : {3, 22})
      for (const char *uplo : {"U", "L"})
        for (const QtbInt lda : {QtbInt{22}, QtbInt{23}}) {
          const std::vector<T> x = numbers<T>(n, 1), y = numbers<T>(n, 2), a = numbers<T>(n * lda, 3);
          const reference::Expectation want[] = {
              reference::symv(*uplo, n, alpha, a.data(), lda, x.data(), one, beta, y.data(), one),
              reference::spmv(*uplo, n, alpha, a.data(), x.data(), one, beta, y.data(), one),
              reference::sbmv(*uplo, n, k, alpha, a.data(), lda, x.data(), one, beta, y.data(), one)};
          for (std::size_t offset_y = 0; offset_y < 16; ++offset_y)
            for (std::size_t offset_a = 0; offset_a < 16; ++offset_a)
              for (int form = 0; form < 3; ++form) {
                Shifted<T> sx(x, (5 * offset_a + 3 * offset_y) % 16), sy(y, offset_y), sa(a, offset_a);
                if (form == 0) p.symv[tier](uplo, &n, &alpha, sa.data(), &lda, sx.data(), &one, &beta, sy.data(), &one);
                if (form == 1) p.spmv[tier](uplo, &n, &alpha, sa.data(), sx.data(), &one, &beta, sy.data(), &one);
                if (form == 2)
                  p.sbmv[tier](uplo, &n, &k, &alpha, sa.data(), &lda, sx.data(), &one, &beta, sy.data(), &one);
                const std::vector<T> got = sy.values();
                for (QtbInt i = 0; i < n; ++i) {
                  const reference::Expected &e = want[form].at(i, 0);
                  ASSERT_LE(error_ratio(got[static_cast<std::size_t>(i)], e.value, Quad(e.gauge), want[form].roundings,
                                        want[form].alpha_magnitude),
                            1)
                      << tier_name(tier) << uplo << form << " n " << n << " offsets " << offset_a << ", " << offset_y;
                }
              }
        }
  });
}

// ---- Increments ----

// Vectors whose elements lie further apart than a 32-bit number counts, in memory of which the system keeps only the
// pages that are touched.
TYPED_TEST(Symmetric, increments_beyond_31_bits_reach_their_elements) {
  using T = TypeParam;
  const Procedures<T> &p = procedures<T>;
  const QtbInt n = 3, far = (QtbInt{1} << 31) + 5;
  const std::size_t bytes = static_cast<std::size_t>(2 * far + 1) * sizeof(T);
  const auto reserve = [&] {
    void *const at = mmap(nullptr, bytes, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0);
    return at == MAP_FAILED ? nullptr : static_cast<T *>(at);
  };
  T *const far_x = reserve(), *const far_y = reserve();
  if (far_x == nullptr || far_y == nullptr) GTEST_SKIP() << "no address space of that size";
  const T alpha = element<T>(0.7, -0.3), beta = element<T>(0.9, -0.2);
  const Real<T> real_alpha = static_cast<Real<T>>(0.7);
  const std::vector<T> x = numbers<T>(3, 1), y = numbers<T>(3, 2), a = numbers<T>(9, 3);
  const auto scattered = [&](T *to, const std::vector<T> &from, QtbInt inc) {
    for (QtbInt i = 0; i < n; ++i) to[inc > 0 ? i * inc : (i - 2) * inc] = from[static_cast<std::size_t>(i)];
  };
  in_every_tier([&](int tier) {
    for (const char *uplo : {"U", "L"})
      for (const QtbInt inc : {far, -far}) {
        const QtbInt two = 2;  // strided as well: the same order of summation
        std::vector<T> near_x(5), near_y(5);
        for (std::size_t i = 0; i < 3; ++i) near_x[2 * i] = x[i], near_y[2 * i] = y[i];
        for (int form = 0; form < 3; ++form) {
          std::vector<T> want = near_y;
          scattered(far_x, x, inc), scattered(far_y, y, inc);
          if (form == 0) {
            p.symv[tier](uplo, &n, &alpha, a.data(), &n, near_x.data(), &two, &beta, want.data(), &two);
            p.symv[tier](uplo, &n, &alpha, a.data(), &n, far_x, &inc, &beta, far_y, &inc);
          } else if (form == 1) {
            p.spmv[tier](uplo, &n, &alpha, a.data(), near_x.data(), &two, &beta, want.data(), &two);
            p.spmv[tier](uplo, &n, &alpha, a.data(), far_x, &inc, &beta, far_y, &inc);
          } else {
            p.sbmv[tier](uplo, &n, &one, &alpha, a.data(), &n, near_x.data(), &two, &beta, want.data(), &two);
            p.sbmv[tier](uplo, &n, &one, &alpha, a.data(), &n, far_x, &inc, &beta, far_y, &inc);
          }
          for (QtbInt i = 0; i < n; ++i) {
            const T got = far_y[inc > 0 ? i * inc : (i - 2) * inc];
            EXPECT_EQ(std::memcmp(&got, &want[static_cast<std::size_t>(2 * i)], sizeof(T)), 0)
                << tier_name(tier) << uplo << form << " element " << i;
          }
        }
        for (int form = 0; form < 4; ++form) {
          std::vector<T> want = a, got = a;
          scattered(far_x, x, inc), scattered(far_y, y, inc);
          if (form == 0) {
            p.syr[tier](uplo, &n, &real_alpha, x.data(), &one, want.data(), &n);
            p.syr[tier](uplo, &n, &real_alpha, far_x, &inc, got.data(), &n);
          } else if (form == 1) {
            p.spr[tier](uplo, &n, &real_alpha, x.data(), &one, want.data());
            p.spr[tier](uplo, &n, &real_alpha, far_x, &inc, got.data());
          } else if (form == 2) {
            p.syr2[tier](uplo, &n, &alpha, x.data(), &one, y.data(), &one, want.data(), &n);
            p.syr2[tier](uplo, &n, &alpha, far_x, &inc, far_y, &inc, got.data(), &n);
          } else {
            p.spr2[tier](uplo, &n, &alpha, x.data(), &one, y.data(), &one, want.data());
            p.spr2[tier](uplo, &n, &alpha, far_x, &inc, far_y, &inc, got.data());
          }
          EXPECT_TRUE(same(got, want)) << tier_name(tier) << uplo << form;
        }
      }
  });
  munmap(far_x, bytes), munmap(far_y, bytes);
}

// ---- Exceptions ----

// The largest numbers that stay finite, at each place in turn: what a spare lane computed would trap.
TYPED_TEST(Symmetric, finite_results_raise_no_exceptions) {
  using T = TypeParam;
  const Procedures<T> &p = procedures<T>;
  using R = Real<T>;
  const double large = static_cast<double>(std::numeric_limits<R>::max()) / 64;
  const T unit = element<T>(1, 0), zero{};
  const R real_one = 1;
  in_every_tier([&](int tier) {
    for (const char *uplo : {"U", "L"})
      for (QtbInt n = 1; n <= 21; ++n)
        for (QtbInt at = 0; at < n; ++at)
          for (const QtbInt inc : {1, 2}) {
            const auto count = static_cast<std::size_t>(n), spread = static_cast<std::size_t>(n * inc);
            std::vector<T> x(spread, element<T>(0.5, 0.5)), y(spread, element<T>(0.5, 0.5)),
                a(count * count, element<T>(0.5, 0.25));
            x[static_cast<std::size_t>(at * inc)] = element<T>(large, large);
            feclearexcept(FE_ALL_EXCEPT);
            feenableexcept(FE_INVALID | FE_OVERFLOW | FE_DIVBYZERO | FE_UNDERFLOW);
            p.symv[tier](uplo, &n, &unit, a.data(), &n, x.data(), &inc, &zero, y.data(), &inc);
            p.spmv[tier](uplo, &n, &unit, a.data(), x.data(), &inc, &zero, y.data(), &inc);
            p.sbmv[tier](uplo, &n, &one, &unit, a.data(), &n, x.data(), &inc, &zero, y.data(), &inc);
            std::fill(y.begin(), y.end(), element<T>(0.5, 0.5));
            p.syr2[tier](uplo, &n, &unit, x.data(), &inc, y.data(), &inc, a.data(), &n);
            p.spr2[tier](uplo, &n, &unit, x.data(), &inc, y.data(), &inc, a.data());
            x[static_cast<std::size_t>(at * inc)] = element<T>(std::sqrt(large) / 4, 0);
            p.syr[tier](uplo, &n, &real_one, x.data(), &inc, a.data(), &n);
            p.spr[tier](uplo, &n, &real_one, x.data(), &inc, a.data());
            fedisableexcept(FE_ALL_EXCEPT);
          }
  });
}

}  // namespace
}  // namespace qtb::test
