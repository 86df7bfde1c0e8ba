// The Fortran names of every routine that takes no array of integers, ahead of those of the library behind.
#define QTB_FACE_INT std::int64_t
#define QTB_FACE_SUFFIX
#include "interfaces/face.h"
#include "tools/trace/forward.h"

// Parameters hide the names of those that a routine does not have, on purpose.
#pragma GCC diagnostic ignored "-Wshadow"

// A complex function returns its value.
#undef QTB_RESULT_cdot
#undef QTB_PARAMS_cdot
#undef QTB_ARGS_cdot
#define QTB_RESULT_cdot(T) T
#define QTB_PARAMS_cdot(T) QTB_PARAMS_dot(T)
#define QTB_ARGS_cdot QTB_ARGS_dot

namespace qtb::trace::absent {
extern "C" {

#define QTB_TRACED(name, shape, T, face, symbol)                                                                \
  QTB_EXPORT QTB_FUNCTION(shape, T, symbol);                                                                    \
  QTB_FUNCTION(shape, T, symbol) {                                                                              \
    static constinit Target target{#symbol};                                                                    \
    return forward<QTB_RESULT_##shape(T), face>(target, routine_##name, QTB_CALL_SHAPE(face), QTB_ARGS(shape)); \
  }
#define QTB_FACES(name, NAME, shape, T, route) \
  QTB_TRACED(name, shape, T, fortran, name##_) \
  QTB_TRACED(name, shape, T, fortran_64, name##_64_)
#define QTB_ROUTINE(name, NAME, shape, T, route) QTB_WITH_FACE(shape, QTB_FACES)(name, NAME, shape, T, route)
#include "blas/routines.def"
#undef QTB_ROUTINE

}  // extern "C"
}  // namespace qtb::trace::absent
