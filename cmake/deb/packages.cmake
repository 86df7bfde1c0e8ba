# Debian packages, by cpack, into packages/ of the build folder: one for each component of the installation.
#
#   library       libqtb10       libqtb.so.10, and the companions in a folder of their own, which the system's
#                                alternatives of libblas.so.3 and libblas64.so.3 point to
#   development   libqtb-dev     headers, names to link against, pkg-config and CMake packages
#   tools         qtb-tools      programs, where an installation has some
# cpack packs what the target `packages` has built by then, and builds nothing itself.
set(CMAKE_SKIP_INSTALL_ALL_DEPENDENCY ON)
set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGE_DIRECTORY ${PROJECT_BINARY_DIR}/packages)
set(CPACK_PACKAGING_INSTALL_PREFIX /usr)
set(CPACK_STRIP_FILES ON)
set(CPACK_PACKAGE_NAME qtb)
set(CPACK_PACKAGE_VENDOR QTB)
set(CPACK_PACKAGE_CONTACT "QTB maintainers <maintainers@qtb.invalid>" CACHE STRING "Maintainer field of packages")
set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON)
set(CPACK_DEBIAN_PACKAGE_CONTROL_STRICT_PERMISSION ON)

get_cmake_property(components COMPONENTS)
set(CPACK_COMPONENTS_ALL library development)
if("tools" IN_LIST components)
  list(APPEND CPACK_COMPONENTS_ALL tools)
endif()

set(library_package libqtb${PROJECT_VERSION_MAJOR})
set(control_folder ${PROJECT_BINARY_DIR}/deb)
foreach(script postinst prerm)
  configure_file(${CMAKE_CURRENT_LIST_DIR}/${script}.in ${control_folder}/${script} @ONLY
    FILE_PERMISSIONS OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)
endforeach()
# The dependency of a program that links libqtb.so. The companions have none: they stand for any BLAS of their names.
file(CONFIGURE OUTPUT ${control_folder}/shlibs @ONLY
  CONTENT "libqtb @PROJECT_VERSION_MAJOR@ @library_package@ (>= @PROJECT_VERSION@)\n")
file(CONFIGURE OUTPUT ${control_folder}/triggers CONTENT "activate-noawait ldconfig\n")

set(CPACK_DEBIAN_LIBRARY_PACKAGE_NAME ${library_package})
set(CPACK_DEBIAN_LIBRARY_PACKAGE_SECTION libs)
set(CPACK_DEBIAN_LIBRARY_PACKAGE_PROVIDES "libblas.so.3, libblas64.so.3")
set(CPACK_DEBIAN_LIBRARY_PACKAGE_CONTROL_EXTRA
  ${control_folder}/postinst ${control_folder}/prerm ${control_folder}/shlibs ${control_folder}/triggers)
set(CPACK_COMPONENT_LIBRARY_DESCRIPTION "dense linear-algebra kernels, shared library
BLAS of levels 1 to 3 for 64-bit x86, chosen per processor and threaded.
Stands in for libblas.so.3 and libblas64.so.3 through the alternatives system.")

set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_NAME libqtb-dev)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_SECTION libdevel)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_DEPENDS "${library_package} (= ${PROJECT_VERSION})")
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_SHLIBDEPS OFF)
set(CPACK_COMPONENT_DEVELOPMENT_DESCRIPTION "dense linear-algebra kernels, development files
Headers for C and C++, and packages for pkg-config and CMake.")

set(CPACK_DEBIAN_TOOLS_PACKAGE_NAME qtb-tools)
set(CPACK_DEBIAN_TOOLS_PACKAGE_SECTION math)
set(CPACK_DEBIAN_TOOLS_PACKAGE_DEPENDS "${library_package} (= ${PROJECT_VERSION})")
set(CPACK_COMPONENT_TOOLS_DESCRIPTION "dense linear-algebra kernels, programs
Programs that tell what the library does on a machine and in a program.")
include(CPack)

add_custom_target(packages COMMAND ${CMAKE_CPACK_COMMAND} WORKING_DIRECTORY ${PROJECT_BINARY_DIR} USES_TERMINAL)
add_dependencies(packages qtb interfaces)
if(TARGET tools)
  add_dependencies(packages tools)
endif()
