# The tiers' instruction sets. Flags stand here and nowhere else; blas/tiers.h has the list of tiers in the same order.
#
# -mno-popcnt and its kin keep out what a compiler would add on its own to the instruction set that the tier names.
#
set(QTB_TIERS def sse3 ssse3 sse42 avx)
# The product holds a source once per tier that lists it. A tool that reads sources wants each of them once.
option(QTB_EACH_SOURCE_ONCE "Kernels in the highest tier alone that lists them: for tools, not a product" OFF)
set(QTB_TIER_FLAGS_def   -march=x86-64)
set(QTB_TIER_FLAGS_sse3  -march=x86-64 -msse3)
set(QTB_TIER_FLAGS_ssse3 -march=x86-64 -mssse3)
set(QTB_TIER_FLAGS_sse42 -march=x86-64 -msse4.2 -mno-popcnt -mno-crc32)
# The avx tier's kernels are those of sse42; only the double-precision GEMM kernel is built with the wider encoding.
set(QTB_TIER_FLAGS_avx   -march=x86-64 -msse4.2 -mno-popcnt -mno-crc32)
# On top of the tier's, for the sources in QTB_WIDE_KERNEL_SOURCES.
set(QTB_WIDE_FLAGS -mavx)

# Loops and procedures start on a cache line: short loops lose up to half of their speed where their last jump straddles
# two lines.
set(QTB_KERNEL_ALIGNMENT -falign-functions=64 -falign-loops=64)

# qtb_add_tiers(source...): one object library qtb_<tier> per tier, each of all the sources and of those that
# QTB_KERNEL_SOURCES_<tier> lists for this tier; with QTB_EACH_SOURCE_ONCE without those that a higher tier has.
function(qtb_add_tiers)
  set_property(SOURCE ${QTB_WIDE_KERNEL_SOURCES} APPEND PROPERTY COMPILE_OPTIONS ${QTB_WIDE_FLAGS})
  set(highest_first ${QTB_TIERS})
  list(REVERSE highest_first)
  set(taken "")
  foreach(tier IN LISTS highest_first)
    set(sources ${ARGN} ${QTB_KERNEL_SOURCES_${tier}})
    if(QTB_EACH_SOURCE_ONCE)
      list(REMOVE_ITEM sources ${taken} "")
      list(APPEND taken ${sources})
    endif()
    add_library(qtb_${tier} OBJECT ${sources})
    target_link_libraries(qtb_${tier} PRIVATE qtb_options)
    target_compile_definitions(qtb_${tier} PRIVATE QTB_TIER=${tier})
    target_compile_options(qtb_${tier} PRIVATE
      ${QTB_TIER_FLAGS_${tier}} ${QTB_KERNEL_ALIGNMENT} -fno-exceptions -fno-rtti)
  endforeach()
endfunction()
