// Which processor this is, as far as the library asks: the tier, and the tests behind it.
#pragma once

#include "blas/tiers.h"
#include "blas/types.h"

extern "C" {

// The tier of this process. Decided at the first call, from QTB_DEBUG_CPU_TYPE, QTB_TIER or the processor, and kept;
// later calls are a load and a test. Never fails; a value of QTB_TIER that has no effect is told on standard output.
QTB_HIDDEN ProcessorTier qtb_serv_cpu_detect();

// Tests of the processor, each 1 or 0, each asking the processor anew.
QTB_HIDDEN int qtb_serv_cpu_is_belmo();
QTB_HIDDEN int qtb_serv_cpu_has_avx();
QTB_HIDDEN int qtb_serv_cpu_has_sse42();
QTB_HIDDEN int qtb_serv_cpu_has_sse41();
QTB_HIDDEN int qtb_serv_cpu_has_ssse3();
QTB_HIDDEN int qtb_serv_cpu_has_sse3();

// The answer of qtb_serv_cpu_has_sse41, asked once per process and kept: what every product of a tier with a family of
// kernels for SSE4.1 wants to know.
QTB_HIDDEN int qtb_serv_cpu_takes_sse41();

// What this library takes where nothing is asked for: the tier by the rules of the product, or the best that the
// processor and the operating system have, whoever made them. Each library has one source that says so.
QTB_HIDDEN extern const bool qtb_serv_takes_best_tier;

// 1 on the vendor "AuthenticAMD" with base family 15 and extended family 1; cached after the first call.
QTB_HIDDEN int qtb_serv_cpu_is_amd_family16();

}  // extern "C"
