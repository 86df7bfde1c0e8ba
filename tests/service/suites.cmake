qtb_add_test(cpu_test BRIEF SOURCES service/cpu_test.cpp LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(cache_test BRIEF SOURCES service/cache_test.cpp LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(thread_settings_test SOURCES service/thread_settings_test.cpp fuzz/environment_fuzz.cpp
  LIBRARIES qtb_static qtb_platform_fake)
target_compile_definitions(thread_settings_test PRIVATE QTB_TEST_CORPUS="${CMAKE_CURRENT_SOURCE_DIR}/fuzz/corpus")
qtb_add_test(cores_test BRIEF SOURCES service/cores_test.cpp LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(threads_test BRIEF SOURCES service/threads_test.cpp LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(override_test BRIEF SOURCES service/override_test.cpp LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(memory_test BRIEF SOURCES service/memory_test.cpp LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(catalog_file_test BRIEF SOURCES service/catalog_file_test.cpp LIBRARIES qtb_platform_static)

# On the real operating system: a program that is started under different circumstances, and an allocator library.
function(add_service_facts name)
  add_executable(${name} service/facts.cpp)
  target_include_directories(${name} PRIVATE ${PROJECT_SOURCE_DIR})
  target_link_libraries(${name} PRIVATE qtb_static qtb_platform_static OpenMP::OpenMP_CXX ${CMAKE_DL_LIBS})
  target_link_options(${name} PRIVATE ${ARGN})
endfunction()
add_service_facts(service_facts)
# With the working directory among the folders that the loader searches: for all that the program loads, and for what it
# loads itself.
add_service_facts(service_facts_rpath -Wl,--disable-new-dtags,-rpath,.)
add_service_facts(service_facts_runpath -Wl,--enable-new-dtags,-rpath,.)
foreach(variant complete three_hooks null_hook)
  add_library(qmalloc_${variant} MODULE service/qmalloc.cpp)
  string(TOUPPER QMALLOC_${variant} definition)
  target_compile_definitions(qmalloc_${variant} PRIVATE ${definition})
  set_target_properties(qmalloc_${variant} PROPERTIES OUTPUT_NAME qmalloc
    LIBRARY_OUTPUT_DIRECTORY ${CMAKE_CURRENT_BINARY_DIR}/qmalloc/${variant})
endforeach()
qtb_add_test(linux_test BRIEF SOURCES service/linux_test.cpp LIBRARIES qtb_static qtb_platform_static)
target_compile_definitions(linux_test PRIVATE QTB_TEST_FACTS="$<TARGET_FILE:service_facts>"
  QTB_TEST_FACTS_RPATH="$<TARGET_FILE:service_facts_rpath>"
  QTB_TEST_FACTS_RUNPATH="$<TARGET_FILE:service_facts_runpath>"
  QTB_TEST_LIBRARY="$<TARGET_FILE:qtb>" QTB_TEST_QMALLOC="${CMAKE_CURRENT_BINARY_DIR}/qmalloc")
add_dependencies(linux_test qtb service_facts service_facts_rpath service_facts_runpath
  qmalloc_complete qmalloc_three_hooks qmalloc_null_hook)

# The shared library, loaded by hand.
qtb_add_test(library_test SOURCES service/library_test.cpp)
target_compile_definitions(library_test PRIVATE QTB_TEST_LIBRARY="$<TARGET_FILE:qtb>")
add_dependencies(library_test qtb)
