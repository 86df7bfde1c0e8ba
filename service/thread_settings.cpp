// The thread variables of the environment.
//
// A number is a text of digits alone: a sign or a blank makes it malformed. What a malformed one means differs from
// variable to variable. A field that was given keeps its first value, so that the order of reading is the precedence.

#include "service/thread_settings.h"

#include <cstdlib>
#include <string_view>

#include "service/platform/platform.h"

namespace qtb {
namespace {

struct Value {
  char text[256];
  std::size_t length;  // 0: absent, empty, or too long for text

  explicit Value(const char *name) : length(platform_environment(name, text, sizeof text)) {
    if (length >= sizeof text) length = 0;
    text[length] = '\0';
  }
};

constexpr std::string_view blank_or_quote = " \"'";

bool all_digits(std::string_view text) { return text.find_first_not_of("0123456789") == text.npos; }

// The number of a text that is malformed is 1: whoever wrote it wanted to limit threads. The text's end has to be
// followed by something that is not a digit.
std::int32_t number_or_one(std::string_view text) {
  return !text.empty() && all_digits(text) ? std::atoi(text.data()) : 1;
}

void give_first(std::int32_t *field, std::int32_t number) {
  if (number >= 1 && *field < 0) *field = number;
}

std::size_t end_of(std::string_view text, std::size_t from, std::string_view stops) {
  const std::size_t end = text.find_first_of(stops, from);
  return end == text.npos ? text.size() : end;
}

std::size_t skip(std::string_view text, std::size_t from, std::string_view skipped) {
  const std::size_t next = text.find_first_not_of(skipped, from);
  return next == text.npos ? text.size() : next;
}

// The characters from begin up to end. (substr would check its arguments, and throw.)
std::string_view part(std::string_view text, std::size_t begin, std::size_t end) {
  return {text.data() + begin, end - begin};
}

// Entries key=number between separators, as in QTB_BLAS=4, QTB_FFT=2.
void read_domains(ThreadSettings *settings, std::string_view text) {
  const struct {
    std::string_view key;
    std::int32_t *field;
  } domains[] = {
      {"QTB_ALL", &settings->threads_all},
      {"QTB_BLAS", &settings->threads_blas},
      {"QTB_FFT", &settings->threads_fft},
      {"QTB_VML", &settings->threads_vml},
  };
  constexpr std::string_view separators = " ,;:\"'";
  std::size_t at = 0;
  while (at < text.size()) {
    const std::size_t key_begin = skip(text, at, separators);
    const std::size_t key_end = end_of(text, key_begin, "=\"' ");
    if (key_end == key_begin) return;
    const std::size_t number_begin = skip(text, key_end, " =");
    const std::size_t number_end = end_of(text, number_begin, separators);
    at = number_end + 1;

    const std::string_view key = part(text, key_begin, key_end);
    const std::int32_t number = number_or_one(part(text, number_begin, number_end));
    for (const auto &domain : domains)
      if (key == domain.key) give_first(domain.field, number);
  }
}

bool says_false(std::string_view text) {
  const std::size_t begin = skip(text, 0, blank_or_quote);
  const std::string_view token = part(text, begin, end_of(text, begin, blank_or_quote));
  return token == "FALSE" || token == "false";
}

}  // namespace

void read_thread_variables(ThreadSettings *settings) {
  if (const Value v("QTB_NUM_THREADS"); v.length != 0) give_first(&settings->threads_all, number_or_one(v.text));

  if (const Value v("QTB_DOMAIN_NUM_THREADS"); v.length != 0) read_domains(settings, v.text);

  if (settings->dynamic == -1) {
    const Value v("QTB_DYNAMIC");
    settings->dynamic = says_false(v.text) ? 0 : 1;
  }

  if (const Value v("OMP_NUM_THREADS"); v.length != 0) give_first(&settings->omp_threads_env, number_or_one(v.text));

  if (const Value v("Q_MPI_NUMBER_OF_MPI_PROCESSES_PER_NODE"); v.length != 0 && all_digits(v.text))
    give_first(&settings->mpi_procs_per_node, std::atoi(v.text));

  if (const Value v("Q_MPI_THREAD_LEVEL"); v.length != 0) {
    constexpr std::int32_t highest_level = 3;
    const std::int32_t level = all_digits(v.text) ? std::atoi(v.text) : 0;
    settings->mpi_thread_level = level >= 0 && level <= highest_level ? level : 0;
  }
}

}  // namespace qtb
