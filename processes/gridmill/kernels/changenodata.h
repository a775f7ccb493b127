#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <type_traits>
#include <vector>

#include "basic/tessel/plaincast.h"
#include "processes/gridmill/kernels/maskedcells.h"
#include "processes/gridmill/kernels/rowconversions.h"

/// The no-data test of the change operators: a sample is no-data if it is, as a `float`, equal to the entry
/// of its channel.
namespace orvik::kernels {

/// Clears the bytes of samples that are equal to their keys.
template <class Sample>
void ClearEqual(const Sample* samples, const Sample* keys, std::size_t count, unsigned char* keep);

/// The same where `never` is 0.
template <class Sample>
void ClearEqual(const Sample* samples, const Sample* keys, const unsigned char* never, std::size_t count,
                unsigned char* keep);

/// Clears the bytes of samples that are equal to `key`.
void ClearEqual(const float* samples, float key, std::size_t count, unsigned char* keep);

/// Narrow integers are compared as they stand with the one sample that an entry can mean, others as `float`.
template <class Sample>
using NoDataKey = std::conditional_t<std::is_integral_v<Sample> && sizeof(Sample) <= 2, Sample, float>;

/// The test of dense pixels, sample by sample.
template <class Sample>
class NoDataTest {
  using Key = NoDataKey<Sample>;
  static constexpr bool kNarrow = std::is_integral_v<Key>;

 public:
  /// @param values  an entry for each channel; channels without one are not tested
  NoDataTest(const std::vector<float>& values, std::size_t channels, std::size_t pixels) {
    bool possible = true;
    for (std::size_t c = 0; c < channels; ++c) {
      const float value = c < values.size() ? values[c] : std::numeric_limits<float>::quiet_NaN();
      keys_.push_back(tessel::PlainCast<Key>(value));
      never_.push_back(static_cast<float>(keys_[c]) != value);
      possible = possible && never_[c] == 0;
    }
    if (possible || !kNarrow) never_.clear();  // NaN is a key that no float is equal to
    Repeat(keys_, channels * pixels);
    if (!never_.empty()) Repeat(never_, channels * pixels);
  }

  /// For each sample of a block the one that is no-data; null if there is not always one.
  const Key* Keys() const { return never_.empty() ? keys_.data() : nullptr; }

  /// Clears the bytes of no-data samples.
  void Clear(const Sample* samples, std::size_t count, unsigned char* keep) const {
    if constexpr (kNarrow) {
      if (never_.empty()) {
        ClearEqual(samples, keys_.data(), count, keep);
      } else {
        ClearEqual(samples, keys_.data(), never_.data(), count, keep);
      }
    } else {
      float scratch[kBlock];
      for (std::size_t i = 0; i < count; i += kBlock) {
        const std::size_t n = std::min(kBlock, count - i);
        ClearEqual(FloatRow(samples + i, 1, n, scratch), keys_.data() + i, n, keep + i);
      }
    }
  }

 private:
  /// Repeats what the vector holds until it has `size` elements.
  template <class Element>
  static void Repeat(std::vector<Element>& pattern, std::size_t size) {
    std::size_t done = pattern.size();
    pattern.resize(size);
    for (; done < size && done > 0; done *= 2)
      std::copy_n(pattern.begin(), std::min(done, size - done),
                  pattern.begin() + static_cast<std::ptrdiff_t>(done));
  }

  std::vector<Key> keys_;             // for each sample of a block
  std::vector<unsigned char> never_;  // 1 where no sample is equal to the entry; empty if there is none such
};

/// Which samples of a block of two dates are computed, for operators that exclude sample by sample.
template <class In, class Ref>
class SampleChoice {
 public:
  /// @param params  with `imgNoData` and `refNoData`
  template <class Params>
  SampleChoice(const Params& params, std::size_t channels, std::size_t pixels)
      : active_(params.imgNoData.size() == channels),
        channels_(channels),
        image_(params.imgNoData, active_ ? channels : 0, pixels),
        reference_(params.refNoData, active_ ? channels : 0, pixels),
        keep_(channels * pixels) {}

  /// One byte for each sample, 0 where it is excluded; null if none is.
  ///
  /// @param block  with dense pixels
  template <class Block>
  const unsigned char* Of(const Block& block) {
    if (!active_ && !block.masked) return nullptr;
    MaskOf(block);
    if (active_) {
      image_.Clear(block.image, block.pixels * channels_, keep_.data());
      reference_.Clear(block.reference, block.pixels * channels_, keep_.data());
    }
    return keep_.data();
  }

  /// The bytes before the no-data test.
  template <class Block>
  const unsigned char* MaskOf(const Block& block) {
    if (block.masked) {
      ReplicateRow(block.valid, channels_, block.pixels, keep_.data());
    } else {
      std::fill_n(keep_.data(), block.pixels * channels_, static_cast<unsigned char>(1));
    }
    return keep_.data();
  }

  /// The keys of an active test, for rows that make it themselves; null if it is not active or needs more.
  const NoDataKey<In>* ImageKeys() const { return Comparable() ? image_.Keys() : nullptr; }
  const NoDataKey<Ref>* ReferenceKeys() const { return Comparable() ? reference_.Keys() : nullptr; }

 private:
  bool Comparable() const { return active_ && image_.Keys() != nullptr && reference_.Keys() != nullptr; }

  bool active_;
  std::size_t channels_;
  NoDataTest<In> image_;
  NoDataTest<Ref> reference_;
  std::vector<unsigned char> keep_;
};

/// Which pixels of a block of two dates are computed, for operators that exclude a pixel for each of its
/// samples.
class PixelChoice {
 public:
  /// @param params             with `imgNoData` and `refNoData`
  /// @param imageChannels      tested in the image if `imgNoData` has as many entries
  /// @param referenceChannels  tested in the reference
  template <class Params>
  PixelChoice(const Params& params, std::size_t imageChannels, std::size_t referenceChannels)
      : active_(params.imgNoData.size() == imageChannels),
        imgNoData_(params.imgNoData),
        refNoData_(params.refNoData) {
    refNoData_.resize(std::min(refNoData_.size(), referenceChannels));
  }

  /// One byte for each pixel, 0 where it is excluded; null if none is.
  ///
  /// @param block  `valid` is where the bytes are
  template <class Block>
  const unsigned char* Of(const Block& block) const {
    if (!active_) return block.masked ? block.valid : nullptr;
    if (!block.masked) std::fill_n(block.valid, block.pixels, static_cast<unsigned char>(1));
    Clear(block.image, block.imageStride, imgNoData_, block.pixels, block.valid);
    Clear(block.reference, block.referenceStride, refNoData_, block.pixels, block.valid);
    return block.valid;
  }

 private:
  template <class Sample>
  static void Clear(const Sample* first, std::size_t stride, const std::vector<float>& values,
                    std::size_t pixels, unsigned char* valid) {
    float scratch[kBlock];
    for (std::size_t c = 0; c < values.size(); ++c)
      ClearEqual(FloatRow(first + c, stride, pixels, scratch), values[c], pixels, valid);
  }

  bool active_;
  std::vector<float> imgNoData_;
  std::vector<float> refNoData_;
};

}  // namespace orvik::kernels
