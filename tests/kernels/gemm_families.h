// The GEMM families as the tests know them, and the panels of their tiles.
//
// The tiles are written down a second time on purpose: drivers and kernels agree on them through the panels.
#pragma once

#include <set>
#include <vector>

#include "tests/kernels/pieces.h"

namespace qtb::test {
namespace {

template <class T>
struct Pieces {
  using Copy = QTB_FUNCTION_TYPE(panel_copy, T);
  using BPacked = QTB_FUNCTION_TYPE(gemm_bpacked, T);
  using APacked = QTB_FUNCTION_TYPE(gemm_apacked, T);
  using Packed = QTB_FUNCTION_TYPE(gemm_packed, T);
  const char *name;
  int tier;
  QtbInt mr, nr, ku;
  Copy *acopy[3], *bcopy[3];  // N, T, C
  BPacked *bpacked;
  APacked *apacked;
  Packed *packed;
};

#define COPIES_NT(name) \
  { name##_n, name##_t, name##_t }
#define COPIES_NTC(name) \
  { name##_n, name##_t, name##_c }
constexpr std::nullptr_t none = nullptr;

template <class T>
const std::vector<Pieces<T>> families;

template <>
const std::vector<Pieces<float>> families<float> = {
    {"sgemm_sse41", tier_ssse3, 8, 4, 4, COPIES_NT(qtb_blas_ssse3_xsgemm_sse41_acopy),
     COPIES_NT(qtb_blas_ssse3_xsgemm_sse41_bcopy), none, none, qtb_blas_ssse3_xsgemm_sse41_packed},
};
template <>
const std::vector<Pieces<double>> families<double> = {
    {"dgemm", tier_ssse3, 4, 4, 4, COPIES_NT(qtb_blas_ssse3_xdgemm_acopy), COPIES_NT(qtb_blas_ssse3_xdgemm_bcopy),
     qtb_blas_ssse3_xdgemm_bpacked, none, none},
    {"dgemm_sse41", tier_ssse3, 4, 4, 4, COPIES_NT(qtb_blas_ssse3_xdgemm_sse41_acopy),
     COPIES_NT(qtb_blas_ssse3_xdgemm_sse41_bcopy), none, none, qtb_blas_ssse3_xdgemm_sse41_packed},
    {"dgemm", tier_sse42, 2, 8, 4, COPIES_NT(qtb_blas_sse42_xdgemm_acopy), COPIES_NT(qtb_blas_sse42_xdgemm_bcopy),
     qtb_blas_sse42_xdgemm_bpacked, qtb_blas_sse42_xdgemm_apacked, none},
    {"dgemm", tier_avx, 8, 4, 4, COPIES_NT(qtb_blas_avx_xdgemm_acopy), COPIES_NT(qtb_blas_avx_xdgemm_bcopy),
     qtb_blas_avx_xdgemm_bpacked, none, none},
};
template <>
const std::vector<Pieces<cfloat>> families<cfloat> = {
    {"cgemm", tier_def, 4, 4, 4, {}, COPIES_NTC(qtb_blas_def_xcgemm_bcopy), none, none, none},
    {"cgemm", tier_sse3, 4, 4, 4, {}, COPIES_NTC(qtb_blas_sse3_xcgemm_bcopy), none, none, none},
    {"cgemm",
     tier_ssse3,
     4,
     2,
     2,
     {},
     COPIES_NTC(qtb_blas_ssse3_xcgemm_bcopy),
     qtb_blas_ssse3_xcgemm_bpacked,
     none,
     none},
    {"cgemm_sse41", tier_ssse3, 4, 2, 4, COPIES_NTC(qtb_blas_ssse3_xcgemm_sse41_acopy),
     COPIES_NTC(qtb_blas_ssse3_xcgemm_sse41_bcopy), qtb_blas_ssse3_xcgemm_sse41, none,
     qtb_blas_ssse3_xcgemm_sse41_packed},
    {"cgemm",
     tier_sse42,
     2,
     4,
     4,
     {},
     COPIES_NTC(qtb_blas_sse42_xcgemm_bcopy),
     qtb_blas_sse42_xcgemm_bpacked,
     none,
     none},
    {"cgemm", tier_avx, 2, 4, 4, {}, COPIES_NTC(qtb_blas_avx_xcgemm_bcopy), qtb_blas_avx_xcgemm_bpacked, none, none},
};
template <>
const std::vector<Pieces<cdouble>> families<cdouble> = {
    {"zgemm", tier_def, 2, 4, 4, {}, COPIES_NTC(qtb_blas_def_xzgemm_bcopy), none, none, none},
    {"zgemm", tier_sse3, 2, 4, 4, {}, COPIES_NTC(qtb_blas_sse3_xzgemm_bcopy), none, none, none},
    {"zgemm",
     tier_ssse3,
     2,
     2,
     2,
     {},
     COPIES_NTC(qtb_blas_ssse3_xzgemm_bcopy),
     qtb_blas_ssse3_xzgemm_bpacked,
     none,
     none},
    {"zgemm_sse41", tier_ssse3, 2, 2, 4, COPIES_NTC(qtb_blas_ssse3_xzgemm_sse41_acopy),
     COPIES_NTC(qtb_blas_ssse3_xzgemm_sse41_bcopy), qtb_blas_ssse3_xzgemm_sse41, none,
     qtb_blas_ssse3_xzgemm_sse41_packed},
    {"zgemm",
     tier_sse42,
     1,
     4,
     4,
     {},
     COPIES_NTC(qtb_blas_sse42_xzgemm_bcopy),
     qtb_blas_sse42_xzgemm_bpacked,
     none,
     none},
    {"zgemm", tier_avx, 1, 4, 4, {}, COPIES_NTC(qtb_blas_avx_xzgemm_bcopy), qtb_blas_avx_xzgemm_bpacked, none, none},
};

inline QtbInt round_up(QtbInt v, QtbInt multiple) { return (v + multiple - 1) / multiple * multiple; }

// The widths of the micro-panels of n columns of B.
inline std::vector<QtbInt> widths(QtbInt nr, QtbInt n) {
  std::vector<QtbInt> w(static_cast<std::size_t>(n / nr), nr);
  QtbInt rest = n % nr;
  if (nr == 8 && rest >= 4) {
    w.push_back(4);
    rest -= 4;
  }
  if (rest > 0) w.push_back(rest);
  return w;
}

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
  const QtbInt kp = round_up(k, p.ku);
  return {static_cast<std::size_t>(m / p.mr), kp * p.mr, p.mr, kp};
}
template <class T>
Panel<T> b_panel(const Pieces<T> &p, QtbInt n, QtbInt k) {
  const QtbInt kp = round_up(k, p.ku);
  const std::vector<QtbInt> w = widths(p.nr, n);
  return {w.size(), kp * p.nr, w.empty() ? 0 : w.back(), kp};
}

// Sizes around the tile.
template <class T>
std::set<QtbInt> row_counts(const Pieces<T> &p) {
  return {1, p.mr - 1, p.mr, p.mr + 1, 2 * p.mr + 3};
}
template <class T>
std::set<QtbInt> column_counts(const Pieces<T> &p) {
  return {1, 2, 3, p.nr - 1, p.nr, p.nr + 1, p.nr + 4, p.nr + 7, 2 * p.nr + 5};
}
constexpr QtbInt depths[] = {1, 3, 4, 5, 9};

}  // namespace
}  // namespace qtb::test
