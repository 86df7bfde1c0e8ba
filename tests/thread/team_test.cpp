// The parallel region: the team that came, shares, barriers, work for all, and the caller's floating-point choice.

#include "blas/thread/team.h"

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <thread>
#include <vector>

namespace qtb {
namespace {

TEST(Team, EveryThreadFindsItselfInTheTeamThatCame) {
  for (const QtbInt asked : {1, 2, 3, 8}) {
    std::vector<std::atomic<int>> seen(static_cast<std::size_t>(asked));
    run_team(asked, [&](const Team &team) {
      EXPECT_EQ(team.size, asked);
      EXPECT_EQ(team.rank, omp_get_thread_num());
      EXPECT_EQ(this_team().rank, team.rank);
      ++seen[static_cast<std::size_t>(team.rank)];
    });
    for (const std::atomic<int> &times : seen) EXPECT_EQ(times, 1);
  }
  EXPECT_EQ(this_team().size, 1);
  EXPECT_EQ(this_team().rank, 0);
}

TEST(Team, SharesAreDealtOutInTurn) {
  for (QtbInt size = 1; size <= 9; ++size)
    for (QtbInt count = 0; count <= 30; ++count) {
      QtbInt dealt = 0;
      for (QtbInt rank = 0; rank < size; ++rank)
        for (const QtbInt i : Team{size, rank}.shares(count)) {
          ASSERT_EQ(i % size, rank);
          ASSERT_TRUE(i >= 0 && i < count);
          ++dealt;
        }
      ASSERT_EQ(dealt, count);
    }
}

TEST(Team, WorkForAllIsDoneByTheCallersThreadAheadOfAll) {
  const std::thread::id caller = std::this_thread::get_id();
  for (int run = 0; run < 20; ++run) {
    std::atomic<int> times{0}, ahead{0};
    run_team(4, [&](const Team &team) {
      team.once([&] {
        EXPECT_EQ(std::this_thread::get_id(), caller);
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
        ++times;
      });
      ahead += times == 1;
      team.meet();
      EXPECT_EQ(ahead, 4) << "a thread passed the barrier ahead of another";
    });
  }
}

TEST(Team, TheCallersChoiceHoldsInsideAndEachThreadsOwnBehind) {
  const auto choices = [] {
    std::vector<unsigned> all(4);
#pragma omp parallel num_threads(4)
    all[static_cast<std::size_t>(omp_get_thread_num())] = floating_choice();
    return all;
  };
  const unsigned before = _mm_getcsr();
  const std::vector<unsigned> own = choices();
  for (const unsigned choice : {0x5F80U /* up */, 0x9FC0U /* flush to zero, denormals are zero */}) {
    _mm_setcsr(choice);
    std::atomic<int> other{0};
    run_team(4, [&](const Team &) { other += floating_choice() != choice; });
    _mm_setcsr(before);
    EXPECT_EQ(other, 0);
    EXPECT_EQ(choices(), own);
  }
}

}  // namespace
}  // namespace qtb
