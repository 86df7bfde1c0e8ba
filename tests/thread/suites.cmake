qtb_add_test(gemm_decision_test SOURCES thread/gemm_decision_test.cpp TIMEOUT 60)
qtb_add_test(gemm_driver_test SOURCES thread/gemm_driver_test.cpp LIBRARIES qtb_static
  ENVIRONMENT OMP_THREAD_LIMIT=5 OMP_WAIT_POLICY=passive)
qtb_add_test(gemm_select_test SOURCES thread/gemm_select_test.cpp LIBRARIES qtb_static SHARDS 2)
qtb_add_test(level1_decision_test SOURCES thread/level1_decision_test.cpp TIMEOUT 60)
qtb_add_test(level1_drivers_test SOURCES thread/level1_drivers_test.cpp LIBRARIES qtb_static SHARDS 2)
qtb_add_test(level1_front_ends_test SOURCES thread/level1_front_ends_test.cpp LIBRARIES qtb_static TIMEOUT 60)
qtb_add_test(level1_library_test SOURCES thread/level1_library_test.cpp
  LIBRARIES qtb_static qtb_platform_fake SHARDS 2)
qtb_add_test(level1_share_test SOURCES thread/level1_share_test.cpp TIMEOUT 60)
