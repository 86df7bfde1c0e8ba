// Matrix product: the speed of dgemm on every tier that this processor can run, and a check of each product.
//
//   matrix_product [order]
//
// C = A B for square matrices of that order, 1500 by default. Returns 0 if all products are right, 1 if one is wrong, 2
// on a bad argument.
//
// A product is checked by a random projection: for a vector v of signs, C v and A (B v) differ by rounding alone, and a
// wrong element of C shows in C v whatever the signs. Four sums of n terms stand behind an element of the difference
// (C, C v, B v, A (B v)), each with at most n roundings, so that it is at most 4 n roundings of |A| |B| |v|.
#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <limits>
#include <random>
#include <string>
#include <vector>

#include "qtb.h"
#include "tiers.h"

namespace {

// y = A x, or |A| x, with a plain loop.
std::vector<double> times(QtbInt n, const std::vector<double> &a, const std::vector<double> &x,
                          bool magnitudes = false) {
  std::vector<double> y(x.size());
  for (QtbInt j = 0; j < n; j++)
    for (QtbInt i = 0; i < n; i++) {
      const double element = a[static_cast<std::size_t>(i + j * n)];
      y[static_cast<std::size_t>(i)] += (magnitudes ? std::fabs(element) : element) * x[static_cast<std::size_t>(j)];
    }
  return y;
}

// The largest difference of C v and A (B v), in units of its bound.
double projection_error(QtbInt n, const std::vector<double> &a, const std::vector<double> &b,
                        const std::vector<double> &c, const std::vector<double> &signs) {
  const double rounding = std::numeric_limits<double>::epsilon() / 2;
  const std::vector<double> left = times(n, c, signs), right_side = times(n, a, times(n, b, signs));
  const std::vector<double> gauge = times(n, a, times(n, b, std::vector<double>(signs.size(), 1), true), true);
  double worst = 0;
  for (std::size_t i = 0; i < left.size(); i++) {
    const double bound = static_cast<double>(4 * n) * rounding * gauge[i];
    const double error = std::fabs(left[i] - right_side[i]) / bound;
    worst = std::isnan(error) ? std::numeric_limits<double>::infinity() : std::max(worst, error);
  }
  return worst;
}

// Multiplies on the tier of this process, and prints its line of the table.
int multiply(const char *tier, QtbInt n) {
  const auto count = static_cast<std::size_t>(n * n);
  std::vector<double> a(count), b(count), c(count), signs(static_cast<std::size_t>(n));
  std::mt19937_64 random(1);
  std::uniform_real_distribution<double> element(-1, 1);
  for (double &value : a) value = element(random);
  for (double &value : b) value = element(random);
  for (double &value : signs) value = element(random) < 0 ? -1 : 1;

  // The first call decides the tier and probes the machine; the best of the others is the speed.
  constexpr int calls = 4;
  const double one = 1, zero = 0;
  double best = std::numeric_limits<double>::infinity();
  for (int call = 0; call < calls; call++) {
    std::fill(c.begin(), c.end(), std::numeric_limits<double>::quiet_NaN());
    const auto start = std::chrono::steady_clock::now();
    dgemm("N", "N", &n, &n, &n, &one, a.data(), &n, b.data(), &n, &zero, c.data(), &n);
    const std::chrono::duration<double> seconds = std::chrono::steady_clock::now() - start;
    if (call > 0) best = std::min(best, seconds.count());
  }

  const double operations = 2.0 * static_cast<double>(n) * static_cast<double>(n) * static_cast<double>(n);
  const double error = projection_error(n, a, b, c, signs);
  const bool good = error <= 1;
  std::printf("%-6s %10.2f %10.3f %14.5f  %s\n", tier, operations / best * 1e-9, best * 1e3, error,
              good ? "right" : "WRONG");
  return good ? right : wrong;
}

}  // namespace

int main(int count, char **arguments) {
  constexpr QtbInt usual = 1500, largest = 20000;  // three matrices of 3.2 GB
  const QtbInt n = order_argument(count, arguments, usual, largest);
  if (n == 0) return bad_argument;
  if (count == 3) return multiply(arguments[2], n);  // a process of on_every_tier

  std::printf("dgemm, order %lld\n%-6s %10s %10s %14s\n", static_cast<long long>(n), "tier", "GFLOP/s", "ms",
              "error / bound");
  return on_every_tier(arguments[0], std::to_string(n));
}
