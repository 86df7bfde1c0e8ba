// The memory service by its rules, over an allocator that records what is asked of it. Each case has its own process.
// One file, although a long one: the cases share that allocator and few lines each.

#include "service/memory.h"

#include <chrono>
#include <random>
#include <thread>

#include "tests/service/recording_allocator.h"
#include "tests/support/child.h"
#include "tests/support/together.h"

namespace qtb::test {
namespace {

constexpr std::uint64_t largest_kept = 41'943'040;
constexpr std::size_t most_lists = 8193;

// Runs a case on a fresh service whose thread has its list already: requests and releases are the buffers' alone.
template <class Body>
void with_list(Body body) {
  in_child([&] {
    use_recording_allocator();
    qtb_serv_malloc(1, 0);  // its entry stays in use, out of the way
    allocator.requests.clear();
    body();
    EXPECT_EQ(allocator.bad_releases, 0);
  });
}

// Runs a case on a fresh service; the first request is that of the list.
template <class Body>
void with_service(Body body, unsigned seconds = 20) {
  in_child(
      [&] {
        use_recording_allocator();
        body();
        EXPECT_EQ(allocator.bad_releases, 0);
      },
      seconds);
}

std::uintptr_t address(const void *pointer) { return reinterpret_cast<std::uintptr_t>(pointer); }

using Sizes = std::vector<std::size_t>;

// ---- Sizes and alignments ----

TEST(Malloc, OfNothingIsNullAndAsksForNothing) {
  with_service([] {
    EXPECT_EQ(qtb_serv_malloc(0, 128), nullptr);
    EXPECT_TRUE(allocator.requests.empty());
    EXPECT_TRUE(fake.environment_reads.empty());
    EXPECT_EQ(fake.thread_words, 1);  // the thread word is made all the same
  });
}

TEST(Malloc, AnAlignmentOfAPowerOfTwoFrom4AsksForThatMuchMore) {
  with_list([] {
    allocator.offset = 20;
    for (const std::int32_t alignment : {4, 8, 64, 128}) {
      void *p = qtb_serv_malloc(1000, alignment);
      EXPECT_EQ(address(p) % static_cast<std::uint32_t>(alignment), 0U);
    }
    EXPECT_EQ(allocator.requests, (Sizes{1004, 1008, 1064, 1128}));
  });
}

TEST(Malloc, AnAlignmentBelow4GetsNoAllowance) {
  with_list([] {
    allocator.offset = 18;
    for (const std::int32_t alignment : {0, 2, 3, -128})
      EXPECT_EQ(allocator.live.count(qtb_serv_malloc(1000, alignment)), 1U) << "what the allocator returned";
    EXPECT_EQ(allocator.requests, (Sizes{1000, 1000, 1000, 1000}));
  });
}

TEST(Malloc, AnAlignmentThatIsNoPowerOfTwoIs32) {
  with_list([] {
    for (const std::int32_t alignment : {48, 5, 100}) EXPECT_EQ(address(qtb_serv_malloc(1000, alignment)) % 32, 0U);
    EXPECT_EQ(allocator.requests, (Sizes{1032, 1032, 1032}));
  });
}

TEST(Malloc, ABufferLiesWithinWhatWasAskedFor) {
  for (std::size_t offset = 1; offset < 256; offset += 5)
    with_list([&] {
      allocator.offset = offset;
      for (const std::int32_t alignment : {128, 64, 4}) {
        const std::uintptr_t p = address(qtb_serv_malloc(1000, alignment));
        EXPECT_EQ(p % static_cast<std::uint32_t>(alignment), 0U);
        bool within = false;
        for (const auto &[raw, size] : allocator.live)
          within = within || (p >= address(raw) && p + 1000 <= address(raw) + size);
        EXPECT_TRUE(within) << "offset " << offset << " alignment " << alignment;
      }
    });
}

TEST(Malloc, AnAddressThatIsAlignedAlreadyIsHandedOutAsItIs) {
  with_list([] {
    allocator.offset = 1024;
    EXPECT_EQ(allocator.live.count(qtb_serv_malloc(1000, 128)), 1U);
  });
}

TEST(Malloc, UpTo40MiBComeFromTheListAndMoreFromTheAllocator) {
  with_list([] {
    void *kept = qtb_serv_malloc(largest_kept, 128);
    EXPECT_EQ(address(kept) % 128, 0U);
    qtb_serv_free(kept);
    EXPECT_TRUE(allocator.releases.empty());
    void *direct = qtb_serv_malloc(largest_kept + 1, 128);
    EXPECT_EQ(address(direct) % 128, 16U);
    qtb_serv_free(direct);
    EXPECT_EQ(allocator.releases, std::vector<void *>{direct});
    EXPECT_EQ(allocator.requests, (Sizes{largest_kept + 128, largest_kept + 1}));
  });
}

TEST(Malloc, AnImpossibleSizeIsTheAllocatorsToRefuse) {
  with_list([] {
    allocator.failing_size = SIZE_MAX - 1;
    EXPECT_EQ(qtb_serv_malloc(SIZE_MAX - 1, 128), nullptr);
  });
}

// ---- Which entry serves a request ----

TEST(Malloc, TheSameRequestGetsTheSameMemoryAndAsksNobody) {
  with_list([] {
    void *first = qtb_serv_malloc(1000, 128);
    for (int i = 0; i < 100; ++i) {
      qtb_serv_free(first);
      ASSERT_EQ(qtb_serv_malloc(1000, 128), first);
    }
    EXPECT_EQ(allocator.requests.size(), 1U);
    EXPECT_TRUE(allocator.releases.empty());
  });
}

TEST(Malloc, TheSameNeedWithAnotherAlignmentIsAnExactMatch) {
  with_list([] {
    allocator.offset = 72;
    qtb_serv_free(qtb_serv_malloc(1000, 128));
    void *second = qtb_serv_malloc(1064, 64);
    EXPECT_EQ(address(second) % 128, 0U) << "72 rounded up to 64 is 128";
    EXPECT_EQ(allocator.requests, Sizes{1128});
    qtb_serv_free(second);
    EXPECT_TRUE(allocator.releases.empty());
  });
}

TEST(Malloc, WithRoomInTheListALargerFreeBufferIsNotReused) {
  with_list([] {
    qtb_serv_free(qtb_serv_malloc(5000, 0));
    qtb_serv_malloc(1000, 0);
    EXPECT_EQ(allocator.requests, (Sizes{5000, 1000}));
  });
}

// A full list of free entries of these sizes, in this order.
void fill_list(const Sizes &sizes) {
  use_recording_allocator();
  std::vector<void *> buffers;
  for (const std::size_t size : sizes) buffers.push_back(qtb_serv_malloc(size, 0));
  for (void *buffer : buffers) qtb_serv_free(buffer);
  allocator.requests.clear();
}

TEST(Malloc, AFullListGivesTheFirstLargerBufferAndItKeepsItsSize) {
  in_child([] {
    fill_list({100, 200, 300, 400, 500});
    void *p = qtb_serv_malloc(250, 0);
    EXPECT_EQ(allocator.live[p], 300U);
    qtb_serv_free(p);
    EXPECT_EQ(qtb_serv_malloc(300, 0), p);
    EXPECT_TRUE(allocator.requests.empty());
  });
  in_child([] {
    fill_list({100, 500, 300, 260, 400});
    EXPECT_EQ(allocator.live[qtb_serv_malloc(250, 0)], 500U) << "the first, not the best";
  });
}

TEST(Malloc, AFullListWithoutALargerBufferReplacesTheFirstSmaller) {
  in_child([] {
    fill_list({100, 200, 300, 400, 500});
    void *p = qtb_serv_malloc(600, 0);
    EXPECT_EQ(allocator.live[p], 600U);
    EXPECT_EQ(allocator.releases.size(), 1U);
    EXPECT_EQ(allocator.requests, Sizes{600});
    std::size_t left = 0;
    for (const auto &[raw, size] : allocator.live) left += size == 200 || size == 300 || size == 400 || size == 500;
    EXPECT_EQ(left, 4U) << "the entry of 100 bytes went";
    qtb_serv_free(p);
    EXPECT_EQ(qtb_serv_malloc(600, 0), p);
    EXPECT_EQ(allocator.bad_releases, 0);
  });
  in_child([] {
    fill_list({300, 100, 200, 250, 150});
    qtb_serv_malloc(600, 0);
    std::size_t left = 0;
    for (const auto &[raw, size] : allocator.live) left += size == 300;
    EXPECT_EQ(left, 0U) << "the first, not the smallest";
  });
}

TEST(Malloc, AnExactMatchComesBeforeALargerBuffer) {
  in_child([] {
    fill_list({500, 100, 250, 400, 300});
    EXPECT_EQ(allocator.live[qtb_serv_malloc(250, 0)], 250U);
    EXPECT_EQ(allocator.live[qtb_serv_malloc(250, 0)], 500U) << "the exact match is in use";
  });
}

TEST(Malloc, ASixthBufferIsTheAllocatorsUnalignedAndNotKept) {
  with_service([] {
    std::vector<void *> held;
    for (int i = 0; i < 5; ++i) held.push_back(qtb_serv_malloc(1000, 128));
    void *sixth = qtb_serv_malloc(1000, 128);
    EXPECT_EQ(allocator.requests.back(), 1000U);
    EXPECT_EQ(address(sixth) % 128, 16U);
    qtb_serv_free(sixth);
    EXPECT_EQ(allocator.releases, std::vector<void *>{sixth});
    for (void *buffer : held) qtb_serv_free(buffer);
    EXPECT_EQ(allocator.releases.size(), 1U);
  });
}

// ---- Releases ----

TEST(Free, OfNullDoesNothing) {
  with_service([] {
    qtb_serv_free(nullptr);
    EXPECT_TRUE(fake.environment_reads.empty());
    EXPECT_TRUE(allocator.releases.empty());
  });
}

TEST(Free, ASecondTimeChangesNothing) {
  with_list([] {
    void *p = qtb_serv_malloc(1000, 128);
    qtb_serv_free(p);
    qtb_serv_free(p);
    EXPECT_TRUE(allocator.releases.empty());
    EXPECT_EQ(qtb_serv_malloc(1000, 128), p);
  });
}

TEST(Free, OfAPointerThatTheServiceNeverGaveOutGoesToTheAllocator) {
  with_service([] {  // also as the first call of a process
    void *mine = recording_malloc(10);
    qtb_serv_free(mine);
    EXPECT_EQ(allocator.releases, std::vector<void *>{mine});
  });
}

TEST(Free, OnAnotherThreadGivesTheBufferBackToItsOwner) {
  with_list([] {
    void *p = qtb_serv_malloc(1000, 128);
    std::thread([&] {
      qtb_serv_free(p);
      EXPECT_NE(qtb_serv_malloc(1000, 128), p);
    }).join();
    EXPECT_TRUE(allocator.releases.empty());
    EXPECT_EQ(qtb_serv_malloc(1000, 128), p);
  });
}

TEST(Free, OnAThreadWithoutAListFindsTheOwnersEntry) {
  with_list([] {
    void *p = qtb_serv_malloc(1000, 128);
    std::thread([&] { qtb_serv_free(p); }).join();
    EXPECT_TRUE(allocator.releases.empty());
    EXPECT_EQ(qtb_serv_malloc(1000, 128), p);
  });
}

TEST(Free, OfABufferWhoseThreadHasEnded) {
  with_list([] {
    void *p = nullptr;
    std::thread([&] { p = qtb_serv_malloc(1000, 128); }).join();
    qtb_serv_free(p);
    EXPECT_TRUE(allocator.releases.empty());
  });
}

// The allocator may give the memory to another thread as soon as it has it, and that thread may release it at once.
TEST(Free, OfMemoryThatAListHasJustGivenUpGoesToTheAllocator) {
  in_child([] {
    fill_list({100, 200, 300, 400, 500});
    allocator.on_release = [](void *given_up) {
      allocator.on_release = nullptr;
      allocator.live[given_up] = 100;
      std::thread([=] { qtb_serv_free(given_up); }).join();
    };
    void *p = qtb_serv_malloc(600, 0);
    ASSERT_EQ(allocator.releases.size(), 2U) << "a list took the other thread's release for its own buffer's";
    EXPECT_EQ(allocator.releases[0], allocator.releases[1]);
    EXPECT_EQ(allocator.live[p], 600U);
    EXPECT_EQ(allocator.bad_releases, 0);
  });
}

// ---- The switches ----

TEST(Switches, AnyValueOfEitherTurnsTheListsOff) {
  for (const char *name : {"QTB_DISABLE_FAST_MM", "QTB_MM_DISABLE"})
    for (const std::string &value : {std::string("1"), std::string("0"), std::string("no"), std::string(300, 'x')})
      with_service([&] {
        fake.environment[name] = value;
        void *p = qtb_serv_malloc(1000, 128);
        EXPECT_EQ(address(p) % 128, 16U);
        EXPECT_EQ(allocator.requests, Sizes{1000}) << "neither a list nor an allowance";
        qtb_serv_free(p);
        EXPECT_EQ(allocator.releases, std::vector<void *>{p});
      });
}

TEST(Switches, AnEmptyValueIsAbsent) {
  with_service([] {
    fake.environment["QTB_MM_DISABLE"] = "";
    EXPECT_EQ(address(qtb_serv_malloc(1000, 128)) % 128, 0U);
  });
}

TEST(Switches, AreReadOnceInTheirOrder) {
  with_service([] {
    for (int i = 0; i < 10; ++i) qtb_serv_free(qtb_serv_malloc(1000, 128));
    EXPECT_EQ(fake.environment_reads, (std::vector<std::string>{"QTB_DISABLE_FAST_MM", "QTB_MM_DISABLE"}));
    fake.environment["QTB_MM_DISABLE"] = "1";
    EXPECT_EQ(address(qtb_serv_malloc(2000, 128)) % 128, 0U);
  });
  with_service([] {
    fake.environment["QTB_DISABLE_FAST_MM"] = "1";
    qtb_serv_free(qtb_serv_malloc(1000, 128));
    EXPECT_EQ(fake.environment_reads, std::vector<std::string>{"QTB_DISABLE_FAST_MM"});
  });
}

// ---- When memory is out ----

TEST(OutOfMemory, ABufferThatFailsIsNullAndItsPlaceIsLost) {
  with_service([] {
    allocator.failing_size = 5000;
    EXPECT_EQ(qtb_serv_malloc(5000, 0), nullptr);
    std::vector<void *> held;
    for (int i = 0; i < 4; ++i) held.push_back(qtb_serv_malloc(1000, 128));
    for (void *buffer : held) EXPECT_EQ(address(buffer) % 128, 0U);
    EXPECT_EQ(address(qtb_serv_malloc(1000, 128)) % 128, 16U) << "a fifth has no place";
    for (void *buffer : held) qtb_serv_free(buffer);
    allocator.failing_size = SIZE_MAX;
    EXPECT_NE(qtb_serv_malloc(5000, 0), nullptr) << "a failed entry serves nobody";
  });
}

TEST(OutOfMemory, AReplacementThatFailsIsNullAndTheOldBufferIsGone) {
  in_child([] {
    fill_list({100, 200, 300, 400, 500});
    allocator.failing_size = 600;
    EXPECT_EQ(qtb_serv_malloc(600, 0), nullptr);
    EXPECT_EQ(allocator.releases.size(), 1U);
    EXPECT_EQ(allocator.live.count(allocator.releases[0]), 0U);
    qtb_serv_malloc(700, 0);
    EXPECT_EQ(allocator.releases.size(), 2U) << "the entry of 200 bytes was next";
    EXPECT_EQ(allocator.bad_releases, 0);
  });
}

TEST(OutOfMemory, AThreadWhoseListFailsGetsPlainMemoryUntilAListSucceeds) {
  with_service([] {
    allocator.failing_call = 0;
    void *plain = qtb_serv_malloc(1000, 128);
    ASSERT_NE(plain, nullptr);
    EXPECT_EQ(address(plain) % 128, 16U);
    EXPECT_EQ(allocator.requests.back(), 1000U);
    void *listed = qtb_serv_malloc(1000, 128);
    EXPECT_EQ(address(listed) % 128, 0U);
    qtb_serv_free(plain);
    qtb_serv_free(listed);
    EXPECT_EQ(allocator.releases, std::vector<void *>{plain});
  });
}

TEST(OutOfMemory, EveryCallOfTheAllocatorMayFail) {
  std::size_t calls = 0;
  const auto scenario = [] {
    use_recording_allocator();
    std::vector<void *> held;
    for (const std::uint64_t size : {1000, 2000, 3000, 4000, 5000, 6000, 50'000'000})
      held.push_back(qtb_serv_malloc(size, 128));
    int failed = 0;
    for (void *buffer : held) failed += buffer == nullptr;
    for (void *buffer : held) qtb_serv_free(buffer);
    held.clear();
    for (const std::uint64_t size : {1500, 9000, 1000}) held.push_back(qtb_serv_malloc(size, 128));
    for (void *buffer : held) failed += buffer == nullptr;
    for (void *buffer : held) qtb_serv_free(buffer);
    EXPECT_EQ(allocator.bad_releases, 0);
    return failed;
  };
  in_child([&] {
    EXPECT_EQ(scenario(), 0);
    EXPECT_EQ(allocator.requests.size(), 9U);
  });
  for (; calls < 9; ++calls)
    in_child([&] {
      allocator.failing_call = calls;
      EXPECT_EQ(scenario(), calls == 0 ? 0 : 1) << "call " << calls;  // call 0 is the list, and has a way around it
    });
  std::printf("%zu allocator calls made to fail, one at a time\n", calls);
}

// ---- The table of lists ----

TEST(Lists, WithoutAThreadWordEveryRequestMakesAListUntilTheTableIsFull) {
  with_service([] {
    fake.no_thread_words = true;
    void *last = nullptr;
    for (std::size_t i = 0; i < most_lists; ++i) last = qtb_serv_malloc(1000, 128);
    EXPECT_EQ(address(last) % 128, 0U);
    EXPECT_EQ(allocator.requests.size(), 2 * most_lists);
    void *plain = qtb_serv_malloc(1000, 128);
    EXPECT_EQ(address(plain) % 128, 16U);
    EXPECT_EQ(allocator.requests.size(), 2 * most_lists + 1);
    qtb_serv_free(last);
    EXPECT_TRUE(allocator.releases.empty()) << "the last list of the table is searched";
    qtb_serv_free(plain);
    EXPECT_EQ(allocator.releases, std::vector<void *>{plain});
  });
}

TEST(Lists, AThreadBeyondTheLimitGetsPlainMemoryAndTheOthersKeepTheirs) {
  with_service([] {
    void *mine = qtb_serv_malloc(1000, 128);
    for (std::size_t i = 1; i < most_lists; ++i) std::thread([] { qtb_serv_free(qtb_serv_malloc(8, 0)); }).join();
    std::thread([] {
      void *plain = qtb_serv_malloc(1000, 128);
      EXPECT_EQ(address(plain) % 128, 16U);
      qtb_serv_free(plain);
      EXPECT_EQ(allocator.releases, std::vector<void *>{plain});
    }).join();
    qtb_serv_free(mine);
    EXPECT_EQ(qtb_serv_malloc(1000, 128), mine);
  });
}

TEST(Lists, OneThreadWordServesAllThreads) {
  with_service([] {
    // All of them find that there is none, and wait for the lock.
    qtb_serv_lock();
    std::atomic<int> started{0};
    std::thread opener([&] {
      while (started != 16) std::this_thread::yield();
      std::this_thread::sleep_for(std::chrono::milliseconds(20));
      qtb_serv_unlock();
    });
    on_threads(16, [&](int) {
      ++started;
      qtb_serv_malloc(1000, 128);
    });
    opener.join();
    EXPECT_EQ(fake.thread_words, 1);
    EXPECT_EQ(fake.environment_reads.size(), 2U);
    EXPECT_EQ(allocator.requests.size(), 32U);
  });
}

TEST(Lists, WhoeverFindsTheLastPlaceTakenGetsPlainMemory) {
  with_service([] {
    fake.no_thread_words = true;
    for (std::size_t i = 1; i < most_lists; ++i) qtb_serv_malloc(1000, 128);
    void *of_the_other = nullptr;
    allocator.on_request = [&](std::size_t) {  // that of the list for the last place
      allocator.on_request = nullptr;
      std::thread([&] { of_the_other = qtb_serv_malloc(1000, 128); }).join();
    };
    void *plain = qtb_serv_malloc(1000, 128);
    EXPECT_EQ(address(of_the_other) % 128, 0U);
    EXPECT_EQ(address(plain) % 128, 16U);
    EXPECT_EQ(allocator.releases.size(), 1U) << "the list without a place";
  });
}

// ---- Threads ----

// A buffer on its way between threads, with what its writer put in.
struct Parcel {
  std::uint64_t *words;
  std::size_t count;
  std::uint64_t mark;
};

TEST(Threads, AllocateHandOverAndReleaseWithoutLosingOrSharingABuffer) {
  with_service(
      [] {
        const int rounds = std::getenv("QTB_TEST_LONG") != nullptr ? 5'000 : 200;
        constexpr std::size_t shelf_size = 24;
        std::mutex mutex;
        std::vector<Parcel> shelf;
        std::atomic<int> damaged{0};
        std::atomic<std::uint64_t> marks{0};
        on_threads(16, [&](int thread) {
          std::mt19937 random(static_cast<unsigned>(thread));
          for (int round = 0; round < rounds; ++round) {
            const std::size_t count = 16 + random() % 8 * 32;
            const Parcel made = {static_cast<std::uint64_t *>(qtb_serv_malloc(count * 8, 64)), count, ++marks};
            for (std::size_t i = 0; i < count; ++i) made.words[i] = made.mark;
            Parcel taken;
            {
              const std::lock_guard guard(mutex);
              shelf.push_back(made);
              if (shelf.size() <= shelf_size) continue;
              std::swap(shelf[random() % shelf.size()], shelf.back());
              taken = shelf.back();
              shelf.pop_back();
            }
            for (std::size_t i = 0; i < taken.count; ++i) damaged += taken.words[i] != taken.mark;
            qtb_serv_free(taken.words);
          }
        });
        for (const Parcel &parcel : shelf) qtb_serv_free(parcel.words);
        EXPECT_EQ(damaged, 0);
      },
      280);
}

TEST(Lock, LetsOneThreadInAtATime) {
  in_child([] {
    int plain = 0;
    on_threads(16, [&](int) {
      for (int round = 0; round < 500; ++round) {
        qtb_serv_lock();
        ++plain;
        qtb_serv_unlock();
      }
    });
    EXPECT_EQ(plain, 8000);
  });
}

TEST(Lock, IsTakenAheadOfAForkAndReleasedBehindIt) {
  in_child([] {
    qtb_serv_prepare_fork();
    EXPECT_EQ(fake.before_fork, &qtb_serv_lock);
    EXPECT_EQ(fake.after_fork, &qtb_serv_unlock);
  });
}

// An allocator with locks and fork handlers of its own would otherwise wait for the service lock, and a thread inside
// the service for the allocator.
TEST(Lock, IsFreeWheneverTheAllocatorIsCalled) {
  with_service([] {
    const auto take_the_lock = [] {  // not re-entrant: an alarm ends a case that holds it
      qtb_serv_lock();
      qtb_serv_unlock();
    };
    int requests = 0, releases = 0;
    allocator.on_request = [&](std::size_t) { take_the_lock(), ++requests; };
    allocator.on_release = [&](void *) { take_the_lock(), ++releases; };
    std::vector<void *> held;
    for (const std::uint64_t size : {1000, 2000, 3000, 4000, 5000, 6000, 50'000'000})
      held.push_back(qtb_serv_malloc(size, 128));
    for (void *buffer : held) qtb_serv_free(buffer);
    qtb_serv_malloc(9000, 128);
    EXPECT_EQ(requests, 9) << "the list, five buffers, two beyond the list, a replacement";
    EXPECT_EQ(releases, 3);
  });
}

// ---- The allocator ----

TEST(SelectAllocator, TakesAllFourHooksAndKeepsTheLibrary) {
  in_child([] {
    use_recording_allocator();
    EXPECT_EQ(fake.loads, std::vector<std::string>{"libqmalloc.so"});
    EXPECT_EQ(fake.unloads, 0);
    qtb_serv_free(qtb_serv_malloc(1000, 0));
    EXPECT_EQ(allocator.requests.size(), 2U);
  });
}

void expect_the_c_library() {
  void *p = qtb_serv_malloc(1000, 128);
  EXPECT_NE(p, nullptr);
  EXPECT_EQ(address(p) % 128, 0U);
  qtb_serv_free(p);
  void *direct = qtb_serv_malloc(largest_kept + 1, 128);
  EXPECT_NE(direct, nullptr);
  qtb_serv_free(direct);
  EXPECT_TRUE(allocator.requests.empty());
}

TEST(SelectAllocator, WithoutTheLibraryTheCLibraryServes) {
  in_child([] {
    qtb_serv_select_allocator();
    EXPECT_EQ(fake.loads.size(), 1U);
    EXPECT_EQ(fake.unloads, 0);
    expect_the_c_library();
  });
}

TEST(SelectAllocator, BeforeAnySelectionTheCLibraryServes) {
  in_child([] { expect_the_c_library(); });
}

TEST(SelectAllocator, ALibraryWithoutOneOfTheNamesIsLetGo) {
  for (const char *missing : {"q_malloc_dll", "q_calloc_dll", "q_realloc_dll", "q_free_dll"})
    in_child([&] {
      fake.libraries["libqmalloc.so"] = {{"q_malloc_dll", &q_malloc},
                                         {"q_calloc_dll", &q_calloc},
                                         {"q_realloc_dll", &q_realloc},
                                         {"q_free_dll", &q_free}};
      fake.libraries["libqmalloc.so"].erase(missing);
      qtb_serv_select_allocator();
      EXPECT_EQ(fake.unloads, 1) << missing;
      expect_the_c_library();
    });
}

TEST(SelectAllocator, ALibraryWithANullHookIsLetGo) {
  for (const char *empty : {"q_malloc_dll", "q_calloc_dll", "q_realloc_dll", "q_free_dll"})
    in_child([&] {
      fake.libraries["libqmalloc.so"] = {{"q_malloc_dll", &q_malloc},
                                         {"q_calloc_dll", &q_calloc},
                                         {"q_realloc_dll", &q_realloc},
                                         {"q_free_dll", &q_free}};
      void *null_hook = nullptr;
      fake.libraries["libqmalloc.so"][empty] = &null_hook;
      qtb_serv_select_allocator();
      EXPECT_EQ(fake.unloads, 1) << empty;
      expect_the_c_library();
    });
}

}  // namespace
}  // namespace qtb::test
