// The element types and the integer of every interface of this library.
//
// Kernels are compiled once per tier, so that nothing here may come from the standard library: an inline function
// that two tiers emit is merged by the linker, and a baseline processor could then run another tier's instructions.
#pragma once

#include <cstdint>

using QtbInt = std::int64_t;  // dimensions, increments, leading dimensions, sparse indices, index results

// One complex element: real part, then imaginary part, as in Fortran, C99 and std::complex.
template <class T>
struct Complex {
  T re, im;
};

using cfloat = Complex<float>;
using cdouble = Complex<double>;

// Real<T>: the type of T's parts. IsComplex<T>: whether T has two of them.
template <class T>
struct ElementTraits {
  using Part = T;
  static constexpr bool is_complex = false;
};
template <class T>
struct ElementTraits<Complex<T>> {
  using Part = T;
  static constexpr bool is_complex = true;
};
template <class T>
using Real = typename ElementTraits<T>::Part;
template <class T>
inline constexpr bool is_complex = ElementTraits<T>::is_complex;

// Whether an element is exactly 0 or 1. A NaN is neither. Inlined always, so that no build emits a procedure.
template <class T>
[[gnu::always_inline]] constexpr bool is_zero(T v) {
  if constexpr (is_complex<T>)
    return v.re == 0 && v.im == 0;
  else
    return v == 0;
}
template <class T>
[[gnu::always_inline]] constexpr bool is_one(T v) {
  if constexpr (is_complex<T>)
    return v.re == 1 && v.im == 0;
  else
    return v == 1;
}

// Whether an option character is a letter, named in upper case, in either of its cases.
[[gnu::always_inline]] constexpr bool is_letter(char option, char letter) {
  constexpr int case_bit = 'a' ^ 'A';
  return (option & ~case_bit) == letter;
}

// Hidden: a name with C linkage that the library's own parts share and that the shared library does not export.
#if defined(_WIN32)
#define QTB_HIDDEN
#else
#define QTB_HIDDEN __attribute__((visibility("hidden")))
#endif
