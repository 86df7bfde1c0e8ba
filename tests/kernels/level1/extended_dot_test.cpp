// Dot products of floats in double, in every tier, against the oracle.

#include <gtest/gtest.h>

#include "tests/reference/norms.h"
#include "tests/support/placed.h"
#include "tests/support/random.h"
#include "tests/support/tally.h"

namespace {

using namespace qtb::test;
using qtb::reference::Bounded;

using Dot = double (*)(const QtbInt *, const float *, const QtbInt *, const float *, const QtbInt *);
using SingleDot = float (*)(const QtbInt *, const float *, const float *, const QtbInt *, const float *,
                            const QtbInt *);

const Dot dsdot[] = QTB_ALL_TIERS(dsdot);
const SingleDot sdsdot[] = QTB_ALL_TIERS(sdsdot);

TEST(dsdot, and_sdsdot_are_within_their_bounds_at_every_place) {
  RandomBits bits(2);
  const QtbInt longest = 70;
  const std::vector<float> vx = random_vector<float>(bits, longest, -12, 12),
                           vy = random_vector<float>(bits, longest, -12, 12);
  const float sb = -1.0F / 3;
  Arena arena_x(arena_bytes), arena_y(arena_bytes);
  for (const QtbInt incx : {1, -1, 2, -2, 3, -3, 0})
    for (const QtbInt incy : {1, -1, 2, -2, 3, -3, 0})
      for (QtbInt n = 0; n <= longest; n += n < 9 ? 1 : 7) {
        std::vector<float> x = vx, y = vy;
        if (incx == 0) std::fill(x.begin(), x.end(), vx[0]);
        if (incy == 0) std::fill(y.begin(), y.end(), vy[0]);
        const Bounded sum = qtb::reference::dot(0, n, x, y), sum_and_sb = qtb::reference::dot(Quad(sb), n, x, y);
        for (std::size_t offset = 0; offset < 16; ++offset) {
          Placed<float> px(arena_x, x, n, incx, Flush::back, offset);
          Placed<float> py(arena_y, y, n, incy, Flush::back, (5 * offset) % 16);
          in_every_tier([&](int tier) {
            double got;
            float got_single;
            {
              const FiniteOnly guard;
              got = dsdot[tier](&n, px.data(), &incx, py.data(), &incy);
              got_single = sdsdot[tier](&n, &sb, px.data(), &incx, py.data(), &incy);
            }
            const double r = error_ratio(got, sum.value, sum.gauge, sum.roundings);
            const double r_single = qtb::reference::ratio_of_rounded(got_single, sum_and_sb);
            TallyReport::of("dsdot").within(tier, r);
            TallyReport::of("sdsdot").within(tier, r_single);
            ASSERT_LE(r, 1) << tier_name(tier) << " n " << n << " increments " << incx << " " << incy;
            ASSERT_LE(r_single, 1) << tier_name(tier) << " n " << n << " increments " << incx << " " << incy;
          });
        }
      }
}

TEST(dsdot, adds_even_and_odd_pairs_in_two_chains_and_the_odd_last_pair_to_their_sum) {
  const float x[] = {0x1p60F, 1, -0x1p60F, 0}, one[] = {1, 1, 1, 1};
  const QtbInt inc = 1;
  in_every_tier([&](int tier) {
    for (const auto &[n, want] : {std::pair<QtbInt, double>{4, 1}, {3, 0}})
      EXPECT_EQ(dsdot[tier](&n, x, &inc, one, &inc), want) << tier_name(tier);
  });
}

TEST(sdsdot, starts_the_chain_of_even_pairs_with_sb) {
  const float sb = 0x1p60F, x[] = {1, -0x1p60F}, one[] = {1, 1};
  const QtbInt n = 2, inc = 1;
  in_every_tier([&](int tier) { EXPECT_EQ(sdsdot[tier](&n, &sb, x, &inc, one, &inc), 0) << tier_name(tier); });
}

TEST(sdsdot, rounds_to_single_once) {
  const float sb = 1, x[] = {0x1p-24F, 0x1p-50F}, y[] = {1, 1};
  const QtbInt n = 2, inc = 1;
  in_every_tier([&](int tier) { EXPECT_EQ(sdsdot[tier](&n, &sb, x, &inc, y, &inc), 1 + 0x1p-23F) << tier_name(tier); });
}

TEST(sdsdot, of_nothing_is_sb_and_reads_no_vector) {
  Arena nothing(0);
  const float *unreadable = reinterpret_cast<const float *>(nothing.data());
  const float sb = 2.5F;
  const QtbInt inc = 1;
  in_every_tier([&](int tier) {
    for (const QtbInt n : {QtbInt{0}, QtbInt{-3}}) {
      EXPECT_EQ(sdsdot[tier](&n, &sb, unreadable, &inc, unreadable, &inc), sb) << tier_name(tier);
      EXPECT_EQ(dsdot[tier](&n, unreadable, &inc, unreadable, &inc), 0) << tier_name(tier);
    }
  });
}

}  // namespace
