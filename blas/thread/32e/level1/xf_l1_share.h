// How a vector is cut over a team, and how the partial results of a dot product are joined: the arithmetic of the
// parallel Level-1 drivers, without threads.
#pragma once

#include <cstdint>

#include "blas/types.h"

namespace qtb {

// Every share but the last starts and ends at a multiple of so many elements, for every element type, which keeps the
// pieces of a contiguous vector on the alignment of the whole.
inline constexpr QtbInt level1_grain = 8;

// A thread's piece of the logical vector: elements start to start + len - 1, where element 0 is the first that the
// routine visits.
struct Level1Share {
  QtbInt start, len;
};

// The share of thread rank, 0 to team - 1. The shares are disjoint and cover the n elements. All are equal but the
// last, which takes the remainder; where the equal part is nothing, the last is the whole vector. Empty shares too
// start inside the vector. Below n of 1 every share is the vector as the caller gave it, whose pointer may be null and
// is not to be moved.
inline Level1Share level1_share(QtbInt n, QtbInt team, QtbInt rank) {
  if (n < 1) return {0, n};
  const QtbInt chunk = n / team / level1_grain * level1_grain;
  const QtbInt start = chunk * rank;
  return {start, rank == team - 1 ? n - start : chunk};
}

// What to add to a vector's pointer, in elements, to pass a share of it as a vector of its own. By the published
// convention a vector with a negative increment starts at its far end, the whole as well as the piece.
inline QtbInt level1_offset(Level1Share share, QtbInt n, QtbInt inc) {
  return inc >= 0 ? inc * share.start : inc * (share.start + share.len - n);
}

// The sum of the team's partial results, in a fixed order that depends on the team and on the array's address alone.
//
// Short teams are summed from zero, left to right. In longer ones single entries go first up to a 16-byte boundary,
// then two accumulators of 16 bytes take the vectors of whole groups of eight in turn, lane by lane; the entries that
// went first stand in lane 0 of the first accumulator. The accumulators are added, their upper half to their lower half
// until one lane is left, and the remaining entries follow left to right. An array that no number of entries aligns is
// summed as a short one. A team is long where a whole group is sure to follow the entries that go first.
template <class T>
T level1_sum(const T *partial, QtbInt team) {
  constexpr QtbInt vector_bytes = 16;
  constexpr QtbInt group = 8;
  constexpr QtbInt lanes = vector_bytes / QtbInt{sizeof(T)};
  constexpr QtbInt shortest_long_team = group + lanes - 1;

  const auto address = reinterpret_cast<std::uintptr_t>(partial);
  T sum = 0;
  QtbInt i = 0;
  if (team >= shortest_long_team && address % sizeof(T) == 0) {
    const QtbInt past_boundary = static_cast<QtbInt>(address % vector_bytes / sizeof(T));
    for (const QtbInt aligned = (lanes - past_boundary) % lanes; i < aligned; ++i) sum += partial[i];
    T accumulator[2][lanes] = {{sum}};
    for (; i + group <= team; i += group)
      for (QtbInt k = 0; k < group; ++k) accumulator[k / lanes % 2][k % lanes] += partial[i + k];
    for (QtbInt lane = 0; lane < lanes; ++lane) accumulator[0][lane] += accumulator[1][lane];
    for (QtbInt half = lanes / 2; half > 0; half /= 2)
      for (QtbInt lane = 0; lane < half; ++lane) accumulator[0][lane] += accumulator[0][lane + half];
    sum = accumulator[0][0];
  }
  for (; i < team; ++i) sum += partial[i];
  return sum;
}

// A complex sum: the parts separately, from zero, left to right, whatever the team.
template <class T>
Complex<T> level1_sum(const Complex<T> *partial, QtbInt team) {
  Complex<T> sum = {0, 0};
  for (QtbInt i = 0; i < team; ++i) {
    sum.re += partial[i].re;
    sum.im += partial[i].im;
  }
  return sum;
}

}  // namespace qtb
