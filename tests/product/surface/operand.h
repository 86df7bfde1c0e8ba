// An array argument: the elements that its storage form keeps, signalling NaNs with a payload everywhere else, in
// guarded memory, with a copy of all its bytes from before the call.
#pragma once

#include <vector>

#include "tests/product/surface/problem.h"
#include "tests/reference/common.h"
#include "tests/support/guarded.h"

namespace qtb::surface {

using reference::Layout;
using reference::Structure;

// What a call may do to an argument.
enum class Access { read, write, none };

template <class T>
class Operand {
  using Part = Real<T>;

 public:
  // The array touches a trapping page at one end or lies some bytes from it, at an address that may be odd.
  Operand(const Layout &layout, Draw &draw)
      : layout_(layout),
        bytes_(static_cast<std::size_t>(layout.extent()) * sizeof(T)),
        flush_(draw.one_in(2) ? test::Flush::front : test::Flush::back),
        offset_(draw_offset(draw)),
        memory_(bytes_ + offset_, flush_) {
    poison();
  }

  // The elements that the call may read.
  void fill(Structure structure, Values values, Draw &draw) {
    // Keeps the solution of a large triangle as large as its right-hand side, about.
    const double weight = 4 / std::fmax(4, static_cast<double>(layout_.rows));
    for (QtbInt j = 0; j < layout_.cols; ++j)
      for (QtbInt i = 0; i < layout_.rows; ++i) {
        if (!layout_.stores(i, j)) continue;
        const bool diagonal = i == j;
        if (structure == Structure::triangular && diagonal)
          store(i, j, away_from_zero(values, draw));
        else if (structure == Structure::triangular || structure == Structure::unit_triangular)
          diagonal ? void() : store(i, j, element(values, draw, weight));
        else if (structure == Structure::hermitian && diagonal)
          store_part(layout_.position(i, j) * parts, static_cast<Part>(part(values, draw, 1)));
        else
          store(i, j, element(values, draw, 1));
      }
  }
  void store(QtbInt i, QtbInt j, T value) {
    std::memcpy(address(layout_.position(i, j) * QtbInt{sizeof(T)}), static_cast<const void *>(&value), sizeof(T));
  }

  // Ends the preparation: what is there now is what was before the call.
  void seal(Access access) {
    const unsigned char *first = memory_.data();
    before_.assign(first, first + memory_.size());
    if (access == Access::read) memory_.read_only();
    if (access == Access::none) memory_.unreadable();
  }
  // As it was before the call, and writable.
  void restore() {
    memory_.writable();
    if (!before_.empty()) std::memcpy(memory_.data(), before_.data(), before_.size());
  }

  const Layout &layout() const { return layout_; }
  T *data() { return reinterpret_cast<T *>(address(0)); }
  const T *after() const { return reinterpret_cast<const T *>(const_cast<Operand *>(this)->address(0)); }
  const T *before() const { return reinterpret_cast<const T *>(before_.data() + lead()); }

  // Whether all bytes but those of the elements for which expected_change(i, j) are what they were.
  template <class Predicate>
  bool unchanged_but(Predicate expected_change) const {
    std::vector<unsigned char> now(memory_.data(), memory_.data() + memory_.size());
    for (QtbInt j = 0; j < layout_.cols; ++j)
      for (QtbInt i = 0; i < layout_.rows; ++i)
        if (layout_.stores(i, j) && expected_change(i, j)) {
          const std::size_t at = lead() + static_cast<std::size_t>(layout_.position(i, j)) * sizeof(T);
          std::memcpy(now.data() + at, before_.data() + at, sizeof(T));
        }
    return now == before_;
  }

 private:
  static constexpr QtbInt parts = sizeof(T) / sizeof(Part);

  static std::size_t draw_offset(Draw &draw) {
    switch (draw.integer(0, 7)) {
      case 0: return static_cast<std::size_t>(draw.integer(1, 63));
      case 1:
      case 2: return sizeof(Part) * static_cast<std::size_t>(draw.integer(1, 15));
      default: return 0;
    }
  }
  std::size_t lead() const { return flush_ == test::Flush::front ? offset_ : 0; }
  unsigned char *address(QtbInt byte) { return memory_.data() + lead() + byte; }

  void store_part(QtbInt index, Part value) {
    std::memcpy(address(index * QtbInt{sizeof(Part)}), &value, sizeof(Part));
  }
  void poison() {
    const QtbInt count = static_cast<QtbInt>(bytes_ / sizeof(Part));
    for (QtbInt i = 0; i < count; ++i) {
      if constexpr (sizeof(Part) == sizeof(float)) {
        const std::uint32_t pattern = 0x7F800000U | (0x2A0001U + static_cast<std::uint32_t>(i % 0x1000));
        std::memcpy(address(i * QtbInt{sizeof(Part)}), &pattern, sizeof(Part));
      } else {
        const std::uint64_t pattern = 0x7FF0000000000000U | (0x5A00000000001U + static_cast<std::uint64_t>(i));
        std::memcpy(address(i * QtbInt{sizeof(Part)}), &pattern, sizeof(Part));
      }
    }
  }

  static double part(Values values, Draw &draw, double weight) {
    if (values == Values::exact) return static_cast<double>(draw.integer(-3, 3));
    if (draw.one_in(16)) return draw.one_in(2) ? 0.0 : -0.0;
    return draw.real() * weight;
  }
  static T element(Values values, Draw &draw, double weight) {
    const bool zero = draw.one_in(16);  // kernels skip zeros
    const double re = part(values, draw, weight), im = part(values, draw, weight);
    return scalar<T>(zero ? Scalar{0, 0} : Scalar{re, im});
  }
  // A diagonal element to divide by: a power of two along one axis, or of magnitude 1 to 2.
  static T away_from_zero(Values values, Draw &draw) {
    static constexpr double powers[] = {1, -1, 2, -2, 4, -0.5};
    if (values == Values::exact) {
      const double power = draw.one_of(powers);
      return scalar<T>(is_complex<T> && draw.one_in(2) ? Scalar{0, power} : Scalar{power, 0});
    }
    const double sign = draw.one_in(2) ? 1 : -1;
    const double re = sign * (1.5 + draw.real() / 2), im = draw.real();
    return scalar<T>(is_complex<T> && draw.one_in(2) ? Scalar{im, re} : Scalar{re, im});
  }

  Layout layout_;
  std::size_t bytes_;
  test::Flush flush_;
  std::size_t offset_;
  test::Guarded<unsigned char> memory_;
  std::vector<unsigned char> before_;
};

}  // namespace qtb::surface
