# The tier implementations, called one by one.
qtb_add_test(gemm_blocks_test SOURCES kernels/gemm_blocks_test.cpp LIBRARIES qtb_static)
qtb_add_test(gemm_body_test SOURCES kernels/gemm_body_test.cpp LIBRARIES qtb_static qtb_platform_fake SHARDS 4)
qtb_add_test(gemm_in_place_test SOURCES kernels/gemm_in_place_test.cpp LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(gemm_kernels_test SOURCES kernels/gemm_kernels_test.cpp LIBRARIES qtb_static)
qtb_add_test(gemm_low_kernels_test SOURCES kernels/gemm_low_kernels_test.cpp LIBRARIES qtb_static)
qtb_add_test(gemm_pack_test SOURCES kernels/gemm_pack_test.cpp LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(gemm_pieces_test SOURCES kernels/gemm_pieces_test.cpp LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(triangle_pieces_test SOURCES kernels/triangle_pieces_test.cpp LIBRARIES qtb_static SHARDS 2)
