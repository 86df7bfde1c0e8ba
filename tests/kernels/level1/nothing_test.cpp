// Vectors of no elements: of all that a Level-1 or sparse routine is given it then reads the length alone, in every
// tier and by its public entry. A caller that has nothing may have no increments and no factors either.

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <type_traits>

#include "tests/support/guarded.h"
#include "tests/support/tiers.h"

// X(name, shape, type) once per routine that takes a length.
// clang-format off
#define QTB_FOR_EACH_VECTOR_ROUTINE(X)                                                                                \
  X(saxpy, axpy, float) X(daxpy, axpy, double) X(caxpy, axpy, cfloat) X(zaxpy, axpy, cdouble) X(scopy, copy, float)   \
  X(dcopy, copy, double) X(ccopy, copy, cfloat) X(zcopy, copy, cdouble) X(sswap, swap, float)                         \
  X(dswap, swap, double) X(cswap, swap, cfloat) X(zswap, swap, cdouble) X(sdot, dot, float) X(ddot, dot, double)      \
  X(cdotc, cdot, cfloat) X(cdotu, cdot, cfloat) X(zdotc, cdot, cdouble) X(zdotu, cdot, cdouble)                       \
  X(dsdot, dsdot, float) X(sdsdot, sdsdot, float) X(sscal, scal, float) X(dscal, scal, double)                        \
  X(cscal, scal, cfloat) X(zscal, scal, cdouble) X(csscal, real_scal, cfloat) X(zdscal, real_scal, cdouble)           \
  X(srot, rot, float) X(drot, rot, double) X(csrot, rot, cfloat) X(zdrot, rot, cdouble) X(srotm, rotm, float)         \
  X(drotm, rotm, double) X(snrm2, norm, float) X(dnrm2, norm, double) X(scnrm2, norm, cfloat)                         \
  X(dznrm2, norm, cdouble) X(sasum, norm, float) X(dasum, norm, double) X(scasum, norm, cfloat)                       \
  X(dzasum, norm, cdouble) X(isamax, search, float) X(idamax, search, double) X(icamax, search, cfloat)               \
  X(izamax, search, cdouble) X(isamin, search, float) X(idamin, search, double) X(icamin, search, cfloat)             \
  X(izamin, search, cdouble) X(saxpyi, axpyi, float) X(daxpyi, axpyi, double) X(caxpyi, axpyi, cfloat)                \
  X(zaxpyi, axpyi, cdouble) X(sdoti, doti, float) X(ddoti, doti, double) X(cdotci, cdoti, cfloat)                     \
  X(cdotui, cdoti, cfloat) X(zdotci, cdoti, cdouble) X(zdotui, cdoti, cdouble) X(sgthr, gthr, float)                  \
  X(dgthr, gthr, double) X(cgthr, gthr, cfloat) X(zgthr, gthr, cdouble) X(sgthrz, gthrz, float)                       \
  X(dgthrz, gthrz, double) X(cgthrz, gthrz, cfloat) X(zgthrz, gthrz, cdouble) X(ssctr, sctr, float)                   \
  X(dsctr, sctr, double) X(csctr, sctr, cfloat) X(zsctr, sctr, cdouble) X(sroti, roti, float)                         \
  X(droti, roti, double)
// clang-format on

#define QTB_DECLARE_ENTRY(name, shape, T) extern "C" QTB_FUNCTION(shape, T, name);
QTB_FOR_EACH_VECTOR_ROUTINE(QTB_DECLARE_ENTRY)

namespace qtb::test {
namespace {

// An address that traps, as any of the pointers that a routine takes.
struct Unreadable {
  const void *address;
  template <class T>
  operator T *() const {
    return static_cast<T *>(const_cast<void *>(address));
  }
};

template <class Argument>
Unreadable in_place_of(Unreadable nothing) {
  return nothing;
}

bool is_nothing(float v) { return v == 0 && !std::signbit(v); }
bool is_nothing(double v) { return v == 0 && !std::signbit(v); }
bool is_nothing(QtbInt v) { return v == 0; }
bool is_nothing(cfloat v) { return is_nothing(v.re) && is_nothing(v.im); }
bool is_nothing(cdouble v) { return is_nothing(v.re) && is_nothing(v.im); }

// Whether a routine of n elements reads no more, and its value, if it has one, is that of nothing.
template <class... Rest>
bool gives_nothing(void (*routine)(const QtbInt *, Rest...), QtbInt n, Unreadable nothing) {
  routine(&n, in_place_of<Rest>(nothing)...);
  return true;
}
template <class R, class... Rest>
bool gives_nothing(R (*routine)(const QtbInt *, Rest...), QtbInt n, Unreadable nothing) {
  return is_nothing(routine(&n, in_place_of<Rest>(nothing)...));
}
template <class T, class... Rest>
bool gives_nothing(T *(*routine)(T *, const QtbInt *, Rest...), QtbInt n, Unreadable nothing) {
  T result{1, 1};
  return routine(&result, &n, in_place_of<Rest>(nothing)...) == &result && is_nothing(result);
}
// sdsdot alone has a value without any element.
bool gives_nothing(std::type_identity_t<QTB_FUNCTION_TYPE(sdsdot, float)> *routine, QtbInt n, Unreadable nothing) {
  const float start = 2.5F;
  return routine(&n, &start, nothing, nothing, nothing, nothing) == start;
}

TEST(vectors_of_no_elements, have_only_their_length_read) {
  Guarded<unsigned char> page(0);
  page.unreadable();
  const Unreadable nothing{page.data()};
  for (const QtbInt n : {QtbInt{0}, QtbInt{-1}, (QtbInt{-1} << 62) - 1, std::numeric_limits<QtbInt>::min()}) {
    const auto check = [&](const char *routine, auto *entry, const auto &tiers) {
      EXPECT_TRUE(gives_nothing(entry, n, nothing)) << routine << " n " << n;
      in_every_tier([&](int tier) {
        EXPECT_TRUE(gives_nothing(tiers[tier], n, nothing)) << routine << ' ' << tier_name(tier) << " n " << n;
      });
    };
#define QTB_CHECK(routine, shape, T)                                                                     \
  {                                                                                                      \
    std::type_identity_t<QTB_FUNCTION_TYPE(shape, T)> *const tiers[tier_count] = QTB_ALL_TIERS(routine); \
    check(#routine, routine, tiers);                                                                     \
  }
    QTB_FOR_EACH_VECTOR_ROUTINE(QTB_CHECK)
#undef QTB_CHECK
  }
}

}  // namespace
}  // namespace qtb::test
