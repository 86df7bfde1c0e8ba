// Every Level-1 routine and type over sizes from 8 to 10^7, contiguous and strided, through the exported names.
//
// Names read routine/n/increment; counters are GB/s (bytes read and written) and GFLOP/s. Beside them, in the context
// of the same run, stand the core's arithmetic rates, its cache rates and the measured copy bandwidth. The tier and the
// number of threads are those of the process: QTB_DEBUG_CPU_TYPE, QTB_NUM_THREADS, QTB_DYNAMIC.

#include <benchmark/benchmark.h>

#include <cstdio>
#include <string>

#include "bench/calls.h"
#include "bench/limits.h"

namespace {

using namespace qtb::bench;

constexpr long sizes[] = {8, 32, 100, 1000, 4000, 32000, 1000000, 10000000};
constexpr long increments[] = {1, 3};
constexpr long longest_strided = 1000000;                 // beyond that a stride only measures the memory again
constexpr std::size_t copy_bytes = std::size_t{1} << 28;  // 256 MiB: far beyond any cache

void run_case(benchmark::State &state, const Library &library, const Routine &routine,
              const qtb::calls::Problem &problem) {
  const BoundCall bound = bind(library, routine, problem);
  constexpr long batch = 16;  // calls per iteration, so that short calls are not lost in the loop of the harness
  bound.calls(1);
  for (auto step : state) {
    static_cast<void>(step);
    bound.calls(batch);
  }
  using benchmark::Counter;
  const double made = static_cast<double>(state.iterations() * batch);
  state.counters["GB/s"] = Counter(made * call_bytes(routine, problem) / 1e9, Counter::kIsRate);
  state.counters["GFLOP/s"] = Counter(made * call_flops(routine, problem) / 1e9, Counter::kIsRate);
  state.counters["ns/call"] = Counter(made / 1e9, Counter::kIsRate | Counter::kInvert);
}

bool has_axis(const Routine &routine, char axis) { return routine.axes.find(axis) != routine.axes.npos; }

std::string rate_text(double rate, const char *unit) {
  char text[64];
  std::snprintf(text, sizeof text, "%.2f %s", rate / 1e9, unit);
  return text;
}

}  // namespace

int main(int argc, char **argv) {
  static const Library library = load_library(QTB_LIBRARY_PATH, true);
  for (const Routine &routine : routines) {
    if (routine.level != 1) continue;
    for (const long increment : increments) {
      if (increment != 1 && !has_axis(routine, 'x')) continue;
      for (const long n : sizes) {
        if (!has_axis(routine, 'n') && n != sizes[0]) continue;
        if (increment != 1 && n > longest_strided) continue;
        qtb::calls::Problem problem;
        problem.n = n;
        problem.incx = problem.incy = increment;
        problem.alpha = routine.steady_alpha, problem.beta = routine.steady_beta;
        const std::string name = std::string(routine.name) + "/" + std::to_string(n) + "/" + std::to_string(increment);
        benchmark::RegisterBenchmark(name.c_str(), [&routine, problem](benchmark::State &state) {
          run_case(state, library, routine, problem);
        })->UseRealTime();
      }
    }
  }
  benchmark::Initialize(&argc, argv);
  const CoreLimits limits = measure_core_limits();
  benchmark::AddCustomContext("double arithmetic", rate_text(limits.double_flops, "GFLOP/s"));
  benchmark::AddCustomContext("single arithmetic", rate_text(limits.single_flops, "GFLOP/s"));
  benchmark::AddCustomContext("double arithmetic, 32 bytes", rate_text(limits.wide_double_flops, "GFLOP/s"));
  benchmark::AddCustomContext("single arithmetic, 32 bytes", rate_text(limits.wide_single_flops, "GFLOP/s"));
  benchmark::AddCustomContext("16-byte loads", rate_text(limits.load_rate, "G/s"));
  benchmark::AddCustomContext("16-byte stores", rate_text(limits.store_rate, "G/s"));
  benchmark::AddCustomContext("copy bandwidth, one thread", rate_text(measure_copy_bandwidth(copy_bytes, 1), "GB/s"));
  benchmark::AddCustomContext("copy bandwidth, two threads", rate_text(measure_copy_bandwidth(copy_bytes, 2), "GB/s"));
  benchmark::RunSpecifiedBenchmarks();
  return 0;
}
