#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <vector>

/// Samples counted by value, with their minimum and maximum.
namespace orvik::kernels {

/// The least and the greatest sample met.
struct Extremes {
  float least;
  float greatest;

  /// Takes a sample that is strictly less or greater; NaN is neither.
  void Take(float sample) {
    if (sample < least) least = sample;
    if (sample > greatest) greatest = sample;
  }
};

/// Takes `count` samples in their order. Of the two zeros the first one met stays.
template <class Sample>
void TakeExtremes(const Sample* samples, std::size_t count, Extremes& extremes);

/// Adds `count` samples to the bins of their values, as integers. A value outside the bins is not counted.
/// Counts wrap.
template <class Sample>
void CountSamples(const Sample* samples, std::size_t count, std::vector<int>& bins);

/// Counts of bytes, which go to two tables in turn: neighbours are often equal, and a count that has just
/// been stored cannot be loaded at once.
class ByteCounts {
 public:
  /// @param stride  bytes from one to the next
  void Count(const unsigned char* bytes, std::size_t stride, std::size_t count);

  /// Adds the counts to the first 256 bins, of which there may be less, and takes the extremes of the bytes.
  void AddTo(std::vector<int>& bins, Extremes& extremes) const;

 private:
  std::array<std::array<std::uint32_t, 256>, 2> tables_{};
};

}  // namespace orvik::kernels
