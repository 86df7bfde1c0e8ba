// The block sizes of every GEMM family: the depth rules at their edges, the cache tests, imposed sizes that stay.
#include <gtest/gtest.h>

#include <algorithm>
#include <initializer_list>
#include <iterator>
#include <utility>

#include "blas/kernels/level3/gemm/limits.h"
#include "service/cache.h"
#include "tests/support/tiers.h"

namespace {
// The processor's caches, as the blocks routines see them in this program.
std::uint32_t cache_table[5];
int cache_reads = 0;
}  // namespace

extern "C" void qtb_serv_get_cache_sizes(std::uint32_t *out) {
  std::copy(cache_table, cache_table + 5, out);
  cache_reads++;
}

namespace qtb::test {
namespace {

using tiles::GemmBlocks, tiles::Family;

void set_caches(std::uint32_t count, std::uint32_t second, std::uint32_t third) {
  const std::uint32_t table[5] = {count, 32768, second, third, 0};
  std::copy(table, table + 5, cache_table);
}

template <class T>
using Query = QTB_FUNCTION_TYPE(blocks, T);

template <class T>
GemmBlocks blocks(Query<T> *query, QtbInt m, QtbInt n, QtbInt k, GemmBlocks imposed = {}) {
  GemmBlocks b = imposed;
  query(&m, &n, &k, &b.mb, &b.nb, &b.kb, &b.mr, &b.nr, &b.ku);
  return b;
}

// The same from the row of the table, for families that no slot asks.
GemmBlocks blocks_of(char kind, ProcessorTier tier, QtbInt m, QtbInt n, QtbInt k) {
  for (const tiles::GemmRules &row : tiles::gemm_rules)
    if (row.kind == kind && (row.tiers >> tier & 1U) != 0 && row.family == Family::base) {
      GemmBlocks b{};
      tiles::fill_blocks(row, m, n, k, cache_table, b);
      return b;
    }
  ADD_FAILURE() << "no family " << kind << " in tier " << tier_name(tier);
  return {};
}

void expect_blocks(const GemmBlocks &got, const GemmBlocks &want) {
  EXPECT_EQ(got.mb, want.mb);
  EXPECT_EQ(got.nb, want.nb);
  EXPECT_EQ(got.kb, want.kb);
  EXPECT_EQ(got.mr, want.mr);
  EXPECT_EQ(got.nr, want.nr);
  EXPECT_EQ(got.ku, want.ku);
}

TEST(GemmBlocks, DepthFollowsItsRuleAtEveryEdge) {
  using Pairs = std::initializer_list<std::pair<QtbInt, QtbInt>>;  // k, kb
  const auto expect = [](tiles::DepthRule rule, Pairs pairs) {
    for (const auto &[k, kb] : pairs) EXPECT_EQ(tiles::block_depth(rule, k), kb) << "k = " << k;
  };
  using tiles::Depth;
  expect({Depth::halved, 256}, {{0, 128},
                                {1, 128},
                                {128, 128},
                                {129, 132},
                                {130, 132},
                                {255, 256},
                                {256, 256},
                                {257, 128},
                                {258, 132},
                                {300, 152},
                                {511, 256},
                                {512, 256},
                                {513, 256},
                                {9000, 256}});
  expect({Depth::stepped, 256}, {{0, 128},
                                 {100, 128},
                                 {130, 132},
                                 {255, 256},
                                 {256, 128},
                                 {300, 128},
                                 {511, 128},
                                 {1024, 128},
                                 {1025, 256},
                                 {2048, 256}});
  expect({Depth::dividing, 256}, {{0, 256},
                                  {100, 256},
                                  {128, 128},
                                  {256, 256},
                                  {257, 130},
                                  {300, 150},
                                  {301, 152},
                                  {384, 128},
                                  {511, 256},
                                  {512, 256},
                                  {513, 256},
                                  {640, 128},
                                  {1000, 256}});
  expect({Depth::dividing, 224}, {{0, 224},
                                  {100, 224},
                                  {128, 128},
                                  {224, 224},
                                  {225, 114},
                                  {256, 128},
                                  {300, 150},
                                  {447, 224},
                                  {448, 224},
                                  {449, 224},
                                  {1000, 224}});
  expect({Depth::halved_down, 112},
         {{1, 112}, {112, 112}, {113, 56}, {119, 56}, {120, 60}, {224, 112}, {225, 112}, {1000, 112}});
  expect({Depth::halved_down, 128}, {{128, 128}, {129, 64}, {130, 64}, {136, 68}, {256, 128}, {257, 128}});
  expect({Depth::whole, 256}, {{1, 128}, {130, 132}, {255, 256}, {256, 256}, {300, 256}});
  expect({Depth::fixed, 64}, {{1, 64}, {64, 64}, {65, 64}, {1000, 64}});
}

TEST(GemmBlocks, TheRemainderOfAFixedDepthComesFirst) {
  using tiles::Depth, tiles::first_depth;
  const auto first = [](QtbInt k) { return first_depth({Depth::fixed, 112}, 112, k); };
  EXPECT_EQ(first(1), 1);
  EXPECT_EQ(first(112), 112);
  EXPECT_EQ(first(113), 1);
  EXPECT_EQ(first(224), 112);
  EXPECT_EQ(first(300), 76);
  EXPECT_EQ(first_depth({Depth::halved, 256}, 152, 300), 152);
  EXPECT_EQ(first_depth({Depth::halved, 256}, 128, 100), 100);
}

TEST(GemmBlocks, SlotsGiveTheSizesOfTheirFamily) {
  set_caches(3, 4194304, 8388608);
  expect_blocks(blocks<double>(qtb_blas_avx_xdgemm_blocks, 3000, 3, 300), {512, 4, 152, 8, 4, 4});
  expect_blocks(blocks<double>(qtb_blas_sse42_xdgemm_blocks, 3000, 9, 300), {640, 16, 152, 2, 8, 4});
  expect_blocks(blocks<double>(qtb_blas_sse42_xdgemm_blocks, 3000, 6000, 300), {640, 5000, 152, 2, 8, 4});
  expect_blocks(blocks<double>(qtb_blas_ssse3_xdgemm_blocks, 3000, 10001, 256), {512, 10000, 256, 4, 4, 4});
  expect_blocks(blocks<double>(qtb_blas_ssse3_xdgemm_sse41_blocks, 3000, 9, 256), {1000, 12, 256, 4, 4, 4});
  expect_blocks(blocks<float>(qtb_blas_avx_xsgemm_blocks, 3000, 5, 300), {1280, 8, 152, 4, 8, 4});
  expect_blocks(blocks<float>(qtb_blas_sse42_xsgemm_blocks, 3000, 4993, 300), {1280, 5000, 152, 4, 8, 4});
  expect_blocks(blocks<float>(qtb_blas_ssse3_xsgemm_blocks, 3000, 7, 300), {1024, 7, 152, 8, 4, 4});
  expect_blocks(blocks<float>(qtb_blas_ssse3_xsgemm_sse41_blocks, 3000, 7, 300), {2000, 8, 152, 8, 4, 4});
  expect_blocks(blocks<cfloat>(qtb_blas_avx_xcgemm_blocks, 3000, 7, 300), {512, 8, 128, 2, 4, 4});
  expect_blocks(blocks<cfloat>(qtb_blas_sse42_xcgemm_blocks, 3000, 7, 300), {512, 8, 128, 2, 4, 4});
  expect_blocks(blocks<cfloat>(qtb_blas_ssse3_xcgemm_blocks, 1000, 1, 300), {748, 2, 150, 4, 2, 2});
  expect_blocks(blocks<cfloat>(qtb_blas_ssse3_xcgemm_blocks, 2, 7, 300), {4, 7, 150, 4, 2, 2});
  expect_blocks(blocks<cfloat>(qtb_blas_ssse3_xcgemm_blocks, 99999, 7, 9), {11264, 7, 256, 4, 2, 2});
  expect_blocks(blocks<cfloat>(qtb_blas_ssse3_xcgemm_sse41_blocks, 3000, 7, 300), {1000, 8, 128, 4, 2, 4});
  expect_blocks(blocks<cdouble>(qtb_blas_avx_xzgemm_blocks, 3000, 2001, 300), {256, 2000, 128, 1, 4, 4});
  expect_blocks(blocks<cdouble>(qtb_blas_sse42_xzgemm_blocks, 3000, 7, 300), {256, 8, 128, 1, 4, 4});
  expect_blocks(blocks<cdouble>(qtb_blas_ssse3_xzgemm_blocks, 1000, 7, 300), {374, 7, 150, 2, 2, 2});
  expect_blocks(blocks<cdouble>(qtb_blas_ssse3_xzgemm_sse41_blocks, 3000, 7, 300), {512, 8, 128, 2, 2, 4});
  expect_blocks(blocks<double>(qtb_blas_def_xdgemm_def_blocks_a, 1000, 6000, 100), {480, 5000, 128, 4, 4, 4});
  expect_blocks(blocks<double>(qtb_blas_def_xdgemm_def_blocks_a, 1000, 2, 256), {240, 4, 256, 4, 4, 4});
  expect_blocks(blocks<double>(qtb_blas_def_xdgemm_def_blocks_b, 1000, 6000, 300), {128, 384, 256, 4, 4, 4});
  expect_blocks(blocks<double>(qtb_blas_def_xdgemm_def_blocks_b, 5, 2, 100), {8, 4, 128, 4, 4, 4});
}

TEST(GemmBlocks, FamiliesWithoutASlotHaveTheirRules) {
  expect_blocks(blocks_of('d', tier_sse3, 100, 90, 100), {480, 90, 112, 4, 4, 4});
  expect_blocks(blocks_of('d', tier_sse3, 6000, 6000, 16), {1536, 5000, 112, 4, 4, 4});
  expect_blocks(blocks_of('d', tier_sse3, 6000, 6000, 32), {1024, 5000, 112, 4, 4, 4});
  expect_blocks(blocks_of('d', tier_sse3, 6000, 6000, 64), {768, 5000, 112, 4, 4, 4});
  expect_blocks(blocks_of('d', tier_sse3, 6000, 6000, 224), {512, 5000, 112, 4, 4, 4});
  expect_blocks(blocks_of('d', tier_sse3, 6000, 6000, 225), {480, 2000, 112, 4, 4, 4});
  expect_blocks(blocks_of('d', tier_sse3, 5000, 6999, 4000), {480, 2000, 112, 4, 4, 4});
  expect_blocks(blocks_of('d', tier_sse3, 5000, 7000, 4000), {512, 5000, 112, 4, 4, 4});
  expect_blocks(blocks_of('d', tier_def, 100, 90, 130), {512, 90, 64, 2, 12, 4});
  expect_blocks(blocks_of('d', tier_def, 6000, 6000, 130), {768, 4992, 64, 2, 12, 4});
  expect_blocks(blocks_of('d', tier_def, 6000, 6000, 257), {512, 4992, 128, 2, 12, 4});
  for (const ProcessorTier tier : {tier_def, tier_sse3}) {
    expect_blocks(blocks_of('s', tier, 100, 3000, 300), {640, 2000, 112, 8, 4, 4});
    expect_blocks(blocks_of('c', tier, 100, 90, 300), {320, 90, 64, 4, 4, 4});
    expect_blocks(blocks_of('z', tier, 100, 90, 300), {320, 90, 64, 2, 4, 4});
  }
}

TEST(GemmBlocks, SmallCachesReduceTheRowsUpToTheLimitItself) {
  const auto third = [](std::uint32_t count, std::uint32_t bytes) { set_caches(count, 0, bytes); };
  const auto second = [](std::uint32_t count, std::uint32_t bytes) { set_caches(count, bytes, 99999999); };
  const struct {
    std::uint32_t count, third, second;
    bool is_small;
  } caches[] = {{3, 4194304, 3145728, true}, {3, 4194305, 3145729, false}, {1, 0, 0, true}, {0, 0, 0, false}};
  for (const auto &c : caches) {
    third(c.count, c.third);
    EXPECT_EQ(blocks<double>(qtb_blas_sse42_xdgemm_blocks, 9999, 9, 9).mb, c.is_small ? 384 : 640);
    EXPECT_EQ(blocks<float>(qtb_blas_sse42_xsgemm_blocks, 9999, 9, 9).mb, c.is_small ? 768 : 1280);
    EXPECT_EQ(blocks<float>(qtb_blas_avx_xsgemm_blocks, 9999, 9, 9).mb, c.is_small ? 768 : 1280);
    EXPECT_EQ(blocks<cfloat>(qtb_blas_sse42_xcgemm_blocks, 9999, 9, 9).mb, c.is_small ? 320 : 512);
    EXPECT_EQ(blocks<cfloat>(qtb_blas_avx_xcgemm_blocks, 9999, 9, 9).mb, c.is_small ? 320 : 512);
    EXPECT_EQ(blocks<cdouble>(qtb_blas_sse42_xzgemm_blocks, 9999, 9, 9).mb, c.is_small ? 160 : 256);
    EXPECT_EQ(blocks<cdouble>(qtb_blas_avx_xzgemm_blocks, 9999, 9, 9).mb, c.is_small ? 160 : 256);
    second(c.count, c.second);
    EXPECT_EQ(blocks<double>(qtb_blas_ssse3_xdgemm_sse41_blocks, 9999, 9, 9).mb, c.is_small ? 448 : 1000);
    EXPECT_EQ(blocks<float>(qtb_blas_ssse3_xsgemm_sse41_blocks, 9999, 9, 9).mb, c.is_small ? 1024 : 2000);
    EXPECT_EQ(blocks<cfloat>(qtb_blas_ssse3_xcgemm_sse41_blocks, 9999, 9, 9).mb, c.is_small ? 448 : 1000);
    EXPECT_EQ(blocks<cdouble>(qtb_blas_ssse3_xzgemm_sse41_blocks, 9999, 9, 9).mb, c.is_small ? 256 : 512);
  }
}

TEST(GemmBlocks, ImposedSizesStayButInTheDoublePrecisionFamilyOfAvx) {
  set_caches(3, 4194304, 8388608);
  const GemmBlocks imposed{200, 800, 64, -1, -1, -1};
  const int reads = cache_reads;
  expect_blocks(blocks<double>(qtb_blas_sse42_xdgemm_blocks, 3000, 3000, 300, imposed), {200, 800, 64, 2, 8, 4});
  expect_blocks(blocks<double>(qtb_blas_ssse3_xdgemm_sse41_blocks, 3000, 3000, 300, imposed), {200, 800, 64, 4, 4, 4});
  EXPECT_EQ(cache_reads, reads) << "an imposed mb asks for no cache";
  expect_blocks(blocks<cfloat>(qtb_blas_ssse3_xcgemm_blocks, 9999, 9, 300, {0, 0, 64, 0, 0, 0}),
                {1760, 9, 64, 4, 2, 2});
  expect_blocks(blocks<double>(qtb_blas_avx_xdgemm_blocks, 3000, 3000, 300, imposed), {512, 3000, 152, 8, 4, 4});
}

// The limits below which a body packs nothing, in m, n and k, written down a second time: where a panel would have no
// row in any case, no test of a product can tell them.
TEST(GemmBlocks, LimitsOfTheSmallPathAreThoseOfTheirBody) {
  using tiles::BodyForm;
  constexpr auto full = BodyForm::full, in_place = BodyForm::b_in_place, a_packed = BodyForm::a_packed;
  constexpr auto base = Family::base, sse41 = Family::sse41, def_a = Family::def_a;
  const struct {
    char kind;
    int tier;
    Family family;
    BodyForm form;
    QtbInt m, n, k;
  } limits[] = {
      {'s', tier_def, base, full, 8, 8, 8},        {'s', tier_sse3, base, full, 8, 8, 8},
      {'s', tier_ssse3, base, full, 9, 3, 3},      {'s', tier_ssse3, base, in_place, 8, 2, 2},
      {'s', tier_ssse3, sse41, full, 9, 5, 5},     {'s', tier_ssse3, sse41, in_place, 8, 4, 4},
      {'s', tier_sse42, base, full, 5, 5, 5},      {'s', tier_sse42, base, in_place, 4, 4, 4},
      {'s', tier_avx, base, full, 5, 5, 5},        {'s', tier_avx, base, in_place, 4, 4, 4},
      {'d', tier_def, base, full, 2, 2, 2},        {'d', tier_def, def_a, full, 2, 2, 2},
      {'d', tier_sse3, base, full, 3, 3, 3},       {'d', tier_ssse3, base, full, 3, 3, 3},
      {'d', tier_ssse3, base, in_place, 2, 2, 2},  {'d', tier_ssse3, sse41, full, 5, 5, 5},
      {'d', tier_ssse3, sse41, in_place, 4, 4, 4}, {'d', tier_sse42, base, full, 3, 5, 5},
      {'d', tier_sse42, base, a_packed, 2, 4, 4},  {'d', tier_avx, base, full, 3, 3, 3},
      {'c', tier_def, base, full, 4, 8, 8},        {'c', tier_sse3, base, full, 4, 8, 8},
      {'c', tier_ssse3, base, full, 5, 3, 3},      {'c', tier_ssse3, sse41, full, 5, 3, 5},
      {'c', tier_sse42, base, full, 3, 5, 5},      {'c', tier_avx, base, full, 3, 5, 5},
      {'z', tier_def, base, full, 4, 8, 8},        {'z', tier_sse3, base, full, 4, 8, 8},
      {'z', tier_ssse3, base, full, 3, 3, 3},      {'z', tier_ssse3, sse41, full, 3, 3, 5},
      {'z', tier_sse42, base, full, 3, 5, 5},      {'z', tier_avx, base, full, 3, 5, 5},
  };
  std::size_t bodies = 0;
  for (const tiles::LimitRow &row : tiles::limit_rows)
    for (int tier = 0; tier < tier_count; tier++) bodies += row.tiers >> tier & 1U;
  EXPECT_EQ(bodies, std::size(limits));
  for (const auto &want : limits) {
    const auto found = std::find_if(std::begin(tiles::limit_rows), std::end(tiles::limit_rows), [&](const auto &row) {
      return row.kind == want.kind && (row.tiers >> want.tier & 1U) != 0 && row.family == want.family &&
             row.form == want.form;
    });
    ASSERT_NE(found, std::end(tiles::limit_rows)) << want.kind << " of " << tier_name(want.tier);
    EXPECT_EQ(found->limits.m, want.m) << want.kind << " of " << tier_name(want.tier);
    EXPECT_EQ(found->limits.n, want.n) << want.kind << " of " << tier_name(want.tier);
    EXPECT_EQ(found->limits.k, want.k) << want.kind << " of " << tier_name(want.tier);
  }
}

TEST(GemmBlocks, NoDepthIsNoDivisionByZero) {
  EXPECT_GT(blocks<cfloat>(qtb_blas_ssse3_xcgemm_blocks, 3000, 3000, 0).mb, 0);
  EXPECT_GT(blocks<cdouble>(qtb_blas_ssse3_xzgemm_blocks, 3000, 3000, 0).mb, 0);
}

}  // namespace
}  // namespace qtb::test
