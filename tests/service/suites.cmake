qtb_add_test(cpu_test SOURCES service/cpu_test.cpp LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(cache_test SOURCES service/cache_test.cpp LIBRARIES qtb_static qtb_platform_fake)
