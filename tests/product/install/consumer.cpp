// A C++ program on the installed library: a product and a complex result in the types of the standard library.
#include <qtb.h>

#include <cstdio>
#include <vector>

int main() {
  const QtbInt n = 2, one = 1;
  const std::complex<double> alpha = 1, beta = 0;
  const std::vector<std::complex<double>> a = {1, {0, 1}, 3, 4}, b = {1, 0, 0, 1};
  std::vector<std::complex<double>> c(4);
  zgemm("C", "N", &n, &n, &n, &alpha, a.data(), &n, b.data(), &n, &beta, c.data(), &n);
  const std::vector<std::complex<double>> expected = {1, 3, {0, -1}, 4};
  if (c != expected) return 1;

  std::complex<double> dot;
  ZDOTU(&dot, &n, a.data(), &one, a.data(), &one);
  if (dot != 0.0) return 2;
  std::puts("complex product and dot product");
}
