// What the kernels of band matrices and of band and packed triangles promise beyond their results: what they skip, what
// they do not read, the form that a tier chooses, increments that no array can fill, exceptions.

#include <fenv.h>
#include <gtest/gtest.h>
#include <sys/mman.h>

#include "blas/kernels/level2/band_forms.h"
#include "tests/kernels/level2/banded.h"

namespace qtb::test {
namespace {

const QtbInt one = 1;

template <class T>
class Bands : public testing::Test {};
template <class T>
class Forms : public testing::Test {};
using Types = testing::Types<float, double, cfloat, cdouble>;
using ComplexTypes = testing::Types<cfloat, cdouble>;
TYPED_TEST_SUITE(Bands, Types);
TYPED_TEST_SUITE(Forms, ComplexTypes);

// Whole numbers, so that sums are exact.
template <class T>
std::vector<T> whole_numbers(QtbInt count, int first) {
  std::vector<T> v(static_cast<std::size_t>(count));
  for (std::size_t i = 0; i < v.size(); ++i) v[i] = element<T>(first + int(i % 5), 2 - int(i % 3));
  return v;
}
template <class T>
bool equals(const std::vector<T> &got, const reference::Expectation &want) {
  for (std::size_t i = 0; i < got.size(); ++i) {
    const QuadComplex g = widen(got[i]), w = want.at(static_cast<QtbInt>(i), 0).value;
    if (g.re != w.re || g.im != w.im) return false;
  }
  return true;
}

// f(uplo, trans, diag) for all cases.
template <class F>
void in_every_case(F f) {
  for (const char *uplo : {"U", "L"})
    for (const char *trans : {"N", "T", "C"})
      for (const char *diag : {"N", "U"}) f(uplo, trans, diag);
}

// ---- gbmv ----

TYPED_TEST(Bands, a_band_of_the_main_diagonal_alone_multiplies_element_by_element) {
  using T = TypeParam;
  const QtbInt none = 0;
  const T alpha = element<T>(2, 0), beta = element<T>(3, 0);
  in_every_tier([&](int tier) {
    for (const QtbInt n : {1, 2, 3, 9, 20})
      for (const char *trans : {"N", "T", "C"})
        for (const QtbInt lda : {1, 3}) {
          std::vector<T> a(static_cast<std::size_t>(n * lda), not_a_number<T>());
          const std::vector<T> x = whole_numbers<T>(n, 1), diagonal = whole_numbers<T>(n, -2);
          for (QtbInt j = 0; j < n; ++j) a[static_cast<std::size_t>(j * lda)] = diagonal[static_cast<std::size_t>(j)];
          std::vector<T> y = whole_numbers<T>(n, 4);
          const reference::Expectation want =
              reference::gbmv(*trans, n, n, none, none, alpha, a.data(), lda, x.data(), one, beta, y.data(), one);
          banded<T>.gbmv[tier](trans, &n, &n, &none, &none, &alpha, a.data(), &lda, x.data(), &one, &beta, y.data(),
                               &one);
          EXPECT_TRUE(equals(y, want)) << tier_name(tier) << trans << n;
        }
  });
}

TYPED_TEST(Bands, columns_past_the_last_row_change_nothing) {
  using T = TypeParam;
  const QtbInt n = 23, kl = 2;
  const T alpha = element<T>(1, 0), beta = element<T>(1, 0);
  in_every_tier([&](int tier) {
    for (const QtbInt m : {1, 2, 7})
      for (const QtbInt ku : {0, 1, 2, 5, 30})
        for (const char *trans : {"N", "T", "C"}) {
          const QtbInt lda = kl + ku + 1, with_rows = std::min(n, m + ku);
          const bool plain = *trans == 'N';
          std::vector<T> a(static_cast<std::size_t>(n * lda), not_a_number<T>());
          const reference::Layout layout = reference::band(m, n, kl, ku, lda);
          for (QtbInt j = 0; j < n; ++j)
            for (QtbInt i = 0; i < m; ++i)
              if (layout.stores(i, j)) a[static_cast<std::size_t>(layout.position(i, j))] = element<T>(1, 0);
          std::vector<T> x(static_cast<std::size_t>(plain ? n : m), element<T>(1, 0));
          std::vector<T> y(static_cast<std::size_t>(plain ? m : n), element<T>(-0.0, -0.0));
          if (plain)
            for (QtbInt j = with_rows; j < n; ++j) x[static_cast<std::size_t>(j)] = not_a_number<T>();
          banded<T>.gbmv[tier](trans, &m, &n, &kl, &ku, &alpha, a.data(), &lda, x.data(), &one, &beta, y.data(), &one);
          for (QtbInt i = 0; i < (plain ? m : n); ++i) {
            double want = 0;
            for (QtbInt j = 0; j < (plain ? n : m); ++j) want += plain ? layout.stores(i, j) : layout.stores(j, i);
            const double got = static_cast<double>(widen(y[static_cast<std::size_t>(i)]).re);
            EXPECT_EQ(got, want) << tier_name(tier) << trans << " m " << m << " ku " << ku << " element " << i;
            if (!plain && i >= with_rows) {
              EXPECT_TRUE(std::signbit(got)) << "touched";
            }
          }
        }
  });
}

TYPED_TEST(Bands, factors_of_zero_and_one_spare_the_operands) {
  using T = TypeParam;
  const QtbInt m = 13, n = 11, kl = 2, ku = 3, lda = 7, none = 0;
  const T zero{}, unit = element<T>(1, 0), other = element<T>(0.5, 2);
  in_every_tier([&](int tier) {
    for (const char *trans : {"N", "T", "C"})
      for (const QtbInt inc : {1, 2}) {
        const QtbInt leny = *trans == 'N' ? m : n;
        const std::vector<T> before(static_cast<std::size_t>(leny * inc), not_a_number<T>());
        std::vector<T> y = before;
        const auto call = [&](const QtbInt *rows, const QtbInt *columns, const T *alpha, const T *beta) {
          banded<T>.gbmv[tier](trans, rows, columns, &kl, &ku, alpha, nullptr, &lda, nullptr, &inc, beta, y.data(),
                               &inc);
        };
        call(&m, &n, &zero, &unit);
        call(&none, &n, &other, &zero);
        call(&m, &none, &other, &zero);
        EXPECT_TRUE(same(y, before)) << tier_name(tier) << trans;
        call(&m, &n, &zero, &zero);
        for (QtbInt i = 0; i < leny; ++i) {
          const QuadComplex e = widen(y[static_cast<std::size_t>(i * inc)]);
          EXPECT_TRUE(e.re == 0 && e.im == 0) << tier_name(tier) << trans << i;
        }
      }
  });
}

// ---- Triangles ----

// The four routines of triangles as one call.
enum class Form { tbmv, tbsv, tpmv, tpsv, general_tbmv, general_tbsv };
constexpr Form all_forms[] = {Form::tbmv, Form::tbsv, Form::tpmv, Form::tpsv, Form::general_tbmv, Form::general_tbsv};
bool is_packed(Form form) { return form == Form::tpmv || form == Form::tpsv; }
bool is_solve(Form form) { return form == Form::tbsv || form == Form::tpsv || form == Form::general_tbsv; }

struct Triangle {
  const char *uplo, *trans, *diag;
  QtbInt n, k, lda;

  reference::Layout layout(Form form) const {
    return is_packed(form) ? reference::packed_triangle(*uplo, n) : reference::band_triangle(*uplo, n, k, lda);
  }
  QtbInt extent(Form form) const { return is_packed(form) ? n * (n + 1) / 2 : n * lda; }
};

template <class T>
void call(Form form, int tier, const Triangle &t, const T *a, T *x, QtbInt incx) {
  const Banded<T> &p = banded<T>;
  if (form == Form::tpmv) return p.tpmv[tier](t.uplo, t.trans, t.diag, &t.n, a, x, &incx);
  if (form == Form::tpsv) return p.tpsv[tier](t.uplo, t.trans, t.diag, &t.n, a, x, &incx);
  const auto &band = form == Form::tbmv           ? p.tbmv
                     : form == Form::tbsv         ? p.tbsv
                     : form == Form::general_tbmv ? p.general_tbmv
                                                  : p.general_tbsv;
  band[tier](t.uplo, t.trans, t.diag, &t.n, &t.k, a, &t.lda, x, &incx);
}

template <class T>
reference::Expectation expected(Form form, const Triangle &t, const T *a, const T *before, const T *after) {
  const QtbInt terms = is_packed(form) ? t.n : std::min(t.n, t.k + 1);
  const reference::Layout layout = t.layout(form);
  return is_solve(form) ? reference::vector_residual(layout, a, *t.trans, *t.diag, before, after, one, terms)
                        : reference::triangle_times_vector(layout, a, *t.trans, *t.diag, before, one, terms);
}

// Elements of a triangle: solutions stay as large as their right-hand sides, about.
template <class T>
std::vector<T> triangle_numbers(Form form, const Triangle &t, unsigned seed) {
  std::vector<T> a = numbers<T>(t.extent(form), seed);
  const reference::Layout layout = t.layout(form);
  const double weight = 2 / std::fmax(2, double(t.n));
  for (T &e : a) {
    const QuadComplex w = widen(e);
    e = element<T>(weight * static_cast<double>(w.re), weight * static_cast<double>(w.im));
  }
  for (QtbInt j = 0; j < t.n; ++j) a[static_cast<std::size_t>(layout.position(j, j))] = element<T>(1.25, -0.5);
  return a;
}

TYPED_TEST(Bands, an_order_of_zero_changes_nothing) {
  using T = TypeParam;
  in_every_tier([&](int tier) {
    in_every_case([&](const char *uplo, const char *trans, const char *diag) {
      for (const Form form : all_forms) {
        const std::vector<T> before(2, not_a_number<T>());
        std::vector<T> x = before;
        call<T>(form, tier, {uplo, trans, diag, 0, 2, 3}, nullptr, x.data() + 1, 1);
        call<T>(form, tier, {uplo, trans, diag, 0, 2, 3}, nullptr, x.data() + 1, -2);
        EXPECT_TRUE(same(x, before)) << tier_name(tier);
      }
    });
  });
}

// Order 3 has no group of four columns, order 4 no other column.
TYPED_TEST(Bands, packed_products_around_one_group_are_exact_in_whole_numbers) {
  using T = TypeParam;
  in_every_tier([&](int tier) {
    in_every_case([&](const char *uplo, const char *trans, const char *diag) {
      for (const QtbInt n : {1, 2, 3, 4, 5, 7, 8, 9}) {
        const std::vector<T> ap = whole_numbers<T>(n * (n + 1) / 2, 1);
        std::vector<T> x = whole_numbers<T>(n, -1), before = x;
        banded<T>.tpmv[tier](uplo, trans, diag, &n, ap.data(), x.data(), &one);
        EXPECT_TRUE(equals(x, reference::tpmv(*uplo, *trans, *diag, n, ap.data(), before.data(), one)))
            << tier_name(tier) << uplo << trans << diag << n;
      }
    });
  });
}

TYPED_TEST(Bands, a_zero_element_leaves_its_column_unread_without_transposition) {
  using T = TypeParam;
  in_every_tier([&](int tier) {
    for (const char *uplo : {"U", "L"})
      for (const char *diag : {"N", "U"})
        for (const Form form : all_forms)
          for (const QtbInt n : {3, 4, 6, 13, 70})
            for (const QtbInt k : {0, 1, 3, 12})
              for (QtbInt skipped = 0; skipped<n; skipped += n> 20 ? 9 : 1) {
                const Triangle t{uplo, "N", diag, n, k, k + 1};
                const reference::Layout layout = t.layout(form);
                std::vector<T> a = triangle_numbers<T>(form, t, 3), x = numbers<T>(n, 4);
                // In a solve the elements before are zeros too, so that this one is still a zero when its turn comes.
                for (QtbInt j = 0; j < n; ++j)
                  if (j == skipped || (is_solve(form) && (*uplo == 'U' ? j > skipped : j < skipped)))
                    x[static_cast<std::size_t>(j)] = element<T>(0, -0.0);
                const std::vector<T> sound = a, before = x;
                for (QtbInt i = 0; i < n; ++i)
                  if (layout.stores(i, skipped))
                    a[static_cast<std::size_t>(layout.position(i, skipped))] = not_a_number<T>();
                call(form, tier, t, a.data(), x.data(), 1);
                const reference::Expectation want = expected(form, t, sound.data(), before.data(), x.data());
                ASSERT_LE(worst_ratio(x, want), 1) << tier_name(tier) << uplo << diag << " form " << int(form) << " n "
                                                   << n << " k " << k << " skipped " << skipped;
              }
  });
}

TYPED_TEST(Bands, a_unit_diagonal_is_never_read) {
  using T = TypeParam;
  in_every_tier([&](int tier) {
    in_every_case([&](const char *uplo, const char *trans, const char *diag) {
      if (*diag == 'N') return;
      for (const Form form : all_forms)
        for (const QtbInt n : {1, 3, 4, 9, 70})
          for (const QtbInt k : {0, 1, 5}) {
            const Triangle t{uplo, trans, diag, n, k, k + 2};
            std::vector<T> a = triangle_numbers<T>(form, t, 5), x = numbers<T>(n, 6);
            const std::vector<T> before = x;
            for (QtbInt j = 0; j < n; ++j)
              a[static_cast<std::size_t>(t.layout(form).position(j, j))] = not_a_number<T>();
            call(form, tier, t, a.data(), x.data(), 1);
            EXPECT_LE(worst_ratio(x, expected(form, t, a.data(), before.data(), x.data())), 1)
                << tier_name(tier) << uplo << trans << " form " << int(form) << " n " << n << " k " << k;
          }
    });
  });
}

TYPED_TEST(Bands, a_zero_on_the_diagonal_of_a_solve_gives_no_finite_number) {
  using T = TypeParam;
  in_every_tier([&](int tier) {
    in_every_case([&](const char *uplo, const char *trans, const char *diag) {
      for (const Form form : all_forms)
        for (const QtbInt n : {1, 3, 4, 9, 70}) {
          if (!is_solve(form)) continue;
          const Triangle t{uplo, trans, diag, n, 2, 3};
          std::vector<T> a = triangle_numbers<T>(form, t, 7), x = numbers<T>(n, 8);
          const QtbInt at = n / 2;
          a[static_cast<std::size_t>(t.layout(form).position(at, at))] = T{};
          call(form, tier, t, a.data(), x.data(), 1);
          const QuadComplex e = widen(x[static_cast<std::size_t>(at)]);
          const bool finite = std::isfinite(double(e.re)) && std::isfinite(double(e.im));
          EXPECT_EQ(finite, *diag == 'U') << tier_name(tier) << uplo << trans << diag << " form " << int(form) << n;
        }
    });
  });
}

// ---- Addresses and increments ----

// count elements at a byte offset from a vector boundary.
template <class T>
class Shifted {
 public:
  Shifted(const std::vector<T> &values, std::size_t offset) : count_(values.size()) {
    memory_.resize(count_ * sizeof(T) + 128);
    first_ = memory_.data() + (64 - reinterpret_cast<std::uintptr_t>(memory_.data()) % 64) + offset;
    std::memcpy(first_, static_cast<const void *>(values.data()), count_ * sizeof(T));
  }
  T *data() { return reinterpret_cast<T *>(first_); }
  std::vector<T> values() const {
    std::vector<T> v(count_);
    std::memcpy(static_cast<void *>(v.data()), first_, count_ * sizeof(T));
    return v;
  }

 private:
  std::size_t count_;
  std::vector<unsigned char> memory_;
  unsigned char *first_;
};

TYPED_TEST(Bands, results_lie_within_the_bound_at_every_phase) {
  using T = TypeParam;
  const QtbInt k = 18, lda = 2 * k + 2;
  const T alpha = element<T>(0.7, -0.3), beta = element<T>(0.9, -0.2);
  in_every_tier([&](int tier) {
    in_every_case([&](const char *uplo, const char *trans, const char *diag) {
      for (const QtbInt n : {5, 33}) {
        const std::vector<T> x = numbers<T>(n, 1);
        for (std::size_t phase = 0; phase < 16; ++phase) {
          for (const Form form : all_forms) {
            const Triangle t{uplo, trans, diag, n, k, k + 2};
            const std::vector<T> a = triangle_numbers<T>(form, t, 2);
            Shifted<T> sa(a, 5 * phase % 16), sx(x, phase);
            call(form, tier, t, sa.data(), sx.data(), 1);
            const std::vector<T> got = sx.values();
            ASSERT_LE(worst_ratio(got, expected(form, t, a.data(), x.data(), got.data())), 1)
                << tier_name(tier) << uplo << trans << diag << " form " << int(form) << " n " << n << phase;
          }
          const std::vector<T> a = numbers<T>(n * lda, 3), y = numbers<T>(n, 4);
          Shifted<T> sa(a, 5 * phase % 16), sx(x, 11 * phase % 16), sy(y, phase);
          banded<T>.gbmv[tier](trans, &n, &n, &k, &k, &alpha, sa.data(), &lda, sx.data(), &one, &beta, sy.data(), &one);
          ASSERT_LE(worst_ratio(sy.values(), reference::gbmv(*trans, n, n, k, k, alpha, a.data(), lda, x.data(), one,
                                                             beta, y.data(), one)),
                    1)
              << tier_name(tier) << trans << n << phase;
        }
      }
    });
  });
}

// Vectors whose elements lie further apart than a 32-bit number counts, in memory of which the system keeps only the
// pages that are touched. The bits are those of elements two apart, which are indexed one by one as well.
TYPED_TEST(Bands, increments_beyond_31_bits_reach_their_elements) {
  using T = TypeParam;
  const QtbInt n = 3, far = (QtbInt{1} << 31) + 5, near = 2;
  const std::size_t bytes = static_cast<std::size_t>(2 * far + 1) * sizeof(T);
  const auto reserve = [&] {
    void *const at = mmap(nullptr, bytes, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0);
    return at == MAP_FAILED ? nullptr : static_cast<T *>(at);
  };
  T *const far_x = reserve(), *const far_y = reserve();
  if (far_x == nullptr || far_y == nullptr) GTEST_SKIP() << "no address space of that size";
  const std::vector<T> x = numbers<T>(n, 1), y = numbers<T>(n, 2), a = numbers<T>(9, 3);
  const auto place = [&](QtbInt i, QtbInt inc) { return inc > 0 ? i * inc : (i + 1 - n) * inc; };
  const auto scattered = [&](T *to, const std::vector<T> &from, QtbInt inc) {
    for (QtbInt i = 0; i < n; ++i) to[place(i, inc)] = from[static_cast<std::size_t>(i)];
  };
  const auto expect_same = [&](const T *got, QtbInt inc, const T *want, QtbInt want_inc, const char *what) {
    for (QtbInt i = 0; i < n; ++i)
      EXPECT_EQ(std::memcmp(static_cast<const void *>(got + place(i, inc)),
                            static_cast<const void *>(want + place(i, want_inc)), sizeof(T)),
                0)
          << what << " element " << i;
  };
  in_every_tier([&](int tier) {
    in_every_case([&](const char *uplo, const char *trans, const char *diag) {
      for (const int sign : {1, -1}) {
        const QtbInt inc = sign * far, near_inc = sign * near;
        T near_x[5], near_y[5];
        for (const Form form : all_forms) {
          const Triangle t{uplo, trans, diag, n, 1, 3};
          scattered(far_x, x, inc), scattered(near_x, x, near_inc);
          call(form, tier, t, a.data(), far_x, inc), call(form, tier, t, a.data(), near_x, near_inc);
          expect_same(far_x, inc, near_x, near_inc, tier_name(tier));
        }
        const T alpha = element<T>(0.7, -0.3), beta = element<T>(0.9, -0.2);
        scattered(far_x, x, inc), scattered(near_x, x, near_inc);
        scattered(far_y, y, inc), scattered(near_y, y, near_inc);
        banded<T>.gbmv[tier](trans, &n, &n, &one, &one, &alpha, a.data(), &n, far_x, &inc, &beta, far_y, &inc);
        banded<T>.gbmv[tier](trans, &n, &n, &one, &one, &alpha, a.data(), &n, near_x, &near_inc, &beta, near_y,
                             &near_inc);
        expect_same(far_y, inc, near_y, near_inc, tier_name(tier));
      }
    });
  });
  munmap(far_x, bytes), munmap(far_y, bytes);
}

// ---- Exceptions ----

// The largest numbers that stay finite, at each place in turn: what a spare lane computed would trap.
TYPED_TEST(Bands, finite_results_raise_no_exceptions) {
  using T = TypeParam;
  const double large = static_cast<double>(std::numeric_limits<Real<T>>::max()) / 4096;
  const T unit = element<T>(1, 0), zero{};
  in_every_tier([&](int tier) {
    in_every_case([&](const char *uplo, const char *trans, const char *diag) {
      for (const QtbInt n : {1, 2, 3, 4, 5, 9, 12, 21, 65})
        for (QtbInt at = 0; at<n; at += n> 30 ? 8 : 1)
          for (const QtbInt inc : {1, 2}) {
            const auto place = static_cast<std::size_t>(at * inc), spread = static_cast<std::size_t>(n * inc);
            for (const Form form : all_forms) {
              const Triangle t{uplo, trans, diag, n, 3, 4};
              std::vector<T> a(static_cast<std::size_t>(t.extent(form)), element<T>(0.03125, 0.015625)),
                  x(spread, element<T>(0.5, 0.5));
              for (QtbInt j = 0; j < n; ++j)
                a[static_cast<std::size_t>(t.layout(form).position(j, j))] = element<T>(1, 0.25);
              x[place] = element<T>(large, large);
              feclearexcept(FE_ALL_EXCEPT);
              feenableexcept(FE_INVALID | FE_OVERFLOW | FE_DIVBYZERO);
              call(form, tier, t, a.data(), x.data(), inc);
              fedisableexcept(FE_ALL_EXCEPT);
            }
            const QtbInt k = 3, lda = 7;
            std::vector<T> a(static_cast<std::size_t>(n * lda), element<T>(0.5, 0.25)), x(spread, element<T>(0.5, 0.5)),
                y(spread, not_a_number<T>());
            x[place] = element<T>(large, large);
            feclearexcept(FE_ALL_EXCEPT);
            feenableexcept(FE_INVALID | FE_OVERFLOW | FE_DIVBYZERO | FE_UNDERFLOW);
            banded<T>.gbmv[tier](trans, &n, &n, &k, &k, &unit, a.data(), &lda, x.data(), &inc, &zero, y.data(), &inc);
            fedisableexcept(FE_ALL_EXCEPT);
          }
    });
  });
}

// ---- The choice of a form ----

TYPED_TEST(Forms, both_forms_lie_within_the_bound_around_the_limits) {
  using T = TypeParam;
  in_every_tier([&](int tier) {
    in_every_case([&](const char *uplo, const char *trans, const char *diag) {
      for (const QtbInt n : {63, 64, 127, 128, 255, 256})
        for (const QtbInt k : {QtbInt{0}, QtbInt{1}, QtbInt{14}})
          for (const Form form : {Form::tbmv, Form::tbsv}) {
            const Triangle t{uplo, trans, diag, n, k, k + 1};
            const std::vector<T> a = triangle_numbers<T>(form, t, 2), before = numbers<T>(n, 1);
            std::vector<T> x = before;
            call(form, tier, t, a.data(), x.data(), 1);
            ASSERT_LE(worst_ratio(x, expected(form, t, a.data(), before.data(), x.data())), 1)
                << tier_name(tier) << uplo << trans << diag << " n " << n << " k " << k;
          }
    });
  });
}

// A sum of the dot product and one of the general form are added up in different orders: bits tell them apart.
TYPED_TEST(Forms, the_form_taken_is_the_one_that_the_table_names) {
  using T = TypeParam;
  const bool single = std::is_same_v<T, cfloat>;
  in_every_tier([&](int tier) {
    for (const char *uplo : {"U", "L"})
      for (const char *trans : {"T", "C"})
        for (const QtbInt n : {40, 63, 64, 127, 128, 256})
          for (const bool solves : {false, true}) {
            const Triangle t{uplo, trans, "N", n, 37, 40};
            const Form form = solves ? Form::tbsv : Form::tbmv;
            const std::vector<T> a = triangle_numbers<T>(form, t, 2);
            std::vector<T> x = numbers<T>(n, 1), general = x;
            call(form, tier, t, a.data(), x.data(), 1);
            call(solves ? Form::general_tbsv : Form::general_tbmv, tier, t, a.data(), general.data(), 1);
            const BandRoutine routine = single ? (solves ? BandRoutine::ctbsv : BandRoutine::ctbmv)
                                               : (solves ? BandRoutine::ztbsv : BandRoutine::ztbmv);
            const bool is_general =
                takes_general_form(routine, static_cast<ProcessorTier>(tier), {*uplo == 'U', false, n, t.k});
            EXPECT_EQ(same(x, general), is_general) << tier_name(tier) << uplo << trans << " n " << n << solves;
          }
  });
}

// Of order 2000 with 501 diagonals, where ssse3 and sse42 return to the general form.
TYPED_TEST(Forms, a_wide_band_of_order_2000_has_the_same_product_in_both_forms) {
  using T = TypeParam;
  const Triangle t{"L", "N", "N", 2000, 501, 502};
  const std::vector<T> a = numbers<T>(t.n * t.lda, 1), before = numbers<T>(t.n, 2);
  std::vector<double> gauge(static_cast<std::size_t>(t.n));
  const auto size = [](T v) { return std::fabs(double(v.re)) + std::fabs(double(v.im)); };
  for (QtbInt j = 0; j < t.n; ++j)
    for (QtbInt i = j; i < std::min(t.n, j + t.k + 1); ++i)
      gauge[static_cast<std::size_t>(i)] +=
          size(a[static_cast<std::size_t>(i - j + j * t.lda)]) * size(before[static_cast<std::size_t>(j)]);
  in_every_tier([&](int tier) {
    std::vector<T> x = before, general = before;
    call(Form::tbmv, tier, t, a.data(), x.data(), 1);
    call(Form::general_tbmv, tier, t, a.data(), general.data(), 1);
    const double c = 2 * reference::roundings<T>(t.k + 1, 2, 4);
    for (std::size_t i = 0; i < x.size(); ++i)
      ASSERT_LE(error_ratio(x[i], widen(general[i]), Quad(gauge[i]), c), 1) << tier_name(tier) << i;
  });
}

// ---- The table ----

struct Row {
  BandRoutine routine;
  char uplo, trans;
  QtbInt n, k;
  bool ssse3, sse42;  // whether these take the general form
};

TEST(BandForms, ssse3_and_sse42_choose_by_order_width_and_options) {
  constexpr BandRoutine cmv = BandRoutine::ctbmv, csv = BandRoutine::ctbsv, zmv = BandRoutine::ztbmv,
                        zsv = BandRoutine::ztbsv;
  const Row rows[] = {
      // ctbmv on ssse3: short, "U" with "N" up to 255, wide; on sse42: "U", short with "N", wide.
      {cmv, 'U', 'N', 63, 5, true, true},
      {cmv, 'U', 'N', 64, 5, true, true},
      {cmv, 'U', 'N', 255, 5, true, true},
      {cmv, 'U', 'N', 256, 5, false, true},
      {cmv, 'U', 'T', 63, 5, true, true},
      {cmv, 'U', 'T', 64, 5, false, true},
      {cmv, 'U', 'C', 63, 5, true, true},
      {cmv, 'U', 'C', 64, 5, false, true},
      {cmv, 'L', 'N', 63, 5, true, true},
      {cmv, 'L', 'N', 64, 5, false, false},
      {cmv, 'L', 'N', 255, 5, false, false},
      {cmv, 'L', 'T', 63, 5, true, false},
      {cmv, 'L', 'T', 64, 5, false, false},
      {cmv, 'L', 'C', 1, 0, true, false},
      {cmv, 'L', 'C', 63, 5, true, false},
      {cmv, 'L', 'N', 1000, 501, false, false},
      {cmv, 'L', 'N', 1001, 500, false, false},
      {cmv, 'L', 'N', 1001, 501, true, true},
      {cmv, 'L', 'C', 2000, 501, true, true},
      {cmv, 'U', 'T', 1000, 501, false, true},
      {cmv, 'U', 'T', 1001, 501, true, true},
      {cmv, 'U', 'N', 1001, 500, false, true},
      // ctbsv: short, "N" up to 255, wide.
      {csv, 'U', 'N', 63, 5, true, true},
      {csv, 'U', 'N', 255, 5, true, true},
      {csv, 'U', 'N', 256, 5, false, false},
      {csv, 'L', 'N', 64, 5, true, true},
      {csv, 'L', 'N', 255, 5, true, true},
      {csv, 'L', 'N', 256, 5, false, false},
      {csv, 'U', 'T', 63, 5, true, true},
      {csv, 'U', 'T', 64, 5, false, false},
      {csv, 'L', 'C', 63, 5, true, true},
      {csv, 'L', 'C', 64, 5, false, false},
      {csv, 'L', 'C', 1000, 501, false, false},
      {csv, 'L', 'C', 1001, 500, false, false},
      {csv, 'L', 'C', 1001, 501, true, true},
      {csv, 'U', 'N', 1001, 501, true, true},
      // ztbmv: short, twice as long on sse42; width counts for nothing.
      {zmv, 'U', 'N', 63, 5, true, true},
      {zmv, 'U', 'N', 64, 5, false, true},
      {zmv, 'L', 'T', 64, 5, false, true},
      {zmv, 'L', 'C', 127, 5, false, true},
      {zmv, 'L', 'C', 128, 5, false, false},
      {zmv, 'U', 'N', 2000, 600, false, false},
      // ztbsv: short, wide.
      {zsv, 'U', 'N', 63, 5, true, true},
      {zsv, 'U', 'N', 64, 5, false, false},
      {zsv, 'L', 'T', 63, 5, true, true},
      {zsv, 'L', 'C', 64, 5, false, false},
      {zsv, 'L', 'C', 1000, 501, false, false},
      {zsv, 'L', 'C', 1001, 500, false, false},
      {zsv, 'L', 'C', 1001, 501, true, true},
  };
  for (const Row &row : rows) {
    const BandCall c{row.uplo == 'U', row.trans == 'N', row.n, row.k};
    const auto what = [&] {
      return std::string(1, row.uplo) + row.trans + " n " + std::to_string(row.n) + " k " + std::to_string(row.k) +
             " routine " + std::to_string(int(row.routine));
    };
    EXPECT_EQ(takes_general_form(row.routine, tier_ssse3, c), row.ssse3) << what();
    EXPECT_EQ(takes_general_form(row.routine, tier_sse42, c), row.sse42) << what();
  }
}

TEST(BandForms, def_and_sse3_have_the_general_form_alone_and_avx_never_takes_it) {
  for (const BandRoutine routine : {BandRoutine::ctbmv, BandRoutine::ctbsv, BandRoutine::ztbmv, BandRoutine::ztbsv})
    for (const bool upper : {false, true})
      for (const bool plain : {false, true})
        for (const QtbInt n : {0, 1, 63, 64, 127, 128, 255, 256, 1000, 1001, 5000})
          for (const QtbInt k : {0, 1, 500, 501, 4000}) {
            const BandCall c{upper, plain, n, k};
            EXPECT_TRUE(takes_general_form(routine, tier_def, c));
            EXPECT_TRUE(takes_general_form(routine, tier_sse3, c));
            EXPECT_FALSE(takes_general_form(routine, tier_avx, c));
          }
}

}  // namespace
}  // namespace qtb::test
