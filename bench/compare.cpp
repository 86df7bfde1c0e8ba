// compare: this library and another BLAS shared library on the same calls, in turn, in one run.
//
//   compare --library LIBRARY [--tier 0..4] [--peer LIBRARY] [--peer-setting NAME=VALUE] [--routines ddot,daxpy]
//           [--sizes 8,4000] [--increment 1] [--threads 1] [--pairs 21] [--csv FILE]
//
// A tier is a process-wide choice of this library, and a peer's environment setting (how it is held to an instruction
// set) is read when it is loaded: both are set before either library is loaded. The peer's integers are 32 bits wide
// and its names end in an underscore, the convention of the distribution's packages.
//
// Each row: routine, size, this library's rate, the peer's, the ratio of the rates pair by pair (median, lowest,
// highest; above 1 this library is faster), and, for the vector routines in cache, the share of what the core's own
// load, store and arithmetic rates allow.

#include <immintrin.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

#include "bench/calls.h"
#include "bench/limits.h"
#include "bench/timing.h"

namespace qtb::bench {
namespace {

constexpr double pair_seconds = 0.0005;  // one side of a pair: long against the clock, short against a disturbance

struct Options {
  std::string path, peer, csv;
  std::vector<std::string> routines;
  std::vector<long> sizes;
  long increment = 1;
  int pairs = 21;
};

// A peer with wider vectors may leave their upper halves in use, which slows every 16-byte instruction behind it.
[[gnu::target("avx")]] void clear_upper_halves() { _mm256_zeroupper(); }
void settle() {
  static const bool wide = __builtin_cpu_supports("avx") != 0;
  if (wide) clear_upper_halves();
}

void compare(const Options &options, const Library &ours, const Library &peer, const CoreLimits &limits,
             const Routine &routine, long size, std::FILE *csv) {
  Operands operands = make_operands(routine, size, options.increment);
  const Calls a = bind(ours, routine, size, options.increment, operands);
  const Calls b = peer.handle != nullptr ? bind(peer, routine, size, options.increment, operands) : Calls{};
  if (!a) return;
  settle();
  a(1);
  const long count_a = calibrate(a, pair_seconds);
  long count_b = 0;
  if (b) {
    b(1);
    count_b = calibrate(b, pair_seconds);
  }
  std::vector<double> time_a, time_b, ratio;
  for (int pair = 0; pair < options.pairs; ++pair) {
    settle();
    time_a.push_back(seconds_per_call(a, count_a));
    if (!b) continue;
    time_b.push_back(seconds_per_call(b, count_b));
    ratio.push_back(time_b.back() / time_a.back());
  }
  const double flops = call_flops(routine, size);
  const double ours_time = spread(time_a).median;
  // Rates: flops where there are any, bytes moved elsewhere.
  const double work = flops > 0 ? flops : call_bytes(routine, size);
  const char *unit = flops > 0 ? "GFLOP/s" : "GB/s";
  std::printf("%-7s %9ld %10.1f %9.2f", routine.name, size, ours_time * 1e9, work / ours_time / 1e9);
  double peer_rate = 0;
  Spread ratios{};
  if (b) {
    peer_rate = work / spread(time_b).median / 1e9;
    ratios = spread(ratio);
    std::printf(" %9.2f %-7s %6.2f  %.2f-%.2f", peer_rate, unit, ratios.median, ratios.low, ratios.high);
  } else {
    std::printf(" %9s %-7s", "-", unit);
  }
  double share = 0;
  if (!routine.is_matrix()) {
    const double vectors = static_cast<double>(size) * static_cast<double>(type_bytes(routine.type)) / 16;
    share = least_seconds(limits, vectors * routine.read, vectors * routine.written, flops, routine.is_single()) /
            ours_time;
    std::printf("   %4.0f%%", share * 100);
  }
  std::printf("\n");
  std::fflush(stdout);
  if (csv != nullptr)
    std::fprintf(csv, "%s,%ld,%ld,%.4g,%.4g,%.4g,%s,%.4g,%.4g,%.4g,%.4g\n", routine.name, size, options.increment,
                 ours_time * 1e9, work / ours_time / 1e9, peer_rate, unit, ratios.median, ratios.low, ratios.high,
                 share);
}

std::vector<std::string> split(const std::string &text) {
  std::vector<std::string> parts;
  std::size_t start = 0;
  while (start <= text.size()) {
    const std::size_t comma = std::min(text.find(',', start), text.size());
    if (comma > start) parts.push_back(text.substr(start, comma - start));
    start = comma + 1;
  }
  return parts;
}

[[noreturn]] void fail(const std::string &message) {
  std::fprintf(stderr, "compare: %s\n", message.c_str());
  std::exit(2);
}

void set_environment(const std::string &assignment) {
  const std::size_t equals = assignment.find('=');
  if (equals == std::string::npos) fail("a setting is NAME=VALUE: " + assignment);
  setenv(assignment.substr(0, equals).c_str(), assignment.substr(equals + 1).c_str(), 1);
}

Options parse(int argc, char **argv) {
  Options options;
  for (int i = 1; i < argc; i += 2) {
    const std::string key = argv[i];
    if (i + 1 >= argc) fail("no value for " + key);
    const std::string value = argv[i + 1];
    if (key == "--library")
      options.path = value;
    else if (key == "--peer")
      options.peer = value;
    else if (key == "--peer-setting")
      set_environment(value);
    else if (key == "--tier")
      setenv("QTB_DEBUG_CPU_TYPE", value.c_str(), 1);
    else if (key == "--threads") {
      for (const char *name : {"QTB_NUM_THREADS", "OMP_NUM_THREADS", "OPENBLAS_NUM_THREADS", "BLIS_NUM_THREADS"})
        setenv(name, value.c_str(), 1);
    } else if (key == "--routines")
      options.routines = split(value);
    else if (key == "--sizes")
      for (const std::string &size : split(value)) options.sizes.push_back(std::stol(size));
    else if (key == "--increment")
      options.increment = std::stol(value);
    else if (key == "--pairs")
      options.pairs = std::stoi(value);
    else if (key == "--csv")
      options.csv = value;
    else
      fail("unknown option " + key);
  }
  if (options.path.empty()) fail("--library is needed");
  if (options.sizes.empty()) options.sizes = {4000};
  return options;
}

int run(int argc, char **argv) {
  const Options options = parse(argc, argv);
  const Library ours = load_library(options.path, true);
  Library peer;
  if (!options.peer.empty()) peer = load_library(options.peer, false);
  const CoreLimits limits = measure_core_limits();
  std::printf("core: %.1f GFLOP/s double, %.1f single (16-byte multiply and add); %.2f G loads/s, %.2f G stores/s\n",
              limits.double_flops / 1e9, limits.single_flops / 1e9, limits.load_rate / 1e9, limits.store_rate / 1e9);
  std::printf("%-7s %9s %10s %9s %9s %-7s %6s  %-9s   %s\n", "routine", "n", "ns/call", "rate", "peer", "", "ratio",
              "range", "of limit");
  std::FILE *csv = options.csv.empty() ? nullptr : std::fopen(options.csv.c_str(), "w");
  if (csv != nullptr)
    std::fprintf(csv, "routine,n,increment,ns,rate,peer_rate,unit,ratio,ratio_low,ratio_high,of_limit\n");
  for (const Routine &routine : routines) {
    bool wanted = options.routines.empty() && !routine.is_matrix();
    for (const std::string &name : options.routines) wanted = wanted || name == routine.name;
    if (!wanted) continue;
    for (const long size : options.sizes) compare(options, ours, peer, limits, routine, size, csv);
  }
  if (csv != nullptr) std::fclose(csv);
  return 0;
}

}  // namespace
}  // namespace qtb::bench

int main(int argc, char **argv) { return qtb::bench::run(argc, argv); }
