// Every tier's serial gemm as the tests of bodies call it, on the memory service and the processor of buffer_memory.h.
//
// Most of it is exact: operands are small integers whose sums every type holds, so that a result is right or wrong bit
// by bit, whatever the order of summation, and no element can hide in a bound. Operands lie flush against trapping
// pages, signalling NaNs fill the rows between columns, and invalid operations trap.
#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <functional>
#include <string>
#include <vector>

#include "tests/kernels/level3/buffer_memory.h"
#include "tests/kernels/level3/pieces.h"
#include "tests/reference/sums.h"

namespace qtb::test {
namespace {

// ---- The bodies ----

template <class T>
struct Routine {
  using Gemm = QTB_FUNCTION_TYPE(gemm, T);
  std::string name;
  int tier;
  Gemm *gemm;
};

// The bodies that find their family by the processor: on another than the plain one, those alone whose family that is.
template <class T>
std::vector<Routine<T>> all_bodies(const char *name, const std::array<typename Routine<T>::Gemm *, tier_count> &tiers) {
  std::vector<Routine<T>> list;
  for (int tier = 0; tier < tier_count; tier++) {
    if (!processor_runs(tier)) continue;
    if (has_sse41() && tier != tier_ssse3) continue;
    if (processor_name().starts_with("family16") && tier != tier_def) continue;
    list.push_back({name, tier, tiers[static_cast<std::size_t>(tier)]});
  }
  return list;
}

template <class T>
std::vector<Routine<T>> bodies();
template <>
std::vector<Routine<float>> bodies<float>() {
  auto list = all_bodies<float>("sgemm", QTB_ALL_TIERS(sgemm));
  if (processor_name() != "plain") return list;
  if (processor_runs(tier_ssse3)) list.push_back({"sgemm_nobcopy", tier_ssse3, qtb_blas_ssse3_xsgemm_nobcopy});
  if (processor_runs(tier_ssse3)) list.push_back({"sgemm_sse41", tier_ssse3, qtb_blas_ssse3_xsgemm_sse41});
  if (processor_runs(tier_sse42)) list.push_back({"sgemm_nobcopy", tier_sse42, qtb_blas_sse42_xsgemm_nobcopy});
  if (processor_runs(tier_avx)) list.push_back({"sgemm_nobcopy", tier_avx, qtb_blas_avx_xsgemm_nobcopy});
  return list;
}
template <>
std::vector<Routine<double>> bodies<double>() {
  auto list = all_bodies<double>("dgemm", QTB_ALL_TIERS(dgemm));
  if (processor_name() != "plain") return list;
  if (processor_runs(tier_ssse3)) list.push_back({"dgemm_nobcopy", tier_ssse3, qtb_blas_ssse3_xdgemm_nobcopy});
  if (processor_runs(tier_ssse3)) list.push_back({"dgemm_sse41", tier_ssse3, qtb_blas_ssse3_xdgemm_sse41});
  if (processor_runs(tier_sse42)) list.push_back({"dgemm_nobcopy", tier_sse42, qtb_blas_sse42_xdgemm_nobcopy});
  list.push_back({"dgemm_def_run_a", tier_def, qtb_blas_def_xdgemm_def_run_a});
  list.push_back({"dgemm_def_run_b", tier_def, qtb_blas_def_xdgemm_def_run_b});
  return list;
}
template <>
std::vector<Routine<cfloat>> bodies<cfloat>() {
  return all_bodies<cfloat>("cgemm", QTB_ALL_TIERS(cgemm));
}
template <>
std::vector<Routine<cdouble>> bodies<cdouble>() {
  return all_bodies<cdouble>("zgemm", QTB_ALL_TIERS(zgemm));
}

// A matrix of plain numbers, column by column.
struct Numbers {
  QtbInt rows, cols;
  std::vector<double> re, im;
  Numbers(QtbInt r, QtbInt c)
      : rows(r), cols(c), re(static_cast<std::size_t>(r * c)), im(static_cast<std::size_t>(r * c)) {}
  std::size_t at(QtbInt i, QtbInt j) const { return static_cast<std::size_t>(i + j * rows); }
};

template <class T>
Numbers draw_integers(QtbInt rows, QtbInt cols) {
  Numbers d(rows, cols);
  for (std::size_t e = 0; e < d.re.size(); e++) {
    const std::uint64_t bits = generator();
    d.re[e] = static_cast<double>(bits % 7) - 3;
    if (is_complex<T>) d.im[e] = static_cast<double>(bits / 7 % 7) - 3;
  }
  return d;
}

Numbers product_of(const Numbers &a, const Numbers &b, bool complex) {
  Numbers c(a.rows, b.cols);
  const std::size_t rows = static_cast<std::size_t>(a.rows), columns = static_cast<std::size_t>(a.cols);
  const auto add = [&](const std::vector<double> &from, const double *by, double *to) {
    reference::add_columns(rows, columns, from.data(), by, to);
  };
  std::vector<double> negative(columns);
  for (QtbInt j = 0; j < b.cols; j++) {
    const double *const b_re = b.re.data() + b.at(0, j), *const b_im = b.im.data() + b.at(0, j);
    double *const c_re = c.re.data() + c.at(0, j), *const c_im = c.im.data() + c.at(0, j);
    add(a.re, b_re, c_re);
    if (!complex) continue;
    std::transform(b_im, b_im + columns, negative.begin(), std::negate<>());
    add(a.im, negative.data(), c_re);
    add(a.re, b_im, c_im);
    add(a.im, b_re, c_im);
  }
  return c;
}

// Memory for one matrix between two trapping pages.
struct Room {
  Arena arena{std::size_t{1} << 26};

  // rows x cols with columns ld apart; flush against a page, moved away from it by offset bytes.
  template <class T>
  T *place(QtbInt rows, QtbInt cols, QtbInt ld, bool front, std::size_t offset) {
    const std::size_t count = rows > 0 && cols > 0 ? static_cast<std::size_t>((cols - 1) * ld + rows) : 0;
    if (count * sizeof(T) + offset > arena.size()) std::abort();
    unsigned char *at = front ? arena.data() + offset : arena.data() + arena.size() - offset - count * sizeof(T);
    T *p = reinterpret_cast<T *>(at);
    for (QtbInt j = 0; j + 1 < cols && rows > 0; j++)
      for (QtbInt i = rows; i < ld; i++) store_signalling_nan<T>(p + i + j * ld);
    return p;
  }
};

// op(stored) is d.
template <class T>
void store(const Numbers &d, int op, T *p, QtbInt ld) {
  for (QtbInt j = 0; j < d.cols; j++)
    for (QtbInt i = 0; i < d.rows; i++)
      p[op == 0 ? i + j * ld : j + i * ld] = value<T>(d.re[d.at(i, j)], op == 2 ? -d.im[d.at(i, j)] : d.im[d.at(i, j)]);
}

struct Scalars {
  double alpha_re, alpha_im, beta_re, beta_im;
};
constexpr Scalars integer_scalars[] = {{1, 0, 1, 0},  {-1, 2, 0, 0}, {2, -1, -1, 0}, {1, 0, 0, 0},
                                       {-2, 0, 2, 1}, {0, 0, 3, -2}, {0, 0, 0, 0},   {3, 1, 1, 0}};

template <class T>
class GemmBodies : public Seeded {
 protected:
  static constexpr int ops = is_complex<T> ? 3 : 2;
  Room room_a, room_b, room_c;
  const std::vector<Routine<T>> routines = bodies<T>();

  static void SetUpTestSuite() { become_processor(); }
  void TearDown() override {
    EXPECT_EQ(buffer_memory.outstanding, 0) << "a body keeps a buffer";
    buffer_memory.requests.clear();
  }
  std::uint64_t turn = 0;

  // C := alpha*op(A)*op(B) + beta*C on integers, in every body, for the pairs of options from first, every so many.
  void expect_exact(QtbInt m, QtbInt n, QtbInt k, int first = 0, int every = 1) {
    const Numbers a = draw_integers<T>(m, k), b = draw_integers<T>(k, n), old = draw_integers<T>(m, n);
    const Numbers product = product_of(a, b, is_complex<T>);
    for (int pair = first % every; pair < ops * ops; pair += every) {
      const int op_a = pair % ops, op_b = pair / ops;
      turn++;
      const Scalars s = integer_scalars[turn % 8];
      const T alpha = value<T>(s.alpha_re, s.alpha_im), beta = value<T>(s.beta_re, s.beta_im);
      const double ai = is_complex<T> ? s.alpha_im : 0, bi = is_complex<T> ? s.beta_im : 0;
      const bool front = turn % 3 == 0, no_beta = s.beta_re == 0 && bi == 0;
      const std::size_t offset = (turn / 8) % 2 * sizeof(Real<T>);
      const QtbInt rows_a = op_a == 0 ? m : k, cols_a = op_a == 0 ? k : m, rows_b = op_b == 0 ? k : n,
                   cols_b = op_b == 0 ? n : k;
      const QtbInt lda = std::max<QtbInt>(rows_a, 1) + static_cast<QtbInt>(turn % 4);
      const QtbInt ldb = std::max<QtbInt>(rows_b, 1) + static_cast<QtbInt>(turn / 2 % 3);
      const QtbInt ldc = std::max<QtbInt>(m, 1) + static_cast<QtbInt>(turn / 4 % 3);
      T *pa = room_a.place<T>(rows_a, cols_a, lda, front, turn / 16 % 2 * sizeof(Real<T>));
      T *pb = room_b.place<T>(rows_b, cols_b, ldb, front, turn / 32 % 2 * sizeof(Real<T>));
      T *pc = room_c.place<T>(m, n, ldc, front, offset);
      store(a, op_a, pa, lda);
      store(b, op_b, pb, ldb);
      for (const Routine<T> &routine : routines) {
        for (QtbInt j = 0; j < n; j++)
          for (QtbInt i = 0; i < m; i++)
            if (no_beta)
              store_signalling_nan<T>(pc + i + j * ldc);
            else
              pc[i + j * ldc] = value<T>(old.re[old.at(i, j)], old.im[old.at(i, j)]);
        {
          const FiniteOnly finite_only;
          routine.gemm(&letters[op_a], &letters[op_b], &m, &n, &k, &alpha, pa, &lda, pb, &ldb, &beta, pc, &ldc);
        }
        for (QtbInt j = 0; j < n; j++)
          for (QtbInt i = 0; i < m; i++) {
            const std::size_t e = old.at(i, j);
            const double re = s.alpha_re * product.re[e] - ai * product.im[e] + s.beta_re * old.re[e] - bi * old.im[e];
            const double im = s.alpha_re * product.im[e] + ai * product.re[e] + s.beta_re * old.im[e] + bi * old.re[e];
            const T want = value<T>(re, im), got = pc[i + j * ldc];
            bool same = false;
            if constexpr (is_complex<T>)
              same = got.re == want.re && got.im == want.im;
            else
              same = got == want;
            ASSERT_TRUE(same) << tier_name(routine.tier) << " " << routine.name << " " << letters[op_a] << letters[op_b]
                              << " C(" << i << ", " << j << ") of " << m << " x " << n << " x " << k;
          }
        T between{};
        store_signalling_nan<T>(&between);
        for (QtbInt j = 0; j + 1 < n && m > 0; j++)
          for (QtbInt i = m; i < ldc; i++)
            ASSERT_TRUE(same_bits(pc[i + j * ldc], between))
                << tier_name(routine.tier) << " " << routine.name << " wrote between columns";
        TallyReport::of(routine.name.c_str()).exact(routine.tier);
      }
    }
  }
};

using Types = testing::Types<float, double, cfloat, cdouble>;

}  // namespace
}  // namespace qtb::test
