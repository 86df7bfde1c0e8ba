// dgemm_kernel_* of sse3: C := beta*C + A*op(B) (def/kernels.h), in tiles of 4 x 4.
//
// The element-doubling load brings an element of B into both lanes, so that no stage is needed, and B may as well be
// where its caller has it. Edges of fewer than 4 rows or columns are tiles of their own, of which only what is part of
// A, B and C is read and written.
#include "blas/kernels/level3/gemm/def/kernels.h"
#include "blas/kernels/level3/gemm/def/tile.h"

namespace qtb::QTB_TIER {
namespace {

constexpr int fixed_depth = 112;  // the largest kb of the family
constexpr int tile_rows = 4, tile_columns = 4;
constexpr int panel_ahead_bytes = 576;

// A as its caller has it: rows of each column, zeros for the lane that is left.
template <int rows>
struct InPlaceA {
  static constexpr int vectors = (rows + 1) / 2;
  static constexpr bool paced = true;
  const double *at;
  QtbInt ld;
  [[gnu::always_inline]] __m128d load(int v) const {
    return 2 * v + 2 <= rows ? load_unaligned(at + 2 * v) : load_lowest(at + 2 * v);
  }
  [[gnu::always_inline]] void next() { at += ld; }
  [[gnu::always_inline]] const double *&pace() { return at; }
};

template <int columns>
struct PackedB {
  static constexpr bool paced = false;
  const double *at;
  [[gnu::always_inline]] __m128d load(int j) const { return broadcast(load_single(at + j)); }
  [[gnu::always_inline]] void next() { at += columns; }
};

template <bool transposed>
struct InPlaceB {
  static constexpr bool paced = transposed;
  const double *at;
  QtbInt ld;
  [[gnu::always_inline]] __m128d load(int j) const { return broadcast(load_single(transposed ? at + j : at + j * ld)); }
  [[gnu::always_inline]] void next() { at += transposed ? ld : 1; }
  [[gnu::always_inline]] const double *&pace() { return at; }
};

QTB_STEP(add_with_two_copies, double, QTB_TWO_COPIES, "pd", "movaps", "movddup")
QTB_STEP(add_with_second_vector, double, QTB_SECOND_VECTOR, "pd", "movaps", "movddup")
QTB_STEP(add_in_place, double, QTB_LOADED_AGAIN, "pd", "movups", "movddup")

template <int ahead_bytes>
[[gnu::always_inline]] inline void add_step(int l, Sums<double, 2, 4> &sums,
                                            const PackedA<double, 2, ahead_bytes> &from_a, const PackedB<4> &from_b) {
  if (l % 3 == 0)
    add_with_two_copies(sums.v, from_a.at, from_b.at, 1);
  else
    add_with_second_vector(sums.v, from_a.at, from_b.at, 1);
}
template <bool transposed>
[[gnu::always_inline]] inline void add_step(int, Sums<double, 2, 4> &sums, const InPlaceA<4> &from_a,
                                            const InPlaceB<transposed> &from_b) {
  add_in_place(sums.v, from_a.at, from_b.at, transposed ? 1 : from_b.ld);
}

// rows of C from the sums of a tile.
template <Beta beta, int rows, int vectors, int columns>
[[gnu::always_inline]] inline void store_rows(const Sums<double, vectors, columns> &sums, double *c, QtbInt ldc,
                                              const double *lanes_of_beta) {
  for (int j = 0; j < columns; j++, c += ldc)
    for (int v = 0; v < (rows + 1) / 2; v++) {
      const bool whole = 2 * v + 2 <= rows;
      double *to = c + 2 * v;
      __m128d sum = sums.v[j][v];
      if constexpr (beta != Beta::zero)
        sum = add(times_beta<double, beta>(whole ? load_unaligned(to) : load_lowest(to), lanes_of_beta), sum);
      if (whole)
        store_unaligned(to, sum);
      else
        store_lowest(to, sum);
    }
}

// ---- A and B packed ----

template <Steps steps, Beta beta, int columns>
void run_packed_columns(QtbInt m, QtbInt k, const double *a, QtbInt lda, const double *b, double *c, QtbInt ldc,
                        const double *lanes_of_beta) {
  using A = PackedA<double, 2, panel_ahead_bytes>;
  for (; m >= tile_rows; m -= tile_rows, a += lda, c += tile_rows) {
    ask_for_c<columns, tile_rows>(c, ldc);
    store_rows<beta, 4>(sums_over<double, 2, columns, steps, fixed_depth>(k, A(a), PackedB<columns>{b}), c, ldc,
                        lanes_of_beta);
  }
  if (m == 0) return;
  const Sums<double, 2, columns> sums =
      sums_over<double, 2, columns, Steps::fours, 0>(k, PackedA<double, 2, 0>(a), PackedB<columns>{b});
  if (m == 3) store_rows<beta, 3>(sums, c, ldc, lanes_of_beta);
  if (m == 2) store_rows<beta, 2>(sums, c, ldc, lanes_of_beta);
  if (m == 1) store_rows<beta, 1>(sums, c, ldc, lanes_of_beta);
}

template <Steps steps, Beta beta>
void run_packed(QTB_EDGE_KERNEL_PARAMS) {
  static_cast<void>(alpha);
  for (; n >= tile_columns; n -= tile_columns, b += ldb, c += tile_columns * ldc)
    run_packed_columns<steps, beta, 4>(m, k, a, lda, b, c, ldc, beta_lanes);
  if (n == 3) run_packed_columns<Steps::fours, beta, 3>(m, k, a, lda, b, c, ldc, beta_lanes);
  if (n == 2) run_packed_columns<Steps::fours, beta, 2>(m, k, a, lda, b, c, ldc, beta_lanes);
  if (n == 1) run_packed_columns<Steps::fours, beta, 1>(m, k, a, lda, b, c, ldc, beta_lanes);
}

// ---- A and B as their caller has them ----

template <Steps steps, Beta beta, int rows, int columns, class B>
[[gnu::always_inline]] inline void run_tile(QtbInt k, const double *a, QtbInt lda, B b, double *c, QtbInt ldc,
                                            const double *alpha, const double *lanes_of_beta) {
  constexpr int vectors = InPlaceA<rows>::vectors;
  Sums<double, vectors, columns> sums =
      sums_over<double, vectors, columns, steps, fixed_depth>(k, InPlaceA<rows>{a, lda}, b);
  const __m128d factor = load_aligned(alpha);
  for (int j = 0; j < columns; j++)
    for (int v = 0; v < vectors; v++) {
      sums.v[j][v] = mul(sums.v[j][v], factor);
      if constexpr (beta == Beta::zero) sums.v[j][v] = add(zero<double>(), sums.v[j][v]);  // as added to zeros: no -0
    }
  store_rows<beta, rows>(sums, c, ldc, lanes_of_beta);
}

template <Steps steps, Beta beta, int columns, class B>
void run_columns(QtbInt m, QtbInt k, const double *a, QtbInt lda, B b, double *c, QtbInt ldc, const double *alpha,
                 const double *lanes_of_beta) {
  for (; m >= tile_rows; m -= tile_rows, a += tile_rows, c += tile_rows)
    run_tile<steps, beta, 4, columns>(k, a, lda, b, c, ldc, alpha, lanes_of_beta);
  if (m == 3) run_tile<Steps::any, beta, 3, columns>(k, a, lda, b, c, ldc, alpha, lanes_of_beta);
  if (m == 2) run_tile<Steps::any, beta, 2, columns>(k, a, lda, b, c, ldc, alpha, lanes_of_beta);
  if (m == 1) run_tile<Steps::any, beta, 1, columns>(k, a, lda, b, c, ldc, alpha, lanes_of_beta);
}

template <bool transposed, Steps steps, Beta beta>
void run_in_place(QTB_EDGE_KERNEL_PARAMS) {
  using B = InPlaceB<transposed>;
  const QtbInt column = transposed ? 1 : ldb;
  for (; n >= tile_columns; n -= tile_columns, b += tile_columns * column, c += tile_columns * ldc)
    run_columns<steps, beta, 4>(m, k, a, lda, B{b, ldb}, c, ldc, alpha, beta_lanes);
  if (n == 3) run_columns<Steps::any, beta, 3>(m, k, a, lda, B{b, ldb}, c, ldc, alpha, beta_lanes);
  if (n == 2) run_columns<Steps::any, beta, 2>(m, k, a, lda, B{b, ldb}, c, ldc, alpha, beta_lanes);
  if (n == 1) run_columns<Steps::any, beta, 1>(m, k, a, lda, B{b, ldb}, c, ldc, alpha, beta_lanes);
}

}  // namespace

#define QTB_SSE3_KERNEL(name, ...)                                            \
  extern "C" void qtb_blas_sse3_dgemm_kernel_##name(QTB_EDGE_KERNEL_PARAMS) { \
    __VA_ARGS__(m, n, k, a, lda, b, ldb, c, ldc, alpha, beta_lanes);          \
  }
QTB_SSE3_KERNEL(a112, run_packed<Steps::all, Beta::one>)
QTB_SSE3_KERNEL(a112e, run_packed<Steps::all, Beta::one>)
QTB_SSE3_KERNEL(ak, run_packed<Steps::fours, Beta::one>)
QTB_SSE3_KERNEL(ak_b, run_packed<Steps::fours, Beta::other>)
QTB_SSE3_KERNEL(ak_0, run_packed<Steps::fours, Beta::zero>)
QTB_SSE3_KERNEL(n112, run_in_place<false, Steps::all, Beta::one>)
QTB_SSE3_KERNEL(t112, run_in_place<true, Steps::all, Beta::one>)
QTB_SSE3_KERNEL(nk, run_in_place<false, Steps::any, Beta::one>)
QTB_SSE3_KERNEL(tk, run_in_place<true, Steps::any, Beta::one>)
QTB_SSE3_KERNEL(nk_b, run_in_place<false, Steps::any, Beta::other>)
QTB_SSE3_KERNEL(tk_b, run_in_place<true, Steps::any, Beta::other>)
QTB_SSE3_KERNEL(nk_0, run_in_place<false, Steps::any, Beta::zero>)
QTB_SSE3_KERNEL(tk_0, run_in_place<true, Steps::any, Beta::zero>)

}  // namespace qtb::QTB_TIER
