# qtb-info: holds the core's objects as a companion does, and the tests of the surface with the oracle.
add_executable(qtb_info tools/info/main.cpp tools/info/machine.cpp tools/info/process.cpp tools/info/selftest.cpp
  tools/info/selftest_level1.cpp tools/info/selftest_level2.cpp tools/info/selftest_level3.cpp
  tests/reference/common.cpp tests/reference/sums.cpp
  ${qtb_shared_objects} $<TARGET_OBJECTS:qtb_platform> $<TARGET_OBJECTS:qtb_companion_own>)
target_include_directories(qtb_info PRIVATE ${PROJECT_SOURCE_DIR})
# The tests are read by the compiler longer than they run: they are compiled as in tests/CMakeLists.txt, and the oracle
# with all optimisation.
target_compile_options(qtb_info PRIVATE -O1 -fno-tree-slp-vectorize -Wall -Wextra)
set_source_files_properties(tests/reference/common.cpp tests/reference/sums.cpp PROPERTIES COMPILE_OPTIONS -O3)
target_compile_definitions(qtb_info PRIVATE QTB_INFO_LIBRARY="libqtb.so.${PROJECT_VERSION_MAJOR}")
target_link_libraries(qtb_info PRIVATE OpenMP::OpenMP_CXX ${CMAKE_DL_LIBS})
add_dependencies(qtb_info qtb)
file(RELATIVE_PATH library_folder ${CMAKE_INSTALL_FULL_BINDIR} ${CMAKE_INSTALL_FULL_LIBDIR})
set_target_properties(qtb_info PROPERTIES OUTPUT_NAME qtb-info RUNTIME_OUTPUT_DIRECTORY ${PROJECT_BINARY_DIR}/tools
  BUILD_RPATH ${PROJECT_BINARY_DIR} INSTALL_RPATH "$ORIGIN/${library_folder}")
install(TARGETS qtb_info RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT tools)
