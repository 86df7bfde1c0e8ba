// A loaded BLAS library: this one or a peer.
#pragma once

#include <functional>
#include <string>

namespace qtb::bench {

// This library has 64-bit integers and plain names; a peer is taken to have 32-bit integers, names that end in an
// underscore, and complex results in registers, the convention of the distribution's packages.
struct Library {
  void *handle = nullptr;
  bool wide = true;
  void *find(const std::string &name) const;
};

// Loads a library, or ends the program with a message.
Library load_library(const std::string &path, bool wide);

// run(count) makes count calls of a routine. Empty where the library has no such routine.
using Calls = std::function<void(long count)>;

}  // namespace qtb::bench
