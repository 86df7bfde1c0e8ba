// The cache table on made-up processors, each in a process of its own: it is filled once.

#include "service/cache.h"

#include <array>
#include <chrono>

#include "service/memory.h"
#include "tests/platform/fake.h"
#include "tests/support/child.h"
#include "tests/support/together.h"

namespace qtb::test {
namespace {

constexpr std::uint32_t data = 1, instruction = 2, unified = 3;
using Table = std::array<std::uint32_t, cache_size_entries>;

void expect_table(const std::vector<CpuidRegisters> &caches, const Table &want) {
  in_child([&] {
    fake.processors[0].caches = caches;
    Table got;
    got.fill(0xDEADBEEF);
    qtb_serv_get_cache_sizes(got.data());
    EXPECT_EQ(got, want);
  });
}

const CpuidRegisters first_data = fake_cache(data, 64, 1, 8, 64), first_code = fake_cache(instruction, 64, 1, 4, 128),
                     second = fake_cache(unified, 64, 1, 8, 512), third = fake_cache(unified, 64, 1, 16, 8192);

TEST(CacheSizes, InstructionCachesAreLeftOut) {
  expect_table({first_data, first_code, second, third}, {3, 32768, 262144, 8388608, 0});
  expect_table({first_code, first_data}, {1, 32768, 0, 0, 0});
}

TEST(CacheSizes, AreLineTimesPartitionsTimesWaysTimesSets) {
  expect_table({fake_cache(data, 48, 3, 12, 1000)}, {1, 48 * 3 * 12 * 1000, 0, 0, 0});
  expect_table({fake_cache(unified, 4096, 1024, 1, 2)}, {1, 4096 * 1024 * 2, 0, 0, 0});
  expect_table({fake_cache(unified, 2, 1, 1024, 3)}, {1, 2 * 1024 * 3, 0, 0, 0});
}

TEST(CacheSizes, AreNumbersOf32Bits) { expect_table({fake_cache(unified, 64, 1, 1024, 1 << 17)}, {1, 0, 0, 0, 0}); }

TEST(CacheSizes, TheBoundaryOfItsReadersIsToldToTheByte) {
  expect_table({first_data, fake_cache(unified, 64, 1, 12, 4096)}, {2, 32768, 3145728, 0, 0});
  expect_table({first_data, fake_cache(unified, 2, 1, 1, 1572865)}, {2, 32768, 3145730, 0, 0});
}

TEST(CacheSizes, AProcessorWithoutTheLeafHasAnEmptyTable) { expect_table({}, {0, 0, 0, 0, 0}); }

TEST(CacheSizes, TheListEndsAtTypeZeroOrWhereTheShapeIsZero) {
  expect_table({first_data, {0, 1, 1, 0}, second}, {1, 32768, 0, 0, 0});
  expect_table({first_data, {unified, 0, 511, 0}, second}, {1, 32768, 0, 0, 0});
  expect_table({first_data, {unified, 0x01C0003F, 0, 0}, second}, {1, 32768, 0, 0, 0});
  expect_table({{instruction, 0, 0, 0}, second}, {0, 0, 0, 0, 0});
}

TEST(CacheSizes, OnlyTheTypeFieldSaysWhatACacheIs) {
  const auto with_other_fields = [](CpuidRegisters cache) {
    cache.eax |= 0xFFFFFFE0;  // level, sharing and the rest
    return cache;
  };
  const CpuidRegisters end = with_other_fields({0, first_data.ebx, first_data.ecx, 0});
  expect_table({with_other_fields(first_code), with_other_fields(first_data), end, second}, {1, 32768, 0, 0, 0});
}

TEST(CacheSizes, FourLevelsAreHandedOutAndSevenCounted) {
  expect_table({first_data, second, second, third}, {4, 32768, 262144, 262144, 8388608});
  expect_table(std::vector<CpuidRegisters>(6, second), {6, 262144, 262144, 262144, 262144});
  expect_table(std::vector<CpuidRegisters>(7, second), {7, 262144, 262144, 262144, 262144});
  expect_table(std::vector<CpuidRegisters>(30, second), {7, 262144, 262144, 262144, 262144});
}

TEST(CacheSizes, AListWithoutAnEndIsCutOff) {
  for (const CpuidRegisters &last : {second, first_code})
    in_child([&] {
      fake.processors[0].caches = {first_data, last};
      fake.processors[0].caches_never_end = true;
      Table got;
      qtb_serv_get_cache_sizes(got.data());
      EXPECT_EQ(got[cache_count], last.eax == unified ? 7U : 1U);
      EXPECT_LE(fake.cpuid_calls, 32);
    });
}

TEST(CacheSizes, SubLeavesUpTo31AreRead) {
  std::vector<CpuidRegisters> caches(32, first_code);
  caches[31] = second;
  expect_table(caches, {1, 262144, 0, 0, 0});
  caches.insert(caches.begin(), first_code);
  expect_table(caches, {0, 0, 0, 0, 0});
}

TEST(CacheSizes, TheVendorAndTheHighestLeafPlayNoPart) {
  in_child([] {
    fake.processors[0].vendor = "AuthenticAMD";
    fake.processors[0].highest_leaf = 1;
    fake.processors[0].caches = {first_data};
    Table got;
    qtb_serv_get_cache_sizes(got.data());
    EXPECT_EQ(got, (Table{1, 32768, 0, 0, 0}));
  });
}

TEST(CacheSizes, ANullPointerStillFillsTheTableAndItIsFilledOnce) {
  in_child([] {
    fake.processors[0].caches = {first_data, second};
    qtb_serv_get_cache_sizes(nullptr);
    const int asked = fake.cpuid_calls;
    EXPECT_GT(asked, 0);
    fake.processors[0].caches = {third};
    Table got;
    qtb_serv_get_cache_sizes(got.data());
    EXPECT_EQ(got, (Table{2, 32768, 262144, 0, 0}));
    EXPECT_EQ(fake.cpuid_calls, asked);
  });
}

TEST(CacheSizes, RacingReadersSeeAWholeTableThatOneOfThemFilled) {
  in_child([] {
    fake.processors[0].caches = {first_data, first_code, second, third};
    Table found[16];
    // All of them find the table empty, and wait for the lock.
    qtb_serv_lock();
    std::atomic<int> started{0};
    std::thread opener([&] {
      while (started != 16) std::this_thread::yield();
      std::this_thread::sleep_for(std::chrono::milliseconds(20));
      qtb_serv_unlock();
    });
    on_threads(16, [&](int i) {
      ++started;
      qtb_serv_get_cache_sizes(found[i].data());
    });
    opener.join();
    for (const Table &table : found) EXPECT_EQ(table, (Table{3, 32768, 262144, 8388608, 0}));
    EXPECT_EQ(fake.cpuid_calls, 5);
  });
}

TEST(CacheSizes, AReaderDuringTheFirstFillWaitsForItsEnd) {
  for (const int call : {1, 3, 5}) {
    in_child([&] {
      fake.processors[0].caches = {first_data, first_code, second, third};
      Table found = {};
      std::atomic<bool> reading{false}, done{false};
      std::thread reader;
      fake.on_cpuid = [&] {
        if (fake.cpuid_calls != call) return;
        reader = std::thread([&] {
          reading = true;
          qtb_serv_get_cache_sizes(found.data());
          done = true;
        });
        while (!reading) std::this_thread::yield();
        for (int ms = 0; ms < 50 && !done; ++ms) std::this_thread::sleep_for(std::chrono::milliseconds(1));
        EXPECT_FALSE(done) << "the table is not whole yet";
      };
      qtb_serv_get_cache_sizes(nullptr);
      reader.join();
      EXPECT_EQ(found, (Table{3, 32768, 262144, 8388608, 0}));
      EXPECT_EQ(fake.cpuid_calls, 5);
    });
  }
}

TEST(CacheSizes, TheServiceLockIsFreeAgainAfterTheFill) {
  in_child([] {
    qtb_serv_get_cache_sizes(nullptr);
    qtb_serv_lock();
    qtb_serv_unlock();
  });
}

}  // namespace
}  // namespace qtb::test
