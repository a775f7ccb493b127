#include "tests/attack/allocations.h"

#include <algorithm>
#include <atomic>
#include <cstdlib>
#include <new>
#include <utility>

#include "tests/attack/guardedpages.h"

// What glibc calls its own `calloc`, behind a replaced one.
extern "C" void* __libc_calloc(std::size_t count, std::size_t bytes);

namespace orvik::attack::allocations {
namespace {

std::atomic<std::size_t> live, made, requests;
std::atomic<std::size_t> failing;  // the number of the request that fails; 0: none
std::atomic<bool> laterToo, failed;
thread_local bool isFailingThread = false;
thread_local std::size_t cleared = 0;
thread_local Edge edge = Edge::kNone;

bool Fails() {
  const std::size_t n = failing.load();
  if (n == 0) return false;
  const std::size_t request = ++requests;
  if (request != n && !(laterToo && request > n)) return false;
  failed = true;
  return true;
}

/// A few blocks between pages without access, each in use or not.
struct Slots {
  static constexpr std::size_t kCount = 4;

  const GuardedPages& At(std::size_t i) const {
    static const GuardedPages pages[kCount] = {GuardedPages(8192), GuardedPages(8192), GuardedPages(8192),
                                               GuardedPages(8192)};
    return pages[i];
  }
  void* Take(std::size_t bytes) {
    for (std::size_t i = 0; i < kCount; ++i)
      if (!std::exchange(isTaken[i], true)) return At(i).Place(bytes, edge == Edge::kEnd);
    throw std::bad_alloc();
  }
  bool Give(void* block) {
    if (!isUsed) return false;
    for (std::size_t i = 0; i < kCount; ++i) {
      if (!At(i).Holds(block)) continue;
      isTaken[i] = false;
      return true;
    }
    return false;
  }

  bool isUsed = false;
  bool isTaken[kCount] = {};
};
thread_local Slots slots;

void* New(std::size_t bytes, std::size_t alignment) {
  if (Fails()) throw std::bad_alloc();
  ++made;
  ++live;
  if (edge != Edge::kNone) return slots.Take(bytes);
  const std::size_t whole = (std::max<std::size_t>(bytes, 1) + alignment - 1) / alignment * alignment;
  void* const block =
      alignment <= alignof(std::max_align_t) ? std::malloc(whole) : std::aligned_alloc(alignment, whole);
  if (block == nullptr) throw std::bad_alloc();
  return block;
}

void Delete(void* block) noexcept {
  if (block == nullptr) return;
  --live;
  if (!slots.Give(block)) std::free(block);
}

}  // namespace

std::size_t Live() { return live; }
std::size_t Made() { return made; }
std::size_t Cleared() { return cleared; }

void FailAt(std::size_t n, bool andLater) {
  requests = 0;
  failed = false;
  laterToo = andLater;
  isFailingThread = true;
  failing = n;
}

bool EndFailures() {
  failing = 0;
  isFailingThread = false;
  return failed;
}

void PlaceAt(Edge place) {
  edge = place;
  if (place != Edge::kNone) slots.isUsed = true;
}

}  // namespace orvik::attack::allocations

using orvik::attack::allocations::Delete;
using orvik::attack::allocations::New;

void* operator new(std::size_t bytes) { return New(bytes, 1); }
void* operator new(std::size_t bytes, std::align_val_t alignment) {
  return New(bytes, static_cast<std::size_t>(alignment));
}
void* operator new[](std::size_t bytes) { return New(bytes, 1); }
void* operator new[](std::size_t bytes, std::align_val_t alignment) {
  return New(bytes, static_cast<std::size_t>(alignment));
}
void operator delete(void* block) noexcept { Delete(block); }
void operator delete(void* block, std::size_t) noexcept { Delete(block); }
void operator delete(void* block, std::align_val_t) noexcept { Delete(block); }
void operator delete(void* block, std::size_t, std::align_val_t) noexcept { Delete(block); }
void operator delete[](void* block) noexcept { Delete(block); }
void operator delete[](void* block, std::size_t) noexcept { Delete(block); }
void operator delete[](void* block, std::align_val_t) noexcept { Delete(block); }
void operator delete[](void* block, std::size_t, std::align_val_t) noexcept { Delete(block); }

extern "C" void* calloc(std::size_t count, std::size_t bytes) {
  using namespace orvik::attack::allocations;
  ++cleared;
  if (isFailingThread && Fails()) return nullptr;
  return __libc_calloc(count, bytes);
}
