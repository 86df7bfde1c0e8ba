// Every routine of Level 3 through its exported names, on random problems of all options, against the oracle.

#include "tests/product/surface/level3_shapes.h"
#include "tests/product/surface/sweeps.h"

#include "tests/product/surface/suite.h"
