// The surroundings of a front end or a driver in a test: every dispatch slot is a routine of the test program that
// notes its call, and on request hands it on to a routine of the test's choice.
//
// A test includes this once and sets up `stand_ins`; QTB_STAND_IN makes further routines, such as the drivers behind a
// front end, stand-ins too, and services.h does so with the services. For one source of one program: it defines the
// library's own names. The parts of the library that are named in neither are the real ones.
#pragma once

#include <gtest/gtest.h>
#include <omp.h>

#include <algorithm>
#include <array>
#include <mutex>
#include <string>
#include <vector>

#include "blas/dispatch/slots.h"
#include "blas/thread/floating_state.h"

namespace qtb::test {

// An argument: the pointer, and what stands there if that is an integer, a letter, or the scalar alpha or beta.
struct Argument {
  const void *pointer;
  std::int64_t number = 0;
  std::string bytes = {};
};

// The bytes of a value, to compare with those of an argument.
template <class V>
std::string bytes_of(const V &v) {
  return {reinterpret_cast<const char *>(&v), sizeof v};
}

struct Call {
  std::string routine;  // without its prefix qtb_blas_
  const char *names;    // of the arguments, in order, between ", "
  std::vector<Argument> arguments;
  int thread, team;
  unsigned floating_choice;

  // The argument of that name, which the routine has to have.
  const Argument &operator[](const std::string &name) const {
    const std::string all = std::string(", ") + names + ",", one = ", " + name + ",";
    const std::size_t at = all.find(one);
    EXPECT_NE(at, std::string::npos) << routine << " has no argument " << name;
    return arguments[static_cast<std::size_t>(
        std::count(all.begin(), all.begin() + static_cast<std::ptrdiff_t>(at + 1), ',') - 1)];
  }
  QtbInt number(const std::string &name) const { return (*this)[name].number; }
  const void *pointer(const std::string &name) const { return (*this)[name].pointer; }
  std::vector<const void *> pointers() const {
    std::vector<const void *> all;
    for (const Argument &argument : arguments) all.push_back(argument.pointer);
    return all;
  }
};

struct StandIns {
  bool recording = true;
  std::vector<Call> calls;
  std::array<CodePointer, slot_count> behind = {};  // what a slot calls, with its arguments, once it has noted them

  // The calls of a routine, by thread.
  std::vector<Call> calls_of(const std::string &routine) const {
    std::vector<Call> found;
    std::copy_if(calls.begin(), calls.end(), std::back_inserter(found),
                 [&](const Call &call) { return call.routine == routine; });
    std::stable_sort(found.begin(), found.end(), [](const Call &a, const Call &b) { return a.thread < b.thread; });
    return found;
  }
};
inline StandIns stand_ins;
inline std::mutex stand_ins_mutex;              // of what is noted
inline thread_local int team_of_last_call = 0;  // of this thread, whether or not calls are recorded

template <class A>
Argument argument_of(const A *pointer, const std::string &name) {
  if constexpr (std::is_same_v<A, QtbInt> || std::is_same_v<A, char>)
    return {pointer, pointer == nullptr ? 0 : *pointer};
  else if (name == "alpha" || name == "beta")
    return {pointer, 0, pointer == nullptr ? "" : bytes_of(*pointer)};
  else
    return {pointer};
}

template <class... A>
void note_call(const char *routine, const char *names, const A *...arguments) {
  team_of_last_call = omp_get_num_threads();
  if (!stand_ins.recording) return;
  Call call{routine, names, {}, omp_get_thread_num(), team_of_last_call, floating_choice()};
  const char *name = names;
  const auto next_name = [&] {
    const std::string text(name, std::find(name, name + std::char_traits<char>::length(name), ','));
    name += text.size() + (name[text.size()] == ',' ? 2 : 0);
    return text;
  };
  (call.arguments.push_back(argument_of(arguments, next_name())), ...);
  const std::lock_guard lock(stand_ins_mutex);
  stand_ins.calls.push_back(std::move(call));
}

// What a stand-in returns that hands nothing on: a value no default would give, or its first argument.
template <class R>
R answer_of(const void *first) {
  if constexpr (std::is_pointer_v<R>)
    return static_cast<R>(const_cast<void *>(first));
  else if constexpr (!std::is_void_v<R>)
    return R(42.5);
}

template <class Function>
struct StandIn;
template <class R, class... A>
struct StandIn<R(A...)> {
  static R call(CodePointer behind, const char *routine, const char *names, A... arguments) {
    note_call(routine, names, arguments...);
    if (behind != nullptr) return reinterpret_cast<R (*)(A...)>(behind)(arguments...);
    const void *const all[] = {arguments...};
    return answer_of<R>(all[0]);
  }
};

template <class Function>
CodePointer code_pointer(Function *function) {
  return reinterpret_cast<CodePointer>(function);
}

}  // namespace qtb::test

#define QTB_TEXT_OF(...) #__VA_ARGS__
#define QTB_TEXT(...) QTB_TEXT_OF(__VA_ARGS__)

// The body of a stand-in for qtb_blas_<name> of a shape.
#define QTB_STAND_IN(name, shape, T, behind) \
  qtb::test::StandIn<QTB_FUNCTION_TYPE(shape, T)>::call(behind, name, QTB_TEXT(QTB_ARGS(shape)), QTB_ARGS(shape))

extern "C" {
#define QTB_SLOT(name, shape, T, tiers)                                                      \
  QTB_FUNCTION(shape, T, qtb_blas_x##name) {                                                 \
    return QTB_STAND_IN("x" #name, shape, T, qtb::test::stand_ins.behind[qtb::slot_##name]); \
  }
#include "blas/dispatch/slots.def"
#undef QTB_SLOT
}
