qtb_add_test(slots_test BRIEF SOURCES dispatch/slots_test.cpp dispatch/recording_kernels.cpp
  LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(slot_table_test BRIEF SOURCES dispatch/table_test.cpp LIBRARIES qtb_static qtb_platform_static)

# Static, since the system's dynamic loader refuses to start on vendors that it does not know; neither the sanitizers
# nor clang's OpenMP runtime come that way.
if(NOT QTB_INSTRUMENT AND CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
  add_executable(dispatch_diagnostic dispatch/diagnostic.cpp)
  target_include_directories(dispatch_diagnostic PRIVATE ${PROJECT_SOURCE_DIR})
  target_link_options(dispatch_diagnostic PRIVATE -static -fopenmp -Wl,--wrap=dlopen)
  target_link_libraries(dispatch_diagnostic PRIVATE qtb_static qtb_platform_static)
  qtb_add_test(simulated_tiers_test SOURCES dispatch/simulated_test.cpp)
  target_compile_definitions(simulated_tiers_test PRIVATE QTB_TEST_DIAGNOSTIC="$<TARGET_FILE:dispatch_diagnostic>")
  add_dependencies(simulated_tiers_test dispatch_diagnostic)
endif()
