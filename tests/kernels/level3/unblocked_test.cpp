// The unblocked triangular kernels of every tier and the small right kernels, in all their options.
#include "tests/kernels/level3/triangular_sweeps.h"

#define TYPES_OF(X, name) X(s##name, float) X(d##name, double) X(c##name, cfloat) X(z##name, cdouble)
#define DECLARE(name, T)                                       \
  QTB_FUNCTION(trmm, T, qtb_blas_def_x##name##_unblocked);     \
  QTB_FUNCTION(trmm, T, qtb_blas_sse3_x##name##_unblocked);    \
  QTB_FUNCTION(trmm, T, qtb_blas_ssse3_x##name##_unblocked);   \
  QTB_FUNCTION(trmm, T, qtb_blas_sse42_x##name##_unblocked);   \
  QTB_FUNCTION(trmm, T, qtb_blas_avx_x##name##_unblocked);     \
  QTB_FUNCTION(trmm, T, qtb_blas_ssse3_x##name##_small_right); \
  QTB_FUNCTION(trmm, T, qtb_blas_sse42_x##name##_small_right); \
  QTB_FUNCTION(trmm, T, qtb_blas_avx_x##name##_small_right);
extern "C" {
TYPES_OF(DECLARE, trmm)
TYPES_OF(DECLARE, trsm)
}
#undef DECLARE

namespace qtb::surface {
namespace {

template <class T>
Role role_of(const char *routine) {
  return calls::kind_of<T>(routine).solve ? Role::solving_kernel : Role::kernel;
}

template <class T>
void register_unblocked(int tier, const char *routine, Triangular<T> *procedure) {
  with_sweep<T>(tier, routine, "_unblocked", procedure, role_of<T>(routine), [](const auto &sweep) {
    register_test("small_triangles_on_both_sides", sweep.label(),
                  [=] { sweep.all_options("LR", range(0, 12), range(0, 12), 2); });
    register_test("larger_triangles_on_the_left", sweep.label(), [=] {
      sweep.all_options("L", {16, 23, 32, 33, 63, 128, 129}, {1, 3, 6, 19}, 3);
    });
    register_test("larger_triangles_on_the_right", sweep.label(), [=] {
      sweep.all_options("R", {1, 3, 6, 19}, {16, 23, 32, 33, 63, 128, 129}, 3);
    });
    register_test("results_in_whole_numbers_are_exact", sweep.label(), [=] { sweep.whole_numbers("LR", 20, 20); });
  });
}

template <class T>
void register_small_right(int tier, const char *routine, Triangular<T> *procedure) {
  with_sweep<T>(tier, routine, "_small_right", procedure, role_of<T>(routine), [](const auto &sweep) {
    register_test("one_to_eight_columns", sweep.label(), [=] {
      sweep.all_options("R", {0, 1, 2, 3, 4, 5, 7, 8, 9, 13, 30}, range(1, 8));
    });
    register_test("results_in_whole_numbers_are_exact", sweep.label(), [=] { sweep.whole_numbers("R", 20, 8); });
  });
}

#define REGISTER(name, T)                                                           \
  register_unblocked<T>(tier_def, #name, qtb_blas_def_x##name##_unblocked);         \
  register_unblocked<T>(tier_sse3, #name, qtb_blas_sse3_x##name##_unblocked);       \
  register_unblocked<T>(tier_ssse3, #name, qtb_blas_ssse3_x##name##_unblocked);     \
  register_unblocked<T>(tier_sse42, #name, qtb_blas_sse42_x##name##_unblocked);     \
  register_unblocked<T>(tier_avx, #name, qtb_blas_avx_x##name##_unblocked);         \
  register_small_right<T>(tier_ssse3, #name, qtb_blas_ssse3_x##name##_small_right); \
  register_small_right<T>(tier_sse42, #name, qtb_blas_sse42_x##name##_small_right); \
  register_small_right<T>(tier_avx, #name, qtb_blas_avx_x##name##_small_right);

void register_all() {
  TYPES_OF(REGISTER, trmm)
  TYPES_OF(REGISTER, trsm)
}

}  // namespace
}  // namespace qtb::surface

int main(int argc, char **argv) { return qtb::surface::run_sweeps(argc, argv, qtb::surface::register_all); }
