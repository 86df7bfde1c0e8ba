/* A C program on a companion: products and solves in rows and columns, values, positions, and reports of errors. */
#include <complex.h>
#include <qtb/cblas.h>
#include <stdio.h>

#ifdef USE_SUFFIX
#define CALL(name) cblas_##name##_64
#else
#define CALL(name) cblas_##name
#endif

int main(void) {
  const double a[6] = {1, 2, 3, 4, 5, 6}, b[6] = {1, 0, 2, 1, 0, 3};
  double c[4] = {-1, -1, -1, -1};

  /* In rows: A is 2 x 3, B 3 x 2. */
  CALL(dgemm)(CblasRowMajor, CblasNoTrans, CblasNoTrans, 2, 2, 3, 1, a, 3, b, 2, 0, c, 2);
  if (c[0] != 5 || c[1] != 11 || c[2] != 14 || c[3] != 23) return 1;
  /* In columns the same memory holds the transposes: A^T is 3 x 2, B^T 2 x 3. */
  CALL(dgemm)(CblasColMajor, CblasNoTrans, CblasNoTrans, 2, 2, 3, 1, b, 2, a, 3, 0, c, 2);
  if (c[0] != 5 || c[1] != 11 || c[2] != 14 || c[3] != 23) return 2;

  const double t[4] = {2, 1, 0, 4};
  double x[2] = {6, 8};
  CALL(dtrsv)(CblasRowMajor, CblasUpper, CblasNoTrans, CblasNonUnit, 2, t, 2, x, 1);
  if (x[0] != 2 || x[1] != 2) return 3;

  /* conj(A^T)*x in rows, for which no routine of columns has a form. */
  const double _Complex z[4] = {1 + I, 2, 3 * I, 4}, v[2] = {1, I}, one = 1, zero = 0;
  double _Complex w[2] = {0, 0}, dot;
  CALL(zgemv)(CblasRowMajor, CblasConjTrans, 2, 2, &one, z, 2, v, 1, &zero, w, 1);
  if (w[0] != 4 - I || w[1] != 2 + 4 * I) return 4;
  CALL(zdotc_sub)(2, z, 1, v, 1, &dot);
  if (dot != 1 + I) return 5;
  if (CALL(idamax)(6, a, 1) != 5 || CALL(idamax)(0, a, 1) != 0 || CALL(ddot)(3, a, 1, b, 1) != 7) return 6;

  /* Parameter 9 is lda; the result stays. */
  CALL(dgemm)(CblasRowMajor, CblasNoTrans, CblasNoTrans, 2, 2, 3, 1, a, 2, b, 2, 0, c, 2);
  CALL(dgemm)(CblasColMajor, CblasNoTrans, (CBLAS_TRANSPOSE)7, 2, 2, 3, 1, a, 2, b, 3, 0, c, 2);
  if (c[0] != 5) return 7;
  return 0;
}
