// Every tier's procedures replaced by ones that only say that they were called and with what.
//
// A test that links recording_kernels.cpp has the library's slots above them and no kernel.
#pragma once

#include <array>

#include "blas/dispatch/slots.h"

namespace qtb::test {

constexpr std::size_t most_arguments = 20;

struct RecordedCall {
  int slot = -1, tier = -1;  // -1: no procedure was called
  int argument_count = 0;
  std::array<const void *, most_arguments> arguments = {};
};
inline thread_local RecordedCall recorded_call;

// What a procedure that returns a number gives, by slot and tier. Exact in every type.
constexpr int recorded_result(int slot, int tier) { return slot * tier_count + tier + 1; }

}  // namespace qtb::test
