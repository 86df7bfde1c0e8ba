// Children that measure, and the parent that gives them their turns.

#include "bench/sides.h"

#include <sys/prctl.h>
#include <sys/socket.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <ctime>

#include "bench/timing.h"

namespace qtb::bench {
namespace {

constexpr double turn_seconds = 0.001;  // long against the clock, short against a disturbance
constexpr long warm_share = 4;          // of a turn's calls so many are first made without a look at the clock
constexpr double once_seconds = 0.1;    // what a library does at its first call only takes less
constexpr double stall_seconds = 1;     // so does a stall of the machine
constexpr int least_turns = 5;          // unless fewer are asked for

// What a child sends: once when it is ready, and after each turn.
struct Report {
  Outcome outcome;
  double seconds;  // per call
  double elapsed;  // of a whole turn, the calls that nobody timed included
};

constexpr pid_t gone = 0;

struct Child {
  pid_t process = gone;
  int channel = -1;
  Report last{Outcome::crashed, 0, 0};
  double processor_seconds = 0, elapsed = 0;  // of all turns
};

// What a stopped child has used of the processors. The system's books of a thread are exact only while it does not run.
double processor_seconds(pid_t process) {
  clockid_t clock{};
  timespec time{};
  if (clock_getcpuclockid(process, &clock) != 0 || clock_gettime(clock, &time) != 0) return 0;
  return static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_nsec) * 1e-9;
}

Report measure_turn(const Calls &calls, long count) {
  const double first = now();
  if (count >= warm_share) calls(count / warm_share);
  const double start = now();
  calls(count);
  const double end = now();
  return {Outcome::measured, (end - start) / static_cast<double>(count), end - first};
}

void send_report(int channel, const Report &report) {
  if (send(channel, &report, sizeof report, MSG_NOSIGNAL) != sizeof report) _exit(1);
}

// The life of a child. It leaves without cleaning up: what runs at the end of a program is the parent's to do.
[[noreturn]] void serve(const Runner &runner, int channel) {
  prctl(PR_SET_PDEATHSIG, SIGKILL);
  const Side &side = runner.side;
  for (const std::string &setting : side.settings) set_environment(setting);
  const Library library = side.path.empty() ? Library{} : load_library(side.path, side.wide);
  const Prepared prepared = runner.prepare(library);
  if (!prepared.calls || !prepared.correct) {
    send_report(channel, {prepared.calls ? Outcome::wrong : Outcome::absent, 0, 0});
    _exit(0);
  }
  Report ready{Outcome::measured, seconds_per_call(prepared.calls, 1), 0};
  if (ready.seconds >= once_seconds && ready.seconds < stall_seconds)
    ready.seconds = fastest_seconds_per_call(prepared.calls, 1);
  ready.elapsed = ready.seconds;
  long count = 1;
  if (ready.seconds < once_seconds) {
    count = calibrate(prepared.calls, turn_seconds);
    ready = measure_turn(prepared.calls, count);
  }
  send_report(channel, ready);
  char turn = 0;
  while (recv(channel, &turn, 1, 0) == 1) send_report(channel, measure_turn(prepared.calls, count));
  _exit(0);
}

// Waits for a child's report and stops the child. A child that is gone reports a crash.
void take_report(Child &child) {
  if (recv(child.channel, &child.last, sizeof child.last, 0) != sizeof child.last) {
    child.last = {Outcome::crashed, 0, 0};
    return;
  }
  kill(child.process, SIGSTOP);
  int status = 0;
  waitpid(child.process, &status, WUNTRACED);
  if (!WIFSTOPPED(status)) child.process = gone;  // it had reported that there is nothing to measure
}

Child start(const Runner &runner) {
  int channel[2];
  if (socketpair(AF_UNIX, SOCK_SEQPACKET, 0, channel) != 0) {
    std::perror("socketpair");
    std::exit(2);
  }
  std::fflush(nullptr);
  Child child;
  child.process = fork();
  if (child.process < 0) {
    std::perror("fork");
    std::exit(2);
  }
  if (child.process == 0) {
    close(channel[0]);
    serve(runner, channel[1]);
  }
  close(channel[1]);
  child.channel = channel[0];
  take_report(child);
  return child;
}

void take_turn(Child &child) {
  const char turn = 1;
  const double processor_start = processor_seconds(child.process);
  send(child.channel, &turn, 1, MSG_NOSIGNAL);
  kill(child.process, SIGCONT);
  take_report(child);
  child.processor_seconds += processor_seconds(child.process) - processor_start;
  child.elapsed += child.last.elapsed;
}

void end(Child &child) {
  close(child.channel);
  if (child.process == gone) return;
  kill(child.process, SIGKILL);
  waitpid(child.process, nullptr, 0);
}

}  // namespace

std::vector<Measurement> measure_in_turn(const std::vector<Runner> &runners, int most_turns, double budget) {
  std::vector<Child> children;
  double seconds_of_turns = 0;
  for (const Runner &runner : runners) {
    children.push_back(start(runner));
    seconds_of_turns += children.back().last.elapsed;
  }
  std::vector<Measurement> measurements(runners.size());
  const double fitting = budget / std::max(seconds_of_turns, turn_seconds);
  const int turns = static_cast<int>(std::min<double>(std::max<double>(fitting, least_turns), most_turns));
  for (int turn = 0; turn < turns; ++turn)
    for (std::size_t i = 0; i < children.size(); ++i) {
      const std::size_t which = turn % 2 == 0 ? i : children.size() - 1 - i;
      Child &child = children[which];
      if (child.last.outcome != Outcome::measured) continue;
      take_turn(child);
      measurements[which].seconds.push_back(child.last.seconds);
    }
  for (std::size_t i = 0; i < children.size(); ++i) {
    measurements[i].outcome = children[i].last.outcome;
    if (measurements[i].outcome == Outcome::measured)
      measurements[i].cores = children[i].processor_seconds / children[i].elapsed;
    else
      measurements[i].seconds.clear();
    end(children[i]);
  }
  return measurements;
}

void set_environment(const std::string &assignment) {
  const std::size_t equals = assignment.find('=');
  if (equals == std::string::npos) {
    std::fprintf(stderr, "a setting is NAME=VALUE: %s\n", assignment.c_str());
    std::exit(2);
  }
  setenv(assignment.substr(0, equals).c_str(), assignment.substr(equals + 1).c_str(), 1);
}

}  // namespace qtb::bench
