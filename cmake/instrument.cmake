# Builds that watch the program: one at a time, for everything in the tree.
#
#   asan      addresses and undefined behaviour, halting at the first report (clang: it takes g++ six times as long)
#   tsan      data races: clang with its OpenMP runtime, whose Archer tool tells the detector of regions and barriers
#   fuzz      asan, with the coverage feedback that the fuzz targets' driver steers by (clang)
#   coverage  lines and branches that a run has reached
set(QTB_INSTRUMENT "" CACHE STRING "asan, tsan, fuzz, coverage or nothing")
set_property(CACHE QTB_INSTRUMENT PROPERTY STRINGS "" asan tsan fuzz coverage)

# The environment that every test gets. Idle threads of the OpenMP runtime sleep: several tests run at once, and teams
# that wait actively would keep each other from running.
set(QTB_TEST_ENVIRONMENT "OMP_WAIT_POLICY=passive")

# The library is built without the type information that the check of polymorphic types reads, and takes operands at any
# address, also between elements, as the processor does. An access through a null pointer or beyond an object is the
# address sanitizer's to find.
set(qtb_asan -fsanitize=address,undefined -fno-sanitize=vptr,alignment,null,object-size,pointer-overflow
  -fno-sanitize-recover=all -fno-omit-frame-pointer)

# Kernels are straight-line code of thousands of accesses, each watched by a call in place of a test of its own.
set(QTB_INSTRUMENT_KERNELS "")

# Tells the sources that every load and store is watched.
if(QTB_INSTRUMENT MATCHES "^(asan|tsan|fuzz)$")
  add_compile_definitions(QTB_WATCHED)
endif()

if(QTB_INSTRUMENT MATCHES "^(asan|fuzz)$")
  set(QTB_INSTRUMENT_KERNELS "SHELL:-mllvm -asan-instrumentation-with-call-threshold=0")
endif()

# A report needs the lines of its calls.
if(QTB_INSTRUMENT MATCHES "^(asan|tsan|fuzz)$")
  add_compile_options(-gline-tables-only)
endif()

if(QTB_INSTRUMENT STREQUAL "asan")
  add_compile_options(${qtb_asan})
  add_link_options(${qtb_asan})
elseif(QTB_INSTRUMENT STREQUAL "tsan")
  add_compile_options(-fsanitize=thread)
  add_link_options(-fsanitize=thread)
  cmake_path(GET OpenMP_omp_LIBRARY PARENT_PATH openmp_folder)
  find_library(QTB_ARCHER archer HINTS ${openmp_folder} PATHS /usr/lib/llvm-14/lib REQUIRED)
  # The OpenMP runtime itself is not instrumented: what it does to the program's memory is not a race.
  list(APPEND QTB_TEST_ENVIRONMENT "TSAN_OPTIONS=ignore_noninstrumented_modules=1" "OMP_TOOL_LIBRARIES=${QTB_ARCHER}")
elseif(QTB_INSTRUMENT STREQUAL "fuzz")
  add_compile_options(${qtb_asan} -fsanitize=fuzzer-no-link)
  add_link_options(${qtb_asan})
elseif(QTB_INSTRUMENT STREQUAL "coverage")
  add_compile_options(--coverage)
  add_link_options(--coverage)
elseif(QTB_INSTRUMENT)
  message(FATAL_ERROR "QTB_INSTRUMENT is ${QTB_INSTRUMENT}, not one of asan, tsan, fuzz, coverage")
endif()
