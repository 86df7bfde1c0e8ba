// gemm: C := alpha*op(A)*op(B) + beta*C on all threads where that pays, the front ends of the four types.
//
// A driver decides, in this order: whether the problem is too small for threads, how many to ask for, whether they pay
// on this machine; and whether C is scaled ahead of the main region, in one of its own, so that the strategies can add
// to it. Inside the main region every thread selects the strategy for itself, from the team that the runtime gave,
// and runs it. A call that goes serial is one call of the dispatch slot with the caller's own arguments.

#include <omp.h>

#include "blas/thread/32e/level3/gemm_class.h"
#include "blas/thread/32e/level3/gemm_mscale_omp.h"
#include "blas/thread/32e/level3/gemm_select.h"
#include "blas/thread/32e/level3/gemm_slots.h"
#include "blas/thread/32e/level3/gemm_strategies.h"
#include "blas/thread/32e/level3/gemm_worth.h"
#include "blas/thread/drivers.h"
#include "blas/thread/floating_state.h"
#include "service/cpu.h"
#include "service/memory.h"
#include "service/threads.h"

namespace qtb {
namespace {

// What a driver calls of its type's own, beside the slots.
template <class T>
struct GemmDriver;
#define QTB_GEMM_DRIVER(t, T)                                      \
  template <>                                                      \
  struct GemmDriver<T> {                                           \
    static constexpr auto mscale = &qtb_blas_##t##gemm_mscale_omp; \
    static constexpr auto select = &qtb_blas_##t##gemm_select;     \
    static constexpr auto row = &qtb_blas_##t##gemm_1d_row;        \
  };
QTB_FOR_EACH_GEMM(QTB_GEMM_DRIVER)
#undef QTB_GEMM_DRIVER

struct ThisProcessor {
  static bool has_sse41() { return qtb_serv_cpu_has_sse41() != 0; }
  static bool is_amd_family16() { return qtb_serv_cpu_is_amd_family16() != 0; }
};

// The panels that threads share, from the memory service; null until one thread has allocated them.
struct SharedPanels {
  void *a, *b;
};

// What each thread of the main region does. prepared is the plan as far as the driver knows it.
template <class T>
void gemm_region(const GemmPlan<T> &prepared, SharedPanels *shared, QTB_PARAMS_gemm(T)) {
  GemmPlan<T> plan = prepared;
  GemmPanelSet<T> panels{};
  plan.nthreads = omp_get_num_threads();
  if (plan.nthreads == 1) return GemmSlots<T>::gemm(QTB_ARGS(gemm));

  GemmDriver<T>::select(m, n, k, &panels, &plan);
  plan.acopy = plan.a_is_n ? panels.acopy_n : !is_complex<T> || plan.a_is_t ? panels.acopy_t : panels.acopy_c;
  plan.bcopy = plan.b_is_n ? panels.bcopy_n : !is_complex<T> || plan.b_is_t ? panels.bcopy_t : panels.bcopy_c;
  panels.a_panel_bytes = panel_bytes<T>(plan.mb, plan.kb);
  panels.b_panel_bytes = panel_bytes<T>(plan.nb, plan.kb);

  if (plan.a_buffers > 0 || plan.b_buffers > 0) {
    // The caller's own thread allocates, since it also gives back: its buffers then serve call after call, and no other
    // thread of the team keeps a set that it may never need again.
#pragma omp master
    {
      if (plan.b_buffers > 0)
        shared->b = qtb_serv_malloc(static_cast<std::uint64_t>(plan.b_buffers * panels.b_panel_bytes),
                                    panel_allocation_alignment);
      if (plan.a_buffers > 0)
        shared->a = qtb_serv_malloc(static_cast<std::uint64_t>(plan.a_buffers * panels.a_panel_bytes),
                                    panel_allocation_alignment);
    }
#pragma omp barrier
    plan.a_shared = align_panel<T>(shared->a);
    plan.b_shared = align_panel<T>(shared->b);
    // Without memory for them, all threads alike turn to the strategy that shares none.
    if ((plan.a_buffers > 0 && plan.a_shared == nullptr) || (plan.b_buffers > 0 && plan.b_shared == nullptr)) {
      plan.kernel.gemm = GemmSlots<T>::gemm;
      plan.strategy = GemmDriver<T>::row;
    }
  }
  plan.strategy(QTB_ARGS(gemm), &panels, &plan);
}

// The rows of a slice of a serial problem inside a parallel region of the caller's, on the class that does so.
constexpr QtbInt serial_slice_rows = 128;

template <class T>
void gemm_in_slices(QTB_PARAMS_gemm(T)) {
  const QtbInt a_step = is_letter(*transa, 'N') ? 1 : *lda;
  for (QtbInt row = 0; row < *m; row += serial_slice_rows) {
    const QtbInt left = *m - row, rows = left < serial_slice_rows ? left : serial_slice_rows;
    GemmSlots<T>::gemm(transa, transb, &rows, n, k, alpha, a + row * a_step, lda, b, ldb, beta, c + row, ldc);
  }
}

template <class T>
[[gnu::noinline]] void gemm_not_tiny(QTB_PARAMS_gemm(T)) {
  const std::int32_t threads = qtb_serv_get_max_threads(domain_blas);
  GemmPlan<T> plan{};
  const ProcessorTier tier = qtb_serv_cpu_detect();
  qtb_serv_get_cache_sizes(plan.cache);
  plan.machine_class = gemm_machine_class(tier, plan.cache, ThisProcessor{});
  if (threads <= 1) {
    if constexpr (!is_complex<T>)
      if (plan.machine_class == machine_sse41_small_l2 && omp_in_parallel() != 0)
        return gemm_in_slices<T>(QTB_ARGS(gemm));
    return GemmSlots<T>::gemm(QTB_ARGS(gemm));
  }

  const bool always_threads = plan.machine_class == machine_plain || plan.machine_class == machine_avx ||
                              plan.machine_class == machine_family16;
  const T *working_beta = beta;
  if (!always_threads) {
    if (!gemm_threads_pay<T>(*m, *n, *k, threads)) return GemmSlots<T>::gemm(QTB_ARGS(gemm));
    if (!is_one(*beta)) GemmDriver<T>::mscale(threads, m, n, beta, c, ldc);
    if (is_zero(*alpha)) return;
    working_beta = &gemm_one<T>;
  }

  plan.a_is_n = is_letter(*transa, 'N');
  plan.b_is_n = is_letter(*transb, 'N');
  plan.a_is_t = is_letter(*transa, 'T');
  plan.b_is_t = is_letter(*transb, 'T');
  SharedPanels shared{};
  const unsigned callers_choice = floating_choice();
#pragma omp parallel num_threads(threads)
  {
    const unsigned own_choice = take_floating_choice(callers_choice);
    gemm_region<T>(plan, &shared, transa, transb, m, n, k, alpha, a, lda, b, ldb, working_beta, c, ldc);
    take_floating_choice(own_choice);
  }
  qtb_serv_free(shared.a);
  qtb_serv_free(shared.b);
}

template <class T>
void gemm(QTB_PARAMS_gemm(T)) {
  if (*m <= 0 || *n <= 0) return;
  if (gemm_is_tiny(*m, *n, *k)) return GemmSlots<T>::gemm(QTB_ARGS(gemm));
  gemm_not_tiny<T>(QTB_ARGS(gemm));
}

}  // namespace
}  // namespace qtb

extern "C" {
#define QTB_GEMM_FRONT_END(t, T) \
  QTB_FUNCTION(gemm, T, qtb_blas_##t##gemm) { qtb::gemm<T>(QTB_ARGS(gemm)); }
QTB_FOR_EACH_GEMM(QTB_GEMM_FRONT_END)
}
