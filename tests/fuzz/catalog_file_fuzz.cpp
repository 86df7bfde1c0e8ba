// Arbitrary files as message catalogues: what the reader answers is what the format says, written out independently,
// and it reads nothing outside the file, which ends where a trapping page begins.
//
// An input is a whole file. Links with the library's own reader.

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <optional>
#include <set>
#include <string>

#include "service/platform/catalog_file.h"
#include "tests/support/guarded.h"

namespace {

using Text = std::optional<std::string>;

// The file as numbers of 32 bits in either byte order.
struct File {
  const std::uint8_t *data;
  std::size_t size;

  std::uint64_t number(std::size_t at, bool swapped) const {
    std::uint64_t value = 0;
    for (std::size_t i = 0; i < 4; ++i) value = value << 8 | data[swapped ? at + i : at + 3 - i];
    return value;
  }
};

// The entries that can be seen of the first table, 0 where the file is no catalogue.
struct Table {
  std::size_t columns = 0, rows = 0;
};

Table table_of(const File &file) {
  if (file.size < 12) return {};
  const bool swapped = file.number(0, true) == 0x960408de;
  if (!swapped && file.number(0, false) != 0x960408de) return {};
  const std::uint64_t columns = file.number(4, swapped), rows = file.number(8, swapped);
  const unsigned __int128 end = 12 + static_cast<unsigned __int128>(columns) * rows * 24;
  if (columns == 0 || rows == 0 || end > file.size) return {};
  return {columns, rows};
}

Text expected_text(const File &file, const Table &table, std::uint32_t number) {
  const std::size_t texts = 12 + table.columns * table.rows * 24;
  for (std::size_t i = 0; i < table.columns * table.rows; ++i) {
    if (i % table.columns != 2 * number % table.columns) continue;
    const std::size_t entry = 12 + 12 * i;
    if (file.number(entry, false) != 2 || file.number(entry + 4, false) != number) continue;
    std::string text;
    for (std::size_t at = texts + file.number(entry + 8, false); at < file.size; ++at) {
      if (file.data[at] == 0) return text;
      text.push_back(static_cast<char>(file.data[at]));
    }
    return std::nullopt;
  }
  return std::nullopt;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
  qtb::test::Guarded<unsigned char> memory(size);
  std::memcpy(memory.data(), data, size);
  memory.read_only();

  const File file = {data, size};
  const Table table = table_of(file);
  qtb::CatalogFile catalog;
  if (qtb::read_catalog(memory.data(), size, &catalog) != (table.columns != 0)) std::abort();
  if (table.columns == 0) return 0;

  // The numbers that the library asks for, their neighbours, and some that the file itself has.
  std::set<std::uint32_t> numbers = {0, 1, 6, 7, 8, 9, 10, 1079, 1080, INT32_MAX, UINT32_MAX};
  for (std::size_t i = 0; i < table.columns * table.rows && i < 16; ++i)
    numbers.insert(static_cast<std::uint32_t>(file.number(16 + 12 * i, false)));
  for (const std::uint32_t number : numbers) {
    const char *const found = qtb::catalog_text(catalog, static_cast<std::int32_t>(number));
    const Text text = found == nullptr ? std::nullopt : Text(found), expected = expected_text(file, table, number);
    if (text == expected) continue;
    std::fprintf(stderr, "message %u is [%s], not [%s]\n", number, text.value_or("absent").c_str(),
                 expected.value_or("absent").c_str());
    std::abort();
  }
  return 0;
}
