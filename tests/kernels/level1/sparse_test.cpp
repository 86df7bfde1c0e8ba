// Sparse vectors, in every tier.

#include <gtest/gtest.h>

#include <numeric>

#include "tests/reference/sparse.h"
#include "tests/support/placed.h"
#include "tests/support/random.h"
#include "tests/support/tally.h"

namespace {

using namespace qtb::test;
namespace reference = qtb::reference;

template <class T>
using Axpyi = void (*)(const QtbInt *, const T *, const T *, const QtbInt *, T *);
template <class T>
using Doti = T (*)(const QtbInt *, const T *, const QtbInt *, const T *);
template <class T>
using ComplexDoti = T *(*)(T *, const QtbInt *, const T *, const QtbInt *, const T *);
template <class T>
using Gthr = void (*)(const QtbInt *, const T *, T *, const QtbInt *);
template <class T>
using Gthrz = void (*)(const QtbInt *, T *, T *, const QtbInt *);
template <class T>
using Sctr = void (*)(const QtbInt *, const T *, const QtbInt *, T *);
template <class T>
using Roti = void (*)(const QtbInt *, T *, const QtbInt *, T *, const T *, const T *);

// The routines of one element type; dots by whether they conjugate.
template <class T>
struct Routines {
  const char *letter;
  Axpyi<T> axpyi[tier_count];
  Doti<T> doti[tier_count];
  ComplexDoti<T> cdoti[2][tier_count];
  Gthr<T> gthr[tier_count];
  Gthrz<T> gthrz[tier_count];
  Sctr<T> sctr[tier_count];
  Roti<T> roti[tier_count];

  std::string name(const char *rest) const { return std::string(letter) + rest; }
};
const Routines<float> s{"s",
                        QTB_ALL_TIERS(saxpyi),
                        QTB_ALL_TIERS(sdoti),
                        {},
                        QTB_ALL_TIERS(sgthr),
                        QTB_ALL_TIERS(sgthrz),
                        QTB_ALL_TIERS(ssctr),
                        QTB_ALL_TIERS(sroti)};
const Routines<double> d{"d",
                         QTB_ALL_TIERS(daxpyi),
                         QTB_ALL_TIERS(ddoti),
                         {},
                         QTB_ALL_TIERS(dgthr),
                         QTB_ALL_TIERS(dgthrz),
                         QTB_ALL_TIERS(dsctr),
                         QTB_ALL_TIERS(droti)};
const Routines<cfloat> c{"c",
                         QTB_ALL_TIERS(caxpyi),
                         {},
                         {QTB_ALL_TIERS(cdotui), QTB_ALL_TIERS(cdotci)},
                         QTB_ALL_TIERS(cgthr),
                         QTB_ALL_TIERS(cgthrz),
                         QTB_ALL_TIERS(csctr),
                         {}};
const Routines<cdouble> z{"z",
                          QTB_ALL_TIERS(zaxpyi),
                          {},
                          {QTB_ALL_TIERS(zdotui), QTB_ALL_TIERS(zdotci)},
                          QTB_ALL_TIERS(zgthr),
                          QTB_ALL_TIERS(zgthrz),
                          QTB_ALL_TIERS(zsctr),
                          {}};

template <class F>
void for_each_type(F f) {
  f(s), f(d), f(c), f(z);
}

template <class T>
T element_of(double re, double im = 0) {
  if constexpr (is_complex<T>)
    return {static_cast<Real<T>>(re), static_cast<Real<T>>(im)};
  else
    return static_cast<T>(re);
}

// What a case is called with: x compressed, y full, and the arena places of both. indx ends at a trapping page too.
struct Places {
  Arena x{arena_bytes}, y{arena_bytes}, indx{arena_bytes};
};
template <class T>
struct Case {
  QtbInt nz;
  std::vector<T> x, y;
  std::vector<QtbInt> indx;
};

// repeats: positions may come again.
template <class T>
Case<T> random_case(RandomBits &bits, QtbInt nz, bool repeats) {
  const QtbInt full = std::max<QtbInt>(1, repeats ? nz / 2 : 2 * nz);
  Case<T> k{nz, random_vector<T>(bits, nz, -8, 8), random_vector<T>(bits, full, -8, 8), {}};
  std::vector<QtbInt> positions(static_cast<std::size_t>(full));
  std::iota(positions.begin(), positions.end(), 1);
  std::shuffle(positions.begin(), positions.end(), bits);
  for (QtbInt i = 0; i < nz; ++i)
    k.indx.push_back(repeats ? 1 + static_cast<QtbInt>(bits() % static_cast<std::uint64_t>(full))
                             : positions[static_cast<std::size_t>(i)]);
  if (nz > 0) k.indx[bits() % k.indx.size()] = 1;
  if (nz > 1) k.indx[bits() % k.indx.size()] = full;
  return k;
}

template <class T>
bool holds(const Placed<T> &placed, const std::vector<T> &want) {
  for (std::size_t i = 0; i < want.size(); ++i)
    if (!same_bits(placed[static_cast<QtbInt>(i)], want[i])) return false;
  return true;
}

// The case in its places; f(tier, x, indx, y) for each tier, on what it was at first each time.
template <class T, class F>
void in_places(Places &places, const Case<T> &k, std::size_t offset, Flush flush, F f) {
  const auto full = static_cast<QtbInt>(k.y.size());
  Placed<T> x(places.x, k.x, k.nz, 1, flush, offset), y(places.y, k.y, full, 1, flush, (7 * offset) % 16);
  Placed<QtbInt> indx(places.indx, k.indx, k.nz, 1, flush, 0);
  in_every_tier([&](int tier) {
    x.restore(), y.restore();
    f(tier, x, indx, y);
    ASSERT_TRUE(x.gaps_untouched() && y.gaps_untouched() && indx.untouched()) << tier_name(tier) << " nz " << k.nz;
  });
}

template <class F>
void sweep(F f) {
  RandomBits bits(21);
  Places places;
  for_each_type([&]<class T>(const Routines<T> &routines) {
    for (QtbInt nz = 0; nz <= 300; nz += nz < 20 ? 1 : 40)
      for (const bool repeats : {false, true})
        for (std::size_t offset = 0; offset < 16; ++offset)
          for (const Flush flush : {Flush::back, Flush::front})
            f(routines, places, random_case<T>(bits, nz, repeats), offset, flush);
  });
}

TEST(axpyi, adds_in_order_at_every_place) {
  sweep([]<class T>(const Routines<T> &routines, Places &places, const Case<T> &k, std::size_t offset, Flush flush) {
    const T a = element_of<T>(-0.7, 1.3);
    auto want = k.y;
    reference::axpyi(a, k.x, k.indx, want);
    in_places(places, k, offset, flush, [&](int tier, Placed<T> &x, Placed<QtbInt> &indx, Placed<T> &y) {
      {
        FiniteOnly guard;
        routines.axpyi[tier](&k.nz, &a, x.data(), indx.data(), y.data());
      }
      ASSERT_TRUE(holds(y, want) && x.untouched()) << routines.name("axpyi") << " " << tier_name(tier);
      TallyReport::of(routines.name("axpyi").c_str()).exact(tier);
    });
  });
}

TEST(doti, is_within_its_bound_at_every_place) {
  sweep([]<class T>(const Routines<T> &routines, Places &places, const Case<T> &k, std::size_t offset, Flush flush) {
    in_places(places, k, offset, flush, [&](int tier, Placed<T> &x, Placed<QtbInt> &indx, Placed<T> &y) {
      for (const bool conjugate : {false, true}) {
        if (conjugate && !is_complex<T>) continue;
        const auto want = reference::doti(k.x, k.indx, k.y, conjugate);
        T got;
        {
          FiniteOnly guard;
          if constexpr (is_complex<T>)
            ASSERT_EQ(routines.cdoti[conjugate][tier](&got, &k.nz, x.data(), indx.data(), y.data()), &got);
          else
            got = routines.doti[tier](&k.nz, x.data(), indx.data(), y.data());
        }
        const double ratio = error_ratio(got, want.value, want.gauge, want.roundings);
        const char *rest = !is_complex<T> ? "doti" : conjugate ? "dotci" : "dotui";
        TallyReport::of(routines.name(rest).c_str()).within(tier, ratio);
        ASSERT_LE(ratio, 1) << routines.name(rest) << " " << tier_name(tier) << " nz " << k.nz;
        ASSERT_TRUE(x.untouched() && y.untouched());
      }
    });
  });
}

TEST(gthr, moves_bits_at_every_place) {
  sweep([]<class T>(const Routines<T> &routines, Places &places, const Case<T> &k, std::size_t offset, Flush flush) {
    auto want = k.x;
    reference::gthr(k.y, want, k.indx);
    in_places(places, k, offset, flush, [&](int tier, Placed<T> &x, Placed<QtbInt> &indx, Placed<T> &y) {
      routines.gthr[tier](&k.nz, y.data(), x.data(), indx.data());
      ASSERT_TRUE(holds(x, want) && y.untouched()) << routines.name("gthr") << " " << tier_name(tier);
      TallyReport::of(routines.name("gthr").c_str()).exact(tier);
    });
  });
}

TEST(gthrz, moves_bits_and_leaves_zeros_at_every_place) {
  sweep([]<class T>(const Routines<T> &routines, Places &places, const Case<T> &k, std::size_t offset, Flush flush) {
    auto want_x = k.x, want_y = k.y;
    reference::gthrz(want_y, want_x, k.indx);
    in_places(places, k, offset, flush, [&](int tier, Placed<T> &x, Placed<QtbInt> &indx, Placed<T> &y) {
      routines.gthrz[tier](&k.nz, y.data(), x.data(), indx.data());
      ASSERT_TRUE(holds(x, want_x) && holds(y, want_y)) << routines.name("gthrz") << " " << tier_name(tier);
      TallyReport::of(routines.name("gthrz").c_str()).exact(tier);
    });
  });
}

TEST(sctr, moves_bits_in_order_at_every_place) {
  sweep([]<class T>(const Routines<T> &routines, Places &places, const Case<T> &k, std::size_t offset, Flush flush) {
    auto want = k.y;
    reference::sctr(k.x, k.indx, want);
    in_places(places, k, offset, flush, [&](int tier, Placed<T> &x, Placed<QtbInt> &indx, Placed<T> &y) {
      routines.sctr[tier](&k.nz, x.data(), indx.data(), y.data());
      ASSERT_TRUE(holds(y, want) && x.untouched()) << routines.name("sctr") << " " << tier_name(tier);
      TallyReport::of(routines.name("sctr").c_str()).exact(tier);
    });
  });
}

TEST(roti, rotates_in_order_at_every_place) {
  sweep([]<class T>(const Routines<T> &routines, Places &places, const Case<T> &k, std::size_t offset, Flush flush) {
    if constexpr (!is_complex<T>) {
      const T cosine = T(0.6), sine = T(-0.8);
      auto want_x = k.x, want_y = k.y;
      reference::roti(want_x, k.indx, want_y, cosine, sine);
      in_places(places, k, offset, flush, [&](int tier, Placed<T> &x, Placed<QtbInt> &indx, Placed<T> &y) {
        {
          FiniteOnly guard;
          routines.roti[tier](&k.nz, x.data(), indx.data(), y.data(), &cosine, &sine);
        }
        ASSERT_TRUE(holds(x, want_x) && holds(y, want_y)) << routines.name("roti") << " " << tier_name(tier);
        TallyReport::of(routines.name("roti").c_str()).exact(tier);
      });
    }
  });
}

// ---- edges ----

constexpr double nan = std::numeric_limits<double>::quiet_NaN();

TEST(sparse_vectors, of_nothing_touch_nothing_and_read_no_scalar) {
  Arena nothing(0);
  for_each_type([&]<class T>(const Routines<T> &routines) {
    T *v = reinterpret_cast<T *>(nothing.data());
    const QtbInt *indx = reinterpret_cast<const QtbInt *>(nothing.data());
    in_every_tier([&](int tier) {
      for (const QtbInt nz : {0, -1, -8}) {
        routines.axpyi[tier](&nz, v, v, indx, v);
        routines.gthr[tier](&nz, v, v, indx);
        routines.gthrz[tier](&nz, v, v, indx);
        routines.sctr[tier](&nz, v, indx, v);
        if constexpr (is_complex<T>) {
          for (const auto &dot : routines.cdoti) {
            T result = element_of<T>(7, 7);
            EXPECT_EQ(dot[tier](&result, &nz, v, indx, v), &result);
            EXPECT_TRUE(same_bits(result, element_of<T>(0))) << tier_name(tier);
          }
        } else {
          EXPECT_EQ(routines.doti[tier](&nz, v, indx, v), 0) << tier_name(tier);
          routines.roti[tier](&nz, v, indx, v, v, v);
        }
      }
    });
  });
}

// Memory that can be read but not written, holding NaNs.
template <class T>
struct ReadOnly {
  Arena arena{4096};
  Placed<T> placed;
  explicit ReadOnly(QtbInt n)
      : placed(arena, std::vector<T>(static_cast<std::size_t>(n), element_of<T>(nan, nan)), n, 1, Flush::back, 0) {
    arena.read_only();
  }
  T *data() { return placed.data(); }
};

TEST(axpyi, with_a_zero_factor_touches_nothing) {
  const QtbInt nz = 3, indx[] = {1, 2, 3};
  for_each_type([&]<class T>(const Routines<T> &routines) {
    ReadOnly<T> x(3), y(3);
    in_every_tier([&](int tier) {
      for (const T a : {element_of<T>(0, 0), element_of<T>(-0.0, -0.0)})
        routines.axpyi[tier](&nz, &a, x.data(), indx, y.data());
    });
  });
}

TEST(axpyi, with_one_zero_part_or_a_nan_computes) {
  const QtbInt nz = 1, indx[] = {1};
  in_every_tier([&](int tier) {
    const cdouble x{2, 3};
    for (const cdouble a : {cdouble{0, 1}, cdouble{1, 0}}) {
      cdouble y{0, 0};
      z.axpyi[tier](&nz, &a, &x, indx, &y);
      EXPECT_TRUE(a.re == 1 ? y.re == 2 && y.im == 3 : y.re == -3 && y.im == 2) << tier_name(tier);
    }
    double y = 1;
    d.axpyi[tier](&nz, &nan, &x.re, indx, &y);
    EXPECT_TRUE(std::isnan(y)) << tier_name(tier);
  });
}

TEST(axpyi, adds_to_a_repeated_position_each_time) {
  const QtbInt nz = 2, indx[] = {3, 3};
  const double a = 10, x[] = {1, 2};
  in_every_tier([&](int tier) {
    double y[] = {5, 5, 5};
    d.axpyi[tier](&nz, &a, x, indx, y);
    EXPECT_TRUE(y[0] == 5 && y[1] == 5 && y[2] == 35) << tier_name(tier);
  });
}

TEST(gthrz, finds_zero_at_a_repeated_position) {
  const QtbInt nz = 2, indx[] = {2, 2};
  in_every_tier([&](int tier) {
    double x[] = {9, 9}, y[] = {5, 6};
    d.gthrz[tier](&nz, y, x, indx);
    EXPECT_TRUE(x[0] == 6 && x[1] == 0 && y[0] == 5 && y[1] == 0 && !std::signbit(y[1])) << tier_name(tier);
  });
}

TEST(sctr, lets_the_last_of_a_repeated_position_win) {
  const QtbInt nz = 3, indx[] = {1, 2, 1};
  const float x[] = {7, 8, 9};
  in_every_tier([&](int tier) {
    float y[] = {0, 0};
    s.sctr[tier](&nz, x, indx, y);
    EXPECT_TRUE(y[0] == 9 && y[1] == 8) << tier_name(tier);
  });
}

// Signalling NaNs keep their payload and raise nothing.
TEST(moves, keep_the_bits_of_a_nan) {
  const QtbInt nz = 5, indx[] = {5, 3, 1, 2, 4};
  for_each_type([&]<class T>(const Routines<T> &routines) {
    T signalling;
    store_signalling_nan<T>(&signalling);
    in_every_tier([&](int tier) {
      FiniteOnly guard;
      std::vector<T> y(5, signalling), x(5), back(5), zeroed(5, element_of<T>(1, 1));
      routines.gthr[tier](&nz, y.data(), x.data(), indx);
      routines.sctr[tier](&nz, x.data(), indx, back.data());
      routines.gthrz[tier](&nz, back.data(), zeroed.data(), indx);
      for (std::size_t i = 0; i < 5; ++i)
        EXPECT_TRUE(same_bits(x[i], signalling) && same_bits(zeroed[i], signalling) && same_bits(back[i], T{}))
            << routines.letter << " " << tier_name(tier);
    });
  });
}

TEST(roti, with_c_1_and_s_0_writes_nothing) {
  const QtbInt nz = 3, indx[] = {1, 2, 3};
  ReadOnly<double> x(3), y(3);
  const double one = 1;
  in_every_tier([&](int tier) {
    for (const double zero : {0.0, -0.0}) d.roti[tier](&nz, x.data(), indx, y.data(), &one, &zero);
  });
}

TEST(roti, with_c_1_and_s_nan_computes) {
  const QtbInt nz = 1, indx[] = {1};
  const double one = 1;
  in_every_tier([&](int tier) {
    double x = 2, y = 3;
    d.roti[tier](&nz, &x, indx, &y, &one, &nan);
    EXPECT_TRUE(std::isnan(x) && std::isnan(y)) << tier_name(tier);
  });
}

TEST(cdotci, conjugates_x) {
  const QtbInt nz = 1, indx[] = {2};
  const cdouble x{1, 2}, y[] = {{nan, nan}, {3, 4}};
  in_every_tier([&](int tier) {
    cdouble u, v;
    z.cdoti[0][tier](&u, &nz, &x, indx, y);
    z.cdoti[1][tier](&v, &nz, &x, indx, y);
    EXPECT_TRUE(u.re == -5 && u.im == 10) << tier_name(tier);
    EXPECT_TRUE(v.re == 11 && v.im == -2) << tier_name(tier);
  });
}

}  // namespace
