// A front end between stand-ins: the services answer as a process that the test makes up and note what they are asked,
// slots and drivers note their calls. A front end must hand on its arguments as they are, to the slot or to the driver
// as the decision says, and return what it gets; the decision itself is tested by value.
//
// For one source of one program, as stand_ins.h is, which this includes.
#pragma once

#include <cstring>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include "tests/thread/asked_process.h"
#include "tests/thread/stand_ins.h"

namespace qtb::test {

inline Answers process_answers;
inline std::string process_asked;
inline AskedProcess asked_process{process_answers, process_asked};

// alpha and beta of the calls, as far as their type has such parts.
struct Factors {
  double alpha[2] = {}, beta[2] = {};
};
inline Factors factors;

// Begins a test: a process that answers by default, nothing asked, nothing called.
class FrontEnds : public testing::Test {
 protected:
  void SetUp() override {
    process_answers = Answers{};
    process_asked.clear();
    stand_ins = StandIns{};
    factors = Factors{};
  }
};

// Calls a front end with the numbers and letters given by the names of its arguments, 1 and N where none is given, and
// with addresses elsewhere that nothing may touch. Returns the routines that were reached, in order. If it is only one,
// of the same shape, it has to have got the caller's own arguments, and the caller its result.
template <class R, class... A>
std::string reached_by(R (*front_end)(A...), const char *names, const std::map<std::string, QtbInt> &given) {
  constexpr std::size_t count = sizeof...(A);
  std::array<QtbInt, count> numbers;
  std::array<char, count> letters;
  std::array<cdouble, count> scalars = {};  // room for one of any type
  std::array<const void *, count> sent;
  std::size_t i = 0;
  const char *name = names;
  const auto choose = [&]<class P>(P *) {
    const std::string text(name, std::find(name, name + std::char_traits<char>::length(name), ','));
    name += text.size() + (name[text.size()] == ',' ? 2 : 0);
    const auto found = given.find(text);
    numbers[i] = found == given.end() ? 1 : found->second;
    letters[i] = found == given.end() ? 'N' : static_cast<char>(found->second);
    sent[i] = std::is_same_v<P, const QtbInt> ? static_cast<const void *>(&numbers[i])
              : std::is_same_v<P, const char> ? static_cast<const void *>(&letters[i])
                                              : reinterpret_cast<const void *>(16 * (i + 1));
    if (text == "alpha" || text == "beta") {
      const double *const parts = text == "alpha" ? factors.alpha : factors.beta;
      using Part = Real<std::remove_const_t<P>>;
      const Part narrow[2] = {static_cast<Part>(parts[0]), static_cast<Part>(parts[1])};
      sent[i] = std::memcpy(&scalars[i], narrow, sizeof(P));
    }
    ++i;
  };
  (choose(A{}), ...);
  stand_ins.calls.clear();
  process_asked.clear();
  const auto invoke = [&]<std::size_t... at>(std::index_sequence<at...>) {
    return front_end(static_cast<A>(const_cast<void *>(sent[at]))...);
  };
  if constexpr (std::is_void_v<R>) {
    invoke(std::index_sequence_for<A...>{});
  } else {
    const R result = invoke(std::index_sequence_for<A...>{});
    EXPECT_EQ(result, answer_of<R>(sent[0]));
  }
  std::string reached;
  for (const Call &call : stand_ins.calls) reached += (reached.empty() ? "" : " ") + call.routine;
  if (stand_ins.calls.size() == 1 && stand_ins.calls[0].names == std::string(names)) {
    EXPECT_EQ(stand_ins.calls[0].pointers(), std::vector<const void *>(sent.begin(), sent.end())) << reached;
  }
  return reached;
}

}  // namespace qtb::test

extern "C" {
ProcessorTier qtb_serv_cpu_detect() { return qtb::test::asked_process.tier(); }
int qtb_serv_cpu_takes_sse41() { return qtb::test::asked_process.has_sse41(); }
int qtb_serv_cpu_is_amd_family16() { return qtb::test::asked_process.is_amd_family16(); }
std::int32_t qtb_serv_get_dynamic() { return qtb::test::asked_process.dynamic(), qtb::test::process_answers.dynamic; }
void qtb_serv_get_cache_sizes(std::uint32_t *out) { qtb::test::asked_process.cache_sizes(out); }
std::int32_t qtb_serv_get_max_threads(std::int32_t domain) {
  EXPECT_EQ(domain, domain_blas);
  return static_cast<std::int32_t>(qtb::test::asked_process.max_threads());
}
}
