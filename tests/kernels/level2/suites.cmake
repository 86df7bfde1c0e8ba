# Level 2, tier by tier.
qtb_add_test(gemv_test SOURCES kernels/level2/gemv_test.cpp LIBRARIES qtb_static qtb_platform_static)
qtb_add_test(general_sweep_test SOURCES kernels/level2/general_sweep_test.cpp LIBRARIES qtb_static
  qtb_platform_static SHARDS 4)
qtb_add_test(ger_test SOURCES kernels/level2/ger_test.cpp LIBRARIES qtb_static qtb_platform_static)
qtb_add_test(triangular_test SOURCES kernels/level2/triangular_test.cpp LIBRARIES qtb_static
  qtb_platform_static SHARDS 2)
# It counts the calls of the front end.
target_link_options(triangular_test PRIVATE -Wl,--wrap=qtb_blas_dgemv)
qtb_add_test(symmetric_sweep_test SOURCES kernels/level2/symmetric_sweep_test.cpp LIBRARIES qtb_static
  qtb_platform_static SHARDS 6)
qtb_add_test(symmetric_test BRIEF SOURCES kernels/level2/symmetric_test.cpp LIBRARIES qtb_static qtb_platform_static)
qtb_add_test(banded_sweep_test SOURCES kernels/level2/banded_sweep_test.cpp LIBRARIES qtb_static qtb_platform_static
  SHARDS 4)
qtb_add_test(banded_test SOURCES kernels/level2/banded_test.cpp LIBRARIES qtb_static qtb_platform_static SHARDS 2)
