// A routine under test: the exported name in both cases, or the same routine of an independent library.
#pragma once

#include <complex>
#include <cstdint>
#include <type_traits>

#include "calls/shapes.h"

namespace qtb::surface {

using calls::Shape;
using calls::ShapeName;

// The same routine with 32-bit integers, a trailing underscore, hidden lengths behind the arguments and complex results
// as function values: the convention of the independent library.
template <class... A>
class Narrowed {
 public:
  explicit Narrowed(A... arguments) : passed_{pass(arguments)...} {}

  template <class R>
  R call(void *symbol) const {
    return call<R>(symbol, std::index_sequence_for<A...>());
  }

 private:
  using Length = std::size_t;
  const void *pass(const QtbInt *value) {
    integers_[used_] = static_cast<std::int32_t>(*value);
    return &integers_[used_++];
  }
  const void *pass(const void *argument) { return argument; }

  template <class R, std::size_t... i>
  R call(void *symbol, std::index_sequence<i...>) const {
    using Function = R (*)(std::conditional_t<true, const void *, A>..., Length, Length, Length, Length);
    return reinterpret_cast<Function>(symbol)(passed_[i]..., 1, 1, 1, 1);
  }

  std::int32_t integers_[sizeof...(A)] = {};
  std::size_t used_ = 0;
  const void *passed_[sizeof...(A)];
};

template <class Function>
class Routine;

template <class R, class... A>
class Routine<R(A...)> {
 public:
  using Pointer = R (*)(A...);

  Routine(const char *name, const calls::Kind &kind, Pointer lower, Pointer upper)
      : name_(name), kind_(kind), lower_(lower), upper_(upper) {}
  Routine(const char *name, const calls::Kind &kind, void *independent)
      : name_(name), kind_(kind), independent_(independent) {}

  const char *name() const { return name_; }
  bool is_independent() const { return independent_ != nullptr; }
  const calls::Kind &kind() const { return kind_; }

  R call(bool upper_name, A... arguments) const {
    if (independent_ == nullptr) return (upper_name ? upper_ : lower_)(arguments...);
    if constexpr (std::is_pointer_v<R>)
      return call_complex(arguments...);
    else
      return Narrowed<A...>(arguments...).template call<Value>(independent_);
  }

 private:
  // An index is a 32-bit integer there.
  using Value = std::conditional_t<std::is_same_v<R, QtbInt>, std::int32_t, R>;

  template <class T, class... Rest>
  R call_complex(T *result, Rest... arguments) const {
    const auto value = Narrowed<Rest...>(arguments...).template call<std::complex<Real<T>>>(independent_);
    *result = {value.real(), value.imag()};
    return result;
  }

  const char *name_;
  calls::Kind kind_;
  Pointer lower_ = nullptr, upper_ = nullptr;
  void *independent_ = nullptr;
};

}  // namespace qtb::surface
