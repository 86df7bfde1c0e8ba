// In what order sums are added up: the bits of every tier's results against plain models. An order belongs to its tier:
// a caller who runs the same call on the same tier again gets the same bits, from this build and the next.
//
// A model takes element after element. Each test also counts how often another order would have given other bits: data
// that could not tell two orders apart would prove nothing.

#include <algorithm>
#include <cmath>

#include "tests/kernels/level1/vector_routines.h"

namespace qtb::test {
namespace {

constexpr int vector_bytes = 16, accumulators = 4;

// How accumulators are joined: ((a0 + a1) + a2) + a3, or (a3 + a2) + (a1 + a0).
enum class Joined { in_a_chain, in_pairs };
constexpr Joined joined_by(int tier) { return tier < tier_sse42 ? Joined::in_a_chain : Joined::in_pairs; }
constexpr Joined other(Joined joined) { return joined == Joined::in_pairs ? Joined::in_a_chain : Joined::in_pairs; }

template <class R>
R join(const R (&a)[accumulators], Joined joined) {
  return joined == Joined::in_pairs ? (a[3] + a[2]) + (a[1] + a[0]) : ((a[0] + a[1]) + a[2]) + a[3];
}

// Accumulators of count numbers each.
template <class R, int count>
struct Accumulators {
  R number[count][accumulators] = {};
  R joined(int at, Joined joined) const { return join(number[at], joined); }
};

// n elements at a vector boundary.
template <class T>
class Aligned {
 public:
  Aligned(QtbInt n, std::uint64_t seed) : image_(n, 1, random_values<T>(n, seed).data()), room_(image_.size()) {
    data_ = image_.put(room_.at(0));
  }
  T *data() { return data_; }

 private:
  Image<T> image_;
  Room room_;
  T *data_;
};

// ---- Real dot products ----

// Aligned vectors: four accumulators of a vector's lanes take the vectors in turn; a tail of less than a vector goes to
// lane 0 of the first accumulator before the join (in a chain), or to the sum after it (in pairs). n is whole passes of
// the main loop and such a tail.
template <class T>
T modelled_dot(QtbInt n, const T *x, const T *y, Joined joined) {
  constexpr int lanes = vector_bytes / static_cast<int>(sizeof(T));
  Accumulators<T, lanes> a;
  const QtbInt vectors = n / lanes;
  for (QtbInt i = 0; i < vectors * lanes; ++i) a.number[i % lanes][i / lanes % accumulators] += x[i] * y[i];
  if (joined == Joined::in_a_chain)
    for (QtbInt i = vectors * lanes; i < n; ++i) a.number[0][0] += x[i] * y[i];
  T lane[lanes];
  for (int k = 0; k < lanes; ++k) lane[k] = a.joined(k, joined);
  T sum;
  if constexpr (lanes == 2)
    sum = lane[0] + lane[1];
  else
    sum = (lane[0] + lane[2]) + (lane[1] + lane[3]);
  if (joined == Joined::in_pairs)
    for (QtbInt i = vectors * lanes; i < n; ++i) sum += x[i] * y[i];
  return sum;
}

constexpr QtbInt longest_pass = 64;  // elements, of any dot product in any tier
constexpr int seeds = 20, passes = 12;

template <class T>
void expect_order(const Dot<T> &routine) {
  for_each_tier([&](int tier) {
    int told_apart = 0;
    for (std::uint64_t seed = 0; seed < seeds; ++seed) {
      Aligned<T> x((passes + 1) * longest_pass, 2 * seed), y((passes + 1) * longest_pass, 2 * seed + 1);
      for (QtbInt pass = 1; pass <= passes; ++pass)
        for (QtbInt tail = 0; tail < vector_bytes / QtbInt{sizeof(T)}; ++tail) {
          const QtbInt n = pass * longest_pass + tail;
          const T got = routine.call(tier, n, x.data(), 1, y.data(), 1);
          ASSERT_EQ(got, modelled_dot(n, x.data(), y.data(), joined_by(tier)))
              << routine.name << ' ' << tier_name(tier) << " n " << n;
          told_apart += got != modelled_dot(n, x.data(), y.data(), other(joined_by(tier)));
        }
    }
    EXPECT_GT(told_apart, 0) << routine.name << ' ' << tier_name(tier);
  });
}

TEST(dots, join_four_accumulators_in_a_chain_below_sse42_and_in_pairs_from_there_on) {
  expect_order(dot_of<double>("ddot", ddot_tiers));
  expect_order(dot_of<float>("sdot", sdot_tiers));
}

// ---- Complex dot products ----

// The four sums of products of parts, each in accumulators of its own: whether a tier pairs x with y and with y's parts
// exchanged, or each part of x with y, the terms of a sum and their order are the same. An element that fills no vector
// goes to the lowest place of the first accumulator. The accumulators are joined as above, then the elements of a
// vector are added, and the signs come last.
template <class T>
T modelled_complex_dot(QtbInt n, const T *x, const T *y, bool conjugated, Joined joined) {
  using R = Real<T>;
  constexpr int places = vector_bytes / static_cast<int>(sizeof(T));
  enum { re_re, im_im, im_re, re_im, sums };
  Accumulators<R, sums> a[places];
  for (QtbInt i = 0; i < n; ++i) {
    const bool in_vector = i / places * places + places <= n;
    const QtbInt k = in_vector ? i / places % accumulators : 0, place = in_vector ? i % places : 0;
    a[place].number[re_re][k] += x[i].re * y[i].re;
    a[place].number[im_im][k] += x[i].im * y[i].im;
    a[place].number[im_re][k] += x[i].im * y[i].re;
    a[place].number[re_im][k] += x[i].re * y[i].im;
  }
  R sum[sums];
  for (int k = 0; k < sums; ++k) {
    sum[k] = a[0].joined(k, joined);
    if constexpr (places == 2) sum[k] += a[1].joined(k, joined);
  }
  return conjugated ? T{sum[re_re] + sum[im_im], sum[re_im] - sum[im_re]}
                    : T{sum[re_re] - sum[im_im], sum[im_re] + sum[re_im]};
}

template <class T>
void expect_complex_order(const Dot<T> &routine) {
  for_each_tier([&](int tier) {
    int told_apart = 0;
    for (std::uint64_t seed = 0; seed < seeds; ++seed) {
      Aligned<T> x((passes + 1) * longest_pass, 2 * seed), y((passes + 1) * longest_pass, 2 * seed + 1);
      for (QtbInt pass = 1; pass <= passes; ++pass)
        for (QtbInt tail = 0; tail < vector_bytes / QtbInt{sizeof(T)}; ++tail) {
          const QtbInt n = pass * longest_pass + tail;
          const auto modelled = [&](Joined joined) {
            return modelled_complex_dot(n, x.data(), y.data(), routine.conjugated, joined);
          };
          const T got = routine.call(tier, n, x.data(), 1, y.data(), 1);
          ASSERT_TRUE(same_bits(got, modelled(joined_by(tier))))
              << routine.name << ' ' << tier_name(tier) << " n " << n;
          told_apart += !same_bits(got, modelled(other(joined_by(tier))));
        }
    }
    EXPECT_GT(told_apart, 0) << routine.name << ' ' << tier_name(tier);
  });
}

TEST(complex_dots, join_the_accumulators_of_four_sums_like_real_dots) {
  expect_complex_order(complex_dot_of<cfloat>("cdotu", cdotu_tiers, false));
  expect_complex_order(complex_dot_of<cfloat>("cdotc", cdotc_tiers, true));
  expect_complex_order(complex_dot_of<cdouble>("zdotu", zdotu_tiers, false));
  expect_complex_order(complex_dot_of<cdouble>("zdotc", zdotc_tiers, true));
}

// ---- Both increments -1 ----

// The sum from the far end on, element by element.
template <class T>
T walked_backwards(QtbInt n, const T *x, const T *y, bool conjugated) {
  if constexpr (!is_complex<T>) {
    T sum = 0;
    for (QtbInt i = n - 1; i >= 0; --i) sum += x[i] * y[i];
    return sum;
  } else {
    T direct{}, crossed{};
    for (QtbInt i = n - 1; i >= 0; --i) {
      direct.re += x[i].re * y[i].re, direct.im += x[i].im * y[i].im;
      crossed.re += x[i].im * y[i].re, crossed.im += x[i].re * y[i].im;
    }
    return conjugated ? T{direct.re + direct.im, crossed.im - crossed.re}
                      : T{direct.re - direct.im, crossed.re + crossed.im};
  }
}

TEST(dots, with_both_increments_minus_1_walk_backwards_from_sse42_on_and_forward_below) {
  for_each_dot([]<class T>(const Dot<T> &routine) {
    for_each_tier([&](int tier) {
      int told_apart = 0;
      for (std::uint64_t seed = 0; seed < seeds; ++seed)
        for (const QtbInt n : {1, 2, 3, 7, 64, 101, 333}) {
          Aligned<T> x(n, 2 * seed), y(n, 2 * seed + 1);
          const T forward = routine.call(tier, n, x.data(), 1, y.data(), 1);
          const T backward = walked_backwards(n, x.data(), y.data(), routine.conjugated);
          const T want = tier < tier_sse42 ? forward : backward;
          ASSERT_TRUE(same_bits(routine.call(tier, n, x.data(), -1, y.data(), -1), want))
              << routine.name << ' ' << tier_name(tier) << " n " << n;
          told_apart += !same_bits(forward, backward);
        }
      EXPECT_GT(told_apart, 0) << routine.name << ' ' << tier_name(tier);
    });
  });
}

// An axpy's elements have the same bits either way. Which way it goes shows where y is x, one element further down:
// forward, every element finds its neighbour as it was; backwards, with that neighbour's own sum in it. Nobody may rely
// on that; here it tells the walks apart.
template <class T>
void expect_walk(const char *name, Tiers<QTB_FUNCTION_TYPE(axpy, T)> &procedures) {
  constexpr QtbInt n = 150, backward = -1;
  const T one{1, 0};
  for_each_tier([&](int tier) {
    std::vector<T> v(n + 1, one);
    procedures[tier](&n, &one, v.data() + 1, &backward, v.data(), &backward);
    for (QtbInt i = 0; i < n; ++i)
      ASSERT_EQ(v[static_cast<std::size_t>(i)].re, tier < tier_sse42 ? 2 : static_cast<Real<T>>(n + 1 - i))
          << name << ' ' << tier_name(tier) << " element " << i;
  });
}

TEST(complex_axpys, with_both_increments_minus_1_walk_backwards_from_sse42_on_and_forward_below) {
  expect_walk<cfloat>("caxpy", caxpy_tiers);
  expect_walk<cdouble>("zaxpy", zaxpy_tiers);
}

// ---- Sums of magnitudes ----

template <class T>
using Norm = Real<T>(const QtbInt *, const T *, const QtbInt *);
Norm<float> *const sasum[] = QTB_ALL_TIERS(sasum), *const snrm2[] = QTB_ALL_TIERS(snrm2);
Norm<double> *const dasum[] = QTB_ALL_TIERS(dasum);
Norm<cfloat> *const scasum[] = QTB_ALL_TIERS(scasum), *const scnrm2[] = QTB_ALL_TIERS(scnrm2);
Norm<cdouble> *const dzasum[] = QTB_ALL_TIERS(dzasum);

template <class T>
T plain_sum(QtbInt n, const T *x) {
  T sum = 0;
  for (QtbInt i = 0; i < n; ++i) sum += std::fabs(x[i]);
  return sum;
}

// Single elements, peeled ones before and a tail of less than a vector behind, have a sum of their own. Four
// accumulators take the vectors in turn and are joined in a chain; then the lanes, by halves in the lowest tier and by
// neighbours above; then the single elements. n less the peeled ones is whole passes and such a tail.
template <class T>
T modelled_sum(QtbInt n, const T *x, QtbInt peeled, int tier) {
  constexpr int lanes = vector_bytes / static_cast<int>(sizeof(T));
  const QtbInt behind = n - (n - peeled) % lanes;
  Accumulators<T, lanes> a;
  T singles = 0;
  for (QtbInt i = 0; i < n; ++i) {
    const QtbInt at = i - peeled;
    if (at < 0 || i >= behind)
      singles += std::fabs(x[i]);
    else
      a.number[at % lanes][at / lanes % accumulators] += std::fabs(x[i]);
  }
  T lane[lanes];
  for (int k = 0; k < lanes; ++k) lane[k] = a.joined(k, Joined::in_a_chain);
  if constexpr (lanes == 2)
    return (lane[0] + lane[1]) + singles;
  else if (tier == tier_def)
    return ((lane[0] + lane[2]) + (lane[1] + lane[3])) + singles;
  else
    return ((lane[0] + lane[1]) + (lane[2] + lane[3])) + singles;
}

// At every phase. Below sse42 an element between its own boundaries makes all elements single, and so it does to
// doubles in every tier; elsewhere those tiers peel, and the others never do.
template <class T>
void expect_sum_order(const char *name, Norm<T> *const (&procedures)[tier_count]) {
  constexpr QtbInt pass = 64;
  for_each_tier([&](int tier) {
    int told_apart = 0;
    for (std::uint64_t seed = 0; seed < seeds; ++seed)
      for (int phase = 0; phase < vector_bytes; ++phase)
        for (QtbInt beyond = 0; beyond < 2 * vector_bytes / QtbInt{sizeof(T)}; ++beyond) {
          const bool peels = tier < tier_sse42, at_elements = phase % static_cast<int>(sizeof(T)) == 0;
          const QtbInt to_boundary = (vector_bytes - phase) % vector_bytes / QtbInt{sizeof(T)};
          const QtbInt peeled = peels && at_elements ? to_boundary : 0;
          const QtbInt n = peeled + 2 * pass + beyond % (vector_bytes / QtbInt{sizeof(T)}), one = 1;
          const std::vector<T> x = random_values<T>(static_cast<std::size_t>(n), seed);
          const Image<T> image(n, 1, x.data());
          Room room(image.size());
          const bool single = !at_elements && (peels || sizeof(T) == sizeof(double));
          const T plain = plain_sum(n, x.data()), by_vectors = modelled_sum(n, x.data(), peeled, tier);
          const T got = procedures[tier](&n, image.put(room.at(phase)), &one);
          ASSERT_EQ(got, single ? plain : by_vectors)
              << name << ' ' << tier_name(tier) << " n " << n << " phase " << phase;
          told_apart += plain != by_vectors;
        }
    EXPECT_GT(told_apart, 0) << name << ' ' << tier_name(tier);
  });
}

TEST(real_sums, add_by_vectors_on_their_boundaries_and_singly_where_no_boundary_can_be_reached) {
  expect_sum_order<float>("sasum", sasum);
  expect_sum_order<double>("dasum", dasum);
}

// Any increment but 1: two elements a turn, one to each of two sums, the second added up before it is added; an odd
// last element goes to the joined sum, part by part.
template <class T>
Real<T> modelled_complex_sum(QtbInt n, const T *x) {
  Real<T> first = 0, second = 0;
  QtbInt i = 0;
  for (; i + 2 <= n; i += 2) {
    first += std::fabs(x[i].re);
    first += std::fabs(x[i].im);
    second += std::fabs(x[i + 1].re) + std::fabs(x[i + 1].im);
  }
  Real<T> sum = first + second;
  if (i < n) {
    sum += std::fabs(x[i].re);
    sum += std::fabs(x[i].im);
  }
  return sum;
}

template <class T>
void expect_complex_sum_order(const char *name, Norm<T> *const (&procedures)[tier_count]) {
  for_each_tier([&](int tier) {
    int told_apart = 0;
    for (std::uint64_t seed = 0; seed < seeds; ++seed)
      for (const QtbInt inc : {-1, 2, -2, 3})
        for (const QtbInt n : {1, 2, 3, 4, 5, 8, 33, 100}) {
          const std::vector<T> x = random_values<T>(static_cast<std::size_t>(n), seed);
          const Image<T> image(n, inc, x.data());
          Room room(image.size());
          const Real<T> got = procedures[tier](&n, image.put(room.at(0)), &inc);
          ASSERT_EQ(got, modelled_complex_sum(n, x.data()))
              << name << ' ' << tier_name(tier) << " n " << n << " inc " << inc;
          told_apart += got != plain_sum(2 * n, &x[0].re);
        }
    EXPECT_GT(told_apart, 0) << name << ' ' << tier_name(tier);
  });
}

TEST(complex_sums, with_another_increment_than_1_take_elements_in_turn_for_two_sums) {
  expect_complex_sum_order<cfloat>("scasum", scasum);
  expect_complex_sum_order<cdouble>("dzasum", dzasum);
}

// ---- Norms in double ----

constexpr int norm_accumulators = 8;

// Pairs of floats, squared in double, go to eight accumulators of two lanes in turn, joined as a tree or, for
// comparison, in a chain.
float modelled_norm(const std::vector<float> &x, bool as_a_tree) {
  double a[norm_accumulators][2] = {};
  for (std::size_t i = 0; i < x.size(); ++i) {
    const double wide = x[i];
    a[i / 2 % norm_accumulators][i % 2] += wide * wide;
  }
  double lane[2];
  for (int k = 0; k < 2; ++k) {
    lane[k] = a[0][k];
    for (int i = 1; i < norm_accumulators; ++i) lane[k] += a[i][k];
    if (as_a_tree) lane[k] = ((a[0][k] + a[1][k]) + (a[2][k] + a[3][k])) + ((a[4][k] + a[5][k]) + (a[6][k] + a[7][k]));
  }
  return static_cast<float>(std::sqrt(lane[0] + lane[1]));
}

// n floats whose norm lies at the middle between two floats, so that the last bit of the sum in double decides which of
// the two comes out: all but the last four at random, and those four take up what is missing, each as far as a float
// can.
std::vector<float> near_a_tie(std::size_t n, std::uint64_t seed) {
  constexpr std::size_t adjusted = 4;
  std::vector<float> x = random_values<float>(n, seed);
  Quad sum = 0;
  for (std::size_t i = 0; i + adjusted < n; ++i) sum += Quad(x[i]) * Quad(x[i]);
  const double above = std::sqrt(static_cast<double>(sum) + 1);
  const float below_middle = static_cast<float>(above);
  const double middle = (static_cast<double>(below_middle) + std::nextafter(below_middle, HUGE_VALF)) / 2;
  Quad missing = Quad(middle) * Quad(middle) - sum;
  for (std::size_t i = n - adjusted; i < n; ++i) {
    float part = static_cast<float>(std::sqrt(static_cast<double>(missing)));
    if (Quad(part) * Quad(part) > missing) part = std::nextafter(part, 0.0F);
    x[i] = part;
    missing -= Quad(part) * Quad(part);
  }
  std::shuffle(x.begin(), x.end(), std::mt19937_64(seed));
  return x;
}

TEST(single_norms, join_eight_accumulators_as_a_tree) {
  constexpr QtbInt one = 1;
  constexpr std::uint64_t ties = 400;
  for_each_tier([&](int tier) {
    int told_apart = 0;
    for (std::uint64_t seed = 0; seed < ties; ++seed) {
      const QtbInt n = 64 * (1 + static_cast<QtbInt>(seed % 4)), elements = n / 2;
      const std::vector<float> x = near_a_tie(static_cast<std::size_t>(n), seed);
      const Image<float> image(n, 1, x.data());
      Room room(image.size());
      const float *at = image.put(room.at(0)), want = modelled_norm(x, true);
      ASSERT_EQ(snrm2[tier](&n, at, &one), want) << tier_name(tier) << " n " << n;
      ASSERT_EQ(scnrm2[tier](&elements, reinterpret_cast<const cfloat *>(at), &one), want) << tier_name(tier);
      told_apart += want != modelled_norm(x, false);
    }
    EXPECT_GT(told_apart, 0) << tier_name(tier);
  });
}

// ---- Sparse dot products ----

template <class T>
void expect_sparse_order(const char *name, Tiers<QTB_FUNCTION_TYPE(doti, T)> &procedures) {
  for_each_tier([&](int tier) {
    int told_apart = 0;
    for (std::uint64_t seed = 0; seed < seeds; ++seed)
      for (const QtbInt n : {1, 2, 3, 4, 7, 64, 101}) {
        const std::vector<T> x = random_values<T>(static_cast<std::size_t>(n), 2 * seed);
        const std::vector<T> y = random_values<T>(static_cast<std::size_t>(n), 2 * seed + 1);
        std::vector<QtbInt> indx(x.size());
        for (std::size_t k = 0; k < indx.size(); ++k) indx[k] = n - static_cast<QtbInt>(k);
        const auto product = [&](std::size_t k) { return x[k] * y[static_cast<std::size_t>(indx[k] - 1)]; };
        T chain[2] = {}, plain = 0;
        const std::size_t pairs = x.size() / 2 * 2;
        for (std::size_t k = 0; k < x.size(); ++k) plain += product(k);
        for (std::size_t k = 0; k < pairs; ++k) chain[k % 2] += product(k);
        T want = chain[0] + chain[1];
        if (pairs < x.size()) want += product(pairs);
        ASSERT_EQ(procedures[tier](&n, x.data(), indx.data(), y.data()), want)
            << name << ' ' << tier_name(tier) << " n " << n;
        told_apart += want != plain;
      }
    EXPECT_GT(told_apart, 0) << name << ' ' << tier_name(tier);
  });
}

std::type_identity_t<QTB_FUNCTION_TYPE(doti, float)> *const sdoti[] = QTB_ALL_TIERS(sdoti);
std::type_identity_t<QTB_FUNCTION_TYPE(doti, double)> *const ddoti[] = QTB_ALL_TIERS(ddoti);

TEST(sparse_dots, take_elements_in_turn_for_two_sums) {
  expect_sparse_order<float>("sdoti", sdoti);
  expect_sparse_order<double>("ddoti", ddoti);
}

}  // namespace
}  // namespace qtb::test
