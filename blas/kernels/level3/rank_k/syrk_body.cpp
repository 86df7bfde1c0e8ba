// The bodies of syrk and herk (update.h tells what is computed): the triangle in chunks of at most 72 rows.
//
// A chunk on the diagonal is copied to the stack by slices of the depth (chunk_copy.h, 41,472 bytes), and its elements
// are summed two rows by two (pair_sums.h) and added to C slice by slice; beta is applied with the first one. Between
// chunks GEMM computes the rectangles.
#include "blas/kernels/level3/rank_k/pair_sums.h"
#include "blas/kernels/level3/rank_k/split.h"
#include "blas/kernels/level3/rank_k/tile_triangle.h"

namespace qtb::QTB_TIER {
namespace {

// What becomes of the sums of one slice of the depth: C := beta*C + alpha*sum.
template <class Update>
struct Elements {
  using T = typename Update::Element;
  using S = typename Update::Scalar;
  Finish<S> finish;
  S alpha, beta;
  Elements(S a, S b) : finish(a, b), alpha(a), beta(b) {}

  template <int count>
  void store(T *c, Vec<T> sum) const {
    store_part<count>(c, finish(sum, [=] { return load_part<count>(static_cast<const T *>(c)); }));
  }
  void store_pair(T *c, const Pair<T> &pair) const {
    constexpr int in_vector = Pair<T>::in_vector;
    repeat<Pair<T>::vectors>([&](auto v) { store<in_vector>(c + v.value * in_vector, pair.v[v.value]); });
  }
  // The first element of a pair.
  void store_first(T *c, const Pair<T> &pair) const { store<1>(c, pair.v[0]); }
  void store_diagonal(T *c, const Pair<T> &pair) const {
    if constexpr (!Update::hermitian) {
      store_first(c, pair);
    } else {
      S *const re = parts(c);
      S total;
      store_lowest(&total, pair.v[0]);
      total *= alpha;
      if (!is_zero(beta)) total += beta * load_single(re);
      store_single(re, total);
      store_single(re + 1, S{0});
    }
  }
};

template <class Update>
void add_slice(const Update &u, const ChunkCopy<typename Update::Element> &copy, QtbInt vectors,
               const Elements<Update> &elements) {
  using T = typename Update::Element;
  const Second second = !Update::hermitian ? Second::plain
                        : u.transposed     ? Second::first_conjugated
                                           : Second::conjugated;
  const Second mirrored = !Update::hermitian ? Second::plain
                          : u.transposed     ? Second::conjugated
                                             : Second::first_conjugated;
  for (QtbInt j = 0; j < u.n; j += 2) {
    const bool two_columns = j + 1 < u.n;
    const QtbInt end = u.upper ? j : u.n;
    for (QtbInt i = u.upper ? 0 : j + 2; i < end; i += 2) {
      const SquareSums<T> s(vectors, copy.row(i), copy.row(j));
      repeat<2>([&](auto e) {
        const Pair<T> pair = totals(s.sum[0][e.value], s.sum[1][e.value], second);
        if (e.value == 1 && !two_columns) return;
        if (i + 1 < u.n)
          elements.store_pair(u.at(i, j + e.value), pair);
        else
          elements.store_first(u.at(i, j + e.value), pair);
      });
    }
    const TriangleSums<T> s(vectors, copy.row(j));
    elements.store_diagonal(u.at(j, j), totals(s.first, s.first, second));
    if (!two_columns) continue;
    if (u.upper)
      elements.store_first(u.at(j, j + 1), totals(s.off, s.off, second));
    else
      elements.store_first(u.at(j + 1, j), totals(s.off, s.off, mirrored));
    elements.store_diagonal(u.at(j + 1, j + 1), totals(s.second, s.second, second));
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
    add_slice(u, copy, copy.vectors_of(depth), Elements<Update>(u.alpha, beta));
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
