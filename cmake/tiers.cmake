# The tiers and their instruction sets, which are columns of the list in blas/tiers.h.
#
# QTB_TIERS: their names, lowest first, so that a place in the list is the number. QTB_TIER_FLAGS_<tier>: the flags.
set(qtb_tier_list ${PROJECT_SOURCE_DIR}/blas/tiers.h)
set_property(DIRECTORY APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS ${qtb_tier_list})
file(READ ${qtb_tier_list} qtb_text)
string(REGEX MATCHALL "\n *ROW\\(" qtb_begun "${qtb_text}")
string(REGEX MATCHALL "\n *ROW\\([a-z0-9]+, *[A-Z0-9]+, *\"[^\"]*\"" qtb_rows "${qtb_text}")
list(LENGTH qtb_begun qtb_begun)
list(LENGTH qtb_rows qtb_read)
if(qtb_read EQUAL 0 OR NOT qtb_read EQUAL qtb_begun)
  message(FATAL_ERROR "${qtb_tier_list}: of ${qtb_begun} tiers ${qtb_read} begin as "
    "ROW(name, NAME, \"compiler flags\", on a line of their own")
endif()
set(QTB_TIERS "")
foreach(row IN LISTS qtb_rows)
  string(REGEX MATCH "ROW\\(([a-z0-9]+), *[A-Z0-9]+, *\"([^\"]*)\"" row "${row}")
  list(APPEND QTB_TIERS ${CMAKE_MATCH_1})
  separate_arguments(QTB_TIER_FLAGS_${CMAKE_MATCH_1} UNIX_COMMAND "${CMAKE_MATCH_2}")
endforeach()
string(REGEX MATCH "largest_asked_tier = ([0-9]+);" row "${qtb_text}")
set(QTB_LARGEST_ASKED_TIER ${CMAKE_MATCH_1})

# The product holds a source once per tier that lists it. A tool that reads sources wants each of them once.
option(QTB_EACH_SOURCE_ONCE "Kernels in the highest tier alone that lists them: for tools, not a product" OFF)

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
      ${QTB_TIER_FLAGS_${tier}} ${QTB_KERNEL_ALIGNMENT} ${QTB_INSTRUMENT_KERNELS} -fno-exceptions -fno-rtti)
  endforeach()
endfunction()
