// The memory that a call has to touch at least: every element of its operands once, read, written or both.
#pragma once

#include <cstddef>

namespace qtb::bench {

struct Traffic {
  double read = 0, written = 0, updated = 0;  // bytes: of what is only read, only written, and both
  double bytes() const { return read + written + updated; }
};

// Moves as much in the same directions, count times, over arrays of the same sizes on so many threads: with 16-byte
// loads and ordinary stores, as the kernels have them. A time of it is what the caches and the memory allow a call.
//
// In a library of its own (qtb_bench_team), which only the child of a measurement loads: the OpenMP runtime reads its
// settings when it is loaded, and its threads do not live through a fork.
class Sweep;
extern "C" {
Sweep *qtb_bench_make_sweep(const Traffic *traffic, int threads);  // lives to the end of the process
void qtb_bench_sweep(Sweep *sweep, long count);
void qtb_bench_empty_regions(int threads, long count);  // of so many threads that do nothing
}

}  // namespace qtb::bench
