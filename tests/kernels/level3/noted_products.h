// What the suites of routines that are made of products share: the products that a routine of sse42 calls, by value and
// in their order, and what every tier's procedure goes through on the problems and under the judgement of the surface
// suites. A program that includes this is linked with the sources that its suite names, and brings main().
//
// The memory service is that of buffer_memory.h.
#pragma once

#include <string>
#include <vector>

#include "tests/kernels/level3/buffer_memory.h"
#include "tests/product/surface/level3_shapes.h"
#include "tests/product/surface/registry.h"
#include "tests/support/finite_only.h"
#include "tests/support/tiers.h"

// ---- The products of sse42 ----

namespace qtb::test {
namespace {

struct NotedProduct {
  std::string ops;  // of both operands
  QtbInt m, n, k;
  std::complex<double> alpha, beta;
  QtbInt lda;
  const void *a, *b, *c;
};
std::vector<NotedProduct> noted_products;
bool notes_products = false;

template <class T>
std::complex<double> noted_factor(T v) {
  if constexpr (is_complex<T>)
    return {v.re, v.im};
  else
    return v;
}

}  // namespace
}  // namespace qtb::test

#define QTB_NOTE_PRODUCTS(name, T)                                                                     \
  extern "C" QTB_FUNCTION(gemm, T, __real_##name);                                                     \
  extern "C" QTB_FUNCTION(gemm, T, __wrap_##name) {                                                    \
    using namespace qtb::test;                                                                         \
    if (notes_products)                                                                                \
      noted_products.push_back(                                                                        \
          {{*transa, *transb}, *m, *n, *k, noted_factor(*alpha), noted_factor(*beta), *lda, a, b, c}); \
    __real_##name(QTB_ARGS(gemm));                                                                     \
  }
QTB_NOTE_PRODUCTS(qtb_blas_sse42_xdgemm, double)
QTB_NOTE_PRODUCTS(qtb_blas_sse42_xzgemm, cdouble)

// ---- A request for memory that is refused ----

namespace qtb::test {
namespace {

std::size_t refused_request = 0;  // from 1 on; none

}  // namespace
}  // namespace qtb::test

extern "C" void *__real_qtb_serv_malloc(std::uint64_t size, std::int32_t alignment);
extern "C" void *__wrap_qtb_serv_malloc(std::uint64_t size, std::int32_t alignment) {
  qtb::test::BufferMemory &memory = qtb::test::buffer_memory;
  const bool was_out = memory.is_out;
  if (memory.requests.size() + 1 == qtb::test::refused_request) memory.is_out = true;
  void *const given = __real_qtb_serv_malloc(size, alignment);
  memory.is_out = was_out;
  return given;
}

namespace qtb::surface {
namespace {

// ---- Problems of one routine in one tier ----

constexpr Scalar some = {0.7, -0.9}, other = {0.9, -0.2}, one = {1, 0}, minus_one = {-1, 0}, none = {0, 0},
                 minus_none = {-0.0, 0};
constexpr Scalar usual_alphas[] = {some, one, minus_one, some}, usual_betas[] = {none, one, other};

template <ShapeName shape, class T, class R>
class TierProblems {
 public:
  TierProblems(const R &routine, const char *label) : session_(label, {}), routine_(routine) {}

  // A problem whose sizes and options are to be set.
  Problem draw(Values values = Values::rounding) {
    Problem p = draw_problem(seed_of(routine_.name(), ++number_), values);
    Draw draw(p.seed);
    if (values == Values::rounding) p.alpha = draw.one_of(usual_alphas), p.beta = draw.one_of(usual_betas);
    return p;
  }
  bool run_one(const Problem &p) {
    if (!session_.start(p)) return false;
    run<T>(Shape<shape>(), routine_, p, session_);
    return true;
  }
  // With each of its requests for memory refused, and with all of them.
  bool run_without_memory(const Problem &p) {
    test::BufferMemory &memory = test::buffer_memory;
    bool goes_on = true;
    std::size_t requests = 1;
    for (std::size_t refused = 1; goes_on && refused <= requests; ++refused) {
      memory.requests.clear();
      test::refused_request = refused;
      goes_on = run_one(p);
      requests = memory.requests.size();
    }
    test::refused_request = 0;
    memory.is_out = true;
    goes_on = goes_on && run_one(p);
    memory.is_out = false;
    EXPECT_EQ(memory.outstanding, 0);
    return goes_on;
  }

  // Numbers whose products are just within the range: a lane that holds anything else than an element's own would leave
  // it.
  void run_within_the_range(Problem p) {
    using P = Real<T>;
    constexpr bool single = sizeof(P) == sizeof(float);
    // Imaginary parts may cancel but for a last digit, which has to stay in the range as well.
    const P largest = single ? P(1e18) : P(1e153);
    const P least = is_complex<T> ? (single ? P(1e-15) : P(1e-145)) : (single ? P(1e-18) : P(1e-153));
    p.alpha = one, p.spare[0] = p.spare[1] = p.spare[2] = 0;
    const calls::Description d = calls::describe<shape>(p, routine_.kind());
    for (const P size : {largest, least}) {
      std::vector<T> a = filled(d.a.layout, size), b = filled(d.b.layout, size), c = filled(d.c.layout, size * size);
      calls::Scalars<T> scalars(d);
      const typename Shape<shape>::Call call(
          scalars.template arguments<shape>(a.data(), b.data(), c.data(), nullptr, nullptr, nullptr));
      const test::FiniteOnly trapping;
      call([&](auto... arguments) { return routine_.call(false, arguments...); });
    }
  }

 private:
  static std::vector<T> filled(const reference::Layout &layout, Real<T> size) {
    std::vector<T> elements(static_cast<std::size_t>(layout.extent()));
    int number = 0;
    for (T &e : elements) {
      const Real<T> next = size + size / 8 * static_cast<Real<T>>(++number % 5);
      if constexpr (is_complex<T>)
        e = {next, size};
      else
        e = next;
    }
    return elements;
  }

  Session session_;
  R routine_;
  int number_ = 0;
};

// Whether this process's processor is one for a tier's sweeps: on others than the plain one only the tier whose
// products depend on it is swept.
inline bool is_swept(int tier) {
  if (test::has_sse41()) return tier == tier_ssse3;
  if (test::has_family16()) return tier == tier_def;
  return true;
}

// One test for each tier: body(problems) with the TierProblems of a routine.
template <ShapeName shape, class T, class Function, class Body>
void register_in_every_tier(const char *name, Function *const (&procedures)[tier_count], const char *test_name,
                            Body body) {
  test::in_every_tier([&](int tier) {
    if (!is_swept(tier)) return;
    static std::map<std::string, std::string> labels;  // outlive the tests
    const std::string label = std::string(name) + " " + test::tier_name(tier);
    labels[label] = label;
    const char *kept = labels[label].c_str();
    const Routine<Function> routine(name, calls::kind_of<T>(name), procedures[tier], procedures[tier]);
    register_test(kept, test_name, [=] {
      TierProblems<shape, T, Routine<Function>> problems(routine, kept);
      body(problems);
      EXPECT_EQ(test::buffer_memory.outstanding, 0);
    });
  });
}

inline int run_suite(int argc, char **argv, void (*register_all)()) {
  testing::InitGoogleTest(&argc, argv);
  test::become_processor();
  register_all();
  std::signal(SIGSEGV, on_trap);
  std::signal(SIGFPE, on_trap);
  std::signal(SIGILL, on_trap);
  const int result = RUN_ALL_TESTS();
  report();
  return result;
}

}  // namespace
}  // namespace qtb::surface
