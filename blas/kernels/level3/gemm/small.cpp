// gemm_small: C := alpha*op(A)*op(B) + beta*C without packing and without a buffer, for problems that a panel would not
// pay for and for the rows that the register tiles leave over.
//
// Two loop nests serve the four cases. Where the rows of op(A) lie side by side, a tile of a few vectors of rows and a
// few columns is summed in registers over the whole depth (column updates); A transposed and B transposed is the same
// with the operands exchanged and C written row by row. Where both operands have the depth side by side, a tile of
// elements is formed as dot products. Every element is scaled and added once: beta*C + alpha*sum. A beta of 0 stores
// without reading C. No alignment is asked for, and nothing outside the operands is read.
#include "blas/kernels/element.h"
#include "blas/kernels/level3/gemm/parts.h"
#include "blas/kernels/simd/repeat.h"

namespace qtb::QTB_TIER {
namespace {

// beta*C + alpha*sum, by vector.
template <class T>
struct Finish {
  Factor<T> alpha, beta;
  bool reads_c, scales_c;
  Finish(T a, T b) : alpha(a), beta(b), reads_c(!is_zero(b)), scales_c(!is_one(b)) {}
  template <class Load>
  Vec<T> operator()(Vec<T> sum, Load load_c) const {
    Vec<T> v = alpha.times(sum);
    if (!reads_c) return add(zero<T>(), v);  // what is added to a C of zeros: never -0
    const Vec<T> old = load_c();
    return add(scales_c ? beta.times(old) : old, v);
  }
};

// count elements of a vector, zeros in the other lanes, and their store; steps of inc apart for the store of a row.
template <int count, class T>
Vec<T> load_part(const T *p) {
  if constexpr (count == lanes<T>)
    return load_unaligned(p);
  else if constexpr (count == 2)
    return _mm_castpd_ps(load_lowest(reinterpret_cast<const double *>(p)));
  else
    return load_lowest(p);
}
template <int count, class T>
void store_part(T *p, Vec<T> v) {
  if constexpr (count == lanes<T>)
    store_unaligned(p, v);
  else if constexpr (count == 2)
    store_lowest(reinterpret_cast<double *>(p), _mm_castps_pd(v));
  else
    store_lowest(p, v);
}
template <int count, class T>
Vec<T> gather_part(const T *p, QtbInt inc) {
  if constexpr (count == 1)
    return load_lowest(p);
  else if constexpr (count == 2 && lanes<T> == 4)
    return _mm_unpacklo_ps(load_lowest(p), load_lowest(p + inc));
  else
    return gather(p, inc);
}
template <int count, class T>
void scatter_part(T *p, QtbInt inc, Vec<T> v) {
  if constexpr (count == 1) {
    store_lowest(p, v);
  } else if constexpr (lanes<T> == 4) {
    store_lowest(p, v);
    store_lowest(p + inc, _mm_shuffle_ps(v, v, 1));
    if constexpr (count == 4) {
      store_lowest(p + 2 * inc, _mm_shuffle_ps(v, v, 2));
      store_lowest(p + 3 * inc, _mm_shuffle_ps(v, v, 3));
    }
  } else {
    scatter(p, inc, v);
  }
}

// An operand whose elements along the vector lie side by side: element (v, l) at x[v + l*ld].
template <class T>
struct SideBySide {
  const T *x;
  QtbInt ld;
  bool conjugated;
};
// The other operand, element by element: (l, e) at y[l*by_depth + e*by_element].
template <class T>
struct ByElement {
  const T *y;
  QtbInt by_depth, by_element;
  bool conjugated;
};
// C, from the tile's first element: (v, e) at c[v*along + e*across]; along is 1 unless C is written by rows.
template <class T>
struct Target {
  T *c;
  QtbInt along, across;
};

// The sums of a tile of vectors x columns, count elements to a vector: real products.
template <int vectors, int columns, int count, class T>
struct Sums {
  Vec<T> sum[vectors][columns];
  void clear() {
    repeat<vectors>([&](auto v) { repeat<columns>([&](auto e) { sum[v.value][e.value] = zero<T>(); }); });
  }
  void add_step(const T *x, const T *y, QtbInt by_element) {
    Vec<T> a[vectors];
    repeat<vectors>([&](auto v) { a[v.value] = load_part<count>(x + v.value * lanes<T>); });
    repeat<columns>([&](auto e) {
      const Vec<T> b = broadcast(load_single(y + e.value * by_element));
      repeat<vectors>([&](auto v) { sum[v.value][e.value] = add(sum[v.value][e.value], mul(a[v.value], b)); });
    });
  }
  Vec<T> total(int v, int e, bool, bool) const { return sum[v][e]; }
};

// Complex products: x times the real part of y and x times the imaginary part are summed apart.
template <int vectors, int columns, int count, class R>
struct Sums<vectors, columns, count, Complex<R>> {
  using T = Complex<R>;
  Vec<T> by_re[vectors][columns], by_im[vectors][columns];
  void clear() {
    repeat<vectors>([&](auto v) {
      repeat<columns>([&](auto e) { by_re[v.value][e.value] = by_im[v.value][e.value] = zero<T>(); });
    });
  }
  void add_step(const T *x, const T *y, QtbInt by_element) {
    Vec<T> a[vectors];
    repeat<vectors>([&](auto v) { a[v.value] = load_part<count>(x + v.value * lanes<T>); });
    repeat<columns>([&](auto e) {
      const R *b = parts(y + e.value * by_element);
      const Vec<T> re = broadcast(load_single(b)), im = broadcast(load_single(b + 1));
      repeat<vectors>([&](auto v) {
        by_re[v.value][e.value] = add(by_re[v.value][e.value], mul(a[v.value], re));
        by_im[v.value][e.value] = add(by_im[v.value][e.value], mul(a[v.value], im));
      });
    });
  }
  // (x.re*y.re - x.im*y.im, x.im*y.re + x.re*y.im), with the signs that conjugation changes.
  Vec<T> total(int v, int e, bool x_conjugated, bool y_conjugated) const {
    const R negative = -R{0}, none = 0;
    const Vec<T> first = alternate(none, x_conjugated ? negative : none);
    const Vec<T> second = alternate(x_conjugated == y_conjugated ? negative : none, y_conjugated ? negative : none);
    return add(bit_xor(first, by_re[v][e]), bit_xor(second, swap_parts(by_im[v][e])));
  }
};

template <int vectors, int columns, int count, class T>
void update_tile(QtbInt k, SideBySide<T> x, ByElement<T> y, const Finish<T> &finish, Target<T> to) {
  Sums<vectors, columns, count, T> sums;
  sums.clear();
  for (QtbInt l = 0; l < k; l++) sums.add_step(x.x + l * x.ld, y.y + l * y.by_depth, y.by_element);
  repeat<columns>([&](auto e) {
    repeat<vectors>([&](auto v) {
      T *c = to.c + v.value * lanes<T> * to.along + e.value * to.across;
      const Vec<T> sum = sums.total(v.value, e.value, x.conjugated, y.conjugated);
      if (to.along == 1)
        store_part<count>(c, finish(sum, [&] { return load_part<count>(c); }));
      else
        scatter_part<count>(c, to.along, finish(sum, [&] { return gather_part<count>(c, to.along); }));
    });
  });
}

// A strip of vectors*count elements along the vector, over all columns.
template <int vectors, int count, class T>
void update_strip(QtbInt columns, QtbInt k, SideBySide<T> x, ByElement<T> y, const Finish<T> &finish, Target<T> to) {
  constexpr int at_once = is_complex<T> ? 2 : 4;
  QtbInt e = 0;
  for (; e + at_once <= columns; e += at_once, y.y += at_once * y.by_element, to.c += at_once * to.across)
    update_tile<vectors, at_once, count>(k, x, y, finish, to);
  for (; e < columns; e++, y.y += y.by_element, to.c += to.across) update_tile<vectors, 1, count>(k, x, y, finish, to);
}

template <int vectors, int count, class T>
void update_strips(QtbInt elements, QtbInt columns, QtbInt k, SideBySide<T> x, ByElement<T> y, const Finish<T> &finish,
                   Target<T> to) {
  constexpr QtbInt strip = vectors * count;
  for (; elements >= strip; elements -= strip, x.x += strip, to.c += strip * to.along)
    update_strip<vectors, count>(columns, k, x, y, finish, to);
  if constexpr (vectors > 1)
    update_strips<1, count>(elements, columns, k, x, y, finish, to);
  else if constexpr (count > 1)
    update_strips<1, count / 2>(elements, columns, k, x, y, finish, to);
}

// ---- Dot products ----

// (a0, b0) and (a1, b1) of vectors whose complex elements are added up first, each filling a vector.
inline __m128 even_parts(__m128 a, __m128 b) {
  const __m128 low = _mm_unpacklo_ps(a, b), high = _mm_unpackhi_ps(a, b), sum = _mm_add_ps(low, high);
  return _mm_movelh_ps(sum, sum);
}
inline __m128 odd_parts(__m128 a, __m128 b) {
  const __m128 low = _mm_unpacklo_ps(a, b), high = _mm_unpackhi_ps(a, b), sum = _mm_add_ps(low, high);
  return _mm_movehl_ps(sum, sum);
}
inline __m128d even_parts(__m128d a, __m128d b) { return _mm_unpacklo_pd(a, b); }
inline __m128d odd_parts(__m128d a, __m128d b) { return _mm_unpackhi_pd(a, b); }

// Two sums of products along the depth: of x and y part by part, and for a complex type of x and y with its parts
// exchanged.
template <class T>
struct DotSum {
  Vec<T> direct = zero<T>(), crossed = zero<T>();
  void add_step(Vec<T> x, Vec<T> y, Vec<T> y_crossed) {
    direct = add(direct, mul(x, y));
    if constexpr (is_complex<T>) crossed = add(crossed, mul(x, y_crossed));
  }
  // The dot product, filling a vector.
  Vec<T> total(bool x_conjugated) const {
    if constexpr (!is_complex<T>) {
      return broadcast(sum_lanes(direct));
    } else {
      const Real<T> negative = -Real<T>{0}, none = 0;
      const Vec<T> sign = x_conjugated ? alternate(none, negative) : alternate(negative, none);
      return add(even_parts(direct, crossed), bit_xor(sign, odd_parts(direct, crossed)));
    }
  }
};

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
  constexpr int at_once = is_complex<T> ? 2 : 4;
  QtbInt j = 0;
  for (; j + at_once <= n; j += at_once)
    dot_tile<rows, at_once>(k, x, ldx, x_conjugated, y + j * ldy, ldy, finish, c + j * ldc, ldc);
  for (; j < n; j++) dot_tile<rows, 1>(k, x, ldx, x_conjugated, y + j * ldy, ldy, finish, c + j * ldc, ldc);
}

template <class T>
QTB_FUNCTION(gemm, T, small) {
  const Op op_a = read_op<T>(transa), op_b = read_op<T>(transb);
  const bool a_conjugated = op_a == Op::conjugate, b_conjugated = op_b == Op::conjugate;
  const bool a_is_n = op_a == Op::none, b_is_n = op_b == Op::none;
  const QtbInt rows = *m, columns = *n, depth = *k;
  if (depth <= 0) return scale_columns<T>(m, n, beta, c, ldc);  // no sum, so that no alpha makes a NaN of it
  constexpr int whole = static_cast<int>(lanes<T>);
  const Finish<T> finish(*alpha, *beta);
  // Rows that do not fill a vector go along the columns instead where those lie side by side.
  const bool by_rows = !b_is_n && (!a_is_n || (rows < whole && columns >= whole));
  if (by_rows) {
    update_strips<2, whole>(columns, rows, depth, SideBySide<T>{b, *ldb, b_conjugated},
                            ByElement<T>{a, a_is_n ? *lda : 1, a_is_n ? 1 : *lda, a_conjugated}, finish,
                            Target<T>{c, *ldc, 1});
  } else if (a_is_n) {
    update_strips<2, whole>(rows, columns, depth, SideBySide<T>{a, *lda, false},
                            ByElement<T>{b, b_is_n ? 1 : *ldb, b_is_n ? *ldb : 1, b_conjugated}, finish,
                            Target<T>{c, 1, *ldc});
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
