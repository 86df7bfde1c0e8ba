// The oracle of Levels 2 and 3: what it is made of.
//
// Every matrix is first written out in full from its storage form (Layout, read); every routine is then a sum of plain
// products of such matrices (update), from the published definitions. Nothing here is shared with the kernels.
//
// Accuracy. A sum of K products is formed by compensated summation over error-free products (sums.h), which leaves a
// relative error of about K*K*2^-106 of the sum of magnitudes, thirty binary digits below the bounds that it is judged
// by; so are the products with alpha and beta. That holds while no product overflows or leaves part of itself below the
// subnormals; where an operand could make it do so (moderate() says), all is formed in 113-bit arithmetic instead.
//
// What depends on no element type is compiled once, in common.cpp.
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
Dense op(char trans, const Dense &a);

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

Expectation untouched(const Layout &layout);

// alpha * left * right.
struct Term {
  QuadComplex alpha;
  Dense left, right;
};

// The sum of the terms + beta*old over the elements that layout keeps. The diagonal of a hermitian result is real.
// Without old there is no second summand.
Expectation updated(const Layout &layout, const std::vector<Term> &terms, QuadComplex beta, const Dense *old,
                    bool complex, double roundings, Outcome outcome, bool hermitian);

// C := sum of the terms + beta*C in the same way. C is not read where beta is zero.
template <class T>
Expectation update(const Layout &layout, const std::vector<Term> &terms, QuadComplex beta, const T *c, double roundings,
                   Outcome outcome = Outcome::value, bool hermitian = false) {
  if (is_value(beta, 0)) return updated(layout, terms, beta, nullptr, is_complex<T>, roundings, outcome, hermitian);
  const Dense old = read(layout, c);
  return updated(layout, terms, beta, &old, is_complex<T>, roundings, outcome, hermitian);
}

// The number of roundings of a sum of terms products: terms + more, or twice terms + more_complex.
template <class T>
double roundings(QtbInt terms, int more, int more_complex) {
  return is_complex<T> ? static_cast<double>(2 * terms + more_complex) : static_cast<double>(terms + more);
}

}  // namespace qtb::reference
