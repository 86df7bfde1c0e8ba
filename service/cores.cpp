// The core probe: visits every processor and reads its identifier there.
//
// An identifier has the thread in its core in the lowest bits, the core in its package above, the package on top. Two
// processors whose identifiers agree in core and package share a core. The widths of the fields come from the counts
// that the processor reports; other vendors report none here, and all their processors count as cores. Identifiers are
// the 8 bits of the initial one, so that no more than 256 cores are told apart.

#include <bit>

#include "service/cpuid.h"
#include "service/threads.h"

namespace {

using namespace qtb::cpuid;

// Logical processors and cores per package, as the processor that the thread is on reports them.
struct PackageCounts {
  std::uint32_t logical, cores;
};

PackageCounts package_counts() {
  const CpuidRegisters vendor = platform_cpuid(leaf_vendor, 0);
  const auto highest_leaf = static_cast<std::int32_t>(vendor.eax);
  if (highest_leaf < 1 || !vendor_is(vendor, vendor_belmo)) return {1, 1};
  const CpuidRegisters features = platform_cpuid(leaf_features, 0);
  if (bits(features.edx, 28, 28) == 0) return {1, 1};
  const std::uint32_t cores = highest_leaf >= 4 ? bits(platform_cpuid(leaf_caches, 0).eax, 26, 31) + 1 : 1;
  return {bits(features.ebx, 16, 23), cores};
}

// Bits that hold the numbers below count, of which the lowest 16 bits are looked at.
int field_width(std::uint32_t count) { return static_cast<int>(std::bit_width((count - 1) & 0xFFFFU)); }

// The core's and the package's part of this processor's identifier.
std::uint8_t core_identifier(std::uint32_t logical_per_core) {
  const std::uint32_t id = bits(platform_cpuid(leaf_features, 0).ebx, 24, 31);
  const PackageCounts counts = package_counts();
  const int thread_width = field_width(logical_per_core), core_width = field_width(counts.cores);
  constexpr std::uint32_t all = 255;
  const std::uint32_t core = id & (all << thread_width ^ all << (thread_width + core_width));
  const std::uint32_t package = id & all << field_width(counts.logical);
  return static_cast<std::uint8_t>(core | package);
}

int one_beyond_last(const ProcessorSet &set) {
  for (int w = ProcessorSet::max_words; w > 0; --w)
    if (set.words[w - 1] != 0) return w * ProcessorSet::word_bits - std::countl_zero(set.words[w - 1]);
  return 0;
}

}  // namespace

void qtb_serv_count_cores(std::int32_t *logical, std::int32_t *physical) {
  *physical = 1;
  ProcessorSet process, online;
  if (!platform_processors(&process, &online) || process != online) return;

  const PackageCounts counts = package_counts();
  const std::uint32_t logical_per_core = counts.logical / counts.cores;
  std::uint8_t identifiers[ProcessorSet::capacity] = {};
  std::int32_t visited = 0;
  const int processors = one_beyond_last(online);
  for (int p = 0; p < processors; ++p) {
    ProcessorSet one = {};
    one.insert(p);
    if (!platform_bind_thread(&one)) continue;
    platform_yield();
    identifiers[p] = core_identifier(logical_per_core);
    ++visited;
  }
  platform_bind_thread(&process);
  platform_yield();

  *logical = visited;
  if (visited < 2) return;
  // The first so many entries, although after a hole or a refused processor they are not the ones that were visited.
  bool seen[256] = {};
  std::int32_t cores = 0;
  for (std::int32_t i = 0; i < visited; ++i) {
    if (!seen[identifiers[i]]) ++cores;
    seen[identifiers[i]] = true;
  }
  *physical = cores;
}
