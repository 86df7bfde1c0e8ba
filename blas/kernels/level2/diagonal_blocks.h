// Triangular blocks on the diagonal: x := op(T)*x and x := op(T)^-1*x in place, for the few columns of one block.
//
// Columns go in groups of 4. Of a group the triangle on the diagonal, its corner, is worked on element by element, and
// the rectangle beside it by a sweep: without transposition the columns are added to the elements beside, in their
// order; otherwise the group takes their dot products with those elements. Groups and columns are taken in the order in
// which a product reads an element before it is overwritten, and a solve after it is known. The columns that fill no
// group have their turn where nothing stands beside them, first or last, and are all corner. A unit diagonal is never
// read, nor the other triangle.
//
// x has any increment but 0 and begins at its first element. What does not lie side by side at addresses of elements
// is worked on in a copy.
#pragma once

#include "blas/kernels/level2/divisor.h"
#include "blas/kernels/level2/sweep.h"

namespace qtb::QTB_TIER {
namespace {

template <bool upper_, Op op_, bool unit_>
struct TriangleCase {
  static constexpr bool upper = upper_, transposed = op_ != Op::none, conjugated = op_ == Op::conjugate, unit = unit_;
};

// An element of op(T), given where its mirror element stands.
template <class Case, class T>
T element_of(const T *a) {
  return conjugate_if<Case::conjugated>(load_element(a));
}

constexpr int group_size = 4;

// The columns of a corner that is walked forward or backward: turn s takes column turn<forward>(s).
template <bool forward>
constexpr int turn(int s, int count) {
  return forward ? s : count - 1 - s;
}

// ---- Products ----

template <class Case>
struct Product {
  static constexpr bool forward = Case::upper != Case::transposed;

  // An element is scattered to those that had their turn before, or gathers from those that have theirs later.
  template <class T>
  [[gnu::always_inline]] static void corner(int count, const T *a, QtbInt lda, T *x) {
    for (int s = 0; s < count; s++) {
      const int j = turn<forward>(s, count);
      const T old = x[j];
      if constexpr (!Case::unit) x[j] = element_of<Case>(a + j + j * lda) * old;
      for (int r = Case::transposed ? s + 1 : 0; r < (Case::transposed ? count : s); r++) {
        const int i = turn<forward>(r, count);
        if constexpr (Case::transposed)
          x[j] += element_of<Case>(a + i + j * lda) * x[i];
        else
          x[i] += load_element(a + i + j * lda) * old;
      }
    }
  }
  // rows elements stand beside the group, from the columns' elements at beside on.
  template <class T>
  static void group(const T *a, QtbInt lda, T *x, QtbInt rows, const T *const (&columns)[group_size], T *beside) {
    T old[group_size], now[group_size];
    for (int k = 0; k < group_size; k++) old[k] = now[k] = x[k];
    corner(group_size, a, lda, now);
    if constexpr (Case::transposed)
      dot_columns<group_size, Case::conjugated>(rows, columns, beside, now);
    else
      add_columns<group_size>(rows, columns, old, beside);
    for (int k = 0; k < group_size; k++) x[k] = now[k];
  }
};

// ---- Solves ----

template <class Case>
struct Solve {
  static constexpr bool forward = Case::upper == Case::transposed;

  template <class T>
  [[gnu::always_inline]] static void corner(int count, const T *a, QtbInt lda, T *x) {
    for (int s = 0; s < count; s++) {
      const int j = turn<forward>(s, count);
      if constexpr (Case::transposed) {
        for (int r = 0; r < s; r++) {
          const int i = turn<forward>(r, count);
          x[j] -= element_of<Case>(a + i + j * lda) * x[i];
        }
      }
      if constexpr (!Case::unit) x[j] = Divisor<T>(element_of<Case>(a + j + j * lda)).divide(x[j]);
      if constexpr (!Case::transposed) {
        for (int r = s + 1; r < count; r++) {
          const int i = turn<forward>(r, count);
          x[i] -= load_element(a + i + j * lda) * x[j];
        }
      }
    }
  }
  template <class T>
  static void group(const T *a, QtbInt lda, T *x, QtbInt rows, const T *const (&columns)[group_size], T *beside) {
    T now[group_size], others[group_size] = {};
    if constexpr (Case::transposed) dot_columns<group_size, Case::conjugated>(rows, columns, beside, others);
    for (int k = 0; k < group_size; k++) now[k] = x[k] - others[k];
    corner(group_size, a, lda, now);
    for (int k = 0; k < group_size; k++) {
      x[k] = now[k];
      others[k] = -now[k];
    }
    if constexpr (!Case::transposed) add_columns<group_size>(rows, columns, others, beside);
  }
};

// ---- Blocks ----

// The columns that fill no group: fewer than four.
template <class Case, template <class> class Work, class T>
[[gnu::noinline]] void short_corner(int count, const T *a, QtbInt lda, T *x) {
  Work<Case>::corner(count, a, lda, x);
}

template <class Case, template <class> class Work, class T>
[[gnu::noinline]] void contiguous_block(QtbInt n, const T *a, QtbInt lda, T *x) {
  const QtbInt rest = n % group_size;
  // Upper columns have the more rows above them the later they come, lower ones the fewer below.
  const QtbInt corner_at = Case::upper ? 0 : n - rest, groups_at = Case::upper ? rest : 0;
  // A walk that begins where the columns are short begins with the rest.
  constexpr bool rest_first = Work<Case>::forward == Case::upper;
  const auto take_rest = [&] {
    if (rest > 0) short_corner<Case, Work>(static_cast<int>(rest), a + corner_at + corner_at * lda, lda, x + corner_at);
  };
  if (rest_first) take_rest();
  for (QtbInt done = 0; done < n - rest; done += group_size) {
    const QtbInt j = groups_at + (Work<Case>::forward ? done : n - rest - group_size - done);
    const QtbInt first = Case::upper ? 0 : j + group_size, rows = Case::upper ? j : n - first;
    const T *const column = a + first + j * lda;
    Work<Case>::group(a + j + j * lda, lda, x + j, rows, {column, column + lda, column + 2 * lda, column + 3 * lda},
                      x + first);
  }
  if (!rest_first) take_rest();
}

// n is at most largest.
template <QtbInt largest, class Case, template <class> class Work, class T>
void diagonal_block(QtbInt n, const T *a, QtbInt lda, T *x, QtbInt incx) {
  if (incx == 1 && reinterpret_cast<std::uintptr_t>(x) % sizeof(Real<T>) == 0)
    return contiguous_block<Case, Work>(n, a, lda, x);
  alignas(vector_bytes) T copy[largest];
  for (QtbInt i = 0; i < n; i++) copy[i] = load_element(x + i * incx);
  contiguous_block<Case, Work>(n, a, lda, copy);
  for (QtbInt i = 0; i < n; i++) store_element(x + i * incx, copy[i]);
}

}  // namespace
}  // namespace qtb::QTB_TIER
