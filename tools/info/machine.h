// What this process and this machine make the library do.
#pragma once

namespace qtb::info {

// Version, tiers, caches, threads and buffers, each with the reason, on standard output.
void print_machine();

// The version as the library tells it.
const char *version();

// What process number has loaded: the libraries of this project and other BLAS libraries. Returns the exit status.
int print_process(long number);

}  // namespace qtb::info
