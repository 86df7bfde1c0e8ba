// The library's messages on the console: numbered texts, built in or from a localised catalogue.
#pragma once

#include <cstddef>
#include <cstdint>

#include "blas/types.h"

// The numbers of the messages that the error reporter prints.
enum MessageNumber : std::int32_t {
  message_line_end = 0,
  message_parameter = 6,             // %d parameter number, %s routine
  message_condition = 7,             // %d condition, %s routine
  message_no_memory = 8,             // %s routine
  message_incompatible_options = 9,  // %s routine
  message_no_work_memory = 1079,     // %s routine
  message_tier_lacking = 2001,       // %s value of QTB_TIER
  message_no_such_tier = 2002,       // %s value of QTB_TIER
};

namespace qtb {

// The longest text that is printed has one character more than this; a longer one ends the process.
inline constexpr int message_length_limit = 512;

// The status of the process that a text beyond the limit ends.
inline constexpr int message_overflow_status = 8;

}  // namespace qtb

extern "C" {

// Prints message number with its arguments and a line end on standard output, and flushes it. Number 0 is a line end
// alone. argument_count tells how many arguments follow, which must be of the types that the comment of the number
// says; destination is accepted and has no effect. The text is the built-in one of the number, or that of the catalogue
// qtb_msg.cat in the folder of the numeric locale, below the working directory, if there is one; it is looked for once
// per process. An unknown number has an empty text. Threads that print at once mix whole lines, never their parts, and
// no other stream than standard output is touched.
QTB_HIDDEN void qtb_serv_print(std::int32_t destination, std::int32_t number, std::int32_t argument_count, ...);

// Whether text asks for exactly the arguments that pattern asks for: the same plain conversions (a percent sign and a
// letter) in the same order, and nothing else but pairs of percent signs. Only such a text may stand in for a pattern.
QTB_HIDDEN bool qtb_serv_same_conversions(const char *pattern, const char *text);

}  // extern "C"
