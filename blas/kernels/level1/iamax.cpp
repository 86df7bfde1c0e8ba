// Index searches: the one-based index of the first element of largest (i?amax) or smallest (i?amin) magnitude, and
// dcabs1, the magnitude of one complex element. A magnitude is |v|, for complex elements |re| + |im|, computed in the
// element's precision. x is read only, at any address. n or incx below 1 gives 0.
//
// The search keeps its best element only if an ordered comparison says so. Ties therefore go to the first occurrence,
// and a NaN takes over from the best before it and gives way to the element after it, whatever that is.

#include "blas/kernels/simd/vec.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
Real<T> magnitude(const T *x) {
  if constexpr (is_complex<T>)
    return absolute(load_single(parts(x))) + absolute(load_single(parts(x) + 1));
  else
    return absolute(load_single(x));
}

// The best of n random elements changes about log(n) times: a branch that is nearly always foretold, and far cheaper
// than carrying the best through a chain of selections.
constexpr double keep_probability = 0.99;

enum class Extreme { largest, smallest };

template <class T, Extreme extreme>
struct Search {
  Real<T> best;
  QtbInt index;  // one-based

  void visit(QtbInt i, const T *x) {
    const Real<T> value = magnitude(x);
    const bool keep = extreme == Extreme::largest ? best >= value : value >= best;
    if (!__builtin_expect_with_probability(keep, true, keep_probability)) {
      best = value;
      index = i;
    }
  }
};

// n >= 2 elements, step apart. Two real elements a pass, or one complex element, in order.
template <class T, Extreme extreme>
[[gnu::always_inline]] inline QtbInt search_walk(QtbInt n, const T *x, QtbInt step) {
  constexpr QtbInt block = is_complex<T> ? 1 : 2;
  Search<T, extreme> search = {magnitude(x), 1};
  QtbInt i = 2;
  for (x += step; i + block - 1 <= n; i += block, x += block * step)
    for (QtbInt k = 0; k < block; ++k) search.visit(i + k, x + k * step);
  if (block > 1 && i <= n) search.visit(i, x);
  return search.index;
}

template <class T, Extreme extreme>
QtbInt find(const QtbInt *n, const T *x, const QtbInt *incx) {
  const QtbInt count = *n;
  if (count < 1) return 0;
  const QtbInt inc = *incx;
  if (inc < 1) return 0;
  if (count == 1) return 1;
  if (inc == 1) return search_walk<T, extreme>(count, x, 1);
  return search_walk<T, extreme>(count, x, inc);
}

}  // namespace

QTB_KERNEL(isamax, search, float, (find<float, Extreme::largest>))
QTB_KERNEL(idamax, search, double, (find<double, Extreme::largest>))
QTB_KERNEL(icamax, search, cfloat, (find<cfloat, Extreme::largest>))
QTB_KERNEL(izamax, search, cdouble, (find<cdouble, Extreme::largest>))
QTB_KERNEL(isamin, search, float, (find<float, Extreme::smallest>))
QTB_KERNEL(idamin, search, double, (find<double, Extreme::smallest>))
QTB_KERNEL(icamin, search, cfloat, (find<cfloat, Extreme::smallest>))
QTB_KERNEL(izamin, search, cdouble, (find<cdouble, Extreme::smallest>))
QTB_KERNEL(dcabs1, cabs1, cdouble, magnitude)

}  // namespace qtb::QTB_TIER
