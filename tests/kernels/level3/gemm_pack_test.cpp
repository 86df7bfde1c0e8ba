// The copy routines of GEMM fill the packed format of their tile, and nothing else.
#include "tests/kernels/level3/gemm_families.h"
#include "tests/reference/panels.h"

namespace qtb::test {
namespace {

template <class T>
class GemmCopies : public Seeded {
 protected:
  static int ops() { return is_complex<T> ? 3 : 2; }
};

using Types = testing::Types<float, double, cfloat, cdouble>;
TYPED_TEST_SUITE(GemmCopies, Types);

// alpha times v in the working precision: the element first, each product and sum rounded once.
template <class T>
T scaled(T v, T alpha) {
  if constexpr (is_complex<T>)
    return {v.re * alpha.re - v.im * alpha.im, v.im * alpha.re + v.re * alpha.im};
  else
    return v * alpha;
}

// Some elements zero, of either sign.
template <class T>
void sow_zeros(Stored<T> &a) {
  for (QtbInt j = 0; j < a.cols; j++)
    for (QtbInt i = 0; i < a.rows; i++)
      if (generator() % 4 == 0) *a.at(i, j) = value<T>(generator() % 2 == 0 ? 0.0 : -0.0, -0.0);
}

TYPED_TEST(GemmCopies, HaveAFamilyOfEveryTier) {
  for (int tier = 0; tier < tier_count; tier++) {
    bool found = false;
    for (const Pieces<TypeParam> &p : families<TypeParam>) found = found || p.tier == tier;
    EXPECT_TRUE(found) << "write the tier " << tier_name(tier) << " into tests/kernels/level3/gemm_families.h";
  }
}

TYPED_TEST(GemmCopies, PacksAWithAlphaBitByBitAndLeavesOutTheRowsBeyondATile) {
  using T = TypeParam;
  for (const Pieces<T> &p : families<T>) {
    if (!processor_runs(p.tier)) continue;
    for (const T alpha : {value<T>(1, 0), value<T>(-0.7, 0.3)})
      for (int op = 0; op < this->ops(); op++)
        for (QtbInt m : row_counts(p))
          for (QtbInt k : depths) {
            Operand<T> a(op, m, k);
            sow_zeros(a.stored);
            Panel<T> panel = a_panel(p, m, k);
            p.acopy[op](&m, &k, a.stored.array.data(), &a.stored.ld, panel.array.data(), &panel.ldp, &alpha);
            QtbInt i = 0;
            for (const auto &row : reference::unpack_a(p.tile, m, panel.array.data(), panel.ldp)) {
              for (QtbInt l = 0; l < padded_depth(p.tile, k); l++)
                ASSERT_TRUE(same_bits(row.at(l), l < k && i < m ? scaled(a.at(i, l), alpha) : T{}))
                    << tier_name(p.tier) << " " << p.name << " " << letters[op] << " element (" << i << ", " << l
                    << ") of " << m << " x " << k;
              i++;
            }
            TallyReport::of((std::string(p.name) + "_acopy").c_str()).exact(p.tier);
          }
  }
}

TYPED_TEST(GemmCopies, PacksBBitByBitWithZeroPaddingAndNarrowerEdges) {
  using T = TypeParam;
  const T unread = value<T>(NAN, NAN);
  for (const Pieces<T> &p : families<T>) {
    if (!processor_runs(p.tier)) continue;
    for (int op = 0; op < this->ops(); op++)
      for (QtbInt n : column_counts(p))
        for (QtbInt k : depths) {
          Operand<T> b(op, k, n);
          sow_zeros(b.stored);
          Panel<T> panel = b_panel(p, n, k);
          p.bcopy[op](&k, &n, b.stored.array.data(), &b.stored.ld, panel.array.data(), &panel.ldp, &unread);
          QtbInt j = 0;
          for (const auto &column : reference::unpack_b(p.tile, n, panel.array.data(), panel.ldp)) {
            for (QtbInt l = 0; l < padded_depth(p.tile, k); l++)
              ASSERT_TRUE(same_bits(column.at(l), l < k ? b.at(l, j) : T{}))
                  << tier_name(p.tier) << " " << p.name << " " << letters[op] << " element (" << l << ", " << j
                  << ") of " << k << " x " << n;
            j++;
          }
          TallyReport::of((std::string(p.name) + "_bcopy").c_str()).exact(p.tier);
        }
  }
}

TYPED_TEST(GemmCopies, SharesOfAPanelPackedApartMakeTheSamePanel) {
  using T = TypeParam;
  const T alpha = value<T>(0.75, -0.5);
  for (const Pieces<T> &p : families<T>) {
    if (!processor_runs(p.tier)) continue;
    for (int op = 0; op < this->ops(); op++) {
      const QtbInt m = 4 * p.tile.mr, n = 3 * p.tile.nr + 3, k = 4 * p.tile.ku + 1;
      const QtbInt rows = 2 * p.tile.mr, columns = 2 * p.tile.nr, depth = 2 * p.tile.ku;
      const QtbInt rest_rows = m - rows, rest_columns = n - columns, rest_depth = k - depth,
                   kp = padded_depth(p.tile, k);
      if (p.acopy[0] != nullptr) {
        Operand<T> a(op, m, k);
        Panel<T> whole = a_panel(p, m, k), by_rows = a_panel(p, m, k), by_depth = a_panel(p, m, k);
        const auto pack = [&](Panel<T> &to, const QtbInt &r, const QtbInt &c, QtbInt i, QtbInt l, QtbInt offset) {
          p.acopy[op](&r, &c, a.block(i, l), &a.stored.ld, to.array.data() + offset, &to.ldp, &alpha);
        };
        pack(whole, m, k, 0, 0, 0);
        pack(by_rows, rows, k, 0, 0, 0);
        pack(by_rows, rest_rows, k, rows, 0, rows * kp);
        pack(by_depth, m, depth, 0, 0, 0);
        pack(by_depth, m, rest_depth, 0, depth, depth * p.tile.mr);
        ASSERT_EQ(0, std::memcmp(whole.array.data(), by_rows.array.data(), whole.array.size() * sizeof(T)))
            << tier_name(p.tier) << " " << p.name;
        ASSERT_EQ(0, std::memcmp(whole.array.data(), by_depth.array.data(), whole.array.size() * sizeof(T)))
            << tier_name(p.tier) << " " << p.name;
      }
      Operand<T> b(op, k, n);
      Panel<T> whole = b_panel(p, n, k), apart = b_panel(p, n, k);
      const auto pack = [&](Panel<T> &to, const QtbInt &c, QtbInt j) {
        p.bcopy[op](&k, &c, b.block(0, j), &b.stored.ld, to.array.data() + j * kp, &to.ldp, &alpha);
      };
      pack(whole, n, 0);
      pack(apart, columns, 0);
      pack(apart, rest_columns, columns);
      // An edge does not fill its step, so that the steps between hold what they held: the same NaN in both.
      ASSERT_EQ(0, std::memcmp(whole.array.data(), apart.array.data(), whole.array.size() * sizeof(T)))
          << tier_name(p.tier) << " " << p.name;
      TallyReport::of((std::string(p.name) + "_bcopy").c_str()).exact(p.tier);
    }
  }
}

TYPED_TEST(GemmCopies, CopiesWriteNothingForNoRowsOrNoColumns) {
  using T = TypeParam;
  const T alpha = value<T>(1, 0);
  Guarded<T> nothing(0);
  const QtbInt ld = 4, ldp = 64, counts[][2] = {{0, 5}, {-1, 5}, {8, 0}, {8, -1}, {0, 0}, {-3, -2}};
  for (const Pieces<T> &p : families<T>) {
    if (!processor_runs(p.tier)) continue;
    for (int op = 0; op < this->ops(); op++)
      for (const auto &count : counts) {
        p.bcopy[op](&count[0], &count[1], nothing.data(), &ld, nothing.data(), &ldp, &alpha);
        if (p.acopy[0] != nullptr) p.acopy[op](&count[0], &count[1], nothing.data(), &ld, nothing.data(), &ldp, &alpha);
        TallyReport::of((std::string(p.name) + "_bcopy").c_str()).exact(p.tier);
      }
  }
}

}  // namespace
}  // namespace qtb::test
