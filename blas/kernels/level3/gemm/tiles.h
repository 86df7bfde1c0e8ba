// The shapes of the GEMM families: register tiles, block sizes and the packed format that follows from them.
//
// A family packs mb x kb of op(A) and kb x nb of op(B) at a time, in micro-panels of mr rows and nr columns, k the slow
// index. The depth of a panel is filled up with zeros to a multiple of ku. Sizes are elements, a complex one counting
// as one. A tier has one base family per type; ssse3 has a second one for processors with SSE4.1, and def two for
// double precision on one processor family.
//
// What stands here is data and arithmetic, the same in every tier's build, so that a row of another tier can be read.
#pragma once

#include "blas/kernels/kernel.h"

namespace qtb::QTB_TIER {
namespace {

struct GemmBlocks {
  QtbInt mb, nb, kb, mr, nr, ku;
};

enum class Family { base, sse41, def_a, def_b };

// How kb follows from k, with the length of the one value that a rule has.
enum class Depth {
  halved,       // the value; two equal parts below twice of it; all of k below it, but at least 128
  stepped,      // the value; half of it up to four times the value; all of k below it, but at least 128
  dividing,     // the value or else 128 where it divides k; otherwise the value, two equal parts below twice of it
  halved_down,  // the value; up to twice of it two parts, rounded down to a multiple of 4
  whole,        // the value; all of k below it, but at least 128
  fixed         // the value, the remainder of k first
};
struct DepthRule {
  Depth rule;
  QtbInt value;
};

// How mb follows.
enum class Rows {
  fixed,        // the value
  small_l2,     // the value; reduced where the second cache level is small
  small_l3,     // the value; reduced where the third cache level is small
  area_of_k,    // m up to an area of value elements over the depth in use, in multiples of step
  area_of_kb,   // m up to an area of value elements over kb, in multiples of step
  capped,       // m up to a multiple of step, at most the value
  flat,         // the value; more where m + n is large and k small, by the depth
  flat_or_huge  // the same; another value where all dimensions are large
};
struct RowRule {
  Rows rule;
  QtbInt value, reduced_or_step = 0;
};

// nb: n, at least floor, at most cap, up to a multiple.
struct ColumnRule {
  QtbInt floor, cap, multiple = 1;
};

struct GemmRules {
  char kind;
  unsigned tiers;
  Family family;
  QtbInt mr, nr, ku;
  RowRule mb;
  ColumnRule nb;
  DepthRule kb;
};

// A cache level of at most so many bytes is small; a level that the processor does not report is, too, unless it
// reports none at all.
constexpr std::uint32_t small_l2_bytes = 3145728, small_l3_bytes = 4194304;

// clang-format off
constexpr DepthRule depth_halved{Depth::halved, 256}, depth_stepped{Depth::stepped, 256};

constexpr unsigned tiers_from_sse42 = tier_set::SSE42 | tier_set::AVX, tiers_to_sse3 = tier_set::DEF | tier_set::SSE3;

constexpr GemmRules gemm_rules[] = {
  // type, tiers, family                          mr nr ku  mb                              nb             kb
  {'d', tier_set::AVX,    Family::base,            8, 4, 4, {Rows::fixed, 512},             {4, 10000},    depth_halved},
  {'d', tier_set::SSE42,  Family::base,            2, 8, 4, {Rows::small_l3, 640, 384},     {8, 5000, 8},  depth_halved},
  {'d', tier_set::SSSE3,  Family::base,            4, 4, 4, {Rows::fixed, 512},             {4, 10000},    depth_halved},
  {'d', tier_set::SSSE3,  Family::sse41,           4, 4, 4, {Rows::small_l2, 1000, 448},    {4, 10000, 4}, depth_halved},
  {'d', tier_set::SSE3,   Family::base,            4, 4, 4, {Rows::flat_or_huge, 480, 512}, {0, 2000},     {Depth::halved_down, 112}},
  {'d', tier_set::DEF,    Family::base,            2, 12, 4, {Rows::flat, 512},             {0, 4992},     {Depth::halved_down, 128}},
  {'d', tier_set::DEF,    Family::def_a,           4, 4, 4, {Rows::area_of_kb, 61440, 8},   {4, 5000},     depth_halved},
  {'d', tier_set::DEF,    Family::def_b,           4, 4, 4, {Rows::capped, 128, 4},         {4, 384},      {Depth::whole, 256}},
  {'s', tiers_from_sse42, Family::base,            4, 8, 4, {Rows::small_l3, 1280, 768},    {8, 5000, 8},  depth_halved},
  {'s', tier_set::SSSE3,  Family::base,            8, 4, 4, {Rows::fixed, 1024},            {4, 5000},     depth_halved},
  {'s', tier_set::SSSE3,  Family::sse41,           8, 4, 4, {Rows::small_l2, 2000, 1024},   {4, 5000, 4},  depth_halved},
  {'s', tiers_to_sse3,    Family::base,            8, 4, 4, {Rows::fixed, 640},             {0, 2000},     {Depth::fixed, 112}},
  {'c', tiers_from_sse42, Family::base,            2, 4, 4, {Rows::small_l3, 512, 320},     {4, 5000, 4},  depth_stepped},
  {'c', tier_set::SSSE3,  Family::base,            4, 2, 2, {Rows::area_of_k, 112640, 4},   {2, 5000},     {Depth::dividing, 256}},
  {'c', tier_set::SSSE3,  Family::sse41,           4, 2, 4, {Rows::small_l2, 1000, 448},    {2, 5000, 2},  depth_stepped},
  {'c', tiers_to_sse3,    Family::base,            4, 4, 4, {Rows::fixed, 320},             {0, 2000},     {Depth::fixed, 64}},
  {'z', tiers_from_sse42, Family::base,            1, 4, 4, {Rows::small_l3, 256, 160},     {4, 2000, 4},  depth_stepped},
  {'z', tier_set::SSSE3,  Family::base,            2, 2, 2, {Rows::area_of_k, 56320, 2},    {2, 2000},     {Depth::dividing, 224}},
  {'z', tier_set::SSSE3,  Family::sse41,           2, 2, 4, {Rows::small_l2, 512, 256},     {2, 5000, 2},  depth_stepped},
  {'z', tiers_to_sse3,    Family::base,            2, 4, 4, {Rows::fixed, 320},             {0, 2000},     {Depth::fixed, 64}},
};
// clang-format on

// The row of a type, tier and family; one that does not exist is an error at compile time.
consteval GemmRules find_rules(char kind, ProcessorTier tier, Family family) {
  for (const GemmRules &row : gemm_rules)
    if (row.kind == kind && (row.tiers >> tier & 1U) != 0 && row.family == family) return row;
  __builtin_unreachable();
}

template <class T>
constexpr char kind_of = is_complex<T> ? (sizeof(Real<T>) == sizeof(float) ? 'c' : 'z')
                                       : (sizeof(T) == sizeof(float) ? 's' : 'd');

// The rules of this build's tier.
template <class T, Family family = Family::base>
constexpr GemmRules rules_of = find_rules(kind_of<T>, this_tier, family);

constexpr QtbInt smaller(QtbInt a, QtbInt b) { return a < b ? a : b; }
constexpr QtbInt larger(QtbInt a, QtbInt b) { return a > b ? a : b; }
constexpr QtbInt round_down(QtbInt v, QtbInt multiple) { return v / multiple * multiple; }
constexpr QtbInt round_up(QtbInt v, QtbInt multiple) { return round_down(v + multiple - 1, multiple); }

// The width of the micro-panel of B with which left columns begin: nr, or of what is less the multiples of 4 together
// and then the rest.
constexpr QtbInt panel_width(QtbInt nr, QtbInt left) {
  if (left >= nr) return nr;
  return left >= 4 ? round_down(left, 4) : left;
}

constexpr QtbInt block_depth(DepthRule kb, QtbInt k) {
  constexpr QtbInt least = 128;
  switch (kb.rule) {
    case Depth::halved:
      if (k < kb.value) return larger(least, round_up(k, 4));
      return k > kb.value && k < 2 * kb.value ? round_up(k / 2, 4) : kb.value;
    case Depth::stepped:
      if (k < kb.value) return larger(least, round_up(k, 4));
      return k <= 4 * kb.value ? kb.value / 2 : kb.value;
    case Depth::dividing:
      if (k % kb.value == 0) return kb.value;
      if (k % least == 0) return least;
      return k > kb.value && k < 2 * kb.value ? round_up((k + 1) / 2, 2) : kb.value;
    case Depth::halved_down: return k > kb.value && k <= 2 * kb.value ? larger(round_down(k / 2, 4), 4) : kb.value;
    case Depth::whole: return k < kb.value ? larger(least, round_up(k, 4)) : kb.value;
    case Depth::fixed: return kb.value;
  }
  __builtin_unreachable();
}

// Many rows and columns over a small depth: with a depth this small, a block of A may have so many rows.
constexpr bool is_flat(QtbInt m, QtbInt n, QtbInt k, QtbInt largest_k) { return k <= largest_k && m + n >= 10000; }
constexpr QtbInt flat_rows(QtbInt depth) { return depth <= 16 ? 1536 : depth <= 32 ? 1024 : depth <= 64 ? 768 : 512; }
// All three large, and m + n so large that larger blocks pay.
constexpr bool is_huge(QtbInt m, QtbInt n, QtbInt k) { return m >= 4000 && n >= 4000 && k >= 4000 && m + n >= 12000; }

// caches is the table of service/cache.h.
inline bool level_is_small(const std::uint32_t *caches, int level, std::uint32_t bytes) {
  return caches[0] != 0 && caches[level] <= bytes;
}

constexpr bool reads_caches(const GemmRules &rules) {
  return rules.mb.rule == Rows::small_l2 || rules.mb.rule == Rows::small_l3;
}

inline QtbInt block_rows(const GemmRules &rules, QtbInt m, QtbInt n, QtbInt k, QtbInt kb, const std::uint32_t *caches) {
  const QtbInt value = rules.mb.value, reduced = rules.mb.reduced_or_step, step = rules.mb.reduced_or_step;
  const QtbInt twice = 2 * rules.kb.value;
  switch (rules.mb.rule) {
    case Rows::fixed: return value;
    case Rows::small_l2: return level_is_small(caches, 2, small_l2_bytes) ? reduced : value;
    case Rows::small_l3: return level_is_small(caches, 3, small_l3_bytes) ? reduced : value;
    case Rows::area_of_k:
      return smaller(larger(m, rules.mr),
                     round_down(value / smaller(kb, larger(round_up(k, rules.ku), rules.ku)), step));
    case Rows::area_of_kb: return smaller(larger(m, rules.mr), round_down(value / kb, step));
    case Rows::capped: return smaller(round_up(m, step), value);
    case Rows::flat: return is_flat(m, n, k, twice) ? flat_rows(smaller(k, kb)) : value;
    case Rows::flat_or_huge:
      if (is_flat(m, n, k, twice)) return flat_rows(smaller(k, kb));
      return is_huge(m, n, k) ? reduced : value;
  }
  __builtin_unreachable();
}

inline QtbInt block_columns(const GemmRules &rules, QtbInt m, QtbInt n, QtbInt k) {
  constexpr QtbInt wide_cap = 5000;  // of the one rule that widens with the problem
  const bool wide = rules.mb.rule == Rows::flat_or_huge && (is_flat(m, n, k, 2 * rules.kb.value) || is_huge(m, n, k));
  return round_up(smaller(larger(n, rules.nb.floor), wide ? wide_cap : rules.nb.cap), rules.nb.multiple);
}

// Fills in each of mb, nb and kb that is 0, and sets the tile. caches may be null where reads_caches says no.
inline void fill_blocks(const GemmRules &rules, QtbInt m, QtbInt n, QtbInt k, const std::uint32_t *caches,
                        GemmBlocks &blocks) {
  if (blocks.kb == 0) blocks.kb = block_depth(rules.kb, k);
  if (blocks.mb == 0) blocks.mb = block_rows(rules, m, n, k, blocks.kb, caches);
  if (blocks.nb == 0) blocks.nb = block_columns(rules, m, n, k);
  blocks.mr = rules.mr;
  blocks.nr = rules.nr;
  blocks.ku = rules.ku;
}

}  // namespace
}  // namespace qtb::QTB_TIER
