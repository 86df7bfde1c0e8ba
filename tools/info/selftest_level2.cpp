// The self-test of the routines of Level 2.
#include "tests/product/surface/level2_shapes.h"

#include "tools/info/selftest_cases.h"

void qtb::info::test_level2(const Library &library, const Plan &plan, Result &result) {
#define QTB_ROUTINE QTB_SELFTEST_ROUTINE
#include "blas/routines.def"
#undef QTB_ROUTINE
}
