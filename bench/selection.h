// Which calls a comparison makes: routines, options and sizes by name.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "bench/routines.h"

namespace qtb::bench {

struct Selection {
  std::vector<std::string> routines{"level1"};  // names, names without their type letter, or levels
  std::vector<std::string> letters;             // of options; "all" is every word that a routine knows
  std::vector<long> sizes, bands{16}, increments{1};
  std::vector<std::vector<long>> shapes;     // one number for each dimension of a routine
  std::optional<calls::Scalar> alpha, beta;  // the routine's own where not given
  long spare = 0;                            // of leading dimensions
};

struct Selected {
  const Routine *routine;
  std::string letters;
  calls::Problem problem;
};

// Every call of a selection, routine by routine. A routine takes the words and the shapes that fit it, and without
// words the first letter of each option. unknown is set to a name without a call.
std::vector<Selected> select_calls(const Selection &selection, std::string &unknown);

// Every combination of a routine's letters that differs from the others, the first letters first.
std::vector<std::string> all_letters(const Routine &routine);

}  // namespace qtb::bench
