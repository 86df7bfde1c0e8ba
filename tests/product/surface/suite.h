// The main program of a suite of the surface: the exported names of the shared library, in both cases, and nothing else
// of it. A suite includes this file last: register_routine(), of sweeps.h or published.h, says what a routine goes
// through.
//
// With QTB_TEST_ROUTINES=reference the routines are those of the distribution's reference BLAS: they must meet the same
// oracle within the same bounds, and so lie within twice the bound of this library. What fails there is the oracle or
// the harness.
#pragma once

#include <dlfcn.h>

#include "tests/product/program.h"
#include "tests/product/surface/registry.h"

extern "C" {
#define QTB_ROUTINE(name, NAME, shape, T, route) \
  QTB_FUNCTION(shape, T, name);                  \
  QTB_FUNCTION(shape, T, NAME);
#include "blas/routines.def"
#undef QTB_ROUTINE
}

namespace qtb::surface {

inline bool tests_reference() {
  const char *routines = std::getenv("QTB_TEST_ROUTINES");
  return routines != nullptr && std::strcmp(routines, "reference") == 0;
}

inline void *open_reference() {
  for (const char *name : {"/usr/lib/x86_64-linux-gnu/blas/libblas.so.3", "/usr/lib/blas/libblas.so.3"})
    if (void *library = dlopen(name, RTLD_NOW | RTLD_LOCAL)) return library;
  return nullptr;
}

// Registers a routine of this library, or where that is open the reference library's, if it has one.
template <ShapeName shape, class T, class Function>
void register_one(void *reference, const char *name, Function *lower, Function *upper) {
  if (reference == nullptr)
    return register_routine<shape, T>(Routine<Function>(name, calls::kind_of<T>(name), lower, upper));
  // Generation of rotations differs by design in signs and special cases.
  if (std::strstr(name, "rotg") != nullptr || std::strstr(name, "rotmg") != nullptr) return;
  void *symbol = dlsym(reference, (std::string(name) + "_").c_str());
  if (symbol != nullptr) register_routine<shape, T>(Routine<Function>(name, calls::kind_of<T>(name), symbol));
}

}  // namespace qtb::surface

int main(int argc, char **argv) {
  using namespace qtb::surface;
  testing::InitGoogleTest(&argc, argv);
  if (!qtb::test::processor_runs_forced_tier()) return qtb::test::exit_skipped;
  void *const reference = tests_reference() ? open_reference() : nullptr;
  if (tests_reference() && reference == nullptr) {
    std::printf("skipped: the reference BLAS (package libblas3) is not installed\n");
    return qtb::test::exit_skipped;
  }
#define QTB_ROUTINE(name, NAME, shape, T, route) register_one<#shape, T>(reference, #name, &name, &NAME);
#include "blas/routines.def"
#undef QTB_ROUTINE
  std::signal(SIGSEGV, on_trap);
  std::signal(SIGFPE, on_trap);
  std::signal(SIGILL, on_trap);
  const int result = RUN_ALL_TESTS();
  report();
  return result;
}
