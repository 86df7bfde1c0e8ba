/* A C program on the installed library: a product, a dot product, a complex result, an error, the version text. */
#include <complex.h>
#include <qtb.h>
#include <stdio.h>
#include <string.h>

int main(void) {
  const QtbInt n = 2, one = 1, short_lda = 1;
  const double alpha = 1, beta = 0, a[4] = {1, 2, 3, 4}, b[4] = {5, 6, 7, 8};
  double c[4] = {-1, -1, -1, -1};

  dgemm("N", "N", &n, &n, &n, &alpha, a, &n, b, &n, &beta, c, &n);
  if (c[0] != 23 || c[1] != 34 || c[2] != 31 || c[3] != 46) return 1;

  DGEMM("t", "n", &n, &n, &n, &alpha, a, &n, b, &n, &beta, c, &n);
  if (c[0] != 17 || c[1] != 39 || c[2] != 23 || c[3] != 53) return 2;

  const double dot = ddot(&n, a, &one, b, &one);
  if (dot != 17) return 3;

  const double _Complex x[2] = {1 + 2 * I, 3}, y[2] = {1 * I, 2 - 1 * I};
  double _Complex z = 0;
  if (zdotc(&z, &n, x, &one, y, &one) != &z || z != 8 - 2 * I) return 4;

  dgemm("N", "N", &n, &n, &n, &alpha, a, &short_lda, b, &n, &beta, c, &n);
  if (c[0] != 17) return 5;

  char version[200];
  QTBGetVersionString(version, sizeof version);
  if (strstr(version, " 10.2.2 ") == NULL) return 6;
  puts(version);
  return 0;
}
