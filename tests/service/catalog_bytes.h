// Message catalogues put together in memory, with any word in any place: files that gencat would not write.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace qtb::test {

struct CatalogEntry {
  std::uint32_t set, number, begin;
};

// The number that an entry of the default set bears.
inline constexpr std::uint32_t default_set = 2;

inline std::string word_bytes(std::uint32_t word) {
  return {static_cast<char>(word), static_cast<char>(word >> 8), static_cast<char>(word >> 16),
          static_cast<char>(word >> 24)};
}

// The mark, columns and rows as they are given, and both tables with the entries.
inline std::string catalog_bytes(std::uint32_t columns, std::uint32_t rows, const std::vector<CatalogEntry> &entries,
                                 const std::string &texts) {
  std::string table, swapped_table;
  for (const CatalogEntry &entry : entries)
    for (const std::uint32_t word : {entry.set, entry.number, entry.begin}) {
      table += word_bytes(word);
      swapped_table += word_bytes(__builtin_bswap32(word));
    }
  return word_bytes(0x960408de) + word_bytes(columns) + word_bytes(rows) + table + swapped_table + texts;
}

// A catalogue with one text for message 6 that begins so far behind the tables.
inline std::string catalog_with_message_6(std::uint32_t begin, const std::string &texts) {
  return catalog_bytes(1, 1, {{default_set, 6, begin}}, texts);
}

}  // namespace qtb::test
