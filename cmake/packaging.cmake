# Installation: the library with its header, a CMake package (find_package(qtb) gives qtb::qtb) and a pkg-config file.
# Both can be moved with the folder that they are installed in. The components: library, development, and tools, whose
# programs stand with their sources.
#
# Where the system keeps libraries by architecture they go below such a folder with any prefix, so that an installation
# and a package of the system are laid out alike; CMAKE_INSTALL_LIBDIR says otherwise.
if(CMAKE_LIBRARY_ARCHITECTURE AND EXISTS /etc/debian_version)
  set(CMAKE_INSTALL_LIBDIR lib/${CMAKE_LIBRARY_ARCHITECTURE} CACHE PATH "Object code libraries")
endif()
include(GNUInstallDirs)
include(CMakePackageConfigHelpers)

install(TARGETS qtb EXPORT qtb LIBRARY COMPONENT library NAMELINK_COMPONENT development)
set(CMAKE_INSTALL_DEFAULT_COMPONENT_NAME development)
install(FILES include/qtb.h DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})

set(package_folder ${CMAKE_INSTALL_LIBDIR}/cmake/qtb)
write_basic_package_version_file(${PROJECT_BINARY_DIR}/qtb-config-version.cmake COMPATIBILITY SameMajorVersion)
install(EXPORT qtb NAMESPACE qtb:: DESTINATION ${package_folder} FILE qtb-config.cmake)
install(FILES ${PROJECT_BINARY_DIR}/qtb-config-version.cmake DESTINATION ${package_folder})

file(RELATIVE_PATH prefix_from_pkgconfig ${CMAKE_INSTALL_FULL_LIBDIR}/pkgconfig ${CMAKE_INSTALL_PREFIX})
configure_file(cmake/qtb.pc.in qtb.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/qtb.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)

# The companions, in a folder of their own: among the other libraries libblas.so.3 would become the system's.
if(QTB_BUILD_INTERFACES)
  set(companions_folder ${CMAKE_INSTALL_LIBDIR}/qtb)
  install(TARGETS qtb_companion_blas qtb_companion_blas64 qtb_companion_qtb64 qtb_cblas EXPORT qtb
    LIBRARY DESTINATION ${companions_folder} COMPONENT library NAMELINK_COMPONENT development)
  install(FILES include/qtb/cblas.h include/qtb/cblas_routines.def include/qtb/threads.h
    DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/qtb)
  function(qtb_install_package package library flags description)
    configure_file(cmake/qtb-companion.pc.in ${package}.pc @ONLY)
    install(FILES ${PROJECT_BINARY_DIR}/${package}.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
  endfunction()
  qtb_install_package(qtb-lp64 blas "" "BLAS with integers of 32 bits, from Fortran and C")
  qtb_install_package(qtb-cblas blas "" "the C interface of BLAS with integers of 32 bits")
  qtb_install_package(qtb-ilp64 blas64 -DCBLAS_ILP64 "BLAS with integers of 64 bits, from Fortran and C")
  qtb_install_package(qtb-ilp64-suffixed qtb64 "" "BLAS with integers of 64 bits, under names that end in _64")
endif()
unset(CMAKE_INSTALL_DEFAULT_COMPONENT_NAME)
