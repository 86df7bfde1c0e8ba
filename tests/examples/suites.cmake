# The examples, run as their users run them.
if(QTB_BUILD_EXAMPLES)
  qtb_add_script_test(least_squares_test COMMAND examples/least_squares_test.sh $<TARGET_FILE:least_squares>
    ${PROJECT_SOURCE_DIR}/examples/data)
  qtb_add_script_test(matrix_product_test COMMAND examples/matrix_product_test.sh $<TARGET_FILE:matrix_product>)
  qtb_add_script_test(linear_systems_test COMMAND examples/linear_systems_test.sh $<TARGET_FILE:linear_systems>)
endif()
