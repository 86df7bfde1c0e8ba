// The GEMM families as the tests know them, and the panels of their tiles.
//
// The tiles are written down a second time on purpose: drivers and kernels agree on them through the panels.
#pragma once

#include <set>
#include <vector>

#include "tests/kernels/level3/pieces.h"
#include "tests/reference/panels.h"

namespace qtb::test {
namespace {

using reference::column_widths;
using reference::padded_depth;
using reference::padded_rows;

// The copy routines that have no slot: the bodies of their own tier call them.
#define DECLARE_COPY(T, name) extern "C" QTB_HIDDEN QTB_FUNCTION(panel_copy, T, name);
#define DECLARE_A_NT(tier, T, name)                    \
  DECLARE_COPY(T, qtb_blas_##tier##_x##name##_acopy_n) \
  DECLARE_COPY(T, qtb_blas_##tier##_x##name##_acopy_t)
#define DECLARE_B_NT(tier, T, name)                    \
  DECLARE_COPY(T, qtb_blas_##tier##_x##name##_bcopy_n) \
  DECLARE_COPY(T, qtb_blas_##tier##_x##name##_bcopy_t)
#define DECLARE_REAL(tier, T, name) DECLARE_A_NT(tier, T, name) DECLARE_B_NT(tier, T, name)
#define DECLARE_COMPLEX_A(tier, T, name) \
  DECLARE_A_NT(tier, T, name) DECLARE_COPY(T, qtb_blas_##tier##_x##name##_acopy_c)
#define DECLARE_TIER(tier, TIER)         \
  DECLARE_REAL(tier, float, sgemm)       \
  DECLARE_COMPLEX_A(tier, cfloat, cgemm) \
  DECLARE_COMPLEX_A(tier, cdouble, zgemm)
QTB_FOR_EACH_TIER(DECLARE_TIER)
DECLARE_REAL(def, double, dgemm)
DECLARE_REAL(def, double, dgemm_def)
DECLARE_REAL(sse3, double, dgemm)

template <class T>
struct Pieces {
  using Copy = QTB_FUNCTION_TYPE(panel_copy, T);
  using BPacked = QTB_FUNCTION_TYPE(gemm_bpacked, T);
  using APacked = QTB_FUNCTION_TYPE(gemm_apacked, T);
  using Packed = QTB_FUNCTION_TYPE(gemm_packed, T);
  const char *name;
  int tier;
  reference::PanelTile tile;
  Copy *acopy[3], *bcopy[3];  // N, T, C
  BPacked *bpacked;
  APacked *apacked;
  Packed *packed;
};

#define COPIES_REAL(p) \
  {p##_acopy_n, p##_acopy_t, p##_acopy_t}, { p##_bcopy_n, p##_bcopy_t, p##_bcopy_t }
#define COPIES_COMPLEX(p) \
  {p##_acopy_n, p##_acopy_t, p##_acopy_c}, { p##_bcopy_n, p##_bcopy_t, p##_bcopy_c }
#define REAL(tier, name, mr, nr, ku) #name, tier_##tier, {mr, nr, ku }, COPIES_REAL(qtb_blas_##tier##_x##name)
#define COMPLEX(tier, name, mr, nr, ku) #name, tier_##tier, {mr, nr, ku }, COPIES_COMPLEX(qtb_blas_##tier##_x##name)
constexpr std::nullptr_t none = nullptr;

template <class T>
const std::vector<Pieces<T>> families;

// clang-format off
template <>
const std::vector<Pieces<float>> families<float> = {
    {REAL(def,   sgemm,       8, 4, 4), none, none, none},
    {REAL(sse3,  sgemm,       8, 4, 4), none, none, none},
    {REAL(ssse3, sgemm,       8, 4, 4), none, none, none},
    {REAL(ssse3, sgemm_sse41, 8, 4, 4), none, none, qtb_blas_ssse3_xsgemm_sse41_packed},
    {REAL(sse42, sgemm,       4, 8, 4), none, none, none},
    {REAL(avx,   sgemm,       4, 8, 4), none, none, none},
};
template <>
const std::vector<Pieces<double>> families<double> = {
    {REAL(def,   dgemm,       2, 12, 4), none, none, none},
    {REAL(def,   dgemm_def,   4, 4, 4), none, none, none},
    {"dgemm", tier_sse3, {4, 4, 4, true}, COPIES_REAL(qtb_blas_sse3_xdgemm), none, none, none},
    {REAL(ssse3, dgemm,       4, 4, 4), qtb_blas_ssse3_xdgemm_bpacked, none, none},
    {REAL(ssse3, dgemm_sse41, 4, 4, 4), none, none, qtb_blas_ssse3_xdgemm_sse41_packed},
    {REAL(sse42, dgemm,       2, 8, 4), qtb_blas_sse42_xdgemm_bpacked, qtb_blas_sse42_xdgemm_apacked, none},
    {REAL(avx,   dgemm,       8, 4, 4), qtb_blas_avx_xdgemm_bpacked, none, none},
};
template <>
const std::vector<Pieces<cfloat>> families<cfloat> = {
    {COMPLEX(def,   cgemm,       4, 4, 4), none, none, none},
    {COMPLEX(sse3,  cgemm,       4, 4, 4), none, none, none},
    {COMPLEX(ssse3, cgemm,       4, 2, 2), qtb_blas_ssse3_xcgemm_bpacked, none, none},
    {COMPLEX(ssse3, cgemm_sse41, 4, 2, 4), qtb_blas_ssse3_xcgemm_sse41, none, qtb_blas_ssse3_xcgemm_sse41_packed},
    {COMPLEX(sse42, cgemm,       2, 4, 4), qtb_blas_sse42_xcgemm_bpacked, none, none},
    {COMPLEX(avx,   cgemm,       2, 4, 4), qtb_blas_avx_xcgemm_bpacked, none, none},
};
template <>
const std::vector<Pieces<cdouble>> families<cdouble> = {
    {COMPLEX(def,   zgemm,       2, 4, 4), none, none, none},
    {COMPLEX(sse3,  zgemm,       2, 4, 4), none, none, none},
    {COMPLEX(ssse3, zgemm,       2, 2, 2), qtb_blas_ssse3_xzgemm_bpacked, none, none},
    {COMPLEX(ssse3, zgemm_sse41, 2, 2, 4), qtb_blas_ssse3_xzgemm_sse41, none, qtb_blas_ssse3_xzgemm_sse41_packed},
    {COMPLEX(sse42, zgemm,       1, 4, 4), qtb_blas_sse42_xzgemm_bpacked, none, none},
    {COMPLEX(avx,   zgemm,       1, 4, 4), qtb_blas_avx_xzgemm_bpacked, none, none},
};
// clang-format on

// Elements of a panel whose micro-panels are ldp apart, the last of width w and depth kp.
inline std::size_t panel_size(std::size_t micro_panels, QtbInt ldp, QtbInt w, QtbInt kp) {
  return micro_panels == 0 ? 0 : (micro_panels - 1) * static_cast<std::size_t>(ldp) + static_cast<std::size_t>(w * kp);
}

template <class T>
struct Panel {
  QtbInt ldp;
  Guarded<T> array;
  Panel(std::size_t micro_panels, QtbInt step, QtbInt w, QtbInt kp)
      : ldp(step), array(panel_size(micro_panels, step, w, kp)) {
    for (std::size_t i = 0; i < array.size(); i++) array[i] = value<T>(NAN, NAN);
  }
};

template <class T>
Panel<T> a_panel(const Pieces<T> &p, QtbInt m, QtbInt k) {
  const QtbInt kp = padded_depth(p.tile, k);
  return {static_cast<std::size_t>(padded_rows(p.tile, m) / p.tile.mr), kp * p.tile.mr, p.tile.mr, kp};
}
template <class T>
Panel<T> b_panel(const Pieces<T> &p, QtbInt n, QtbInt k) {
  const QtbInt kp = padded_depth(p.tile, k);
  const std::vector<QtbInt> w = column_widths(p.tile, n);
  return {w.size(), kp * p.tile.nr, w.empty() ? 0 : w.back(), kp};
}

// Sizes around the tile.
template <class T>
std::set<QtbInt> row_counts(const Pieces<T> &p) {
  const QtbInt mr = p.tile.mr;
  return {1, mr - 1, mr, mr + 1, 2 * mr + 3, 8 * mr + 1};
}
template <class T>
std::set<QtbInt> column_counts(const Pieces<T> &p) {
  const QtbInt nr = p.tile.nr;
  return {1, 2, 3, nr - 1, nr, nr + 1, nr + 4, nr + 7, 2 * nr + 5, 2 * nr + 10};
}
constexpr QtbInt depths[] = {1, 3, 4, 5, 9, 16, 21};

}  // namespace
}  // namespace qtb::test
