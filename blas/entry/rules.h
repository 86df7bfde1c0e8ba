// The rules of the argument checkers as functions: first_broken_<shape><T> takes a routine's arguments and returns the
// number of the first illegal one, 0 if all are legal. It reads the arguments in the order of the rules and none behind
// the first illegal one, and has no effect.
#pragma once

#include <cstddef>

#include "blas/shapes.h"

// All arguments of the routine are taken, and those looked at that have a rule.
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wunused-parameter"

namespace qtb {
namespace {

// A rule holds the addresses of what it tests and reads them when its turn comes, so that nothing behind the first
// illegal argument is read: a caller that got one wrong may have passed nothing usable for the others.

inline bool is(const char *option, char letter) { return is_letter(*option, letter); }

struct Option {
  QtbInt number;
  const char *value;
  char first, second, third;
  // Either of two letters is three of them with the second twice.
  bool kept() const { return is(value, first) || is(value, second) || is(value, third); }
};
inline Option option(QtbInt number, const char *value, char first, char second) {
  return {number, value, first, second, second};
}
inline Option option(QtbInt number, const char *value, char first, char second, char third) {
  return {number, value, first, second, third};
}

struct Dimension {
  QtbInt number;
  const QtbInt *value;
  bool kept() const { return *value >= 0; }
};
inline Dimension dimension(QtbInt number, const QtbInt *value) { return {number, value}; }

// One of two extents, by whether an option is a letter.
struct Extent {
  const char *option;
  char letter;
  const QtbInt *where_it_is, *otherwise;
};
inline QtbInt read(const QtbInt *extent) { return *extent; }
inline QtbInt read(const Extent &extent) {
  return is(extent.option, extent.letter) ? *extent.where_it_is : *extent.otherwise;
}
inline Extent by(const char *option, char letter, const QtbInt *where_it_is, const QtbInt *otherwise) {
  return {option, letter, where_it_is, otherwise};
}

template <class AnyExtent>
struct Leading {
  QtbInt number;
  const QtbInt *value;
  AnyExtent extent;
  bool kept() const {
    const QtbInt least = read(extent);
    return *value >= (least > 1 ? least : 1);
  }
};
inline Leading<const QtbInt *> leading(QtbInt number, const QtbInt *value, const QtbInt *extent) {
  return {number, value, extent};
}
inline Leading<Extent> leading(QtbInt number, const QtbInt *value, Extent extent) { return {number, value, extent}; }

// Band storage has a row for every diagonal: those of the bandwidths and the main one. The sum wraps around in 64 bits.
template <int bandwidths>
struct Band {
  QtbInt number;
  const QtbInt *value;
  const QtbInt *bandwidth[bandwidths];
  bool kept() const {
    std::uint64_t diagonals = 1;
    for (const QtbInt *width : bandwidth) diagonals += static_cast<std::uint64_t>(*width);
    return *value >= static_cast<QtbInt>(diagonals);
  }
};
inline Band<1> band(QtbInt number, const QtbInt *value, const QtbInt *width) { return {number, value, {width}}; }
inline Band<2> band(QtbInt number, const QtbInt *value, const QtbInt *below, const QtbInt *above) {
  return {number, value, {below, above}};
}

struct Increment {
  QtbInt number;
  const QtbInt *value;
  bool kept() const { return *value != 0; }
};
inline Increment increment(QtbInt number, const QtbInt *value) { return {number, value}; }

// The number of the first rule that is not kept, 0 if all are. No rule behind it is looked at.
template <class... Rules>
QtbInt first_broken(Rules... rules) {
  QtbInt number = 0;
  static_cast<void>(((rules.kept() || (number = rules.number, false)) && ...));
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

}  // namespace
}  // namespace qtb

#pragma GCC diagnostic pop
