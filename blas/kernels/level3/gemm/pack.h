// Packing of a block of op(A) or op(B) into the micro-panels of its GEMM family (tiles.h has the format).
//
// Two designs serve both operands. Where the elements of one step of depth lie side by side in memory (A as it is, B
// transposed), a pass reads a cache line of each stored column and deals it out to as many micro-panels as it fills.
// Where the depth lies side by side (A transposed, B as it is), a pass runs down the columns of one micro-panel
// together and transposes small blocks in registers. What becomes of an element on the way is a Change: nothing, the
// product with alpha, the conjugate, or both. Each element is read once and all of a panel is written, zeros beyond the
// depth included; nothing outside the block is read. No alignment of source or panel is asked for.
#pragma once

#include "blas/kernels/element.h"
#include "blas/kernels/level3/gemm/family.h"
#include "blas/kernels/simd/repeat.h"

namespace qtb::QTB_TIER {
namespace {

// ---- What becomes of an element ----

template <class T>
struct Copied {
  Vec<T> operator()(Vec<T> v) const { return v; }
};

template <class T>
struct Conjugated {
  Vec<T> sign = alternate(Real<T>{0}, -Real<T>{0});
  Vec<T> operator()(Vec<T> v) const { return bit_xor(sign, v); }
};

// The element times alpha, rounded once per operation.
template <class T>
struct Scaled {
  Factor<T> alpha;
  explicit Scaled(T v) : alpha(v) {}
  Vec<T> operator()(Vec<T> v) const { return alpha.times(v); }
};

template <class T>
struct ScaledConjugate {
  Conjugated<T> conjugated;
  Scaled<T> scaled;
  explicit ScaledConjugate(T v) : scaled(v) {}
  Vec<T> operator()(Vec<T> v) const { return scaled(conjugated(v)); }
};

// One element: in all lanes of its kind, so that no lane computes on anything else.
template <class T, class Change>
void change_one(const T *from, T *to, const Change &change) {
  if constexpr (is_complex<T>)
    store_lowest(to, change(load_repeated(from)));
  else
    store_lowest(to, change(broadcast(load_single(from))));
}

// ---- Micro-panels ----

template <class T>
constexpr QtbInt line_elements = 64 / static_cast<QtbInt>(sizeof(T));

// Each pass asks for what the next one will read, as it meets the same column or the same depth: the source lies in
// short runs a column apart, mostly on other pages, and what processors foresee ends with the run. The last pass asks
// for what may lie beyond the block, which reads nothing.
template <class T>
void ask_for(const T *p, QtbInt ahead) {
  _mm_prefetch(reinterpret_cast<const char *>(reinterpret_cast<std::uintptr_t>(p) +
                                              static_cast<std::uintptr_t>(ahead) * sizeof(T)),
               _MM_HINT_T0);
}

template <class T>
void fill_with_zeros(QtbInt count, T *to) {
  for (QtbInt i = 0; i < count; i++) to[i] = T{};
}

// Step l of width w and micro-panel p takes element (p*w + i) + l*ld to place l*w + i, for panels micro-panels.
template <class T, int w, int panels, class Change>
void pack_side_by_side(QtbInt depth, QtbInt padded, const T *src, QtbInt ld, T *dst, QtbInt ldp, const Change &change) {
  constexpr int step = static_cast<int>(lanes<T>), whole = w / step;
  const T *from = src;
  for (QtbInt l = 0; l < depth; l++, from += ld) {
    T *to = dst + l * w;
    ask_for(from, panels * w);
    repeat<panels>([&](auto p) {
      const T *part = from + p.value * w;
      T *panel = to + p.value * ldp;
      repeat<whole>(
          [&](auto i) { store_unaligned(panel + i.value * step, change(load_unaligned(part + i.value * step))); });
      repeat<w % step>(
          [&](auto i) { change_one(part + whole * step + i.value, panel + whole * step + i.value, change); });
    });
  }
  for (int p = 0; p < panels; p++) fill_with_zeros((padded - depth) * w, dst + p * ldp + depth * w);
}

inline void transpose(__m128 (&v)[4]) { _MM_TRANSPOSE4_PS(v[0], v[1], v[2], v[3]); }
inline void transpose(__m128d (&v)[2]) {
  const __m128d low = _mm_unpacklo_pd(v[0], v[1]);
  v[1] = _mm_unpackhi_pd(v[0], v[1]);
  v[0] = low;
}
inline void transpose(__m128 (&v)[2]) {
  const __m128 low = _mm_movelh_ps(v[0], v[1]);
  v[1] = _mm_movehl_ps(v[1], v[0]);
  v[0] = low;
}
inline void transpose(__m128d (&)[1]) {}

// Step l of one micro-panel of width w takes element l + i*ld to place l*w + i.
template <class T, int w, class Change>
void pack_columns(QtbInt depth, QtbInt padded, const T *src, QtbInt ld, T *dst, Change change) {
  constexpr int step = static_cast<int>(lanes<T>), groups = w / step, line = static_cast<int>(line_elements<T>);
  const auto block = [=](QtbInt l) __attribute__((always_inline)) {
    repeat<groups>([&](auto g) __attribute__((always_inline)) {
      const T *from = src + l + g.value * step * ld;
      T *to = dst + l * w + g.value * step;
      Vec<T> v[step];
      repeat<step>([&](auto i) __attribute__((always_inline)) {
        Vec<T> x = load_unaligned(from + i.value * ld);
        // Loaded once: rather than transpose two vectors of two, compilers load the halves of both, four loads for two.
        if constexpr (step == 2) keep_in_place(x);
        v[i.value] = change(x);
      });
      transpose(v);
      repeat<step>([&](auto i) { store_unaligned(to + i.value * w, v[i.value]); });
    });
    for (int i = groups * step; i < w; i++)
      repeat<step>([&](auto s) { change_one(src + l + s.value + i * ld, dst + (l + s.value) * w + i, change); });
  };
  QtbInt l = 0;
  for (; l + line <= depth; l += line) {
    for (int i = 0; i < w; i++) ask_for(src + l + i * ld, w * ld);
    for (int s = 0; s < line; s += step) block(l + s);
  }
  for (; l + step <= depth; l += step) block(l);
  for (; l < depth; l++)
    for (int i = 0; i < w; i++) change_one(src + l + i * ld, dst + l * w + i, change);
  fill_with_zeros((padded - depth) * w, dst + depth * w);
}

// ---- Panels ----

// Full micro-panels of width w, as many of them at a time as one cache line of the source fills.
template <class T, int w, bool side_by_side, int panels, class Change>
void pack_full(QtbInt count, QtbInt depth, QtbInt padded, const T *src, QtbInt ld, T *dst, QtbInt ldp,
               const Change &change) {
  if constexpr (side_by_side) {
    for (; count >= panels; count -= panels, src += panels * w, dst += panels * ldp)
      pack_side_by_side<T, w, panels>(depth, padded, src, ld, dst, ldp, change);
    if constexpr (panels > 1)
      if (count > 0) pack_full<T, w, side_by_side, panels / 2>(count, depth, padded, src, ld, dst, ldp, change);
  } else {
    for (; count > 0; count--, src += w * ld, dst += ldp) pack_columns<T, w>(depth, padded, src, ld, dst, change);
  }
}

template <class T, int w>
constexpr int panels_per_line = line_elements<T> >= 8 * w   ? 8
                                : line_elements<T> >= 4 * w ? 4
                                : line_elements<T> >= 2 * w ? 2
                                                            : 1;

// One micro-panel of a width below nr.
template <class T, int w, bool side_by_side, class Change>
void pack_edge(QtbInt width, QtbInt depth, QtbInt padded, const T *src, QtbInt ld, T *dst, const Change &change) {
  if constexpr (w > 0) {
    if (width != w) return pack_edge<T, w - 1, side_by_side>(width, depth, padded, src, ld, dst, change);
    if constexpr (side_by_side)
      pack_side_by_side<T, w, 1>(depth, padded, src, ld, dst, 0, change);
    else
      pack_columns<T, w>(depth, padded, src, ld, dst, change);
  }
}

// All of count rows of op(A) or columns of op(B), in micro-panels of width and then, down to least, of the widths of
// panel_width.
template <class T, int width, QtbInt least, bool side_by_side, class Change>
void pack_panels(QtbInt count, QtbInt depth, QtbInt padded, const T *src, QtbInt ld, T *dst, QtbInt ldp,
                 const Change &change) {
  const QtbInt full = count / width, step = side_by_side ? 1 : ld;
  QtbInt left = count;
  // Small products have edges only, and feel the steps that would come to nothing.
  if (full > 0) {
    pack_full<T, width, side_by_side, panels_per_line<T, width>>(full, depth, padded, src, ld, dst, ldp, change);
    left -= full * width;
    src += full * width * step;
    dst += full * ldp;
  }
  for (QtbInt w; left >= least; left -= w, src += w * step, dst += ldp) {
    w = panel_width(width, left);
    if constexpr (width > 8)
      if (w == 8) {
        pack_full<T, 8, side_by_side, 1>(1, depth, padded, src, ld, dst, ldp, change);
        continue;
      }
    if constexpr (width > 4)
      if (w == 4) {
        pack_full<T, 4, side_by_side, 1>(1, depth, padded, src, ld, dst, ldp, change);
        continue;
      }
    pack_edge<T, (width > 4 ? 3 : width - 1), side_by_side>(w, depth, padded, src, ld, dst, change);
  }
}

// So many rows, fewer than mr; element (i, l) at src[i*row + l*step].
template <class T>
void pack_last_rows(QtbInt rows, QtbInt mr, QtbInt depth, QtbInt padded, const T *src, QtbInt row, QtbInt step, T *dst,
                    T alpha) {
  fill_with_zeros(padded * mr, dst);
  for (QtbInt l = 0; l < depth; l++)
    for (QtbInt i = 0; i < rows; i++) dst[l * mr + i] = alpha * load_single(src + i * row + l * step);
}

// The A panel of a family from a rows x depth block of op(A): alpha folded in. Rows beyond a multiple of mr are left
// out, but where the kernels take edges: a last micro-panel then has them.
template <class T, Op op, Family family>
void pack_a(QtbInt rows, QtbInt depth, const T *src, QtbInt ld, T *dst, QtbInt ldp, T alpha) {
  constexpr GemmRules rules = rules_of<T, family>;
  constexpr int mr = static_cast<int>(rules.mr);
  if (rows <= 0 || depth <= 0) return;
  const QtbInt whole = round_down(rows, mr), padded = round_up(depth, rules.ku);
  if constexpr (op == Op::conjugate)
    pack_panels<T, mr, mr, false>(whole, depth, padded, src, ld, dst, ldp, ScaledConjugate<T>(alpha));
  else
    pack_panels<T, mr, mr, op == Op::none>(whole, depth, padded, src, ld, dst, ldp, Scaled<T>(alpha));
  if constexpr (rules.walk.kernels_take_edges) {
    const QtbInt row = op == Op::none ? 1 : ld, step = op == Op::none ? ld : 1;
    if (whole < rows)
      pack_last_rows(rows - whole, rules.mr, depth, padded, src + whole * row, row, step, dst + whole / rules.mr * ldp,
                     alpha);
  }
}

// The B panel of a family from a depth x columns block of op(B). Fewer columns than its walk packs are left out.
template <class T, Op op, Family family>
void pack_b(QtbInt depth, QtbInt columns, const T *src, QtbInt ld, T *dst, QtbInt ldp) {
  constexpr GemmRules rules = rules_of<T, family>;
  constexpr int nr = static_cast<int>(rules.nr);
  constexpr QtbInt least = rules.walk.columns;
  if (depth <= 0 || columns <= 0) return;
  const QtbInt padded = round_up(depth, rules.ku);
  if constexpr (op == Op::conjugate)
    pack_panels<T, nr, least, true>(columns, depth, padded, src, ld, dst, ldp, Conjugated<T>());
  else
    pack_panels<T, nr, least, op == Op::transpose>(columns, depth, padded, src, ld, dst, ldp, Copied<T>());
}

}  // namespace
}  // namespace qtb::QTB_TIER
