// The error reporter under arbitrary codes, lengths and names: it prints what the published form says, reads no more of
// the name than it may, and never ends the process.
//
// An input is the code and the length, 4 bytes each, and the name. Links with the made-up catalogue of tests/platform.

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <memory>
#include <string>

#include "blas/entry/xerbla.h"
#include "tests/support/captured_stdout.h"

extern "C" int xerbla(const char *name, const QtbInt *info, std::int32_t length);

namespace {

std::string expected_text(std::int32_t code, const std::string &name) {
  if (code == 1000 || code == 1079) return "QTB INTERNAL ERROR: Not enough work memory in function " + name;
  if (code == 1001) return "QTB ERROR: Incompatible optional parameters on entry to " + name;
  if (code > 0) return "QTB ERROR: Parameter " + std::to_string(code) + " was incorrect on entry to " + name;
  const std::int64_t condition = code == INT32_MIN ? code : -code;
  return "QTB INTERNAL ERROR: Condition " + std::to_string(condition) + " detected in function " + name;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
  std::int32_t code = 0, length = 0;
  if (size < sizeof code + sizeof length) return 0;
  std::memcpy(&code, data, sizeof code);
  std::memcpy(&length, data + sizeof code, sizeof length);
  const std::string bytes(data + sizeof code + sizeof length, data + size);

  // A name whose length covers it needs no terminator, and then has none.
  const bool terminated = length < 0 || static_cast<std::size_t>(length) > bytes.size();
  const std::size_t room = terminated ? bytes.size() + 1 : static_cast<std::size_t>(length);
  const std::unique_ptr<char[]> name(new char[room]);
  std::memcpy(name.get(), bytes.c_str(), room);

  const std::size_t limit = length < 0 ? 20 : std::min<std::size_t>(20, static_cast<std::size_t>(length));
  const std::string shown = bytes.substr(0, std::min(limit, bytes.find('\0')));
  const std::string expected = "\n" + qtb::test::collapse_percent_signs(expected_text(code, shown)) + "\n";

  const QtbInt info = (QtbInt{0x5A5A5A5A} << 32) | static_cast<std::uint32_t>(code);
  const std::string printed = qtb::test::captured_stdout([&] { xerbla(name.get(), &info, length); });
  if (printed != expected) {
    std::fprintf(stderr, "code %d, length %d, name [%s]: %s", code, length, bytes.c_str(), printed.c_str());
    std::abort();
  }
  return 0;
}
