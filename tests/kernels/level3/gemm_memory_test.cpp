// What a serial gemm asks of the memory service: the size of its one buffer by family and form, and so which family a
// tier takes and which problems pack at all; the largest blocks, which stay inside it; and products without a buffer.
//
// The sizes are written down a second time on purpose. Fixed ones are those of a family's largest blocks: mb rows of
// 256 for A, 256 columns' worth of nb for B, between them what the kernel stages, and what the boundaries cost.
#include "tests/kernels/level3/gemm_bodies.h"

namespace qtb::test {
namespace {

template <class T>
class GemmMemory : public GemmBodies<T> {};
TYPED_TEST_SUITE(GemmMemory, Types);

template <class T>
using Gemm = QTB_FUNCTION_TYPE(gemm, T);
template <class T>
using GemmOfPackedB = QTB_FUNCTION_TYPE(gemm_bpacked, T);
template <class T>
using GemmOfPackedA = QTB_FUNCTION_TYPE(gemm_apacked, T);
template <class T>
using GemmOfPacked = QTB_FUNCTION_TYPE(gemm_packed, T);

// What a call asks for; 0 where it asks for nothing.
template <class Call>
std::uint64_t requested(Call call) {
  buffer_memory.requests.clear();
  call();
  EXPECT_LE(buffer_memory.requests.size(), 1U);
  return buffer_memory.requests.empty() ? 0 : buffer_memory.requests[0];
}

// Operands of zeros, large enough for every size here.
template <class T>
struct Zeros {
  Guarded<T> a{std::size_t{1} << 20}, b{std::size_t{1} << 22}, c{std::size_t{1} << 20};
  Zeros() {
    std::memset(a.data(), 0, a.size() * sizeof(T));
    std::memset(b.data(), 0, b.size() * sizeof(T));
    std::memset(c.data(), 0, c.size() * sizeof(T));
  }
  std::uint64_t gemm(Gemm<T> *body, QtbInt m, QtbInt n, QtbInt k) {
    const T one = value<T>(1, 0);
    return requested([&] { body("N", "N", &m, &n, &k, &one, a.data(), &m, b.data(), &k, &one, c.data(), &m); });
  }
  std::uint64_t bpacked(GemmOfPackedB<T> *body, QtbInt m, QtbInt n, QtbInt k) {
    const T one = value<T>(1, 0);
    const QtbInt ldp = (k + 3) / 4 * 4 * 12;
    return requested(
        [&] { body("N", "N", &m, &n, &k, &one, a.data(), &m, b.data(), &k, b.data(), &ldp, &one, c.data(), &m); });
  }
  std::uint64_t apacked(GemmOfPackedA<T> *body, QtbInt m, QtbInt n, QtbInt k) {
    const T one = value<T>(1, 0);
    const QtbInt ldp = (k + 3) / 4 * 4 * 12;
    return requested(
        [&] { body("N", "N", &m, &n, &k, &one, a.data(), &m, a.data(), &ldp, b.data(), &k, &one, c.data(), &m); });
  }
  std::uint64_t packed(GemmOfPacked<T> *body, QtbInt m, QtbInt n, QtbInt k) {
    const T one = value<T>(1, 0);
    const QtbInt ldp = (k + 3) / 4 * 4 * 12;
    return requested([&] {
      body("N", "N", &m, &n, &k, &one, a.data(), &m, a.data(), &ldp, b.data(), &k, b.data(), &ldp, &one, c.data(), &m);
    });
  }
};

// ---- The families that ask for the same whatever the problem, on a size that they pack ----

class GemmRequests : public testing::Test {
 protected:
  static void SetUpTestSuite() { become_processor(); }
  static bool runs(int tier) { return processor_runs(tier); }
};

constexpr QtbInt some = 40;

TEST_F(GemmRequests, SinglePrecision) {
  Zeros<float> of;
  const std::uint64_t low = 448 * some + 311552;
  if (runs(tier_def)) {
    EXPECT_EQ(of.gemm(qtb_blas_def_xsgemm, some, some, some), low);
  }
  if (runs(tier_def)) {
    EXPECT_EQ(of.gemm(qtb_blas_def_xsgemm, some, 2001, some), 448U * 2000 + 311552);
  }
  if (runs(tier_sse3)) {
    EXPECT_EQ(of.gemm(qtb_blas_sse3_xsgemm, some, some, some), low);
  }
  if (runs(tier_ssse3)) {
    EXPECT_EQ(of.gemm(qtb_blas_ssse3_xsgemm_nobcopy, some, some, some), 1078016U);
    EXPECT_EQ(of.gemm(qtb_blas_ssse3_xsgemm_sse41, some, some, some), 2081024U);
    EXPECT_EQ(of.packed(qtb_blas_ssse3_xsgemm_sse41_packed, some, some, some), 20736U);
  }
  if (runs(tier_sse42)) {
    EXPECT_EQ(of.gemm(qtb_blas_sse42_xsgemm_nobcopy, some, some, some), 1340160U);
  }
  if (runs(tier_sse42)) {
    EXPECT_EQ(of.gemm(qtb_blas_sse42_xsgemm, some, 300, 256), 6468864U);
  }
  if (runs(tier_avx)) {
    EXPECT_EQ(of.gemm(qtb_blas_avx_xsgemm_nobcopy, some, some, some), 1340160U);
  }
  if (runs(tier_avx)) {
    EXPECT_EQ(of.gemm(qtb_blas_avx_xsgemm, some, 300, 256), 6468864U);
  }
}

TEST_F(GemmRequests, DoublePrecision) {
  Zeros<double> of;
  EXPECT_EQ(of.gemm(qtb_blas_def_xdgemm_def_run_a, some, some, some), 520960U);
  EXPECT_EQ(of.gemm(qtb_blas_def_xdgemm_def_run_a, some, 200, 200), 10769664U);
  EXPECT_EQ(of.gemm(qtb_blas_def_xdgemm_def_run_b, some, some, some), 10769664U);
  if (runs(tier_sse3)) {
    EXPECT_EQ(of.gemm(qtb_blas_sse3_xdgemm, some, some, some), 0U) << "reads A and B in place";
    EXPECT_EQ(of.gemm(qtb_blas_sse3_xdgemm, 100, 285, 300), 112U * 64 + 112 * 480 * 8 + 112 * 285 * 8 + 18176);
  }
  if (runs(tier_ssse3)) {
    EXPECT_EQ(of.gemm(qtb_blas_ssse3_xdgemm_nobcopy, some, some, some), 1078016U);
    EXPECT_EQ(of.bpacked(qtb_blas_ssse3_xdgemm_bpacked, some, some, some), 1078016U);
    EXPECT_EQ(of.gemm(qtb_blas_ssse3_xdgemm_sse41, some, some, some), 2069248U);
    EXPECT_EQ(of.packed(qtb_blas_ssse3_xdgemm_sse41_packed, some, some, some), 13056U);
  }
  if (runs(tier_sse42)) {
    EXPECT_EQ(of.gemm(qtb_blas_sse42_xdgemm, some, some, some), 11588864U);
    EXPECT_EQ(of.gemm(qtb_blas_sse42_xdgemm_nobcopy, some, some, some), 1340160U);
    EXPECT_EQ(of.bpacked(qtb_blas_sse42_xdgemm_bpacked, some, some, some), 1340160U);
    EXPECT_EQ(of.apacked(qtb_blas_sse42_xdgemm_apacked, some, some, some), 10269952U);
  }
  if (runs(tier_avx)) {
    EXPECT_EQ(of.gemm(qtb_blas_avx_xdgemm, some, some, 300), 152U * 128 + (512 + some) * 152 * 8 + 21760);
    EXPECT_EQ(of.gemm(qtb_blas_avx_xdgemm, some, 10001, 200), 200U * 128 + (512 + 10000) * 200 * 8 + 21760);
    EXPECT_EQ(of.bpacked(qtb_blas_avx_xdgemm_bpacked, some, some, 300), 152U * 128 + 512 * 152 * 8 + 13056);
  }
}

TEST_F(GemmRequests, SinglePrecisionComplex) {
  Zeros<cfloat> of;
  if (runs(tier_def)) {
    EXPECT_EQ(of.gemm(qtb_blas_def_xcgemm, some, some, some), 512U * some + 189696);
  }
  if (runs(tier_sse3)) {
    EXPECT_EQ(of.gemm(qtb_blas_sse3_xcgemm, some, 2001, some), 512U * 2000 + 189696);
  }
  if (runs(tier_ssse3)) {
    EXPECT_EQ(of.bpacked(qtb_blas_ssse3_xcgemm_bpacked, some, some, some), 901120U + 17152 + 12288);
    EXPECT_EQ(of.bpacked(qtb_blas_ssse3_xcgemm_sse41, some, some, some), 2048000U + 16640 + 12288);
    EXPECT_EQ(of.packed(qtb_blas_ssse3_xcgemm_sse41_packed, some, some, some), 20736U);
  }
  if (runs(tier_sse42)) {
    EXPECT_EQ(of.gemm(qtb_blas_sse42_xcgemm, some, some, some), 11326720U);
    EXPECT_EQ(of.bpacked(qtb_blas_sse42_xcgemm_bpacked, some, some, some), 1048576U + 17152 + 12288);
  }
  if (runs(tier_avx)) {
    EXPECT_EQ(of.gemm(qtb_blas_avx_xcgemm, some, some, some), 11326720U);
  }
}

TEST_F(GemmRequests, DoublePrecisionComplex) {
  Zeros<cdouble> of;
  if (runs(tier_def)) {
    EXPECT_EQ(of.gemm(qtb_blas_def_xzgemm, some, some, some), 1024U * some + 353536);
  }
  if (runs(tier_sse3)) {
    EXPECT_EQ(of.gemm(qtb_blas_sse3_xzgemm, some, 2001, some), 1024U * 2000 + 353536);
  }
  if (runs(tier_ssse3)) {
    EXPECT_EQ(of.bpacked(qtb_blas_ssse3_xzgemm_bpacked, some, some, some), 901120U + 17152 + 12288);
    EXPECT_EQ(of.bpacked(qtb_blas_ssse3_xzgemm_sse41, some, some, some), 2097152U + 16640 + 12288);
    EXPECT_EQ(of.packed(qtb_blas_ssse3_xzgemm_sse41_packed, some, some, some), 20736U);
  }
  if (runs(tier_sse42)) {
    EXPECT_EQ(of.gemm(qtb_blas_sse42_xzgemm, some, some, some), 9278720U);
    EXPECT_EQ(of.bpacked(qtb_blas_sse42_xzgemm_bpacked, some, some, some), 1048576U + 17152 + 12288);
  }
  if (runs(tier_avx)) {
    EXPECT_EQ(of.gemm(qtb_blas_avx_xzgemm, some, some, some), 9278720U);
  }
}

// ---- Which family and which body a tier's gemm takes ----

// The request of a slice of B of depth k over n columns, just small enough to be read in place and just too large.
template <class T>
void expect_choice(Gemm<T> *body, QtbInt most_bytes, std::uint64_t in_place, std::uint64_t packed) {
  Zeros<T> of;
  const QtbInt n = most_bytes / (256 * static_cast<QtbInt>(sizeof(T)));
  EXPECT_EQ(of.gemm(body, some, n, 256), in_place);
  EXPECT_EQ(of.gemm(body, some, n, 257), in_place) << "a slice is no deeper than a block";
  EXPECT_EQ(of.gemm(body, some, n + 1, 256), packed);
}

TEST_F(GemmRequests, BodiesOfSsse3GoToTheFamilyOfTheProcessor) {
  if (!runs(tier_ssse3)) GTEST_SKIP();
  Zeros<cfloat> c;
  Zeros<cdouble> z;
  if (has_sse41()) {
    expect_choice<float>(qtb_blas_ssse3_xsgemm, 2097152, 2081024, 7205632);
    expect_choice<double>(qtb_blas_ssse3_xdgemm, 2097152, 2069248, 22557952);
    EXPECT_EQ(c.gemm(qtb_blas_ssse3_xcgemm, some, some, some), 12325632U);
    EXPECT_EQ(z.gemm(qtb_blas_ssse3_xzgemm, some, some, some), 22614784U);
  } else {
    expect_choice<float>(qtb_blas_ssse3_xsgemm, 2097152, 1078016, 6206720);
    expect_choice<double>(qtb_blas_ssse3_xdgemm, 2097152, 1078016, 21566720);
    EXPECT_EQ(c.gemm(qtb_blas_ssse3_xcgemm, some, some, some), 11179264U);
    EXPECT_EQ(z.gemm(qtb_blas_ssse3_xzgemm, some, some, some), 9131264U);
  }
}

TEST_F(GemmRequests, TheProcessorIsAskedForSse41Once) {
  if (!runs(tier_ssse3)) GTEST_SKIP();
  Zeros<double> of;
  of.gemm(qtb_blas_ssse3_xdgemm, some, some, some);
  const int asked = fake.cpuid_calls;
  for (int i = 0; i < 3; i++) of.gemm(qtb_blas_ssse3_xdgemm, 2 + i, 2 + i, 2 + i);
  EXPECT_EQ(fake.cpuid_calls, asked);
}

TEST_F(GemmRequests, SinglePrecisionOfLaterTiersReadsASmallSliceInPlace) {
  if (runs(tier_sse42)) expect_choice<float>(qtb_blas_sse42_xsgemm, 262144, 1340160, 6468864);
  if (runs(tier_avx)) expect_choice<float>(qtb_blas_avx_xsgemm, 262144, 1340160, 6468864);
}

TEST_F(GemmRequests, TheSliceThatIsReadInPlaceAtMostIsOfOneBlockOfColumns) {
  Zeros<float> of;
  const auto few_rows = [&](QtbInt n, QtbInt k) { return of.gemm(qtb_blas_sse42_xsgemm, 8, n, k); };
  if (!runs(tier_sse42)) GTEST_SKIP();
  EXPECT_EQ(few_rows(12000, 13), 1340160U) << "5000 columns, 260000 bytes";
  EXPECT_EQ(few_rows(12000, 14), 6468864U);
}

template <class T>
std::vector<T> product_bits(Gemm<T> *body, QtbInt m, QtbInt n, QtbInt k) {
  generator.seed(7);
  std::vector<T> a, b, c(static_cast<std::size_t>(m * n));
  for (QtbInt e = 0; e < m * k; e++) a.push_back(draw<T>());
  for (QtbInt e = 0; e < k * n; e++) b.push_back(draw<T>());
  const T one = value<T>(1, 0), none = value<T>(0, 0);
  body("N", "N", &m, &n, &k, &one, a.data(), &m, b.data(), &k, &none, c.data(), &m);
  return c;
}

// The two bodies of the processor family cut a depth of 300 differently, and so round differently.
TEST_F(GemmRequests, DefGoesToTheFamilyOfTheProcessor) {
  Zeros<double> of;
  const auto wide = [](QtbInt n, QtbInt kb) {
    return static_cast<std::uint64_t>(kb * 192 + kb * 512 * 8 + kb * (n < 4992 ? n : 4992) * 8 + 18176);
  };
  if (!has_family16()) {
    EXPECT_EQ(of.gemm(qtb_blas_def_xdgemm, some, some, some), wide(some, 128));
    EXPECT_EQ(of.gemm(qtb_blas_def_xdgemm, some, some, 200), wide(some, 100));
    EXPECT_EQ(of.gemm(qtb_blas_def_xdgemm, 8, 5000, 300), wide(5000, 128));
    return;
  }
  EXPECT_EQ(of.gemm(qtb_blas_def_xdgemm, some, some, some), 10769664U);
  constexpr QtbInt m = 12, k = 300, at_most = 262144 / (256 * 8);
  const auto bits_of = [&](Gemm<double> *body, QtbInt n) { return product_bits<double>(body, m, n, k); };
  for (const QtbInt n : {at_most, at_most + 1})
    ASSERT_NE(bits_of(qtb_blas_def_xdgemm_def_run_a, n), bits_of(qtb_blas_def_xdgemm_def_run_b, n));
  EXPECT_EQ(bits_of(qtb_blas_def_xdgemm, at_most), bits_of(qtb_blas_def_xdgemm_def_run_b, at_most));
  EXPECT_EQ(bits_of(qtb_blas_def_xdgemm, at_most + 1), bits_of(qtb_blas_def_xdgemm_def_run_a, at_most + 1));
}

TEST_F(GemmRequests, TheDefBodyThatMayReadBInPlaceDoesSoForASmallSlice) {
  expect_choice<double>(qtb_blas_def_xdgemm_def_run_a, 262144, 520960, 10769664);
}

// ---- Which problems pack: a limit is told by its first size, in each of m, n and k, that asks for a buffer ----

// A limit of rows below a full tile shows nowhere: such a problem has no rows for a panel in any case.
struct PackingFrom {
  QtbInt m, n, k;
};
template <class Request>
void expect_packing_from(const char *what, PackingFrom from, Request request) {
  EXPECT_EQ(request(from.m - 1, some, some), 0U) << what << ", m";
  EXPECT_NE(request(from.m, some, some), 0U) << what << ", m";
  EXPECT_EQ(request(some, from.n - 1, some), 0U) << what << ", n";
  EXPECT_NE(request(some, from.n, some), 0U) << what << ", n";
  EXPECT_EQ(request(some, some, from.k - 1), 0U) << what << ", k";
  EXPECT_NE(request(some, some, from.k), 0U) << what << ", k";
}
template <class T>
void expect_packing_from(const char *what, PackingFrom from, Gemm<T> *body) {
  Zeros<T> of;
  expect_packing_from(what, from, [&](QtbInt m, QtbInt n, QtbInt k) { return of.gemm(body, m, n, k); });
}

TEST_F(GemmRequests, ProblemsBelowTheLimitsOfABodyAskForNothing) {
  expect_packing_from<float>("def s", {8, 8, 8}, qtb_blas_def_xsgemm);
  expect_packing_from<cfloat>("def c", {4, 8, 8}, qtb_blas_def_xcgemm);
  expect_packing_from<cdouble>("def z", {4, 8, 8}, qtb_blas_def_xzgemm);
  // The columns beyond a multiple of four are not packed.
  if (!has_family16()) expect_packing_from<double>("def d", {2, 4, 2}, qtb_blas_def_xdgemm);
  expect_packing_from<double>("def a", {4, 2, 2}, qtb_blas_def_xdgemm_def_run_a);
  expect_packing_from<double>("def b", {4, 2, 2}, qtb_blas_def_xdgemm_def_run_b);
  if (runs(tier_sse3)) {
    expect_packing_from<float>("sse3 s", {8, 8, 8}, qtb_blas_sse3_xsgemm);
    expect_packing_from<cfloat>("sse3 c", {4, 8, 8}, qtb_blas_sse3_xcgemm);
    expect_packing_from<cdouble>("sse3 z", {4, 8, 8}, qtb_blas_sse3_xzgemm);
    Zeros<double> of;
    const double one = 1;
    expect_packing_from("sse3 d", {3, 3, 3}, [&](QtbInt m, QtbInt n, QtbInt k) {
      return requested([&] {
        qtb_blas_sse3_xdgemm("T", "N", &m, &n, &k, &one, of.a.data(), &k, of.b.data(), &k, &one, of.c.data(), &m);
      });
    });
  }
  if (runs(tier_ssse3)) {
    expect_packing_from<float>("ssse3 s in place", {8, 2, 2}, qtb_blas_ssse3_xsgemm_nobcopy);
    expect_packing_from<double>("ssse3 d in place", {4, 2, 2}, qtb_blas_ssse3_xdgemm_nobcopy);
    expect_packing_from<float>("sse41 s in place", {8, 4, 4}, qtb_blas_ssse3_xsgemm_sse41);
    expect_packing_from<double>("sse41 d in place", {4, 4, 4}, qtb_blas_ssse3_xdgemm_sse41);
    Zeros<float> s;
    Zeros<double> d;
    Zeros<cfloat> c;
    Zeros<cdouble> z;
    const auto packed_s = [&](QtbInt m, QtbInt n, QtbInt k) {
      return s.packed(qtb_blas_ssse3_xsgemm_sse41_packed, m, n, k);
    };
    const auto packed_d = [&](QtbInt m, QtbInt n, QtbInt k) {
      return d.packed(qtb_blas_ssse3_xdgemm_sse41_packed, m, n, k);
    };
    expect_packing_from("sse41 s", {9, 5, 5}, packed_s);
    expect_packing_from("sse41 d", {5, 5, 5}, packed_d);
    expect_packing_from("ssse3 d", {4, 3, 3}, [&](QtbInt m, QtbInt n, QtbInt k) {
      return d.bpacked(qtb_blas_ssse3_xdgemm_bpacked, m, n, k);
    });
    expect_packing_from("ssse3 c", {5, 3, 3}, [&](QtbInt m, QtbInt n, QtbInt k) {
      return c.bpacked(qtb_blas_ssse3_xcgemm_bpacked, m, n, k);
    });
    expect_packing_from("ssse3 z", {3, 3, 3}, [&](QtbInt m, QtbInt n, QtbInt k) {
      return z.bpacked(qtb_blas_ssse3_xzgemm_bpacked, m, n, k);
    });
    expect_packing_from("sse41 c", {5, 3, 5},
                        [&](QtbInt m, QtbInt n, QtbInt k) { return c.bpacked(qtb_blas_ssse3_xcgemm_sse41, m, n, k); });
    expect_packing_from("sse41 z", {3, 3, 5},
                        [&](QtbInt m, QtbInt n, QtbInt k) { return z.bpacked(qtb_blas_ssse3_xzgemm_sse41, m, n, k); });
  }
  if (runs(tier_sse42)) {
    expect_packing_from<double>("sse42 d", {3, 5, 5}, qtb_blas_sse42_xdgemm);
    Zeros<double> of;
    expect_packing_from("sse42 d, A packed", {2, 4, 4}, [&](QtbInt m, QtbInt n, QtbInt k) {
      return of.apacked(qtb_blas_sse42_xdgemm_apacked, m, n, k);
    });
    expect_packing_from<float>("sse42 s in place", {4, 4, 4}, qtb_blas_sse42_xsgemm_nobcopy);
    expect_packing_from<cfloat>("sse42 c", {3, 5, 5}, qtb_blas_sse42_xcgemm);
    expect_packing_from<cdouble>("sse42 z", {3, 5, 5}, qtb_blas_sse42_xzgemm);
  }
  // The full bodies of single precision get large slices alone, so that their limits of n and k never tell.
  Zeros<float> of;
  if (runs(tier_ssse3) && !has_sse41()) {
    EXPECT_EQ(of.gemm(qtb_blas_ssse3_xsgemm, 8, 2049, 256), 0U);
    EXPECT_NE(of.gemm(qtb_blas_ssse3_xsgemm, 9, 2049, 256), 0U);
  }
  const std::pair<int, Gemm<float> *> later[] = {{tier_sse42, qtb_blas_sse42_xsgemm}, {tier_avx, qtb_blas_avx_xsgemm}};
  for (const auto &[tier, body] : later)
    if (runs(tier)) {
      EXPECT_EQ(of.gemm(body, 4, 257, 256), 0U);
      EXPECT_NE(of.gemm(body, 5, 257, 256), 0U);
    }
  if (runs(tier_avx)) {
    expect_packing_from<double>("avx d", {8, 3, 3}, qtb_blas_avx_xdgemm);
    expect_packing_from<float>("avx s in place", {4, 4, 4}, qtb_blas_avx_xsgemm_nobcopy);
    expect_packing_from<cfloat>("avx c", {3, 5, 5}, qtb_blas_avx_xcgemm);
    expect_packing_from<cdouble>("avx z", {3, 5, 5}, qtb_blas_avx_xzgemm);
  }
}

// ---- The buffers at work ----

// A depth of a whole block in every family, below it and above; rows and columns beyond the largest block.
TYPED_TEST(GemmMemory, TheLargestBlocksStayInsideTheirBuffers) {
  int trial = 0;
  for (const QtbInt k : {112, 128, 224, 255, 256}) {
    this->expect_exact(2010, 13, k, trial++, this->ops * this->ops);
    if (this->HasFatalFailure()) return;
  }
  this->expect_exact(11300, 9, 10, trial++, this->ops * this->ops);
  if (this->HasFatalFailure()) return;
  for (const QtbInt k : {112, 256}) {
    this->expect_exact(17, 10012, k, trial++, this->ops * this->ops);
    if (this->HasFatalFailure()) return;
  }
  // One and the other at once.
  if (!is_complex<TypeParam>) this->expect_exact(1030, 1030, 256, trial++, this->ops * this->ops);
}

TYPED_TEST(GemmMemory, ProductsThatGetNoBufferAreStillExact) {
  buffer_memory.is_out = true;
  int trial = 0;
  for (const auto &[m, n, k] : std::initializer_list<std::array<QtbInt, 3>>{
           {9, 9, 9}, {21, 13, 40}, {40, 40, 40}, {17, 70, 300}, {300, 300, 30}, {700, 9, 130}}) {
    this->expect_exact(m, n, k, trial, this->ops + 1);
    this->expect_exact(m, n, k, trial + 1, this->ops + 1);
    trial++;
    if (this->HasFatalFailure()) break;
  }
  buffer_memory.is_out = false;
}

}  // namespace
}  // namespace qtb::test
