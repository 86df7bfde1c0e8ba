// The public header: every prototype has the shape that the library's own list gives the routine.

#include <gtest/gtest.h>

#include <type_traits>

#include "blas/shapes.h"
#include "include/qtb.h"

namespace {

// A public type as the library's own sources name it.
template <class T>
struct Inner {
  using Type = T;
};
template <class T>
struct Inner<std::complex<T>> {
  using Type = Complex<T>;
};
template <class T>
struct Inner<const T> {
  using Type = const typename Inner<T>::Type;
};
template <class T>
struct Inner<T *> {
  using Type = typename Inner<T>::Type *;
};
template <class Result, class... Parameters>
struct Inner<Result(Parameters...)> {
  using Type = typename Inner<Result>::Type(typename Inner<Parameters>::Type...);
};

static_assert(std::is_same_v<Inner<const QtbDoubleComplex *>::Type, const cdouble *>);
static_assert(sizeof(QtbFloatComplex) == sizeof(cfloat) && sizeof(QtbDoubleComplex) == sizeof(cdouble));
static_assert(std::is_same_v<QtbInt, std::int64_t>);

#define QTB_ROUTINE(name, NAME, shape, T, route)                                                    \
  static_assert(std::is_same_v<Inner<decltype(::name)>::Type, QTB_FUNCTION_TYPE(shape, T)>, #name); \
  static_assert(std::is_same_v<decltype(::NAME), decltype(::name)>, #NAME);
#include "blas/routines.def"
#undef QTB_ROUTINE

static_assert(std::is_same_v<decltype(::lsame), std::int64_t(const char *, const char *)>);
static_assert(std::is_same_v<decltype(::LSAME), decltype(::lsame)>);
static_assert(std::is_same_v<decltype(::xerbla), int(const char *, const QtbInt *, std::int32_t)>);
static_assert(std::is_same_v<decltype(::XERBLA), decltype(::xerbla)>);
static_assert(std::is_same_v<decltype(::QTBGetVersionString), void(char *, std::int32_t)>);

TEST(Header, declares_every_routine_in_the_shape_of_the_list) {
  int routines = 0;
#define QTB_ROUTINE(name, NAME, shape, T, route) ++routines;
#include "blas/routines.def"
#undef QTB_ROUTINE
  EXPECT_EQ(routines + 2, 177);
}

}  // namespace
