// The kernel of the tiles of 32 bytes by four columns: 8 x 4 in s, 4 x 4 in c and d, 2 x 4 in z.
//
// Before the rows of a group of columns pass, the stage gets its micro-panel of B with each real number in all lanes of
// a vector, so that a step is loads, products and sums alone: a shuffle in the depth would compete with these. Of a
// complex micro-panel the stage has two columns and then the other two, a pass of the tile each.
#pragma once

#include "blas/kernels/level3/gemm/def/kernels.h"
#include "blas/kernels/level3/gemm/def/tile.h"

namespace qtb::QTB_TIER {
namespace {

constexpr int staged_vectors = 2, staged_columns = 4;  // of real numbers, in one pass

// A kernel's constants: longest is the depth of Steps::all.
struct StagedForm {
  Steps steps;
  int longest;
  int ahead_bytes = 0;
};

// One micro-panel of B, of columns real numbers per step, and all rows of A.
template <class T, Beta beta, StagedForm form, int columns>
void run_staged_columns(QtbInt m, QtbInt kp, const T *ap, QtbInt ldap, SourceB<Real<T>> b, T *c, QtbInt ldc,
                        Real<T> *stage, const Real<T> *beta_lanes) {
  using R = Real<T>;
  using A = PackedA<R, staged_vectors, form.ahead_bytes>;
  constexpr int whole = columns / staged_columns, left = columns % staged_columns;
  constexpr QtbInt mr = staged_vectors * lanes<T>;
  constexpr QtbInt columns_per_pass = staged_columns * lanes<T> / lanes<R>;
  const QtbInt stage_step = kp * staged_columns * lanes<R>;

  for (int p = 0; p < whole; p++, b.first += staged_columns * b.column)
    fill_stage<R, staged_columns>(kp, b, stage + p * stage_step);
  if constexpr (left > 0) fill_stage<R, left>(kp, b, stage + whole * stage_step);

  for (QtbInt i0 = 0; i0 < m; i0 += mr, ap += ldap, c += mr) {
    const R *a = parts(ap);
    T *to = c;
    ask_for_c<columns * lanes<T> / lanes<R>, mr>(c, ldc);
    for (int p = 0; p < whole; p++, to += columns_per_pass * ldc)
      store_tile<T, beta>(sums_over<R, staged_vectors, staged_columns, form.steps, form.longest>(
                              kp, A(a), StagedB<R, staged_columns>{stage + p * stage_step}),
                          to, ldc, beta_lanes);
    if constexpr (left > 0)
      store_tile<T, beta>(
          sums_over<R, staged_vectors, left, Steps::fours, 0>(kp, A(a), StagedB<R, left>{stage + whole * stage_step}),
          to, ldc, beta_lanes);
  }
}

// All columns. b is the first micro-panel, next the distance to the one behind it; width_is_step: the steps of a
// micro-panel that is narrower than the others are so many real numbers apart as it has columns.
template <class T, Beta beta, StagedForm form, bool width_is_step>
void run_staged(QtbInt m, QtbInt n, QtbInt kp, const T *ap, QtbInt ldap, SourceB<Real<T>> b, QtbInt next, T *c,
                QtbInt ldc, Real<T> *stage, const Real<T> *beta_lanes) {
  constexpr int nr = 4, reals = is_complex<T> ? 2 : 1;
  constexpr StagedForm loop{Steps::fours, 0, form.ahead_bytes};
  for (; n >= nr; n -= nr, b.first += next, c += nr * ldc)
    run_staged_columns<T, beta, form, nr * reals>(m, kp, ap, ldap, b, c, ldc, stage, beta_lanes);
  if (width_is_step) b.step = n * reals;
  if (n == 3) run_staged_columns<T, beta, loop, 3 * reals>(m, kp, ap, ldap, b, c, ldc, stage, beta_lanes);
  if (n == 2) run_staged_columns<T, beta, loop, 2 * reals>(m, kp, ap, ldap, b, c, ldc, stage, beta_lanes);
  if (n == 1) run_staged_columns<T, beta, loop, reals>(m, kp, ap, ldap, b, c, ldc, stage, beta_lanes);
}

// The same with B in micro-panels.
template <class T, Beta beta, StagedForm form>
void run_on_panels(QTB_INNER_KERNEL_PARAMS(T), const Real<T> *beta_lanes) {
  constexpr int nr = 4, reals = is_complex<T> ? 2 : 1;
  run_staged<T, beta, form, true>(m, n, kp, ap, ldap, {parts(bp), kp, nr * reals, 1}, ldbp * reals, c, ldc,
                                  reinterpret_cast<Real<T> *>(stage), beta_lanes);
}

}  // namespace
}  // namespace qtb::QTB_TIER
