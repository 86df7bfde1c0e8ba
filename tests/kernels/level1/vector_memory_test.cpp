// The basic vector kernels touch nothing but their operands: arrays flush against trapping pages, inputs that cannot be
// written, operands that must not even be read.

#include <memory>

#include "tests/kernels/level1/vector_routines.h"
#include "tests/support/guarded.h"
#include "tests/support/stepped.h"

namespace qtb::test {
namespace {

constexpr QtbInt longest_pass = 64;               // elements per pass of the widest kernels
constexpr QtbInt longest = 4 * longest_pass + 3;  // four passes, and every way to end
constexpr std::size_t room = 3 * (longest + 1);   // elements, for increments up to 3

// n elements that end, or begin, at a trapping page.
template <class T>
T *flush_in(Guarded<T> &array, QtbInt n, QtbInt inc, bool at_back) {
  const QtbInt length = n > 0 ? (n - 1) * (inc < 0 ? -inc : inc) + 1 : 0;
  return at_back ? array.data() + (static_cast<QtbInt>(array.size()) - length) : array.data();
}

// An array whose first and last bytes both touch a trapping page.
template <class T>
std::size_t whole_pages() {
  const std::size_t page = static_cast<std::size_t>(sysconf(_SC_PAGESIZE));
  return (room * sizeof(T) + page - 1) / page * page / sizeof(T);
}

template <class T>
void fill(Guarded<T> &array, std::uint64_t seed) {
  const std::vector<T> values = random_values<T>(array.size(), seed);
  std::memcpy(array.data(), values.data(), values.size() * sizeof(T));
}

constexpr QtbInt increments[][2] = {{1, 1}, {-1, -1}, {1, -1}, {2, 1}, {1, 3}, {-2, 3}, {0, 2}, {2, 0}};

TEST(VectorMemory, elementwise_kernels_stay_between_trapping_pages) {
  Tally tally;
  for_each_elementwise([&]<class T>(const Elementwise<T> &routine) {
    Guarded<T> x(whole_pages<T>()), y(whole_pages<T>());
    fill(x, 1);
    fill(y, 2);
    if (!routine.stores_x) x.read_only();
    for_each_tier([&](int tier) {
      for (QtbInt n = 0; n <= longest; ++n)
        for (const auto &[incx, incy] : increments)
          for (int ends = 0; ends < 4; ++ends) {
            routine.call(tier, n, flush_in(x, n, incx, ends & 1), incx, flush_in(y, n, incy, ends & 2), incy);
            tally.count(tier);
          }
    });
  });
}

TEST(VectorMemory, dots_stay_between_trapping_pages_and_only_read) {
  Tally tally;
  for_each_dot([&]<class T>(const Dot<T> &routine) {
    Guarded<T> x(whole_pages<T>()), y(whole_pages<T>());
    fill(x, 3);
    fill(y, 4);
    x.read_only();
    y.read_only();
    for_each_tier([&](int tier) {
      for (QtbInt n = 0; n <= longest; ++n)
        for (const auto &[incx, incy] : increments)
          for (int ends = 0; ends < 4; ++ends) {
            routine.call(tier, n, flush_in(x, n, incx, ends & 1), incx, flush_in(y, n, incy, ends & 2), incy);
            tally.count(tier);
          }
    });
  });
}

// One operand flush, and the other at each phase, so that every treatment of different phases meets the page.
TEST(VectorMemory, operands_of_different_phases_stay_between_trapping_pages) {
  Tally tally;
  const auto at_phases = [&]<class T>(auto &&call, Guarded<T> &flush, Guarded<T> &other) {
    for (QtbInt n = 0; n <= longest; n += n < 40 ? 1 : 13)
      for (QtbInt bytes = 0; bytes < 16; ++bytes)
        for (const bool at_back : {false, true}) {
          unsigned char *base = reinterpret_cast<unsigned char *>(other.data());
          call(n, flush_in(flush, n, 1, at_back), reinterpret_cast<T *>(base + bytes));
        }
  };
  for_each_elementwise([&]<class T>(const Elementwise<T> &routine) {
    Guarded<T> x(whole_pages<T>()), y(whole_pages<T>());
    fill(x, 5);
    fill(y, 6);
    for_each_tier([&](int tier) {
      at_phases([&](QtbInt n, T *a, T *b) { routine.call(tier, n, a, 1, b, 1), tally.count(tier); }, x, y);
      at_phases([&](QtbInt n, T *a, T *b) { routine.call(tier, n, b, 1, a, 1), tally.count(tier); }, y, x);
    });
  });
  for_each_dot([&]<class T>(const Dot<T> &routine) {
    Guarded<T> x(whole_pages<T>()), y(whole_pages<T>());
    fill(x, 7);
    fill(y, 8);
    for_each_tier([&](int tier) {
      at_phases([&](QtbInt n, T *a, T *b) { routine.call(tier, n, a, 1, b, 1), tally.count(tier); }, x, y);
      at_phases([&](QtbInt n, T *a, T *b) { routine.call(tier, n, b, 1, a, 1), tally.count(tier); }, y, x);
    });
  });
}

// An operand that ends with its heap block. A read behind it within the same 16 bytes meets no page, but the address
// sanitizer's red zone: this test is for builds that have one.
template <class T>
class HeapOperand {
 public:
  HeapOperand(QtbInt n, int phase)
      : block_(std::make_unique<unsigned char[]>(static_cast<std::size_t>(n) * sizeof(T) + phase)), phase_(phase) {}
  T *data() { return reinterpret_cast<T *>(block_.get() + phase_); }

 private:
  std::unique_ptr<unsigned char[]> block_;
  int phase_;
};

TEST(VectorMemory, operands_that_end_with_their_heap_block_are_not_left) {
  Tally tally;
  const auto at_phases = [&]<class T>(const auto &routine, T) {
    for (QtbInt n = 0; n <= longest; n += n < 40 ? 1 : 13)
      for (int phase_x = 0; phase_x < 16; phase_x += 2)
        for (int phase_y = 0; phase_y < 16; phase_y += 2) {
          HeapOperand<T> x(n, phase_x), y(n, phase_y);
          for_each_tier([&](int tier) {
            routine.call(tier, n, x.data(), 1, y.data(), 1);
            tally.count(tier);
          });
        }
  };
  for_each_elementwise([&]<class T>(const Elementwise<T> &routine) { at_phases(routine, T{}); });
  for_each_dot([&]<class T>(const Dot<T> &routine) { at_phases(routine, T{}); });
}

// The same without a sanitizer: no instruction brings anything from beside an operand into a register.
constexpr std::size_t words_beside = 8;

// n elements so many bytes above a vector boundary, with the forbidden pattern before and behind them.
template <class T>
class Surrounded {
 public:
  Surrounded(QtbInt n, int phase, std::uint64_t seed)
      : words_(static_cast<std::size_t>(n) * sizeof(T) / sizeof(std::uint32_t) + 3 * words_beside, forbidden_pattern) {
    unsigned char *first = reinterpret_cast<unsigned char *>(words_.data() + words_beside);
    first += (16 - reinterpret_cast<std::uintptr_t>(first) % 16) % 16 + static_cast<std::uintptr_t>(phase);
    data_ = reinterpret_cast<T *>(first);
    const std::vector<T> values = random_values<T>(static_cast<std::size_t>(n), seed);
    std::memcpy(first, values.data(), values.size() * sizeof(T));
  }
  T *data() { return data_; }

 private:
  std::vector<std::uint32_t> words_;
  T *data_;
};

template <class T>
T one_behind(const T *p, QtbInt n) {
  volatile T sum = 0;
  for (QtbInt i = 0; i <= n; ++i) sum = sum + p[i];
  return sum;
}

TEST(VectorMemory, a_read_of_one_element_too_many_is_seen_by_stepping_through_it) {
  Surrounded<float> single(5, 4, 1);
  Surrounded<double> wide(5, 8, 1);
  EXPECT_FALSE(step_through([&] { one_behind(single.data(), 4); }).read_forbidden);
  EXPECT_TRUE(step_through([&] { one_behind(single.data(), 5); }).read_forbidden);
  EXPECT_FALSE(step_through([&] { one_behind(wide.data(), 4); }).read_forbidden);
  EXPECT_TRUE(step_through([&] { one_behind(wide.data(), 5); }).read_forbidden);
}

TEST(VectorMemory, nothing_beside_an_operand_is_brought_into_a_register) {
#if defined(QTB_WATCHED)
  GTEST_SKIP() << "every load is watched in this build";
#endif
  Tally tally;
  long steps = 0;
  const auto at_phases = [&]<class T>(const auto &routine, T) {
    for (const QtbInt n : {1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 13, 35})
      for (const auto &[phase_x, phase_y] : {std::pair{0, 0}, {4, 0}, {8, 0}, {12, 0}, {0, 8}, {4, 12}}) {
        Surrounded<T> x(n, phase_x, 1), y(n, phase_y, 2);
        for_each_tier([&](int tier) {
          const Stepped stepped = step_through([&] { routine.call(tier, n, x.data(), 1, y.data(), 1); });
          ASSERT_FALSE(stepped.read_forbidden)
              << routine.name << ' ' << tier_name(tier) << " n " << n << " phases " << phase_x << ' ' << phase_y;
          steps += stepped.steps;
          tally.count(tier);
        });
      }
  };
  for_each_elementwise([&]<class T>(const Elementwise<T> &routine) { at_phases(routine, T{}); });
  for_each_dot([&]<class T>(const Dot<T> &routine) { at_phases(routine, T{}); });
  std::cout << "instructions: " << steps << '\n';
}

TEST(VectorMemory, no_operand_is_touched_for_lengths_below_one) {
  for_each_elementwise([&]<class T>(const Elementwise<T> &routine) {
    for_each_tier([&](int tier) {
      for (const QtbInt n : {QtbInt{0}, QtbInt{-1}, QtbInt{-1} << 62})
        for (const QtbInt inc : {1, -1, 0, 2}) routine.call(tier, n, nullptr, inc, nullptr, inc);
    });
  });
  for_each_dot([&]<class T>(const Dot<T> &routine) {
    for_each_tier([&](int tier) {
      for (const QtbInt n : {QtbInt{0}, QtbInt{-1}, QtbInt{-1} << 62})
        for (const QtbInt inc : {1, -1, 0, 2}) {
          const T zero{};
          EXPECT_TRUE(same_bits(routine.call(tier, n, nullptr, inc, nullptr, inc), zero))
              << routine.name << ' ' << tier_name(tier);
        }
    });
  });
}

template <class T>
void expect_untouched(const char *name, Tiers<QTB_FUNCTION_TYPE(axpy, T)> &procedures, T alpha) {
  for_each_tier([&](int tier) {
    for (const QtbInt inc : {1, -1, 0, 2}) {
      const QtbInt n = 40;
      SCOPED_TRACE(std::string(name) + ' ' + tier_name(tier));
      procedures[tier](&n, &alpha, nullptr, &inc, nullptr, &inc);
    }
  });
}

TEST(VectorMemory, axpy_with_a_zero_alpha_touches_neither_operand) {
  expect_untouched<float>("saxpy", saxpy_tiers, 0.0f);
  expect_untouched<float>("saxpy", saxpy_tiers, -0.0f);
  expect_untouched<double>("daxpy", daxpy_tiers, 0.0);
  expect_untouched<double>("daxpy", daxpy_tiers, -0.0);
  expect_untouched<cfloat>("caxpy", caxpy_tiers, {0.0f, -0.0f});
  expect_untouched<cfloat>("caxpy", caxpy_tiers, {-0.0f, 0.0f});
  expect_untouched<cdouble>("zaxpy", zaxpy_tiers, {0.0, -0.0});
  expect_untouched<cdouble>("zaxpy", zaxpy_tiers, {-0.0, 0.0});
}

}  // namespace
}  // namespace qtb::test
