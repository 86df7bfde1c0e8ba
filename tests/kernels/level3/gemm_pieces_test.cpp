// The products that parallel drivers call on panels packed outside, and the scaling of C.
#include "tests/kernels/level3/gemm_families.h"

namespace qtb::test {
namespace {

template <class T>
class GemmPieces : public Seeded {
 protected:
  static int ops() { return is_complex<T> ? 3 : 2; }
};

using Types = testing::Types<float, double, cfloat, cdouble>;
TYPED_TEST_SUITE(GemmPieces, Types);

template <class T>
bool takes_panels(const Pieces<T> &p) {
  return processor_runs(p.tier) && (p.bpacked != nullptr || p.apacked != nullptr || p.packed != nullptr);
}

// Every product of a family that takes panels, at one size.
template <class T>
void expect_products(const Pieces<T> &p, int op_a, int op_b, QtbInt m, QtbInt n, QtbInt k) {
  const T scalars[][2] = {
      {value<T>(1, 0), value<T>(1, 0)}, {value<T>(-0.75, 0.5), value<T>(0.5, 0.25)}, {value<T>(2, -1), value<T>(0, 0)}};
  const T alpha = scalars[(m + n + k) % 3][0], beta = scalars[(m + n + k) % 3][1];
  const char *ta = &letters[op_a], *tb = &letters[op_b];
  Operand<T> a(op_a, m, k), b(op_b, k, n);
  Panel<T> ap = a_panel(p, m, k), bp = b_panel(p, n, k);
  const T *a0 = a.stored.array.data(), *b0 = b.stored.array.data();
  const QtbInt lda = a.stored.ld, ldb = b.stored.ld;
  p.acopy[op_a](&m, &k, a0, &lda, ap.array.data(), &ap.ldp, &alpha);
  p.bcopy[op_b](&k, &n, b0, &ldb, bp.array.data(), &bp.ldp, &alpha);
  ap.array.read_only();
  bp.array.read_only();
  Stored<T> before(m, n), c(m, n);
  const auto reset = [&] {
    c.take(before);
    if (magnitude(widen(beta)) == 0) c.poison();
  };
  const QtbInt ldc = c.ld;
  if (p.bpacked != nullptr) {
    reset();
    p.bpacked(ta, tb, &m, &n, &k, &alpha, a0, &lda, b0, &ldb, bp.array.data(), &bp.ldp, &beta, c.array.data(), &ldc);
    expect_product(std::string(p.name) + "_bpacked", p.tier, k, alpha, a, b, beta, before, c);
  }
  if (p.apacked != nullptr) {
    reset();
    p.apacked(ta, tb, &m, &n, &k, &alpha, a0, &lda, ap.array.data(), &ap.ldp, b0, &ldb, &beta, c.array.data(), &ldc);
    expect_product(std::string(p.name) + "_apacked", p.tier, k, alpha, a, b, beta, before, c);
  }
  if (p.packed != nullptr) {
    reset();
    p.packed(ta, tb, &m, &n, &k, &alpha, a0, &lda, ap.array.data(), &ap.ldp, b0, &ldb, bp.array.data(), &bp.ldp, &beta,
             c.array.data(), &ldc);
    expect_product(std::string(p.name) + "_packed", p.tier, k, alpha, a, b, beta, before, c);
  }
}

TYPED_TEST(GemmPieces, ProductsFromPanelsPackedOutsideAgreeWithTheOracle) {
  for (const auto &p : families<TypeParam>) {
    if (!takes_panels(p)) continue;
    for (int op_a = 0; op_a < this->ops(); op_a++)
      for (int op_b = 0; op_b < this->ops(); op_b++)
        for (QtbInt m : row_counts(p))
          for (QtbInt n : column_counts(p))
            for (QtbInt k : depths) {
              if (m == 0 || n == 0 || (m + n + k) % 2 != (op_a + op_b) % 2) continue;
              expect_products(p, op_a, op_b, m, n, k);
              if (this->HasFatalFailure()) return;
            }
  }
}

TYPED_TEST(GemmPieces, PanelsDeeperThanTheDepthOfABlockAreTakenInSlices) {
  for (const auto &p : families<TypeParam>) {
    if (!takes_panels(p)) continue;
    for (QtbInt k : {256, 257, 300, 515})
      for (QtbInt n : {p.tile.nr, 2 * p.tile.nr + 3, p.tile.nr + 7}) {
        expect_products(p, 0, 0, 2 * p.tile.mr + 1, n, k);
        if (this->HasFatalFailure()) return;
      }
  }
}

TYPED_TEST(GemmPieces, ProductsOfNoRowsOrNoColumnsTouchNothing) {
  using T = TypeParam;
  Guarded<T> nothing(0);
  T *const p0 = nothing.data();
  const T one = value<T>(1, 0), zero = value<T>(0, 0);
  const QtbInt k = 8, ld = 8, ldp = 64, counts[][2] = {{0, 5}, {-1, 5}, {8, 0}, {8, -1}};
  for (const Pieces<T> &p : families<T>) {
    if (!processor_runs(p.tier)) continue;
    for (const auto &count : counts) {
      const QtbInt *m = &count[0], *n = &count[1];
      if (p.bpacked != nullptr) p.bpacked("N", "N", m, n, &k, &one, p0, &ld, p0, &ld, p0, &ldp, &zero, p0, &ld);
      if (p.apacked != nullptr) p.apacked("N", "N", m, n, &k, &one, p0, &ld, p0, &ldp, p0, &ld, &zero, p0, &ld);
      if (p.packed != nullptr) p.packed("N", "N", m, n, &k, &one, p0, &ld, p0, &ldp, p0, &ld, p0, &ldp, &zero, p0, &ld);
    }
  }
}

template <class T>
struct ScaleC {
  using Scale = QTB_FUNCTION_TYPE(scale_c, T);
  const char *name;
  Scale *tiers[tier_count];
};
template <class T>
const ScaleC<T> scale_c;
template <>
const ScaleC<float> scale_c<float> = {"sgemm_scale_c", QTB_ALL_TIERS(sgemm_scale_c)};
template <>
const ScaleC<double> scale_c<double> = {"dgemm_scale_c", QTB_ALL_TIERS(dgemm_scale_c)};
template <>
const ScaleC<cfloat> scale_c<cfloat> = {"cgemm_scale_c", QTB_ALL_TIERS(cgemm_scale_c)};
template <>
const ScaleC<cdouble> scale_c<cdouble> = {"zgemm_scale_c", QTB_ALL_TIERS(zgemm_scale_c)};

TYPED_TEST(GemmPieces, ScalingOfCMultipliesAndStoresZerosWithoutReading) {
  using T = TypeParam;
  const QtbInt none_deep = 0;
  const T zero{}, betas[] = {value<T>(0, 0), value<T>(1, 0), value<T>(-0.75, 0.5), value<T>(NAN, 0)};
  for (int tier = 0; tier < tier_count; tier++) {
    if (!processor_runs(tier)) continue;
    for (const T beta : betas)
      for (QtbInt m : {-1, 0, 1, 2, 8, 9, 21})
        for (QtbInt n : {-1, 0, 1, 3, 4, 9}) {
          Operand<T> a(0, m, 0), b(0, 0, n);
          Stored<T> before(m, n), c(m, n);
          if (m > 0 && n > 0) c.take(before);
          if (magnitude(widen(beta)) == 0) c.poison();
          scale_c<T>.tiers[tier](&m, &n, &beta, c.array.data(), &c.ld);
          if (m < 0 || n < 0) continue;  // there is no matrix to look at
          expect_product(scale_c<T>.name, tier, none_deep, zero, a, b, beta, before, c);
          if (this->HasFatalFailure()) return;
        }
  }
}

}  // namespace
}  // namespace qtb::test
