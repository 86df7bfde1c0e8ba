// x := op(T)*x and x := op(T)^-1*x in place for a triangle in band or packed storage: the frame of tbmv, tbsv, tpmv and
// tpsv.
//
// Columns go in groups, and singly what does not fill one; the last columns of the triangle are left over. A group has
// a small triangle on the diagonal, which is done in scalar arithmetic, and a rectangle above ("U") or below ("L") it,
// which is swept: with N the group's elements of x update the others, with T and C the others go into the group's. The
// groups follow each other so that every element of x is used before it is overwritten.
//
// With N a zero element of x does nothing: its column is not read, nor, in a solve, its diagonal. Divisions are true
// ones: a zero on the diagonal gives infinities or NaNs. A unit diagonal is never read.
//
// A triangle has
//
//   origin, behind()     row 0 of its first column and of the column behind its last one
//   step(j)              from row i of column j to row i of column j + 1
//   begin(j), end(j)     the rows of column j beside the diagonal, the second exclusive; they vary by one from column
//                        to column at most
//   holds_group(size)    whether a group's triangle on the diagonal is stored in full
#pragma once

#include "blas/kernels/level2/divisor.h"
#include "blas/kernels/level2/line_vectors.h"

namespace qtb::QTB_TIER {
namespace {

enum class Task { product, solve };

// From the first column to the last, so that elements are used before they are overwritten.
template <Task task, Op op, class Triangle>
constexpr bool goes_forward = (Triangle::upper == (op == Op::none)) == (task == Task::product);

// ---- One group ----

template <class T, class Triangle>
struct GroupTask {
  Triangle t;
  LineVector<T> x;
  bool unit;

  // The rows of the rectangle beside columns j to j + count - 1.
  template <int count>
  GroupRows beside(QtbInt j) const {
    constexpr int right = count - 1;
    if constexpr (Triangle::upper)
      return {t.begin(j), t.begin(j + right), j, j};
    else
      return {j + count, j + count, t.end(j), t.end(j + right)};
  }

  // Element (p, q) of the group's triangle, and whether it lies beside the diagonal.
  template <int p, int q>
  static constexpr bool stored = Triangle::upper ? (p < q) : (p > q);
  template <bool conjugated, int count>
  static T element(const Group<count, T> &group, QtbInt j, int p, int q) {
    return conjugate_if<conjugated>(load_element(group.column[q] + j + p));
  }

  // ---- N: columns scatter ----

  template <int count>
  [[gnu::always_inline]] void multiply_by_columns(QtbInt j, const Group<count, T> &group) const {
    T old[count], now[count];
    load(j, old);
    bool any_zero = false;
    repeat<count>([&](auto q) __attribute__((always_inline)) { any_zero = any_zero || is_zero(old[q.value]); });
    if (any_zero) return take_singly<Task::product>(j, group);
    add_group(group, beside<count>(j), old, x);
    repeat<count>([&](auto q) __attribute__((always_inline)) {
      now[q.value] = unit ? old[q.value] : old[q.value] * element<false>(group, j, q.value, q.value);
    });
    repeat<count>([&](auto q) __attribute__((always_inline)) {
      repeat<count>([&](auto p) __attribute__((always_inline)) {
        if constexpr (stored<p.value, q.value>)
          now[p.value] += old[q.value] * element<false>(group, j, p.value, q.value);
      });
    });
    store(j, now);
  }

  template <int count>
  [[gnu::always_inline]] void solve_by_columns(QtbInt j, const Group<count, T> &group) const {
    T now[count], factors[count];
    load(j, now);
    bool any_zero = false;
    backwards_if<count>(
        Constant<Triangle::upper>(), [&](auto q) __attribute__((always_inline)) {
          any_zero = any_zero || is_zero(now[q.value]);
          if (any_zero) return;
          if (!unit) now[q.value] = Divisor<T>(element<false>(group, j, q.value, q.value)).divide(now[q.value]);
          factors[q.value] = -now[q.value];
          repeat<count>([&](auto p) __attribute__((always_inline)) {
            if constexpr (stored<p.value, q.value>)
              now[p.value] += factors[q.value] * element<false>(group, j, p.value, q.value);
          });
        });
    if (any_zero) return take_singly<Task::solve>(j, group);
    store(j, now);
    add_group(group, beside<count>(j), factors, x);
  }

  // A group with a zero, from the start: column by column, without those of zeros.
  template <Task task, int count>
  [[gnu::noinline]] void take_singly(QtbInt j, const Group<count, T> &group) const {
    if constexpr (count > 1)
      backwards_if<count>(Constant<Triangle::upper == (task == Task::solve)>(), [&](auto q) {
        const Group<1, T> column{{group.column[q.value]}};
        if constexpr (task == Task::product)
          multiply_by_columns(j + q.value, column);
        else
          solve_by_columns(j + q.value, column);
      });
  }

  // ---- T and C: columns gather ----

  template <bool conjugated, int count>
  [[gnu::always_inline]] void multiply_by_rows(QtbInt j, const Group<count, T> &group) const {
    T old[count], now[count];
    load(j, old);
    repeat<count>([&](auto q) __attribute__((always_inline)) {
      now[q.value] = unit ? old[q.value] : element<conjugated>(group, j, q.value, q.value) * old[q.value];
      repeat<count>([&](auto p) __attribute__((always_inline)) {
        if constexpr (stored<p.value, q.value>)
          now[q.value] += element<conjugated>(group, j, p.value, q.value) * old[p.value];
      });
    });
    dot_group<conjugated>(group, beside<count>(j), x, now);
    store(j, now);
  }

  template <bool conjugated, int count>
  [[gnu::always_inline]] void solve_by_rows(QtbInt j, const Group<count, T> &group) const {
    T now[count], sums[count] = {};
    dot_group<conjugated>(group, beside<count>(j), x, sums);
    load(j, now);
    repeat<count>([&](auto q) __attribute__((always_inline)) { now[q.value] = now[q.value] - sums[q.value]; });
    backwards_if<count>(
        Constant<!Triangle::upper>(), [&](auto q) __attribute__((always_inline)) {
          repeat<count>([&](auto p) __attribute__((always_inline)) {
            if constexpr (stored<p.value, q.value>)
              now[q.value] = now[q.value] - element<conjugated>(group, j, p.value, q.value) * now[p.value];
          });
          if (!unit) now[q.value] = Divisor<T>(element<conjugated>(group, j, q.value, q.value)).divide(now[q.value]);
        });
    store(j, now);
  }

 private:
  template <int count>
  [[gnu::always_inline]] void load(QtbInt j, T (&to)[count]) const {
    repeat<count>([&](auto q) __attribute__((always_inline)) { to[q.value] = x.get(j + q.value); });
  }
  template <int count>
  [[gnu::always_inline]] void store(QtbInt j, const T (&from)[count]) const {
    repeat<count>([&](auto q) __attribute__((always_inline)) { x.set(j + q.value, from[q.value]); });
  }
  // f of each column of a group in the order of its substitution.
  template <int count, class F>
  [[gnu::always_inline]] static void backwards_if(Constant<0>, F f) {
    repeat<count>(f);
  }
  template <int count, class F>
  [[gnu::always_inline]] static void backwards_if(Constant<1>, F f) {
    repeat<count>([&](auto q) __attribute__((always_inline)) { f(Constant<count - 1 - q.value>()); });
  }
};

// ---- All groups ----

// x := op(T)*x, or the solve of op(T)*x = b, of an op that is known.
template <Task task, Op op, int count, class T, class Triangle>
[[gnu::always_inline]] inline void take_group(const GroupTask<T, Triangle> &work, QtbInt j,
                                              const Group<count, T> &group) {
  constexpr bool conjugated = op == Op::conjugate;
  if constexpr (task == Task::product && op == Op::none)
    work.multiply_by_columns(j, group);
  else if constexpr (task == Task::product)
    work.template multiply_by_rows<conjugated>(j, group);
  else if constexpr (op == Op::none)
    work.solve_by_columns(j, group);
  else
    work.template solve_by_rows<conjugated>(j, group);
}

template <Task task, Op op, int size, class T, class Triangle>
[[gnu::noinline]] void take_groups(const Triangle &t, bool unit, const LineVector<T> &x) {
  const GroupTask<T, Triangle> work{t, x, unit};
  const QtbInt grouped = t.holds_group(size) ? t.n - t.n % size : 0;
  if constexpr (goes_forward<task, op, Triangle>) {
    const T *column = t.origin;
    const auto take = [&](auto count, QtbInt j) __attribute__((always_inline)) {
      Group<count.value, T> group;
      repeat<count.value>([&](auto q) __attribute__((always_inline)) {
        group.column[q.value] = column;
        column += t.step(j + q.value);
      });
      take_group<task, op>(work, j, group);
    };
    for (QtbInt j = 0; j < grouped; j += size) take(Constant<size>(), j);
    for (QtbInt j = grouped; j < t.n; ++j) take(Constant<1>(), j);
  } else {
    const T *column = t.behind();
    const auto take = [&](auto count, QtbInt j) __attribute__((always_inline)) {
      Group<count.value, T> group;
      repeat<count.value>([&](auto q) __attribute__((always_inline)) {
        constexpr int c = count.value - 1 - q.value;
        column -= t.step(j + c);
        group.column[c] = column;
      });
      take_group<task, op>(work, j, group);
    };
    for (QtbInt j = t.n; j > grouped; --j) take(Constant<1>(), j - 1);
    for (QtbInt j = grouped; j > 0; j -= size) take(Constant<size>(), j - size);
  }
}

// By groups of size columns.
template <Task task, int size, class T, class Triangle>
void take_triangle(const Triangle &t, Op op, bool unit, T *x, QtbInt incx) {
  const LineVector<T> v = line_vector(x, t.n, incx);
  switch (op) {
    case Op::none: return take_groups<task, Op::none, size>(t, unit, v);
    case Op::transpose: return take_groups<task, Op::transpose, size>(t, unit, v);
    case Op::conjugate:
      if constexpr (is_complex<T>) take_groups<task, Op::conjugate, size>(t, unit, v);
  }
}

}  // namespace
}  // namespace qtb::QTB_TIER
