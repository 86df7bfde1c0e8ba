// The basic vector routines as the tests of their kernels see them: every tier's procedure behind one shape per kind,
// and operands that can be put at any byte and checked bit by bit around their elements.
#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <functional>
#include <iostream>
#include <map>
#include <random>
#include <string>
#include <type_traits>
#include <vector>

#include "tests/reference/vector.h"
#include "tests/support/bounds.h"
#include "tests/support/tiers.h"

namespace qtb::test {

// ---- The routines ----

template <class Procedure>
using Tiers = Procedure *const[tier_count];

// A routine that stores element by element. Of a routine with one vector that is y, and x is not looked at.
template <class T>
struct Elementwise {
  std::string name;
  std::function<void(int tier, QtbInt n, T *x, QtbInt incx, T *y, QtbInt incy)> call;
  // What becomes of y's element, and in how many roundings; of a routine that moves elements instead, neither.
  std::function<reference::Judged(T x, T y)> oracle = nullptr;
  double roundings = 0;
  bool one_vector = false;
  bool stores_x = false;
};

template <class T>
struct Dot {
  std::string name;
  std::function<T(int tier, QtbInt n, const T *x, QtbInt incx, const T *y, QtbInt incy)> call;
  bool conjugated = false;
};

template <class T>
Elementwise<T> axpy_of(const char *name, Tiers<QTB_FUNCTION_TYPE(axpy, T)> &procedures, T alpha) {
  Elementwise<T> routine;
  routine.name = name;
  routine.call = [&procedures, alpha](int tier, QtbInt n, T *x, QtbInt incx, T *y, QtbInt incy) {
    procedures[tier](&n, &alpha, x, &incx, y, &incy);
  };
  routine.oracle = [alpha](T x, T y) { return reference::axpy(alpha, x, y); };
  routine.roundings = is_complex<T> ? 3 : 2;
  return routine;
}
template <class T>
Elementwise<T> copy_of(const char *name, Tiers<QTB_FUNCTION_TYPE(copy, T)> &procedures) {
  Elementwise<T> routine;
  routine.name = name;
  routine.call = [&procedures](int tier, QtbInt n, T *x, QtbInt incx, T *y, QtbInt incy) {
    procedures[tier](&n, x, &incx, y, &incy);
  };
  return routine;
}
template <class T>
Elementwise<T> swap_of(const char *name, Tiers<QTB_FUNCTION_TYPE(swap, T)> &procedures) {
  Elementwise<T> routine;
  routine.name = name;
  routine.call = [&procedures](int tier, QtbInt n, T *x, QtbInt incx, T *y, QtbInt incy) {
    procedures[tier](&n, x, &incx, y, &incy);
  };
  routine.stores_x = true;
  return routine;
}
template <class T, class Alpha>
using Scal = void(const QtbInt *, const Alpha *, T *, const QtbInt *);
template <class T, class Alpha>
Elementwise<T> scal_of(const char *name, Tiers<Scal<T, Alpha>> &procedures, Alpha alpha) {
  Elementwise<T> routine;
  routine.name = name;
  routine.call = [&procedures, alpha](int tier, QtbInt n, T *, QtbInt, T *y, QtbInt incy) {
    procedures[tier](&n, &alpha, y, &incy);
  };
  T factor{};  // a real factor of complex elements has no imaginary part
  std::memcpy(&factor, &alpha, sizeof alpha);
  routine.oracle = [factor](T, T y) { return reference::scal(factor, y); };
  routine.roundings = is_complex<T> ? 2 : 1;
  routine.one_vector = true;
  return routine;
}
template <class T>
Dot<T> dot_of(const char *name, Tiers<QTB_FUNCTION_TYPE(dot, T)> &procedures) {
  return {name, [&procedures](int tier, QtbInt n, const T *x, QtbInt incx, const T *y, QtbInt incy) {
            return procedures[tier](&n, x, &incx, y, &incy);
          }};
}
template <class T>
Dot<T> complex_dot_of(const char *name, Tiers<QTB_FUNCTION_TYPE(cdot, T)> &procedures, bool conjugated) {
  return {name,
          [&procedures](int tier, QtbInt n, const T *x, QtbInt incx, const T *y, QtbInt incy) {
            T result;
            EXPECT_EQ(procedures[tier](&result, &n, x, &incx, y, &incy), &result);
            return result;
          },
          conjugated};
}

// Every tier's procedures, by routine.
#define QTB_VECTOR_PROCEDURES(name, shape, T) \
  inline std::type_identity_t<QTB_FUNCTION_TYPE(shape, T)> *const name##_tiers[] = QTB_ALL_TIERS(name);
QTB_VECTOR_PROCEDURES(sdot, dot, float)
QTB_VECTOR_PROCEDURES(ddot, dot, double)
QTB_VECTOR_PROCEDURES(cdotu, cdot, cfloat)
QTB_VECTOR_PROCEDURES(cdotc, cdot, cfloat)
QTB_VECTOR_PROCEDURES(zdotu, cdot, cdouble)
QTB_VECTOR_PROCEDURES(zdotc, cdot, cdouble)
QTB_VECTOR_PROCEDURES(saxpy, axpy, float)
QTB_VECTOR_PROCEDURES(daxpy, axpy, double)
QTB_VECTOR_PROCEDURES(caxpy, axpy, cfloat)
QTB_VECTOR_PROCEDURES(zaxpy, axpy, cdouble)
QTB_VECTOR_PROCEDURES(scopy, copy, float)
QTB_VECTOR_PROCEDURES(dcopy, copy, double)
QTB_VECTOR_PROCEDURES(ccopy, copy, cfloat)
QTB_VECTOR_PROCEDURES(zcopy, copy, cdouble)
QTB_VECTOR_PROCEDURES(sswap, swap, float)
QTB_VECTOR_PROCEDURES(dswap, swap, double)
QTB_VECTOR_PROCEDURES(cswap, swap, cfloat)
QTB_VECTOR_PROCEDURES(zswap, swap, cdouble)
QTB_VECTOR_PROCEDURES(sscal, scal, float)
QTB_VECTOR_PROCEDURES(dscal, scal, double)
QTB_VECTOR_PROCEDURES(cscal, scal, cfloat)
QTB_VECTOR_PROCEDURES(zscal, scal, cdouble)
QTB_VECTOR_PROCEDURES(csscal, real_scal, cfloat)
QTB_VECTOR_PROCEDURES(zdscal, real_scal, cdouble)
#undef QTB_VECTOR_PROCEDURES

// f once per routine that computes or moves elements, with a factor that has no special value.
template <class F>
void for_each_elementwise(F &&f) {
  f(axpy_of<float>("saxpy", saxpy_tiers, 1.25f / 3));
  f(axpy_of<double>("daxpy", daxpy_tiers, -1.75 / 3));
  f(axpy_of<cfloat>("caxpy", caxpy_tiers, {0.7f, -1.3f}));
  f(axpy_of<cdouble>("zaxpy", zaxpy_tiers, {-0.9, 0.6}));
  f(copy_of<float>("scopy", scopy_tiers));
  f(copy_of<double>("dcopy", dcopy_tiers));
  f(copy_of<cfloat>("ccopy", ccopy_tiers));
  f(copy_of<cdouble>("zcopy", zcopy_tiers));
  f(swap_of<float>("sswap", sswap_tiers));
  f(swap_of<double>("dswap", dswap_tiers));
  f(swap_of<cfloat>("cswap", cswap_tiers));
  f(swap_of<cdouble>("zswap", zswap_tiers));
  f(scal_of<float, float>("sscal", sscal_tiers, -0.3f));
  f(scal_of<double, double>("dscal", dscal_tiers, 1.7));
  f(scal_of<cfloat, cfloat>("cscal", cscal_tiers, {0.7f, -1.3f}));
  f(scal_of<cdouble, cdouble>("zscal", zscal_tiers, {-0.9, 0.6}));
  f(scal_of<cfloat, float>("csscal", csscal_tiers, 0.7f));
  f(scal_of<cdouble, double>("zdscal", zdscal_tiers, -0.9));
}

template <class F>
void for_each_dot(F &&f) {
  f(dot_of<float>("sdot", sdot_tiers));
  f(dot_of<double>("ddot", ddot_tiers));
  f(complex_dot_of<cfloat>("cdotu", cdotu_tiers, false));
  f(complex_dot_of<cfloat>("cdotc", cdotc_tiers, true));
  f(complex_dot_of<cdouble>("zdotu", zdotu_tiers, false));
  f(complex_dot_of<cdouble>("zdotc", zdotc_tiers, true));
}

// f(tier) for every tier that this processor runs.
template <class F>
void for_each_tier(F &&f) {
  for (int tier = 0; tier < tier_count; ++tier)
    if (processor_runs(tier)) f(tier);
}

// ---- Operands ----

// A part that nothing may read or write: a signalling NaN with a payload.
template <class R>
R untouchable() {
  R v;
  const std::uint64_t bits = sizeof(R) == 4 ? 0x7FA5C3E1u : 0x7FF5A5C3E1D2B4F0u;
  std::memcpy(&v, &bits, sizeof v);
  return v;
}

// The bytes of an operand: its elements where the increment has them, and a signalling NaN in every part between and
// for some way around them.
template <class T>
class Image {
 public:
  static constexpr QtbInt margin = 64;  // bytes, a multiple of every element's size
  Image(QtbInt n, QtbInt inc, const T *values) : length_(n > 0 ? (n - 1) * (inc < 0 ? -inc : inc) + 1 : 0) {
    using R = Real<T>;
    const R filler = untouchable<R>();
    bytes_.resize(static_cast<std::size_t>(length_) * sizeof(T) + 2 * margin);
    for (std::size_t at = 0; at < bytes_.size(); at += sizeof(R)) std::memcpy(&bytes_[at], &filler, sizeof(R));
    for (QtbInt i = 0; i < n; ++i) set(reference::place(i, n, inc), values[i]);
  }
  void set(QtbInt position, T value) { std::memcpy(&bytes_[offset(position)], &value, sizeof value); }
  // Copied to a place, whose first element is the result; and whether that place holds the same bytes still.
  T *put(unsigned char *place) const {
    std::memcpy(place, bytes_.data(), bytes_.size());
    return reinterpret_cast<T *>(place + margin);
  }
  bool is_at(const unsigned char *place) const { return std::memcmp(place, bytes_.data(), bytes_.size()) == 0; }
  std::size_t size() const { return bytes_.size(); }

 private:
  std::size_t offset(QtbInt position) const { return static_cast<std::size_t>(margin + position * QtbInt{sizeof(T)}); }
  QtbInt length_;
  std::vector<unsigned char> bytes_;
};

// Room for an image at every phase: at(phase) is so many bytes above a 16-byte boundary.
class Room {
 public:
  explicit Room(std::size_t bytes) : bytes_(bytes + 48) {}
  unsigned char *at(int phase) {
    const std::uintptr_t begin = reinterpret_cast<std::uintptr_t>(bytes_.data());
    return bytes_.data() + (16 - begin % 16) % 16 + phase;
  }

 private:
  std::vector<unsigned char> bytes_;
};

// Values between a quarter and 16 in magnitude, of either sign.
template <class T>
std::vector<T> random_values(std::size_t count, std::uint64_t seed) {
  std::mt19937_64 bits(seed);
  std::vector<T> values(count);
  for (T &v : values) {
    Real<T> part[2];
    for (Real<T> &p : part) {
      const double fraction = 0.5 + static_cast<double>(bits() >> 12) * 0x1p-53;
      p = static_cast<Real<T>>(std::ldexp(bits() & 1 ? fraction : -fraction, static_cast<int>(bits() % 6) - 1));
    }
    std::memcpy(&v, part, sizeof v);
  }
  return values;
}

// Bit patterns of every kind: NaN of both kinds, infinities, subnormals among them.
template <class T>
std::vector<T> random_bits(std::size_t count, std::uint64_t seed) {
  std::mt19937_64 bits(seed);
  std::vector<Real<T>> parts(count * sizeof(T) / sizeof(Real<T>));
  for (Real<T> &p : parts) {
    std::uint64_t pattern = bits();
    const std::uint64_t exponent = sizeof(Real<T>) == 4 ? 0x7F800000u : 0x7FF0000000000000u;
    if (pattern % 3 == 0) pattern |= exponent;
    if (pattern % 7 == 0) pattern &= ~exponent;
    std::memcpy(&p, &pattern, sizeof p);
  }
  std::vector<T> values(count);
  std::memcpy(values.data(), parts.data(), count * sizeof(T));
  return values;
}

// Small integers, whose sums of products are exact in any order.
template <class T>
std::vector<T> random_integers(std::size_t count, std::uint64_t seed) {
  std::mt19937_64 bits(seed);
  std::vector<T> values(count);
  for (T &v : values) {
    Real<T> part[2] = {static_cast<Real<T>>(bits() % 17) - 8, static_cast<Real<T>>(bits() % 17) - 8};
    std::memcpy(&v, part, sizeof v);
  }
  return values;
}

template <class T>
bool same_bits(T a, T b) {
  return std::memcmp(&a, &b, sizeof(T)) == 0;
}

// ---- What a run did ----

// Cases per tier and the worst error over its bound per routine, printed at the end of a test.
class Tally {
 public:
  void count(int tier, long cases = 1) { cases_[tier] += cases; }
  void error(const std::string &routine, double ratio) {
    double &worst = worst_[routine];
    if (ratio > worst) worst = ratio;
  }
  ~Tally() {
    std::cout << "cases:";
    for (int tier = 0; tier < tier_count; ++tier) std::cout << ' ' << tier_name(tier) << ' ' << cases_[tier];
    std::cout << '\n';
    for (const auto &[routine, ratio] : worst_) std::cout << "worst error/bound: " << routine << ' ' << ratio << '\n';
  }

 private:
  long cases_[tier_count] = {};
  std::map<std::string, double> worst_;
};

}  // namespace qtb::test
