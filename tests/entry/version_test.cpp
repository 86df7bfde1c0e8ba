// QTBGetVersionString: the text, and how it fills buffers of every length.

#include <gtest/gtest.h>

#include <string>

#include "tests/support/guarded.h"

extern "C" void QTBGetVersionString(char *buffer, std::int32_t length);

namespace {

const std::string text =
    "Belmo(R) Quill Tensor Base Version 10.2.2 Product Build 20090814 for Belmo(R) 64 architecture applications";

constexpr char untouched = '\x55';

// The buffer after a call with a length; bytes behind the length are in it too and must be untouched.
std::string delivered(std::int32_t length, std::size_t room = 300) {
  std::string buffer(room, untouched);
  QTBGetVersionString(buffer.data(), length);
  return buffer;
}

std::string padded(std::string head, std::size_t zeros_to, std::size_t room = 300) {
  head.resize(zeros_to, '\0');
  head.resize(room, untouched);
  return head;
}

TEST(Version, exactly_the_text_and_its_terminator) {
  EXPECT_EQ(delivered(static_cast<std::int32_t>(text.size()) + 1), padded(text, text.size() + 1));
}

TEST(Version, one_byte_short_of_the_terminator_cuts_the_last_character) {
  EXPECT_EQ(delivered(static_cast<std::int32_t>(text.size())), padded(text.substr(0, text.size() - 1), text.size()));
}

TEST(Version, one_byte_more_is_a_zero) {
  EXPECT_EQ(delivered(static_cast<std::int32_t>(text.size()) + 2), padded(text, text.size() + 2));
}

TEST(Version, a_buffer_of_200_has_zeros_up_to_its_last_byte) { EXPECT_EQ(delivered(200), padded(text, 200)); }

TEST(Version, a_buffer_of_10_has_nine_characters) { EXPECT_EQ(delivered(10), padded(text.substr(0, 9), 10)); }

TEST(Version, a_buffer_of_1_has_the_terminator) { EXPECT_EQ(delivered(1), padded("", 1)); }

TEST(Version, without_room_nothing_is_written) {
  EXPECT_EQ(delivered(0), padded("", 0));
  EXPECT_EQ(delivered(-1), padded("", 0));
  EXPECT_EQ(delivered(INT32_MIN), padded("", 0));
}

TEST(Version, never_writes_outside_the_buffer) {
  for (std::size_t length = 1; length <= 2 * text.size(); ++length) {
    qtb::test::Guarded<char> buffer(length);
    QTBGetVersionString(buffer.data(), static_cast<std::int32_t>(length));
    ASSERT_EQ(std::string(buffer.data()), text.substr(0, length - 1)) << length;
    for (std::size_t i = std::min(length - 1, text.size()); i < length; ++i) ASSERT_EQ(buffer[i], '\0') << length;
  }
}

}  // namespace
