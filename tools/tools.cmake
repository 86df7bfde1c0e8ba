# The programs for users of the libraries.
include(tools/info/info.cmake)
include(tools/trace/trace.cmake)
add_custom_target(tools)
add_dependencies(tools qtb_info qtb_trace)
install(FILES man/qtb-info.1 man/qtb-trace.1 DESTINATION ${CMAKE_INSTALL_MANDIR}/man1 COMPONENT tools)
install(FILES man/qtb.7 DESTINATION ${CMAKE_INSTALL_MANDIR}/man7 COMPONENT tools)
