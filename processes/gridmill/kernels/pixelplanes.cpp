#include "processes/gridmill/kernels/pixelplanes.h"

#include <algorithm>
#include <cstdint>
#include <cstring>

#include "processes/gridmill/kernels/multiversion.h"
#include "processes/gridmill/kernels/transpose.h"

namespace orvik::kernels {

namespace {

/// As many pixels as a register has lanes, and as many channels.
template <class Sample>
GRIDMILL_INLINE void SplitSquare(const Sample* first, std::size_t stride, Sample (*planes)[kBlock],
                                 std::size_t x) {
  using Word = WordOf<sizeof(Sample)>;
  Lanes<Word> square[kLanes<Word>];
  for (std::size_t i = 0; i < kLanes<Word>; ++i) std::memcpy(&square[i], first + i * stride, 16);
  Transpose<Word>(square);
  for (std::size_t c = 0; c < kLanes<Word>; ++c) std::memcpy(&planes[c][x], &square[c], 16);
}

template <class Sample>
GRIDMILL_INLINE void JoinSquare(const Sample* const* planes, std::size_t x, std::size_t samples,
                                Sample* target) {
  using Word = WordOf<sizeof(Sample)>;
  Lanes<Word> square[kLanes<Word>];
  for (std::size_t c = 0; c < kLanes<Word>; ++c) std::memcpy(&square[c], planes[c] + x, 16);
  Transpose<Word>(square);
  for (std::size_t i = 0; i < kLanes<Word>; ++i) std::memcpy(target + i * samples, &square[i], 16);
}

}  // namespace

/// Registers reach past the channels of a pixel, but not past those of the last one: the pixels at the end
/// come from a copy.
template <class Sample>
GRIDMILL_MULTIVERSION void SplitPixels(const Sample* __restrict first, std::size_t stride,
                                       std::size_t channels, std::size_t count,
                                       Sample (*__restrict planes)[kBlock]) {
  constexpr std::size_t lanes = kSplitChannels<Sample>;
  const std::size_t samples = count == 0 ? 0 : (count - 1) * stride + channels;
  std::size_t x = 0;
  for (; (x + lanes - 1) * stride + lanes <= samples; x += lanes)
    SplitSquare(first + x * stride, stride, planes, x);
  for (; x < count; x += lanes) {
    Sample last[lanes * lanes] = {};
    for (std::size_t i = 0; i < std::min(lanes, count - x); ++i)
      for (std::size_t c = 0; c < channels; ++c) last[i * lanes + c] = first[(x + i) * stride + c];
    SplitSquare(last, lanes, planes, x);
  }
}

GRIDMILL_MULTIVERSION void SplitTriples(const unsigned char* __restrict pixels, std::size_t count,
                                        unsigned char* __restrict first, unsigned char* __restrict second,
                                        unsigned char* __restrict third) {
  for (std::size_t i = 0; i < count; ++i) {
    first[i] = pixels[3 * i];
    second[i] = pixels[3 * i + 1];
    third[i] = pixels[3 * i + 2];
  }
}

/// The last square of a pixel's samples ends with them: it may write some a second time.
template <class Sample>
GRIDMILL_MULTIVERSION void JoinPixels(const Sample* const* __restrict planes, std::size_t samples,
                                      std::size_t count, Sample* __restrict target) {
  constexpr std::size_t lanes = kSplitChannels<Sample>;
  std::size_t x = 0;
  if (samples >= lanes) {
    for (; x + lanes <= count; x += lanes) {
      Sample* const pixels = target + x * samples;
      for (std::size_t c = 0; c + lanes <= samples; c += lanes)
        JoinSquare(planes + c, x, samples, pixels + c);
      if (samples % lanes != 0) JoinSquare(planes + samples - lanes, x, samples, pixels + samples - lanes);
    }
  }
  for (; x < count; ++x)
    for (std::size_t c = 0; c < samples; ++c) target[x * samples + c] = planes[c][x];
}

template void SplitPixels(const char*, std::size_t, std::size_t, std::size_t, char (*)[kBlock]);
template void SplitPixels(const unsigned char*, std::size_t, std::size_t, std::size_t,
                          unsigned char (*)[kBlock]);
template void SplitPixels(const short*, std::size_t, std::size_t, std::size_t, short (*)[kBlock]);
template void SplitPixels(const unsigned short*, std::size_t, std::size_t, std::size_t,
                          unsigned short (*)[kBlock]);
template void SplitPixels(const int*, std::size_t, std::size_t, std::size_t, int (*)[kBlock]);
template void SplitPixels(const unsigned int*, std::size_t, std::size_t, std::size_t,
                          unsigned int (*)[kBlock]);
template void SplitPixels(const float*, std::size_t, std::size_t, std::size_t, float (*)[kBlock]);
template void SplitPixels(const double*, std::size_t, std::size_t, std::size_t, double (*)[kBlock]);
template void SplitPixels(const std::int64_t*, std::size_t, std::size_t, std::size_t,
                          std::int64_t (*)[kBlock]);
template void SplitPixels(const std::uint64_t*, std::size_t, std::size_t, std::size_t,
                          std::uint64_t (*)[kBlock]);

template void JoinPixels(const char* const*, std::size_t, std::size_t, char*);
template void JoinPixels(const unsigned char* const*, std::size_t, std::size_t, unsigned char*);
template void JoinPixels(const short* const*, std::size_t, std::size_t, short*);
template void JoinPixels(const unsigned short* const*, std::size_t, std::size_t, unsigned short*);
template void JoinPixels(const int* const*, std::size_t, std::size_t, int*);
template void JoinPixels(const unsigned int* const*, std::size_t, std::size_t, unsigned int*);
template void JoinPixels(const float* const*, std::size_t, std::size_t, float*);
template void JoinPixels(const double* const*, std::size_t, std::size_t, double*);
template void JoinPixels(const std::int64_t* const*, std::size_t, std::size_t, std::int64_t*);
template void JoinPixels(const std::uint64_t* const*, std::size_t, std::size_t, std::uint64_t*);

}  // namespace orvik::kernels
