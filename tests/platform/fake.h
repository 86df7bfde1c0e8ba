// A made-up operating system and processor behind service/platform/platform.h: what a test wants the library to find.
//
// A test sets up `fake` before it calls the library and reads from it what the library did. The library may then run on
// any number of threads; the set-up itself is for one. Messages are fake_messages.h's.
#pragma once

#include <atomic>
#include <cstdint>
#include <functional>
#include <map>
#include <mutex>
#include <set>
#include <string>
#include <vector>

#include "service/platform/platform.h"

namespace qtb::test {

// One logical processor, as CPUID describes it.
struct FakeProcessor {
  std::string vendor = "GenuineBelmo";
  std::uint32_t highest_leaf = 11;
  std::uint32_t signature = 0;     // leaf 1, EAX
  std::uint32_t features_ecx = 0;  // leaf 1, ECX
  std::uint32_t features_edx = 0;  // leaf 1, EDX
  std::uint32_t identifier = 0;    // leaf 1, EBX bits 24 to 31
  std::uint32_t logical_per_package = 1;
  std::uint32_t cores_per_package = 1;
  std::vector<CpuidRegisters> caches;  // the sub-leaves of leaf 4; beyond them, zeros
  bool caches_never_end = false;       // beyond them, the last one again and again
};

// A cache as leaf 4 describes it: type 1 data, 2 instructions, 3 both.
CpuidRegisters fake_cache(std::uint32_t type, std::uint32_t line_size, std::uint32_t partitions, std::uint32_t ways,
                          std::uint32_t sets);

// The processors first to last, both included, added to a set.
void insert_processors(ProcessorSet *set, int first, int last);

// Makes the machine one of so many cores, of one thread each, all of which the process may use.
void set_cores(int count);

struct FakeSystem {
  std::map<std::string, std::string> environment;
  std::vector<std::string> environment_reads;  // the names asked for, in order

  std::vector<FakeProcessor> processors{1};  // a processor beyond the list is like its last one
  std::atomic<int> cpuid_calls{0};
  std::function<void()> on_cpuid;  // called by each of them, where it is set

  std::uint64_t saved_state = 7;  // of the registers: those of 8, 16 and 32 bytes

  ProcessorSet process = {}, online = {};
  bool masks_known = true;
  std::set<int> refused;            // processors that a thread cannot be bound to although they are online
  std::vector<ProcessorSet> bound;  // every set that a thread was bound to, refused ones not among them
  std::atomic<int> yields{0};

  bool no_thread_words = false;
  std::atomic<int> thread_words{0};

  std::map<std::string, std::map<std::string, void *>> libraries;  // by name, their symbols
  std::vector<std::string> loads;                                  // the names asked for, found or not
  int unloads = 0;

  bool forked_from_threads = false;
  void (*before_fork)() = nullptr;
  void (*after_fork)() = nullptr;

  std::mutex mutex;  // of the lists that calls append to
};
extern FakeSystem fake;

}  // namespace qtb::test
