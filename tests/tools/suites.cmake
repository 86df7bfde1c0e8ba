# The programs for users of the libraries.
if(NOT TARGET tools)
  return()
endif()
qtb_add_script_test(trace_test COMMAND tools/trace_test.sh ${PROJECT_BINARY_DIR})
