#pragma once

#include <cstddef>

/// Sums with the bits of one addition after the other, formed faster.
namespace orvik::kernels {

/// Terms that go through together at most.
inline constexpr std::size_t kMostTerms = 1024;
/// The room that has to follow the terms, which is overwritten.
inline constexpr std::size_t kRoomAfterTerms = 32;

/// Adds `count` terms in their order. The first is one of channel 0, the next of channel 1 and so on round
/// all channels; each channel has its sum, which is not a negative zero.
void AddInOrder(double* terms, std::size_t channels, std::size_t count, double* sums);

/// The same for terms and sums of which none is negative.
void AddSquaresInOrder(double* terms, std::size_t channels, std::size_t count, double* sums);

}  // namespace orvik::kernels
