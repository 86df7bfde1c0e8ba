// Memory for operands: from a cache line on, and filled with values that no routine finds hard.
#pragma once

#include <cstddef>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <random>

namespace qtb::bench {

using Memory = std::unique_ptr<void, void (*)(void *)>;

inline Memory allocate(std::size_t bytes) {
  constexpr std::size_t line = 64, slack = 4096;
  return {std::aligned_alloc(line, (bytes + slack) / line * line), std::free};
}

// Magnitudes from one half to one, of either sign: sums neither vanish nor grow beyond the number of their terms. The
// values repeat after a prime number of elements, since drawing them all would take longer than what is timed.
template <class R>
void fill(void *memory, std::size_t bytes) {
  constexpr std::size_t period = 65537;
  std::mt19937 random(12345);
  std::uniform_real_distribution<R> magnitudes(R(0.5), R(1));
  R *values = static_cast<R *>(memory);
  const std::size_t count = bytes / sizeof(R);
  for (std::size_t i = 0; i < count && i < period; ++i)
    values[i] = (random() & 1U) != 0 ? magnitudes(random) : -magnitudes(random);
  for (std::size_t i = period; i < count; ++i) values[i] = values[i - period];
}

}  // namespace qtb::bench
