// Work buffers, and the lock that the services share.
#pragma once

#include <cstddef>
#include <cstdint>

#include "blas/types.h"

extern "C" {

// A buffer of size bytes, or null for a size of 0 and where memory is out.
//
// A power of two of at least 4 aligns the buffer to so many bytes; below 4 it is as aligned as the allocator leaves it,
// and any other value counts as 32. The alignment is not promised where the thread already holds five buffers, where
// size is above 40 MiB, and where QTB_DISABLE_FAST_MM or QTB_MM_DISABLE is set. A thread that repeats its requests gets
// the same memory again without asking the allocator.
QTB_HIDDEN void *qtb_serv_malloc(std::uint64_t size, std::int32_t alignment);

// Gives back what qtb_serv_malloc returned, from any thread. Null is accepted; a second release changes nothing.
QTB_HIDDEN void qtb_serv_free(void *pointer);

// Takes the allocator from libqmalloc.so if that library is present and complete, else from the C library. At load.
QTB_HIDDEN void qtb_serv_select_allocator();

// Has the service lock taken ahead of every fork and released behind it in both processes, so that a child never
// inherits it from a thread which it does not have. At load.
QTB_HIDDEN void qtb_serv_prepare_fork();

// The service lock: a spin lock for short work that is done once or seldom. Not re-entrant.
QTB_HIDDEN void qtb_serv_lock();
QTB_HIDDEN void qtb_serv_unlock();

}  // extern "C"
