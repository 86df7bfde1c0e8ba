// What the suites of the surface share: seeds, the registration of a test per routine, the report, the handler of a
// trap.
#pragma once

#include <gtest/gtest.h>
#include <unistd.h>

#include <csignal>
#include <cstdlib>
#include <functional>

#include "tests/product/surface/session.h"

namespace qtb::surface {

// ---- counts and seeds ----

inline bool is_long() {
  const char *value = std::getenv("QTB_TEST_LONG");
  return value != nullptr && *value != '\0' && *value != '0';
}
inline int times(int count) { return is_long() ? 20 * count : count; }

// QTB_TEST_SEED starts the draws elsewhere.
inline std::uint64_t first_seed() {
  const char *value = std::getenv("QTB_TEST_SEED");
  return value != nullptr ? std::strtoull(value, nullptr, 10) : 20;
}

// A seed of its own for each routine and case.
inline std::uint64_t seed_of(const char *routine, int number) {
  std::uint64_t seed = first_seed() * 1000003;
  for (const char *c = routine; *c != '\0'; ++c) seed = seed * 131 + static_cast<unsigned char>(*c);
  return seed * 1000003 + static_cast<std::uint64_t>(number);
}

// ---- tests ----

inline const bool failures_are_the_tests_own = [] {
  report_failure = [](const char *problem, const char *what) { ADD_FAILURE() << problem << "\n" << what; };
  return true;
}();

class BodyTest : public testing::Test {
 public:
  explicit BodyTest(const std::function<void()> &body) : body_(body) {}
  void TestBody() override { body_(); }

 private:
  std::function<void()> body_;
};
inline void register_test(const char *suite, const char *name, const std::function<void()> &body) {
  testing::RegisterTest(suite, name, nullptr, nullptr, __FILE__, __LINE__,
                        [body]() -> testing::Test * { return new BodyTest(body); });
}

// ---- the program ----

// Names the problem that trapped.
inline void on_trap(int signal) {
  const auto put = [](const char *text) { (void)!write(STDERR_FILENO, text, std::strlen(text)); };
  put("\ntrapped in ");
  put(current_problem);
  put("\n");
  std::signal(signal, SIG_DFL);
  std::raise(signal);
}

inline void report() {
  long cases = 0;
  for (const auto &[routine, tally] : tallies()) {
    std::printf("%-8s %7ld cases, worst error / bound %.3f\n", routine.c_str(), tally.cases, tally.worst);
    cases += tally.cases;
  }
  if (cases == 0) return;
  const char *tier = std::getenv("QTB_DEBUG_CPU_TYPE");
  std::printf("tier %s: %ld cases from seed %llu\n", tier != nullptr ? tier : "(chosen)", cases,
              static_cast<unsigned long long>(first_seed()));
}

}  // namespace qtb::surface
