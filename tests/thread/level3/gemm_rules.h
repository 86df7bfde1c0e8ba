// What the parallel GEMM has to decide, written down a second time: which machine class a processor is of, whether
// threads pay, and which strategy a team takes with which plan. The tests hold the library to it.
//
// Conditions are written as conjunctions and disjunctions of plain comparisons, arithmetic is modulo 2^64 where it can
// be large, and routines are named by text, so that no slip of the library's chains of rules can repeat itself here.
// Nothing of the library is included.
#pragma once

#include <cstdint>

namespace qtb::test {

using Int = std::int64_t;

// ---- Machine classes ----

// tier: 0 def, 1 sse3, 2 ssse3, 3 sse42, 4 avx; the cache table's levels and the bytes of the second.
inline int class_of(int tier, bool sse41, bool family16, std::uint32_t levels, std::uint32_t second) {
  const bool second_is_large = levels == 0 || second > 3u * 1024 * 1024;
  return 6 * int(tier == 0 && family16) + 1 * int(tier == 2 && !sse41) +
         2 * int(tier == 2 && sse41 && second_is_large) + 4 * int(tier == 2 && sse41 && !second_is_large) +
         3 * int(tier == 3) + 5 * int(tier == 4);
}

// ---- Too small for threads, whatever the processor ----

inline bool too_small(Int m, Int n, Int k) {
  const bool all_small = !(m > 16 || n > 16 || k > 16);
  return m < 6 || k < 5 || all_small;
}

// ---- Whether threads pay in classes 1 to 4 ----

struct Worth {
  bool room;                    // enough rows and columns to begin with
  bool volume, surface, depth;  // three reasons, each of which is enough
  bool pays() const { return room && (volume || surface || depth); }
};

inline Worth worth(char type, Int threads, Int m, Int n, Int k) {
  using U = std::uint64_t;
  const Int pairs = threads < 4 ? 1 : threads / 2;
  const Int half = m / 2, columns = n / pairs;
  const U volume = U(k) * U(half) * U(columns);
  if (type == 's' || type == 'd') {
    const U surface = U(half) * U(columns) + U(k) * U(columns) + U(k) * U(half);
    const Int shift = type == 's' ? 8 : 7;
    return {columns >= 2 && (type == 'd' || half >= 5), (Int(volume) >> 9) > (type == 's' ? 18 : 36 / pairs),
            (Int(surface) >> shift) > (type == 's' ? 24 : 48 / pairs), k > (type == 's' ? 256 : 512 / pairs)};
  }
  const U surface = U(half) * U(k) + U(columns) * U(k) + U(half) * U(columns);
  const Int limit = (type == 'c' ? 48 : 24) / pairs;
  return {true, Int(8 * volume) / 1024 > limit, (surface >> (type == 'c' ? 7 : 6)) > U(limit), k > 256 / pairs};
}

// ---- What a team does ----

enum Kind {
  k_row,
  k_col,
  k_grid_41,
  k_grid_t,
  k_grid_fa,
  k_grid_fb,
  k_xgemm,
  k_abcopy,
  k_acopy,
  k_bcopy_1d,
  k_bcopy,
  k_bcopy_41,
  kind_count
};

// What a plan of each kind names, "D" for the type: strategies without their prefix qtb_blas_, the others without
// qtb_blas_x. Of the packing routines, the common part of their three forms; "" for no routine.
struct KindRoutines {
  const char *name, *strategy, *kernel, *blocks, *acopy, *bcopy;
};
// clang-format off
constexpr KindRoutines kind_routines[kind_count] = {
  // name      strategy                          kernel                blocks                acopy                bcopy
  {"row",      "Dgemm_1d_row",                   "Dgemm",              "",                   "",                  ""},
  {"col",      "Dgemm_1d_col",                   "Dgemm",              "",                   "",                  ""},
  {"grid_41",  "Dgemm_2d_grid",                  "Dgemm_sse41",        "Dgemm_sse41_blocks", "",                  ""},
  {"grid_t",   "Dgemm_2d_grid",                  "Dgemm_nobcopy",      "Dgemm_blocks",       "",                  ""},
  {"grid_fa",  "Dgemm_2d_grid",                  "Dgemm_def_run_a",    "Dgemm_def_blocks_a", "",                  ""},
  {"grid_fb",  "Dgemm_2d_grid",                  "Dgemm_def_run_b",    "Dgemm_def_blocks_b", "",                  ""},
  {"xgemm",    "Dgemm_2d_xgemm_p",               "Dgemm",              "Dgemm_sse41_blocks", "",                  ""},
  {"abcopy",   "Dgemm_2d_abcopy_abx_m_km_par_p", "Dgemm_sse41_packed", "Dgemm_sse41_blocks", "Dgemm_sse41_acopy", "Dgemm_sse41_bcopy"},
  {"acopy",    "Dgemm_2d_acopy_n",               "Dgemm_apacked",      "Dgemm_blocks",       "Dgemm_acopy",       ""},
  {"bcopy_1d", "Dgemm_1d_with_copy_0",           "Dgemm_bpacked",      "Dgemm_blocks",       "",                  "Dgemm_bcopy"},
  {"bcopy",    "Dgemm_2d_bcopy",                 "Dgemm_bpacked",      "Dgemm_blocks",       "",                  "Dgemm_bcopy"},
  {"bcopy_41", "Dgemm_2d_bcopy",                 "Dgemm_sse41",        "Dgemm_sse41_blocks", "",                  "Dgemm_sse41_bcopy"},
};
// clang-format on

// What a selector puts into a plan beside the routines; block sizes as the block query finds them.
struct Outcome {
  Kind kind;
  Int nthreads;
  Int grid_rows = 0, grid_cols = 0;
  Int mb = 0, nb = 0, kb = 0;
  int a_buffers = 0, b_buffers = 0;

  bool operator==(const Outcome &) const = default;
};

constexpr Outcome row(Int t) { return {k_row, t}; }
constexpr Outcome col(Int t) { return {k_col, t}; }
constexpr Outcome grid_41(Int rows, Int cols) { return {k_grid_41, rows * cols, rows, cols}; }
constexpr Outcome grid_t(Int rows, Int cols) { return {k_grid_t, rows * cols, rows, cols}; }
constexpr Outcome grid_fa(Int rows, Int cols) { return {k_grid_fa, rows * cols, rows, cols}; }
constexpr Outcome grid_fb(Int rows, Int cols) { return {k_grid_fb, rows * cols, rows, cols}; }
constexpr Outcome xgemm(Int t) { return {k_xgemm, t, 2, t / 2, 200, 800, 128}; }
constexpr Outcome abcopy(Int t, Int mb) { return {k_abcopy, t, 0, 0, mb, 8}; }
constexpr Outcome acopy(Int rows, Int cols, Int mb) {
  return {k_acopy, rows * cols, rows, cols, mb, 10000, 0, int(rows), 0};
}
constexpr Outcome bcopy_1d(Int t) { return {k_bcopy_1d, t, 0, 0, 512, 0, 0, 0, 1}; }
constexpr Outcome bcopy(Int t) { return {k_bcopy, t, 2, t / 2, 0, 0, 0, 0, int(t)}; }
constexpr Outcome bcopy_41(Int t) { return {k_bcopy_41, t, 2, t / 2, 0, 0, 0, 0, int(t)}; }

// The team and the problem of one selection, and the cache table's count and third size.
struct Point {
  char type;
  int machine_class;
  Int t, m, n, k;
  std::uint32_t cache_count = 3, third_size = 8u << 20;
};

constexpr bool is_complex_type(char type) { return type == 'c' || type == 'z'; }

inline Outcome row_or_col(const Point &p, Int t) { return p.m > p.n ? row(t) : col(t); }

// In classes 2 and 4, whether the problem is worth packing (large), and whether every thread then packs for itself.
struct Packing {
  bool large, alone;
};

inline Packing packing(const Point &p, Int even) {
  const Int m = p.m, n = p.n, k = p.k;
  const bool tall_enough = n <= m * even;
  const bool team_of_24 = p.machine_class == 4 && even == 24;
  const bool fives = m % 5000 == 0 && n % 5000 == 0;
  const bool huge = m >= 7000 && n >= 3000;
  switch (p.type) {
    case 'd':
      if (team_of_24) {
        const bool deep = n >= 500 && k >= 150;
        const bool deep_large = (m >= 14000 && n > 512) || (m > 600 && m < 14000) || (m <= 600 && n < 2000);
        const bool flat_large = huge || (m >= 1200 && n >= 1200 && k >= 128);
        return {tall_enough && m >= 500 && ((deep && deep_large) || (!deep && flat_large)),
                k <= 256 || (m >= 10000 && k <= 512) || fives || (m > 4700 && n >= 1000 && n <= 4000)};
      }
      return {tall_enough && m >= 1000 && ((k >= 150 && n >= 1000) || huge || (m >= 1200 && n >= 1200 && k >= 128)),
              true};
    case 's':
      if (team_of_24) {
        const bool deep = n >= 700 && k >= 512;
        return {tall_enough && m >= 700 && ((!deep && huge && k >= 120) || (deep && (m >= 801 || n < 3000))),
                (huge && k <= 512) || fives || (m >= 4800 && m <= 5400 && n >= 4000)};
      }
      return {tall_enough && m >= 2048 && ((k >= 512 && n >= 2048) || (huge && k >= 120)), true};
    default: {
      const bool c = p.type == 'c';
      const Int first = c ? 800 : 400, second = c ? 150 : 200, third = c ? 1000 : 600;
      return {(n >= 16 * even && m > 2 * n) ||
                  (m >= first && ((k >= second && n >= first) || huge || (m >= third && n >= third && k >= 128))),
              true};
    }
  }
}

inline Int abcopy_mb(const Point &p) {
  const bool c4 = p.machine_class == 4;
  switch (p.type) {
    case 's': return 1024;
    case 'd': return c4 ? 448 : p.m > 7000 && (p.k == 256 || p.k >= 512) ? 704 : 1024;
    case 'c': return c4 ? 448 : 1024;
    default: return c4 ? 256 : 512;
  }
}

// What a team of p.t threads does.
inline Outcome expected(const Point &p) {
  const char type = p.type;
  const Int t = p.t, even = t - t % 2, m = p.m, n = p.n, k = p.k;
  const bool real = !is_complex_type(type), d = type == 'd';
  const bool tall = m > 2 * n, broad = n > 2 * m;

  if (p.machine_class == 6 && d) {
    const bool one_way = t % 2 == 1 || tall || broad;
    const Int rows = one_way ? (m > n ? t : 1) : t % 4 == 0 ? 4 : 2;
    const Int cols = t / rows;
    return n / cols > 384 ? grid_fa(rows, cols) : grid_fb(rows, cols);
  }

  if (p.machine_class == 1) {
    if (!real) return bcopy(even);
    if (d && m >= 8000 && n >= 3000 && k <= 512 && m > n) return bcopy_1d(even);
    return grid_t(2, even / 2);
  }

  if (p.machine_class == 3) {
    if (!real) return (m >= 400 && n >= 400 && k >= 400) || !(tall || broad) ? bcopy(even) : row_or_col(p, even);
    const bool small_odd = d && t < 8 && t % 2 == 1;
    if (small_odd && !(m >= n && m / t < 32)) return row_or_col(p, t);
    const bool simple = t < 8 || m < 200 || n < 128 || k >= 5 * n || (m <= 1000 && (k < 200 || k > 2 * m));
    if (!d || simple) {
      const Int rows = m > 4 * n ? even : n > m * even ? 1 : 2;
      return grid_t(rows, even / rows);
    }
    const Int rows = m == 256 || m == 512 || even % 4 != 0 ? 2 : 4;  // a team of 8 or more has the four
    return acopy(rows, even / rows, p.cache_count > 0 && p.third_size <= 4u << 20 ? 384 : 1000);
  }

  if (p.machine_class == 2 || p.machine_class == 4) {
    if (d && p.machine_class == 4 && t == 3) return row_or_col(p, t);
    const Packing choice = packing(p, even);
    if (choice.large && choice.alone) return abcopy(even, abcopy_mb(p));
    if (choice.large) return xgemm(even);
    if (!real) return bcopy_41(even);
    return m > even * n ? grid_41(even, 1) : n > even * m ? grid_41(1, even) : grid_41(2, even / 2);
  }

  return row_or_col(p, t);
}

}  // namespace qtb::test
