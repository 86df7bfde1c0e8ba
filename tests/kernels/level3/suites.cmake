# Level 3, tier by tier.
qtb_add_test(gemm_blocks_test SOURCES kernels/level3/gemm_blocks_test.cpp LIBRARIES qtb_static)
qtb_add_test(gemm_body_test SOURCES kernels/level3/gemm_body_test.cpp LIBRARIES qtb_static qtb_platform_fake SHARDS 4)
qtb_add_test(gemm_in_place_test SOURCES kernels/level3/gemm_in_place_test.cpp LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(gemm_kernels_test SOURCES kernels/level3/gemm_kernels_test.cpp LIBRARIES qtb_static)
qtb_add_test(gemm_low_kernels_test SOURCES kernels/level3/gemm_low_kernels_test.cpp LIBRARIES qtb_static)
qtb_add_test(gemm_pack_test SOURCES kernels/level3/gemm_pack_test.cpp LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(gemm_pieces_test SOURCES kernels/level3/gemm_pieces_test.cpp LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(triangle_pieces_test SOURCES kernels/level3/triangle_pieces_test.cpp LIBRARIES qtb_static SHARDS 2)
