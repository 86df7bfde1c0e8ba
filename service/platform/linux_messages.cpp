// Localised messages: the files of catalogues, and the locale as a published numeric language identifier.

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <new>

#include "service/platform/catalog_file.h"
#include "service/platform/platform.h"

namespace {

struct LocaleNumber {
  const char *name;  // language, or language and territory
  unsigned long number;
};

constexpr unsigned long default_locale = 1033;

// The first entry that a locale's name begins with is its own, so a language alone stands behind its territories.
constexpr LocaleNumber locale_numbers[] = {
    {"ar", 1025},    {"bg", 1026},    {"ca", 1027},    {"cs", 1029},    {"da", 1030},    {"de_AT", 3079},
    {"de_CH", 2055}, {"de", 1031},    {"el", 1032},    {"en_AU", 3081}, {"en_CA", 4105}, {"en_GB", 2057},
    {"en", 1033},    {"es_MX", 2058}, {"es", 3082},    {"et", 1061},    {"fi", 1035},    {"fr_BE", 2060},
    {"fr_CA", 3084}, {"fr_CH", 4108}, {"fr", 1036},    {"he", 1037},    {"hi", 1081},    {"hr", 1050},
    {"hu", 1038},    {"id", 1057},    {"it_CH", 2064}, {"it", 1040},    {"ja", 1041},    {"ko", 1042},
    {"lt", 1063},    {"lv", 1062},    {"nb", 1044},    {"nl_BE", 2067}, {"nl", 1043},    {"nn", 2068},
    {"no", 1044},    {"pl", 1045},    {"pt_PT", 2070}, {"pt", 1046},    {"ro", 1048},    {"ru", 1049},
    {"sk", 1051},    {"sl", 1060},    {"sv", 1053},    {"th", 1054},    {"tr", 1055},    {"uk", 1058},
    {"vi", 1066},    {"zh_HK", 3076}, {"zh_SG", 4100}, {"zh_TW", 1028}, {"zh", 2052},
};

bool is_letter(char c) { return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z'); }

// Whether locale is name, or name with a territory, codeset or modifier behind it.
bool begins_with(const char *locale, const char *name) {
  const std::size_t length = std::strlen(name);
  return std::strncmp(locale, name, length) == 0 && !is_letter(locale[length]);
}

// A catalogue with a text of the greatest length for every message takes less than 1 MiB.
constexpr std::size_t largest_catalog = std::size_t{4} << 20;

// An open catalogue: the record, and behind it the bytes of the file that it points to.
constexpr std::size_t record_size = sizeof(qtb::CatalogFile);

// Reads up to size bytes from the start of a file. Fewer come where it ends early or cannot be read further.
std::size_t read_bytes(int file, unsigned char *bytes, std::size_t size) {
  std::size_t got = 0;
  while (got < size) {
    const ssize_t n = read(file, bytes + got, size - got);
    if (n < 0 && errno == EINTR) continue;
    if (n <= 0) break;
    got += static_cast<std::size_t>(n);
  }
  return got;
}

}  // namespace

unsigned long platform_message_locale() {
  constexpr const char *variables[] = {"LC_ALL", "LC_MESSAGES", "LANG"};
  for (const char *variable : variables) {
    const char *locale = std::getenv(variable);
    if (locale == nullptr || *locale == '\0') continue;
    for (const LocaleNumber &entry : locale_numbers)
      if (begins_with(locale, entry.name)) return entry.number;
    break;
  }
  return default_locale;
}

// Opened without waiting: the path may be a pipe. The file is read once, here, and only these bytes are used: whoever
// may write to it cannot change what was found to be in order.
void *platform_open_catalog(const char *path) {
  const int file = open(path, O_RDONLY | O_NONBLOCK | O_CLOEXEC);
  if (file < 0) return nullptr;
  struct stat status;
  const bool plain = fstat(file, &status) == 0 && S_ISREG(status.st_mode);
  unsigned char *memory = nullptr;
  std::size_t size = 0;
  if (plain && static_cast<std::uint64_t>(status.st_size) <= largest_catalog) {
    size = static_cast<std::size_t>(status.st_size);
    memory = static_cast<unsigned char *>(std::malloc(record_size + size));
  }
  if (memory != nullptr) size = read_bytes(file, memory + record_size, size);
  close(file);
  qtb::CatalogFile catalog;
  if (memory == nullptr || !qtb::read_catalog(memory + record_size, size, &catalog)) {
    std::free(memory);
    return nullptr;
  }
  return new (memory) qtb::CatalogFile(catalog);
}

bool platform_catalog_message(void *catalog, std::int32_t number, char *buffer, std::size_t size) {
  const char *text = qtb::catalog_text(*static_cast<const qtb::CatalogFile *>(catalog), number);
  if (text == nullptr) return false;
  const std::size_t length = std::strlen(text);
  if (length >= size) return false;
  std::memcpy(buffer, text, length + 1);
  return true;
}
