// A piece of a test in a process of its own: state that a process sets once can so be set anew for every case.
#pragma once

#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>

namespace qtb::test {

// Runs body in a forked child, ended by an alarm after so many seconds, and fails if the child fails or dies. What the
// child expects is reported by the child itself.
template <class Body>
void in_child(Body body, unsigned seconds = 20) {
  std::fflush(nullptr);
  const pid_t child = fork();
  ASSERT_NE(child, -1);
  if (child == 0) {
    alarm(seconds);
    body();
    std::fflush(nullptr);
    _exit(::testing::Test::HasFailure() ? 1 : 0);
  }
  int status = 0;
  ASSERT_EQ(waitpid(child, &status, 0), child);
  ASSERT_TRUE(WIFEXITED(status)) << "the child ended with signal " << WTERMSIG(status);
  EXPECT_EQ(WEXITSTATUS(status), 0) << "the child failed";
}

}  // namespace qtb::test
