// Operands of small whole numbers at chosen addresses: their sums are exact in any order, so that a plain loop tells
// the result to the bit, at a cost that lets a test go through all addresses.
//
// An operand lies in a buffer of signalling NaNs, some bytes above a boundary, or in reserved memory, with its elements
// further apart than a 32-bit number counts.
#pragma once

#include <gtest/gtest.h>
#include <sys/mman.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "blas/types.h"
#include "tests/support/placed.h"
#include "tests/support/tiers.h"

namespace qtb::test {

// The order of draws is fixed: a linear congruence is random enough for whole numbers.
class WholeNumbers {
 public:
  explicit WholeNumbers(std::uint32_t seed) : state_(seed * 2654435761U + 1) {}
  int part() {
    state_ = state_ * 1664525U + 1013904223U;
    return static_cast<int>(state_ >> 29) - 3;  // -3 to 4
  }
  template <class T>
  T element() {
    if constexpr (is_complex<T>) {
      const int re = part();
      return {static_cast<Real<T>>(re), static_cast<Real<T>>(part())};
    } else {
      return static_cast<T>(part());
    }
  }

 private:
  std::uint32_t state_;
};

template <class T>
class Buffer {
 public:
  explicit Buffer(std::size_t elements) : bytes_((elements + 2 * margin) * sizeof(T) + 64) {}

  // Elements from here on, phase bytes above a 16-byte boundary; all NaNs.
  T *place(std::size_t elements, std::size_t phase) {
    const auto address = reinterpret_cast<std::uintptr_t>(bytes_.data());
    start_ = (64 - address % 64) % 64 + phase;
    count_ = elements + 2 * margin;
    if (start_ + count_ * sizeof(T) > bytes_.size()) std::abort();
    T nan;
    store_signalling_nan<T>(&nan);
    for (std::size_t i = 0; i < count_; ++i) std::memcpy(at(i), &nan, sizeof(T));
    return reinterpret_cast<T *>(at(margin));
  }
  void set(std::size_t i, T value) { std::memcpy(at(i + margin), &value, sizeof(T)); }
  // What is there now is what has to be there after the call, but for the changes that are set from here on.
  void expect_kept() { kept_.assign(at(0), at(0) + count_ * sizeof(T)); }
  void expect(std::size_t i, T value) { std::memcpy(kept_.data() + (i + margin) * sizeof(T), &value, sizeof(T)); }
  // Zeros of either sign are the same number.
  bool as_expected() const {
    if (std::memcmp(kept_.data(), at(0), kept_.size()) == 0) return true;
    for (std::size_t i = 0; i < kept_.size() / sizeof(Real<T>); ++i) {
      Real<T> want, got;
      std::memcpy(&want, kept_.data() + i * sizeof(want), sizeof want);
      std::memcpy(&got, at(0) + i * sizeof(got), sizeof got);
      if (std::memcmp(&want, &got, sizeof got) != 0 && !(want == 0 && got == 0)) return false;
    }
    return true;
  }

 private:
  static constexpr std::size_t margin = 4;
  unsigned char *at(std::size_t i) { return bytes_.data() + start_ + i * sizeof(T); }
  const unsigned char *at(std::size_t i) const { return bytes_.data() + start_ + i * sizeof(T); }

  std::vector<unsigned char> bytes_, kept_;
  std::size_t start_ = 0, count_ = 0;
};

// ---- vectors ----

// Elements from the first to the last of a vector of n, and where element i lies.
inline std::size_t extent(QtbInt n, QtbInt inc) {
  return n > 0 ? static_cast<std::size_t>((n - 1) * std::abs(inc) + 1) : 0;
}
inline std::size_t position(QtbInt i, QtbInt n, QtbInt inc) {
  return static_cast<std::size_t>(inc >= 0 ? i * inc : (i - n + 1) * inc);
}

// A vector of up to three elements further apart than a 32-bit number counts, in memory of which the system keeps only
// the pages that are touched.
template <class T>
class FarVector {
 public:
  static constexpr QtbInt increment = (QtbInt{1} << 31) + 3;

  FarVector()
      : memory_(mmap(nullptr, bytes, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0)) {}
  ~FarVector() { munmap(memory_, bytes); }
  FarVector(const FarVector &) = delete;
  FarVector &operator=(const FarVector &) = delete;
  // Whether there is so much address space.
  bool is_there() const { return memory_ != MAP_FAILED; }
  T *data() const { return static_cast<T *>(memory_); }
  void set(const std::vector<T> &values, QtbInt inc) {
    for (QtbInt i = 0; i < 3; ++i) data()[position(i, 3, inc)] = values[static_cast<std::size_t>(i)];
  }
  std::vector<T> values(QtbInt inc) const {
    std::vector<T> result;
    for (QtbInt i = 0; i < 3; ++i) result.push_back(data()[position(i, 3, inc)]);
    return result;
  }

 private:
  static constexpr std::size_t bytes = static_cast<std::size_t>(2 * increment + 1) * sizeof(T);
  void *memory_;
};

// ---- arithmetic of the plain loops ----

template <class T>
T whole(QtbInt value) {
  if constexpr (is_complex<T>)
    return {static_cast<Real<T>>(value), 0};
  else
    return static_cast<T>(value);
}

template <class T>
T plus(T a, T b) {
  if constexpr (is_complex<T>)
    return {a.re + b.re, a.im + b.im};
  else
    return a + b;
}
template <class T>
T times(T a, T b) {
  if constexpr (is_complex<T>)
    return {a.re * b.re - a.im * b.im, a.re * b.im + a.im * b.re};
  else
    return a * b;
}
template <class T>
T conjugate_if(bool conjugated, T v) {
  if constexpr (is_complex<T>)
    if (conjugated) v.im = -v.im;
  return v;
}

template <class T>
bool equal(const std::vector<T> &a, const std::vector<T> &b) {
  return std::equal(a.begin(), a.end(), b.begin(), b.end(), [](T v, T w) {
    if constexpr (is_complex<T>)
      return v.re == w.re && v.im == w.im;
    else
      return v == w;
  });
}

}  // namespace qtb::test
