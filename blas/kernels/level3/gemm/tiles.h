// The GEMM families of all tiers: register tiles, block sizes, the packed format that follows from them, and how a body
// walks its blocks.
//
// A family packs mb x kb of op(A) and kb x nb of op(B) at a time, in micro-panels of mr rows and nr columns, k the slow
// index. The depth of a panel is filled up with zeros to a multiple of ku. Sizes are elements, a complex one counting
// as one. A tier has one base family per type; ssse3 has a second one for processors with SSE4.1, and def two for
// double precision on one processor family.
//
// What stands here is data and arithmetic, the same in every tier's build and outside of them: family.h names the rows
// of the tier that is built.
#pragma once

#include "blas/tiers.h"
#include "blas/types.h"
#include "service/cache.h"

namespace qtb::tiles {
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

// What a walk over blocks does beside packing and multiplying.
struct WalkRule {
  bool kernels_apply_beta = false;  // those of the first block of depth; otherwise C is scaled ahead of the walk
  bool kernels_take_edges = false;  // rows beyond a multiple of mr, packed with zeros; otherwise the small path does
  QtbInt columns = 1;               // packed in multiples of so many; the small path takes the rest, at the end
  bool callers_blocks_stay = true;  // a size that the caller of gemm_blocks gives
};

// What a body asks of the memory service (regions.h).
enum class Request {
  largest,    // room for the largest blocks, so that a thread which repeats its requests gets the same memory; bytes:
              // from the end of A to where B may begin
  of_blocks,  // room for the blocks at hand, with a vector of 32 bytes for each of four columns per step of depth;
              // bytes: from there to where B may begin
  tight       // room for the blocks at hand, A beyond the start of the allocation; bytes: what the boundaries cost
};
struct BufferRule {
  Request request;
  QtbInt bytes;
};

// A serial body reads B in place where a slice of B has at most so many bytes: it then stays in a cache by itself. Its
// blocks of A have rows of their own where a rule says so. A kernel that can do without a stage gets none beside the
// micro-panel of B where the staging region has room for that alone.
struct InPlaceRule {
  QtbInt most_bytes = 0;
  RowRule mb = {Rows::fixed, 0};
  bool kernel_has_stage = true;
};

struct GemmRules {
  char kind;
  unsigned tiers;
  Family family;
  QtbInt mr, nr, ku;
  RowRule mb;
  ColumnRule nb;
  DepthRule kb;
  WalkRule walk;
  BufferRule buffers;
  InPlaceRule in_place;
};

// clang-format off
constexpr DepthRule depth_halved{Depth::halved, 256}, depth_stepped{Depth::stepped, 256};

constexpr unsigned tiers_from_sse42 = tier_set::SSE42 | tier_set::AVX, tiers_to_sse3 = tier_set::DEF | tier_set::SSE3;

constexpr WalkRule adding{}, folding{.kernels_apply_beta = true};

// What lies between A and B has room for a micro-panel of B, or for one whose elements are doubled.
constexpr BufferRule plain_stage{Request::largest, 8960}, doubled_stage{Request::largest, 17152};
// Four pages and what keeps the stage apart from A; some room to spare.
constexpr BufferRule tight{Request::tight, 4 * 4096 + 1280}, tight_spare{Request::tight, 18176};

constexpr QtbInt slice_256k = 262144, slice_2m = 2097152;
constexpr InPlaceRule never{};
constexpr InPlaceRule slice_2m_sse41{slice_2m, {Rows::small_l2, 600, 448}};
constexpr InPlaceRule slice_2m_bare{slice_2m, {Rows::small_l2, 600, 448}, false};

constexpr GemmRules gemm_rules[] = {
  // type, tiers, family                          mr nr ku  mb                              nb             kb            walk                                                           buffers                    B in place
  {'d', tier_set::AVX,    Family::base,            8, 4, 4, {Rows::fixed, 512},             {4, 10000},    depth_halved, {.callers_blocks_stay = false},                                {Request::of_blocks, 768}, never},
  {'d', tier_set::SSE42,  Family::base,            2, 8, 4, {Rows::small_l3, 640, 384},     {8, 5000, 8},  depth_halved, adding,                                                        doubled_stage,             never},
  {'d', tier_set::SSSE3,  Family::base,            4, 4, 4, {Rows::fixed, 512},             {4, 10000},    depth_halved, adding,                                                        doubled_stage,             {slice_2m}},
  {'d', tier_set::SSSE3,  Family::sse41,           4, 4, 4, {Rows::small_l2, 1000, 448},    {4, 10000, 4}, depth_halved, adding,                                                        plain_stage,               slice_2m_bare},
  {'d', tier_set::SSE3,   Family::base,            4, 4, 4, {Rows::flat_or_huge, 480, 512}, {0, 2000},     {Depth::halved_down, 112}, {.kernels_apply_beta = true, .kernels_take_edges = true}, tight_spare,      never},
  {'d', tier_set::DEF,    Family::base,            2, 12, 4, {Rows::flat, 512},             {0, 4992},     {Depth::halved_down, 128}, {.columns = 4},                                   tight_spare,               never},
  {'d', tier_set::DEF,    Family::def_a,           4, 4, 4, {Rows::area_of_kb, 61440, 8},   {4, 5000},     depth_halved, adding,                                                        doubled_stage,             {slice_256k}},
  {'d', tier_set::DEF,    Family::def_b,           4, 4, 4, {Rows::capped, 128, 4},         {4, 384},      {Depth::whole, 256}, adding,                                                 doubled_stage,             never},
  {'s', tiers_from_sse42, Family::base,            4, 8, 4, {Rows::small_l3, 1280, 768},    {8, 5000, 8},  depth_halved, adding,                                                        doubled_stage,             {slice_256k}},
  {'s', tier_set::SSSE3,  Family::base,            8, 4, 4, {Rows::fixed, 1024},            {4, 5000},     depth_halved, adding,                                                        doubled_stage,             {slice_2m}},
  {'s', tier_set::SSSE3,  Family::sse41,           8, 4, 4, {Rows::small_l2, 2000, 1024},   {4, 5000, 4},  depth_halved, adding,                                                        plain_stage,               slice_2m_sse41},
  {'s', tiers_to_sse3,    Family::base,            8, 4, 4, {Rows::fixed, 640},             {0, 2000},     {Depth::fixed, 112}, folding,                                                tight,                     never},
  {'c', tiers_from_sse42, Family::base,            2, 4, 4, {Rows::small_l3, 512, 320},     {4, 5000, 4},  depth_stepped, adding,                                                       doubled_stage,             never},
  {'c', tier_set::SSSE3,  Family::base,            4, 2, 2, {Rows::area_of_k, 112640, 4},   {2, 5000},     {Depth::dividing, 256}, adding,                                              doubled_stage,             never},
  {'c', tier_set::SSSE3,  Family::sse41,           4, 2, 4, {Rows::small_l2, 1000, 448},    {2, 5000, 2},  depth_stepped, adding,                                                       plain_stage,               never},
  {'c', tiers_to_sse3,    Family::base,            4, 4, 4, {Rows::fixed, 320},             {0, 2000},     {Depth::fixed, 64}, folding,                                                 tight,                     never},
  {'z', tiers_from_sse42, Family::base,            1, 4, 4, {Rows::small_l3, 256, 160},     {4, 2000, 4},  depth_stepped, adding,                                                       doubled_stage,             never},
  {'z', tier_set::SSSE3,  Family::base,            2, 2, 2, {Rows::area_of_k, 56320, 2},    {2, 2000},     {Depth::dividing, 224}, adding,                                              doubled_stage,             never},
  {'z', tier_set::SSSE3,  Family::sse41,           2, 2, 4, {Rows::small_l2, 512, 256},     {2, 5000, 2},  depth_stepped, adding,                                                       plain_stage,               never},
  {'z', tiers_to_sse3,    Family::base,            2, 4, 4, {Rows::fixed, 320},             {0, 2000},     {Depth::fixed, 64}, folding,                                                 tight,                     never},
};
// clang-format on

consteval bool every_tier_has_rules() {
  constexpr char kinds[] = {'s', 'd', 'c', 'z'};
  for (const char kind : kinds) {
    unsigned found = 0;
    for (const GemmRules &row : gemm_rules)
      if (row.kind == kind && row.family == Family::base) found |= row.tiers;
    if (found != tier_set::ALL) return false;
  }
  return true;
}
static_assert(every_tier_has_rules(),
              "blas/kernels/level3/gemm/tiles.h: write every tier into a row of a base family of each type");

// The row of a type, tier and family; one that does not exist is an error at compile time.
consteval GemmRules find_rules(char kind, ProcessorTier tier, Family family) {
  for (const GemmRules &row : gemm_rules)
    if (row.kind == kind && (row.tiers >> tier & 1U) != 0 && row.family == family) return row;
  __builtin_unreachable();
}

// The rules of a walk with B in place, which may have a row rule of its own.
consteval GemmRules with_rows_in_place(GemmRules rules, bool in_place) {
  if (in_place && rules.in_place.mb.value != 0) rules.mb = rules.in_place.mb;
  return rules;
}

template <class T>
constexpr char kind_of = is_complex<T> ? (sizeof(Real<T>) == sizeof(float) ? 'c' : 'z')
                                       : (sizeof(T) == sizeof(float) ? 's' : 'd');

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

// The depth of the first of the blocks that are kb deep.
constexpr QtbInt first_depth(DepthRule rule, QtbInt kb, QtbInt k) {
  const QtbInt remainder = rule.rule == Depth::fixed ? k % kb : 0;
  return remainder != 0 ? remainder : smaller(kb, k);
}

// Many rows and columns over a small depth: with a depth this small, a block of A may have so many rows.
constexpr bool is_flat(QtbInt m, QtbInt n, QtbInt k, QtbInt largest_k) { return k <= largest_k && m + n >= 10000; }
constexpr QtbInt flat_rows(QtbInt depth) { return depth <= 16 ? 1536 : depth <= 32 ? 1024 : depth <= 64 ? 768 : 512; }
// All three large, and m + n so large that larger blocks pay.
constexpr bool is_huge(QtbInt m, QtbInt n, QtbInt k) { return m >= 4000 && n >= 4000 && k >= 4000 && m + n >= 12000; }

constexpr bool reads_caches(const GemmRules &rules) {
  return rules.mb.rule == Rows::small_l2 || rules.mb.rule == Rows::small_l3;
}

// caches is the table of service/cache.h.
constexpr QtbInt block_rows(const GemmRules &rules, QtbInt m, QtbInt n, QtbInt k, QtbInt kb,
                            const std::uint32_t *caches) {
  const QtbInt value = rules.mb.value, reduced = rules.mb.reduced_or_step, step = rules.mb.reduced_or_step;
  const QtbInt twice = 2 * rules.kb.value;
  switch (rules.mb.rule) {
    case Rows::fixed: return value;
    case Rows::small_l2: return cache_is_small(caches, cache_second_size, small_second_cache_bytes) ? reduced : value;
    case Rows::small_l3: return cache_is_small(caches, cache_third_size, small_third_cache_bytes) ? reduced : value;
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

constexpr QtbInt block_columns(const GemmRules &rules, QtbInt m, QtbInt n, QtbInt k) {
  constexpr QtbInt wide_cap = 5000;  // of the one rule that widens with the problem
  const bool wide = rules.mb.rule == Rows::flat_or_huge && (is_flat(m, n, k, 2 * rules.kb.value) || is_huge(m, n, k));
  return round_up(smaller(larger(n, rules.nb.floor), wide ? wide_cap : rules.nb.cap), rules.nb.multiple);
}

// Fills in each of mb, nb and kb that is 0, and sets the tile. caches may be null where reads_caches says no.
constexpr void fill_blocks(const GemmRules &rules, QtbInt m, QtbInt n, QtbInt k, const std::uint32_t *caches,
                           GemmBlocks &blocks) {
  if (blocks.kb == 0) blocks.kb = block_depth(rules.kb, k);
  if (blocks.mb == 0) blocks.mb = block_rows(rules, m, n, k, blocks.kb, caches);
  if (blocks.nb == 0) blocks.nb = block_columns(rules, m, n, k);
  blocks.mr = rules.mr;
  blocks.nr = rules.nr;
  blocks.ku = rules.ku;
}

}  // namespace
}  // namespace qtb::tiles
