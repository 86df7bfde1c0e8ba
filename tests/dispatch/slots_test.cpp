// The way through a dispatch slot, for every slot and tier, with procedures that only record their call, and a made-up
// processor below. Each case has its own process, whose slots are empty.

#include "blas/dispatch/slots.h"

#include <utility>

#include "tests/dispatch/recording_kernels.h"
#include "tests/platform/fake.h"
#include "tests/support/child.h"
#include "tests/support/together.h"

extern "C" std::int64_t lsame(const char *a, const char *b);

namespace qtb::test {
namespace {

// Addresses to call with, all different; nobody follows them.
alignas(16) char places[most_arguments][16];

// Calls a slot's stub with a place of its own for each argument, and checks the result against the tier's.
template <class Function>
struct Stub;

template <class Result, class... Arguments>
struct Stub<Result(Arguments...)> {
  using Pointer = Result (*)(Arguments...);

  static void call(CodePointer stub, int slot, int tier) {
    with(reinterpret_cast<Pointer>(stub), slot, tier, std::index_sequence_for<Arguments...>{});
  }

  template <std::size_t... i>
  static void with(Pointer stub, int slot, int tier, std::index_sequence<i...>) {
    if constexpr (std::is_void_v<Result>) {
      stub(reinterpret_cast<Arguments>(places[i])...);
    } else {
      const Result result = stub(reinterpret_cast<Arguments>(places[i])...);
      if constexpr (std::is_pointer_v<Result>)
        EXPECT_EQ(static_cast<const void *>(result), places[0]);
      else
        EXPECT_EQ(result, static_cast<Result>(recorded_result(slot, tier)));
    }
  }
};

struct SlotStub {
  CodePointer stub;
  void (*call)(CodePointer stub, int slot, int tier);
  int argument_count;
};

template <class Function>
struct ArgumentCount;
template <class Result, class... Arguments>
struct ArgumentCount<Result(Arguments...)> {
  static constexpr int value = sizeof...(Arguments);
};

#define QTB_SLOT(name, shape, T, tiers)                                                        \
  {reinterpret_cast<CodePointer>(&qtb_blas_x##name), &Stub<QTB_FUNCTION_TYPE(shape, T)>::call, \
   ArgumentCount<QTB_FUNCTION_TYPE(shape, T)>::value},
const SlotStub stubs[slot_count] = {
#include "blas/dispatch/slots.def"
};
#undef QTB_SLOT

// The tier whose procedure stands in a slot, or -1 for the empty routine. Here every tier has procedures of its own,
// also where two of the library's share one.
int tier_in_slot(int slot, int tier) { return (slot_targets[slot].tiers >> tier & 1) != 0 ? tier : -1; }

void expect_call(int slot, int tier) {
  const int expected = tier_in_slot(slot, tier);
  recorded_call = {};
  if (expected == -1) {
    // The empty routine sets no result: only that nothing was called can be seen.
    reinterpret_cast<void (*)()>(stubs[slot].stub)();
    EXPECT_EQ(recorded_call.slot, -1) << slot_targets[slot].name;
    return;
  }
  stubs[slot].call(stubs[slot].stub, slot, expected);
  EXPECT_EQ(recorded_call.slot, slot) << slot_targets[slot].name;
  EXPECT_EQ(recorded_call.tier, expected) << slot_targets[slot].name;
  EXPECT_EQ(recorded_call.argument_count, stubs[slot].argument_count) << slot_targets[slot].name;
  for (int i = 0; i < recorded_call.argument_count; ++i)
    EXPECT_EQ(recorded_call.arguments[static_cast<std::size_t>(i)], places[i])
        << slot_targets[slot].name << " argument " << i;
}

TEST(Slots, EveryCallReachesTheTiersProcedureWithItsArgumentsAndBringsItsResultBack) {
  int calls = 0;
  for (int tier = 0; tier < tier_count; ++tier) {
    in_child([&] {
      fake.environment["QTB_DEBUG_CPU_TYPE"] = std::to_string(tier);
      for (int slot = 0; slot < slot_count; ++slot)
        for (int call = 0; call < 3; ++call) expect_call(slot, tier);
    });
    calls += 3 * slot_count;
  }
  std::printf("%d calls of %d slots in %d tiers\n", calls, slot_count, tier_count);
}

TEST(Slots, AreEmptyUntilTheirFirstCallAndThenHoldTheTarget) {
  for (int tier = 0; tier < tier_count; ++tier)
    in_child([&] {
      fake.environment["QTB_DEBUG_CPU_TYPE"] = std::to_string(tier);
      for (int slot = 0; slot < slot_count; ++slot) {
        for (int later = slot; later < slot_count; ++later) ASSERT_EQ(dispatch_slots[later].load(), nullptr);
        expect_call(slot, tier);
        EXPECT_EQ(dispatch_slots[slot].load(), slot_targets[slot].target[tier]);
      }
    });
}

TEST(Slots, OnlyAFirstCallDetects) {
  in_child([] {
    EXPECT_EQ(lsame("u", "U"), 1);
    EXPECT_TRUE(fake.environment_reads.empty());
    EXPECT_EQ(fake.cpuid_calls, 0);
    fake.environment["QTB_DEBUG_CPU_TYPE"] = "2";
    expect_call(slot_ddot, tier_ssse3);
    EXPECT_EQ(fake.environment_reads.size(), 1U);
    const int asked = fake.cpuid_calls;
    fake.environment["QTB_DEBUG_CPU_TYPE"] = "1";
    expect_call(slot_ddot, tier_ssse3);
    expect_call(slot_dgemm, tier_ssse3);
    EXPECT_EQ(fake.environment_reads.size(), 1U);
    EXPECT_EQ(fake.cpuid_calls, asked);
  });
}

TEST(Slots, WithoutAnOverrideFollowTheProcessor) {
  in_child([] {
    fake.processors[0].features_ecx = 1U << 9 | 1;
    expect_call(slot_ddot, tier_ssse3);
  });
  in_child([] {
    fake.processors[0].vendor = "AuthenticAMD";
    fake.processors[0].features_ecx = ~0U;
    expect_call(slot_ddot, tier_def);
  });
}

TEST(Slots, ThreadsThatRaceOnTheFirstCallOfASlotAllReachTheTarget) {
  for (const SlotNumber slot : {slot_ddot, slot_cdotc, slot_dgemm, slot_idamax})
    in_child([&] {
      fake.environment["QTB_DEBUG_CPU_TYPE"] = "3";
      on_threads(16, [&](int) { expect_call(slot, tier_sse42); });
    });
}

TEST(Slots, ThreadsThatRaceOnTheFirstCallsOfDifferentSlotsAgreeOnTheTier) {
  in_child([] {
    fake.environment["QTB_DEBUG_CPU_TYPE"] = "1";
    on_threads(16, [](int thread) {
      for (int slot = 0; slot < slot_count; ++slot) expect_call((slot + thread * 16) % slot_count, tier_sse3);
    });
  });
}

}  // namespace
}  // namespace qtb::test
