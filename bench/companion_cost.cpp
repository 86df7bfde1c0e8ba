// companion_cost LIBRARY COMPANION REFERENCE PROGRAM: what a companion costs beside the library and the reference BLAS.
//
// A tiny call through a companion's Fortran name, with its integers of 32 bits, and the same through the library's own
// name, in turn, on the tier that QTB_DEBUG_CPU_TYPE gives both: ns a call, the difference by pairs, its median. Then a
// PROGRAM of one such call, started with the companion and with the reference BLAS, in turn: milliseconds from start to
// end, and the largest memory that it held. COMPANION and REFERENCE are paths of a libblas.so.3.
#include <spawn.h>
#include <sys/wait.h>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

#include "bench/library.h"
#include "bench/timing.h"
#include "blas/shapes.h"

extern char **environ;

namespace {

using namespace qtb::bench;

// One call of each routine, on arguments of order one. Int is the integer of the library.
template <class Int>
struct TinyCalls {
  Library library;
  std::string ending;
  Int n = 1;
  double a = 1, b = 1, c = 1, one = 1;

  template <class Result, class... Arguments>
  auto loop(const char *name, Arguments... arguments) {
    auto *function = reinterpret_cast<Result (*)(Arguments...)>(library.find(name + ending));
    if (function == nullptr) std::printf("no %s\n", name), std::exit(1);
    return [=](long count) {
      for (long i = 0; i < count; ++i) function(arguments...);
    };
  }
  auto ddot() { return loop<double>("ddot", &n, &a, &n, &b, &n); }
  auto daxpy() { return loop<void>("daxpy", &n, &one, &a, &n, &b, &n); }
  auto dgemv() { return loop<void>("dgemv", "N", &n, &n, &one, &a, &n, &b, &n, &one, &c, &n); }
  auto dgemm() { return loop<void>("dgemm", "N", "N", &n, &n, &n, &one, &a, &n, &b, &n, &one, &c, &n); }
};

template <class Core, class Companion>
void compare(const char *name, Core core, Companion companion) {
  constexpr int pairs = 201;
  constexpr double seconds = 0.001;
  core(1);
  companion(1);
  const long count = calibrate(core, seconds);
  std::vector<double> own, face, difference;
  for (int pair = 0; pair < pairs; ++pair) {
    own.push_back(fastest_seconds_per_call(core, count) * 1e9);
    face.push_back(fastest_seconds_per_call(companion, count) * 1e9);
    difference.push_back(face.back() - own.back());
  }
  std::printf("%-6s n=1, ns/call: library %.2f, companion %.2f, difference %.2f (median of %d pairs)\n", name,
              spread(own).median, spread(face).median, spread(difference).median, pairs);
}

// From here on processes that start find this libblas.so.3.
void take_library(const std::string &library) {
  setenv("LD_LIBRARY_PATH", library.substr(0, library.rfind('/')).c_str(), 1);
}

double milliseconds(const char *program, const std::string &library) {
  take_library(library);
  char *arguments[] = {const_cast<char *>(program), nullptr};
  pid_t child = 0;
  int status = 0;
  const double begin = now();
  if (posix_spawn(&child, program, nullptr, nullptr, arguments, environ) != 0 || waitpid(child, &status, 0) != child ||
      status != 0) {
    std::printf("%s fails with %s\n", program, library.c_str());
    std::exit(1);
  }
  return (now() - begin) * 1e3;
}

// Largest resident memory in KiB, as the process itself reads it: what its parent is told holds the parent's own.
long memory(const char *program, const std::string &library) {
  take_library(library);
  long size = 0;
  std::FILE *answer = popen((std::string("'") + program + "' memory").c_str(), "r");
  if (answer == nullptr || std::fscanf(answer, "%ld", &size) != 1 || pclose(answer) != 0) std::exit(1);
  return size;
}

}  // namespace

int main(int argc, char **argv) {
  if (argc != 5) {
    std::fprintf(stderr, "companion_cost LIBRARY COMPANION REFERENCE PROGRAM\n");
    return 2;
  }
  TinyCalls<std::int64_t> core{load_library(argv[1], true), ""};
  TinyCalls<std::int32_t> companion{load_library(argv[2], false), ""};
  compare("ddot", core.ddot(), companion.ddot());
  compare("daxpy", core.daxpy(), companion.daxpy());
  compare("dgemv", core.dgemv(), companion.dgemv());
  compare("dgemm", core.dgemm(), companion.dgemm());

  constexpr int starts = 101;
  const char *program = argv[4], *libraries[] = {argv[2], argv[3]};
  std::vector<double> ours, reference, difference;
  for (int i = 0; i < starts; ++i) {
    ours.push_back(milliseconds(program, libraries[0]));
    reference.push_back(milliseconds(program, libraries[1]));
    difference.push_back(ours.back() - reference.back());
  }
  std::printf("start to end, ms: companion %.2f, reference %.2f, difference %.2f (median of %d pairs)\n",
              spread(ours).median, spread(reference).median, spread(difference).median, starts);
  std::printf("largest memory, KiB: companion %ld, reference %ld\n", memory(program, libraries[0]),
              memory(program, libraries[1]));
  return 0;
}
