// The strategies that cut one dimension. See gemm_strategies.h.

#include "blas/thread/32e/level3/gemm_operands.h"
#include "blas/thread/32e/level3/gemm_share.h"
#include "blas/thread/32e/level3/gemm_strategies.h"
#include "blas/thread/team.h"

namespace qtb {
namespace {

// The cut may lie anywhere: the kernel below makes the best of an edge.
template <class T>
void gemm_1d_row(QTB_PARAMS_GEMM_STRATEGY(T)) {
  (void)panel_set;
  const GemmOperands<T> at = gemm_operands(plan, a, lda, b, ldb, c, ldc);
  const QtbInt t = plan->nthreads;
  for (const QtbInt i : this_team().shares(t)) {
    const GemmRange rows = gemm_range(*m, t, i);
    plan->kernel.gemm(transa, transb, &rows.count, n, k, alpha, at.a_at(rows.first, 0), lda, b, ldb, beta,
                      at.c_at(rows.first, 0), ldc);
  }
}

template <class T>
void gemm_1d_col(QTB_PARAMS_GEMM_STRATEGY(T)) {
  (void)panel_set;
  const GemmOperands<T> at = gemm_operands(plan, a, lda, b, ldb, c, ldc);
  const QtbInt t = plan->nthreads;
  for (const QtbInt i : this_team().shares(t)) {
    const GemmRange columns = gemm_range(*n, t, i);
    plan->kernel.gemm(transa, transb, m, &columns.count, k, alpha, a, lda, at.b_at(0, columns.first), ldb, beta,
                      at.c_at(0, columns.first), ldc);
  }
}

// For tall products over a short depth: a block of op(B) is packed by all threads, each some columns, and then used by
// all, each on its rows. A barrier behind each loop keeps packing and computing apart. C is added to: beta is 1.
void dgemm_1d_with_copy_0(QTB_PARAMS_GEMM_STRATEGY(double)) {
  (void)beta;
  const GemmOperands<double> at = gemm_operands(plan, a, lda, b, ldb, c, ldc);
  const Team team = this_team();
  const QtbInt mu = panel_set->mu, nu = panel_set->nu, ku = panel_set->ku;
  const QtbInt t = multiple_below(plan->nthreads, 2), widest = at_most(plan->nb, *n);
  for (QtbInt kk = 0; kk < *k; kk += plan->kb) {
    const QtbInt kc = at_most(plan->kb, *k - kk), kr = multiple_above(kc, ku), ld_pack = nu * kr;
    for (QtbInt jj = 0; jj < *n; jj += widest) {
      const QtbInt nc = at_most(widest, *n - jj), share = gemm_place_share(nc, t, nu);
      for (const QtbInt i : team.shares(t)) {
        const GemmRange columns = gemm_place(nc, share, t, i);
        plan->bcopy(&kc, &columns.count, at.b_at(kk, jj + columns.first), ldb, plan->b_shared + columns.first * kr,
                    &ld_pack, nullptr);
      }
      team.meet();
      for (const QtbInt i : team.shares(t)) {
        const GemmRange rows = gemm_rows(*m, t, mu, i);
        for (QtbInt ii = 0; ii < rows.count; ii += plan->mb) {
          const QtbInt mblk = at_most(plan->mb, rows.count - ii);
          plan->kernel.bpacked(transa, transb, &mblk, &nc, &kc, alpha, at.a_at(rows.first + ii, kk), lda,
                               at.b_at(kk, jj), ldb, plan->b_shared, &ld_pack, &gemm_one<double>,
                               at.c_at(rows.first + ii, jj), ldc);
        }
      }
      team.meet();
    }
  }
}

}  // namespace
}  // namespace qtb

extern "C" {
#define QTB_GEMM_1D(t, T)                                                                                      \
  void qtb_blas_##t##gemm_1d_row(QTB_PARAMS_GEMM_STRATEGY(T)) { qtb::gemm_1d_row<T>(QTB_ARGS_GEMM_STRATEGY); } \
  void qtb_blas_##t##gemm_1d_col(QTB_PARAMS_GEMM_STRATEGY(T)) { qtb::gemm_1d_col<T>(QTB_ARGS_GEMM_STRATEGY); }
QTB_GEMM_1D(s, float)
QTB_GEMM_1D(d, double)
QTB_GEMM_1D(c, cfloat)
QTB_GEMM_1D(z, cdouble)

void qtb_blas_dgemm_1d_with_copy_0(QTB_PARAMS_GEMM_STRATEGY(double)) {
  qtb::dgemm_1d_with_copy_0(QTB_ARGS_GEMM_STRATEGY);
}
}
