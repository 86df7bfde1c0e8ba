// The plan of one parallel GEMM: which strategy cuts it, on how many threads, in what blocks, with which routines.
//
// A driver fills a plan's nthreads, machine_class and cache table; a selector does the rest. Every thread of the region
// has a plan of its own and computes the same one, so that threads share nothing but the packed panels.
#pragma once

#include "blas/shapes.h"
#include "service/cache.h"

namespace qtb {

// The keys of the tuned tables, worked out at each call.
enum GemmMachineClass : std::int32_t {
  machine_plain,           // tiers def (but for machine_family16) and sse3
  machine_ssse3,           // tier ssse3 without SSE4.1
  machine_sse41_large_l2,  // tier ssse3 with SSE4.1; the second cache level large, or none reported
  machine_sse42,
  machine_sse41_small_l2,  // tier ssse3 with SSE4.1, the second cache level small
  machine_avx,
  machine_family16,  // tier def on the processor family that has kernels of its own
  machine_class_count
};

// The types of the routines that plans hold.
template <class T>
using GemmRoutine = QTB_FUNCTION_TYPE(gemm, T);
template <class T>
using BpackedRoutine = QTB_FUNCTION_TYPE(gemm_bpacked, T);
template <class T>
using ApackedRoutine = QTB_FUNCTION_TYPE(gemm_apacked, T);
template <class T>
using PackedRoutine = QTB_FUNCTION_TYPE(gemm_packed, T);
template <class T>
using PanelCopyRoutine = QTB_FUNCTION_TYPE(panel_copy, T);
template <class T>
using BlocksRoutine = QTB_FUNCTION_TYPE(blocks, T);

// What a strategy calls on each thread's share; which member holds follows from the strategy.
template <class T>
union GemmKernel {
  GemmRoutine<T> *gemm;
  BpackedRoutine<T> *bpacked;
  ApackedRoutine<T> *apacked;
  PackedRoutine<T> *packed;
};

template <class T>
struct GemmPlan;
template <class T>
struct GemmPanelSet;

// A partition strategy: C := alpha*op(A)*op(B) + beta*C by every thread of the running team together. beta is the
// working beta; strategies that revisit C need it to be 1.
#define QTB_PARAMS_GEMM_STRATEGY(T) \
  QTB_PARAMS_gemm(T), const qtb::GemmPanelSet<T> *panel_set, const qtb::GemmPlan<T> *plan
#define QTB_ARGS_GEMM_STRATEGY QTB_ARGS(gemm), panel_set, plan
template <class T>
using GemmStrategy = void(QTB_PARAMS_GEMM_STRATEGY(T));

template <class T>
struct GemmPlan {
  QtbInt nthreads;              // threads taking part: the team, then rounded by the selector
  QtbInt grid_rows, grid_cols;  // the thread grid, where the strategy has one
  QtbInt mb, nb, kb;            // block sizes; the block query fills in those that are 0
  GemmKernel<T> kernel;
  GemmStrategy<T> *strategy;           // null until selected
  PanelCopyRoutine<T> *acopy, *bcopy;  // the packing of this op(A) and op(B)
  T *a_shared, *b_shared;              // the shared panels, at a multiple of panel_alignment
  bool a_is_n, b_is_n, a_is_t, b_is_t;
  std::int32_t a_buffers, b_buffers;  // how many shared panels the region allocates
  GemmMachineClass machine_class;
  std::uint32_t cache[cache_size_entries];
};

template <class T>
struct GemmPanelSet {
  QtbInt mu, nu, ku;                    // the kernel's multiples of m, n and k, from the block query
  QtbInt a_panel_bytes, b_panel_bytes;  // of one shared panel, with what rounding its address may take
  BlocksRoutine<T> *blocks;             // the block query; null where the strategy needs no blocks
  PanelCopyRoutine<T> *acopy_n, *acopy_t, *acopy_c, *bcopy_n, *bcopy_t, *bcopy_c;
};

// Packed panels begin at page boundaries; each has so many bytes more than its elements, which pay for that.
constexpr QtbInt panel_alignment = 4096, panel_spare_bytes = 8704;
// What the memory service is asked to align the allocations themselves to.
constexpr std::int32_t panel_allocation_alignment = 128;

template <class T>
constexpr QtbInt panel_bytes(QtbInt extent, QtbInt kb) {
  return extent * kb * static_cast<QtbInt>(sizeof(T)) + panel_spare_bytes;
}

// The first multiple of panel_alignment at or behind an address; null stays null.
template <class T>
T *align_panel(void *allocated) {
  const auto address = reinterpret_cast<std::uintptr_t>(allocated);
  const auto mask = static_cast<std::uintptr_t>(panel_alignment - 1);
  return reinterpret_cast<T *>((address + mask) & ~mask);
}

template <class T>
constexpr T gemm_one{1};
template <class R>
constexpr Complex<R> gemm_one<Complex<R>>{1, 0};

}  // namespace qtb
