// Least squares: fits the first column of a table by an intercept and the other columns, and compares the coefficients
// with certified ones.
//
//   least_squares data.csv certified.csv
//
// The certified table has a text and a number per line: a term ("intercept" or a column's name) and its coefficient.
// Returns 0 if every coefficient agrees to nine digits or more, 1 if not, 2 on bad input.
//
// Method: with X the m by p matrix of a column of ones and the data's columns, X = QR by Householder reflections, one
// column after another, Q being applied to the right-hand side on the way; R b = Q'y gives the coefficients. Column
// scaling would change nothing: the factorisation is as accurate as if every column had length one. The covariance of
// the coefficients is s*s times inverse(R) times its transpose, with s*s the squared residual over m - p.
#include <float.h>
#include <math.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>

#include "qtb.h"
#include "table.h"

enum { agreed = 0, disagreed = 1, bad_input = 2 };

static const double digits_expected = 9;
static const double digits_certified = 15;

// The constants that calls by reference need.
static const QtbInt one_step = 1;
static const double one = 1, zero = 0;

static double *matrix(QtbInt rows, QtbInt columns) {
  double *a = calloc((size_t)(rows * columns), sizeof *a);
  if (a == NULL) {
    fprintf(stderr, "out of memory\n");
    exit(EXIT_FAILURE);
  }
  return a;
}

// Replaces the m by n matrix a, m > p, by its first p Householder reflections' work: R in the upper triangle of the
// first p columns, zeros below, and Q' times the other columns. work has n elements, v has m.
static void reflect(QtbInt m, QtbInt n, QtbInt p, double *a, double *v, double *work) {
  for (QtbInt j = 0; j < p; j++) {
    const QtbInt rows = m - j, columns = n - j - 1;
    double *column = a + j + j * m;
    const double length = dnrm2(&rows, column, &one_step);
    if (length == 0) continue;
    const double diagonal = column[0] > 0 ? -length : length;  // away from column[0], so that nothing cancels

    // H = I - tau v v' with v[0] = 1 takes the column to (diagonal, 0, ..., 0).
    const double tau = (diagonal - column[0]) / diagonal;
    const double scale = 1 / (column[0] - diagonal);
    dcopy(&rows, column, &one_step, v, &one_step);
    dscal(&rows, &scale, v, &one_step);
    v[0] = 1;
    column[0] = diagonal;
    memset(column + 1, 0, (size_t)(rows - 1) * sizeof *column);

    // The columns to the right, B: B - tau v (B'v)'.
    double *right = column + m;
    const double minus_tau = -tau;
    dgemv("T", &rows, &columns, &one, right, &m, v, &one_step, &zero, work, &one_step);
    dger(&rows, &columns, &minus_tau, v, &one_step, work, &one_step, right, &m);
  }
}

// How many decimal digits of value agree with the certified one: -log10 of the relative error.
static double digits(double value, double certified) {
  const double error = fabs(value - certified) / fabs(certified == 0 ? 1 : certified);
  if (error == 0) return digits_certified;
  return isnan(error) ? 0 : fmax(0, fmin(digits_certified, -log10(error)));
}

// The number of a term in the certified table, -1 if it has none.
static long certified_row(const struct table *certified, const char *term) {
  for (size_t i = 0; i < certified->rows; i++)
    if (strcmp(certified->labels[i], term) == 0) return (long)i;
  return -1;
}

static int fit(const struct table *data, const struct table *certified) {
  const QtbInt m = (QtbInt)data->rows, p = (QtbInt)data->columns, n = p + 1;  // n: with y behind the columns of X
  double *a = matrix(m, n), *v = matrix(m, 1), *work = matrix(n, 1);
  for (QtbInt i = 0; i < m; i++) {
    const double *row = data->values + i * p;
    a[i] = 1;
    for (QtbInt j = 1; j < p; j++) a[i + j * m] = row[j];
    a[i + p * m] = row[0];
  }
  reflect(m, n, p, a, v, work);

  int result = agreed;
  for (QtbInt j = 0; j < p; j++) {
    // A column of R is as long as that of X; what is left of it on the diagonal must be more than rounding.
    const QtbInt above = j + 1;
    if (fabs(a[j + j * m]) <= (double)m * DBL_EPSILON * dnrm2(&above, a + j * m, &one_step)) result = bad_input;
  }
  if (result == bad_input) fprintf(stderr, "the columns are linearly dependent\n");

  if (result == agreed) {
    double *b = a + p * m, *inverse = matrix(p, p);
    dtrsv("U", "N", "N", &p, a, &m, b, &one_step);
    for (QtbInt j = 0; j < p; j++) inverse[j + j * p] = 1;
    dtrsm("L", "U", "N", "N", &p, &p, &one, a, &m, inverse, &p);

    // The residual is Q times what lies below the coefficients, and as long.
    const QtbInt freedom = m - p;
    const double deviation = dnrm2(&freedom, b + p, &one_step) / sqrt((double)freedom);

    printf("%-14s %24s %24s %16s %7s\n", "term", "computed", "certified", "standard error", "digits");
    for (QtbInt j = 0; j < p; j++) {
      const char *term = j == 0 ? "intercept" : data->names[j];
      const double expected = certified->values[certified_row(certified, term) * 2 + 1];
      const double agreeing = digits(b[j], expected), error = deviation * dnrm2(&p, inverse + j, &p);
      printf("%-14s %24.15g %24.15g %16.6g %7.1f\n", term, b[j], expected, error, agreeing);
      if (agreeing < digits_expected) result = disagreed;
    }
    printf("residual standard deviation %.12g with %lld degrees of freedom\n", deviation, (long long)freedom);
    if (result == disagreed) fprintf(stderr, "fewer than %.0f digits agree\n", digits_expected);
    free(inverse);
  }
  free(a);
  free(v);
  free(work);
  return result;
}

// Whether the two tables fit each other and can be solved; prints what is wrong.
static bool consistent(const struct table *data, const struct table *certified) {
  if (data->columns < 2) {
    fprintf(stderr, "the data need a column to fit and at least one to fit it by\n");
    return false;
  }
  if (data->rows <= data->columns) {
    fprintf(stderr, "%zu rows are too few for %zu coefficients\n", data->rows, data->columns);
    return false;
  }
  if (certified->columns != 2) {
    fprintf(stderr, "the certified table has %zu columns, not a term and a coefficient\n", certified->columns);
    return false;
  }
  for (size_t j = 0; j < data->columns; j++) {
    const char *term = j == 0 ? "intercept" : data->names[j];
    if (certified_row(certified, term) < 0) {
      fprintf(stderr, "no certified coefficient of %s\n", term);
      return false;
    }
  }
  return true;
}

int main(int count, char **arguments) {
  if (count != 3) {
    fprintf(stderr, "usage: %s data.csv certified.csv\n", arguments[0]);
    return bad_input;
  }
  struct table data, certified = {0};
  int result = bad_input;
  if (table_read(&data, arguments[1], false) && table_read(&certified, arguments[2], true) &&
      consistent(&data, &certified))
    result = fit(&data, &certified);
  table_free(&data);
  table_free(&certified);
  return result;
}
