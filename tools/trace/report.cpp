// The report at the end of a process that made calls: a table of routines and one of the shapes that took longest, on
// standard error or where QTB_TRACE_OUTPUT says, and every shape as a row of the file that QTB_TRACE_CSV names. %p in
// either name is the process.
#include "tools/trace/report.h"

#include <errno.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <map>
#include <string>
#include <vector>

#include "calls/level1.h"
#include "calls/level2.h"
#include "calls/level3.h"
#include "tools/trace/record.h"

namespace qtb::trace {
namespace {

constexpr auto relaxed = std::memory_order_relaxed;

// ---- the routines ----

calls::Problem problem_of(const CallShape &shape, std::string_view axes) {
  const auto or_zero = [](std::int32_t size) { return size < 0 ? 0 : QtbInt{size}; };
  calls::Problem p;
  p.m = or_zero(shape.m), p.n = or_zero(shape.n), p.k = or_zero(shape.k);
  p.kl = or_zero(axes.find('b') != axes.npos ? shape.k : shape.kl), p.ku = or_zero(shape.ku);
  if (shape.side != '\0') p.side = shape.side;
  if (shape.uplo != '\0') p.uplo = shape.uplo;
  if (shape.transa != '\0') p.transa = shape.transa;
  if (shape.transb != '\0') p.transb = shape.transb;
  if (shape.diag != '\0') p.diag = shape.diag;
  p.alpha = p.beta = {1, 0};
  return p;
}

template <calls::ShapeName name, class T>
double flops(const CallShape &shape, const char *routine) {
  const calls::Kind kind = calls::kind_of<T>(routine);
  return calls::describe<name>(problem_of(shape, calls::Shape<name>::axes), kind).work.flops(kind.complex);
}

struct Routine {
  const char *name;
  double (*flops)(const CallShape &, const char *);
};
constexpr Routine routines[] = {
#define QTB_ROUTINE(name, NAME, shape, T, route) {#name, &flops<#shape, T>},
#include "blas/routines.def"
#undef QTB_ROUTINE
};

std::string called_name(const Key &key) {
  constexpr struct {
    const char *front, *back;
  } parts[face_count] = {{"", "_"}, {"cblas_", ""}, {"", "_64_"}, {"cblas_", "_64"}, {"cblas_", "64_"}};
  return std::string(parts[key.face()].front) + routines[key.routine()].name + parts[key.face()].back;
}

// ---- what the tables hold ----

struct Row {
  Key key;
  std::uint64_t calls = 0, ticks = 0, least = UINT64_MAX, most = 0;
  double flops = 0;  // of all calls

  void add(const Row &other) {
    calls += other.calls, ticks += other.ticks, flops += other.flops;
    least = std::min(least, other.least), most = std::max(most, other.most);
  }
};

Row row_of(const Entry &entry, std::uint64_t calls) {
  Row row;
  row.key = entry.key;
  row.calls = calls, row.ticks = entry.ticks.load(relaxed);
  row.least = entry.least.load(relaxed), row.most = entry.most.load(relaxed);
  const Routine &routine = routines[row.key.routine()];
  row.flops = static_cast<double>(calls) * routine.flops(row.key.shape(), routine.name);
  return row;
}

struct Report {
  std::map<std::string, Row> shapes;  // by the bytes of their keys
  std::map<std::string, Row> routines;
  std::uint64_t calls = 0, ticks = 0, lost = 0;
};

Report collect() {
  Report report;
  for (const Table *table = first_table(); table != nullptr; table = table->next) {
    report.lost += table->lost.load(relaxed);
    for (const Entry &entry : table->entries) {
      const std::uint64_t calls = entry.calls.load(std::memory_order_acquire);
      if (calls == 0) continue;
      const Row row = row_of(entry, calls);
      const std::string bytes(static_cast<const char *>(static_cast<const void *>(&row.key)), sizeof row.key);
      report.shapes.try_emplace(bytes, Row{row.key}).first->second.add(row);
      report.routines.try_emplace(called_name(row.key), Row{row.key}).first->second.add(row);
      report.calls += calls, report.ticks += row.ticks;
    }
  }
  return report;
}

// ---- time ----

double now() {
  timespec t;
  clock_gettime(CLOCK_MONOTONIC, &t);
  return static_cast<double>(t.tv_sec) + 1e-9 * static_cast<double>(t.tv_nsec);
}
double begun_at;
std::uint64_t begun_ticks;
[[gnu::constructor]] void begin() {
  begun_at = now();
  begun_ticks = __rdtsc();
}

// ---- text ----

std::string letters(const CallShape &shape) {
  std::string text;
  for (const char letter : {shape.side, shape.uplo, shape.transa, shape.transb, shape.diag})
    if (letter != '\0') text += letter;
  return text;
}
std::string size_text(std::int32_t size) { return size == CallShape::absent ? "" : std::to_string(size); }
std::string shape_text(const CallShape &shape) {
  std::string text = letters(shape);
  const struct {
    const char *name;
    std::int32_t size;
  } sizes[] = {{"m", shape.m}, {"n", shape.n}, {"k", shape.k}, {"kl", shape.kl}, {"ku", shape.ku}};
  for (const auto &[name, size] : sizes)
    if (size != CallShape::absent) text += std::string(text.empty() ? "" : " ") + name + "=" + std::to_string(size);
  return text.empty() ? "-" : text;
}

std::FILE *open_output(const char *variable, std::FILE *otherwise) {
  const char *const given = std::getenv(variable);
  if (given == nullptr || *given == '\0') return otherwise;
  std::string path = given;
  if (const std::size_t at = path.find("%p"); at != path.npos) path.replace(at, 2, std::to_string(getpid()));
  std::FILE *const file = std::fopen(path.c_str(), "we");
  if (file == nullptr) std::fprintf(stderr, "qtb-trace: %s: %s\n", path.c_str(), std::strerror(errno));
  return file != nullptr ? file : otherwise;
}

std::vector<Row> by_time(const std::map<std::string, Row> &rows) {
  std::vector<Row> sorted;
  for (const auto &[name, row] : rows) sorted.push_back(row);
  std::stable_sort(sorted.begin(), sorted.end(), [](const Row &a, const Row &b) { return a.ticks > b.ticks; });
  return sorted;
}

void print_summary(std::FILE *out, const Report &report, double seconds_per_tick, double elapsed) {
  const auto share = [&](const Row &row) {
    return report.ticks == 0 ? 0 : 100 * static_cast<double>(row.ticks) / static_cast<double>(report.ticks);
  };
  const auto seconds = [&](std::uint64_t ticks) { return seconds_per_tick * static_cast<double>(ticks); };
  const auto rate = [&](const Row &row) { return row.ticks == 0 ? 0 : 1e-9 * row.flops / seconds(row.ticks); };
  std::fprintf(out, "qtb-trace: process %d, %llu calls in %.6f s of %.6f s\n", static_cast<int>(getpid()),
               static_cast<unsigned long long>(report.calls), seconds(report.ticks), elapsed);
  std::fprintf(out, "library %s, tier %s\n", library_behind().file, library_behind().tier);
  std::fprintf(out, "\n%-20s %12s %14s %10s %8s\n", "routine", "calls", "seconds", "GFLOP/s", "share");
  for (const Row &row : by_time(report.routines))
    std::fprintf(out, "%-20s %12llu %14.6f %10.3f %7.2f%%\n", called_name(row.key).c_str(),
                 static_cast<unsigned long long>(row.calls), seconds(row.ticks), rate(row), share(row));
  constexpr std::size_t most_shown = 10;
  std::fprintf(out, "\n%-20s %-36s %7s %12s %14s %10s %8s\n", "routine", "shape", "threads", "calls", "seconds",
               "GFLOP/s", "share");
  const std::vector<Row> shapes = by_time(report.shapes);
  for (std::size_t i = 0; i < std::min(most_shown, shapes.size()); ++i) {
    const Row &row = shapes[i];
    std::fprintf(out, "%-20s %-36s %7u %12llu %14.6f %10.3f %7.2f%%\n", called_name(row.key).c_str(),
                 shape_text(row.key.shape()).c_str(), row.key.threads(), static_cast<unsigned long long>(row.calls),
                 seconds(row.ticks), rate(row), share(row));
  }
  if (shapes.size() > most_shown) std::fprintf(out, "and %zu shapes more\n", shapes.size() - most_shown);
  if (report.lost != 0)
    std::fprintf(out, "%llu calls found no room and are not told\n", static_cast<unsigned long long>(report.lost));
}

void print_rows(std::FILE *out, const Report &report, double seconds_per_tick) {
  std::fprintf(out, "routine,options,m,n,k,kl,ku,threads,tier,calls,seconds,least_seconds,most_seconds,gflops\n");
  for (const Row &row : by_time(report.shapes)) {
    const CallShape s = row.key.shape();
    const double seconds = seconds_per_tick * static_cast<double>(row.ticks);
    std::fprintf(out, "%s,%s,%s,%s,%s,%s,%s,%u,%s,%llu,%.9f,%.9f,%.9f,%.6f\n", called_name(row.key).c_str(),
                 letters(s).c_str(), size_text(s.m).c_str(), size_text(s.n).c_str(), size_text(s.k).c_str(),
                 size_text(s.kl).c_str(), size_text(s.ku).c_str(), row.key.threads(), library_behind().tier,
                 static_cast<unsigned long long>(row.calls), seconds, seconds_per_tick * static_cast<double>(row.least),
                 seconds_per_tick * static_cast<double>(row.most), row.ticks == 0 ? 0 : 1e-9 * row.flops / seconds);
  }
}

[[gnu::destructor]] void report_all() {
  const double elapsed = now() - begun_at;
  const Report report = collect();
  if (report.calls == 0) return;
  const double seconds_per_tick = elapsed / static_cast<double>(__rdtsc() - begun_ticks);
  std::FILE *const summary = open_output("QTB_TRACE_OUTPUT", stderr);
  print_summary(summary, report, seconds_per_tick, elapsed);
  if (summary != stderr) std::fclose(summary);
  std::FILE *const rows = open_output("QTB_TRACE_CSV", nullptr);
  if (rows == nullptr) return;
  print_rows(rows, report, seconds_per_tick);
  std::fclose(rows);
}

}  // namespace
}  // namespace qtb::trace
