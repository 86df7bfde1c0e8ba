// The problems of the published Level-3 tester, against the oracle.

#include "tests/product/surface/level3_shapes.h"
#include "tests/product/surface/published.h"

#include "tests/product/surface/suite.h"
