// The parallel Level-1 drivers. See xf_l1_omp.h for their contract and xf_l1_share.h for the cut and the joining of
// dots.
//
// There is no barrier and no reduction in the regions but their end. axpy, copy, swap and rot compute each element
// alone, so that their results do not depend on the team; a dot's partial sums, and the order in which they are joined,
// do.

#include "blas/thread/32e/level1/xf_l1_omp.h"

#include "blas/dispatch/slots.h"
#include "blas/thread/32e/level1/xf_l1_share.h"
#include "blas/thread/team.h"
#include "service/memory.h"

namespace qtb {
namespace {

// What one thread of a team works on.
template <class X, class Y>
struct Piece {
  Team team;
  QtbInt len;
  X *x;
  Y *y;
};

// Calls body on every thread's piece, on a team of nthreads or of what the runtime gives, down to the caller alone.
template <class X, class Y, class Body>
void for_each_piece(QtbInt nthreads, QtbInt n, X *x, QtbInt incx, Y *y, QtbInt incy, Body body) {
  run_team(nthreads, [&](const Team &team) {
    const Level1Share share = level1_share(n, team.size, team.rank);
    body(Piece<X, Y>{team, share.len, x + level1_offset(share, n, incx), y + level1_offset(share, n, incy)});
  });
}

template <class T, auto slot>
void axpy(QTB_OMP_PARAMS_axpy(T)) {
  for_each_piece(nthreads, *n, x, *incx, y, *incy,
                 [=](const auto &piece) { slot(&piece.len, alpha, piece.x, incx, piece.y, incy); });
}

template <class T, auto slot>
void copy(QTB_OMP_PARAMS_copy(T)) {
  for_each_piece(nthreads, *n, x, *incx, y, *incy,
                 [=](const auto &piece) { slot(&piece.len, piece.x, incx, piece.y, incy); });
}

template <class T, auto slot>
void swap(QTB_OMP_PARAMS_swap(T)) {
  for_each_piece(nthreads, *n, x, *incx, y, *incy,
                 [=](const auto &piece) { slot(&piece.len, piece.x, incx, piece.y, incy); });
}

template <class T, auto slot>
void rot(QTB_OMP_PARAMS_rot(T)) {
  for_each_piece(nthreads, *n, x, *incx, y, *incy,
                 [=](const auto &piece) { slot(&piece.len, piece.x, incx, piece.y, incy, c, s); });
}

// Teams up to this size keep their partial results on the stack.
constexpr QtbInt local_partials = 128;

// The sum of the partial results that piece_dot gives. Where there is no memory for those of a larger team, the team is
// as large as the local array allows. The local array is aligned because the order of summation follows the address.
template <class T, class PieceDot>
T joined_dot(QTB_OMP_PARAMS_dot(T), PieceDot piece_dot) {
  alignas(16) T local[local_partials];
  T *allocated = nullptr;
  if (nthreads > local_partials) {
    allocated = static_cast<T *>(qtb_serv_malloc(static_cast<std::uint64_t>(nthreads) * sizeof(T), 0));
    if (allocated == nullptr) nthreads = local_partials;
  }
  T *const partial = allocated != nullptr ? allocated : local;
  QtbInt team = 1;
  for_each_piece(nthreads, *n, x, *incx, y, *incy, [=, &team](const auto &piece) {
    if (piece.team.rank == 0) team = piece.team.size;
    partial[piece.team.rank] = piece_dot(piece);
  });
  // The result of a team of one stands as it is, a negative zero included.
  const T sum = team == 1 ? partial[0] : level1_sum(partial, team);
  qtb_serv_free(allocated);
  return sum;
}

template <class T, auto slot>
T dot(QTB_OMP_PARAMS_dot(T)) {
  return joined_dot<T>(QTB_OMP_ARGS_dot,
                       [=](const auto &piece) { return slot(&piece.len, piece.x, incx, piece.y, incy); });
}

template <class T, auto slot>
T *cdot(QTB_OMP_PARAMS_cdot(T)) {
  *result = joined_dot<T>(QTB_OMP_ARGS_dot, [=](const auto &piece) {
    T partial;
    slot(&partial, &piece.len, piece.x, incx, piece.y, incy);
    return partial;
  });
  return result;
}

}  // namespace
}  // namespace qtb

extern "C" {
#define QTB_LEVEL1_DRIVER(name, shape, T) \
  QTB_OMP_FUNCTION(shape, T, name) { return qtb::shape<T, &qtb_blas_x##name>(QTB_OMP_ARGS_##shape); }
#define QTB_LEVEL1_SIZED(name, shape, T, ...) QTB_LEVEL1_DRIVER(name, shape, T)
#define QTB_LEVEL1_PAIR(name, shape, T, min_n) QTB_LEVEL1_DRIVER(name, shape, T)
#include "blas/thread/32e/level1/xf_l1.def"
#undef QTB_LEVEL1_SIZED
#undef QTB_LEVEL1_PAIR
}
