// Arbitrary texts in the catalogue: one is printed only if it has the conversions of the built-in text, in their order,
// and nothing else that begins with a percent sign; otherwise the built-in text is printed.
//
// An input is the text of message 6, up to a zero byte. Links with the made-up catalogue of tests/platform.

#include <cstdint>
#include <regex>
#include <string>

#include "service/messages.h"
#include "tests/platform/fake_messages.h"
#include "tests/support/captured_stdout.h"

namespace {

constexpr std::int32_t parameter = 3;
const std::string routine = "DGEMM ";

// The text with its arguments if every percent sign begins a pair, the one "%d" or the "%s" behind it.
std::string formatted(const std::string &text) {
  static const std::regex whole("((?:[^%]|%%)*)%d((?:[^%]|%%)*)%s((?:[^%]|%%)*)");
  std::smatch parts;
  if (!std::regex_match(text, parts, whole))
    return "QTB ERROR: Parameter " + std::to_string(parameter) + " was incorrect on entry to " + routine;
  using qtb::test::collapse_percent_signs;
  return collapse_percent_signs(parts[1].str()) + std::to_string(parameter) + collapse_percent_signs(parts[2].str()) +
         routine + collapse_percent_signs(parts[3].str());
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
  std::string text(data, data + size);
  text = text.substr(0, text.find('\0'));
  // A longer text would end the process once its arguments are in it.
  if (text.size() > qtb::message_length_limit - routine.size()) return 0;
  qtb::test::fake_messages.present = true;
  qtb::test::fake_messages.texts[message_parameter] = text;

  std::string stripped = text;
  if (stripped.ends_with("\r\n")) stripped.resize(stripped.size() - 2);
  const std::string expected = qtb::test::collapse_percent_signs(formatted(stripped)) + "\n";
  const std::string printed =
      qtb::test::captured_stdout([] { qtb_serv_print(1, message_parameter, 2, parameter, routine.c_str()); });
  if (printed != expected) {
    std::fprintf(stderr, "[%s] printed as %s", text.c_str(), printed.c_str());
    std::abort();
  }
  return 0;
}
