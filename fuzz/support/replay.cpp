#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <exception>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#define TARGET(name) extern "C" std::uint64_t GridmillFuzz_##name(const std::uint8_t* data, std::size_t size);
#include "targets.inc"
#undef TARGET

namespace {

namespace fs = std::filesystem;

struct Target {
  const char* name;
  std::uint64_t (*run)(const std::uint8_t* data, std::size_t size);
};

#define TARGET(name) {#name, GridmillFuzz_##name},
constexpr Target kTargets[] = {
#include "targets.inc"
};
#undef TARGET

/// Runs a target on each file of its folder in the order of their names, and returns how many there were.
std::size_t Replay(const Target& target, const fs::path& folder) {
  std::vector<fs::path> files;
  for (const auto& entry : fs::directory_iterator(folder)) files.push_back(entry.path());
  std::sort(files.begin(), files.end());
  for (const fs::path& path : files) {
    std::ifstream file(path, std::ios::binary);
    const std::vector<char> bytes{std::istreambuf_iterator<char>(file), {}};
    std::fprintf(stderr, "%s\n", path.c_str());  // the last one, if it ends the process
    target.run(reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size());
  }
  return files.size();
}

}  // namespace

/// Runs the targets on their folders of a corpus, all of them or those that are named, without a fuzzer. A
/// difference ends the process behind the name of the file. An empty folder is a failure, as nothing would be
/// tested.
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
      const std::size_t replayed = Replay(target, fs::path(arguments[1]) / target.name);
      std::fprintf(stderr, "%s: %zu inputs\n", target.name, replayed);
      if (replayed == 0) ++failures;
    }
  } catch (const std::exception& failure) {
    std::fprintf(stderr, "%s\n", failure.what());
    return 1;
  }
  return failures == 0 ? 0 : 1;
}
