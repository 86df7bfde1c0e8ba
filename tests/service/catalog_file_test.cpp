// The reader of message catalogues: what gencat writes, as the system's own reader finds it, and bytes that mislead,
// with a page behind them that traps.

#include "service/platform/catalog_file.h"

#include <gtest/gtest.h>
#include <nl_types.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <optional>
#include <random>

#include "tests/service/catalog_bytes.h"
#include "tests/support/guarded.h"

namespace qtb::test {
namespace {

constexpr std::size_t page = 4096;

// A catalogue that ends where a trapping page begins.
class Opened {
 public:
  explicit Opened(const std::string &bytes) : memory_(bytes.size()) {
    std::memcpy(memory_.data(), bytes.data(), bytes.size());
    memory_.read_only();
    is_catalog = read_catalog(memory_.data(), bytes.size(), &catalog_);
  }
  std::optional<std::string> text(std::int32_t number) const {
    const char *const found = is_catalog ? catalog_text(catalog_, number) : nullptr;
    return found == nullptr ? std::nullopt : std::optional<std::string>(found);
  }
  bool is_catalog;

 private:
  Guarded<unsigned char> memory_;
  CatalogFile catalog_ = {};
};

const std::string zero_byte(1, '\0');

TEST(CatalogFile, GivesTheTextOfANumberUpToItsZeroByte) {
  const std::string texts = "six" + zero_byte + "seven" + zero_byte + zero_byte;
  const Opened catalog(catalog_bytes(1, 3, {{default_set, 6, 0}, {default_set, 7, 4}, {default_set, 8, 10}}, texts));
  EXPECT_EQ(catalog.text(6), "six");
  EXPECT_EQ(catalog.text(7), "seven");
  EXPECT_EQ(catalog.text(8), "");
  for (const std::int32_t number : {0, 1, 5, 9, -6, INT32_MIN, INT32_MAX})
    EXPECT_EQ(catalog.text(number), std::nullopt);
}

TEST(CatalogFile, TakesTheDefaultSetAloneAndTheFirstOfTwoEntries) {
  const std::string texts = "other" + zero_byte + "first" + zero_byte + "second" + zero_byte;
  const Opened catalog(catalog_bytes(1, 4, {{1, 6, 0}, {3, 6, 0}, {default_set, 6, 6}, {default_set, 6, 12}}, texts));
  EXPECT_EQ(catalog.text(6), "first");
}

// Message 6 of the default set is in column 12 % 5.
TEST(CatalogFile, LooksIntoTheColumnOfTheNumber) {
  const std::string texts = "six" + zero_byte;
  for (std::size_t place = 0; place < 10; ++place) {
    std::vector<CatalogEntry> entries(10);
    entries[place] = {default_set, 6, 0};
    const Opened catalog(catalog_bytes(5, 2, entries, texts));
    EXPECT_EQ(catalog.text(6).has_value(), place % 5 == 2) << place;
  }
}

TEST(CatalogFile, IsNoneWithAnotherMarkOrNoEntry) {
  const std::string good = catalog_with_message_6(0, "six" + zero_byte);
  EXPECT_TRUE(Opened(good).is_catalog);
  for (std::size_t byte = 0; byte < 4; ++byte) {
    std::string other = good;
    ++other[byte];
    EXPECT_FALSE(Opened(other).is_catalog) << byte;
  }
  EXPECT_FALSE(Opened(catalog_bytes(0, 1, {}, std::string(page, 'x'))).is_catalog);
  EXPECT_FALSE(Opened(catalog_bytes(1, 0, {}, std::string(page, 'x'))).is_catalog);
}

TEST(CatalogFile, IsReadInTheByteOrderOfItsHeader) {
  std::string bytes = catalog_bytes(2, 3, std::vector<CatalogEntry>(6, {default_set, 6, 0}), "six" + zero_byte);
  for (std::size_t word = 0; word < 3; ++word) std::reverse(bytes.begin() + 4 * word, bytes.begin() + 4 * word + 4);
  EXPECT_EQ(Opened(bytes).text(6), "six");
}

TEST(CatalogFile, IsNoneUntilBothItsTablesAreThere) {
  const std::string whole = catalog_bytes(2, 2, std::vector<CatalogEntry>(4, {default_set, 6, 0}), "");
  for (std::size_t size = 0; size < whole.size(); ++size) EXPECT_FALSE(Opened(whole.substr(0, size)).is_catalog);
  EXPECT_TRUE(Opened(whole).is_catalog);
  EXPECT_EQ(Opened(whole).text(6), std::nullopt) << "there are no texts";
}

// Products of columns and rows, and bytes of so many entries, that 32 or 64 bits do not hold.
TEST(CatalogFile, IsNoneWithTablesBeyondItsEnd) {
  const std::string rest(2 * page, '\x02');
  constexpr std::uint32_t half = 1U << 31, most = UINT32_MAX;
  const std::pair<std::uint32_t, std::uint32_t> shapes[] = {
      {most, most},         {half, 2},      {2, half}, {1U << 16, 1U << 16},
      {half, half},         {most, 1},      {1, most}, {1U << 29, 1U << 31},
      {1U << 30, 1U << 31}, {178956971, 1}, {342, 1},  {1, 342},
      {0xAAAAAAAB, 0x10}};
  for (const auto &[columns, rows] : shapes)
    EXPECT_FALSE(Opened(catalog_bytes(columns, rows, {}, rest)).is_catalog) << columns << " x " << rows;
  EXPECT_TRUE(Opened(catalog_bytes(341, 1, {}, rest)).is_catalog) << "the most that have room";
}

TEST(CatalogFile, GivesNoTextThatBeginsOrEndsOutside) {
  for (const std::size_t size : {std::size_t{1}, std::size_t{3}, page - 36, page, 2 * page, std::size_t{2} << 20}) {
    const std::string endless(size, 'x'), ended = endless.substr(1) + zero_byte;
    const auto end = static_cast<std::uint32_t>(size);
    for (const std::uint32_t begin : {0U, end - 1}) {
      EXPECT_EQ(Opened(catalog_with_message_6(begin, endless)).text(6), std::nullopt) << size;
      EXPECT_EQ(Opened(catalog_with_message_6(begin, ended)).text(6), ended.substr(begin, end - 1 - begin)) << size;
    }
    for (const std::uint32_t begin :
         {end, end + 1, end + 36, INT32_MAX + 0U, INT32_MAX + 1U, UINT32_MAX - 36, UINT32_MAX})
      EXPECT_EQ(Opened(catalog_with_message_6(begin, ended)).text(6), std::nullopt) << size << " at " << begin;
  }
}

// Sets and messages enough for tables of many columns and rows.
TEST(CatalogFile, AnswersWhatTheSystemsReaderAnswers) {
  namespace fs = std::filesystem;
  char directory[] = "/tmp/qtb_catalog_XXXXXX";
  ASSERT_NE(mkdtemp(directory), nullptr);
  const fs::path source = fs::path(directory) / "source.msg", path = fs::path(directory) / "made.cat";
  std::mt19937 random(6);
  int found = 0;
  for (const int messages : {1, 7, 60, 500}) {
    std::ofstream file(source);
    for (int set = 1; set <= 3; ++set) {
      file << "$set " << set << "\n";
      for (int number = 1; number <= 1079; ++number)
        if (static_cast<int>(random() % 1079) < messages || number == 1079)
          file << number << " set " << set << " message " << number << std::string(random() % 60, 'x') << "\n";
    }
    file.close();
    ASSERT_EQ(std::system(("gencat " + path.string() + " " + source.string() + " 2>/dev/null").c_str()), 0);
    std::ifstream stream(path, std::ios::binary);
    const Opened ours(std::string((std::istreambuf_iterator<char>(stream)), std::istreambuf_iterator<char>()));
    ASSERT_TRUE(ours.is_catalog);
    const nl_catd theirs = catopen(path.c_str(), 0);
    ASSERT_NE(theirs, reinterpret_cast<nl_catd>(-1));
    for (int number = 0; number <= 1100; ++number) {
      const char absent[] = "absent";
      EXPECT_EQ(ours.text(number).value_or(absent), catgets(theirs, NL_SETD, number, absent)) << number;
      found += ours.text(number).has_value();
    }
    catclose(theirs);
  }
  fs::remove_all(directory);
  EXPECT_GT(found, 400);
}

}  // namespace
}  // namespace qtb::test
