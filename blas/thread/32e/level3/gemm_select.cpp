// The selectors. See gemm_select.h.
//
// They are tuned by hand: the limits below were found by measuring, class by class, and follow from no formula.

#include "blas/thread/32e/level3/gemm_select.h"

#include "blas/thread/32e/level3/gemm_slots.h"
#include "blas/thread/32e/level3/gemm_strategies.h"

namespace qtb {
namespace {

template <class T>
struct GemmStrategies;

#define QTB_GEMM_STRATEGIES(t)                            \
  static constexpr auto row = &qtb_blas_##t##gemm_1d_row; \
  static constexpr auto col = &qtb_blas_##t##gemm_1d_col; \
  static constexpr auto abcopy = &qtb_blas_##t##gemm_2d_abcopy_abx_m_km_par_p;
#define QTB_GEMM_STRATEGIES_REAL(t)                         \
  QTB_GEMM_STRATEGIES(t)                                    \
  static constexpr auto grid = &qtb_blas_##t##gemm_2d_grid; \
  static constexpr auto xgemm = &qtb_blas_##t##gemm_2d_xgemm_p;
#define QTB_GEMM_STRATEGIES_COMPLEX(t) \
  QTB_GEMM_STRATEGIES(t)               \
  static constexpr auto bcopy = &qtb_blas_##t##gemm_2d_bcopy;

template <>
struct GemmStrategies<float> {
  QTB_GEMM_STRATEGIES_REAL(s)
};
template <>
struct GemmStrategies<double> {
  QTB_GEMM_STRATEGIES_REAL(d)
};
template <>
struct GemmStrategies<cfloat> {
  QTB_GEMM_STRATEGIES_COMPLEX(c)
};
template <>
struct GemmStrategies<cdouble> {
  QTB_GEMM_STRATEGIES_COMPLEX(z)
};

// One selection: the problem, the team, and what is being filled in. The procedures that set an outcome do so whole;
// grids are rows by columns of threads.
template <class T>
struct Selection {
  using Slots = GemmSlots<T>;
  using Strategies = GemmStrategies<T>;

  QtbInt m, n, k, t;
  GemmPanelSet<T> &panels;
  GemmPlan<T> &plan;

  // The team that takes part from now on. An odd team's last thread idles.
  void make_even() { plan.nthreads = t = t - t % 2; }

  void grid_of(QtbInt rows, QtbInt cols) {
    plan.grid_rows = rows;
    plan.grid_cols = cols;
  }

  // ---- Outcomes ----

  void row_or_col() {
    plan.strategy = m > n ? Strategies::row : Strategies::col;
    plan.kernel.gemm = Slots::gemm;
  }

  void grid(GemmRoutine<T> *kernel, BlocksRoutine<T> *blocks, QtbInt rows, QtbInt cols) {
    plan.strategy = Strategies::grid;
    plan.kernel.gemm = kernel;
    panels.blocks = blocks;
    grid_of(rows, cols);
  }
  void grid_in_place(QtbInt rows, QtbInt cols) { grid(Slots::nobcopy, Slots::blocks, rows, cols); }
  void grid_sse41(QtbInt rows, QtbInt cols) { grid(Slots::sse41, Slots::sse41_blocks, rows, cols); }

  void xgemm() {
    plan.strategy = Strategies::xgemm;
    plan.kernel.gemm = Slots::gemm;
    panels.blocks = Slots::sse41_blocks;
    grid_of(2, t / 2);
    plan.mb = 200;
    plan.nb = 800;
    plan.kb = 128;
  }

  void abcopy(QtbInt mb) {
    plan.strategy = Strategies::abcopy;
    plan.kernel.packed = Slots::sse41_packed;
    panels.blocks = Slots::sse41_blocks;
    panels.acopy_n = Slots::sse41_acopy_n;
    panels.acopy_t = Slots::sse41_acopy_t;
    panels.acopy_c = Slots::sse41_acopy_c;
    take_sse41_bcopy();
    plan.mb = mb;
    plan.nb = 8;
  }

  void bcopy() {
    share_b();
    plan.kernel.bpacked = Slots::bpacked;
    panels.blocks = Slots::blocks;
    panels.bcopy_n = Slots::bcopy_n;
    panels.bcopy_t = Slots::bcopy_t;
    panels.bcopy_c = Slots::bcopy_c;
  }
  void bcopy_sse41() {
    share_b();
    plan.kernel.bpacked = Slots::sse41;
    panels.blocks = Slots::sse41_blocks;
    take_sse41_bcopy();
  }

 private:
  void share_b() {
    plan.strategy = Strategies::bcopy;
    grid_of(2, t / 2);
    plan.b_buffers = static_cast<std::int32_t>(t);
  }
  void take_sse41_bcopy() {
    panels.bcopy_n = Slots::sse41_bcopy_n;
    panels.bcopy_t = Slots::sse41_bcopy_t;
    panels.bcopy_c = Slots::sse41_bcopy_c;
  }
};

// ---- Double precision ----

// Tile kernels of their own: few columns a thread take the one with blocks of few columns.
void select_family16(Selection<double> &s) {
  const QtbInt m = s.m, n = s.n, t = s.t;
  QtbInt rows;
  if (t % 2 != 0 || m > 2 * n || n > 2 * m)
    rows = m > n ? t : 1;
  else
    rows = t % 4 == 0 ? 4 : 2;
  const QtbInt cols = t / rows;
  if (n / cols > 384)
    s.grid(&qtb_blas_xdgemm_def_run_a, &qtb_blas_xdgemm_def_blocks_a, rows, cols);
  else
    s.grid(&qtb_blas_xdgemm_def_run_b, &qtb_blas_xdgemm_def_blocks_b, rows, cols);
}

void select_ssse3(Selection<double> &s) {
  s.make_even();
  if (s.m < 8000 || s.k > 512 || s.n < 3000 || s.m <= s.n) return s.grid_in_place(2, s.t / 2);
  s.plan.strategy = &qtb_blas_dgemm_1d_with_copy_0;
  s.plan.kernel.bpacked = &qtb_blas_xdgemm_bpacked;
  s.panels.blocks = &qtb_blas_xdgemm_blocks;
  s.panels.bcopy_n = &qtb_blas_xdgemm_bcopy_n;
  s.panels.bcopy_t = &qtb_blas_xdgemm_bcopy_t;
  s.plan.mb = 512;
  s.plan.b_buffers = 1;
}

// Shared by single and double precision. Of an even team.
template <class T>
void select_grid_sse42(Selection<T> &s) {
  const QtbInt rows = s.m > 4 * s.n ? s.t : s.n > s.m * s.t ? 1 : 2;
  s.grid_in_place(rows, s.t / rows);
}

void select_acopy(Selection<double> &s) {
  s.make_even();
  const QtbInt rows = s.m == 512 || s.m == 256 || s.t % 4 != 0 ? 2 : 4;
  s.plan.strategy = &qtb_blas_dgemm_2d_acopy_n;
  s.plan.kernel.apacked = &qtb_blas_xdgemm_apacked;
  s.panels.blocks = &qtb_blas_xdgemm_blocks;
  s.panels.acopy_n = &qtb_blas_xdgemm_acopy_n;
  s.panels.acopy_t = &qtb_blas_xdgemm_acopy_t;
  s.grid_of(rows, s.t / rows);
  s.plan.a_buffers = static_cast<std::int32_t>(rows);
  s.plan.nb = 10000;
  s.plan.mb = cache_is_small(s.plan.cache, cache_third_size, small_third_cache_bytes) ? 384 : 1000;
}

void select_sse42(Selection<double> &s) {
  const QtbInt m = s.m, n = s.n, k = s.k, t = s.t;
  bool simple;
  if (t >= 8) {
    simple = m < 200 || (k < 200 && m <= 1000) || (k > 2 * m && m <= 1000) || n < 128 || k >= 5 * n;
  } else {
    simple = t % 2 == 0 || (m >= n && m / t < 32);
    if (!simple) return s.row_or_col();
  }
  if (!simple) return select_acopy(s);
  s.make_even();
  select_grid_sse42(s);
}

// Whether a problem is large, and whether it is cut by rows alone then.
struct Size {
  bool large, by_rows;
};

// What the large problems of narrower limits have in common.
bool is_large_flat(QtbInt m, QtbInt n, QtbInt k) {
  if (m >= 7000 && n >= 3000) return true;
  return m >= 1200 && n >= 1200 && k >= 128;
}

Size size_on_24_threads(const Selection<double> &s) {
  const QtbInt m = s.m, n = s.n, k = s.k, t = s.t;
  const bool by_rows =
      k <= 256 || (m >= 10000 && k <= 512) || (m % 5000 == 0 && n % 5000 == 0) || (m > 4700 && n >= 1000 && n <= 4000);
  if (n > t * m || m < 500) return {false, by_rows};
  if (n < 500 || k < 150) return {is_large_flat(m, n, k), by_rows};
  if (m >= 14000) return {n > 512, by_rows};
  return {m > 600 || n < 2000, by_rows};
}

Size size_of(const Selection<double> &s) {
  const QtbInt m = s.m, n = s.n, k = s.k;
  if (n > s.t * m || m < 1000) return {false, true};
  return {(k >= 150 && n >= 1000) || is_large_flat(m, n, k), true};
}

void select_sse41(Selection<double> &s) {
  const bool small_l2 = s.plan.machine_class == machine_sse41_small_l2;
  if (small_l2 && s.t == 3) return s.row_or_col();
  s.make_even();
  const QtbInt m = s.m, n = s.n, k = s.k, t = s.t;
  const Size size = small_l2 && t == 24 ? size_on_24_threads(s) : size_of(s);
  if (size.large) {
    if (!size.by_rows) return s.xgemm();
    if (small_l2) return s.abcopy(448);
    return s.abcopy(m > 7000 && (k == 256 || k >= 512) ? 704 : 1024);
  }
  if (m > t * n) return s.grid_sse41(t, 1);
  if (n > t * m) return s.grid_sse41(1, t);
  s.grid_sse41(2, t / 2);
}

void select(Selection<double> &s) {
  switch (s.plan.machine_class) {
    case machine_family16: return select_family16(s);
    case machine_ssse3: return select_ssse3(s);
    case machine_sse42: return select_sse42(s);
    case machine_sse41_large_l2:
    case machine_sse41_small_l2: return select_sse41(s);
    case machine_plain:
    case machine_avx:
    case machine_class_count: return s.row_or_col();
  }
}

// ---- Single precision ----

Size size_on_24_threads(const Selection<float> &s) {
  const QtbInt m = s.m, n = s.n, k = s.k;
  const bool by_rows =
      (m >= 7000 && n >= 3000 && k <= 512) || (m % 5000 == 0 && n % 5000 == 0) || (m >= 4800 && m <= 5400 && n >= 4000);
  if (n > m * s.t || m < 700) return {false, by_rows};
  if (n < 700 || k < 512) return {m >= 7000 && n >= 3000 && k >= 120, by_rows};
  return {m >= 801 || n < 3000, by_rows};
}

Size size_of(const Selection<float> &s) {
  const QtbInt m = s.m, n = s.n, k = s.k;
  if (n > m * s.t || m < 2048) return {false, true};
  return {(k >= 512 && n >= 2048) || (m >= 7000 && n >= 3000 && k >= 120), true};
}

void select_sse41(Selection<float> &s) {
  s.make_even();
  const QtbInt m = s.m, n = s.n, t = s.t;
  const Size size = s.plan.machine_class == machine_sse41_small_l2 && t == 24 ? size_on_24_threads(s) : size_of(s);
  if (size.large) return size.by_rows ? s.abcopy(1024) : s.xgemm();
  if (n > m * t && m <= t * n) return s.grid_sse41(1, t);
  if (m > t * n) return s.grid_sse41(t, 1);
  s.grid_sse41(2, t / 2);
}

void select(Selection<float> &s) {
  switch (s.plan.machine_class) {
    case machine_ssse3: s.make_even(); return s.grid_in_place(2, s.t / 2);
    case machine_sse42: s.make_even(); return select_grid_sse42(s);
    case machine_sse41_large_l2:
    case machine_sse41_small_l2: return select_sse41(s);
    case machine_plain:
    case machine_avx:
    case machine_family16:
    case machine_class_count: return s.row_or_col();
  }
}

// ---- Complex ----

struct ComplexLimits {
  QtbInt least_m, least_k, least_extent;  // what makes a problem large
  QtbInt mb_small_l2, mb_large_l2;        // the blocks of rows then
};
template <class T>
constexpr ComplexLimits complex_limits = {};
template <>
constexpr ComplexLimits complex_limits<cfloat> = {800, 150, 1000, 448, 1024};
template <>
constexpr ComplexLimits complex_limits<cdouble> = {400, 200, 600, 256, 512};

template <class T>
bool is_large(const Selection<T> &s) {
  constexpr ComplexLimits least = complex_limits<T>;
  const QtbInt m = s.m, n = s.n, k = s.k;
  if (n >= 16 * s.t && m > 2 * n) return true;
  if (m < least.least_m) return false;
  if ((k >= least.least_k && n >= least.least_m) || (m >= 7000 && n >= 3000)) return true;
  return m >= least.least_extent && n >= least.least_extent && k >= 128;
}

template <class T>
void select_complex(Selection<T> &s) {
  const QtbInt m = s.m, n = s.n, k = s.k;
  const GemmMachineClass machine = s.plan.machine_class;
  switch (machine) {
    case machine_ssse3: s.make_even(); return s.bcopy();
    case machine_sse42:
      s.make_even();
      if ((m >= 400 && n >= 400 && k >= 400) || (m <= 2 * n && n <= 2 * m)) return s.bcopy();
      return s.row_or_col();
    case machine_sse41_large_l2:
    case machine_sse41_small_l2:
      s.make_even();
      if (!is_large(s)) return s.bcopy_sse41();
      return s.abcopy(machine == machine_sse41_small_l2 ? complex_limits<T>.mb_small_l2
                                                        : complex_limits<T>.mb_large_l2);
    case machine_plain:
    case machine_avx:
    case machine_family16:
    case machine_class_count: return s.row_or_col();
  }
}
void select(Selection<cfloat> &s) { select_complex(s); }
void select(Selection<cdouble> &s) { select_complex(s); }

template <class T>
void gemm_select(const QtbInt *m, const QtbInt *n, const QtbInt *k, GemmPanelSet<T> *panel_set, GemmPlan<T> *plan) {
  Selection<T> selection{*m, *n, *k, plan->nthreads, *panel_set, *plan};
  select(selection);
  if (panel_set->blocks == nullptr) return;
  panel_set->blocks(m, n, k, &plan->mb, &plan->nb, &plan->kb, &panel_set->mu, &panel_set->nu, &panel_set->ku);
  // A cut by rows needs a register tile for each thread. Only a team of hundreds meets a large problem with less.
  if (plan->strategy == GemmStrategies<T>::abcopy && *m / plan->nthreads < panel_set->mu) selection.row_or_col();
}

}  // namespace
}  // namespace qtb

extern "C" {
#define QTB_DEFINE_GEMM_SELECT(t, T)                                                                                 \
  void qtb_blas_##t##gemm_select(const QtbInt *m, const QtbInt *n, const QtbInt *k, qtb::GemmPanelSet<T> *panel_set, \
                                 qtb::GemmPlan<T> *plan) {                                                           \
    qtb::gemm_select(m, n, k, panel_set, plan);                                                                      \
  }
QTB_FOR_EACH_GEMM(QTB_DEFINE_GEMM_SELECT)
}
