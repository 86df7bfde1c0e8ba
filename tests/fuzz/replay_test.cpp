// Runs a fuzz target on its corpus: QTB_TEST_CORPUS is the folder, and the target ends the process on a finding.

#include <gtest/gtest.h>

#include <cstdint>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size);

namespace {

TEST(Corpus, holds_for_every_file) {
  int files = 0;
  for (const auto &entry : std::filesystem::directory_iterator(QTB_TEST_CORPUS)) {
    SCOPED_TRACE(entry.path());
    std::ifstream stream(entry.path(), std::ios::binary);
    const std::string bytes((std::istreambuf_iterator<char>(stream)), std::istreambuf_iterator<char>());
    LLVMFuzzerTestOneInput(reinterpret_cast<const std::uint8_t *>(bytes.data()), bytes.size());
    ++files;
  }
  EXPECT_GE(files, 10);
  RecordProperty("files", files);
}

}  // namespace
