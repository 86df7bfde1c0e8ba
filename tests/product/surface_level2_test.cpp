// Every routine of Level 2 through its exported names, on random problems of all options, against the oracle.

#include "tests/product/surface/level2_shapes.h"
#include "tests/product/surface/sweeps.h"

#include "tests/product/surface/suite.h"
