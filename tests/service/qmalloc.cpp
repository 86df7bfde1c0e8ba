// An allocator library as the memory service looks for one. It says so when it is loaded.
//
// Built three times: complete, without one of the names (QMALLOC_THREE_HOOKS), and with a null hook
// (QMALLOC_NULL_HOOK).

#include <cstdio>
#include <cstdlib>

extern "C" {

__attribute__((visibility("default"))) int given, taken_back;

static void *counting_malloc(std::size_t size) {
  ++given;
  return std::malloc(size);
}
static void counting_free(void *pointer) {
  ++taken_back;
  std::free(pointer);
}

__attribute__((visibility("default"))) void *(*q_malloc_dll)(std::size_t) = &counting_malloc;
__attribute__((visibility("default"))) void *(*q_calloc_dll)(std::size_t, std::size_t) = &std::calloc;
#if defined(QMALLOC_NULL_HOOK)
__attribute__((visibility("default"))) void *(*q_realloc_dll)(void *, std::size_t) = nullptr;
#elif !defined(QMALLOC_THREE_HOOKS)
__attribute__((visibility("default"))) void *(*q_realloc_dll)(void *, std::size_t) = &std::realloc;
#endif
__attribute__((visibility("default"))) void (*q_free_dll)(void *) = &counting_free;

}  // extern "C"

__attribute__((constructor)) static void say_loaded() {
  std::puts("qmalloc is loaded");
  std::fflush(stdout);
}
