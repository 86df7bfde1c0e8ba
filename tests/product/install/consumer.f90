! A Fortran program on the installed library: character options with their hidden lengths, integers of eight bytes.
program consumer
  implicit none
  double precision :: a(2, 2) = reshape([1d0, 2d0, 3d0, 4d0], [2, 2]), b(2, 2) = reshape([5d0, 6d0, 7d0, 8d0], [2, 2])
  double precision :: c(2, 2), ddot
  double complex :: x(2) = [(1d0, 2d0), (3d0, 0d0)], z
  external :: ddot, dgemm, zdotc, xerbla
  call dgemm('No transpose', 'N', 2, 2, 2, 1d0, a, 2, b, 2, 0d0, c, 2)
  if (any(c /= reshape([23d0, 34d0, 31d0, 46d0], [2, 2]))) stop 1
  call dgemm('transpose', 'n', 2, 2, 2, 1d0, a, 2, b, 2, 0d0, c, 2)
  if (any(c /= reshape([17d0, 39d0, 23d0, 53d0], [2, 2]))) stop 2
  if (ddot(4, a, 1, b, 1) /= 70d0) stop 3
  call zdotc(z, 2, x, 1, x, 1)
  if (z /= (14d0, 0d0)) stop 4
  call xerbla('MYSUB ', 7)
end program
