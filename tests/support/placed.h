// Vectors for kernel tests: n elements inc apart, at any byte offset from a trapping page, with signalling NaNs in
// every gap and around. A kernel that reads further than it may ends the test there and then: at the page, or, where
// the gaps are, at the arithmetic, under FiniteOnly.
#pragma once

#include <algorithm>
#include <cstring>
#include <vector>

#include "blas/types.h"
#include "tests/support/finite_only.h"
#include "tests/support/guarded.h"

namespace qtb::test {

// Memory between two trapping pages, for one placed vector at a time.
using Arena = Guarded<unsigned char>;
constexpr std::size_t arena_bytes = std::size_t{1} << 18;

template <class T>
void store_signalling_nan(void *p) {
  const std::uint32_t single = 0x7FA5A5A5U;
  const std::uint64_t wide = 0x7FF4A5A5A5A5A5A5U;
  for (std::size_t part = 0; part < sizeof(T) / sizeof(Real<T>); ++part) {
    unsigned char *at = static_cast<unsigned char *>(p) + part * sizeof(Real<T>);
    if (sizeof(Real<T>) == sizeof(single))
      std::memcpy(at, &single, sizeof single);
    else
      std::memcpy(at, &wide, sizeof wide);
  }
}

template <class T>
bool same_bits(const T &a, const T &b) {
  return std::memcmp(&a, &b, sizeof(T)) == 0;
}

// The first n of values, inc apart (all at one place where inc is 0, which then holds the first).
template <class T>
class Placed {
 public:
  Placed(Arena &arena, const std::vector<T> &values, QtbInt n, QtbInt inc, Flush flush, std::size_t offset)
      : n_(n), inc_(inc) {
    const QtbInt extent = n > 0 ? (n - 1) * (inc < 0 ? -inc : inc) + 1 : 0;
    const std::size_t bytes = static_cast<std::size_t>(extent) * sizeof(T);
    if (bytes + offset > arena.size()) std::abort();
    unsigned char *const begin = arena.data(), *const end = begin + arena.size();
    unsigned char *const first = flush == Flush::front ? begin + offset : end - offset - bytes;
    data_ = reinterpret_cast<T *>(first);
    const std::size_t margin = 4 * sizeof(T);
    const std::size_t before = std::min(margin, static_cast<std::size_t>(first - begin));
    const std::size_t after = std::min(margin, static_cast<std::size_t>(end - first) - bytes);
    // The image on the grid of the elements, with a whole margin at both ends, of which the arena holds a part.
    image_.resize(bytes + 2 * margin);
    for (std::size_t at = 0; at < image_.size(); at += sizeof(T)) store_signalling_nan<T>(image_.data() + at);
    for (QtbInt i = 0; i < (inc == 0 ? std::min<QtbInt>(n, 1) : n); ++i)
      std::memcpy(image_.data() + margin + position(i) * sizeof(T), &values[static_cast<std::size_t>(i)], sizeof(T));
    image_.erase(image_.begin(), image_.begin() + static_cast<std::ptrdiff_t>(margin - before));
    image_.resize(before + bytes + after);
    start_ = first - before;
    restore();
  }

  // What it held at first.
  void restore() { std::memcpy(start_, image_.data(), image_.size()); }
  T *data() { return data_; }
  const T *data() const { return data_; }
  T operator[](QtbInt i) const {
    T value;
    std::memcpy(static_cast<void *>(&value), reinterpret_cast<const unsigned char *>(data_) + position(i) * sizeof(T),
                sizeof(T));
    return value;
  }
  // Whether everything is what it was at first; and whether everything but the elements is.
  bool untouched() const { return std::memcmp(start_, image_.data(), image_.size()) == 0; }
  bool gaps_untouched() {
    std::vector<unsigned char> now(start_, start_ + image_.size());
    const std::size_t before = static_cast<std::size_t>(reinterpret_cast<unsigned char *>(data_) - start_);
    for (QtbInt i = 0; i < n_; ++i) {
      const std::size_t at = before + position(i) * sizeof(T);
      std::memcpy(now.data() + at, image_.data() + at, sizeof(T));
    }
    return now == image_;
  }

 private:
  std::size_t position(QtbInt i) const { return static_cast<std::size_t>(inc_ >= 0 ? i * inc_ : (i - n_ + 1) * inc_); }

  QtbInt n_, inc_;
  T *data_;
  unsigned char *start_;
  std::vector<unsigned char> image_;
};

}  // namespace qtb::test
