// The real operating system behind platform.h, and the services on it.

#include <omp.h>
#include <pthread.h>
#include <sched.h>

#include <chrono>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <sstream>
#include <thread>

#include "service/cache.h"
#include "service/cpu.h"
#include "service/memory.h"
#include "service/platform/platform.h"
#include "service/threads.h"
#include "tests/support/child.h"
#include "tests/support/run.h"

namespace qtb::test {
namespace {

// ---- The environment ----

TEST(Environment, AnAbsentOrEmptyVariableHasLength0AndLeavesTheBuffer) {
  char buffer[8] = "before";
  unsetenv("QTB_TEST_VARIABLE");
  EXPECT_EQ(platform_environment("QTB_TEST_VARIABLE", buffer, sizeof buffer), 0U);
  setenv("QTB_TEST_VARIABLE", "", 1);
  EXPECT_EQ(platform_environment("QTB_TEST_VARIABLE", buffer, sizeof buffer), 0U);
  EXPECT_STREQ(buffer, "before");
}

TEST(Environment, AValueIsCopiedAsFarAsItFits) {
  setenv("QTB_TEST_VARIABLE", "1234567", 1);
  for (std::size_t size = 0; size <= 10; ++size) {
    char buffer[12];
    std::memset(buffer, '#', sizeof buffer);
    EXPECT_EQ(platform_environment("QTB_TEST_VARIABLE", buffer, size), 7U);
    if (size > 0) {
      EXPECT_EQ(std::string(buffer), std::string("1234567").substr(0, size - 1));
    }
    for (std::size_t i = size; i < sizeof buffer; ++i) EXPECT_EQ(buffer[i], '#') << "size " << size;
  }
}

// ---- The processor ----

TEST(Cpuid, TellsWhatTheCompilersOwnTestsTell) {
  EXPECT_EQ(qtb_serv_cpu_has_sse3(), __builtin_cpu_supports("sse3") != 0);
  EXPECT_EQ(qtb_serv_cpu_has_ssse3(), __builtin_cpu_supports("ssse3") != 0);
  EXPECT_EQ(qtb_serv_cpu_has_sse41(), __builtin_cpu_supports("sse4.1") != 0);
  EXPECT_EQ(qtb_serv_cpu_has_sse42(), __builtin_cpu_supports("sse4.2") != 0);
}

// ---- Thread-local words ----

TEST(ThreadWord, IsNullInEveryNewThreadAndKeptByEach) {
  const std::int32_t index = platform_tls_create();
  ASSERT_GE(index, 0);
  int mine = 0;
  EXPECT_EQ(platform_tls_get(index), nullptr);
  platform_tls_set(index, &mine);
  for (int round = 0; round < 3; ++round)
    std::thread([&] {
      EXPECT_EQ(platform_tls_get(index), nullptr);
      int own = 0;
      platform_tls_set(index, &own);
      EXPECT_EQ(platform_tls_get(index), &own);
    }).join();
  EXPECT_EQ(platform_tls_get(index), &mine);
}

TEST(ThreadWord, OfIndexMinus1ReadsAsNull) {
  int mine = 0;
  platform_tls_set(-1, &mine);
  EXPECT_EQ(platform_tls_get(-1), nullptr);
}

TEST(ThreadWord, IsMinus1WhereTheSystemHasNoneLeftAndTheMemoryServiceRunsOn) {
  in_child([] {
    while (platform_tls_create() >= 0) {
    }
    for (int i = 0; i < 10; ++i) {
      void *p = qtb_serv_malloc(1000, 128);
      EXPECT_EQ(reinterpret_cast<std::uintptr_t>(p) % 128, 0U);
      qtb_serv_free(p);
    }
  });
}

// ---- Affinity ----

int size_of(const ProcessorSet &set) {
  int size = 0;
  for (int p = 0; p < ProcessorSet::capacity; ++p) size += set.contains(p);
  return size;
}

ProcessorSet own_affinity() {
  ProcessorSet set = {};
  EXPECT_EQ(sched_getaffinity(0, sizeof set.words, reinterpret_cast<cpu_set_t *>(set.words)), 0);
  return set;
}

TEST(Affinity, TheProcessHasSomeOfTheProcessorsThatAreOnline) {
  ProcessorSet process, online;
  ASSERT_TRUE(platform_processors(&process, &online));
  EXPECT_GE(size_of(process), 1);
  EXPECT_EQ(size_of(online), sysconf(_SC_NPROCESSORS_ONLN));
  for (int p = 0; p < ProcessorSet::capacity; ++p) EXPECT_LE(process.contains(p), online.contains(p)) << p;
  EXPECT_EQ(process, own_affinity());
}

TEST(Affinity, ABoundThreadRunsWhereItWasBound) {
  in_child([] {
    const ProcessorSet all = own_affinity();
    for (int p = 0; p < ProcessorSet::capacity; ++p) {
      if (!all.contains(p)) continue;
      ProcessorSet one = {};
      one.insert(p);
      ASSERT_TRUE(platform_bind_thread(&one));
      platform_yield();
      EXPECT_EQ(sched_getcpu(), p);
    }
    ASSERT_TRUE(platform_bind_thread(&all));
    EXPECT_EQ(own_affinity(), all);
  });
}

TEST(Affinity, WhatIsNotOnlineIsRefusedAndNothingChanges) {
  in_child([] {
    const ProcessorSet all = own_affinity();
    ProcessorSet set = {};
    EXPECT_FALSE(platform_bind_thread(&set));
    set.insert(ProcessorSet::capacity - 1);
    EXPECT_FALSE(platform_bind_thread(&set));
    EXPECT_EQ(own_affinity(), all);
  });
}

// Binds the calling thread to the first processor that it may use.
void bind_to_one() {
  const ProcessorSet all = own_affinity();
  for (int p = 0; p < ProcessorSet::capacity; ++p) {
    if (!all.contains(p)) continue;
    ProcessorSet one = {};
    one.insert(p);
    platform_bind_thread(&one);
    return;
  }
}

TEST(Affinity, AThreadThatBoundItselfDoesNotNarrowTheProcess) {
  in_child([] {
    const ProcessorSet all = own_affinity();
    std::thread([&] {
      bind_to_one();
      ProcessorSet process, online;
      ASSERT_TRUE(platform_processors(&process, &online));
      EXPECT_EQ(process, all);
    }).join();
    std::atomic<bool> done{false};
    std::thread witness([&] {
      while (!done) platform_yield();
    });
    bind_to_one();
    ProcessorSet process, online;
    ASSERT_TRUE(platform_processors(&process, &online));
    EXPECT_EQ(process, all) << "the first thread alone is bound";
    done = true;
    witness.join();
  });
}

// ---- Cores and threads ----

TEST(RealProbe, CountsAndGivesTheThreadTheProcessMask) {
  in_child([] {
    const ProcessorSet before = own_affinity();
    std::int32_t logical = -1, physical = -1;
    qtb_serv_count_cores(&logical, &physical);
    std::printf("%d logical processors, %d cores\n", logical, physical);
    EXPECT_GE(physical, 1);
    if (logical != -1) {
      EXPECT_EQ(logical, sysconf(_SC_NPROCESSORS_ONLN));
      EXPECT_LE(physical, logical);
    }
    EXPECT_EQ(own_affinity(), before);
  });
}

std::string output_of(const std::vector<std::string> &command, const RunOptions &options) {
  const Run run = run_program(command, options);
  EXPECT_EQ(run.status, 0) << run.output;
  return run.output;
}

std::string facts(const char *what, const RunOptions &options) { return output_of({QTB_TEST_FACTS, what}, options); }

// What may bind or count threads in the environment that the tests are started in.
const std::map<std::string, std::string> plain = {
    {"OMP_PROC_BIND", ""},   {"OMP_PLACES", ""},  {"GOMP_CPU_AFFINITY", ""},     {"OMP_NUM_THREADS", ""},
    {"QTB_NUM_THREADS", ""}, {"QTB_DYNAMIC", ""}, {"QTB_DOMAIN_NUM_THREADS", ""}};

RunOptions with(const std::map<std::string, std::string> &environment, void (*prepare)() = nullptr) {
  RunOptions options = {plain, "", prepare};
  for (const auto &[name, value] : environment) options.environment[name] = value;
  return options;
}

TEST(ThreadBinding, OfTheOpenMpRuntimeDoesNotHideTheProcessors) {
  const std::string free = facts("threads", with({}));
  std::printf("%s", free.c_str());
  EXPECT_EQ(facts("threads", with({{"OMP_PROC_BIND", "true"}})), free);
  EXPECT_EQ(facts("threads", with({{"OMP_PROC_BIND", "close"}})), free);
  EXPECT_EQ(facts("threads", with({{"OMP_PROC_BIND", "spread"}, {"OMP_PLACES", "threads"}})), free);
  EXPECT_EQ(facts("threads", with({{"OMP_PLACES", "cores"}})), free);
}

TEST(ThreadBinding, OfTheWholeProcessLeavesOneThread) {
  if (sysconf(_SC_NPROCESSORS_ONLN) == 1) GTEST_SKIP() << "the machine has one processor";
  for (const char *bind : {"", "true"})
    EXPECT_EQ(facts("threads", with({{"OMP_PROC_BIND", bind}, {"OMP_NUM_THREADS", "2"}}, &bind_to_one)),
              "logical -1 physical 1 threads 1\n");
}

// ---- Libraries ----

const std::string none = "libqmalloc.so is absent\n";

const std::string planted = QTB_TEST_QMALLOC "/complete";

RunOptions in_directory(const std::string &directory, const std::string &search_path) {
  RunOptions options;
  options.environment["LD_LIBRARY_PATH"] = search_path;
  options.directory = directory;
  return options;
}

std::string allocator_facts(const std::string &search_path, const std::string &directory) {
  return facts("allocator", in_directory(directory, search_path));
}

TEST(AllocatorLibrary, OnTheSearchPathServesIfItIsComplete) {
  EXPECT_EQ(allocator_facts(planted, "/"), "qmalloc is loaded\nlibqmalloc.so gave 3, took back 1\n");
}

TEST(AllocatorLibrary, ThatIsIncompleteIsLetGo) {
  EXPECT_EQ(allocator_facts(QTB_TEST_QMALLOC "/three_hooks", "/"), "qmalloc is loaded\n" + none);
  EXPECT_EQ(allocator_facts(QTB_TEST_QMALLOC "/null_hook", "/"), "qmalloc is loaded\n" + none);
}

TEST(AllocatorLibrary, PlantedInTheWorkingDirectoryIsNotLoaded) {
  ASSERT_TRUE(std::filesystem::exists(planted + "/libqmalloc.so"));
  EXPECT_EQ(allocator_facts("", planted), none);
  EXPECT_EQ(allocator_facts("/nonexistent", planted), none);
}

TEST(AllocatorLibrary, PlantedInTheWorkingDirectoryIsNotLoadedThroughAnEmptyOrRelativeEntry) {
  for (const char *path : {":", ";", ":/nonexistent", "/nonexistent:", "/nonexistent::/usr/lib", ".", "./",
                           "/usr/lib:.", "../complete", "/usr/lib;../complete"})
    EXPECT_EQ(allocator_facts(path, planted), none) << path;
}

// The loader knows some words behind a dollar sign, of which $ORIGIN alone stands for an absolute path; any other word
// is the name of a folder as it stands.
TEST(AllocatorLibrary, PlantedBelowTheWorkingDirectoryIsNotLoadedThroughAPlaceholder) {
  namespace fs = std::filesystem;
  char root[] = "/tmp/qtb_planted_XXXXXX";
  ASSERT_NE(mkdtemp(root), nullptr);
  for (const char *path : {"$LIB", "${LIB}", "$PLATFORM", "${PLATFORM}", "$X", "$HOME/lib", "/usr/lib:$LIB"}) {
    std::istringstream folders(facts("folders", in_directory(root, path)));
    int planted_in = 0;
    for (std::string folder; std::getline(folders, folder);) {
      if (folder[0] == '/') continue;
      fs::create_directories(root / fs::path(folder));
      fs::copy_file(planted + "/libqmalloc.so", root / fs::path(folder) / "libqmalloc.so",
                    fs::copy_options::overwrite_existing);
      ++planted_in;
    }
    EXPECT_EQ(planted_in, 1) << path;
    EXPECT_EQ(allocator_facts(path, root), none) << path;
  }
  fs::remove_all(root);
}

TEST(AllocatorLibrary, BesideTheProgramServesThroughThePlaceholderForItsFolder) {
  namespace fs = std::filesystem;
  const std::string folder = fs::relative(planted, fs::path(QTB_TEST_FACTS).parent_path());
  EXPECT_EQ(allocator_facts("$ORIGIN/" + folder, "/"), "qmalloc is loaded\nlibqmalloc.so gave 3, took back 1\n");
}

// The loader reads the variable when the program starts.
TEST(AllocatorLibrary, IsLookedForWhereTheLoaderSearchesAndNotWhereTheVariableSaysByNow) {
  for (const char *path : {".", ":", "../complete"})
    EXPECT_EQ(facts("allocator-after-unset", in_directory(planted, path)), none) << path;
  EXPECT_EQ(facts("allocator-after-unset", in_directory("/", planted)),
            "qmalloc is loaded\nlibqmalloc.so gave 3, took back 1\n");
}

TEST(AllocatorLibrary, PlantedInTheWorkingDirectoryIsNotLoadedThroughARunPathOfTheProgram) {
  for (const char *program : {QTB_TEST_FACTS_RPATH, QTB_TEST_FACTS_RUNPATH})
    EXPECT_EQ(output_of({program, "allocator"}, in_directory(planted, "")), none) << program;
}

// ---- The product beside an allocator library ----

const std::string right = "the product is right\n";

std::string product_facts(const std::string &program, const RunOptions &options) {
  return output_of({program, "product", QTB_TEST_LIBRARY}, options);
}

TEST(Product, TakesItsWorkBuffersFromTheAllocatorLibrary) {
  const std::string output = product_facts(QTB_TEST_FACTS, in_directory("/", planted));
  int given = 0, taken_back = -1;
  ASSERT_EQ(
      std::sscanf(output.c_str(), "qmalloc is loaded\nthe product is right\nlibqmalloc.so gave %d, took back %d\n",
                  &given, &taken_back),
      2)
      << output;
  EXPECT_GE(given, 2) << "a list and a buffer";
  EXPECT_LT(taken_back, given);
}

TEST(Product, TakesNoneFromAPlantedOne) {
  EXPECT_EQ(product_facts(QTB_TEST_FACTS, in_directory(planted, "")), right + none);
  EXPECT_EQ(product_facts(QTB_TEST_FACTS, in_directory(planted, "$X:.")), right + none);
  EXPECT_EQ(product_facts(QTB_TEST_FACTS_RPATH, in_directory(planted, "")), right + none);
}

TEST(Product, LetsAnIncompleteOneGo) {
  EXPECT_EQ(product_facts(QTB_TEST_FACTS, in_directory("/", QTB_TEST_QMALLOC "/null_hook")),
            "qmalloc is loaded\n" + right + none);
}

TEST(Libraries, AreFoundByNameAndTellTheirSymbols) {
  EXPECT_EQ(platform_load_library("libqtb_nowhere.so"), nullptr);
  void *library = platform_load_library("libm.so.6");
  ASSERT_NE(library, nullptr);
  EXPECT_NE(platform_library_symbol(library, "cos"), nullptr);
  EXPECT_EQ(platform_library_symbol(library, "qtb_nowhere"), nullptr);
  platform_unload_library(library);
}

// ---- Fork ----

// What a child may want of the services, whatever the other threads of its parent were about.
void use_services() {
  qtb_serv_lock();
  qtb_serv_unlock();
  void *p = qtb_serv_malloc(1000, 128);
  EXPECT_EQ(reinterpret_cast<std::uintptr_t>(p) % 128, 0U);
  qtb_serv_free(p);
  void *direct = qtb_serv_malloc(50'000'000, 0);  // its release searches all lists under the lock
  qtb_serv_free(direct);
  qtb_serv_get_cache_sizes(nullptr);
  EXPECT_GE(qtb_serv_get_max_threads(domain_blas), 1);
}

TEST(Fork, AfterAParallelRegionTheChildRunsOnOneThread) {
  in_child([] {
    qtb_serv_prepare_fork();
    setenv("QTB_DYNAMIC", "FALSE", 1);
    setenv("QTB_NUM_THREADS", "3", 1);
    std::atomic<int> members{0};
#pragma omp parallel num_threads(3)
    ++members;
    ASSERT_EQ(members, 3);
    in_child([] {
      EXPECT_EQ(platform_forked_from_threads(), 1);
      EXPECT_EQ(qtb_serv_get_max_threads(domain_blas), 1);
      use_services();
      in_child([] { EXPECT_EQ(qtb_serv_get_max_threads(domain_blas), 1) << "a grandchild"; });
    });
    EXPECT_EQ(platform_forked_from_threads(), 0);
    EXPECT_EQ(qtb_serv_get_max_threads(domain_blas), 3);
  });
}

#if defined(__has_feature)
#define QTB_HAS_FEATURE(name) __has_feature(name)
#else
#define QTB_HAS_FEATURE(name) 0
#endif

TEST(Fork, OfAProcessWithOneThreadLeavesTheChildItsThreads) {
  if (QTB_HAS_FEATURE(thread_sanitizer)) GTEST_SKIP() << "the sanitizer has a thread of its own";
  in_child([] {
    qtb_serv_prepare_fork();
    setenv("QTB_DYNAMIC", "FALSE", 1);
    setenv("QTB_NUM_THREADS", "3", 1);
    std::thread([] {}).join();
    in_child([] {
      EXPECT_EQ(platform_forked_from_threads(), 0);
      EXPECT_EQ(qtb_serv_get_max_threads(domain_blas), 3);
      std::atomic<int> members{0};
#pragma omp parallel num_threads(3)
      ++members;
      EXPECT_EQ(members, 3);
    });
  });
}

TEST(Fork, WhileOtherThreadsUseTheLockLeavesNoChildWaitingAndTheLockIntact) {
  constexpr int forks = 200;
  in_child(
      [] {
        qtb_serv_prepare_fork();
        // Another thread's buffer is released under the lock, and without the allocator, whose own locks are not at
        // issue: that of the address sanitizer leaves its children waiting.
        void *const of_this_thread = qtb_serv_malloc(1000, 0);
        std::atomic<bool> done{false};
        std::atomic<int> inside{0}, met{0};
        std::vector<std::thread> threads;
        for (int i = 0; i < 3; ++i)
          threads.emplace_back([&] {
            while (!done) {
              qtb_serv_free(of_this_thread);
              qtb_serv_lock();
              met += ++inside != 1;
              for (int held = 0; held < 10'000; ++held) asm volatile("");
              --inside;
              qtb_serv_unlock();
              std::this_thread::sleep_for(std::chrono::microseconds(10));  // or the forks starve
            }
          });
        for (int i = 0; i < forks && !::testing::Test::HasFailure(); ++i) in_child(use_services, 10);
        done = true;
        for (std::thread &thread : threads) thread.join();
        EXPECT_EQ(met, 0) << "two threads held the lock at once";
        std::printf("%d forks survived\n", forks);
      },
      120);
}

}  // namespace
}  // namespace qtb::test
