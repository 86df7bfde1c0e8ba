// The memory of a test: every request and release is noted, memory begins at a chosen distance behind a page boundary,
// holds NaN in every type, has a mark at its end that no one may write to, and may run out at any request.
//
// It stands behind the memory service (use_recorded_memory, in the whole library on the fake system), or in its place:
// QTB_RECORDED_MEMORY_SERVICE, once in a program, defines the service's two procedures.
#pragma once

#include <omp.h>
#include <sys/mman.h>
#include <unistd.h>

#include <array>
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
inline const auto memory_mark_bytes = [] {
  std::array<unsigned char, memory_mark> mark;
  mark.fill(0x5A);
  return mark;
}();

// Pages full of 0xFF, private ones: what a test does not touch of its large buffers costs nothing. They come from a
// file without a name, which is as long as the largest request so far.
inline unsigned char *map_nans(std::size_t bytes) {
  static const int file = memfd_create("nans", 0);
  static std::size_t length = 0;
  static const std::vector<unsigned char> chunk(1024 * 1024, 0xFF);
  while (length < bytes) {
    const ssize_t written = write(file, chunk.data(), chunk.size());
    if (written <= 0) std::abort();
    length += static_cast<std::size_t>(written);
  }
  void *const pages = mmap(nullptr, bytes, PROT_READ | PROT_WRITE, MAP_PRIVATE, file, 0);
  if (pages == MAP_FAILED) std::abort();
  return static_cast<unsigned char *>(pages);
}
// The pages of a piece of memory, from the one that it begins in.
inline std::size_t mapped_bytes(std::size_t distance, std::uint64_t size) {
  return (distance % memory_page + size + memory_mark + memory_page - 1) / memory_page * memory_page;
}

inline void *recorded_malloc(std::uint64_t size, std::int32_t alignment) {
  const std::lock_guard lock(recorded_memory_mutex);
  RecordedMemory &memory = recorded_memory;
  const int thread = omp_get_thread_num();
  int of_thread = 0;
  for (const MemoryRequest &earlier : memory.requests) of_thread += earlier.thread == thread;
  void *given = nullptr;
  if (!memory.fails || !memory.fails(static_cast<long>(memory.requests.size()), thread, of_thread)) {
    unsigned char *const base = map_nans(mapped_bytes(memory.distance, size));
    std::memcpy(base + memory.distance + size, memory_mark_bytes.data(), memory_mark);
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
  if (std::memcmp(end, memory_mark_bytes.data(), memory_mark) != 0) ++memory.faults;
  const std::size_t distance = reinterpret_cast<std::uintptr_t>(pointer) % memory_page;
  munmap(static_cast<unsigned char *>(pointer) - distance, mapped_bytes(distance, held->second));
  memory.held.erase(held);
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
