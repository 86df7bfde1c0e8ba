// The strategy and plan that a GEMM's team takes: a table to be read beside the rules, a sweep over teams, classes and
// extents against a second transcription of them, and that a plan depends on nothing but what it is for.
//
// The selectors run between stand-ins: every dispatch slot and every strategy is a routine of this program, which a
// plan is compared by; the block queries among them note the question and answer with numbers of their own. Nothing
// here knows or asks the processor.

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cstdio>
#include <cstring>
#include <map>
#include <random>
#include <set>
#include <string>
#include <tuple>
#include <vector>

#include "blas/dispatch/slots.h"
#include "blas/thread/32e/level3/gemm_select.h"
#include "blas/thread/32e/level3/gemm_strategies.h"
#include "tests/support/together.h"
#include "tests/thread/gemm_rules.h"
#include "tests/thread/gemm_select_table.h"

namespace {

using namespace qtb::test;

// ---- The stand-ins ----

struct BlockQuery {
  const void *slot;  // the address of the routine that was asked
  QtbInt m, n, k, mb, nb, kb;
};
thread_local int query_count = 0;
thread_local BlockQuery query;
thread_local QtbInt answered_mu = 0;
constexpr QtbInt answered_block = 77, answered_nu = 6, answered_ku = 12;

template <class R, class... A>
struct StandIn {
  static R answer(const void *, A...) { return R(); }
};
template <class... A>
struct StandIn<void, A...> {
  static void answer(const void *, A...) { ADD_FAILURE() << "a selector calls no routine but a block query"; }
};
template <>
struct StandIn<void, const QtbInt *, const QtbInt *, const QtbInt *, QtbInt *, QtbInt *, QtbInt *, QtbInt *, QtbInt *,
               QtbInt *> {
  static void answer(const void *slot, const QtbInt *m, const QtbInt *n, const QtbInt *k, QtbInt *mb, QtbInt *nb,
                     QtbInt *kb, QtbInt *mu, QtbInt *nu, QtbInt *ku) {
    ++query_count;
    query = {slot, *m, *n, *k, *mb, *nb, *kb};
    for (QtbInt *block : {mb, nb, kb})
      if (*block == 0) *block = answered_block;
    *mu = answered_mu;
    *nu = answered_nu;
    *ku = answered_ku;
  }
};
template <class R, class... A>
StandIn<R, A...> stand_in_for(R (*)(A...));

}  // namespace

extern "C" {
// Each notes an address of its own, or a linker might fold them into one.
#define QTB_SLOT(name, shape, T, tiers)                                                                         \
  QTB_FUNCTION(shape, T, qtb_blas_x##name) {                                                                    \
    return decltype(stand_in_for(&qtb_blas_x##name))::answer(reinterpret_cast<const void *>(&qtb_blas_x##name), \
                                                             QTB_ARGS(shape));                                  \
  }
#include "blas/dispatch/slots.def"
#undef QTB_SLOT
#define QTB_STRATEGY(name, T)                                                                          \
  void qtb_blas_##name(QTB_PARAMS_GEMM_STRATEGY(T)) {                                                  \
    decltype(stand_in_for(&qtb_blas_##name))::answer(reinterpret_cast<const void *>(&qtb_blas_##name), \
                                                     QTB_ARGS_GEMM_STRATEGY);                          \
  }
QTB_FOR_EACH_GEMM_STRATEGY(QTB_STRATEGY)
#undef QTB_STRATEGY
}

namespace {

// ---- A plan's routines by name ----

struct Routine {
  const void *address;
  unsigned tiers;  // that have it, as a set of tier bits
};

// Null for a name that no routine has.
const Routine *routine(const std::string &name) {
  using namespace qtb::tier_set;
  static const std::map<std::string, Routine> all = {{"", {nullptr, ALL}},
#define QTB_SLOT(name, shape, T, tiers) {#name, {reinterpret_cast<const void *>(&qtb_blas_x##name), tiers}},
#include "blas/dispatch/slots.def"
#undef QTB_SLOT
#define QTB_STRATEGY(name, T) {#name, {reinterpret_cast<const void *>(&qtb_blas_##name), ALL}},
                                                     QTB_FOR_EACH_GEMM_STRATEGY(QTB_STRATEGY)
#undef QTB_STRATEGY
  };
  const auto found = all.find(name);
  return found == all.end() ? nullptr : &found->second;
}

// The routines that a plan and its panel set hold.
struct Routines {
  const void *strategy, *kernel, *blocks, *acopy_n, *acopy_t, *acopy_c, *bcopy_n, *bcopy_t, *bcopy_c;
  bool operator==(const Routines &) const = default;
};

// What a kind of plan holds in a type.
struct KindInType {
  bool exists = true;  // the type has all of its routines
  Routines routines;
  unsigned tiers = ~0u;  // that have all of them
};

KindInType find_kind(char type, const KindRoutines &names) {
  KindInType found;
  const auto address = [&](std::string name, const char *form = "") -> const void * {
    if (name.empty()) return nullptr;
    name[0] = type;
    const Routine *r = routine(name + form);
    found.exists = found.exists && r != nullptr;
    if (r == nullptr) return nullptr;
    found.tiers &= r->tiers;
    return r->address;
  };
  // A conjugate transpose is a form of its own in complex types only.
  const bool three_forms = is_complex_type(type);
  found.routines = {
      address(names.strategy),    address(names.kernel),      address(names.blocks),
      address(names.acopy, "_n"), address(names.acopy, "_t"), three_forms ? address(names.acopy, "_c") : nullptr,
      address(names.bcopy, "_n"), address(names.bcopy, "_t"), three_forms ? address(names.bcopy, "_c") : nullptr};
  return found;
}

constexpr char types[] = {'s', 'd', 'c', 'z'};

const KindInType &kind_in_type(char type, Kind kind) {
  static const auto all = [] {
    std::array<std::array<KindInType, kind_count>, 128> table;
    for (const char t : types)
      for (std::size_t i = 0; i < kind_count; ++i)
        table[static_cast<std::size_t>(t)][i] = find_kind(t, kind_routines[i]);
    return table;
  }();
  return all[static_cast<std::size_t>(type)][kind];
}

// ---- One selection by the library ----

// The least rows of the register tiles that the block queries tell.
constexpr QtbInt tile_rows(char type) { return type == 's' ? 8 : type == 'z' ? 2 : 4; }

template <class T>
struct Selected {
  qtb::GemmPlan<T> plan;
  qtb::GemmPanelSet<T> panels;
};

void call_select(const Point &p, Selected<float> *s) { qtb_blas_sgemm_select(&p.m, &p.n, &p.k, &s->panels, &s->plan); }
void call_select(const Point &p, Selected<double> *s) { qtb_blas_dgemm_select(&p.m, &p.n, &p.k, &s->panels, &s->plan); }
void call_select(const Point &p, Selected<cfloat> *s) { qtb_blas_cgemm_select(&p.m, &p.n, &p.k, &s->panels, &s->plan); }
void call_select(const Point &p, Selected<cdouble> *s) {
  qtb_blas_zgemm_select(&p.m, &p.n, &p.k, &s->panels, &s->plan);
}

// Selects as a thread of a region does. *s is overwritten, padding and all.
template <class T>
void select(const Point &p, QtbInt mu, Selected<T> *s) {
  std::memset(static_cast<void *>(s), 0, sizeof *s);
  s->plan.nthreads = p.t;
  s->plan.machine_class = static_cast<qtb::GemmMachineClass>(p.machine_class);
  const std::uint32_t cache[cache_size_entries] = {p.cache_count, 32768, 262144, p.third_size, 0};
  std::copy(std::begin(cache), std::end(cache), s->plan.cache);
  query_count = 0;
  answered_mu = mu;
  call_select(p, s);
}

template <class R>
const void *address_of(R *routine) {
  return reinterpret_cast<const void *>(routine);
}

template <class T>
Routines routines_in(const Selected<T> &s) {
  const qtb::GemmPanelSet<T> &p = s.panels;
  return {address_of(s.plan.strategy),
          address_of(s.plan.kernel.gemm),
          address_of(p.blocks),
          address_of(p.acopy_n),
          address_of(p.acopy_t),
          is_complex<T> ? address_of(p.acopy_c) : nullptr,  // in real types nobody reads it
          address_of(p.bcopy_n),
          address_of(p.bcopy_t),
          is_complex<T> ? address_of(p.bcopy_c) : nullptr};
}

// What a block query makes of a preset size.
constexpr QtbInt filled_in(QtbInt preset) { return preset != 0 ? preset : answered_block; }

// Whether a selection is the outcome: the routines; team, grid, buffers; the block query asked once, with the preset
// sizes and the problem, and its answers kept; nothing else touched.
template <class T>
bool is_outcome(const Selected<T> &s, const Point &p, const Outcome &want) {
  const qtb::GemmPlan<T> &plan = s.plan;
  const KindInType &kind = kind_in_type(p.type, want.kind);
  if (!kind.exists || routines_in(s) != kind.routines) return false;
  const bool queried = kind.routines.blocks != nullptr;
  if (plan.nthreads != want.nthreads || plan.grid_rows != want.grid_rows || plan.grid_cols != want.grid_cols ||
      plan.a_buffers != want.a_buffers || plan.b_buffers != want.b_buffers || query_count != int(queried))
    return false;
  if (queried) {
    if (query.slot != kind.routines.blocks || query.m != p.m || query.n != p.n || query.k != p.k) return false;
    if (query.mb != want.mb || query.nb != want.nb || query.kb != want.kb) return false;
    if (plan.mb != filled_in(want.mb) || plan.nb != filled_in(want.nb) || plan.kb != filled_in(want.kb)) return false;
    if (s.panels.mu != answered_mu || s.panels.nu != answered_nu || s.panels.ku != answered_ku) return false;
  } else if (plan.mb != 0 || plan.nb != 0 || plan.kb != 0) {
    return false;
  }
  return plan.machine_class == p.machine_class && plan.cache[cache_count] == p.cache_count &&
         plan.cache[cache_third_size] == p.third_size && plan.acopy == nullptr && plan.bcopy == nullptr &&
         plan.a_shared == nullptr && plan.b_shared == nullptr && !plan.a_is_n && !plan.b_is_n && !plan.a_is_t &&
         !plan.b_is_t && s.panels.a_panel_bytes == 0 && s.panels.b_panel_bytes == 0;
}

std::string text(const Point &p) {
  char buffer[160];
  std::snprintf(buffer, sizeof buffer, "%c class %d t %ld m %ld n %ld k %ld third %u of %u", p.type, p.machine_class,
                long(p.t), long(p.m), long(p.n), long(p.k), p.third_size, p.cache_count);
  return buffer;
}

std::string text(const Outcome &o) {
  char buffer[160];
  std::snprintf(buffer, sizeof buffer, "%s t %ld grid %ld x %ld blocks %ld %ld %ld panels %d %d",
                kind_routines[o.kind].name, long(o.nthreads), long(o.grid_rows), long(o.grid_cols), long(o.mb),
                long(o.nb), long(o.kb), o.a_buffers, o.b_buffers);
  return buffer;
}

// What was selected, in the words of an outcome: the first kind that has the strategy and the kernel.
template <class T>
std::string text(const Selected<T> &s, char type) {
  const Routines found = routines_in(s);
  const qtb::GemmPlan<T> &plan = s.plan;
  for (int i = 0; i < kind_count; ++i) {
    const Routines &own = kind_in_type(type, Kind(i)).routines;
    if (own.strategy == found.strategy && own.kernel == found.kernel)
      return text(Outcome{Kind(i), plan.nthreads, plan.grid_rows, plan.grid_cols, plan.mb, plan.nb, plan.kb,
                          plan.a_buffers, plan.b_buffers}) +
             (own == found ? "" : " with other routines") + " queries " + std::to_string(query_count);
  }
  return "no known strategy and kernel";
}

// Calls use(Selected<T> *) for the type that a letter names.
template <class Use>
auto with_type(char type, Use use) {
  static thread_local Selected<float> s;
  static thread_local Selected<double> d;
  static thread_local Selected<cfloat> c;
  static thread_local Selected<cdouble> z;
  switch (type) {
    case 's': return use(&s);
    case 'd': return use(&d);
    case 'c': return use(&c);
    default: return use(&z);
  }
}

::testing::AssertionResult selects(const Point &p, const Outcome &want) {
  return with_type(p.type, [&](auto *s) -> ::testing::AssertionResult {
    select(p, tile_rows(p.type), s);
    if (is_outcome(*s, p, want)) return ::testing::AssertionSuccess();
    return ::testing::AssertionFailure() << text(p) << ": " << text(*s, p.type) << ", not " << text(want);
  });
}

// ---- The table ----

// use(point, outcome) for each point of the table.
template <class Use>
void for_each_point(Use use) {
  for (const Section &section : select_table)
    for (const char *type = section.types; *type != 0; ++type)
      for (const int machine_class : section.classes)
        for (const Row &r : section.rows)
          use(Point{*type, machine_class, r.t, r.m, r.n, r.k, section.cache_count, section.third_size}, r.outcome);
}

TEST(GemmSelectTable, EveryPointByHand) {
  long points = 0, rows = 0;
  for (const Section &section : select_table) rows += long(section.rows.size());
  for_each_point([&](const Point &p, const Outcome &want) {
    EXPECT_TRUE(selects(p, want));
    EXPECT_EQ(expected(p), want) << text(p) << ": " << text(expected(p)) << " by the transcription";
    ++points;
  });
  std::printf("rows %ld, points %ld\n", rows, points);
}

// Threads select at the same time, each for itself, twice.
TEST(GemmSelectTable, EveryThreadSelectsTheSamePlan) {
  std::vector<Point> points;
  for_each_point([&](const Point &p, const Outcome &) { points.push_back(p); });
  constexpr int thread_count = 4;
  std::vector<std::string> plans[thread_count];
  on_threads(thread_count, [&](int i) {
    for (int round = 0; round < 2; ++round)
      for (const Point &p : points)
        with_type(p.type, [&](auto *s) {
          select(p, tile_rows(p.type), s);
          plans[i].emplace_back(reinterpret_cast<const char *>(s), sizeof *s);
        });
  });
  for (int i = 0; i < thread_count; ++i)
    for (std::size_t j = 0; j < plans[i].size(); ++j)
      ASSERT_EQ(plans[i][j], plans[0][j % points.size()]) << text(points[j % points.size()]);
}

// ---- What each class and type may come to ----

struct Reach {
  const char *types;
  std::vector<int> classes;
  std::set<std::string> outcomes;  // "kind", "kind shape" with a grid, "kind mb" with a preset block of rows
};
// clang-format off
const Reach reaches[] = {
  {"sdcz", {0, 5},  {"row", "col"}},
  {"scz",  {6},     {"row", "col"}},
  {"d",    {6},     {"grid_fa 1xt", "grid_fa 2xt/2", "grid_fa 4xt/4", "grid_fa tx1",
                     "grid_fb 1xt", "grid_fb 2xt/2", "grid_fb 4xt/4", "grid_fb tx1"}},
  {"d",    {1},     {"grid_t 2xt/2", "bcopy_1d 512"}},
  {"s",    {1},     {"grid_t 2xt/2"}},
  {"cz",   {1},     {"bcopy 2xt/2"}},
  {"d",    {3},     {"row", "col", "grid_t 1xt", "grid_t 2xt/2", "grid_t tx1", "acopy 2xt/2 384", "acopy 2xt/2 1000",
                     "acopy 4xt/4 384", "acopy 4xt/4 1000"}},
  {"s",    {3},     {"grid_t 1xt", "grid_t 2xt/2", "grid_t tx1"}},
  {"cz",   {3},     {"row", "col", "bcopy 2xt/2"}},
  {"d",    {2},     {"grid_41 1xt", "grid_41 2xt/2", "grid_41 tx1", "abcopy 704", "abcopy 1024"}},
  {"d",    {4},     {"row", "col", "grid_41 1xt", "grid_41 2xt/2", "grid_41 tx1", "abcopy 448", "xgemm 2xt/2 200"}},
  {"s",    {2},     {"grid_41 1xt", "grid_41 2xt/2", "grid_41 tx1", "abcopy 1024"}},
  {"s",    {4},     {"grid_41 1xt", "grid_41 2xt/2", "grid_41 tx1", "abcopy 1024", "xgemm 2xt/2 200"}},
  {"c",    {2},     {"bcopy_41 2xt/2", "abcopy 1024"}},
  {"c",    {4},     {"bcopy_41 2xt/2", "abcopy 448"}},
  {"z",    {2},     {"bcopy_41 2xt/2", "abcopy 512"}},
  {"z",    {4},     {"bcopy_41 2xt/2", "abcopy 256"}},
};
// clang-format on

const std::set<std::string> &reach_of(char type, int machine_class) {
  for (const Reach &r : reaches)
    if (std::strchr(r.types, type) != nullptr &&
        std::find(r.classes.begin(), r.classes.end(), machine_class) != r.classes.end())
      return r.outcomes;
  std::abort();
}

// An outcome but for the size of its team. A small team's grid may have the shape of two rules; it counts as the first.
enum Shape { no_grid, one_row, two_rows, one_column, four_rows };
struct Label {
  Kind kind;
  Shape shape;
  Int mb;
  auto operator<=>(const Label &) const = default;
};

Label label(const Outcome &o) {
  const Shape shape = o.grid_rows == 0   ? no_grid
                      : o.grid_rows == 1 ? one_row
                      : o.grid_rows == 2 ? two_rows
                      : o.grid_cols == 1 ? one_column
                                         : four_rows;
  return {o.kind, shape, o.mb};
}

std::string text(const Label &l) {
  static const char *const shapes[] = {"", " 1xt", " 2xt/2", " tx1", " 4xt/4"};
  return std::string(kind_routines[l.kind].name) + shapes[l.shape] + (l.mb != 0 ? " " + std::to_string(l.mb) : "");
}

TEST(GemmSelectTable, EveryOutcomeOfEveryClassAndTypeIsInTheTable) {
  std::map<std::pair<char, int>, std::set<std::string>> found;
  for_each_point([&](const Point &p, const Outcome &o) { found[{p.type, p.machine_class}].insert(text(label(o))); });
  for (const char type : types)
    for (int machine_class = 0; machine_class < qtb::machine_class_count; ++machine_class)
      EXPECT_EQ((found[{type, machine_class}]), reach_of(type, machine_class)) << type << machine_class;
}

// The tiers that a class is of.
unsigned tiers_of(int machine_class) {
  using namespace qtb::tier_set;
  const unsigned tiers[qtb::machine_class_count] = {DEF | SSE3, SSSE3, SSSE3, SSE42, SSSE3, AVX, DEF};
  return tiers[machine_class];
}

// Slots of other tiers hold an empty routine.
TEST(GemmSelectTable, TheTiersOfAClassHaveTheRoutinesThatItSelects) {
  for_each_point([&](const Point &p, const Outcome &o) {
    const KindInType &kind = kind_in_type(p.type, o.kind);
    ASSERT_TRUE(kind.exists) << text(p);
    ASSERT_EQ(kind.tiers & tiers_of(p.machine_class), tiers_of(p.machine_class)) << text(p) << ' ' << text(o);
  });
}

// ---- The sweep ----

// Positive numbers one below, at and one above each limit, without repetition.
std::vector<Int> around(const std::vector<Int> &limits) {
  std::set<Int> all;
  for (const Int limit : limits)
    for (const Int v : {limit - 1, limit, limit + 1})
      if (v > 0) all.insert(v);
  return {all.begin(), all.end()};
}

// Every number that a rule compares an extent with, and some beyond.
const std::vector<Int> m_limits = {6,    100,  200,  256,  400,  500,  512,  600,  700,   800,   1000,
                                   1200, 2048, 4700, 4800, 5000, 5400, 7000, 8000, 10000, 14000, 15000};
const std::vector<Int> n_limits = {1,    100,  128,  400,  500,  512,  600,  700,  800,
                                   1000, 1200, 2000, 2048, 3000, 4000, 5000, 10000};
const std::vector<Int> k_limits = {5, 120, 128, 150, 200, 256, 400, 512, 2000};

std::vector<Int> joined(std::vector<Int> a, const std::vector<Int> &b) {
  a.insert(a.end(), b.begin(), b.end());
  return a;
}

// Points of one type and class. Stops at the first failure.
struct Sweep {
  char type;
  int machine_class;
  long points = 0;
  std::map<Label, long> outcomes = {};

  void at(Int t, Int m, Int n, Int k, std::uint32_t cache_count = 3, std::uint32_t third_size = 8u << 20) {
    const Point p{type, machine_class, t, m, n, k, cache_count, third_size};
    const Outcome want = expected(p);
    with_type(type, [&](auto *s) {
      select(p, tile_rows(type), s);
      if (!is_outcome(*s, p, want)) FAIL() << text(p) << ": " << text(*s, type) << ", not " << text(want);
    });
    ++points;
    ++outcomes[label(want)];
  }

  // Every combination of limits for a team, or one in so many of them.
  void team(Int t, std::mt19937_64 *bits, std::uint64_t one_in) {
    for (const Int m : around(joined(m_limits, {32 * t}))) {
      if (testing::Test::HasFailure()) return;
      // Where the quotients of m and n, t and the columns of a grid meet a limit.
      const std::vector<Int> ns = around(joined(n_limits, {m / 4, m / 2, m, 2 * m, m / t, m * t, m * (t - t % 2),
                                                           16 * t, 384, 385 * t, 385 * (t / 2), 385 * (t / 4)}));
      for (const Int n : ns)
        for (const Int k : around(joined(k_limits, {2 * m, 5 * n})))
          if (one_in == 1 || (*bits)() % one_in == 0) at(t, m, n, k);
    }
  }
};

class GemmSelectSweep : public testing::TestWithParam<std::tuple<char, int>> {};
INSTANTIATE_TEST_SUITE_P(All, GemmSelectSweep, testing::Combine(testing::ValuesIn(types), testing::Range(0, 7)),
                         [](const auto &info) {
                           return std::string(1, std::get<0>(info.param)) + "_class" +
                                  std::to_string(std::get<1>(info.param));
                         });

TEST_P(GemmSelectSweep, MatchesTheTranscriptionAndReachesEveryOutcome) {
  const auto [type, machine_class] = GetParam();
  Sweep sweep{type, machine_class};
  std::mt19937_64 bits(20241103);
  const bool one_rule = machine_class == 0 || machine_class == 5;
  const std::set<Int> whole = {2, 3, 4, 5, 7, 8, 9, 12, 16, 24, 25, 64};
  // A team of one is no team, but where the rules allow for any.
  const bool any_team = one_rule || machine_class == 6;
  for (Int t = any_team ? 1 : 2; t <= 64; ++t) sweep.team(t, &bits, one_rule || whole.count(t) == 0 ? 20 : 1);
  for (const std::uint32_t count : {0u, 1u, 2u, 3u, 4u})
    for (const std::uint32_t third : {0u, 4194303u, 4194304u, 4194305u, 4294967295u})
      for (const Int t : {2, 8, 10, 24})
        for (const Int m : {512, 1500, 2500})
          for (const Int k : {100, 500}) sweep.at(t, m, 1500, k, count, third);

  std::set<std::string> reached;
  std::printf("%c class %d: %ld points;", type, machine_class, sweep.points);
  for (const auto &[outcome, count] : sweep.outcomes) {
    reached.insert(text(outcome));
    std::printf(" %s %ld;", text(outcome).c_str(), count);
  }
  std::printf("\n");
  EXPECT_EQ(reached, reach_of(type, machine_class));
}

// ---- Teams of hundreds ----

// A cut by rows leaves each thread a register tile at least; a team too large for that takes slabs of rows or columns.
TEST(GemmSelectLargeTeams, ACutByRowsLeavesEachThreadATile) {
  long cuts = 0, slabs = 0;
  for (const char type : types)
    for (const int machine_class : {2, 4})
      for (Int t = 2; t <= 700; ++t)
        for (const Int m : around({16 * t, 8 * t, 4 * t, 2 * t, 700, 800, 1000, 2048, 7000}))
          for (const Int n : around({600, 1000, 2048, m}))
            for (const Int mu : {1, 2, 4, 8, 16}) {
              const Point p{type, machine_class, t, m, n, 512};
              const Outcome chosen = expected(p);
              if (chosen.kind != k_abcopy) continue;
              with_type(type, [&](auto *s) {
                select(p, mu, s);
                if (m >= chosen.nthreads * mu) {
                  ASSERT_TRUE(is_outcome(*s, p, chosen)) << text(p) << " mu " << mu << ": " << text(*s, type);
                  ++cuts;
                  return;
                }
                const Routines found = routines_in(*s), &want = kind_in_type(type, m > n ? k_row : k_col).routines;
                ASSERT_EQ(found.strategy, want.strategy) << text(p) << " mu " << mu << ": " << text(*s, type);
                ASSERT_EQ(found.kernel, want.kernel) << text(p);
                ASSERT_EQ(s->plan.nthreads, chosen.nthreads) << text(p);
                ASSERT_EQ(s->plan.a_buffers + s->plan.b_buffers, 0) << text(p);
                ++slabs;
              });
              if (HasFatalFailure()) return;
            }
  std::printf("cuts by rows %ld, slabs instead %ld\n", cuts, slabs);
  EXPECT_GT(cuts, 0);
  EXPECT_GT(slabs, 0);
}

}  // namespace
