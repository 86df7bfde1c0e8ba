// The sizes of the processor's caches.
#pragma once

#include <cstdint>

#include "blas/types.h"

// The entries of the table that qtb_serv_get_cache_sizes hands out.
enum CacheSizeEntry : int {
  cache_count,       // levels recorded, instruction caches not among them; 0 where the processor does not tell
  cache_first_size,  // bytes of the nearest data or unified cache, as a whole: no share of a core and no total
  cache_second_size,
  cache_third_size,
  cache_fourth_size,
  cache_size_entries
};

// Copies the table to out, cache_size_entries numbers, where out is not null. The processor is asked once per process.
extern "C" QTB_HIDDEN void qtb_serv_get_cache_sizes(std::uint32_t *out);

// Whether a level of such a table is small: of at most so many bytes. A level that the processor does not report is,
// too, unless it reports none at all. Inlined always, so that no build emits a procedure.
[[gnu::always_inline]] constexpr bool cache_is_small(const std::uint32_t *sizes, CacheSizeEntry level,
                                                     std::uint32_t bytes) {
  return sizes[cache_count] != 0 && sizes[level] <= bytes;
}

// The limits by which products choose their blocks and their strategies.
constexpr std::uint32_t small_second_cache_bytes = 3145728, small_third_cache_bytes = 4194304;
