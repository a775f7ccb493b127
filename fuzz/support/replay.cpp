#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <exception>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <vector>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size);

namespace {

void Replay(const std::filesystem::path& path) {
  std::ifstream file(path, std::ios::binary);
  const std::vector<char> bytes{std::istreambuf_iterator<char>(file), {}};
  std::fprintf(stderr, "%s\n", path.c_str());
  LLVMFuzzerTestOneInput(reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size());
}

}  // namespace

/// Runs a target on each file of the folders that are given, without a fuzzer. A difference ends the process
/// behind the name of the file. An empty corpus is a failure, as nothing would be tested.
int main(int count, char** arguments) {
  std::size_t replayed = 0;
  try {
    for (int i = 1; i < count; ++i) {
      for (const auto& entry : std::filesystem::directory_iterator(arguments[i])) {
        if (!entry.is_regular_file()) continue;
        Replay(entry.path());
        ++replayed;
      }
    }
  } catch (const std::exception& failure) {
    std::fprintf(stderr, "%s\n", failure.what());
    return 1;
  }
  std::fprintf(stderr, "%zu inputs\n", replayed);
  return replayed == 0 ? 1 : 0;
}
