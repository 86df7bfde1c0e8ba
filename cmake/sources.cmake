# The library's sources, by folder. A source below blas or service that no list names fails the configure step.

# Compiled once per tier.
set(QTB_KERNEL_SOURCES
  # level1
  blas/kernels/level1/asum.cpp
  blas/kernels/level1/axpy.cpp
  blas/kernels/level1/complex_dot.cpp
  blas/kernels/level1/copy.cpp
  blas/kernels/level1/dot.cpp
  blas/kernels/level1/extended_dot.cpp
  blas/kernels/level1/iamax.cpp
  blas/kernels/level1/nrm2.cpp
  blas/kernels/level1/rot.cpp
  blas/kernels/level1/rotg.cpp
  blas/kernels/level1/rotm.cpp
  blas/kernels/level1/rotmg.cpp
  blas/kernels/level1/scal.cpp
  blas/kernels/level1/sparse.cpp
  blas/kernels/level1/swap.cpp
  # level2
  blas/kernels/level2/diagonal_kernels.cpp
  blas/kernels/level2/gbmv.cpp
  blas/kernels/level2/gemv.cpp
  blas/kernels/level2/symv.cpp
  blas/kernels/level2/syr.cpp
  blas/kernels/level2/syr2.cpp
  blas/kernels/level2/tbmv.cpp
  blas/kernels/level2/tbsv.cpp
  blas/kernels/level2/tpmv.cpp
  blas/kernels/level2/tpsv.cpp
  blas/kernels/level2/trmv.cpp
  blas/kernels/level2/trsv.cpp
  # level3
  blas/kernels/level3/gemm/scale_c.cpp
  blas/kernels/level3/gemm/small.cpp
  blas/kernels/level3/rank_k/syr2k.cpp
  blas/kernels/level3/symmetric/symm.cpp
  blas/kernels/level3/triangular/unblocked.cpp
)

# Compiled for some tiers only: these lists alone decide where.
set(QTB_KERNEL_SOURCES_def
  blas/kernels/level1/sscal.cpp
  blas/kernels/level2/def/ger.cpp
  blas/kernels/level3/gemm/def/blocks.cpp
  blas/kernels/level3/gemm/def/dgemm.cpp
  blas/kernels/level3/gemm/def/dgemm_kernel.cpp
  blas/kernels/level3/gemm/def/folding_gemm.cpp
  blas/kernels/level3/gemm/def/folding_kernels.cpp
  blas/kernels/level3/gemm/def/pack.cpp
  blas/kernels/level3/gemm/pack.cpp
  blas/kernels/level3/rank_k/syrk_tiles.cpp
  blas/kernels/level3/triangular/def/trmm.cpp
  blas/kernels/level3/triangular/def/trsm.cpp
)
set(QTB_KERNEL_SOURCES_sse3
  blas/kernels/level1/sscal.cpp
  blas/kernels/level2/gemv_kernels.cpp
  blas/kernels/level2/ger.cpp
  blas/kernels/level3/gemm/def/folding_gemm.cpp
  blas/kernels/level3/gemm/def/folding_kernels.cpp
  blas/kernels/level3/gemm/pack.cpp
  blas/kernels/level3/gemm/sse3/dgemm.cpp
  blas/kernels/level3/gemm/sse3/dgemm_kernel.cpp
  blas/kernels/level3/rank_k/syrk_tiles.cpp
  blas/kernels/level3/triangular/def/trmm.cpp
  blas/kernels/level3/triangular/def/trsm.cpp
)
set(QTB_KERNEL_SOURCES_ssse3
  blas/kernels/level1/sscal.cpp
  blas/kernels/level2/gemv_kernels.cpp
  blas/kernels/level2/ger.cpp
  blas/kernels/level2/syr2_block.cpp
  blas/kernels/level2/syr_block.cpp
  blas/kernels/level2/trmv_block.cpp
  blas/kernels/level3/gemm/blocks.cpp
  blas/kernels/level3/gemm/pieces.cpp
  blas/kernels/level3/gemm/ssse3/blocks.cpp
  blas/kernels/level3/gemm/ssse3/gemm.cpp
  blas/kernels/level3/gemm/ssse3/gemm_kernel.cpp
  blas/kernels/level3/gemm/ssse3/pack.cpp
  blas/kernels/level3/rank_k/dsyrk_n4.cpp
  blas/kernels/level3/rank_k/syrk.cpp
  blas/kernels/level3/rank_k/syrk_body.cpp
  blas/kernels/level3/triangular/level_trmm.cpp
  blas/kernels/level3/triangular/level_trsm.cpp
  blas/kernels/level3/triangular/small_right.cpp
)
set(QTB_KERNEL_SOURCES_sse42
  blas/kernels/level1/sse42/sscal.cpp
  blas/kernels/level2/gemv_kernels.cpp
  blas/kernels/level2/ger.cpp
  blas/kernels/level2/syr2_block.cpp
  blas/kernels/level2/syr_block.cpp
  blas/kernels/level2/trmv_block.cpp
  blas/kernels/level3/gemm/blocks.cpp
  blas/kernels/level3/gemm/gemm.cpp
  blas/kernels/level3/gemm/pack.cpp
  blas/kernels/level3/gemm/pieces.cpp
  blas/kernels/level3/gemm/sse42/dgemm_kernel.cpp
  blas/kernels/level3/gemm/sse42/gemm_kernel.cpp
  blas/kernels/level3/gemm/sse42/pieces.cpp
  blas/kernels/level3/rank_k/dsyrk_n4.cpp
  blas/kernels/level3/rank_k/syrk.cpp
  blas/kernels/level3/rank_k/syrk_body.cpp
  blas/kernels/level3/triangular/level_trmm.cpp
  blas/kernels/level3/triangular/level_trsm.cpp
  blas/kernels/level3/triangular/small_right.cpp
)
set(QTB_KERNEL_SOURCES_avx
  blas/kernels/level2/gemv_kernels.cpp
  blas/kernels/level2/ger.cpp
  blas/kernels/level2/syr2_block.cpp
  blas/kernels/level2/syr_block.cpp
  blas/kernels/level2/trmv_block.cpp
  blas/kernels/level3/gemm/avx/dgemm_kernel.cpp
  blas/kernels/level3/gemm/blocks.cpp
  blas/kernels/level3/gemm/gemm.cpp
  blas/kernels/level3/gemm/pack.cpp
  blas/kernels/level3/gemm/pieces.cpp
  blas/kernels/level3/gemm/sse42/gemm_kernel.cpp
  blas/kernels/level3/rank_k/dsyrk_n4.cpp
  blas/kernels/level3/rank_k/syrk.cpp
  blas/kernels/level3/rank_k/syrk_body.cpp
  blas/kernels/level3/triangular/level_trmm.cpp
  blas/kernels/level3/triangular/level_trsm.cpp
  blas/kernels/level3/triangular/small_right.cpp
)
set(qtb_tier_sources "")
foreach(tier IN LISTS QTB_TIERS)
  if(NOT DEFINED QTB_KERNEL_SOURCES_${tier})
    message(FATAL_ERROR "cmake/sources.cmake: write QTB_KERNEL_SOURCES_${tier}, the kernels that the tier has beside "
      "those of all tiers: its products at least")
  endif()
  list(APPEND qtb_tier_sources ${QTB_KERNEL_SOURCES_${tier}})
endforeach()
# Of these, the ones in the wider encoding: tests/product/mnemonics/vex_objects.txt has the same list.
set(QTB_WIDE_KERNEL_SOURCES
  blas/kernels/level3/gemm/avx/dgemm_kernel.cpp
)

# Vectorised by hand: what the compiler's own vectoriser adds is code that makes short and strided vectors slower, whose
# spare lanes can raise exceptions that the elements do not, and that moves tiles out of registers.
set(qtb_hand_vectorised ${QTB_KERNEL_SOURCES} ${qtb_tier_sources})
list(REMOVE_DUPLICATES qtb_hand_vectorised)
list(FILTER qtb_hand_vectorised INCLUDE REGEX "^blas/kernels/level[1-3]/")
set_property(SOURCE ${qtb_hand_vectorised} APPEND PROPERTY COMPILE_OPTIONS -fno-tree-vectorize)

# The order of a pass that computes is that of its source: moved together, its loads and its counters make these loops
# slower, while copy and swap gain by it. Where a pass has many accumulators, registers that are not reused at once do
# the same good.
if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
  foreach(routine asum axpy complex_dot scal sscal sse42/sscal)
    set_property(SOURCE blas/kernels/level1/${routine}.cpp APPEND PROPERTY COMPILE_OPTIONS -fno-schedule-insns2)
  endforeach()
  foreach(routine asum complex_dot)
    set_property(SOURCE blas/kernels/level1/${routine}.cpp APPEND PROPERTY COMPILE_OPTIONS -frename-registers)
  endforeach()
endif()

# Some processors decode a jump slowly that crosses or ends on a boundary of 32 bytes. Where the arithmetic of a column
# is as short as what stands around it, a loop placed so loses up to a sixth.
include(CheckCXXCompilerFlag)
set(qtb_placed_jumps -Wa,-malign-branch-boundary=32,-malign-branch=jcc+fused+jmp,-malign-branch-prefix-size=0)
check_cxx_compiler_flag("${qtb_placed_jumps}" QTB_ASSEMBLER_PLACES_JUMPS)
if(QTB_ASSEMBLER_PLACES_JUMPS)
  set(qtb_short_columns ${qtb_hand_vectorised})
  list(FILTER qtb_short_columns INCLUDE REGEX "^blas/kernels/level2/")
  set_property(SOURCE ${qtb_short_columns} APPEND PROPERTY COMPILE_OPTIONS ${qtb_placed_jumps})
endif()

# The inner kernels of GEMV read and write by halves what stands 8 bytes off a boundary: the compiler would join them.
if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
  set_property(SOURCE blas/kernels/level2/gemv_kernels.cpp APPEND PROPERTY COMPILE_OPTIONS
    -mtune-ctrl=^sse_unaligned_load_optimal,^sse_unaligned_store_optimal)
endif()

# Compiled once.
set(QTB_CORE_SOURCES
  # dispatch
  blas/dispatch/slots.cpp
  # entry
  blas/entry/checks.cpp
  blas/entry/entries.cpp
  blas/entry/load.cpp
  blas/entry/lsame.cpp
  blas/entry/version.cpp
  blas/entry/xerbla.cpp
  # thread
  blas/thread/32/level3/hemm_omp.cpp
  blas/thread/32/level3/her2k_omp.cpp
  blas/thread/32/level3/symm.cpp
  blas/thread/32/level3/symm_omp.cpp
  blas/thread/32/level3/syr2k.cpp
  blas/thread/32/level3/syr2k_omp.cpp
  blas/thread/32e/level1/xf_l1.cpp
  blas/thread/32e/level1/xf_l1_omp.cpp
  blas/thread/32e/level2/gemv.cpp
  blas/thread/32e/level2/gemv_omp.cpp
  blas/thread/32e/level2/l2.cpp
  blas/thread/32e/level2/l2_omp.cpp
  blas/thread/32e/level3/gemm.cpp
  blas/thread/32e/level3/gemm_1d.cpp
  blas/thread/32e/level3/gemm_2d.cpp
  blas/thread/32e/level3/gemm_mscale_omp.cpp
  blas/thread/32e/level3/gemm_omp.cpp
  blas/thread/32e/level3/gemm_select.cpp
  blas/thread/32e/level3/syrk.cpp
  blas/thread/32e/level3/syrk_omp.cpp
  blas/thread/32e/level3/trmm.cpp
  blas/thread/32e/level3/trmm_omp.cpp
  blas/thread/32e/level3/trsm_omp.cpp
  blas/thread/forward.cpp
  # service
  service/cache.cpp
  service/cores.cpp
  service/cpu.cpp
  service/memory.cpp
  service/messages.cpp
  service/thread_settings.cpp
  service/threads.cpp
)

# The operating system behind service/platform/platform.h.
set(QTB_PLATFORM_SOURCES
  service/platform/catalog_file.cpp
  service/platform/linux.cpp
  service/platform/linux_messages.cpp
)

# Said by each library for itself: this is the product's.
set(QTB_OWN_SOURCES
  service/own_threads.cpp
  service/own_tier.cpp
)

file(GLOB_RECURSE qtb_found RELATIVE ${PROJECT_SOURCE_DIR} CONFIGURE_DEPENDS
  ${PROJECT_SOURCE_DIR}/blas/*.cpp ${PROJECT_SOURCE_DIR}/service/*.cpp)
foreach(source IN LISTS qtb_found)
  if(NOT source IN_LIST QTB_KERNEL_SOURCES AND NOT source IN_LIST qtb_tier_sources
      AND NOT source IN_LIST QTB_CORE_SOURCES AND NOT source IN_LIST QTB_PLATFORM_SOURCES
      AND NOT source IN_LIST QTB_OWN_SOURCES)
    message(FATAL_ERROR "${source} is in no list of cmake/sources.cmake")
  endif()
endforeach()
