// Message lookup, formatting and printing.
//
// A text goes through a format twice: with the arguments, where there are any, and once more without. The second pass
// has one effect, a pair of percent signs prints as one; any other percent sign, which an argument may have brought in,
// prints as it stands.

#include "service/messages.h"

#include <atomic>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "service/platform/platform.h"

namespace {

struct Message {
  std::int32_t number;
  const char *text;
};

constexpr Message messages[] = {
    {1, "QTB FATAL ERROR: Cannot load %s"},
    {2, "QTB FATAL ERROR: Cannot load neither %s nor %s"},
    {3, "QTB FATAL ERROR on load the function %s"},
    {4, "QTB WARNING: QTB_DEBUG_CPU_TYPE=%d not convenient for this processor."},
    {5, "QTB WARNING: library %s (QTB type %d) not convenient for this processor (QTB type %d)."},
    {message_parameter, "QTB ERROR: Parameter %d was incorrect on entry to %s"},
    {message_condition, "QTB INTERNAL ERROR: Condition %d detected in function %s"},
    {message_no_memory, "QTB INTERNAL ERROR: Not enough work memory in function %s"},
    {message_incompatible_options, "QTB ERROR: Incompatible optional parameters on entry to %s"},
    {message_tier_lacking, "QTB WARNING: QTB_TIER=%s not convenient for this processor."},
    {message_no_such_tier, "QTB WARNING: QTB_TIER=%s is no tier of this library."},
    {message_no_work_memory, "QTB INTERNAL ERROR: Not enough work memory in function %s"},
};

constexpr char catalog_file[] = "qtb_msg.cat";

// Room for "<numeric locale>/<file>" with any number.
constexpr std::size_t path_size = 64;

// The longest text of a catalogue that can be printed as it stands, with its terminator.
constexpr std::size_t catalog_text_size = qtb::message_length_limit + 2;

// Room for any text with its arguments and a terminator or a line end.
constexpr std::size_t formatted_text_size = 1024;

std::atomic<bool> msg_file_pending{true};
std::atomic<void *> msg_catalog{nullptr};  // null: use the built-in texts

const char *builtin_text(std::int32_t number) {
  for (const Message &message : messages)
    if (message.number == number) return message.text;
  return "";
}

// The catalogue of the process, null if there is none. A thread that comes while another opens it gets null.
void *message_catalog() {
  if (msg_file_pending.exchange(false, std::memory_order_relaxed)) {
    char path[path_size];
    std::snprintf(path, sizeof path, "%lu/%s", platform_message_locale(), catalog_file);
    msg_catalog.store(platform_open_catalog(path), std::memory_order_release);
  }
  return msg_catalog.load(std::memory_order_acquire);
}

// A text of the catalogue may end in the line end of the system that it was written on.
void strip_line_end(char *text) {
  const std::size_t length = std::strlen(text);
  if (length >= 2 && text[length - 2] == '\r' && text[length - 1] == '\n') text[length - 2] = '\0';
}

// The letter of the conversion that begins next at or behind *text, which moves past it; 0 at the end of the text.
// What is not a percent sign and a letter gives the character behind the percent sign, '%' at the end of the text.
char next_conversion(const char **text) {
  for (const char *p = *text; *p != '\0'; ++p) {
    if (*p != '%') continue;
    ++p;
    if (*p == '%') continue;
    *text = *p == '\0' ? p : p + 1;
    return *p == '\0' ? '%' : *p;
  }
  return '\0';
}

// Writes a text that fits its buffer here, pairs of percent signs as one, and a line end: in one piece, so that the
// lines of threads that print at once stay whole. Only standard output is flushed: another stream may be locked for as
// long as its reader waits for input.
void print_line(const char *text) {
  char line[formatted_text_size];
  std::size_t length = 0;
  for (; *text != '\0'; ++text) {
    if (text[0] == '%' && text[1] == '%') ++text;
    line[length++] = *text;
  }
  line[length++] = '\n';
  std::fwrite(line, 1, length, stdout);
  std::fflush(stdout);
}

[[noreturn]] void end_on_overflow(std::int32_t number, int length) {
  std::printf("\nQTB INTERNAL ERROR: message buffer overflow.");
  std::fflush(stdout);
  std::printf("\n       Message N %d   Lenght: %d   Buffer size: %d\n", number, length, qtb::message_length_limit);
  std::fflush(stdout);
  std::exit(qtb::message_overflow_status);
}

}  // namespace

extern "C" {

bool qtb_serv_same_conversions(const char *pattern, const char *text) {
  for (;;) {
    const char wanted = next_conversion(&pattern);
    if (next_conversion(&text) != wanted) return false;
    if (wanted == '\0') return true;
  }
}

void qtb_serv_print(std::int32_t, std::int32_t number, std::int32_t argument_count, ...) {
  if (number == message_line_end) {
    std::putchar('\n');
    return;
  }
  const char *text = builtin_text(number);

  char catalog_text[catalog_text_size];
  void *const catalog = message_catalog();
  if (catalog != nullptr && platform_catalog_message(catalog, number, catalog_text, sizeof catalog_text)) {
    strip_line_end(catalog_text);
    if (qtb_serv_same_conversions(text, catalog_text)) text = catalog_text;
  }

  char formatted_text[formatted_text_size];
  int length = static_cast<int>(std::strlen(text));
  if (argument_count > 0) {
    va_list arguments;
    va_start(arguments, argument_count);
    length = std::vsnprintf(formatted_text, sizeof formatted_text, text, arguments);
    va_end(arguments);
    text = formatted_text;
  }
  if (length - 1 > qtb::message_length_limit) end_on_overflow(number, length - 1);
  print_line(text);
}

}  // extern "C"
