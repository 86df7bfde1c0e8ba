// load_balance: how evenly the parallel GEMM cuts a problem, for teams that this machine does not have.
//
// For every machine class of the process's tier, element type, shape and team, the selector is asked as a call would
// ask it, and the strategy's share functions for what each thread computes. Printed is the share of an even cut over
// that of the busiest thread: 1 where all compute the same, 0.96 on 25 threads where one of them idles, and the
// speed-up divided by the team where nothing else costs time. A letter tells the strategy. QTB_DEBUG_CPU_TYPE chooses
// the tier, and with it the register tiles.

#include <algorithm>
#include <cstdio>

#include "blas/thread/32e/level3/gemm_select.h"
#include "blas/thread/32e/level3/gemm_share.h"
#include "blas/thread/32e/level3/gemm_strategies.h"
#include "service/cpu.h"

namespace qtb::bench {
namespace {

struct Shape {
  QtbInt m, n, k;
};
constexpr Shape shapes[] = {{200, 200, 200},    {600, 600, 600},    {1000, 1000, 1000}, {2000, 2000, 2000},
                            {5000, 5000, 5000}, {10000, 400, 400},  {400, 10000, 400},  {4000, 4000, 64},
                            {10000, 3000, 256}, {1000, 1000, 10000}};
constexpr QtbInt teams[] = {2, 3, 4, 5, 6, 8, 12, 16, 24, 25, 32, 48, 64};

struct MachineRow {
  ProcessorTier tier;
  GemmMachineClass machine;
  const char *name;
};
constexpr MachineRow machines[] = {{tier_def, machine_plain, "def"},
                                   {tier_def, machine_family16, "def, on the family with kernels of its own"},
                                   {tier_sse3, machine_plain, "sse3"},
                                   {tier_ssse3, machine_ssse3, "ssse3"},
                                   {tier_ssse3, machine_sse41_large_l2, "ssse3 and SSE4.1, large second cache level"},
                                   {tier_ssse3, machine_sse41_small_l2, "ssse3 and SSE4.1, small second cache level"},
                                   {tier_sse42, machine_sse42, "sse42"},
                                   {tier_avx, machine_avx, "avx"}};
consteval bool machines_of_every_tier() {
  unsigned found = 0;
  for (const MachineRow &row : machines) found |= 1U << row.tier;
  return found == tier_set::ALL;
}
static_assert(machines_of_every_tier(), "bench/load_balance.cpp: write a row for each machine class of every tier");

// ---- What a thread computes: elements of C, by strategy ----

template <class T>
struct Cut {
  const Shape &shape;
  const GemmPlan<T> &plan;
  const GemmPanelSet<T> &panels;
};

template <class T>
QtbInt by_row(const Cut<T> &cut, QtbInt i) {
  return gemm_range(cut.shape.m, cut.plan.nthreads, i).count * cut.shape.n;
}
template <class T>
QtbInt by_column(const Cut<T> &cut, QtbInt i) {
  return gemm_range(cut.shape.n, cut.plan.nthreads, i).count * cut.shape.m;
}
template <class T>
QtbInt by_tile_rows(const Cut<T> &cut, QtbInt i) {
  return gemm_rows(cut.shape.m, cut.plan.nthreads, cut.panels.mu, i).count * cut.shape.n;
}
template <class T, QtbInt column_unit>
QtbInt by_grid(const Cut<T> &cut, QtbInt i) {
  const GemmTile tile =
      gemm_grid_tile(cut.shape.m, cut.shape.n, cut.plan.grid_rows, cut.plan.grid_cols, cut.panels.mu, column_unit, i);
  return tile.rows * tile.columns;
}
template <class T>
QtbInt by_group(const Cut<T> &cut, QtbInt i) {
  const QtbInt cols = cut.plan.grid_cols, share = gemm_place_share(cut.shape.n, cols, cut.panels.nu);
  return gemm_rows(cut.shape.m, cut.plan.grid_rows, cut.panels.mu, i / cols).count *
         gemm_place(cut.shape.n, share, cols, i % cols).count;
}
template <class T>
QtbInt by_pair(const Cut<T> &cut, QtbInt i) {
  const QtbInt t = cut.plan.nthreads;
  const GemmPairs pairs = gemm_pairs(cut.shape.m, cut.shape.n, t / 2, cut.panels.mu, cut.panels.nu);
  return (i % 2 == 0 ? pairs.rows : cut.shape.m - pairs.rows) * (i < t - 2 ? pairs.share : pairs.last);
}

template <class T>
struct StrategyRow {
  GemmStrategy<T> *strategy;
  char letter;
  QtbInt (*elements)(const Cut<T> &cut, QtbInt i);
};

constexpr char legend[] =
    "R rows, C columns, W rows with B packed by all, G grid, X grid by blocks, A groups share A, B pairs share B, "
    "P rows, packed by each";

template <class T>
struct Strategies;
#define QTB_ROW(t, T, name, letter, elements) {&qtb_blas_##t##gemm_##name, letter, elements},
#define QTB_COMMON_ROWS(t, T)              \
  QTB_ROW(t, T, 1d_row, 'R', by_row<T>)    \
  QTB_ROW(t, T, 1d_col, 'C', by_column<T>) \
  QTB_ROW(t, T, 2d_abcopy_abx_m_km_par_p, 'P', by_tile_rows<T>)
#define QTB_GRID_ROWS(t, T)                                    \
  QTB_ROW(t, T, 2d_grid, 'G', (by_grid<T, gemm_grid_columns>)) \
  QTB_ROW(t, T, 2d_xgemm_p, 'X', (by_grid<T, 1>))
template <>
struct Strategies<float> {
  static constexpr StrategyRow<float> rows[] = {QTB_COMMON_ROWS(s, float) QTB_GRID_ROWS(s, float)};
};
template <>
struct Strategies<double> {
  static constexpr StrategyRow<double> rows[] = {QTB_COMMON_ROWS(d, double) QTB_GRID_ROWS(d, double) QTB_ROW(
      d, double, 2d_acopy_n, 'A', by_group<double>) QTB_ROW(d, double, 1d_with_copy_0, 'W', by_tile_rows<double>)};
};
template <>
struct Strategies<cfloat> {
  static constexpr StrategyRow<cfloat> rows[] = {QTB_COMMON_ROWS(c, cfloat)
                                                     QTB_ROW(c, cfloat, 2d_bcopy, 'B', by_pair<cfloat>)};
};
template <>
struct Strategies<cdouble> {
  static constexpr StrategyRow<cdouble> rows[] = {QTB_COMMON_ROWS(z, cdouble)
                                                      QTB_ROW(z, cdouble, 2d_bcopy, 'B', by_pair<cdouble>)};
};

// ---- The tables ----

template <class T>
using Selector = void(const QtbInt *, const QtbInt *, const QtbInt *, GemmPanelSet<T> *, GemmPlan<T> *);

template <class T>
void print_type(char type, Selector<T> *select, GemmMachineClass machine) {
  for (const Shape &shape : shapes) {
    std::printf("%c %5ld x %5ld x %5ld", type, static_cast<long>(shape.m), static_cast<long>(shape.n),
                static_cast<long>(shape.k));
    for (const QtbInt team : teams) {
      GemmPlan<T> plan{};
      GemmPanelSet<T> panels{};
      plan.nthreads = team;
      plan.machine_class = machine;
      select(&shape.m, &shape.n, &shape.k, &panels, &plan);
      for (const StrategyRow<T> &row : Strategies<T>::rows) {
        if (row.strategy != plan.strategy) continue;
        QtbInt busiest = 0;
        for (QtbInt i = 0; i < plan.nthreads; ++i) busiest = std::max(busiest, row.elements({shape, plan, panels}, i));
        const double even = static_cast<double>(shape.m * shape.n) / static_cast<double>(team);
        std::printf("  %.2f%c", even / static_cast<double>(busiest), row.letter);
      }
    }
    std::printf("\n");
  }
}

void print_machine(const MachineRow &row) {
  std::printf("%s\n%-22s", row.name, "threads");
  for (const QtbInt team : teams) std::printf("%7ld", static_cast<long>(team));
  std::printf("\n");
#define QTB_PRINT_TYPE(t, T) print_type<T>(#t[0], &qtb_blas_##t##gemm_select, row.machine);
  QTB_FOR_EACH_GEMM(QTB_PRINT_TYPE)
  std::printf("\n");
}

}  // namespace
}  // namespace qtb::bench

int main() {
  using namespace qtb::bench;
  std::printf("%s\n\n", legend);
  for (const MachineRow &row : machines)
    if (row.tier == qtb_serv_cpu_detect()) print_machine(row);
  return 0;
}
