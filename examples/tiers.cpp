// A program on every tier. See tiers.h.
#include "tiers.h"

#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>

namespace {

struct Tier {
  const char *number, *name;
  bool runs_here;
};

int in_process(const Tier &tier, const char *program, const std::string &order) {
  std::fflush(stdout);
  const pid_t child = fork();
  if (child == 0) {
    setenv("QTB_DEBUG_CPU_TYPE", tier.number, 1);
    execl("/proc/self/exe", program, order.c_str(), tier.name, static_cast<char *>(nullptr));
    std::perror(program);
    _exit(bad_argument);
  }
  int status = 0;
  if (child < 0 || waitpid(child, &status, 0) < 0 || !WIFEXITED(status)) {
    std::fprintf(stderr, "%s: the process of tier %s did not finish\n", program, tier.name);
    return wrong;
  }
  return WEXITSTATUS(status);
}

}  // namespace

long long order_argument(int count, char **arguments, long long usual, long long largest) {
  char *end = nullptr;
  const long long order = count > 1 ? std::strtoll(arguments[1], &end, 10) : usual;
  if ((end == nullptr || *end == '\0') && order >= 1 && order <= largest && count <= 3) return order;
  std::fprintf(stderr, "usage: %s [order from 1 to %lld]\n", arguments[0], largest);
  return 0;
}

int on_every_tier(const char *program, const std::string &order) {
  const Tier tiers[] = {
      {"0", "def", true},
      {"1", "sse3", __builtin_cpu_supports("sse3") != 0},
      {"2", "ssse3", __builtin_cpu_supports("ssse3") != 0},
      {"3", "sse42", __builtin_cpu_supports("sse4.2") != 0},
      {"4", "avx", __builtin_cpu_supports("avx") != 0},
  };
  int result = right;
  for (const Tier &tier : tiers) {
    if (tier.runs_here)
      result = std::max(result, in_process(tier, program, order));
    else
      std::printf("%-6s this processor lacks its instructions\n", tier.name);
  }
  return result;
}
