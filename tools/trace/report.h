// What the report says of the library that was called.
#pragma once

namespace qtb::trace {

struct Behind {
  char file[4096] = "";
  const char *tier = "-";  // a companion of this project tells its own
};

// As it was found at the first call.
const Behind &library_behind();

}  // namespace qtb::trace
