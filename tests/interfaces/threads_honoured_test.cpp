// Every routine with a parallel path takes the number that the program has set: the teams that a companion asks the
// OpenMP runtime for are counted where they begin. The run has dynamic mode off and a tier with all drivers.
#include <dlfcn.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <functional>
#include <vector>

#include "include/qtb/cblas.h"
#include "include/qtb/threads.h"
#include "tests/support/together.h"

namespace {

std::atomic<unsigned> largest_team{0};
thread_local unsigned own_largest_team = 0;

}  // namespace

// Stands ahead of the runtime's own.
extern "C" __attribute__((visibility("default"))) void GOMP_parallel(void (*body)(void *), void *data, unsigned threads,
                                                                     unsigned flags) {
  static const auto next = reinterpret_cast<decltype(&GOMP_parallel)>(dlsym(RTLD_NEXT, "GOMP_parallel"));
  largest_team = std::max<unsigned>(largest_team, threads);
  own_largest_team = std::max(own_largest_team, threads);
  next(body, data, threads, flags);
}

namespace qtb::test {
namespace {

constexpr int n = 300, updated = 1500, length = 100000;  // updated: of a triangle, by vectors

// A call of each family of drivers, large enough to run on threads.
struct Case {
  const char *name;
  std::function<void()> call;
};
std::vector<Case> &cases() {
  static std::vector<double> a(n * n, 0.5), b(n * n, 0.25), c(n * n), u(updated * updated), x(length, 1.0),
      y(length, 2.0);
  constexpr auto rows = CblasColMajor;
  constexpr auto plain = CblasNoTrans;
  static std::vector<Case> all = {
      {"daxpy", [] { cblas_daxpy(length, 1e-9, x.data(), 1, y.data(), 1); }},
      {"ddot", [] { cblas_ddot(length, x.data(), 1, y.data(), 1); }},
      {"dgemv", [] { cblas_dgemv(rows, plain, n, n, 1, a.data(), n, x.data(), 1, 0, y.data(), 1); }},
      {"dsymv", [] { cblas_dsymv(rows, CblasUpper, n, 1, a.data(), n, x.data(), 1, 0, y.data(), 1); }},
      {"dsyr", [] { cblas_dsyr(rows, CblasUpper, updated, 1e-9, x.data(), 1, u.data(), updated); }},
      {"dsyr2", [] { cblas_dsyr2(rows, CblasUpper, updated, 1e-9, x.data(), 1, y.data(), 1, u.data(), updated); }},
      {"dtrmv", [] { cblas_dtrmv(rows, CblasUpper, plain, CblasUnit, n, b.data(), n, y.data(), 1); }},
      {"dgemm", [] { cblas_dgemm(rows, plain, plain, n, n, n, 1, a.data(), n, b.data(), n, 0, c.data(), n); }},
      {"dsymm", [] { cblas_dsymm(rows, CblasLeft, CblasUpper, n, n, 1, a.data(), n, b.data(), n, 0, c.data(), n); }},
      {"dsyrk", [] { cblas_dsyrk(rows, CblasUpper, plain, n, n, 1, a.data(), n, 0, c.data(), n); }},
      {"dsyr2k", [] { cblas_dsyr2k(rows, CblasUpper, plain, n, n, 1, a.data(), n, b.data(), n, 0, c.data(), n); }},
      {"dtrmm", [] { cblas_dtrmm(rows, CblasLeft, CblasUpper, plain, CblasUnit, n, n, 0, a.data(), n, c.data(), n); }},
      {"dtrsm", [] { cblas_dtrsm(rows, CblasLeft, CblasUpper, plain, CblasUnit, n, n, 1, a.data(), n, c.data(), n); }},
  };
  return all;
}

// The largest team that a call asked for; 1 where it asked for none.
unsigned team_of(const Case &of) {
  largest_team = 1;
  of.call();
  return largest_team;
}

TEST(ANumberThatWasSet, is_taken_by_every_driver) {
  for (const Case &each : cases()) {
    qtb_set_num_threads(3);
    EXPECT_GE(team_of(each), 2U) << each.name;
    EXPECT_LE(team_of(each), 3U) << each.name;
    qtb_set_num_threads(1);
    EXPECT_EQ(team_of(each), 1U) << each.name;
    EXPECT_EQ(qtb_set_num_threads_local(2), 0);
    EXPECT_EQ(team_of(each), 2U) << each.name;
    qtb_set_num_threads_local(0);
    qtb_set_num_threads(0);
  }
}

TEST(ANumberThatWasSet, is_each_threads_own) {
  on_threads(3, [](int i) {
    qtb_set_num_threads_local(i + 1);
    std::vector<double> a(n * n, 1), c(n * n);
    for (int k = 0; k < 3; ++k) {
      own_largest_team = 1;
      cblas_dgemm(CblasColMajor, CblasNoTrans, CblasTrans, n, n, n, 1, a.data(), n, a.data(), n, 0, c.data(), n);
      EXPECT_EQ(own_largest_team, static_cast<unsigned>(i + 1));
    }
  });
}

}  // namespace
}  // namespace qtb::test
