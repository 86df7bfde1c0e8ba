// Selections of a parallel GEMM between stand-ins: every dispatch slot is a routine of this program, by which a plan is
// compared with an outcome of gemm_rules.h; the block queries among them note the question and answer with numbers of
// their own. Nothing here knows or asks the processor.
//
// For one source of one program, as stand_ins.h is.
#pragma once

#include <cstdio>
#include <cstring>
#include <map>

#include "blas/thread/32e/level3/gemm_select.h"
#include "blas/thread/32e/level3/gemm_strategies.h"
#include "tests/thread/level3/gemm_rules.h"
#include "tests/thread/stand_ins.h"

namespace {

using namespace qtb::test;

// ---- The block queries ----

struct BlockQuery {
  int slot;  // that was asked
  QtbInt m, n, k, mb, nb, kb;
};
thread_local int query_count = 0;
thread_local BlockQuery query;
thread_local QtbInt answered_mu = 0;
constexpr QtbInt answered_block = 77, answered_nu = 6, answered_ku = 12;

template <int slot>
void answer_blocks(const QtbInt *m, const QtbInt *n, const QtbInt *k, QtbInt *mb, QtbInt *nb, QtbInt *kb, QtbInt *mu,
                   QtbInt *nu, QtbInt *ku) {
  ++query_count;
  query = {slot, *m, *n, *k, *mb, *nb, *kb};
  for (QtbInt *block : {mb, nb, kb})
    if (*block == 0) *block = answered_block;
  *mu = answered_mu, *nu = answered_nu, *ku = answered_ku;
}

void use_block_queries() {
  stand_ins = StandIns{};
  stand_ins.recording = false;
#define QTB_SLOT(name, shape, T, tiers)                                          \
  if (std::is_same_v<QTB_FUNCTION_TYPE(shape, T), QTB_FUNCTION_TYPE(blocks, T)>) \
    stand_ins.behind[qtb::slot_##name] = code_pointer(&answer_blocks<qtb::slot_##name>);
#include "blas/dispatch/slots.def"
#undef QTB_SLOT
}

// ---- A plan's routines by name ----

struct Routine {
  const void *address;
  unsigned tiers;  // that have it, as a set of tier bits
  int slot;        // -1 for a strategy
};

// Null for a name that no routine has.
const Routine *routine(const std::string &name) {
  using namespace qtb::tier_set;
  static const std::map<std::string, Routine> all = {
#define QTB_SLOT(name, shape, T, tiers) \
  {#name, {reinterpret_cast<const void *>(&qtb_blas_x##name), tiers, qtb::slot_##name}},
#include "blas/dispatch/slots.def"
#undef QTB_SLOT
#define QTB_STRATEGY(name, T) {#name, {reinterpret_cast<const void *>(&qtb_blas_##name), ALL, -1}},
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
  int blocks_slot = -1;
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
  if (*names.blocks != 0) {
    std::string blocks = names.blocks;
    blocks[0] = type;
    if (const Routine *r = routine(blocks)) found.blocks_slot = r->slot;
  }
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

#define QTB_CALL_SELECT(t, T)                                          \
  void call_select(const Point &p, Selected<T> *s) {                   \
    qtb_blas_##t##gemm_select(&p.m, &p.n, &p.k, &s->panels, &s->plan); \
  }
QTB_FOR_EACH_GEMM(QTB_CALL_SELECT)

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
    if (query.slot != kind.blocks_slot || query.m != p.m || query.n != p.n || query.k != p.k) return false;
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

}  // namespace
