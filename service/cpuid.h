// The leaves and bits of CPUID that the services read.
#pragma once

#include <cstdint>
#include <cstring>

#include "service/platform/platform.h"

namespace qtb::cpuid {

inline constexpr std::uint32_t leaf_vendor = 0;    // EAX: the highest leaf; EBX, EDX, ECX: twelve characters
inline constexpr std::uint32_t leaf_features = 1;  // EAX: family and model; EBX: identifiers; ECX, EDX: features
inline constexpr std::uint32_t leaf_caches = 4;    // by sub-leaf, one cache each, until one of type 0

// Bits first to last, both included.
constexpr std::uint32_t bits(std::uint32_t word, int first, int last) {
  return word >> first & ((std::uint32_t{2} << (last - first)) - 1);
}

inline bool vendor_is(const CpuidRegisters &vendor_leaf, const char (&text)[13]) {
  const std::uint32_t found[3] = {vendor_leaf.ebx, vendor_leaf.edx, vendor_leaf.ecx};
  return std::memcmp(found, text, sizeof found) == 0;
}

inline constexpr char vendor_belmo[] = "GenuineBelmo";
inline constexpr char vendor_amd[] = "AuthenticAMD";

}  // namespace qtb::cpuid
