// The oracle of the rotations: applied ones in 113 bits with their gauges, and the published formulas of the generated
// ones step by step in the element's own precision, where a result is judged bit by bit.
#pragma once

#include <cmath>
#include <vector>

#include "tests/support/bounds.h"

namespace qtb::reference {

using test::Quad;

// h11 x + h12 y, for one real part, and the sum of magnitudes.
struct RowSum {
  Quad value, gauge;
};
template <class R>
RowSum row(R h1, R x, R h2, R y) {
  const Quad p = Quad(h1) * Quad(x), q = Quad(h2) * Quad(y);
  return {p + q, test::magnitude(p) + test::magnitude(q)};
}
constexpr double rotation_roundings = 2;  // a rounding each for the sum and for its larger product

// The matrix of a modified rotation, from param.
template <class R>
struct Matrix {
  R h11, h21, h12, h22;
};
template <class R>
Matrix<R> matrix(const R *param) {
  if (param[0] == -2) return {1, 0, 0, 1};
  if (param[0] < 0) return {param[1], param[2], param[3], param[4]};
  if (param[0] == 0) return {1, param[2], param[3], 1};
  return {param[1], -1, 1, param[4]};
}

// One element pair in the element's precision: two products, one sum. A product by 1 is exact.
template <class R>
void transform(const Matrix<R> &h, R &x, R &y) {
  const R xx = h.h11 * x, xy = h.h12 * y, yx = h.h21 * x, yy = h.h22 * y;
  x = xx + xy;
  y = yx + yy;
}

// ---- generated rotations ----

template <class T>
struct Generated {
  T a, b;
  Real<T> c;
  T s;
};

template <class R>
Generated<R> rotg(R a, R b) {
  const R scale = std::fabs(a) + std::fabs(b);
  if (scale == 0) return {0, 0, 1, 0};
  const R as = a / scale, bs = b / scale;
  R r = scale * std::sqrt(as * as + bs * bs);
  const bool a_larger = std::fabs(a) > std::fabs(b);
  if ((a_larger ? a : b) < 0) r = -r;
  const R c = a / r, s = b / r;
  R z = 1;
  if (a_larger) z = s;
  if (std::fabs(b) >= std::fabs(a) && c != 0) z = 1 / c;
  return {r, z, c, s};
}

// W: the precision of what follows the norm.
template <class W, class R>
Generated<Complex<R>> rotg(Complex<R> a, Complex<R> b) {
  const R abs_a = std::sqrt(a.re * a.re + a.im * a.im);
  if (abs_a == 0) return {b, b, 0, {1, 0}};
  const R abs_b = std::sqrt(b.re * b.re + b.im * b.im);
  const R scale = abs_b + abs_a;
  const R t1 = a.re / scale, t2 = a.im / scale, t3 = b.re / scale, t4 = b.im / scale;
  const R norm = scale * std::sqrt(t1 * t1 + t2 * t2 + t3 * t3 + t4 * t4);
  const W alpha_re = W(a.re) / W(abs_a), alpha_im = W(a.im) / W(abs_a);
  const W s_re = alpha_re * W(b.re) + alpha_im * W(b.im), s_im = alpha_im * W(b.re) - alpha_re * W(b.im);
  return {{R(alpha_re * W(norm)), R(alpha_im * W(norm))}, b, abs_a / norm, {R(s_re / W(norm)), R(s_im / W(norm))}};
}

template <class R>
struct GeneratedModified {
  R d1, d2, x1;
  R param[5];
  bool endless = false;  // the formulas rescale for ever; no result is told
};

// From d1, d2, x1, y1 and the param that stands there before.
template <class R>
GeneratedModified<R> rotmg(R d1, R d2, R x1, R y1, const R *before) {
  const R gam = 4096, gamsq = 16777216, rgamsq = static_cast<R>(5.960464477539e-8);
  const R rgam = sizeof(R) == sizeof(float) ? static_cast<R>(0.000244141F) : static_cast<R>(0.000244140625);
  GeneratedModified<R> g{d1, d2, x1, {before[0], before[1], before[2], before[3], before[4]}};
  const GeneratedModified<R> all_zero{0, 0, 0, {-1, 0, 0, 0, 0}};
  if (d1 < 0) return all_zero;
  if (d2 * y1 == 0) {
    g.param[0] = -2;
    return g;
  }
  R flag, h11 = 0, h21 = 0, h12 = 0, h22 = 0, u;
  const R p1 = d1 * x1;
  if (std::fabs(x1 * p1) > std::fabs(d2 * y1 * y1)) {
    flag = 0;
    const R t = y1 / p1;
    h21 = -d1 * t;
    h12 = t * d2;
    u = 1 - h12 * h21;
    g.x1 = x1 * u;
    g.d1 = d1 * (1 / u);
    g.d2 = d2 * (1 / u);
  } else {
    if (d2 * y1 * y1 < 0) return all_zero;
    flag = 1;
    const R t = x1 / (d2 * y1);
    h11 = d1 * t;
    h22 = d2 * t;
    u = h11 * h22 + 1;
    g.x1 = u * y1;
    g.d1 = d2 * (1 / u);
    g.d2 = d1 * (1 / u);
  }
  const auto fix = [&] {
    if (flag == 1) h12 = 1, h21 = -1;
    if (flag == 0) h11 = 1, h22 = 1;
    flag = -1;
  };
  int passes = 0;
  const auto endless = [&] { return g.endless = ++passes > 1000; };
  if (g.d1 != 0 && g.d1 <= rgamsq)
    for (fix(); g.d1 <= rgamsq && !endless();) g.d1 *= gamsq, g.x1 *= rgam, h11 *= rgam, h12 *= rgam;
  if (g.d1 >= gamsq)
    for (fix(); g.d1 >= gamsq && !endless();) g.d1 *= rgamsq, g.x1 *= gam, h11 *= gam, h12 *= gam;
  if (std::fabs(g.d2) >= gamsq && flag == 0) {
    fix();
    g.d2 *= gamsq, h21 *= rgam, h22 *= rgam;
  } else {
    if (g.d2 != 0 && std::fabs(g.d2) <= rgamsq)
      for (fix(); std::fabs(g.d2) <= rgamsq && !endless();) g.d2 *= gamsq, h21 *= rgam, h22 *= rgam;
    if (std::fabs(g.d2) >= gamsq)
      for (fix(); std::fabs(g.d2) >= gamsq && !endless();) g.d2 *= rgamsq, h21 *= gam, h22 *= gam;
  }
  if (flag != 0) g.param[1] = h11, g.param[4] = h22;
  if (flag != 1) g.param[2] = h21, g.param[3] = h12;
  g.param[0] = flag;
  return g;
}

}  // namespace qtb::reference
