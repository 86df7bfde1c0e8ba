// How a routine of each Level-1 shape is tested on one problem: the call, and what is expected of it. Only n, the
// increments and the factors of a problem are used; kl and ku choose special cases.
#pragma once

#include "tests/product/surface/called.h"

namespace qtb::surface {

using reference::Dense;
using reference::strided;
using reference::Term;
using reference::update;

// A large problem's vectors are as long as its matrices are large.
inline Problem with_length(Problem p) {
  if (p.n > 70) p.n *= 30;
  return p;
}
// An operand that is only read sometimes has an increment of zero, the same element every time.
inline QtbInt input_increment(QtbInt increment, QtbInt choice) { return choice == 1 ? 0 : increment; }
inline Problem with_input_x(Problem p) {
  p.incx = input_increment(p.incx, p.kl);
  return with_length(p);
}
inline Problem with_inputs(Problem p) {
  p.incy = input_increment(p.incy, p.ku);
  return with_input_x(p);
}

inline Dense one_by_one(bool complex) {
  Dense d(1, 1, complex, true);
  reference::set(d, 0, 0, 1.0);
  return d;
}
// What a vector holds already, read as a matrix of one column.
template <class T>
Dense column_before(const Array<T> &x) {
  return reference::read(x.layout(), x.before());
}

// The elements of one vector in the places of another, exactly.
template <class T>
Expectation moved(const Array<T> &from, const Layout &to) {
  const T nothing{};
  return update(to, {{{1, 0}, column_before(from), one_by_one(is_complex<T>)}}, {0, 0}, &nothing, 0);
}

// ---- updates and moves ----

// y := alpha*x + y.
template <ShapeName shape, class T, class R>
void test_axpy(const R &routine, const Problem &p, Session &s) {
  Called<shape, T> o(p, routine.kind());
  o.call(s, routine);
  const T alpha = o.scalars.alpha;
  const Layout &layout = o.y.layout();
  s.judge(o.y.operand(), is_zero(alpha)
                             ? reference::untouched(layout)
                             : update(layout, {{test::widen(alpha), column_before(o.x), one_by_one(is_complex<T>)}},
                                      {1, 0}, o.y.before(), is_complex<T> ? 3 : 2));
}
template <class T, class R>
void run(Shape<"axpy">, const R &routine, const Problem &p, Session &s) {
  test_axpy<"axpy", T>(routine, with_input_x(p), s);
}

template <class T, class R>
void run(Shape<"copy">, const R &routine, const Problem &p, Session &s) {
  Called<"copy", T> o(with_input_x(p), routine.kind());
  o.call(s, routine);
  s.judge(o.y.operand(), moved(o.x, o.y.layout()));
}

template <class T, class R>
void run(Shape<"swap">, const R &routine, const Problem &p, Session &s) {
  Called<"swap", T> o(with_length(p), routine.kind());
  o.call(s, routine);
  s.judge(o.x.operand(), moved(o.y, o.x.layout()));
  s.judge(o.y.operand(), moved(o.x, o.y.layout()));
}

// x := alpha*x, with so many roundings. A negative increment takes the elements that its magnitude takes.
template <ShapeName shape, class T, class R>
void test_scal(const R &routine, const Problem &p, Session &s, double roundings) {
  Problem q = with_length(p);
  if (routine.is_independent()) q.incx = std::abs(q.incx);
  Called<shape, T> o(q, routine.kind());
  o.call(s, routine);
  s.judge(o.x.operand(), update(o.x.layout(), {}, test::widen(o.scalars.alpha), o.x.before(), roundings));
}
template <class T, class R>
void run(Shape<"scal">, const R &routine, const Problem &p, Session &s) {
  test_scal<"scal", T>(routine, p, s, is_complex<T> ? 2 : 1);
}
template <class T, class R>
void run(Shape<"real_scal">, const R &routine, const Problem &p, Session &s) {
  test_scal<"real_scal", T>(routine, p, s, 1);
}

// ---- dot products ----

// The sum of x(i) y(i) and of its magnitudes, with x conjugated where told.
struct Dot {
  QuadComplex value;
  double gauge;
};
template <class T>
Dot dot_before(const Array<T> &x, const Array<T> &y, bool conjugated) {
  const Dense row = reference::op(conjugated ? 'C' : 'T', column_before(x));
  const T nothing{};
  const Expectation e = update(strided(1, 1), {{{1, 0}, row, column_before(y)}}, {0, 0}, &nothing, 0);
  return {e.at(0, 0).value, e.at(0, 0).gauge};
}

template <ShapeName shape, class T, class R>
void test_dot(const R &routine, const Problem &p, Session &s) {
  Called<shape, T> o(p, routine.kind());
  const auto got = o.call(s, routine);
  const Dot want = dot_before(o.x, o.y, false);
  s.judge_value(got, want.value, want.gauge, static_cast<double>(o.x.layout().rows));
}
template <class T, class R>
void run(Shape<"dot">, const R &routine, const Problem &p, Session &s) {
  test_dot<"dot", T>(routine, with_inputs(p), s);
}
template <class T, class R>
void run(Shape<"dsdot">, const R &routine, const Problem &p, Session &s) {
  test_dot<"dsdot", T>(routine, with_inputs(p), s);
}

template <ShapeName shape, class T, class R>
void test_complex_dot(const R &routine, const Problem &p, Session &s) {
  Called<shape, T> o(p, routine.kind());
  T *const returned = o.call(s, routine);
  s.require(returned == &o.scalars.result, "the value of a complex function is the pointer to its result");
  const Dot want = dot_before(o.x, o.y, routine.kind().conjugated);
  s.judge_value(o.scalars.result, want.value, want.gauge, 2 * static_cast<double>(o.x.layout().rows));
}
template <class T, class R>
void run(Shape<"cdot">, const R &routine, const Problem &p, Session &s) {
  test_complex_dot<"cdot", T>(routine, with_inputs(p), s);
}

template <class T, class R>
void run(Shape<"sdsdot">, const R &routine, const Problem &p, Session &s) {
  Called<"sdsdot", T> o(with_inputs(p), routine.kind());
  const double n = static_cast<double>(o.x.layout().rows);
  const T sb = o.scalars.alpha;
  const T got = o.call(s, routine);
  Dot want = dot_before(o.x, o.y, false);
  want.value.re += Quad(sb);
  // One rounding to single, and n of the double sum.
  constexpr double doubles = test::unit_roundoff<double> / test::unit_roundoff<float>;
  const double gauge =
      std::fabs(static_cast<double>(want.value.re)) + n * doubles * (want.gauge + std::fabs(static_cast<double>(sb)));
  s.judge_value(got, want.value, gauge, 1);
}

// ---- rotations ----

// x := xx*x + xy*y, y := yx*x + yy*y for real factors.
struct PlaneMap {
  double xx, xy, yx, yy;
};
template <class T>
Expectation mapped(const Layout &out, double fx, const Array<T> &x, double fy, const Array<T> &y) {
  const Dense one = one_by_one(is_complex<T>);
  const T nothing{};
  std::vector<Term> terms;
  if (fx != 0) terms.push_back({{Quad(fx), 0}, column_before(x), one});
  if (fy != 0) terms.push_back({{Quad(fy), 0}, column_before(y), one});
  return update(out, terms, {0, 0}, &nothing, is_complex<T> ? 4 : 2);
}

// The call made, of a map of two vectors: nothing may change where it is not applied.
template <ShapeName shape, class T, class R>
void test_plane_map(Called<shape, T> &o, const R &routine, Session &s, PlaneMap map, bool applied) {
  o.call(s, routine);
  const Layout &lx = o.x.layout(), &ly = o.y.layout();
  s.judge(o.x.operand(), applied ? mapped(lx, map.xx, o.x, map.xy, o.y) : reference::untouched(lx));
  s.judge(o.y.operand(), applied ? mapped(ly, map.yx, o.x, map.yy, o.y) : reference::untouched(ly));
}

template <class T, class R>
void run(Shape<"rot">, const R &routine, const Problem &p, Session &s) {
  Called<"rot", T> o(with_length(p), routine.kind());
  const double c = static_cast<double>(scalar<Real<T>>(p.alpha)), sine = static_cast<double>(scalar<Real<T>>(p.beta));
  test_plane_map(o, routine, s, {c, sine, -sine, c}, true);
}

template <class T, class R>
void run(Shape<"rotm">, const R &routine, const Problem &p, Session &s) {
  Called<"rotm", T> o(with_length(p), routine.kind());
  Draw draw(p.seed + 1);
  const double flag = static_cast<double>(draw.integer(-2, 1));
  const double h11 = draw_scalar(draw, p.values).re, h21 = draw_scalar(draw, p.values).re,
               h12 = draw_scalar(draw, p.values).re, h22 = draw_scalar(draw, p.values).re;
  const double drawn[] = {flag, h11, h21, h12, h22};
  T(&param)[5] = o.scalars.param;
  for (std::size_t i = 0; i < 5; ++i) param[i] = static_cast<T>(drawn[i]);
  PlaneMap map{param[1], param[3], param[2], param[4]};
  if (flag == 0) map.xx = map.yy = 1;
  if (flag == 1) map.xy = 1, map.yx = -1;
  test_plane_map(o, routine, s, map, flag != -2);
  for (std::size_t i = 0; i < 5; ++i) s.require(param[i] == static_cast<T>(drawn[i]), "param is an input");
}

inline Quad square_root(Quad v) {
  if (v == 0) return 0;
  Quad root = Quad(std::sqrt(static_cast<double>(v)));
  for (int step = 0; step < 2; ++step) root = (root + v / root) / 2;  // doubles the digits each time
  return root;
}

// The identities of a rotation that was generated: r against the length, and the rotation of (a, b) onto (r, 0).
template <class T, class R>
void run(Shape<"rotg">, const R &routine, const Problem &p, Session &s) {
  using Part = Real<T>;
  Called<"rotg", T> o(p, routine.kind());
  const T &a = o.scalars.alpha, &b = o.scalars.beta, &sine = o.scalars.sine;
  const Part &c = o.scalars.cosine;
  const QuadComplex before_a = test::widen(a), before_b = test::widen(b);
  o.call(s, routine);
  const QuadComplex r = test::widen(a), wide_s = test::widen(sine);
  const QuadComplex wide_c{Quad(c), 0};
  const Quad length = square_root(before_a.re * before_a.re + before_a.im * before_a.im + before_b.re * before_b.re +
                                  before_b.im * before_b.im);
  if (is_zero(scalar<T>(p.alpha)) && (is_complex<T> || length == 0)) {
    const QuadComplex want_r = is_complex<T> ? before_b : QuadComplex{};
    s.require(Quad(c) == Quad(is_complex<T> ? 0 : 1) && wide_s.re == Quad(is_complex<T> ? 1 : 0) && wide_s.im == 0 &&
                  r.re == want_r.re && r.im == want_r.im,
              "the case of a zero");
    return;
  }
  const double many = is_complex<T> ? 24 : 12, size = static_cast<double>(length);
  const auto times = [](QuadComplex u, QuadComplex v) { return reference::product(u, v, is_complex<T>); };
  const auto vanishes = [&](Quad v, double gauge, double roundings) { s.judge_residual<Part>(v, gauge, roundings); };
  const Quad r_length = square_root(r.re * r.re + r.im * r.im);
  vanishes(r_length - length, size, is_complex<T> ? 12 : 6);
  vanishes(wide_c.re * wide_c.re + wide_s.re * wide_s.re + wide_s.im * wide_s.im - 1, 1, many);
  const QuadComplex ca = times(wide_c, before_a), sb = times(wide_s, before_b);
  const QuadComplex cb = times(wide_c, before_b), sa = times(reference::conjugate(wide_s), before_a);
  for (const Quad v : {ca.re + sb.re - r.re, ca.im + sb.im - r.im, cb.re - sa.re, cb.im - sa.im})
    vanishes(v, size, many);
  if constexpr (!is_complex<T>) {
    const bool a_is_larger = magnitude(before_a.re) > magnitude(before_b.re);
    s.require((r.re < 0) == ((a_is_larger ? before_a.re : before_b.re) < 0), "the sign of r");
    const Quad z = a_is_larger ? wide_s.re : c != 0 ? 1 / wide_c.re : Quad(1);
    vanishes(Quad(b) - z, std::fabs(static_cast<double>(z)), 1);
  } else {
    s.require(b.re == scalar<T>(p.beta).re && b.im == scalar<T>(p.beta).im, "b is an input");
  }
}

// The identities of a modified rotation H: it maps (x1, y1) onto (new x1, 0) and diag(d) = H^T diag(new d) H. Factors
// are so near 1 that nothing is rescaled.
template <class T, class R>
void run(Shape<"rotmg">, const R &routine, const Problem &p, Session &s) {
  Draw draw(p.seed);
  const auto near_one = [&] { return static_cast<T>(1.5 + draw.real() / 2); };
  Called<"rotmg", T> o(p, routine.kind());
  T &d1 = o.scalars.d1, &d2 = o.scalars.d2, &x1 = o.scalars.x1, &y1 = o.scalars.y1;
  d1 = near_one(), d2 = near_one(), x1 = near_one();
  y1 = static_cast<T>(draw.one_in(2) ? static_cast<double>(near_one()) : -static_cast<double>(near_one()));
  const Quad old_d1 = d1, old_d2 = d2, old_x1 = x1, old_y1 = y1;
  o.call(s, routine);
  const T(&param)[5] = o.scalars.param;
  s.require(Quad(y1) == old_y1, "y1 is an input");
  const Quad h11 = param[0] == 1 ? Quad(param[1]) : 1, h22 = param[0] == 1 ? Quad(param[4]) : 1;
  const Quad h21 = param[0] == 1 ? Quad(-1) : Quad(param[2]), h12 = param[0] == 1 ? Quad(1) : Quad(param[3]);
  s.require(param[0] == 0 || param[0] == 1, "nothing is rescaled");
  const auto vanishes = [&](Quad v, Quad gauge) {
    s.judge_residual<T>(v, static_cast<double>(magnitude(gauge)), 12);  // as for a rotation
  };
  vanishes(h11 * old_x1 + h12 * old_y1 - Quad(x1), magnitude(h11 * old_x1) + magnitude(h12 * old_y1));
  vanishes(h21 * old_x1 + h22 * old_y1, magnitude(h21 * old_x1) + magnitude(h22 * old_y1));
  vanishes(h11 * h11 * Quad(d1) + h21 * h21 * Quad(d2) - old_d1, old_d1);
  vanishes(h12 * h12 * Quad(d1) + h22 * h22 * Quad(d2) - old_d2, old_d2);
  vanishes(h11 * h12 * Quad(d1) + h21 * h22 * Quad(d2),
           magnitude(h11 * h12 * Quad(d1)) + magnitude(h21 * h22 * Quad(d2)));
}

// ---- norms, sums, searches ----

template <class T, class R>
void run(Shape<"norm">, const R &routine, const Problem &p, Session &s) {
  Problem q = with_input_x(p);
  if (routine.is_independent()) q.incx = std::abs(p.incx);
  Called<"norm", T> o(q, routine.kind());
  const Real<T> got = o.call(s, routine);
  const Dense column = column_before(o.x);
  const QtbInt n = q.n;
  Quad sum = 0, squares = 0;
  for (QtbInt i = 0; i < n; ++i) {
    const QuadComplex v = column.value(i, 0);
    sum += magnitude(v);
    squares += v.re * v.re + v.im * v.im;
  }
  const double terms = static_cast<double>(is_complex<T> ? 2 * n : n);
  const bool is_sum = !routine.kind().squares;
  const Quad want = is_sum ? sum : square_root(squares);
  const bool rescales = sizeof(Real<T>) == sizeof(double);
  const double c = is_sum ? terms : rescales ? 3 * terms + 4 : terms / 2 + 4;
  if (is_sum || !s.exact()) s.judge_value(got, {want, 0}, static_cast<double>(want), c);
}

template <class T>
Real<T> search_magnitude(T v) {
  if constexpr (is_complex<T>)
    return std::fabs(v.re) + std::fabs(v.im);
  else
    return std::fabs(v);
}

template <class T, class R>
void run(Shape<"search">, const R &routine, const Problem &p, Session &s) {
  Called<"search", T> o(with_input_x(p), routine.kind());
  const QtbInt n = o.scalars.n, incx = o.scalars.incx;
  const QtbInt got = o.call(s, routine);
  const bool largest = std::string(routine.name()).find("max") != std::string::npos;
  QtbInt want = n < 1 || incx < 1 ? 0 : 1;
  for (QtbInt i = 1; i < n && want != 0; ++i) {
    const Real<T> value = search_magnitude(reference::load(o.x.before(), i * incx));
    const Real<T> best = search_magnitude(reference::load(o.x.before(), (want - 1) * incx));
    if (largest ? value > best : value < best) want = i + 1;
  }
  s.require(got == want, "the index of the first extreme magnitude");
}

template <class T, class R>
void run(Shape<"cabs1">, const R &routine, const Problem &p, Session &s) {
  Called<"cabs1", T> o(p, routine.kind());
  const T z = o.scalars.alpha;
  const Real<T> got = o.call(s, routine);
  s.judge_value(got, {magnitude(test::widen(z)), 0}, static_cast<double>(magnitude(test::widen(z))), 1);
}

// ---- sparse vectors ----

// Distinct one-based positions in a vector of about twice as many elements, in no order, in read-only memory.
struct Indices {
  Indices(const Problem &p, QtbInt nz) : draw(p.seed + 2), operand(strided(nz, 1), draw) {
    std::vector<QtbInt> all(static_cast<std::size_t>(2 * nz + 1));
    for (std::size_t i = 0; i < all.size(); ++i) all[i] = static_cast<QtbInt>(i) + 1;
    for (QtbInt i = 0; i < nz; ++i) {
      std::swap(all[static_cast<std::size_t>(i)],
                all[static_cast<std::size_t>(draw.integer(i, static_cast<QtbInt>(all.size()) - 1))]);
      operand.store(i, 0, all[static_cast<std::size_t>(i)]);
    }
    operand.seal(Access::read);
  }
  // The problem on these positions.
  Problem of(Problem p) {
    p.index = operand.data();
    return p;
  }

 private:
  Draw draw;
  Operand<QtbInt> operand;
};

template <class T, class R>
void run(Shape<"axpyi">, const R &routine, const Problem &p, Session &s) {
  Indices index(p, p.n);
  test_axpy<"axpyi", T>(routine, index.of(p), s);
}

template <class T, class R>
void run(Shape<"doti">, const R &routine, const Problem &p, Session &s) {
  Indices index(p, p.n);
  test_dot<"doti", T>(routine, index.of(p), s);
}
template <class T, class R>
void run(Shape<"cdoti">, const R &routine, const Problem &p, Session &s) {
  Indices index(p, p.n);
  test_complex_dot<"cdoti", T>(routine, index.of(p), s);
}

// x(k) := y(indx(k)), and with zeroing y(indx(k)) := 0.
template <class T, class R>
void run(Shape<"gthr">, const R &routine, const Problem &p, Session &s) {
  Indices index(p, p.n);
  Called<"gthr", T> o(index.of(p), routine.kind());
  o.call(s, routine);
  s.judge(o.x.operand(), moved(o.y, o.x.layout()));
}
template <class T, class R>
void run(Shape<"gthrz">, const R &routine, const Problem &p, Session &s) {
  Indices index(p, p.n);
  Called<"gthrz", T> o(index.of(p), routine.kind());
  o.call(s, routine);
  s.judge(o.x.operand(), moved(o.y, o.x.layout()));
  s.judge(o.y.operand(), update(o.y.layout(), {}, {0, 0}, o.y.before(), 0));
}

template <class T, class R>
void run(Shape<"sctr">, const R &routine, const Problem &p, Session &s) {
  Indices index(p, p.n);
  Called<"sctr", T> o(index.of(p), routine.kind());
  o.call(s, routine);
  s.judge(o.y.operand(), moved(o.x, o.y.layout()));
}

template <class T, class R>
void run(Shape<"roti">, const R &routine, const Problem &p, Session &s) {
  Indices index(p, p.n);
  Called<"roti", T> o(index.of(p), routine.kind());
  const double c = static_cast<double>(o.scalars.alpha), sine = static_cast<double>(o.scalars.beta);
  test_plane_map(o, routine, s, {c, sine, -sine, c}, c != 1 || sine != 0);
}

}  // namespace qtb::surface
