#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <exception>
#include <fstream>
#include <stdexcept>
#include <string>
#include <vector>

#define TARGET(name) extern "C" std::uint64_t GridmillFuzz_##name(const std::uint8_t* data, std::size_t size);
#include "targets.inc"
#undef TARGET

namespace {

struct Target {
  const char* name;
  std::uint64_t (*run)(const std::uint8_t* data, std::size_t size);
};

#define TARGET(name) {#name, GridmillFuzz_##name},
constexpr Target kTargets[] = {
#include "targets.inc"
};
#undef TARGET

/// Runs a target on each input in the file of its corpus, and returns how many there were. An input stands
/// behind its length, of two bytes with the higher one first.
std::size_t Replay(const Target& target, const std::string& folder) {
  std::ifstream file(folder + "/" + target.name + ".bin", std::ios::binary);
  std::size_t replayed = 0;
  unsigned char length[2];
  while (file.read(reinterpret_cast<char*>(length), sizeof length)) {
    std::vector<std::uint8_t> bytes(std::size_t{length[0]} * 256 + length[1]);
    if (!file.read(reinterpret_cast<char*>(bytes.data()), static_cast<std::streamsize>(bytes.size())))
      throw std::runtime_error(std::string(target.name) + ": the corpus ends within an input");
    std::fprintf(stderr, "%s: input %zu\n", target.name, replayed);  // the last one, if it ends the process
    target.run(bytes.data(), bytes.size());
    ++replayed;
  }
  return replayed;
}

}  // namespace

/// Runs the targets on their parts of a corpus, all of them or those that are named, without a fuzzer. A
/// difference ends the process behind the number of the input. A part without inputs is a failure, as nothing
/// would be tested.
int main(int count, char** arguments) {
  if (count < 2) {
    std::fprintf(stderr, "usage: %s CORPUS [TARGET...]\n", arguments[0]);
    return 2;
  }
  const std::vector<std::string> wanted(arguments + 2, arguments + count);
  int failures = 0;
  try {
    for (const Target& target : kTargets) {
      if (!wanted.empty() && std::find(wanted.begin(), wanted.end(), target.name) == wanted.end()) continue;
      const std::size_t replayed = Replay(target, arguments[1]);
      std::fprintf(stderr, "%s: %zu inputs\n", target.name, replayed);
      if (replayed == 0) ++failures;
    }
  } catch (const std::exception& failure) {
    std::fprintf(stderr, "%s\n", failure.what());
    return 1;
  }
  return failures == 0 ? 0 : 1;
}
