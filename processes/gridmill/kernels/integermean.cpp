#include "processes/gridmill/kernels/integermean.h"

#include <cstdint>
#include <cstring>

#include "basic/tessel/clipto.h"

namespace orvik::kernels {

namespace {

using Bytes = unsigned char __attribute__((vector_size(16)));
using Words = unsigned short __attribute__((vector_size(32)));

/// The mean of three samples is their sum plus this, over 3, rounded to 8 bits.
constexpr unsigned short kRounding = 1;

constexpr bool AgreesWithFloat() {
  for (int sum = 0; sum <= 3 * 255; ++sum)
    if ((sum + kRounding) / 3 != tessel::ClipTo<unsigned char>(static_cast<float>(sum) / 3.0f)) return false;
  return true;
}
static_assert(AgreesWithFloat());

/// 16 pixels of three channels.
GRIDMILL_INLINE void RoundedMeans3(const unsigned char* source, Bytes noData, Bytes tested, Bytes substitute,
                                   unsigned char* target) {
  Bytes low, middle, high;
  std::memcpy(&low, source, 16);
  std::memcpy(&middle, source + 16, 16);
  std::memcpy(&high, source + 32, 16);
  const Bytes a = __builtin_shufflevector(
      __builtin_shufflevector(low, middle, 0, 3, 6, 9, 12, 15, 18, 21, 24, 27, 30, 0, 0, 0, 0, 0), high, 0, 1,
      2, 3, 4, 5, 6, 7, 8, 9, 10, 17, 20, 23, 26, 29);
  const Bytes b = __builtin_shufflevector(
      __builtin_shufflevector(low, middle, 1, 4, 7, 10, 13, 16, 19, 22, 25, 28, 31, 0, 0, 0, 0, 0), high, 0,
      1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 18, 21, 24, 27, 30);
  const Bytes c = __builtin_shufflevector(
      __builtin_shufflevector(low, middle, 2, 5, 8, 11, 14, 17, 20, 23, 26, 29, 0, 0, 0, 0, 0, 0), high, 0, 1,
      2, 3, 4, 5, 6, 7, 8, 9, 16, 19, 22, 25, 28, 31);
  const Words sum = __builtin_convertvector(a, Words) + __builtin_convertvector(b, Words) +
                    __builtin_convertvector(c, Words);
  const Bytes mean = __builtin_convertvector((sum + kRounding) / 3, Bytes);
  const Bytes hit = reinterpret_cast<Bytes>((a == noData) | (b == noData) | (c == noData)) & tested;
  const Bytes result = (hit & substitute) | (~hit & mean);
  std::memcpy(target, &result, 16);
}

}  // namespace

GRIDMILL_MULTIVERSION void RoundedMeanRow3(const unsigned char* source, NoDataSample<unsigned char> noData,
                                           unsigned char substitute, std::size_t count,
                                           unsigned char* target) {
  const Bytes none = {};
  const Bytes sample = none + noData.sample;
  const Bytes tested = noData.exists ? ~none : none;
  const Bytes written = none + substitute;
  std::size_t i = 0;
  for (; i + 16 <= count; i += 16) RoundedMeans3(source + 3 * i, sample, tested, written, target + i);
  if (i < count) {
    unsigned char last[48] = {};
    unsigned char means[16];
    std::memcpy(last, source + 3 * i, 3 * (count - i));
    RoundedMeans3(last, sample, tested, written, means);
    std::memcpy(target + i, means, count - i);
  }
}

GRIDMILL_MULTIVERSION void MeanRow4(const unsigned short* source, NoDataSample<unsigned short> noData,
                                    float substitute, std::size_t count, float* __restrict mean) {
  constexpr std::uint64_t ones = 0x0001000100010001u;
  constexpr std::uint64_t sample = 0xFFFFu;
  const std::uint64_t pattern = ones * noData.sample;
  const std::uint64_t tested = noData.exists ? ones << 15 : 0;
  for (std::size_t i = 0; i < count; ++i) {
    std::uint64_t pixel;
    std::memcpy(&pixel, source + 4 * i, 8);
    const std::uint64_t sum =
        (pixel & sample) + ((pixel >> 16) & sample) + ((pixel >> 32) & sample) + (pixel >> 48);
    // The top bit of a field is set if it, or one below it, is zero.
    const std::uint64_t difference = pixel ^ pattern;
    const std::uint64_t zero = (difference - ones) & ~difference & tested;
    const float value = static_cast<float>(static_cast<std::int32_t>(sum)) / 4.0f;
    mean[i] = zero != 0 ? substitute : value;
  }
}

}  // namespace orvik::kernels
