# The descriptions of calls that tests and benchmarks share.
qtb_add_test(description_test BRIEF SOURCES calls/description_test.cpp)
