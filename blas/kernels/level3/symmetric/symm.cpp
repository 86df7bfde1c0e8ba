// symm, hemm: C := alpha*A*B + beta*C (side "L") or alpha*B*A + beta*C ("R") with a symmetric or Hermitian A.
//
// C and B are m x n with columns ldc and ldb apart; the order of A, with columns lda apart, is m on the left and n on
// the right. One triangle of A is read; the diagonal of a Hermitian A counts by its real part. An alpha of 0 reads
// neither A nor B, a beta of 0 stores without reading C. A and B do not overlap C. No alignment is asked for.
//
// Nearly all of the work is done by GEMM. A is cut into tiles along its diagonal, and the other dimension of C into
// steps. A tile meets a block of B's rows; with these are multiplied the columns of A that it stands in, which are
// stored on one side of it and mirrored from its rows on the other, one product each, and the tile itself, of which a
// buffer gets all, times alpha (tile_copy.h). On the right columns of B meet rows of A in the same way.
//
// The buffer comes from the memory service and goes back at every exit. Without it tiles are so small that their copies
// stand on the stack, in 16,384 bytes.
#include "blas/kernels/level3/gemm/parts.h"
#include "blas/kernels/level3/gemm/tier_gemm.h"
#include "blas/kernels/level3/symmetric/tile_copy.h"
#include "service/memory.h"

namespace qtb::QTB_TIER {
namespace {

constexpr QtbInt tile_order = 256;       // in double precision half of a second-level cache of 1 MiB
constexpr QtbInt other_step = 5000;      // what GEMM packs of B at a time stays within its largest buffers
constexpr QtbInt stack_tile_order = 32;  // the copy of the largest elements takes no more than a small stack has

constexpr std::int32_t buffer_alignment = 64;  // a cache line
constexpr QtbInt least_buffer_bytes = tile_order * tile_order * static_cast<QtbInt>(sizeof(double));
template <class T>
constexpr QtbInt buffer_bytes = larger(least_buffer_bytes, tile_order *tile_order *static_cast<QtbInt>(sizeof(T)));

// Some of the rows of C on the left, of its columns on the right, or of the other dimension.
struct Range {
  QtbInt first, count;
};

template <class T, bool hermitian>
struct SymmetricProduct {
  bool left, upper;
  T alpha;
  const T *a;
  QtbInt lda;
  const T *b;
  QtbInt ldb;
  T *c;
  QtbInt ldc;

  // Adds factor*op(X)*B to a range of rows of C (factor*B*op(X) to columns), where B has the range that meets X.
  void add(T factor, Op op, const T *x, QtbInt ldx, Range of_b, Range of_c, Range others) const {
    if (left)
      gemm(op, Op::none, of_c.count, others.count, of_b.count, factor, x, ldx, b + of_b.first + others.first * ldb, ldb,
           one<T>, c + of_c.first + others.first * ldc, ldc);
    else
      gemm(Op::none, op, others.count, of_c.count, of_b.count, factor, b + others.first + of_b.first * ldb, ldb, x, ldx,
           one<T>, c + others.first + of_c.first * ldc, ldc);
  }
  // The part of A above or below the tile, which the triangle holds or mirrors.
  void add_beside(Range tile, Range part, bool is_stored, Range others) const {
    if (part.count == 0) return;
    const bool in_columns_of_tile = left == is_stored;
    const QtbInt row = in_columns_of_tile ? part.first : tile.first;
    const QtbInt column = in_columns_of_tile ? tile.first : part.first;
    constexpr Op mirrored = hermitian ? Op::conjugate : Op::transpose;
    add(alpha, is_stored ? Op::none : mirrored, a + row + column * lda, lda, tile, part, others);
  }
  void add_tile(Range tile, T *copy, Range others) const {
    const T *const from = a + tile.first + tile.first * lda;
    if (upper)
      copy_symmetric<T, hermitian, true>(tile.count, from, lda, copy, alpha);
    else
      copy_symmetric<T, hermitian, false>(tile.count, from, lda, copy, alpha);
    add(one<T>, Op::none, copy, tile.count, tile, tile, others);
  }
  // One tile and one step are no loop: small products are spared what goes ahead of loops.
  void add_all(QtbInt order, QtbInt others, QtbInt most, T *copy) const {
    if (order <= most && others <= other_step)
      add_tile({0, order}, copy, {0, others});
    else
      add_tiles(order, others, most, copy);
  }
  [[gnu::noinline]] void add_tiles(QtbInt order, QtbInt others, QtbInt most, T *copy) const {
    const bool stored_first = left == upper;
    for (QtbInt o0 = 0; o0 < others; o0 += other_step) {
      const Range step{o0, smaller(other_step, others - o0)};
      for (QtbInt t0 = 0; t0 < order; t0 += most) {
        const Range tile{t0, smaller(most, order - t0)};
        const Range before{0, t0}, behind{t0 + tile.count, order - t0 - tile.count};
        add_beside(tile, stored_first ? before : behind, true, step);
        add_beside(tile, stored_first ? behind : before, false, step);
        add_tile(tile, copy, step);
      }
    }
  }
};

template <class T, bool hermitian>
[[gnu::noinline]] void add_by_small_tiles(const SymmetricProduct<T, hermitian> &product, QtbInt order, QtbInt others) {
  alignas(buffer_alignment) T copy[stack_tile_order * stack_tile_order];
  product.add_all(order, others, stack_tile_order, copy);
}

template <class T, bool hermitian = false>
QTB_FUNCTION(symm, T, symm) {
  T *const buffer = static_cast<T *>(qtb_serv_malloc(buffer_bytes<T>, buffer_alignment));
  if (*m > 0 && *n > 0) {
    if (!is_one(*beta)) scale_columns<T>(m, n, beta, c, ldc);
    if (!is_zero(*alpha)) {
      const bool left = is_letter(*side, 'L');
      const SymmetricProduct<T, hermitian> product{left, is_letter(*uplo, 'U'), *alpha, a, *lda, b, *ldb, c, *ldc};
      const QtbInt order = left ? *m : *n, others = left ? *n : *m;
      if (buffer != nullptr)
        product.add_all(order, others, tile_order, buffer);
      else
        add_by_small_tiles(product, order, others);
    }
  }
  qtb_serv_free(buffer);
}

}  // namespace

QTB_KERNEL(ssymm, symm, float, symm<float>)
QTB_KERNEL(dsymm, symm, double, symm<double>)
QTB_KERNEL(csymm, symm, cfloat, symm<cfloat>)
QTB_KERNEL(zsymm, symm, cdouble, symm<cdouble>)
QTB_KERNEL(chemm, symm, cfloat, (symm<cfloat, true>))
QTB_KERNEL(zhemm, symm, cdouble, (symm<cdouble, true>))

}  // namespace qtb::QTB_TIER
