// Reports of bad arguments through the two faces of a companion.
#include <gtest/gtest.h>

#include <cstdint>
#include <set>
#include <sstream>
#include <string>
#include <thread>

#include "include/qtb/cblas.h"

extern "C" void dgemm_(const char *transa, const char *transb, const std::int32_t *m, const std::int32_t *n,
                       const std::int32_t *k, const double *alpha, const double *a, const std::int32_t *lda,
                       const double *b, const std::int32_t *ldb, const double *beta, double *c,
                       const std::int32_t *ldc);

namespace {

const std::int32_t bad = -1, one = 1;
const double factor = 1, a[1] = {1};
double c[1] = {1};

void bad_columns_in_fortran() { dgemm_("N", "N", &one, &bad, &one, &factor, a, &one, a, &one, &factor, c, &one); }
void bad_columns_in_rows() {
  cblas_dgemm(CblasRowMajor, CblasNoTrans, CblasNoTrans, one, bad, one, factor, a, one, a, one, factor, c, one);
}

std::set<std::string> lines_of(const std::string &text) {
  std::set<std::string> lines;
  std::istringstream in(text);
  for (std::string line; std::getline(in, line);)
    if (!line.empty()) lines.insert(line);
  return lines;
}

TEST(Reports, AnOptionIsToldAheadOfIntegersThatAreNotThere) {
  testing::internal::CaptureStdout();
  dgemm_("X", "N", nullptr, nullptr, nullptr, &factor, a, nullptr, a, nullptr, &factor, c, nullptr);
  const std::string text = testing::internal::GetCapturedStdout();
  EXPECT_NE(text.find("Parameter 1 "), std::string::npos) << text;
  EXPECT_NE(text.find("DGEMM"), std::string::npos) << text;
}

TEST(Reports, ThreadsThatReportThroughBothFacesKeepTheirOwnNamesAndPositions) {
  testing::internal::CaptureStdout();
  bad_columns_in_fortran();
  bad_columns_in_rows();
  const std::set<std::string> alone = lines_of(testing::internal::GetCapturedStdout());
  ASSERT_EQ(alone.size(), 2U);

  testing::internal::CaptureStdout();
  constexpr int reports = 2000;
  const auto repeat = [](void report()) {
    for (int i = 0; i < reports; i++) report();
  };
  std::thread fortran(repeat, bad_columns_in_fortran), rows(repeat, bad_columns_in_rows);
  fortran.join();
  rows.join();
  EXPECT_EQ(lines_of(testing::internal::GetCapturedStdout()), alone);
}

}  // namespace
