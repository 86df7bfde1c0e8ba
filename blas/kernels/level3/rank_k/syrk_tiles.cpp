// syrk and herk of the tiers whose whole routine is a walk over tiles of C (update.h tells what is computed,
// tile_triangle.h how).
//
// The buffer of a tile on the diagonal stands on the stack: 131,072 bytes in double precision, 65,536 in single and in
// complex double, 32,768 in complex single. The smaller tiles of the complex types, of small matrices above all, make
// less of the other triangle, which is in vain.
#include "blas/kernels/level3/rank_k/tile_triangle.h"
#include "blas/kernels/level3/rank_k/update.h"

namespace qtb::QTB_TIER {
namespace {

// The rows of a tile, and of one of a matrix of fewer rows than small.
struct TileOrder {
  QtbInt usual, small, order_of_small;
};
template <class T>
constexpr TileOrder tile_order = {128, 0, 0};
template <class R>
constexpr TileOrder tile_order<Complex<R>> = {64, 256, 32};

template <class Update>
void update_by_tiles(const Update &u) {
  using T = typename Update::Element;
  constexpr TileOrder orders = tile_order<T>;
  const QtbInt order = u.n < orders.small ? orders.order_of_small : orders.usual;
  if (u.only_scales()) return scale_triangle<Update::hermitian>(u.upper, u.n, u.beta, u.c, u.ldc);
  alignas(64) T tile[orders.usual * orders.usual];
  walk_tiles(
      u.upper, u.n, order,
      [&](QtbInt i0, QtbInt rows, QtbInt j0, QtbInt columns) {
        u.multiply(i0, rows, j0, columns, u.beta, u.at(i0, j0), u.ldc);
      },
      [&](QtbInt i0, QtbInt count) {
        const QtbInt ldt = (count + lanes<T> - 1) / lanes<T> * lanes<T>;
        u.multiply(i0, count, i0, count, {}, tile, ldt);
        add_tile_triangle<Update::hermitian>(u.upper, count, tile, ldt, u.beta, u.at(i0, i0), u.ldc);
      });
}

template <class T>
QTB_FUNCTION(syrk, T, syrk) {
  update_by_tiles(rank_k<false>(uplo, trans, n, k, alpha, a, lda, beta, c, ldc));
}
template <class T>
QTB_FUNCTION(herk, T, herk) {
  update_by_tiles(rank_k<true>(uplo, trans, n, k, alpha, a, lda, beta, c, ldc));
}

}  // namespace

QTB_KERNEL(ssyrk, syrk, float, syrk<float>)
QTB_KERNEL(dsyrk, syrk, double, syrk<double>)
QTB_KERNEL(csyrk, syrk, cfloat, syrk<cfloat>)
QTB_KERNEL(zsyrk, syrk, cdouble, syrk<cdouble>)
QTB_KERNEL(cherk, herk, cfloat, herk<cfloat>)
QTB_KERNEL(zherk, herk, cdouble, herk<cdouble>)

}  // namespace qtb::QTB_TIER
