// Every routine of Level 1 and of the sparse vectors through its exported names, on random problems of all options,
// against the oracle.

#include "tests/product/surface/level1_shapes.h"
#include "tests/product/surface/sweeps.h"

#include "tests/product/surface/suite.h"
