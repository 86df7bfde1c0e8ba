// The inner kernels of GEMV: columns in groups of 4, 2 and 1, rows in runs of 16, 8, 4, 2 and 1.
//
// No unaligned vector is loaded. A leading row is done singly where that brings the columns to a vector boundary; with
// an odd leading dimension every other column is then 8 bytes off, and is read by halves. The vector beside the
// columns, y without transposition and x with it, is read (and written) by halves where it stands 8 bytes off. An
// element of cdouble cannot be peeled: a matrix that begins 8 bytes off is read by halves throughout.
//
// Without transposition a group adds its columns to y in one sweep. Transposed, each column has a vector of sums that
// starts from zero; its lanes are added at the end.
#include "blas/kernels/level2/gemv_kernels.h"
#include "blas/kernels/level2/sweep.h"

namespace qtb::QTB_TIER {
namespace {

// How far ahead the 16-row loop of a kernel asks for its columns, in bytes; 0 for not at all.
template <class T, Op op, Parity parity>
constexpr QtbInt bytes_ahead() {
  if (this_tier != tier_sse3 || is_complex<T>) return 0;
  if (op != Op::none) return 128;
  return parity == Parity::even ? 256 : 0;
}

template <QtbInt bytes, int count, class T>
[[gnu::always_inline]] inline void ask_for(const T *const (&columns)[count]) {
  if constexpr (bytes > 0)
    repeat<count>([&](auto j) __attribute__((always_inline)) {
      _mm_prefetch(reinterpret_cast<const char *>(columns[j.value]) + bytes, _MM_HINT_T0);
    });
}

// All rows of a walk over a group of columns.
template <QtbInt ahead, class T, class Walk>
[[gnu::always_inline]] inline void runs(QtbInt rows, bool peels, Walk &walk) {
  // What is written out; longer runs take several turns, which changes no sum.
  constexpr int most_vectors = is_complex<T> ? 4 : 8;
  constexpr QtbInt run = most_vectors * lanes<T>;
  if (peels) {
    walk.single();
    --rows;
  }
  for (; rows >= run; rows -= run) {
    ask_for<ahead>(walk.columns.p);
    walk.template pass<most_vectors>();
  }
  if constexpr (run > 8)
    if ((rows & 8) != 0) walk.template pass<8 / lanes<T>>();
  if constexpr (run > 4)
    if ((rows & 4) != 0) walk.template pass<4 / lanes<T>>();
  if ((rows & 2) != 0) walk.template pass<2 / lanes<T>>();
  if ((rows & 1) == 0) return;
  if constexpr (lanes<T> == 1)
    walk.template pass<1>();
  else
    walk.single();
}

template <class T>
struct Group {
  QtbInt rows;
  T alpha;
  const T *a;
  QtbInt lda;
  bool peels, conjugated;
};

template <int count, QtbInt ahead, template <class> class Even, template <class> class Odd, template <class> class Y,
          class T>
void add_group(const Group<T> &g, const T *x, T *y) {
  T f[count];
  repeat<count>([&](auto j) __attribute__((always_inline)) { f[j.value] = g.alpha * x[j.value]; });
  const ColumnFactors<T, count> factors(f);
  using C = Columns<T, count, Even, Odd>;
  AddingRows<T, C, Y<T>, ColumnFactors<T, count>> walk{C(g.a, g.lda), {y}, factors};
  runs<ahead, T>(g.rows, g.peels, walk);
}

template <int count, QtbInt ahead, template <class> class Even, template <class> class Odd, template <class> class X,
          class T>
void dot_group(const Group<T> &g, const T *x, T *y) {
  ColumnSums<T, count> sums;
  using C = Columns<T, count, Even, Odd>;
  DotRows<T, count, C, X<const T>> walk{C(g.a, g.lda), {x}, sums};
  runs<ahead, T>(g.rows, g.peels, walk);
  add_totals(sums, g.conjugated, g.alpha, y);
}

// Odd's columns only count in groups of two and more. The arguments stay in registers: what passes through memory on
// the way to a small product takes longer than its arithmetic.
template <bool transposed, QtbInt ahead, template <class> class Even, template <class> class Odd,
          template <class> class Beside, class T>
[[gnu::noinline]] void all_groups(QtbInt columns, QtbInt rows, T alpha, const T *a, QtbInt lda, const T *x, T *y,
                                  bool conjugated) {
  const bool peels = lanes<T> > 1 && phase(a) != 0;
  const auto take = [&](auto count) __attribute__((always_inline)) {
    const Group<T> group{rows, alpha, a, lda, peels, conjugated};
    if constexpr (!transposed) {
      add_group<count.value, ahead, Even, Odd, Beside>(group, x, y);
      x += count.value;
    } else {
      dot_group<count.value, ahead, Even, Odd, Beside>(group, x, y);
      y += count.value;
    }
    a += count.value * lda;
  };
  for (; columns >= 4; columns -= 4) take(Constant<4>());
  if ((columns & 2) != 0) take(Constant<2>());
  if ((columns & 1) != 0) take(Constant<1>());
}

template <class T, Op op, Parity parity>
void gemv_kernel(QTB_GEMV_KERNEL_PARAMS(T)) {
  if (*rows < 1) return;
  constexpr QtbInt ahead = bytes_ahead<T, op, parity>();
  constexpr bool transposed = op != Op::none, conjugated = op == Op::conjugate;
  const QtbInt beside = transposed ? phase(x) : phase(y);
  if constexpr (parity == Parity::any) {
    if (phase(a) == 0 && beside == 0)
      all_groups<transposed, ahead, Aligned, Aligned, Aligned>(*columns, *rows, *alpha, a, *lda, x, y, conjugated);
    else
      all_groups<transposed, ahead, Halves, Halves, Halves>(*columns, *rows, *alpha, a, *lda, x, y, conjugated);
  } else if (phase(a) == beside) {
    if constexpr (parity == Parity::even)
      all_groups<transposed, ahead, Aligned, Aligned, Aligned>(*columns, *rows, *alpha, a, *lda, x, y, conjugated);
    else
      all_groups<transposed, ahead, Aligned, Halves, Aligned>(*columns, *rows, *alpha, a, *lda, x, y, conjugated);
  } else {
    if constexpr (parity == Parity::even)
      all_groups<transposed, ahead, Aligned, Aligned, Halves>(*columns, *rows, *alpha, a, *lda, x, y, conjugated);
    else
      all_groups<transposed, ahead, Aligned, Halves, Halves>(*columns, *rows, *alpha, a, *lda, x, y, conjugated);
  }
}

}  // namespace

extern "C" {
#define QTB_GEMV_KERNEL(name, T, operation, parity)                                    \
  void QTB_TIER_NAME(name)(QTB_GEMV_KERNEL_PARAMS(T)) {                                \
    gemv_kernel<T, Op::operation, Parity::parity>(rows, columns, alpha, a, lda, x, y); \
  }
#include "blas/kernels/level2/gemv_kernels.def"
#undef QTB_GEMV_KERNEL
}

}  // namespace qtb::QTB_TIER
