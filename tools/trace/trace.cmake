# qtb-trace: a library that a program gets ahead of its BLAS, and the script that starts it so. The names of the
# companions' faces fall out of the lists that those are made from.
add_library(qtb_trace SHARED tools/trace/behind.cpp tools/trace/cblas.cpp tools/trace/fortran.cpp
  tools/trace/record.cpp tools/trace/report.cpp)
target_link_libraries(qtb_trace PRIVATE qtb_options ${CMAKE_DL_LIBS})
target_link_options(qtb_trace PRIVATE -Wl,-z,nodelete -Wl,-z,relro -Wl,-z,now -Wl,--as-needed)
set_target_properties(qtb_trace PROPERTIES OUTPUT_NAME qtb-trace LIBRARY_OUTPUT_DIRECTORY ${PROJECT_BINARY_DIR}/tools)

file(RELATIVE_PATH trace_folder ${CMAKE_INSTALL_FULL_BINDIR} ${CMAKE_INSTALL_FULL_LIBDIR}/qtb)
configure_file(tools/trace/qtb-trace.in ${PROJECT_BINARY_DIR}/tools/qtb-trace @ONLY
  FILE_PERMISSIONS OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)
install(TARGETS qtb_trace LIBRARY DESTINATION ${companions_folder} COMPONENT tools)
install(PROGRAMS ${PROJECT_BINARY_DIR}/tools/qtb-trace DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT tools)
