# The tier implementations, called one by one.
qtb_add_test(vector_arithmetic_test SOURCES kernels/vector_arithmetic_test.cpp LIBRARIES qtb_static SHARDS 2)
qtb_add_test(vector_cases_test SOURCES kernels/vector_cases_test.cpp LIBRARIES qtb_static)
qtb_add_test(vector_memory_test SOURCES kernels/vector_memory_test.cpp LIBRARIES qtb_static)
qtb_add_test(vector_sweep_test SOURCES kernels/vector_sweep_test.cpp LIBRARIES qtb_static SHARDS 2)
