// The argument checkers, each expanded from its line of routines.def and the rules of its shape in checks.def.

#include "blas/entry/checks.h"

#include "blas/entry/xerbla.h"

// A checker takes all the arguments of its routine and looks at those that have a rule.
#pragma GCC diagnostic ignored "-Wunused-parameter"

namespace qtb {
namespace {

struct Rule {
  QtbInt number;
  bool kept;
};

bool is(const char *option, char letter) { return is_letter(*option, letter); }

template <class... Letters>
Rule option(QtbInt number, const char *value, Letters... letters) {
  return {number, (is(value, letters) || ...)};
}
Rule dimension(QtbInt number, const QtbInt *value) { return {number, *value >= 0}; }
Rule leading(QtbInt number, const QtbInt *value, const QtbInt *extent) {
  return {number, *value >= (*extent > 1 ? *extent : 1)};
}
Rule band(QtbInt number, const QtbInt *value, QtbInt diagonals) { return {number, *value >= diagonals}; }
Rule increment(QtbInt number, const QtbInt *value) { return {number, *value != 0}; }

// Rows of band storage: the diagonals below and above and the main one. The sum wraps around in 64 bits.
QtbInt diagonals(QtbInt below, QtbInt above) {
  return static_cast<QtbInt>(static_cast<std::uint64_t>(below) + static_cast<std::uint64_t>(above) + 1);
}

// The number of the first rule that is not kept, 0 if all are.
template <class... Rules>
QtbInt first_broken(Rules... rules) {
  QtbInt number = 0;
  static_cast<void>(((rules.kept || (number = rules.number, false)) && ...));
  return number;
}

#define QTB_RULES(shape, ...)                          \
  template <class T>                                   \
  QtbInt first_broken_##shape(QTB_PARAMS_##shape(T)) { \
    return first_broken(__VA_ARGS__);                  \
  }
#include "blas/entry/checks.def"
#undef QTB_RULES

// A routine's name as messages show it: padded with blanks to six characters.
struct RoutineName {
  static constexpr int length = 6;
  char text[length + 1];
};

template <std::size_t size>
consteval RoutineName padded(const char (&name)[size]) {
  static_assert(size <= sizeof(RoutineName::text));
  RoutineName padded_name = {"      "};
  for (std::size_t i = 0; i + 1 < size; ++i) padded_name.text[i] = name[i];
  return padded_name;
}

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
