// The sides of a comparison, each measured in a process of its own, in turn.
//
// A library's settings (tier, number of threads) are read once per process, so that one process can neither hold the
// same library twice with different settings nor two libraries that share a threading runtime and want different
// numbers of threads. Threads that wait for work do so by spinning for some milliseconds, which takes a core from
// whoever is measured next. So every side is a child that is stopped, with all its threads, while it is not its turn.
#pragma once

#include <functional>
#include <string>
#include <vector>

#include "bench/library.h"

namespace qtb::bench {

struct Side {
  std::string path;                   // of the shared library; empty for a side that needs none
  bool wide = true;                   // as in Library
  std::vector<std::string> settings;  // NAME=VALUE for the environment, set before the library is loaded
};

struct Prepared {
  Calls calls;
  bool correct = true;  // whether a call gave the right result
};

// Makes the calls of one case ready in the side's process.
using Prepare = std::function<Prepared(const Library &)>;

struct Runner {
  Side side;
  Prepare prepare;
};

enum class Outcome : int { measured, absent, wrong, crashed };

struct Measurement {
  Outcome outcome = Outcome::crashed;
  std::vector<double> seconds;  // per call, one value per turn; empty unless measured
  double cores = 0;             // processor time over elapsed time, of all turns together
};

// Measures the runners in turn, as often as fits the budget of seconds, but not less than a few times, and not more
// often than most_turns. Odd turns go backward through the runners, so that none profits from a drifting clock.
std::vector<Measurement> measure_in_turn(const std::vector<Runner> &runners, int most_turns, double budget);

// Sets NAME=VALUE in this process's environment, or ends the program with a message.
void set_environment(const std::string &assignment);

}  // namespace qtb::bench
