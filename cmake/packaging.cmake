# Installation: the library with its header, a CMake package (find_package(qtb) gives qtb::qtb) and a pkg-config file.
# Both can be moved with the folder that they are installed in.
include(GNUInstallDirs)
include(CMakePackageConfigHelpers)

install(TARGETS qtb EXPORT qtb)
install(FILES include/qtb.h DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})

set(package_folder ${CMAKE_INSTALL_LIBDIR}/cmake/qtb)
write_basic_package_version_file(${PROJECT_BINARY_DIR}/qtb-config-version.cmake COMPATIBILITY SameMajorVersion)
install(EXPORT qtb NAMESPACE qtb:: DESTINATION ${package_folder} FILE qtb-config.cmake)
install(FILES ${PROJECT_BINARY_DIR}/qtb-config-version.cmake DESTINATION ${package_folder})

file(RELATIVE_PATH prefix_from_pkgconfig ${CMAKE_INSTALL_FULL_LIBDIR}/pkgconfig ${CMAKE_INSTALL_PREFIX})
configure_file(cmake/qtb.pc.in qtb.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/qtb.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
