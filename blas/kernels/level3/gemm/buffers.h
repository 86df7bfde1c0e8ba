// The work buffers of a GEMM body: one allocation, cut into the panel of A, the kernel's staging region and the panel
// of B.
//
// The panels begin on page boundaries, the staging region a few hundred bytes beyond a multiple of 128, so that the
// three do not meet in the same sets of a cache. A body that is given a panel does without that region. All families
// but the double-precision one of avx ask for the same size whatever the problem: a thread that repeats its requests
// then gets the same memory again (service/memory.h).
#pragma once

#include "blas/kernels/level3/gemm/tiles.h"
#include "service/memory.h"

namespace qtb::QTB_TIER {
namespace {

constexpr QtbInt page_bytes = 4096, region_boundary = 128, stage_offset = 256;

// The largest depth of a panel, of every family with fixed buffers.
constexpr QtbInt largest_depth = 256;

// From the rounded end of A, or from the start where there is none, to where B may begin: the staging region, with room
// for a micro-panel of B of the largest depth, each element doubled where a family's kernel does that. More where a
// kernel asks for more.
template <class T, Family family>
constexpr QtbInt stage_room(QtbInt kb, QtbInt stage_bytes) {
  if constexpr (this_tier == tier_avx && kind_of<T> == 'd') return kb * 128 + 768;
  return larger(family == Family::sse41 ? 8960 : 17152, round_up(stage_offset + stage_bytes, region_boundary));
}

// What the boundaries of the regions cost at most, by the regions that are wanted.
constexpr QtbInt slack_for_both = 20992, slack_for_b = 12800, slack_for_a = 12288, slack_for_none = 4096;

template <class T>
struct GemmBuffers {
  void *allocation;  // what qtb_serv_free gets; null where memory is out, and the body then takes the small path
  T *a, *b, *stage;
};

// Bytes of the region of A: mb rows of kb. Fixed: the largest mb of the family.
template <class T, Family family>
constexpr QtbInt a_region_bytes(QtbInt mb, QtbInt kb) {
  constexpr GemmRules rules = rules_of<T, family>;
  constexpr QtbInt width = sizeof(T);
  if constexpr (this_tier == tier_avx && kind_of<T> == 'd') return mb * kb * width;
  if constexpr (rules.mb.rule == Rows::area_of_k || rules.mb.rule == Rows::area_of_kb) return rules.mb.value * width;
  return rules.mb.value * largest_depth * width;
}
template <class T, Family family>
constexpr QtbInt b_region_bytes(QtbInt nb, QtbInt kb) {
  constexpr GemmRules rules = rules_of<T, family>;
  constexpr QtbInt width = sizeof(T);
  if constexpr (this_tier == tier_avx && kind_of<T> == 'd') return nb * kb * width;
  return rules.nb.cap * largest_depth * width;
}

inline std::uintptr_t up_to(std::uintptr_t address, QtbInt boundary) {
  const std::uintptr_t step = static_cast<std::uintptr_t>(boundary);
  return (address + step - 1) / step * step;
}

// Bytes of the allocation. A zero mb or nb: the region of A or of B is not wanted. stage_bytes: what the kernel wants
// for the largest depth.
template <class T, Family family>
constexpr QtbInt buffer_bytes(QtbInt mb, QtbInt nb, QtbInt kb, QtbInt stage_bytes) {
  const QtbInt a_bytes = mb == 0 ? 0 : a_region_bytes<T, family>(mb, kb);
  const QtbInt b_bytes = nb == 0 ? 0 : b_region_bytes<T, family>(nb, kb);
  const QtbInt slack = mb != 0 ? (nb != 0 ? slack_for_both : slack_for_a) : (nb != 0 ? slack_for_b : slack_for_none);
  return a_bytes + b_bytes + stage_room<T, family>(kb, stage_bytes) + slack;
}

// The pointer to a region that is not wanted is of no use.
template <class T, Family family>
GemmBuffers<T> get_buffers(QtbInt mb, QtbInt nb, QtbInt kb, QtbInt stage_bytes) {
  void *allocation =
      qtb_serv_malloc(static_cast<std::uint64_t>(buffer_bytes<T, family>(mb, nb, kb, stage_bytes)), region_boundary);
  const std::uintptr_t start = reinterpret_cast<std::uintptr_t>(allocation), a = up_to(start, page_bytes);
  const std::uintptr_t after_a = mb == 0 ? start : a + static_cast<std::uintptr_t>(a_region_bytes<T, family>(mb, kb));
  const std::uintptr_t end_of_a = up_to(after_a, region_boundary);
  const std::uintptr_t stage = end_of_a + static_cast<std::uintptr_t>(stage_offset);
  const std::uintptr_t b =
      up_to(end_of_a + static_cast<std::uintptr_t>(stage_room<T, family>(kb, stage_bytes)), page_bytes);
  return {allocation, reinterpret_cast<T *>(a), reinterpret_cast<T *>(b), reinterpret_cast<T *>(stage)};
}

template <class T>
void free_buffers(const GemmBuffers<T> &buffers) {
  qtb_serv_free(buffers.allocation);
}

}  // namespace
}  // namespace qtb::QTB_TIER
