// Comparison of option characters, equal in either case.
//
// Only the 26 ASCII letters fold; every other byte stands for itself, whatever the locale.
#pragma once

#include <cstdint>

#include "blas/types.h"

namespace qtb {

constexpr unsigned char fold_case(unsigned char byte) {
  constexpr unsigned char case_distance = 'a' - 'A';
  return byte >= 'a' && byte <= 'z' ? static_cast<unsigned char>(byte - case_distance) : byte;
}

constexpr bool same_option(char a, char b) {
  return fold_case(static_cast<unsigned char>(a)) == fold_case(static_cast<unsigned char>(b));
}

}  // namespace qtb

// 1 if the first bytes at a and b are the same option character, else 0.
extern "C" QTB_HIDDEN std::int64_t qtb_serv_lsame(const char *a, const char *b);
