// The front ends between stand-ins: slots, drivers and services of the test's own, which note what reaches them.
//
// Every front end must hand on its arguments as they are, to the slot or to the driver as the decision says, and return
// what it gets. The decision itself is tested by value elsewhere.

#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <vector>

#include "blas/dispatch/slots.h"
#include "blas/thread/32e/level1/xf_l1_omp.h"
#include "blas/thread/drivers.h"
#include "service/cache.h"
#include "service/cpu.h"
#include "service/threads.h"

namespace {

// ---- What the stand-ins answer and note ----

struct World {
  ProcessorTier tier = tier_sse42;
  std::int32_t max_threads = 1;
  std::int32_t dynamic = 1;
  std::string asked;               // one letter per question to a service
  std::string reached;             // "slot" or "driver", with the routine
  QtbInt nthreads = 0;             // of the driver
  std::vector<const void *> args;  // the pointers that arrived, in order
};
World world;

void arrived(const std::string &what, std::vector<const void *> args, QtbInt nthreads = 0) {
  world.reached = what;
  world.args = std::move(args);
  world.nthreads = nthreads;
}

// What a stand-in returns: a value no default would give, or the result pointer itself.
template <class R>
R answer_of(const void *first) {
  if constexpr (std::is_pointer_v<R>)
    return static_cast<R>(const_cast<void *>(first));
  else if constexpr (!std::is_void_v<R>)
    return R(42.5);
}

}  // namespace

extern "C" {
ProcessorTier qtb_serv_cpu_detect() { return world.asked += 't', world.tier; }
std::int32_t qtb_serv_get_max_threads(std::int32_t domain) {
  EXPECT_EQ(domain, domain_blas);
  return world.asked += 'n', world.max_threads;
}
std::int32_t qtb_serv_get_dynamic() { return world.asked += 'd', world.dynamic; }
void qtb_serv_get_cache_sizes(std::uint32_t *out) {
  world.asked += 'c';
  const std::uint32_t table[cache_size_entries] = {2, 32768, 1048576, 0, 0};
  std::copy(std::begin(table), std::end(table), out);
}

#define QTB_STAND_INS(name, shape, T)                         \
  QTB_FUNCTION(shape, T, qtb_blas_x##name) {                  \
    const std::vector<const void *> args = {QTB_ARGS(shape)}; \
    arrived("slot " #name, args);                             \
    return answer_of<QTB_RESULT_##shape(T)>(args[0]);         \
  }                                                           \
  QTB_OMP_FUNCTION(shape, T, name) {                          \
    const std::vector<const void *> args = {QTB_ARGS(shape)}; \
    arrived("driver " #name, args, nthreads);                 \
    return answer_of<QTB_RESULT_##shape(T)>(args[0]);         \
  }
#define QTB_LEVEL1_SIZED(name, shape, T, ...) QTB_STAND_INS(name, shape, T)
#define QTB_LEVEL1_PAIR(name, shape, T, min_n) QTB_STAND_INS(name, shape, T)
#include "blas/thread/32e/level1/xf_l1.def"
#undef QTB_LEVEL1_SIZED
#undef QTB_LEVEL1_PAIR
}

namespace {

// One call of a front end: n, incx and incy are read; every other argument is an address that nothing may touch.
struct Call {
  QtbInt n, incx = 1, incy = 1;
};

// Calls a front end with n, incx and incy in their places and untouchable addresses elsewhere. Checks that what arrived
// is what was sent, and that the result came back.
template <class R, class... A>
void call(const char *name, R (*front_end)(A...), const std::vector<std::string> &arg_names, const Call &arguments) {
  ASSERT_EQ(arg_names.size(), sizeof...(A)) << name;
  std::vector<const void *> sent;
  for (const std::string &arg : arg_names) {
    if (arg == "n")
      sent.push_back(&arguments.n);
    else if (arg == "incx")
      sent.push_back(&arguments.incx);
    else if (arg == "incy")
      sent.push_back(&arguments.incy);
    else
      sent.push_back(reinterpret_cast<const void *>(std::uintptr_t{16} * (sent.size() + 1)));
  }
  const auto invoke = [&]<std::size_t... i>(std::index_sequence<i...>) {
    return front_end(static_cast<A>(const_cast<void *>(sent[i]))...);
  };
  world.reached.clear();
  world.asked.clear();
  if constexpr (std::is_void_v<R>) {
    invoke(std::index_sequence_for<A...>{});
  } else {
    const R result = invoke(std::index_sequence_for<A...>{});
    EXPECT_EQ(result, answer_of<R>(sent[0])) << name;
  }
  EXPECT_EQ(world.args, sent) << name;
}

// "n, alpha, x" as a list.
std::vector<std::string> names(const char *text) {
  std::vector<std::string> list(1);
  for (; *text != 0; ++text)
    if (*text == ',')
      list.emplace_back();
    else if (*text != ' ')
      list.back() += *text;
  return list;
}

#define QTB_TEXT(...) #__VA_ARGS__
#define QTB_ARGS_TEXT(...) QTB_TEXT(__VA_ARGS__)

struct FrontEnd {
  const char *name;
  QtbInt min_n;
  bool pair;
  void (*call)(const Call &arguments);
};

#define QTB_FRONT_END(name, shape, min_n, pair) \
  {#name, min_n, pair,                          \
   [](const Call &arguments) { call(#name, &qtb_blas_##name, names(QTB_ARGS_TEXT(QTB_ARGS(shape))), arguments); }},
const FrontEnd front_ends[] = {
#define QTB_LEVEL1_SIZED(name, shape, T, min_n, ...) QTB_FRONT_END(name, shape, min_n, false)
#define QTB_LEVEL1_PAIR(name, shape, T, min_n) QTB_FRONT_END(name, shape, min_n, true)
#include "blas/thread/32e/level1/xf_l1.def"
#undef QTB_LEVEL1_SIZED
#undef QTB_LEVEL1_PAIR
};

class Level1FrontEnds : public testing::Test {
 protected:
  void SetUp() override { world = World{}; }
};

TEST_F(Level1FrontEnds, ShortVectorGoesToTheSlotAndAsksNothing) {
  world.max_threads = 64;
  for (const FrontEnd &f : front_ends)
    for (const QtbInt n : {f.min_n - 1, QtbInt{1}, QtbInt{0}, QtbInt{-1}}) {
      f.call({n});
      EXPECT_EQ(world.reached, std::string("slot ") + f.name) << n;
      EXPECT_EQ(world.asked, "") << f.name << n;
    }
}

TEST_F(Level1FrontEnds, LongVectorGoesToTheDriverWithTheDecisionsThreads) {
  world.max_threads = 8;
  for (const FrontEnd &f : front_ends) {
    f.call({1000000, -2, 3});
    EXPECT_EQ(world.reached, std::string("driver ") + f.name);
    EXPECT_EQ(world.nthreads, f.pair ? 2 : 8) << f.name;
    EXPECT_EQ(world.asked, "tnd") << f.name;
    f.call({f.min_n});
    EXPECT_EQ(world.reached, std::string("driver ") + f.name);
    EXPECT_EQ(world.nthreads, f.pair ? 2 : 4) << f.name;
  }
}

TEST_F(Level1FrontEnds, TierSsse3ReadsTheCacheTable) {
  world.tier = tier_ssse3;
  world.max_threads = 3;
  for (const FrontEnd &f : front_ends) {
    f.call({1000000});
    EXPECT_EQ(world.reached, std::string("driver ") + f.name);
    EXPECT_EQ(world.nthreads, f.pair ? 2 : 3) << f.name;
    EXPECT_EQ(world.asked, f.pair ? "tnd" : "tndc") << f.name;
  }
}

TEST_F(Level1FrontEnds, OneThreadGoesToTheSlot) {
  for (const FrontEnd &f : front_ends) {
    f.call({1000000});
    EXPECT_EQ(world.reached, std::string("slot ") + f.name);
    EXPECT_EQ(world.asked, "tn") << f.name;
  }
}

TEST_F(Level1FrontEnds, OtherTiersGoToTheSlot) {
  world.max_threads = 64;
  for (const ProcessorTier tier : {tier_def, tier_sse3, tier_avx})
    for (const FrontEnd &f : front_ends) {
      world.tier = tier;
      f.call({1000000});
      EXPECT_EQ(world.reached, std::string("slot ") + f.name);
      EXPECT_EQ(world.asked, "t") << f.name;
    }
}

TEST_F(Level1FrontEnds, EitherZeroIncrementGoesToTheSlot) {
  world.max_threads = 64;
  for (const FrontEnd &f : front_ends)
    for (const auto &[incx, incy] : {std::pair<QtbInt, QtbInt>{0, 1}, {1, 0}, {0, 0}}) {
      f.call({1000000, incx, incy});
      EXPECT_EQ(world.reached, std::string("slot ") + f.name);
    }
}

TEST_F(Level1FrontEnds, DynamicModeOffTakesAllThreadsAndThePairRoutinesNone) {
  world.max_threads = 64;
  world.dynamic = 0;
  for (const FrontEnd &f : front_ends) {
    f.call({f.min_n});
    EXPECT_EQ(world.reached, std::string(f.pair ? "slot " : "driver ") + f.name);
    EXPECT_EQ(world.nthreads, f.pair ? 0 : 64) << f.name;
  }
}

}  // namespace
