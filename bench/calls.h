// The calls that benchmarks time: every Level-1 routine and the matrix products, of this library or of a peer.
#pragma once

#include <cstddef>
#include <cstdlib>
#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace qtb::bench {

// A loaded BLAS library. This library has 64-bit integers and plain names; a peer is taken to have 32-bit integers,
// names that end in an underscore, and complex results in registers, the convention of the distribution's packages.
struct Library {
  void *handle = nullptr;
  bool wide = true;
  void *find(const std::string &name) const;
};

// Loads a library, or ends the program with a message.
Library load_library(const std::string &path, bool wide);

// A routine, its kind of call, and what it does per element: operands read and written, flops. For gemm flops counts
// what one multiply and add of the type costs.
struct Routine {
  const char *name;
  const char *kind;
  char type;  // s, d, c, z: the type of its vectors
  double read, written, flops;
  bool is_matrix() const;
  bool is_single() const;
};

extern const std::vector<Routine> routines;

// Bytes of one element.
std::size_t type_bytes(char type);

// What a call of size n and increment costs: flops, and bytes moved (matrix routines: each operand once).
double call_flops(const Routine &routine, long n);
double call_bytes(const Routine &routine, long n);

// Operands of a call, shared by the libraries that are compared so that they work on the same memory.
struct Operands {
  std::unique_ptr<double, void (*)(void *)> x{nullptr, std::free}, y{nullptr, std::free}, z{nullptr, std::free};
  std::vector<long> index;  // one-based positions, for the sparse routines
};
Operands make_operands(const Routine &routine, long n, long increment);

// run(count) makes count calls of a routine on the operands. Empty where the library has no such routine. Scalars keep
// the values bounded over any number of calls.
using Calls = std::function<void(long count)>;
Calls bind(const Library &library, const Routine &routine, long n, long increment, Operands &operands);

}  // namespace qtb::bench
