// An allocator that the memory service takes for its own, and that records what the service asks of it.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <functional>
#include <map>
#include <mutex>
#include <vector>

#include "service/memory.h"
#include "tests/platform/fake.h"

namespace qtb::test {

struct RecordingAllocator {
  static constexpr std::size_t page = 4096;

  std::vector<std::size_t> requests;    // sizes asked for, in order
  std::vector<void *> releases;         // pointers given back, in order
  std::map<void *, std::size_t> live;   // what is out, with its size
  std::size_t offset = 16;              // where in a page a result lies, so that it is no more aligned than that
  std::size_t failing_call = SIZE_MAX;  // the call, counted from 0, that returns null
  std::size_t failing_size = SIZE_MAX;  // every call for this size returns null
  int bad_releases = 0;                 // releases of what was not out
  std::function<void(std::size_t)> on_request;  // called at the end of every request, with its size
  std::function<void(void *)> on_release;       // called at the end of every release
  std::mutex mutex;
};
inline RecordingAllocator allocator;

inline void *recorded_request(std::size_t size) {
  const std::lock_guard guard(allocator.mutex);
  allocator.requests.push_back(size);
  if (allocator.requests.size() - 1 == allocator.failing_call || size == allocator.failing_size) return nullptr;
  const std::size_t pages = (size + allocator.offset + RecordingAllocator::page - 1) / RecordingAllocator::page;
  char *base = static_cast<char *>(std::aligned_alloc(RecordingAllocator::page, pages * RecordingAllocator::page));
  void *result = base + allocator.offset;
  allocator.live[result] = size;
  return result;
}

inline void *recording_malloc(std::size_t size) {
  void *const result = recorded_request(size);
  if (allocator.on_request) allocator.on_request(size);
  return result;
}

inline void recording_free(void *pointer) {
  {
    const std::lock_guard guard(allocator.mutex);
    allocator.releases.push_back(pointer);
    if (allocator.live.erase(pointer) == 0) ++allocator.bad_releases;
  }
  if (allocator.on_release) allocator.on_release(pointer);
}

inline void *unused_calloc(std::size_t, std::size_t) { std::abort(); }
inline void *unused_realloc(void *, std::size_t) { std::abort(); }

// The variables that an allocator library has.
inline void *q_malloc = reinterpret_cast<void *>(&recording_malloc);
inline void *q_calloc = reinterpret_cast<void *>(&unused_calloc);
inline void *q_realloc = reinterpret_cast<void *>(&unused_realloc);
inline void *q_free = reinterpret_cast<void *>(&recording_free);

// Puts the recording allocator behind the memory service of this process.
inline void use_recording_allocator() {
  fake.libraries["libqmalloc.so"] = {
      {"q_malloc_dll", &q_malloc}, {"q_calloc_dll", &q_calloc}, {"q_realloc_dll", &q_realloc}, {"q_free_dll", &q_free}};
  qtb_serv_select_allocator();
}

}  // namespace qtb::test
