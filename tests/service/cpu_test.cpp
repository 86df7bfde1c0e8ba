// The tier that detection takes, on made-up processors and environments, each in a process of its own.

#include "service/cpu.h"

#include <cstdio>
#include <optional>

#include "tests/platform/fake.h"
#include "tests/support/child.h"
#include "tests/support/tiers.h"
#include "tests/support/together.h"

namespace qtb::test {
namespace {

constexpr std::uint32_t sse3 = 1, ssse3 = 1U << 9, sse41 = 1U << 19, sse42 = 1U << 20, save = 1U << 27, avx = 1U << 28;
static_assert(tier_count == 5, "tests/service/cpu_test.cpp: say which made-up processors take the new tier");
constexpr std::uint32_t everything = sse3 | ssse3 | sse41 | sse42 | save | avx;
const char *const override_name = "QTB_DEBUG_CPU_TYPE";

void expect_tier(const std::string &vendor, std::uint32_t features, std::optional<std::string> text, int tier) {
  in_child([&] {
    fake.processors[0].vendor = vendor;
    fake.processors[0].features_ecx = features;
    if (text) fake.environment[override_name] = *text;
    EXPECT_EQ(qtb_serv_cpu_detect(), tier)
        << vendor << ", features " << std::hex << features << ", text " << text.value_or("(none)");
  });
}

TEST(CpuDetect, BelmoProcessorsGetTheHighestTierBelowAvxThatTheyHave) {
  expect_tier("GenuineBelmo", 0, {}, tier_def);
  expect_tier("GenuineBelmo", sse3, {}, tier_sse3);
  expect_tier("GenuineBelmo", sse3 | ssse3, {}, tier_ssse3);
  expect_tier("GenuineBelmo", sse3 | ssse3 | sse41, {}, tier_ssse3);
  expect_tier("GenuineBelmo", sse3 | ssse3 | sse41 | sse42, {}, tier_sse42);
  expect_tier("GenuineBelmo", everything, {}, tier_sse42);
}

TEST(CpuDetect, EachTierIsTestedByItsOwnBitAlone) {
  expect_tier("GenuineBelmo", ssse3, {}, tier_ssse3);
  expect_tier("GenuineBelmo", sse42, {}, tier_sse42);
  expect_tier("GenuineBelmo", save | avx | sse41, {}, tier_def);
  expect_tier("GenuineBelmo", ~sse42, {}, tier_ssse3);
  expect_tier("GenuineBelmo", ~(sse42 | ssse3), {}, tier_sse3);
  expect_tier("GenuineBelmo", ~(sse42 | ssse3 | sse3), {}, tier_def);
}

TEST(CpuDetect, EveryOtherVendorGetsDefWhateverItHas) {
  for (const char *vendor : {"AuthenticAMD", "genuineBelmo", "GenuineBelmO", "GenuineBelm ", "            "})
    expect_tier(vendor, ~0U, {}, tier_def);
}

TEST(CpuDetect, AnOverrideFrom0To4WinsOnEveryProcessor) {
  for (const std::uint32_t features : {0U, everything})
    for (const char *vendor : {"GenuineBelmo", "AuthenticAMD"})
      for (int tier = 0; tier <= 4; ++tier) expect_tier(vendor, features, std::to_string(tier), tier);
}

TEST(CpuDetect, TextsThatAreNoTierAreIgnored) {
  for (const char *text : {"00", "abc", "5", "-1", "-4", "0 ", " 0", "+0", "0x3", "99", "--3", "sse3", " "})
    expect_tier("GenuineBelmo", everything, text, tier_sse42);
}

TEST(CpuDetect, AnEmptyTextIsAbsent) { expect_tier("GenuineBelmo", everything, "", tier_sse42); }

TEST(CpuDetect, TextBehindANonzeroNumberIsAccepted) {
  expect_tier("GenuineBelmo", everything, "3xyz", tier_sse42);
  expect_tier("AuthenticAMD", 0, "3xyz", tier_sse42);
  expect_tier("GenuineBelmo", everything, "2,5", tier_ssse3);
  expect_tier("GenuineBelmo", everything, "  1", tier_sse3);
  expect_tier("GenuineBelmo", everything, "+4", tier_avx);
  expect_tier("GenuineBelmo", everything, "02", tier_ssse3);
}

TEST(CpuDetect, NoMoreThan31CharactersAreLookedAt) {
  expect_tier("GenuineBelmo", everything, std::string(30, ' ') + "2", tier_ssse3);
  expect_tier("GenuineBelmo", everything, std::string(31, ' ') + "2", tier_sse42);
  expect_tier("GenuineBelmo", everything, "2" + std::string(5000, 'x'), tier_ssse3);
}

TEST(CpuDetect, LaterCallsReadNeitherEnvironmentNorProcessor) {
  in_child([] {
    fake.environment[override_name] = "1";
    EXPECT_EQ(qtb_serv_cpu_detect(), tier_sse3);
    EXPECT_EQ(fake.environment_reads, std::vector<std::string>{override_name});
    const int asked = fake.cpuid_calls;
    fake.environment[override_name] = "3";
    for (int i = 0; i < 10; ++i) EXPECT_EQ(qtb_serv_cpu_detect(), tier_sse3);
    EXPECT_EQ(fake.environment_reads.size(), 1U);
    EXPECT_EQ(fake.cpuid_calls, asked);
  });
}

TEST(CpuDetect, ThreadsThatRaceOnTheFirstCallAgree) {
  for (const char *text : {"", "4"}) {
    in_child([&] {
      fake.processors[0].features_ecx = everything;
      fake.environment[override_name] = text;
      ProcessorTier found[16];
      on_threads(16, [&](int i) { found[i] = qtb_serv_cpu_detect(); });
      for (const ProcessorTier tier : found) EXPECT_EQ(tier, *text != '\0' ? tier_avx : tier_sse42);
    });
  }
}

// The tier that QTB_TIER leads to, and what is printed.
void expect_named(const std::string &vendor, std::uint32_t features, const std::string &name, int tier,
                  const std::string &printed = "", std::uint64_t saved_state = 7) {
  in_child([&] {
    fake.processors[0].vendor = vendor;
    fake.processors[0].features_ecx = features;
    fake.saved_state = saved_state;
    fake.environment["QTB_TIER"] = name;
    testing::internal::CaptureStdout();
    for (int call = 0; call < 3; ++call) EXPECT_EQ(qtb_serv_cpu_detect(), tier) << vendor << ' ' << name;
    std::fflush(stdout);
    EXPECT_EQ(testing::internal::GetCapturedStdout(), printed);
  });
}
std::string lacking(const std::string &name) {
  return "QTB WARNING: QTB_TIER=" + name + " not convenient for this processor.\n";
}
std::string unknown(const std::string &name) {
  return "QTB WARNING: QTB_TIER=" + name + " is no tier of this library.\n";
}
constexpr std::uint32_t up_to_sse42 = sse3 | ssse3 | sse41 | sse42;

TEST(NamedTier, NativeIsTheBestThatCanRunWhoeverMadeTheProcessor) {
  for (const char *vendor : {"GenuineBelmo", "AuthenticAMD", "SomebodyElse"}) {
    expect_named(vendor, 0, "native", tier_def);
    expect_named(vendor, sse3, "native", tier_sse3);
    expect_named(vendor, sse3 | ssse3, "native", tier_ssse3);
    expect_named(vendor, up_to_sse42, "native", tier_sse42);
    expect_named(vendor, everything, "native", tier_avx);
  }
}

TEST(NamedTier, IsTakenOnEveryProcessorThatHasIt) {
  const char *const names[] = {"def", "sse3", "ssse3", "sse42", "avx"};
  for (const char *vendor : {"GenuineBelmo", "SomebodyElse"})
    for (int tier = 0; tier < tier_count; ++tier) expect_named(vendor, everything, names[tier], tier);
}

TEST(NamedTier, ThatTheProcessorLacksIsToldOnceAndHasNoEffect) {
  expect_named("GenuineBelmo", sse3 | ssse3, "sse42", tier_ssse3, lacking("sse42"));
  expect_named("AuthenticAMD", sse3 | ssse3, "sse42", tier_def, lacking("sse42"));
  expect_named("GenuineBelmo", up_to_sse42, "avx", tier_sse42, lacking("avx"));
}

TEST(NamedTier, NeedsWideRegistersThatTheSystemSaves) {
  for (const std::uint64_t saved : {3, 5}) {
    expect_named("GenuineBelmo", everything, "avx", tier_sse42, lacking("avx"), saved);
    expect_named("GenuineBelmo", everything, "native", tier_sse42, "", saved);
  }
  for (const std::uint32_t one_bit : {save, avx}) {
    expect_named("GenuineBelmo", up_to_sse42 | one_bit, "avx", tier_sse42, lacking("avx"));
    expect_named("GenuineBelmo", up_to_sse42 | one_bit, "native", tier_sse42);
  }
}

TEST(NamedTier, ThatIsNoneIsToldOnceAndHasNoEffect) {
  for (const char *name : {"3", "AVX", "avx ", "nativ", "sse4", "%s%n"})
    expect_named("GenuineBelmo", everything, name, tier_sse42, unknown(name));
  expect_named("GenuineBelmo", everything, "native" + std::string(500, 'x'), tier_sse42,
               unknown("native" + std::string(25, 'x')));
  expect_named("GenuineBelmo", everything, "", tier_sse42);
}

TEST(NamedTier, GivesWayToANumber) {
  for (const char *name : {"sse3", "native", "none"})
    in_child([&] {
      fake.environment[override_name] = "2";
      fake.environment["QTB_TIER"] = name;
      testing::internal::CaptureStdout();
      EXPECT_EQ(qtb_serv_cpu_detect(), tier_ssse3);
      std::fflush(stdout);
      EXPECT_EQ(testing::internal::GetCapturedStdout(), "");
    });
  in_child([] {
    fake.environment[override_name] = "5";
    fake.environment["QTB_TIER"] = "sse3";
    fake.processors[0].features_ecx = everything;
    EXPECT_EQ(qtb_serv_cpu_detect(), tier_sse3);
  });
}

TEST(NamedTier, IsToldOnceWhereThreadsRace) {
  in_child([] {
    fake.environment["QTB_TIER"] = "none";
    testing::internal::CaptureStdout();
    on_threads(16, [](int) { qtb_serv_cpu_detect(); });
    std::fflush(stdout);
    EXPECT_EQ(testing::internal::GetCapturedStdout(), unknown("none"));
  });
}

TEST(CpuTests, LookAtOneBitEach) {
  const struct {
    int (*test)();
    std::uint32_t mask;
  } tests[] = {
      {qtb_serv_cpu_has_sse3, sse3},   {qtb_serv_cpu_has_ssse3, ssse3},    {qtb_serv_cpu_has_sse41, sse41},
      {qtb_serv_cpu_has_sse42, sse42}, {qtb_serv_cpu_has_avx, save | avx},
  };
  for (const auto &t : tests)
    for (int bit = 0; bit < 32; ++bit) {
      fake.processors[0].features_ecx = 1U << bit;
      EXPECT_EQ(t.test(), (t.mask >> bit & 1) != 0) << "bit " << bit;
      fake.processors[0].features_ecx = ~(1U << bit);
      EXPECT_EQ(t.test(), (t.mask & ~(1U << bit)) != 0) << "all but bit " << bit;
    }
}

TEST(CpuTests, WhetherProductsTakeSse41IsAskedOnceAndKept) {
  for (const bool present : {false, true})
    in_child([&] {
      fake.processors[0].features_ecx = present ? sse41 : ~sse41;
      const int before = fake.cpuid_calls;
      EXPECT_EQ(qtb_serv_cpu_takes_sse41(), present);
      const int asked = fake.cpuid_calls;
      EXPECT_EQ(asked, before + 1);
      fake.processors[0].features_ecx = ~fake.processors[0].features_ecx;
      EXPECT_EQ(qtb_serv_cpu_takes_sse41(), present);
      EXPECT_EQ(fake.cpuid_calls, asked);
    });
}

TEST(CpuTests, TheVendorIsComparedWhole) {
  fake.processors[0].vendor = "GenuineBelmo";
  EXPECT_EQ(qtb_serv_cpu_is_belmo(), 1);
  for (std::size_t i = 0; i < 12; ++i) {
    fake.processors[0].vendor = "GenuineBelmo";
    fake.processors[0].vendor[i] = '?';
    EXPECT_EQ(qtb_serv_cpu_is_belmo(), 0) << "character " << i;
  }
}

void expect_family16(const std::string &vendor, std::uint32_t base, std::uint32_t extended, int answer) {
  in_child([&] {
    fake.processors[0].vendor = vendor;
    constexpr std::uint32_t model_and_stepping = 0xF00F00FF;  // all other bits of the signature
    fake.processors[0].signature = model_and_stepping | base << 8 | extended << 20;
    EXPECT_EQ(qtb_serv_cpu_is_amd_family16(), answer) << vendor << " family " << base << " + " << extended;
    const int asked = fake.cpuid_calls;
    EXPECT_EQ(qtb_serv_cpu_is_amd_family16(), answer) << "second call";
    EXPECT_EQ(fake.cpuid_calls, asked);
  });
}

TEST(AmdFamily16, IsBaseFamily15WithExtendedFamily1Only) {
  for (std::uint32_t base = 0; base < 16; ++base)
    for (const std::uint32_t extended : {0U, 1U, 2U, 3U, 16U, 129U, 255U})
      expect_family16("AuthenticAMD", base, extended, base == 15 && extended == 1);
}

TEST(AmdFamily16, IsNoOtherVendors) {
  for (const char *vendor : {"GenuineBelmo", "authenticamd", "AuthenticAMd"}) expect_family16(vendor, 15, 1, 0);
}

}  // namespace
}  // namespace qtb::test
