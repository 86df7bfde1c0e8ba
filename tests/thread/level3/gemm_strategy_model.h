// What every thread of a partition strategy does, written a second time as plain lists: for each thread its steps in
// order, each with the rectangle of op(A), op(B) or C that it works on, the place in the panel, and the phase, which
// counts the barriers that lie before it. Steps of no rows, columns or depth are left out: they do nothing.
//
// The lists come from the rules of the strategies alone and share no text with the library, so that a bound that is
// wrong on one side shows as a difference.
#pragma once

#include <algorithm>
#include <cstdint>
#include <ostream>
#include <vector>

namespace qtb::test::gemm_model {

enum class Action { pack_a, pack_b, compute };

struct Step {
  Action what;
  std::int64_t row, rows;      // of op(A) and C; 0, 0 in pack_b
  std::int64_t col, cols;      // of op(B) and C; 0, 0 in pack_a
  std::int64_t depth, depths;  // of k
  std::int64_t place;  // byte offset into the shared or own panel that is written, or is read by compute; -1: none
  std::int64_t ld;     // stride between the strips of that panel, in elements; 0: none
  std::int64_t phase;  // barriers before this step
  friend bool operator==(const Step &, const Step &) = default;
};

inline std::ostream &operator<<(std::ostream &out, const Step &s) {
  const char *names[] = {"pack A", "pack B", "compute"};
  return out << names[static_cast<int>(s.what)] << " rows " << s.row << "+" << s.rows << " columns " << s.col << "+"
             << s.cols << " depth " << s.depth << "+" << s.depths << " place " << s.place << " ld " << s.ld << " phase "
             << s.phase;
}

struct Schedule {
  std::vector<std::vector<Step>> threads;
  std::int64_t phases = 0;  // barriers in all; without any, the end of the region is what makes C whole
};

struct Setting {
  std::int64_t m, n, k;
  std::int64_t t, r, c;     // threads that take part, grid
  std::int64_t mb, nb, kb;  // blocks
  std::int64_t mu, nu, ku;  // multiples of the kernel
  std::int64_t width;       // bytes of an element
};

inline std::int64_t up(std::int64_t x, std::int64_t unit) { return (x + unit - 1) / unit * unit; }
inline std::int64_t down(std::int64_t x, std::int64_t unit) { return x / unit * unit; }

inline void add(Schedule &all, std::int64_t thread, const Step &s) {
  const bool row_side = s.what == Action::pack_b || s.rows > 0;
  const bool col_side = s.what == Action::pack_a || s.cols > 0;
  if (row_side && col_side && s.depths > 0) all.threads[static_cast<std::size_t>(thread)].push_back(s);
}

inline Schedule rows_of_c(const Setting &p) {
  Schedule all{std::vector<std::vector<Step>>(static_cast<std::size_t>(p.t)), 0};
  const std::int64_t q = p.m / p.t;
  for (std::int64_t i = 0; i < p.t; i++) {
    const std::int64_t rows = i < p.t - 1 ? q : std::max<std::int64_t>(p.m - q * i, 0);
    add(all, i, {Action::compute, std::min(q * i, p.m - 1), rows, 0, p.n, 0, p.k, -1, 0, 0});
  }
  return all;
}

inline Schedule columns_of_c(const Setting &p) {
  Schedule all{std::vector<std::vector<Step>>(static_cast<std::size_t>(p.t)), 0};
  const std::int64_t q = p.n / p.t;
  for (std::int64_t i = 0; i < p.t; i++) {
    const std::int64_t cols = i < p.t - 1 ? q : std::max<std::int64_t>(p.n - q * i, 0);
    add(all, i, {Action::compute, 0, p.m, std::min(q * i, p.n - 1), cols, 0, p.k, -1, 0, 0});
  }
  return all;
}

// One packed B for all threads, rows shared out.
inline Schedule shared_b_rows(const Setting &p) {
  const std::int64_t t = p.t / 2 * 2;
  Schedule all{std::vector<std::vector<Step>>(static_cast<std::size_t>(t)), 0};
  const std::int64_t row_share = down(p.m / t, p.mu);
  const std::int64_t widest = std::min(p.nb, p.n);
  if (p.k < 1 || p.n < 1) return all;
  for (std::int64_t kk = 0; kk < p.k; kk += p.kb) {
    const std::int64_t kc = std::min(kk + p.kb, p.k) - kk;
    const std::int64_t kr = up(kc, p.ku);
    for (std::int64_t jj = 0; jj < p.n; jj += widest) {
      const std::int64_t nc = std::min(jj + widest, p.n) - jj;
      const std::int64_t share = down(nc / t, p.nu);
      for (std::int64_t i = 0; i < t; i++)
        add(all, i,
            {Action::pack_b, 0, 0, jj + i * share, i < t - 1 ? share : nc - (t - 1) * share, kk, kc,
             i * share * kr * p.width, p.nu * kr, all.phases});
      all.phases++;
      for (std::int64_t i = 0; i < t; i++) {
        const std::int64_t rows = i < t - 1 ? row_share : std::max(p.m - i * row_share, row_share);
        for (std::int64_t ii = 0; ii < rows; ii += p.mb)
          add(all, i,
              {Action::compute, i * row_share + ii, std::min(ii + p.mb, rows) - ii, jj, nc, kk, kc, 0, p.nu * kr,
               all.phases});
      }
      all.phases++;
    }
  }
  return all;
}

// Tiles without packing; threads run down the columns of the grid. No barrier.
inline Schedule tiles(const Setting &p) {
  Schedule all{std::vector<std::vector<Step>>(static_cast<std::size_t>(p.t)), 0};
  const std::int64_t row_share = down(p.m / p.r, p.mu);
  const std::int64_t col_share = down(p.n / p.c, 4);
  for (std::int64_t i = 0; i < p.t; i++) {
    const std::int64_t ci = i / p.r, ri = i - p.r * ci;
    const std::int64_t rows = ri != p.r - 1 ? row_share : std::max<std::int64_t>(p.m - (p.r - 1) * row_share, 0);
    const std::int64_t cols = i < p.t - p.t / p.c ? col_share : std::max<std::int64_t>(p.n - (p.c - 1) * col_share, 0);
    add(all, i, {Action::compute, ri * row_share, rows, ci * col_share, cols, 0, p.k, -1, 0, 0});
  }
  return all;
}

// Tiles, each walked in blocks of columns, rows, depth.
inline Schedule tiles_in_blocks(const Setting &p) {
  Schedule all{std::vector<std::vector<Step>>(static_cast<std::size_t>(p.t)), 0};
  const std::int64_t row_share = down(p.m / p.r, p.mu);
  const std::int64_t col_share = p.n / p.c;
  const std::int64_t last_rows = std::max<std::int64_t>(p.m - p.r * row_share + row_share, 0);
  const std::int64_t last_cols = std::max<std::int64_t>(p.n - p.c * col_share + col_share, 0);
  for (std::int64_t i = 0; i < p.t; i++) {
    const std::int64_t ci = i / p.r, ri = i - p.r * ci;
    const std::int64_t cols = i < p.t - p.t / p.c ? col_share : last_cols;
    const std::int64_t rows = i < p.r * ci + p.r - 1 ? row_share : last_rows;
    for (std::int64_t j = 0; j < cols; j += p.nb)
      for (std::int64_t ii = 0; ii < rows; ii += p.mb)
        for (std::int64_t l = 0; l < p.k; l += p.kb)
          add(all, i,
              {Action::compute, ri * row_share + ii, std::min(ii + p.mb, rows) - ii, ci * col_share + j,
               std::min(j + p.nb, cols) - j, l, std::min(l + p.kb, p.k) - l, -1, 0, 0});
  }
  return all;
}

// A row group shares a packed A, its threads split the columns. A share of the packing below 0 counts as 0.
inline Schedule shared_a(const Setting &p) {
  constexpr std::int64_t spare = 8704, rows_up_to = 64;
  Schedule all{std::vector<std::vector<Step>>(static_cast<std::size_t>(p.t)), 0};
  const std::int64_t panel = (p.mb * p.kb * p.width + spare);
  const std::int64_t row_share = down(p.m / p.r, p.mu);
  const std::int64_t last_rows = p.m - (p.t / p.c - 1) * row_share;
  for (std::int64_t kk = 0; kk < p.k; kk += p.kb) {
    const std::int64_t kc = std::min(kk + p.kb, p.k) - kk;
    const std::int64_t kr = up(kc, p.ku);
    for (std::int64_t ii = 0; ii < last_rows; ii += p.mb) {
      const std::int64_t rn = std::min(ii + p.mb, row_share) - ii;
      const std::int64_t rl = std::min(ii + p.mb, last_rows) - ii;
      for (std::int64_t i = 0; i < p.t; i++) {
        const std::int64_t g = i / p.c, q = i - p.c * g;
        const std::int64_t rows = i < p.t - p.c ? rn : rl;
        const std::int64_t base = g * panel / 8 * 8;
        if (p.k / p.c <= rows_up_to) {
          const std::int64_t share = std::max<std::int64_t>(down(rn / p.c, 8), 0);
          add(all, i,
              {Action::pack_a, g * row_share + ii + q * share, q < p.c - 1 ? share : rows - q * share, 0, 0, kk, kc,
               base + q * share * kr * p.width, p.mu * kr, all.phases});
        } else {
          const std::int64_t share = down(kc / p.c, 4);
          add(all, i,
              {Action::pack_a, g * row_share + ii, rows, 0, 0, kk + q * share, q < p.c - 1 ? share : kc - q * share,
               base + q * share * p.mu * p.width, p.mu * kr, all.phases});
        }
      }
      all.phases++;
      const std::int64_t v = std::min<std::int64_t>(p.n, 10'000'000);
      for (std::int64_t jj = 0; jj < p.n; jj += v) {
        const std::int64_t nc = std::min(jj + v, p.n) - jj;
        const std::int64_t share = down(nc / p.c, p.nu);
        for (std::int64_t i = 0; i < p.t; i++) {
          const std::int64_t g = i / p.c, q = i - p.c * g;
          const std::int64_t cols = i < p.c * g + p.c - 1 ? share : std::max<std::int64_t>(nc - (p.c - 1) * share, 0);
          add(all, i,
              {Action::compute, g * row_share + ii, i < p.t - p.c ? rn : rl, jj + q * share, cols, kk, kc,
               g * panel / 8 * 8, p.mu * kr, all.phases});
        }
        all.phases++;
      }
    }
  }
  return all;
}

// Pairs of threads share a packed B and split the rows.
inline Schedule shared_b_pairs(const Setting &p) {
  constexpr std::int64_t spare = 8704;
  Schedule all{std::vector<std::vector<Step>>(static_cast<std::size_t>(p.t)), 0};
  const std::int64_t row_share = down(p.m / p.r, p.mu);
  const std::int64_t col_share = down(p.n / p.c, p.nu);
  const std::int64_t last_cols = p.n - (p.t / 2 - 1) * col_share;
  const std::int64_t widest = std::max(col_share, last_cols);
  if (widest < 1) return all;
  const std::int64_t step_cols = std::min(p.nb, widest);
  const std::int64_t panel = step_cols * p.kb * p.width + spare;
  for (std::int64_t jj = 0; jj < widest; jj += step_cols) {
    const std::int64_t ncn = std::min(jj + step_cols, col_share) - jj;
    const std::int64_t ncl = std::min(jj + step_cols, widest) - jj;
    for (std::int64_t kk = 0; kk < p.k; kk += p.kb) {
      const std::int64_t kc = std::min(kk + p.kb, p.k) - kk;
      const std::int64_t kr = up(kc, p.ku);
      for (std::int64_t i = 0; i < p.t; i += 2)
        add(all, i,
            {Action::pack_b, 0, 0, col_share * (i / 2) + jj, i < p.t - 2 ? ncn : ncl, kk, kc, i / 2 * panel / 8 * 8,
             p.nu * kr, all.phases});
      all.phases++;
      for (std::int64_t i = 0; i < p.t; i++)
        add(all, i,
            {Action::compute, i % 2 * row_share, i % 2 == 0 ? row_share : std::max<std::int64_t>(p.m - row_share, 0),
             i / 2 * col_share + jj, i < p.t - 2 ? ncn : ncl, kk, kc, i / 2 * panel / 8 * 8, p.nu * kr, all.phases});
      all.phases++;
    }
  }
  return all;
}

// Rows shared out; each thread packs A and B for itself and walks the slabs of B from its own number on. Place 0 is the
// thread's own panel; of a compute step `ld` is that of A.
inline Schedule own_a_and_b(const Setting &p) {
  Schedule all{std::vector<std::vector<Step>>(static_cast<std::size_t>(p.t)), 0};
  const std::int64_t row_share = down(p.m / p.t, p.mu);
  const std::int64_t last_rows = p.m - (p.t - 1) * row_share;
  const std::int64_t super = p.t * p.nb;
  const std::int64_t whole = p.n / super * super;
  for (std::int64_t i = 0; i < p.t; i++) {
    const std::int64_t first = i * row_share;
    for (std::int64_t kk = 0; kk < p.k; kk += p.kb) {
      const std::int64_t kc = std::min(kk + p.kb, p.k) - kk;
      const std::int64_t kr = up(kc, p.ku);
      for (std::int64_t ii = 0; ii < row_share; ii += p.mb) {
        const bool rest = i == p.t - 1 && ii + p.mb >= row_share;
        const std::int64_t block = rest ? last_rows - ii : std::min(ii + p.mb, row_share) - ii;
        add(all, i, {Action::pack_a, first + ii, block, 0, 0, kk, kc, 0, p.mu * kr, 0});
        const auto slab = [&](std::int64_t col, std::int64_t cols) {
          add(all, i, {Action::pack_b, 0, 0, col, cols, kk, kc, 0, p.nu * kr, 0});
          add(all, i, {Action::compute, first + ii, block, col, cols, kk, kc, 0, p.mu * kr, 0});
        };
        for (std::int64_t jj = 0; jj < whole; jj += super)
          for (std::int64_t turn = 0; turn < p.t; turn++) slab(jj + (i + turn) % p.t * p.nb, p.nb);
        for (std::int64_t j = whole; j < p.n; j += p.nb) slab(j, std::min(j + p.nb, p.n) - j);
      }
    }
  }
  return all;
}

}  // namespace qtb::test::gemm_model
