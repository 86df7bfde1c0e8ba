/*
 * A program with known calls, for the tests of qtb-trace: by Fortran names and by the C interface, from two threads,
 * and in a forked child where there is an argument. As a library it is for plugin_host.c.
 */
#include <pthread.h>
#include <setjmp.h>
#include <sys/wait.h>
#include <unistd.h>

#include "qtb/cblas.h"

enum { n = 64 };
static double a[n * n], c[n * n];

double ddot_(const CBLAS_INT *, const double *, const CBLAS_INT *, const double *, const CBLAS_INT *);
void dgemm_(const char *, const char *, const CBLAS_INT *, const CBLAS_INT *, const CBLAS_INT *, const double *,
            const double *, const CBLAS_INT *, const double *, const CBLAS_INT *, const double *, double *,
            const CBLAS_INT *);

static void *dots(void *unused) {
  const CBLAS_INT count = 100, one = 1;
  double sum = 0;
  for (int i = 0; i < 1000; i++) sum += ddot_(&count, a, &one, a, &one);
  if (sum != 100000) _exit(3);
  return unused;
}

/* Leaves a call by a jump, as some programs do. */
static jmp_buf behind_the_error;
void xerbla_(const char *name, const CBLAS_INT *info, size_t length);
void xerbla_(const char *name, const CBLAS_INT *info, size_t length) {
  (void)name, (void)info, (void)length;
  longjmp(behind_the_error, 1);
}

int main(int argc, char **argv) {
  (void)argv;
  for (int i = 0; i < n * n; i++) a[i] = 1;

  const CBLAS_INT size = n, rows = 20, columns = 30, inner = 40;
  const double one = 1, zero = 0;
  if (setjmp(behind_the_error) == 0) {
    const CBLAS_INT wrong = -1;
    dgemm_("N", "N", &wrong, &wrong, &wrong, &one, a, &size, a, &size, &zero, c, &size);
    return 8;
  }
  for (int i = 0; i < 10; i++) dgemm_("n", "T", &rows, &columns, &inner, &one, a, &size, a, &size, &zero, c, &size);
  if (c[0] != inner || c[19 + 29 * n] != inner || c[20] != 0) return 1;

  cblas_dgemm(CblasRowMajor, CblasTrans, CblasNoTrans, rows, columns, inner, 1, a, n, a, n, 0, c, n);
  cblas_dtrsm(CblasRowMajor, CblasLeft, CblasUpper, CblasNoTrans, CblasUnit, 5, 6, 1, a, n, c, n);
  cblas_dsbmv(CblasColMajor, CblasLower, 9, 3, 1, a, n, a, 1, 0, c, 1);
  float x[] = {1, 2, 3, 4}, product[2];
  cblas_cdotc_sub(2, x, 1, x, 1, product);
  if (product[0] != 30 || product[1] != 0) return 2;
  if (cblas_idamax(4, a, 1) != 0) return 2;

  pthread_t threads[2];
  for (int i = 0; i < 2; i++) pthread_create(&threads[i], NULL, dots, NULL);
  for (int i = 0; i < 2; i++) pthread_join(threads[i], NULL);
  if (argc > 1) {
    const pid_t child = fork();
    if (child == 0) {
      const CBLAS_INT three = 3, step = 1;
      return ddot_(&three, a, &step, a, &step) == 3 ? 0 : 6;
    }
    int status = 0;
    if (waitpid(child, &status, 0) != child || status != 0) return 7;
  }
  return 0;
}
