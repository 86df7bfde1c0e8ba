qtb_add_test(cpu_test SOURCES service/cpu_test.cpp LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(cache_test SOURCES service/cache_test.cpp LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(thread_settings_test SOURCES service/thread_settings_test.cpp fuzz/environment_fuzz.cpp
  LIBRARIES qtb_static qtb_platform_fake)
target_compile_definitions(thread_settings_test PRIVATE QTB_TEST_CORPUS="${CMAKE_CURRENT_SOURCE_DIR}/fuzz/corpus")
qtb_add_test(cores_test SOURCES service/cores_test.cpp LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(threads_test SOURCES service/threads_test.cpp LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(memory_test SOURCES service/memory_test.cpp LIBRARIES qtb_static qtb_platform_fake)
