# The oracle, against itself in wider arithmetic and against results worked out by hand.
qtb_add_test(oracle_test SOURCES reference/oracle_test.cpp)
