// The front ends of the parallel GEMM between stand-ins: what they ask, what they hand on to slots, selectors and
// strategies, and in which order. The scaling pass and the runtime's teams are the real ones.
//
// In a process with a thread limit (ctest sets one) the runtime delivers fewer threads than some calls ask for. The
// file is long because every step of a call has its tests here.

#include <gtest/gtest.h>
#include <omp.h>
#include <xmmintrin.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <limits>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "tests/thread/gemm_driver_world.h"

namespace {

// ---- The order of entry ----

TYPED_TEST(GemmDriver, AnEmptyResultAsksAndDoesNothing) {
  for (const auto &[m, n] : {std::pair<QtbInt, QtbInt>{0, 300}, {300, 0}, {-1, 300}, {300, -5}, {0, 0}})
    for (const QtbInt k : {300, 0, -1}) {
      Problem<TypeParam> p;
      p.m = m, p.n = n, p.k = k;
      p.call();
      EXPECT_EQ(world.asked, "") << m << ' ' << n;
      EXPECT_TRUE(world.calls.empty()) << m << ' ' << n;
    }
}

TYPED_TEST(GemmDriver, SmallProblemsGoToTheSlotAndAskNothing) {
  world.max_threads = 64;
  for (const auto &[m, n, k] : {std::array<QtbInt, 3>{5, 1000, 1000},
                                {1, 1000, 1000},
                                {1000, 1000, 4},
                                {1000, 1000, 0},
                                {1000, 1000, -7},
                                {16, 16, 16},
                                {6, 1, 5}})
    for (const int machine_class : all_classes) {
      be_of_class(machine_class);
      Problem<TypeParam> p;
      p.m = m, p.n = n, p.k = k;
      p.alpha = value<TypeParam>(0);
      p.call();
      this->expect_serial(p, "", std::to_string(m) + " " + std::to_string(n) + " " + std::to_string(k));
    }
}

TYPED_TEST(GemmDriver, JustAboveTheSmallProblemsQuestionsAreAskedInOrderAndOnce) {
  for (const int machine_class : all_classes)
    for (const auto &[m, n, k] :
         {std::array<QtbInt, 3>{6, 1000, 1000}, {1000, 1000, 5}, {17, 16, 16}, {16, 17, 16}, {16, 16, 17}}) {
      be_of_class(machine_class);
      Problem<TypeParam> p;
      p.m = m, p.n = n, p.k = k;
      p.call();
      EXPECT_EQ(world.asked, questions(machine_class)) << machine_class;
    }
}

TYPED_TEST(GemmDriver, OneThreadGoesToTheSlot) {
  for (const std::int32_t threads : {1, 0})
    for (const int machine_class : all_classes) {
      be_of_class(machine_class);
      world.max_threads = threads;
      Problem<TypeParam> p;
      p.alpha = value<TypeParam>(0);  // the slot's business, here
      p.call();
      this->expect_serial(p, questions(machine_class), std::to_string(machine_class));
    }
}

TYPED_TEST(GemmDriver, OneThreadInARegionTakesSlicesOfRowsOnTheSmallL2ClassInRealTypes) {
  world.max_threads = 1;
  for (const int machine_class : all_classes)
    for (const char transa : {'N', 'n', 'T', 't', 'C', 'c'})
      for (const QtbInt m : {127, 128, 129, 256, 300}) {
        be_of_class(machine_class);
        Problem<TypeParam> p;
        p.m = m;
        p.transa = transa;
        call_in_a_region(p);
        if (!this->is_real || machine_class != small_l2) {
          this->expect_serial(p, questions(machine_class), std::to_string(machine_class));
          continue;
        }
        EXPECT_EQ(world.asked, questions(machine_class));
        std::vector<QtbInt> rows;
        QtbInt row = 0;
        for (const Call &call : world.calls) {
          EXPECT_EQ(call.routine, Front<TypeParam>::name);
          Pointers want = p.args(), got = call.args;
          want[arg_a] = p.a + row * (transa == 'N' || transa == 'n' ? 1 : p.lda);
          want[arg_c] = p.c + row;
          want[arg_m] = got[arg_m] = nullptr;  // the rows of a slice, by value below
          EXPECT_EQ(got, want) << transa << ' ' << m << ' ' << row;
          rows.push_back(call.m);
          row += call.m;
        }
        const std::vector<QtbInt> want = m == 127   ? std::vector<QtbInt>{127}
                                         : m == 128 ? std::vector<QtbInt>{128}
                                         : m == 129 ? std::vector<QtbInt>{128, 1}
                                         : m == 256 ? std::vector<QtbInt>{128, 128}
                                                    : std::vector<QtbInt>{128, 128, 44};
        EXPECT_EQ(rows, want) << transa << ' ' << m;
      }
}

// A problem that is not tiny, and still too small for four threads.
TYPED_TEST(GemmDriver, WhatDoesNotPayGoesToTheSlotOnTunedClassesOnly) {
  Problem<TypeParam> p;
  p.m = p.n = 10;
  p.k = 17;
  p.alpha = value<TypeParam>(0);
  for (const int machine_class : tuned_classes) {
    be_of_class(machine_class);
    p.call();
    this->expect_serial(p, questions(machine_class), std::to_string(machine_class));
  }
  for (const int machine_class : untuned_classes) {
    be_of_class(machine_class);
    p.call();
    this->expect_region(4, std::to_string(machine_class));
  }
}

// ---- The scaling pass ----

TYPED_TEST(GemmDriver, TunedClassesScaleUnlessBetaIsOneAndWorkWithBetaOne) {
  const double nan = std::numeric_limits<double>::quiet_NaN();
  struct Beta {
    double re, im;
    bool scales;
  };
  std::vector<Beta> betas = {{1, 0, false}, {1, -0.0, false}, {0, 0, true},   {-0.0, 0, true},
                             {-1, 0, true}, {2, 0, true},     {nan, 0, true}, {std::nextafter(1.0F, 2.0F), 0, true}};
  if (!this->is_real) {
    for (const double im : {1.0, -1.0, 1e-30, nan}) betas.push_back({1, im, true});
    betas.push_back({0, 1, true});
  }
  const std::string &name = Front<TypeParam>::name;
  for (const int machine_class : tuned_classes)
    for (const auto &[re, im, scales] : betas)
      for (const auto &[threads, n] : {std::pair<int, QtbInt>{4, 300}, {4, 303}, {5, 4}, {2, 300}}) {
        be_of_class(machine_class);
        world.max_threads = threads;
        Problem<TypeParam> p;
        p.n = n;
        p.m = p.k = 1000;
        p.beta = value<TypeParam>(re, im);
        p.call();
        const std::string why =
            std::to_string(machine_class) + " beta " + std::to_string(re) + " " + std::to_string(im);
        const std::vector<Call> passes = calls_of(name + "_scale_c");
        ASSERT_EQ(passes.size(), static_cast<std::size_t>(scales ? threads : 0)) << why;
        QtbInt share = n / threads, column = 0;
        for (const Call &pass : passes) {
          const bool last = pass.thread == threads - 1;
          EXPECT_EQ(pass.m, p.m) << why;
          EXPECT_EQ(pass.n, last ? n - share * (threads - 1) : share) << why;
          EXPECT_EQ(pass.args[2], &p.beta) << why;
          EXPECT_EQ(pass.args[3], p.c + std::min(share * pass.thread, n - 1) * p.ldc) << why;
          EXPECT_EQ(*static_cast<const QtbInt *>(pass.args[4]), p.ldc) << why;
          column += pass.n;
        }
        EXPECT_EQ(column, scales ? n : 0) << why;

        this->expect_region(threads, why);
        for (const Call &call : calls_of(name + "_1d_col")) {
          EXPECT_EQ(call.beta, bytes_of(value<TypeParam>(1))) << why;
          Pointers want = p.args(), got = call.args;
          want[arg_beta] = got[arg_beta] = nullptr;
          EXPECT_EQ(got, want) << why;
        }
        // All of C is scaled before any of it is added to.
        for (std::size_t i = 0; i < passes.size(); ++i) EXPECT_EQ(world.calls[i].routine, name + "_scale_c") << why;
      }
}

TYPED_TEST(GemmDriver, OnTunedClassesAlphaZeroScalesAndReturns) {
  const std::string &name = Front<TypeParam>::name;
  for (const int machine_class : tuned_classes)
    for (const double zero : {0.0, -0.0}) {
      be_of_class(machine_class);
      Problem<TypeParam> p;
      p.alpha = value<TypeParam>(zero, zero);
      p.beta = value<TypeParam>(1);
      p.call();
      EXPECT_TRUE(world.calls.empty()) << machine_class;
      p.beta = value<TypeParam>(0);
      p.call();
      EXPECT_EQ(world.calls.size(), 4U) << machine_class;
      EXPECT_EQ(calls_of(name + "_scale_c").size(), 4U) << machine_class;
    }
}

TYPED_TEST(GemmDriver, AnAlphaThatIsNotZeroGoesOn) {
  const double nan = std::numeric_limits<double>::quiet_NaN(), least = std::numeric_limits<float>::denorm_min();
  for (const int machine_class : tuned_classes)
    for (const auto &[re, im] : {std::pair<double, double>{nan, 0}, {least, 0}, {0, 1}, {0, least}, {0, nan}}) {
      be_of_class(machine_class);
      Problem<TypeParam> p;
      p.alpha = value<TypeParam>(re, im);
      p.beta = value<TypeParam>(1);
      p.call();
      this->expect_region(4, std::to_string(re) + " " + std::to_string(im));
    }
}

TYPED_TEST(GemmDriver, OtherClassesHandOnAlphaZeroAndTheCallersBeta) {
  for (const int machine_class : untuned_classes)
    for (const double alpha : {0.0, 2.0})
      for (const double beta : {0.0, 1.0, 3.0}) {
        be_of_class(machine_class);
        Problem<TypeParam> p;
        p.alpha = value<TypeParam>(alpha);
        p.beta = value<TypeParam>(beta);
        p.call();
        this->expect_region(4, std::to_string(machine_class));
        EXPECT_EQ(world.calls.size(), 8U) << machine_class;
        for (const Call &call : calls_of(Front<TypeParam>::name + "_1d_col")) EXPECT_EQ(call.args, p.args());
      }
}

// ---- The region ----

TYPED_TEST(GemmDriver, ATeamOfOneRunsTheSlotOnceWithTheWorkingBeta) {
  for (const int machine_class : all_classes)
    for (const double beta : {1.0, 3.0}) {
      be_of_class(machine_class);
      Problem<TypeParam> p;
      p.beta = value<TypeParam>(beta);
      call_in_a_region(p);
      const bool tuned = machine_class >= ssse3 && machine_class <= small_l2, scales = tuned && beta != 1;
      ASSERT_EQ(world.calls.size(), scales ? 2U : 1U) << machine_class;
      if (scales) {
        const Call &pass = world.calls[0];
        EXPECT_EQ(pass.routine, Front<TypeParam>::name + "_scale_c") << machine_class;
        EXPECT_EQ(pass.n, p.n);
        EXPECT_EQ(pass.args[3], p.c);
      }
      const Call &call = world.calls.back();
      EXPECT_EQ(call.routine, Front<TypeParam>::name) << machine_class;
      Pointers want = p.args(), got = call.args;
      EXPECT_EQ(call.beta, bytes_of(tuned ? value<TypeParam>(1) : p.beta)) << machine_class;
      if (tuned) want[arg_beta] = got[arg_beta] = nullptr;
      EXPECT_EQ(got, want) << machine_class;
      EXPECT_TRUE(world.allocations.empty());
    }
}

TYPED_TEST(GemmDriver, EveryThreadSelectsFromAnEmptyPlanForTheTeamThatThereIs) {
  for (const int machine_class : all_classes)
    for (const int requested : {2, 3, 4, 8}) {
      be_of_class(machine_class);
      world.max_threads = requested;
      Problem<TypeParam> p;
      p.transa = 't';
      p.transb = 'N';
      p.call();
      const int team = team_of(requested);
      this->expect_region(team, std::to_string(requested));
      GemmPlan<TypeParam> want{};
      want.nthreads = team;
      want.machine_class = static_cast<qtb::GemmMachineClass>(machine_class);
      std::copy(std::begin(world.cache), std::end(world.cache), want.cache);
      for (const Call &call : calls_of(Front<TypeParam>::name + "_select")) {
        EXPECT_EQ(call.args, (Pointers{&p.m, &p.n, &p.k}));
        const auto found = from_bytes<GemmPlan<TypeParam>>(call.plan);
        EXPECT_FALSE(found.a_is_n);
        EXPECT_TRUE(found.a_is_t);
        EXPECT_TRUE(found.b_is_n);
        EXPECT_FALSE(found.b_is_t);
        want.a_is_t = want.b_is_n = true;
        EXPECT_EQ(call.plan, bytes_of(want)) << machine_class << ' ' << team;
        EXPECT_EQ(call.panels, bytes_of(GemmPanelSet<TypeParam>{})) << machine_class;
      }
      const std::vector<Call> strategies = calls_of(Front<TypeParam>::name + "_1d_col");
      for (const Call &call : strategies) {
        EXPECT_EQ(call.plan, strategies[0].plan);
        EXPECT_EQ(call.panels, strategies[0].panels);
      }
      EXPECT_TRUE(world.allocations.empty());
    }
}

// Under ctest, eight threads are asked for and five come.
TYPED_TEST(GemmDriver, FewerThreadsThanAskedForScaleAndSelectForTheirNumber) {
  if (omp_get_thread_limit() >= 8) GTEST_SKIP() << "needs OMP_THREAD_LIMIT below 8";
  world.max_threads = 8;
  Problem<TypeParam> p;
  p.n = 303;
  p.call();
  const int team = omp_get_thread_limit();
  this->expect_region(team, "");
  const std::vector<Call> passes = calls_of(Front<TypeParam>::name + "_scale_c");
  ASSERT_EQ(passes.size(), static_cast<std::size_t>(team));
  QtbInt columns = 0;
  for (const Call &pass : passes) {
    EXPECT_EQ(pass.args[3], p.c + columns * p.ldc);
    columns += pass.n;
  }
  EXPECT_EQ(columns, p.n);
  for (const Call &call : calls_of(Front<TypeParam>::name + "_select"))
    EXPECT_EQ(from_bytes<GemmPlan<TypeParam>>(call.plan).nthreads, team);
}

TYPED_TEST(GemmDriver, ThePlanHasThePackingOfEachForm) {
  const char letters[] = {'N', 'n', 'T', 't', 'C', 'c'};
  for (const int machine_class : {sse42, plain})
    for (const char transa : letters)
      for (const char transb : letters) {
        be_of_class(machine_class);
        Problem<TypeParam> p;
        p.transa = transa;
        p.transb = transb;
        p.call();
        this->expect_region(4, {transa, transb});
        // The number of a form among n, t, c; in real types the third is the second.
        const auto form = [&](char letter) {
          const std::uintptr_t number = letter == 'N' || letter == 'n' ? 0 : letter == 'T' || letter == 't' ? 1 : 2;
          return this->is_real && number == 2 ? 1 : number;
        };
        const auto is = [](char letter, char upper) { return letter == upper || letter == upper + 32; };
        for (const Call &call : calls_of(Front<TypeParam>::name + "_1d_col")) {
          const auto plan = from_bytes<GemmPlan<TypeParam>>(call.plan);
          EXPECT_EQ(plan.acopy, packing<TypeParam>(1 + form(transa))) << transa;
          EXPECT_EQ(plan.bcopy, packing<TypeParam>(4 + form(transb))) << transb;
          EXPECT_EQ(plan.a_is_n, is(transa, 'N')) << transa;
          EXPECT_EQ(plan.a_is_t, is(transa, 'T')) << transa;
          EXPECT_EQ(plan.b_is_n, is(transb, 'N')) << transb;
          EXPECT_EQ(plan.b_is_t, is(transb, 'T')) << transb;
        }
      }
}

// ---- Shared panels ----

void *address(std::uintptr_t number) { return reinterpret_cast<void *>(number); }

TYPED_TEST(GemmDriver, OneThreadAllocatesTheSharedPanelsAndAllFindThemAtPageBoundaries) {
  constexpr QtbInt width = sizeof(TypeParam);
  const QtbInt a_bytes = chosen_mb * chosen_kb * width + 8704, b_bytes = chosen_kb * chosen_nb * width + 8704;
  // A multiple of a page stays as it is; any other goes up to the next.
  const struct {
    std::uintptr_t allocated, aligned;
  } places[] = {
      {0x700000, 0x700000}, {0x700080, 0x701000}, {0x700f80, 0x701000}, {0x700fff, 0x701000}, {0x701000, 0x701000}};
  for (const std::int32_t a_buffers : {0, 1, 4})
    for (const std::int32_t b_buffers : {0, 1, 6})
      for (const auto &[allocated, aligned] : places) {
        world.a_buffers = a_buffers;
        world.b_buffers = b_buffers;
        // B is allocated first, and lies 0x100000 above.
        world.memory.clear();
        if (b_buffers > 0) world.memory.push_back(address(allocated + 0x100000));
        if (a_buffers > 0) world.memory.push_back(address(allocated));
        Problem<TypeParam> p;
        p.call();
        this->expect_region(4, std::to_string(a_buffers) + " " + std::to_string(b_buffers));

        std::vector<Allocation> want;
        if (b_buffers > 0) want.push_back({static_cast<std::uint64_t>(b_buffers * b_bytes), 128, 0});
        if (a_buffers > 0) want.push_back({static_cast<std::uint64_t>(a_buffers * a_bytes), 128, 0});
        EXPECT_EQ(world.allocations, want);
        std::vector<void *> released(world.memory.rbegin(), world.memory.rend());  // A first
        EXPECT_EQ(world.released, released);
        if (!released.empty()) {
          EXPECT_EQ(world.strategies_released, 4U);
        }

        for (const Call &call : calls_of(Front<TypeParam>::name + "_1d_col")) {
          const auto plan = from_bytes<GemmPlan<TypeParam>>(call.plan);
          const auto panels = from_bytes<GemmPanelSet<TypeParam>>(call.panels);
          EXPECT_EQ(panels.a_panel_bytes, a_bytes);
          EXPECT_EQ(panels.b_panel_bytes, b_bytes);
          EXPECT_EQ(plan.a_shared, address(a_buffers > 0 ? aligned : 0));
          EXPECT_EQ(plan.b_shared, address(b_buffers > 0 ? aligned + 0x100000 : 0));
          EXPECT_EQ(plan.mb, chosen_mb);
          EXPECT_EQ(plan.nb, chosen_nb);
          EXPECT_EQ(plan.kb, chosen_kb);
        }
      }
}

TYPED_TEST(GemmDriver, WithoutSharedPanelsNoThreadWaitsForAnother) {
  world.others_wait = true;
  Problem<TypeParam> p;
  p.call();
  this->expect_region(4, "");
}

TYPED_TEST(GemmDriver, WithoutMemoryForSharedPanelsAllThreadsTakeRowsByTheSlot) {
  const std::string &name = Front<TypeParam>::name;
  for (const auto &[a_buffers, b_buffers] : {std::pair<int, int>{1, 0}, {4, 0}, {0, 1}, {0, 6}, {4, 6}})
    for (const bool a_fails : {false, true})
      for (const bool b_fails : {false, true}) {
        const bool short_of_memory = (a_fails && a_buffers > 0) || (b_fails && b_buffers > 0);
        if (!short_of_memory) continue;
        world.a_buffers = a_buffers;
        world.b_buffers = b_buffers;
        world.memory.clear();
        std::vector<void *> released;
        if (b_buffers > 0) world.memory.push_back(b_fails ? nullptr : address(0x800080));
        if (a_buffers > 0) world.memory.push_back(a_fails ? nullptr : address(0x700080));
        if (a_buffers > 0 && !a_fails) released.push_back(address(0x700080));
        if (b_buffers > 0 && !b_fails) released.push_back(address(0x800080));
        Problem<TypeParam> p;
        p.call();
        EXPECT_EQ(calls_of(name + "_1d_col").size(), 0U);
        const std::vector<Call> rows = calls_of(name + "_1d_row");
        ASSERT_EQ(rows.size(), 4U);
        for (const Call &call : rows) {
          const auto plan = from_bytes<GemmPlan<TypeParam>>(call.plan);
          EXPECT_EQ(plan.kernel.gemm, Front<TypeParam>::slot);
          EXPECT_EQ(plan.nthreads, 4);
          EXPECT_EQ(call.beta, bytes_of(value<TypeParam>(1)));
        }
        EXPECT_EQ(world.released, released);
      }
}

// ---- The floating-point state ----

// The choice of each thread of a team, as it is outside the library.
std::vector<unsigned> choices_of_team(int team) {
  std::vector<unsigned> choices(static_cast<std::size_t>(team));
#pragma omp parallel num_threads(team)
  choices[static_cast<std::size_t>(omp_get_thread_num())] = qtb::floating_choice();
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
    ASSERT_EQ(world.calls.size(), 3U * team);  // scaling, selection, strategy
    for (const Call &call : world.calls) EXPECT_EQ(call.floating_choice, choice) << call.routine << call.thread;
    EXPECT_EQ(choices_of_team(team), own);
  }
}

}  // namespace
