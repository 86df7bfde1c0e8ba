// The cache table: filled at its first reader from the processor's deterministic cache parameters, then kept.

#include "service/cache.h"

#include <atomic>

#include "service/cpuid.h"
#include "service/memory.h"

namespace {

using namespace qtb::cpuid;

constexpr std::uint32_t max_levels = 7;      // data and unified levels that the table has room for
constexpr std::uint32_t max_subleaves = 32;  // where a list without an end is cut off
constexpr std::uint32_t type_end = 0, type_instruction = 2;

std::uint32_t cache_table[1 + max_levels];
std::atomic<std::uint32_t> cache_table_pending{1};  // cleared behind the last write to the table

// The leaf is read whatever the vendor and the highest leaf: a processor without it gives an empty list as a rule.
void fill_cache_table() {
  std::uint32_t count = 0;
  for (std::uint32_t subleaf = 0; subleaf < max_subleaves && count < max_levels; ++subleaf) {
    const CpuidRegisters cache = platform_cpuid(leaf_caches, subleaf);
    const std::uint32_t type = bits(cache.eax, 0, 4);
    if (type == type_end || cache.ebx == 0 || cache.ecx == 0) break;
    if (type == type_instruction) continue;
    const std::uint32_t line_size = bits(cache.ebx, 0, 11) + 1, partitions = bits(cache.ebx, 12, 21) + 1;
    const std::uint32_t ways = bits(cache.ebx, 22, 31) + 1, sets = cache.ecx + 1;
    cache_table[++count] = line_size * partitions * ways * sets;
  }
  cache_table[cache_count] = count;
}

}  // namespace

void qtb_serv_get_cache_sizes(std::uint32_t *out) {
  if (cache_table_pending.load(std::memory_order_acquire) != 0) {
    qtb_serv_lock();
    if (cache_table_pending.load(std::memory_order_relaxed) != 0) {
      fill_cache_table();
      cache_table_pending.store(0, std::memory_order_release);
    }
    qtb_serv_unlock();
  }
  if (out == nullptr) return;
  for (int entry = 0; entry < cache_size_entries; ++entry) out[entry] = cache_table[entry];
}
