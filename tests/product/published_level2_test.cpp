// The problems of the published Level-2 tester, against the oracle.

#include "tests/product/surface/level2_shapes.h"
#include "tests/product/surface/published.h"

#include "tests/product/surface/suite.h"
