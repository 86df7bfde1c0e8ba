// The calls that set a companion's number of threads, and what the thread service asks of them.
//
// There is no lock: a number for all is one relaxed atomic, since a call may take the former or the new one and nothing
// else hangs on it; a thread's own number is that thread's alone, at a fixed distance from its pointer.
#include <algorithm>
#include <atomic>

#include "blas/tier_names.h"
#include "service/cpu.h"
#include "service/threads.h"

#pragma GCC visibility push(default)
#include "include/qtb/threads.h"
#pragma GCC visibility pop

namespace {

// 0: none was set.
std::atomic<int> asked_of_all{0};
[[gnu::tls_model("initial-exec")]] thread_local int asked_of_thread = 0;

// The exported names call this and not each other: of two companions in a process each would call the first one's.
void ask_of_all(int threads) { asked_of_all.store(std::max(threads, 0), std::memory_order_relaxed); }

}  // namespace

std::int32_t qtb_serv_threads_asked_for() {
  return asked_of_thread != 0 ? asked_of_thread : asked_of_all.load(std::memory_order_relaxed);
}

void qtb_set_num_threads(int threads) { ask_of_all(threads); }

int qtb_set_num_threads_local(int threads) {
  const int former = asked_of_thread;
  asked_of_thread = std::max(threads, 0);
  return former;
}

int qtb_get_num_threads() { return qtb_serv_get_max_threads(domain_blas); }

void blas_set_num_threads(int threads) { ask_of_all(threads); }
int blas_get_num_threads() { return qtb_serv_get_max_threads(domain_blas); }

const char *qtb_get_tier() { return qtb::tier_names[qtb_serv_cpu_detect()]; }
