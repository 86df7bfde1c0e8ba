# The library's sources, by folder. A source below blas or service that no list names fails the configure step.

# Compiled once per tier.
set(QTB_KERNEL_SOURCES
  # level3
  blas/kernels/level3/blocks.cpp
  # plain
  blas/kernels/plain/gemm.cpp
  blas/kernels/plain/gemm_copy.cpp
  blas/kernels/plain/gemm_packed.cpp
  blas/kernels/plain/gemv.cpp
  blas/kernels/plain/ger.cpp
  blas/kernels/plain/symm.cpp
  blas/kernels/plain/symv.cpp
  blas/kernels/plain/syr.cpp
  blas/kernels/plain/syr2.cpp
  blas/kernels/plain/syr2k.cpp
  blas/kernels/plain/syrk.cpp
  blas/kernels/plain/trmm.cpp
  blas/kernels/plain/trmv.cpp
  blas/kernels/plain/trsm.cpp
  blas/kernels/plain/trsv.cpp
)

# Compiled once.
set(QTB_CORE_SOURCES
  # dispatch
  blas/dispatch/slots.cpp
  # entry
  blas/entry/entries.cpp
  # thread
  blas/thread/forward.cpp
  # service
)

# The operating system behind service/platform/platform.h.
set(QTB_PLATFORM_SOURCES
)

file(GLOB_RECURSE qtb_found RELATIVE ${PROJECT_SOURCE_DIR} CONFIGURE_DEPENDS
  ${PROJECT_SOURCE_DIR}/blas/*.cpp ${PROJECT_SOURCE_DIR}/service/*.cpp)
foreach(source IN LISTS qtb_found)
  if(NOT source IN_LIST QTB_KERNEL_SOURCES AND NOT source IN_LIST QTB_CORE_SOURCES
      AND NOT source IN_LIST QTB_PLATFORM_SOURCES)
    message(FATAL_ERROR "${source} is in no list of cmake/sources.cmake")
  endif()
endforeach()
