// trmm and trsm of the tiers with level tables, case by case: whole numbers under every option, which leave no room for
// an error; what is never read or written; which kernel does a block, as the buffers and the products that it asks for
// tell; walks over tables of the test's own; what a call asks of the memory service.
#include <gtest/gtest.h>

#include <cmath>
#include <complex>

#include "blas/kernels/level3/triangular/levels.h"
#include "tests/kernels/level3/buffer_memory.h"
#include "tests/kernels/level3/pieces.h"

namespace {
int products = 0;  // calls of the sse42 product of doubles
}

extern "C" {
QTB_FUNCTION(gemm, double, __real_qtb_blas_sse42_xdgemm);
QTB_FUNCTION(gemm, double, __wrap_qtb_blas_sse42_xdgemm) {
  products++;
  __real_qtb_blas_sse42_xdgemm(QTB_ARGS(gemm));
}
#define DECLARE_LEVELS(tier, t, T)                                               \
  QTB_HIDDEN void qtb_blas_##tier##_x##t##trmm_level_left(QTB_LEVEL_PARAMS(T));  \
  QTB_HIDDEN void qtb_blas_##tier##_x##t##trmm_level_right(QTB_LEVEL_PARAMS(T)); \
  QTB_HIDDEN void qtb_blas_##tier##_x##t##trsm_level_left(QTB_LEVEL_PARAMS(T));  \
  QTB_HIDDEN void qtb_blas_##tier##_x##t##trsm_level_right(QTB_LEVEL_PARAMS(T));
DECLARE_LEVELS(sse42, s, float)
DECLARE_LEVELS(sse42, d, double)
DECLARE_LEVELS(sse42, c, cfloat)
DECLARE_LEVELS(sse42, z, cdouble)
#undef DECLARE_LEVELS
}

namespace qtb::test {
namespace {

using levels::TriLevel;
using Number = std::complex<double>;

template <class T>
struct Procedures {
  using Whole = QTB_FUNCTION_TYPE(trmm, T);
  using Walk = void(QTB_LEVEL_PARAMS(T));
  Whole *trmm[tier_count], *trsm[tier_count];
  Walk *left[2], *right[2];  // of sse42, trmm and trsm
};
template <class T>
const Procedures<T> procedures{};
#define PROCEDURES(t, T)                                                                                          \
  template <>                                                                                                     \
  const Procedures<T> procedures<T>{QTB_ALL_TIERS(t##trmm),                                                       \
                                    QTB_ALL_TIERS(t##trsm),                                                       \
                                    {qtb_blas_sse42_x##t##trmm_level_left, qtb_blas_sse42_x##t##trsm_level_left}, \
                                    {qtb_blas_sse42_x##t##trmm_level_right, qtb_blas_sse42_x##t##trsm_level_right}};
PROCEDURES(s, float)
PROCEDURES(d, double)
PROCEDURES(c, cfloat)
PROCEDURES(z, cdouble)
#undef PROCEDURES

struct Form {
  bool left, upper;
  int op;  // of letters
  bool unit;
  const char *side() const { return left ? "L" : "R"; }
  const char *uplo() const { return upper ? "U" : "L"; }
  const char *trans() const { return &letters[op]; }
  const char *diag() const { return unit ? "U" : "N"; }
};
constexpr int form_count = 24;
Form form_of(int number) { return {number % 2 == 0, number / 2 % 2 == 0, number / 4 % 3, number >= 12}; }

std::ostream &operator<<(std::ostream &out, const Form &form) {
  return out << form.side() << form.uplo() << *form.trans() << form.diag();
}

template <class T>
T element(Number v) {
  return value<T>(v.real(), v.imag());
}

// op(T)*X or X*op(T) on whole numbers: the triangle as it is stored, with signalling NaNs where nothing may be read,
// and X and its product. A diagonal element is a power of two along an axis, so that a solve is exact, too.
template <class T>
struct System {
  Form form;
  QtbInt m, n, order, lda, ldb;
  Guarded<T> a, b;
  std::vector<Number> x, product;

  System(const Form &f, QtbInt rows, QtbInt columns)
      : form(f),
        m(rows),
        n(columns),
        order(f.left ? rows : columns),
        lda(order + 1),
        ldb(rows + 2),
        a(static_cast<std::size_t>(lda * (order - 1) + order)),
        b(static_cast<std::size_t>(ldb * (n - 1) + m)),
        x(static_cast<std::size_t>(m * n)),
        product(x.size()) {
    const bool complex = is_complex<T>;
    std::vector<Number> full(static_cast<std::size_t>(order * order));
    const auto draw_part = [] { return static_cast<double>(generator() % 3) - 1; };
    for (QtbInt e = 0; e < static_cast<QtbInt>(a.size()); e++) store_signalling_nan<T>(a.data() + e);
    for (QtbInt j = 0; j < order; j++)
      for (QtbInt i = 0; i < order; i++) {
        if (i != j && (i < j) != form.upper) continue;
        Number v{draw_part(), complex ? draw_part() : 0};
        if (i == j) {
          static const Number axes[] = {{1, 0}, {-2, 0}, {0, 1}, {0, -2}};
          v = form.unit ? Number{1, 0} : axes[generator() % (complex ? 4 : 2)];
        }
        const Number op_v = form.op == 2 && complex ? std::conj(v) : v;
        full[static_cast<std::size_t>(form.op == 0 ? i + j * order : j + i * order)] = op_v;
        if (i != j || !form.unit) a[static_cast<std::size_t>(i + j * lda)] = element<T>(v);
      }
    for (Number &v : x) v = {draw_part(), complex ? draw_part() : 0};
    for (QtbInt j = 0; j < n; j++)
      for (QtbInt i = 0; i < m; i++)
        for (QtbInt l = 0; l < order; l++)
          product[at(i, j)] += form.left ? full[static_cast<std::size_t>(i + l * order)] * x[at(l, j)]
                                         : x[at(i, l)] * full[static_cast<std::size_t>(l + j * order)];
  }
  std::size_t at(QtbInt i, QtbInt j) const { return static_cast<std::size_t>(i + j * m); }

  void put(const std::vector<Number> &v) {
    for (QtbInt e = 0; e < static_cast<QtbInt>(b.size()); e++) store_signalling_nan<T>(b.data() + e);
    for (QtbInt j = 0; j < n; j++)
      for (QtbInt i = 0; i < m; i++) b[static_cast<std::size_t>(i + j * ldb)] = element<T>(v[at(i, j)]);
  }
  void expect(const std::vector<Number> &want, Number factor, const std::string &what) {
    for (QtbInt j = 0; j < n; j++)
      for (QtbInt i = 0; i < m; i++) {
        const T got = b[static_cast<std::size_t>(i + j * ldb)], w = element<T>(factor * want[at(i, j)]);
        bool same = false;
        if constexpr (is_complex<T>)
          same = got.re == w.re && got.im == w.im;
        else
          same = got == w;
        ASSERT_TRUE(same) << what << " " << form << " (" << i << ", " << j << ") of " << m << " x " << n;
      }
    T between{};
    store_signalling_nan<T>(&between);
    for (QtbInt j = 0; j + 1 < n; j++)
      for (QtbInt i = m; i < ldb; i++)
        ASSERT_TRUE(same_bits(b[static_cast<std::size_t>(i + j * ldb)], between)) << what << " wrote between columns";
  }
};

template <class T>
class Triangular : public Seeded {
 protected:
  static void SetUpTestSuite() { become_processor(); }
  void TearDown() override {
    EXPECT_EQ(buffer_memory.outstanding, 0) << "a call keeps a buffer";
    buffer_memory.requests.clear();
    buffer_memory.is_out = false;
  }
  // f(tier) for each tier with level tables.
  template <class F>
  void in_tiers(F f) {
    in_every_tier([&](int tier) {
      if (tier >= tier_ssse3 && (!has_sse41() || tier == tier_ssse3) && !this->HasFatalFailure()) f(tier);
    });
  }
  void trmm(int tier, System<T> &s, T alpha) { run(procedures<T>.trmm[tier], s, alpha); }
  void trsm(int tier, System<T> &s, T alpha) { run(procedures<T>.trsm[tier], s, alpha); }

  // Whether the buffers of a call are written to.
  template <class Call>
  bool packs(Call call) {
    buffer_memory.idle.clear();
    call();
    for (const auto &[bytes, buffers] : buffer_memory.idle)
      for (const auto &buffer : buffers)
        for (std::size_t i = 0; i < buffer->size(); i++)
          if ((*buffer)[i] != 0xFF) return true;
    return false;
  }

 private:
  void run(typename Procedures<T>::Whole *procedure, System<T> &s, T alpha) {
    const FiniteOnly finite_only;
    procedure(s.form.side(), s.form.uplo(), s.form.trans(), s.form.diag(), &s.m, &s.n, &alpha, s.a.data(), &s.lda,
              s.b.data(), &s.ldb);
  }
};
using Types = testing::Types<float, double, cfloat, cdouble>;
TYPED_TEST_SUITE(Triangular, Types);

// ---- Results ----

TYPED_TEST(Triangular, WholeNumbersAreExactAndNothingElseIsRead) {
  using T = TypeParam;
  const T one = value<T>(1, 0), factor = value<T>(-2, 0);
  for (const QtbInt order : {1, 2, 3, 4, 5, 7, 8, 9, 12, 16, 17, 20, 31, 32, 33, 65})
    for (const QtbInt other : {1, 3, 4, 5, 8, 9, 18})
      for (int number = static_cast<int>(order + other) % 5; number<form_count; number += order> 20 ? 5 : 1) {
        const Form form = form_of(number);
        System<T> s(form, form.left ? order : other, form.left ? other : order);
        this->in_tiers([&](int tier) {
          s.put(s.x);
          this->trmm(tier, s, factor);
          s.expect(s.product, -2, std::string("trmm of ") + tier_name(tier));
          s.put(s.product);
          this->trsm(tier, s, one);
          s.expect(s.x, 1, std::string("trsm of ") + tier_name(tier));
        });
        if (this->HasFatalFailure()) return;
      }
}

TYPED_TEST(Triangular, AnAlphaOfZeroZeroesBAndReadsNeither) {
  using T = TypeParam;
  const T zero = value<T>(0, 0);
  for (int number = 0; number < form_count; number++)
    for (const QtbInt size : {1, 3, 8, 9, 40}) {
      System<T> s(form_of(number), size, size + 1);
      s.a.unreadable();
      this->in_tiers([&](int tier) {
        for (const bool solves : {false, true}) {
          s.put(s.x);
          for (QtbInt j = 0; j < s.n; j++)
            for (QtbInt i = 0; i < s.m; i++) store_signalling_nan<T>(s.b.data() + i + j * s.ldb);
          solves ? this->trsm(tier, s, zero) : this->trmm(tier, s, zero);
          s.expect(s.x, 0, tier_name(tier));
        }
      });
    }
}

TYPED_TEST(Triangular, AnEmptyBIsLeftAlone) {
  using T = TypeParam;
  const T zero = value<T>(0, 0);
  T b = value<T>(3, 0);
  for (const QtbInt m : {0, -1, 5})
    for (const QtbInt n : {0, -1, 5}) {
      if (m == 5 && n == 5) continue;
      const QtbInt ld = 5;
      this->in_tiers([&](int tier) {
        for (const auto procedure : {procedures<T>.trmm[tier], procedures<T>.trsm[tier]})
          procedure("L", "U", "N", "N", &m, &n, &zero, nullptr, &ld, &b, &ld);
      });
      EXPECT_TRUE(same_bits(b, value<T>(3, 0)));
      EXPECT_TRUE(buffer_memory.requests.empty());
    }
}

TYPED_TEST(Triangular, AZeroOnTheDiagonalGivesNothingFiniteInItsRow) {
  using T = TypeParam;
  const T one = value<T>(1, 0);
  for (int number = 0; number < form_count; number++) {
    const Form form = form_of(number);
    if (form.unit) continue;
    for (const QtbInt order : {1, 3, 4, 8, 9, 33})
      for (QtbInt hole : {QtbInt{0}, order / 2, order - 1}) {
        System<T> s(form, form.left ? order : 5, form.left ? 5 : order);
        s.a[static_cast<std::size_t>(hole + hole * s.lda)] = value<T>(0, 0);
        // A solve has come to the rows before the hole, in its own order, and they are right.
        const bool up = levels::walks_up(levels::Routine::trsm, form.left, form.upper, form.op == 0);
        this->in_tiers([&](int tier) {
          s.put(s.product);
          procedures<T>.trsm[tier](form.side(), form.uplo(), form.trans(), form.diag(), &s.m, &s.n, &one, s.a.data(),
                                   &s.lda, s.b.data(), &s.ldb);
          for (QtbInt r = 0; r < order; r++)
            for (QtbInt e = 0; e < 5; e++) {
              const QtbInt i = form.left ? r : e, j = form.left ? e : r;
              const T got = s.b[static_cast<std::size_t>(i + j * s.ldb)], want = element<T>(s.x[s.at(i, j)]);
              bool finite = false, right = false;
              if constexpr (is_complex<T>) {
                finite = std::isfinite(got.re) && std::isfinite(got.im);
                right = got.re == want.re && got.im == want.im;
              } else {
                finite = std::isfinite(got), right = got == want;
              }
              ASSERT_TRUE(r != hole || !finite) << tier_name(tier) << " " << form << " row " << r;
              ASSERT_TRUE(r == hole || (r < hole) != up || right) << tier_name(tier) << " " << form << " row " << r;
            }
        });
      }
  }
}

// ---- Which kernel does a block ----

TYPED_TEST(Triangular, ARightProductOfEightColumnsIsSmallAndOneOfNineIsWalked) {
  using T = TypeParam;
  for (const bool upper : {true, false}) {
    System<T> eight({false, upper, 0, false}, 40, 8), nine({false, upper, 0, false}, 40, 9);
    this->in_tiers([&](int tier) {
      eight.put(eight.x), nine.put(nine.x);
      EXPECT_FALSE(this->packs([&] { this->trmm(tier, eight, value<T>(1, 0)); })) << tier_name(tier);
      // A complex block of eight columns is small, and the product beside it, of one column, packs nothing either.
      const bool packs = !is_complex<T> || tier == tier_ssse3;
      EXPECT_EQ(this->packs([&] { this->trmm(tier, nine, value<T>(1, 0)); }), packs) << tier_name(tier);
      eight.expect(eight.product, 1, tier_name(tier));
      nine.expect(nine.product, 1, tier_name(tier));
    });
  }
}

TYPED_TEST(Triangular, ARightProductOfOneColumnByOneReturnsAtOnce) {
  using T = TypeParam;
  System<T> s({false, true, 0, true}, 40, 1);
  s.put(s.x);
  s.b.read_only();
  this->in_tiers([&](int tier) { this->trmm(tier, s, value<T>(1, 0)); });
  s.b.writable();
  s.expect(s.x, 1, "one");
}

// Rows that make no tile are divided by the diagonal; a tile's are multiplied by its reciprocals.
TYPED_TEST(Triangular, ASolveOfThreeRowsGoesStraightToTheUnblockedSolver) {
  using T = TypeParam;
  using R = Real<T>;
  const R divisor = 49, dividend = 5;
  ASSERT_NE(dividend / divisor, dividend * (1 / divisor));
  for (const QtbInt m : {3, 4}) {
    System<T> s({true, true, 0, false}, m, 4);
    for (QtbInt j = 0; j < m; j++)
      for (QtbInt i = 0; i <= j; i++)
        s.a[static_cast<std::size_t>(i + j * s.lda)] = i == j ? value<T>(49, 0) : value<T>(0, 0);
    this->in_tiers([&](int tier) {
      s.put(std::vector<Number>(s.x.size(), Number{5, 0}));
      EXPECT_EQ(this->packs([&] { this->trsm(tier, s, value<T>(1, 0)); }), m == 4) << tier_name(tier);
      for (QtbInt j = 0; j < s.n; j++)
        for (QtbInt i = 0; i < m; i++) {
          const R want = m == 3 ? dividend / divisor : dividend * (1 / divisor);
          ASSERT_EQ(reinterpret_cast<const R &>(s.b[static_cast<std::size_t>(i + j * s.ldb)]), want) << tier_name(tier);
        }
    });
  }
}

TEST(TriangularBlocks, AnOrderOfTheLastLevelIsOneBlock) {
  become_processor();
  struct Row {
    bool solves, left;
    QtbInt last;
  };
  if (!processor_runs(tier_sse42)) GTEST_SKIP();
  for (const Row &row : {Row{true, true, 32}, Row{true, false, 32}, Row{false, true, 64}, Row{false, false, 16}})
    for (const QtbInt order : {row.last - 1, row.last, row.last + 1}) {
      const Form form{row.left, true, 0, false};
      System<double> s(form, row.left ? order : 20, row.left ? 20 : order);
      s.put(s.product);
      products = 0;
      const double one = 1;
      (row.solves ? qtb_blas_sse42_xdtrsm : qtb_blas_sse42_xdtrmm)(form.side(), "U", "N", "N", &s.m, &s.n, &one,
                                                                   s.a.data(), &s.lda, s.b.data(), &s.ldb);
      EXPECT_EQ(products, order > row.last ? 1 : 0) << form << " of order " << order;
    }
}

// ---- Walks ----

TYPED_TEST(Triangular, WalksOverAnyTableAgree) {
  using T = TypeParam;
  if (!processor_runs(tier_sse42)) GTEST_SKIP();
  struct Table {
    QtbInt blocks[3];
    QtbInt last, step;
  };
  constexpr Table tables[] = {{{7}, 0, levels::whole}, {{100, 9, 4}, 2, 5}, {{12, 5}, 1, 6}, {{8, 8, 3}, 2, 1}};
  constexpr std::size_t bytes = 1 << 16;
  Guarded<unsigned char> buffer_a(bytes), buffer_b(bytes);
  const T one = value<T>(1, 0), factor = value<T>(-1, 0);
  for (const Table &table : tables)
    for (int number = 0; number < form_count; number++)
      for (const QtbInt order : {7, 8, 23, 30})
        for (const bool has_buffers : {true, false}) {
          const Form form = form_of(number);
          System<T> s(form, form.left ? order : 13, form.left ? 13 : order);
          const bool not_trans = form.op == 0, is_transpose = form.op == 1;
          for (const bool solves : {false, true}) {
            const auto routine = solves ? levels::Routine::trsm : levels::Routine::trmm;
            TriLevel<T> rows[3];
            for (int l = 0; l < 3; l++)
              rows[l] = {table.blocks[l], table.step, levels::gemm_comes_first(routine, form.left, not_trans),
                         has_buffers ? reinterpret_cast<T *>(buffer_a.data()) : nullptr,
                         has_buffers ? reinterpret_cast<T *>(buffer_b.data()) : nullptr};
            const T alpha = solves || form.left ? one : factor;
            const QtbInt first = 0;
            s.put(solves ? s.product : s.x);
            const auto walk = (form.left ? procedures<T>.left : procedures<T>.right)[solves];
            walk(&not_trans, &form.upper, &is_transpose, form.diag(), &s.m, &s.n, &alpha, s.a.data(), &s.lda,
                 s.b.data(), &s.ldb, &first, &table.last, rows);
            s.expect(solves ? s.x : s.product, solves || form.left ? 1 : -1, solves ? "solve" : "product");
            if (this->HasFatalFailure()) return;
          }
        }
}

// ---- Memory ----

TYPED_TEST(Triangular, WithoutMemoryTheResultIsTheSame) {
  using T = TypeParam;
  buffer_memory.is_out = true;
  for (int number = 0; number < form_count; number++)
    for (const QtbInt order : {4, 9, 33}) {
      const Form form = form_of(number);
      System<T> s(form, form.left ? order : 6, form.left ? 6 : order);
      this->in_tiers([&](int tier) {
        s.put(s.x);
        this->trmm(tier, s, value<T>(2, 0));
        s.expect(s.product, 2, std::string("trmm of ") + tier_name(tier));
        s.put(s.product);
        this->trsm(tier, s, value<T>(1, 0));
        s.expect(s.x, 1, std::string("trsm of ") + tier_name(tier));
      });
    }
}

// Of the double products' regions, those of the tiers with fixed ones hold any blocks; avx has room for mb + nb by kb.
TEST(TriangularRequests, DoublePrecision) {
  become_processor();
  constexpr std::uint64_t avx = 128 * 8 * (640 + 1000) + 128 * 128 + 21760,
                          avx_solve = 256 * 8 * (512 + 1000) + 256 * 128 + 21760;
  struct Row {
    int tier;
    std::uint64_t trmm, trsm;
  };
  for (const Row &row :
       {Row{tier_ssse3, 21566720, 21566720}, Row{tier_sse42, 11588864, 11588864}, Row{tier_avx, avx, avx_solve}}) {
    if (!processor_runs(row.tier) || (has_sse41() && row.tier != tier_ssse3)) continue;
    for (const bool left : {true, false}) {
      System<double> s({left, true, 0, false}, 5, 5);
      s.put(s.x);
      const double one = 1;
      for (const bool solves : {false, true}) {
        buffer_memory.requests.clear();
        (solves ? procedures<double>.trsm : procedures<double>.trmm)[row.tier](
            s.form.side(), "U", "N", "N", &s.m, &s.n, &one, s.a.data(), &s.lda, s.b.data(), &s.ldb);
        ASSERT_EQ(buffer_memory.requests.size(), 1U);
        EXPECT_EQ(buffer_memory.requests[0], solves ? row.trsm : row.trmm) << tier_name(row.tier);
      }
    }
  }
}

}  // namespace
}  // namespace qtb::test
