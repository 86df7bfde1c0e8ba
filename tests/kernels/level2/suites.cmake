# Level 2, tier by tier.
qtb_add_test(banded_sweep_test SOURCES kernels/level2/banded_sweep_test.cpp LIBRARIES qtb_static qtb_platform_static
  SHARDS 4)
qtb_add_test(banded_test SOURCES kernels/level2/banded_test.cpp LIBRARIES qtb_static qtb_platform_static SHARDS 2)
