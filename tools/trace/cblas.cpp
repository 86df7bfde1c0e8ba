// The C names of every routine that takes no array of integers, ahead of those of the library behind.
//
// The lists of arguments are those of the companions' C face, by argument shape; each of its functions becomes one that
// forwards, under one name without a suffix and two with one.
#define QTB_FACE_INT std::int64_t
#define QTB_FACE_SUFFIX
#define CBLAS_ILP64
#include "interfaces/cblas_shapes.h"
#include "tools/trace/forward.h"

// Parameters hide the names of those that a routine does not have, on purpose.
#pragma GCC diagnostic ignored "-Wshadow"

#undef QTB_CBLAS_VECTORS
#undef QTB_CBLAS_VALUE
#undef QTB_CBLAS_LAYOUT
#undef QTB_CBLAS_cdot
#undef QTB_CBLAS_search
#define QTB_TRACED_AS(R, name, symbol, face, arguments, ...)                                       \
  QTB_EXPORT R symbol(__VA_ARGS__);                                                                \
  R symbol(__VA_ARGS__) {                                                                          \
    static constinit Target target{#symbol};                                                       \
    return forward<R, face>(target, routine_##name, QTB_CALL_SHAPE(face), QTB_UNPACKED arguments); \
  }
#define QTB_UNPACKED(...) __VA_ARGS__
// symbol is the name behind cblas_, of which the routine's is a part.
#define QTB_TRACED(R, name, symbol, arguments, ...)                             \
  QTB_TRACED_AS(R, name, cblas_##symbol, cblas, arguments, __VA_ARGS__)         \
  QTB_TRACED_AS(R, name, cblas_##symbol##_64, cblas_64, arguments, __VA_ARGS__) \
  QTB_TRACED_AS(R, name, cblas_##symbol##64_, cblas_64_second, arguments, __VA_ARGS__)
#define QTB_CBLAS_VECTORS(name, shape, core, ...) QTB_TRACED(void, name, name, (QTB_ARGS(shape)), __VA_ARGS__)
#define QTB_CBLAS_VALUE(R, name, shape, core, ...) QTB_TRACED(R, name, name, (QTB_ARGS(shape)), __VA_ARGS__)
#define QTB_CBLAS_LAYOUT(name, NAME, shape, T, core, ...) \
  QTB_TRACED(void, name, name, (layout, QTB_ARGS(shape)), CBLAS_LAYOUT layout, __VA_ARGS__)
#define QTB_CBLAS_cdot(name, NAME, shape, T, core) \
  QTB_TRACED(void, name, name##_sub, (QTB_ARGS_dot, result), QTB_N, QTB_X(T), QTB_Y(T), void *result)
#define QTB_CBLAS_search(name, NAME, shape, T, core) \
  QTB_TRACED(CBLAS_INDEX, name, name, (QTB_ARGS(shape)), QTB_N, QTB_X(T))

namespace qtb::trace::absent {
extern "C" {

#define QTB_FACE(name, NAME, shape, T, route) QTB_CBLAS_##shape(name, NAME, shape, T, )
#define QTB_ROUTINE(name, NAME, shape, T, route) QTB_WITH_FACE(shape, QTB_FACE)(name, NAME, shape, T, route)
#include "blas/routines.def"
#undef QTB_ROUTINE

}  // extern "C"
}  // namespace qtb::trace::absent
