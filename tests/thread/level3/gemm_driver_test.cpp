// The parallel GEMM driver between stand-ins: what it hands on to slots, selectors and strategies, and in which order,
// for decisions by hand. The scaling pass and the runtime's teams are the real ones.
//
// In a process with a thread limit (ctest sets one) the runtime delivers fewer threads than some calls ask for.

#include <xmmintrin.h>

#include <atomic>
#include <chrono>
#include <cmath>
#include <limits>
#include <thread>

#include "blas/thread/32e/level3/gemm_omp.h"
#include "blas/thread/32e/level3/gemm_strategies.h"
#include "tests/thread/recorded_memory.h"
#include "tests/thread/stand_ins.h"

QTB_RECORDED_MEMORY_SERVICE

namespace qtb::test {
namespace {

// A plan and a panel set as a selector found them, or as a strategy got them.
template <class T>
struct Seen {
  bool by_strategy;
  GemmPlan<T> plan;
  GemmPanelSet<T> panels;
};
template <class T>
std::vector<Seen<T>> seen;

struct World {
  std::int32_t a_buffers = 0, b_buffers = 0;  // what the selectors put into a plan
  bool others_wait = false;                   // whether they keep all threads but the first until a strategy has begun
};
World world;
std::atomic<int> strategies_begun{0};

// Packing routines that are told apart by their addresses.
template <class T>
PanelCopyRoutine<T> *packing(std::uintptr_t number) {
  return reinterpret_cast<PanelCopyRoutine<T> *>(16 * number);
}
constexpr QtbInt chosen_mb = 24, chosen_nb = 40, chosen_kb = 16;

template <class T>
void note_plan(bool by_strategy, const GemmPlan<T> &plan, const GemmPanelSet<T> &panels) {
  const std::lock_guard lock(stand_ins_mutex);
  seen<T>.push_back({by_strategy, plan, panels});
}

template <class T>
void select(GemmPanelSet<T> *panels, GemmPlan<T> *plan, GemmStrategy<T> *strategy) {
  note_plan(false, *plan, *panels);
  if (world.others_wait && omp_get_thread_num() != 0) {
    const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(10);
    while (strategies_begun == 0 && std::chrono::steady_clock::now() < end) std::this_thread::yield();
    EXPECT_GT(strategies_begun, 0) << "the first thread waits for the others";
  }
  plan->strategy = strategy;
  plan->mb = chosen_mb, plan->nb = chosen_nb, plan->kb = chosen_kb;
  plan->a_buffers = world.a_buffers, plan->b_buffers = world.b_buffers;
  panels->acopy_n = packing<T>(1), panels->acopy_t = packing<T>(2), panels->acopy_c = packing<T>(3);
  panels->bcopy_n = packing<T>(4), panels->bcopy_t = packing<T>(5), panels->bcopy_c = packing<T>(6);
}

}  // namespace
}  // namespace qtb::test

extern "C" {
#define QTB_STRATEGY(name, T)                                 \
  void qtb_blas_##name(QTB_PARAMS_GEMM_STRATEGY(T)) {         \
    QTB_STAND_IN(#name, gemm, T, nullptr);                    \
    qtb::test::note_plan(true, *plan, *panel_set);            \
    EXPECT_TRUE(qtb::test::recorded_memory.releases.empty()); \
    ++qtb::test::strategies_begun;                            \
  }
QTB_FOR_EACH_GEMM_STRATEGY(QTB_STRATEGY)
#define QTB_SELECT(t, T)                                                                                             \
  void qtb_blas_##t##gemm_select(const QtbInt *m, const QtbInt *n, const QtbInt *k, qtb::GemmPanelSet<T> *panel_set, \
                                 qtb::GemmPlan<T> *plan) {                                                           \
    qtb::test::note_call(#t "gemm_select", "m, n, k", m, n, k);                                                      \
    qtb::test::select(panel_set, plan, &qtb_blas_##t##gemm_1d_col);                                                  \
  }
QTB_FOR_EACH_GEMM(QTB_SELECT)
}

namespace qtb::test {
namespace {

// ---- Calls of a driver ----

template <class T>
struct Driver;
#define QTB_DRIVER(t, T)                                  \
  template <>                                             \
  struct Driver<T> {                                      \
    static constexpr auto gemm = &qtb_blas_##t##gemm_omp; \
    static constexpr auto slot = &qtb_blas_x##t##gemm;    \
    static inline const std::string name = #t "gemm";     \
  };
QTB_FOR_EACH_GEMM(QTB_DRIVER)

// A value of T: the second part counts in complex types only.
template <class T>
T value(double re, double im = 0) {
  if constexpr (is_complex<T>)
    return {static_cast<Real<T>>(re), static_cast<Real<T>>(im)};
  else
    return static_cast<T>(re);
}

template <class T>
struct Problem {
  GemmDecision decision = {gemm_parallel, 4, machine_sse42, true, {3, 32768, 262144, 8388608, 7}};
  QtbInt m = 300, n = 300, k = 300;
  char transa = 'N', transb = 'N';
  T alpha = value<T>(2), beta = value<T>(3);
  QtbInt lda = 1000, ldb = 1001, ldc = 1002;
  const T *a = reinterpret_cast<const T *>(std::uintptr_t{1} << 20);
  const T *b = reinterpret_cast<const T *>(std::uintptr_t{2} << 20);
  T *c = reinterpret_cast<T *>(std::uintptr_t{3} << 20);

  void call() const {
    stand_ins.calls.clear();
    recorded_memory.forget();
    seen<T>.clear();
    strategies_begun = 0;
    Driver<T>::gemm(&decision, &transa, &transb, &m, &n, &k, &alpha, a, &lda, b, &ldb, &beta, c, &ldc);
  }
};

template <class T>
class GemmDriver : public testing::Test {
 protected:
  using P = Problem<T>;
  const std::string &name = Driver<T>::name;
  const double nan = std::numeric_limits<double>::quiet_NaN();

  void SetUp() override {
    world = World{};
    stand_ins = StandIns{};
    recorded_memory = RecordedMemory{};
  }
  void TearDown() override {
    EXPECT_TRUE(recorded_memory.held.empty());
    EXPECT_EQ(recorded_memory.faults, 0);
  }

  // The calls of a routine: one by each thread of a team, with the caller's arguments, but for beta if that is to be 1.
  static void expect_calls(const P &p, const std::string &routine, int team, bool beta_is_1) {
    const std::vector<Call> calls = stand_ins.calls_of(routine);
    ASSERT_EQ(calls.size(), static_cast<std::size_t>(team)) << routine;
    for (int i = 0; i < team; ++i) {
      const Call &call = calls[static_cast<std::size_t>(i)];
      EXPECT_EQ(call.thread, i) << routine;
      EXPECT_EQ(call.team, team) << routine;
      std::vector<const void *> want = {&p.transa, &p.transb, &p.m,   &p.n,    &p.k, &p.alpha, p.a,
                                        &p.lda,    p.b,       &p.ldb, &p.beta, p.c,  &p.ldc};
      if (beta_is_1) want[10] = call.pointer("beta");
      EXPECT_EQ(call.pointers(), want) << routine;
      EXPECT_EQ(call["beta"].bytes, bytes_of(beta_is_1 ? value<T>(1) : p.beta)) << routine;
    }
  }
  // A selection and a strategy on each thread of a team, behind a scaling pass or without one.
  static void expect_region(const P &p, int team, bool beta_is_1, int scaling_team) {
    const std::string &name = Driver<T>::name;
    EXPECT_EQ(stand_ins.calls.size(), static_cast<std::size_t>(2 * team + scaling_team));
    EXPECT_EQ(stand_ins.calls_of(name + "_select").size(), static_cast<std::size_t>(team));
    expect_calls(p, name + "_1d_col", team, beta_is_1);
    // All of C is scaled before any of it is added to, whole columns by each thread.
    QtbInt column = 0;
    const std::vector<Call> passes = stand_ins.calls_of("x" + name + "_scale_c");
    ASSERT_EQ(passes.size(), static_cast<std::size_t>(scaling_team));
    for (int i = 0; i < scaling_team; ++i) {
      const Call &pass = passes[static_cast<std::size_t>(i)];
      EXPECT_EQ(stand_ins.calls[static_cast<std::size_t>(i)].routine, pass.routine);
      EXPECT_EQ(pass.number("m"), p.m);
      EXPECT_EQ(pass.number("n"), i < scaling_team - 1 ? p.n / scaling_team : p.n - column);
      EXPECT_EQ(pass.number("ldc"), p.ldc);
      EXPECT_EQ(pass.pointer("beta"), &p.beta);
      EXPECT_EQ(pass.pointer("c"), p.c + std::min(column, p.n - 1) * p.ldc);
      column += pass.number("n");
    }
    EXPECT_TRUE(scaling_team == 0 || column == p.n);
  }
};
using Types = testing::Types<float, double, cfloat, cdouble>;
TYPED_TEST_SUITE(GemmDriver, Types);

// The threads that the runtime delivers where so many are asked for.
int team_of(int requested) { return std::min(requested, omp_get_thread_limit()); }

// ---- The scaling pass ----

TYPED_TEST(GemmDriver, TunedClassesScaleUnlessBetaIsOneAndWorkWithBetaOne) {
  struct Beta {
    double re, im;
    bool scales;
  };
  const double nan = this->nan;
  std::vector<Beta> betas = {{1, 0, false}, {1, -0.0, false}, {0, 0, true},   {-0.0, 0, true},
                             {-1, 0, true}, {2, 0, true},     {nan, 0, true}, {std::nextafter(1.0F, 2.0F), 0, true}};
  if (is_complex<TypeParam>)
    for (const double im : {1.0, -1.0, 1e-30, nan}) betas.push_back({1, im, true});
  for (const auto &[re, im, scales] : betas)
    for (const auto &[threads, n] : {std::pair<int, QtbInt>{4, 300}, {4, 303}, {5, 4}, {2, 300}, {8, 303}}) {
      Problem<TypeParam> p;
      p.decision.threads = threads;
      p.n = n;
      p.beta = value<TypeParam>(re, im);
      p.call();
      SCOPED_TRACE(testing::Message() << "beta " << re << ' ' << im << " n " << n << " threads " << threads);
      const int team = team_of(threads);  // under ctest, eight are asked for and five come
      ASSERT_NO_FATAL_FAILURE(this->expect_region(p, team, true, scales ? team : 0));
    }
}

TYPED_TEST(GemmDriver, OnTunedClassesAlphaZeroScalesAndReturns) {
  for (const double zero : {0.0, -0.0}) {
    Problem<TypeParam> p;
    p.alpha = value<TypeParam>(zero, zero);
    p.beta = value<TypeParam>(1);
    p.call();
    EXPECT_TRUE(stand_ins.calls.empty());
    p.beta = value<TypeParam>(0);
    p.call();
    EXPECT_EQ(stand_ins.calls.size(), 4U);
    EXPECT_EQ(stand_ins.calls_of("x" + this->name + "_scale_c").size(), 4U);
  }
}

TYPED_TEST(GemmDriver, AnAlphaThatIsNotZeroGoesOn) {
  const double nan = this->nan, least = std::numeric_limits<float>::denorm_min();
  std::vector<std::pair<double, double>> alphas = {{nan, 0}, {least, 0}};
  if (is_complex<TypeParam>) alphas.insert(alphas.end(), {{0, 1}, {0, least}, {0, nan}});
  for (const auto &[re, im] : alphas) {
    Problem<TypeParam> p;
    p.alpha = value<TypeParam>(re, im);
    p.beta = value<TypeParam>(1);
    p.call();
    ASSERT_NO_FATAL_FAILURE(this->expect_region(p, 4, true, 0));
  }
}

TYPED_TEST(GemmDriver, OtherClassesHandOnAlphaZeroAndTheCallersBeta) {
  for (const double alpha : {0.0, 2.0})
    for (const double beta : {0.0, 1.0, 3.0}) {
      Problem<TypeParam> p;
      p.decision.tuned = false;
      p.alpha = value<TypeParam>(alpha);
      p.beta = value<TypeParam>(beta);
      p.call();
      ASSERT_NO_FATAL_FAILURE(this->expect_region(p, 4, false, 0));
    }
}

// ---- The region ----

// In a region that may not nest, the call's own have one thread each.
TYPED_TEST(GemmDriver, ATeamOfOneRunsTheSlotOnceWithTheWorkingBeta) {
  const int levels = omp_get_max_active_levels();
  omp_set_max_active_levels(1);
  for (const bool tuned : {false, true})
    for (const double beta : {1.0, 3.0}) {
      Problem<TypeParam> p;
      p.decision.tuned = tuned;
      p.beta = value<TypeParam>(beta);
#pragma omp parallel num_threads(2)
#pragma omp single
      p.call();
      const bool scales = tuned && beta != 1;
      ASSERT_EQ(stand_ins.calls.size(), scales ? 2U : 1U);
      if (scales) {
        EXPECT_EQ(stand_ins.calls[0].routine, "x" + this->name + "_scale_c");
        EXPECT_EQ(stand_ins.calls[0].number("n"), p.n);
        EXPECT_EQ(stand_ins.calls[0].pointer("c"), p.c);
      }
      for (Call &call : stand_ins.calls) call.thread = 0;  // whichever thread of the outer region it was
      this->expect_calls(p, "x" + this->name, 1, tuned);
      EXPECT_TRUE(recorded_memory.requests.empty());
    }
  omp_set_max_active_levels(levels);
}

TYPED_TEST(GemmDriver, EveryThreadSelectsFromAnEmptyPlanForTheTeamThatThereIs) {
  for (const GemmMachineClass machine_class : {machine_plain, machine_sse42, machine_sse41_small_l2})
    for (const int requested : {2, 3, 4, 8}) {
      Problem<TypeParam> p;
      p.decision.threads = requested;
      p.decision.machine_class = machine_class;
      p.transa = 't';
      p.call();
      GemmPlan<TypeParam> want{};
      want.nthreads = team_of(requested);
      want.machine_class = machine_class;
      want.a_is_t = want.b_is_n = true;
      std::copy(std::begin(p.decision.cache), std::end(p.decision.cache), want.cache);
      for (const Call &call : stand_ins.calls_of(this->name + "_select"))
        EXPECT_EQ(call.pointers(), (std::vector<const void *>{&p.m, &p.n, &p.k}));
      const Seen<TypeParam> *first = nullptr;  // that a strategy got
      for (const Seen<TypeParam> &s : seen<TypeParam>) {
        // Without the padding behind the last member, which a copy need not keep; there is none between members.
        constexpr std::size_t plan_bytes = offsetof(GemmPlan<TypeParam>, cache) + sizeof want.cache;
        if (s.by_strategy && first == nullptr) first = &s;
        const GemmPlan<TypeParam> &plan = s.by_strategy ? first->plan : want;
        const GemmPanelSet<TypeParam> &panels = s.by_strategy ? first->panels : GemmPanelSet<TypeParam>{};
        EXPECT_EQ(std::memcmp(&s.plan, &plan, plan_bytes), 0) << machine_class << ' ' << requested;
        EXPECT_EQ(bytes_of(s.panels), bytes_of(panels));
      }
      EXPECT_EQ(seen<TypeParam>.size(), static_cast<std::size_t>(2 * team_of(requested)));
      EXPECT_TRUE(recorded_memory.requests.empty());
    }
}

TYPED_TEST(GemmDriver, ThePlanHasThePackingOfEachForm) {
  // The number of a form among n, t, c; in real types the third is the second.
  const auto form = [](char letter) -> std::uintptr_t {
    return letter == 'N' || letter == 'n' ? 0 : letter == 'T' || letter == 't' || !is_complex<TypeParam> ? 1 : 2;
  };
  for (const char transa : {'N', 'n', 'T', 't', 'C', 'c'})
    for (const char transb : {'N', 'n', 'T', 't', 'C', 'c'}) {
      Problem<TypeParam> p;
      p.transa = transa;
      p.transb = transb;
      p.call();
      for (const Seen<TypeParam> &s : seen<TypeParam>) {
        EXPECT_EQ(s.plan.a_is_n, is_letter(transa, 'N'));
        EXPECT_EQ(s.plan.a_is_t, is_letter(transa, 'T'));
        EXPECT_EQ(s.plan.b_is_n, is_letter(transb, 'N'));
        EXPECT_EQ(s.plan.b_is_t, is_letter(transb, 'T'));
        if (!s.by_strategy) continue;
        EXPECT_EQ(s.plan.acopy, packing<TypeParam>(1 + form(transa))) << transa;
        EXPECT_EQ(s.plan.bcopy, packing<TypeParam>(4 + form(transb))) << transb;
      }
    }
}

// ---- Shared panels ----

// Panels are requested on the caller's thread, B ahead of A, all before any strategy begins, and given back behind the
// region, A first. All threads find them at the next page boundary. Where one is missing, all turn to rows by the slot.
TYPED_TEST(GemmDriver, OneThreadAllocatesTheSharedPanelsAndWithoutMemoryAllTakeRows) {
  constexpr QtbInt width = sizeof(TypeParam);
  const QtbInt a_bytes = chosen_mb * chosen_kb * width + 8704, b_bytes = chosen_kb * chosen_nb * width + 8704;
  for (const std::int32_t a_buffers : {0, 1, 4})
    for (const std::int32_t b_buffers : {0, 1, 6})
      for (const std::size_t distance : {0, 128, 3968, 4095})
        for (const unsigned failing : {0U, 1U, 2U, 3U}) {  // a bit for each request
          SCOPED_TRACE(testing::Message() << a_buffers << ' ' << b_buffers << ' ' << distance << ' ' << failing);
          world.a_buffers = a_buffers;
          world.b_buffers = b_buffers;
          recorded_memory.distance = distance;
          recorded_memory.fails = [failing](long number, int thread, int) {
            EXPECT_EQ(thread, 0);
            EXPECT_EQ(strategies_begun, 0);
            // Time enough for the other threads to go on, if nothing made them wait.
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
            return (failing >> number & 1) != 0;
          };
          Problem<TypeParam> p;
          p.call();
          std::vector<std::uint64_t> want;
          if (b_buffers > 0) want.push_back(static_cast<std::uint64_t>(b_buffers * b_bytes));
          if (a_buffers > 0) want.push_back(static_cast<std::uint64_t>(a_buffers * a_bytes));
          ASSERT_EQ(recorded_memory.requests.size(), want.size());
          std::vector<void *> held, aligned;
          for (std::size_t i = 0; i < want.size(); ++i) {
            const MemoryRequest &request = recorded_memory.requests[i];
            EXPECT_EQ(request.bytes, want[i]);
            EXPECT_EQ(request.alignment, 128);
            if (request.given != nullptr) held.insert(held.begin(), request.given);
            const auto address = reinterpret_cast<std::uintptr_t>(request.given);
            aligned.push_back(reinterpret_cast<void *>((address + 4095) / 4096 * 4096));
          }
          ASSERT_EQ(recorded_memory.releases.size(), held.size());
          for (std::size_t i = 0; i < held.size(); ++i) EXPECT_EQ(recorded_memory.releases[i].second, held[i]);
          const bool is_short = held.size() < want.size();
          ASSERT_NO_FATAL_FAILURE(this->expect_calls(p, this->name + (is_short ? "_1d_row" : "_1d_col"), 4, true));
          for (const Seen<TypeParam> &s : seen<TypeParam>) {
            if (!s.by_strategy) continue;
            EXPECT_EQ(s.panels.a_panel_bytes, a_bytes);
            EXPECT_EQ(s.panels.b_panel_bytes, b_bytes);
            EXPECT_EQ(s.plan.nthreads, 4);
            EXPECT_EQ(s.plan.b_shared, b_buffers > 0 ? aligned.front() : nullptr);
            EXPECT_EQ(s.plan.a_shared, a_buffers > 0 ? aligned.back() : nullptr);
            EXPECT_EQ(s.plan.mb, chosen_mb);
            EXPECT_EQ(s.plan.nb, chosen_nb);
            EXPECT_EQ(s.plan.kb, chosen_kb);
            if (is_short) {
              EXPECT_EQ(s.plan.kernel.gemm, Driver<TypeParam>::slot);
            }
          }
        }
}

TYPED_TEST(GemmDriver, WithoutSharedPanelsNoThreadWaitsForAnother) {
  world.others_wait = true;
  Problem<TypeParam> p;
  p.call();
  this->expect_region(p, 4, true, 4);
}

// ---- The floating-point state ----

// The choice of each thread of a team, as it is outside the library.
std::vector<unsigned> choices_of_team(int team) {
  std::vector<unsigned> choices(static_cast<std::size_t>(team));
#pragma omp parallel num_threads(team)
  choices[static_cast<std::size_t>(omp_get_thread_num())] = floating_choice();
  return choices;
}

TYPED_TEST(GemmDriver, ThreadsTakeTheCallersFloatingPointChoiceAndGiveTheirsBack) {
  constexpr int team = 4;
  const unsigned before = _mm_getcsr();
  const std::vector<unsigned> own = choices_of_team(team);
  for (const unsigned choice :
       {0x5F80U /* up */, 0x3F80U /* down */, 0x9FC0U /* flush to zero, denormals are zero */}) {
    _mm_setcsr(choice);
    Problem<TypeParam> p;
    p.call();
    const unsigned after = _mm_getcsr();
    _mm_setcsr(before);
    EXPECT_EQ(after, choice);
    ASSERT_EQ(stand_ins.calls.size(), 3U * team);  // scaling, selection, strategy
    for (const Call &call : stand_ins.calls) EXPECT_EQ(call.floating_choice, choice) << call.routine << call.thread;
    EXPECT_EQ(choices_of_team(team), own);
  }
}

}  // namespace
}  // namespace qtb::test
