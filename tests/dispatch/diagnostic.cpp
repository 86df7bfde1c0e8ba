// Prints the tier that this process takes, and runs a routine of each kind in it.
//
// "detected <tier>, dispatched <tier>, family 16 <0 or 1>, results <right or wrong>". On a processor that lacks an
// instruction of the tier it dies of it.

#include <cstdio>

#include "blas/dispatch/slots.h"
#include "service/cpu.h"
#include "tests/support/tiers.h"

// In place of the C library's dlopen, which a static program cannot rely on.
extern "C" void *__wrap_dlopen(const char *, int) { return nullptr; }

namespace {

// ddot, daxpy and dgemm on integers, which come out exactly.
bool results_are_right() {
  constexpr QtbInt n = 37, one = 1;
  double x[n], y[n], a[n * n], b[n * n], c[n * n] = {};
  for (QtbInt i = 0; i < n; ++i) x[i] = static_cast<double>(i), y[i] = 1;
  for (QtbInt i = 0; i < n * n; ++i) a[i] = static_cast<double>(i % 7), b[i] = static_cast<double>(i % 5);
  const double alpha = 2, beta = 0;
  bool right = qtb_blas_xddot(&n, x, &one, y, &one) == n * (n - 1) / 2;
  qtb_blas_xdaxpy(&n, &alpha, x, &one, y, &one);
  for (QtbInt i = 0; i < n; ++i) right = right && y[i] == static_cast<double>(1 + 2 * i);
  qtb_blas_xdgemm("N", "N", &n, &n, &n, &alpha, a, &n, b, &n, &beta, c, &n);
  for (QtbInt j = 0; j < n; ++j)
    for (QtbInt i = 0; i < n; ++i) {
      double sum = 0;
      for (QtbInt k = 0; k < n; ++k) sum += a[i + k * n] * b[k + j * n];
      right = right && c[i + j * n] == alpha * sum;
    }
  return right;
}

}  // namespace

int main() {
  const bool right = results_are_right();
  const qtb::CodePointer target = qtb::dispatch_slots[qtb::slot_ddot].load();
  const char *dispatched = "no tier";
  for (int tier = 0; tier < tier_count; ++tier)
    if (target == qtb::slot_targets[qtb::slot_ddot].target[tier]) dispatched = qtb::test::tier_name(tier);
  std::printf("detected %s, dispatched %s, family 16 %d, results %s\n", qtb::test::tier_name(qtb_serv_cpu_detect()),
              dispatched, qtb_serv_cpu_is_amd_family16(), right ? "right" : "wrong");
}
