// What a running process has loaded, from its map of files.
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <iterator>
#include <set>
#include <string>
#include <string_view>

#include "tools/info/machine.h"

namespace qtb::info {
namespace {

// What stands at the head of every version text of this project.
constexpr std::string_view version_head = "Belmo(R) Quill Tensor Base Version ";

// The version that a file holds, empty where it is none of this project's.
std::string version_in(const std::string &path) {
  std::ifstream file(path, std::ios::binary);
  const std::string bytes{std::istreambuf_iterator<char>(file), {}};
  const std::size_t at = bytes.find(version_head);
  if (at == bytes.npos) return {};
  const std::size_t begin = at + version_head.size();
  const std::size_t end = bytes.find_first_not_of("0123456789.", begin);
  return bytes.substr(begin, end == bytes.npos ? end : end - begin);
}

// Whether a file's name is that of a library of linear algebra: what a program may take its BLAS from.
bool looks_like_blas(std::string_view name) {
  for (const std::string_view part : {"blas", "lapack", "blis", "atlas"})
    if (name.find(part) != name.npos) return true;
  return false;
}

// The paths of the files that are mapped with code, in order and once.
std::set<std::string> mapped_code(std::istream &maps) {
  std::set<std::string> files;
  for (std::string line; std::getline(maps, line);) {
    const std::size_t path = line.find('/');
    const std::size_t rights = line.find(' ');
    if (path == line.npos || rights == line.npos || line.compare(rights + 3, 1, "x") != 0) continue;
    files.insert(line.substr(path));
  }
  return files;
}

}  // namespace

int print_process(long number) {
  const std::string root = "/proc/" + std::to_string(number);
  errno = 0;
  std::ifstream maps(root + "/maps");
  const std::set<std::string> files = mapped_code(maps);
  if (files.empty()) {
    std::fprintf(stderr, "qtb-info: process %ld: %s\n", number,
                 errno != 0 ? std::strerror(errno) : "its files are not to be seen");
    return 1;
  }
  int shown = 0;
  for (const std::string &path : files) {
    const std::string_view name = std::string_view(path).substr(path.rfind('/') + 1);
    // A file that was replaced since is still to be had from the process.
    std::string version;
    if (name.find(".so") != name.npos) version = version_in(std::string(root).append("/root").append(path));
    if (!version.empty())
      std::printf("QTB %-12s %s\n", version.c_str(), path.c_str());
    else if (name.starts_with("libqtb-trace"))
      std::printf("%-16s %s\n", "QTB's trace", path.c_str());
    else if (name.find(".so") != name.npos && looks_like_blas(name))
      std::printf("%-16s %s\n", "another BLAS", path.c_str());
    else
      continue;
    ++shown;
  }
  if (shown == 0) std::printf("process %ld has loaded no BLAS as a shared library\n", number);
  return 0;
}

}  // namespace qtb::info
