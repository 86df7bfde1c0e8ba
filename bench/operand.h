// An array argument of a call that is timed: the elements of its form in memory that begins on a cache line.
#pragma once

#include <complex>
#include <limits>
#include <random>

#include "bench/memory.h"
#include "calls/shapes.h"

namespace qtb::bench {

using Number = std::complex<double>;

template <class T>
class Operand {
  using Part = Real<T>;
  static constexpr std::size_t parts = sizeof(T) / sizeof(Part);

 public:
  explicit Operand(const calls::Form &form) : form_(form), count_(static_cast<std::size_t>(form.layout.extent())) {
    if (count_ > 0) memory_ = allocate(count_ * sizeof(T));
  }

  const calls::Form &form() const { return form_; }
  QtbInt rows() const { return form_.layout.rows; }
  QtbInt columns() const { return form_.layout.cols; }
  T *data() const { return static_cast<T *>(memory_.get()); }

  Number at(QtbInt i, QtbInt j) const {
    const Part *element = address(i, j);
    if constexpr (is_complex<T>)
      return {static_cast<double>(element[0]), static_cast<double>(element[1])};
    else
      return static_cast<double>(element[0]);
  }
  void set(QtbInt i, QtbInt j, Number value) {
    Part *element = address(i, j);
    element[0] = static_cast<Part>(value.real());
    if constexpr (is_complex<T>) element[1] = static_cast<Part>(value.imag());
  }

  // What the call may meet again and again: magnitudes from one half to one; a triangular matrix is near the identity.
  void fill() {
    if (count_ == 0) return;
    bench::fill<Part>(data(), count_ * sizeof(T));
    constexpr double off_diagonal = 1e-6;
    if (is_triangular())
      for_each([&](QtbInt i, QtbInt j) { set(i, j, i == j ? sign(at(i, j)) : off_diagonal * at(i, j)); });
    make_diagonal_real();
  }
  // Small integers, so that sums and products of them are exact. The diagonal of a triangular matrix is one or minus
  // one.
  void fill_integers(std::mt19937 &random) {
    const auto integer = [&] {
      const int magnitude = 1 + static_cast<int>(random() % 2U);
      return static_cast<double>((random() & 1U) != 0 ? magnitude : -magnitude);
    };
    for_each([&](QtbInt i, QtbInt j) {
      const double re = integer(), im = integer();
      set(i, j, is_triangular() && i == j ? sign(re) : Number(re, im));
    });
    make_diagonal_real();
  }
  void fill_with_nan() {
    constexpr double nan = std::numeric_limits<double>::quiet_NaN();
    for_each([&](QtbInt i, QtbInt j) { set(i, j, {nan, nan}); });
  }

  // visit(i, j) for every element that the form keeps.
  template <class Visit>
  void for_each(Visit &&visit) const {
    const calls::Layout &layout = form_.layout;
    for (QtbInt j = 0; j < layout.cols; ++j)
      for (QtbInt i = layout.first_row(j); i < layout.end_row(j); ++i) visit(i, j);
  }

 private:
  Part *address(QtbInt i, QtbInt j) const {
    return static_cast<Part *>(memory_.get()) + static_cast<std::size_t>(form_.layout.position(i, j)) * parts;
  }
  bool is_triangular() const {
    return form_.structure == calls::Structure::triangular || form_.structure == calls::Structure::unit_triangular;
  }
  static Number sign(Number value) { return value.real() < 0 ? -1 : 1; }
  void make_diagonal_real() {
    if (form_.structure != calls::Structure::hermitian) return;
    for (QtbInt i = 0; i < form_.layout.rows; ++i) set(i, i, at(i, i).real());
  }

  calls::Form form_;
  std::size_t count_;
  Memory memory_{nullptr, std::free};
};

}  // namespace qtb::bench
