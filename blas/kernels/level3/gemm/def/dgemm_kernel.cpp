// dgemm_kernel and dgemm_def_kernel of def: C += Ap*Bp (kernels.h beside this file).
//
// dgemm_kernel: tiles of 2 x 12, 2 x 8 and 2 x 4, one vector of A per step and a stage of B with each element twice. A
// step of the widest tile is 12 products, 12 sums and 13 loads. With two loads a cycle these are what limits it.
#include "blas/kernels/level3/gemm/def/staged.h"

namespace qtb::QTB_TIER {
namespace {

constexpr int fixed_depth = 128;  // the largest kb of the family
constexpr QtbInt tile_rows = 2;

// sum += a*b, b an operand in memory: compilers load it, and copy sums from register to register.
[[gnu::always_inline]] inline void add_product(__m128d &sum, __m128d a, const double *b) {
  __m128d x;
  __asm__ volatile("movaps %[a], %[x]\n\tmulpd %[b], %[x]\n\taddpd %[x], %[sum]"
                   : [sum] "+x"(sum), [x] "=&x"(x)
                   : [a] "x"(a), [b] "m"(*reinterpret_cast<const __m128d *>(b)));
}
template <int columns>
[[gnu::always_inline]] inline void add_step(int, Sums<double, 1, columns> &sums, const PackedA<double, 1, 0> &from_a,
                                            const StagedB<double, columns> &from_b) {
  const __m128d a = from_a.load(0);
  for (int j = 0; j < columns; j++) add_product(sums.v[j][0], a, from_b.at + j * lanes<double>);
}

// Elements of the micro-panel as it is, for rows that pass but once.
template <int columns>
struct PanelB {
  static constexpr bool paced = false;
  const double *at;
  [[gnu::always_inline]] __m128d load(int j) const { return broadcast(load_single(at + j)); }
  [[gnu::always_inline]] void next() { at += columns; }
};

// The lines of A behind the tile at hand, for the tiles to come.
inline void ask_for_rows(const double *a) {
  constexpr int nearest = 128, farthest = 512, line = 64;
  for (int ahead = nearest; ahead <= farthest; ahead += line)
    _mm_prefetch(reinterpret_cast<const char *>(a) + ahead, _MM_HINT_T0);
}

// Not inlined, so that a call computes what its own width needs.
template <Steps steps, int columns>
[[gnu::noinline]] void run_columns(QtbInt m, QtbInt kp, const double *ap, QtbInt ldap, const double *bp, double *c,
                                   QtbInt ldc, double *stage) {
  if (m <= tile_rows)
    return store_tile<double, Beta::one>(
        sums_over<double, 1, columns, Steps::fours, 0>(kp, PackedA<double, 1, 0>(ap), PanelB<columns>{bp}), c, ldc,
        nullptr);
  fill_stage<double, columns>(kp, {bp, kp, columns, 1}, stage);
  for (QtbInt i0 = 0; i0 < m; i0 += tile_rows, ap += ldap, c += tile_rows) {
    ask_for_rows(ap);
    store_tile<double, Beta::one>(sums_over<double, 1, columns, steps, fixed_depth>(kp, PackedA<double, 1, 0>(ap),
                                                                                    StagedB<double, columns>{stage}),
                                  c, ldc, nullptr);
  }
}

template <Steps steps>
void run(QTB_INNER_KERNEL_PARAMS(double)) {
  for (QtbInt w; n > 0; n -= w, bp += ldbp, c += w * ldc) {
    w = panel_width(12, n);
    if (w == 12)
      run_columns<steps, 12>(m, kp, ap, ldap, bp, c, ldc, stage);
    else if (w == 8)
      run_columns<steps, 8>(m, kp, ap, ldap, bp, c, ldc, stage);
    else
      run_columns<steps, 4>(m, kp, ap, ldap, bp, c, ldc, stage);
  }
}

}  // namespace

extern "C" void qtb_blas_def_dgemm_kernel(QTB_INNER_KERNEL_PARAMS(double)) {
  run<Steps::fours>(m, n, kp, ap, ldap, bp, ldbp, c, ldc, stage);
}
extern "C" void qtb_blas_def_dgemm_kernel_128(QTB_INNER_KERNEL_PARAMS(double)) {
  run<Steps::all>(m, n, kp, ap, ldap, bp, ldbp, c, ldc, stage);
}

constexpr int panel_ahead_bytes = 576;
constexpr StagedForm family_form{Steps::fours, 0, panel_ahead_bytes};

extern "C" void qtb_blas_def_dgemm_def_kernel(QTB_INNER_KERNEL_PARAMS(double)) {
  run_on_panels<double, Beta::one, family_form>(m, n, kp, ap, ldap, bp, ldbp, c, ldc, stage, nullptr);
}
extern "C" void qtb_blas_def_dgemm_def_kernel_in_place(QTB_IN_PLACE_KERNEL_PARAMS(double)) {
  const QtbInt kp = round_up(depth, 4), step = transb ? ldb : 1, column = transb ? 1 : ldb;
  run_staged<double, Beta::one, family_form, false>(m, n, kp, ap, ldap, {b, depth, step, column}, 4 * column, c, ldc,
                                                    stage, nullptr);
}

}  // namespace qtb::QTB_TIER
