#include <string_view>

#include <gtest/gtest.h>

// In a test program of a lesser instruction set the linker puts this file between the loader and libgcc's
// look at the processor: the kernels' versions are chosen as on a processor that has no more.

extern "C" {
extern unsigned int __cpu_features2[];
int __real___cpu_indicator_init();
int __wrap___cpu_indicator_init();
}

namespace {

/// Where libgcc keeps what `arch=x86-64-v3` and `arch=x86-64-v4` ask for. Compilers write these numbers into
/// programs, so they stay.
constexpr int kLevels = 2;
constexpr unsigned int kV3 = 2;
constexpr unsigned int kV4 = 4;

constexpr unsigned int Hidden(std::string_view isa) {
  if (isa == "x86-64") return kV3 | kV4;
  return isa == "x86-64-v3" ? kV4 : 0;
}

// A function of several versions, as the kernels are, that tells which of them was chosen.
__attribute__((target("default"))) std::string_view Chosen() { return "x86-64"; }
__attribute__((target("arch=x86-64-v3"))) std::string_view Chosen() { return "x86-64-v3"; }
__attribute__((target("arch=x86-64-v4"))) std::string_view Chosen() { return "x86-64-v4"; }

}  // namespace

/// Runs before any constructor.
int __wrap___cpu_indicator_init() {
  const int result = __real___cpu_indicator_init();
  __cpu_features2[kLevels] &= ~Hidden(GRIDMILL_TEST_ISA);
  return result;
}

TEST(LoaderChoice, IsTheInstructionSetUnderTest) { EXPECT_EQ(Chosen(), GRIDMILL_TEST_ISA); }
