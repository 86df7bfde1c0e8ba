// A traced call: the routine of the library behind this one, timed.
#pragma once

#include "include/qtb/cblas.h"
#include "tools/trace/record.h"

namespace qtb::trace {

// A name of this library and the procedure of that name in the library behind it, found at the first call.
struct Target {
  const char *name;
  std::atomic<void *> procedure{nullptr};
};

// The procedure of a target. Ends the process with a message where no library has it.
void *find_target(Target &target);

// Whether integers of names without a suffix have 64 bits: as told by QTB_TRACE_INTEGERS, or where the file's name of
// the library behind has a 64. Known from the first find_target on.
extern std::atomic<bool> integers_have_64_bits;

// What a face's integers are.
template <Face face>
bool is_wide() {
  return face >= fortran_64 || integers_have_64_bits.load(std::memory_order_relaxed);
}

// ---- what a call does, from its arguments ----

// An argument that a routine does not have: stands behind the names of those that it has.
struct None {};

// Integers are declared with 64 bits, which hands on those of 32 as they came: in the lower half of a register or of a
// place on the stack. The reader alone has to know which half counts.
template <Face face>
struct Reader {
  static std::int32_t size(None) { return CallShape::absent; }
  static std::int32_t size(const QtbInt *value) {
    std::int64_t wide;
    std::int32_t narrow;
    if (!is_wide<face>()) return __builtin_memcpy(&narrow, value, sizeof narrow), narrow;
    __builtin_memcpy(&wide, value, sizeof wide);
    return clipped(wide);
  }
  static std::int32_t size(QtbInt value) { return is_wide<face>() ? clipped(value) : static_cast<std::int32_t>(value); }
  // The one of two that the routine has.
  static std::int32_t size(None, const auto &other) { return size(other); }
  static std::int32_t size(const auto &one, None) { return size(one); }
  static std::int32_t size(None, None) { return CallShape::absent; }

  static char letter(None) { return '\0'; }
  static char letter(const char *option) { return static_cast<char>(*option & ~('a' ^ 'A')); }
  template <class Option>
  requires std::is_enum_v<Option>
  static char letter(Option option) {
    switch (static_cast<int>(option)) {
      case CblasNoTrans:
      case CblasNonUnit: return 'N';
      case CblasTrans: return 'T';
      case CblasConjTrans: return 'C';
      case CblasUpper:
      case CblasUnit: return 'U';
      case CblasLower:
      case CblasLeft: return 'L';
      case CblasRight: return 'R';
      default: return '?';
    }
  }
  static char letter(None, const auto &other) { return letter(other); }
  static char letter(const auto &one, None) { return letter(one); }
  static char letter(None, None) { return '\0'; }

 private:
  static std::int32_t clipped(std::int64_t value) {
    return static_cast<std::int32_t>(value > INT32_MAX ? INT32_MAX : value < -1 ? -1 : value);
  }
};

// ---- the call ----

// Counts what the calls below it take as theirs.
class Timed {
 public:
  explicit Timed(std::uintptr_t frame) {
    this_thread.frame = frame;
    this_thread.team = 1;
    begin_ = __rdtsc();
  }
  void end(Table *table, RoutineNumber routine, Face face, const CallShape &shape) const {
    const std::uint64_t ticks = __rdtsc() - begin_;
    this_thread.frame = 0;
    if (table != nullptr) record(*table, Key::of(routine, face, this_thread.team, shape), ticks);
  }

 private:
  std::uint64_t begin_;
};

// Fortran passes the lengths of character arguments behind the last one; they are 1.
template <class R, class... A>
R call_procedure(void *procedure, A... arguments) {
  constexpr int characters = (0 + ... + (std::is_same_v<A, const char *> ? 1 : 0));
  if constexpr (characters == 0) {
    return reinterpret_cast<R (*)(A...)>(procedure)(arguments...);
  } else {
    constexpr std::size_t one = 1;
    using Procedure = R (*)(A..., std::size_t, std::size_t, std::size_t, std::size_t);
    return reinterpret_cast<Procedure>(procedure)(arguments..., one, one, one, one);
  }
}

// Calls the target; shape() tells what the call does. It is asked ahead of the call, which may change its arguments.
template <class R, Face face, class Shape, class... A>
R forward(Target &target, RoutineNumber routine, const Shape &shape, A... arguments) {
  void *procedure = target.procedure.load(std::memory_order_acquire);
  if (procedure == nullptr) [[unlikely]]
    procedure = find_target(target);
  const auto frame = reinterpret_cast<std::uintptr_t>(__builtin_frame_address(0));
  if (frame < this_thread.frame) return call_procedure<R>(procedure, arguments...);
  Table *const table = this_thread.table != nullptr ? this_thread.table : take_table();
  const CallShape what = shape();
  const Timed timed(frame);
  if constexpr (std::is_void_v<R>) {
    call_procedure<R>(procedure, arguments...);
    timed.end(table, routine, face, what);
  } else {
    const R result = call_procedure<R>(procedure, arguments...);
    timed.end(table, routine, face, what);
    return result;
  }
}

}  // namespace qtb::trace

// Behind the parameters of a routine, whichever it has.
namespace qtb::trace::absent {
inline constexpr None side, uplo, trans, transa, transb, diag, m, n, k, kl, ku;
}  // namespace qtb::trace::absent

// What the arguments of the enclosing function tell. A name that is none of them is found in qtb::trace::absent.
#define QTB_CALL_SHAPE(face)                                                                            \
  [&] {                                                                                                 \
    using Read = qtb::trace::Reader<face>;                                                              \
    return qtb::trace::CallShape{Read::letter(side),   Read::letter(uplo), Read::letter(trans, transa), \
                                 Read::letter(transb), Read::letter(diag), Read::size(m),               \
                                 Read::size(n),        Read::size(k),      Read::size(kl),              \
                                 Read::size(ku)};                                                       \
  }
