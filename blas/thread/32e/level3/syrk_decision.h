// Whether a rank-k update takes threads, and by which scheme: pure functions of the order and of what the process
// answers to two questions. process.h has the answers of this process.
//
// The tiers with building blocks cut the triangle into tiles (syrk_tiles.h), the others into a diagonal and strips
// (strips.h). Asked in this order: tier, max_threads, which orders too small for a second thread do not ask.
#pragma once

#include "blas/thread/process.h"

// f(name, shape, T): the routines.
#define QTB_FOR_EACH_SYRK(f)                                                                                         \
  f(ssyrk, syrk, float) f(dsyrk, syrk, double) f(csyrk, syrk, cfloat) f(zsyrk, syrk, cdouble) f(cherk, herk, cfloat) \
      f(zherk, herk, cdouble)

namespace qtb {

template <class Process>
bool syrk_takes_tiles(Process &&process) {
  return tier_has_pieces(process.tier());
}

// The road of an update by tiles.
enum SyrkRoad {
  syrk_of_order_4,  // the kernel for that order
  syrk_small,       // the kernel of diagonal blocks
  syrk_serial,      // the dispatch slot
  syrk_parallel
};
struct SyrkDecision {
  SyrkRoad road;
  QtbInt threads;  // to ask for; at least 2 by tiles
};

inline constexpr QtbInt syrk_kernel_order = 4;     // has a kernel of its own
inline constexpr QtbInt syrk_rows_per_thread = 8;  // needed by each thread: two blocks of four

template <class Process>
SyrkDecision syrk_decision(QtbInt n, Process &&process) {
  if (n == syrk_kernel_order) return {syrk_of_order_4, 1};
  if (n < syrk_rows_per_thread) return {syrk_small, 1};
  const QtbInt threads = process.max_threads();
  if (syrk_rows_per_thread * threads > n) return {syrk_small, 1};
  if (threads < 2) return {syrk_serial, 1};
  return {syrk_parallel, threads};
}

}  // namespace qtb
