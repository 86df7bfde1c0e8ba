// The memory service: a short list of reusable buffers per thread, over an allocator that is chosen at load.
//
// A buffer that is released stays in the list of the thread that got it, and goes back to the allocator only to make
// room for a larger one. A thread's list is written by that thread alone, but for the in_use word: any thread may
// release a buffer. The thread finds its own buffers without a lock; another thread finds them through the table of all
// lists, under the service lock. Nothing is freed when a thread or the process ends.

#include "service/memory.h"

#include <atomic>
#include <cstdlib>
#include <new>

#include "service/memory_held.h"
#include "service/platform/platform.h"

namespace {

constexpr std::int64_t list_size = 5;                     // buffers that a thread keeps
constexpr std::uint64_t largest_kept = 40 * 1024 * 1024;  // bytes; more is too much to hold back from the process
constexpr std::int32_t list_limit = 8192;                 // threads with a list, by the test before the last one
constexpr std::int32_t smallest_alignment = 4;            // what asks for less gets the allocator's own
constexpr std::int32_t default_alignment = 32;            // for an alignment that is no power of two

constexpr auto relaxed = std::memory_order_relaxed;
constexpr auto acquire = std::memory_order_acquire;
constexpr auto release = std::memory_order_release;

struct MemThreadList {
  std::atomic<void *> raw[list_size];      // what malloc_hook returned
  std::atomic<void *> aligned[list_size];  // the address last handed out
  std::uint64_t requested[list_size];      // bytes last asked for
  std::uint64_t allocated[list_size];      // bytes asked of malloc_hook
  std::atomic<std::int64_t> in_use[list_size];
  std::atomic<std::int64_t> count;  // entries that exist; it never falls
  std::uint64_t total_bytes;        // the sum of allocated, for whoever looks at a process
};

void *(*malloc_hook)(std::size_t) = &std::malloc;
void *(*calloc_hook)(std::size_t, std::size_t) = &std::calloc;
void *(*realloc_hook)(void *, std::size_t) = &std::realloc;
void (*free_hook)(void *) = &std::free;

std::atomic<std::int32_t> service_lock{0};
std::atomic<std::int32_t> mm_tls_index{-1};
std::atomic<std::int32_t> mm_config_state{-1};  // -1 until the switches were read, then 1
std::atomic<std::int32_t> mm_disabled{-1};
std::atomic<std::int32_t> mm_list_count{0};
MemThreadList *mm_lists[list_limit + 2];  // from index 1; under the lock

[[gnu::noinline, gnu::cold]] void read_switches() {
  qtb_serv_lock();
  if (mm_config_state.load(relaxed) == -1) {
    char value[16];
    const bool set = platform_environment("QTB_DISABLE_FAST_MM", value, sizeof value) != 0 ||
                     platform_environment("QTB_MM_DISABLE", value, sizeof value) != 0;
    mm_disabled.store(set, relaxed);
    mm_config_state.store(1, release);
  }
  qtb_serv_unlock();
}

bool fast_path_disabled() {
  if (mm_config_state.load(acquire) == -1) read_switches();
  return mm_disabled.load(relaxed) == 1;
}

void create_thread_word() {
  qtb_serv_lock();
  if (mm_tls_index.load(relaxed) == -1) mm_tls_index.store(platform_tls_create(), release);
  qtb_serv_unlock();
}

MemThreadList *own_list() { return static_cast<MemThreadList *>(platform_tls_get(mm_tls_index.load(acquire))); }

// A new list for this thread, in its word and in the table. Null where the table is full or memory is out. The
// allocator is called outside the lock: it may take locks of its own, also ahead of a fork, which takes the service
// lock as well.
MemThreadList *create_list() {
  if (mm_list_count.load(relaxed) > list_limit) return nullptr;
  void *memory = malloc_hook(sizeof(MemThreadList));
  if (memory == nullptr) return nullptr;
  MemThreadList *list = new (memory) MemThreadList{};
  qtb_serv_lock();
  const std::int32_t index = mm_list_count.load(relaxed) + 1;
  const bool room = index <= list_limit + 1;  // others may have taken the last places meanwhile
  if (room) {
    platform_tls_set(mm_tls_index.load(relaxed), list);
    mm_lists[index] = list;
    mm_list_count.store(index, relaxed);
  }
  qtb_serv_unlock();
  if (room) return list;
  free_hook(memory);
  return nullptr;
}

// Memory for an entry. A failure is recorded like a success: the entry then holds null, for good.
void fill_entry(MemThreadList *list, std::int64_t i, std::uint64_t size, std::uint64_t need) {
  list->raw[i].store(malloc_hook(need), relaxed);
  list->in_use[i].store(1, relaxed);
  list->requested[i] = size;
  list->allocated[i] = need;
  list->total_bytes += need;
}

// Gives an entry's memory back. The addresses go first: as soon as the allocator has the memory, it may be another
// thread's, whose release must not find it here.
void empty_entry(MemThreadList *list, std::int64_t i) {
  void *raw = list->raw[i].exchange(nullptr, relaxed);
  list->aligned[i].store(nullptr, relaxed);
  if (raw != nullptr) free_hook(raw);
  list->total_bytes -= list->allocated[i];
}

// The entry that serves a request, marked as used, or -1 if all five are in use. An exact match comes first, then a new
// entry while there is room, then the first free entry that is larger, then the first that is smaller, replaced.
std::int64_t take_entry(MemThreadList *list, std::uint64_t size, std::uint64_t need) {
  const std::int64_t count = list->count.load(relaxed);
  std::int64_t larger = -1, smaller = -1;
  for (std::int64_t i = 0; i < count; ++i) {
    if (list->in_use[i].load(acquire) != 0) continue;
    if (list->allocated[i] == need) {
      list->in_use[i].store(1, relaxed);
      return i;
    }
    if (list->allocated[i] > need) {
      if (larger == -1) larger = i;
    } else if (smaller == -1) {
      smaller = i;
    }
  }
  if (count < list_size) {
    fill_entry(list, count, size, need);
    list->count.store(count + 1, release);
    return count;
  }
  if (larger != -1) {
    list->in_use[larger].store(1, relaxed);
    list->requested[larger] = size;
    return larger;
  }
  if (smaller != -1) {
    empty_entry(list, smaller);
    fill_entry(list, smaller, size, need);
  }
  return smaller;
}

// Marks the entry of a list that was handed out as pointer as free again. False if there is none.
bool release_entry(MemThreadList *list, const void *pointer) {
  const std::int64_t count = list->count.load(acquire);
  for (std::int64_t i = 0; i < count; ++i) {
    if (list->aligned[i].load(relaxed) != pointer || list->raw[i].load(relaxed) == nullptr) continue;
    list->in_use[i].store(0, release);
    return true;
  }
  return false;
}

}  // namespace

void *qtb_serv_malloc(std::uint64_t size, std::int32_t alignment) {
  if (mm_tls_index.load(acquire) == -1) create_thread_word();
  if (size == 0) return nullptr;
  if (fast_path_disabled() || size > largest_kept) return malloc_hook(size);

  std::uint64_t pad = 0;
  if (alignment >= smallest_alignment)
    pad = static_cast<std::uint64_t>((alignment & (alignment - 1)) == 0 ? alignment : default_alignment);
  const std::uint64_t mask = pad == 0 ? 0 : pad - 1, need = size + pad;

  MemThreadList *list = own_list();
  if (list == nullptr) list = create_list();
  if (list == nullptr) return malloc_hook(size);
  const std::int64_t entry = take_entry(list, size, need);
  if (entry == -1) return malloc_hook(size);

  char *raw = static_cast<char *>(list->raw[entry].load(relaxed));
  const std::uint64_t beyond = reinterpret_cast<std::uintptr_t>(raw) & mask;
  char *aligned = beyond == 0 ? raw : raw + (pad - beyond);
  list->aligned[entry].store(aligned, relaxed);
  return aligned;
}

void qtb_serv_free(void *pointer) {
  if (pointer == nullptr) return;
  if (fast_path_disabled()) return free_hook(pointer);
  MemThreadList *own = own_list();
  if (own != nullptr && release_entry(own, pointer)) return;

  qtb_serv_lock();
  bool found = false;
  const std::int32_t lists = mm_list_count.load(relaxed);
  for (std::int32_t i = 1; i <= lists && !found; ++i) found = release_entry(mm_lists[i], pointer);
  qtb_serv_unlock();
  if (!found) free_hook(pointer);
}

void qtb_serv_get_memory_held(MemoryHeld *held) {
  *held = {0, 0, 0, !fast_path_disabled()};
  qtb_serv_lock();
  held->threads = mm_list_count.load(relaxed);
  for (std::int64_t i = 1; i <= held->threads; ++i) {
    held->buffers += mm_lists[i]->count.load(relaxed);
    held->bytes += mm_lists[i]->total_bytes;
  }
  qtb_serv_unlock();
}

// Each name is a variable of that library which holds a function. A library that supplies the hooks has to stay.
void qtb_serv_select_allocator() {
  void *library = platform_load_library("libqmalloc.so");
  if (library == nullptr) return;
  void *const *const variables[] = {
      static_cast<void *const *>(platform_library_symbol(library, "q_malloc_dll")),
      static_cast<void *const *>(platform_library_symbol(library, "q_calloc_dll")),
      static_cast<void *const *>(platform_library_symbol(library, "q_realloc_dll")),
      static_cast<void *const *>(platform_library_symbol(library, "q_free_dll")),
  };
  for (void *const *variable : variables) {
    if (variable == nullptr || *variable == nullptr) {
      platform_unload_library(library);
      return;
    }
  }
  malloc_hook = reinterpret_cast<decltype(malloc_hook)>(*variables[0]);
  calloc_hook = reinterpret_cast<decltype(calloc_hook)>(*variables[1]);
  realloc_hook = reinterpret_cast<decltype(realloc_hook)>(*variables[2]);
  free_hook = reinterpret_cast<decltype(free_hook)>(*variables[3]);
}

void qtb_serv_prepare_fork() { platform_at_fork(&qtb_serv_lock, &qtb_serv_unlock); }

void qtb_serv_lock() {
  for (std::int32_t open = 0; !service_lock.compare_exchange_weak(open, 1, acquire, relaxed);) open = 0;
}

void qtb_serv_unlock() { service_lock.store(0, release); }
