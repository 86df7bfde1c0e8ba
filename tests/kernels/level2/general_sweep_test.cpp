// The product with a full matrix, its rank update, and the product and the solve with a full triangle, in every tier.

#include <string_view>

namespace qtb::surface {
constexpr bool tests_shape(std::string_view shape) { return shape == "gemv" || shape == "ger" || shape == "trmv"; }
}  // namespace qtb::surface

#include "tests/kernels/level2/tier_sweeps.h"

int main(int argc, char **argv) { return qtb::surface::run_tier_sweeps(argc, argv); }
