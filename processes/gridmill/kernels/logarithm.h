#pragma once

#include <bit>
#include <cstddef>
#include <cstdint>
#include <limits>

#include "processes/gridmill/kernels/multiversion.h"

/// The decimal logarithm in double precision, without branches.
///
/// The outer form is that of the Sun Microsystems libm of 1993, on which the GNU C library 2.36 still rests:
/// x = 2^y m with m from 0.5 to 2, and log10(x) = (y log10_2lo + ivln10 ln(m)) + y log10_2hi, with each step
/// rounded. These roundings decide most of the last bits, so they are kept. ln(m) is our own: a table holds
/// reciprocals c of 24 bits whose logarithms are all but exact in `double`; f = c m - 1 is formed as a head
/// and a tail without error, and ln(m) = -ln(c) + f + f^2 Q(f), of which only the last sum rounds noticeably.
/// ln(m) is good to 0.54 ulp, the result to 1.6 ulp, as is that of the GNU library.
///
/// The result is within 1 ulp of the GNU library's, with fused multiply-add and without, and 10 times both
/// gave the same `float` on all quotients of 8-bit means and on some 10^9 random ones; they could differ only
/// where a tie lies between the two. It does not depend on the processor or the platform's library.
namespace orvik::kernels {

/// A reciprocal of the arguments of one interval, and the natural logarithm of what it is the reciprocal of.
struct Log10Entry {
  double reciprocal;
  double logarithm;
};

/// One entry for each 64th of the binades [0.5, 1) and [1, 2); that of the interval around 1 is the identity.
/// Of the `float` values next to the ideal reciprocal, each is the one whose logarithm comes nearest to a
/// `double` to which f can be added without error: to 0.0012 of the last place of such sums.
inline constexpr Log10Entry kLog10Table[] = {
    {0x1.fea59p0, -0x1.61894a85eda1fp-1},
    {0x1.f96974p0, -0x1.5c42b21a0210ap-1},
    {0x1.f1befap0, -0x1.546f682638e53p-1},
    {0x1.ea4c84p0, -0x1.4cb788357d612p-1},
    {0x1.e3096cp0, -0x1.4513a1cc2f48bp-1},
    {0x1.dc127p0, -0x1.3da3fb3e50405p-1},
    {0x1.d5414p0, -0x1.3641856857532p-1},
    {0x1.cea2b8p0, -0x1.2efb77edb08ep-1},
    {0x1.c82d9cp0, -0x1.27c9147e33186p-1},
    {0x1.c1e2f6p0, -0x1.20acc1cac544dp-1},
    {0x1.bbd316p0, -0x1.19ba9db337d88p-1},
    {0x1.b5e084p0, -0x1.12d24a4a5ac04p-1},
    {0x1.b015bcp0, -0x1.0c00effb4649ep-1},
    {0x1.aa7f8ep0, -0x1.0557310ac7abp-1},
    {0x1.a50054p0, -0x1.fd65be5f910fep-2},
    {0x1.9fa63ep0, -0x1.f04bece67e5c2p-2},
    {0x1.9a74bp0, -0x1.e36bc75b1ed42p-2},
    {0x1.955ac6p0, -0x1.d69d62d1c5ebdp-2},
    {0x1.90719cp0, -0x1.ca222a3e3a823p-2},
    {0x1.8b94e2p0, -0x1.bd9fb6f33cc81p-2},
    {0x1.86df1ap0, -0x1.b15bb4b3dc568p-2},
    {0x1.823ccep0, -0x1.a5254a9d9269ep-2},
    {0x1.7dbdbap0, -0x1.9927a11c84c8bp-2},
    {0x1.7958b2p0, -0x1.8d4c49ca8f92bp-2},
    {0x1.751826p0, -0x1.81b18b33bcfa3p-2},
    {0x1.70dc2ep0, -0x1.760174f11e54dp-2},
    {0x1.6ccafap0, -0x1.6aa6e5c043636p-2},
    {0x1.68bab2p0, -0x1.5f2e5dd2b91dbp-2},
    {0x1.64cac8p0, -0x1.53f17a7bc38c5p-2},
    {0x1.60f982p0, -0x1.48ed92a146566p-2},
    {0x1.5d34c2p0, -0x1.3defba95840c3p-2},
    {0x1.598306p0, -0x1.330bb75abf2d7p-2},
    {0x1.55e64ep0, -0x1.2848aed1a4566p-2},
    {0x1.52699ep0, -0x1.1dc95413c01b4p-2},
    {0x1.4ef7dp0, -0x1.134f68fa43154p-2},
    {0x1.4b8aeap0, -0x1.08c8ec7ca746p-2},
    {0x1.483eb6p0, -0x1.fd18f108419cep-3},
    {0x1.44f714p0, -0x1.e887ebae55a1p-3},
    {0x1.41c41p0, -0x1.d444bb8eb3e8fp-3},
    {0x1.3ea5eap0, -0x1.c053d822e6f2p-3},
    {0x1.3b999ap0, -0x1.aca4840627ba8p-3},
    {0x1.3890eep0, -0x1.98dc22743e0efp-3},
    {0x1.35a09ep0, -0x1.858380f6d54d6p-3},
    {0x1.32b35ep0, -0x1.7210179cbcc38p-3},
    {0x1.2fdf9p0, -0x1.5f1874a4672afp-3},
    {0x1.2d1a64p0, -0x1.4c56f716ebd29p-3},
    {0x1.2a5046p0, -0x1.394725493248cp-3},
    {0x1.27a7fp0, -0x1.26f388b1a130ap-3},
    {0x1.24fc54p0, -0x1.145eadbd2c5aap-3},
    {0x1.226e6p0, -0x1.026f6f30a6be6p-3},
    {0x1.1fd8ecp0, -0x1.e0448a0e0c5f7p-4},
    {0x1.1d595ep0, -0x1.bc901a88e516p-4},
    {0x1.1ae3cap0, -0x1.991bc06c0ab85p-4},
    {0x1.187d3p0, -0x1.7632e039bb5c4p-4},
    {0x1.1616ecp0, -0x1.530220087a352p-4},
    {0x1.13bdcep0, -0x1.3046a309e88cdp-4},
    {0x1.117568p0, -0x1.0e398f16b5057p-4},
    {0x1.0f35ecp0, -0x1.d8d414b5d765ep-5},
    {0x1.0cfc4p0, -0x1.9555fcbcd8253p-5},
    {0x1.0ac022p0, -0x1.50fd4388100ebp-5},
    {0x1.08a378p0, -0x1.0fdf34a909d4bp-5},
    {0x1.067f1ap0, -0x1.9a9661b8031b6p-6},
    {0x1.0468dp0, -0x1.17cce0725ade6p-6},
    {0x1.02557p0, -0x1.295d89bc576dcp-7},
    {1.0, 0.0},
    {0x1.f96942p-1, 0x1.a86c1f1f55b5ap-7},
    {0x1.f1bcd2p-1, 0x1.cedff32d2ab42p-6},
    {0x1.ea489p-1, 0x1.630c88930f08fp-5},
    {0x1.e30d9cp-1, 0x1.dcc1de142e4bep-5},
    {0x1.dc1458p-1, 0x1.29f13ef2f3de8p-4},
    {0x1.d540bap-1, 0x1.6519e5e17372ap-4},
    {0x1.ce9bf2p-1, 0x1.9f81b8ad56938p-4},
    {0x1.c824aep-1, 0x1.d9290a34777fap-4},
    {0x1.c1e23p-1, 0x1.08e13ded2254ep-3},
    {0x1.bbccbap-1, 0x1.24c3a174c47dcp-3},
    {0x1.b5ddp-1, 0x1.4058080cba3c7p-3},
    {0x1.b018d2p-1, 0x1.5b7e5f6bcf293p-3},
    {0x1.aa79a6p-1, 0x1.7650583cef6bep-3},
    {0x1.a50868p-1, 0x1.909df765577a7p-3},
    {0x1.9fac54p-1, 0x1.aadae98a0b586p-3},
    {0x1.9a769ep-1, 0x1.c4af903483384p-3},
    {0x1.95608p-1, 0x1.de390b8a508f4p-3},
    {0x1.90703ep-1, 0x1.f7536948bfd0ep-3},
    {0x1.8b9726p-1, 0x1.0822cb8def9fbp-2},
    {0x1.86d7d8p-1, 0x1.147faee8ff6d5p-2},
    {0x1.8246f4p-1, 0x1.20882dbeac4e4p-2},
    {0x1.7dc70ap-1, 0x1.2c87c41d22891p-2},
    {0x1.795744p-1, 0x1.387ff74c2aa88p-2},
    {0x1.751176p-1, 0x1.44292f9d369dap-2},
    {0x1.70e03p-1, 0x1.4fbbcab0f13cp-2},
    {0x1.6cc2bp-1, 0x1.5b38befe38e65p-2},
    {0x1.68b8e8p-1, 0x1.669f162ef5f5dp-2},
    {0x1.64d5dp-1, 0x1.71b73cf2146ddp-2},
    {0x1.60f2fcp-1, 0x1.7cedba2f3556cp-2},
    {0x1.5d33dap-1, 0x1.87db4d99b7cecp-2},
    {0x1.598804p-1, 0x1.92addcfdcc11ep-2},
    {0x1.55e954p-1, 0x1.9d76a2f0743c3p-2},
    {0x1.5269acp-1, 0x1.a7fee16ebbabfp-2},
    {0x1.4ee9b2p-1, 0x1.b2a41fd4fd7dep-2},
    {0x1.4b876ap-1, 0x1.bd0a42d229e04p-2},
    {0x1.483c4p-1, 0x1.c74394bf0c99cp-2},
    {0x1.44f22p-1, 0x1.d19405c125f45p-2},
    {0x1.41cd9p-1, 0x1.db87c6d998d99p-2},
    {0x1.3ea2eep-1, 0x1.e5a80b05706dep-2},
    {0x1.3b997ep-1, 0x1.ef7678b59ae6fp-2},
    {0x1.388c5cp-1, 0x1.f96947cca982ep-2},
    {0x1.359ea2p-1, 0x1.018697bc0b0acp-1},
    {0x1.32bd1p-1, 0x1.064ffae31c376p-1},
    {0x1.2fde6cp-1, 0x1.0b1ffec610622p-1},
    {0x1.2d1c72p-1, 0x1.0fcaf3c1f8a5dp-1},
    {0x1.2a5f2ep-1, 0x1.1478d1cbdcd45p-1},
    {0x1.27a88ap-1, 0x1.192643134bd0bp-1},
    {0x1.24fdfep-1, 0x1.1dc99c1048ba4p-1},
    {0x1.226d44p-1, 0x1.224a48ce0b4d4p-1},
    {0x1.1fd916p-1, 0x1.26db53f919da5p-1},
    {0x1.1d5532p-1, 0x1.2b59a8fab73ffp-1},
    {0x1.1adf1cp-1, 0x1.2fc930343d5eep-1},
    {0x1.1878dap-1, 0x1.3425be250aafcp-1},
    {0x1.161a36p-1, 0x1.387dddbbb6399p-1},
    {0x1.13c61ep-1, 0x1.3ccbec7e2aa3fp-1},
    {0x1.11780ep-1, 0x1.411808a567a1fp-1},
    {0x1.0f2b24p-1, 0x1.456b497623543p-1},
    {0x1.0cf66cp-1, 0x1.4999e834e6c3cp-1},
    {0x1.0abf64p-1, 0x1.4dd5c867160b3p-1},
    {0x1.089e9cp-1, 0x1.51efa3840b144p-1},
    {0x1.068548p-1, 0x1.56036f5464cb8p-1},
    {0x1.046284p-1, 0x1.5a322a7b1e7ffp-1},
    {0x1.0254cep-1, 0x1.5e3ffadbc9d9fp-1},
    {0x1.00adb4p-1, 0x1.61893d97348bcp-1},
};

/// x = 2^exponent mantissa, and the index of the mantissa's entry. Where the result is no finite number, the
/// exponent is the result.
struct Log10Parts {
  double mantissa;
  double exponent;
  std::uint64_t entry;
};

/// No condition decides twice, or the compiler makes control flow of it and the loop gets slower.
GRIDMILL_INLINE Log10Parts SplitForLog10(double x) {
  constexpr double infinity = std::numeric_limits<double>::infinity();
  const double scale = x < std::numeric_limits<double>::min() ? 0x1p54 : 1.0;
  const double scaled = x * scale;
  const double unit = scaled < 1.0 ? 0.5 : 1.0;
  const auto bits = std::bit_cast<std::uint64_t>(scaled);

  // The exponent field becomes a double as the low bits of 2^52. The bias is 1022 below 1, else 1023, and 54
  // more where the scale is 2^54; a scale of 1 adds what rounding takes away.
  const double field = std::bit_cast<double>((bits >> 52) | 0x4330000000000000u);
  const double bias = (0x1p52 + 1021.0 + scale * (54.0 / 0x1p54)) + (unit + unit);
  double exponent = field - bias;
  exponent = x < infinity ? exponent : x;
  const double undefined = x == 0.0 ? -infinity : std::numeric_limits<double>::quiet_NaN();
  exponent = x > 0.0 ? exponent : undefined;

  const std::uint64_t mantissa = (bits & 0x000FFFFFFFFFFFFFu) | std::bit_cast<std::uint64_t>(unit);
  // From 0.5 on. 1 lies so in its interval that the interval reaches equally far to both sides.
  const std::uint64_t entry = (mantissa - (0x3FE0000000000000u - 0x00002AAA80000000u)) >> 46;
  return {std::bit_cast<double>(mantissa), exponent, entry};
}

/// The decimal logarithm of 2^exponent mantissa.
GRIDMILL_INLINE double JoinForLog10(double mantissa, double exponent, Log10Entry entry) {
  constexpr double ivln10 = 4.34294481903251816668e-01;
  constexpr double log10_2hi = 3.01029995663611771306e-01;
  constexpr double log10_2lo = 3.69423907715893078616e-13;

  // The upper 28 bits of the mantissa times the 24 of the reciprocal are exact; times 1 all bits are.
  const std::uint64_t bits = entry.logarithm == 0.0 ? 0xFFFFFFFFFFFFFFFFu : 0xFFFFFFFFFE000000u;
  const double upper = std::bit_cast<double>(std::bit_cast<std::uint64_t>(mantissa) & bits);
  const double head = upper * entry.reciprocal - 1.0;
  const double tail = (mantissa - upper) * entry.reciprocal;
  const double f = head + tail;
  const double f2 = f * f;
  const double q = (-0x1.000000000001dp-1 + f * 0x1.55555555555d6p-2) +
                   f2 * ((-0x1.fffffff19c48ap-3 + f * 0x1.999999856e1a8p-3) +
                         f2 * (-0x1.555c65bd3885bp-3 + f * 0x1.2499dc896cbdcp-3));
  const double high = entry.logarithm + head;  // exact
  const double low = tail + f2 * q;
  const double logarithm = high + low;

  // Where ln(m) is nearly halfway between two doubles, another library may round it to the other one, and the
  // products with ivln10 are up to 2 ulp apart. From 0.446 of a last place on, where they can be, `lost`
  // moves the product by 1 ulp towards the other; elsewhere it is too small to move it.
  const double lost = low - (logarithm - high);
  const double product = (exponent * log10_2lo + ivln10 * logarithm) + 0.28 * lost;
  return product + exponent * log10_2hi;
}

/// The decimal logarithm. That of a zero is -infinity, that of a negative number NaN.
GRIDMILL_INLINE double Log10(double x) {
  const Log10Parts parts = SplitForLog10(x);
  return JoinForLog10(parts.mantissa, parts.exponent, kLog10Table[parts.entry]);
}

/// `Log10` of `count` values, in place or from one row to another.
void Log10Row(const double* x, std::size_t count, double* log10);

}  // namespace orvik::kernels
