# Programs that no one here wrote, on libblas.so.3 of the companions and on the reference BLAS. `make test-long`
# installs and runs them; docs/ecosystem.md has what passes.
if(NOT TARGET interfaces OR QTB_INSTRUMENT)
  return()
endif()
function(qtb_add_ecosystem_test name)
  qtb_add_script_test(ecosystem.${name} LABELS long TIMEOUT 7200 COMMAND ${ARGN})
  set_tests_properties(ecosystem.${name} PROPERTIES SKIP_RETURN_CODE 77 PROCESSORS 2)
endfunction()
set(companions ${PROJECT_BINARY_DIR}/interfaces)
qtb_add_ecosystem_test(lapack ecosystem/lapack_test.sh ${companions})
qtb_add_ecosystem_test(numpy ecosystem/python_test.sh ${companions} NumPy numpy.linalg numpy.matrixlib
  numpy.core.tests.test_multiarray numpy.core.tests.test_einsum numpy.core.tests.test_numeric)
qtb_add_ecosystem_test(scipy ecosystem/python_test.sh ${companions} SciPy scipy.linalg scipy.sparse.linalg)
qtb_add_ecosystem_test(octave ecosystem/octave_test.sh ${companions})
qtb_add_ecosystem_test(r ecosystem/r_test.sh ${companions})
qtb_add_ecosystem_test(hpl ecosystem/hpl_test.sh ${companions})
qtb_add_ecosystem_test(scalapack ecosystem/scalapack_test.sh ${companions})
