// QTBGetVersionString: the library's version as a text.

#include <algorithm>
#include <cstdint>
#include <cstring>

#include "blas/entry/export.h"

namespace {

// QTB_VERSION is the version of the project, as the build knows it.
constexpr char version_text[] = "Belmo(R) Quill Tensor Base Version " QTB_VERSION
                                " Product Build 20090814 for Belmo(R) 64 architecture applications";

}  // namespace

extern "C" {

// The text as far as it fits length bytes with a terminator, and zeros up to the end of the buffer. Without room for a
// terminator nothing is written.
QTB_EXPORT void QTBGetVersionString(char *buffer, std::int32_t length);
void QTBGetVersionString(char *buffer, std::int32_t length) {
  if (length < 1) return;
  const std::size_t size = static_cast<std::size_t>(length);
  const std::size_t copied = std::min(size, sizeof version_text) - 1;
  std::memcpy(buffer, version_text, copied);
  std::memset(buffer + copied, 0, size - copied);
}

}  // extern "C"
