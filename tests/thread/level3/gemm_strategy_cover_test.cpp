// The partition strategies of a parallel GEMM, each on its own, on real teams with a plan made by hand: who packs what
// to which place, who computes what from which place, and what barriers lie between.
//
// Packing routines and kernels are the test's own. An element of A or B is its number; a packing routine puts the
// numbers into the panel, and a kernel looks whether the panel holds the numbers of the tile that it is told to
// compute. What each thread did is compared, step by step, with a second statement of the strategies (the model), and,
// apart from it, every element of C has to be covered once for every step of k. Threads are held up at random places,
// so that one that a barrier does not stop runs ahead.
//
// One file, since the stand-ins, what they record and the checks of it are of one piece, and each edge is two lines.

#include <gtest/gtest.h>
#include <omp.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <map>
#include <mutex>
#include <random>
#include <string>
#include <thread>
#include <vector>

#include "blas/thread/32e/level3/gemm_strategies.h"
#include "tests/thread/level3/gemm_strategy_model.h"
#include "tests/thread/recorded_memory.h"
#include "tests/thread/stand_ins.h"

QTB_RECORDED_MEMORY_SERVICE

namespace qtb::test {
namespace {

using namespace gemm_model;

// The request number which that this thread has made in this run.
MemoryRequest own_request(std::size_t which) {
  const std::lock_guard guard(recorded_memory_mutex);
  for (const MemoryRequest &request : recorded_memory.requests)
    if (request.thread == omp_get_thread_num() && which-- == 0) return request;
  return {};
}

// ---- What the threads did ----

struct Event {
  Step step;
  long begin, end;  // places in the order of all events
};

constexpr int most_threads = 64;
std::atomic<long> clock_of_events{0};
std::vector<Event> events[most_threads];
std::uint64_t delays[most_threads];  // the state of each thread's random numbers
std::atomic<int> faults{0};
std::mutex fault_mutex;
std::string first_fault;

void fault(const std::string &what) {
  if (faults++ > 0) return;
  const std::lock_guard guard(fault_mutex);
  first_fault = "thread " + std::to_string(omp_get_thread_num()) + ": " + what;
}

std::uint64_t next_random(std::uint64_t &state) {
  state ^= state << 13;
  state ^= state >> 7;
  return state ^= state << 17;
}

// Now and then a thread falls behind.
void dawdle() {
  const std::uint64_t draw = next_random(delays[omp_get_thread_num()]) >> 20;
  if (draw % 4 == 0) std::this_thread::yield();
  if (draw % 16 == 1) std::this_thread::sleep_for(std::chrono::microseconds(30 + draw / 16 % 4 * 100));
}

// ---- One problem, whose elements are numbers ----

template <class T>
T element(std::int64_t id) {
  if constexpr (is_complex<T>)
    return {static_cast<Real<T>>(id), static_cast<Real<T>>(-id)};
  else
    return static_cast<T>(id);
}
template <class T>
bool is_element(const T &v, std::int64_t id) {
  const T want = element<T>(id);
  return std::memcmp(&v, &want, sizeof(T)) == 0;
}

template <class T>
struct Problem {
  Setting set;
  char transa, transb;
  bool a_is_n, b_is_n;
  QtbInt lda, ldb, ldc;
  T alpha, beta;
  std::vector<T> a, b, c;
  std::vector<unsigned char> covered;  // per element of C and step of k, how often
  std::vector<unsigned char> shared;   // panels
  T *panels = nullptr;                 // the shared panels' first element
  bool own_panels = false, beta_passes = false, empty_calls_inside = false;
  bool stalls = false;  // thread 0 waits in its kernel until all others have returned
  int team = 0;
  std::atomic<int> returned{0};
};

template <class T>
Problem<T> *current = nullptr;

std::int64_t id_of_a(const Setting &s, QtbInt row, QtbInt depth) { return 1 + row * s.k + depth; }
std::int64_t id_of_b(const Setting &s, QtbInt depth, QtbInt col) { return 2 + s.m * s.k + col * s.k + depth; }

struct Position {
  QtbInt row, col;
};
// Where an address lies in a column-major array of so many rows and columns.
template <class T>
Position position(const T *p, const std::vector<T> &array, QtbInt ld, QtbInt rows, QtbInt cols, const char *name) {
  const QtbInt offset = p - array.data();
  const Position at{offset % ld, offset / ld};
  if (offset < 0 || at.row >= rows || at.col >= cols) fault(std::string("an address outside ") + name);
  return at;
}
template <class T>
Position position_in_a(const Problem<T> &p, const T *tile) {
  if (p.a_is_n) return position(tile, p.a, p.lda, p.set.m, p.set.k, "A");
  const Position at = position(tile, p.a, p.lda, p.set.k, p.set.m, "A");
  return {at.col, at.row};
}
// row is the depth.
template <class T>
Position position_in_b(const Problem<T> &p, const T *tile) {
  if (p.b_is_n) return position(tile, p.b, p.ldb, p.set.k, p.set.n, "B");
  const Position at = position(tile, p.b, p.ldb, p.set.n, p.set.k, "B");
  return {at.col, at.row};
}

// The offset in bytes of an address in the shared panels, or in this thread's own panel number which.
template <class T>
std::int64_t place_of(const Problem<T> &p, const T *panel, std::size_t which) {
  if (!p.own_panels) return (panel - p.panels) * static_cast<std::int64_t>(sizeof(T));
  const auto address = reinterpret_cast<std::uintptr_t>(own_request(which).given);
  if (address == 0) return fault("a panel that was not asked for"), 0;
  return static_cast<std::int64_t>(reinterpret_cast<std::uintptr_t>(panel) - (address + 4095) / 4096 * 4096);
}

class Recorded {
 public:
  explicit Recorded(const Step &step) : index_(events[omp_get_thread_num()].size()) {
    events[omp_get_thread_num()].push_back({step, ++clock_of_events, 0});
    dawdle();
  }
  ~Recorded() {
    dawdle();
    events[omp_get_thread_num()][index_].end = ++clock_of_events;
  }
  Recorded(const Recorded &) = delete;
  Recorded &operator=(const Recorded &) = delete;

 private:
  std::size_t index_;
};

// ---- Packing ----

// Strips of mu rows, step of k by step, filled up to a whole strip and to a multiple of ku.
template <class T>
void pack_a(QTB_PARAMS_panel_copy(T)) {
  Problem<T> &p = *current<T>;
  if (*rows <= 0 || *cols <= 0) return;
  const Position at = position_in_a(p, src);
  const Recorded recorded(Step{Action::pack_a, at.row, *rows, 0, 0, at.col, *cols, place_of(p, dst, 0), *ldp, 0});
  if (*ld != p.lda) fault("not A's leading dimension");
  if (std::memcmp(alpha, &p.alpha, sizeof(T)) != 0) fault("alpha lost on its way to the packing of A");
  const QtbInt mu = p.set.mu;
  for (QtbInt i = 0; i < up(*rows, mu); ++i)
    for (QtbInt d = 0; d < up(*cols, p.set.ku); ++d) {
      const bool real = i < *rows && d < *cols;
      dst[i / mu * *ldp + d * mu + i % mu] = !real ? T{} : p.a_is_n ? src[i + d * *ld] : src[d + i * *ld];
    }
}

template <class T>
void pack_b(QTB_PARAMS_panel_copy(T)) {
  (void)alpha;
  Problem<T> &p = *current<T>;
  if (*rows <= 0 || *cols <= 0) return;
  const Position at = position_in_b(p, src);
  const Recorded recorded(Step{Action::pack_b, 0, 0, at.col, *cols, at.row, *rows, place_of(p, dst, 1), *ldp, 0});
  if (*ld != p.ldb) fault("not B's leading dimension");
  const QtbInt nu = p.set.nu;
  for (QtbInt j = 0; j < up(*cols, nu); ++j)
    for (QtbInt d = 0; d < up(*rows, p.set.ku); ++d) {
      const bool real = j < *cols && d < *rows;
      dst[j / nu * *ldp + d * nu + j % nu] = !real ? T{} : p.b_is_n ? src[d + j * *ld] : src[j + d * *ld];
    }
}

// ---- Kernels ----

template <class T>
struct Tile {
  const char *transa, *transb;
  QtbInt rows, cols, depths;
  const T *alpha, *a, *b, *beta;
  const T *c;
  QtbInt lda, ldb, ldc;
};
#define QTB_TILE \
  { transa, transb, *m, *n, *k, alpha, a, b, beta, c, *lda, *ldb, *ldc }

template <class T>
void check_strips(const Problem<T> &p, const T *panel, QtbInt ld, QtbInt unit, QtbInt count, QtbInt depths,
                  std::int64_t first_id, const char *name) {
  for (QtbInt i = 0; i < count; ++i)
    for (QtbInt d = 0; d < depths; ++d)
      if (!is_element(panel[i / unit * ld + d * unit + i % unit], first_id + i * p.set.k + d))
        return fault(std::string("the panel of ") + name + " does not hold the tile");
}

// What is common to the kernels. The tile is where it is said to be, once and by one thread.
template <class T>
void compute(const Tile<T> &tile, const T *ap, QtbInt ldap, const T *bp, QtbInt ldbp) {
  Problem<T> &p = *current<T>;
  const Setting &s = p.set;
  if (tile.rows <= 0 || tile.cols <= 0 || tile.depths <= 0) {
    if (p.empty_calls_inside) {
      position(tile.c, p.c, p.ldc, s.m, s.n, "C");
      position_in_a(p, tile.a);
      position_in_b(p, tile.b);
    }
    return;
  }
  const Position at = position(tile.c, p.c, p.ldc, s.m, s.n, "C");
  const Position in_a = position_in_a(p, tile.a), in_b = position_in_b(p, tile.b);
  const QtbInt depth = in_a.col;
  const T *const panel = ap != nullptr ? ap : bp;
  const Recorded recorded(Step{Action::compute, at.row, tile.rows, at.col, tile.cols, depth, tile.depths,
                               panel == nullptr ? -1 : place_of(p, panel, ap != nullptr ? 0 : 1),
                               ap != nullptr ? ldap : ldbp, 0});
  if (in_a.row != at.row) fault("the rows of A are not those of C");
  if (in_b.col != at.col) fault("the columns of B are not those of C");
  if (in_b.row != depth) fault("A and B differ in depth");
  if (at.row + tile.rows > s.m || at.col + tile.cols > s.n || depth + tile.depths > s.k)
    return fault("a tile too large");
  if (tile.lda != p.lda || tile.ldb != p.ldb || tile.ldc != p.ldc) fault("a leading dimension is lost");
  if (*tile.transa != p.transa || *tile.transb != p.transb) fault("an option letter is lost");
  if (std::memcmp(tile.alpha, &p.alpha, sizeof(T)) != 0) fault("alpha is lost");
  const T beta = p.beta_passes ? p.beta : gemm_one<T>;
  if (std::memcmp(tile.beta, &beta, sizeof(T)) != 0) fault("not the beta of this strategy");
  if (ap != nullptr) check_strips(p, ap, ldap, s.mu, tile.rows, tile.depths, id_of_a(s, at.row, depth), "A");
  if (bp != nullptr) check_strips(p, bp, ldbp, s.nu, tile.cols, tile.depths, id_of_b(s, depth, at.col), "B");
  if (ap != nullptr && bp != nullptr) {
    if (ldbp != s.nu * up(tile.depths, s.ku)) fault("not the stride of the packed B");
    if (place_of(p, bp, 1) != 0) fault("not this thread's own packed B");
  }
  for (QtbInt j = at.col; j < at.col + tile.cols; ++j)
    for (QtbInt i = at.row; i < at.row + tile.rows; ++i)
      for (QtbInt d = depth; d < depth + tile.depths; ++d)
        ++p.covered[static_cast<std::size_t>((j * s.m + i) * s.k + d)];
  if (p.stalls && omp_get_thread_num() == 0)
    for (int tries = 0; p.returned < p.team - 1; ++tries) {
      if (tries == 20000) return fault("the other threads wait for this one");
      std::this_thread::sleep_for(std::chrono::microseconds(100));
    }
}

template <class T>
void kernel_gemm(QTB_PARAMS_gemm(T)) {
  compute<T>(QTB_TILE, nullptr, 0, nullptr, 0);
}
template <class T>
void kernel_bpacked(QTB_PARAMS_gemm_bpacked(T)) {
  compute<T>(QTB_TILE, nullptr, 0, bp, *ldbp);
}
template <class T>
void kernel_apacked(QTB_PARAMS_gemm_apacked(T)) {
  compute<T>(QTB_TILE, ap, *ldap, nullptr, 0);
}
template <class T>
void kernel_packed(QTB_PARAMS_gemm_packed(T)) {
  compute<T>(QTB_TILE, ap, *ldap, bp, *ldbp);
}

// ---- The strategies ----

enum class Kind { row, col, shared_b, grid, xgemm, acopy, bcopy, abcopy };

Schedule schedule_of(Kind kind, const Setting &s) {
  switch (kind) {
    case Kind::row: return rows_of_c(s);
    case Kind::col: return columns_of_c(s);
    case Kind::shared_b: return shared_b_rows(s);
    case Kind::grid: return tiles(s);
    case Kind::xgemm: return tiles_in_blocks(s);
    case Kind::acopy: return shared_a(s);
    case Kind::bcopy: return shared_b_pairs(s);
    case Kind::abcopy: return own_a_and_b(s);
  }
  return {};
}

template <class T>
struct Strategy {
  const char *name;
  Kind kind;
  GemmStrategy<T> *run;
};

template <class T>
GemmKernel<T> kernel_of(Kind kind) {
  GemmKernel<T> kernel{};
  switch (kind) {
    case Kind::shared_b:
    case Kind::bcopy: kernel.bpacked = &kernel_bpacked<T>; break;
    case Kind::acopy: kernel.apacked = &kernel_apacked<T>; break;
    case Kind::abcopy: kernel.packed = &kernel_packed<T>; break;
    default: kernel.gemm = &kernel_gemm<T>; break;
  }
  return kernel;
}

// ---- One run, checked ----

constexpr char letters[] = {'N', 'T', 'C', 'n', 't', 'c'};

template <class T>
void prepare(Problem<T> &p, Kind kind, const Setting &set, int team, std::uint64_t seed) {
  p.set = set;
  p.team = team;
  p.transa = letters[seed % 6];
  p.transb = letters[seed / 6 % 6];
  p.a_is_n = p.transa == 'N' || p.transa == 'n';
  p.b_is_n = p.transb == 'N' || p.transb == 'n';
  p.lda = (p.a_is_n ? set.m : set.k) + 1;
  p.ldb = (p.b_is_n ? set.k : set.n) + 2;
  p.ldc = set.m + 3;
  p.alpha = element<T>(7);
  p.beta = element<T>(5);
  p.own_panels = kind == Kind::abcopy;
  p.beta_passes = kind == Kind::row || kind == Kind::col || kind == Kind::grid;
  p.empty_calls_inside = kind == Kind::row || kind == Kind::col;
  p.a.assign(static_cast<std::size_t>(p.lda * (p.a_is_n ? set.k : set.m)), T{});
  p.b.assign(static_cast<std::size_t>(p.ldb * (p.b_is_n ? set.n : set.k)), T{});
  p.c.assign(static_cast<std::size_t>(p.ldc * set.n), T{});
  for (QtbInt d = 0; d < set.k; ++d) {
    for (QtbInt i = 0; i < set.m; ++i)
      p.a[static_cast<std::size_t>(p.a_is_n ? i + d * p.lda : d + i * p.lda)] = element<T>(id_of_a(set, i, d));
    for (QtbInt j = 0; j < set.n; ++j)
      p.b[static_cast<std::size_t>(p.b_is_n ? d + j * p.ldb : j + d * p.ldb)] = element<T>(id_of_b(set, d, j));
  }
  p.covered.assign(static_cast<std::size_t>(set.m * set.n * set.k), 0);
  for (int i = 0; i < most_threads; ++i) {
    events[i].clear();
    delays[i] = (seed + 1) * 0x9E3779B97F4A7C15U + static_cast<std::uint64_t>(i) * 0xBF58476D1CE4E5B9U + 1;
  }
  recorded_memory.forget();
  stand_ins.recording = false;
  // What a thread without memory falls back to.
  stand_ins.behind[slot_sgemm] = code_pointer(&kernel_gemm<float>);
  stand_ins.behind[slot_dgemm] = code_pointer(&kernel_gemm<double>);
  stand_ins.behind[slot_cgemm] = code_pointer(&kernel_gemm<cfloat>);
  stand_ins.behind[slot_zgemm] = code_pointer(&kernel_gemm<cdouble>);
  faults = 0;
  first_fault.clear();
}

// The strategy on a team. Returns the places of the threads' returns in the order of events, and the last event's.
struct Returns {
  long first_return, last_event;
};
template <class T>
Returns run(Problem<T> &p, const Strategy<T> &strategy) {
  const Setting &s = p.set;
  GemmPlan<T> plan{};
  GemmPanelSet<T> panel_set{};
  plan.nthreads = s.t;
  plan.grid_rows = s.r;
  plan.grid_cols = s.c;
  plan.mb = s.mb, plan.nb = s.nb, plan.kb = s.kb;
  plan.kernel = kernel_of<T>(strategy.kind);
  plan.strategy = strategy.run;
  plan.acopy = &pack_a<T>;
  plan.bcopy = &pack_b<T>;
  plan.a_is_n = p.a_is_n, plan.b_is_n = p.b_is_n;
  panel_set.mu = s.mu, panel_set.nu = s.nu, panel_set.ku = s.ku;
  panel_set.a_panel_bytes = panel_bytes<T>(s.mb, s.kb);
  panel_set.b_panel_bytes = panel_bytes<T>(s.nb, s.kb);
  const QtbInt panels = strategy.kind == Kind::acopy ? s.r : strategy.kind == Kind::bcopy ? s.t : 1;
  p.shared.assign(static_cast<std::size_t>(panels * std::max(panel_set.a_panel_bytes, panel_set.b_panel_bytes)), 0xA5);
  plan.a_shared = plan.b_shared = p.panels = align_panel<T>(p.shared.data());
  current<T> = &p;

  long returns[most_threads] = {};
  p.returned = 0;
#pragma omp parallel num_threads(p.team)
  {
    const GemmPlan<T> own_plan = plan;
    const GemmPanelSet<T> own_set = panel_set;
    strategy.run(&p.transa, &p.transb, &s.m, &s.n, &s.k, &p.alpha, p.a.data(), &p.lda, p.b.data(), &p.ldb, &p.beta,
                 p.c.data(), &p.ldc, &own_set, &own_plan);
    returns[omp_get_thread_num()] = ++clock_of_events;
    ++p.returned;
  }
  long last_event = 0;
  for (int i = 0; i < p.team; ++i)
    for (const Event &event : events[i]) last_event = std::max(last_event, event.end);
  return {*std::min_element(returns, returns + p.team), last_event};
}

template <class T>
void expect_covered_once(const Problem<T> &p) {
  const auto wrong = std::find_if(p.covered.begin(), p.covered.end(), [](int times) { return times != 1; });
  if (wrong == p.covered.end()) return;
  const QtbInt at = wrong - p.covered.begin();
  FAIL() << "C(" << at / p.set.k % p.set.m << ", " << at / p.set.k / p.set.m << ") at depth " << at % p.set.k
         << " computed " << int{*wrong} << " times";
}

// All that the threads did, against the model.
template <class T>
void expect_schedule(const Problem<T> &p, const Schedule &want, const Returns &returns) {
  std::vector<long> first(static_cast<std::size_t>(want.phases) + 1, LONG_MAX), last(first.size(), 0);
  for (int i = 0; i < p.team; ++i) {
    const auto thread = static_cast<std::size_t>(i);
    const std::vector<Step> none;
    const std::vector<Step> &steps = thread < want.threads.size() ? want.threads[thread] : none;
    ASSERT_EQ(events[i].size(), steps.size()) << "thread " << i;
    for (std::size_t e = 0; e < steps.size(); ++e) {
      Step got = events[i][e].step;
      got.phase = steps[e].phase;
      ASSERT_EQ(got, steps[e]) << "thread " << i << ", step " << e;
      const auto phase = static_cast<std::size_t>(got.phase);
      first[phase] = std::min(first[phase], events[i][e].begin);
      last[phase] = std::max(last[phase], events[i][e].end);
    }
  }
  long before = 0;
  for (std::size_t phase = 0; phase < first.size(); ++phase) {
    ASSERT_GT(first[phase], before) << "a thread passed barrier " << phase << " ahead of another's work";
    before = std::max(before, last[phase]);
  }
  if (want.phases > 0) {
    ASSERT_GT(returns.first_return, returns.last_event) << "a thread returned ahead of another's work";
  }
}

template <class T>
void expect_own_panels(const Problem<T> &p) {
  const Setting &s = p.set;
  const auto width = static_cast<QtbInt>(sizeof(T));
  const QtbInt share = s.m / s.t / s.mu * s.mu, last_rows = s.m - (s.t - 1) * share;
  ASSERT_TRUE(recorded_memory.held.empty()) << "panels kept";
  ASSERT_EQ(recorded_memory.faults, 0);
  std::vector<std::vector<MemoryRequest>> asked(most_threads);
  for (const MemoryRequest &request : recorded_memory.requests)
    asked[static_cast<std::size_t>(request.thread)].push_back(request);
  for (QtbInt i = 0; i < p.team; ++i) {
    const std::vector<MemoryRequest> &own = asked[static_cast<std::size_t>(i)];
    if (i >= s.t || share < 1) {
      ASSERT_TRUE(own.empty());
      continue;
    }
    ASSERT_EQ(own.size(), 2U);
    QtbInt want = s.mb * s.kb * width + 8704;
    if (i == s.t - 1) want = 2 * s.mb * s.kb * width + 17408;
    if (i == s.t - 1 && last_rows - share > s.mb) {
      ASSERT_GE(static_cast<QtbInt>(own[0].bytes), want);
    } else {
      ASSERT_EQ(static_cast<QtbInt>(own[0].bytes), want) << "A of thread " << i;
    }
    ASSERT_EQ(static_cast<QtbInt>(own[1].bytes), s.nb * s.kb * width + 8704) << "B of thread " << i;
    ASSERT_EQ(own[0].alignment, 128);
    ASSERT_EQ(own[1].alignment, 128);
    std::vector<void *> released;
    for (const auto &[thread, pointer] : recorded_memory.releases)
      if (thread == i) released.push_back(pointer);
    ASSERT_EQ(released, (std::vector<void *>{own[0].given, own[1].given})) << "not the A one first";
  }
}

std::string text_of(const Setting &s, int team) {
  const auto n = [](std::int64_t v) { return std::to_string(v) + " "; };
  return "m n k " + n(s.m) + n(s.n) + n(s.k) + "t r c " + n(s.t) + n(s.r) + n(s.c) + "mb nb kb " + n(s.mb) + n(s.nb) +
         n(s.kb) + "mu nu ku " + n(s.mu) + n(s.nu) + n(s.ku) + "team " + n(team);
}

template <class T>
void check(const Strategy<T> &strategy, Setting set, int team, std::uint64_t seed) {
  set.width = sizeof(T);
  SCOPED_TRACE(std::string(strategy.name) + ": " + text_of(set, team) + "seed " + std::to_string(seed));
  Problem<T> p;
  prepare(p, strategy.kind, set, team, seed);
  const Returns returns = run(p, strategy);
  ASSERT_EQ(faults, 0) << first_fault;
  const Schedule want = schedule_of(strategy.kind, set);
  ASSERT_NO_FATAL_FAILURE(expect_schedule(p, want, returns));
  const bool none = strategy.kind == Kind::abcopy && set.m / set.t < set.mu;
  if (none) {
    ASSERT_EQ(returns.last_event, 0) << "a share below one tile, and yet something was done";
  } else {
    ASSERT_NO_FATAL_FAILURE(expect_covered_once(p));
  }
  if (strategy.kind == Kind::abcopy) {
    ASSERT_NO_FATAL_FAILURE(expect_own_panels(p));
  } else {
    ASSERT_TRUE(recorded_memory.requests.empty());
  }
}

// ---- Which runs ----

constexpr int teams[] = {2, 3, 4, 5, 7, 8, 16, 24, 25};

// What the plan's nthreads and grid may be with a strategy on a team.
std::vector<Setting> grids(Kind kind, int team) {
  const QtbInt even = team / 2 * 2;
  std::vector<Setting> all;
  const auto add_grid = [&](QtbInt t, QtbInt rows) {
    Setting s{};
    s.t = t, s.r = rows, s.c = t / rows;
    all.push_back(s);
  };
  switch (kind) {
    case Kind::row:
    case Kind::col:
      add_grid(team, 1);
      if (even != team) add_grid(even, 1);
      break;
    case Kind::shared_b: add_grid(even, 1); break;
    case Kind::grid:
      for (const QtbInt rows : {QtbInt{1}, QtbInt{2}, QtbInt{4}, even})
        if (even % rows == 0) add_grid(even, rows);
      if (even != team) add_grid(team, 1), add_grid(team, team);
      break;
    case Kind::xgemm:
    case Kind::bcopy: add_grid(even, 2); break;
    case Kind::acopy:
      add_grid(even, 2);
      if (even % 4 == 0) add_grid(even, 4);
      break;
    case Kind::abcopy: add_grid(even, even); break;
  }
  return all;
}

// Extents round the boundary of one unit for each of parts, and within it.
std::vector<QtbInt> extents(QtbInt parts, QtbInt unit, QtbInt block) {
  std::vector<QtbInt> all = {
      1, parts - 1, parts, parts * unit - 1, parts * unit, parts * unit + 1, 2 * parts * unit + 3};
  all.push_back(parts * block - 1);
  all.push_back(parts * block + unit + 1);
  all.erase(std::remove_if(all.begin(), all.end(), [](QtbInt v) { return v < 1 || v > 150; }), all.end());
  return all;
}

template <class T>
void sweep(const Strategy<T> &strategy, int cases_per_grid) {
  std::mt19937_64 random(20);
  const auto pick = [&](const std::vector<QtbInt> &from) { return from[random() % from.size()]; };
  std::uint64_t seed = 0;
  for (const int team : teams)
    for (Setting s : grids(strategy.kind, team)) {
      for (int i = 0; i < cases_per_grid; ++i) {
        s.mu = pick({2, 4, 8});
        s.nu = pick({2, 4, 8});
        s.ku = pick({1, 2, 4});
        s.mb = s.mu * pick({1, 2, 3});
        s.nb = strategy.kind == Kind::abcopy ? s.nu : s.nu * pick({1, 2, 3});
        s.kb = pick({4, 8, 12});
        const bool rows_by_grid = strategy.kind == Kind::grid || strategy.kind == Kind::xgemm ||
                                  strategy.kind == Kind::acopy || strategy.kind == Kind::bcopy;
        s.m = pick(extents(rows_by_grid ? s.r : s.t, s.mu, s.mb));
        s.n = pick(extents(rows_by_grid ? s.c : s.t, strategy.kind == Kind::grid ? 4 : s.nu, s.nb));
        if (strategy.kind == Kind::abcopy && i % 4 != 0) {
          s.m = s.t * s.mu * pick({1, 2, 3}) + pick({0, 1, s.mu, s.t * s.mu - 1});
          s.n = pick({s.t * s.nb - 1, s.t * s.nb, s.t * s.nb + 1, 2 * s.t * s.nb + 5, s.nb - 1, s.nb});
        }
        s.k = pick({1, s.kb - 1, s.kb, s.kb + 1, 2 * s.kb + 3});
        ASSERT_NO_FATAL_FAILURE(check(strategy, s, team, seed++));
      }
    }
}

// By the end of a strategy's name.
Kind kind_of(const std::string &name) {
  const std::pair<const char *, Kind> kinds[] = {
      {"1d_row", Kind::row},    {"1d_col", Kind::col},       {"1d_with_copy_0", Kind::shared_b},
      {"2d_grid", Kind::grid},  {"2d_xgemm_p", Kind::xgemm}, {"2d_acopy_n", Kind::acopy},
      {"2d_bcopy", Kind::bcopy}};
  for (const auto &[end, kind] : kinds)
    if (name.ends_with(end)) return kind;
  return Kind::abcopy;
}

#define QTB_COVER_TEST(name, T)                                                                     \
  TEST(GemmStrategyCover, name) {                                                                   \
    sweep<T>({#name, kind_of(#name), &qtb_blas_##name}, is_complex<T> || sizeof(T) == 4 ? 20 : 60); \
  }
QTB_FOR_EACH_GEMM_STRATEGY(QTB_COVER_TEST)

// ---- Edges by name ----

const Strategy<double> d_row = {"row", Kind::row, &qtb_blas_dgemm_1d_row},
                       d_col = {"col", Kind::col, &qtb_blas_dgemm_1d_col},
                       d_shared_b = {"shared B", Kind::shared_b, &qtb_blas_dgemm_1d_with_copy_0},
                       d_grid = {"grid", Kind::grid, &qtb_blas_dgemm_2d_grid},
                       d_blocks = {"blocks", Kind::xgemm, &qtb_blas_dgemm_2d_xgemm_p},
                       d_shared_a = {"shared A", Kind::acopy, &qtb_blas_dgemm_2d_acopy_n},
                       d_own = {"own panels", Kind::abcopy, &qtb_blas_dgemm_2d_abcopy_abx_m_km_par_p};

// The events of a thread in the last run that are of a kind.
std::vector<Step> steps_of(int thread, Action what) {
  std::vector<Step> all;
  for (const Event &event : events[thread])
    if (event.step.what == what) all.push_back(event.step);
  return all;
}

// m n k, t r c, mb nb kb, mu nu ku, width
TEST(GemmStrategyCover, TeamOfOneTakesAll) {
  ASSERT_NO_FATAL_FAILURE(check(d_row, {7, 5, 3, 1, 1, 1, 0, 0, 0, 1, 1, 1, 8}, 1, 0));
  ASSERT_NO_FATAL_FAILURE(check(d_col, {7, 5, 3, 1, 1, 1, 0, 0, 0, 1, 1, 1, 8}, 1, 1));
  ASSERT_NO_FATAL_FAILURE(check(d_grid, {7, 5, 3, 1, 1, 1, 0, 0, 0, 4, 1, 1, 8}, 1, 2));
}

// Where no panel is shared no thread waits for another: the end of the region does that.
TEST(GemmStrategyCover, StrategiesWithoutSharedPanelsHaveNoBarrier) {
  for (const Strategy<double> &strategy : {d_row, d_col, d_grid, d_blocks, d_own}) {
    Problem<double> p;
    prepare(p, strategy.kind, {40, 40, 3, 4, 2, 2, 8, 8, 4, 4, 4, 1, 8}, 5, 0);
    p.stalls = true;
    run(p, strategy);
    EXPECT_EQ(faults, 0) << strategy.name << ": " << first_fault;
  }
}

TEST(GemmStrategyCover, DepthOf64AThreadSharesOutRowsAnd65Depth) {
  for (const QtbInt c : {1, 2, 3}) {
    const QtbInt t = 2 * c;
    const Setting by_rows{70, 20, 65 * c - 1, t, 2, c, 32, 0, 48, 4, 4, 4, 8};
    ASSERT_NO_FATAL_FAILURE(check(d_shared_a, by_rows, static_cast<int>(t), 0));
    EXPECT_EQ(steps_of(0, Action::pack_a).at(0).depths, 48);
    EXPECT_EQ(steps_of(0, Action::pack_a).at(0).rows, 32 / c / 8 * 8);
    Setting by_depth = by_rows;
    by_depth.k = 65 * c;
    ASSERT_NO_FATAL_FAILURE(check(d_shared_a, by_depth, static_cast<int>(t) + 1, 1));
    EXPECT_EQ(steps_of(0, Action::pack_a).at(0).depths, 48 / c / 4 * 4);
    EXPECT_EQ(steps_of(0, Action::pack_a).at(0).rows, 32);
  }
}

TEST(GemmStrategyCover, LastBlockOfRowsMayBeLongerThanTwoBlocks) {
  // Shares of 8 rows, 31 + 8 for the last thread, in blocks of 8.
  ASSERT_NO_FATAL_FAILURE(check(d_own, {8 * 16 + 31 - 8 + 8, 20, 9, 16, 16, 1, 8, 8, 4, 8, 4, 4, 8}, 16, 0));
  EXPECT_GT(steps_of(15, Action::pack_a).at(0).rows, 8);
  ASSERT_NO_FATAL_FAILURE(check(d_own, {24 * 8 - 1, 20, 9, 24, 24, 1, 4, 8, 4, 4, 4, 4, 8}, 24, 0));
}

TEST(GemmStrategyCover, DepthOfNoneIsNoWork) {
  for (const Strategy<double> &strategy : {d_shared_b, d_blocks, d_shared_a, d_own}) {
    Problem<double> p;
    Setting set{20, 20, 1, 4, 2, 2, 8, 8, 4, 4, 4, 4, 8};
    if (strategy.kind == Kind::abcopy) set.r = 4, set.c = 1;
    prepare(p, strategy.kind, set, 4, 0);
    p.set.k = 0;
    run(p, strategy);
    EXPECT_EQ(faults, 0) << first_fault;
    for (int i = 0; i < 4; ++i) EXPECT_TRUE(events[i].empty()) << strategy.name;
  }
}

// ---- Without memory ----

TEST(GemmStrategyCover, ThreadWithoutPanelsComputesItsRowsByTheSerialRoutine) {
  for (int thread = 0; thread < 4; ++thread)
    for (int request = 0; request < 2; ++request)
      for (std::uint64_t seed = 0; seed < 36; seed += 7) {
        Problem<double> p;
        prepare(p, Kind::abcopy, {35, 2 * 4 * 8 + 3, 9, 4, 4, 1, 8, 8, 4, 4, 4, 4, 8}, 5, seed);
        recorded_memory.fails = [=](long, int by, int number) { return by == thread && number == request; };
        run(p, d_own);
        recorded_memory.fails = nullptr;
        ASSERT_EQ(faults, 0) << first_fault;
        ASSERT_NO_FATAL_FAILURE(expect_covered_once(p));
        ASSERT_EQ(events[thread].size(), 1U);
        ASSERT_EQ(events[thread][0].step.depths, 9);
        ASSERT_EQ(events[thread][0].step.cols, 2 * 4 * 8 + 3);
        ASSERT_GT(events[(thread + 1) % 4].size(), 1U);
        ASSERT_TRUE(recorded_memory.held.empty());
      }
}

}  // namespace
}  // namespace qtb::test
