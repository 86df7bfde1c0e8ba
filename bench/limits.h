// What this machine can do at best, measured in the same run as what is compared with it.
#pragma once

#include <cstddef>

namespace qtb::bench {

// Rates of one core. A vector is 16 bytes, the width of every kernel but the widest.
struct CoreLimits {
  double double_flops;  // multiplications and additions per second on registers alone, in equal numbers
  double single_flops;
  double load_rate;   // 16-byte loads per second from the first-level cache
  double store_rate;  // 16-byte stores per second to the first-level cache
};

CoreLimits measure_core_limits();

// Bytes read and written per second by a plain copy loop (16-byte loads and ordinary stores, as the kernels have them)
// over arrays of so many bytes, which should be far larger than the caches, on one thread or on several.
double measure_copy_bandwidth(std::size_t bytes, int threads);

// The least time of a call that needs so many loads and stores (of 16 bytes each) and flops, all from the first-level
// cache.
double least_seconds(const CoreLimits &limits, double loads, double stores, double flops, bool single);

}  // namespace qtb::bench
