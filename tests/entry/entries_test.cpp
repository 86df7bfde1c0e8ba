// The exported entries: which way each goes, that it hands its arguments on as they came and its result back, that a
// failed check stops it, and that both cases are one routine. What lies behind the entries is replaced by a recorder.

#include <gtest/gtest.h>

#include <cstring>
#include <set>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include "blas/dispatch/slots.h"
#include "blas/entry/checks.h"
#include "blas/thread/drivers.h"

namespace {

struct Step {
  std::string what;  // "check", "slot" or "driver"
  std::string routine;
  std::vector<const void *> arguments;
};
std::vector<Step> steps;
std::int32_t check_result = 0;

// The value that a recorded call gives back, as far as its type can hold one.
template <class Result>
Result value_of(const char *routine) {
  if constexpr (std::is_pointer_v<Result>)
    return reinterpret_cast<Result>(const_cast<char *>(routine));
  else if constexpr (!std::is_void_v<Result>)
    return static_cast<Result>(routine[0] * 100 + routine[1]);
}

template <class Result, class... Arguments>
Result record(const char *what, const char *routine, Arguments... arguments) {
  steps.push_back({what, routine, {static_cast<const void *>(arguments)...}});
  return value_of<Result>(routine);
}

}  // namespace

extern "C" {
#define QTB_RECORD_SLOT(name, shape, T) \
  QTB_FUNCTION(shape, T, qtb_blas_x##name) { return record<QTB_RESULT_##shape(T)>("slot", #name, QTB_ARGS(shape)); }
#define QTB_RECORD_DRIVER(name, shape, T) \
  QTB_FUNCTION(shape, T, qtb_blas_##name) { return record<QTB_RESULT_##shape(T)>("driver", #name, QTB_ARGS(shape)); }
#define QTB_RECORD_CHECK(name, shape, T)                       \
  std::int32_t qtb_blas_errchk_##name(QTB_PARAMS_##shape(T)) { \
    record<void>("check", #name, QTB_ARGS(shape));             \
    return check_result;                                       \
  }
#define QTB_RECORD_CHECK_SLOT(name, shape, T) QTB_RECORD_CHECK(name, shape, T) QTB_RECORD_SLOT(name, shape, T)
#define QTB_RECORD_CHECK_DRIVER(name, shape, T) QTB_RECORD_CHECK(name, shape, T) QTB_RECORD_DRIVER(name, shape, T)
#define QTB_ROUTINE(name, NAME, shape, T, route)                   \
  QTB_RECORD_##route(name, shape, T) QTB_FUNCTION(shape, T, name); \
  QTB_FUNCTION(shape, T, NAME);
#include "blas/routines.def"
#undef QTB_ROUTINE
}

namespace {

// Distinct addresses for the arguments; nothing reads them.
constexpr int argument_limit = 16;
char argument_memory[argument_limit];

template <class Result, class... Parameters, std::size_t... position>
bool call_gives(Result (*entry)(Parameters...), Result expected, std::index_sequence<position...>) {
  return entry(reinterpret_cast<Parameters>(argument_memory + position)...) == expected;
}
template <class... Parameters, std::size_t... position>
void call_void(void (*entry)(Parameters...), std::index_sequence<position...>) {
  entry(reinterpret_cast<Parameters>(argument_memory + position)...);
}

// Calls an entry with the distinct addresses; says whether its value was what the recorder gave.
template <class Result, class... Parameters>
bool call(Result (*entry)(Parameters...), const char *routine) {
  if constexpr (std::is_void_v<Result>) {
    call_void(entry, std::index_sequence_for<Parameters...>());
    return true;
  } else {
    return call_gives(entry, value_of<Result>(routine), std::index_sequence_for<Parameters...>());
  }
}

template <class Result, class... Parameters>
constexpr std::size_t parameter_count(Result (*)(Parameters...)) {
  return sizeof...(Parameters);
}

// An entry with the lengths of its character arguments behind the last one, as some compilers call it.
template <class Result, class... Parameters>
bool call_with_lengths(Result (*entry)(Parameters...), const char *routine) {
  using WithLengths = Result (*)(Parameters..., std::int64_t, std::int64_t, std::int64_t, std::int64_t);
  const auto with_lengths = reinterpret_cast<WithLengths>(reinterpret_cast<void *>(entry));
  const auto bound = [&]<std::size_t... position>(std::index_sequence<position...>) {
    return with_lengths(reinterpret_cast<Parameters>(argument_memory + position)..., 1, -1, INT64_MAX, 0);
  };
  if constexpr (std::is_void_v<Result>) {
    bound(std::index_sequence_for<Parameters...>());
    return true;
  } else {
    return bound(std::index_sequence_for<Parameters...>()) == value_of<Result>(routine);
  }
}

struct Entry {
  const char *name;
  bool has_checker;
  std::size_t parameters;
  bool (*call)();
  bool (*call_with_lengths)();
  const void *lower, *upper;
};

#define QTB_HAS_SLOT false
#define QTB_HAS_DRIVER false
#define QTB_HAS_CHECK_SLOT true
#define QTB_HAS_CHECK_DRIVER true
#define QTB_ROUTINE(name, NAME, shape, T, route)   \
  {#name,                                          \
   QTB_HAS_##route,                                \
   parameter_count(&name),                         \
   [] { return call(&name, #name); },              \
   [] { return call_with_lengths(&name, #name); }, \
   reinterpret_cast<const void *>(&name),          \
   reinterpret_cast<const void *>(&NAME)},
const Entry entries[] = {
#include "blas/routines.def"
};
#undef QTB_ROUTINE

// The routines with a parallel front end; every other one goes straight to its slot.
std::set<std::string> routines_with_drivers() {
  std::istringstream names(
      "saxpy daxpy caxpy zaxpy scopy dcopy ccopy zcopy sswap dswap cswap zswap sdot ddot cdotc srot drot csrot zdrot "
      "sgemv dgemv cgemv zgemv ssymv dsymv ssyr dsyr ssyr2 dsyr2 strmv dtrmv ctrmv ztrmv sgemm dgemm cgemm zgemm "
      "ssymm dsymm csymm zsymm chemm zhemm ssyrk dsyrk csyrk zsyrk cherk zherk ssyr2k dsyr2k csyr2k zsyr2k cher2k "
      "zher2k strmm dtrmm ctrmm ztrmm strsm dtrsm ctrsm ztrsm");
  std::set<std::string> result;
  for (std::string name; names >> name;) result.insert(name);
  return result;
}

bool is_as_passed(const Step &step, const Entry &entry) {
  if (step.routine != entry.name || step.arguments.size() != entry.parameters) return false;
  for (std::size_t i = 0; i < entry.parameters; ++i)
    if (step.arguments[i] != argument_memory + i) return false;
  return true;
}

TEST(Entries, there_are_175_beside_lsame_and_xerbla) { EXPECT_EQ(std::size(entries), 175U); }

TEST(Entries, each_takes_its_way_with_its_arguments_as_they_came) {
  const std::set<std::string> drivers = routines_with_drivers();
  EXPECT_EQ(drivers.size(), 63U);
  int checked = 0;
  for (const Entry &entry : entries) {
    check_result = 0;
    steps.clear();
    EXPECT_TRUE(entry.call()) << entry.name << " must give back what it got";
    ASSERT_EQ(steps.size(), entry.has_checker ? 2U : 1U) << entry.name;
    EXPECT_EQ(steps.front().what == "check", entry.has_checker) << entry.name;
    EXPECT_EQ(steps.back().what, drivers.count(entry.name) != 0 ? "driver" : "slot") << entry.name;
    for (const Step &step : steps) EXPECT_TRUE(is_as_passed(step, entry)) << entry.name << " " << step.what;
    checked += entry.has_checker;
  }
  EXPECT_EQ(checked, 96);
}

TEST(Entries, a_failed_check_is_the_last_step) {
  for (const Entry &entry : entries) {
    if (!entry.has_checker) continue;
    check_result = 1;
    steps.clear();
    entry.call();
    ASSERT_EQ(steps.size(), 1U) << entry.name;
    EXPECT_EQ(steps.front().what, "check") << entry.name;
  }
}

TEST(Entries, hidden_lengths_change_nothing) {
  check_result = 0;
  for (const Entry &entry : entries) {
    steps.clear();
    EXPECT_TRUE(entry.call_with_lengths()) << entry.name;
    for (const Step &step : steps) EXPECT_TRUE(is_as_passed(step, entry)) << entry.name << " " << step.what;
  }
}

TEST(Entries, both_cases_are_one_routine) {
  for (const Entry &entry : entries) EXPECT_EQ(entry.lower, entry.upper) << entry.name;
}

TEST(Entries, the_second_name_is_the_first_in_upper_case) {
#define QTB_ROUTINE(name, NAME, shape, T, route)                                              \
  {                                                                                           \
    std::string upper = #name;                                                                \
    for (char &c : upper) c = static_cast<char>(std::toupper(static_cast<unsigned char>(c))); \
    EXPECT_EQ(upper, #NAME);                                                                  \
  }
#include "blas/routines.def"
#undef QTB_ROUTINE
}

}  // namespace
