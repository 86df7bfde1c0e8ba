// The Level-1 calls that benchmarks time, every routine of this library or of a peer.
#pragma once

#include <cstddef>
#include <vector>

#include "bench/library.h"
#include "bench/memory.h"

namespace qtb::bench {

// A routine, its kind of call, and what it does per element: operands read and written, flops.
struct Routine {
  const char *name;
  const char *kind;
  char type;  // s, d, c, z: the type of its vectors
  double read, written, flops;
  bool is_single() const;
};

extern const std::vector<Routine> routines;

// Bytes of one element.
std::size_t type_bytes(char type);

// What a call of size n and increment costs: flops, and bytes moved.
double call_flops(const Routine &routine, long n);
double call_bytes(const Routine &routine, long n);

struct Operands {
  Memory x{nullptr, std::free}, y{nullptr, std::free};
  std::vector<long> index;  // one-based positions, for the sparse routines
};
Operands make_operands(const Routine &routine, long n, long increment);

// The calls of a routine on the operands, which have to outlive them. Scalars keep the values bounded over any number
// of calls.
Calls bind(const Library &library, const Routine &routine, long n, long increment, Operands &operands);

}  // namespace qtb::bench
