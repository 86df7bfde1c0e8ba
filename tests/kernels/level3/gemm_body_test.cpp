// Every tier's serial gemm, from no rows, columns or depth to beyond every block boundary. Random reals then meet the
// oracle.
#include <random>
#include <set>

#include "tests/kernels/level3/gemm_bodies.h"

namespace qtb::test {
namespace {

TYPED_TEST_SUITE(GemmBodies, Types);

// QTB_TEST_LONG: every size up to 70, under every pair of options.
bool long_run() { return std::getenv("QTB_TEST_LONG") != nullptr; }

TYPED_TEST(GemmBodies, SmallSizesAreExactOnIntegers) {
  const QtbInt most = long_run() ? 70 : 20;
  for (QtbInt m = 0; m <= most; m++)
    for (QtbInt n = 0; n <= most; n++)
      for (QtbInt k = 0; k <= most; k++) {
        const bool all_pairs = long_run() || (m <= 8 && n <= 8);
        this->expect_exact(m, n, k, static_cast<int>(m + n + k), all_pairs ? 1 : this->ops + 1);
        if (this->HasFatalFailure()) return;
      }
}

TYPED_TEST(GemmBodies, SizesUpToSeventyAreExactOnIntegers) {
  for (int trial = 0; trial < 300; trial++) {
    const auto size = [] { return static_cast<QtbInt>(generator() % 71); };
    const QtbInt m = size(), n = size(), k = size();
    this->expect_exact(m, n, k, trial, this->ops + 1);
    if (this->HasFatalFailure()) return;
  }
}

TYPED_TEST(GemmBodies, EveryBoundaryOfABlockIsExactOnIntegers) {
  const auto around = [](std::initializer_list<QtbInt> values) {
    std::set<QtbInt> all;
    for (QtbInt v : values) all.insert({v - 1, v, v + 1});
    return all;
  };
  int trial = 0;
  for (QtbInt m : around({160, 256, 320, 384, 448, 480, 512, 600, 640, 768, 1000, 1024, 1280, 1536, 2000})) {
    this->expect_exact(m, 11, 9, trial++, this->ops + 1);
    if (this->HasFatalFailure()) return;
  }
  for (QtbInt n : around({384, 2000, 4992, 5000, 10000})) {
    this->expect_exact(9, n, 5, trial++, this->ops * this->ops);
    if (this->HasFatalFailure()) return;
  }
  for (QtbInt k : around({64, 112, 128, 224, 256, 300, 448, 512, 768, 1024, 1300})) {
    this->expect_exact(17, 15, k, trial++, this->ops + 1);
    if (this->HasFatalFailure()) return;
  }
  // Beyond the size of B up to which a body reads it in place; more than one block in each direction.
  this->expect_exact(33, 300, 260, trial++, this->ops + 1);
  this->expect_exact(1300, 130, 270, trial++, this->ops * this->ops);
}

// From nothing but zeros, alpha of -1 makes products of -0; added to the zero that a beta of 0 puts there they are 0.
TYPED_TEST(GemmBodies, ABetaOfZeroNeverLeavesANegativeZero) {
  using T = TypeParam;
  const T alpha = value<T>(-1, 0), beta = value<T>(0, 0), plus_zero = value<T>(0, 0);
  for (const QtbInt size : {1, 2, 3, 5, 8, 9, 13, 40})
    for (int pair = 0; pair < this->ops * this->ops; pair++) {
      Operand<T> a(pair % this->ops, size, size), b(pair / this->ops, size, size);
      for (std::size_t e = 0; e < a.stored.array.size(); e++) a.stored.array[e] = plus_zero;
      Stored<T> c(size, size);
      for (const Routine<T> &routine : this->routines) {
        c.poison();
        routine.gemm(&letters[a.op], &letters[b.op], &size, &size, &size, &alpha, a.stored.array.data(), &a.stored.ld,
                     b.stored.array.data(), &b.stored.ld, &beta, c.array.data(), &c.ld);
        for (QtbInt j = 0; j < size; j++)
          for (QtbInt i = 0; i < size; i++)
            ASSERT_TRUE(same_bits(*c.at(i, j), plus_zero)) << tier_name(routine.tier) << " " << routine.name << " "
                                                           << letters[a.op] << letters[b.op] << " of size " << size;
        TallyReport::of(routine.name.c_str()).exact(routine.tier);
      }
    }
}

TYPED_TEST(GemmBodies, RandomRealsAgreeWithTheOracle) {
  using T = TypeParam;
  const T scalars[][2] = {
      {value<T>(1, 0), value<T>(1, 0)}, {value<T>(-0.75, 0.5), value<T>(0.5, 0.25)}, {value<T>(2, -1), value<T>(0, 0)}};
  const QtbInt sizes[][3] = {{1, 1, 1},   {2, 3, 4},   {4, 4, 4},    {5, 9, 7},    {8, 8, 8},    {13, 11, 33},
                             {16, 5, 70}, {7, 19, 31}, {33, 6, 129}, {25, 27, 64}, {9, 14, 300}, {41, 3, 530}};
  int turn = 0;
  for (const auto &size : sizes)
    for (int op_a = 0; op_a < this->ops; op_a++)
      for (int op_b = 0; op_b < this->ops; op_b++, turn++) {
        const QtbInt m = size[0], n = size[1], k = size[2];
        if (m * n * k > 4000 && (op_a + op_b) % 2 != turn / (this->ops * this->ops) % 2) continue;
        const T alpha = scalars[turn % 3][0], beta = scalars[turn % 3][1];
        Operand<T> a(op_a, m, k), b(op_b, k, n);
        Stored<T> before(m, n), c(m, n);
        for (const Routine<T> &routine : this->routines) {
          c.take(before);
          if (magnitude(widen(beta)) == 0) c.poison();
          routine.gemm(&letters[op_a], &letters[op_b], &m, &n, &k, &alpha, a.stored.array.data(), &a.stored.ld,
                       b.stored.array.data(), &b.stored.ld, &beta, c.array.data(), &c.ld);
          expect_product(routine.name, routine.tier, k, alpha, a, b, beta, before, c);
          if (this->HasFatalFailure()) return;
        }
      }
}

TYPED_TEST(GemmBodies, NotANumberInAScalarReachesEveryElementAndOnlyWhereThePublishedRoutineUsesIt) {
  using T = TypeParam;
  const T not_a_number = value<T>(NAN, 0), one = value<T>(1, 0), zero = value<T>(0, 0);
  const auto is_not_a_number = [](T v) {
    if constexpr (is_complex<T>)
      return std::isnan(v.re) || std::isnan(v.im);
    else
      return static_cast<bool>(std::isnan(v));
  };
  for (const Routine<T> &routine : this->routines) {
    for (QtbInt size : {2, 9, 40}) {
      Operand<T> a(0, size, size), b(1, size, size);
      Stored<T> c(size, size);
      const auto call = [&](const T &alpha, const T &beta, QtbInt k) {
        routine.gemm("N", "T", &size, &size, &k, &alpha, a.stored.array.data(), &a.stored.ld, b.stored.array.data(),
                     &b.stored.ld, &beta, c.array.data(), &c.ld);
      };
      const auto count = [&] {
        QtbInt found = 0;
        for (QtbInt j = 0; j < size; j++)
          for (QtbInt i = 0; i < size; i++) found += is_not_a_number(*c.at(i, j));
        return found;
      };
      c.poison();
      call(one, zero, size);
      ASSERT_EQ(0, count()) << tier_name(routine.tier) << " " << routine.name;
      call(not_a_number, one, 0);
      ASSERT_EQ(0, count()) << tier_name(routine.tier) << " " << routine.name << " with no depth";
      call(zero, not_a_number, size);
      ASSERT_EQ(size * size, count()) << tier_name(routine.tier) << " " << routine.name;
      call(zero, zero, size);
      ASSERT_EQ(0, count()) << tier_name(routine.tier) << " " << routine.name;
      call(not_a_number, zero, size);
      ASSERT_EQ(size * size, count()) << tier_name(routine.tier) << " " << routine.name;
      TallyReport::of(routine.name.c_str()).exact(routine.tier);
    }
  }
}

TYPED_TEST(GemmBodies, NothingIsTouchedWithoutRowsOrColumnsAndNoOperandIsReadWithoutAlpha) {
  using T = TypeParam;
  const T one = value<T>(1, 0), zero = value<T>(0, 0), two = value<T>(2, 0);
  Guarded<T> nothing(0);
  for (const Routine<T> &routine : this->routines) {
    const QtbInt k = 9, ld = 9, counts[][2] = {{0, 9}, {9, 0}, {-1, 9}, {9, -1}};
    for (const auto &count : counts)
      routine.gemm("N", "N", &count[0], &count[1], &k, &one, nothing.data(), &ld, nothing.data(), &ld, &zero,
                   nothing.data(), &ld);
    const QtbInt size = 9;
    Stored<T> c(size, size), before(size, size);
    c.take(before);
    routine.gemm("T", "T", &size, &size, &k, &zero, nothing.data(), &ld, nothing.data(), &ld, &one, c.array.data(),
                 &c.ld);
    ASSERT_EQ(0, std::memcmp(c.array.data(), before.array.data(), c.array.size() * sizeof(T)))
        << tier_name(routine.tier) << " " << routine.name;
    routine.gemm("T", "T", &size, &size, &k, &zero, nothing.data(), &ld, nothing.data(), &ld, &two, c.array.data(),
                 &c.ld);
    TallyReport::of(routine.name.c_str()).exact(routine.tier);
  }
}

}  // namespace
}  // namespace qtb::test
