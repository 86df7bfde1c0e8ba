# Level 3, tier by tier.
qtb_add_test(gemm_blocks_test SOURCES kernels/level3/gemm_blocks_test.cpp LIBRARIES qtb_static)
# A process keeps its processor, on which the family of two tiers depends.
set(gemm_processors "plain=QTB_TEST_PROCESSOR=plain" "sse41=QTB_TEST_PROCESSOR=sse41"
  "family16=QTB_TEST_PROCESSOR=family16")
qtb_add_test(gemm_body_test SOURCES kernels/level3/gemm_body_test.cpp LIBRARIES qtb_static qtb_platform_fake
  RUNS ${gemm_processors} SHARDS 4)
qtb_add_test(gemm_in_place_test SOURCES kernels/level3/gemm_in_place_test.cpp LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(gemm_kernels_test SOURCES kernels/level3/gemm_kernels_test.cpp LIBRARIES qtb_static)
qtb_add_test(gemm_low_kernels_test SOURCES kernels/level3/gemm_low_kernels_test.cpp LIBRARIES qtb_static)
qtb_add_test(gemm_memory_test SOURCES kernels/level3/gemm_memory_test.cpp LIBRARIES qtb_static qtb_platform_fake
  RUNS ${gemm_processors} "family16_of_sse3=QTB_TEST_PROCESSOR=family16_of_sse3" SHARDS 2)
qtb_add_test(gemm_pack_test SOURCES kernels/level3/gemm_pack_test.cpp LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(gemm_pieces_test SOURCES kernels/level3/gemm_pieces_test.cpp LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(small_right_test SOURCES kernels/level3/small_right_test.cpp LIBRARIES qtb_static qtb_platform_static)
qtb_add_test(triangle_pieces_test SOURCES kernels/level3/triangle_pieces_test.cpp LIBRARIES qtb_static SHARDS 2)
qtb_add_test(nested_blocks_test SOURCES kernels/level3/nested_blocks_test.cpp LIBRARIES qtb_static qtb_platform_static
  SHARDS 8)
qtb_add_test(unblocked_test SOURCES kernels/level3/unblocked_test.cpp LIBRARIES qtb_static qtb_platform_static
  SHARDS 8)
qtb_add_test(triangular_levels_test SOURCES kernels/level3/triangular_levels_test.cpp)
qtb_add_test(triangular_sweep_test SOURCES kernels/level3/triangular_sweep_test.cpp LIBRARIES qtb_static
  qtb_platform_fake RUNS "plain=QTB_TEST_PROCESSOR=plain" "sse41=QTB_TEST_PROCESSOR=sse41" SHARDS 4)
qtb_add_test(triangular_level3_test SOURCES kernels/level3/triangular_test.cpp LIBRARIES qtb_static qtb_platform_fake
  RUNS "plain=QTB_TEST_PROCESSOR=plain" "sse41=QTB_TEST_PROCESSOR=sse41" SHARDS 2)
# It counts the products that a walk asks for.
target_link_options(triangular_level3_test PRIVATE -Wl,--wrap=qtb_blas_sse42_xdgemm)
