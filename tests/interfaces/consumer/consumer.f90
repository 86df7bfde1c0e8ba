! A Fortran program on a companion, with the integers that its compiler was told.
program consumer
  implicit none
  double precision :: a(2, 2) = reshape([1d0, 2d0, 3d0, 4d0], [2, 2]), b(2, 2) = reshape([5d0, 6d0, 7d0, 8d0], [2, 2])
  double precision :: c(2, 2), ddot
  real :: sdot
  double complex :: x(2) = [(1d0, 2d0), (3d0, 0d0)], zdotc
  complex :: y(2) = [(1., 2.), (3., 0.)], cdotu
  integer :: idamax
  external :: ddot, sdot, zdotc, cdotu, idamax, dgemm
  call dgemm('No transpose', 'N', 2, 2, 2, 1d0, a, 2, b, 2, 0d0, c, 2)
  if (any(c /= reshape([23d0, 34d0, 31d0, 46d0], [2, 2]))) stop 1
  if (ddot(4, a, 1, b, 1) /= 70d0) stop 2
  if (sdot(2, real(a), 1, real(b), 1) /= 17.) stop 3
  if (zdotc(2, x, 1, x, 1) /= (14d0, 0d0)) stop 4
  if (cdotu(2, y, 1, y, 1) /= (6., 4.)) stop 5
  if (idamax(4, a, 1) /= 4) stop 6
  call dgemm('N', 'N', 2, 2, 2, 1d0, a, 1, b, 2, 0d0, c, 2)
end program
