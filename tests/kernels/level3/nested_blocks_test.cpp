// trmm and trsm of the tiers sse3 and def, around the edges of their blocks.
#include "tests/kernels/level3/triangular_sweeps.h"

namespace qtb::surface {
namespace {

template <class T>
void register_routine(int tier, const char *routine, Triangular<T> *procedure) {
  with_sweep<T>(tier, routine, "", procedure, Role::routine, [](const auto &sweep) {
    register_test("small_triangles_on_both_sides", sweep.label(),
                  [=] { sweep.all_options("LR", range(0, 20), range(0, 20), 20); });
    register_test("edges_of_inner_blocks_on_the_left", sweep.label(), [=] {
      sweep.all_options("L", {127, 128, 129, 255, 256, 257}, {1, 2, 5}, 6);
    });
    register_test("edges_of_inner_blocks_on_the_right", sweep.label(), [=] {
      sweep.all_options("R", {1, 2, 5}, {127, 128, 129, 255, 256, 257}, 6);
    });
    register_test("edges_of_outer_blocks_on_the_left", sweep.label(), [=] {
      sweep.all_options("L", {1023, 1024, 1025}, {1, 2}, 32);
    });
    register_test("edges_of_outer_blocks_on_the_right", sweep.label(), [=] {
      sweep.all_options("R", {1, 2}, {1023, 1024, 1025}, 32);
    });
    register_test("results_in_whole_numbers_are_exact", sweep.label(), [=] { sweep.whole_numbers("LR", 30, 30); });
  });
}

void register_all() {
#define REGISTER(name, T)                                     \
  register_routine<T>(tier_def, #name, qtb_blas_def_x##name); \
  register_routine<T>(tier_sse3, #name, qtb_blas_sse3_x##name);
  REGISTER(strmm, float)
  REGISTER(dtrmm, double)
  REGISTER(ctrmm, cfloat)
  REGISTER(ztrmm, cdouble)
  REGISTER(strsm, float)
  REGISTER(dtrsm, double)
  REGISTER(ctrsm, cfloat)
  REGISTER(ztrsm, cdouble)
#undef REGISTER
}

}  // namespace
}  // namespace qtb::surface

int main(int argc, char **argv) { return qtb::surface::run_sweeps(argc, argv, qtb::surface::register_all); }
