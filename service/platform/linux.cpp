// The operating system behind platform.h: Linux with the GNU C library.

#include <cpuid.h>
#include <dirent.h>
#include <dlfcn.h>
#include <omp.h>
#include <pthread.h>
#include <sched.h>
#include <sys/stat.h>
#include <unistd.h>

#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "service/platform/platform.h"

// ---- The processor ----

CpuidRegisters platform_cpuid(std::uint32_t leaf, std::uint32_t subleaf) {
  CpuidRegisters r;
  __cpuid_count(leaf, subleaf, r.eax, r.ebx, r.ecx, r.edx);
  return r;
}

std::uint64_t platform_saved_state() {
  std::uint32_t low, high;
  __asm__ volatile("xgetbv" : "=a"(low), "=d"(high) : "c"(0));
  return static_cast<std::uint64_t>(high) << 32 | low;
}

// ---- The environment ----

std::size_t platform_environment(const char *name, char *buffer, std::size_t size) {
  const char *value = std::getenv(name);
  if (value == nullptr || *value == '\0') return 0;
  const std::size_t length = std::strlen(value);
  if (size == 0) return length;
  const std::size_t copied = length < size ? length : size - 1;
  std::memcpy(buffer, value, copied);
  buffer[copied] = '\0';
  return length;
}

// ---- Thread-local words ----

// The library's own thread-local storage, at a fixed distance from the thread's pointer: a small product looks twice,
// and a call of the system for each would be felt. It takes a few bytes of the room that the C library keeps for this.
namespace {

constexpr std::int32_t most_words = 4;  // the library creates one
std::atomic<std::int32_t> words_created{0};
[[gnu::tls_model("initial-exec")]] thread_local void *words[most_words];

}  // namespace

std::int32_t platform_tls_create() {
  const std::int32_t index = words_created.fetch_add(1, std::memory_order_relaxed);
  if (index < most_words) return index;
  words_created.store(most_words, std::memory_order_relaxed);
  return -1;
}

// An index of -1, of a word that could not be had, reads as null and takes no value.
void *platform_tls_get(std::int32_t index) { return index < 0 ? nullptr : words[index]; }

void platform_tls_set(std::int32_t index, void *value) {
  if (index >= 0) words[index] = value;
}

// ---- Processors and affinity ----

namespace {

// The kernel's masks and the C library's are arrays of 64-bit words like ours.
bool thread_affinity(pid_t thread, ProcessorSet *set) {
  return sched_getaffinity(thread, sizeof set->words, reinterpret_cast<cpu_set_t *>(set->words)) == 0;
}

void merge(ProcessorSet *into, const ProcessorSet &from) {
  for (int w = 0; w < ProcessorSet::max_words; ++w) into->words[w] |= from.words[w];
}

// Linux keeps no mask of a process, only of its threads, each of which inherits its creator's. The widest that any
// thread has left is the best witness of what the process was given.
bool merge_thread_affinities(ProcessorSet *process) {
  ProcessorSet one;
  if (!thread_affinity(getpid(), &one)) return false;
  merge(process, one);
  DIR *tasks = opendir("/proc/self/task");
  if (tasks == nullptr) return true;
  while (const dirent *task = readdir(tasks)) {
    const int thread = std::atoi(task->d_name);
    if (thread > 0 && thread_affinity(thread, &one)) merge(process, one);
  }
  closedir(tasks);
  return true;
}

// An OpenMP runtime that is told to bind threads binds the initial one when it is loaded, to the first of its places;
// all the places together are what it found.
void merge_places(ProcessorSet *process) {
  const int places = omp_get_num_places();
  for (int place = 0; place < places; ++place) {
    const int count = omp_get_place_num_procs(place);
    if (count <= 0) continue;
    int *processors = static_cast<int *>(std::malloc(static_cast<std::size_t>(count) * sizeof(int)));
    if (processors == nullptr) return;
    omp_get_place_proc_ids(place, processors);
    for (int i = 0; i < count; ++i)
      if (processors[i] >= 0 && processors[i] < ProcessorSet::capacity) process->insert(processors[i]);
    std::free(processors);
  }
}

// The kernel's list has the form 0-3,8,10-11.
bool read_online(ProcessorSet *online) {
  std::FILE *list = std::fopen("/sys/devices/system/cpu/online", "re");
  if (list == nullptr) return false;
  *online = {};
  bool any = false;
  int first;
  while (std::fscanf(list, "%d", &first) == 1) {
    int last = first;
    int separator = std::fgetc(list);
    if (separator == '-') {
      if (std::fscanf(list, "%d", &last) != 1) break;
      separator = std::fgetc(list);
    }
    for (int p = first; p <= last && p < ProcessorSet::capacity; ++p) {
      online->insert(p);
      any = true;
    }
    if (separator != ',') break;
  }
  std::fclose(list);
  return any;
}

}  // namespace

bool platform_processors(ProcessorSet *process, ProcessorSet *online) {
  ProcessorSet given = {}, running;
  if (!merge_thread_affinities(&given) || !read_online(&running)) return false;
  merge_places(&given);
  *process = given;
  *online = running;
  return true;
}

bool platform_bind_thread(const ProcessorSet *processors) {
  return sched_setaffinity(0, sizeof processors->words, reinterpret_cast<const cpu_set_t *>(processors->words)) == 0;
}

void platform_yield() { sched_yield(); }

// ---- Libraries ----

namespace {

// This library, or the program that it is linked into, as the loader knows it.
void *own_handle() {
  static const char inside = 0;
  Dl_info information;
  void *handle = nullptr;
  return dladdr1(&inside, &information, &handle, RTLD_DL_LINKMAP) != 0 ? handle : nullptr;
}

// Whether the folders of the loader's own list are absolute paths. The environment of the moment does not tell: the
// list has run paths too, it was made when the program started, and placeholders were replaced in it.
bool search_path_is_absolute() {
  void *const self = own_handle();
  Dl_serinfo extent;
  if (self == nullptr || dlinfo(self, RTLD_DI_SERINFOSIZE, &extent) != 0) return false;
  auto *const list = static_cast<Dl_serinfo *>(std::malloc(extent.dls_size));
  if (list == nullptr) return false;
  list->dls_size = extent.dls_size;
  list->dls_cnt = extent.dls_cnt;
  bool absolute = dlinfo(self, RTLD_DI_SERINFO, list) == 0;
  for (unsigned i = 0; absolute && i < list->dls_cnt; ++i) absolute = list->dls_serpath[i].dls_name[0] == '/';
  std::free(list);
  return absolute;
}

}  // namespace

void *platform_load_library(const char *name) {
  return search_path_is_absolute() ? dlopen(name, RTLD_NOW | RTLD_LOCAL) : nullptr;
}

void *platform_library_symbol(void *library, const char *name) { return dlsym(library, name); }

void platform_unload_library(void *library) { dlclose(library); }

// ---- Fork ----

namespace {

void (*call_before_fork)();
void (*call_after_fork)();

// Forking threads write these only while they hold the lock that before takes, all with the same values.
std::atomic<bool> forking_from_threads;
std::atomic<bool> forked_from_threads;

// The link count of the directory of a process's threads is 2 more than their number. Where nobody tells, there may be
// many.
bool process_has_threads() {
  struct stat tasks;
  constexpr nlink_t one_thread = 3;
  return stat("/proc/self/task", &tasks) != 0 || tasks.st_nlink != one_thread;
}

void before_fork() {
  call_before_fork();
  forking_from_threads.store(process_has_threads(), std::memory_order_relaxed);
}

void after_fork_in_parent() { call_after_fork(); }

void after_fork_in_child() {
  if (forking_from_threads.load(std::memory_order_relaxed)) forked_from_threads.store(true, std::memory_order_relaxed);
  call_after_fork();
}

}  // namespace

void platform_at_fork(void (*before)(), void (*after)()) {
  call_before_fork = before;
  call_after_fork = after;
  pthread_atfork(&before_fork, &after_fork_in_parent, &after_fork_in_child);
}

int platform_forked_from_threads() { return forked_from_threads.load(std::memory_order_relaxed); }
