// Prints what the services find on this system, for tests that start it under different circumstances.
//
// facts threads                  cores and threads that a call may use
// facts allocator                whether libqmalloc.so serves, and how often it was asked
// facts allocator-after-unset    the same, once LD_LIBRARY_PATH is gone from the environment
// facts folders                  where the loader searches for libraries, a line each
// facts product library          the same of a product, whose services are its own

#include <dlfcn.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "blas/shapes.h"
#include "service/memory.h"
#include "service/threads.h"

namespace {

void print_threads() {
  std::int32_t logical = -1, physical = -1;
  qtb_serv_count_cores(&logical, &physical);
  std::printf("logical %d physical %d threads %d\n", logical, physical, qtb_serv_get_max_threads(domain_blas));
}

void print_use_of_allocator() {
  void *library = dlopen("libqmalloc.so", RTLD_NOW | RTLD_NOLOAD);
  if (library == nullptr)
    std::printf("libqmalloc.so is absent\n");
  else
    std::printf("libqmalloc.so gave %d, took back %d\n", *static_cast<int *>(dlsym(library, "given")),
                *static_cast<int *>(dlsym(library, "taken_back")));
}

void print_allocator() {
  qtb_serv_select_allocator();
  void *buffer = qtb_serv_malloc(1000, 128);
  qtb_serv_free(buffer);
  void *direct = qtb_serv_malloc(50'000'000, 128);
  qtb_serv_free(direct);
  if (buffer == nullptr || direct == nullptr) std::printf("no memory\n");
  print_use_of_allocator();
}

void print_folders() {
  void *const self = dlopen(nullptr, RTLD_NOW);
  Dl_serinfo extent;
  if (dlinfo(self, RTLD_DI_SERINFOSIZE, &extent) != 0) return;
  auto *const list = static_cast<Dl_serinfo *>(std::malloc(extent.dls_size));
  if (list == nullptr || dlinfo(self, RTLD_DI_SERINFOSIZE, list) != 0 || dlinfo(self, RTLD_DI_SERINFO, list) != 0)
    return;
  for (unsigned i = 0; i < list->dls_cnt; ++i) std::printf("%s\n", list->dls_serpath[i].dls_name);
}

// A product of matrices that packs them into work buffers.
void print_product(const char *path) {
  void *library = dlopen(path, RTLD_NOW | RTLD_LOCAL);
  using Gemm = QTB_FUNCTION_TYPE(gemm, double);
  Gemm *const dgemm = library == nullptr ? nullptr : reinterpret_cast<Gemm *>(dlsym(library, "dgemm"));
  if (dgemm == nullptr) {
    std::printf("no product: %s\n", dlerror());
    return;
  }
  constexpr QtbInt n = 200;
  const double alpha = 1, beta = 0;
  const std::vector<double> a(n * n, 1.0), b(n * n, 2.0);
  std::vector<double> c(n * n);
  dgemm("N", "N", &n, &n, &n, &alpha, a.data(), &n, b.data(), &n, &beta, c.data(), &n);
  std::printf("the product is %s\n", c == std::vector<double>(n * n, 2.0 * n) ? "right" : "wrong");
  print_use_of_allocator();
}

}  // namespace

int main(int count, char **arguments) {
  const auto asks_for = [&](const char *what, int argument_count) {
    return count == argument_count && std::strcmp(arguments[1], what) == 0;
  };
  if (asks_for("threads", 2)) {
    print_threads();
  } else if (asks_for("allocator", 2)) {
    print_allocator();
  } else if (asks_for("allocator-after-unset", 2)) {
    unsetenv("LD_LIBRARY_PATH");
    print_allocator();
  } else if (asks_for("folders", 2)) {
    print_folders();
  } else if (asks_for("product", 3)) {
    print_product(arguments[2]);
  } else {
    return 2;
  }
  return 0;
}
