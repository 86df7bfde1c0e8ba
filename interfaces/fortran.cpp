// The Fortran face: every routine of the core that takes no array of integers, as Fortran compilers call it.
//
// A complex function returns its value; the lengths of character arguments stand behind the last argument, and nothing
// reads them. Beside each function stands a subroutine <name>sub that stores the value through its last argument, which
// interfaces to C have used for long.
#include "interfaces/face.h"

// From here on the lists of arguments have the integer of the face.
#define QtbInt qtb::face::Int

#undef QTB_RESULT_cdot
#undef QTB_PARAMS_cdot
#undef QTB_ARGS_cdot
#define QTB_RESULT_cdot(T) T
#define QTB_PARAMS_cdot(T) QTB_PARAMS_dot(T)
#define QTB_ARGS_cdot QTB_ARGS_dot

namespace qtb::face {
namespace {

template <class T>
[[gnu::always_inline]] inline T magnitude(T part) {
  return part < 0 ? -part : part;
}

}  // namespace
}  // namespace qtb::face

extern "C" {

#define QTB_CALL_SLOT(name, NAME, shape, T) \
  return static_cast<QTB_RESULT_##shape(T)>(qtb::face::value_of(QTB_CORE_SLOT(name), QTB_ARGS(shape)));
#define QTB_CALL_DRIVER(name, NAME, shape, T) \
  return static_cast<QTB_RESULT_##shape(T)>(qtb::face::value_of(QTB_CORE_DRIVER(name), QTB_ARGS(shape)));
#define QTB_CALL_CHECKED(core, NAME, shape, T)                                   \
  static constexpr qtb::RoutineName padded_name = qtb::padded(#NAME);            \
  const auto report = [](std::int64_t number) {                                  \
    const qtb::face::Int info = static_cast<qtb::face::Int>(number);             \
    QTB_FORTRAN_NAME(xerbla)(padded_name.text, &info, qtb::RoutineName::length); \
  };                                                                             \
  qtb::face::call(core, qtb::first_broken_##shape<T>, report, QTB_ARGS(shape));
#define QTB_CALL_CHECK_SLOT(name, NAME, shape, T) QTB_CALL_CHECKED(QTB_CORE_CHECK_SLOT(name), NAME, shape, T)
#define QTB_CALL_CHECK_DRIVER(name, NAME, shape, T) QTB_CALL_CHECKED(QTB_CORE_CHECK_DRIVER(name), NAME, shape, T)

#define QTB_FACE(name, NAME, shape, T, route)                \
  QTB_EXPORT QTB_FUNCTION(shape, T, QTB_FORTRAN_NAME(name)); \
  QTB_FUNCTION(shape, T, QTB_FORTRAN_NAME(name)) { QTB_CALL_##route(name, NAME, shape, T) }
#define QTB_ROUTINE(name, NAME, shape, T, route) QTB_WITH_FACE(shape, QTB_FACE)(name, NAME, shape, T, route)
#include "blas/routines.def"
#undef QTB_ROUTINE

float QTB_FORTRAN_NAME(scabs1)(const cfloat *z) { return qtb::face::magnitude(z->re) + qtb::face::magnitude(z->im); }

// Functions as subroutines.
#define QTB_SUBROUTINE(name, shape, T)                                                                \
  QTB_EXPORT void QTB_FORTRAN_NAME(name##sub)(QTB_PARAMS_##shape(T), QTB_RESULT_##shape(T) * result); \
  void QTB_FORTRAN_NAME(name##sub)(QTB_PARAMS_##shape(T), QTB_RESULT_##shape(T) * result) {           \
    *result = QTB_FORTRAN_NAME(name)(QTB_ARGS(shape));                                                \
  }
#define QTB_FUNCTION_SHAPE_dot , QTB_SUBROUTINE
#define QTB_FUNCTION_SHAPE_cdot , QTB_SUBROUTINE
#define QTB_FUNCTION_SHAPE_dsdot , QTB_SUBROUTINE
#define QTB_FUNCTION_SHAPE_sdsdot , QTB_SUBROUTINE
#define QTB_FUNCTION_SHAPE_norm , QTB_SUBROUTINE
#define QTB_FUNCTION_SHAPE_search , QTB_SUBROUTINE
#define QTB_FUNCTION_SHAPE_cabs1 , QTB_SUBROUTINE
#define QTB_ROUTINE(name, NAME, shape, T, route) QTB_CHOOSE(QTB_FUNCTION_SHAPE_##shape, QTB_NOTHING, )(name, shape, T)
#include "blas/routines.def"
#undef QTB_ROUTINE
QTB_SUBROUTINE(scabs1, cabs1, cfloat)

}  // extern "C"
