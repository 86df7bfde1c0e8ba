// The tier that a companion takes by itself, on made-up processors, each in a process of its own.
#include <gtest/gtest.h>

#include "service/cpu.h"
#include "tests/platform/fake.h"

const bool qtb_serv_takes_best_tier = true;

namespace qtb::test {
namespace {

constexpr std::uint32_t sse3 = 1U << 0, ssse3 = 1U << 9, sse41 = 1U << 19, sse42 = 1U << 20, save = 1U << 27,
                        avx = 1U << 28;
constexpr std::uint32_t up_to_sse42 = sse3 | ssse3 | sse41 | sse42;

// The exit status of a child is the tier.
void expect_tier(const char *vendor, std::uint32_t features, std::uint64_t saved_state, ProcessorTier expected) {
  EXPECT_EXIT(
      {
        fake.processors[0].vendor = vendor;
        fake.processors[0].features_ecx = features;
        fake.saved_state = saved_state;
        std::exit(qtb_serv_cpu_detect());
      },
      testing::ExitedWithCode(expected), "")
      << vendor << " " << features;
}

TEST(BestTier, is_the_highest_that_the_processor_has_whoever_made_it) {
  for (const char *vendor : {"GenuineBelmo", "AuthenticAMD", "SomebodyElse"}) {
    expect_tier(vendor, 0, 7, tier_def);
    expect_tier(vendor, sse3, 7, tier_sse3);
    expect_tier(vendor, sse3 | ssse3, 7, tier_ssse3);
    expect_tier(vendor, up_to_sse42, 7, tier_sse42);
    expect_tier(vendor, up_to_sse42 | save | avx, 7, tier_avx);
  }
}

TEST(BestTier, needs_wide_registers_that_the_system_saves) {
  expect_tier("GenuineBelmo", up_to_sse42 | avx, 7, tier_sse42);
  expect_tier("GenuineBelmo", up_to_sse42 | save, 7, tier_sse42);
  expect_tier("GenuineBelmo", up_to_sse42 | save | avx, 3, tier_sse42);
  expect_tier("GenuineBelmo", up_to_sse42 | save | avx, 5, tier_sse42);
}

TEST(BestTier, gives_way_to_the_environment) {
  EXPECT_EXIT(
      {
        fake.environment["QTB_DEBUG_CPU_TYPE"] = "1";
        fake.processors[0].features_ecx = up_to_sse42 | save | avx;
        std::exit(qtb_serv_cpu_detect());
      },
      testing::ExitedWithCode(tier_sse3), "");
}

}  // namespace
}  // namespace qtb::test
