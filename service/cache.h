// The sizes of the processor's caches.
#pragma once

#include "blas/types.h"

extern "C" {

// out[0] is the number of data and unified cache levels, out[1] to out[4] their sizes in bytes, nearest first; absent
// levels are 0. The table is filled at the first call and kept. out may be null.
QTB_HIDDEN void qtb_serv_get_cache_sizes(std::uint32_t *out);

}  // extern "C"
