// What the library asks of the operating system and of the processor, behind one header.
//
// linux.cpp implements it; tests link tests/platform/fake.cpp in its place, and so can be any processor with any
// caches, environment and affinity. Nothing here keeps state for the library, and nothing throws.
#pragma once

#include <cstddef>
#include <cstdint>

// ---- The processor ----

struct CpuidRegisters {
  std::uint32_t eax, ebx, ecx, edx;
};

// The CPUID instruction. A leaf that the processor lacks gives what the processor gives.
CpuidRegisters platform_cpuid(std::uint32_t leaf, std::uint32_t subleaf);

// The parts of the processor's state that the operating system saves (XCR0). Only where CPUID says that it does.
std::uint64_t platform_saved_state();

// ---- The environment ----

// Returns the length of an environment variable's value, 0 where the variable is absent or empty, and copies as much of
// the value as fits into buffer, zero-terminated. A length of size or more says that the copy was cut. With a length of
// 0 buffer stays as it is.
std::size_t platform_environment(const char *name, char *buffer, std::size_t size);

// ---- Thread-local words ----

// Creates a word that is null in every thread, also in threads that start later. Nothing is done about its value when a
// thread ends. Returns its index, or -1 where the system has none left; a word of index -1 reads as null.
std::int32_t platform_tls_create();
void *platform_tls_get(std::int32_t index);
void platform_tls_set(std::int32_t index, void *value);

// ---- Processors and affinity ----

// A set of logical processors, one bit each: bit p % 64 of words[p / 64] is processor p.
struct ProcessorSet {
  static constexpr int word_bits = 64;
  static constexpr int max_words = 128;
  static constexpr int capacity = max_words * word_bits;  // 8192, the most that a Linux kernel is built for on x86

  std::uint64_t words[max_words];

  bool contains(int p) const { return (words[p / word_bits] >> (p % word_bits) & 1) != 0; }
  void insert(int p) { words[p / word_bits] |= std::uint64_t{1} << (p % word_bits); }
  bool operator==(const ProcessorSet &) const = default;
};

// The processors that the process was given, and those that are online. The first is what the process was given also
// where its threads, or the OpenMP runtime on their behalf, have bound themselves to fewer. Returns false, with nothing
// written, where the system does not tell.
bool platform_processors(ProcessorSet *process, ProcessorSet *online);

// Binds the calling thread to a set of processors. Returns false, with nothing changed, where that is refused.
bool platform_bind_thread(const ProcessorSet *processors);

// Gives up the rest of the time slice.
void platform_yield();

// ---- Libraries ----

// Loads a library by plain file name from the folders that the system's loader searches for this library. Null if
// absent, and also, with nothing looked for, where one of them is not an absolute path or the loader does not tell:
// such an entry stands for the working directory of the moment, and whoever may write there could plant a library.
void *platform_load_library(const char *name);
void *platform_library_symbol(void *library, const char *name);
void platform_unload_library(void *library);

// ---- Localised messages ----

// The numeric identifier of the user's message locale, 1033 (United States English) where it has no number.
unsigned long platform_message_locale();

// Reads a message catalogue at a path, as a handle for the life of the process. Null if there is none.
void *platform_open_catalog(const char *path);

// Copies message number of a catalogue into buffer, zero-terminated, and returns true. Returns false where the
// catalogue has no such message or the text with its terminator does not fit size bytes.
bool platform_catalog_message(void *catalog, std::int32_t number, char *buffer, std::size_t size);

// ---- Fork ----

// Has before called ahead of every fork, and after behind it in both processes. Called once, at load.
void platform_at_fork(void (*before)(), void (*after)());

// 1 in a process that was forked, after platform_at_fork, while its parent had more than one thread, and in all that
// descend from it: the OpenMP runtime's threads do not exist there, and a parallel region may never return. 0
// elsewhere.
int platform_forked_from_threads();
