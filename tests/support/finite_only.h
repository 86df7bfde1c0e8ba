// Floating-point exceptions that end a test.
#pragma once

#include <fenv.h>

namespace qtb::test {

// What a lane that nobody wants may raise: no result that is finite and normal needs any of it.
constexpr int spurious_exceptions = FE_INVALID | FE_DIVBYZERO | FE_OVERFLOW | FE_UNDERFLOW;
// The same for data whose own products leave the range.
constexpr int exceptions_beyond_range = FE_INVALID | FE_DIVBYZERO;

// While one of these lives, each of the exceptions is a SIGFPE.
class FiniteOnly {
 public:
  explicit FiniteOnly(int exceptions = spurious_exceptions) : exceptions_(exceptions) {
    feclearexcept(FE_ALL_EXCEPT);
    feenableexcept(exceptions_);
  }
  ~FiniteOnly() {
    fedisableexcept(exceptions_);
    feclearexcept(FE_ALL_EXCEPT);
  }
  FiniteOnly(const FiniteOnly &) = delete;
  FiniteOnly &operator=(const FiniteOnly &) = delete;

 private:
  int exceptions_;
};

}  // namespace qtb::test
