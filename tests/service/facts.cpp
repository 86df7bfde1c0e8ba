// Prints what the services find on this system, for tests that start it under different circumstances.
//
// facts threads      cores and threads that a call may use
// facts allocator    whether libqmalloc.so serves, and how often it was asked

#include <dlfcn.h>

#include <cstdio>
#include <cstring>

#include "service/memory.h"
#include "service/threads.h"

namespace {

void print_threads() {
  std::int32_t logical = -1, physical = -1;
  qtb_serv_count_cores(&logical, &physical);
  std::printf("logical %d physical %d threads %d\n", logical, physical, qtb_serv_get_max_threads(domain_blas));
}

void print_allocator() {
  qtb_serv_select_allocator();
  void *buffer = qtb_serv_malloc(1000, 128);
  qtb_serv_free(buffer);
  void *direct = qtb_serv_malloc(50'000'000, 128);
  qtb_serv_free(direct);
  if (buffer == nullptr || direct == nullptr) std::printf("no memory\n");
  void *library = dlopen("libqmalloc.so", RTLD_NOW | RTLD_NOLOAD);
  if (library == nullptr)
    std::printf("libqmalloc.so is absent\n");
  else
    std::printf("libqmalloc.so gave %d, took back %d\n", *static_cast<int *>(dlsym(library, "given")),
                *static_cast<int *>(dlsym(library, "taken_back")));
}

}  // namespace

int main(int count, char **arguments) {
  if (count == 2 && std::strcmp(arguments[1], "threads") == 0)
    print_threads();
  else if (count == 2 && std::strcmp(arguments[1], "allocator") == 0)
    print_allocator();
  else
    return 2;
  return 0;
}
