// A piece of a test in a process of its own: state that a process sets once can so be set anew for every case, and what
// a process prints or dies of can be looked at.
#pragma once

#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <string>

namespace qtb::test {

// What a limit in seconds is multiplied with where every load and store is watched: such code is several times slower,
// and threads that spin for a lock on a busy machine keep the one that holds it waiting all the longer.
#if defined(QTB_WATCHED)
inline constexpr unsigned patience = 10;
#else
inline constexpr unsigned patience = 1;
#endif

// Runs body in a forked child, ended by an alarm after so many seconds, and fails if the child fails or dies. What the
// child expects is reported by the child itself.
template <class Body>
void in_child(Body body, unsigned seconds = 20) {
  std::fflush(nullptr);
  const pid_t child = fork();
  ASSERT_NE(child, -1);
  if (child == 0) {
    alarm(seconds * patience);
    body();
    std::fflush(nullptr);
    _exit(::testing::Test::HasFailure() ? 1 : 0);
  }
  int status = 0;
  ASSERT_EQ(waitpid(child, &status, 0), child);
  ASSERT_TRUE(WIFEXITED(status)) << "the child ended with signal " << WTERMSIG(status);
  EXPECT_EQ(WEXITSTATUS(status), 0) << "the child failed";
}

struct ChildResult {
  int exit_status = -1;  // -1 where a signal ended it
  std::string output;    // what it wrote to standard output
};

// Runs body in a forked child, ended by an alarm after so many seconds, and returns how it ended. Where body returns,
// the child ends with status 0 and without flushing its streams, so that only what the code under test flushed is seen.
template <class Body>
ChildResult capture_child(Body body, unsigned seconds = 20) {
  std::fflush(nullptr);
  std::FILE *const captured = std::tmpfile();
  if (captured == nullptr) std::abort();
  const pid_t child = fork();
  if (child < 0) std::abort();
  if (child == 0) {
    alarm(seconds * patience);
    dup2(fileno(captured), STDOUT_FILENO);
    body();
    _exit(0);
  }
  ChildResult result;
  int status = 0;
  if (waitpid(child, &status, 0) == child && WIFEXITED(status)) result.exit_status = WEXITSTATUS(status);
  std::rewind(captured);
  char chunk[4096];
  for (std::size_t got; (got = std::fread(chunk, 1, sizeof chunk, captured)) > 0;) result.output.append(chunk, got);
  std::fclose(captured);
  return result;
}

}  // namespace qtb::test
