// The inner kernels of GEMM, each alone: C += Ap*Bp on panels of its tile, at every edge width, depth and place of C,
// with a trapping page behind each operand and the stage.
//
// A kernel joins with its line in kernels.def.
#include <string_view>

#include "tests/kernels/level3/pieces.h"

namespace qtb::test {
namespace {

template <class T>
using Kernel = void(QtbInt m, QtbInt n, QtbInt kp, const T *ap, QtbInt ldap, const T *bp, QtbInt ldbp, T *c, QtbInt ldc,
                    T *stage);

extern "C" {
#define QTB_INNER_KERNEL(tier, T, family, any, aligned, stage, step) \
  QTB_HIDDEN Kernel<T> qtb_blas_##tier##_##any;                      \
  QTB_HIDDEN Kernel<T> qtb_blas_##tier##_##aligned;
#include "blas/kernels/level3/gemm/kernels.def"
}

template <class T>
struct Listed {
  int tier;
  std::string_view family;
  const char *name;
  Kernel<T> *any, *aligned;
  QtbInt stage_bytes_per_k;
};

// The kernels of a type.
template <class T>
std::vector<Listed<T>> listed() {
  std::vector<Listed<T>> kernels;
  const auto add = [&]<class U>(int tier, const char *family, const char *name, Kernel<U> *any, Kernel<U> *aligned,
                                QtbInt stage) {
    if constexpr (std::is_same_v<T, U>)
      if (processor_runs(tier)) kernels.push_back({tier, family, name, any, aligned, stage});
  };
#define QTB_INNER_KERNEL(tier, U, family, any, aligned, stage, step) \
  add.template operator()<U>(tier_##tier, #family, #any, qtb_blas_##tier##_##any, qtb_blas_##tier##_##aligned, stage);
#include "blas/kernels/level3/gemm/kernels.def"
  return kernels;
}

// The tiles, written down a second time on purpose: the copy routines and the kernels agree on them through the panels.
struct TileOf {
  char kind;
  unsigned tiers;
  std::string_view family;
  QtbInt mr, nr, ku;
};
constexpr unsigned from_sse42 = tier_set::SSE42 | tier_set::AVX, to_sse3 = tier_set::DEF | tier_set::SSE3;
constexpr TileOf tiles[] = {
    {'d', tier_set::AVX, "base", 8, 4, 4},    {'d', tier_set::SSE42, "base", 2, 8, 4},
    {'d', tier_set::SSSE3, "base", 4, 4, 4},  {'d', tier_set::SSSE3, "sse41", 4, 4, 4},
    {'s', from_sse42, "base", 4, 8, 4},       {'s', tier_set::SSSE3, "base", 8, 4, 4},
    {'s', tier_set::SSSE3, "sse41", 8, 4, 4}, {'c', from_sse42, "base", 2, 4, 4},
    {'c', tier_set::SSSE3, "base", 4, 2, 2},  {'c', tier_set::SSSE3, "sse41", 4, 2, 4},
    {'z', from_sse42, "base", 1, 4, 4},       {'z', tier_set::SSSE3, "base", 2, 2, 2},
    {'z', tier_set::SSSE3, "sse41", 2, 2, 4}, {'d', tier_set::DEF, "def_a", 4, 4, 4},
    {'s', to_sse3, "base", 8, 4, 4},          {'c', to_sse3, "base", 4, 4, 4},
    {'z', to_sse3, "base", 2, 4, 4},
};

template <class T>
TileOf tile_of(const Listed<T> &kernel) {
  constexpr char kind = is_complex<T> ? (sizeof(T) == 8 ? 'c' : 'z') : (sizeof(T) == 4 ? 's' : 'd');
  for (const TileOf &tile : tiles)
    if (tile.kind == kind && (tile.tiers >> kernel.tier & 1U) != 0 && tile.family == kernel.family) return tile;
  ADD_FAILURE() << "no tile is written down for " << tier_name(kernel.tier) << " " << kernel.name;
  return {};
}

// The width of the micro-panel with which left columns begin.
QtbInt width_of(QtbInt nr, QtbInt left) {
  if (left >= nr) return nr;
  return nr == 8 && left >= 4 ? 4 : left;
}

// The panels of m x kp and kp x n, with a gap behind every micro-panel.
template <class T>
struct Panels {
  static constexpr QtbInt gap = 32 / sizeof(T);  // keeps the alignment that a panel has
  QtbInt m, n, kp, ldap, ldbp;
  std::vector<QtbInt> first_of, width;  // by micro-panel of B
  Guarded<T> ap, bp;
  Panels(const TileOf &tile, QtbInt rows, QtbInt columns, QtbInt depth)
      : m(rows),
        n(columns),
        kp(depth),
        ldap(tile.mr * depth + gap),
        ldbp(tile.nr * depth + gap),
        ap(static_cast<std::size_t>((rows / tile.mr - 1) * ldap + tile.mr * depth)),
        bp(cut(tile.nr)) {
    for (Guarded<T> *panel : {&ap, &bp})
      for (std::size_t e = 0; e < panel->size(); e++) store_signalling_nan<T>(&(*panel)[e]);
    for (QtbInt l = 0; l < kp; l++) {
      for (QtbInt i = 0; i < m; i++) a(tile, i, l) = draw<T>();
      for (QtbInt j = 0; j < n; j++) b(j, l) = draw<T>();
    }
  }
  T &a(const TileOf &tile, QtbInt i, QtbInt l) {
    return ap[static_cast<std::size_t>(i / tile.mr * ldap + l * tile.mr + i % tile.mr)];
  }
  T &b(QtbInt j, QtbInt l) {
    std::size_t q = first_of.size() - 1;
    while (first_of[q] > j) q--;
    return bp[static_cast<std::size_t>(static_cast<QtbInt>(q) * ldbp + l * width[q] + j - first_of[q])];
  }

 private:
  std::size_t cut(QtbInt nr) {
    for (QtbInt j = 0; j < n; j += width.back()) {
      first_of.push_back(j);
      width.push_back(width_of(nr, n - j));
    }
    return (width.size() - 1) * static_cast<std::size_t>(ldbp) + static_cast<std::size_t>(width.back() * kp);
  }
};

// C before a call, and what it holds after it.
template <class T>
struct Product {
  std::vector<T> before;
  reference::Expectation after;
  Product(const TileOf &tile, Panels<T> &p) {
    std::vector<T> a, b;
    for (QtbInt e = 0; e < p.m * p.n; e++) before.push_back(draw<T>());
    for (QtbInt l = 0; l < p.kp; l++)
      for (QtbInt i = 0; i < p.m; i++) a.push_back(p.a(tile, i, l));
    for (QtbInt l = 0; l < p.kp; l++)
      for (QtbInt j = 0; j < p.n; j++) b.push_back(p.b(j, l));
    const T one = value<T>(1, 0);
    after = reference::gemm('N', 'T', p.m, p.n, p.kp, one, a.data(), p.m, b.data(), p.n, one, before.data(), p.m);
  }
};

// A place of C: shift bytes from the trapping page behind it, ldc spare elements beyond m.
struct Place {
  std::size_t shift;
  QtbInt spare;
};

// One call at one place. Returns the result's columns end to end; what lies between them keeps its bits.
template <class T>
std::vector<T> call(Kernel<T> *kernel, const Panels<T> &p, const std::vector<T> &before, Place place,
                    QtbInt stage_bytes) {
  const QtbInt ldc = p.m + place.spare;
  Guarded<T> c(static_cast<std::size_t>((p.n - 1) * ldc + p.m), Flush::back, place.shift);
  Guarded<T> stage(static_cast<std::size_t>(stage_bytes) / sizeof(T));
  for (std::size_t e = 0; e < c.size(); e++) store_signalling_nan<T>(&c[e]);
  for (std::size_t e = 0; e < stage.size(); e++) store_signalling_nan<T>(&stage[e]);
  for (std::size_t e = 0; e < before.size(); e++) {
    const QtbInt at = static_cast<QtbInt>(e);
    c[static_cast<std::size_t>(at / p.m * ldc + at % p.m)] = before[e];
  }
  {
    const FiniteOnly trap;
    kernel(p.m, p.n, p.kp, p.ap.data(), p.ldap, p.bp.data(), p.ldbp, c.data(), ldc, stage.data());
  }
  std::vector<T> after;
  T unread;
  store_signalling_nan<T>(&unread);
  for (QtbInt e = 0; e < static_cast<QtbInt>(c.size()); e++) {
    const T &element = c[static_cast<std::size_t>(e)];
    if (e % ldc < p.m)
      after.push_back(element);
    else
      EXPECT_TRUE(same_bits(element, unread)) << "wrote between the columns of C";
  }
  return after;
}

// Every place of C within 32 bytes, the widest alignment that a kernel looks at, with columns that keep it and that do
// not; and the places that the aligned form takes.
template <class T>
std::vector<Place> places(bool aligned) {
  std::vector<Place> all;
  const std::size_t step = aligned ? 16 : sizeof(Real<T>);
  for (std::size_t shift = 0; shift < 32; shift += step)
    for (QtbInt spare = 0; spare * static_cast<QtbInt>(sizeof(T)) <= 32; spare++)
      if (!aligned || static_cast<std::size_t>(spare) * sizeof(T) % 16 == 0) all.push_back({shift, spare});
  return all;
}

template <class T>
class GemmKernels : public Seeded {};
using Types = testing::Types<float, double, cfloat, cdouble>;
TYPED_TEST_SUITE(GemmKernels, Types);

TYPED_TEST(GemmKernels, AddTheProductOfThePanelsAtEveryWidthAndDepthAndPlaceOfC) {
  using T = TypeParam;
  for (const Listed<T> &kernel : listed<T>()) {
    const TileOf tile = tile_of(kernel);
    std::vector<QtbInt> depths{128, 256};
    for (QtbInt kp = tile.ku; kp <= 24; kp += tile.ku) depths.push_back(kp);
    for (QtbInt n = 1; n < 2 * tile.nr + 1; n++)
      for (QtbInt m : {tile.mr, 3 * tile.mr})
        for (QtbInt kp : depths) {
          Panels<T> p(tile, m, n, kp);
          p.ap.read_only();
          p.bp.read_only();
          const Product<T> product(tile, p);
          const std::string what = std::string(tier_name(kernel.tier)) + " " + kernel.name + " of " +
                                   std::to_string(m) + " x " + std::to_string(n) + " x " + std::to_string(kp);
          SCOPED_TRACE(what);
          std::vector<T> first;
          for (bool aligned : {false, true})
            for (const Place &place : places<T>(aligned)) {
              const std::vector<T> got =
                  call(aligned ? kernel.aligned : kernel.any, p, product.before, place, kernel.stage_bytes_per_k * kp);
              if (first.empty()) first = got;
              ASSERT_EQ(0, std::memcmp(first.data(), got.data(), got.size() * sizeof(T)))
                  << "another result at shift " << place.shift << ", spare " << place.spare;
            }
          double worst = 0;
          for (std::size_t e = 0; e < first.size(); e++)
            worst = std::fmax(worst, error_ratio(first[e], product.after.element[e].value,
                                                 product.after.element[e].gauge, product.after.roundings));
          ASSERT_LE(worst, 1) << what;
          TallyReport::of(kernel.name).within(kernel.tier, worst);
        }
  }
}

TYPED_TEST(GemmKernels, TouchNothingForNoRowsOrNoColumns) {
  using T = TypeParam;
  Guarded<T> nothing(0);
  nothing.unreadable();
  for (const Listed<T> &kernel : listed<T>()) {
    const TileOf tile = tile_of(kernel);
    const QtbInt sizes[][2] = {{0, 0}, {tile.mr, 0}};
    for (Kernel<T> *form : {kernel.any, kernel.aligned})
      for (const auto &[m, n] : sizes)
        form(m, n, 4, nothing.data(), 64, nothing.data(), 64, nothing.data(), 64, nothing.data());
    TallyReport::of(kernel.name).exact(kernel.tier);
  }
}

TYPED_TEST(GemmKernels, ZerosAreSummedWithTheSignOfASumFromPlusZero) {
  using T = TypeParam;
  // Of (1, 0) times (0, 1) the real part is 0 - 0, and of 1 times -0 added to a sum from +0 it is +0 as well.
  const T x = value<T>(1, 0), y = is_complex<T> ? value<T>(0, 1) : value<T>(-0.0, 0);
  for (const Listed<T> &kernel : listed<T>()) {
    const TileOf tile = tile_of(kernel);
    for (QtbInt n = 1; n <= tile.nr; n++) {
      Panels<T> p(tile, tile.mr, n, 4);
      for (QtbInt l = 0; l < p.kp; l++) {
        for (QtbInt i = 0; i < p.m; i++) p.a(tile, i, l) = l == 0 ? x : T{};
        for (QtbInt j = 0; j < p.n; j++) p.b(j, l) = l == 0 ? y : T{};
      }
      const std::vector<T> before(static_cast<std::size_t>(p.m * n), value<T>(-0.0, -0.0));
      for (const T &got : call(kernel.any, p, before, {0, 0}, kernel.stage_bytes_per_k * p.kp))
        EXPECT_TRUE(same_bits(got, value<T>(0, 1))) << tier_name(kernel.tier) << " " << kernel.name << " width " << n;
      TallyReport::of(kernel.name).exact(kernel.tier);
    }
  }
}

// Whether the upper half of any of the sixteen 256-bit registers holds something.
bool upper_halves_in_use() {
  alignas(16) unsigned char halves[16][16];
#define STORE_UPPER(r) __asm__ volatile("vextractf128 $1, %%ymm" #r ", %0" : "=m"(halves[r]))
  STORE_UPPER(0);
  STORE_UPPER(1);
  STORE_UPPER(2);
  STORE_UPPER(3);
  STORE_UPPER(4);
  STORE_UPPER(5);
  STORE_UPPER(6);
  STORE_UPPER(7);
  STORE_UPPER(8);
  STORE_UPPER(9);
  STORE_UPPER(10);
  STORE_UPPER(11);
  STORE_UPPER(12);
  STORE_UPPER(13);
  STORE_UPPER(14);
  STORE_UPPER(15);
#undef STORE_UPPER
  for (const auto &half : halves)
    for (unsigned char byte : half)
      if (byte != 0) return true;
  return false;
}

TYPED_TEST(GemmKernels, LeaveTheUpperHalvesOfTheRegistersClear) {
  using T = TypeParam;
  if (!processor_runs(tier_avx)) GTEST_SKIP() << "no 256-bit registers";
  for (const Listed<T> &kernel : listed<T>()) {
    const TileOf tile = tile_of(kernel);
    for (QtbInt n = 1; n <= tile.nr; n++) {
      Panels<T> p(tile, tile.mr, n, 8);
      Guarded<T> c(static_cast<std::size_t>(p.m * n)), stage(static_cast<std::size_t>(kernel.stage_bytes_per_k) * 8);
      for (std::size_t e = 0; e < c.size(); e++) c[e] = draw<T>();
      kernel.any(p.m, n, p.kp, p.ap.data(), p.ldap, p.bp.data(), p.ldbp, c.data(), p.m, stage.data());
      EXPECT_FALSE(upper_halves_in_use()) << tier_name(kernel.tier) << " " << kernel.name << " width " << n;
      TallyReport::of(kernel.name).exact(kernel.tier);
    }
  }
}

}  // namespace
}  // namespace qtb::test
