// gemm_small: C := alpha*op(A)*op(B) + beta*C without packing and without a buffer, for problems that a panel would not
// pay for and for the rows that the register tiles leave over.
//
// Two loop nests serve the four cases. Where the rows of op(A) lie side by side, a tile of a few vectors of rows and a
// few columns is summed in registers over the whole depth (column updates); A transposed and B transposed is the same
// with the operands exchanged and C written row by row. Where both operands have the depth side by side, a tile of
// elements is formed as dot products. Every element is scaled and added once: beta*C + alpha*sum. A beta of 0 stores
// without reading C. No alignment is asked for, and nothing outside the operands is read.
#include "blas/kernels/level3/gemm/parts.h"
#include "blas/kernels/level3/gemm/short_depth.h"
#include "blas/kernels/level3/gemm/sums.h"

namespace qtb::QTB_TIER {
namespace {

template <bool by_rows, int vectors, int columns, int last, class T>
void update_tile(QtbInt k, SideBySide<T> x, ByElement<T> y, const Finish<T> &finish, Target<T> to) {
  Sums<vectors, columns, last, T> sums;
  sums.clear();
  for (QtbInt l = 0; l < k; l++) sums.add_step(x.x + l * x.ld, y.y + l * y.by_depth, y.by_element);
  repeat<columns>([&](auto e) {
    repeat<vectors>([&](auto v) {
      constexpr int count = count_of<vectors, last, T>(v.value);
      const Vec<T> sum = sums.total(v.value, e.value, x.conjugated, y.conjugated);
      if constexpr (by_rows) {
        T *c = to.c + v.value * lanes<T> * to.along + e.value;
        scatter_part<count>(c, to.along, finish(sum, [&] { return gather_part<count>(c, to.along); }));
      } else {
        T *c = to.c + v.value * lanes<T> + e.value * to.across;
        store_part<count>(c, finish(sum, [&] { return load_part<count>(c); }));
      }
    });
  });
}

// Vectors that are summed at once beside so many columns: a cache line of them where there are registers for its sums.
template <class T>
constexpr int vectors_at_once(int columns) {
  constexpr int most_sums = 8, line_vectors = 4, sums = is_complex<T> ? 2 : 1;
  return columns * line_vectors * sums <= most_sums ? line_vectors : 2;
}

// All elements against one group of columns.
template <bool by_rows, int columns, class T>
void update_group(QtbInt elements, QtbInt k, SideBySide<T> x, ByElement<T> y, const Finish<T> &finish, Target<T> to) {
  constexpr int whole = static_cast<int>(lanes<T>), vectors = vectors_at_once<T>(columns);
  const auto update_some = [&](auto count, auto last) __attribute__((always_inline)) {
    constexpr QtbInt taken = (count.value - 1) * whole + last.value;
    update_tile<by_rows, count.value, columns, last.value>(k, x, y, finish, to);
    elements -= taken;
    x.x += taken;
    to.c += taken * to.along;
  };
  if constexpr (vectors > 2)
    while (elements >= vectors * whole) update_some(Constant<vectors>(), Constant<whole>());
  while (elements >= 2 * whole) update_some(Constant<2>(), Constant<whole>());
  if (elements > whole) with_count<whole>(elements - whole, [&](auto last) { update_some(Constant<2>(), last); });
  if (elements > 0) with_count<whole>(elements, [&](auto last) { update_some(Constant<1>(), last); });
}

template <bool by_rows, class T>
void update_groups(QtbInt elements, QtbInt columns, QtbInt k, SideBySide<T> x, ByElement<T> y, const Finish<T> &finish,
                   Target<T> to) {
  constexpr int at_once = columns_at_once<T>;
  for (; columns >= at_once; columns -= at_once, y.y += at_once * y.by_element, to.c += at_once * to.across)
    update_group<by_rows, at_once>(elements, k, x, y, finish, to);
  if (columns > 0)
    with_count<at_once - 1>(columns,
                            [&](auto left) { update_group<by_rows, left.value>(elements, k, x, y, finish, to); });
}

// The smaller operand is the one that is passed over again.
template <bool by_rows, class T>
void update(QtbInt elements, QtbInt columns, QtbInt k, SideBySide<T> x, ByElement<T> y, const Finish<T> &finish,
            Target<T> to) {
  constexpr QtbInt strip = 2 * lanes<T>;
  if (elements <= columns || columns <= columns_at_once<T>)
    return update_groups<by_rows>(elements, columns, k, x, y, finish, to);
  for (; elements > 0; elements -= strip, x.x += strip, to.c += strip * to.along)
    update_groups<by_rows>(smaller(elements, strip), columns, k, x, y, finish, to);
}

// ---- Dot products ----

// x has rows columns ldx apart, y has columns columns ldy apart, all of them k long.
template <int rows, int columns, class T>
void dot_tile(QtbInt k, const T *x, QtbInt ldx, bool x_conjugated, const T *y, QtbInt ldy, const Finish<T> &finish,
              T *c, QtbInt ldc) {
  DotSum<T> sum[rows][columns];
  const auto step = [&](auto load) {
    Vec<T> a[rows];
    repeat<rows>([&](auto i) { a[i.value] = load(x + i.value * ldx); });
    repeat<columns>([&](auto j) {
      const Vec<T> b = load(y + j.value * ldy);
      Vec<T> crossed = b;
      if constexpr (is_complex<T>) crossed = swap_parts(b);
      repeat<rows>([&](auto i) { sum[i.value][j.value].add_step(a[i.value], b, crossed); });
    });
  };
  QtbInt l = 0;
  for (; l + lanes<T> <= k; l += lanes<T>, x += lanes<T>, y += lanes<T>)
    step([](const T *p) { return load_unaligned(p); });
  for (; l < k; l++, x++, y++) step([](const T *p) { return load_lowest(p); });
  repeat<columns>([&](auto j) {
    repeat<rows>([&](auto i) {
      T *to = c + i.value + j.value * ldc;
      store_lowest(to, finish(sum[i.value][j.value].total(x_conjugated), [&] {
                     if constexpr (is_complex<T>)
                       return load_repeated(to);
                     else
                       return broadcast(load_single(to));
                   }));
    });
  });
}

template <int rows, class T>
void dot_rows(QtbInt n, QtbInt k, const T *x, QtbInt ldx, bool x_conjugated, const T *y, QtbInt ldy,
              const Finish<T> &finish, T *c, QtbInt ldc) {
  constexpr int at_once = columns_at_once<T>;
  QtbInt j = 0;
  for (; j + at_once <= n; j += at_once)
    dot_tile<rows, at_once>(k, x, ldx, x_conjugated, y + j * ldy, ldy, finish, c + j * ldc, ldc);
  if (j < n)
    with_count<at_once - 1>(n - j, [&](auto left) {
      dot_tile<rows, left.value>(k, x, ldx, x_conjugated, y + j * ldy, ldy, finish, c + j * ldc, ldc);
    });
}

template <class T>
QTB_FUNCTION(gemm, T, small) {
  const Op op_a = read_op<T>(transa), op_b = read_op<T>(transb);
  const bool a_conjugated = op_a == Op::conjugate, b_conjugated = op_b == Op::conjugate;
  const bool a_is_n = op_a == Op::none, b_is_n = op_b == Op::none;
  const QtbInt rows = *m, columns = *n, depth = *k;
  if (depth <= 0) return scale_columns<T>(m, n, beta, c, ldc);  // no sum, so that no alpha makes a NaN of it
  constexpr QtbInt whole = lanes<T>;
  const Finish<T> finish(*alpha, *beta);
  const ByElement<T> by_column{b, b_is_n ? 1 : *ldb, b_is_n ? *ldb : 1, b_conjugated};
  // A few rows go along the columns instead where those lie side by side: whole vectors, and more of a line at a time.
  constexpr QtbInt few = 3;
  const bool by_rows = !b_is_n && (!a_is_n || (rows <= few && columns >= whole));
  const bool by_lanes = !a_is_n && b_is_n;
  if (rows >= whole && depth <= (by_lanes || !is_complex<T> ? longest_short_depth<T> : longest_in_sequence)) {
    if (a_is_n)
      multiply_short(rows, columns, depth, SideBySide<T>{a, *lda, false}, by_column, finish, c, *ldc);
    else
      multiply_short_transposed(rows, columns, depth, a, *lda, a_conjugated, by_lanes, by_column, finish, c, *ldc);
  } else if (by_rows) {
    update<true>(columns, rows, depth, SideBySide<T>{b, *ldb, b_conjugated},
                 ByElement<T>{a, a_is_n ? *lda : 1, a_is_n ? 1 : *lda, a_conjugated}, finish, Target<T>{c, *ldc, 1});
  } else if (a_is_n) {
    update<false>(rows, columns, depth, SideBySide<T>{a, *lda, false}, by_column, finish, Target<T>{c, 1, *ldc});
  } else {
    QtbInt i = 0;
    for (; i + 2 <= rows; i += 2)
      dot_rows<2>(columns, depth, a + i * *lda, *lda, a_conjugated, b, *ldb, finish, c + i, *ldc);
    if (i < rows) dot_rows<1>(columns, depth, a + i * *lda, *lda, a_conjugated, b, *ldb, finish, c + i, *ldc);
  }
}

}  // namespace

QTB_KERNEL(sgemm_small, gemm, float, small<float>)
QTB_KERNEL(dgemm_small, gemm, double, small<double>)
QTB_KERNEL(cgemm_small, gemm, cfloat, small<cfloat>)
QTB_KERNEL(zgemm_small, gemm, cdouble, small<cdouble>)

}  // namespace qtb::QTB_TIER
