# What benchmarks decide and check by themselves; nothing here is timed.
qtb_add_test(selection_test BRIEF SOURCES bench/selection_test.cpp ../bench/routines.cpp ../bench/selection.cpp)
qtb_add_test(check_test BRIEF SOURCES bench/check_test.cpp LIBRARIES qtb)
