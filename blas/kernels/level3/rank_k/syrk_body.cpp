// The bodies of syrk and herk (update.h tells what is computed): the triangle in chunks of at most 72 rows.
//
// A chunk on the diagonal is copied to the stack by slices of the depth (chunk_copy.h, 41,472 bytes), and its elements
// are summed two rows by two (row_sums.h) and added to C slice by slice; beta is applied with the first one. Between
// chunks GEMM computes the rectangles.
#include "blas/kernels/level3/rank_k/row_sums.h"
#include "blas/kernels/level3/rank_k/split.h"
#include "blas/kernels/level3/rank_k/tile_triangle.h"

namespace qtb::QTB_TIER {
namespace {

// What becomes of the sums of one slice of the depth: C := beta*C + alpha*sum.
template <class Update>
struct Elements {
  using T = typename Update::Element;
  using S = typename Update::Scalar;
  static constexpr Conjugated no = Conjugated::none;
  const Update &u;
  Finish<S> finish;
  S beta;
  // What is conjugated in element (i, j) as sum of row i with row j, and of row j with row i.
  Conjugated as_it_is, mirrored;
  Elements(const Update &update, S b)
      : u(update),
        finish(update.alpha, b),
        beta(b),
        as_it_is(!Update::hermitian  ? no
                 : update.transposed ? Conjugated::first
                                     : Conjugated::second),
        mirrored(!Update::hermitian  ? no
                 : update.transposed ? Conjugated::second
                                     : Conjugated::first) {}

  // The first rows of count sums, get(i) for row i, below each other from c on.
  template <int count, class Get>
  [[gnu::always_inline]] void store_column(T *c, QtbInt rows, Conjugated conjugated, Get get) const {
    constexpr int whole = static_cast<int>(lanes<T>), vectors = (count + whole - 1) / whole;
    repeat<vectors>([&](auto v) __attribute__((always_inline)) {
      constexpr int first = v.value * whole, wanted = count - first < whole ? count - first : whole;
      if (first >= rows) return;
      Sum<T> sums[whole];
      repeat<wanted>([&](auto i) __attribute__((always_inline)) { sums[i.value] = get(Constant<first + i.value>()); });
      const Vec<T> sum = totals(sums, conjugated);
      const auto store = [&](auto part) __attribute__((always_inline)) {
        store_part<part.value>(c + first, finish(sum, [=] { return load_part<part.value>(c + first); }));
      };
      if constexpr (wanted == 1)
        store(Constant<1>());
      else if (rows - first >= wanted)
        store(Constant<wanted>());
      else
        with_count<wanted - 1>(rows - first, store);
    });
  }
  // A Hermitian diagonal element: the imaginary part of its sum is 0, and that of C is not read.
  void store_real(T *c, const Sum<T> &sum) const {
    S *const re = parts(c);
    const S old = is_zero(beta) ? S{0} : beta * load_single(re);
    store_single(re, old + u.alpha * sum_lanes(sum.direct));
    store_single(re + 1, S{0});
  }

  // The sums are no constants: compilers keep those in memory.
  template <int tile_rows>
  void add_tile(const ChunkCopy<T> &copy, QtbInt vectors, QtbInt i, QtbInt rows, QtbInt j, QtbInt columns) const {
    TileSums<T, tile_rows> s = sum_tile<T, tile_rows>(vectors, copy.row(i), copy.row(j));
    store_column<tile_rows>(
        u.at(i, j), rows, as_it_is, [&](auto r) __attribute__((always_inline)) { return s.sum[r.value][0]; });
    if (columns > 1)
      store_column<tile_rows>(
          u.at(i, j + 1), rows, as_it_is, [&](auto r) __attribute__((always_inline)) { return s.sum[r.value][1]; });
  }
  template <int tile_rows>
  void add_triangle(const ChunkCopy<T> &copy, QtbInt vectors, QtbInt j, QtbInt rows) const {
    constexpr int diagonal = Update::hermitian ? 1 : 0;  // of the elements of a column, stored apart
    TriangleSums<T, tile_rows> s = sum_triangle<T, tile_rows>(vectors, copy.row(j));
    repeat<tile_rows>([&](auto e) __attribute__((always_inline)) {
      constexpr int column = e.value, above = column + 1 - diagonal, below = tile_rows - column - diagonal;
      if (column >= rows) return;
      if (u.upper) {
        if constexpr (above > 0)
          store_column<above>(
              u.at(j, j + column), above,
              as_it_is, [&](auto r) __attribute__((always_inline)) { return s.sum[r.value][column]; });
      } else {
        if constexpr (below > 0)
          store_column<below>(
              u.at(j + column + diagonal, j + column), rows - column - diagonal,
              mirrored, [&](auto r) __attribute__((always_inline)) {
                return s.sum[column][column + diagonal + r.value];
              });
      }
      if constexpr (Update::hermitian) store_real(u.at(j + column, j + column), s.sum[column][column]);
    });
  }
};

// f(Constant<rows>()) for the rows that tiles take at once, or for two where no more are left.
template <class T, class F>
[[gnu::always_inline]] inline void with_tile_rows(QtbInt rows, F f) {
  if (rows_at_once<T> == 2 || rows <= 2)
    f(Constant<2>());
  else
    f(Constant<rows_at_once<T>>());
}

// The rows of a group stay in the first cache level while the pairs beside them pass.
template <class Update>
void add_slice(const Update &u, const ChunkCopy<typename Update::Element> &copy, QtbInt vectors,
               const Elements<Update> &elements) {
  using T = typename Update::Element;
  constexpr QtbInt step = rows_at_once<T>;
  for (QtbInt i = 0; i < u.n; i += step) {
    const QtbInt rows = u.n - i < step ? u.n - i : step, end = u.upper ? u.n : i;
    with_tile_rows<T>(
        rows, [&](auto tile_rows) __attribute__((always_inline)) {
          elements.template add_triangle<tile_rows.value>(copy, vectors, i, rows);
          for (QtbInt j = u.upper ? i + step : 0; j < end; j += 2)
            elements.template add_tile<tile_rows.value>(copy, vectors, i, rows, j, u.n - j);
        });
  }
}

template <class Update>
void update_chunk(const Update &u) {
  using T = typename Update::Element;
  using S = typename Update::Scalar;
  ChunkCopy<T> copy;
  S beta = u.beta;
  for (QtbInt l = 0; l < u.k; l += copy.depth) {
    const QtbInt depth = u.k - l < copy.depth ? u.k - l : copy.depth;
    if (u.transposed)
      copy_rows(u.n, depth, u.a + l, u.lda, copy);
    else
      copy_across(u.n, depth, u.a + l * u.lda, u.lda, copy);
    add_slice(u, copy, copy.vectors_of(depth), Elements<Update>(u, beta));
    if constexpr (is_complex<S>)
      beta = {1, 0};
    else
      beta = 1;
  }
}

template <class Update>
void update_body(const Update &u) {
  if (u.n <= 0) return;
  if (u.only_scales()) return scale_triangle<Update::hermitian>(u.upper, u.n, u.beta, u.c, u.ldc);
  split(u, strips::chunks(u.n), [](const Update &chunk) { update_chunk(chunk); });
}

template <class T>
QTB_FUNCTION(syrk, T, syrk_body) {
  update_body(rank_k<false>(uplo, trans, n, k, alpha, a, lda, beta, c, ldc));
}
template <class T>
QTB_FUNCTION(herk, T, herk_body) {
  update_body(rank_k<true>(uplo, trans, n, k, alpha, a, lda, beta, c, ldc));
}

}  // namespace

QTB_KERNEL(ssyrk_body, syrk, float, syrk_body<float>)
QTB_KERNEL(dsyrk_body, syrk, double, syrk_body<double>)
QTB_KERNEL(csyrk_body, syrk, cfloat, syrk_body<cfloat>)
QTB_KERNEL(zsyrk_body, syrk, cdouble, syrk_body<cdouble>)
QTB_KERNEL(cherk_body, herk, cfloat, herk_body<cfloat>)
QTB_KERNEL(zherk_body, herk, cdouble, herk_body<cdouble>)

}  // namespace qtb::QTB_TIER
