// How many threads a call may use.
#pragma once

#include <cstdint>

#include "blas/types.h"

// Who asks. Only domain_blas is asked for within this library; any number that is not listed counts as domain_all.
enum ThreadDomain : std::int32_t { domain_all, domain_blas, domain_fft, domain_vml };

extern "C" {

// The largest number of threads that a call may use now, at least 1. The first call of a process reads the environment
// and counts the cores, once; later calls read cells and ask the OpenMP runtime. From any thread, in or out of a
// parallel region. In a process that was forked from one with several threads it is always 1.
QTB_HIDDEN std::int32_t qtb_serv_get_max_threads(std::int32_t domain);

// 1 in dynamic mode, where the library lowers the number that was asked for to what pays; 0 if QTB_DYNAMIC turned it
// off.
QTB_HIDDEN std::int32_t qtb_serv_get_dynamic();

// Reads all thread settings and counts the cores. The two above call it where that has not been done.
QTB_HIDDEN void qtb_serv_read_thread_env();

// The number that the program has set by a call, for the calling thread or for all: 0 where there is none. It goes
// before what the environment gives. Each library has one source that says so.
QTB_HIDDEN std::int32_t qtb_serv_threads_asked_for();

// Counts logical processors and physical cores. The calling thread visits every processor of the machine, and ends with
// the affinity of the process. A process that may not use all of the machine's processors counts one core, and
// *logical stays as it was.
QTB_HIDDEN void qtb_serv_count_cores(std::int32_t *logical, std::int32_t *physical);

}  // extern "C"
