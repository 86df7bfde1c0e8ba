// The tiers' procedures of band and packed matrices without symmetry, by element type, and numbers for their operands.
#pragma once

#include <cmath>
#include <vector>

#include "tests/kernels/level2/numbers.h"
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
