// The tier taken on processors that a simulator makes up: vendor, instructions and family, with the real kernels. The
// simulated processor stops at an instruction that it lacks.

#include <gtest/gtest.h>

#include "tests/support/run.h"

namespace qtb::test {
namespace {

const char *const no_sse3 = "-sse3,-ssse3,-sse4.1,-sse4.2";
const char *const sse3 = "+sse3,-ssse3,-sse4.1,-sse4.2";
const char *const ssse3 = "+sse3,+ssse3,-sse4.1,-sse4.2";
const char *const sse41 = "+sse3,+ssse3,+sse4.1,-sse4.2";
const char *const sse42 = "+sse3,+ssse3,+sse4.1,+sse4.2";
const char *const avx = "+sse3,+ssse3,+sse4.1,+sse4.2,+avx,+xsave";

bool simulator_is_there() { return run_program({"qemu-x86_64", "--version"}).status == 0; }

void expect_diagnostic(const std::string &processor, const std::string &override_text, const std::string &want) {
  if (!simulator_is_there()) GTEST_SKIP() << "qemu-x86_64 is not installed";
  RunOptions options;
  options.environment["QTB_DEBUG_CPU_TYPE"] = override_text;
  const Run run = run_program({"qemu-x86_64", "-cpu", "qemu64," + processor, QTB_TEST_DIAGNOSTIC}, options);
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

}  // namespace
}  // namespace qtb::test
