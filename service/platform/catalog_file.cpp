// The parts of a message catalogue and its texts, every step inside the bytes of the file.

#include "service/platform/catalog_file.h"

#include <cstring>

namespace qtb {
namespace {

constexpr std::uint32_t catalog_mark = 0x960408de;
constexpr std::uint32_t swapped_mark = 0xde080496;

constexpr std::size_t word_size = sizeof(std::uint32_t);
constexpr std::size_t header_size = 3 * word_size;
constexpr std::size_t entry_size = 3 * word_size;
constexpr std::size_t tables = 2;  // one per byte order

// The default set (NL_SETD) is set 1, and entries hold the number of their set plus 1.
constexpr std::uint32_t default_set_in_entries = 2;

// The word at an index of 32-bit words, at any alignment.
std::uint32_t word(const unsigned char *bytes, std::uint64_t index) {
  std::uint32_t value;
  std::memcpy(&value, bytes + index * word_size, word_size);
  return value;
}

}  // namespace

bool read_catalog(const unsigned char *bytes, std::size_t size, CatalogFile *catalog) {
  if (size < header_size) return false;
  std::uint32_t columns = word(bytes, 1), rows = word(bytes, 2);
  if (word(bytes, 0) == swapped_mark) {
    columns = __builtin_bswap32(columns);
    rows = __builtin_bswap32(rows);
  } else if (word(bytes, 0) != catalog_mark) {
    return false;
  }
  // Two factors of 32 bits: the product is exact, and by the division what follows cannot wrap around either.
  const std::uint64_t entries = static_cast<std::uint64_t>(columns) * rows;
  if (entries == 0 || entries > (size - header_size) / (tables * entry_size)) return false;
  const std::size_t before_texts = header_size + entries * tables * entry_size;
  *catalog = {bytes + header_size, columns, rows, reinterpret_cast<const char *>(bytes) + before_texts,
              size - before_texts};
  return true;
}

const char *catalog_text(const CatalogFile &catalog, std::int32_t number) {
  const std::uint32_t wanted = static_cast<std::uint32_t>(number);
  const std::uint64_t column = default_set_in_entries * wanted % catalog.columns;
  for (std::uint64_t row = 0; row < catalog.rows; ++row) {
    const unsigned char *entry = catalog.entries + (row * catalog.columns + column) * entry_size;
    if (word(entry, 0) != default_set_in_entries || word(entry, 1) != wanted) continue;
    const std::uint32_t begin = word(entry, 2);
    if (begin >= catalog.texts_size) return nullptr;
    const char *text = catalog.texts + begin;
    return std::memchr(text, '\0', catalog.texts_size - begin) == nullptr ? nullptr : text;
  }
  return nullptr;
}

}  // namespace qtb
