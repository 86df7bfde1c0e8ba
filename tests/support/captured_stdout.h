// What a call prints, in memory: for targets that make so many calls that a process or a file for each would be slow.
#pragma once

#include <cstdio>
#include <cstdlib>
#include <string>

namespace qtb::test {

// Calls body and returns what it wrote to stdout. Whatever else writes to stdout meanwhile is caught too.
template <class Body>
std::string captured_stdout(Body body) {
  char *text = nullptr;
  std::size_t size = 0;
  std::FILE *const console = stdout;
  std::FILE *const memory = open_memstream(&text, &size);
  if (memory == nullptr) std::abort();
  stdout = memory;
  body();
  stdout = console;
  std::fclose(memory);
  const std::string output(text, size);
  std::free(text);
  return output;
}

// A format without conversions, as printf prints it: every pair of percent signs is one.
inline std::string collapse_percent_signs(std::string text) {
  for (std::size_t at = 0; (at = text.find("%%", at)) != std::string::npos; ++at) text.erase(at, 1);
  return text;
}

}  // namespace qtb::test
