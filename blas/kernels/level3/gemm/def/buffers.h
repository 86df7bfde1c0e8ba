// The work buffers of the bodies of def and sse3: one allocation for the problem at hand, cut into the panel of A, the
// kernel's staging region and the panel of B.
#pragma once

#include "blas/kernels/level3/gemm/buffers.h"

namespace qtb::QTB_TIER {
namespace {

// What the boundaries between the regions cost at most, with room to spare: four pages and what keeps the stage apart.
constexpr QtbInt slack_of_regions = 4 * page_bytes + 1280;

// A and B begin on page boundaries, A beyond the start of the allocation.
template <class T>
GemmBuffers<T> get_buffers_for(QtbInt mb, QtbInt nb, QtbInt kb, QtbInt stage_bytes, QtbInt slack) {
  constexpr QtbInt width = sizeof(T);
  const QtbInt size = stage_bytes + kb * mb * width + kb * nb * width + slack;
  void *allocation = qtb_serv_malloc(static_cast<std::uint64_t>(size), region_boundary);
  const std::uintptr_t a = up_to(reinterpret_cast<std::uintptr_t>(allocation) + 1, page_bytes);
  const std::uintptr_t stage = up_to(a + static_cast<std::uintptr_t>(kb * mb * width), region_boundary) +
                               static_cast<std::uintptr_t>(stage_offset);
  const std::uintptr_t b = up_to(stage + static_cast<std::uintptr_t>(stage_bytes), page_bytes);
  return {allocation, reinterpret_cast<T *>(a), reinterpret_cast<T *>(b), reinterpret_cast<T *>(stage)};
}

}  // namespace
}  // namespace qtb::QTB_TIER
