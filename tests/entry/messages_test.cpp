// The message service: texts, the two passes through a format, the limit, and when a catalogue's text is used.

#include "service/messages.h"

#include <gtest/gtest.h>
#include <poll.h>
#include <printf.h>
#include <sys/socket.h>

#include <csignal>
#include <map>
#include <random>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

#include "tests/platform/fake_messages.h"
#include "tests/support/child.h"

namespace {

using qtb::test::capture_child;
using qtb::test::fake_messages;
using qtb::test::FakeMessages;
using qtb::test::in_child;

constexpr char name[] = "DGEMM ";
const std::string builtin_6 = "QTB ERROR: Parameter 3 was incorrect on entry to DGEMM \n";

// What message 6 prints where the catalogue has a text for it.
std::string message_6_with(const std::string &catalog_text) {
  fake_messages = {};
  fake_messages.present = true;
  fake_messages.texts[6] = catalog_text;
  return capture_child([] { qtb_serv_print(1, 6, 2, 3, name); }).output;
}

std::string print_builtin(std::int32_t number) {
  fake_messages = {};
  return capture_child([&] { qtb_serv_print(1, number, 0); }).output;
}

TEST(Messages, the_built_in_texts) {
  EXPECT_EQ(print_builtin(1), "QTB FATAL ERROR: Cannot load %s\n");
  EXPECT_EQ(print_builtin(2), "QTB FATAL ERROR: Cannot load neither %s nor %s\n");
  EXPECT_EQ(print_builtin(3), "QTB FATAL ERROR on load the function %s\n");
  EXPECT_EQ(print_builtin(4), "QTB WARNING: QTB_DEBUG_CPU_TYPE=%d not convenient for this processor.\n");
  EXPECT_EQ(print_builtin(5),
            "QTB WARNING: library %s (QTB type %d) not convenient for this processor (QTB type %d).\n");
  EXPECT_EQ(print_builtin(6), "QTB ERROR: Parameter %d was incorrect on entry to %s\n");
  EXPECT_EQ(print_builtin(7), "QTB INTERNAL ERROR: Condition %d detected in function %s\n");
  EXPECT_EQ(print_builtin(8), "QTB INTERNAL ERROR: Not enough work memory in function %s\n");
  EXPECT_EQ(print_builtin(9), "QTB ERROR: Incompatible optional parameters on entry to %s\n");
  EXPECT_EQ(print_builtin(1079), "QTB INTERNAL ERROR: Not enough work memory in function %s\n");
  EXPECT_EQ(print_builtin(2001), "QTB WARNING: QTB_TIER=%s not convenient for this processor.\n");
  EXPECT_EQ(print_builtin(2002), "QTB WARNING: QTB_TIER=%s is no tier of this library.\n");
}

TEST(Messages, numbers_without_a_text_print_an_empty_line) {
  for (std::int32_t number : {10, 500, 1078, 1080, 2000, 2003, 100000, -1, INT32_MIN, INT32_MAX})
    EXPECT_EQ(print_builtin(number), "\n") << number;
}

TEST(Messages, arguments_take_the_place_of_conversions) {
  fake_messages = {};
  const auto result = capture_child([] { qtb_serv_print(1, 5, 3, "here.so", 4, 2); });
  EXPECT_EQ(result.output,
            "QTB WARNING: library here.so (QTB type 4) not convenient for this processor (QTB type 2).\n");
}

TEST(Messages, the_destination_has_no_effect) {
  fake_messages = {};
  for (int destination : {0, 1, 2, -1})
    EXPECT_EQ(capture_child([&] { qtb_serv_print(destination, 6, 2, 3, name); }).output, builtin_6);
}

TEST(Messages, number_0_is_a_line_end_and_looks_for_no_catalogue) {
  fake_messages = {};
  const auto result = capture_child([] {
    qtb_serv_print(1, 0, 0);
    std::fflush(stdout);
    _exit(fake_messages.opened);
  });
  EXPECT_EQ(result.output, "\n");
  EXPECT_EQ(result.exit_status, 0);
}

// The child ends before anything else can flush, so what is seen has been flushed by the call.
TEST(Messages, a_message_is_flushed_with_all_that_stood_before_it) {
  fake_messages = {};
  const auto result = capture_child([] {
    std::printf("before ");
    qtb_serv_print(1, 0, 0);
    qtb_serv_print(1, 6, 2, 3, name);
    std::printf("behind");
    std::raise(SIGKILL);
  });
  EXPECT_EQ(result.output, "before \n" + builtin_6);
}

TEST(Messages, the_catalogue_is_looked_for_once_in_the_folder_of_the_locale) {
  for (bool present : {false, true}) {
    fake_messages = {};
    fake_messages.locale = 1031;
    fake_messages.present = present;
    const auto result = capture_child([] {
      qtb_serv_print(1, 6, 2, 3, name);
      qtb_serv_print(1, 7, 2, 3, name);
      qtb_serv_print(1, 6, 2, 3, name);
      _exit(fake_messages.path == "1031/qtb_msg.cat" ? fake_messages.opened : 100);
    });
    EXPECT_EQ(result.exit_status, 1);
  }
}

TEST(Messages, a_text_of_the_catalogue_replaces_the_built_in_one) {
  EXPECT_EQ(message_6_with("Parameter %d von %s ist falsch"), "Parameter 3 von DGEMM  ist falsch\n");
}

TEST(Messages, a_number_that_the_catalogue_lacks_keeps_the_built_in_text) {
  fake_messages = {};
  fake_messages.present = true;
  fake_messages.texts[7] = "other %d %s";
  EXPECT_EQ(capture_child([] { qtb_serv_print(1, 6, 2, 3, name); }).output, builtin_6);
}

TEST(Messages, carriage_return_and_line_feed_at_the_end_are_stripped) {
  EXPECT_EQ(message_6_with("%d %s\r\n"), "3 DGEMM \n");
  EXPECT_EQ(message_6_with("%d %s\r\n\r\n"), "3 DGEMM \r\n\n");
}

TEST(Messages, any_other_end_stays) {
  EXPECT_EQ(message_6_with("%d %s\n"), "3 DGEMM \n\n");
  EXPECT_EQ(message_6_with("%d %s\r"), "3 DGEMM \r\n");
  EXPECT_EQ(message_6_with("%d %s"), "3 DGEMM \n");
}

TEST(Messages, a_catalogue_may_hold_a_text_for_a_number_without_one) {
  fake_messages = {};
  fake_messages.present = true;
  fake_messages.texts[10] = "ten\r\n";
  fake_messages.texts[11] = "%s";
  EXPECT_EQ(capture_child([] { qtb_serv_print(1, 10, 0); }).output, "ten\n");
  EXPECT_EQ(capture_child([] { qtb_serv_print(1, 11, 0); }).output, "\n");
}

TEST(Messages, a_text_that_asks_for_other_arguments_is_not_used) {
  for (const char *text : {"",          "\r\n",      "no conversion",   "%d",       "%s %d",    "%s",
                           "%d %d",     "%s %s",     "%d %s %s",        "%d %s %d", "%d %s %n", "%n%d %s",
                           "%d %n",     "%hhn %s",   "%d %ls",          "%ld %s",   "%lld %s",  "%hd %s",
                           "%i %s",     "%u %s",     "%x %s",           "%c %s",    "%p %s",    "%d %S",
                           "%5d %s",    "%05d %s",   "%-5d %s",         "% d %s",   "%+d %s",   "%'d %s",
                           "%#d %s",    "%.3d %s",   "%d %.3s",         "%d %.*s",  "%*d %s",   "%*d",
                           "%1$d %2$s", "%2$s %1$d", "%d %2000000000s", "%d %s %",  "%d %s%",   "%",
                           "%d %",      "%d%",       "%%d %s",          "%d %%s",   "%%%d",     "%d %%%",
                           "%d %s %m",  "%I64d %s",  "%d %s %f"})
    EXPECT_EQ(message_6_with(text), builtin_6) << text;
}

TEST(Messages, pairs_of_percent_signs_are_text) {
  EXPECT_EQ(message_6_with("%d %s 100%%"), "3 DGEMM  100%\n");
  EXPECT_EQ(message_6_with("%%%d%%%s%%%%"), "%3%DGEMM %\n");
}

TEST(Messages, a_text_without_arguments_still_passes_a_format_once) {
  fake_messages = {};
  fake_messages.present = true;
  fake_messages.texts[10] = "100%% done";
  EXPECT_EQ(capture_child([] { qtb_serv_print(1, 10, 0); }).output, "100% done\n");
}

TEST(Messages, a_text_too_long_to_print_keeps_the_built_in_one) {
  const std::string conversions = "%d %s";
  EXPECT_EQ(message_6_with(conversions + std::string(1000, 'x')), builtin_6);
  EXPECT_EQ(message_6_with(conversions + std::string(100000, 'x')), builtin_6);
  fake_messages.texts[10] = std::string(514, 'x');
  EXPECT_EQ(capture_child([] { qtb_serv_print(1, 10, 0); }).output, "\n");
}

// The limit counts a text's length less 1, against 512.
TEST(Messages, a_text_at_the_limit_is_printed) {
  const std::string longest(513, 'x');
  fake_messages = {};
  fake_messages.present = true;
  fake_messages.texts[10] = longest;
  EXPECT_EQ(capture_child([] { qtb_serv_print(1, 10, 0); }).output, longest + "\n");
  // "QTB FATAL ERROR: Cannot load " has 29 characters.
  const std::string rest(513 - 29, 'y');
  const auto result = capture_child([&] { qtb_serv_print(1, 1, 1, rest.c_str()); });
  EXPECT_EQ(result.exit_status, 0);
  EXPECT_EQ(result.output, "QTB FATAL ERROR: Cannot load " + rest + "\n");
}

TEST(Messages, a_text_beyond_the_limit_ends_the_process_with_status_8) {
  fake_messages = {};
  for (int excess : {1, 2, 511, 512, 5000}) {
    const std::string rest(static_cast<std::size_t>(513 - 29 + excess), 'y');
    const auto result = capture_child([&] {
      qtb_serv_print(1, 1, 1, rest.c_str());
      _exit(0);
    });
    EXPECT_EQ(result.exit_status, 8);
    EXPECT_EQ(result.output, "\nQTB INTERNAL ERROR: message buffer overflow.\n       Message N 1   Lenght: " +
                                 std::to_string(512 + excess) + "   Buffer size: 512\n");
  }
}

TEST(Messages, a_text_of_the_catalogue_that_its_arguments_push_beyond_the_limit_ends_the_process) {
  fake_messages = {};
  fake_messages.present = true;
  fake_messages.texts[6] = "%d %s" + std::string(508, 'x');
  const auto result = capture_child([] { qtb_serv_print(1, 6, 2, 3, name); });
  EXPECT_EQ(result.exit_status, 8);
}

TEST(Messages, percent_signs_of_an_argument_stand_as_they_are_but_for_pairs) {
  fake_messages = {};
  EXPECT_EQ(capture_child([] { qtb_serv_print(1, 1, 1, "%s%n%%%d%"); }).output,
            "QTB FATAL ERROR: Cannot load %s%n%%d%\n");
}

// Each write of standard output is a packet of its own here. However the stream is buffered, a message is one.
TEST(Messages, a_message_is_one_write) {
  for (const int buffering : {_IONBF, _IOLBF, _IOFBF}) {
    int ends[2];
    ASSERT_EQ(socketpair(AF_UNIX, SOCK_SEQPACKET, 0, ends), 0);
    fake_messages = {};
    in_child([&] {
      std::setvbuf(stdout, nullptr, buffering, buffering == _IONBF ? 0 : BUFSIZ);
      const int console = dup(STDOUT_FILENO);
      dup2(ends[1], STDOUT_FILENO);
      for (int i = 0; i < 3; ++i) qtb_serv_print(1, 6, 2, 3, name);
      dup2(console, STDOUT_FILENO);
    });
    close(ends[1]);
    char packet[1024];
    for (int i = 0; i < 3; ++i) {
      const ssize_t size = read(ends[0], packet, sizeof packet);
      ASSERT_GE(size, 0);
      EXPECT_EQ(std::string(packet, static_cast<std::size_t>(size)), builtin_6);
    }
    EXPECT_EQ(read(ends[0], packet, sizeof packet), 0) << "nothing is left";
    close(ends[0]);
  }
}

TEST(Messages, lines_of_threads_that_print_at_once_stay_whole) {
  fake_messages = {};
  constexpr int thread_count = 8, prints = 200;
  const auto result = capture_child([] {
    std::vector<std::thread> threads;
    for (int t = 0; t < thread_count; ++t)
      threads.emplace_back([t] {
        const std::string own_name(static_cast<std::size_t>(t + 1), static_cast<char>('A' + t));
        for (int i = 0; i < prints; ++i) qtb_serv_print(1, 6, 2, t, own_name.c_str());
      });
    for (std::thread &thread : threads) thread.join();
    _exit(fake_messages.opened);
  });
  EXPECT_EQ(result.exit_status, 1);
  std::map<std::string, int> lines;
  std::istringstream output(result.output);
  for (std::string line; std::getline(output, line);) ++lines[line];
  EXPECT_EQ(lines.size(), static_cast<std::size_t>(thread_count));
  for (int t = 0; t < thread_count; ++t) {
    const std::string own_name(static_cast<std::size_t>(t + 1), static_cast<char>('A' + t));
    EXPECT_EQ(lines["QTB ERROR: Parameter " + std::to_string(t) + " was incorrect on entry to " + own_name], prints);
  }
}

// Whoever reads holds the lock of the stream until input comes, which here it never does.
TEST(Messages, a_message_goes_out_while_another_thread_waits_for_input) {
  fake_messages = {};
  int ends[2];
  ASSERT_EQ(pipe(ends), 0);
  const auto result = capture_child([&] {
    dup2(ends[0], STDIN_FILENO);
    std::thread([] {
      char line[80];
      if (std::fgets(line, sizeof line, stdin) != nullptr) std::abort();
    }).detach();
    while (ftrylockfile(stdin) == 0) {
      funlockfile(stdin);
      std::this_thread::yield();
    }
    qtb_serv_print(1, 0, 0);
    qtb_serv_print(1, 6, 2, 3, name);
    _exit(77);
  });
  EXPECT_EQ(result.exit_status, 77) << "an alarm ended the report";
  EXPECT_EQ(result.output, "\n" + builtin_6);
  close(ends[0]);
  close(ends[1]);
}

TEST(Messages, other_streams_keep_what_they_hold) {
  fake_messages = {};
  int ends[2];
  ASSERT_EQ(pipe(ends), 0);
  in_child([&] {
    std::FILE *const other = fdopen(ends[1], "w");
    std::fputs("unfinished", other);
    std::FILE *const console = stdout;
    stdout = std::tmpfile();
    qtb_serv_print(1, 6, 2, 3, name);
    stdout = console;
    pollfd ready = {ends[0], POLLIN, 0};
    EXPECT_EQ(poll(&ready, 1, 0), 0);
  });
  close(ends[0]);
  close(ends[1]);
}

// The arguments that the system's own printf would take for a text.
std::vector<int> arguments_of(const std::string &text) {
  std::vector<int> types(64);
  const std::size_t count = parse_printf_format(text.c_str(), types.size(), types.data());
  types.resize(std::min(count, types.size()));
  return types;
}

TEST(Messages, an_accepted_text_makes_printf_take_the_same_arguments) {
  const std::string patterns[] = {"", "%d", "%s", "a %d b %s", "%s %d %d"};
  const std::string pieces[] = {"%", "d", "s", "%d", "%s", "%%", "n",  "l", "*",
                                "1", "$", ".", " ",  "x",  "-",  "%d", "%s"};
  std::mt19937 random(20231);
  const int cases = 400000;
  int accepted = 0;
  for (int i = 0; i < cases; ++i) {
    std::string text;
    for (unsigned left = random() % 8; left > 0; --left) text += pieces[random() % std::size(pieces)];
    for (const std::string &pattern : patterns) {
      if (!qtb_serv_same_conversions(pattern.c_str(), text.c_str())) continue;
      ++accepted;
      ASSERT_EQ(arguments_of(text), arguments_of(pattern)) << text;
    }
  }
  EXPECT_GT(accepted, cases / 20);
  RecordProperty("texts", cases);
  RecordProperty("accepted", accepted);
}

TEST(Messages, a_text_of_plain_conversions_is_accepted_for_its_own_pattern_alone) {
  std::mt19937 random(7);
  for (int i = 0; i < 20000; ++i) {
    std::string pattern, text;
    for (unsigned left = random() % 5; left > 0; --left) {
      const char letter = random() % 2 == 0 ? 'd' : 's';
      pattern += std::string("p%") + letter;
      for (unsigned words = random() % 3; words > 0; --words) text += random() % 2 == 0 ? "%%" : "t ";
      text += std::string("%") + letter;
    }
    ASSERT_TRUE(qtb_serv_same_conversions(pattern.c_str(), text.c_str())) << pattern << " | " << text;
    ASSERT_FALSE(qtb_serv_same_conversions(pattern.c_str(), (text + "%d").c_str())) << text;
    ASSERT_FALSE(qtb_serv_same_conversions((pattern + "%s").c_str(), text.c_str())) << text;
    ASSERT_FALSE(qtb_serv_same_conversions(pattern.c_str(), (text + "%").c_str())) << text;
  }
}

}  // namespace
