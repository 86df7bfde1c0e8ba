// The strategies that cut C in both dimensions, or whose threads share packed panels. See gemm_strategies.h.
//
// A thread beyond the plan's nthreads has no share in any loop and passes the barriers. All threads compute the
// same bounds, and so meet at the same barriers. Panels are written between one barrier and the next and read behind
// it.

#include "blas/thread/32e/level3/gemm_operands.h"
#include "blas/thread/32e/level3/gemm_share.h"
#include "blas/thread/32e/level3/gemm_slots.h"
#include "blas/thread/32e/level3/gemm_strategies.h"
#include "blas/thread/team.h"
#include "service/memory.h"

namespace qtb {
namespace {

// No loop and no barrier: a thread's tile is one call, which blocks and packs for itself.
template <class T>
void gemm_2d_grid(QTB_PARAMS_GEMM_STRATEGY(T)) {
  const GemmOperands<T> at = gemm_operands(plan, a, lda, b, ldb, c, ldc);
  const QtbInt i = this_team().rank;
  if (i >= plan->nthreads) return;
  const GemmTile tile = gemm_grid_tile(*m, *n, plan->grid_rows, plan->grid_cols, panel_set->mu, gemm_grid_columns, i);
  plan->kernel.gemm(transa, transb, &tile.rows, &tile.columns, k, alpha, at.a_at(tile.row, 0), lda,
                    at.b_at(0, tile.column), ldb, beta, at.c_at(tile.row, tile.column), ldc);
}

// Blocks by a serial GEMM, the depth innermost: a block of C is added to again and again while it is close. beta is 1.
template <class T>
void gemm_2d_xgemm_p(QTB_PARAMS_GEMM_STRATEGY(T)) {
  (void)beta;
  const GemmOperands<T> at = gemm_operands(plan, a, lda, b, ldb, c, ldc);
  for (const QtbInt i : this_team().shares(plan->nthreads)) {
    const GemmTile tile = gemm_grid_tile(*m, *n, plan->grid_rows, plan->grid_cols, panel_set->mu, 1, i);
    for (QtbInt j = 0; j < tile.columns; j += plan->nb) {
      const QtbInt nc = at_most(plan->nb, tile.columns - j), column = tile.column + j;
      for (QtbInt ii = 0; ii < tile.rows; ii += plan->mb) {
        const QtbInt mblk = at_most(plan->mb, tile.rows - ii), row = tile.row + ii;
        for (QtbInt l = 0; l < *k; l += plan->kb) {
          const QtbInt kc = at_most(plan->kb, *k - l);
          plan->kernel.gemm(transa, transb, &mblk, &nc, &kc, alpha, at.a_at(row, l), lda, at.b_at(l, column), ldb,
                            &gemm_one<T>, at.c_at(row, column), ldc);
        }
      }
    }
  }
}

// Shared panels begin at multiples of this behind the first, so that their elements stay aligned.
constexpr QtbInt panel_step_bytes = 8;

// The panel of a group or pair.
template <class T>
T *shared_panel(T *panels, QtbInt number, QtbInt bytes) {
  return panels + multiple_below(number * bytes, panel_step_bytes) / static_cast<QtbInt>(sizeof(T));
}

// Where a group's depth is small against its size, its threads pack rows of the block, else depths of it. The shares
// are multiples of these, so that each begins with a micro-panel, or a step of depth, of its own.
constexpr QtbInt acopy_depth_by_rows = 64, acopy_row_unit = 8, acopy_depth_unit = 4;
// Columns that are computed between two barriers: in effect all.
constexpr QtbInt acopy_columns = 10000000;

// Thread i is place i % grid_cols of row group i / grid_cols. A group packs a block of its rows of op(A) together, and
// its threads split the columns. The last group takes the rest of m, in as many more passes as that needs. beta is 1.
void dgemm_2d_acopy_n(QTB_PARAMS_GEMM_STRATEGY(double)) {
  (void)beta;
  const GemmOperands<double> at = gemm_operands(plan, a, lda, b, ldb, c, ldc);
  const Team team = this_team();
  const QtbInt t = plan->nthreads, groups = plan->grid_rows, places = plan->grid_cols;
  const QtbInt mu = panel_set->mu, nu = panel_set->nu, ku = panel_set->ku;
  const QtbInt group_rows = multiple_below(*m / groups, mu), last_rows = *m - (t / places - 1) * group_rows;
  for (QtbInt kk = 0; kk < *k; kk += plan->kb) {
    const QtbInt kc = at_most(plan->kb, *k - kk), kr = multiple_above(kc, ku), ld_a = mu * kr;
    for (QtbInt ii = 0; ii < last_rows; ii += plan->mb) {
      const QtbInt rows = at_most(plan->mb, group_rows - ii), rows_of_last = at_most(plan->mb, last_rows - ii);
      const bool by_rows = *k / places <= acopy_depth_by_rows;
      const QtbInt share =
          by_rows ? gemm_place_share(rows, places, acopy_row_unit) : gemm_place_share(kc, places, acopy_depth_unit);
      for (const QtbInt i : team.shares(t)) {
        const QtbInt group = i / places, place = i % places, row = group * group_rows + ii;
        const QtbInt own_rows = group < groups - 1 ? rows : rows_of_last;
        double *const panel = shared_panel(plan->a_shared, group, panel_set->a_panel_bytes);
        if (by_rows) {
          const GemmRange part = gemm_place(own_rows, share, places, place);
          plan->acopy(&part.count, &kc, at.a_at(row + part.first, kk), lda, panel + part.first * kr, &ld_a, alpha);
        } else {
          const GemmRange part = gemm_place(kc, share, places, place);
          plan->acopy(&own_rows, &part.count, at.a_at(row, kk + part.first), lda, panel + part.first * mu, &ld_a,
                      alpha);
        }
      }
      team.meet();
      const QtbInt widest = at_most(acopy_columns, *n);
      for (QtbInt jj = 0; jj < *n; jj += widest) {
        const QtbInt nc = at_most(widest, *n - jj), column_share = gemm_place_share(nc, places, nu);
        for (const QtbInt i : team.shares(t)) {
          const QtbInt group = i / places, row = group * group_rows + ii;
          const QtbInt own_rows = group < groups - 1 ? rows : rows_of_last;
          const GemmRange columns = gemm_place(nc, column_share, places, i % places);
          const double *const panel = shared_panel(plan->a_shared, group, panel_set->a_panel_bytes);
          plan->kernel.apacked(transa, transb, &own_rows, &columns.count, &kc, alpha, at.a_at(row, kk), lda, panel,
                               &ld_a, at.b_at(kk, jj + columns.first), ldb, &gemm_one<double>,
                               at.c_at(row, jj + columns.first), ldc);
        }
        team.meet();
      }
    }
  }
}

// Threads in pairs: a pair owns columns, its even thread packs op(B) for both, and they split the rows. beta is 1.
template <class T>
void gemm_2d_bcopy(QTB_PARAMS_GEMM_STRATEGY(T)) {
  (void)beta;
  const GemmOperands<T> at = gemm_operands(plan, a, lda, b, ldb, c, ldc);
  const Team team = this_team();
  const QtbInt t = plan->nthreads, mu = panel_set->mu, nu = panel_set->nu, ku = panel_set->ku;
  const GemmPairs pairs = gemm_pairs(*m, *n, t / 2, mu, nu);
  const QtbInt width = pairs.share > pairs.last ? pairs.share : pairs.last;
  const QtbInt widest = at_most(plan->nb, width), bytes = panel_bytes<T>(widest, plan->kb);
  for (QtbInt jj = 0; jj < width; jj += widest) {
    const QtbInt columns = at_most(widest, pairs.share - jj), columns_of_last = at_most(widest, pairs.last - jj);
    for (QtbInt kk = 0; kk < *k; kk += plan->kb) {
      const QtbInt kc = at_most(plan->kb, *k - kk), kr = multiple_above(kc, ku), ld_b = nu * kr;
      for (const QtbInt i : team.shares(t)) {
        if (i % 2 != 0) continue;
        const QtbInt nc = i < t - 2 ? columns : columns_of_last;
        plan->bcopy(&kc, &nc, at.b_at(kk, i / 2 * pairs.share + jj), ldb, shared_panel(plan->b_shared, i / 2, bytes),
                    &ld_b, nullptr);
      }
      team.meet();
      for (const QtbInt i : team.shares(t)) {
        const QtbInt row = i % 2 * pairs.rows, rows = i % 2 == 0 ? pairs.rows : at_least_0(*m - pairs.rows);
        const QtbInt nc = i < t - 2 ? columns : columns_of_last, column = i / 2 * pairs.share + jj;
        plan->kernel.bpacked(transa, transb, &rows, &nc, &kc, alpha, at.a_at(row, kk), lda, at.b_at(kk, column), ldb,
                             shared_panel(plan->b_shared, i / 2, bytes), &ld_b, &gemm_one<T>, at.c_at(row, column),
                             ldc);
      }
      team.meet();
    }
  }
}

// A thread's own panels. Both are there or none is.
template <class T>
struct OwnPanels {
  void *a_allocated, *b_allocated;
  T *a, *b;
};

template <class T>
OwnPanels<T> get_own_panels(QtbInt a_bytes, QtbInt b_bytes) {
  OwnPanels<T> own{};
  own.a_allocated = qtb_serv_malloc(static_cast<std::uint64_t>(a_bytes), panel_allocation_alignment);
  own.b_allocated = qtb_serv_malloc(static_cast<std::uint64_t>(b_bytes), panel_allocation_alignment);
  if (own.a_allocated != nullptr && own.b_allocated != nullptr) {
    own.a = align_panel<T>(own.a_allocated);
    own.b = align_panel<T>(own.b_allocated);
  }
  return own;
}

template <class T>
void free_own_panels(const OwnPanels<T> &own) {
  qtb_serv_free(own.a_allocated);
  qtb_serv_free(own.b_allocated);
}

// Each thread alone on its rows: a block of op(A) is packed, and against it slab after slab of nb columns of op(B). In
// a super-slab of t slabs thread i begins with slab i, so that no two threads are at the same columns of B and C.
//
// The last block of the last thread takes the rest of m: its panel is larger. A share of rows below one register tile
// is no share: no thread computes anything then. beta is 1. Where there is no memory for its panels, a thread computes
// its rows by the serial GEMM, which can do without.
template <class T>
void gemm_2d_abcopy(QTB_PARAMS_GEMM_STRATEGY(T)) {
  (void)beta;
  const GemmOperands<T> at = gemm_operands(plan, a, lda, b, ldb, c, ldc);
  const QtbInt t = plan->nthreads, mu = panel_set->mu, nu = panel_set->nu, ku = panel_set->ku;
  const QtbInt mb = plan->mb, nb = plan->nb, kb = plan->kb;
  const QtbInt share = gemm_rows(*m, t, mu, 0).count, super_slabs = multiple_below(*n, t * nb);
  for (const QtbInt i : this_team().shares(t)) {
    if (share < 1) continue;
    const GemmRange own = gemm_rows(*m, t, mu, i);
    const QtbInt more_rows = own.count - share;
    QtbInt a_bytes = panel_bytes<T>(mb, kb);
    if (i == t - 1) a_bytes = panel_bytes<T>(more_rows > mb ? mb + more_rows : 2 * mb, kb) + panel_spare_bytes;
    const OwnPanels<T> panels = get_own_panels<T>(a_bytes, panel_bytes<T>(nb, kb));
    if (panels.a == nullptr) {
      free_own_panels(panels);
      GemmSlots<T>::gemm(transa, transb, &own.count, n, k, alpha, at.a_at(own.first, 0), lda, b, ldb, &gemm_one<T>,
                         at.c_at(own.first, 0), ldc);
      continue;
    }
    for (QtbInt kk = 0; kk < *k; kk += kb) {
      const QtbInt kc = at_most(kb, *k - kk), kr = multiple_above(kc, ku), ld_a = mu * kr, ld_b = nu * kr;
      for (QtbInt ii = 0; ii < share; ii += mb) {
        const QtbInt row = own.first + ii, mblk = ii + mb < share ? mb : own.count - ii;
        plan->acopy(&mblk, &kc, at.a_at(row, kk), lda, panels.a, &ld_a, alpha);
        const auto add_slab = [&](QtbInt column, QtbInt nc) {
          plan->bcopy(&kc, &nc, at.b_at(kk, column), ldb, panels.b, &ld_b, nullptr);
          plan->kernel.packed(transa, transb, &mblk, &nc, &kc, alpha, at.a_at(row, kk), lda, panels.a, &ld_a,
                              at.b_at(kk, column), ldb, panels.b, &ld_b, &gemm_one<T>, at.c_at(row, column), ldc);
        };
        for (QtbInt jj = 0; jj < super_slabs; jj += t * nb)
          for (QtbInt slab = 0; slab < t; ++slab) add_slab(jj + (i + slab) % t * nb, nb);
        for (QtbInt j = super_slabs; j < *n; j += nb) add_slab(j, at_most(nb, *n - j));
      }
    }
    free_own_panels(panels);
  }
}

}  // namespace
}  // namespace qtb

extern "C" {
#define QTB_GEMM_STRATEGY(name, body, T) \
  void qtb_blas_##name(QTB_PARAMS_GEMM_STRATEGY(T)) { qtb::body(QTB_ARGS_GEMM_STRATEGY); }
QTB_GEMM_STRATEGY(sgemm_2d_grid, gemm_2d_grid, float)
QTB_GEMM_STRATEGY(dgemm_2d_grid, gemm_2d_grid, double)
QTB_GEMM_STRATEGY(sgemm_2d_xgemm_p, gemm_2d_xgemm_p, float)
QTB_GEMM_STRATEGY(dgemm_2d_xgemm_p, gemm_2d_xgemm_p, double)
QTB_GEMM_STRATEGY(dgemm_2d_acopy_n, dgemm_2d_acopy_n, double)
QTB_GEMM_STRATEGY(cgemm_2d_bcopy, gemm_2d_bcopy, cfloat)
QTB_GEMM_STRATEGY(zgemm_2d_bcopy, gemm_2d_bcopy, cdouble)
QTB_GEMM_STRATEGY(sgemm_2d_abcopy_abx_m_km_par_p, gemm_2d_abcopy, float)
QTB_GEMM_STRATEGY(dgemm_2d_abcopy_abx_m_km_par_p, gemm_2d_abcopy, double)
QTB_GEMM_STRATEGY(cgemm_2d_abcopy_abx_m_km_par_p, gemm_2d_abcopy, cfloat)
QTB_GEMM_STRATEGY(zgemm_2d_abcopy_abx_m_km_par_p, gemm_2d_abcopy, cdouble)
}
