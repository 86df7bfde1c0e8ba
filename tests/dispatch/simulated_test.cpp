// The tier taken on processors that a simulator makes up: vendor, instructions and family, with the real kernels. The
// simulated processor stops at an instruction that it lacks.

#include <gtest/gtest.h>
#include <sys/resource.h>

#include <csignal>

#include "tests/support/run.h"

namespace qtb::test {
namespace {

const char *const no_sse3 = "-sse3,-ssse3,-sse4.1,-sse4.2";
const char *const sse3 = "+sse3,-ssse3,-sse4.1,-sse4.2";
const char *const ssse3 = "+sse3,+ssse3,-sse4.1,-sse4.2";
const char *const sse41 = "+sse3,+ssse3,+sse4.1,-sse4.2";
const char *const sse42 = "+sse3,+ssse3,+sse4.1,+sse4.2";
const char *const avx = "+sse3,+ssse3,+sse4.1,+sse4.2,+avx,+xsave";

constexpr const char *no_simulator = "qemu-x86_64 is not installed";

bool simulator_is_there() { return run_program({"qemu-x86_64", "--version"}).status == 0; }

Run diagnose(const std::string &processor, const std::string &override_text) {
  RunOptions options;
  options.environment["QTB_DEBUG_CPU_TYPE"] = override_text;
  options.prepare = [] {
    const rlimit no_core_file = {};
    setrlimit(RLIMIT_CORE, &no_core_file);
  };
  return run_program({"qemu-x86_64", "-cpu", "qemu64," + processor, QTB_TEST_DIAGNOSTIC}, options);
}

void expect_diagnostic(const std::string &processor, const std::string &override_text, const std::string &want) {
  if (!simulator_is_there()) GTEST_SKIP() << no_simulator;
  const Run run = diagnose(processor, override_text);
  EXPECT_EQ(run.status, 0) << processor;
  EXPECT_EQ(run.output, want) << processor;
  std::printf("%s%s%s: %s", processor.c_str(), override_text.empty() ? "" : ", override ", override_text.c_str(),
              run.output.c_str());
}

std::string tier(const std::string &name, int family16 = 0) {
  return "detected " + name + ", dispatched " + name + ", family 16 " + std::to_string(family16) + ", results right\n";
}

const std::string belmo = "vendor=GenuineBelmo,", amd = "vendor=AuthenticAMD,";

TEST(Simulated, BelmoProcessorsTakeTheTierOfTheirInstructions) {
  expect_diagnostic(belmo + no_sse3, "", tier("def"));
  expect_diagnostic(belmo + sse3, "", tier("sse3"));
  expect_diagnostic(belmo + ssse3, "", tier("ssse3"));
  expect_diagnostic(belmo + sse41, "", tier("ssse3"));
  expect_diagnostic(belmo + sse42, "", tier("sse42"));
}

TEST(Simulated, AvxIsTakenOnlyWhereItIsAskedFor) {
  expect_diagnostic(belmo + avx, "", tier("sse42"));
  expect_diagnostic(belmo + avx, "4", tier("avx"));
}

TEST(Simulated, OtherVendorsTakeDefWithAllInstructions) {
  expect_diagnostic(std::string("vendor=SomeoneElse1,family=6,") + avx, "", tier("def"));
  expect_diagnostic(amd + "family=15," + avx, "", tier("def"));
}

TEST(Simulated, AmdFamily16IsKnown) {
  expect_diagnostic(amd + "family=16," + sse3, "", tier("def", 1));
  expect_diagnostic(amd + "family=17," + sse3, "", tier("def"));
  expect_diagnostic(belmo + "family=16," + no_sse3, "", tier("def"));
}

TEST(Simulated, AnOverrideWinsOverTheVendor) {
  expect_diagnostic(amd + "family=15," + sse42, "3", tier("sse42"));
  expect_diagnostic(amd + "family=15," + sse42, "2", tier("ssse3"));
  expect_diagnostic(belmo + sse42, "1", tier("sse3"));
  expect_diagnostic(belmo + sse42, "0", tier("def"));
}

TEST(Simulated, AnOverrideBeyondTheProcessorEndsInAnIllegalInstruction) {
  if (!simulator_is_there()) GTEST_SKIP() << no_simulator;
  for (const char *above : {"1", "2", "3", "4"}) {
    const auto run = diagnose(belmo + no_sse3, above);
    EXPECT_TRUE(WIFSIGNALED(run.status) && WTERMSIG(run.status) == SIGILL) << above << ": " << run.output;
  }
}

}  // namespace
}  // namespace qtb::test
