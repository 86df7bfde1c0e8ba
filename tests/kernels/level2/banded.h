// The tiers' procedures of band and packed matrices without symmetry, by element type, and numbers for their operands.
#pragma once

#include <cmath>
#include <cstring>
#include <vector>

#include "tests/reference/level2.h"
#include "tests/support/tiers.h"

extern "C" {
#define QTB_GENERAL_FORMS(tier, TIER)                                      \
  QTB_HIDDEN QTB_FUNCTION(tbmv, cfloat, qtb_blas_##tier##_ctbmv_general);  \
  QTB_HIDDEN QTB_FUNCTION(tbmv, cfloat, qtb_blas_##tier##_ctbsv_general);  \
  QTB_HIDDEN QTB_FUNCTION(tbmv, cdouble, qtb_blas_##tier##_ztbmv_general); \
  QTB_HIDDEN QTB_FUNCTION(tbmv, cdouble, qtb_blas_##tier##_ztbsv_general);
QTB_FOR_EACH_TIER(QTB_GENERAL_FORMS)
#undef QTB_GENERAL_FORMS
}

namespace qtb::test {

#define QTB_GENERAL_FORM(tier, TIER, name) qtb_blas_##tier##_##name##_general,
#define QTB_ALL_GENERAL_FORMS(name) \
  { QTB_FOR_EACH_TIER(QTB_GENERAL_FORM, name) }

template <class F>
using InTiers = F *[tier_count];

template <class T>
struct Banded {
  InTiers<QTB_FUNCTION_TYPE(gbmv, T)> gbmv;
  InTiers<QTB_FUNCTION_TYPE(tbmv, T)> tbmv, tbsv;
  InTiers<QTB_FUNCTION_TYPE(tpmv, T)> tpmv, tpsv;
  // The general forms that the complex types have besides.
  InTiers<QTB_FUNCTION_TYPE(tbmv, T)> general_tbmv, general_tbsv;
};
template <class T>
constexpr Banded<T> banded;
template <>
constexpr Banded<float> banded<float> = {QTB_ALL_TIERS(sgbmv), QTB_ALL_TIERS(stbmv), QTB_ALL_TIERS(stbsv),
                                         QTB_ALL_TIERS(stpmv), QTB_ALL_TIERS(stpsv), QTB_ALL_TIERS(stbmv),
                                         QTB_ALL_TIERS(stbsv)};
template <>
constexpr Banded<double> banded<double> = {QTB_ALL_TIERS(dgbmv), QTB_ALL_TIERS(dtbmv), QTB_ALL_TIERS(dtbsv),
                                           QTB_ALL_TIERS(dtpmv), QTB_ALL_TIERS(dtpsv), QTB_ALL_TIERS(dtbmv),
                                           QTB_ALL_TIERS(dtbsv)};
template <>
constexpr Banded<cfloat> banded<cfloat> = {
    QTB_ALL_TIERS(cgbmv), QTB_ALL_TIERS(ctbmv),         QTB_ALL_TIERS(ctbsv),        QTB_ALL_TIERS(ctpmv),
    QTB_ALL_TIERS(ctpsv), QTB_ALL_GENERAL_FORMS(ctbmv), QTB_ALL_GENERAL_FORMS(ctbsv)};
template <>
constexpr Banded<cdouble> banded<cdouble> = {
    QTB_ALL_TIERS(zgbmv), QTB_ALL_TIERS(ztbmv),         QTB_ALL_TIERS(ztbsv),        QTB_ALL_TIERS(ztpmv),
    QTB_ALL_TIERS(ztpsv), QTB_ALL_GENERAL_FORMS(ztbmv), QTB_ALL_GENERAL_FORMS(ztbsv)};

template <class T>
T element(double re, double im) {
  if constexpr (is_complex<T>)
    return {static_cast<Real<T>>(re), static_cast<Real<T>>(im)};
  else
    return static_cast<T>(re);
}
template <class T>
T not_a_number() {
  return element<T>(NAN, NAN);
}
template <class T>
bool is_not_a_number(T v) {
  if constexpr (is_complex<T>)
    return std::isnan(v.re) || std::isnan(v.im);
  else
    return std::isnan(v);
}

// Numbers in (-1, 1) that need all digits, the same for the same seed.
template <class T>
std::vector<T> numbers(QtbInt count, unsigned seed) {
  std::vector<T> v(static_cast<std::size_t>(count));
  std::uint64_t state = seed;
  const auto next = [&] {
    state = state * 6364136223846793005U + 1442695040888963407U;
    return static_cast<double>(static_cast<std::int64_t>(state) >> 11) * 0x1p-52;
  };
  for (T &e : v) {
    const double re = next(), im = next();
    e = element<T>(re, im);
  }
  return v;
}

template <class T>
bool same(const std::vector<T> &a, const std::vector<T> &b) {
  return a.size() == b.size() && std::memcmp(a.data(), b.data(), a.size() * sizeof(T)) == 0;
}

// The worst error / bound of a contiguous result.
template <class T>
double worst_ratio(const std::vector<T> &got, const reference::Expectation &want) {
  double worst = 0;
  for (std::size_t i = 0; i < got.size(); ++i) {
    const reference::Expected &e = want.at(static_cast<QtbInt>(i), 0);
    if (e.outcome == reference::Outcome::unchanged) continue;
    const T value = e.outcome == reference::Outcome::residual ? T{} : got[i];
    worst = std::fmax(worst, error_ratio(value, e.value, Quad(e.gauge), want.roundings, want.alpha_magnitude));
  }
  return worst;
}

}  // namespace qtb::test
