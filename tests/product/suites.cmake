# The product as a whole: its object files, and the files that it is built from.
if(NOT QTB_INSTRUMENT)
  foreach(tier IN LISTS QTB_TIERS)
    set(list ${CMAKE_CURRENT_BINARY_DIR}/tier_objects_${tier}.txt)
    file(GENERATE OUTPUT ${list} CONTENT "$<JOIN:$<TARGET_OBJECTS:qtb_${tier}>,\n>\n")
    qtb_add_script_test(tier_objects_test.${tier} COMMAND product/tier_objects_test.sh ${tier} ${list} ${QTB_TIERS})
  endforeach()
  qtb_add_script_test(tier_objects_self_test COMMAND product/tier_objects_self_test.sh ${QTB_TIERS})
  qtb_add_script_test(exports_test
    COMMAND product/exports_test.sh $<TARGET_FILE:qtb> ${PROJECT_SOURCE_DIR}/blas/routines.def)
  qtb_add_script_test(exports_self_test
    COMMAND product/exports_self_test.sh ${PROJECT_SOURCE_DIR}/blas/routines.def)
  if(TARGET tools)
    qtb_add_script_test(promises_test
      COMMAND product/promises_test.sh ${PROJECT_SOURCE_DIR} ${PROJECT_BINARY_DIR} ${CMAKE_CTEST_COMMAND})
  endif()
  qtb_add_script_test(install_test COMMAND product/install_test.sh ${PROJECT_BINARY_DIR})
  if(TARGET interfaces AND PROJECT_IS_TOP_LEVEL)
    qtb_add_script_test(deb_test LABELS long TIMEOUT 600 COMMAND product/deb_test.sh ${PROJECT_BINARY_DIR})
    set_tests_properties(deb_test PROPERTIES SKIP_RETURN_CODE 77)
  endif()
endif()
qtb_add_test(interface_test BRIEF SOURCES product/interface_test.cpp LIBRARIES qtb)
qtb_add_script_test(kernel_types_test COMMAND product/kernel_types_test.sh ${PROJECT_SOURCE_DIR})
qtb_add_script_test(repository_test COMMAND product/repository_test.sh ${PROJECT_SOURCE_DIR})
qtb_add_script_test(repository_self_test COMMAND product/repository_self_test.sh)
qtb_add_script_test(tier_words_test COMMAND product/tier_words_test.sh ${PROJECT_SOURCE_DIR} ${QTB_TIERS})
qtb_add_script_test(packages_test COMMAND product/packages_test.sh ${PROJECT_SOURCE_DIR}/tools/packages.sh)

# The exported routines of the shared library, each suite once per tier; and the routines of an independent library, to
# see that the oracle is right.
set(other_routines reference=QTB_TEST_ROUTINES=reference)
qtb_add_test(surface_level1_test TIERS SOURCES product/surface_level1_test.cpp LIBRARIES qtb RUNS ${other_routines})
qtb_add_test(surface_level2_test TIERS SOURCES product/surface_level2_test.cpp LIBRARIES qtb RUNS ${other_routines})
qtb_add_test(surface_level3_test TIERS SOURCES product/surface_level3_test.cpp LIBRARIES qtb RUNS ${other_routines})
qtb_add_test(published_level2_test TIERS SOURCES product/published_level2_test.cpp LIBRARIES qtb)
qtb_add_test(published_level3_test TIERS SOURCES product/published_level3_test.cpp LIBRARIES qtb)
qtb_add_test(first_calls_test TIERS SOURCES product/first_calls_test.cpp LIBRARIES qtb)
qtb_add_test(published_errors_test BRIEF SOURCES product/published_errors_test.cpp LIBRARIES qtb)
