// The distribution's reference BLAS on the problems of the surface suites: it must meet the same oracle within the same
// bounds, and so lies within twice the bound of this library. What fails here is the oracle or the harness.

#include <dlfcn.h>

#include <vector>

#include "tests/product/program.h"
#include "tests/product/surface/level1_shapes.h"
#include "tests/product/surface/level2_shapes.h"
#include "tests/product/surface/level3_shapes.h"
#include "tests/product/surface/sweeps.h"

namespace {

using namespace qtb::surface;

void *open_library() {
  for (const char *name : {"/usr/lib/x86_64-linux-gnu/blas/libblas.so.3", "/usr/lib/blas/libblas.so.3"})
    if (void *library = dlopen(name, RTLD_NOW | RTLD_LOCAL)) return library;
  return nullptr;
}

template <ShapeName shape, class T, class Function>
void add(void *library, const char *name) {
  // Generation of rotations differs by design in signs and special cases.
  if (std::strstr(name, "rotg") != nullptr || std::strstr(name, "rotmg") != nullptr) return;
  void *symbol = dlsym(library, (std::string(name) + "_").c_str());
  if (symbol != nullptr) register_routine<shape, T>(Routine<Function>(name, qtb::calls::kind_of<T>(name), symbol));
}

void add_all(void *library) {
#define QTB_ROUTINE(name, NAME, shape, T, route) add<#shape, T, QTB_FUNCTION_TYPE(shape, T)>(library, #name);
#include "blas/routines.def"
#undef QTB_ROUTINE
}

}  // namespace

int main(int argc, char **argv) {
  testing::InitGoogleTest(&argc, argv);
  void *library = open_library();
  if (library == nullptr) {
    std::printf("skipped: the reference BLAS (package libblas3) is not installed\n");
    return qtb::test::exit_skipped;
  }
  add_all(library);
  std::signal(SIGSEGV, on_trap);
  std::signal(SIGFPE, on_trap);
  const int result = RUN_ALL_TESTS();
  report();
  return result;
}
