# The companions: their names, programs that call them, and the distribution's testers.
if(NOT TARGET interfaces)
  return()
endif()
set(companions ${PROJECT_BINARY_DIR}/interfaces)
qtb_add_test(best_tier_test BRIEF SOURCES interfaces/best_tier_test.cpp LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(companion_reports_test BRIEF SOURCES interfaces/reports_test.cpp LIBRARIES qtb::lp64)
qtb_add_test(threads_calls_test BRIEF SOURCES interfaces/threads_calls_test.cpp ../interfaces/threads.cpp
  LIBRARIES qtb_static qtb_platform_fake)
if(NOT QTB_INSTRUMENT)
  # A team is counted where g++ begins it.
  qtb_add_test(threads_honoured_test SOURCES interfaces/threads_honoured_test.cpp LIBRARIES qtb_companion_blas
    RUNS sse42=QTB_DEBUG_CPU_TYPE=3 ENVIRONMENT QTB_DYNAMIC=FALSE)
  set_target_properties(threads_honoured_test PROPERTIES ENABLE_EXPORTS ON)
  qtb_add_script_test(companion_names_test COMMAND interfaces/names_test.sh ${companions})
  qtb_add_script_test(companion_consumers_test COMMAND interfaces/consumers_test.sh ${PROJECT_BINARY_DIR})
  qtb_add_script_test(blas_testers_test COMMAND interfaces/testers_test.sh ${companions})
  list(LENGTH QTB_TIERS count)
  math(EXPR last "${count} - 1")
  set(numbers "")
  foreach(number RANGE ${last})
    list(APPEND numbers ${number})
  endforeach()
  qtb_add_script_test(blas_testers_test.all_tiers LABELS long TIMEOUT 900
    COMMAND interfaces/testers_test.sh ${companions} ${numbers})
  set_tests_properties(companion_names_test companion_consumers_test blas_testers_test blas_testers_test.all_tiers
    PROPERTIES SKIP_RETURN_CODE 77)
endif()
