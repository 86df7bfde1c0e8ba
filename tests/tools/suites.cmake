# The programs for users of the libraries.
if(NOT TARGET tools)
  return()
endif()
qtb_add_script_test(trace_test COMMAND tools/trace_test.sh ${PROJECT_BINARY_DIR})
qtb_add_script_test(info_test COMMAND tools/info_test.sh ${PROJECT_BINARY_DIR})
qtb_add_script_test(man_test COMMAND tools/man_test.sh ${PROJECT_SOURCE_DIR} ${PROJECT_BINARY_DIR})
qtb_add_script_test(selftest_test COMMAND tools/selftest_test.sh ${PROJECT_BINARY_DIR})
