# The tier implementations, called one by one.
qtb_add_test(vector_arithmetic_test SOURCES kernels/vector_arithmetic_test.cpp LIBRARIES qtb_static SHARDS 2)
qtb_add_test(vector_cases_test SOURCES kernels/vector_cases_test.cpp LIBRARIES qtb_static)
qtb_add_test(vector_memory_test SOURCES kernels/vector_memory_test.cpp LIBRARIES qtb_static)
qtb_add_test(vector_sweep_test SOURCES kernels/vector_sweep_test.cpp LIBRARIES qtb_static SHARDS 2)
qtb_add_test(gemm_blocks_test SOURCES kernels/gemm_blocks_test.cpp LIBRARIES qtb_static)
qtb_add_test(gemm_copy_test SOURCES kernels/gemm_copy_test.cpp LIBRARIES qtb_static)
qtb_add_test(gemm_kernels_test SOURCES kernels/gemm_kernels_test.cpp LIBRARIES qtb_static)
qtb_add_test(gemm_pieces_test SOURCES kernels/gemm_pieces_test.cpp LIBRARIES qtb_static)
qtb_add_test(triangle_pieces_test SOURCES kernels/triangle_pieces_test.cpp LIBRARIES qtb_static SHARDS 2)
# Every tier's kernels, called directly.
# level1
qtb_add_test(norms_test SOURCES kernels/norms_test.cpp LIBRARIES qtb_static)
qtb_add_test(rotations_test SOURCES kernels/rotations_test.cpp LIBRARIES qtb_static)
qtb_add_test(searches_test SOURCES kernels/searches_test.cpp LIBRARIES qtb_static)
qtb_add_test(sparse_test SOURCES kernels/sparse_test.cpp LIBRARIES qtb_static)
