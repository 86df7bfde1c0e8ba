// Whether a triangular product or solve takes threads, and how the matrix is cut then: a pure function of the shape and
// of what the process answers to two questions. process.h has the answers of this process.
//
// Asked in this order, and only when the answer counts: max_threads, tier. Of a matrix so small that no tier and no
// number of threads would split it nothing is asked.
#pragma once

#include <type_traits>

#include "blas/thread/32e/level3/slabs.h"
#include "blas/thread/process.h"

// f(name, T): the routines, in two lists.
#define QTB_FOR_EACH_TRMM(f) f(strmm, float) f(dtrmm, double) f(ctrmm, cfloat) f(ztrmm, cdouble)
#define QTB_FOR_EACH_TRSM(f) f(strsm, float) f(dtrsm, double) f(ctrsm, cfloat) f(ztrsm, cdouble)

namespace qtb {

// What is asked about: a product or a solve with a triangle left or right of the m x n matrix.
struct TrmmCall {
  bool solve, left;
  QtbInt m, n;
  constexpr QtbInt order() const { return slab_order(left, m, n); }
  constexpr QtbInt extent() const { return slab_extent(left, m, n); }
};

// Work that does not pay: below a value, or at it too. No work is below 0.
struct WorkLimit {
  double value;
  bool value_too;
  constexpr bool holds(double work) const { return value_too ? work <= value : work < value; }
};
constexpr WorkLimit below(double value) { return {value, false}; }
constexpr WorkLimit up_to(double value) { return {value, true}; }
inline constexpr WorkLimit no_limit = below(0);

// Which share of a thread counts as its work: the one that it gets, or the one before it is rounded to the unit.
enum class ShareOf { rounded, whole };

// The tuned cut of one type and side, in the tiers with building blocks. The work has two parts: the triangle, which
// every thread reads, is order*(order + 1)*triangle, and a thread's slab is order*share*slab.
struct TrmmRule {
  QtbInt unit, unit_order;  // shares are multiples of unit, for triangles of at least this order
  double triangle, slab;
  ShareOf share_of;
  // The caller's thread does it alone where
  WorkLimit both_triangle, both_slab;  // the triangle and the slab are both so little work,
  WorkLimit sum;                       // or both together are,
  WorkLimit alone_triangle;            // or the triangle alone,
  WorkLimit alone_slab;                // or the slab alone,
  QtbInt least_share;                  // or a thread's whole share is smaller than this.
};

template <class T>
struct TrmmRules;  // left, right

// clang-format off
//                                   unit from triangle     slab        share             both triangle both slab sum        triangle  slab      share
template <>
struct TrmmRules<double> {
  static constexpr TrmmRule left  = {4,   513, 0.00390625,  0.0078125,  ShareOf::rounded, below(1),     below(6), up_to(6),  no_limit, no_limit, 0};
  static constexpr TrmmRule right = {4,   0,   0.00390625,  0.0078125,  ShareOf::rounded, no_limit,     no_limit, up_to(10), up_to(1), below(4), 0};
};
template <>
struct TrmmRules<float> {
  static constexpr TrmmRule left  = TrmmRules<double>::left;
  static constexpr TrmmRule right = {8,   0,   0.001953125, 0.00390625, ShareOf::rounded, no_limit,     no_limit, below(8),  no_limit, no_limit, 16};
};
template <>
struct TrmmRules<cfloat> {
  static constexpr TrmmRule left  = {1,   0,   0.00390625,  0.0078125,  ShareOf::rounded, below(1),     below(2), no_limit,  no_limit, no_limit, 0};
  static constexpr TrmmRule right = {4,   0,   0,           0.0078125,  ShareOf::whole,   no_limit,     no_limit, no_limit,  no_limit, below(3), 5};
};
template <>
struct TrmmRules<cdouble> {
  static constexpr TrmmRule left  = {1,   0,   0.0078125,   0.015625,   ShareOf::rounded, below(1),     below(2), no_limit,  no_limit, no_limit, 0};
  static constexpr TrmmRule right = {1,   0,   0,           0.015625,   ShareOf::whole,   no_limit,     no_limit, no_limit,  no_limit, below(3), 3};
};
// clang-format on

// An m x n matrix with both below this is tiny.
inline constexpr QtbInt trmm_tiny = 17;
// On tier sse3 a solve in double precision with a large triangle on the left needs slabs of some columns.
inline constexpr QtbInt trmm_large_order = 513, trmm_large_least_share = 8;

template <class T>
constexpr TrmmRule trmm_rule(bool left) {
  return left ? TrmmRules<T>::left : TrmmRules<T>::right;
}

// The unit of the shares; below the tiers with building blocks any cut will do.
template <class T>
constexpr QtbInt trmm_unit(const TrmmCall &call, ProcessorTier tier) {
  const TrmmRule rule = trmm_rule<T>(call.left);
  return tier_has_pieces(tier) && call.order() >= rule.unit_order ? rule.unit : 1;
}

// Whether so many threads, at least 2, do not pay.
template <class T>
constexpr bool trmm_is_serial(const TrmmCall &call, ProcessorTier tier, QtbInt threads) {
  const bool tiny = call.m < trmm_tiny && call.n < trmm_tiny;
  const bool double_solve = call.solve && std::is_same_v<T, double>, of_sse3 = double_solve && tier == tier_sse3;
  if (!tier_has_pieces(tier) && !of_sse3) return tiny || (!call.solve && call.m == 0);
  if (double_solve && tiny) return true;

  const TrmmRule rule = trmm_rule<T>(call.left);
  const QtbInt whole = call.extent() / threads, share = slab_share(call.extent(), trmm_unit<T>(call, tier), threads);
  if (of_sse3 && call.left && call.order() >= trmm_large_order && share < trmm_large_least_share) return true;

  const auto order = static_cast<double>(call.order());
  const double triangle = (order + 1) * order * rule.triangle;
  const double slab = order * static_cast<double>(rule.share_of == ShareOf::whole ? whole : share) * rule.slab;
  return (rule.both_triangle.holds(triangle) && rule.both_slab.holds(slab)) || rule.sum.holds(triangle + slab) ||
         rule.alone_triangle.holds(triangle) || rule.alone_slab.holds(slab) || whole < rule.least_share;
}

// Up to so many rows and columns every tier is serial on any number of threads.
inline constexpr QtbInt trmm_serial_size = 10;

struct TrmmDecision {
  QtbInt threads;  // 1: the dispatch slot on the whole problem. The driver is never asked for it
  QtbInt unit;     // of the shares, whatever team comes
};

template <class T, class Process>
TrmmDecision trmm_decision(const TrmmCall &call, Process &&process) {
  constexpr TrmmDecision serial = {1, 1};
  if (call.m <= trmm_serial_size && call.n <= trmm_serial_size) return serial;
  const QtbInt threads = process.max_threads();
  if (threads < 2) return serial;
  const ProcessorTier tier = process.tier();
  if (trmm_is_serial<T>(call, tier, threads)) return serial;
  return {threads, trmm_unit<T>(call, tier)};
}

}  // namespace qtb
