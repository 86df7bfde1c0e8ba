// How a benchmark measures: the time of a call from a loop long enough to be read, and pairs of measurements in turn.
//
// Machines are shared and their clocks drift, so a comparison measures A and B in turn and looks at the ratio of each
// pair; what is quoted is the median.
#pragma once

#include <algorithm>
#include <chrono>
#include <cstddef>
#include <vector>

namespace qtb::bench {

inline double now() {
  return std::chrono::duration<double>(std::chrono::steady_clock::now().time_since_epoch()).count();
}

// Seconds per call of run(count), which makes count calls.
template <class Run>
double seconds_per_call(Run &&run, long count) {
  const double start = now();
  run(count);
  return (now() - start) / static_cast<double>(count);
}

// The fastest of three looks at so many calls: a stall of the machine falls into one of them at most, or the machine is
// of no use.
template <class Run>
double fastest_seconds_per_call(Run &&run, long count) {
  double fastest = seconds_per_call(run, count);
  for (int look = 1; look < 3; ++look) fastest = std::min(fastest, seconds_per_call(run, count));
  return fastest;
}

// A count of calls that takes about the given time.
template <class Run>
long calibrate(Run &&run, double seconds) {
  long count = 1;
  for (;;) {
    const double elapsed = fastest_seconds_per_call(run, count) * static_cast<double>(count);
    if (elapsed > seconds / 4) return std::max(1L, static_cast<long>(static_cast<double>(count) * seconds / elapsed));
    count *= 4;
  }
}

struct Spread {
  double median, low, high;
};

inline Spread spread(std::vector<double> values) {
  std::sort(values.begin(), values.end());
  return {values[values.size() / 2], values.front(), values.back()};
}

}  // namespace qtb::bench
