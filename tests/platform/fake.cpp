// The made-up operating system; see fake.h.

#include "tests/platform/fake.h"

#include <algorithm>
#include <cstring>

namespace qtb::test {

FakeSystem fake;

namespace {
constexpr int max_thread_words = 4;
thread_local void *words[max_thread_words];
thread_local std::size_t current_processor;
}  // namespace

CpuidRegisters fake_cache(std::uint32_t type, std::uint32_t line_size, std::uint32_t partitions, std::uint32_t ways,
                          std::uint32_t sets) {
  return {type, (line_size - 1) | (partitions - 1) << 12 | (ways - 1) << 22, sets - 1, 0};
}

void insert_processors(ProcessorSet *set, int first, int last) {
  for (int p = first; p <= last; ++p) set->insert(p);
}

void set_cores(int count) {
  fake.processors.assign(static_cast<std::size_t>(count), {});
  for (std::uint32_t p = 0; p < fake.processors.size(); ++p) {
    fake.processors[p].vendor = "AuthenticAMD";
    fake.processors[p].identifier = p;
  }
  insert_processors(&fake.online, 0, count - 1);
  fake.process = fake.online;
}

}  // namespace qtb::test

using namespace qtb::test;

std::uint64_t platform_saved_state() { return fake.saved_state; }

CpuidRegisters platform_cpuid(std::uint32_t leaf, std::uint32_t subleaf) {
  ++fake.cpuid_calls;
  if (fake.on_cpuid) fake.on_cpuid();
  const FakeProcessor &processor = fake.processors[std::min(current_processor, fake.processors.size() - 1)];
  CpuidRegisters r = {};
  switch (leaf) {
    case 0:
      r.eax = processor.highest_leaf;
      std::memcpy(&r.ebx, processor.vendor.data(), 4);
      std::memcpy(&r.edx, processor.vendor.data() + 4, 4);
      std::memcpy(&r.ecx, processor.vendor.data() + 8, 4);
      break;
    case 1:
      r.eax = processor.signature;
      r.ebx = processor.identifier << 24 | processor.logical_per_package << 16;
      r.ecx = processor.features_ecx;
      r.edx = processor.features_edx;
      break;
    case 4:
      if (subleaf < processor.caches.size())
        r = processor.caches[subleaf];
      else if (processor.caches_never_end)
        r = processor.caches.back();
      r.eax |= (processor.cores_per_package - 1) << 26;
      break;
    default: break;
  }
  return r;
}

std::size_t platform_environment(const char *name, char *buffer, std::size_t size) {
  const std::lock_guard guard(fake.mutex);
  fake.environment_reads.emplace_back(name);
  const auto found = fake.environment.find(name);
  if (found == fake.environment.end() || found->second.empty()) return 0;
  const std::string &value = found->second;
  const std::size_t copied = std::min(value.size(), size - 1);
  std::memcpy(buffer, value.data(), copied);
  buffer[copied] = '\0';
  return value.size();
}

std::int32_t platform_tls_create() { return fake.no_thread_words ? -1 : fake.thread_words++; }

void *platform_tls_get(std::int32_t index) { return index < 0 ? nullptr : words[index]; }

void platform_tls_set(std::int32_t index, void *value) {
  if (index >= 0) words[index] = value;
}

bool platform_processors(ProcessorSet *process, ProcessorSet *online) {
  if (!fake.masks_known) return false;
  *process = fake.process;
  *online = fake.online;
  return true;
}

bool platform_bind_thread(const ProcessorSet *processors) {
  for (int p = 0; p < ProcessorSet::capacity; ++p) {
    if (!processors->contains(p) || !fake.online.contains(p) || fake.refused.count(p) != 0) continue;
    current_processor = static_cast<std::size_t>(p);
    const std::lock_guard guard(fake.mutex);
    fake.bound.push_back(*processors);
    return true;
  }
  return false;
}

void platform_yield() { ++fake.yields; }

void *platform_load_library(const char *name) {
  fake.loads.emplace_back(name);
  const auto found = fake.libraries.find(name);
  return found == fake.libraries.end() ? nullptr : &found->second;
}

void *platform_library_symbol(void *library, const char *name) {
  const auto &symbols = *static_cast<std::map<std::string, void *> *>(library);
  const auto found = symbols.find(name);
  return found == symbols.end() ? nullptr : found->second;
}

void platform_unload_library(void *) { ++fake.unloads; }

int platform_forked_from_threads() { return fake.forked_from_threads; }

void platform_at_fork(void (*before)(), void (*after)()) {
  fake.before_fork = before;
  fake.after_fork = after;
}
