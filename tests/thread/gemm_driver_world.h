// The surroundings of a parallel GEMM's front ends in a test: dispatch slots, selectors, strategies and services that
// note what reaches them and answer as `world` says; and problems whose matrices are addresses that nothing may touch.
//
// For one source of one program: it defines the library's own names. Only the front ends, the scaling pass and the
// OpenMP runtime are real.
#pragma once

#include <gtest/gtest.h>
#include <omp.h>
#include <xmmintrin.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstddef>
#include <cstring>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "blas/dispatch/slots.h"
#include "blas/thread/32e/level3/gemm_select.h"
#include "blas/thread/32e/level3/gemm_strategies.h"
#include "blas/thread/drivers.h"
#include "blas/thread/floating_state.h"
#include "service/cache.h"
#include "service/cpu.h"
#include "service/memory.h"
#include "service/threads.h"

namespace {

using qtb::GemmPanelSet;
using qtb::GemmPlan;

// ---- What the stand-ins answer and note ----

using Pointers = std::vector<const void *>;

// A call of a serial GEMM, of a scaling slot, of a selector or of a strategy.
struct Call {
  std::string routine;
  int thread, team;
  unsigned floating_choice;
  Pointers args;
  QtbInt m, n, k;
  std::string beta;          // its bytes, of a GEMM and of a strategy
  std::string plan, panels;  // their bytes, as a selector finds them and as a strategy gets them
};

struct Allocation {
  std::uint64_t size;
  std::int32_t alignment;
  std::size_t strategies_before;
  bool operator==(const Allocation &) const = default;
};

struct World {
  // What services answer.
  ProcessorTier tier = tier_sse42;
  int sse41 = 1, family16 = 0;
  std::uint32_t cache[cache_size_entries] = {3, 32768, 262144, 8388608, 7};
  std::int32_t max_threads = 4;
  std::vector<void *> memory;  // what the allocations return, the first one first
  // What the selectors put into a plan.
  std::int32_t a_buffers = 0, b_buffers = 0;
  // Whether the selector keeps all threads but the first until a strategy has begun.
  bool others_wait = false;

  std::string asked;  // a letter per question to a service
  std::vector<Call> calls;
  std::vector<Allocation> allocations;
  std::vector<void *> released;
  std::atomic<std::size_t> strategies = 0;  // begun
  std::size_t strategies_released = 0;      // begun by the first release
};
World world;
std::mutex world_mutex;  // of what is noted

template <class V>
std::string bytes_of(const V &v) {
  return {reinterpret_cast<const char *>(&v), sizeof v};
}
// Without the padding behind the last member, which a copy need not keep; there is none between members.
template <class T>
std::string bytes_of(const GemmPlan<T> &plan) {
  return {reinterpret_cast<const char *>(&plan), offsetof(GemmPlan<T>, cache) + sizeof plan.cache};
}
template <class V>
V from_bytes(const std::string &bytes) {
  V v{};
  EXPECT_LE(bytes.size(), sizeof v);
  std::memcpy(static_cast<void *>(&v), bytes.data(), std::min(bytes.size(), sizeof v));
  return v;
}

void ask(char question) {
  const std::lock_guard lock(world_mutex);
  world.asked += question;
}

void note(Call call) {
  call.thread = omp_get_thread_num();
  call.team = omp_get_num_threads();
  call.floating_choice = qtb::floating_choice();
  const std::lock_guard lock(world_mutex);
  world.calls.push_back(std::move(call));
}

// A slot by its arguments: those of a GEMM, those of scaling, and all others, which no driver calls.
template <class T>
void slot(const char *name, const char *transa, const char *transb, const QtbInt *m, const QtbInt *n, const QtbInt *k,
          const T *alpha, const T *a, const QtbInt *lda, const T *b, const QtbInt *ldb, const T *beta, T *c,
          const QtbInt *ldc) {
  note({name, 0, 0, 0, {QTB_ARGS(gemm)}, *m, *n, *k, bytes_of(*beta), "", ""});
}
template <class T>
void slot(const char *name, const QtbInt *m, const QtbInt *n, const T *beta, T *c, const QtbInt *ldc) {
  note({name, 0, 0, 0, {QTB_ARGS(scale_c)}, *m, *n, 0, bytes_of(*beta), "", ""});
}
template <class... A>
void slot(const char *name, A...) {
  ADD_FAILURE() << name << " is called";
}

// Packing routines that are told apart by their addresses.
template <class T>
qtb::PanelCopyRoutine<T> *packing(std::uintptr_t number) {
  return reinterpret_cast<qtb::PanelCopyRoutine<T> *>(16 * number);
}
constexpr QtbInt chosen_mb = 24, chosen_nb = 40, chosen_kb = 16;

template <class T>
void select(const char *name, const QtbInt *m, const QtbInt *n, const QtbInt *k, GemmPanelSet<T> *panel_set,
            GemmPlan<T> *plan, qtb::GemmStrategy<T> *strategy) {
  note({name, 0, 0, 0, {m, n, k}, *m, *n, *k, "", bytes_of(*plan), bytes_of(*panel_set)});
  if (world.others_wait && omp_get_thread_num() != 0) {
    const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(10);
    while (world.strategies == 0 && std::chrono::steady_clock::now() < end) std::this_thread::yield();
    EXPECT_GT(world.strategies, 0U) << "the first thread waits for the others";
  }
  plan->strategy = strategy;
  plan->mb = chosen_mb;
  plan->nb = chosen_nb;
  plan->kb = chosen_kb;
  plan->a_buffers = world.a_buffers;
  plan->b_buffers = world.b_buffers;
  panel_set->acopy_n = packing<T>(1);
  panel_set->acopy_t = packing<T>(2);
  panel_set->acopy_c = packing<T>(3);
  panel_set->bcopy_n = packing<T>(4);
  panel_set->bcopy_t = packing<T>(5);
  panel_set->bcopy_c = packing<T>(6);
}

template <class T>
void strategy(const char *name, QTB_PARAMS_GEMM_STRATEGY(T)) {
  note({name, 0, 0, 0, {QTB_ARGS(gemm)}, *m, *n, *k, bytes_of(*beta), bytes_of(*plan), bytes_of(*panel_set)});
  ++world.strategies;
}

}  // namespace

extern "C" {
ProcessorTier qtb_serv_cpu_detect() { return ask('t'), world.tier; }
int qtb_serv_cpu_takes_sse41() { return ask('4'), world.sse41; }
int qtb_serv_cpu_is_amd_family16() { return ask('f'), world.family16; }
std::int32_t qtb_serv_get_max_threads(std::int32_t domain) {
  EXPECT_EQ(domain, domain_blas);
  return ask('n'), world.max_threads;
}
void qtb_serv_get_cache_sizes(std::uint32_t *out) {
  ask('c');
  std::copy(std::begin(world.cache), std::end(world.cache), out);
}
void *qtb_serv_malloc(std::uint64_t size, std::int32_t alignment) {
  // Time enough for the other threads to go on, if nothing made them wait.
  std::this_thread::sleep_for(std::chrono::milliseconds(1));
  const std::lock_guard lock(world_mutex);
  world.allocations.push_back({size, alignment, world.strategies});
  const std::size_t number = world.allocations.size() - 1;
  if (number < world.memory.size()) return world.memory[number];
  ADD_FAILURE() << "allocation " << number << " of " << size;
  return nullptr;
}
void qtb_serv_free(void *pointer) {
  const std::lock_guard lock(world_mutex);
  if (pointer == nullptr) return;
  if (world.released.empty()) world.strategies_released = world.strategies;
  world.released.push_back(pointer);
}

#define QTB_SLOT(name, shape, T, tiers)      \
  QTB_FUNCTION(shape, T, qtb_blas_x##name) { \
    using Result = QTB_RESULT_##shape(T);    \
    slot(#name, QTB_ARGS(shape));            \
    return Result();                         \
  }
#include "blas/dispatch/slots.def"
#undef QTB_SLOT

#define QTB_STRATEGY(name, T) \
  void qtb_blas_##name(QTB_PARAMS_GEMM_STRATEGY(T)) { strategy<T>(#name, QTB_ARGS_GEMM_STRATEGY); }
QTB_FOR_EACH_GEMM_STRATEGY(QTB_STRATEGY)
#undef QTB_STRATEGY

#define QTB_SELECT(t, T)                                                                                        \
  void qtb_blas_##t##gemm_select(const QtbInt *m, const QtbInt *n, const QtbInt *k, GemmPanelSet<T> *panel_set, \
                                 GemmPlan<T> *plan) {                                                           \
    select<T>(#t "gemm_select", m, n, k, panel_set, plan, &qtb_blas_##t##gemm_1d_col);                          \
  }
QTB_FOR_EACH_GEMM(QTB_SELECT)
#undef QTB_SELECT
}

namespace {

// ---- Calls of a front end ----

template <class T>
struct Front;
#define QTB_FRONT(t, T)                                \
  template <>                                          \
  struct Front<T> {                                    \
    static constexpr auto gemm = &qtb_blas_##t##gemm;  \
    static constexpr auto slot = &qtb_blas_x##t##gemm; \
    static inline const std::string name = #t "gemm";  \
  };
QTB_FOR_EACH_GEMM(QTB_FRONT)
#undef QTB_FRONT

// A value of T: the second part counts in complex types only.
template <class T>
T value(double re, double im = 0) {
  if constexpr (is_complex<T>)
    return {static_cast<Real<T>>(re), static_cast<Real<T>>(im)};
  else
    return static_cast<T>(re + im);
}

template <class T>
struct Problem {
  QtbInt m = 300, n = 300, k = 300;
  char transa = 'N', transb = 'N';
  T alpha = value<T>(2), beta = value<T>(3);
  QtbInt lda = 1000, ldb = 1001, ldc = 1002;
  const T *a = reinterpret_cast<const T *>(std::uintptr_t{1} << 20);
  const T *b = reinterpret_cast<const T *>(std::uintptr_t{2} << 20);
  T *c = reinterpret_cast<T *>(std::uintptr_t{3} << 20);

  // Calls the front end and clears what was noted ahead of it.
  void call() const {
    world.asked.clear();
    world.calls.clear();
    world.allocations.clear();
    world.released.clear();
    world.strategies = 0;
    world.strategies_released = 0;
    Front<T>::gemm(&transa, &transb, &m, &n, &k, &alpha, a, &lda, b, &ldb, &beta, c, &ldc);
  }
  Pointers args() const { return {&transa, &transb, &m, &n, &k, &alpha, a, &lda, b, &ldb, &beta, c, &ldc}; }
};
constexpr std::size_t arg_m = 2, arg_a = 6, arg_beta = 10, arg_c = 11;

// Calls from a thread of a region of two. The regions of the call have one thread then.
template <class T>
void call_in_a_region(const Problem<T> &problem) {
  const int levels = omp_get_max_active_levels();
  omp_set_max_active_levels(1);
#pragma omp parallel num_threads(2)
  {
    EXPECT_NE(omp_in_parallel(), 0);
#pragma omp single
    problem.call();
  }
  omp_set_max_active_levels(levels);
}

std::vector<Call> calls_of(const std::string &routine) {
  std::vector<Call> found;
  std::copy_if(world.calls.begin(), world.calls.end(), std::back_inserter(found),
               [&](const Call &call) { return call.routine == routine; });
  std::sort(found.begin(), found.end(), [](const Call &a, const Call &b) { return a.thread < b.thread; });
  return found;
}

constexpr int plain = 0, ssse3 = 1, large_l2 = 2, sse42 = 3, small_l2 = 4, avx = 5, def_family16 = 6;
constexpr int all_classes[] = {plain, ssse3, large_l2, sse42, small_l2, avx, def_family16};
constexpr int tuned_classes[] = {ssse3, large_l2, sse42, small_l2};
constexpr int untuned_classes[] = {plain, avx, def_family16};

// The services answer as a processor of the class does.
void be_of_class(int machine_class) {
  const ProcessorTier tiers[] = {tier_def, tier_ssse3, tier_ssse3, tier_sse42, tier_ssse3, tier_avx, tier_def};
  world.tier = tiers[machine_class];
  world.sse41 = machine_class != ssse3;
  world.family16 = machine_class == def_family16;
  world.cache[cache_second_size] = machine_class == large_l2 ? 3145729 : 3145728;
}

// What a front end asks of a processor of the class: the threads, the tier, the caches, and the class's own question.
std::string questions(int machine_class) {
  const bool is_def = machine_class == plain || machine_class == def_family16;
  const bool is_ssse3 = machine_class == ssse3 || machine_class == large_l2 || machine_class == small_l2;
  return std::string("ntc") + (is_def ? "f" : is_ssse3 ? "4" : "");
}

template <class T>
class GemmDriver : public testing::Test {
 protected:
  void SetUp() override {
    std::destroy_at(&world);
    std::construct_at(&world);
  }
  static constexpr bool is_real = !is_complex<T>;

  // One call of the serial slot with the caller's own arguments, and nothing else but the questions.
  static void expect_serial(const Problem<T> &problem, const std::string &asked, const std::string &why) {
    EXPECT_EQ(world.asked, asked) << why;
    ASSERT_EQ(world.calls.size(), 1U) << why;
    EXPECT_EQ(world.calls[0].routine, Front<T>::name) << why;
    EXPECT_EQ(world.calls[0].args, problem.args()) << why;
  }

  // A selection and a strategy on each thread of a team, and nothing else.
  static void expect_region(int team, const std::string &why) {
    const std::string &name = Front<T>::name;
    for (const std::string &routine : {name + "_select", name + "_1d_col"}) {
      const std::vector<Call> calls = calls_of(routine);
      ASSERT_EQ(calls.size(), static_cast<std::size_t>(team)) << routine << ' ' << why;
      for (int i = 0; i < team; ++i) {
        EXPECT_EQ(calls[static_cast<std::size_t>(i)].thread, i) << routine << ' ' << why;
        EXPECT_EQ(calls[static_cast<std::size_t>(i)].team, team) << routine << ' ' << why;
      }
    }
    EXPECT_EQ(calls_of(name).size(), 0U) << why;
  }
};
using Types = testing::Types<float, double, cfloat, cdouble>;
TYPED_TEST_SUITE(GemmDriver, Types);

// The threads that the runtime delivers where so many are asked for.
int team_of(int requested) { return std::min(requested, omp_get_thread_limit()); }

}  // namespace
