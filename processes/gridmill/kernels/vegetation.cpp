#include "processes/gridmill/kernels/vegetation.h"

#include <algorithm>
#include <array>
#include <bit>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <string_view>

#include "processes/gridmill/kernels/exactquotient.h"
#include "processes/gridmill/kernels/multiversion.h"

namespace orvik::kernels {

namespace {

/// The bands of one pixel.
template <class Number>
struct Bands {
  Number B{}, G{}, R{}, E{}, N{}, S1{}, S2{};
};

template <class Number>
GRIDMILL_INLINE Number LimitedToOne(Number v) {
  const Number upper = v > Number{1} ? Number{1} : v;
  return upper < Number{-1} ? Number{-1} : upper;
}

template <class Number>
GRIDMILL_INLINE Number QuotientOrZero(Number numerator, Number denominator) {
  const Number quotient = numerator / denominator;
  return denominator == Number{0} ? Number{0} : quotient;
}

template <class Number>
struct Ngrdi {
  static Number GRIDMILL_INLINE Of(const Bands<Number>& p) { return QuotientOrZero(p.G - p.R, p.G + p.R); }
};

template <class Number>
struct ExcessGreen {
  static Number GRIDMILL_INLINE Of(const Bands<Number>& p) {
    constexpr Number half{0.5};
    return ((p.G + Number{255}) - ((p.R + p.B) * half)) * half;
  }
};

template <class Number>
struct Dvi {
  static Number GRIDMILL_INLINE Of(const Bands<Number>& p) { return p.N - p.R; }
};

template <class Number>
struct Rvi {
  static Number GRIDMILL_INLINE Of(const Bands<Number>& p) { return QuotientOrZero(p.N, p.R); }
};

/// Bands that are never negative keep within the limits by themselves.
template <class Number, bool limited = true>
struct Ndvi {
  static Number GRIDMILL_INLINE Of(const Bands<Number>& p) {
    const Number index = QuotientOrZero(p.N - p.R, p.N + p.R);
    return limited ? LimitedToOne(index) : index;
  }
};

/// Deliberate: the radicand is not tested, and the root is narrowed to `float`.
struct Tvi {
  static double GRIDMILL_INLINE Of(const Bands<double>& p) {
    const double sum = p.N + p.R;
    const double root = static_cast<float>(std::sqrt(((p.N - p.R) / sum) + 0.5));
    return sum == 0.0 ? 0.0 : root;
  }
};

struct Savi {
  static double GRIDMILL_INLINE Of(const Bands<double>& p) {
    const double D = (p.N + p.R) + 0.5;
    const double index = ((p.N - p.R) / D) * 1.5;
    return LimitedToOne(D == 0.0 ? 0.0 : index);
  }
};

/// Deliberate: the radicand is not tested.
struct Msavi2 {
  static double GRIDMILL_INLINE Of(const Bands<double>& p) {
    const double square = p.N * 2.0 + 1.0;
    return (((p.N + 1.0) * 2.0) - std::sqrt(square * square - ((p.N - p.R) * 8.0))) * 0.5;
  }
};

struct Gemi {
  static double GRIDMILL_INLINE Of(const Bands<double>& p) {
    const double D = (p.N + p.R) + 0.5;
    const double eta = QuotientOrZero((((p.N * p.N) - (p.R * p.R)) * 2.0) + (p.N * 1.5) + (p.R * 0.5), D);
    const double Q = 1.0 - p.R;
    const double index = ((1.0 - (eta * 0.25)) * eta) - ((p.R - 0.125) / Q);
    return Q == 0.0 ? 0.0 : index;
  }
};

/// Deliberate: the weight of the second shortwave band is -1.18.
struct Greenness {
  static double GRIDMILL_INLINE Of(const Bands<double>& p) {
    return p.B * -0.2848 + p.G * -0.2435 + p.R * -0.5436 + p.N * 0.7243 + p.S1 * 0.084 + p.S2 * -1.18;
  }
};

struct Mcari {
  static double GRIDMILL_INLINE Of(const Bands<double>& p) {
    const double index = ((p.E - p.R) - ((p.E - p.G) * 0.2)) * (p.E / p.R);
    return p.R == 0.0 ? 0.0 : index;
  }
};

struct Mtvi1 {
  static double GRIDMILL_INLINE Of(const Bands<double>& p) {
    return (((p.N - p.G) * 1.2) - ((p.R - p.G) * 2.5)) * 1.2;
  }
};

// Bands that are narrow integers. Their sums and differences, and those times 3 or 2, are exact in `float`. A
// quotient of such lies no closer than 2^-43 to the middle between two `float`s and is never it, so that it
// rounds to the same `float` with a `double` in between, or from anything within 2^-44.

/// Three times the numerator over twice the divisor, which is odd: never 0.
struct NarrowSavi {
  static float GRIDMILL_INLINE Of(const Bands<float>& p) {
    return LimitedToOne(((p.N - p.R) * 3.0f) / ((p.N + p.R) * 2.0f + 1.0f));
  }
};

// ---- row

template <class Number>
GRIDMILL_INLINE Bands<Number> BandsAt(const BandPlanes& b, std::size_t i) {
  return {b[0][i], b[1][i], b[2][i], b[3][i], b[4][i], b[5][i], b[6][i]};
}

template <class Index, class Number, class Value>
GRIDMILL_MULTIVERSION void RowOf(const BandPlanes& __restrict bands, std::size_t count,
                                 Value* __restrict index) {
  for (std::size_t i = 0; i < count; ++i) index[i] = static_cast<Value>(Index::Of(BandsAt<Number>(bands, i)));
}

template <class Value>
using Row = void (*)(const BandPlanes&, std::size_t, Value*);

/// Twelve samples of some pixels, in groups of four: compilers put the results of several pixels together so.
struct PixelGroup {
  static constexpr std::size_t kPixels = 16;

  alignas(64) float quads[kVegetationIndices / 4][4 * kPixels];

  GRIDMILL_INLINE void Put(std::size_t pixel, std::size_t code, float index) {
    quads[code / 4][4 * pixel + code % 4] = index;
  }

  GRIDMILL_INLINE void Store(std::size_t pixels, float* target) const {
    for (std::size_t i = 0; i < pixels; ++i)
      for (const auto& quad : quads) target = std::copy_n(quad + 4 * i, 4, target);
  }
};

/// All indices, in the order of their codes.
template <class... Index>
struct IndexList {
  template <class Value>
  static constexpr Row<Value> kRows[] = {RowOf<Index, double, Value>...};

  GRIDMILL_INLINE static void Put(const BandPlanes& bands, std::size_t i, std::size_t pixel,
                                  PixelGroup& group) {
    const auto p = BandsAt<double>(bands, i);
    std::size_t code = 0;
    (group.Put(pixel, code++, static_cast<float>(Index::Of(p))), ...);
  }
};
using AllIndices = IndexList<Ngrdi<double>, ExcessGreen<double>, Dvi<double>, Rvi<double>, Ndvi<double>, Tvi,
                             Savi, Msavi2, Gemi, Greenness, Mcari, Mtvi1>;

/// All indices of narrow bands. Quotients are shared, and two are formed without the divider, which the roots
/// keep busy.
struct AllNarrowIndices {
  GRIDMILL_INLINE static void Put(const BandPlanes& bands, std::size_t i, std::size_t pixel,
                                  PixelGroup& group) {
    const auto f = BandsAt<float>(bands, i);
    const auto p = BandsAt<double>(bands, i);
    const Divisor red(f.R);
    const Divisor soil((f.N + f.R) + 0.5f);
    const double difference = p.N - p.R;
    const double twice = difference * 2.0;
    const double ratio = difference / (p.N + p.R);
    const bool dark = f.N + f.R == 0.0f;
    group.Put(pixel, 0, Ngrdi<float>::Of(f));
    group.Put(pixel, 1, ExcessGreen<float>::Of(f));
    group.Put(pixel, 2, Dvi<float>::Of(f));
    const auto rvi = static_cast<float>(p.N * red.reciprocal);
    group.Put(pixel, 3, f.R == 0.0f ? 0.0f : rvi);
    const auto ndvi = static_cast<float>(ratio);
    group.Put(pixel, 4, LimitedToOne(dark ? 0.0f : ndvi));
    const auto tvi = static_cast<float>(std::sqrt(ratio + 0.5));
    group.Put(pixel, 5, dark ? 0.0f : tvi);
    group.Put(pixel, 6, LimitedToOne(static_cast<float>(difference * soil.reciprocal * 1.5)));
    const double half = p.N + 0.5;
    group.Put(pixel, 7, static_cast<float>((half + 0.5) - std::sqrt(half * half - twice)));
    const double eta = ExactQuotient((p.N + p.R) * (twice + 1.0) + difference * 0.5, soil);
    const auto gemi = static_cast<float>(((1.0 - (eta * 0.25)) * eta) - ((p.R - 0.125) / (1.0 - p.R)));
    group.Put(pixel, 8, f.R == 1.0f ? 0.0f : gemi);
    group.Put(pixel, 9, static_cast<float>(Greenness::Of(p)));
    const auto mcari = static_cast<float>(((p.E - p.R) - ((p.E - p.G) * 0.2)) * ExactQuotient(p.E, red));
    group.Put(pixel, 10, f.R == 0.0f ? 0.0f : mcari);
    group.Put(pixel, 11, static_cast<float>(Mtvi1::Of(p)));
  }
};

template <class Indices>
GRIDMILL_MULTIVERSION void PixelsOf(const BandPlanes& __restrict bands, std::size_t count,
                                    float* __restrict target) {
  for (std::size_t x = 0; x < count; x += PixelGroup::kPixels) {
    PixelGroup group;
    for (std::size_t i = 0; i < PixelGroup::kPixels; ++i) Indices::Put(bands, x + i, i, group);
    group.Store(std::min(PixelGroup::kPixels, count - x), target + x * kVegetationIndices);
  }
}

template <class Index, class In>
GRIDMILL_MULTIVERSION void PixelRowOf(const In* __restrict pixels, const NarrowPixelBands& bands,
                                      std::size_t count, float* __restrict index) {
  const auto [green, red, nir] = bands;
  for (std::size_t i = 0; i < count; ++i) {
    std::uint64_t pixel;
    std::memcpy(&pixel, pixels + 4 * i, sizeof(pixel));
    const auto sample = [pixel](std::size_t channel) {
      const auto word = static_cast<std::uint32_t>(pixel >> (16 * channel));
      const std::uint32_t top = word << 16;
      return static_cast<float>(std::is_signed_v<In> ? static_cast<std::int32_t>(top) >> 16
                                                     : static_cast<std::int32_t>(top >> 16));
    };
    index[i] = Index::Of(Bands<float>{.G = sample(green), .R = sample(red), .N = sample(nir)});
  }
}

}  // namespace

bool IndexReads(std::size_t code, std::size_t role) {
  constexpr std::array<std::string_view, kVegetationIndices> kRead = {
      "GR", "BGR", "NR", "NR", "NR", "NR", "NR", "NR", "NR", "BGRN12", "GRE", "GRN"};
  return kRead[code].find("BGREN12"[role]) != std::string_view::npos;
}

template <class Value>
void VegetationRow(std::size_t code, const BandPlanes& bands, std::size_t count, Value* index) {
  const auto& rows = AllIndices::kRows<Value>;
  rows[code](bands, count, index);
}

void NarrowVegetationRow(std::size_t code, const BandPlanes& bands, std::size_t count, float* index) {
  static constexpr Row<float> kRows[kVegetationIndices] = {
      RowOf<Ngrdi<float>, float, float>, RowOf<ExcessGreen<float>, float, float>,
      RowOf<Dvi<float>, float, float>,   RowOf<Rvi<float>, float, float>,
      RowOf<Ndvi<float>, float, float>,  nullptr,
      RowOf<NarrowSavi, float, float>};
  const auto& rows = AllIndices::kRows<float>;
  (kRows[code] != nullptr ? kRows[code] : rows[code])(bands, count, index);
}

void VegetationPixels(const BandPlanes& bands, std::size_t count, float* target) {
  PixelsOf<AllIndices>(bands, count, target);
}

void NarrowVegetationPixels(const BandPlanes& bands, std::size_t count, float* target) {
  PixelsOf<AllNarrowIndices>(bands, count, target);
}

bool HasPixelRow(std::size_t code) {
  return std::endian::native == std::endian::little && (code == 0 || code == 3 || code == 4 || code == 6);
}

template <class In>
void NarrowPixelRow(std::size_t code, const In* pixels, const NarrowPixelBands& bands, std::size_t count,
                    float* index) {
  constexpr bool limited = std::is_signed_v<In>;
  if (code == 0) PixelRowOf<Ngrdi<float>>(pixels, bands, count, index);
  if (code == 3) PixelRowOf<Rvi<float>>(pixels, bands, count, index);
  if (code == 4) PixelRowOf<Ndvi<float, limited>>(pixels, bands, count, index);
  if (code == 6) PixelRowOf<NarrowSavi>(pixels, bands, count, index);
}

template void VegetationRow(std::size_t, const BandPlanes&, std::size_t, float*);
template void VegetationRow(std::size_t, const BandPlanes&, std::size_t, double*);
template void NarrowPixelRow(std::size_t, const short*, const NarrowPixelBands&, std::size_t, float*);
template void NarrowPixelRow(std::size_t, const unsigned short*, const NarrowPixelBands&, std::size_t,
                             float*);

}  // namespace orvik::kernels
