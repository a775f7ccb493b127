#pragma once

#include <cstddef>
#include <new>

#include <sys/mman.h>
#include <unistd.h>

namespace orvik::attack {

/// Memory with a page before it and one behind it that nobody can read or write.
class GuardedPages {
 public:
  explicit GuardedPages(std::size_t atLeast) {
    const auto page = static_cast<std::size_t>(sysconf(_SC_PAGESIZE));
    bytes_ = (atLeast + page - 1) / page * page;
    whole_ = bytes_ + 2 * page;
    void* const start = mmap(nullptr, whole_, PROT_NONE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (start == MAP_FAILED) throw std::bad_alloc();
    begin_ = static_cast<unsigned char*>(start) + page;
    if (mprotect(begin_, bytes_, PROT_READ | PROT_WRITE) != 0) throw std::bad_alloc();
  }
  GuardedPages(const GuardedPages&) = delete;
  GuardedPages& operator=(const GuardedPages&) = delete;
  ~GuardedPages() { munmap(begin_ - (whole_ - bytes_) / 2, whole_); }

  /// The `bytes` bytes that end at the second guard, or that begin after the first one.
  unsigned char* Place(std::size_t bytes, bool atEnd) const {
    if (bytes > bytes_) throw std::bad_alloc();
    return atEnd ? begin_ + bytes_ - bytes : begin_;
  }

  bool Holds(const void* address) const {
    const auto* const byte = static_cast<const unsigned char*>(address);
    return byte >= begin_ && byte <= begin_ + bytes_;
  }

 private:
  std::size_t bytes_;
  std::size_t whole_;
  unsigned char* begin_;
};

}  // namespace orvik::attack
