#pragma once

#include <cmath>
#include <cstdint>
#include <cstring>
#include <memory>
#include <vector>

#include "basic/exceptions/exceptions.h"
#include "fuzz/support/bytes.h"
#include "fuzz/support/digest.h"
#include "fuzz/support/scene.h"
#include "fuzz/support/values.h"

namespace orvik::fuzz {

/// Fails unless two vectors hold the same bits, any NaN for a NaN.
inline void RequireSameSums(const std::vector<double>& expected, const std::vector<double>& actual) {
  if (expected.size() != actual.size()) Fail("the results differ in number");
  for (std::size_t i = 0; i < expected.size(); ++i) {
    const bool isSame = std::isnan(expected[i]) ? std::isnan(actual[i])
                                                : std::memcmp(&expected[i], &actual[i], sizeof(double)) == 0;
    if (!isSame) Fail("a sum differs");
  }
  Observed().Add(actual);
}

/// Runs one input of the fuzzer on a focus measure and its twin: calls with setters, clears, type changes and
/// failures between them.
///
/// @param compare  void(const Measure&, const Twin&)
template <class Measure, class Twin, class Compare>
void RunFocus(Bytes& bytes, bool isInitialised, Compare compare) {
  const std::uint32_t channels = 1 + bytes.Below(6);
  auto measure = std::make_unique<Measure>();
  Twin twin;
  const auto set = [&] {
    const double low = bytes.OneIn(2) ? Value(bytes) : -1e300, high = bytes.OneIn(2) ? Value(bytes) : 1e300;
    const double failure = Value(bytes);
    measure->SetBackground(low, high);
    twin.SetBackground(low, high);
    measure->SetFailure(failure);
    twin.SetFailure(failure);
  };
  const auto initialise = [&] {
    measure->InitEvaluation(channels);
    twin.InitEvaluation(channels);
  };
  set();
  if (isInitialised || bytes.OneIn(2)) initialise();
  if (bytes.OneIn(4)) measure = std::make_unique<Measure>(*measure);
  tessel::DataType type = PixelTypeOf(bytes);
  for (std::uint32_t i = 0, calls = 1 + bytes.Below(4); i < calls; ++i) {
    if (i > 0 && bytes.OneIn(3)) set();
    if (i > 0 && bytes.OneIn(4)) initialise();
    if (bytes.OneIn(3)) type = PixelTypeOf(bytes);
    if (bytes.OneIn(8)) {
      tessel::Raster complex({1, 1, 1, tessel::DataType(tessel::eDT_32F, true)}, {});
      try {
        measure->Process(&complex, nullptr, nullptr);
        Fail("a complex input was taken");
      } catch (const Exception&) {
        twin.FailToDispatch();
      }
    }
    const Buffer in(DrawShape(bytes, type, channels, 0), false);
    const std::unique_ptr<tessel::Mask> mask = DrawMask(bytes, *in);
    Fill(bytes, type, *in);
    const std::vector<unsigned char> before = BytesOf(*in);
    measure->Process(in.Get(), mask.get(), nullptr);
    twin.Process(*in, mask.get());
    compare(*measure, twin);
    RequireUntouched(before, BytesOf(*in));
  }
}

}  // namespace orvik::fuzz
