# Fuzz targets: <name>_fuzz.cpp with LLVMFuzzerTestOneInput, seeds and past findings in corpus/<name>. Ordinary suites
# replay the corpora; the tests of this file run each target on new inputs too.
set(QTB_FUZZ_SECONDS 60 CACHE STRING "How long each fuzz target runs")

add_custom_target(fuzz_targets)

# qtb_add_fuzz(name SOURCES source... [LIBRARIES library...]); sources relative to tests.
function(qtb_add_fuzz name)
  cmake_parse_arguments(arg "" "" "SOURCES;LIBRARIES" ${ARGN})
  list(TRANSFORM arg_SOURCES PREPEND ${PROJECT_SOURCE_DIR}/tests/)
  add_executable(${name}_fuzz ${arg_SOURCES})
  target_include_directories(${name}_fuzz PRIVATE ${PROJECT_SOURCE_DIR})
  target_compile_options(${name}_fuzz PRIVATE -Wall -Wextra)
  target_link_options(${name}_fuzz PRIVATE -fsanitize=fuzzer)
  target_link_libraries(${name}_fuzz PRIVATE ${arg_LIBRARIES} OpenMP::OpenMP_CXX ${CMAKE_DL_LIBS})
  add_dependencies(fuzz_targets ${name}_fuzz)
  set(corpus ${PROJECT_SOURCE_DIR}/tests/fuzz/corpus/${name})
  set(scratch ${CMAKE_CURRENT_BINARY_DIR}/fuzz)
  file(MAKE_DIRECTORY ${scratch}/${name})
  add_test(NAME ${name}_fuzz.replay COMMAND ${name}_fuzz -runs=0 ${corpus})
  # New inputs go to the first folder, those that fail go beside it.
  add_test(NAME ${name}_fuzz.search
    COMMAND ${name}_fuzz -max_total_time=${QTB_FUZZ_SECONDS} -print_final_stats=1
      -artifact_prefix=${scratch}/${name}- ${scratch}/${name} ${corpus})
  math(EXPR limit "2 * ${QTB_FUZZ_SECONDS} + 60")
  set_tests_properties(${name}_fuzz.search PROPERTIES LABELS long TIMEOUT ${limit})
endfunction()

qtb_add_fuzz(catalog_file SOURCES fuzz/catalog_file_fuzz.cpp LIBRARIES qtb_platform_static)
qtb_add_fuzz(catalog_text SOURCES fuzz/catalog_text_fuzz.cpp platform/fake_messages.cpp LIBRARIES qtb_services_static)
qtb_add_fuzz(environment SOURCES fuzz/environment_fuzz.cpp LIBRARIES qtb_services_static qtb_platform_fake)
qtb_add_fuzz(xerbla SOURCES fuzz/xerbla_fuzz.cpp platform/fake_messages.cpp LIBRARIES qtb_services_static)
