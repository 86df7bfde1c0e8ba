// The whole parallel GEMM on every machine class: front ends, drivers, selectors, strategies and kernels of a made-up
// machine, for teams of 2, 3, 4 and 8, at sizes that reach each outcome, with all option letters and all kinds of alpha
// and beta. Small problems are judged by the oracle; large ones, in whole numbers, have to be exact.

#include <gtest/gtest.h>
#include <omp.h>

#include <cmath>
#include <string>

#include "tests/support/together.h"
#include "tests/thread/level3/gemm_machines.h"
#include "tests/thread/level3/gemm_problem.h"

namespace qtb::test {
namespace {

constexpr int teams[] = {2, 3, 4, 8};

template <class T>
void check(const GemmShape &s, T alpha, T beta, int team) {
  SCOPED_TRACE(std::string(GemmFrontEnd<T>::name) + " on " + std::to_string(team) + " threads: " + text_of(s));
  GemmProblem<T> p(s, alpha, beta);
  omp_set_num_threads(team);
  recorded_memory.forget();
  call(p);
  if (s.whole_numbers)
    p.expect_exact();
  else
    p.expect_within_bound();
}

GemmShape shape_of(QtbInt m, QtbInt n, QtbInt k, std::uint64_t seed) {
  GemmShape s;
  s.transa = letters[seed % 6];
  s.transb = letters[seed / 6 % 6];
  s.m = m, s.n = n, s.k = k;
  s.flush = seed % 2 == 0 ? Flush::back : Flush::front;
  s.seed = seed;
  return s;
}

// ---- All factors and letters, small sizes ----

template <class T>
void small_sizes() {
  const T alphas[] = {number<T>(0), number<T>(1), number<T>(-0.75, 0.5)};
  const T betas[] = {number<T>(0), number<T>(1), number<T>(1.5, -0.25), number<T>(NAN, 1)};
  // At the limits of the serial path and above them, then wide, tall and deep.
  const QtbInt sizes[][3] = {{5, 40, 40},  {6, 40, 40}, {16, 16, 16}, {17, 16, 16}, {16, 17, 16},
                             {16, 16, 17}, {40, 40, 4}, {40, 40, 5},  {33, 31, 35}, {7, 150, 20},
                             {150, 7, 20}, {30, 1, 60}, {12, 3, 270}, {48, 64, 40}, {20, 20, 0}};
  std::uint64_t seed = 1;
  for (const int team : teams)
    for (const auto &size : sizes)
      for (const T &alpha : alphas)
        for (const T &beta : betas) {
          check(shape_of(size[0], size[1], size[2], seed++), alpha, beta, team);
          if (testing::Test::HasFailure()) return;
        }
}

TEST(GemmClasses, SmallSizesInSinglePrecision) { small_sizes<float>(); }
TEST(GemmClasses, SmallSizesInDoublePrecision) { small_sizes<double>(); }
TEST(GemmClasses, SmallSizesInSingleComplex) { small_sizes<cfloat>(); }
TEST(GemmClasses, SmallSizesInDoubleComplex) { small_sizes<cdouble>(); }

// ---- Sizes of each outcome but the largest ----

template <class T>
void middle_sizes() {
  const T alpha = number<T>(0.5, 1);
  const T betas[] = {number<T>(0), number<T>(1), number<T>(-2, 0.5)};
  const QtbInt sizes[][3] = {{130, 257, 65}, {257, 60, 40},  {60, 257, 40},   {520, 30, 33},  {30, 520, 33},
                             {210, 140, 80}, {256, 130, 90}, {100, 200, 100}, {200, 100, 90}, {1030, 9, 17}};
  std::uint64_t seed = 5000;
  for (const int team : teams) {
    for (const auto &size : sizes) {
      check(shape_of(size[0], size[1], size[2], seed), alpha, betas[seed % 3], team);
      ++seed;
      if (testing::Test::HasFailure()) return;
    }
    EXPECT_GE(threads_of_this_process(), team) << "no team of the size that was asked for was at work";
  }
}

TEST(GemmClasses, MiddleSizesInSinglePrecision) { middle_sizes<float>(); }
TEST(GemmClasses, MiddleSizesInDoublePrecision) { middle_sizes<double>(); }
TEST(GemmClasses, MiddleSizesInSingleComplex) { middle_sizes<cfloat>(); }
TEST(GemmClasses, MiddleSizesInDoubleComplex) { middle_sizes<cdouble>(); }

// ---- The largest, in whole numbers ----

std::uint64_t large_seed = 8000;

template <class T>
void large(QtbInt m, QtbInt n, QtbInt k, int team) {
  GemmShape s = shape_of(m, n, k, large_seed++);
  s.whole_numbers = true;
  const T betas[] = {number<T>(0), number<T>(1), number<T>(3, -1)};
  check(s, number<T>(2, 1), betas[large_seed % 3], team);
}

TEST(GemmClasses, LargeProblemsAreExact) {
  switch (machine.machine_class) {
    case machine_ssse3:
      for (const int team : {2, 3, 8}) {
        large<double>(1003, 601, 151, team);
        large<float>(1003, 601, 151, team);
        large<cfloat>(403, 401, 151, team);
        large<cdouble>(403, 401, 151, team);
      }
      large<double>(8001, 3001, 5, 2);  // a shared B
      large<double>(8003, 3002, 7, 3);
      break;
    case machine_sse41_large_l2:
    case machine_sse41_small_l2:
      // Threads with panels of their own, by the limits of each type.
      for (const int team : teams) {
        large<double>(1003, 1001, 151, team);
        large<cfloat>(803, 801, 151, team);
        large<cdouble>(403, 401, 201, team);
        large<cfloat>(16 * team * 2 + 1, 16 * team, 40, team);
      }
      large<float>(2051, 2049, 513, 3);
      large<double>(2101, 1200, 130, 2);
      // On 24 threads blocks as well.
      large<double>(601, 500, 260, 24);
      large<double>(601, 500, 160, 25);
      large<float>(801, 701, 513, 24);
      break;
    case machine_sse42:
      // A shared A, by rows and by depth.
      for (const int team : {8, 9, 12}) {
        large<double>(1003, 301, 203, team);
        large<double>(512, 203, 203, team);
        large<double>(256, 201, 401, team);
        large<double>(1001, 203, 1001, team);
        large<cdouble>(401, 403, 405, team);
        large<cfloat>(401, 403, 405, team);
        large<cfloat>(901, 403, 105, team);
        large<float>(1003, 301, 203, team);
      }
      for (const int team : {2, 3, 7}) large<double>(1003, 301, 203, team);
      break;
    default:
      for (const int team : teams) {
        large<double>(403, 1703, 131, team);
        large<double>(1003, 801, 131, team);
        large<float>(1003, 801, 131, team);
        large<cfloat>(403, 401, 131, team);
        large<cdouble>(403, 401, 131, team);
      }
      break;
  }
}

// ---- Without memory ----

// With each request for memory failing, alone and with all that follow it, the product is right, and nothing is kept.
template <class T>
void without_memory(QtbInt m, QtbInt n, QtbInt k, int team) {
  SCOPED_TRACE(std::string(GemmFrontEnd<T>::name) + " on " + std::to_string(team) + " threads");
  GemmShape s = shape_of(m, n, k, large_seed++);
  s.whole_numbers = true;
  omp_set_num_threads(team);
  GemmProblem<T> p(s, number<T>(2, 1), number<T>(3, -1));
  recorded_memory.forget();
  call(p);
  p.expect_exact();
  const long requests = static_cast<long>(recorded_memory.requests.size());
  EXPECT_GE(requests, team - team % 2) << "not every thread that takes part had work";
  // Of very many requests, the first of each thread and some of the others.
  constexpr long most = 60;
  for (long first = 0; first < requests; first += requests <= most || first < 2 * team ? 1 : requests / 7)
    for (const long count : {1L, 1000000L}) {
      p.restore();
      recorded_memory.forget();
      recorded_memory.fails = [=](long number, int, int) { return number >= first && number < first + count; };
      call(p);
      recorded_memory.fails = nullptr;
      p.expect_exact();
      ASSERT_TRUE(recorded_memory.held.empty());
      ASSERT_FALSE(testing::Test::HasFailure())
          << "request " << first << " of " << requests << " and " << count - 1 << " more";
    }
}

TEST(GemmClasses, EveryFailureOfMemoryLeavesARightProduct) {
  for (const int team : {2, 4, 5}) {
    without_memory<float>(190, 64, 20, team);
    without_memory<double>(390, 380, 40, team);
    without_memory<cfloat>(190, 64, 20, team);
    without_memory<cdouble>(190, 80, 20, team);
    without_memory<cfloat>(64, 60, 40, team);
    without_memory<cdouble>(64, 60, 40, team);
  }
  switch (machine.machine_class) {
    case machine_ssse3: without_memory<double>(8001, 3001, 5, 2); break;
    case machine_sse41_large_l2:
    case machine_sse41_small_l2: without_memory<double>(1003, 1001, 151, 2); break;
    case machine_sse42: without_memory<double>(203, 140, 201, 8); break;
    default: break;
  }
}

}  // namespace
}  // namespace qtb::test
