// The products with band matrices, and the products and solves with band and packed triangles, in every tier; and the
// general forms of the complex band triangles, which the tiers choose by order and width.

#include <string_view>

namespace qtb::surface {
constexpr bool tests_shape(std::string_view shape) { return shape == "gbmv" || shape == "tbmv" || shape == "tpmv"; }
}  // namespace qtb::surface

#include "tests/kernels/level2/banded.h"
#include "tests/kernels/level2/tier_sweeps.h"

namespace qtb::surface {
namespace {

// The name in a test's label; what a routine does is told by the published name.
template <class T>
void register_general(const char *name, const char *label,
                      const test::InTiers<QTB_FUNCTION_TYPE(tbmv, T)> &procedures) {
  test::in_every_tier([&](int tier) {
    using R = Routine<QTB_FUNCTION_TYPE(tbmv, T)>;
    static std::map<std::string, std::string> labels;  // outlive the tests
    const std::string text = std::string(label) + " " + test::tier_name(tier);
    const char *const kept = (labels[text] = text).c_str();
    const TierSweeps<"tbmv", T, R> sweeps(R(name, calls::kind_of<T>(name), procedures[tier], procedures[tier]), text);
    register_test("sizes_up_to_70_lie_within_the_bound", kept, [=] { sweeps.sizes_up_to_70(); });
    register_test("sizes_around_limits_lie_within_the_bound", kept, [=] { sweeps.sizes_around_limits(); });
    register_test("results_in_whole_numbers_are_exact", kept, [=] { sweeps.whole_numbers_are_exact(); });
  });
}

}  // namespace
}  // namespace qtb::surface

int main(int argc, char **argv) {
  using namespace qtb;
  surface::register_general<cfloat>("ctbmv", "ctbmv_general", test::banded<cfloat>.general_tbmv);
  surface::register_general<cfloat>("ctbsv", "ctbsv_general", test::banded<cfloat>.general_tbsv);
  surface::register_general<cdouble>("ztbmv", "ztbmv_general", test::banded<cdouble>.general_tbmv);
  surface::register_general<cdouble>("ztbsv", "ztbsv_general", test::banded<cdouble>.general_tbsv);
  return surface::run_tier_sweeps(argc, argv);
}
