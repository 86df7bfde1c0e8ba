// A process whose answers are given, and which notes what it is asked, a letter a question, in order:
//   t tier, n threads, d dynamic mode, c cache table, 4 SSE4.1, f the family with kernels of its own, p parallel region
// Decisions about threads are asked of it by value; stand_ins.h puts it behind the services.
#pragma once

#include <algorithm>
#include <iterator>
#include <string>

#include "blas/thread/process.h"

namespace qtb::test {

struct Answers {
  ProcessorTier tier = tier_sse42;
  std::int32_t max_threads = 8;
  std::int32_t dynamic = 1;
  std::uint32_t cache[cache_size_entries] = {3, 32768, 262144, 8388608, 7};  // levels, then bytes of each
  bool sse41 = true, family16 = false, in_parallel = false;
};

struct AskedProcess {
  const Answers &answers;
  std::string &asked;

  ProcessorTier tier() { return asked += 't', answers.tier; }
  QtbInt max_threads() { return asked += 'n', answers.max_threads; }
  bool dynamic() { return asked += 'd', answers.dynamic == 1; }
  void cache_sizes(std::uint32_t *out) {
    asked += 'c';
    std::copy(std::begin(answers.cache), std::end(answers.cache), out);
  }
  bool has_sse41() { return asked += '4', answers.sse41; }
  bool is_amd_family16() { return asked += 'f', answers.family16; }
  bool in_parallel() { return asked += 'p', answers.in_parallel; }
};

}  // namespace qtb::test
