// A message catalogue in memory and a locale of choice, in place of the system's.
#pragma once

#include <cstdint>
#include <map>
#include <string>

namespace qtb::test {

struct FakeMessages {
  unsigned long locale = 1033;
  bool present = false;                       // whether the catalogue can be opened
  std::map<std::int32_t, std::string> texts;  // what it holds
  int opened = 0;                             // how often the library tried to open it
  std::string path;                           // the path of the last attempt
};

inline FakeMessages fake_messages;

}  // namespace qtb::test
