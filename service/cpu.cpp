// The tier of the process, decided once, and the tests of the processor behind it.
//
// There is no lock: threads that race on the first call run the whole decision, from the same inputs, and store the
// same value.

#include "service/cpu.h"

#include <atomic>
#include <cstdlib>

#include "service/cpuid.h"
#include "service/platform/platform.h"

namespace {

using namespace qtb::cpuid;

constexpr std::int32_t no_override = -666;  // outside every value that atoi's result may set the tier to

std::atomic<std::int32_t> cached_tier{-1};        // negative until decided
std::atomic<std::int32_t> asked_tiers{-1};        // -1 not looked at; else those asked for that are never taken unasked
std::atomic<std::int32_t> sse41_cached{-1};       // -1 until asked
std::atomic<std::int32_t> amd_family_cached{-1};  // -1 until tested

constexpr auto relaxed = std::memory_order_relaxed;

std::uint32_t feature_bits() { return platform_cpuid(leaf_features, 0).ecx; }

// What the lowest tier needs every processor has.
int qtb_serv_cpu_has_baseline() { return 1; }

enum Taken { by_itself, if_asked };
struct TierTest {
  int (*passes)();
  Taken taken;
};
#define QTB_TIER_TEST(tier, TIER, flags, processor, taken, ...) {qtb_serv_cpu_has_##processor, taken},
constexpr TierTest tier_tests[tier_count] = {QTB_TIER_ROWS(QTB_TIER_TEST)};
#undef QTB_TIER_TEST

// The tier that QTB_DEBUG_CPU_TYPE asks for, or no_override. A number may be followed by anything, except that 0 has to
// stand alone: every text without a number reads as 0.
std::int32_t tier_override() {
  char text[32];
  if (platform_environment("QTB_DEBUG_CPU_TYPE", text, sizeof text) == 0) return no_override;
  const std::int32_t number = std::atoi(text);
  if (number == 0) return text[0] == '0' && text[1] == '\0' ? 0 : no_override;
  return number > 0 && number <= qtb::largest_asked_tier ? number : no_override;
}

// The test of avx takes either of two bits; a library that takes the tier unasked wants both, and the registers saved.
bool may_take_unasked(std::int32_t tier) {
  if (tier < tier_avx) return true;
  constexpr std::uint32_t saves_state_and_has_avx = 3;
  constexpr std::uint64_t vector_registers = 6;
  return bits(feature_bits(), 27, 28) == saves_state_and_has_avx &&
         (platform_saved_state() & vector_registers) == vector_registers;
}

// From the highest tier down, the first whose test passes; no test is made behind it.
std::int32_t tier_of_processor() {
  if (qtb_serv_takes_best_tier) {
    for (std::int32_t tier = tier_count - 1; tier > tier_def; --tier)
      if (tier_tests[tier].passes() && may_take_unasked(tier)) return tier;
    return tier_def;
  }
  if (!qtb_serv_cpu_is_belmo()) return tier_def;
  const std::int32_t asked = asked_tiers.load(relaxed);
  for (std::int32_t tier = tier_count - 1; tier > tier_def; --tier) {
    const TierTest &test = tier_tests[tier];
    if ((test.taken == by_itself || (asked >> tier & 1) != 0) && test.passes()) return tier;
  }
  return tier_def;
}

}  // namespace

// The override wins on every processor, also where the instructions are missing: who sets it knows better.
ProcessorTier qtb_serv_cpu_detect() {
  const std::int32_t known = cached_tier.load(relaxed);
  if (known >= 0) return static_cast<ProcessorTier>(known);

  const std::int32_t asked = tier_override();
  if (asked_tiers.load(relaxed) == -1) asked_tiers.store(0, relaxed);
  if (asked != no_override && tier_tests[asked].taken == if_asked) asked_tiers.store(1 << asked, relaxed);
  const std::int32_t computed = tier_of_processor();
  const std::int32_t tier = asked != no_override ? asked : computed;
  cached_tier.store(tier, relaxed);
  return static_cast<ProcessorTier>(tier);
}

int qtb_serv_cpu_is_belmo() { return vendor_is(platform_cpuid(leaf_vendor, 0), vendor_belmo); }

// Bit 27 says that the operating system saves the extended state, bit 28 that the processor has AVX. Either one counts.
int qtb_serv_cpu_has_avx() { return bits(feature_bits(), 27, 28) != 0; }
int qtb_serv_cpu_has_sse42() { return bits(feature_bits(), 20, 20) != 0; }
int qtb_serv_cpu_has_sse41() { return bits(feature_bits(), 19, 19) != 0; }
int qtb_serv_cpu_has_ssse3() { return bits(feature_bits(), 9, 9) != 0; }
int qtb_serv_cpu_has_sse3() { return bits(feature_bits(), 0, 0) != 0; }

int qtb_serv_cpu_takes_sse41() {
  const std::int32_t known = sse41_cached.load(relaxed);
  if (known != -1) return known;
  const std::int32_t asked = qtb_serv_cpu_has_sse41();
  sse41_cached.store(asked, relaxed);
  return asked;
}

// A reader that comes while the first caller still tests may see 0, and takes the ordinary path that once.
int qtb_serv_cpu_is_amd_family16() {
  const std::int32_t known = amd_family_cached.load(relaxed);
  if (known != -1) return known;

  amd_family_cached.store(0, relaxed);
  if (!vendor_is(platform_cpuid(leaf_vendor, 0), vendor_amd)) return 0;
  const std::uint32_t signature = platform_cpuid(leaf_features, 0).eax;
  constexpr std::uint32_t base_family = 15, extended_family = 1;  // the family is their sum
  if (bits(signature, 8, 11) != base_family || bits(signature, 20, 27) != extended_family) return 0;
  amd_family_cached.store(1, relaxed);
  return 1;
}
