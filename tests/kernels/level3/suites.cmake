# Level 3, tier by tier.
qtb_add_test(gemm_blocks_test BRIEF SOURCES kernels/level3/gemm_blocks_test.cpp LIBRARIES qtb_static)
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
qtb_add_test(gemm_pack_test BRIEF SOURCES kernels/level3/gemm_pack_test.cpp LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(gemm_pieces_test SOURCES kernels/level3/gemm_pieces_test.cpp LIBRARIES qtb_static qtb_platform_fake)
qtb_add_test(rank_k_splits_test BRIEF SOURCES kernels/level3/rank_k_splits_test.cpp LIBRARIES qtb_static
  qtb_platform_static)
# It notes the calls among the kernels.
foreach(name sse42_xdsyrk_body sse42_xdsyrk_n4 sse42_xssyrk_body sse42_xcsyrk_body sse42_xzherk_body sse42_xdgemm
    sse42_xcgemm sse42_xzgemm def_xdgemm def_xzgemm)
  target_link_options(rank_k_splits_test PRIVATE -Wl,--wrap=qtb_blas_${name})
endforeach()
qtb_add_test(rank_k_test SOURCES kernels/level3/rank_k_test.cpp LIBRARIES qtb_static qtb_platform_static SHARDS 3)
qtb_add_test(triangle_pieces_test SOURCES kernels/level3/triangle_pieces_test.cpp LIBRARIES qtb_static
  qtb_platform_static SHARDS 2)
qtb_add_test(symm_test SOURCES kernels/level3/symm_test.cpp LIBRARIES qtb_static qtb_platform_fake
  RUNS ${gemm_processors} SHARDS 5)
qtb_add_test(syr2k_test SOURCES kernels/level3/syr2k_test.cpp LIBRARIES qtb_static qtb_platform_fake
  RUNS ${gemm_processors} SHARDS 5)
# They note the products that the kernels call, and refuse requests for memory.
foreach(suite symm_test syr2k_test)
  foreach(name qtb_blas_sse42_xdgemm qtb_blas_sse42_xzgemm qtb_serv_malloc)
    target_link_options(${suite} PRIVATE -Wl,--wrap=${name})
  endforeach()
endforeach()
qtb_add_test(small_right_test SOURCES kernels/level3/small_right_test.cpp LIBRARIES qtb_static qtb_platform_static)
qtb_add_test(nested_blocks_test SOURCES kernels/level3/nested_blocks_test.cpp LIBRARIES qtb_static qtb_platform_static
  SHARDS 8)
qtb_add_test(unblocked_test SOURCES kernels/level3/unblocked_test.cpp LIBRARIES qtb_static qtb_platform_static
  SHARDS 8)
qtb_add_test(triangular_levels_test BRIEF SOURCES kernels/level3/triangular_levels_test.cpp)
qtb_add_test(triangular_sweep_test SOURCES kernels/level3/triangular_sweep_test.cpp LIBRARIES qtb_static
  qtb_platform_fake RUNS "plain=QTB_TEST_PROCESSOR=plain" "sse41=QTB_TEST_PROCESSOR=sse41" SHARDS 4)
qtb_add_test(triangular_level3_test SOURCES kernels/level3/triangular_test.cpp LIBRARIES qtb_static qtb_platform_fake
  RUNS "plain=QTB_TEST_PROCESSOR=plain" "sse41=QTB_TEST_PROCESSOR=sse41" SHARDS 2)
# It counts the products that a walk asks for.
target_link_options(triangular_level3_test PRIVATE -Wl,--wrap=qtb_blas_sse42_xdgemm)
