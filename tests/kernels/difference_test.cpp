#include "processes/gridmill/kernels/difference.h"

#include <cstddef>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>

namespace orvik::kernels {
namespace {

/// One difference as the header defines it, which integers wrap to their range.
template <class Sample>
Sample DifferenceOf(Difference form, Sample a, Sample b) {
  if constexpr (std::is_integral_v<Sample>) {
    const bool reversed = form == Difference::kBackward || (form == Difference::kAbsolute && a < b);
    return static_cast<Sample>(reversed ? b - a : a - b);
  } else {
    if (form == Difference::kBackward) return Sample(0) - (a - b);
    return form == Difference::kAbsolute && a < b ? b - a : a - b;
  }
}

template <class Sample>
struct TestedDifferenceRowOf : ::testing::Test {};
using TestedTypes = ::testing::Types<char, unsigned char, short, unsigned short, float>;
TYPED_TEST_SUITE(TestedDifferenceRowOf, TestedTypes);

TYPED_TEST(TestedDifferenceRowOf, ExcludesWhatIsNotKeptAndWhatEqualsItsKey) {
  using Sample = TypeParam;
  constexpr std::size_t count = 601;
  std::vector<Sample> a(count), b(count), aKeys(count), bKeys(count), target(count + 1, Sample(99));
  std::vector<unsigned char> keep(count);
  for (std::size_t i = 0; i < count; ++i) {
    a[i] = static_cast<Sample>(i * 7 % 128);
    b[i] = static_cast<Sample>(i * i % 127);
    aKeys[i] = i % 5 == 0 ? a[i] : b[i];
    bKeys[i] = i % 7 == 0 ? b[i] : static_cast<Sample>(b[i] + 1);
    keep[i] = i % 3 != 0;
  }
  for (const Difference form : {Difference::kAbsolute, Difference::kForward, Difference::kBackward}) {
    TestedDifferenceRow(a.data(), aKeys.data(), b.data(), bKeys.data(), keep.data(), form, Sample(77), count,
                        target.data());
    for (std::size_t i = 0; i < count; ++i) {
      const bool excluded = keep[i] == 0 || a[i] == aKeys[i] || b[i] == bKeys[i];
      ASSERT_EQ(target[i], excluded ? Sample(77) : DifferenceOf(form, a[i], b[i]))
          << "form " << static_cast<int>(form) << ", sample " << i;
    }
    ASSERT_EQ(target.back(), Sample(99));
  }
}

}  // namespace
}  // namespace orvik::kernels
