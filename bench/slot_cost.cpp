// What a dispatch slot costs on its steady path: the same empty-vector call through the slot's stub and through a
// pointer to the tier's implementation, in turn, and the difference.

#include <cstdio>
#include <vector>

#include "bench/timing.h"
#include "blas/dispatch/slots.h"
#include "service/cpu.h"

int main() {
  using namespace qtb::bench;
  constexpr int pairs = 51;
  constexpr double seconds = 0.005;
  const QtbInt n = 0, increment = 1;
  const double x = 1;
  using Function = QTB_FUNCTION_TYPE(dot, double);
  Function *volatile direct =
      reinterpret_cast<Function *>(qtb::slot_targets[qtb::slot_ddot].target[qtb_serv_cpu_detect()]);
  Function *volatile stub = &qtb_blas_xddot;
  const auto loop = [&](Function *volatile &function) {
    return [&](long count) {
      for (long i = 0; i < count; ++i) function(&n, &x, &increment, &x, &increment);
    };
  };
  const auto through_slot = loop(stub), through_pointer = loop(direct);
  through_slot(1);
  const long count = calibrate(through_pointer, seconds);
  std::vector<double> slot, pointer, difference;
  for (int pair = 0; pair < pairs; ++pair) {
    slot.push_back(seconds_per_call(through_slot, count) * 1e9);
    pointer.push_back(seconds_per_call(through_pointer, count) * 1e9);
    difference.push_back(slot.back() - pointer.back());
  }
  std::printf(
      "ddot of an empty vector, ns/call: through the slot %.3f, through a pointer %.3f, difference %.3f "
      "(median of %d pairs, %.3f to %.3f)\n",
      spread(slot).median, spread(pointer).median, spread(difference).median, pairs, spread(difference).low,
      spread(difference).high);
  return 0;
}
