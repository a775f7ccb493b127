#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <memory>
#include <type_traits>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "processes/gridmill/kernels/bytecolours.h"
#include "processes/gridmill/kernels/changenodata.h"
#include "processes/gridmill/kernels/channelratio.h"
#include "processes/gridmill/kernels/channelsums.h"
#include "processes/gridmill/kernels/difference.h"
#include "processes/gridmill/kernels/focussums.h"
#include "processes/gridmill/kernels/integermean.h"
#include "processes/gridmill/kernels/logarithm.h"
#include "processes/gridmill/kernels/maskedcells.h"
#include "processes/gridmill/kernels/orderedsums.h"
#include "processes/gridmill/kernels/percentilespline.h"
#include "processes/gridmill/kernels/pixelgather.h"
#include "processes/gridmill/kernels/pixelplanes.h"
#include "processes/gridmill/kernels/reverse.h"
#include "processes/gridmill/kernels/rowconversions.h"
#include "processes/gridmill/kernels/samplecounts.h"
#include "processes/gridmill/kernels/syntheticblue.h"
#include "processes/gridmill/kernels/tablelookup.h"
#include "processes/gridmill/kernels/terraincell.h"
#include "processes/gridmill/kernels/thresholds.h"
#include "processes/gridmill/kernels/validrange.h"
#include "processes/gridmill/kernels/vegetation.h"
#include "processes/gridmill/kernels/wholedegrees.h"
#include "tests/attack/guardedpages.h"

// Rows of kernels at memory without access. What the operators hand on from scratch of a fixed size, of which
// nothing outside would be noticed, lies at its end here.
namespace orvik::attack {
namespace {

using kernels::kBlock;

enum class At { kPlain, kEnd, kBegin };

/// The rows of one call of a kernel.
class Rows {
 public:
  explicit Rows(At at) : at_(at) {}

  /// A row of numbers from 1 to 100.
  template <class T>
  T* Numbers(std::size_t count) {
    T* const row = Make<T>(count);
    for (std::size_t i = 0; i < count; ++i) row[i] = static_cast<T>(1 + (i * 37 + rows_.size() * 11) % 100);
    return row;
  }

  /// A row of zeros and ones.
  unsigned char* Valid(std::size_t count) {
    unsigned char* const row = Numbers<unsigned char>(count);
    for (std::size_t i = 0; i < count; ++i) row[i] = row[i] % 5 != 0;
    return row;
  }

  /// A row of numbers that a kernel uses as it likes.
  template <class T>
  T* Scratch(std::size_t count) {
    T* const row = Numbers<T>(count);
    rows_.back().second = 0;
    return row;
  }

  /// What all rows hold but the scratch.
  std::vector<unsigned char> Bytes() const {
    std::vector<unsigned char> all;
    for (const auto& [bytes, count] : rows_) all.insert(all.end(), bytes, bytes + count);
    return all;
  }

 private:
  template <class T>
  T* Make(std::size_t count) {
    constexpr std::size_t room = 1024;
    const std::size_t bytes = count * sizeof(T);
    const GuardedPages& pages = Pages(rows_.size());
    unsigned char* const row = at_ == At::kPlain ? pages.Place(room + bytes + room, false) + room
                                                 : pages.Place(bytes, at_ == At::kEnd);
    rows_.emplace_back(row, bytes);
    return reinterpret_cast<T*>(row);
  }

  /// The same ones for each call.
  static const GuardedPages& Pages(std::size_t row) {
    static std::vector<std::unique_ptr<GuardedPages>> pages;
    while (pages.size() <= row) pages.push_back(std::make_unique<GuardedPages>(64 * 1024));
    return *pages[row];
  }

  At at_;
  std::vector<std::pair<unsigned char*, std::size_t>> rows_;
};

/// Calls `run(rows, count)` for many counts up to `kBlock`, with plain rows and at both ends of the memory.
template <class Run>
void ForCounts(Run run) {
  for (std::size_t count = 0; count <= kBlock; count += count < 70 ? 1 : 31) {
    const auto result = [&](At at) {
      Rows rows(at);
      run(rows, count);
      return rows.Bytes();
    };
    const std::vector<unsigned char> wanted = result(At::kPlain);
    EXPECT_TRUE(result(At::kEnd) == wanted) << count;
    EXPECT_TRUE(result(At::kBegin) == wanted) << count;
  }
}

/// Elements from the first of `count` to the last, `stride` apart.
std::size_t Span(std::size_t count, std::size_t stride) { return count == 0 ? 0 : (count - 1) * stride + 1; }

template <class T>
class KernelPages : public testing::Test {};
using Samples = testing::Types<char, unsigned char, short, unsigned short, int, unsigned int, float, double,
                               std::int64_t, std::uint64_t>;
TYPED_TEST_SUITE(KernelPages, Samples);

TYPED_TEST(KernelPages, RowsAreLoaded) {
  using T = TypeParam;
  for (const std::size_t stride : {1u, 2u, 3u, 4u, 5u, 6u, 7u, 8u, 13u}) {
    ForCounts([&](Rows& rows, std::size_t n) {
      const T* const source = rows.Numbers<T>(Span(n, stride));
      kernels::LoadRow(source, stride, n, rows.Numbers<float>(n));
      kernels::LoadRow(source, stride, n, rows.Numbers<double>(n));
      kernels::CopyRow(source, stride, n, rows.Numbers<T>(n));
    });
  }
}

TYPED_TEST(KernelPages, RowsAreStored) {
  using T = TypeParam;
  ForCounts([](Rows& rows, std::size_t n) {
    const float* const floats = rows.Numbers<float>(n);
    const double* const doubles = rows.Numbers<double>(n);
    const T* const samples = rows.Numbers<T>(n);
    const unsigned char* const valid = rows.Valid(n);
    kernels::StoreCast(samples, n, rows.Numbers<unsigned char>(n));
    kernels::StoreCast(doubles, n, rows.Numbers<T>(n));
    kernels::StoreClipped(samples, n, rows.Numbers<short>(n));
    kernels::StoreClipped(floats, n, rows.Numbers<T>(n));
    kernels::StoreClippedWhere(floats, valid, T{7}, n, rows.Numbers<T>(n));
    kernels::StoreClippedWhere(doubles, valid, T{7}, n, rows.Numbers<T>(n));
    kernels::ReplaceMasked(valid, T{7}, n, rows.Numbers<T>(n));
  });
}

TYPED_TEST(KernelPages, PixelsAreTakenApartAndPutTogether) {
  using T = TypeParam;
  for (const std::size_t channels : {1u, 2u, 3u, 4u, 5u, 7u, 8u, 16u, 17u}) {
    const std::size_t together = std::min(channels, kernels::kSplitChannels<T>);
    ForCounts([&](Rows& rows, std::size_t n) {
      auto* const planes =
          reinterpret_cast<T(*)[kBlock]>(rows.Numbers<T>(kernels::kSplitChannels<T> * kBlock));
      // Of the last pixel no more is there than what is taken.
      const T* const pixels = rows.Numbers<T>(n == 0 ? 0 : (n - 1) * channels + together);
      kernels::SplitPixels(pixels, channels, together, n, planes);
      std::vector<const T*> each;
      for (std::size_t c = 0; c < channels; ++c) each.push_back(rows.Numbers<T>(n));
      kernels::JoinPixels(each.data(), channels, n, rows.Numbers<T>(n * channels));
    });
  }
}

TYPED_TEST(KernelPages, PlanesAreStoredAsPixels) {
  using T = TypeParam;
  static T planes[4][kBlock];
  ForCounts([](Rows& rows, std::size_t n) {
    kernels::StorePixels(*reinterpret_cast<const T(*)[3][kBlock]>(&planes), n, rows.Numbers<T>(3 * n));
    kernels::StorePixels(planes, n, rows.Numbers<T>(4 * n));
  });
}

TYPED_TEST(KernelPages, SamplesAreCounted) {
  using T = TypeParam;
  ForCounts([](Rows& rows, std::size_t n) {
    const T* const samples = rows.Numbers<T>(n);
    float* const ends = rows.Numbers<float>(2);
    kernels::Extremes extremes = {50.0f, 50.0f};
    kernels::TakeExtremes(samples, n, extremes);
    ends[0] = extremes.least;
    ends[1] = extremes.greatest;
    std::vector<int> bins(64);
    kernels::CountSamples(samples, n, bins);
    std::copy(bins.begin(), bins.end(), rows.Numbers<int>(bins.size()));
  });
}

TYPED_TEST(KernelPages, FocusIsSummed) {
  using T = TypeParam;
  for (const std::size_t channels : {1u, 2u, 3u, 4u, 5u}) {
    for (const double low : {-1e7, 20.0}) {
      const kernels::FocusSums<T> focus{channels, kernels::CountedSamples<T>(low, 1e7, -32767.0)};
      ForCounts([&](Rows& rows, std::size_t n) {
        const T* const upper = rows.Numbers<T>(n * channels);
        const T* const row = rows.Numbers<T>(n == 0 ? 0 : (n + 2) * channels);
        double* const sums = rows.Numbers<double>(channels);
        focus.AddSquaredDifferences(upper, rows.Numbers<T>(n * channels), n, sums);
        focus.AddNeighbourProducts(row, n, sums, rows.Numbers<double>(channels));
      });
    }
  }
}

TYPED_TEST(KernelPages, DatesAreCompared) {
  using T = TypeParam;
  using kernels::Difference;
  ForCounts([](Rows& rows, std::size_t n) {
    const T* const a = rows.Numbers<T>(n);
    const T* const b = rows.Numbers<T>(n);
    for (const Difference form : {Difference::kAbsolute, Difference::kForward, Difference::kBackward})
      kernels::DifferenceRow(a, b, form, n, rows.Numbers<T>(n));
    kernels::KeepValidSamples(a, 20, nullptr, n, rows.Valid(n));
    const kernels::ValidRange range(10.0f, 90.0f);
    kernels::KeepValidSamples(a, 20, &range, n, rows.Valid(n));
    const T* const c = rows.Numbers<T>(n);
    kernels::SyntheticBlueRow(a, b, c, n, rows.Numbers<double>(n));
    kernels::BlueBinRow(a, b, c, n, rows.Numbers<unsigned char>(n));
  });
}

TYPED_TEST(KernelPages, KeysAreCompared) {
  using T = TypeParam;
  if constexpr (sizeof(T) <= 2 || std::is_same_v<T, float>) {
    ForCounts([](Rows& rows, std::size_t n) {
      const T* const a = rows.Numbers<T>(n);
      const T* const b = rows.Numbers<T>(n);
      const T* const aKeys = rows.Numbers<T>(n);
      const T* const bKeys = rows.Numbers<T>(n);
      kernels::TestedDifferenceRow(a, aKeys, b, bKeys, rows.Valid(n), kernels::Difference::kForward, T{7}, n,
                                   rows.Numbers<T>(n));
      kernels::ClearEqual(a, aKeys, n, rows.Valid(n));
      if constexpr (std::is_integral_v<T>) {
        kernels::ClearEqual(a, aKeys, rows.Valid(n), n, rows.Valid(n));
        const kernels::IntegerRange<T> range(10.0f, 90.0f, false);
        kernels::SelectRow(a, range, n, rows.Numbers<unsigned char>(n));
      } else {
        kernels::ClearEqual(a, 20.0f, n, rows.Valid(n));
        kernels::SelectRow(a, 10.0f, 90.0f, true, n, rows.Numbers<unsigned char>(n));
      }
    });
  }
}

TYPED_TEST(KernelPages, CornersAreLoaded) {
  using T = TypeParam;
  for (const std::size_t stride : {1u, 3u, 4u}) {
    for (const std::size_t right : {stride, std::size_t{1}}) {
      ForCounts([&](Rows& rows, std::size_t n) {
        if (n == 0) return;
        const T* const upper = rows.Numbers<T>((n - 1) * stride + right + 1);
        const T* const lower = rows.Numbers<T>((n - 1) * stride + right + 1);
        kernels::CellScratch scratch;
        const kernels::CellCorners z = kernels::LoadCorners(upper, lower, stride, right, n, scratch);
        for (const float* const corner : {z.z00, z.z10, z.z01, z.z11})
          std::copy_n(corner, n, rows.Numbers<float>(n));
      });
    }
  }
}

struct Square {
  template <class>
  static constexpr bool kFitsInt = false;
  template <class In>
  static double Of(In sample) {
    return static_cast<double>(sample) * static_cast<double>(sample);
  }
};

struct Half {
  double Of(double sum) const { return sum / 2; }
};

TYPED_TEST(KernelPages, ChannelsAreSummed) {
  using T = TypeParam;
  for (const std::size_t stride : {1u, 3u, 4u, 5u}) {
    for (const std::size_t channels : {std::size_t{1}, stride}) {
      ForCounts([&](Rows& rows, std::size_t n) {
        const T* const pixels = rows.Numbers<T>(n == 0 ? 0 : (n - 1) * stride + channels);
        kernels::SumRow<Square>(pixels, stride, channels, Half{}, n, rows.Numbers<double>(n));
      });
    }
  }
}

TEST(KernelPages, PixelsAreReversed) {
  for (std::size_t bytes = 1; bytes <= 17; ++bytes) {
    ForCounts([&](Rows& rows, std::size_t n) {
      const unsigned char* const pixels = rows.Numbers<unsigned char>(n * bytes);
      if (n > 0)
        kernels::ReversePixels(pixels + (n - 1) * bytes, bytes, n, rows.Numbers<unsigned char>(n * bytes));
    });
  }
}

TEST(KernelPages, PixelsAreGathered) {
  for (std::size_t bytes = 1; bytes <= 17; ++bytes) {
    for (const std::uint32_t times : {2u, 3u}) {
      ForCounts([&](Rows& rows, std::size_t n) {
        // Each pixel some times, and each second one.
        std::vector<std::uint32_t> repeated, halved;
        for (std::uint32_t i = 0; i < n * times; ++i) repeated.push_back(i / times);
        for (std::uint32_t i = 0; i < n; i += times) halved.push_back(i);
        const unsigned char* const row = rows.Numbers<unsigned char>(n * bytes);
        for (const std::vector<std::uint32_t>& columns : {repeated, halved}) {
          const kernels::PixelGather gather(columns, bytes, n);
          gather.Take(row, 0, columns.size(), rows.Numbers<unsigned char>(columns.size() * bytes));
        }
      });
    }
  }
}

TEST(KernelPages, MasksAreSpread) {
  for (const std::size_t channels : {1u, 2u, 3u, 4u, 5u, 9u}) {
    ForCounts([&](Rows& rows, std::size_t n) {
      kernels::ReplicateRow(rows.Valid(n), channels, n, rows.Numbers<unsigned char>(n * channels));
    });
  }
  ForCounts([](Rows& rows, std::size_t n) {
    const float* const centre = rows.Numbers<float>(n);
    const float* const corner = rows.Numbers<float>(n);
    kernels::LevelRow(centre, corner, rows.Valid(n), n, rows.Numbers<float>(n));
    const unsigned char* const valid = rows.Valid(n);
    kernels::KeepValid(valid, n, rows.Valid(n));
    kernels::KeepWithin(rows.Numbers<double>(n), 10.0, 90.0, n, rows.Valid(n));
  });
}

TEST(KernelPages, BitsAreCounted) {
  for (std::size_t first = 0; first < 9; ++first) {
    for (const std::size_t second : {first + 1, first + 13}) {
      ForCounts([&](Rows& rows, std::size_t n) {
        // The last bit is in the last byte.
        const unsigned char* const bits = rows.Numbers<unsigned char>((second + n + 7) / 8);
        *rows.Numbers<std::size_t>(1) = kernels::CountSetInBoth(bits, first, second, n);
      });
    }
  }
}

TEST(KernelPages, SumsGoInOrder) {
  for (const std::size_t channels : {1u, 2u, 3u, 4u, 5u, 8u, 9u}) {
    ForCounts([&](Rows& rows, std::size_t n) {
      const std::size_t room = n * channels + kernels::kRoomAfterTerms;
      if (n * channels > kernels::kMostTerms) return;
      double* const sums = rows.Numbers<double>(channels);
      kernels::AddInOrder(rows.Scratch<double>(room), channels, n * channels, sums);
      kernels::AddSquaresInOrder(rows.Scratch<double>(room), channels, n * channels, sums);
    });
  }
}

TEST(KernelPages, BytesAreCounted) {
  for (const std::size_t stride : {1u, 3u, 4u}) {
    ForCounts([&](Rows& rows, std::size_t n) {
      kernels::ByteCounts counts;
      counts.Count(rows.Numbers<unsigned char>(Span(n, stride)), stride, n);
      std::vector<int> bins(256);
      kernels::Extremes extremes = {50.0f, 50.0f};
      counts.AddTo(bins, extremes);
      std::copy(bins.begin(), bins.end(), rows.Numbers<int>(bins.size()));
    });
  }
  ForCounts([](Rows& rows, std::size_t n) {
    unsigned char* const bands[] = {rows.Numbers<unsigned char>(n), rows.Numbers<unsigned char>(n),
                                    rows.Numbers<unsigned char>(n)};
    kernels::SplitTriples(rows.Numbers<unsigned char>(3 * n), n, bands[0], bands[1], bands[2]);
  });
}

/// Colours of pixels of which none is background.
kernels::ByteColours ColoursOfAll(bool trims) {
  constexpr float infinity = std::numeric_limits<float>::infinity();
  kernels::ByteColours colours{};
  std::fill_n(colours.background, 3, -1);
  for (auto& range : colours.range) range = kernels::ValidRange(-infinity, infinity).Of<unsigned char>();
  colours.least = -infinity;
  colours.greatest = infinity;
  colours.trims = trims;
  std::fill_n(colours.trim, 3, kernels::Trim{10.0f, 1.5f});
  std::fill_n(colours.written, 3, static_cast<unsigned char>(7));
  return colours;
}

TEST(KernelPages, ColoursOfBytesAreMade) {
  using Planes = unsigned char(*)[kBlock];
  for (const bool trims : {false, true}) {
    const kernels::ByteColours colours = ColoursOfAll(trims);
    int made = 0;
    ForCounts([&](Rows& rows, std::size_t n) {
      const auto* const planes = reinterpret_cast<Planes>(rows.Numbers<unsigned char>(3 * kBlock));
      const auto bands = reinterpret_cast<Planes>(rows.Scratch<unsigned char>(3 * kBlock));
      if (!colours.Make(planes, rows.Valid(n), n, bands)) return;
      ++made;
      for (std::size_t c = 0; c < 3; ++c) std::copy_n(bands[c], n, rows.Numbers<unsigned char>(n));
    });
    EXPECT_GT(made, 150);
  }
}

TEST(KernelPages, MeansRatiosAndLogarithmsAreFormed) {
  ForCounts([](Rows& rows, std::size_t n) {
    kernels::RoundedMeanRow3(rows.Numbers<unsigned char>(3 * n), kernels::NoDataSample<unsigned char>(7.0f),
                             9, n, rows.Numbers<unsigned char>(n));
    kernels::MeanRow4(rows.Numbers<unsigned short>(4 * n), kernels::NoDataSample<unsigned short>(7.0f), 9.0f,
                      n, rows.Numbers<float>(n));
    const float* const image = rows.Numbers<float>(n);
    for (const bool absolute : {false, true})
      kernels::RatioRow(image, rows.Numbers<float>(n), absolute, n, rows.Numbers<float>(n));
    kernels::Log10Row(rows.Numbers<double>(n), n, rows.Numbers<double>(n));
    float* const cosines = rows.Numbers<float>(n);
    for (std::size_t i = 0; i < n; ++i) cosines[i] /= 100;
    kernels::RoundedDegreesRow(cosines, n, rows.Numbers<int>(n));
  });
}

TEST(KernelPages, SplinesAreRead) {
  ForCounts([](Rows& rows, std::size_t n) {
    kernels::Knot* const knots = reinterpret_cast<kernels::Knot*>(rows.Numbers<double>(8 * 101));
    const float* const values = rows.Numbers<float>(n);
    const int* const bins = rows.Numbers<int>(n);
    kernels::SplineRow(values, bins, knots, n, rows.Numbers<double>(n));
    int* const inside = rows.Numbers<int>(n);
    for (std::size_t i = 0; i < n; ++i) inside[i] = inside[i] % 3 == 0 ? -1 : 0;
    kernels::ReplaceOutside(inside, rows.Numbers<float>(n), n, rows.Numbers<float>(n));
  });
}

TEST(KernelPages, TablesAreLookedUp) {
  for (const std::size_t channels : {1u, 2u, 3u, 4u, 5u}) {
    ForCounts([&](Rows& rows, std::size_t n) {
      const float* const tables = rows.Numbers<float>(channels * kernels::kTableEntries<char>);
      kernels::LookUpRow(rows.Numbers<char>(n * channels), tables, channels, n * channels,
                         rows.Numbers<float>(n * channels));
    });
  }
}

TEST(KernelPages, VegetationIndicesAreStored) {
  static kernels::BandPlanes bands;
  for (std::size_t role = 0; role < kernels::kBandRoles; ++role)
    for (std::size_t i = 0; i < kBlock; ++i) bands[role][i] = static_cast<float>(1 + (i * 37 + role) % 100);
  for (std::size_t code = 0; code < kernels::kVegetationIndices; ++code) {
    ForCounts([&](Rows& rows, std::size_t n) {
      kernels::VegetationRow(code, bands, n, rows.Numbers<float>(n));
      kernels::VegetationRow(code, bands, n, rows.Numbers<double>(n));
      kernels::NarrowVegetationRow(code, bands, n, rows.Numbers<float>(n));
      if (kernels::HasPixelRow(code))
        kernels::NarrowPixelRow(code, rows.Numbers<short>(4 * n), {1, 2, 3}, n, rows.Numbers<float>(n));
    });
  }
  ForCounts([](Rows& rows, std::size_t n) {
    kernels::VegetationPixels(bands, n, rows.Numbers<float>(12 * n));
    kernels::NarrowVegetationPixels(bands, n, rows.Numbers<float>(12 * n));
  });
}

}  // namespace
}  // namespace orvik::attack
