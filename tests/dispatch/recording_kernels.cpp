// The recording procedures of every tier; see recording_kernels.h.

#include "tests/dispatch/recording_kernels.h"

namespace qtb::test {
namespace {

// A procedure that returns a pointer returns its first argument; one that returns a number gives recorded_result.
template <class Function>
struct Record;

template <class Result, class... Arguments>
struct Record<Result(Arguments...)> {
  static Result call(int slot, int tier, Arguments... arguments) {
    recorded_call = {slot, tier, sizeof...(arguments), {arguments...}};
    if constexpr (std::is_pointer_v<Result>)
      return static_cast<Result>(const_cast<void *>(recorded_call.arguments[0]));
    else if constexpr (!std::is_void_v<Result>)
      return static_cast<Result>(recorded_result(slot, tier));
  }
};

}  // namespace
}  // namespace qtb::test

extern "C" {
#define QTB_RECORDING(tier, TIER, name, shape, T)                                                                \
  QTB_FUNCTION(shape, T, qtb_blas_##tier##_x##name) {                                                            \
    return qtb::test::Record<QTB_FUNCTION_TYPE(shape, T)>::call(qtb::slot_##name, tier_##tier, QTB_ARGS(shape)); \
  }
#define QTB_SLOT(name, shape, T, tiers) QTB_FOR_EACH_TIER(QTB_RECORDING, name, shape, T)
#include "blas/dispatch/slots.def"
#undef QTB_SLOT
#undef QTB_RECORDING
}
