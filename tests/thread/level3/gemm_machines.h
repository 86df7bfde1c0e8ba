// The made-up machines that a parallel GEMM tells apart: one for each machine class, and for each cache table that a
// selector asks for. A process is one machine, named by QTB_TEST_MACHINE in its environment.
#pragma once

#include <gtest/gtest.h>
#include <omp.h>

#include <cstdio>
#include <cstdlib>
#include <string>

#include "blas/thread/32e/level3/gemm_plan.h"
#include "tests/platform/fake.h"
#include "tests/support/tiers.h"
#include "tests/thread/recorded_memory.h"

namespace qtb::test {

struct GemmMachine {
  const char *name;
  ProcessorTier tier;
  GemmMachineClass machine_class;
  bool sse41;
  bool amd_family;
  std::uint32_t second_kib, third_kib;  // cache levels; 0 for none
};

inline constexpr GemmMachine gemm_machines[] = {
    {"def", tier_def, machine_plain, false, false, 512, 0},
    {"def_family16", tier_def, machine_family16, false, true, 512, 0},
    {"sse3", tier_sse3, machine_plain, false, false, 512, 0},
    {"ssse3", tier_ssse3, machine_ssse3, false, false, 2048, 0},
    {"sse41_large_l2", tier_ssse3, machine_sse41_large_l2, true, false, 6144, 0},
    {"sse41_small_l2", tier_ssse3, machine_sse41_small_l2, true, false, 3072, 0},
    {"sse41_no_table", tier_ssse3, machine_sse41_large_l2, true, false, 0, 0},
    {"sse42", tier_sse42, machine_sse42, true, false, 256, 8192},
    {"sse42_small_l3", tier_sse42, machine_sse42, true, false, 256, 4096},
    {"avx", tier_avx, machine_avx, true, false, 256, 8192},
};
consteval bool machines_of_every_tier() {
  unsigned found = 0;
  for (const GemmMachine &machine : gemm_machines) found |= 1U << machine.tier;
  return found == tier_set::ALL;
}
static_assert(
    machines_of_every_tier(),
    "tests/thread/level3/gemm_machines.h: write a row for each machine class of every tier, and its name into "
    "tests/thread/suites.cmake");

// Makes this process the machine. Ends it as skipped where the processor cannot run the machine's tier.
inline void become(const GemmMachine &machine) {
  constexpr int exit_skipped = 77;
  constexpr std::uint32_t sse41_bit = 1U << 19, family_of_kernels = 0x100F00;
  if (!processor_runs(machine.tier)) {
    std::printf("skipped: this processor lacks the instructions of tier %s\n", tier_name(machine.tier));
    std::exit(exit_skipped);
  }
  fake.environment["QTB_DEBUG_CPU_TYPE"] = std::to_string(machine.tier);
  fake.environment["QTB_DYNAMIC"] = "FALSE";
  FakeProcessor &processor = fake.processors[0];
  processor.vendor = machine.amd_family ? "AuthenticAMD" : "GenuineBelmo";
  processor.signature = machine.amd_family ? family_of_kernels : 0;
  processor.features_ecx = machine.sse41 ? sse41_bit : 0;
  processor.caches.clear();
  if (machine.second_kib != 0)
    processor.caches = {fake_cache(1, 64, 1, 8, 64), fake_cache(3, 64, 1, 16, machine.second_kib)};
  if (machine.third_kib != 0) processor.caches.push_back(fake_cache(3, 64, 1, 16, machine.third_kib));
  insert_processors(&fake.process, 0, 0);
  fake.online = fake.process;
}

// Whether it is the first machine of its tier: what depends on the tier alone need not run on the others.
inline bool stands_for_its_tier(const GemmMachine &machine) {
  for (const GemmMachine &other : gemm_machines)
    if (other.tier == machine.tier) return &other == &machine;
  return false;
}

// The machine that QTB_TEST_MACHINE names; the plain one where nothing does.
inline const GemmMachine &named_machine() {
  const char *name = std::getenv("QTB_TEST_MACHINE");
  for (const GemmMachine &machine : gemm_machines)
    if (name != nullptr && std::string(name) == machine.name) return machine;
  if (name != nullptr) std::abort();
  return gemm_machines[0];
}

// A program that is a machine, in recorded memory: everything is given back, and nothing is written outside it.
inline const GemmMachine &machine = named_machine();

class MachineOfThisProgram : public testing::Environment {
  void SetUp() override {
    become(machine);
    use_recorded_memory();
    omp_set_dynamic(0);
  }
  void TearDown() override {
    EXPECT_TRUE(recorded_memory.held.empty());
    EXPECT_EQ(recorded_memory.faults, 0);
  }
};
inline const testing::Environment *const machine_environment =
    testing::AddGlobalTestEnvironment(new MachineOfThisProgram);

constexpr char letters[] = {'N', 'T', 'C', 'n', 't', 'c'};

}  // namespace qtb::test
