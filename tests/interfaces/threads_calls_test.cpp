// The calls that set a number of threads, on made-up machines and environments, each case in a process of its own.
#include <omp.h>

#include "include/qtb/threads.h"
#include "service/threads.h"
#include "tests/platform/fake.h"
#include "tests/support/child.h"
#include "tests/support/tiers.h"
#include "tests/support/together.h"

namespace qtb::test {
namespace {

using Environment = std::map<std::string, std::string>;

// body in a process on a machine of eight cores, with a runtime that offers eight threads.
template <class Body>
void on_eight_cores(const Environment &environment, Body body) {
  in_child([&] {
    set_cores(8);
    fake.environment = environment;
    omp_set_num_threads(8);
    body();
  });
}

TEST(SetNumThreads, holds_for_all_threads_until_it_is_taken_back) {
  on_eight_cores({{"QTB_NUM_THREADS", "5"}}, [] {
    EXPECT_EQ(qtb_get_num_threads(), 5);
    for (const int taken_back : {0, -1, -2147483647 - 1}) {
      qtb_set_num_threads(3);
      EXPECT_EQ(qtb_get_num_threads(), 3);
      on_threads(4, [](int) { EXPECT_EQ(qtb_serv_get_max_threads(domain_blas), 3); });
      qtb_set_num_threads(taken_back);
      EXPECT_EQ(qtb_get_num_threads(), 5);
    }
  });
}

TEST(SetNumThreads, goes_before_every_number_of_the_environment) {
  on_eight_cores({{"QTB_DOMAIN_NUM_THREADS", "QTB_BLAS=2"}}, [] {
    qtb_set_num_threads(6);
    EXPECT_EQ(qtb_get_num_threads(), 6);
  });
  on_eight_cores({{"Q_MPI_NUMBER_OF_MPI_PROCESSES_PER_NODE", "8"}}, [] {
    EXPECT_EQ(qtb_get_num_threads(), 1);
    qtb_set_num_threads(4);
    EXPECT_EQ(qtb_get_num_threads(), 4);
  });
}

TEST(SetNumThreads, takes_no_more_than_dynamic_mode_allows) {
  on_eight_cores({}, [] {
    for (const int many : {8, 9, 2147483647}) {
      qtb_set_num_threads(many);
      EXPECT_EQ(qtb_get_num_threads(), 8);
    }
    std::atomic<int> most{0};
#pragma omp parallel num_threads(2)
    {
      const int threads = qtb_get_num_threads();
      if (threads > 1) most = threads;
    }
    EXPECT_EQ(most, 0);
    fake.forked_from_threads = true;
    EXPECT_EQ(qtb_get_num_threads(), 1);
  });
  on_eight_cores({}, [] {
    fake.process = {};
    insert_processors(&fake.process, 0, 3);
    qtb_set_num_threads(4);
    EXPECT_EQ(qtb_get_num_threads(), 1);
  });
}

TEST(SetNumThreads, without_dynamic_mode_is_the_number_itself) {
  on_eight_cores({{"QTB_DYNAMIC", "FALSE"}}, [] {
    qtb_set_num_threads(64);
    EXPECT_EQ(qtb_get_num_threads(), 64);
  });
}

TEST(SetNumThreadsLocal, holds_for_the_calling_thread_and_returns_the_former_number) {
  on_eight_cores({}, [] {
    qtb_set_num_threads(6);
    EXPECT_EQ(qtb_set_num_threads_local(2), 0);
    EXPECT_EQ(qtb_get_num_threads(), 2);
    on_threads(4, [](int i) {
      EXPECT_EQ(qtb_get_num_threads(), 6);
      EXPECT_EQ(qtb_set_num_threads_local(i + 1), 0);
      EXPECT_EQ(qtb_get_num_threads(), i + 1);
    });
    EXPECT_EQ(qtb_set_num_threads_local(3), 2);
    EXPECT_EQ(qtb_set_num_threads_local(-1), 3);
    EXPECT_EQ(qtb_get_num_threads(), 6);
    EXPECT_EQ(qtb_set_num_threads_local(0), 0);
  });
}

TEST(SetNumThreadsLocal, stays_with_a_forked_child) {
  on_eight_cores({}, [] {
    qtb_set_num_threads(6);
    qtb_set_num_threads_local(2);
    in_child([] {
      EXPECT_EQ(qtb_get_num_threads(), 2);
      qtb_set_num_threads_local(0);
      EXPECT_EQ(qtb_get_num_threads(), 6);
    });
    EXPECT_EQ(qtb_get_num_threads(), 2);
  });
}

TEST(SetNumThreads, by_its_generic_names_is_the_same) {
  on_eight_cores({}, [] {
    blas_set_num_threads(3);
    EXPECT_EQ(qtb_get_num_threads(), 3);
    qtb_set_num_threads(4);
    EXPECT_EQ(blas_get_num_threads(), 4);
  });
}

TEST(SetNumThreads, may_be_called_while_others_ask) {
  on_eight_cores({{"QTB_NUM_THREADS", "1"}}, [] {
    std::atomic<int> strange{0};
    on_threads(8, [&](int i) {
      for (int k = 0; k < 2000; ++k) {
        if (i < 2) qtb_set_num_threads(i + 2);
        const int threads = qtb_get_num_threads();
        if (threads < 1 || threads > 3) strange = threads;
      }
    });
    EXPECT_EQ(strange, 0);
  });
}

TEST(SetNumThreads, is_not_in_the_environment_of_the_first_read) {
  on_eight_cores({{"QTB_NUM_THREADS", "5"}}, [] {
    qtb_set_num_threads(3);
    EXPECT_TRUE(fake.environment_reads.empty());
    EXPECT_EQ(qtb_get_num_threads(), 3);
    EXPECT_EQ(fake.environment_reads.size(), 6U);
  });
}

TEST(GetTier, tells_what_the_processor_was_found_to_be) {
  for (int tier = 0; tier < tier_count; ++tier)
    on_eight_cores({{"QTB_DEBUG_CPU_TYPE", std::to_string(tier)}},
                   [&] { EXPECT_STREQ(qtb_get_tier(), tier_name(tier)); });
}

}  // namespace
}  // namespace qtb::test
