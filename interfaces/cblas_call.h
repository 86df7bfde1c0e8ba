// How the C face calls a routine: scalars by value, options as enumerations, and a layout.
//
// A row-major matrix is the transpose of the column-major one in the same memory, so that each routine has an
// equivalent on transposes: operands change places, triangles and sides turn over. Where a conjugate without a
// transpose would be needed, which no routine has, vectors are conjugated: results in place, operands in a copy.
//
// An illegal option is told to cblas_xerbla at once. What the rules of the routine find goes to the Fortran reporter
// with CBLAS_CallFromC and RowMajorStrg set, as a program that replaces either reporter expects, and by default from
// there to cblas_xerbla.
#pragma once

#include "interfaces/face.h"
#include "interfaces/reports.h"
#include "service/memory.h"

namespace qtb::face {
namespace {

template <class T>
using Scalar = std::conditional_t<is_complex<T>, const void *, T>;
template <class T>
using In = std::conditional_t<is_complex<T>, const void *, const T *>;
template <class T>
using Out = std::conditional_t<is_complex<T>, void *, T *>;

// ---- Options ----

// An option as the routines take it, 0 for an illegal value; and what a report says of it.
struct Letter {
  char letter;
  const char *what;
  int value;
};
inline Letter read(CBLAS_TRANSPOSE v, const char *what = "Trans") {
  return {v == CblasNoTrans ? 'N' : v == CblasTrans ? 'T' : v == CblasConjTrans ? 'C' : '\0', what, v};
}
inline Letter read(CBLAS_UPLO v) { return {v == CblasUpper ? 'U' : v == CblasLower ? 'L' : '\0', "Uplo", v}; }
inline Letter read(CBLAS_DIAG v) { return {v == CblasNonUnit ? 'N' : v == CblasUnit ? 'U' : '\0', "Diag", v}; }
inline Letter read(CBLAS_SIDE v) { return {v == CblasLeft ? 'L' : v == CblasRight ? 'R' : '\0', "Side", v}; }

constexpr char other_triangle(char uplo) { return uplo == 'U' ? 'L' : 'U'; }
constexpr char other_side(char side) { return side == 'L' ? 'R' : 'L'; }

// ---- Routines ----

// A routine of Levels 2 and 3 in one call. The options have to be accepted before anything is run.
template <class... P>
class Routine {
 public:
  Routine(void (*core)(P...), QtbInt (*first_broken)(P...), const RoutineName &name, const char *c_name,
          CBLAS_LAYOUT layout)
      : core_(core), first_broken_(first_broken), name_(name), c_name_(c_name), layout_(layout) {}

  bool row_major() const { return layout_ == CblasRowMajor; }

  // Whether the layout and the options, which stand behind it in this order, are legal.
  template <class... Options>
  bool accepts_options(Options... options) const {
    if (layout_ != CblasRowMajor && layout_ != CblasColMajor)
      return report_option(false, 1, c_name_, "layout", layout_), false;
    int position = 1;
    [[maybe_unused]] const auto legal = [&](const Letter &option) {
      position++;
      if (option.letter == '\0') report_option(row_major(), position, c_name_, option.what, option.value);
      return option.letter != '\0';
    };
    return (legal(options) && ...);
  }
  // Runs the routine if its arguments are legal.
  template <class... A>
  void operator()(A... given) const {
    call(
        core_, first_broken_, [this](QtbInt number) { report(number); }, given...);
  }
  // Whether the arguments are legal, for who has to change them first.
  template <class... A>
  bool accepts(A... given) const {
    bool legal = true;
    const auto look = [&](P... argument) {
      const QtbInt number = first_broken_(argument...);
      legal = number == 0;
      if (!legal) report(number);
    };
    look(Argument<P>(given)...);
    return legal;
  }
  // Another routine of the same shape, for the same call.
  Routine with(void (*core)(P...)) const { return {core, first_broken_, name_, c_name_, layout_}; }
  // Whether the routine's name says that it conjugates its second vector.
  bool conjugates() const { return name_.text[4] == 'C'; }
  void report_no_memory() const { face::report_no_memory(c_name_); }

 private:
  [[gnu::noinline, gnu::cold]] void report(QtbInt number) const { report_rule(row_major(), name_.text, number); }

  void (*core_)(P...);
  QtbInt (*first_broken_)(P...);
  const RoutineName &name_;
  const char *c_name_;
  CBLAS_LAYOUT layout_;
};

// ---- Conjugates ----

template <class T>
T conjugated(const void *value) {
  const T v = *static_cast<const T *>(value);
  return {v.re, -v.im};
}

// Vectors of n elements, of either sign of the increment.
template <class T>
void conjugate_in_place(Int n, void *vector, Int inc) {
  T *const v = static_cast<T *>(vector);
  const std::ptrdiff_t step = inc < 0 ? -static_cast<std::ptrdiff_t>(inc) : inc;
  for (std::ptrdiff_t i = 0; i < n; i++) v[i * step].im = -v[i * step].im;
}

// A copy with an increment of 1. data is null where there is no memory.
template <class T>
class ConjugatedCopy {
 public:
  ConjugatedCopy(Int n, const void *vector, Int inc)
      : data(static_cast<T *>(qtb_serv_malloc(static_cast<std::uint64_t>(n) * sizeof(T), 64))) {
    if (data == nullptr) return;
    const T *v = static_cast<const T *>(vector);
    const std::ptrdiff_t step = inc, first = step < 0 ? (1 - static_cast<std::ptrdiff_t>(n)) * step : 0;
    for (std::ptrdiff_t i = 0; i < n; i++) data[i] = {v[first + i * step].re, -v[first + i * step].im};
  }
  ~ConjugatedCopy() { qtb_serv_free(data); }
  ConjugatedCopy(const ConjugatedCopy &) = delete;
  ConjugatedCopy &operator=(const ConjugatedCopy &) = delete;

  T *const data;
};

}  // namespace
}  // namespace qtb::face
