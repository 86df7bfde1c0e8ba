// The tables of all threads.
#include "tools/trace/record.h"

#include <pthread.h>
#include <sys/mman.h>

#include <cstring>

namespace qtb::trace {

constinit thread_local ThreadState this_thread{};

namespace {

constexpr auto relaxed = std::memory_order_relaxed;

std::atomic<Table *> tables{nullptr};
pthread_key_t thread_end;

// The table of a thread that has ended goes to the next that starts, with what it holds.
void give_back(void *table) {
  this_thread.table = nullptr;
  static_cast<Table *>(table)->taken.store(false, std::memory_order_release);
}

// A child has its parent's tables, whose calls are not its own. It has one thread, so that nobody writes meanwhile.
void forget_parent() {
  for (Table *table = first_table(); table != nullptr; table = table->next) {
    std::memset(static_cast<void *>(table->entries), 0, sizeof table->entries);
    table->used = 0;
    table->lost.store(0, relaxed);
    table->taken.store(table == this_thread.table, relaxed);
  }
}

[[gnu::constructor]] void prepare() {
  pthread_key_create(&thread_end, &give_back);
  pthread_atfork(nullptr, nullptr, &forget_parent);
}

Table *free_table() {
  for (Table *table = first_table(); table != nullptr; table = table->next) {
    bool taken = false;
    if (table->taken.compare_exchange_strong(taken, true, std::memory_order_acquire, relaxed)) return table;
  }
  return nullptr;
}

// Fresh pages are zeros, and take memory where they are touched.
Table *new_table() {
  void *const pages = mmap(nullptr, sizeof(Table), PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
  if (pages == MAP_FAILED) return nullptr;
  Table *const table = static_cast<Table *>(pages);
  table->taken.store(true, relaxed);
  table->next = tables.load(relaxed);
  while (!tables.compare_exchange_weak(table->next, table, std::memory_order_release, relaxed)) {
  }
  return table;
}

std::size_t place_of(const Key &key) {
  constexpr std::uint64_t mix = 0x9E3779B97F4A7C15U;  // an odd number without a pattern: 2^64 over the golden ratio
  const std::uint64_t one = (key.words[0] ^ (key.words[1] << 20 | key.words[1] >> 44)) * mix;
  const std::uint64_t other = (key.words[2] ^ (key.words[3] << 24 | key.words[3] >> 40)) * (mix >> 1 | 1);
  return (one ^ other >> 17) * mix >> (64 - Table::bits);
}

// The entry of a key, a new one where there is none and room for it.
[[gnu::noinline]] Entry *find(Table &table, const Key &key, std::size_t room) {
  for (std::size_t i = place_of(key), tried = 0; tried < Table::size; i = (i + 1) % Table::size, ++tried) {
    Entry &entry = table.entries[i];
    if (entry.calls.load(relaxed) == 0) {
      if (table.used >= room) return nullptr;
      ++table.used;
      entry.key = key;
      entry.least.store(UINT64_MAX, relaxed);
      return &entry;
    }
    if (entry.key == key) return &entry;
  }
  return nullptr;
}

}  // namespace

Table *take_table() {
  Table *table = free_table();
  if (table == nullptr) table = new_table();
  if (table != nullptr) pthread_setspecific(thread_end, table);
  this_thread.table = table;
  return table;
}

Table *first_table() { return tables.load(std::memory_order_acquire); }

namespace {

// Where a table is full of shapes, the one entry of the routine for all others.
[[gnu::noinline]] Entry *find_or_share(Table &table, const Key &key) {
  Entry *const entry = find(table, key, Table::most_shapes);
  if (entry != nullptr) return entry;
  constexpr std::int32_t absent = CallShape::absent;
  const CallShape any{0, 0, 0, 0, 0, absent, absent, absent, absent, absent};
  return find(table, Key::of(key.routine(), key.face(), key.threads(), any), Table::size);
}

}  // namespace

void record(Table &table, const Key &key, std::uint64_t ticks) {
  Entry *entry = &table.entries[place_of(key)];
  if (!(entry->key == key) || entry->calls.load(relaxed) == 0) [[unlikely]] {
    entry = find_or_share(table, key);
    if (entry == nullptr) {
      table.lost.store(table.lost.load(relaxed) + 1, relaxed);
      return;
    }
  }
  entry->ticks.store(entry->ticks.load(relaxed) + ticks, relaxed);
  if (ticks < entry->least.load(relaxed)) entry->least.store(ticks, relaxed);
  if (ticks > entry->most.load(relaxed)) entry->most.store(ticks, relaxed);
  entry->calls.store(entry->calls.load(relaxed) + 1, std::memory_order_release);
}

}  // namespace qtb::trace
