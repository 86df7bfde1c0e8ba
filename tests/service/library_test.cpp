// The shared library itself: loaded late and let go, forked from, and used in the child.

#include <dlfcn.h>
#include <gtest/gtest.h>

#include <atomic>
#include <cstdlib>
#include <thread>
#include <vector>

#include "blas/shapes.h"
#include "tests/support/child.h"

namespace qtb::test {
namespace {

// Routines of the library, looked up by name.
template <class Function>
Function *routine(void *library, const char *name) {
  return reinterpret_cast<Function *>(dlsym(library, name));
}

void *load() { return dlopen(QTB_TEST_LIBRARY, RTLD_NOW | RTLD_LOCAL); }

constexpr QtbInt length = 200'000;  // long enough for threads
constexpr QtbInt one = 1;

bool dot_is_right(void *library) {
  const auto ddot = routine<QTB_FUNCTION_TYPE(dot, double)>(library, "ddot");
  const std::vector<double> x(length, 1.0), y(length, 2.0);
  return ddot(&length, x.data(), &one, y.data(), &one) == 2.0 * length;
}

bool product_is_right(void *library) {
  const auto dgemm = routine<QTB_FUNCTION_TYPE(gemm, double)>(library, "dgemm");
  constexpr QtbInt n = 300;
  const double alpha = 1, beta = 0;
  const std::vector<double> a(n * n, 1.0), b(n * n, 2.0);
  std::vector<double> c(n * n);
  dgemm("N", "N", &n, &n, &n, &alpha, a.data(), &n, b.data(), &n, &beta, c.data(), &n);
  for (const double element : c)
    if (element != 2.0 * n) return false;
  return true;
}

// A tier with parallel vector routines, and a team also where the machine has one processor.
void ask_for_threads() {
  setenv("QTB_DEBUG_CPU_TYPE", "3", 1);
  setenv("QTB_DYNAMIC", "FALSE", 1);
  setenv("QTB_NUM_THREADS", "4", 1);
}

// The library stays: the OpenMP runtime's idle threads would otherwise go on in code that is gone.
TEST(Library, MayBeLoadedAndLetGoAgainAndAgain) {
  in_child([] {
    if (!__builtin_cpu_supports("sse4.2")) return;
    ask_for_threads();
    for (int round = 0; round < 20; ++round) {
      void *library = load();
      ASSERT_NE(library, nullptr) << dlerror();
      EXPECT_TRUE(dot_is_right(library));
      dlclose(library);
      EXPECT_NE(dlopen(QTB_TEST_LIBRARY, RTLD_NOW | RTLD_NOLOAD), nullptr);
      in_child([] {});
    }
  });
}

TEST(Library, ServesAChildOfAProcessThatRanOnThreads) {
  in_child([] {
    if (!__builtin_cpu_supports("sse4.2")) return;
    ask_for_threads();
    void *library = load();
    ASSERT_NE(library, nullptr) << dlerror();
    EXPECT_TRUE(dot_is_right(library));
    EXPECT_TRUE(product_is_right(library));
    in_child([&] {
      EXPECT_TRUE(dot_is_right(library));
      EXPECT_TRUE(product_is_right(library));
      in_child([&] { EXPECT_TRUE(product_is_right(library)); });
    });
    EXPECT_TRUE(product_is_right(library));
  });
}

TEST(Library, ServesChildrenForkedWhileThreadsCallIt) {
  in_child(
      [] {
        void *library = load();
        ASSERT_NE(library, nullptr) << dlerror();
        std::atomic<bool> done{false};
        std::vector<std::thread> callers;
        for (int i = 0; i < 3; ++i)
          callers.emplace_back([&] {
            while (!done) EXPECT_TRUE(product_is_right(library));
          });
        for (int i = 0; i < 50; ++i) in_child([&] { EXPECT_TRUE(product_is_right(library)); });
        done = true;
        for (std::thread &caller : callers) caller.join();
      },
      120);
}

}  // namespace
}  // namespace qtb::test
