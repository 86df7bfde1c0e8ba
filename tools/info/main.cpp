// qtb-info: what the library does on this machine and why, whether it computes rightly here, and what a running process
// has loaded.
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "tools/info/machine.h"
#include "tools/info/selftest.h"

namespace {

constexpr int exit_usage = 2;

constexpr char usage[] =
    R"(usage: qtb-info [--selftest [FILE] | --pid NUMBER | --help | --version]

Without an option: the version, the tier of kernels, the caches, the threads and the buffers, each with the reason.

  --selftest [FILE]  calls every routine in every tier that this processor has, with one thread and with several, and
                     compares the results with an oracle of higher precision; of FILE, which may be libqtb.so or
                     libblas.so.3, or by itself of the libqtb.so beside this program. Takes some seconds
  --pid NUMBER       what a running process has loaded: libraries of QTB with their versions, and other BLAS libraries
  --help             this text
  --version          the version

The exit status is 0, 1 where a routine failed or a process cannot be seen, 2 where the arguments are wrong.
)";

int wrong(const char *what, const char *argument) {
  std::fprintf(stderr, "qtb-info: %s%s; qtb-info --help tells more\n", what, argument);
  return exit_usage;
}

int run(int count, char **arguments) {
  if (count == 0) return qtb::info::print_machine(), 0;
  const char *const option = arguments[0], *const value = count > 1 ? arguments[1] : nullptr;
  const auto is = [option](const char *name) { return std::strcmp(option, name) == 0; };
  const bool takes_value = is("--selftest") || is("--pid") || is("--selftest-serial") || is("--selftest-threads");
  if (count > (takes_value ? 2 : 1)) return wrong("too many arguments: ", arguments[takes_value ? 2 : 1]);
  if (is("--help")) return std::fputs(usage, stdout), 0;
  if (is("--version")) return std::printf("%s\n", qtb::info::version()), 0;
  if (is("--selftest")) return qtb::info::run_selftest(value);
  if (value != nullptr && (is("--selftest-serial") || is("--selftest-threads")))  // as run_selftest starts it again
    return qtb::info::run_selftest_of_tier(value, is("--selftest-threads"));
  if (is("--pid")) {
    if (value == nullptr) return wrong("--pid needs the number of a process", "");
    char *end = nullptr;
    errno = 0;
    const long number = std::strtol(value, &end, 10);
    if (errno != 0 || *end != '\0' || end == value || number < 1) return wrong("not the number of a process: ", value);
    return qtb::info::print_process(number);
  }
  return wrong("no such option: ", option);
}

}  // namespace

int main(int argc, char **argv) { return run(argc - 1, argv + 1); }
