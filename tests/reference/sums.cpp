// Sums of products, two lanes at a time or in 113 bits: see sums.h.
#include "tests/reference/sums.h"

#include <cmath>
#include <cstring>

namespace qtb::reference {
namespace {

using test::magnitude;
using test::Quad;
using test::QuadComplex;

// Two sums at a time.
using Two = double __attribute__((vector_size(16)));
using TwoBits = std::int64_t __attribute__((vector_size(16)));
constexpr QtbInt lanes = 2;

void load(const double *from, Two &to) { std::memcpy(&to, from, sizeof to); }
void load(const double *from, double &to) { to = *from; }
void take_magnitude(Two &v) { v = reinterpret_cast<Two>(reinterpret_cast<TwoBits>(v) & ~((TwoBits{} - 1) << 63)); }
void take_magnitude(double &v) { v = std::fabs(v); }

template <class Lanes, bool complex, bool exact>
struct Sums {
  Compensated<Lanes> re, im;
  Lanes gauge{};

  void add(Strip x, Strip y, QtbInt k) {
    Lanes a, b, c, d;
    load(x.re + k, a), load(y.re + k, b);
    re.template add_product<exact>(a, b);
    if constexpr (complex) {
      load(x.im + k, c), load(y.im + k, d);
      re.template add_product<exact>(-c, d);
      im.template add_product<exact>(a, d);
      im.template add_product<exact>(c, b);
      take_magnitude(a), take_magnitude(b), take_magnitude(c), take_magnitude(d);
      gauge += (a + c) * (b + d);
    } else {
      Lanes p = a * b;
      take_magnitude(p);
      gauge += p;
    }
  }
};

template <bool complex, bool exact>
CompensatedSum sum_of(QtbInt first, QtbInt last, Strip x, Strip y) {
  Sums<double, complex, exact> sum;
  QtbInt k = first;
  if (last - first >= lanes) {
    Sums<Two, complex, exact> two;
    for (; k + lanes <= last; k += lanes) two.add(x, y, k);
    for (QtbInt lane = 0; lane < lanes; ++lane) {
      sum.re.add(two.re.high[lane]), sum.re.low += two.re.low[lane];
      sum.im.add(two.im.high[lane]), sum.im.low += two.im.low[lane];
      sum.gauge += two.gauge[lane];
    }
  }
  for (; k < last; ++k) sum.add(x, y, k);
  return {sum.re, sum.im, sum.gauge};
}

// Four columns at a time, so that a sum is loaded and stored once for all of them.
template <class R>
void add_all_columns(std::size_t rows, std::size_t columns, const R *a, const R *y, R *__restrict sum) {
  std::size_t l = 0;
  for (; l + 4 <= columns; l += 4) {
    const R *const a0 = a + l * rows, *const a1 = a0 + rows, *const a2 = a1 + rows, *const a3 = a2 + rows;
    const R y0 = y[l], y1 = y[l + 1], y2 = y[l + 2], y3 = y[l + 3];
    for (std::size_t i = 0; i < rows; ++i) sum[i] += (a0[i] * y0 + a1[i] * y1) + (a2[i] * y2 + a3[i] * y3);
  }
  for (; l < columns; ++l)
    for (std::size_t i = 0; i < rows; ++i) sum[i] += a[i + l * rows] * y[l];
}

}  // namespace

bool moderate(double value) {
  constexpr double least = 0x1p-300, most = 0x1p300;
  return value == 0 || (std::fabs(value) >= least && std::fabs(value) <= most);
}
bool moderate(const std::vector<double> &values) {
  for (const double v : values)
    if (!moderate(v)) return false;
  return true;
}

CompensatedSum compensated_sum(QtbInt first, QtbInt last, Strip x, Strip y, bool complex, bool exact) {
  if (complex) return exact ? sum_of<true, true>(first, last, x, y) : sum_of<true, false>(first, last, x, y);
  return exact ? sum_of<false, true>(first, last, x, y) : sum_of<false, false>(first, last, x, y);
}

WideSum wide_sum(QtbInt first, QtbInt last, Strip x, Strip y, bool complex) {
  WideSum sum;
  for (QtbInt k = first; k < last; ++k) {
    const QuadComplex a{Quad(x.re[k]), Quad(x.im[k])}, b{Quad(y.re[k]), Quad(y.im[k])};
    if (complex) {
      sum.value.re += a.re * b.re - a.im * b.im;
      sum.value.im += a.re * b.im + a.im * b.re;
    } else {
      sum.value.re += a.re * b.re;
    }
    sum.gauge += static_cast<double>(magnitude(a) * magnitude(b));
  }
  return sum;
}

void add_columns(std::size_t rows, std::size_t columns, const float *a, const float *y, float *sum) {
  add_all_columns(rows, columns, a, y, sum);
}
void add_columns(std::size_t rows, std::size_t columns, const double *a, const double *y, double *sum) {
  add_all_columns(rows, columns, a, y, sum);
}

}  // namespace qtb::reference
