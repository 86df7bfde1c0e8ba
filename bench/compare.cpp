// compare: this library beside another BLAS shared library, or beside itself under other settings, on the same calls.
//
//   compare --library LIBRARY [--tier 0..4] [--setting NAME=VALUE]...
//           [--peer LIBRARY|self]... [--baseline LIBRARY]... [--peer-setting NAME=VALUE]... [--threads 1]
//           [--routines ddot,gemv,level2] [--options N,UNN|all]
//           [--sizes 8,4000] [--shapes 1000x1000x32] [--bands 16] [--increments 1,2] [--spare 0]
//           [--alpha 1[,0]] [--beta 0[,0]] [--turns 21] [--seconds 0.5] [--csv FILE]
//
// A routine is named in full, without its type letter, or as a level; without names all of Level 1 is run. Each case is
// measured in turns of at most so many seconds in all, each side in a process of its own (sides.h), which reads the
// settings afresh: --threads holds for both sides, --setting for the first and --peer-setting for the second.
// --baseline is a peer with this library's conventions, such as a former build of it.
//
// A size is that of all dimensions, a shape one number for each dimension of a routine (m x n of gemv, n x k of syrk).
// The options of a routine are its letters in the order of its arguments: N or T of gemv, UNN of trmv, LU of symm. Each
// routine takes the ones of --options that it knows, or, without that, the first of each: left, upper, as it is, not
// unit. Bands have so many diagonals on each side, arrays leading dimensions so many beyond their rows.
//
// A row: routine, options, case, this library's time per call and rate, the peer's rate, the ratio of the rates pair by
// pair (median, lowest, highest; above 1 this library is faster), the share of what is possible on that number of
// threads, and the cores that each side kept busy over the whole case.
//
// What is possible is a median of pairs too: a loop of nothing but the work that bounds the call takes its turns beside
// the sides. That is the core's load, store and arithmetic rates in cache (Level 1), the arithmetic alone (Level 3), or
// the slower one of arithmetic and moving arrays of the same sizes as the operands once (Level 2), so that a matrix
// beyond the caches is held against the bandwidth of the memory.
//
// Levels 2 and 3 are first checked; where a result is wrong, the row says so, nothing is timed, and the exit status is
// 1. The file has the same as numbers, and the rate at the limit; peers count from 1 there.

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <iterator>
#include <string>
#include <vector>

#include "bench/calls.h"
#include "bench/limits.h"
#include "bench/selection.h"
#include "bench/sides.h"
#include "bench/timing.h"
#include "bench/traffic.h"
#include "blas/kernels/level3/gemm/tiles.h"

namespace qtb::bench {
namespace {

using calls::Problem;
using calls::Scalar;

struct Options {
  Side ours;
  std::vector<Side> peers;
  std::string csv;
  Selection selection;
  long threads = 1;
  int turns = 21;
  double seconds = 0.5;
  int tier = -1;  // of this library's side, where it is asked for
};

struct Case {
  std::string routine, letters, label;
  std::string numbers;  // m,n,k,band,increment for the file, empty where the routine has none
  double work;          // of a call: flops where there are any, bytes elsewhere
  Bound bound;          // of the busiest thread's part of a call
  Traffic traffic;      // nothing where the memory is no part of the limit
  const char *unit;
  Prepare prepare;
};

// The first row of the file; `compare` writes the others in this order.
constexpr const char *header =
    "routine,options,m,n,k,band,increment,threads,peer,ns,rate,peer_ns,peer_rate,unit,ratio,ratio_low,ratio_high,limit,"
    "share,"
    "cores,peer_cores,outcome,peer_outcome";

const char *name(Outcome outcome) {
  switch (outcome) {
    case Outcome::measured: return "measured";
    case Outcome::absent: return "absent";
    case Outcome::wrong: return "wrong";
    default: return "crashed";
  }
}

bool failed(Outcome outcome) { return outcome == Outcome::wrong || outcome == Outcome::crashed; }

// ---- the side that does no more than what bounds a call ----

// The loops that need a team are in a library of their own, which a child loads as its side.
const Side team{QTB_TEAM_PATH, true, {}};

template <class Function>
Function *find_in_team(const Library &library, Function *, const char *name) {
  return reinterpret_cast<Function *>(library.find(name));
}
#define QTB_IN_TEAM(library, function) find_in_team(library, &function, #function)

Calls sweep_calls(const Library &library, const Traffic &traffic, int threads) {
  Sweep *sweep = QTB_IN_TEAM(library, qtb_bench_make_sweep)(&traffic, threads);
  return [sweep, run = QTB_IN_TEAM(library, qtb_bench_sweep)](long count) { run(sweep, count); };
}

// Whichever takes longer, the core's work or the memory's.
Runner runner_at_limit(const Options &options, const CoreLimits &limits, const Case &item) {
  const Bound bound = item.bound;
  const Calls core = [bound](long count) { work_at_limit(bound.limit, bound.amount * static_cast<double>(count)); };
  if (item.traffic.bytes() == 0) return {Side{}, [core](const Library &) { return Prepared{core}; }};
  const double core_seconds = bound.amount / limits.*bound.limit;
  return {team, [core, core_seconds, traffic = item.traffic, threads = options.threads](const Library &library) {
            const Calls sweep = sweep_calls(library, traffic, static_cast<int>(threads));
            constexpr double look_seconds = 0.001;
            const double seconds = fastest_seconds_per_call(sweep, calibrate(sweep, look_seconds));
            return Prepared{seconds > core_seconds ? sweep : core};
          }};
}

// The other side's time over the first's, turn by turn.
Spread ratios(const Measurement &first, const Measurement &other) {
  std::vector<double> ratio;
  for (std::size_t i = 0; i < std::min(first.seconds.size(), other.seconds.size()); ++i)
    ratio.push_back(other.seconds[i] / first.seconds[i]);
  return ratio.empty() ? Spread{} : spread(ratio);
}

double median_seconds(const Measurement &side) { return side.seconds.empty() ? 0 : spread(side.seconds).median; }

// One row of the table and of the file: this library beside a peer, or beside none (number 0).
void print_row(const Options &options, const Case &item, const Measurement &ours, const Measurement &at_limit,
               std::size_t number, const Measurement &peer, std::FILE *csv) {
  const double ours_time = median_seconds(ours), peer_time = median_seconds(peer);
  const auto rate = [&](double seconds) { return seconds > 0 ? item.work / seconds / 1e9 : 0; };
  const Spread ratio = ratios(ours, peer);
  const double share = ratios(ours, at_limit).median;

  std::printf("%-7s %-4s %-15s", item.routine.c_str(), item.letters.c_str(), item.label.c_str());
  if (ours.outcome == Outcome::measured)
    std::printf(" %12.1f %8.2f", ours_time * 1e9, rate(ours_time));
  else
    std::printf(" %12s %8s", "", name(ours.outcome));
  if (peer_time > 0)
    std::printf(" %8.2f", rate(peer_time));
  else
    std::printf(" %8s", number > 0 ? name(peer.outcome) : "-");
  std::printf(" %-7s", item.unit);
  if (ratio.median == 0)
    std::printf(" %6s  %11s", "-", "");
  else
    std::printf(" %6.2f  %5.2f-%5.2f", ratio.median, ratio.low, ratio.high);
  std::printf("  %4.0f%%  %4.2f", share * 100, ours.cores);
  if (peer_time > 0) std::printf(" %4.2f", peer.cores);
  std::printf("\n");
  std::fflush(stdout);

  if (csv != nullptr) {
    std::fprintf(csv, "%s,%s,%s,%ld,%zu,%.4g,%.4g,%.4g,%.4g,%s,%.4g,%.4g,%.4g,%.4g,%.4g,%.3g,%.3g,%s,%s\n",
                 item.routine.c_str(), item.letters.c_str(), item.numbers.c_str(), options.threads, number,
                 ours_time * 1e9, rate(ours_time), peer_time * 1e9, rate(peer_time), item.unit, ratio.median, ratio.low,
                 ratio.high, rate(median_seconds(at_limit)), share, ours.cores, peer.cores, name(ours.outcome),
                 name(peer.outcome));
  }
}

// One case: a row for each peer. False where a side failed.
bool compare(const Options &options, const CoreLimits &limits, const Case &item, std::FILE *csv) {
  std::vector<Runner> runners = {{options.ours, item.prepare}, runner_at_limit(options, limits, item)};
  for (const Side &peer : options.peers) runners.push_back({peer, item.prepare});
  const std::vector<Measurement> measured = measure_in_turn(runners, options.turns, options.seconds);
  const Measurement &ours = measured[0], &at_limit = measured[1];
  if (ours.outcome == Outcome::absent) return true;
  bool all_well = !failed(ours.outcome);
  if (options.peers.empty()) print_row(options, item, ours, at_limit, 0, {Outcome::absent, {}, 0}, csv);
  for (std::size_t i = 2; i < measured.size(); ++i) {
    print_row(options, item, ours, at_limit, i - 1, measured[i], csv);
    all_well = all_well && !failed(measured[i].outcome);
  }
  return all_well;
}

// Whether a tier's products of this type are made by a kernel with vectors of 32 bytes.
bool has_wide_kernel(int tier, char kind) {
  struct Listed {
    int tier;
    char kind;
    int vector_bytes;
  };
  constexpr auto first = [](int vector_bytes, auto...) { return vector_bytes; };
#define QTB_INNER_KERNEL(tier, T, family, any, aligned, stage, step) {tier_##tier, tiles::kind_of<T>, first step},
  const Listed kernels[] = {
#include "blas/kernels/level3/gemm/kernels.def"
  };
  return std::any_of(std::begin(kernels), std::end(kernels), [&](const Listed &kernel) {
    return kernel.tier == tier && kernel.kind == kind && kernel.vector_bytes == 32;
  });
}

Limit product_limit(const Options &options, const Routine &routine) {
  const char kind = routine.kind.complex ? (routine.is_single ? 'c' : 'z') : (routine.is_single ? 's' : 'd');
  const bool wide = has_wide_kernel(options.tier, kind);
  if (routine.is_single) return wide ? &CoreLimits::wide_single_flops : &CoreLimits::single_flops;
  return wide ? &CoreLimits::wide_double_flops : &CoreLimits::double_flops;
}

// What bounds a call: the arithmetic of Level 3, and the moves as well of the others.
Bound find_call_bound(const Options &options, const CoreLimits &limits, const Routine &routine,
                      const calls::Description &d) {
  const double flops = d.work.flops(routine.kind.complex);
  if (routine.level == 3) return {product_limit(options, routine), flops};
  const double vectors_of_element = static_cast<double>(routine.element_bytes()) / 16;
  return find_bound(limits, d.read() * vectors_of_element, d.written() * vectors_of_element, flops, routine.is_single);
}

// What the memory has a part in: Level 2, whose matrices are read once.
Traffic find_traffic(const Routine &routine, const calls::Description &d) {
  Traffic traffic;
  if (routine.level != 2) return traffic;
  for (const calls::Form *form : {&d.a, &d.b, &d.c, &d.x, &d.y}) {
    const double bytes = static_cast<double>(form->layout.count()) * static_cast<double>(routine.element_bytes());
    if (form->is_read && form->is_written)
      traffic.updated += bytes;
    else if (form->is_read)
      traffic.read += bytes;
    else if (form->is_written)
      traffic.written += bytes;
  }
  return traffic;
}

Case make_case(const Options &options, const CoreLimits &limits, const Selected &call) {
  const Routine &routine = *call.routine;
  const Problem &problem = call.problem;
  const calls::Description d = routine.describe(problem, routine.kind);
  Case item;
  item.routine = routine.name;
  item.letters = call.letters;
  const auto number = [&](const char *axis, QtbInt value) {
    if (!routine.has_axis(axis)) return std::string();
    if (std::strchr("mnk", *axis) != nullptr) item.label += (item.label.empty() ? "" : "x") + std::to_string(value);
    return std::to_string(value);
  };
  // In this order, in which the label grows: the operands of a sum of texts are evaluated in any.
  const std::string numbers[] = {number("m", problem.m), number("n", problem.n), number("k", problem.k),
                                 number("lb", problem.kl), number("xy", problem.incx)};
  for (const std::string &text : numbers) item.numbers += (&text == numbers ? "" : ",") + text;
  if (routine.has_axis("lb")) item.label += " b" + std::to_string(problem.kl);
  if (routine.has_axis("xy") && problem.incx != 1) item.label += " inc " + std::to_string(problem.incx);
  const double flops = d.work.flops(routine.kind.complex);
  item.work = flops > 0 ? flops : call_bytes(routine, problem);
  item.unit = flops > 0 ? "GFLOP/s" : "GB/s";
  item.bound = find_call_bound(options, limits, routine, d);
  item.bound.amount /= static_cast<double>(options.threads);
  item.traffic = find_traffic(routine, d);
  item.prepare = [&routine, problem](const Library &library) {
    const BoundCall bound = bind(library, routine, problem);
    return Prepared{bound.calls, bound.correct};
  };
  return item;
}

[[noreturn]] void fail(const std::string &message) {
  std::fprintf(stderr, "compare: %s\n", message.c_str());
  std::exit(2);
}

std::vector<std::string> split(const std::string &text, char separator) {
  std::vector<std::string> parts;
  std::size_t start = 0;
  while (start <= text.size()) {
    const std::size_t end = std::min(text.find(separator, start), text.size());
    if (end > start) parts.push_back(text.substr(start, end - start));
    start = end + 1;
  }
  return parts;
}

std::vector<long> parse_numbers(const std::string &text, char separator) {
  std::vector<long> numbers;
  for (const std::string &part : split(text, separator)) numbers.push_back(std::stol(part));
  return numbers;
}

Scalar parse_scalar(const std::string &text) {
  const std::vector<std::string> parts = split(text, ',');
  if (parts.empty() || parts.size() > 2) fail("a scalar is REAL or REAL,IMAGINARY: " + text);
  return {std::stod(parts[0]), parts.size() == 2 ? std::stod(parts[1]) : 0};
}

Options parse(int argc, char **argv) {
  Options options;
  const char *tier_of_process = std::getenv("QTB_DEBUG_CPU_TYPE");
  std::string tier = tier_of_process != nullptr ? tier_of_process : "";
  for (int i = 1; i < argc; i += 2) {
    const std::string key = argv[i];
    if (i + 1 >= argc) fail("no value for " + key);
    const std::string value = argv[i + 1];
    if (key == "--library")
      options.ours.path = value;
    else if (key == "--peer")
      options.peers.push_back({value, value == "self", {}});
    else if (key == "--baseline")
      options.peers.push_back({value, true, {}});
    else if (key == "--setting")
      options.ours.settings.push_back(value);
    else if (key == "--peer-setting" && !options.peers.empty())
      options.peers.back().settings.push_back(value);
    else if (key == "--tier")
      tier = value;
    else if (key == "--threads")
      options.threads = std::stol(value);
    else if (key == "--routines")
      options.selection.routines = split(value, ',');
    else if (key == "--sizes")
      options.selection.sizes = parse_numbers(value, ',');
    else if (key == "--shapes")
      for (const std::string &shape : split(value, ',')) options.selection.shapes.push_back(parse_numbers(shape, 'x'));
    else if (key == "--options")
      options.selection.letters = split(value, ',');
    else if (key == "--alpha")
      options.selection.alpha = parse_scalar(value);
    else if (key == "--beta")
      options.selection.beta = parse_scalar(value);
    else if (key == "--bands")
      options.selection.bands = parse_numbers(value, ',');
    else if (key == "--increments")
      options.selection.increments = parse_numbers(value, ',');
    else if (key == "--spare")
      options.selection.spare = std::stol(value);
    else if (key == "--turns")
      options.turns = std::stoi(value);
    else if (key == "--seconds")
      options.seconds = std::stod(value);
    else if (key == "--csv")
      options.csv = value;
    else
      fail("unknown option " + key);
  }
  if (options.ours.path.empty()) fail("--library is needed");
  Selection &selection = options.selection;
  if (selection.sizes.empty() && selection.shapes.empty()) selection.sizes = {4000};
  for (Side &peer : options.peers)
    if (peer.path == "self") peer.path = options.ours.path;
  // What both sides have in common comes first, so that the settings of a side go before it.
  if (!tier.empty()) set_environment("QTB_DEBUG_CPU_TYPE=" + tier);
  if (!tier.empty()) options.tier = std::atoi(tier.c_str());
  for (const char *variable : {"QTB_NUM_THREADS", "OMP_NUM_THREADS", "OPENBLAS_NUM_THREADS", "BLIS_NUM_THREADS"})
    set_environment(variable + ("=" + std::to_string(options.threads)));
  return options;
}

std::vector<Case> list_cases(const Options &options, const CoreLimits &limits) {
  std::vector<Case> cases;
  std::string unknown;
  for (const Selected &call : select_calls(options.selection, unknown))
    cases.push_back(make_case(options, limits, call));
  if (!unknown.empty()) fail("no case of " + unknown);
  return cases;
}

// What the memory allows where it has a part, and what a parallel region costs where there is one.
void print_surroundings(const Options &options, const std::vector<Case> &cases) {
  const int threads = static_cast<int>(options.threads);
  const auto seconds = [&](const Prepare &prepare) {
    return median_seconds(measure_in_turn({{team, prepare}}, options.turns, options.seconds)[0]);
  };
  const auto bandwidth = [&](const Traffic &traffic) {
    return traffic.bytes() / 1e9 /
           seconds([&](const Library &library) { return Prepared{sweep_calls(library, traffic, threads)}; });
  };
  const auto has_traffic = [](const Case &item) { return item.traffic.bytes() > 0; };
  if (std::any_of(cases.begin(), cases.end(), has_traffic)) {
    constexpr double first_level = 16e3, second_level = 256e3, memory = 256e6;  // bytes, clearly within or without
    std::printf(
        "memory, %d thread%s: GB/s read %.1f (16 kB), %.1f (256 kB), %.1f (256 MB); read and written %.1f, "
        "%.1f, %.1f\n",
        threads, threads == 1 ? "" : "s", bandwidth({first_level, 0, 0}), bandwidth({second_level, 0, 0}),
        bandwidth({memory, 0, 0}), 2 * bandwidth({0, 0, first_level}), 2 * bandwidth({0, 0, second_level}),
        2 * bandwidth({0, 0, memory}));
  }
  if (threads > 1) {
    const double region = seconds([&](const Library &library) {
      return Prepared{
          [threads, run = QTB_IN_TEAM(library, qtb_bench_empty_regions)](long count) { run(threads, count); }};
    });
    std::printf("an empty parallel region of %d threads: %.2f us\n", threads, region * 1e6);
  }
}

int run(int argc, char **argv) {
  const Options options = parse(argc, argv);
  const CoreLimits limits = measure_core_limits();
  const std::vector<Case> cases = list_cases(options, limits);
  std::printf(
      "core: %.1f GFLOP/s double, %.1f single (16-byte multiply and add); %.1f double, %.1f single (32-byte); "
      "%.2f G loads/s, %.2f G stores/s\n",
      limits.double_flops / 1e9, limits.single_flops / 1e9, limits.wide_double_flops / 1e9,
      limits.wide_single_flops / 1e9, limits.load_rate / 1e9, limits.store_rate / 1e9);
  print_surroundings(options, cases);
  std::printf("%-7s %-4s %-15s %12s %8s %8s %-7s %6s  %-11s  %5s  %s\n", "routine", "", "case", "ns/call", "rate",
              "peer", "", "ratio", "range", "limit", "cores");
  std::FILE *csv = options.csv.empty() ? nullptr : std::fopen(options.csv.c_str(), "w");
  if (csv == nullptr && !options.csv.empty()) fail("cannot write " + options.csv);
  if (csv != nullptr) std::fprintf(csv, "%s\n", header);
  bool all_well = true;
  for (const Case &item : cases) all_well = compare(options, limits, item, csv) && all_well;
  if (csv != nullptr) std::fclose(csv);
  return all_well ? 0 : 1;
}

}  // namespace
}  // namespace qtb::bench

int main(int argc, char **argv) { return qtb::bench::run(argc, argv); }
