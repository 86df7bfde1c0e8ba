// What this machine can do at best, measured in the same run as what is compared with it.
#pragma once

#include <cstddef>

namespace qtb::bench {

// Rates of one core. Arithmetic is multiplications and additions in equal numbers, on registers alone.
struct CoreLimits {
  double double_flops;  // per second, with vectors of 16 bytes, the width of every kernel but the widest
  double single_flops;
  double wide_double_flops;  // with vectors of 32 bytes; 0 where the processor has none
  double wide_single_flops;
  double load_rate;         // 16-byte loads per second from the first-level cache
  double store_rate;        // 16-byte stores per second to the first-level cache
  double wide_load_rate;    // 32-byte loads; 0 where the processor has none
  double instruction_rate;  // instructions per second that need no unit to compute them
  double shuffled_flops;    // double_flops with one shuffle beside every 16 products and sums
};

CoreLimits measure_core_limits();

// One of them.
using Limit = double CoreLimits::*;

// So many flops, loads, stores or instructions, as fast as the core does them, on the calling thread. 32-byte vectors
// need a processor that has them.
void work_at_limit(Limit limit, double amount);

// Bytes read and written per second by a plain copy loop (16-byte loads and ordinary stores, as the kernels have them)
// over arrays of so many bytes, which should be far larger than the caches, on one thread or on several.
double measure_copy_bandwidth(std::size_t bytes, int threads);

// What bounds a call that needs so many loads and stores (of 16 bytes each) and flops, all from the first-level cache:
// the work that takes longest.
struct Bound {
  Limit limit;
  double amount;  // flops, loads or stores
};
Bound find_bound(const CoreLimits &limits, double loads, double stores, double flops, bool single);

}  // namespace qtb::bench
