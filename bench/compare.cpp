// compare: this library beside another BLAS shared library, or beside itself under other settings, on the same calls.
//
//   compare --library LIBRARY [--tier 0..4] [--setting NAME=VALUE]...
//           [--peer LIBRARY|self] [--peer-setting NAME=VALUE]... [--threads 1]
//           [--routines ddot,dgemm] [--sizes 8,4000] [--increment 1]
//           [--shapes 1000x1000x32] [--options NN,NT] [--alpha 1[,0]] [--beta 0[,0]]
//           [--turns 21] [--seconds 0.5] [--csv FILE]
//
// Vector routines run once per size. Matrix products run once per option letters and size (square) or shape, m x n x k.
// Each case is measured in turns of at most so many seconds in all, each side in a process of its own (sides.h), which
// reads the settings afresh: --threads holds for both sides, --setting for the first and --peer-setting for the second.
//
// A row: routine, options, case, this library's time per call and rate, the peer's rate, the ratio of the rates pair by
// pair (median, lowest, highest; above 1 this library is faster), the share of what the core's own load, store and
// arithmetic rates allow on that number of threads (vector routines: in cache; products: the arithmetic alone), and the
// cores that each side kept busy. The share is a median of pairs too: a loop of nothing but the work that bounds the
// call takes its turns beside the sides. A product is first checked; where it is wrong, the row says so, nothing is
// timed, and the exit status is 1. The file has the same as numbers, and the rate at the limit.

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <string>
#include <vector>

#include "bench/calls.h"
#include "bench/limits.h"
#include "bench/products.h"
#include "bench/sides.h"
#include "bench/timing.h"
#include "blas/tiers.h"

namespace qtb::bench {
namespace {

struct Shape {
  long m, n, k;
};

struct Options {
  Side ours, peer;
  std::string csv;
  std::vector<std::string> routines, letters{"NN"};
  std::vector<long> sizes;
  std::vector<Shape> shapes;
  std::complex<double> alpha = 1, beta = 0;
  long increment = 1, threads = 1;
  int turns = 21;
  double seconds = 0.5;
  bool avx = false;  // the tier of this library's side
};

struct Case {
  std::string routine, letters, label;
  std::string numbers;  // m,n,k,increment for the file, empty where the routine has none
  double work;          // of a call: flops where there are any, bytes elsewhere
  Bound bound;          // of the busiest thread's part of a call
  const char *unit;
  Prepare prepare;
};

// The first row of the file; `compare` writes the others in this order.
constexpr const char *header =
    "routine,options,m,n,k,increment,threads,ns,rate,peer_ns,peer_rate,unit,ratio,ratio_low,ratio_high,limit,share,"
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

Case vector_case(const Options &options, const CoreLimits &limits, const Routine &routine, long n) {
  const long increment = options.increment;
  const double flops = call_flops(routine, n);
  const double vectors = static_cast<double>(n) * static_cast<double>(type_bytes(routine.type)) / 16;
  Case item;
  item.routine = routine.name;
  item.label = std::to_string(n);
  item.numbers = "," + std::to_string(n) + ",," + std::to_string(increment);
  item.work = flops > 0 ? flops : call_bytes(routine, n);
  item.unit = flops > 0 ? "GFLOP/s" : "GB/s";
  item.bound = find_bound(limits, vectors * routine.read, vectors * routine.written, flops, routine.is_single());
  item.bound.amount /= static_cast<double>(options.threads);
  item.prepare = [&routine, n, increment](const Library &library) {
    const auto operands = std::make_shared<Operands>(make_operands(routine, n, increment));
    const Calls calls = bind(library, routine, n, increment, *operands);
    if (!calls) return Prepared{};
    return Prepared{[operands, calls](long count) { calls(count); }, true};
  };
  return item;
}

// The avx tier's only kernel with 32-byte vectors is that of dgemm.
Limit limit_of(const Options &options, const Product &product) {
  if (options.avx && product.routine == "dgemm") return &CoreLimits::wide_double_flops;
  return product.is_single() ? &CoreLimits::single_flops : &CoreLimits::double_flops;
}

Case product_case(const Options &options, const Product &product) {
  const auto numbers = [&](char separator) {
    return std::to_string(product.m) + separator + std::to_string(product.n) + separator + std::to_string(product.k);
  };
  Case item;
  item.routine = product.routine;
  item.letters = {product.op_a, product.op_b};
  item.label = numbers('x');
  item.numbers = numbers(',') + ',';
  item.work = product_flops(product);
  item.unit = "GFLOP/s";
  item.bound = {limit_of(options, product), item.work / static_cast<double>(options.threads)};
  item.prepare = [product](const Library &library) {
    const BoundProduct bound = bind_product(library, product);
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

Shape parse_shape(const std::string &text) {
  const std::vector<std::string> parts = split(text, 'x');
  if (parts.size() != 3) fail("a shape is MxNxK: " + text);
  return {std::stol(parts[0]), std::stol(parts[1]), std::stol(parts[2])};
}

std::complex<double> parse_scalar(const std::string &text) {
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
      for (const std::string &size : split(value, ',')) options.sizes.push_back(std::stol(size));
    else if (key == "--shapes")
      for (const std::string &shape : split(value, ',')) options.shapes.push_back(parse_shape(shape));
    else if (key == "--options")
      options.letters = split(value, ',');
    else if (key == "--alpha")
      options.alpha = parse_scalar(value);
    else if (key == "--beta")
      options.beta = parse_scalar(value);
    else if (key == "--increment")
      options.increment = std::stol(value);
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
  for (const std::string &letters : options.letters)
    if (letters.size() != 2 || letters.find_first_not_of("NTC") != letters.npos) fail("no such options: " + letters);
  if (options.sizes.empty() && options.shapes.empty()) options.sizes = {4000};
  if (options.peer.path == "self")
    options.peer.path = options.ours.path;
  else
    options.peer.wide = false;
  // What both sides have in common comes first, so that the settings of a side go before it.
  if (!tier.empty()) set_environment("QTB_DEBUG_CPU_TYPE=" + tier);
  options.avx = tier == std::to_string(tier_avx);
  for (const char *variable : {"QTB_NUM_THREADS", "OMP_NUM_THREADS", "OPENBLAS_NUM_THREADS", "BLIS_NUM_THREADS"})
    set_environment(variable + ("=" + std::to_string(options.threads)));
  return options;
}

std::vector<Case> list_cases(const Options &options, const CoreLimits &limits) {
  std::vector<Case> cases;
  for (const Routine &routine : routines) {
    const auto named = std::find(options.routines.begin(), options.routines.end(), routine.name);
    if (!options.routines.empty() && named == options.routines.end()) continue;
    for (const long size : options.sizes) cases.push_back(vector_case(options, limits, routine, size));
  }
  for (const std::string &routine : options.routines) {
    if (!is_product(routine)) continue;
    for (const std::string &letters : options.letters) {
      const auto add = [&](long m, long n, long k) {
        Product product{routine, letters[0], letters[1], m, n, k, options.alpha, options.beta};
        if (!product.is_complex()) product.alpha = product.alpha.real(), product.beta = product.beta.real();
        cases.push_back(product_case(options, product));
      };
      for (const long size : options.sizes) add(size, size, size);
      for (const Shape &shape : options.shapes) add(shape.m, shape.n, shape.k);
    }
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
