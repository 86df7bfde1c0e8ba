// The self-test: every routine of a library, in every tier that this processor has, against the oracle.
#pragma once

namespace qtb::info {

// How many problems a routine gets.
struct Plan {
  int small, large;
};

// A library that was loaded by its path.
class Library {
 public:
  // Ends the program with a message where the file cannot be loaded or is none that can be tested.
  explicit Library(const char *path);
  void *symbol(const char *name) const;
  // The published names of the product, in two cases; otherwise Fortran names with integers of 32 bits.
  bool is_published() const { return published_; }

 private:
  void *handle_;
  bool published_;
};

struct Result {
  long routines = 0, cases = 0, failures = 0;
  // Says what is wrong with a routine.
  void fail(const char *routine, const char *what);
};

// The parts, by level.
void test_level1(const Library &library, const Plan &plan, Result &result);
void test_level2(const Library &library, const Plan &plan, Result &result);
void test_level3(const Library &library, const Plan &plan, Result &result);

// Runs all tiers of the processor, or the one that QTB_DEBUG_CPU_TYPE names, each in a process of its own and with one
// thread and with several. path is null for the library that belongs to this program. Returns the exit status: 0, or 1
// where a routine failed.
int run_selftest(const char *path);
// What such a process does.
int run_selftest_of_tier(const char *path, bool threads);

}  // namespace qtb::info
