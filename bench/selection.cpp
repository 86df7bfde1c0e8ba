// Names and letters to calls.

#include "bench/selection.h"

#include <algorithm>

namespace qtb::bench {

std::vector<std::string> all_letters(const Routine &routine) {
  std::vector<std::string> words{""};
  for (const char axis : routine.options()) {
    std::vector<std::string> longer;
    for (const std::string &word : words)
      for (const char letter : calls::legal_letters(axis))
        if (routine.knows(axis, letter)) longer.push_back(word + letter);
    words = longer;
  }
  return words;
}

namespace {

using calls::Problem;

bool is_named(const Routine &routine, const std::string &name) {
  return routine.name == name || routine.name.substr(1) == name || "level" + std::to_string(routine.level) == name;
}

std::vector<std::string> letters_of(const Selection &selection, const Routine &routine) {
  const std::vector<std::string> all = all_letters(routine);
  if (selection.letters.empty()) return {all.front()};
  if (selection.letters.front() == "all" || routine.options().empty()) return all;
  std::vector<std::string> known;
  for (const std::string &word : selection.letters)
    if (std::find(all.begin(), all.end(), word) != all.end()) known.push_back(word);
  return known;
}

void set_letters(const Routine &routine, const std::string &letters, Problem &problem) {
  for (std::size_t i = 0; i < letters.size(); ++i) problem.option(routine.options()[i]) = letters[i];
}

// The problems of one routine: every size and shape with every band and increment.
std::vector<Problem> list_problems(const Selection &selection, const Routine &routine) {
  std::vector<std::vector<long>> shapes = selection.shapes;
  std::string_view dimensions = routine.axes.substr(0, routine.axes.find_first_not_of(calls::size_axes));
  for (const long size : selection.sizes) shapes.emplace_back(dimensions.size(), size);
  if (dimensions.empty()) shapes = {{}};  // of scalars
  std::vector<Problem> problems;
  for (const std::vector<long> &shape : shapes) {
    if (shape.size() != dimensions.size()) continue;
    for (const long band : routine.has_axis("lb") ? selection.bands : std::vector<long>{0})
      for (const long increment : routine.has_axis("xy") ? selection.increments : std::vector<long>{1}) {
        Problem problem;
        for (std::size_t i = 0; i < shape.size(); ++i) problem.size(dimensions[i]) = shape[i];
        problem.kl = problem.ku = band;
        problem.incx = problem.incy = increment;
        for (QtbInt &spare : problem.spare) spare = selection.spare;
        problem.alpha = selection.alpha.value_or(routine.steady_alpha);
        problem.beta = selection.beta.value_or(routine.steady_beta);
        problems.push_back(problem);
      }
  }
  return problems;
}

}  // namespace

std::vector<Selected> select_calls(const Selection &selection, std::string &unknown) {
  std::vector<Selected> calls;
  for (const std::string &name : selection.routines) {
    const std::size_t before = calls.size();
    for (const Routine &routine : routines) {
      if (!is_named(routine, name)) continue;
      for (const std::string &letters : letters_of(selection, routine))
        for (Problem problem : list_problems(selection, routine)) {
          set_letters(routine, letters, problem);
          calls.push_back({&routine, letters, problem});
        }
    }
    if (calls.size() == before) unknown = name;
  }
  return calls;
}

}  // namespace qtb::bench
