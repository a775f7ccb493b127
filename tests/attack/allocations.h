#pragma once

#include <cstddef>

// What the test program knows of the memory that the library asks for. The program replaces `operator new`,
// `operator delete` and `calloc` for all that is loaded with it. Built with a sanitizer, which has
// replacements of its own, it only asks that one how much is in use.
namespace orvik::attack::allocations {

/// How much is in use: blocks, or with a sanitizer bytes.
std::size_t Live();

/// Blocks that `operator new` has been asked for so far; 0 with a sanitizer.
std::size_t Made();

/// Blocks of `calloc` on this thread so far; 0 with a sanitizer.
std::size_t Cleared();

/// From now on the n-th request fails, of `operator new` on any thread and of `calloc` on this one, and with
/// `andLater` all that follow.
void FailAt(std::size_t n, bool andLater);

/// Ends it. Returns true if a request has failed.
bool EndFailures();

enum class Edge { kNone, kBegin, kEnd };

/// From now on `operator new` gives blocks on this thread that end at memory without access, or begin after
/// it, until it is `kNone` again. With a sanitizer, which watches the ends of all blocks, it does nothing.
void PlaceAt(Edge edge);

}  // namespace orvik::attack::allocations
