/*
 * A library with a broken routine, ahead of the real one, which it is linked with: what BROKEN names is computed
 * wrongly in its last element ("wrong"), or traps ("trap").
 */
#define _GNU_SOURCE
#include <dlfcn.h>
#include <signal.h>
#include <stdlib.h>
#include <string.h>

#include "qtb.h"

typedef void (*Symv)(const char *, const QtbInt *, const double *, const double *, const QtbInt *, const double *,
                     const QtbInt *, const double *, double *, const QtbInt *);

static void broken(const char *name, const char *uplo, const QtbInt *n, const double *alpha, const double *a,
                   const QtbInt *lda, const double *x, const QtbInt *incx, const double *beta, double *y,
                   const QtbInt *incy) {
  const char *const how = getenv("BROKEN");
  if (how != NULL && strcmp(how, "trap") == 0) raise(SIGILL);
  ((Symv)dlsym(RTLD_NEXT, name))(uplo, n, alpha, a, lda, x, incx, beta, y, incy);
  if (how != NULL && strcmp(how, "wrong") == 0 && *n > 20 && *incy > 0) y[(*n - 1) * *incy] *= 1 + 0x1p-40;
}

void dsymv(const char *uplo, const QtbInt *n, const double *alpha, const double *a, const QtbInt *lda, const double *x,
           const QtbInt *incx, const double *beta, double *y, const QtbInt *incy) {
  broken("dsymv", uplo, n, alpha, a, lda, x, incx, beta, y, incy);
}
void DSYMV(const char *uplo, const QtbInt *n, const double *alpha, const double *a, const QtbInt *lda, const double *x,
           const QtbInt *incx, const double *beta, double *y, const QtbInt *incy) {
  broken("DSYMV", uplo, n, alpha, a, lda, x, incx, beta, y, incy);
}
