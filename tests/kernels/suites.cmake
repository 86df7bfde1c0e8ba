# Every tier's kernels, called directly.
# level1
qtb_add_test(norms_test SOURCES kernels/norms_test.cpp LIBRARIES qtb_static)
qtb_add_test(rotations_test SOURCES kernels/rotations_test.cpp LIBRARIES qtb_static)
qtb_add_test(searches_test SOURCES kernels/searches_test.cpp LIBRARIES qtb_static)
qtb_add_test(sparse_test SOURCES kernels/sparse_test.cpp LIBRARIES qtb_static)
