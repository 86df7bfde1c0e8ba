// A message catalogue as gencat writes it, read from memory that holds the bytes of a whole file.
//
// The file has a header of three words of 32 bits (a mark, columns, rows), a table of columns x rows entries, the same
// table in the other byte order, and the texts, each ended by a zero byte. An entry is three words: set, message
// number, and where its text begins among the texts. All entries of one column stand columns entries apart, and the set
// and the number say which column a message is in. The header is in the order of the machine that wrote it; of the
// tables the first is in the order of this processor.
//
// The bytes are anyone's: a file may be cut, damaged or made to mislead. Nothing outside them is read.
#pragma once

#include <cstddef>
#include <cstdint>

namespace qtb {

// Where the parts of a catalogue lie. The entries and the texts are those of the bytes that it was made from.
struct CatalogFile {
  const unsigned char *entries;
  std::uint64_t columns, rows;
  const char *texts;
  std::size_t texts_size;  // bytes
};

// Finds the parts of the catalogue in size bytes. False, with *catalog as it was, where the bytes are none: another
// mark, no entries, or tables that do not lie inside.
bool read_catalog(const unsigned char *bytes, std::size_t size, CatalogFile *catalog);

// Message number of the default set. Null where the catalogue has none, and where the text or the zero byte behind it
// would lie outside the file.
const char *catalog_text(const CatalogFile &catalog, std::int32_t number);

}  // namespace qtb
