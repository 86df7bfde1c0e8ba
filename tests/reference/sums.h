// Sums of products, for the oracle: in about 106 bits where the operands allow it, and in 113 bits for any operands.
#pragma once

#include <vector>

#include "blas/types.h"
#include "tests/support/bounds.h"

namespace qtb::reference {

// Whether error-free products of two such numbers neither overflow nor lose their low part: 2^-300 to 2^300, or zero.
bool moderate(double value);
bool moderate(const std::vector<double> &values);

// A compensated sum: high + low is the value. Lanes is double, or a vector of doubles that are summed apart.
template <class Lanes>
struct Compensated {
  Lanes high{}, low{};

  void add(Lanes term) {
    const Lanes sum = high + term;
    const Lanes part = sum - high;
    low += (high - (sum - part)) + (term - part);
    high = sum;
  }
  // Exact says that a*b is a double.
  template <bool exact>
  void add_product(Lanes a, Lanes b) {
    const Lanes p = a * b;
    if constexpr (!exact) low += product_error(a, b, p);
    add(p);
  }
  void add_product(double a, const Compensated &b) {
    low += a * b.low;
    add_product<false>(a, b.high);
  }
  // a*b - p for p = a*b rounded: the operands are cut into halves of 26 bits, whose products are exact.
  static Lanes product_error(Lanes a, Lanes b, Lanes p) {
    constexpr double split = 134217729;  // 2^27 + 1
    const Lanes ta = split * a, tb = split * b;
    const Lanes ah = ta - (ta - a), bh = tb - (tb - b);
    const Lanes al = a - ah, bl = b - bh;
    return ((ah * bh - p) + ah * bl + al * bh) + al * bl;
  }
  test::Quad value() const { return test::Quad(high) + test::Quad(low); }
};

// The parts of a row of the left operand or of a column of the right one, one behind the other.
struct Strip {
  const double *re, *im;
};

// The sum over k, from first to before last, of x[k]*y[k], and of the magnitudes of these products.
struct CompensatedSum {
  Compensated<double> re, im;
  double gauge = 0;

  test::QuadComplex value() const { return {re.value(), im.value()}; }
};
// Exact says that the parts are floats, so that a product of two is a double.
CompensatedSum compensated_sum(QtbInt first, QtbInt last, Strip x, Strip y, bool complex, bool exact);

struct WideSum {
  test::QuadComplex value;
  double gauge = 0;
};
WideSum wide_sum(QtbInt first, QtbInt last, Strip x, Strip y, bool complex);

// sum += A*y for A of rows by columns elements, column by column without a gap. In plain arithmetic and in any order:
// for whole numbers whose sums all are exact.
void add_columns(std::size_t rows, std::size_t columns, const float *a, const float *y, float *sum);
void add_columns(std::size_t rows, std::size_t columns, const double *a, const double *y, double *sum);

}  // namespace qtb::reference
