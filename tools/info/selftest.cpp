// The processes of the self-test.
#include "tools/info/selftest.h"

#include <dlfcn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

#include "tests/product/surface/session.h"
#include "tests/support/tiers.h"

namespace qtb::info {
namespace {

constexpr int exit_failed = 1, exit_usage = 2;

Result *current_result;

// A line of its own for each failure: the first stands behind the name of the tier.
void begin_failure() {
  if (current_result->failures++ == 0) std::printf("\n");
}

// A failure of a session tells the routine at the head of its problem.
void fail_session(const char *problem, const char *what) {
  begin_failure();
  std::printf("FAILED %s\n       %s\n", problem, what);
}

void on_trap(int signal) {
  const auto put = [](const char *text) { (void)!write(STDOUT_FILENO, text, std::strlen(text)); };
  put("\nFAILED ");
  put(surface::current_problem);
  put("\n       trapped\n");
  std::signal(signal, SIG_DFL);
  std::raise(signal);
}

// Runs this program again for one tier.
bool tier_passes(int tier, bool threads, const char *path) {
  std::printf("tier %s, %s: ", test::tier_name(tier), threads ? "4 threads" : "1 thread");
  std::fflush(stdout);
  const pid_t child = fork();
  if (child < 0) return std::perror("qtb-info: fork"), false;
  if (child == 0) {
    setenv("QTB_DEBUG_CPU_TYPE", std::to_string(tier).c_str(), 1);
    setenv("QTB_NUM_THREADS", threads ? "4" : "1", 1);
    setenv("QTB_DYNAMIC", "FALSE", 1);
    setenv("OMP_WAIT_POLICY", "passive", 1);
    unsetenv("QTB_DOMAIN_NUM_THREADS");
    execl("/proc/self/exe", "qtb-info", threads ? "--selftest-threads" : "--selftest-serial", path, nullptr);
    _exit(exit_usage);
  }
  int status = 0;
  if (waitpid(child, &status, 0) != child) return false;
  if (WIFSIGNALED(status)) std::printf("       ended by signal %d\n", WTERMSIG(status));
  return WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

}  // namespace

Library::Library(const char *path) : handle_(dlopen(path, RTLD_NOW | RTLD_LOCAL)), published_(false) {
  if (handle_ == nullptr) {
    std::fprintf(stderr, "qtb-info: %s\n", dlerror());
    std::exit(exit_usage);
  }
  published_ = symbol("dgemm") != nullptr;
  const char *const name = std::strrchr(path, '/') != nullptr ? std::strrchr(path, '/') + 1 : path;
  if (!published_ && (symbol("dgemm_") == nullptr || std::strstr(name, "64") != nullptr)) {
    std::fprintf(stderr, "qtb-info: %s has neither the names of libqtb.so nor those of libblas.so.3\n", path);
    std::exit(exit_usage);
  }
}

void *Library::symbol(const char *name) const { return dlsym(handle_, name); }

void Result::fail(const char *routine, const char *what) {
  begin_failure();
  std::printf("FAILED %s\n       %s\n", routine, what);
}

int run_selftest_of_tier(const char *path, bool threads) {
  const Library library(path);
  for (const int signal : {SIGSEGV, SIGBUS, SIGFPE, SIGILL}) std::signal(signal, on_trap);
  std::setvbuf(stdout, nullptr, _IOLBF, 0);
  Result result;
  current_result = &result;
  surface::report_failure = &fail_session;
  const Plan plan = threads ? Plan{2, 2} : Plan{12, 1};
  test_level1(library, plan, result);
  test_level2(library, plan, result);
  test_level3(library, plan, result);
  for (const auto &[routine, tally] : surface::tallies()) result.cases += tally.cases;
  std::printf("%ld routines, %ld calls, %ld failures\n", result.routines, result.cases, result.failures);
  return result.failures == 0 && result.routines > 0 ? 0 : exit_failed;
}

int run_selftest(const char *path) {
  if (path == nullptr) path = QTB_INFO_LIBRARY;
  const Library library(path);  // a message for a wrong path, once
  bool passes = true;
  int tiers = 0;
  std::printf("self-test of %s\n", path);
  const char *const asked = std::getenv("QTB_DEBUG_CPU_TYPE");
  test::in_every_tier([&](int tier) {
    if (asked != nullptr && std::to_string(tier) != asked) return;
    ++tiers;
    for (const bool threads : {false, true}) passes = tier_passes(tier, threads, path) && passes;
  });
  passes = passes && tiers > 0;
  std::printf("%s\n", passes ? "passed" : "FAILED");
  return passes ? 0 : exit_failed;
}

}  // namespace qtb::info
