// Localised messages through the system's message catalogues, made by its gencat: the folder of the locale, texts that
// may and may not be used, and files that are no catalogue.

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

#include "service/messages.h"
#include "service/platform/platform.h"
#include "tests/service/catalog_bytes.h"
#include "tests/support/child.h"

namespace {

namespace fs = std::filesystem;

const std::string builtin_6 = "QTB ERROR: Parameter 3 was incorrect on entry to DGEMM \n";

// A working directory of its own, with catalogues below it.
class Catalog : public testing::Test {
 protected:
  void SetUp() override {
    char path[] = "/tmp/qtb_catalog_XXXXXX";
    ASSERT_NE(mkdtemp(path), nullptr);
    directory_ = path;
  }
  void TearDown() override { fs::remove_all(directory_); }

  // Compiles messages in gencat's source form ("6 text") into <locale>/qtb_msg.cat.
  void make(const std::string &locale, const std::string &messages) {
    fs::create_directories(directory_ / locale);
    const fs::path source = directory_ / "source.msg", catalog = directory_ / locale / "qtb_msg.cat";
    std::ofstream(source) << "$set 1\n" << messages;
    ASSERT_EQ(std::system(("gencat " + catalog.string() + " " + source.string()).c_str()), 0);
  }

  void write(const std::string &locale, const std::string &bytes) {
    fs::create_directories(directory_ / locale);
    std::ofstream(directory_ / locale / "qtb_msg.cat", std::ios::binary) << bytes;
  }

  // What message 6 prints in the directory with an environment variable set.
  std::string message_6(const char *variable = "LC_ALL", const char *locale = "en_US.UTF-8") {
    const auto result = qtb::test::capture_child([&] {
      for (const char *name : {"LC_ALL", "LC_MESSAGES", "LANG"}) unsetenv(name);
      setenv(variable, locale, 1);
      if (chdir(directory_.c_str()) != 0) _exit(1);
      qtb_serv_print(1, 6, 2, 3, "DGEMM ");
    });
    EXPECT_EQ(result.exit_status, 0);
    return result.output;
  }

  fs::path directory_;
};

TEST_F(Catalog, without_a_file_the_built_in_text_is_printed) { EXPECT_EQ(message_6(), builtin_6); }

TEST_F(Catalog, a_text_of_the_file_is_used) {
  make("1033", "6 parameter %d of %s is bad\n");
  EXPECT_EQ(message_6(), "parameter 3 of DGEMM  is bad\n");
}

TEST_F(Catalog, a_line_end_of_the_text_is_stripped) {
  make("1033", "6 parameter %d of %s is bad\\r\\n\n");
  EXPECT_EQ(message_6(), "parameter 3 of DGEMM  is bad\n");
}

TEST_F(Catalog, numbers_up_to_the_last_are_found) {
  make("1033", "7 seven %d %s\n1079 last %s\n");
  const auto result = qtb::test::capture_child([&] {
    setenv("LC_ALL", "C", 1);
    if (chdir(directory_.c_str()) != 0) _exit(1);
    qtb_serv_print(1, 7, 2, 3, "DGEMM ");
    qtb_serv_print(1, 1079, 1, "DGEMM ");
    qtb_serv_print(1, 8, 1, "DGEMM ");
    qtb_serv_print(1, -7, 0);
  });
  EXPECT_EQ(result.output,
            "seven 3 DGEMM \nlast DGEMM \nQTB INTERNAL ERROR: Not enough work memory in function DGEMM \n\n");
}

TEST_F(Catalog, hostile_texts_are_not_used) {
  for (const char *text : {"%n%d %s", "%d %s %n", "%d %s %s", "%s %d", "%2$s %1$d", "%1$d %2$n", "%*d %s", "%d %ls",
                           "%d %s %", "%999999999d %s", "%hhn%hhn", "only a text"}) {
    make("1033", std::string("6 ") + text + "\n");
    EXPECT_EQ(message_6(), builtin_6) << text;
  }
}

TEST_F(Catalog, a_text_too_long_is_not_used) {
  make("1033", "6 %d %s" + std::string(600, 'x') + "\n");
  EXPECT_EQ(message_6(), builtin_6);
}

TEST_F(Catalog, the_folder_is_the_number_of_the_locale) {
  make("1031", "6 falsch: %d %s\n");
  make("1033", "6 wrong: %d %s\n");
  EXPECT_EQ(message_6("LC_ALL", "de_DE.UTF-8"), "falsch: 3 DGEMM \n");
  EXPECT_EQ(message_6("LC_MESSAGES", "de"), "falsch: 3 DGEMM \n");
  EXPECT_EQ(message_6("LANG", "de_DE@euro"), "falsch: 3 DGEMM \n");
  EXPECT_EQ(message_6("LANG", "C"), "wrong: 3 DGEMM \n");
  EXPECT_EQ(message_6("LANG", "fr_FR.UTF-8"), builtin_6);
}

TEST_F(Catalog, what_is_no_catalogue_is_not_used) {
  write("1033", "");
  EXPECT_EQ(message_6(), builtin_6);
  write("1033", "6 wrong: %d %s\n");
  EXPECT_EQ(message_6(), builtin_6);
  write("1033", std::string(4096, '\xFF'));
  EXPECT_EQ(message_6(), builtin_6);
}

// Such a machine writes the three words of the header in its own order; the tables behind it stand there in both.
TEST_F(Catalog, a_catalogue_from_a_machine_of_the_other_byte_order_is_used) {
  make("1033", "6 parameter %d of %s is bad\n");
  std::fstream file(directory_ / "1033" / "qtb_msg.cat", std::ios::in | std::ios::out | std::ios::binary);
  char header[12];
  file.read(header, sizeof header);
  for (char *word = header; word != std::end(header); word += 4) std::reverse(word, word + 4);
  file.seekp(0);
  file.write(header, sizeof header);
  file.close();
  ASSERT_TRUE(file.good());
  EXPECT_EQ(message_6(), "parameter 3 of DGEMM  is bad\n");
}

// A cut catalogue is none, or all of its text was before the cut.
TEST_F(Catalog, a_cut_catalogue_gives_a_whole_text_or_none) {
  make("1033", "6 wrong: %d %s\n");
  const fs::path path = directory_ / "1033" / "qtb_msg.cat";
  int cut = 0;
  for (std::uintmax_t size = fs::file_size(path); size-- > 0;) {
    fs::resize_file(path, size);
    const std::string output = message_6();
    cut += output == builtin_6;
    ASSERT_TRUE(output == builtin_6 || output == "wrong: 3 DGEMM \n") << size << ": " << output;
  }
  EXPECT_GT(cut, 0);
}

TEST_F(Catalog, a_damaged_catalogue_passes_no_other_conversions) {
  make("1033", "6 wrong: %d %s\n");
  const fs::path path = directory_ / "1033" / "qtb_msg.cat";
  std::ifstream stream(path, std::ios::binary);
  const std::string whole((std::istreambuf_iterator<char>(stream)), std::istreambuf_iterator<char>());
  for (std::size_t i = 0; i < whole.size(); ++i)
    for (char replacement : {'%', 'n', '\0', '\xFF'}) {
      std::string damaged = whole;
      damaged[i] = replacement;
      write("1033", damaged);
      const std::string output = message_6();
      EXPECT_TRUE(output == builtin_6 || (output.find('3') < output.find("DGEMM") && output.back() == '\n')) << i;
    }
}

// Sizes of whole pages, behind which there may be anything or nothing, and offsets that lead there.
TEST_F(Catalog, a_text_that_begins_or_ends_outside_the_file_is_not_used) {
  using qtb::test::catalog_with_message_6;
  const std::size_t tables = catalog_with_message_6(0, "").size();
  const std::string text = "last %d %s", zero_byte(1, '\0');
  for (const std::size_t file_size : {std::size_t{4096}, std::size_t{8192}, std::size_t{2} << 20}) {
    const auto size = static_cast<std::uint32_t>(file_size - tables);
    const std::string before(size - text.size() - 1, 'x');
    const auto begin = static_cast<std::uint32_t>(before.size());
    write("1033", catalog_with_message_6(begin, before + text + zero_byte));
    EXPECT_EQ(message_6(), "last 3 DGEMM \n") << file_size << ": a text up to the end";
    write("1033", catalog_with_message_6(begin + 1, before + 'x' + text));
    EXPECT_EQ(message_6(), builtin_6) << file_size << ": no zero byte";
    for (const std::uint32_t beyond : {size, size + 1, size + 12, size + 4096, 1U << 30, UINT32_MAX}) {
      write("1033", catalog_with_message_6(beyond, before + text + zero_byte));
      EXPECT_EQ(message_6(), builtin_6) << file_size << ": begins at " << beyond;
    }
  }
}

TEST_F(Catalog, a_file_larger_than_all_messages_need_is_not_used) {
  const std::string text = "large %d %s" + std::string(1, '\0');
  const auto with_size = [&](std::size_t size) {
    std::string bytes = qtb::test::catalog_with_message_6(0, text);
    bytes.resize(size);
    write("1033", bytes);
  };
  with_size(std::size_t{4} << 20);
  EXPECT_EQ(message_6(), "large 3 DGEMM \n");
  with_size((std::size_t{4} << 20) + 1);
  EXPECT_EQ(message_6(), builtin_6);
}

// What was read at the first message is what is used to the end, whatever becomes of the file.
TEST_F(Catalog, a_file_that_changes_after_it_was_read_changes_nothing) {
  make("1033", "6 parameter %d of %s is bad\n7 " + std::string(6000, 'x') + "\n8 later %s\n");
  const auto result = qtb::test::capture_child([&] {
    setenv("LC_ALL", "C", 1);
    if (chdir(directory_.c_str()) != 0) _exit(1);
    qtb_serv_print(1, 6, 2, 3, "DGEMM ");
    fs::resize_file(directory_ / "1033" / "qtb_msg.cat", 0);
    qtb_serv_print(1, 8, 1, "DGEMM ");
    write("1033", std::string(20000, '%'));
    qtb_serv_print(1, 6, 2, 3, "DGEMM ");
  });
  EXPECT_EQ(result.exit_status, 0);
  EXPECT_EQ(result.output, "parameter 3 of DGEMM  is bad\nlater DGEMM \nparameter 3 of DGEMM  is bad\n");
}

TEST_F(Catalog, a_folder_or_a_pipe_in_its_place_is_not_used) {
  fs::create_directories(directory_ / "1033" / "qtb_msg.cat");
  EXPECT_EQ(message_6(), builtin_6);
  fs::remove(directory_ / "1033" / "qtb_msg.cat");
  ASSERT_EQ(mkfifo((directory_ / "1033" / "qtb_msg.cat").c_str(), 0600), 0);
  EXPECT_EQ(message_6(), builtin_6);
}

unsigned long locale_number(const char *lc_all, const char *lc_messages, const char *lang) {
  const std::pair<const char *, const char *> variables[] = {
      {"LC_ALL", lc_all}, {"LC_MESSAGES", lc_messages}, {"LANG", lang}};
  for (const auto &[name, value] : variables) value != nullptr ? setenv(name, value, 1) : unsetenv(name);
  return platform_message_locale();
}

TEST(Locale, is_1033_where_nothing_names_another) {
  EXPECT_EQ(locale_number(nullptr, nullptr, nullptr), 1033U);
  EXPECT_EQ(locale_number("", "", ""), 1033U);
  EXPECT_EQ(locale_number("C", nullptr, nullptr), 1033U);
  EXPECT_EQ(locale_number("POSIX", nullptr, nullptr), 1033U);
  EXPECT_EQ(locale_number("C.UTF-8", nullptr, nullptr), 1033U);
  EXPECT_EQ(locale_number("xx_YY", nullptr, nullptr), 1033U);
}

TEST(Locale, the_first_variable_with_a_value_decides) {
  EXPECT_EQ(locale_number("ja_JP.UTF-8", "de_DE", "fr_FR"), 1041U);
  EXPECT_EQ(locale_number(nullptr, "de_DE", "fr_FR"), 1031U);
  EXPECT_EQ(locale_number("", "", "fr_FR"), 1036U);
  EXPECT_EQ(locale_number("C", "de_DE", "fr_FR"), 1033U);
}

TEST(Locale, a_territory_has_a_number_of_its_own_where_there_is_one) {
  EXPECT_EQ(locale_number("en_GB.UTF-8", nullptr, nullptr), 2057U);
  EXPECT_EQ(locale_number("en_US", nullptr, nullptr), 1033U);
  EXPECT_EQ(locale_number("pt_BR", nullptr, nullptr), 1046U);
  EXPECT_EQ(locale_number("pt_PT", nullptr, nullptr), 2070U);
  EXPECT_EQ(locale_number("zh_CN.GB18030", nullptr, nullptr), 2052U);
  EXPECT_EQ(locale_number("zh_TW", nullptr, nullptr), 1028U);
  EXPECT_EQ(locale_number("de_LI", nullptr, nullptr), 1031U);
}

TEST(Locale, a_longer_language_is_another_one) {
  EXPECT_EQ(locale_number("den_CA", nullptr, nullptr), 1033U);
  EXPECT_EQ(locale_number("fil_PH", nullptr, nullptr), 1033U);
}

}  // namespace
