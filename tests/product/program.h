// The main program of a suite of the whole library: one process runs one tier, told by QTB_DEBUG_CPU_TYPE.
#pragma once

#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>

#include "tests/support/tiers.h"

namespace qtb::test {

constexpr int exit_skipped = 77;  // what ctest takes as skipped

// False, with a line that says so, where QTB_DEBUG_CPU_TYPE asks for a tier that this processor lacks.
inline bool processor_runs_forced_tier() {
  const char *forced = std::getenv("QTB_DEBUG_CPU_TYPE");
  if (forced == nullptr) return true;
  const int tier = std::atoi(forced);
  if (tier < 0 || tier >= tier_count || processor_runs(tier)) return true;
  std::printf("skipped: this processor lacks the instructions of tier %s\n", tier_name(tier));
  return false;
}

}  // namespace qtb::test
