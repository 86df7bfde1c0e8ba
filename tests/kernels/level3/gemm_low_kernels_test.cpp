// The inner kernels of GEMM that def and sse3 alone have, each form alone: beta in the kernel, fixed depths, edges of
// rows and columns, A and B where their caller has them. A trapping page lies behind each operand and the stage,
// signalling NaNs fill what belongs to no operand, and invalid operations trap.
#include <vector>

#include "tests/kernels/level3/pieces.h"
#include "tests/reference/level3.h"

namespace qtb::test {
namespace {

#define INNER_PARAMS(T) \
  QtbInt m, QtbInt n, QtbInt kp, const T *ap, QtbInt ldap, const T *bp, QtbInt ldbp, T *c, QtbInt ldc, T *stage
#define EDGE_PARAMS                                                                                              \
  QtbInt m, QtbInt n, QtbInt k, const double *a, QtbInt lda, const double *b, QtbInt ldb, double *c, QtbInt ldc, \
      const double *alpha, const double *beta

template <class T>
using AddingKernel = void(INNER_PARAMS(T));
template <class T>
using BetaKernel = void(INNER_PARAMS(T), const Real<T> *beta);
using EdgeKernel = void(EDGE_PARAMS);

extern "C" {
// clang-format off
#define FOLDING(tier, T, t, fixed)                                       \
  QTB_HIDDEN AddingKernel<T> qtb_blas_##tier##_##t##gemm_kernel;         \
  QTB_HIDDEN AddingKernel<T> qtb_blas_##tier##_##t##gemm_kernel_##fixed; \
  QTB_HIDDEN AddingKernel<T> qtb_blas_##tier##_##t##gemm_kernel_0;       \
  QTB_HIDDEN BetaKernel<T> qtb_blas_##tier##_##t##gemm_kernel_b;
FOLDING(def, float, s, 112)
FOLDING(def, cfloat, c, 64)
FOLDING(def, cdouble, z, 64)
FOLDING(sse3, float, s, 112)
FOLDING(sse3, cfloat, c, 64)
FOLDING(sse3, cdouble, z, 64)
#undef FOLDING
QTB_HIDDEN AddingKernel<double> qtb_blas_def_dgemm_kernel;
QTB_HIDDEN AddingKernel<double> qtb_blas_def_dgemm_kernel_128;
QTB_HIDDEN void qtb_blas_def_dgemm_def_kernel_in_place(bool transb, QtbInt m, QtbInt n, QtbInt depth, const double *ap,
                                                       QtbInt ldap, const double *b, QtbInt ldb, double *c, QtbInt ldc,
                                                       double *room);
#define EDGE_KERNELS(X) \
  X(a112) X(a112e) X(ak) X(ak_b) X(ak_0) X(n112) X(t112) X(nk) X(tk) X(nk_b) X(tk_b) X(nk_0) X(tk_0)
#define DECLARE(name) QTB_HIDDEN EdgeKernel qtb_blas_sse3_dgemm_kernel_##name;
EDGE_KERNELS(DECLARE)
#undef DECLARE
}

enum class Beta { one, zero, other };
template <class T>
T beta_value(Beta beta) {
  return beta == Beta::one ? value<T>(1, 0) : beta == Beta::zero ? value<T>(0, 0) : value<T>(-0.75, 0.5);
}

template <class T>
struct Form {
  std::string name;
  int tier;
  QtbInt mr, nr;
  QtbInt column_step;  // n is a multiple of it
  QtbInt fixed_depth;  // 0: any
  QtbInt stage_bytes_per_k;
  Beta beta;
  AddingKernel<T> *adding;
  BetaKernel<T> *with_beta;
};

#define FOLDING(tier, T, t, mr, depth, stage)                                                                          \
  {#t "gemm_kernel", tier_##tier, mr, 4, 1, 0, stage, Beta::one, qtb_blas_##tier##_##t##gemm_kernel, nullptr},         \
      {#t "gemm_kernel_" #depth,                                                                                       \
       tier_##tier,                                                                                                    \
       mr,                                                                                                             \
       4,                                                                                                              \
       1,                                                                                                              \
       depth,                                                                                                          \
       stage,                                                                                                          \
       Beta::one,                                                                                                      \
       qtb_blas_##tier##_##t##gemm_kernel_##depth,                                                                     \
       nullptr},                                                                                                       \
      {#t "gemm_kernel_0", tier_##tier, mr, 4, 1, 0, stage, Beta::zero,                                                \
       qtb_blas_##tier##_##t##gemm_kernel_0, nullptr},                                                                 \
  {                                                                                                                    \
#t "gemm_kernel_b", tier_##tier, mr, 4, 1, 0, stage, Beta::other, nullptr, qtb_blas_##tier##_##t##gemm_kernel_b     \
  }
template <class T>
const std::vector<Form<T>> forms;
template <>
const std::vector<Form<float>> forms<float> = {FOLDING(def, float, s, 8, 112, 64), FOLDING(sse3, float, s, 8, 112, 64)};
template <>
const std::vector<Form<double>> forms<double> = {
    {"dgemm_kernel", tier_def, 2, 12, 4, 0, 192, Beta::one, qtb_blas_def_dgemm_kernel, nullptr},
    {"dgemm_kernel_128", tier_def, 2, 12, 4, 128, 192, Beta::one, qtb_blas_def_dgemm_kernel_128, nullptr}};
template <>
const std::vector<Form<cfloat>> forms<cfloat> = {FOLDING(def, cfloat, c, 4, 64, 128),
                                                 FOLDING(sse3, cfloat, c, 4, 64, 128)};
template <>
const std::vector<Form<cdouble>> forms<cdouble> = {FOLDING(def, cdouble, z, 2, 64, 128),
                                                   FOLDING(sse3, cdouble, z, 2, 64, 128)};
#undef FOLDING

template <class T>
void fill_with_signalling_nan(Guarded<T> &array) {
  for (std::size_t e = 0; e < array.size(); e++) store_signalling_nan<T>(&array[e]);
}

// op(A) or op(B) in plain order: element (i, j) of rows x cols.
template <class T>
struct Plain {
  QtbInt rows;
  std::vector<T> element;
  Plain(QtbInt r, QtbInt c) : rows(r) {
    for (QtbInt e = 0; e < r * c; e++) element.push_back(draw<T>());
  }
  T at(QtbInt i, QtbInt j) const { return element[static_cast<std::size_t>(i + j * rows)]; }
};

// The panel of A: micro-panels of mr rows, the last filled up with zeros; ldp apart.
template <class T>
void pack_a(const Plain<T> &a, QtbInt m, QtbInt mr, QtbInt kp, QtbInt ldp, Guarded<T> &panel) {
  fill_with_signalling_nan(panel);
  for (QtbInt i = 0; i < (m + mr - 1) / mr * mr; i++)
    for (QtbInt l = 0; l < kp; l++)
      panel[static_cast<std::size_t>(i / mr * ldp + l * mr + i % mr)] = i < m ? a.at(i, l) : T{};
}

QtbInt width_of(QtbInt nr, QtbInt left) { return left >= nr ? nr : left >= 8 ? 8 : left >= 4 ? 4 : left; }

template <class T>
void pack_b(const Plain<T> &b, QtbInt n, QtbInt nr, QtbInt kp, QtbInt ldp, Guarded<T> &panel) {
  fill_with_signalling_nan(panel);
  QtbInt q = 0;
  for (QtbInt j0 = 0, w; j0 < n; j0 += w, q++) {
    w = width_of(nr, n - j0);
    for (QtbInt l = 0; l < kp; l++)
      for (QtbInt j = 0; j < w; j++) panel[static_cast<std::size_t>(q * ldp + l * w + j)] = b.at(l, j0 + j);
  }
}

// The size of a panel of so many rows or columns, the last micro-panel of as many as there are.
QtbInt panel_elements(QtbInt count, QtbInt width, QtbInt kp, QtbInt ldp, bool filled) {
  const QtbInt last = (count - 1) / width;
  QtbInt left = count - last * width, at = last * ldp;
  if (filled) return at + width * kp;
  while (left > width_of(width, left)) {
    left -= width_of(width, left);
    at += ldp;
  }
  return at + left * kp;
}

template <class T>
struct Columns {
  QtbInt m, n, ldc;
  Guarded<T> before, now;
  Columns(QtbInt rows, QtbInt columns, QtbInt spare, Beta beta)
      : m(rows), n(columns), ldc(rows + spare), before(size()), now(size()) {
    fill_with_signalling_nan(before);
    if (beta != Beta::zero)
      for (QtbInt e = 0; e < static_cast<QtbInt>(size()); e++)
        if (e % ldc < m) before[static_cast<std::size_t>(e)] = draw<T>();
    std::memcpy(now.data(), before.data(), size() * sizeof(T));
  }
  std::size_t size() const { return static_cast<std::size_t>((n - 1) * ldc + m); }
};

// C against beta*C + alpha*A*B; the worst error over its bound. What lies between the columns keeps its bits.
template <class T>
double worst_error(const Columns<T> &c, const Plain<T> &a, const Plain<T> &b, QtbInt k, T alpha, Beta beta) {
  const reference::Expectation want =
      reference::gemm('N', 'N', c.m, c.n, k, alpha, a.element.data(), a.rows, b.element.data(), b.rows,
                      beta_value<T>(beta), c.before.data(), c.ldc);
  double worst = 0;
  for (QtbInt j = 0; j < c.n; j++)
    for (QtbInt i = 0; i < c.ldc; i++) {
      const QtbInt e = i + j * c.ldc;
      if (e >= static_cast<QtbInt>(c.size())) break;
      const std::size_t at = static_cast<std::size_t>(e);
      if (i < c.m)
        worst = std::fmax(worst, error_ratio(c.now[at], want.at(i, j).value, want.at(i, j).gauge, want.roundings));
      else
        EXPECT_TRUE(same_bits(c.now[at], c.before[at])) << "wrote between the columns of C";
    }
  return worst;
}

// beta as a kernel gets it: in all lanes of a vector; of a complex type the imaginary part in a second one, with
// alternating signs in that of a cdouble.
template <class T>
struct Lanes {
  alignas(16) Real<T> lane[32 / sizeof(Real<T>)];
  explicit Lanes(T beta) {
    constexpr int step = 16 / sizeof(Real<T>);
    const QuadComplex wide = widen(beta);
    for (int i = 0; i < step; i++) {
      lane[i] = static_cast<Real<T>>(wide.re);
      lane[step + i] = static_cast<Real<T>>(step == 2 && i == 1 ? -wide.im : wide.im);
    }
  }
};

template <class T>
class FoldingKernels : public Seeded {};
using Types = testing::Types<float, double, cfloat, cdouble>;
TYPED_TEST_SUITE(FoldingKernels, Types);

TYPED_TEST(FoldingKernels, ApplyBetaAndAddTheProductAtEveryWidthAndDepth) {
  using T = TypeParam;
  for (const Form<T> &form : forms<T>) {
    if (!processor_runs(form.tier)) continue;
    std::vector<QtbInt> depths{4, 8, 12, 60, 64, 68, 108, 112, 116, 124, 128, 228};
    if (form.fixed_depth != 0) depths = {form.fixed_depth};
    for (QtbInt n = form.column_step; n <= 2 * form.nr + 1; n += form.column_step)
      for (QtbInt m : {form.mr, 3 * form.mr})
        for (QtbInt kp : depths)
          for (QtbInt spare : {0, 1, 4}) {
            const Plain<T> a(m, kp), b(kp, n);
            const QtbInt gap = 32 / static_cast<QtbInt>(sizeof(T)), ldap = form.mr * kp + gap,
                         ldbp = form.nr * kp + gap;
            Guarded<T> ap(static_cast<std::size_t>(panel_elements(m, form.mr, kp, ldap, true)));
            Guarded<T> bp(static_cast<std::size_t>(panel_elements(n, form.nr, kp, ldbp, false)));
            Guarded<T> stage(static_cast<std::size_t>(form.stage_bytes_per_k * kp) / sizeof(T));
            pack_a(a, m, form.mr, kp, ldap, ap);
            pack_b(b, n, form.nr, kp, ldbp, bp);
            fill_with_signalling_nan(stage);
            ap.read_only();
            bp.read_only();
            Columns<T> c(m, n, spare, form.beta);
            const Lanes<T> beta(beta_value<T>(form.beta));
            {
              const FiniteOnly trap;
              if (form.adding != nullptr)
                form.adding(m, n, kp, ap.data(), ldap, bp.data(), ldbp, c.now.data(), c.ldc, stage.data());
              else
                form.with_beta(m, n, kp, ap.data(), ldap, bp.data(), ldbp, c.now.data(), c.ldc, stage.data(),
                               beta.lane);
            }
            const double worst = worst_error(c, a, b, kp, value<T>(1, 0), form.beta);
            ASSERT_LE(worst, 1) << tier_name(form.tier) << " " << form.name << " of " << m << " x " << n << " x " << kp;
            TallyReport::of(form.name.c_str()).within(form.tier, worst);
          }
  }
}

// ---- The double-precision kernels of sse3 ----

struct EdgeForm {
  const char *name;
  EdgeKernel *kernel;
  bool packed() const { return name[0] == 'a'; }
  bool transposed() const { return name[0] == 't'; }
  bool fixed() const { return name[1] == '1'; }
  bool without_edges() const { return std::string(name) == "a112"; }
  Beta beta() const {
    const std::string text = name;
    return text.ends_with("_0") ? Beta::zero : text.ends_with("_b") ? Beta::other : Beta::one;
  }
};
#define LIST(name) {#name, qtb_blas_sse3_dgemm_kernel_##name},
const EdgeForm edge_forms[] = {EDGE_KERNELS(LIST)};
#undef LIST

class EdgeKernels : public Seeded {};

// A stored rows x cols matrix with NaN between its columns, its last element before a trapping page.
void store(const Plain<double> &from, QtbInt rows, QtbInt cols, bool transposed, QtbInt ld, Guarded<double> &to) {
  fill_with_signalling_nan(to);
  for (QtbInt j = 0; j < cols; j++)
    for (QtbInt i = 0; i < rows; i++)
      to[static_cast<std::size_t>(i + j * ld)] = transposed ? from.at(j, i) : from.at(i, j);
}

TEST_F(EdgeKernels, EachFormComputesItsUpdateAtEveryEdgeAndDepth) {
  if (!processor_runs(tier_sse3)) GTEST_SKIP();
  const double factor = -1.25;
  for (const EdgeForm &form : edge_forms) {
    std::vector<QtbInt> depths{1, 2, 3, 4, 5, 7, 8, 64, 111, 112};
    if (form.packed()) depths = {4, 8, 64, 108, 112, 116, 224};
    if (form.fixed()) depths = {112};
    const QtbInt step = form.without_edges() ? 4 : 1;
    for (QtbInt m = step; m <= 13; m += step)
      for (QtbInt n = step; n <= 9; n += step)
        for (QtbInt k : depths) {
          const Plain<double> a(m, k), b(k, n);
          const bool across = form.transposed();
          const QtbInt lda = form.packed() ? 4 * k + 4 : m + m % 3, ldb = form.packed() ? 4 * k + 4
                                                                          : across      ? n + 1
                                                                                        : k + 2;
          const QtbInt columns_of_b = across ? k : n, rows_of_b = across ? n : k;
          Guarded<double> in_a(
              static_cast<std::size_t>(form.packed() ? panel_elements(m, 4, k, lda, true) : (k - 1) * lda + m));
          Guarded<double> in_b(static_cast<std::size_t>(form.packed() ? panel_elements(n, 4, k, ldb, false)
                                                                      : (columns_of_b - 1) * ldb + rows_of_b));
          if (form.packed()) {
            pack_a(a, m, 4, k, lda, in_a);
            pack_b(b, n, 4, k, ldb, in_b);
          } else {
            store(a, m, k, false, lda, in_a);
            store(b, rows_of_b, columns_of_b, across, ldb, in_b);
          }
          in_a.read_only();
          in_b.read_only();
          Columns<double> c(m, n, (m + n) % 3, form.beta());
          const Lanes<double> alpha(factor), beta(beta_value<double>(form.beta()));
          {
            const FiniteOnly trap;
            form.kernel(m, n, k, in_a.data(), lda, in_b.data(), ldb, c.now.data(), c.ldc,
                        form.packed() ? nullptr : alpha.lane, beta.lane);
          }
          const double worst = worst_error(c, a, b, k, form.packed() ? 1 : factor, form.beta());
          ASSERT_LE(worst, 1) << form.name << " of " << m << " x " << n << " x " << k;
          TallyReport::of(form.name).within(tier_sse3, worst);
        }
  }
}

// ---- The kernel of the 4 x 4 family of def that reads B in place ----

class InPlaceKernels : public Seeded {};

TEST_F(InPlaceKernels, TakeBTransposedOrNotAtDepthsThatArePadded) {
  for (bool across : {false, true})
    for (QtbInt n = 1; n <= 9; n++)
      for (QtbInt m : {4, 12})
        for (QtbInt k : {1, 2, 3, 4, 5, 130, 255, 256}) {
          const QtbInt kp = (k + 3) / 4 * 4, ldap = 4 * kp + 4, ldb = (across ? n : k) + 1;
          const QtbInt columns_of_b = across ? k : n, rows_of_b = across ? n : k;
          Plain<double> a(m, kp), b(k, n);
          for (QtbInt l = k; l < kp; l++)
            for (QtbInt i = 0; i < m; i++) a.element[static_cast<std::size_t>(i + l * m)] = 0;
          Guarded<double> ap(static_cast<std::size_t>(panel_elements(m, 4, kp, ldap, true)));
          Guarded<double> in_b(static_cast<std::size_t>((columns_of_b - 1) * ldb + rows_of_b));
          Guarded<double> stage(static_cast<std::size_t>(kp * 8));
          pack_a(a, m, 4, kp, ldap, ap);
          store(b, rows_of_b, columns_of_b, across, ldb, in_b);
          fill_with_signalling_nan(stage);
          Columns<double> c(m, n, n % 3, Beta::one);
          {
            const FiniteOnly trap;
            qtb_blas_def_dgemm_def_kernel_in_place(across, m, n, k, ap.data(), ldap, in_b.data(), ldb, c.now.data(),
                                                   c.ldc, stage.data());
          }
          const double worst = worst_error(c, a, b, k, 1.0, Beta::one);
          ASSERT_LE(worst, 1) << m << " x " << n << " x " << k << (across ? " transposed" : "");
          TallyReport::of("in_place").within(tier_def, worst);
        }
}

}  // namespace
}  // namespace qtb::test
