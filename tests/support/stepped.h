// A procedure run one instruction at a time, watched for a value that must not be read.
//
// Behind an operand that ends within 16 bytes of memory that it shares with others no page can trap, and a load that
// goes too far changes no result. But what it brings is in a register after that very instruction: here every register
// is looked at after every instruction. What must not be read holds a forbidden pattern, which no register may hold.
#pragma once

#include <signal.h>
#include <ucontext.h>
#include <x86intrin.h>

#include <cstdint>
#include <cstring>

namespace qtb::test {

// A signalling NaN in either precision at every multiple of 4 bytes. Arithmetic on it leaves the same bits, but for the
// one that says quiet.
constexpr std::uint32_t forbidden_pattern = 0x7FA5C3E1U;

namespace stepping {

constexpr std::uint32_t quiet_bit = 0x00400000U;
constexpr unsigned long long single_step_flag = 0x100;  // of the flags register: a trap after each instruction

inline bool found = false;
inline long steps = 0;
inline greg_t at_first[NGREG];  // the general registers after the first instruction, which may hold what came before

inline bool is_forbidden(std::uint32_t word) { return (word & ~quiet_bit) == (forbidden_pattern & ~quiet_bit); }
inline bool holds_forbidden(std::uint64_t value) {
  return is_forbidden(static_cast<std::uint32_t>(value)) || is_forbidden(static_cast<std::uint32_t>(value >> 32));
}

inline void look(int, siginfo_t *, void *context) {
  const mcontext_t &machine = static_cast<ucontext_t *>(context)->uc_mcontext;
  if (steps++ == 0) std::memcpy(at_first, machine.gregs, sizeof at_first);
  for (int k = REG_R8; k <= REG_RCX; ++k)
    if (machine.gregs[k] != at_first[k] && holds_forbidden(static_cast<std::uint64_t>(machine.gregs[k]))) found = true;
  for (const auto &vector : machine.fpregs->_xmm)
    for (const std::uint32_t word : vector.element)
      if (is_forbidden(word)) found = true;
}

// No vector register holds anything from before.
[[gnu::noinline]] inline void clear_vectors() {
  __asm__ volatile(
      "pxor %%xmm0, %%xmm0\n\tpxor %%xmm1, %%xmm1\n\tpxor %%xmm2, %%xmm2\n\tpxor %%xmm3, %%xmm3\n\t"
      "pxor %%xmm4, %%xmm4\n\tpxor %%xmm5, %%xmm5\n\tpxor %%xmm6, %%xmm6\n\tpxor %%xmm7, %%xmm7\n\t"
      "pxor %%xmm8, %%xmm8\n\tpxor %%xmm9, %%xmm9\n\tpxor %%xmm10, %%xmm10\n\tpxor %%xmm11, %%xmm11\n\t"
      "pxor %%xmm12, %%xmm12\n\tpxor %%xmm13, %%xmm13\n\tpxor %%xmm14, %%xmm14\n\tpxor %%xmm15, %%xmm15"
      :
      :
      : "xmm0", "xmm1", "xmm2", "xmm3", "xmm4", "xmm5", "xmm6", "xmm7", "xmm8", "xmm9", "xmm10", "xmm11", "xmm12",
        "xmm13", "xmm14", "xmm15");
}

inline void set_stepping(bool on) {
  const auto flags = __readeflags();
  __writeeflags(on ? flags | single_step_flag : flags & ~single_step_flag);
}

}  // namespace stepping

// What a stepped run saw: instructions, and whether the pattern was ever in a register.
struct Stepped {
  long steps;
  bool read_forbidden;
};

// f() step by step. It must not read the pattern itself; nothing else in the program may need SIGTRAP.
template <class F>
Stepped step_through(F &&f) {
  struct sigaction action = {}, before = {};
  action.sa_sigaction = stepping::look;
  action.sa_flags = SA_SIGINFO;
  sigaction(SIGTRAP, &action, &before);
  stepping::found = false;
  stepping::steps = 0;
  stepping::clear_vectors();
  stepping::set_stepping(true);
  f();
  stepping::set_stepping(false);
  sigaction(SIGTRAP, &before, nullptr);
  __asm__ volatile("" ::: "memory");  // the handler has written since
  return {stepping::steps, stepping::found};
}

}  // namespace qtb::test
