# The descriptions of calls that tests and benchmarks share.
qtb_add_test(description_test SOURCES calls/description_test.cpp)
