// The thread variables under arbitrary values: what the library reads equals the rules written out independently.
//
// An input is up to six values, each ended by a line feed or a zero byte, in the order in which they are read. Links
// with the made-up operating system of tests/platform.

#include <cstddef>
#include <cstdint>
#include <cstdio>

#include "service/thread_settings.h"
#include "tests/platform/fake.h"
#include "tests/service/environment_transcription.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
  using namespace qtb::test;
  fake.environment.clear();
  fake.environment_reads.clear();
  std::size_t at = 0;
  for (const char *name : {"QTB_NUM_THREADS", "QTB_DOMAIN_NUM_THREADS", "QTB_DYNAMIC", "OMP_NUM_THREADS",
                           "Q_MPI_NUMBER_OF_MPI_PROCESSES_PER_NODE", "Q_MPI_THREAD_LEVEL"}) {
    std::string value;
    for (; at < size && data[at] != '\n' && data[at] != 0; ++at) value.push_back(static_cast<char>(data[at]));
    ++at;
    if (!value.empty()) fake.environment[name] = value;
  }
  qtb::ThreadSettings read;
  qtb::read_thread_variables(&read);
  if (read == transcribed_settings(fake.environment)) return 0;
  for (const auto &[name, value] : fake.environment) std::fprintf(stderr, "%s=[%s]\n", name.c_str(), value.c_str());
  std::abort();
}
