// Operands, calls and check of a matrix product.

#include "bench/products.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <memory>
#include <random>
#include <vector>

#include "bench/memory.h"

namespace qtb::bench {
namespace {

using Complex = std::complex<double>;
using Vector = std::vector<Complex>;

constexpr int largest_integer = 2;    // of the operands of the check: sums of k products stay exact in single precision
constexpr int largest_weight = 1023;  // of the vector that C is multiplied with

// A column-major matrix of elements of one or two numbers of type R.
template <class R>
struct Matrix {
  R *values;
  std::size_t rows, columns;
  bool is_complex;

  std::size_t count() const { return rows * columns * (is_complex ? 2U : 1U); }
  Complex at(std::size_t i, std::size_t j) const {
    const std::size_t position = i + j * rows;
    return is_complex ? Complex(double(values[2 * position]), double(values[2 * position + 1]))
                      : Complex(double(values[position]));
  }
};

struct Operands {
  Memory a{nullptr, std::free}, b{nullptr, std::free}, c{nullptr, std::free};
};

template <class R>
void fill_integers(const Matrix<R> &matrix, std::mt19937 &random) {
  for (std::size_t i = 0; i < matrix.count(); ++i) {
    const int magnitude = 1 + static_cast<int>(random() % largest_integer);
    matrix.values[i] = static_cast<R>((random() & 1U) != 0 ? magnitude : -magnitude);
  }
}

// Without the special cases of the operator of std::complex, which takes care of infinities.
Complex times(Complex x, Complex y) {
  return {x.real() * y.real() - x.imag() * y.imag(), x.real() * y.imag() + x.imag() * y.real()};
}

// op(matrix)*v
template <class R>
Vector apply(const Matrix<R> &matrix, char op, const Vector &v) {
  Vector result(op == 'N' ? matrix.rows : matrix.columns);
  for (std::size_t j = 0; j < matrix.columns; ++j)
    for (std::size_t i = 0; i < matrix.rows; ++i) {
      const Complex element = matrix.at(i, j);
      if (op == 'N')
        result[i] += times(element, v[j]);
      else
        result[j] += times(op == 'C' ? std::conj(element) : element, v[i]);
    }
  return result;
}

double away_from_zero(double x) { return x < 0 ? std::floor(x) : std::ceil(x); }
Complex away_from_zero(Complex x) { return {away_from_zero(x.real()), away_from_zero(x.imag())}; }

// call(alpha, beta) makes one call on the three matrices.
template <class R, class Call>
bool multiplies_correctly(const Product &product, const Matrix<R> &a, const Matrix<R> &b, const Matrix<R> &c,
                          Call &&call) {
  std::mt19937 random(54321);
  const Complex alpha = away_from_zero(product.alpha), beta = away_from_zero(product.beta);
  fill_integers(a, random);
  fill_integers(b, random);
  if (beta == 0.0)
    std::fill_n(c.values, c.count(), std::numeric_limits<R>::quiet_NaN());
  else
    fill_integers(c, random);
  Vector w(c.columns);
  for (Complex &weight : w) weight = double(1 + random() % largest_weight);

  Vector expected = apply(a, product.op_a, apply(b, product.op_b, w));
  for (Complex &element : expected) element = times(alpha, element);
  if (beta != 0.0) {
    const Vector before = apply(c, 'N', w);
    for (std::size_t i = 0; i < expected.size(); ++i) expected[i] += times(beta, before[i]);
  }
  call(alpha, beta);
  return apply(c, 'N', w) == expected;
}

template <class I, class R>
BoundProduct bind_as(void *function, const Product &product) {
  auto *gemm =
      reinterpret_cast<void (*)(const char *, const char *, const I *, const I *, const I *, const R *, const R *,
                                const I *, const R *, const I *, const R *, R *, const I *)>(function);
  const auto operands = std::make_shared<Operands>();
  const auto make = [&](Memory &memory, long rows, long columns) {
    Matrix<R> matrix{nullptr, static_cast<std::size_t>(rows), static_cast<std::size_t>(columns), product.is_complex()};
    memory = allocate(matrix.count() * sizeof(R));
    matrix.values = static_cast<R *>(memory.get());
    return matrix;
  };
  const bool a_stands = product.op_a == 'N', b_stands = product.op_b == 'N';
  const Matrix<R> a = make(operands->a, a_stands ? product.m : product.k, a_stands ? product.k : product.m);
  const Matrix<R> b = make(operands->b, b_stands ? product.k : product.n, b_stands ? product.n : product.k);
  const Matrix<R> c = make(operands->c, product.m, product.n);

  const auto call = [=, m = static_cast<I>(product.m), n = static_cast<I>(product.n), k = static_cast<I>(product.k),
                     lda = static_cast<I>(a.rows), ldb = static_cast<I>(b.rows), op_a = product.op_a,
                     op_b = product.op_b](Complex alpha, Complex beta, long count) {
    const R scale[2] = {R(alpha.real()), R(alpha.imag())}, keep[2] = {R(beta.real()), R(beta.imag())};
    for (long i = 0; i < count; ++i)
      gemm(&op_a, &op_b, &m, &n, &k, scale, a.values, &lda, b.values, &ldb, keep, c.values, &m);
  };
  BoundProduct bound;
  bound.correct = multiplies_correctly(product, a, b, c, [&](Complex alpha, Complex beta) { call(alpha, beta, 1); });
  for (const Matrix<R> &matrix : {a, b, c}) fill<R>(matrix.values, matrix.count() * sizeof(R));
  bound.calls = [call, operands, alpha = product.alpha, beta = product.beta](long count) { call(alpha, beta, count); };
  return bound;
}

}  // namespace

bool is_product(const std::string &routine) { return routine.size() == 5 && routine.substr(1) == "gemm"; }

double product_flops(const Product &product) {
  const double terms = double(product.m) * double(product.n) * double(product.k);
  return terms * (product.is_complex() ? 8 : 2);
}

BoundProduct bind_product(const Library &library, const Product &product) {
  void *function = library.find(product.routine);
  if (function == nullptr) return {};
  if (library.wide)
    return product.is_single() ? bind_as<std::int64_t, float>(function, product)
                               : bind_as<std::int64_t, double>(function, product);
  return product.is_single() ? bind_as<std::int32_t, float>(function, product)
                             : bind_as<std::int32_t, double>(function, product);
}

}  // namespace qtb::bench
