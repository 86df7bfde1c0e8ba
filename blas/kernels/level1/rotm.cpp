// Modified rotations: (x[i], y[i]) := H * (x[i], y[i]) over n element pairs, H the 2 by 2 matrix that param describes.
//
// param = flag, h11, h21, h12, h22. A flag of -2 means H = I, and nothing is touched; below 0 all of H is stored; at 0
// the diagonal is 1 and not read; otherwise the other diagonal is 1 and -1 and not read:
//
//   flag < 0: (h11 h12; h21 h22)     flag 0: (1 h12; h21 1)     flag > 0: (h11 1; -1 h22)
//
// x and y must not overlap; each may stand at any address. A negative increment walks its vector from the far end. n
// below 1 changes nothing.

#include "blas/kernels/level1/pair_walk.h"

namespace qtb::QTB_TIER {
namespace {

enum class Form { full, unit_diagonal, unit_antidiagonal };

// One coefficient of H, for elements and for vectors. One that the form does not have is never read.
template <class T>
struct Coefficient {
  T one;
  Vec<T> all;
};

template <class T>
Coefficient<T> coefficient(bool stored, const T *h) {
  const T value = stored ? load_single(h) : T(0);
  return {value, broadcast(value)};
}

template <class T, Form form>
struct ModifiedRotation {
  Coefficient<T> h11, h21, h12, h22;

  explicit ModifiedRotation(const T *param)
      : h11(coefficient(form != Form::unit_diagonal, param + 1)),
        h21(coefficient(form != Form::unit_antidiagonal, param + 2)),
        h12(coefficient(form != Form::unit_antidiagonal, param + 3)),
        h22(coefficient(form != Form::unit_diagonal, param + 4)) {}

  void operator()(T &x, T &y) const {
    const T u = x, v = y;
    if constexpr (form == Form::full) {
      x = h11.one * u + h12.one * v;
      y = h21.one * u + h22.one * v;
    } else if constexpr (form == Form::unit_diagonal) {
      x = u + h12.one * v;
      y = h21.one * u + v;
    } else {
      x = h11.one * u + v;
      y = h22.one * v - u;
    }
  }
  void operator()(Vec<T> &x, Vec<T> &y) const {
    const Vec<T> u = x, v = y;
    if constexpr (form == Form::full) {
      x = add(mul(h11.all, u), mul(h12.all, v));
      y = add(mul(h21.all, u), mul(h22.all, v));
    } else if constexpr (form == Form::unit_diagonal) {
      x = add(u, mul(h12.all, v));
      y = add(mul(h21.all, u), v);
    } else {
      x = add(mul(h11.all, u), v);
      y = sub(mul(h22.all, v), u);
    }
  }
};

template <Form form, class T>
void rotate_by(QtbInt n, T *x, QtbInt incx, T *y, QtbInt incy, const T *param) {
  constexpr QtbInt block = 8, strided_block = 2;
  const ModifiedRotation<T, form> rotation(param);
  if (incx == 1 && incy == 1)
    transform_contiguous<block, block, Load::halves>(n, x, y, rotation);
  else
    transform_strided<1, strided_block>(n, x, incx, y, incy, rotation);
}

template <class T>
void rotate(const QtbInt *n, T *x, const QtbInt *incx, T *y, const QtbInt *incy, const T *param) {
  if (*n < 1) return;
  const T flag = load_single(param);
  if (flag + T(2) == 0) return;
  if (flag < 0)
    rotate_by<Form::full>(*n, x, *incx, y, *incy, param);
  else if (flag == 0)
    rotate_by<Form::unit_diagonal>(*n, x, *incx, y, *incy, param);
  else
    rotate_by<Form::unit_antidiagonal>(*n, x, *incx, y, *incy, param);
}

}  // namespace

QTB_KERNEL(srotm, rotm, float, rotate)
QTB_KERNEL(drotm, rotm, double, rotate)

}  // namespace qtb::QTB_TIER
