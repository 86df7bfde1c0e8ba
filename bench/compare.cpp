// compare: this library beside another BLAS shared library, or beside itself under other settings, on the same calls.
//
//   compare --library LIBRARY [--tier 0..4] [--setting NAME=VALUE]...
//           [--peer LIBRARY|self] [--baseline LIBRARY] [--peer-setting NAME=VALUE]... [--threads 1]
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
// pair (median, lowest, highest; above 1 this library is faster), the share of what the core's own load, store and
// arithmetic rates allow on that number of threads (Levels 1 and 2: in cache; Level 3: the arithmetic alone), and the
// cores that each side kept busy. The share is a median of pairs too: a loop of nothing but the work that bounds the
// call takes its turns beside the sides. Levels 2 and 3 are first checked; where a result is wrong, the row says so,
// nothing is timed, and the exit status is 1. The file has the same as numbers, and the rate at the limit.

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "bench/calls.h"
#include "bench/limits.h"
#include "bench/sides.h"
#include "bench/timing.h"
#include "blas/tiers.h"

namespace qtb::bench {
namespace {

using calls::Problem;
using calls::Scalar;

struct Options {
  Side ours, peer;
  std::string csv;
  std::vector<std::string> routines{"level1"}, letters;
  std::vector<long> sizes, bands{16}, increments{1};
  std::vector<std::vector<long>> shapes;
  std::optional<Scalar> alpha, beta;  // the routine's own where not given
  long spare = 0, threads = 1;
  int turns = 21;
  double seconds = 0.5;
  bool avx = false;  // the tier of this library's side
};

struct Case {
  std::string routine, letters, label;
  std::string numbers;  // m,n,k,band,increment for the file, empty where the routine has none
  double work;          // of a call: flops where there are any, bytes elsewhere
  Bound bound;          // of the busiest thread's part of a call
  const char *unit;
  Prepare prepare;
};

// The first row of the file; `compare` writes the others in this order.
constexpr const char *header =
    "routine,options,m,n,k,band,increment,threads,ns,rate,peer_ns,peer_rate,unit,ratio,ratio_low,ratio_high,limit,"
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

// The side that does no more than what bounds a call.
Runner runner_at_limit(const Bound &bound) {
  return {
      Side{}, [bound](const Library &) {
        return Prepared{[bound](long count) { work_at_limit(bound.limit, bound.amount * static_cast<double>(count)); }};
      }};
}

// The other side's time over the first's, turn by turn.
Spread ratios(const Measurement &first, const Measurement &other) {
  std::vector<double> ratio;
  for (std::size_t i = 0; i < std::min(first.seconds.size(), other.seconds.size()); ++i)
    ratio.push_back(other.seconds[i] / first.seconds[i]);
  return ratio.empty() ? Spread{} : spread(ratio);
}

// One case: its row in the table and in the file. False where a side failed.
bool compare(const Options &options, const CoreLimits &limits, const Case &item, std::FILE *csv) {
  const bool has_peer = !options.peer.path.empty();
  std::vector<Runner> runners = {{options.ours, item.prepare}, runner_at_limit(item.bound)};
  if (has_peer) runners.push_back({options.peer, item.prepare});
  const std::vector<Measurement> measured = measure_in_turn(runners, options.turns, options.seconds);
  const Measurement no_peer{Outcome::absent, {}, 0};
  const Measurement &ours = measured[0], &at_limit = measured[1], &peer = has_peer ? measured[2] : no_peer;
  if (ours.outcome == Outcome::absent) return true;

  const auto time_of = [](const Measurement &side) { return side.seconds.empty() ? 0 : spread(side.seconds).median; };
  const double ours_time = time_of(ours), peer_time = time_of(peer);
  const auto rate = [&](double seconds) { return seconds > 0 ? item.work / seconds / 1e9 : 0; };
  const Spread ratio = ratios(ours, peer);
  const double share = ratios(ours, at_limit).median;
  const double least_seconds = item.bound.amount / limits.*item.bound.limit;

  std::printf("%-7s %-2s %-15s", item.routine.c_str(), item.letters.c_str(), item.label.c_str());
  if (ours.outcome == Outcome::measured)
    std::printf(" %12.1f %8.2f", ours_time * 1e9, rate(ours_time));
  else
    std::printf(" %12s %8s", "", name(ours.outcome));
  if (peer_time > 0)
    std::printf(" %8.2f", rate(peer_time));
  else
    std::printf(" %8s", has_peer ? name(peer.outcome) : "-");
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
    std::fprintf(csv, "%s,%s,%s,%ld,%.4g,%.4g,%.4g,%.4g,%s,%.4g,%.4g,%.4g,%.4g,%.4g,%.3g,%.3g,%s,%s\n",
                 item.routine.c_str(), item.letters.c_str(), item.numbers.c_str(), options.threads, ours_time * 1e9,
                 rate(ours_time), peer_time * 1e9, rate(peer_time), item.unit, ratio.median, ratio.low, ratio.high,
                 rate(least_seconds), share, ours.cores, peer.cores, name(ours.outcome), name(peer.outcome));
  }
  return !failed(ours.outcome) && !failed(peer.outcome);
}

// The avx tier's only kernel with 32-byte vectors is that of dgemm, which the other real products in double precision
// are made of.
Limit product_limit(const Options &options, const Routine &routine) {
  if (options.avx && !routine.is_single && !routine.kind.complex) return &CoreLimits::wide_double_flops;
  return routine.is_single ? &CoreLimits::single_flops : &CoreLimits::double_flops;
}

// What bounds a call: the arithmetic of Level 3, and the moves as well of the others.
Bound find_call_bound(const Options &options, const CoreLimits &limits, const Routine &routine,
                      const calls::Description &d) {
  const double flops = d.work.flops(routine.kind.complex);
  if (routine.level == 3) return {product_limit(options, routine), flops};
  const double vectors_of_element = static_cast<double>(routine.element_bytes()) / 16;
  return find_bound(limits, d.read() * vectors_of_element, d.written() * vectors_of_element, flops, routine.is_single);
}

bool has_axis(const Routine &routine, const char *axes) {
  return routine.axes.find_first_of(axes) != routine.axes.npos;
}

Case make_case(const Options &options, const CoreLimits &limits, const Routine &routine, const std::string &letters,
               const Problem &problem) {
  const calls::Description d = routine.describe(problem, routine.kind);
  Case item;
  item.routine = routine.name;
  item.letters = letters;
  const auto number = [&](const char *axis, QtbInt value) {
    if (!has_axis(routine, axis)) return std::string();
    if (std::strchr("mnk", *axis) != nullptr) item.label += (item.label.empty() ? "" : "x") + std::to_string(value);
    return std::to_string(value);
  };
  item.numbers = number("m", problem.m) + ',' + number("n", problem.n) + ',' + number("k", problem.k) + ',' +
                 number("lb", problem.kl) + ',' + number("xy", problem.incx);
  if (has_axis(routine, "lb")) item.label += " b" + std::to_string(problem.kl);
  if (has_axis(routine, "xy") && problem.incx != 1) item.label += " inc " + std::to_string(problem.incx);
  const double flops = d.work.flops(routine.kind.complex);
  item.work = flops > 0 ? flops : call_bytes(routine, problem);
  item.unit = flops > 0 ? "GFLOP/s" : "GB/s";
  item.bound = find_call_bound(options, limits, routine, d);
  item.bound.amount /= static_cast<double>(options.threads);
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
      options.peer.path = value, options.peer.wide = value == "self";
    else if (key == "--baseline")
      options.peer.path = value;
    else if (key == "--setting")
      options.ours.settings.push_back(value);
    else if (key == "--peer-setting")
      options.peer.settings.push_back(value);
    else if (key == "--tier")
      tier = value;
    else if (key == "--threads")
      options.threads = std::stol(value);
    else if (key == "--routines")
      options.routines = split(value, ',');
    else if (key == "--sizes")
      options.sizes = parse_numbers(value, ',');
    else if (key == "--shapes")
      for (const std::string &shape : split(value, ',')) options.shapes.push_back(parse_numbers(shape, 'x'));
    else if (key == "--options")
      options.letters = split(value, ',');
    else if (key == "--alpha")
      options.alpha = parse_scalar(value);
    else if (key == "--beta")
      options.beta = parse_scalar(value);
    else if (key == "--bands")
      options.bands = parse_numbers(value, ',');
    else if (key == "--increments")
      options.increments = parse_numbers(value, ',');
    else if (key == "--spare")
      options.spare = std::stol(value);
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
  if (options.sizes.empty() && options.shapes.empty()) options.sizes = {4000};
  if (options.peer.path == "self") options.peer.path = options.ours.path;
  // What both sides have in common comes first, so that the settings of a side go before it.
  if (!tier.empty()) set_environment("QTB_DEBUG_CPU_TYPE=" + tier);
  options.avx = tier == std::to_string(tier_avx);
  for (const char *variable : {"QTB_NUM_THREADS", "OMP_NUM_THREADS", "OPENBLAS_NUM_THREADS", "BLIS_NUM_THREADS"})
    set_environment(variable + ("=" + std::to_string(options.threads)));
  return options;
}

// ---- routines and options by name ----

bool is_named(const Routine &routine, const std::string &name) {
  return routine.name == name || routine.name.substr(1) == name || "level" + std::to_string(routine.level) == name;
}

// Every combination of a routine's letters that differs from the others.
std::vector<std::string> all_letters(const Routine &routine) {
  std::vector<std::string> words{""};
  for (const char axis : routine.options()) {
    std::vector<std::string> longer;
    for (const std::string &word : words)
      for (const char letter : calls::legal_letters(axis))
        if (routine.knows(axis, letter)) longer.push_back(word + letter);
    words = longer;
  }
  return words;
}

std::vector<std::string> letters_of(const Options &options, const Routine &routine) {
  const std::vector<std::string> all = all_letters(routine);
  if (options.letters.empty()) return {all.front()};
  if (options.letters.front() == "all" || routine.options().empty()) return all;
  std::vector<std::string> known;
  for (const std::string &word : options.letters)
    if (std::find(all.begin(), all.end(), word) != all.end()) known.push_back(word);
  return known;
}

void set_letters(const Routine &routine, const std::string &letters, Problem &problem) {
  for (std::size_t i = 0; i < letters.size(); ++i) problem.option(routine.options()[i]) = letters[i];
}

// The problems of one routine: every size and shape with every band and increment.
std::vector<Problem> list_problems(const Options &options, const Routine &routine) {
  std::vector<std::vector<long>> shapes = options.shapes;
  std::string_view dimensions = routine.axes.substr(0, routine.axes.find_first_not_of(calls::size_axes));
  for (const long size : options.sizes) shapes.emplace_back(dimensions.size(), size);
  std::vector<Problem> problems;
  for (const std::vector<long> &shape : shapes) {
    if (shape.size() != dimensions.size()) continue;
    for (const long band : has_axis(routine, "lb") ? options.bands : std::vector<long>{0})
      for (const long increment : has_axis(routine, "xy") ? options.increments : std::vector<long>{1}) {
        Problem problem;
        for (std::size_t i = 0; i < shape.size(); ++i) problem.size(dimensions[i]) = shape[i];
        problem.kl = problem.ku = band;
        problem.incx = problem.incy = increment;
        for (QtbInt &spare : problem.spare) spare = options.spare;
        problem.alpha = options.alpha.value_or(routine.steady_alpha);
        problem.beta = options.beta.value_or(routine.steady_beta);
        problems.push_back(problem);
      }
  }
  return problems;
}

std::vector<Case> list_cases(const Options &options, const CoreLimits &limits) {
  std::vector<Case> cases;
  for (const std::string &name : options.routines) {
    bool found = false;
    for (const Routine &routine : routines) {
      if (!is_named(routine, name)) continue;
      for (const std::string &letters : letters_of(options, routine))
        for (Problem problem : list_problems(options, routine)) {
          set_letters(routine, letters, problem);
          cases.push_back(make_case(options, limits, routine, letters, problem));
          found = true;
        }
    }
    if (!found) fail("no case of " + name);
  }
  return cases;
}

int run(int argc, char **argv) {
  const Options options = parse(argc, argv);
  const CoreLimits limits = measure_core_limits();
  std::printf(
      "core: %.1f GFLOP/s double, %.1f single (16-byte multiply and add); %.1f double, %.1f single (32-byte); "
      "%.2f G loads/s, %.2f G stores/s\n",
      limits.double_flops / 1e9, limits.single_flops / 1e9, limits.wide_double_flops / 1e9,
      limits.wide_single_flops / 1e9, limits.load_rate / 1e9, limits.store_rate / 1e9);
  std::printf("%-7s %-2s %-15s %12s %8s %8s %-7s %6s  %-11s  %5s  %s\n", "routine", "", "case", "ns/call", "rate",
              "peer", "", "ratio", "range", "limit", "cores");
  std::FILE *csv = options.csv.empty() ? nullptr : std::fopen(options.csv.c_str(), "w");
  if (csv == nullptr && !options.csv.empty()) fail("cannot write " + options.csv);
  if (csv != nullptr) std::fprintf(csv, "%s\n", header);
  bool all_well = true;
  for (const Case &item : list_cases(options, limits)) all_well = compare(options, limits, item, csv) && all_well;
  if (csv != nullptr) std::fclose(csv);
  return all_well ? 0 : 1;
}

}  // namespace
}  // namespace qtb::bench

int main(int argc, char **argv) { return qtb::bench::run(argc, argv); }
