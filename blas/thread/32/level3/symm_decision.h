// Whether a product with a symmetric or Hermitian matrix takes threads: a pure function of the shape and of what the
// process answers to one question, max_threads, which a tiny problem does not ask. There is no estimate of the work
// beyond that, and no difference between tiers.
#pragma once

#include "blas/thread/process.h"

// f(name, T): the routines, in two lists.
#define QTB_FOR_EACH_SYMM(f) f(ssymm, float) f(dsymm, double) f(csymm, cfloat) f(zsymm, cdouble)
#define QTB_FOR_EACH_HEMM(f) f(chemm, cfloat) f(zhemm, cdouble)

namespace qtb {

// With m and n both below this the caller's thread does it.
inline constexpr QtbInt symm_tiny = 17;

// The number of threads for m and n of at least 1; 1 is the dispatch slot on the whole problem.
template <class Process>
QtbInt symm_threads(QtbInt m, QtbInt n, Process &&process) {
  if (m < symm_tiny && n < symm_tiny) return 1;
  const QtbInt threads = process.max_threads();
  return threads > 1 ? threads : 1;
}

}  // namespace qtb
