// An array with a trapping page on either side, so that a read or write outside it ends the test.
#pragma once

#include <sys/mman.h>
#include <unistd.h>

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>

namespace qtb::test {

enum class Flush { front, back };  // which end of the array touches a trapping page

// count elements of T at a chosen byte offset from the flush position. With Flush::back and offset 0 the last byte is
// the last before a trapping page; offset moves the array away from that page by so many bytes, to reach every phase.
template <class T>
class Guarded {
 public:
  explicit Guarded(std::size_t count, Flush flush = Flush::back, std::size_t offset = 0) : count_(count) {
    const std::size_t page = static_cast<std::size_t>(sysconf(_SC_PAGESIZE));
    const std::size_t bytes = count * sizeof(T) + offset;
    inner_ = (bytes + page - 1) / page * page;
    if (inner_ == 0) inner_ = page;
    total_ = inner_ + 2 * page;
    void *base = mmap(nullptr, total_, PROT_NONE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (base == MAP_FAILED) std::abort();
    base_ = static_cast<unsigned char *>(base);
    inside_ = base_ + page;
    if (mprotect(inside_, inner_, PROT_READ | PROT_WRITE) != 0) std::abort();
    std::memset(inside_, 0xA5, inner_);
    unsigned char *first = flush == Flush::front ? inside_ + offset : inside_ + inner_ - bytes;
    data_ = reinterpret_cast<T *>(first);
  }
  ~Guarded() { munmap(base_, total_); }
  Guarded(const Guarded &) = delete;
  Guarded &operator=(const Guarded &) = delete;

  T *data() { return data_; }
  const T *data() const { return data_; }
  std::size_t size() const { return count_; }
  T &operator[](std::size_t i) { return data_[i]; }
  const T &operator[](std::size_t i) const { return data_[i]; }

  // From here on a write to the array traps (its pages become read-only), until writable().
  void read_only() { mprotect(inside_, inner_, PROT_READ); }
  // The same for a read.
  void unreadable() { mprotect(inside_, inner_, PROT_NONE); }
  void writable() { mprotect(inside_, inner_, PROT_READ | PROT_WRITE); }

 private:
  std::size_t count_, inner_, total_;
  unsigned char *base_, *inside_;
  T *data_;
};

}  // namespace qtb::test
