# The library's sources, by folder. A source below blas or service that no list names fails the configure step.

# Compiled once per tier.
set(QTB_KERNEL_SOURCES
  # level1
  blas/kernels/level1/axpy.cpp
  blas/kernels/level1/complex_dot.cpp
  blas/kernels/level1/copy.cpp
  blas/kernels/level1/dot.cpp
  blas/kernels/level1/scal.cpp
  blas/kernels/level1/swap.cpp
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
