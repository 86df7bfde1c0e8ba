# Teams of many more threads than processors: idle threads sleep there. Some suites run once for each made-up machine,
# which a process is for good; see level3/gemm_machines.h.
set(gemm_machines def def_family16 sse3 ssse3 sse41_large_l2 sse41_small_l2 sse41_no_table sse42 sse42_small_l3 avx)
list(TRANSFORM gemm_machines REPLACE "(.+)" "\\1=QTB_TEST_MACHINE=\\1" OUTPUT_VARIABLE gemm_machine_runs)
# Teams that come as large as they are asked for, and smaller ones.
set(team_limits any_team=OMP_DYNAMIC=false small_team=OMP_THREAD_LIMIT=5)
qtb_add_test(gemm_classes_test SOURCES thread/level3/gemm_classes_test.cpp LIBRARIES qtb_static qtb_platform_fake
  RUNS ${gemm_machine_runs} ENVIRONMENT OMP_WAIT_POLICY=passive)
qtb_add_test(gemm_decision_test SOURCES thread/level3/gemm_decision_test.cpp TIMEOUT 60)
qtb_add_test(gemm_driver_test BRIEF SOURCES thread/level3/gemm_driver_test.cpp LIBRARIES qtb_static
  ENVIRONMENT OMP_THREAD_LIMIT=5 OMP_WAIT_POLICY=passive)
qtb_add_test(gemm_front_ends_test BRIEF SOURCES thread/level3/gemm_front_ends_test.cpp LIBRARIES qtb_static TIMEOUT 60)
qtb_add_test(gemm_select_test SOURCES thread/level3/gemm_select_test.cpp
  LIBRARIES qtb_static qtb_platform_static SHARDS 2)
qtb_add_test(gemm_share_test SOURCES thread/level3/gemm_share_test.cpp TIMEOUT 60)
qtb_add_test(gemm_strategy_cover_test SOURCES thread/level3/gemm_strategy_cover_test.cpp LIBRARIES qtb_static
  ENVIRONMENT OMP_WAIT_POLICY=passive)
qtb_add_test(gemm_strategy_test SOURCES thread/level3/gemm_strategy_test.cpp LIBRARIES qtb_static qtb_platform_fake
  RUNS ${gemm_machine_runs} ENVIRONMENT OMP_WAIT_POLICY=passive)
qtb_add_test(gemm_teams_test TIERS SOURCES thread/level3/gemm_teams_test.cpp LIBRARIES qtb_static qtb_platform_static
  ENVIRONMENT OMP_WAIT_POLICY=passive QTB_DYNAMIC=FALSE)
qtb_add_test(level1_decision_test SOURCES thread/level1/decision_test.cpp TIMEOUT 60)
qtb_add_test(level1_drivers_test SOURCES thread/level1/drivers_test.cpp LIBRARIES qtb_static SHARDS 2)
qtb_add_test(level1_front_ends_test BRIEF SOURCES thread/level1/front_ends_test.cpp LIBRARIES qtb_static TIMEOUT 60)
qtb_add_test(level1_library_test BRIEF SOURCES thread/level1/library_test.cpp
  LIBRARIES qtb_static qtb_platform_fake SHARDS 2)
qtb_add_test(level1_share_test BRIEF SOURCES thread/level1/share_test.cpp TIMEOUT 60)
qtb_add_test(level2_decision_test SOURCES thread/level2/decision_test.cpp TIMEOUT 60)
qtb_add_test(level2_drivers_test SOURCES thread/level2/drivers_test.cpp LIBRARIES qtb_static SHARDS 2
  RUNS ${team_limits} ENVIRONMENT OMP_WAIT_POLICY=passive)
qtb_add_test(level2_front_ends_test BRIEF SOURCES thread/level2/front_ends_test.cpp LIBRARIES qtb_static TIMEOUT 60)
qtb_add_test(level2_share_test SOURCES thread/level2/share_test.cpp TIMEOUT 60)
qtb_add_test(level3_decision_test SOURCES thread/level3/level3_decision_test.cpp TIMEOUT 60)
qtb_add_test(level3_drivers_test SOURCES thread/level3/level3_drivers_test.cpp LIBRARIES qtb_static
  RUNS ${team_limits} ENVIRONMENT OMP_WAIT_POLICY=passive)
qtb_add_test(level3_front_ends_test BRIEF SOURCES thread/level3/level3_front_ends_test.cpp LIBRARIES qtb_static
  TIMEOUT 60)
qtb_add_test(level3_share_test SOURCES thread/level3/level3_share_test.cpp TIMEOUT 60)
qtb_add_test(level3_teams_test SOURCES thread/level3/level3_teams_test.cpp LIBRARIES qtb_static qtb_platform_fake
  RUNS ${gemm_machine_runs} ENVIRONMENT OMP_WAIT_POLICY=passive OMP_THREAD_LIMIT=11)
qtb_add_test(team_test BRIEF SOURCES thread/team_test.cpp ENVIRONMENT OMP_WAIT_POLICY=passive TIMEOUT 60)
