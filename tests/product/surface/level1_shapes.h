// How a routine of each Level-1 shape is tested on one problem: the arguments made, the call, the judgement. Only n,
// the increments and the factors of a problem are used; kl and ku choose special cases.
#pragma once

#include "tests/product/surface/session.h"

namespace qtb::surface {

using reference::Dense;
using reference::strided;
using reference::Term;
using reference::update;

// A large problem's vectors are as long as its matrices are large.
inline QtbInt vector_length(const Problem &p) { return p.n <= 70 ? p.n : 30 * p.n; }

// The increment of an operand that is only read: sometimes zero, the same element every time.
inline QtbInt input_increment(QtbInt increment, QtbInt choice) { return choice == 1 ? 0 : increment; }

inline Dense one_by_one(bool complex) {
  Dense d(1, 1, complex, true);
  reference::set(d, 0, 0, 1.0);
  return d;
}
// What a vector holds already, read as a matrix of one column.
template <class T>
Dense column_before(const Operand<T> &x) {
  return reference::read(x.layout(), x.before());
}

// The elements of one vector in the places of another, exactly.
template <class T>
Expectation moved(const Operand<T> &from, const Layout &to) {
  const T nothing{};
  return update(to, {{{1, 0}, column_before(from), one_by_one(is_complex<T>)}}, {0, 0}, &nothing, 0);
}

// ---- updates and moves ----

// y := alpha*x + y. call(alpha, x, y) makes the call.
template <class T, class Call>
void test_axpy(const Problem &p, Session &s, const Layout &lx, const Layout &ly, Call call) {
  Draw draw(p.seed);
  Operand<T> x(lx, draw), y(ly, draw);
  const T alpha = scalar<T>(p.alpha);
  prepare_input(x, Structure::general, p, draw, !is_zero(alpha));
  prepare_output(y, Structure::general, p, draw, true);
  call(&alpha, x.data(), y.data());
  s.judge(y, is_zero(alpha) ? reference::untouched(ly)
                            : update(ly, {{test::widen(alpha), column_before(x), one_by_one(is_complex<T>)}}, {1, 0},
                                     y.before(), is_complex<T> ? 3 : 2));
}

template <class T, class R>
void run(Shape<"axpy">, const R &routine, const Problem &p, Session &s) {
  const QtbInt n = vector_length(p), incx = input_increment(p.incx, p.kl);
  test_axpy<T>(p, s, strided(n, incx), strided(n, p.incy),
               [&](const T *alpha, const T *x, T *y) { s.call(routine, &n, alpha, x, &incx, y, &p.incy); });
}

template <class T, class R>
void run(Shape<"copy">, const R &routine, const Problem &p, Session &s) {
  const QtbInt n = vector_length(p), incx = input_increment(p.incx, p.kl);
  Draw draw(p.seed);
  Operand<T> x(strided(n, incx), draw), y(strided(n, p.incy), draw);
  prepare_input(x, Structure::general, p, draw, true);
  prepare_output(y, Structure::general, p, draw, false);
  s.call(routine, &n, x.data(), &incx, y.data(), &p.incy);
  s.judge(y, moved(x, y.layout()));
}

template <class T, class R>
void run(Shape<"swap">, const R &routine, const Problem &p, Session &s) {
  const QtbInt n = vector_length(p);
  Draw draw(p.seed);
  Operand<T> x(strided(n, p.incx), draw), y(strided(n, p.incy), draw);
  prepare_output(x, Structure::general, p, draw, true);
  prepare_output(y, Structure::general, p, draw, true);
  s.call(routine, &n, x.data(), &p.incx, y.data(), &p.incy);
  s.judge(x, moved(y, x.layout()));
  s.judge(y, moved(x, y.layout()));
}

// x := alpha*x. A negative increment takes the elements that its magnitude takes.
template <class T, class Factor, class R>
void test_scal(const R &routine, const Problem &p, Session &s) {
  const QtbInt n = vector_length(p), incx = routine.is_independent() ? std::abs(p.incx) : p.incx;
  Draw draw(p.seed);
  Operand<T> x(strided(n, incx), draw);
  const Factor alpha = scalar<Factor>(p.alpha);
  prepare_output(x, Structure::general, p, draw, true);
  s.call(routine, &n, &alpha, x.data(), &incx);
  s.judge(x, update(x.layout(), {}, test::widen(alpha), x.before(), is_complex<Factor> ? 2 : 1));
}
template <class T, class R>
void run(Shape<"scal">, const R &routine, const Problem &p, Session &s) {
  test_scal<T, T>(routine, p, s);
}
template <class T, class R>
void run(Shape<"real_scal">, const R &routine, const Problem &p, Session &s) {
  test_scal<T, Real<T>>(routine, p, s);
}

// ---- dot products ----

// The sum of x(i) y(i) and of its magnitudes, with x conjugated where told.
struct Dot {
  QuadComplex value;
  double gauge;
};
template <class T>
Dot dot_before(const Operand<T> &x, const Operand<T> &y, bool conjugated) {
  const Dense row = reference::op(conjugated ? 'C' : 'T', column_before(x));
  const T nothing{};
  const Expectation e = update(strided(1, 1), {{{1, 0}, row, column_before(y)}}, {0, 0}, &nothing, 0);
  return {e.at(0, 0).value, e.at(0, 0).gauge};
}

// The arguments of a dot product, filled and sealed.
template <class T>
struct DotOperands {
  DotOperands(const Problem &p, const Layout &lx, const Layout &ly) : draw(p.seed), x(lx, draw), y(ly, draw) {
    prepare_input(x, Structure::general, p, draw, true);
    prepare_input(y, Structure::general, p, draw, true);
  }
  Draw draw;
  Operand<T> x, y;
};

template <class T, class R>
void run(Shape<"dot">, const R &routine, const Problem &p, Session &s) {
  const QtbInt n = vector_length(p), incx = input_increment(p.incx, p.kl), incy = input_increment(p.incy, p.ku);
  DotOperands<T> o(p, strided(n, incx), strided(n, incy));
  const T got = s.call(routine, &n, o.x.data(), &incx, o.y.data(), &incy);
  const Dot want = dot_before(o.x, o.y, false);
  s.judge_value(got, want.value, want.gauge, static_cast<double>(n));
}

template <class T, class R>
void run(Shape<"cdot">, const R &routine, const Problem &p, Session &s) {
  const QtbInt n = vector_length(p), incx = input_increment(p.incx, p.kl), incy = input_increment(p.incy, p.ku);
  DotOperands<T> o(p, strided(n, incx), strided(n, incy));
  T got{};
  T *const returned = s.call(routine, &got, &n, o.x.data(), &incx, o.y.data(), &incy);
  s.require(returned == &got, "the value of a complex function is the pointer to its result");
  const Dot want = dot_before(o.x, o.y, routine.is_conjugated());
  s.judge_value(got, want.value, want.gauge, 2 * static_cast<double>(n));
}

template <class T, class R>
void run(Shape<"dsdot">, const R &routine, const Problem &p, Session &s) {
  const QtbInt n = vector_length(p), incx = input_increment(p.incx, p.kl), incy = input_increment(p.incy, p.ku);
  DotOperands<T> o(p, strided(n, incx), strided(n, incy));
  const double got = s.call(routine, &n, o.x.data(), &incx, o.y.data(), &incy);
  const Dot want = dot_before(o.x, o.y, false);
  s.judge_value(got, want.value, want.gauge, static_cast<double>(n));
}

template <class T, class R>
void run(Shape<"sdsdot">, const R &routine, const Problem &p, Session &s) {
  const QtbInt n = vector_length(p), incx = input_increment(p.incx, p.kl), incy = input_increment(p.incy, p.ku);
  DotOperands<T> o(p, strided(n, incx), strided(n, incy));
  const T sb = scalar<T>(p.alpha);
  const T got = s.call(routine, &n, &sb, o.x.data(), &incx, o.y.data(), &incy);
  Dot want = dot_before(o.x, o.y, false);
  want.value.re += Quad(sb);
  // One rounding to single, and n of the double sum.
  constexpr double doubles = test::unit_roundoff<double> / test::unit_roundoff<float>;
  const double gauge = std::fabs(static_cast<double>(want.value.re)) +
                       static_cast<double>(n) * doubles * (want.gauge + std::fabs(static_cast<double>(sb)));
  s.judge_value(got, want.value, gauge, 1);
}

// ---- rotations ----

// x := xx*x + xy*y, y := yx*x + yy*y for real factors.
struct PlaneMap {
  double xx, xy, yx, yy;
};
template <class T>
Expectation mapped(const Layout &out, double fx, const Operand<T> &x, double fy, const Operand<T> &y) {
  const Dense one = one_by_one(is_complex<T>);
  const T nothing{};
  std::vector<Term> terms;
  if (fx != 0) terms.push_back({{Quad(fx), 0}, column_before(x), one});
  if (fy != 0) terms.push_back({{Quad(fy), 0}, column_before(y), one});
  return update(out, terms, {0, 0}, &nothing, is_complex<T> ? 4 : 2);
}

// A map of two vectors, stored as told. call(x, y) makes the call; nothing may change where it is not applied.
template <class T, class Call>
void test_plane_map(const Problem &p, Session &s, const Layout &lx, const Layout &ly, PlaneMap map, bool applied,
                    Call call) {
  Draw draw(p.seed);
  Operand<T> x(lx, draw), y(ly, draw);
  prepare_output(x, Structure::general, p, draw, true);
  prepare_output(y, Structure::general, p, draw, true);
  call(x.data(), y.data());
  s.judge(x, applied ? mapped(lx, map.xx, x, map.xy, y) : reference::untouched(lx));
  s.judge(y, applied ? mapped(ly, map.yx, x, map.yy, y) : reference::untouched(ly));
}

template <class T, class R>
void run(Shape<"rot">, const R &routine, const Problem &p, Session &s) {
  const QtbInt n = vector_length(p);
  const Real<T> c = scalar<Real<T>>(p.alpha), sine = scalar<Real<T>>(p.beta);
  const double dc = static_cast<double>(c), ds = static_cast<double>(sine);
  test_plane_map<T>(p, s, strided(n, p.incx), strided(n, p.incy), {dc, ds, -ds, dc}, true,
                    [&](T *x, T *y) { s.call(routine, &n, x, &p.incx, y, &p.incy, &c, &sine); });
}

template <class T, class R>
void run(Shape<"rotm">, const R &routine, const Problem &p, Session &s) {
  const QtbInt n = vector_length(p);
  Draw draw(p.seed + 1);
  const double flag = static_cast<double>(draw.integer(-2, 1));
  const double h11 = draw_scalar(draw, p.values).re, h21 = draw_scalar(draw, p.values).re,
               h12 = draw_scalar(draw, p.values).re, h22 = draw_scalar(draw, p.values).re;
  const T param[5] = {static_cast<T>(flag), static_cast<T>(h11), static_cast<T>(h21), static_cast<T>(h12),
                      static_cast<T>(h22)};
  PlaneMap map{param[1], param[3], param[2], param[4]};
  if (flag == 0) map.xx = map.yy = 1;
  if (flag == 1) map.xy = 1, map.yx = -1;
  test_plane_map<T>(p, s, strided(n, p.incx), strided(n, p.incy), map, flag != -2,
                    [&](T *x, T *y) { s.call(routine, &n, x, &p.incx, y, &p.incy, param); });
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
  T a = scalar<T>(p.alpha), b = scalar<T>(p.beta);
  const QuadComplex before_a = test::widen(a), before_b = test::widen(b);
  Part c{};
  T sine{};
  s.call(routine, &a, &b, &c, &sine);
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
  T d1 = near_one(), d2 = near_one(), x1 = near_one();
  const T y1 = static_cast<T>(draw.one_in(2) ? static_cast<double>(near_one()) : -static_cast<double>(near_one()));
  const Quad old_d1 = d1, old_d2 = d2, old_x1 = x1, old_y1 = y1;
  T param[5] = {};
  s.call(routine, &d1, &d2, &x1, &y1, param);
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
  const QtbInt n = vector_length(p);
  const QtbInt incx = routine.is_independent() ? std::abs(p.incx) : input_increment(p.incx, p.kl);
  Draw draw(p.seed);
  Operand<T> x(strided(n, incx), draw);
  prepare_input(x, Structure::general, p, draw, true);
  const Real<T> got = s.call(routine, &n, x.data(), &incx);
  const Dense column = column_before(x);
  Quad sum = 0, squares = 0;
  for (QtbInt i = 0; i < n; ++i) {
    const QuadComplex v = column.value(i, 0);
    sum += magnitude(v);
    squares += v.re * v.re + v.im * v.im;
  }
  const double terms = static_cast<double>(is_complex<T> ? 2 * n : n);
  const bool is_sum = std::string(routine.name()).find("asum") != std::string::npos;
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
  const QtbInt n = vector_length(p), incx = input_increment(p.incx, p.kl);
  Draw draw(p.seed);
  Operand<T> x(strided(n, incx), draw);
  prepare_input(x, Structure::general, p, draw, true);
  const QtbInt got = s.call(routine, &n, x.data(), &incx);
  const bool largest = std::string(routine.name()).find("max") != std::string::npos;
  QtbInt want = n < 1 || incx < 1 ? 0 : 1;
  for (QtbInt i = 1; i < n && want != 0; ++i) {
    const Real<T> value = search_magnitude(reference::load(x.before(), i * incx));
    const Real<T> best = search_magnitude(reference::load(x.before(), (want - 1) * incx));
    if (largest ? value > best : value < best) want = i + 1;
  }
  s.require(got == want, "the index of the first extreme magnitude");
}

template <class T, class R>
void run(Shape<"cabs1">, const R &routine, const Problem &p, Session &s) {
  const T z = scalar<T>(p.alpha);
  const Real<T> got = s.call(routine, &z);
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
    chosen.assign(all.begin(), all.begin() + nz);
    operand.seal(Access::read);
  }
  Layout layout() const { return reference::indexed(static_cast<QtbInt>(chosen.size()), chosen.data()); }
  const QtbInt *data() { return operand.data(); }

 private:
  Draw draw;
  Operand<QtbInt> operand;
  std::vector<QtbInt> chosen;
};

template <class T, class R>
void run(Shape<"axpyi">, const R &routine, const Problem &p, Session &s) {
  Indices index(p, p.n);
  test_axpy<T>(p, s, strided(p.n, 1), index.layout(),
               [&](const T *alpha, const T *x, T *y) { s.call(routine, &p.n, alpha, x, index.data(), y); });
}

template <class T, class R>
void run(Shape<"doti">, const R &routine, const Problem &p, Session &s) {
  Indices index(p, p.n);
  DotOperands<T> o(p, strided(p.n, 1), index.layout());
  const T got = s.call(routine, &p.n, o.x.data(), index.data(), o.y.data());
  const Dot want = dot_before(o.x, o.y, false);
  s.judge_value(got, want.value, want.gauge, static_cast<double>(p.n));
}

template <class T, class R>
void run(Shape<"cdoti">, const R &routine, const Problem &p, Session &s) {
  Indices index(p, p.n);
  DotOperands<T> o(p, strided(p.n, 1), index.layout());
  T got{};
  T *const returned = s.call(routine, &got, &p.n, o.x.data(), index.data(), o.y.data());
  s.require(returned == &got, "the value of a complex function is the pointer to its result");
  const Dot want = dot_before(o.x, o.y, routine.is_conjugated());
  s.judge_value(got, want.value, want.gauge, 2 * static_cast<double>(p.n));
}

// x(k) := y(indx(k)), and with zeroing y(indx(k)) := 0.
template <class T, class R>
void test_gather(const R &routine, const Problem &p, Session &s, bool zeroes) {
  Indices index(p, p.n);
  Draw draw(p.seed);
  Operand<T> x(strided(p.n, 1), draw), y(index.layout(), draw);
  prepare_output(x, Structure::general, p, draw, false);
  if (zeroes)
    prepare_output(y, Structure::general, p, draw, true);
  else
    prepare_input(y, Structure::general, p, draw, true);
  s.call(routine, &p.n, y.data(), x.data(), index.data());
  s.judge(x, moved(y, x.layout()));
  if (zeroes) s.judge(y, update(y.layout(), {}, {0, 0}, y.before(), 0));
}
template <class T, class R>
void run(Shape<"gthr">, const R &routine, const Problem &p, Session &s) {
  test_gather<T>(routine, p, s, false);
}
template <class T, class R>
void run(Shape<"gthrz">, const R &routine, const Problem &p, Session &s) {
  test_gather<T>(routine, p, s, true);
}

template <class T, class R>
void run(Shape<"sctr">, const R &routine, const Problem &p, Session &s) {
  Indices index(p, p.n);
  Draw draw(p.seed);
  Operand<T> x(strided(p.n, 1), draw), y(index.layout(), draw);
  prepare_input(x, Structure::general, p, draw, true);
  prepare_output(y, Structure::general, p, draw, false);
  s.call(routine, &p.n, x.data(), index.data(), y.data());
  s.judge(y, moved(x, y.layout()));
}

template <class T, class R>
void run(Shape<"roti">, const R &routine, const Problem &p, Session &s) {
  Indices index(p, p.n);
  const T c = scalar<T>(p.alpha), sine = scalar<T>(p.beta);
  const double dc = static_cast<double>(c), ds = static_cast<double>(sine);
  test_plane_map<T>(p, s, strided(p.n, 1), index.layout(), {dc, ds, -ds, dc}, dc != 1 || ds != 0,
                    [&](T *x, T *y) { s.call(routine, &p.n, x, index.data(), y, &c, &sine); });
}

}  // namespace qtb::surface
