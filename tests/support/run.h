// Another program, run with an environment and a working directory of its own.
#pragma once

#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdlib>
#include <map>
#include <string>
#include <vector>

namespace qtb::test {

struct Run {
  int status = -1;     // as waitpid tells it; 0 is success
  std::string output;  // standard output and standard error
};

struct RunOptions {
  std::map<std::string, std::string> environment;  // set on top of this process's; an empty value removes the name
  std::string directory;                           // empty: this process's
  void (*prepare)() = nullptr;                     // called in the new process, ahead of the program
  unsigned seconds = 60;                           // an alarm ends the program after that
};

inline Run run_program(const std::vector<std::string> &command, const RunOptions &options = {}) {
  Run run;
  int ends[2];
  if (pipe2(ends, O_CLOEXEC) != 0) return run;
  const pid_t child = fork();
  if (child == 0) {
    dup2(ends[1], STDOUT_FILENO);
    dup2(ends[1], STDERR_FILENO);
    for (const auto &[name, value] : options.environment) {
      if (value.empty())
        unsetenv(name.c_str());
      else
        setenv(name.c_str(), value.c_str(), 1);
    }
    if (!options.directory.empty() && chdir(options.directory.c_str()) != 0) _exit(126);
    if (options.prepare != nullptr) options.prepare();
    std::vector<char *> arguments;
    for (const std::string &argument : command) arguments.push_back(const_cast<char *>(argument.c_str()));
    arguments.push_back(nullptr);
    alarm(options.seconds);
    execvp(arguments[0], arguments.data());
    _exit(127);
  }
  close(ends[1]);
  if (child > 0) {
    char buffer[4096];
    for (ssize_t n; (n = read(ends[0], buffer, sizeof buffer)) > 0;) run.output.append(buffer, static_cast<size_t>(n));
    waitpid(child, &run.status, 0);
  }
  close(ends[0]);
  return run;
}

}  // namespace qtb::test
