// Sixteen application threads call the library for the first time at once, the same routine or different ones; and a
// process that has used threads forks. Each case runs in a process of its own that has never called the library, under
// an alarm: what hangs is killed and fails.

#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <atomic>
#include <csignal>
#include <functional>
#include <thread>
#include <vector>

#include "blas/shapes.h"
#include "tests/product/program.h"

extern "C" {
#define QTB_ROUTINE(name, NAME, shape, T, route) QTB_FUNCTION(shape, T, name);
#include "blas/routines.def"
#undef QTB_ROUTINE
}

namespace {

constexpr QtbInt one = 1;

template <class T>
T number(int value) {
  if constexpr (is_complex<T>)
    return {static_cast<Real<T>>(value), 0};
  else
    return static_cast<T>(value);
}
template <class T>
bool all_are(const std::vector<T> &v, int value) {
  for (const T &x : v) {
    if constexpr (is_complex<T>) {
      if (x.re != static_cast<Real<T>>(value) || x.im != 0) return false;
    } else if (x != static_cast<T>(value)) {
      return false;
    }
  }
  return true;
}
template <class T>
std::vector<T> ones(QtbInt count) {
  return std::vector<T>(static_cast<std::size_t>(count), number<T>(1));
}
template <class T>
std::vector<T> identity(QtbInt n) {
  std::vector<T> a(static_cast<std::size_t>(n * n), number<T>(0));
  for (QtbInt i = 0; i < n; ++i) a[static_cast<std::size_t>(i + i * n)] = number<T>(1);
  return a;
}

// ---- calls on ones and identities, whose results are whole numbers ----

using Call = std::function<bool(QtbInt n)>;

template <class T, class F>
Call gemm_call(F *gemm) {
  return [gemm](QtbInt n) {
    const auto a = ones<T>(n * n), b = ones<T>(n * n);
    auto c = ones<T>(n * n);
    const T alpha = number<T>(1), beta = number<T>(2);
    gemm("N", "T", &n, &n, &n, &alpha, a.data(), &n, b.data(), &n, &beta, c.data(), &n);
    return all_are(c, static_cast<int>(n) + 2);
  };
}
template <class T, class F>
Call gemv_call(F *gemv) {
  return [gemv](QtbInt n) {
    const auto a = ones<T>(n * n), x = ones<T>(n);
    auto y = ones<T>(n);
    const T alpha = number<T>(2), beta = number<T>(0);
    gemv("T", &n, &n, &alpha, a.data(), &n, x.data(), &one, &beta, y.data(), &one);
    return all_are(y, 2 * static_cast<int>(n));
  };
}
template <class T, class F>
Call symv_call(F *symv) {
  return [symv](QtbInt n) {
    const auto a = ones<T>(n * n), x = ones<T>(n);
    auto y = ones<T>(n);
    const T alpha = number<T>(1), beta = number<T>(1);
    symv("U", &n, &alpha, a.data(), &n, x.data(), &one, &beta, y.data(), &one);
    return all_are(y, static_cast<int>(n) + 1);
  };
}
// trmm and trsm by the identity, from the right.
template <class T, class F>
Call trmm_call(F *trmm) {
  return [trmm](QtbInt n) {
    const auto a = identity<T>(n);
    auto b = ones<T>(n * n);
    const T alpha = number<T>(3);
    trmm("R", "L", "T", "N", &n, &n, &alpha, a.data(), &n, b.data(), &n);
    return all_are(b, 3);
  };
}
// trmv and trsv by the identity.
template <class T, class F>
Call trmv_call(F *trmv) {
  return [trmv](QtbInt n) {
    const auto a = identity<T>(n);
    auto x = ones<T>(n);
    trmv("L", "N", "N", &n, a.data(), &n, x.data(), &one);
    return all_are(x, 1);
  };
}
template <class T, class F>
Call axpy_call(F *axpy) {
  return [axpy](QtbInt n) {
    const auto x = ones<T>(n);
    auto y = ones<T>(n);
    const T alpha = number<T>(4);
    axpy(&n, &alpha, x.data(), &one, y.data(), &one);
    return all_are(y, 5);
  };
}
template <class T, class F>
Call dot_call(F *dot) {
  return [dot](QtbInt n) {
    const auto x = ones<T>(n);
    return dot(&n, x.data(), &one, x.data(), &one) == static_cast<T>(n);
  };
}
template <class T, class F>
Call rank_k_call(F *herk) {
  return [herk](QtbInt n) {
    const auto a = ones<T>(n * n);
    auto c = ones<T>(n * n);
    const Real<T> alpha = 1, beta = 0;
    for (const char *uplo : {"U", "L"}) herk(uplo, "N", &n, &n, &alpha, a.data(), &n, &beta, c.data(), &n);
    return all_are(c, static_cast<int>(n));
  };
}

std::vector<Call> assorted_calls() {
  return {
      gemm_call<float>(&sgemm),  gemm_call<double>(&dgemm), gemm_call<cfloat>(&cgemm),   gemm_call<cdouble>(&zgemm),
      gemv_call<double>(&dgemv), gemv_call<cfloat>(&cgemv), symv_call<float>(&ssymv),    symv_call<cdouble>(&zhemv),
      trmm_call<double>(&dtrmm), trmm_call<cfloat>(&ctrsm), trmv_call<float>(&strsv),    trmv_call<cdouble>(&ztrmv),
      axpy_call<double>(&daxpy), dot_call<float>(&sdot),    rank_k_call<double>(&dsyrk), rank_k_call<cdouble>(&zherk)};
}

// ---- processes and threads ----

constexpr int thread_count = 16;
constexpr unsigned time_limit = 60;  // seconds

// Runs body in a new process; true if it ends in time and returns true.
bool in_own_process(const std::function<bool()> &body) {
  const pid_t child = fork();
  if (child == 0) {
    std::signal(SIGALRM, SIG_DFL);
    alarm(time_limit);
    _exit(body() ? 0 : 1);
  }
  int status = 0;
  waitpid(child, &status, 0);
  return WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

// All threads wait for each other and then make their calls, of calls[t] for thread t or of all in turn.
bool at_once(const std::vector<Call> &calls, QtbInt n) {
  std::atomic<int> waiting = thread_count, failed = 0;
  std::vector<std::thread> threads;
  for (int t = 0; t < thread_count; ++t)
    threads.emplace_back([&, t] {
      --waiting;
      while (waiting > 0) std::this_thread::yield();
      if (!calls[static_cast<std::size_t>(t) % calls.size()](n)) ++failed;
    });
  for (std::thread &thread : threads) thread.join();
  return failed == 0;
}

// Sizes below and above those from which routines use threads of their own.
constexpr QtbInt sizes[] = {3, 250};

TEST(the_first_call_may_be_made_by_sixteen_threads_at_once, of_the_same_routine) {
  for (const QtbInt n : sizes)
    for (const Call &call : assorted_calls())
      EXPECT_TRUE(in_own_process([&] { return at_once({call}, n); })) << "n " << n;
}

TEST(the_first_call_may_be_made_by_sixteen_threads_at_once, of_different_routines) {
  for (const QtbInt n : sizes)
    for (int round = 0; round < 5; ++round)
      EXPECT_TRUE(in_own_process([&] { return at_once(assorted_calls(), n); })) << "n " << n;
}

bool every_call_works(QtbInt n) {
  for (const Call &call : assorted_calls())
    if (!call(n)) return false;
  return true;
}

TEST(after_a_threaded_call, a_forked_child_can_call_everything) {
  EXPECT_TRUE(in_own_process([] {
    return every_call_works(400) && in_own_process([] { return every_call_works(400); }) && every_call_works(40);
  }));
}

TEST(after_a_threaded_call, children_of_forked_children_can_call_everything) {
  EXPECT_TRUE(in_own_process([] {
    return every_call_works(250) &&
           in_own_process([] { return every_call_works(250) && in_own_process([] { return every_call_works(250); }); });
  }));
}

}  // namespace

int main(int argc, char **argv) {
  testing::InitGoogleTest(&argc, argv);
  if (!qtb::test::processor_runs_forced_tier()) return qtb::test::exit_skipped;
  return RUN_ALL_TESTS();
}
