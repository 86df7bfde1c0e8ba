# The companions: libraries that stand in for a BLAS of another convention. Each holds the core's objects of its own, so
# that it works beside libqtb.so in one process, takes the best tier of the processor by itself, and has the calls of
# qtb/threads.h.
#
#   blas     libblas.so.3     32-bit integers, Fortran names and the C face
#   blas64   libblas64.so.3   the same names, 64-bit integers
#   qtb64    libqtb64.so      64-bit integers, names that end in _64 or 64_
add_library(qtb_companion_own OBJECT interfaces/best_tier.cpp interfaces/threads.cpp)
target_link_libraries(qtb_companion_own PRIVATE qtb_options)

# qtb_add_companion(name exported-name SUFFIX text BITS 32|64 [SOVERSION n])
function(qtb_add_companion name exported)
  cmake_parse_arguments(arg "" "SUFFIX;BITS;SOVERSION" "" ${ARGN})
  set(target qtb_companion_${name})
  add_library(${target} SHARED interfaces/fortran.cpp interfaces/cblas.cpp interfaces/reports.cpp
    ${qtb_shared_objects} $<TARGET_OBJECTS:qtb_platform> $<TARGET_OBJECTS:qtb_companion_own>)
  target_compile_definitions(${target} PRIVATE QTB_FACE_INT=std::int${arg_BITS}_t QTB_FACE_SUFFIX=${arg_SUFFIX}
    $<$<EQUAL:${arg_BITS},64>:CBLAS_ILP64>
    $<$<BOOL:${arg_SUFFIX}>:QTB_FACE_SECOND_NAMES>)
  target_compile_options(${target} PRIVATE -fno-exceptions -fno-rtti)
  target_link_libraries(${target} PRIVATE qtb_options OpenMP::OpenMP_CXX ${CMAKE_DL_LIBS})
  # No -Bsymbolic: a program's own xerbla_ or cblas_xerbla is called in place of the library's.
  target_link_options(${target} PRIVATE -Wl,--version-script=${PROJECT_SOURCE_DIR}/interfaces/companion.map
    -Wl,-z,relro -Wl,-z,now -Wl,-z,nodelete -Wl,--as-needed)
  set_target_properties(${target} PROPERTIES OUTPUT_NAME ${name}
    LIBRARY_OUTPUT_DIRECTORY ${PROJECT_BINARY_DIR}/interfaces
    LINK_DEPENDS ${PROJECT_SOURCE_DIR}/interfaces/companion.map)
  if(arg_SOVERSION)
    set_target_properties(${target} PROPERTIES VERSION ${PROJECT_VERSION} SOVERSION ${arg_SOVERSION})
  endif()
  add_library(qtb::${exported} ALIAS ${target})
  set_target_properties(${target} PROPERTIES EXPORT_NAME ${exported})
  if(arg_BITS EQUAL 64 AND NOT arg_SUFFIX)
    target_compile_definitions(${target} INTERFACE CBLAS_ILP64)
  endif()
  target_include_directories(${target} INTERFACE
    $<BUILD_INTERFACE:${PROJECT_SOURCE_DIR}/include> $<INSTALL_INTERFACE:include>)
  add_dependencies(interfaces ${target})
endfunction()

add_custom_target(interfaces)
qtb_add_companion(blas lp64 BITS 32 SUFFIX "" SOVERSION 3)
qtb_add_companion(blas64 ilp64 BITS 64 SUFFIX "" SOVERSION 3)
qtb_add_companion(qtb64 ilp64_suffixed BITS 64 SUFFIX _64)

# cblas.h with the libraries that have its names.
add_library(qtb_cblas INTERFACE)
add_library(qtb::cblas ALIAS qtb_cblas)
target_link_libraries(qtb_cblas INTERFACE qtb_companion_blas)
set_target_properties(qtb_cblas PROPERTIES EXPORT_NAME cblas)
