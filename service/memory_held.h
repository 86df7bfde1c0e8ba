// What the memory service holds for the threads of this process.
#pragma once

#include <cstdint>

#include "blas/types.h"

struct MemoryHeld {
  std::int64_t threads;  // that have a list of buffers, also those that have ended
  std::int64_t buffers;  // in all lists
  std::uint64_t bytes;   // of all buffers
  bool reuses_buffers;   // false where the environment turned that off
};

// While no other thread computes: the figures of a thread that does may be those of a moment ago.
extern "C" QTB_HIDDEN void qtb_serv_get_memory_held(MemoryHeld *held);
