# The programs for users of the libraries.
include(tools/trace/trace.cmake)
add_custom_target(tools)
add_dependencies(tools qtb_trace)
