// One routine under test: makes its calls in chosen surroundings, judges what they leave behind, and counts.
#pragma once

#include <immintrin.h>
#include <pthread.h>

#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <map>
#include <string>

#include "tests/product/surface/operand.h"
#include "tests/product/surface/routine.h"

namespace qtb::surface {

using reference::Expectation;
using reference::Expected;
using reference::Outcome;
using test::magnitude;
using test::Quad;
using test::QuadComplex;

// ---- the report ----

struct Tally {
  long cases = 0;
  double worst = 0;  // error / bound
};
inline std::map<std::string, Tally> &tallies() {
  static std::map<std::string, Tally> all;
  return all;
}

// Where a failure goes: the problem, with the routine at its head, and what is wrong. Each program sets it.
inline void (*report_failure)(const char *problem, const char *what) = nullptr;

// What is being run, for the handler of a trap.
inline char current_problem[600];

// ---- the surroundings of a call ----

struct Surroundings {
  unsigned control = 0;   // MXCSR bits beyond the usual state: rounding, flush to zero
  std::size_t stack = 0;  // bytes of a stack of its own; 0 is the caller's

  bool rounds_to_nearest() const { return (control & _MM_ROUND_MASK) == _MM_ROUND_NEAREST; }
};

constexpr unsigned mxcsr_exceptions = 0x3F;
constexpr unsigned mxcsr_invalid = 0x01;

template <class F>
void on_own_stack(std::size_t bytes, F &call) {
  pthread_attr_t attributes;
  pthread_attr_init(&attributes);
  pthread_attr_setstacksize(&attributes, bytes);
  pthread_t thread;
  const auto body = [](void *f) -> void * {
    (*static_cast<F *>(f))();
    return nullptr;
  };
  if (pthread_create(&thread, &attributes, body, &call) != 0) std::abort();
  pthread_join(thread, nullptr);
  pthread_attr_destroy(&attributes);
}

// ---- the session ----

class Session {
 public:
  Session(const char *routine, Surroundings surroundings) : routine_(routine), surroundings_(surroundings) {}

  // Starts a problem. False once enough have failed.
  bool start(const Problem &problem) {
    problem_ = &problem;
    const int used = std::snprintf(current_problem, sizeof current_problem, "%s: ", routine_);
    problem.describe(current_problem + used, sizeof current_problem - static_cast<std::size_t>(used));
    ++tally().cases;
    return failures_ < 3;
  }
  bool exact() const { return problem_->values == Values::exact; }

  // Calls the routine with the surroundings set, and sees that it keeps them and takes no invalid operation: what it
  // may read is finite, and what it may not read is a signalling NaN. call(procedure) passes the arguments.
  template <class R, class... A, class Call>
  R call(const Routine<R(A...)> &routine, const Call &call) {
    const auto by_name = [&](A... arguments) { return routine.call(problem_->upper_name, arguments...); };
    if constexpr (std::is_void_v<R>) {
      run([&] { call(by_name); });
    } else {
      R result{};
      run([&] { result = call(by_name); });
      return result;
    }
  }

  // The array of the result against what the oracle expects, and every other byte of it against what it was.
  template <class T>
  void judge(const Operand<T> &out, const Expectation &expected) {
    double worst = 0;
    QtbInt worst_i = 0, worst_j = 0;
    const Layout &layout = expected.layout;
    for (QtbInt j = 0; j < layout.cols; ++j)
      for (QtbInt i = 0; i < layout.rows; ++i) {
        const Expected &want = expected.at(i, j);
        if (want.outcome == Outcome::unchanged) continue;
        const double ratio = this->ratio(want, reference::load(out.after(), layout.position(i, j)), expected);
        if (ratio > worst) worst = ratio, worst_i = i, worst_j = j;
      }
    const bool kept =
        out.unchanged_but([&](QtbInt i, QtbInt j) { return expected.at(i, j).outcome != Outcome::unchanged; });
    if (worst > limit())
      fail("error / bound %g at (%lld, %lld)", worst, static_cast<long long>(worst_i), static_cast<long long>(worst_j));
    if (!kept) fail("wrote what it must not");
    tally().worst = std::fmax(tally().worst, worst / limit());
  }

  // A result that is not an array, and a difference of type T that must vanish.
  template <class T>
  void judge_value(T got, QuadComplex want, double gauge, double roundings) {
    judge_one(got, {want, gauge, Outcome::value}, roundings);
  }
  template <class T>
  void judge_residual(Quad residual, double gauge, double roundings) {
    judge_one(T{}, {{residual, 0}, gauge, Outcome::residual}, roundings);
  }
  void require(bool holds, const char *what) {
    if (!holds) fail("%s", what);
  }

 private:
  Tally &tally() { return tallies()[routine_]; }

  // A rounding towards one side errs by up to twice as much.
  double limit() const { return surroundings_.rounds_to_nearest() ? 1 : 2; }

  template <class T>
  void judge_one(T got, const Expected &want, double roundings) {
    const double ratio = this->ratio(want, got, Expectation{{}, roundings, 1, {}});
    if (ratio > limit()) fail("error / bound %g of the result", ratio);
    tally().worst = std::fmax(tally().worst, ratio / limit());
  }
  template <class T>
  double ratio(const Expected &want, T got, const Expectation &e) const {
    constexpr double wrong = std::numeric_limits<double>::infinity();
    if constexpr (is_complex<T>)
      if (want.outcome == Outcome::real_value && got.im != 0) return wrong;
    if (want.outcome == Outcome::residual)
      return test::error_ratio(T{}, want.value, want.gauge, e.roundings, e.alpha_magnitude);
    if (exact()) {
      const QuadComplex g = test::widen(got);
      return g.re == want.value.re && g.im == want.value.im ? 0 : wrong;
    }
    return test::error_ratio(got, want.value, want.gauge, e.roundings, e.alpha_magnitude);
  }

  template <class F>
  void run(F call) {
    unsigned after = 0, set = 0;
    auto surrounded = [&] {
      const unsigned usual = _mm_getcsr();
      set = (usual & ~mxcsr_exceptions) | surroundings_.control;
      _mm_setcsr(set);
      call();
      after = _mm_getcsr();
      _mm_setcsr(usual);
    };
    surroundings_.stack == 0 ? surrounded() : on_own_stack(surroundings_.stack, surrounded);
    if ((after & ~mxcsr_exceptions) != set) fail("MXCSR was %#x and is %#x", set, after);
    if ((after & mxcsr_invalid) != 0) fail("an invalid operation on what it may not read");
  }

  [[gnu::format(printf, 2, 3)]] void fail(const char *format, ...) {
    char text[200];
    va_list values;
    va_start(values, format);
    std::vsnprintf(text, sizeof text, format, values);
    va_end(values);
    report_failure(current_problem, text);
    ++failures_;
  }

  const char *routine_;
  Surroundings surroundings_;
  const Problem *problem_ = nullptr;
  int failures_ = 0;
};

// ---- solves in whole numbers ----

// What an array holds now, as the expectation of a call.
template <class T>
Expectation solution(const Operand<T> &x) {
  Expectation e = reference::untouched(x.layout());
  for (QtbInt j = 0; j < e.layout.cols; ++j)
    for (QtbInt i = 0; i < e.layout.rows; ++i)
      e.element[static_cast<std::size_t>(i + j * e.layout.rows)] = {
          test::widen(reference::load(x.after(), e.layout.position(i, j))), 0, Outcome::value};
  return e;
}
// An exact value of the oracle as an element.
template <class T>
T narrow(QuadComplex v) {
  return scalar<T>({static_cast<double>(v.re), static_cast<double>(v.im)});
}

}  // namespace qtb::surface
