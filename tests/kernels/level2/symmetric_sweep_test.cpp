// The products with a symmetric or Hermitian matrix and its rank updates, in every storage and tier.

#include <string_view>

namespace qtb::surface {
constexpr bool tests_shape(std::string_view shape) {
  for (const std::string_view tested : {"symv", "spmv", "sbmv", "syr", "her", "spr", "hpr", "syr2", "spr2"})
    if (shape == tested) return true;
  return false;
}
}  // namespace qtb::surface

#include "tests/kernels/level2/tier_sweeps.h"

int main(int argc, char **argv) { return qtb::surface::run_tier_sweeps(argc, argv); }
