/* one_call [memory]: a program of one tiny call, for companion_cost: what it takes beyond that is loading the library
 * and its first call. With an argument it prints the largest memory that it held, in KiB. */
#include <stdio.h>

double ddot_(const int *n, const double *x, const int *incx, const double *y, const int *incy);

int main(int argc, char **argv) {
  const int one = 1;
  const double x = 1;
  char line[128];
  (void)argv;
  if (ddot_(&one, &x, &one, &x, &one) != 1) return 1;
  if (argc == 1) return 0;
  FILE *status = fopen("/proc/self/status", "r");
  long size = 0;
  while (status && fgets(line, sizeof line, status)) {
    if (sscanf(line, "VmHWM: %ld", &size) == 1) printf("%ld\n", size);
  }
  return size == 0;
}
