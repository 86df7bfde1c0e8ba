// Slot tables and stubs, expanded from slots.def.

#include "blas/dispatch/slots.h"

#include "service/cpu.h"

extern "C" void qtb_blas_noop() {}

namespace qtb {

// Constant data: the conditions are constants, so a target that is not named is not referred to.
#define QTB_TARGET(tier, TIER, name, tiers)                    \
  (tier_set::TIER & (tiers)) == 0 ? &qtb_blas_noop             \
  : tier_##tier == tier_avx && (AVX_RUNS_SSE42 & (tiers)) != 0 \
      ? reinterpret_cast<CodePointer>(&qtb_blas_sse42_x##name) \
      : reinterpret_cast<CodePointer>(&qtb_blas_##tier##_x##name),
#define QTB_SLOT(name, shape, T, tiers) {#name, tiers, {QTB_FOR_EACH_TIER(QTB_TARGET, name, tiers)}},
using namespace tier_set;
const SlotTargets slot_targets[slot_count] = {
#include "blas/dispatch/slots.def"
};
#undef QTB_SLOT
#undef QTB_TARGET

std::atomic<CodePointer> dispatch_slots[slot_count];

namespace {

// The way of a slot's first call, with the arguments of the call: a procedure of its own, so that the stub has no
// frame and its fast path is a load, a test and a jump.
template <class Function, SlotNumber slot>
struct FirstCall;

template <class Result, class... Arguments, SlotNumber slot>
struct FirstCall<Result(Arguments...), slot> {
  [[gnu::noinline, gnu::cold]] static Result run(Arguments... arguments) {
    const CodePointer target = slot_targets[slot].target[qtb_serv_cpu_detect()];
    dispatch_slots[slot].store(target, std::memory_order_relaxed);
    return reinterpret_cast<Result (*)(Arguments...)>(target)(arguments...);
  }
};

template <class Function, SlotNumber slot>
[[gnu::always_inline]] inline Function *resolve() {
  const CodePointer target = dispatch_slots[slot].load(std::memory_order_relaxed);
  return target != nullptr ? reinterpret_cast<Function *>(target) : &FirstCall<Function, slot>::run;
}

}  // namespace
}  // namespace qtb

extern "C" {
#define QTB_SLOT(name, shape, T, tiers)                                                    \
  QTB_FUNCTION(shape, T, qtb_blas_x##name) {                                               \
    return qtb::resolve<QTB_FUNCTION_TYPE(shape, T), qtb::slot_##name>()(QTB_ARGS(shape)); \
  }
#include "blas/dispatch/slots.def"
#undef QTB_SLOT
}
