// The memory of a test: every request and release is noted, memory begins at a chosen distance behind a page boundary,
// holds NaN in every type, has a mark at its end that no one may write to, and may run out at any request.
//
// It stands behind the memory service (use_recorded_memory, in the whole library on the fake system), or in its place:
// QTB_RECORDED_MEMORY_SERVICE, once in a program, defines the service's two procedures.
#pragma once

#include <omp.h>

#include <atomic>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <map>
#include <mutex>
#include <vector>

#include "service/memory.h"
#include "tests/platform/fake.h"

namespace qtb::test {

struct MemoryRequest {
  int thread;
  std::uint64_t bytes;
  std::int32_t alignment;
  void *given;  // null for a request that failed
};

struct RecordedMemory {
  std::size_t distance = 128;  // as aligned as panels ask, and as far as that is from the next page
  // Whether a request gets nothing, from its number and its number among those of its thread; never where empty.
  std::function<bool(long number, int thread, int number_of_thread)> fails = {};

  std::vector<MemoryRequest> requests;
  std::vector<std::pair<int, void *>> releases;  // with the thread
  std::map<void *, std::uint64_t> held;          // and the bytes asked for
  long faults = 0;                               // marks overwritten, and releases of what was not held

  void forget() {
    requests.clear();
    releases.clear();
  }
};
inline RecordedMemory recorded_memory;
inline std::mutex recorded_memory_mutex;

constexpr std::size_t memory_mark = 64 * 1024, memory_page = 4096;
constexpr unsigned char memory_mark_byte = 0x5A;

inline void *recorded_malloc(std::uint64_t size, std::int32_t alignment) {
  const std::lock_guard lock(recorded_memory_mutex);
  RecordedMemory &memory = recorded_memory;
  const int thread = omp_get_thread_num();
  int of_thread = 0;
  for (const MemoryRequest &earlier : memory.requests) of_thread += earlier.thread == thread;
  void *given = nullptr;
  if (!memory.fails || !memory.fails(static_cast<long>(memory.requests.size()), thread, of_thread)) {
    const std::size_t bytes = memory.distance + size + memory_mark;
    auto *const base = static_cast<unsigned char *>(
        std::aligned_alloc(memory_page, (bytes + memory_page - 1) / memory_page * memory_page));
    std::memset(base + memory.distance, 0xFF, size);
    std::memset(base + memory.distance + size, memory_mark_byte, memory_mark);
    given = base + memory.distance;
    memory.held[given] = size;
  }
  memory.requests.push_back({thread, size, alignment, given});
  return given;
}

inline void recorded_free(void *pointer) {
  if (pointer == nullptr) return;
  const std::lock_guard lock(recorded_memory_mutex);
  RecordedMemory &memory = recorded_memory;
  memory.releases.push_back({omp_get_thread_num(), pointer});
  const auto held = memory.held.find(pointer);
  if (held == memory.held.end()) {
    ++memory.faults;
    return;
  }
  const unsigned char *const end = static_cast<unsigned char *>(pointer) + held->second;
  for (std::size_t i = 0; i < memory_mark; ++i)
    if (end[i] != memory_mark_byte) {
      ++memory.faults;
      break;
    }
  memory.held.erase(held);
  std::free(reinterpret_cast<void *>(reinterpret_cast<std::uintptr_t>(pointer) / memory_page * memory_page));
}

// For programs with the whole library on the fake system: puts this memory behind the memory service, ahead of its
// first request. The service keeps no buffers then, so that every request and release is seen.
inline void use_recorded_memory() {
  static void *procedures[] = {reinterpret_cast<void *>(+[](std::size_t size) { return recorded_malloc(size, 0); }),
                               reinterpret_cast<void *>(+[](std::size_t, std::size_t) -> void * { std::abort(); }),
                               reinterpret_cast<void *>(+[](void *, std::size_t) -> void * { std::abort(); }),
                               reinterpret_cast<void *>(&recorded_free)};
  fake.environment["QTB_DISABLE_FAST_MM"] = "1";
  fake.libraries["libqmalloc.so"] = {{"q_malloc_dll", &procedures[0]},
                                     {"q_calloc_dll", &procedures[1]},
                                     {"q_realloc_dll", &procedures[2]},
                                     {"q_free_dll", &procedures[3]}};
  qtb_serv_select_allocator();
}

}  // namespace qtb::test

#define QTB_RECORDED_MEMORY_SERVICE                                              \
  extern "C" void *qtb_serv_malloc(std::uint64_t size, std::int32_t alignment) { \
    return qtb::test::recorded_malloc(size, alignment);                          \
  }                                                                              \
  extern "C" void qtb_serv_free(void *pointer) { qtb::test::recorded_free(pointer); }
