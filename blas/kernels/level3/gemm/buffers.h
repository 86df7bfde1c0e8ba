// The work buffers of a GEMM body: one allocation, cut into the regions of regions.h.
//
// The panels begin on page boundaries, the staging region a few hundred bytes beyond a multiple of 128, so that the
// three do not meet in the same sets of a cache.
#pragma once

#include "blas/kernels/level3/gemm/family.h"
#include "blas/kernels/level3/gemm/regions.h"
#include "service/memory.h"

namespace qtb::QTB_TIER {
namespace {

template <class T>
struct GemmBuffers {
  void *allocation;  // what qtb_serv_free gets; null where memory is out, and the body then takes the small path
  T *a, *b, *stage;
};

inline std::uintptr_t up_to(std::uintptr_t address, QtbInt boundary) {
  const std::uintptr_t step = static_cast<std::uintptr_t>(boundary);
  return (address + step - 1) / step * step;
}

// A zero mb or nb: the region of A or of B is not wanted, and the pointer to it is of no use.
template <class T, Family family>
[[gnu::always_inline]] inline GemmBuffers<T> get_buffers(QtbInt mb, QtbInt nb, QtbInt kb, QtbInt stage_per_k) {
  constexpr GemmRules rules = rules_of<T, family>;
  const Regions regions = regions_of(rules, sizeof(T), mb, nb, kb, stage_per_k);
  void *allocation = qtb_serv_malloc(static_cast<std::uint64_t>(regions.total()), region_boundary);
  const std::uintptr_t start = reinterpret_cast<std::uintptr_t>(allocation);
  const std::uintptr_t a = up_to(rules.buffers.request == Request::tight ? start + 1 : start, page_bytes);
  const std::uintptr_t end_of_a = up_to(mb == 0 ? start : a + static_cast<std::uintptr_t>(regions.a), region_boundary);
  const std::uintptr_t stage = end_of_a + static_cast<std::uintptr_t>(stage_offset);
  const std::uintptr_t b = up_to(end_of_a + static_cast<std::uintptr_t>(regions.from_a_to_b), page_bytes);
  return {allocation, reinterpret_cast<T *>(a), reinterpret_cast<T *>(b), reinterpret_cast<T *>(stage)};
}

template <class T>
void free_buffers(const GemmBuffers<T> &buffers) {
  qtb_serv_free(buffers.allocation);
}

}  // namespace
}  // namespace qtb::QTB_TIER
