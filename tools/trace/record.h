// What is kept of each traced call, and by whom: a table per thread, with one entry for all calls of the same routine,
// options, sizes and team.
//
// A table is written by its thread alone and read by the report, at any time: an entry's key stands before its count
// says that it exists. Nothing is allocated in a call but a thread's table at its first.
#pragma once

#include <x86intrin.h>

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <initializer_list>
#include <type_traits>

#include "blas/types.h"

namespace qtb::trace {

// By which names a routine was called.
enum Face : std::uint8_t { fortran, cblas, fortran_64, cblas_64, cblas_64_second, face_count };

enum RoutineNumber : std::uint16_t {
#define QTB_ROUTINE(name, NAME, shape, T, route) routine_##name,
#include "blas/routines.def"
#undef QTB_ROUTINE
  routine_count
};

// What a call does, of which it may have little: letters of options, 0 where there is none, and sizes.
struct CallShape {
  static constexpr std::int32_t absent = INT32_MIN;
  char side, uplo, transa, transb, diag;
  std::int32_t m, n, k, kl, ku;
};

// A name, the largest team of the OpenMP runtime, 1 where there was none, and a shape. It is put together in registers:
// words that were written in parts could not be read at once.
struct Key {
  std::uint64_t words[4];

  static Key of(RoutineNumber routine, Face face, std::uint32_t threads, const CallShape &s) {
    const auto pair = [](std::int32_t low, std::int32_t high) {
      return std::uint64_t{static_cast<std::uint32_t>(high)} << 32 | static_cast<std::uint32_t>(low);
    };
    std::uint64_t letters = 0;
    for (const char letter : {s.side, s.uplo, s.transa, s.transb, s.diag})
      letters = letters << 8 | static_cast<unsigned char>(letter);
    const int name = int{routine} * int{face_count} + int{face};
    return {{letters << 16 | static_cast<std::uint16_t>(name), pair(s.m, s.n), pair(s.k, s.kl),
             pair(s.ku, static_cast<std::int32_t>(threads))}};
  }
  RoutineNumber routine() const { return static_cast<RoutineNumber>((words[0] & 0xFFFF) / face_count); }
  Face face() const { return static_cast<Face>((words[0] & 0xFFFF) % face_count); }
  std::uint32_t threads() const { return static_cast<std::uint32_t>(words[3] >> 32); }
  CallShape shape() const {
    const auto letter = [this](int behind) { return static_cast<char>(words[0] >> (16 + 8 * behind)); };
    const auto low = [](std::uint64_t word) { return static_cast<std::int32_t>(word); };
    const auto high = [](std::uint64_t word) { return static_cast<std::int32_t>(word >> 32); };
    return {letter(4),     letter(3),      letter(2),     letter(1),      letter(0),
            low(words[1]), high(words[1]), low(words[2]), high(words[2]), low(words[3])};
  }
  bool operator==(const Key &other) const {
    return words[0] == other.words[0] && words[1] == other.words[1] && words[2] == other.words[2] &&
           words[3] == other.words[3];
  }
};

// Times are in ticks of the processor's counter.
struct alignas(64) Entry {
  Key key;
  std::atomic<std::uint64_t> calls, ticks, least, most;
};

struct Table {
  static constexpr std::size_t bits = 12, size = std::size_t{1} << bits;
  static constexpr std::size_t most_shapes = size / 4 * 3;  // beyond them, one entry for each routine

  Entry entries[size];
  std::size_t used;
  std::atomic<std::uint64_t> lost;  // calls that found no entry at all
  std::atomic<bool> taken;          // by a thread that lives
  Table *next;                      // in the list of all
};

// A thread in a call of its program's. Calls within it are of that call: they stand below its frame on the stack. One
// that a jump or an exception has left needs no end: the next call stands above it.
struct ThreadState {
  Table *table;
  std::uintptr_t frame;  // 0 outside of all calls
  std::uint32_t team;
};
[[gnu::tls_model("initial-exec")]] extern constinit thread_local ThreadState this_thread;

// A table for the calling thread; null where memory is out.
Table *take_table();
// Every table so far, the newest first.
Table *first_table();

void record(Table &table, const Key &key, std::uint64_t ticks);

}  // namespace qtb::trace
