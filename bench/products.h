// The matrix products that benchmarks time: C := alpha*op(A)*op(B) + beta*C of any shape, of this library or of a peer.
#pragma once

#include <complex>
#include <string>

#include "bench/library.h"

namespace qtb::bench {

struct Product {
  std::string routine;               // sgemm, dgemm, cgemm, zgemm
  char op_a, op_b;                   // N, T or C
  long m, n, k;                      // C is m by n; leading dimensions are the stored rows
  std::complex<double> alpha, beta;  // real for real routines; a beta beyond a magnitude of 1 lets C overflow
  bool is_single() const { return routine[0] == 's' || routine[0] == 'c'; }
  bool is_complex() const { return routine[0] == 'c' || routine[0] == 'z'; }
};

bool is_product(const std::string &routine);

double product_flops(const Product &product);

struct BoundProduct {
  Calls calls;   // empty where the library has no such routine
  bool correct;  // what multiplies_correctly found
};

// The calls of a library on operands of their own, and whether one call gave the right result.
//
// The check costs two sweeps over the operands and is exact. A, B and C are small integers, so that every product and
// sum is a number of the type, whatever the order of summation; then C*w, for a vector w of random integers, has to be
// alpha*(op(A)*(op(B)*w)) + beta*(C*w) to the last bit. An element that is wrong escapes with a probability of about
// one in a thousand per row. With a beta of zero C holds NaN before the call. For this call alpha and beta are rounded
// to integers, away from zero.
BoundProduct bind_product(const Library &library, const Product &product);

}  // namespace qtb::bench
