// The tier of the process, decided once, and the tests of the processor behind it.
//
// There is no lock: threads that race on the first call run the whole decision, from the same inputs, and store the
// same value.

#include "service/cpu.h"

#include <atomic>
#include <cstdlib>
#include <cstring>

#include "blas/tier_names.h"
#include "service/cpuid.h"
#include "service/messages.h"
#include "service/platform/platform.h"

namespace {

using namespace qtb::cpuid;

constexpr std::int32_t no_override = -666;  // outside every value that atoi's result may set the tier to

std::atomic<std::int32_t> cached_tier{-1};        // negative until decided
std::atomic<std::int32_t> asked_tiers{-1};        // -1 not looked at; else those asked for that are never taken unasked
std::atomic<std::int32_t> sse41_cached{-1};       // -1 until asked
std::atomic<std::int32_t> amd_family_cached{-1};  // -1 until tested

std::atomic<bool> tier_warned{false};  // that QTB_TIER has no effect

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

// Whether the processor and the operating system have what the tier needs. The test of avx takes either of two bits;
// here both are wanted, and that the registers are saved.
bool can_run(std::int32_t tier) {
  if (!tier_tests[tier].passes()) return false;
  if (tier < tier_avx) return true;
  constexpr std::uint32_t saves_state_and_has_avx = 3;
  constexpr std::uint64_t vector_registers = 6;
  return bits(feature_bits(), 27, 28) == saves_state_and_has_avx &&
         (platform_saved_state() & vector_registers) == vector_registers;
}

// The best that can run, whoever made the processor.
std::int32_t native_tier() {
  std::int32_t tier = tier_count - 1;
  while (tier > tier_def && !can_run(tier)) --tier;
  return tier;
}

// The tier that QTB_TIER asks for, or no_override. What cannot be had is told once.
std::int32_t named_tier() {
  char text[32];
  const std::size_t length = platform_environment("QTB_TIER", text, sizeof text);
  if (length == 0) return no_override;
  MessageNumber why = message_no_such_tier;
  if (length < sizeof text) {
    if (std::strcmp(text, "native") == 0) return native_tier();
    for (std::int32_t tier = 0; tier < tier_count; ++tier) {
      if (std::strcmp(text, qtb::tier_names[tier]) != 0) continue;
      if (can_run(tier)) return tier;
      why = message_tier_lacking;
    }
  }
  if (!tier_warned.exchange(true, relaxed)) qtb_serv_print(0, why, 1, text);
  return no_override;
}

// From the highest tier down, the first whose test passes; no test is made behind it.
std::int32_t tier_of_processor() {
  if (qtb_serv_takes_best_tier) return native_tier();
  if (!qtb_serv_cpu_is_belmo()) return tier_def;
  const std::int32_t asked = asked_tiers.load(relaxed);
  for (std::int32_t tier = tier_count - 1; tier > tier_def; --tier) {
    const TierTest &test = tier_tests[tier];
    if ((test.taken == by_itself || (asked >> tier & 1) != 0) && test.passes()) return tier;
  }
  return tier_def;
}

}  // namespace

// The override by number wins on every processor, also where the instructions are missing: who sets it knows better.
// The one by name, which is read where there is no number, wins where it can run.
ProcessorTier qtb_serv_cpu_detect() {
  const std::int32_t known = cached_tier.load(relaxed);
  if (known >= 0) return static_cast<ProcessorTier>(known);

  const std::int32_t asked = tier_override();
  if (asked_tiers.load(relaxed) == -1) asked_tiers.store(0, relaxed);
  if (asked != no_override && tier_tests[asked].taken == if_asked) asked_tiers.store(1 << asked, relaxed);
  const std::int32_t computed = tier_of_processor();
  const std::int32_t named = asked != no_override ? asked : named_tier();
  const std::int32_t tier = named != no_override ? named : computed;
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
