// Linear systems: A x = b of n equations by Cholesky and by LU with partial pivoting, both in blocks on Level 3, with
// iterative refinement, on every tier that this processor can run.
//
//   linear_systems [order]
//
// The order is 2000 by default. LU has a random general matrix, Cholesky a random positive definite one. A line tells
// the rate of the factorisation and the solve, by the operation counts of the published benchmark (2/3 n^3 + 3/2 n^2
// for LU, half of the cubic term for Cholesky), the scaled residual of that benchmark,
//
//   |A x - b| / (eps (|A| |x| + |b|) n)   in the maximum norm,
//
// which has to be below 16, and the same behind the refinement. Returns 0 if all are, 1 if not, 2 on a bad argument.
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

using Vector = std::vector<double>;

constexpr double one = 1, minus_one = -1, zero = 0;
constexpr QtbInt step = 1;
constexpr QtbInt block = 128;  // columns that are factored before Level 3 takes the rest of the matrix

QtbInt smaller(QtbInt a, QtbInt b) { return a < b ? a : b; }

// ---- LU: P A = L U, with L of unit diagonal, in place ----

// Rows i and pivots[i] of n columns change places, for i from first to last - 1 in order.
void swap_rows(QtbInt n, double *a, QtbInt lda, const QtbInt *pivots, QtbInt first, QtbInt last) {
  for (QtbInt i = first; i < last; i++)
    if (pivots[i] != i) dswap(&n, a + i, &lda, a + pivots[i], &lda);
}

// A panel of m rows and n <= m columns, by halves: the left one, its part of the right one, the rest of the right one.
// The pivots count from the panel's first row. False where a column has nothing but zeros to divide by.
bool factor_panel(QtbInt m, QtbInt n, double *a, QtbInt lda, QtbInt *pivots) {
  if (n == 1) {
    const QtbInt below = m - 1, pivot = idamax(&m, a, &step) - 1;
    pivots[0] = pivot;
    if (a[pivot] == 0) return false;
    std::swap(a[0], a[pivot]);
    const double inverse = 1 / a[0];
    dscal(&below, &inverse, a + 1, &step);
    return true;
  }
  const QtbInt left = n / 2, right = n - left, below = m - left;
  double *const top = a + left * lda, *const rest = top + left;
  if (!factor_panel(m, left, a, lda, pivots)) return false;
  swap_rows(right, top, lda, pivots, 0, left);
  dtrsm("L", "L", "N", "U", &left, &right, &one, a, &lda, top, &lda);
  dgemm("N", "N", &below, &right, &left, &minus_one, a + left, &lda, top, &lda, &one, rest, &lda);
  if (!factor_panel(below, right, rest, lda, pivots + left)) return false;
  for (QtbInt i = left; i < n; i++) pivots[i] += left;
  swap_rows(left, a, lda, pivots, left, n);
  return true;
}

bool factor_lu(QtbInt n, double *a, QtbInt *pivots) {
  for (QtbInt j = 0; j < n; j += block) {
    const QtbInt columns = smaller(block, n - j), below = n - j, behind = j + columns, rest = n - behind;
    double *const diagonal = a + j + j * n, *const right = a + j + behind * n;
    if (!factor_panel(below, columns, diagonal, n, pivots + j)) return false;
    for (QtbInt i = j; i < behind; i++) pivots[i] += j;
    swap_rows(j, a, n, pivots, j, behind);
    swap_rows(rest, a + behind * n, n, pivots, j, behind);
    dtrsm("L", "L", "N", "U", &columns, &rest, &one, diagonal, &n, right, &n);
    dgemm("N", "N", &rest, &rest, &columns, &minus_one, diagonal + columns, &n, right, &n, &one, right + columns, &n);
  }
  return true;
}

void solve_lu(QtbInt n, const double *a, const QtbInt *pivots, double *x) {
  for (QtbInt i = 0; i < n; i++) std::swap(x[i], x[pivots[i]]);
  dtrsm("L", "L", "N", "U", &n, &step, &one, a, &n, x, &n);
  dtrsm("L", "U", "N", "N", &n, &step, &one, a, &n, x, &n);
}

// ---- Cholesky: A = L L^T, in the lower triangle ----

// A diagonal block, by halves. False where the matrix is not positive definite.
bool factor_diagonal(QtbInt n, double *a, QtbInt lda) {
  if (n == 1) {
    if (!(a[0] > 0)) return false;
    a[0] = std::sqrt(a[0]);
    return true;
  }
  const QtbInt top = n / 2, bottom = n - top;
  double *const below = a + top, *const rest = below + top * lda;
  if (!factor_diagonal(top, a, lda)) return false;
  dtrsm("R", "L", "T", "N", &bottom, &top, &one, a, &lda, below, &lda);
  dsyrk("L", "N", &bottom, &top, &minus_one, below, &lda, &one, rest, &lda);
  return factor_diagonal(bottom, rest, lda);
}

bool factor_cholesky(QtbInt n, double *a) {
  for (QtbInt j = 0; j < n; j += block) {
    const QtbInt columns = smaller(block, n - j), rest = n - j - columns;
    double *const diagonal = a + j + j * n, *const below = diagonal + columns;
    if (!factor_diagonal(columns, diagonal, n)) return false;
    dtrsm("R", "L", "T", "N", &rest, &columns, &one, diagonal, &n, below, &n);
    dsyrk("L", "N", &rest, &columns, &minus_one, below, &n, &one, below + columns * n, &n);
  }
  return true;
}

void solve_cholesky(QtbInt n, const double *a, double *x) {
  dtrsm("L", "L", "N", "N", &n, &step, &one, a, &n, x, &n);
  dtrsm("L", "L", "T", "N", &n, &step, &one, a, &n, x, &n);
}

// ---- Systems ----

struct System {
  QtbInt n;
  bool definite;  // the lower triangle of A is stored
  Vector a, b;
};

System random_system(QtbInt n, bool definite) {
  System s{n, definite, Vector(static_cast<std::size_t>(n * n)), Vector(static_cast<std::size_t>(n))};
  std::mt19937_64 random(1);
  std::uniform_real_distribution<double> element(-0.5, 0.5);
  for (double &value : s.b) value = element(random);
  if (!definite) {
    for (double &value : s.a) value = element(random);
    return s;
  }
  // A product of a slender matrix with its transpose, and 1 on the diagonal: definite, whatever the numbers are.
  const QtbInt depth = smaller(n, 64);
  Vector factor(static_cast<std::size_t>(n * depth));
  for (double &value : factor) value = element(random);
  for (QtbInt i = 0; i < n; i++) s.a[static_cast<std::size_t>(i + i * n)] = 1;
  dsyrk("L", "N", &n, &depth, &one, factor.data(), &n, &one, s.a.data(), &n);
  return s;
}

// b - A x.
Vector residual(const System &s, const Vector &x) {
  Vector r = s.b;
  if (s.definite)
    dsymm("L", "L", &s.n, &step, &minus_one, s.a.data(), &s.n, x.data(), &s.n, &one, r.data(), &s.n);
  else
    dgemv("N", &s.n, &s.n, &minus_one, s.a.data(), &s.n, x.data(), &step, &one, r.data(), &step);
  return r;
}

double largest(const Vector &v) {
  double most = 0;
  for (const double value : v) most = std::isnan(value) ? value : std::max(most, std::fabs(value));
  return most;
}

// The largest sum of magnitudes in a row of A.
double norm(const System &s) {
  Vector sums(static_cast<std::size_t>(s.n));
  for (QtbInt j = 0; j < s.n; j++)
    for (QtbInt i = s.definite ? j : 0; i < s.n; i++) {
      const double magnitude = std::fabs(s.a[static_cast<std::size_t>(i + j * s.n)]);
      sums[static_cast<std::size_t>(i)] += magnitude;
      if (s.definite && i != j) sums[static_cast<std::size_t>(j)] += magnitude;
    }
  return largest(sums);
}

double scaled_residual(const System &s, double norm_of_a, const Vector &x, const Vector &r) {
  constexpr double rounding = std::numeric_limits<double>::epsilon() / 2;
  const double scale = norm_of_a * largest(x) + largest(s.b);
  return largest(r) / (rounding * scale * static_cast<double>(s.n));
}

// Factors and solves on the tier of this process, refines, and prints a line of the table.
int solve(const char *tier, const System &s) {
  constexpr double residual_limit = 16;  // of the published benchmark
  constexpr int refinements = 3;
  const QtbInt n = s.n;
  Vector factors = s.a, x = s.b;
  std::vector<QtbInt> pivots(static_cast<std::size_t>(n));
  const auto solve_for = [&](Vector &v) {
    if (s.definite)
      solve_cholesky(n, factors.data(), v.data());
    else
      solve_lu(n, factors.data(), pivots.data(), v.data());
  };
  const auto start = std::chrono::steady_clock::now();
  const bool factored = s.definite ? factor_cholesky(n, factors.data()) : factor_lu(n, factors.data(), pivots.data());
  if (factored) solve_for(x);
  const std::chrono::duration<double> seconds = std::chrono::steady_clock::now() - start;

  // Each step solves for what the last residual leaves, as long as that gains.
  const double norm_of_a = norm(s);
  Vector r = residual(s, x);
  const double first = scaled_residual(s, norm_of_a, x, r);
  double best = first;
  for (int i = 0; i < refinements; i++) {
    Vector refined = x;
    solve_for(r);
    daxpy(&n, &one, r.data(), &step, refined.data(), &step);
    r = residual(s, refined);
    const double next = scaled_residual(s, norm_of_a, refined, r);
    if (!(next < best)) break;
    best = next;
    x = refined;
  }

  const auto order = static_cast<double>(n);
  const double operations = (s.definite ? 1.0 : 2.0) / 3 * order * order * order + 1.5 * order * order;
  const bool good = factored && first < residual_limit && best < residual_limit;
  std::printf("%-6s %-10s %10.2f %10.1f %12.5f %12.5f  %s\n", tier, s.definite ? "Cholesky" : "LU",
              operations / seconds.count() * 1e-9, seconds.count() * 1e3, first, best, good ? "right" : "WRONG");
  return good ? right : wrong;
}

}  // namespace

int main(int count, char **arguments) {
  constexpr QtbInt usual = 2000, largest_order = 20000;  // two matrices of 3.2 GB
  const QtbInt n = order_argument(count, arguments, usual, largest_order);
  if (n == 0) return bad_argument;
  if (count == 3) {  // a process of on_every_tier
    int result = right;
    for (const bool definite : {true, false})
      result = std::max(result, solve(arguments[2], random_system(n, definite)));
    return result;
  }
  std::printf("systems of %lld equations, scaled residual below 16\n%-6s %-10s %10s %10s %12s %12s\n",
              static_cast<long long>(n), "tier", "factors", "GFLOP/s", "ms", "residual", "refined");
  return on_every_tier(arguments[0], std::to_string(n));
}
