// The self-test of the routines of Level 3.
#include "tests/product/surface/level3_shapes.h"

#include "tools/info/selftest_cases.h"

void qtb::info::test_level3(const Library &library, const Plan &plan, Result &result) {
#define QTB_ROUTINE QTB_SELFTEST_ROUTINE
#include "blas/routines.def"
#undef QTB_ROUTINE
}
