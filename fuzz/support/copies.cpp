#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>

// A target, its twin and the library twice in one program, each in a namespace of its own: for x86-64, and
// for another instruction set with other numbers of threads.
extern "C" {
std::uint64_t GridmillFuzz_0(const std::uint8_t* data, std::size_t size);
std::uint64_t GridmillFuzz_1(const std::uint8_t* data, std::size_t size);
int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size);
}

int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  if (GridmillFuzz_0(data, size) != GridmillFuzz_1(data, size)) {
    std::fprintf(stderr, "gridmill: the instruction sets differ\n");
    std::abort();
  }
  return 0;
}
