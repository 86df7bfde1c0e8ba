// The main program of a suite of the surface: the exported names of the shared library, in both cases, and nothing else
// of it. A suite includes this file last: register_routine(), of sweeps.h or published.h, says what a routine goes
// through.
#pragma once

#include "tests/product/program.h"
#include "tests/product/surface/registry.h"

extern "C" {
#define QTB_ROUTINE(name, NAME, shape, T, route) \
  QTB_FUNCTION(shape, T, name);                  \
  QTB_FUNCTION(shape, T, NAME);
#include "blas/routines.def"
#undef QTB_ROUTINE
}

int main(int argc, char **argv) {
  using namespace qtb::surface;
  testing::InitGoogleTest(&argc, argv);
  if (!qtb::test::processor_runs_forced_tier()) return qtb::test::exit_skipped;
#define QTB_ROUTINE(name, NAME, shape, T, route) \
  register_routine<#shape, T>(Routine<QTB_FUNCTION_TYPE(shape, T)>(#name, qtb::calls::kind_of<T>(#name), &name, &NAME));
#include "blas/routines.def"
#undef QTB_ROUTINE
  std::signal(SIGSEGV, on_trap);
  std::signal(SIGFPE, on_trap);
  std::signal(SIGILL, on_trap);
  const int result = RUN_ALL_TESTS();
  report();
  return result;
}
