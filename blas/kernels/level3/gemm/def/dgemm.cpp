// dgemm, dgemm_def_run_a, dgemm_def_run_b of def.
//
// dgemm chooses: on one processor family the bodies with the 4 x 4 tile, run_b where a slice of B is small, run_a,
// which may leave B in place, elsewhere; on all others the body with the 2 x 12 tile.
#include "blas/kernels/level3/gemm/body.h"
#include "blas/kernels/level3/gemm/def/kernels.h"
#include "service/cpu.h"

namespace qtb::QTB_TIER {
namespace {

// The 2 x 12 tile, which has a kernel for the depth of a whole block.
struct WideKernels {
  static constexpr QtbInt stage_per_k = 192, whole_depth = 128;
  WideKernels(const Product<double> &, double) {}
  void run(const Block<double> &x, bool) const {
    if (x.kp == whole_depth)
      qtb_blas_def_dgemm_kernel_128(x.m, x.n, x.kp, x.a, x.lda, x.b, x.ldb, x.c, x.ldc, x.stage);
    else
      qtb_blas_def_dgemm_kernel(x.m, x.n, x.kp, x.a, x.lda, x.b, x.ldb, x.c, x.ldc, x.stage);
  }
};

void add_wide(const Product<double> &p) {
  add_blocks<double, Family::base, Source::packed, Source::packed, WideKernels>(p, body_blocks<double, Family::base>(p),
                                                                                &one<double>);
}

template <Family family>
bool slice_is_small(const Product<double> &p) {
  return slice_bytes(rules_of<double, family>, sizeof(double), p.n, p.k) <=
         rules_of<double, Family::def_a>.in_place.most_bytes;
}

void add_a(const Product<double> &p) {
  if (slice_is_small<Family::def_a>(p))
    add_blocks<double, Family::def_a, Source::packed, Source::in_place>(
        p, body_blocks<double, Family::def_a, Source::in_place>(p), &one<double>);
  else
    add_blocks<double, Family::def_a, Source::packed, Source::packed>(p, body_blocks<double, Family::def_a>(p),
                                                                      &one<double>);
}

// The panels of both families of this tile are the same, and so are the kernels and the buffers.
void add_b(const Product<double> &p) {
  add_blocks<double, Family::def_a, Source::packed, Source::packed>(p, body_blocks<double, Family::def_b>(p),
                                                                    &one<double>);
}

void add_for_processor(const Product<double> &p) {
  if (qtb_serv_cpu_detect() != tier_def || qtb_serv_cpu_is_amd_family16() == 0) return add_wide(p);
  if (slice_is_small<Family::def_b>(p)) return add_b(p);
  add_a(p);
}

template <Family family, void (*add)(const Product<double> &)>
QTB_FUNCTION(gemm, double, gemm) {
  const Product<double> p = product(transa, transb, m, n, k, alpha, a, lda, b, ldb, c, ldc);
  if (begin_product<double, family>(p, beta)) add(p);
}

}  // namespace

QTB_KERNEL(dgemm, gemm, double, (gemm<Family::base, add_for_processor>))
QTB_KERNEL(dgemm_def_run_a, gemm, double, (gemm<Family::def_a, add_a>))
QTB_KERNEL(dgemm_def_run_b, gemm, double, (gemm<Family::def_a, add_b>))

}  // namespace qtb::QTB_TIER
