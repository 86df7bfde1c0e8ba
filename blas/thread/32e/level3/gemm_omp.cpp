// The parallel GEMM driver. See gemm_omp.h.

#include "blas/thread/32e/level3/gemm_omp.h"

#include <algorithm>
#include <iterator>

#include "blas/thread/32e/level3/gemm_mscale_omp.h"
#include "blas/thread/32e/level3/gemm_slots.h"
#include "blas/thread/32e/level3/gemm_strategies.h"
#include "blas/thread/team.h"
#include "service/memory.h"

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

// The panels that threads share, from the memory service; null until one thread has allocated them.
struct SharedPanels {
  void *a, *b;
};

// What each thread of the main region does. prepared is the plan as far as the driver knows it.
template <class T>
void gemm_region(const Team &team, const GemmPlan<T> &prepared, SharedPanels *shared, QTB_PARAMS_gemm(T)) {
  GemmPlan<T> plan = prepared;
  GemmPanelSet<T> panels{};
  plan.nthreads = team.size;
  if (plan.nthreads == 1) return GemmSlots<T>::gemm(QTB_ARGS(gemm));

  GemmDriver<T>::select(m, n, k, &panels, &plan);
  plan.acopy = plan.a_is_n ? panels.acopy_n : !is_complex<T> || plan.a_is_t ? panels.acopy_t : panels.acopy_c;
  plan.bcopy = plan.b_is_n ? panels.bcopy_n : !is_complex<T> || plan.b_is_t ? panels.bcopy_t : panels.bcopy_c;
  panels.a_panel_bytes = panel_bytes<T>(plan.mb, plan.kb);
  panels.b_panel_bytes = panel_bytes<T>(plan.nb, plan.kb);

  if (plan.a_buffers > 0 || plan.b_buffers > 0) {
    // The caller's own thread allocates, since it also gives back: its buffers then serve call after call, and no other
    // thread of the team keeps a set that it may never need again.
    team.once([&] {
      if (plan.b_buffers > 0)
        shared->b = qtb_serv_malloc(static_cast<std::uint64_t>(plan.b_buffers * panels.b_panel_bytes),
                                    panel_allocation_alignment);
      if (plan.a_buffers > 0)
        shared->a = qtb_serv_malloc(static_cast<std::uint64_t>(plan.a_buffers * panels.a_panel_bytes),
                                    panel_allocation_alignment);
    });
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

template <class T>
void gemm_omp(const GemmDecision &decision, QTB_PARAMS_gemm(T)) {
  const T *working_beta = beta;
  if (decision.tuned) {
    if (!is_one(*beta)) GemmDriver<T>::mscale(decision.threads, m, n, beta, c, ldc);
    if (is_zero(*alpha)) return;
    working_beta = &gemm_one<T>;
  }

  GemmPlan<T> plan{};
  plan.machine_class = decision.machine_class;
  std::copy(std::begin(decision.cache), std::end(decision.cache), plan.cache);
  plan.a_is_n = is_letter(*transa, 'N');
  plan.b_is_n = is_letter(*transb, 'N');
  plan.a_is_t = is_letter(*transa, 'T');
  plan.b_is_t = is_letter(*transb, 'T');
  SharedPanels shared{};
  run_team(decision.threads, [&](const Team &team) {
    gemm_region<T>(team, plan, &shared, transa, transb, m, n, k, alpha, a, lda, b, ldb, working_beta, c, ldc);
  });
  qtb_serv_free(shared.a);
  qtb_serv_free(shared.b);
}

}  // namespace
}  // namespace qtb

extern "C" {
#define QTB_DEFINE_GEMM_OMP(t, T)                                                      \
  void qtb_blas_##t##gemm_omp(const qtb::GemmDecision *decision, QTB_PARAMS_gemm(T)) { \
    qtb::gemm_omp<T>(*decision, QTB_ARGS(gemm));                                       \
  }
QTB_FOR_EACH_GEMM(QTB_DEFINE_GEMM_OMP)
}
