// The dispatch slots: one cached code pointer per routine or building block, each behind a stub of its own name.
//
// qtb_blas_x<name> calls the implementation of the process's tier. A slot is empty until its first call, which asks for
// the tier and stores the target; racing first calls store the same value, so there is no lock and nothing to set up.
#pragma once

#include <atomic>

#include "blas/shapes.h"
#include "blas/tiers.h"

// The stubs, and the implementations behind them: qtb_blas_<tier>_x<name>.
extern "C" {
#define QTB_DECLARE_TARGET(tier, TIER, name, shape, T) QTB_HIDDEN QTB_FUNCTION(shape, T, qtb_blas_##tier##_x##name);
#define QTB_SLOT(name, shape, T, tiers)                \
  QTB_HIDDEN QTB_FUNCTION(shape, T, qtb_blas_x##name); \
  QTB_FOR_EACH_TIER(QTB_DECLARE_TARGET, name, shape, T)
#include "blas/dispatch/slots.def"
#undef QTB_SLOT
#undef QTB_DECLARE_TARGET

// What a slot holds on a tier that has no such building block. It does nothing; no driver of that tier calls it.
QTB_HIDDEN void qtb_blas_noop();
}

namespace qtb {

#define QTB_SLOT(name, shape, T, tiers) slot_##name,
enum SlotNumber : int {
#include "blas/dispatch/slots.def"
  slot_count
};
#undef QTB_SLOT

using CodePointer = void (*)();

// What is fixed about a slot: its name, the tiers with a body of their own (a set of tier_set), and the five targets.
struct SlotTargets {
  const char *name;
  unsigned tiers;
  CodePointer target[tier_count];
};
extern const SlotTargets slot_targets[slot_count];

// The cached pointers, side by side; null until a slot's first call and never changed afterwards.
extern std::atomic<CodePointer> dispatch_slots[slot_count];

}  // namespace qtb
