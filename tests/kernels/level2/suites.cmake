# Level 2, tier by tier.
qtb_add_test(symmetric_sweep_test SOURCES kernels/level2/symmetric_sweep_test.cpp LIBRARIES qtb_static
  qtb_platform_static SHARDS 6)
qtb_add_test(symmetric_test SOURCES kernels/level2/symmetric_test.cpp LIBRARIES qtb_static qtb_platform_static)
