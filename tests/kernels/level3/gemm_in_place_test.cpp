// The inner kernels of GEMM that read B in place, each alone: C += Ap*op(B) at every width and depth, with a trapping
// page behind each operand and the stage.
//
// A kernel joins with its line in kernels.def.
#include "tests/kernels/level3/pieces.h"

namespace qtb::test {
namespace {

template <class T>
using Kernel = void(bool transb, QtbInt m, QtbInt n, QtbInt depth, const T *ap, QtbInt ldap, const T *b, QtbInt ldb,
                    T *c, QtbInt ldc, T *stage);

extern "C" {
#define QTB_IN_PLACE_KERNEL(tier, T, family, any, aligned) \
  QTB_HIDDEN Kernel<T> qtb_blas_##tier##_##any;            \
  QTB_HIDDEN Kernel<T> qtb_blas_##tier##_##aligned;
#include "blas/kernels/level3/gemm/kernels.def"
}

template <class T>
struct Listed {
  int tier;
  const char *name;
  Kernel<T> *any, *aligned;
};

template <class T>
std::vector<Listed<T>> listed() {
  std::vector<Listed<T>> kernels;
  const auto add = [&]<class U>(int tier, const char *name, Kernel<U> *any, Kernel<U> *aligned) {
    if constexpr (std::is_same_v<T, U>)
      if (processor_runs(tier)) kernels.push_back({tier, name, any, aligned});
  };
#define QTB_IN_PLACE_KERNEL(tier, U, family, any, aligned) \
  add.template operator()<U>(tier_##tier, #any, qtb_blas_##tier##_##any, qtb_blas_##tier##_##aligned);
#include "blas/kernels/level3/gemm/kernels.def"
  return kernels;
}

// All of these have four columns and steps of depth to a tile; the rows fill two vectors.
constexpr QtbInt nr = 4, ku = 4;
template <class T>
constexpr QtbInt mr = 32 / static_cast<QtbInt>(sizeof(T));

template <class T>
class GemmInPlaceKernels : public Seeded {};
using Types = testing::Types<float, double>;
TYPED_TEST_SUITE(GemmInPlaceKernels, Types);

TYPED_TEST(GemmInPlaceKernels, AddTheProductWithBAsItLies) {
  using T = TypeParam;
  for (const Listed<T> &kernel : listed<T>())
    for (bool transb : {false, true})
      for (QtbInt n = 1; n <= 2 * nr + 1; n++)
        for (QtbInt depth : {1, 2, 3, 4, 5, 8, 127, 128})
          for (QtbInt spare : {0, 1, 4}) {
            const QtbInt m = 2 * mr<T>, kp = (depth + ku - 1) / ku * ku, ldap = kp * mr<T>;
            const QtbInt ldb = (transb ? n : depth) + spare, ldc = m + spare;
            const auto size = [](QtbInt count) { return static_cast<std::size_t>(count); };
            Guarded<T> ap(size(2 * ldap)), b(size(transb ? (depth - 1) * ldb + n : (n - 1) * ldb + depth));
            Guarded<T> c(size((n - 1) * ldc + m)), stage(size(kp * nr * 16) / sizeof(T));
            for (Guarded<T> *array : {&ap, &b, &c, &stage})
              for (std::size_t e = 0; e < array->size(); e++) store_signalling_nan<T>(&(*array)[e]);
            const auto a_at = [&](QtbInt i, QtbInt l) -> T & {
              return ap[size(i / mr<T> * ldap + l * mr<T> + i % mr<T>)];
            };
            const auto b_at = [&](QtbInt l, QtbInt j) -> T & { return b[size(transb ? j + l * ldb : l + j * ldb)]; };
            for (QtbInt l = 0; l < kp; l++)
              for (QtbInt i = 0; i < m; i++) a_at(i, l) = l < depth ? draw<T>() : T{};
            for (QtbInt l = 0; l < depth; l++)
              for (QtbInt j = 0; j < n; j++) b_at(l, j) = draw<T>();
            for (QtbInt j = 0; j < n; j++)
              for (QtbInt i = 0; i < m; i++) c[size(i + j * ldc)] = draw<T>();
            const std::vector<T> before(c.data(), c.data() + c.size());
            const bool aligned = reinterpret_cast<std::uintptr_t>(c.data()) % 16 == 0 && ldc * sizeof(T) % 16 == 0;
            (aligned ? kernel.aligned : kernel.any)(transb, m, n, depth, ap.data(), ldap, b.data(), ldb, c.data(), ldc,
                                                    stage.data());
            double worst = 0;
            for (QtbInt e = 0; e < static_cast<QtbInt>(c.size()); e++) {
              const QtbInt i = e % ldc, j = e / ldc;
              if (i >= m) {
                ASSERT_TRUE(same_bits(c[size(e)], before[size(e)])) << "wrote between the columns of C";
                continue;
              }
              QuadComplex sum = widen(before[size(e)]);
              Quad gauge = magnitude(sum);
              for (QtbInt l = 0; l < depth; l++) {
                const QuadComplex product = times(widen(a_at(i, l)), widen(b_at(l, j)));
                sum = plus(sum, product);
                gauge += magnitude(product);
              }
              worst = std::fmax(worst, error_ratio(c[size(e)], sum, gauge, static_cast<double>(depth + 3)));
            }
            ASSERT_LE(worst, 1) << tier_name(kernel.tier) << " " << kernel.name << " transb " << transb << " of " << m
                                << " x " << n << " x " << depth << ", spare " << spare;
            TallyReport::of(kernel.name).within(kernel.tier, worst);
          }
}

}  // namespace
}  // namespace qtb::test
