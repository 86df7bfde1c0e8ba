// Libraries by path, routines by name.

#include "bench/library.h"

#include <dlfcn.h>

#include <cstdio>
#include <cstdlib>

namespace qtb::bench {

void *Library::find(const std::string &name) const { return dlsym(handle, (wide ? name : name + "_").c_str()); }

Library load_library(const std::string &path, bool wide) {
  Library library;
  library.wide = wide;
  library.handle = dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
  if (library.handle == nullptr) {
    std::fprintf(stderr, "%s\n", dlerror());
    std::exit(2);
  }
  return library;
}

}  // namespace qtb::bench
