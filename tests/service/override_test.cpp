// The thread settings that no variable gives: the place for a setter, filled here by a reader of the environment that
// stands in for the library's own.

#include <omp.h>

#include "service/thread_settings.h"
#include "service/threads.h"
#include "tests/platform/fake.h"
#include "tests/support/child.h"

namespace qtb {
namespace {

ThreadSettings given;

}  // namespace

void read_thread_variables(ThreadSettings *settings) { *settings = given; }

namespace test {
namespace {

// On 8 cores, with a runtime that offers 6 threads.
void expect_threads(int threads, const ThreadSettings &settings) {
  in_child([&] {
    given = settings;
    set_cores(8);
    omp_set_num_threads(6);
    EXPECT_EQ(qtb_serv_get_max_threads(domain_blas), threads);
  });
}

ThreadSettings with(std::int32_t dynamic, std::int32_t dynamic_override) {
  ThreadSettings settings;
  settings.dynamic = dynamic;
  settings.dynamic_override = dynamic_override;
  return settings;
}

TEST(DynamicOverride, OfZeroMeansOneThread) { expect_threads(1, with(1, 0)); }

TEST(DynamicOverride, OfAnythingElseMeansTheSmallerOfTheNumberAskedForAndTheCores) {
  for (const std::int32_t value : {1, 2, 100, -2}) {
    ThreadSettings settings = with(1, value);
    expect_threads(6, settings);
    settings.threads_blas = 4;
    expect_threads(4, settings);
    settings.threads_blas = 64;
    expect_threads(8, settings);
  }
}

TEST(DynamicOverride, OfMinusOneIsNone) { expect_threads(6, with(1, -1)); }

TEST(DynamicOverride, GoesBeforeTheShareOfARank) {
  ThreadSettings settings = with(1, -1);
  settings.mpi_procs_per_node = 2;
  settings.mpi_thread_level = 1;
  expect_threads(4, settings);
  settings.dynamic_override = 1;
  expect_threads(6, settings);
  settings.dynamic_override = 0;
  expect_threads(1, settings);
}

TEST(DynamicOverride, SaysNothingWithoutDynamicMode) {
  ThreadSettings settings = with(0, 0);
  expect_threads(6, settings);
  settings.threads_blas = 64;
  expect_threads(64, settings);
}

}  // namespace
}  // namespace test
}  // namespace qtb
