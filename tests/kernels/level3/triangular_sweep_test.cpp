// trmm and trsm of the tiers with level tables, by the tiers' own procedures: all options and small sizes, the edges of
// blocks and steps, with work buffers between trapping pages and without any, on the problems and under the judgement
// of the surface suites.
#include "tests/kernels/level3/buffer_memory.h"
#include "tests/product/surface/level3_shapes.h"
#include "tests/product/surface/registry.h"
#include "tests/support/tiers.h"

namespace qtb::surface {
namespace {

constexpr Scalar factors[] = {{1, 0}, {0.7, -0.9}, {1, 0}, {-1, 0}, {0.7, -0.9}, {0, 0}, {1, 0}};

// Extents of a triangle, and of the other side of B, at which a walk, a base kernel or a small kernel changes.
constexpr QtbInt triangle_edges[] = {63, 64, 65, 71, 72, 73, 127, 128, 129, 255, 256, 257};
constexpr QtbInt large_triangles[] = {511, 512, 513};
constexpr QtbInt other_edges[] = {255, 256, 257, 511, 512, 513, 999, 1000, 1001, 1023, 1024, 1025};

template <class T, class R>
class TriangularSweeps {
 public:
  TriangularSweeps(const R &routine, const char *label) : routine_(routine), label_(label) {}

  // Every order up to 40 in all 24 cases of side, uplo, transa and diag.
  void orders_up_to_40(bool has_memory, QtbInt step) const {
    Session session(label_, {});
    test::buffer_memory.is_out = !has_memory;
    int number = 0;
    for (QtbInt order = 1; order <= 40; order += step)
      for (int form = 0; form < 24; form++) {
        Problem p = problem(++number, form);
        const QtbInt other = Draw(p.seed).one_in(3) ? order : Draw(p.seed + 1).integer(1, 21);
        set_extents(p, order, other);
        if (!try_one(p, session)) break;
      }
    test::buffer_memory.is_out = false;
    EXPECT_EQ(test::buffer_memory.outstanding, 0);
  }
  void edges_of_blocks() const {
    Session session(label_, {});
    int number = 10000;
    for (const QtbInt order : triangle_edges)
      for (int side = 0; side < 2; side++)
        if (!try_edge(++number, side, order, 7, session)) return;
    for (const QtbInt other : other_edges)
      for (int side = 0; side < 2; side++)
        if (!try_edge(++number, side, 19, other, session)) return;
    for (const QtbInt order : large_triangles)
      if (is_long() || order == 513)
        for (int side = 0; side < 2; side++)
          if (!try_edge(++number, side, order, 5, session)) return;
  }
  // Rows from which on a solve from the right takes larger blocks.
  void many_rows() const {
    Session session(label_, {});
    int number = 20000;
    for (const QtbInt m : {1999, 2000, 2001})
      if (!try_edge(++number, 1, is_long() ? 260 : 36, m, session)) return;
  }
  void whole_numbers_are_exact() const {
    Session session(label_, {});
    for (int number = 0; number < times(300); ++number)
      if (!try_one(draw_problem(seed_of(routine_.name(), 200000 + number), Values::exact), session)) return;
  }

 private:
  // Side, uplo and transa in turn, both kinds of diagonal.
  Problem problem(int number, int form) const {
    Problem p = draw_problem(seed_of(routine_.name(), number), Values::rounding);
    Draw draw(p.seed);
    p.side = "LR"[form % 2], p.uplo = "UL"[form / 2 % 2], p.transa = "NTC"[form / 4 % 3], p.diag = "NU"[form / 12];
    p.alpha = draw.one_of(factors);
    return p;
  }
  static void set_extents(Problem &p, QtbInt order, QtbInt other) {
    p.m = p.side == 'L' ? order : other;
    p.n = p.side == 'L' ? other : order;
  }
  bool try_edge(int number, int side, QtbInt order, QtbInt other, Session &session) const {
    Problem p = problem(number, static_cast<int>(Draw(static_cast<std::uint64_t>(number)).bits() % 12) * 2 + side);
    set_extents(p, order, other);
    return try_one(p, session);
  }
  bool try_one(const Problem &p, Session &session) const {
    if (!session.start(p)) return false;
    run<T>(Shape<"trmm">(), routine_, p, session);
    return true;
  }

  R routine_;
  const char *label_;
};

// The tiers of this suite; the ones whose decisions hang on the processor alone where it has SSE4.1.
bool is_swept(int tier) { return test::has_sse41() ? tier == tier_ssse3 : tier >= tier_ssse3; }

template <class T, class Function>
void register_tiers(const char *name, Function *const (&procedures)[tier_count]) {
  test::in_every_tier([&](int tier) {
    if (!is_swept(tier)) return;
    static std::map<std::string, std::string> labels;  // outlive the tests
    const std::string label = std::string(name) + " " + test::tier_name(tier);
    labels[label] = label;
    const char *kept = labels[label].c_str();
    const Routine<Function> routine(name, calls::kind_of<T>(name), procedures[tier], procedures[tier]);
    const TriangularSweeps<T, Routine<Function>> sweeps(routine, kept);
    register_test("orders_up_to_40_lie_within_the_bound", kept, [=] { sweeps.orders_up_to_40(true, 1); });
    register_test("orders_up_to_40_do_without_memory", kept, [=] { sweeps.orders_up_to_40(false, is_long() ? 1 : 3); });
    register_test("edges_of_blocks_lie_within_the_bound", kept, [=] { sweeps.edges_of_blocks(); });
    register_test("many_rows_lie_within_the_bound", kept, [=] { sweeps.many_rows(); });
    register_test("results_in_whole_numbers_are_exact", kept, [=] { sweeps.whole_numbers_are_exact(); });
  });
}

}  // namespace
}  // namespace qtb::surface

int main(int argc, char **argv) {
  using namespace qtb;
  testing::InitGoogleTest(&argc, argv);
  test::become_processor();
#define QTB_REGISTER(name, T) surface::register_tiers<T, QTB_FUNCTION_TYPE(trmm, T)>(#name, QTB_ALL_TIERS(name));
  QTB_REGISTER(strmm, float)
  QTB_REGISTER(dtrmm, double)
  QTB_REGISTER(ctrmm, cfloat)
  QTB_REGISTER(ztrmm, cdouble)
  QTB_REGISTER(strsm, float)
  QTB_REGISTER(dtrsm, double)
  QTB_REGISTER(ctrsm, cfloat)
  QTB_REGISTER(ztrsm, cdouble)
#undef QTB_REGISTER
  std::signal(SIGSEGV, surface::on_trap);
  std::signal(SIGFPE, surface::on_trap);
  std::signal(SIGILL, surface::on_trap);
  const int result = RUN_ALL_TESTS();
  surface::report();
  return result;
}
