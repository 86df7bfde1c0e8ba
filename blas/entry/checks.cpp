// The argument checkers, each expanded from its line of routines.def and the rules of its shape in checks.def.

#include "blas/entry/checks.h"

#include "blas/entry/rules.h"
#include "blas/entry/xerbla.h"

namespace qtb {
namespace {

[[gnu::noinline, gnu::cold]] std::int32_t report(const RoutineName &name, QtbInt info) {
  qtb_serv_xerbla(name.text, &info, RoutineName::length);
  return 1;
}

}  // namespace
}  // namespace qtb

extern "C" {

#define QTB_DEFINE_SLOT(name, NAME, shape, T)
#define QTB_DEFINE_DRIVER(name, NAME, shape, T)
#define QTB_DEFINE_CHECK_SLOT(name, NAME, shape, T)                     \
  std::int32_t qtb_blas_errchk_##name(QTB_PARAMS_##shape(T)) {          \
    static constexpr qtb::RoutineName padded_name = qtb::padded(#NAME); \
    const QtbInt info = qtb::first_broken_##shape<T>(QTB_ARGS(shape));  \
    return info == 0 ? 0 : qtb::report(padded_name, info);              \
  }
#define QTB_DEFINE_CHECK_DRIVER(name, NAME, shape, T) QTB_DEFINE_CHECK_SLOT(name, NAME, shape, T)
#define QTB_ROUTINE(name, NAME, shape, T, route) QTB_DEFINE_##route(name, NAME, shape, T)
#include "blas/routines.def"
#undef QTB_ROUTINE

}  // extern "C"
