// The oracle of Levels 2 and 3: what it is made of.
//
// Every matrix is first written out in full from its storage form (Layout, read); every routine is then a sum of plain
// products of such matrices (update), from the published definitions. Nothing here is shared with the kernels.
//
// Accuracy. A sum of K products is formed by compensated summation over error-free products, which leaves a relative
// error of about K*K*2^-106 of the sum of magnitudes, thirty binary digits below the bounds that it is judged by. That
// holds while no product overflows or leaves part of itself below the subnormals; where an operand could make it do so
// (moderate() says), the sum is formed in 113-bit arithmetic instead. Everything outside the sum is always 113 bits.
#pragma once

#include <algorithm>
#include <cmath>
#include <cstring>
#include <vector>

#include "calls/layout.h"
#include "tests/support/bounds.h"

namespace qtb::reference {

using test::magnitude;
using test::Quad;
using test::QuadComplex;

// ---- option letters ----

inline char upper_case(char letter) { return letter >= 'a' && letter <= 'z' ? static_cast<char>(letter - 32) : letter; }
inline bool is_letter(char option, char letter) { return upper_case(option) == letter; }

// ---- complex arithmetic of the oracle; a real number has im = 0 and never multiplies by it ----

inline QuadComplex conjugate(QuadComplex v) { return {v.re, -v.im}; }
inline QuadComplex negative(QuadComplex v) { return {-v.re, -v.im}; }
inline QuadComplex product(QuadComplex a, QuadComplex b, bool complex) {
  if (!complex) return {a.re * b.re, 0};
  return {a.re * b.re - a.im * b.im, a.re * b.im + a.im * b.re};
}
inline bool is_value(QuadComplex v, int value) { return v.re == value && v.im == 0; }

// ---- storage ----

using calls::band;
using calls::band_triangle;
using calls::full;
using calls::indexed;
using calls::Layout;
using calls::packed_triangle;
using calls::strided;
using calls::Structure;
using calls::triangle;
using calls::triangular;

// One element of a caller's array, at any address.
template <class T>
T load(const T *array, QtbInt position) {
  T value;
  std::memcpy(static_cast<void *>(&value), reinterpret_cast<const char *>(array) + position * QtbInt{sizeof(T)},
              sizeof(T));
  return value;
}

// A matrix written out in full. Elements are exact: every element type is a part of double.
struct Dense {
  QtbInt rows = 0, cols = 0;
  bool complex = false;
  bool single = false;             // every part is a float, so that a product of two parts is a double
  std::vector<double> re, im;      // column by column
  std::vector<unsigned char> has;  // 0 where the element is a structural zero, which no product takes in

  Dense() = default;
  Dense(QtbInt rows_, QtbInt cols_, bool complex_, bool single_)
      : rows(rows_), cols(cols_), complex(complex_), single(single_) {
    const auto count = static_cast<std::size_t>(rows * cols);
    re.resize(count), im.resize(count), has.resize(count);
  }
  std::size_t at(QtbInt i, QtbInt j) const { return static_cast<std::size_t>(i + j * rows); }
  QuadComplex value(QtbInt i, QtbInt j) const { return {Quad(re[at(i, j)]), Quad(im[at(i, j)])}; }
};

template <class T>
void set(Dense &d, QtbInt i, QtbInt j, T value, bool conjugated = false) {
  const std::size_t p = d.at(i, j);
  if constexpr (is_complex<T>) {
    d.re[p] = static_cast<double>(value.re);
    d.im[p] = conjugated ? -static_cast<double>(value.im) : static_cast<double>(value.im);
  } else {
    d.re[p] = static_cast<double>(value);
  }
  d.has[p] = 1;
}

template <class T>
Dense read(const Layout &layout, const T *array, Structure structure = Structure::general) {
  Dense d(layout.rows, layout.cols, is_complex<T>, sizeof(Real<T>) == sizeof(float));
  const bool mirrored = structure == Structure::symmetric || structure == Structure::hermitian;
  for (QtbInt j = 0; j < layout.cols; ++j)
    for (QtbInt i = 0; i < layout.rows; ++i) {
      if (i == j && structure == Structure::unit_triangular) {
        d.re[d.at(i, j)] = 1;
        d.has[d.at(i, j)] = 1;
      } else if (layout.stores(i, j)) {
        set(d, i, j, load(array, layout.position(i, j)));
        if (i == j && structure == Structure::hermitian) d.im[d.at(i, j)] = 0;
      } else if (mirrored && layout.stores(j, i)) {
        set(d, i, j, load(array, layout.position(j, i)), structure == Structure::hermitian);
      }
    }
  return d;
}

// op(A): A, its transpose or its conjugate transpose.
inline Dense op(char trans, const Dense &a) {
  if (is_letter(trans, 'N')) return a;
  Dense d(a.cols, a.rows, a.complex, a.single);
  const double sign = is_letter(trans, 'C') ? -1 : 1;
  for (QtbInt j = 0; j < d.cols; ++j)
    for (QtbInt i = 0; i < d.rows; ++i) {
      d.re[d.at(i, j)] = a.re[a.at(j, i)];
      d.im[d.at(i, j)] = sign * a.im[a.at(j, i)];
      d.has[d.at(i, j)] = a.has[a.at(j, i)];
    }
  return d;
}

// ---- sums of products ----

// Whether error-free products of two such numbers neither overflow nor lose their low part: 2^-300 to 2^300, or zero.
inline bool moderate(const std::vector<double> &values) {
  constexpr double least = 0x1p-300, most = 0x1p300;
  for (const double v : values)
    if (v != 0 && !(std::fabs(v) >= least && std::fabs(v) <= most)) return false;
  return true;
}

// A compensated sum of products: high + low is the sum.
struct Compensated {
  double high = 0, low = 0;

  void add(double term) {
    const double sum = high + term;
    const double part = sum - high;
    low += (high - (sum - part)) + (term - part);
    high = sum;
  }
  template <bool exact>
  void add_product(double a, double b) {
    const double p = a * b;
    if constexpr (!exact) low += product_error(a, b, p);
    add(p);
  }
  // a*b - p for p = a*b rounded: the operands are cut into halves of 26 bits, whose products are exact.
  static double product_error(double a, double b, double p) {
    constexpr double split = 134217729;  // 2^27 + 1
    const double ta = split * a, tb = split * b;
    const double ah = ta - (ta - a), bh = tb - (tb - b);
    const double al = a - ah, bl = b - bh;
    return ((ah * bh - p) + ah * bl + al * bh) + al * bl;
  }
  Quad value() const { return Quad(high) + Quad(low); }
};

// sum over k of left(i, k) right(k, j), and the sum of its magnitudes. The operands lie so that k is contiguous.
struct Sum {
  QuadComplex value;
  double gauge = 0;
};

struct Strip {  // a row of the left operand or a column of the right one
  const double *re, *im;
};

template <bool exact>
Sum compensated_sum(QtbInt first, QtbInt last, Strip x, Strip y, bool complex) {
  Compensated re, im;
  Sum sum;
  if (!complex) {
    for (QtbInt k = first; k < last; ++k) {
      re.add_product<exact>(x.re[k], y.re[k]);
      sum.gauge += std::fabs(x.re[k] * y.re[k]);
    }
  } else {
    for (QtbInt k = first; k < last; ++k) {
      re.add_product<exact>(x.re[k], y.re[k]);
      re.add_product<exact>(-x.im[k], y.im[k]);
      im.add_product<exact>(x.re[k], y.im[k]);
      im.add_product<exact>(x.im[k], y.re[k]);
      sum.gauge += (std::fabs(x.re[k]) + std::fabs(x.im[k])) * (std::fabs(y.re[k]) + std::fabs(y.im[k]));
    }
  }
  sum.value = {re.value(), im.value()};
  return sum;
}

inline Sum wide_sum(QtbInt first, QtbInt last, Strip x, Strip y, bool complex) {
  Sum sum;
  for (QtbInt k = first; k < last; ++k) {
    const QuadComplex a{Quad(x.re[k]), Quad(x.im[k])}, b{Quad(y.re[k]), Quad(y.im[k])};
    const QuadComplex p = product(a, b, complex);
    sum.value.re += p.re;
    sum.value.im += p.im;
    sum.gauge += static_cast<double>(magnitude(a) * magnitude(b));
  }
  return sum;
}

// alpha * left * right.
struct Term {
  QuadComplex alpha;
  Dense left, right;
};

// A term made ready: rows of the left operand contiguous, with the range of each strip that is not structurally zero.
struct ReadyTerm {
  explicit ReadyTerm(const Term &term)
      : alpha(term.alpha), rows(op('T', term.left)), right(term.right), complex(term.left.complex) {
    exact = term.left.single && term.right.single;
    wide = !(moderate(rows.re) && moderate(rows.im) && moderate(right.re) && moderate(right.im));
    row_range = ranges(rows);
    column_range = ranges(right);
  }
  Sum sum(QtbInt i, QtbInt j) const {
    const auto r = row_range[static_cast<std::size_t>(i)], c = column_range[static_cast<std::size_t>(j)];
    const QtbInt first = std::max(r.first, c.first), last = std::min(r.last, c.last);
    const std::size_t p = rows.at(0, i), q = right.at(0, j);
    const Strip x{rows.re.data() + p, rows.im.data() + p}, y{right.re.data() + q, right.im.data() + q};
    if (wide) return wide_sum(first, last, x, y, complex);
    return exact ? compensated_sum<true>(first, last, x, y, complex)
                 : compensated_sum<false>(first, last, x, y, complex);
  }

  QuadComplex alpha;

 private:
  struct Range {
    QtbInt first, last;
  };
  static std::vector<Range> ranges(const Dense &d) {
    std::vector<Range> result;
    for (QtbInt j = 0; j < d.cols; ++j) {
      QtbInt first = 0, last = d.rows;
      while (last > 0 && d.has[d.at(last - 1, j)] == 0) --last;
      while (first < last && d.has[d.at(first, j)] == 0) ++first;
      result.push_back({first, last});
    }
    return result;
  }
  Dense rows, right;
  bool complex, exact, wide;
  std::vector<Range> row_range, column_range;
};

// ---- what a routine must leave behind ----

enum class Outcome : unsigned char {
  unchanged,   // bit for bit what it was
  value,       // value, to rounding
  real_value,  // value, to rounding, with an imaginary part of exactly zero
  residual     // value is a difference that must vanish, to rounding
};

struct Expected {
  QuadComplex value;
  double gauge = 0;
  Outcome outcome = Outcome::unchanged;
};

// The elements of the result, column by column over its layout, and the number of roundings c of the bound.
struct Expectation {
  Layout layout;
  double roundings = 0;
  double alpha_magnitude = 1;
  std::vector<Expected> element;

  const Expected &at(QtbInt i, QtbInt j) const { return element[static_cast<std::size_t>(i + j * layout.rows)]; }
};

inline Expectation untouched(const Layout &layout) {
  Expectation e{layout, 0, 1, {}};
  e.element.resize(static_cast<std::size_t>(layout.rows * layout.cols));
  return e;
}

// C := sum of the terms + beta*C over the elements that layout keeps. C is not read where beta is zero. The diagonal of
// a hermitian result is real.
template <class T>
Expectation update(const Layout &layout, const std::vector<Term> &terms, QuadComplex beta, const T *c, double roundings,
                   Outcome outcome = Outcome::value, bool hermitian = false) {
  Expectation e = untouched(layout);
  e.roundings = roundings;
  std::vector<ReadyTerm> ready;
  for (const Term &term : terms) {
    ready.emplace_back(term);
    e.alpha_magnitude = std::fmax(e.alpha_magnitude, static_cast<double>(magnitude(term.alpha)));
  }
  for (QtbInt j = 0; j < layout.cols; ++j)
    for (QtbInt i = 0; i < layout.rows; ++i) {
      if (!layout.stores(i, j)) continue;
      const bool real = hermitian && i == j;
      Expected &x = e.element[static_cast<std::size_t>(i + j * layout.rows)];
      x.outcome = real ? Outcome::real_value : outcome;
      for (const ReadyTerm &term : ready) {
        const Sum sum = term.sum(i, j);
        const QuadComplex p = product(term.alpha, sum.value, is_complex<T>);
        x.value.re += p.re;
        x.value.im += p.im;
        x.gauge += static_cast<double>(magnitude(term.alpha)) * sum.gauge;
      }
      if (!is_value(beta, 0)) {
        QuadComplex old = test::widen(load(c, layout.position(i, j)));
        if (real) old.im = 0;
        const QuadComplex p = product(beta, old, is_complex<T>);
        x.value.re += p.re;
        x.value.im += p.im;
        x.gauge += static_cast<double>(magnitude(beta) * magnitude(old));
      }
      if (real) x.value.im = 0;
    }
  return e;
}

// The number of roundings of a sum of terms products: terms + more, or twice terms + more_complex.
template <class T>
double roundings(QtbInt terms, int more, int more_complex) {
  return is_complex<T> ? static_cast<double>(2 * terms + more_complex) : static_cast<double>(terms + more);
}

}  // namespace qtb::reference
