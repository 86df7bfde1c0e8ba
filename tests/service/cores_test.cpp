// The core probe on made-up machines. It keeps no state, so that one process can run all cases.

#include <gtest/gtest.h>

#include "service/threads.h"
#include "tests/platform/fake.h"

namespace qtb::test {
namespace {

constexpr std::uint32_t many_per_package = 1U << 28;  // leaf 1, EDX: the counts of a package mean something

struct Counts {
  std::int32_t logical, physical;
  bool operator==(const Counts &) const = default;
};

constexpr std::int32_t untouched = -77;

Counts probe() {
  fake.bound.clear();
  fake.yields = 0;
  Counts counts = {untouched, untouched};
  qtb_serv_count_cores(&counts.logical, &counts.physical);
  return counts;
}

void set_online(int processors) {
  fake.online = fake.process = {};
  fake.refused.clear();
  fake.masks_known = true;
  insert_processors(&fake.online, 0, processors - 1);
  fake.process = fake.online;
}

// Processors of another vendor, numbered as they stand: each is a core.
void plain_machine(int processors) {
  fake.processors.assign(static_cast<std::size_t>(processors), {});
  for (int p = 0; p < processors; ++p) {
    FakeProcessor &processor = fake.processors[static_cast<std::size_t>(p)];
    processor.vendor = "AuthenticAMD";
    processor.identifier = static_cast<std::uint32_t>(p) & 255;
  }
  set_online(processors);
}

int bits_for(int count) {
  int bits = 0;
  while (1 << bits < count) ++bits;
  return bits;
}

// Packages of cores of threads, identified by fields as wide as the counts need.
void belmo_machine(int packages, int cores, int threads) {
  const int thread_bits = bits_for(threads), core_bits = bits_for(cores);
  fake.processors.clear();
  for (int package = 0; package < packages; ++package)
    for (int core = 0; core < cores; ++core)
      for (int thread = 0; thread < threads; ++thread) {
        FakeProcessor processor;
        processor.features_edx = many_per_package;
        processor.cores_per_package = static_cast<std::uint32_t>(cores);
        processor.logical_per_package = static_cast<std::uint32_t>(cores * threads);
        processor.identifier =
            static_cast<std::uint32_t>(package << (core_bits + thread_bits) | core << thread_bits | thread);
        fake.processors.push_back(processor);
      }
  set_online(static_cast<int>(fake.processors.size()));
}

TEST(CoreProbe, CountsCoresAndNotTheirThreads) {
  for (const int packages : {1, 2, 4})
    for (const int cores : {1, 2, 3, 4, 6, 8})
      for (const int threads : {1, 2}) {
        if (packages * cores * threads == 1) continue;
        belmo_machine(packages, cores, threads);
        EXPECT_EQ(probe(), (Counts{packages * cores * threads, packages * cores}))
            << packages << " packages of " << cores << " cores of " << threads << " threads";
      }
}

TEST(CoreProbe, CountsPackagesThatFillTheirFields) {
  belmo_machine(2, 64, 2);
  EXPECT_EQ(probe(), (Counts{256, 128}));
}

TEST(CoreProbe, TheOrderInWhichProcessorsAreNumberedPlaysNoPart) {
  belmo_machine(2, 4, 2);
  std::vector<FakeProcessor> shuffled;
  for (std::size_t i = 0; i < 16; ++i) shuffled.push_back(fake.processors[i * 7 % 16]);
  fake.processors = shuffled;
  EXPECT_EQ(probe(), (Counts{16, 8}));
}

TEST(CoreProbe, EveryProcessorOfAnotherVendorIsACore) {
  belmo_machine(1, 2, 2);
  for (FakeProcessor &processor : fake.processors) processor.vendor = "AuthenticAMD";
  EXPECT_EQ(probe(), (Counts{4, 4}));
}

TEST(CoreProbe, WithoutTheCountsOfAPackageEveryProcessorIsACore) {
  belmo_machine(1, 2, 2);
  for (FakeProcessor &processor : fake.processors) processor.features_edx = ~many_per_package;
  EXPECT_EQ(probe(), (Counts{4, 4}));
}

TEST(CoreProbe, WithoutLeaf4APackageIsOneCore) {
  belmo_machine(2, 2, 2);
  for (FakeProcessor &processor : fake.processors) processor.highest_leaf = 3;
  EXPECT_EQ(probe(), (Counts{8, 2}));
  for (FakeProcessor &processor : fake.processors) processor.highest_leaf = 4;
  EXPECT_EQ(probe(), (Counts{8, 4}));
}

TEST(CoreProbe, WithoutLeaf1TheVendorDoesNotCount) {
  belmo_machine(2, 2, 2);
  for (FakeProcessor &processor : fake.processors) processor.highest_leaf = 0;
  EXPECT_EQ(probe(), (Counts{8, 8}));
}

TEST(CoreProbe, TheHighestLeafIsASignedNumber) {
  belmo_machine(2, 2, 2);
  for (FakeProcessor &processor : fake.processors) processor.highest_leaf = 0x80000008;
  EXPECT_EQ(probe(), (Counts{8, 8}));
}

TEST(CoreProbe, APackageThatReportsNoLogicalProcessorsIsOneCore) {
  belmo_machine(1, 2, 2);
  for (FakeProcessor &processor : fake.processors) processor.logical_per_package = 0;
  EXPECT_EQ(probe(), (Counts{4, 1}));
}

TEST(CoreProbe, ThreadsPerCoreComeFromTheProcessorWhereItBeginsAndTheRestFromTheOneVisited) {
  belmo_machine(1, 4, 2);
  for (std::size_t p = 4; p < 8; ++p) {
    fake.processors[p].cores_per_package = 1;  // its core field is empty; the package field begins at bit 3 as before
  }
  EXPECT_EQ(probe(), (Counts{8, 2}));
}

TEST(CoreProbe, AProcessWithLessThanTheMachineCountsOneCoreAndMovesNowhere) {
  plain_machine(8);
  fake.process = {};
  insert_processors(&fake.process, 0, 6);
  EXPECT_EQ(probe(), (Counts{untouched, 1}));
  EXPECT_TRUE(fake.bound.empty());
  EXPECT_EQ(fake.yields, 0);
}

TEST(CoreProbe, AProcessorBeyondTheFirst64CountsInTheComparison) {
  plain_machine(96);
  fake.process = {};
  insert_processors(&fake.process, 0, 94);
  EXPECT_EQ(probe(), (Counts{untouched, 1}));
}

TEST(CoreProbe, WhereTheSystemDoesNotTellThereIsOneCore) {
  plain_machine(8);
  fake.masks_known = false;
  EXPECT_EQ(probe(), (Counts{untouched, 1}));
  fake.masks_known = true;
}

TEST(CoreProbe, OneProcessorIsOneCore) {
  plain_machine(1);
  EXPECT_EQ(probe(), (Counts{1, 1}));
}

TEST(CoreProbe, VisitsEveryProcessorInTurnAndEndsWithTheProcessMask) {
  plain_machine(5);
  EXPECT_EQ(probe(), (Counts{5, 5}));
  ASSERT_EQ(fake.bound.size(), 6U);
  for (int p = 0; p < 5; ++p) {
    ProcessorSet one = {};
    one.insert(p);
    EXPECT_EQ(fake.bound[static_cast<std::size_t>(p)], one);
  }
  EXPECT_EQ(fake.bound.back(), fake.process);
  EXPECT_EQ(fake.yields, 6);
}

TEST(CoreProbe, MoreThan64ProcessorsAreCountedAndMoreThan256) {
  for (const int processors : {31, 32, 33, 63, 64, 65, 96, 128, 255, 256}) {
    plain_machine(processors);
    EXPECT_EQ(probe(), (Counts{processors, processors}));
  }
}

TEST(CoreProbe, IdentifiersHave8BitsSoThat256CoresAreToldApart) {
  for (const int processors : {257, 300, 1024, static_cast<int>(ProcessorSet::capacity)}) {
    plain_machine(processors);
    EXPECT_EQ(probe(), (Counts{processors, 256}));
  }
}

TEST(CoreProbe, ARefusedProcessorIsSkippedAndTheEntriesAheadOfTheCountDecide) {
  plain_machine(4);
  fake.refused = {1};
  // Entries 0 to 2 are looked at: processor 0, the empty one of the refused, processor 2.
  for (std::size_t p = 0; p < 4; ++p) fake.processors[p].identifier = static_cast<std::uint32_t>(10 + p);
  EXPECT_EQ(probe(), (Counts{3, 3}));
  fake.processors[0].identifier = 0;
  EXPECT_EQ(probe(), (Counts{3, 2}));
  fake.refused = {3};
  EXPECT_EQ(probe(), (Counts{3, 3}));
}

TEST(CoreProbe, AHoleInTheMachineIsLikeARefusedProcessor) {
  plain_machine(4);
  fake.online.words[0] = fake.process.words[0] = 0b1101;
  EXPECT_EQ(probe(), (Counts{3, 2}));
}

TEST(CoreProbe, WithAllButOneProcessorRefusedThereIsOneCore) {
  plain_machine(4);
  fake.refused = {0, 1, 3};
  EXPECT_EQ(probe(), (Counts{1, 1}));
  fake.refused = {0, 1, 2, 3};
  EXPECT_EQ(probe(), (Counts{0, 1}));
}

}  // namespace
}  // namespace qtb::test
