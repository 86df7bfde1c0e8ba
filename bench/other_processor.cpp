// What the processor says of itself, changed: so that a family of kernels that this processor does not take can be
// timed in whole calls. The library qtb_other_processor is this library with its look at the processor wrapped.
//
// QTB_BENCH_PROCESSOR in the environment says what to change:
//   no_sse41    the SSE4.1 bit is clear: ssse3 takes its base family
//   family16    an AMD processor of family 16: def takes its kernels with a tile of 4 x 4 in double precision

#include <cstdlib>
#include <cstring>

#include "service/cpuid.h"
#include "service/platform/platform.h"

// QTB_CPUID_SYMBOL is the symbol of platform_cpuid, which the linker wraps.
CpuidRegisters real_cpuid(std::uint32_t leaf, std::uint32_t subleaf) __asm__("__real_" QTB_CPUID_SYMBOL);
CpuidRegisters other_cpuid(std::uint32_t leaf, std::uint32_t subleaf) __asm__("__wrap_" QTB_CPUID_SYMBOL);

namespace {

bool is_asked_for(const char *change) {
  const char *processor = std::getenv("QTB_BENCH_PROCESSOR");
  return processor != nullptr && std::strcmp(processor, change) == 0;
}

constexpr std::uint32_t sse41_bit = 1U << 19;
constexpr std::uint32_t signature_of_family16 = 1U << 20 | 15U << 8;  // the extended family and the base family

}  // namespace

CpuidRegisters other_cpuid(std::uint32_t leaf, std::uint32_t subleaf) {
  using namespace qtb::cpuid;
  CpuidRegisters r = real_cpuid(leaf, subleaf);
  const bool no_sse41 = is_asked_for("no_sse41"), family16 = is_asked_for("family16");
  if (leaf == leaf_vendor && family16) {
    std::memcpy(&r.ebx, vendor_amd, 4);
    std::memcpy(&r.edx, vendor_amd + 4, 4);
    std::memcpy(&r.ecx, vendor_amd + 8, 4);
  }
  if (leaf == leaf_features) {
    if (no_sse41) r.ecx &= ~sse41_bit;
    if (family16) r.eax = signature_of_family16;
  }
  return r;
}
