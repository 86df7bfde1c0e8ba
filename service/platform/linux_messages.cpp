// Localised messages: POSIX message catalogues, and the locale as a published numeric language identifier.

#include <fcntl.h>
#include <nl_types.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <cstring>

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

// How a catalogue of the GNU C library begins: behind it stand two tables, one per byte order, of size x depth entries
// of three words.
struct CatalogHeader {
  std::uint32_t magic, size, depth;
};
constexpr std::uint32_t catalog_magic = 0x960408de;
constexpr std::uint32_t swapped_magic = 0xde080496;
constexpr std::uint64_t bytes_per_entry = 2 * 3 * sizeof(std::uint32_t);

// Whether a path is a plain file whose tables lie inside it. The system's reader believes the sizes in the header, and
// a damaged one would end the process. Opened without waiting: the path may be a pipe.
bool may_be_catalog(const char *path) {
  const int file = open(path, O_RDONLY | O_NONBLOCK | O_CLOEXEC);
  if (file < 0) return false;
  struct stat status;
  CatalogHeader header;
  const bool plain = fstat(file, &status) == 0 && S_ISREG(status.st_mode);
  const bool read_header = plain && read(file, &header, sizeof header) == sizeof header;
  close(file);
  if (!read_header) return false;
  if (header.magic == swapped_magic) {
    header.size = __builtin_bswap32(header.size);
    header.depth = __builtin_bswap32(header.depth);
  } else if (header.magic != catalog_magic) {
    return false;
  }
  const std::uint64_t room = (static_cast<std::uint64_t>(status.st_size) - sizeof header) / bytes_per_entry;
  const std::uint64_t entries = static_cast<std::uint64_t>(header.size) * header.depth;
  return entries != 0 && entries <= room;
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

void *platform_open_catalog(const char *path) {
  if (!may_be_catalog(path)) return nullptr;
  const nl_catd catalog = catopen(path, 0);
  return catalog == reinterpret_cast<nl_catd>(-1) ? nullptr : catalog;
}

bool platform_catalog_message(void *catalog, std::int32_t number, char *buffer, std::size_t size) {
  const char absent[] = "";
  const char *text = catgets(catalog, NL_SETD, number, absent);
  const std::size_t length = std::strlen(text);
  if (text == absent || length >= size) return false;
  std::memcpy(buffer, text, length + 1);
  return true;
}
