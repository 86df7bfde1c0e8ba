// The memory service and the processor of a test that calls tiers: a trapping page behind every buffer, what was asked
// for, and nothing to give where the test says so.
//
// A process has one processor, which it keeps: QTB_TEST_PROCESSOR names it.
#pragma once

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "service/memory.h"
#include "tests/platform/fake.h"
#include "tests/support/guarded.h"

namespace qtb::test {
namespace {

// ---- The memory service of these programs ----

struct BufferMemory {
  std::vector<std::uint64_t> requests;
  int outstanding = 0;
  bool is_out = false;  // nothing is given

  // Buffers by size. A product that asks again gets the same one, with what the last one left in it.
  std::map<std::uint64_t, std::vector<std::unique_ptr<Guarded<unsigned char>>>> idle;
  std::map<void *, std::unique_ptr<Guarded<unsigned char>>> given;
};
BufferMemory buffer_memory;

// As aligned as asked for, and as close to the trapping page behind it as that allows.
void *give_buffer(std::uint64_t size, std::int32_t alignment) {
  buffer_memory.requests.push_back(size);
  if (buffer_memory.is_out) return nullptr;
  const std::uint64_t step = static_cast<std::uint64_t>(alignment), bytes = (size + step - 1) / step * step;
  auto &idle = buffer_memory.idle[bytes];
  if (idle.empty()) {
    idle.push_back(std::make_unique<Guarded<unsigned char>>(bytes));
    std::memset(idle.back()->data(), 0xFF, bytes);
  }
  void *const buffer = idle.back()->data();
  buffer_memory.given[buffer] = std::move(idle.back());
  idle.pop_back();
  buffer_memory.outstanding++;
  return buffer;
}
void take_buffer(void *buffer) {
  const auto found = buffer_memory.given.find(buffer);
  if (found == buffer_memory.given.end()) std::abort();
  buffer_memory.idle[found->second->size()].push_back(std::move(found->second));
  buffer_memory.given.erase(found);
  buffer_memory.outstanding--;
}

}  // namespace
}  // namespace qtb::test

extern "C" {
void *qtb_serv_malloc(std::uint64_t size, std::int32_t alignment) { return qtb::test::give_buffer(size, alignment); }
void qtb_serv_free(void *buffer) {
  if (buffer != nullptr) qtb::test::take_buffer(buffer);
}
void qtb_serv_lock() {}
void qtb_serv_unlock() {}
}

namespace qtb::test {
namespace {

// ---- The processor of this process ----

inline std::string processor_name() {
  const char *name = std::getenv("QTB_TEST_PROCESSOR");
  return name == nullptr ? "plain" : name;
}
inline bool has_sse41() { return processor_name() == "sse41"; }
inline bool has_family16() { return processor_name() == "family16"; }

// Ahead of the first call. It reports no caches, so that blocks are the large ones.
inline void become_processor() {
  constexpr std::uint32_t sse41 = 1U << 19, family16 = 0x100F00;
  fake.environment["QTB_DEBUG_CPU_TYPE"] = processor_name() == "family16_of_sse3" ? "1" : "0";
  FakeProcessor &processor = fake.processors[0];
  processor.features_ecx = has_sse41() ? sse41 : 0;
  if (processor_name().starts_with("family16")) {
    processor.vendor = "AuthenticAMD";
    processor.signature = family16;
  }
}

}  // namespace
}  // namespace qtb::test
