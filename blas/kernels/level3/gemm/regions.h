// The regions of a GEMM body's one allocation: the panel of A, the kernel's staging region and the panel of B, in
// bytes.
//
// A body that gets a panel, or does without, does without its region: a zero mb or nb says so. The same in every tier's
// build and outside of them.
#pragma once

#include "blas/kernels/level3/gemm/tiles.h"

namespace qtb::tiles {
namespace {

constexpr QtbInt page_bytes = 4096, region_boundary = 128, stage_offset = 256;

// The largest depth of a panel, of every family that asks for its largest blocks.
constexpr QtbInt largest_depth = 256;

// What the boundaries of the regions cost at most, by the regions that are wanted.
constexpr QtbInt slack_for_both = 20992, slack_for_b = 12800, slack_for_a = 12288, slack_for_none = 4096;

struct Regions {
  QtbInt a, b;         // the panels
  QtbInt from_a_to_b;  // from the rounded end of A, or from the start where there is none, to where B may begin
  QtbInt slack;
  constexpr QtbInt total() const { return a + b + from_a_to_b + slack; }
};

// width: bytes of an element. stage_per_k: bytes of the staging region that the kernel wants per step of depth.
constexpr Regions regions_of(const GemmRules &rules, QtbInt width, QtbInt mb, QtbInt nb, QtbInt kb,
                             QtbInt stage_per_k) {
  const auto [request, bytes] = rules.buffers;
  if (request == Request::tight) {
    const QtbInt stage = stage_offset + stage_per_k * kb;
    return {mb * kb * width, nb * kb * width, stage, bytes - stage_offset};
  }
  const QtbInt slack = mb != 0 ? (nb != 0 ? slack_for_both : slack_for_a) : (nb != 0 ? slack_for_b : slack_for_none);
  if (request == Request::of_blocks) return {mb * kb * width, nb * kb * width, kb * 4 * 32 + bytes, slack};
  const bool is_area = rules.mb.rule == Rows::area_of_k || rules.mb.rule == Rows::area_of_kb;
  const QtbInt largest_a = is_area ? rules.mb.value : rules.mb.value * largest_depth;
  return {mb == 0 ? 0 : largest_a * width, nb == 0 ? 0 : rules.nb.cap * largest_depth * width,
          larger(bytes, round_up(stage_offset + stage_per_k * largest_depth, region_boundary)), slack};
}

}  // namespace
}  // namespace qtb::tiles
