// The table of routines and the calls, one lambda per kind of argument list.

#include "bench/calls.h"

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <random>
#include <type_traits>

namespace qtb::bench {

const std::vector<Routine> routines = {
    {"sdot", "dot", 's', 2, 0, 2},      {"ddot", "dot", 'd', 2, 0, 2},      {"cdotu", "cdot", 'c', 2, 0, 8},
    {"cdotc", "cdot", 'c', 2, 0, 8},    {"zdotu", "cdot", 'z', 2, 0, 8},    {"zdotc", "cdot", 'z', 2, 0, 8},
    {"saxpy", "axpy", 's', 2, 1, 2},    {"daxpy", "axpy", 'd', 2, 1, 2},    {"caxpy", "axpy", 'c', 2, 1, 8},
    {"zaxpy", "axpy", 'z', 2, 1, 8},    {"scopy", "copy", 's', 1, 1, 0},    {"dcopy", "copy", 'd', 1, 1, 0},
    {"ccopy", "copy", 'c', 1, 1, 0},    {"zcopy", "copy", 'z', 1, 1, 0},    {"sswap", "swap", 's', 2, 2, 0},
    {"dswap", "swap", 'd', 2, 2, 0},    {"cswap", "swap", 'c', 2, 2, 0},    {"zswap", "swap", 'z', 2, 2, 0},
    {"sscal", "scal", 's', 1, 1, 1},    {"dscal", "scal", 'd', 1, 1, 1},    {"cscal", "scal", 'c', 1, 1, 6},
    {"zscal", "scal", 'z', 1, 1, 6},    {"csscal", "rscal", 'c', 1, 1, 2},  {"zdscal", "rscal", 'z', 1, 1, 2},
    {"srot", "rot", 's', 2, 2, 6},      {"drot", "rot", 'd', 2, 2, 6},      {"csrot", "rot", 'c', 2, 2, 12},
    {"zdrot", "rot", 'z', 2, 2, 12},    {"srotm", "rotm", 's', 2, 2, 6},    {"drotm", "rotm", 'd', 2, 2, 6},
    {"sasum", "norm", 's', 1, 0, 1},    {"dasum", "norm", 'd', 1, 0, 1},    {"scasum", "norm", 'c', 1, 0, 2},
    {"dzasum", "norm", 'z', 1, 0, 2},   {"snrm2", "norm", 's', 1, 0, 2},    {"dnrm2", "norm", 'd', 1, 0, 2},
    {"scnrm2", "norm", 'c', 1, 0, 4},   {"dznrm2", "norm", 'z', 1, 0, 4},   {"isamax", "search", 's', 1, 0, 1},
    {"idamax", "search", 'd', 1, 0, 1}, {"icamax", "search", 'c', 1, 0, 2}, {"izamax", "search", 'z', 1, 0, 2},
    {"isamin", "search", 's', 1, 0, 1}, {"idamin", "search", 'd', 1, 0, 1}, {"icamin", "search", 'c', 1, 0, 2},
    {"izamin", "search", 'z', 1, 0, 2}, {"dsdot", "dsdot", 's', 2, 0, 2},   {"sdsdot", "sdsdot", 's', 2, 0, 2},
    {"srotg", "rotg", 's', 0, 0, 8},    {"drotg", "rotg", 'd', 0, 0, 8},    {"crotg", "rotg", 'c', 0, 0, 20},
    {"zrotg", "rotg", 'z', 0, 0, 20},   {"srotmg", "rotmg", 's', 0, 0, 12}, {"drotmg", "rotmg", 'd', 0, 0, 12},
    {"saxpyi", "axpyi", 's', 2, 1, 2},  {"daxpyi", "axpyi", 'd', 2, 1, 2},  {"caxpyi", "axpyi", 'c', 2, 1, 8},
    {"zaxpyi", "axpyi", 'z', 2, 1, 8},  {"sdoti", "doti", 's', 2, 0, 2},    {"ddoti", "doti", 'd', 2, 0, 2},
    {"cdotci", "cdoti", 'c', 2, 0, 8},  {"cdotui", "cdoti", 'c', 2, 0, 8},  {"zdotci", "cdoti", 'z', 2, 0, 8},
    {"zdotui", "cdoti", 'z', 2, 0, 8},  {"sgthr", "gthr", 's', 1, 1, 0},    {"dgthr", "gthr", 'd', 1, 1, 0},
    {"cgthr", "gthr", 'c', 1, 1, 0},    {"zgthr", "gthr", 'z', 1, 1, 0},    {"sgthrz", "gthr", 's', 1, 2, 0},
    {"dgthrz", "gthr", 'd', 1, 2, 0},   {"cgthrz", "gthr", 'c', 1, 2, 0},   {"zgthrz", "gthr", 'z', 1, 2, 0},
    {"ssctr", "sctr", 's', 1, 1, 0},    {"dsctr", "sctr", 'd', 1, 1, 0},    {"csctr", "sctr", 'c', 1, 1, 0},
    {"zsctr", "sctr", 'z', 1, 1, 0},    {"sroti", "roti", 's', 2, 2, 6},    {"droti", "roti", 'd', 2, 2, 6},
};

std::size_t type_bytes(char type) {
  switch (type) {
    case 's': return 4;
    case 'z': return 16;
    default: return 8;
  }
}

namespace {

double sink;  // keeps results alive

// The calls of one routine of one library on the operands, with integers of type I and real parts of type R. Scalars
// keep values bounded over any number of calls: -1 for scal, a rotation for rot, a small alpha for axpy.
template <class I, class R>
Calls make_calls(const Routine &routine, void *function, long size, long increment, Operands &operands) {
  const I n = static_cast<I>(size), inc = static_cast<I>(increment);
  R *x = reinterpret_cast<R *>(operands.x.get()), *y = reinterpret_cast<R *>(operands.y.get());
  const std::string kind = routine.kind;
  if (kind == "dot") {
    auto *f = reinterpret_cast<R (*)(const I *, const R *, const I *, const R *, const I *)>(function);
    return [=](long count) {
      for (long i = 0; i < count; ++i) sink = static_cast<double>(f(&n, x, &inc, y, &inc));
    };
  }
  if (kind == "axpy") {
    auto *f = reinterpret_cast<void (*)(const I *, const R *, const R *, const I *, R *, const I *)>(function);
    return [=](long count) {
      const R alpha[2] = {R(1e-6), R(1e-6)};
      for (long i = 0; i < count; ++i) f(&n, alpha, x, &inc, y, &inc);
    };
  }
  if (kind == "copy" || kind == "swap") {
    auto *f = reinterpret_cast<void (*)(const I *, R *, const I *, R *, const I *)>(function);
    return [=](long count) {
      for (long i = 0; i < count; ++i) f(&n, x, &inc, y, &inc);
    };
  }
  if (kind == "scal" || kind == "rscal") {
    auto *f = reinterpret_cast<void (*)(const I *, const R *, R *, const I *)>(function);
    return [=](long count) {
      const R alpha[2] = {R(-1), R(0)};
      for (long i = 0; i < count; ++i) f(&n, alpha, x, &inc);
    };
  }
  if (kind == "rot") {
    auto *f = reinterpret_cast<void (*)(const I *, R *, const I *, R *, const I *, const R *, const R *)>(function);
    return [=](long count) {
      const R c = R(0.6), s = R(0.8);
      for (long i = 0; i < count; ++i) f(&n, x, &inc, y, &inc, &c, &s);
    };
  }
  if (kind == "rotm") {
    auto *f = reinterpret_cast<void (*)(const I *, R *, const I *, R *, const I *, const R *)>(function);
    return [=](long count) {
      const R param[5] = {R(-1), R(0.6), R(-0.8), R(0.8), R(0.6)};
      for (long i = 0; i < count; ++i) f(&n, x, &inc, y, &inc, param);
    };
  }
  if (kind == "norm") {
    auto *f = reinterpret_cast<R (*)(const I *, const R *, const I *)>(function);
    return [=](long count) {
      for (long i = 0; i < count; ++i) sink = static_cast<double>(f(&n, x, &inc));
    };
  }
  if (kind == "search") {
    auto *f = reinterpret_cast<I (*)(const I *, const R *, const I *)>(function);
    return [=](long count) {
      for (long i = 0; i < count; ++i) sink = static_cast<double>(f(&n, x, &inc));
    };
  }
  if (kind == "dsdot" || kind == "sdsdot") {
    const R sb = R(1);
    if (kind == "sdsdot") {
      auto *f = reinterpret_cast<R (*)(const I *, const R *, const R *, const I *, const R *, const I *)>(function);
      return [=](long count) {
        for (long i = 0; i < count; ++i) sink = static_cast<double>(f(&n, &sb, x, &inc, y, &inc));
      };
    }
    auto *f = reinterpret_cast<double (*)(const I *, const R *, const I *, const R *, const I *)>(function);
    return [=](long count) {
      for (long i = 0; i < count; ++i) sink = f(&n, x, &inc, y, &inc);
    };
  }
  if (kind == "rotg") {
    auto *f = reinterpret_cast<void (*)(R *, R *, R *, R *)>(function);
    return [=](long count) {
      for (long i = 0; i < count; ++i) {
        R a[2] = {R(3), R(1)}, b[2] = {R(4), R(2)}, c[2] = {}, s[2] = {};
        f(a, b, c, s);
        sink = static_cast<double>(c[0]);
      }
    };
  }
  if (kind == "rotmg") {
    auto *f = reinterpret_cast<void (*)(R *, R *, R *, const R *, R *)>(function);
    return [=](long count) {
      for (long i = 0; i < count; ++i) {
        R d1 = R(2), d2 = R(3), x1 = R(1.5), param[5];
        const R y1 = R(0.5);
        f(&d1, &d2, &x1, &y1, param);
        sink = static_cast<double>(d1);
      }
    };
  }
  const I *index = reinterpret_cast<const I *>(operands.index.data());
  if (kind == "axpyi") {
    auto *f = reinterpret_cast<void (*)(const I *, const R *, const R *, const I *, R *)>(function);
    return [=](long count) {
      const R alpha[2] = {R(1e-6), R(1e-6)};
      for (long i = 0; i < count; ++i) f(&n, alpha, x, index, y);
    };
  }
  if (kind == "doti") {
    auto *f = reinterpret_cast<R (*)(const I *, const R *, const I *, const R *)>(function);
    return [=](long count) {
      for (long i = 0; i < count; ++i) sink = static_cast<double>(f(&n, x, index, y));
    };
  }
  if (kind == "cdoti") {
    auto *f = reinterpret_cast<R *(*)(R *, const I *, const R *, const I *, const R *)>(function);
    return [=](long count) {
      R result[2] = {};
      for (long i = 0; i < count; ++i) f(result, &n, x, index, y);
      sink = static_cast<double>(result[0]);
    };
  }
  if (kind == "gthr") {
    auto *f = reinterpret_cast<void (*)(const I *, R *, R *, const I *)>(function);
    return [=](long count) {
      for (long i = 0; i < count; ++i) f(&n, y, x, index);
    };
  }
  if (kind == "sctr") {
    auto *f = reinterpret_cast<void (*)(const I *, const R *, const I *, R *)>(function);
    return [=](long count) {
      for (long i = 0; i < count; ++i) f(&n, x, index, y);
    };
  }
  if (kind == "roti") {
    auto *f = reinterpret_cast<void (*)(const I *, R *, const I *, R *, const R *, const R *)>(function);
    return [=](long count) {
      const R c = R(0.6), s = R(0.8);
      for (long i = 0; i < count; ++i) f(&n, x, index, y, &c, &s);
    };
  }
  return {};
}

// A complex dot: this library takes a pointer to the result first; the peer's convention returns the element in
// registers, as the C compiler returns a complex number.
template <class R>
Calls make_complex_dot(const Library &library, void *function, long size, long increment, Operands &operands) {
  R *x = reinterpret_cast<R *>(operands.x.get()), *y = reinterpret_cast<R *>(operands.y.get());
  if (library.wide) {
    auto *f = reinterpret_cast<void *(*)(R *, const std::int64_t *, const R *, const std::int64_t *, const R *,
                                         const std::int64_t *)>(function);
    return [=, n = std::int64_t{size}, inc = std::int64_t{increment}](long count) {
      R result[2] = {};
      for (long i = 0; i < count; ++i) f(result, &n, x, &inc, y, &inc);
      sink = static_cast<double>(result[0]);
    };
  }
  using C = _Complex float;
  using Z = _Complex double;
  using Result = std::conditional_t<sizeof(R) == 4, C, Z>;
  auto *f = reinterpret_cast<Result (*)(const std::int32_t *, const R *, const std::int32_t *, const R *,
                                        const std::int32_t *)>(function);
  return [=, n = static_cast<std::int32_t>(size), inc = static_cast<std::int32_t>(increment)](long count) {
    for (long i = 0; i < count; ++i) sink = static_cast<double>(__real__ f(&n, x, &inc, y, &inc));
  };
}

}  // namespace

Calls bind(const Library &library, const Routine &routine, long n, long increment, Operands &operands) {
  void *function = library.find(routine.name);
  if (function == nullptr) return {};
  const bool single = routine.is_single();
  if (std::strcmp(routine.kind, "cdot") == 0)
    return single ? make_complex_dot<float>(library, function, n, increment, operands)
                  : make_complex_dot<double>(library, function, n, increment, operands);
  if (library.wide)
    return single ? make_calls<std::int64_t, float>(routine, function, n, increment, operands)
                  : make_calls<std::int64_t, double>(routine, function, n, increment, operands);
  return single ? make_calls<std::int32_t, float>(routine, function, n, increment, operands)
                : make_calls<std::int32_t, double>(routine, function, n, increment, operands);
}

bool Routine::is_single() const { return type == 's' || type == 'c'; }

double call_flops(const Routine &routine, long n) { return routine.flops * static_cast<double>(n); }

double call_bytes(const Routine &routine, long n) {
  const double bytes = static_cast<double>(n) * static_cast<double>(type_bytes(routine.type));
  return bytes * (routine.read + routine.written);
}

Operands make_operands(const Routine &routine, long n, long increment) {
  const std::size_t elements = static_cast<std::size_t>(n * increment);
  const std::size_t bytes = elements * type_bytes(routine.type);
  Operands operands;
  for (auto *p : {&operands.x, &operands.y}) {
    *p = allocate(bytes);
    if (routine.is_single())
      fill<float>(p->get(), bytes);
    else
      fill<double>(p->get(), bytes);
  }
  // Positions of a sparse vector: all of y once, in a fixed random order within blocks that stay in cache.
  operands.index.resize(static_cast<std::size_t>(n));
  for (std::size_t i = 0; i < operands.index.size(); ++i) operands.index[i] = static_cast<long>(i) + 1;
  std::mt19937 random(54321);
  constexpr std::ptrdiff_t block = 256;
  for (auto first = operands.index.begin(); first < operands.index.end();) {
    const auto last = first + std::min<std::ptrdiff_t>(block, operands.index.end() - first);
    std::shuffle(first, last, random);
    first = last;
  }
  return operands;
}

}  // namespace qtb::bench
