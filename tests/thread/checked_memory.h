// An allocator behind the memory service that makes the worst of every request: memory begins just behind a page
// boundary, holds NaN in every type, has a mark at its end, and may run out at any request.
#pragma once

#include <atomic>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <mutex>

#include "service/memory.h"
#include "tests/platform/fake.h"

namespace qtb::test {

struct CheckedMemory {
  static constexpr std::size_t before = 128;  // as aligned as panels ask, and as far as that is from the next page
  static constexpr std::size_t mark = 64 * 1024;
  static constexpr unsigned char mark_byte = 0x5A;

  std::atomic<long> requests{0}, outstanding{0}, overruns{0};
  std::atomic<long> failing_first{-1}, failing_count{0};  // so many requests from that number on get nothing
};
inline CheckedMemory checked_memory;

struct CheckedHeader {
  std::size_t size;
};

inline void *checked_malloc(std::size_t size) {
  const long number = checked_memory.requests++;
  const long first = checked_memory.failing_first;
  if (first >= 0 && number >= first && number < first + checked_memory.failing_count) return nullptr;
  const std::size_t bytes = CheckedMemory::before + size + CheckedMemory::mark;
  auto *const base = static_cast<unsigned char *>(std::aligned_alloc(4096, (bytes + 4095) / 4096 * 4096));
  new (base) CheckedHeader{size};
  unsigned char *const given = base + CheckedMemory::before;
  std::memset(given, 0xFF, size);
  std::memset(given + size, CheckedMemory::mark_byte, CheckedMemory::mark);
  ++checked_memory.outstanding;
  return given;
}

inline void checked_free(void *pointer) {
  unsigned char *const given = static_cast<unsigned char *>(pointer);
  unsigned char *const base = given - CheckedMemory::before;
  const unsigned char *const end = given + reinterpret_cast<const CheckedHeader *>(base)->size;
  for (std::size_t i = 0; i < CheckedMemory::mark; ++i)
    if (end[i] != CheckedMemory::mark_byte) {
      ++checked_memory.overruns;
      break;
    }
  --checked_memory.outstanding;
  std::free(base);
}

inline void *no_calloc(std::size_t, std::size_t) { std::abort(); }
inline void *no_realloc(void *, std::size_t) { std::abort(); }

inline void *checked_malloc_variable = reinterpret_cast<void *>(&checked_malloc);
inline void *checked_calloc_variable = reinterpret_cast<void *>(&no_calloc);
inline void *checked_realloc_variable = reinterpret_cast<void *>(&no_realloc);
inline void *checked_free_variable = reinterpret_cast<void *>(&checked_free);

// Puts the allocator behind the memory service of this process, ahead of its first request. The service keeps no
// buffers then, so that every request and release is seen.
inline void use_checked_memory() {
  fake.environment["QTB_DISABLE_FAST_MM"] = "1";
  fake.libraries["libqmalloc.so"] = {{"q_malloc_dll", &checked_malloc_variable},
                                     {"q_calloc_dll", &checked_calloc_variable},
                                     {"q_realloc_dll", &checked_realloc_variable},
                                     {"q_free_dll", &checked_free_variable}};
  qtb_serv_select_allocator();
}

}  // namespace qtb::test
