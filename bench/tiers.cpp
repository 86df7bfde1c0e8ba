// The tiers, one line each, for the scripts of the benchmarks: number, name, and whether this processor runs it.

#include <cstdio>

#include "tests/support/tiers.h"

int main() {
  for (int tier = 0; tier < tier_count; ++tier)
    std::printf("%d %s %s\n", tier, qtb::test::tier_name(tier), qtb::test::processor_runs(tier) ? "runs" : "lacks");
  return 0;
}
