// What the faces of the companion libraries share: the integer of a face, its names, and the call of a routine.
//
// A face is compiled once per convention. The build defines
//   QTB_FACE_INT      the integer of the interface: std::int32_t or std::int64_t
//   QTB_FACE_SUFFIX   what stands behind a routine's name and ahead of Fortran's underscore: nothing or _64
// A routine takes every argument by a pointer, integers of 64 bits; an Argument makes that of what a caller gave. No
// rule is judged before: a null integer stays null, so that what is wrong ahead of it is reported and not met here.
#pragma once

#include <cstddef>
#include <cstdint>
#include <type_traits>

#include "blas/dispatch/slots.h"
#include "blas/entry/export.h"
#include "blas/entry/rules.h"
#include "blas/thread/drivers.h"

#define QTB_FACE_PASTE(left, middle, right) left##middle##right
#define QTB_FACE_EXPAND(left, middle, right) QTB_FACE_PASTE(left, middle, right)
#define QTB_FORTRAN_NAME(name) QTB_FACE_EXPAND(name, QTB_FACE_SUFFIX, _)

// Shapes whose arguments hold an array of integers have no face: QTB_WITH_FACE(shape, something) is nothing for them.
#define QTB_FACELESS_axpyi , QTB_NOTHING
#define QTB_FACELESS_doti , QTB_NOTHING
#define QTB_FACELESS_cdoti , QTB_NOTHING
#define QTB_FACELESS_gthr , QTB_NOTHING
#define QTB_FACELESS_gthrz , QTB_NOTHING
#define QTB_FACELESS_sctr , QTB_NOTHING
#define QTB_FACELESS_roti , QTB_NOTHING
#define QTB_NOTHING(...)
#define QTB_SECOND(first, second, ...) second
#define QTB_CHOOSE(...) QTB_SECOND(__VA_ARGS__)
#define QTB_WITH_FACE(shape, define) QTB_CHOOSE(QTB_FACELESS_##shape, define, )

// What a route calls, and the rules of its arguments.
#define QTB_CORE_SLOT(name) qtb_blas_x##name
#define QTB_CORE_DRIVER(name) qtb_blas_##name
#define QTB_CORE_CHECK_SLOT(name) qtb_blas_x##name
#define QTB_CORE_CHECK_DRIVER(name) qtb_blas_##name

namespace qtb::face {

using Int = QTB_FACE_INT;

// What a routine is given for its parameter of type P: the caller's own pointer, or one to a copy that lives as long as
// the call.
template <class P>
class Argument;

template <class T>
class Argument<const T *> {
 public:
  Argument(const T *given) : pointer(given) {}
  Argument(const void *given) : pointer(static_cast<const T *>(given)) {}
  Argument(T given) requires std::is_arithmetic_v<T> : copy(given), pointer(&copy) {}
  Argument(const std::int32_t *given) requires std::is_same_v<T, QtbInt>
      : copy(given == nullptr ? 0 : *given), pointer(given == nullptr ? nullptr : &copy) {}
  Argument(const Argument &) = delete;
  operator const T *() const { return pointer; }

 private:
  T copy;
  const T *pointer;
};

template <class T>
class Argument<T *> {
 public:
  Argument(T *given) : pointer(given) {}
  Argument(void *given) : pointer(static_cast<T *>(given)) {}
  Argument(const Argument &) = delete;
  operator T *() const { return pointer; }

 private:
  T *pointer;
};

// The value of a routine without rules. A complex dot product gets a place for its result ahead of what is given.
template <class R, class... P, class... A>
requires(sizeof...(P) == sizeof...(A)) R value_of(R (*core)(P...), A... given) { return core(Argument<P>(given)...); }
template <class T, class... P, class... A>
requires(sizeof...(P) == sizeof...(A)) T value_of(T *(*core)(T *, P...), A... given) {
  T result;
  core(&result, Argument<P>(given)...);
  return result;
}

// Calls a routine if its arguments are legal; report gets the number of the first that is not.
template <class... P, class Report, class... A>
void call(void (*core)(P...), QtbInt (*first_broken)(P...), Report report, A... given) {
  const auto checked = [&](P... argument) __attribute__((always_inline)) {
    if (const QtbInt info = first_broken(argument...); info != 0) return report(info);
    core(argument...);
  };
  checked(Argument<P>(given)...);
}

}  // namespace qtb::face

extern "C" {
// |Re z| + |Im z|, which the core has in double precision alone.
QTB_EXPORT float QTB_FORTRAN_NAME(scabs1)(const cfloat *z);
// The reporter of bad arguments: name is length characters, filled up with blanks; *info is a parameter number, counted
// from 1.
QTB_EXPORT void QTB_FORTRAN_NAME(xerbla)(const char *name, const QTB_FACE_INT *info, std::size_t length);
}
