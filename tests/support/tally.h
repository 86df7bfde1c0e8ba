// What a suite did: cases per tier and the worst error / bound per routine, printed when its program ends.
#pragma once

#include <gtest/gtest.h>

#include <cmath>
#include <cstdio>
#include <map>
#include <string>

#include "tests/support/tiers.h"

namespace qtb::test {

struct Tally {
  long cases[tier_count] = {};
  double worst[tier_count] = {};
  bool bounded = false;

  void exact(int tier) { ++cases[tier]; }
  // One case whose worst error / bound is ratio.
  void within(int tier, double ratio) {
    ++cases[tier];
    bounded = true;
    worst[tier] = std::fmax(worst[tier], ratio);
  }
};

class TallyReport : public ::testing::Environment {
 public:
  static Tally &of(const char *routine) { return tallies()[routine]; }
  void TearDown() override {
    for (const auto &[routine, tally] : tallies()) {
      std::printf("%-8s cases", routine.c_str());
      for (int tier = 0; tier < tier_count; ++tier) std::printf(" %s %ld", tier_name(tier), tally.cases[tier]);
      double worst = 0;
      for (const double ratio : tally.worst) worst = std::fmax(worst, ratio);
      if (tally.bounded)
        std::printf("; worst error/bound %.3f\n", worst);
      else
        std::printf("; exact\n");
    }
  }

 private:
  static std::map<std::string, Tally> &tallies() {
    static std::map<std::string, Tally> all;
    return all;
  }
};

inline ::testing::Environment *const tally_report = ::testing::AddGlobalTestEnvironment(new TallyReport);

}  // namespace qtb::test
