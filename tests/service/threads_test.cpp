// How many threads a call may use, on made-up machines and environments, each case in a process of its own.

#include "service/threads.h"

#include <omp.h>

#include "tests/platform/fake.h"
#include "tests/support/child.h"
#include "tests/support/together.h"

namespace qtb::test {
namespace {

using Environment = std::map<std::string, std::string>;

// A machine of so many cores, an OpenMP runtime that offers so many threads, and an environment.
void set_up(int cores, int runtime_threads, const Environment &environment) {
  fake.processors.assign(static_cast<std::size_t>(cores), {});
  for (int p = 0; p < cores; ++p) {
    fake.processors[static_cast<std::size_t>(p)].vendor = "AuthenticAMD";
    fake.processors[static_cast<std::size_t>(p)].identifier = static_cast<std::uint32_t>(p);
  }
  insert_processors(&fake.online, 0, cores - 1);
  fake.process = fake.online;
  fake.environment = environment;
  omp_set_num_threads(runtime_threads);
}

void expect_threads(int threads, int cores, int runtime_threads, const Environment &environment = {},
                    std::int32_t domain = domain_blas) {
  in_child([&] {
    set_up(cores, runtime_threads, environment);
    EXPECT_EQ(qtb_serv_get_max_threads(domain), threads) << testing::PrintToString(environment);
    EXPECT_EQ(qtb_serv_get_max_threads(domain), threads) << "second call";
  });
}

// The same, asked by the members of a team of two.
void expect_threads_in_region(int threads, int cores, const Environment &environment) {
  in_child([&] {
    set_up(cores, 8, environment);
    std::atomic<int> members{0}, agreed{0};
#pragma omp parallel num_threads(2)
    {
      ++members;
      agreed += qtb_serv_get_max_threads(domain_blas) == threads;
    }
    EXPECT_EQ(members, 2);
    EXPECT_EQ(agreed, 2) << testing::PrintToString(environment);
  });
}

TEST(MaxThreads, IsTheSmallerOfTheRuntimesNumberAndTheCores) {
  expect_threads(4, 8, 4);
  expect_threads(8, 8, 8);
  expect_threads(8, 8, 64);
  expect_threads(1, 8, 1);
  expect_threads(1, 1, 8);
}

TEST(MaxThreads, IsOneInsideAParallelRegion) {
  expect_threads_in_region(1, 8, {});
  expect_threads_in_region(1, 8, {{"QTB_NUM_THREADS", "4"}});
}

TEST(MaxThreads, WithoutDynamicModeIsTheNumberAskedForOnAnyMachineAndInARegion) {
  const Environment environment = {{"QTB_DYNAMIC", "FALSE"}, {"QTB_NUM_THREADS", "64"}};
  expect_threads(64, 1, 2, environment);
  expect_threads(64, 8, 2, environment);
  expect_threads_in_region(64, 8, environment);
  expect_threads(12, 8, 12, {{"QTB_DYNAMIC", "false"}});
}

TEST(MaxThreads, DynamicModeStaysOnForEverySpellingButTwo) {
  expect_threads(8, 8, 2, {{"QTB_DYNAMIC", "False"}, {"QTB_NUM_THREADS", "64"}});
}

TEST(MaxThreads, GivenNumbersHaveTheirPrecedence) {
  const Environment all_three = {{"QTB_NUM_THREADS", "6"}, {"QTB_DOMAIN_NUM_THREADS", "QTB_ALL=2,QTB_BLAS=3"}};
  expect_threads(3, 8, 7, all_three);
  expect_threads(6, 8, 7, all_three, domain_fft);
  expect_threads(6, 8, 7, {{"QTB_NUM_THREADS", "6"}});
  expect_threads(2, 8, 7, {{"QTB_DOMAIN_NUM_THREADS", "QTB_ALL=2"}});
  expect_threads(7, 8, 7, {{"QTB_DOMAIN_NUM_THREADS", "QTB_FFT=2"}});
}

TEST(MaxThreads, EveryDomainHasItsKey) {
  const Environment environment = {{"QTB_DOMAIN_NUM_THREADS", "QTB_ALL=2,QTB_BLAS=3,QTB_FFT=4,QTB_VML=5"}};
  expect_threads(3, 8, 8, environment, domain_blas);
  expect_threads(4, 8, 8, environment, domain_fft);
  expect_threads(5, 8, 8, environment, domain_vml);
  for (const std::int32_t other : {0, 4, 7, -1, 1 << 30}) expect_threads(2, 8, 8, environment, other);
}

TEST(MaxThreads, AMalformedNumberMeansOne) {
  for (const char *text : {"abc", "-2", " 4"}) expect_threads(1, 8, 8, {{"QTB_NUM_THREADS", text}});
  expect_threads(8, 8, 8, {{"QTB_NUM_THREADS", "0"}});
}

TEST(MaxThreads, AProcessWithLessThanTheMachineRunsOnOneThread) {
  in_child([] {
    set_up(8, 8, {{"QTB_NUM_THREADS", "4"}});
    fake.process = {};
    insert_processors(&fake.process, 0, 6);
    EXPECT_EQ(qtb_serv_get_max_threads(domain_blas), 1);
  });
}

TEST(MaxThreads, ARankGetsItsShareOfTheCoresIfRanksMayUseThreads) {
  const char *const ranks = "Q_MPI_NUMBER_OF_MPI_PROCESSES_PER_NODE", *const level = "Q_MPI_THREAD_LEVEL";
  for (const char *given : {"1", "2", "3"}) expect_threads(4, 8, 8, {{ranks, "2"}, {level, given}});
  expect_threads(2, 8, 8, {{ranks, "3"}, {level, "1"}});
  expect_threads(1, 8, 8, {{ranks, "8"}, {level, "1"}});
  expect_threads(1, 8, 8, {{ranks, "100"}, {level, "1"}});
  expect_threads(8, 8, 8, {{ranks, "0"}, {level, "1"}});
}

TEST(MaxThreads, TheShareOfARankReplacesTheRuntimesNumber) {
  expect_threads(4, 8, 2, {{"Q_MPI_NUMBER_OF_MPI_PROCESSES_PER_NODE", "2"}, {"Q_MPI_THREAD_LEVEL", "1"}});
}

TEST(MaxThreads, ARankWithoutThreadSupportRunsOnOneThread) {
  const char *const ranks = "Q_MPI_NUMBER_OF_MPI_PROCESSES_PER_NODE", *const level = "Q_MPI_THREAD_LEVEL";
  expect_threads(1, 8, 8, {{ranks, "2"}});
  for (const char *given : {"0", "4", "x"}) expect_threads(1, 8, 8, {{ranks, "2"}, {level, given}});
}

TEST(MaxThreads, ARankWhoseUserNamedANumberIsLikeAnyProcess) {
  Environment environment = {{"Q_MPI_NUMBER_OF_MPI_PROCESSES_PER_NODE", "2"}, {"Q_MPI_THREAD_LEVEL", "1"}};
  environment["OMP_NUM_THREADS"] = "6";
  expect_threads(6, 8, 6, environment);
  expect_threads(8, 8, 12, environment);
  environment["OMP_NUM_THREADS"] = "0";
  expect_threads(4, 8, 6, environment);
  environment.erase("OMP_NUM_THREADS");
  environment["QTB_NUM_THREADS"] = "5";
  expect_threads(5, 8, 8, environment);
}

TEST(MaxThreads, ThreadLevelAloneHasNoEffect) { expect_threads(8, 8, 8, {{"Q_MPI_THREAD_LEVEL", "0"}}); }

TEST(MaxThreads, IsOneInAProcessForkedFromThreads) {
  in_child([] {
    set_up(8, 8, {{"QTB_NUM_THREADS", "4"}, {"QTB_DYNAMIC", "FALSE"}});
    fake.forked_from_threads = true;
    EXPECT_EQ(qtb_serv_get_max_threads(domain_blas), 1);
  });
}

TEST(MaxThreads, FollowsTheRuntimeFromCallToCall) {
  in_child([] {
    set_up(8, 4, {});
    EXPECT_EQ(qtb_serv_get_max_threads(domain_blas), 4);
    omp_set_num_threads(2);
    EXPECT_EQ(qtb_serv_get_max_threads(domain_blas), 2);
  });
}

TEST(MaxThreads, ReadsEnvironmentAndMachineOnce) {
  in_child([] {
    set_up(8, 8, {{"QTB_NUM_THREADS", "4"}});
    EXPECT_TRUE(fake.environment_reads.empty());
    EXPECT_EQ(qtb_serv_get_max_threads(domain_blas), 4);
    const int asked = fake.cpuid_calls;
    EXPECT_EQ(fake.environment_reads.size(), 6U);
    fake.environment["QTB_NUM_THREADS"] = "2";
    fake.environment["QTB_DYNAMIC"] = "FALSE";
    EXPECT_EQ(qtb_serv_get_max_threads(domain_blas), 4);
    EXPECT_EQ(qtb_serv_get_dynamic(), 1);
    EXPECT_EQ(fake.environment_reads.size(), 6U);
    EXPECT_EQ(fake.cpuid_calls, asked);
  });
}

TEST(DynamicMode, IsOnUnlessTheEnvironmentTurnsItOff) {
  for (const char *text : {"", "TRUE", "0", "False"})
    in_child([&] {
      set_up(2, 2, {{"QTB_DYNAMIC", text}});
      EXPECT_EQ(qtb_serv_get_dynamic(), 1) << text;
    });
  in_child([] {
    set_up(2, 2, {{"QTB_DYNAMIC", "FALSE"}});
    EXPECT_EQ(qtb_serv_get_dynamic(), 0);
    EXPECT_EQ(fake.environment_reads.size(), 6U);
    EXPECT_EQ(qtb_serv_get_max_threads(domain_blas), 2);
    EXPECT_EQ(fake.environment_reads.size(), 6U);
  });
}

TEST(ReadThreadEnv, LeavesTheNextQueryToReadAgain) {
  in_child([] {
    set_up(2, 2, {});
    qtb_serv_read_thread_env();
    EXPECT_EQ(fake.environment_reads.size(), 6U);
    qtb_serv_get_dynamic();
    EXPECT_EQ(fake.environment_reads.size(), 12U);
  });
}

TEST(MaxThreads, RacingFirstCallsAgree) {
  in_child([] {
    set_up(8, 8, {{"QTB_DOMAIN_NUM_THREADS", "QTB_BLAS=3"}});
    std::int32_t found[16], modes[16];
    on_threads(16, [&](int i) {
      found[i] = qtb_serv_get_max_threads(domain_blas);
      modes[i] = qtb_serv_get_dynamic();
    });
    for (int i = 0; i < 16; ++i) {
      EXPECT_EQ(found[i], 3);
      EXPECT_EQ(modes[i], 1);
    }
  });
}

}  // namespace
}  // namespace qtb::test
