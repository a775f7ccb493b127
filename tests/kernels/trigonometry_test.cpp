#include "processes/gridmill/kernels/trigonometry.h"

#include <algorithm>
#include <atomic>
#include <bit>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <limits>
#include <random>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#if __has_include(<gnu/libc-version.h>)
#include <gnu/libc-version.h>
#endif

// Bit for bit against the platform's functions, where the platform is the one that the kernels promise to
// equal. The whole of the inputs is tested where GRIDMILL_EXHAUSTIVE is set in the environment, which takes
// minutes.
namespace orvik::kernels {
namespace {

// ---- the kernels, built for each instruction set, and their oracles

struct AcosFunction {
  static GRIDMILL_INLINE float Kernel(float x, float) { return Acos(x); }
  static float Oracle(float x, float) { return std::acos(x); }
};
struct AtanPositiveFunction {
  static GRIDMILL_INLINE float Kernel(float q, float) { return AtanPositive(q); }
  static float Oracle(float q, float) { return std::atan(q); }
};
struct Atan2Function {
  static GRIDMILL_INLINE float Kernel(float y, float x) { return Atan2(y, x); }
  static float Oracle(float y, float x) { return std::atan2(y, x); }
};

/// Arguments that go through a row together.
struct Batch {
  static constexpr std::size_t kSize = 1024;
  std::size_t count = 0;
  float first[kSize];
  float second[kSize];
};

template <class Function>
GRIDMILL_INLINE void Row(const Batch& batch, float* __restrict result) {
  for (std::size_t i = 0; i < batch.count; ++i) result[i] = Function::Kernel(batch.first[i], batch.second[i]);
}

template <class Function>
void BaselineRow(const Batch& batch, float* result) {
  Row<Function>(batch, result);
}

using RowFunction = void (*)(const Batch&, float*);

#if defined(__x86_64__) && defined(__GNUC__) && !defined(__clang__)
template <class Function>
__attribute__((target("arch=x86-64-v3"))) void V3Row(const Batch& batch, float* result) {
  Row<Function>(batch, result);
}
template <class Function>
__attribute__((target("arch=x86-64-v4"))) void V4Row(const Batch& batch, float* result) {
  Row<Function>(batch, result);
}
/// The rows that this processor can run.
template <class Function>
std::vector<RowFunction> Rows() {
  std::vector<RowFunction> rows = {&BaselineRow<Function>};
  if (__builtin_cpu_supports("x86-64-v3")) rows.push_back(&V3Row<Function>);
  if (__builtin_cpu_supports("x86-64-v4")) rows.push_back(&V4Row<Function>);
  return rows;
}
#else
template <class Function>
std::vector<RowFunction> Rows() {
  return {&BaselineRow<Function>};
}
#endif

bool Same(float a, float b) {
  if (std::isnan(a) || std::isnan(b)) return std::isnan(a) && std::isnan(b);
  return std::bit_cast<std::uint32_t>(a) == std::bit_cast<std::uint32_t>(b);
}

/// Collects arguments and compares the rows with the oracle when a batch is full and at the end.
template <class Function>
class Checker {
 public:
  Checker() = default;
  Checker(const Checker&) = delete;
  Checker& operator=(const Checker&) = delete;
  ~Checker() { Flush(); }

  void Add(float first, float second = 0.0f) {
    batch_.first[batch_.count] = first;
    batch_.second[batch_.count] = second;
    if (++batch_.count == Batch::kSize) Flush();
  }

 private:
  void Flush() {
    float expected[Batch::kSize];
    float result[Batch::kSize];
    for (std::size_t i = 0; i < batch_.count; ++i)
      expected[i] = Function::Oracle(batch_.first[i], batch_.second[i]);
    for (std::size_t level = 0; level < rows_.size(); ++level) {
      rows_[level](batch_, result);
      for (std::size_t i = 0; i < batch_.count; ++i)
        if (!Same(result[i], expected[i])) Report(level, i, result[i], expected[i]);
    }
    batch_.count = 0;
  }

  void Report(std::size_t level, std::size_t i, float result, float expected) {
    if (++mismatches_ > 10) return;
    char text[200];
    std::snprintf(text, sizeof(text), "level %zu of (%a, %a): %a, expected %a", level,
                  static_cast<double>(batch_.first[i]), static_cast<double>(batch_.second[i]),
                  static_cast<double>(result), static_cast<double>(expected));
    ADD_FAILURE() << text;
  }

  const std::vector<RowFunction> rows_ = Rows<Function>();
  Batch batch_;
  int mismatches_ = 0;
};

// ---- arguments

float FromBits(std::uint64_t bits) { return std::bit_cast<float>(static_cast<std::uint32_t>(bits)); }

/// A value and the `reach` values on each side of it, with both signs.
std::vector<float> Around(float centre, int reach) {
  std::vector<float> values;
  const auto bits = std::bit_cast<std::uint32_t>(centre);
  for (int step = -reach; step <= reach; ++step) {
    if (step < 0 && bits < static_cast<std::uint32_t>(-step)) continue;
    const float value = FromBits(bits + static_cast<std::uint32_t>(step));
    values.push_back(value);
    values.push_back(-value);
  }
  return values;
}

constexpr float kInfinity = std::numeric_limits<float>::infinity();
constexpr float kSpecial[] = {0.0f,
                              std::numeric_limits<float>::denorm_min(),
                              std::numeric_limits<float>::min(),
                              0x1p-29f,
                              0x1p-12f,
                              0.4375f,
                              0.5f,
                              0.6875f,
                              1.0f,
                              1.1875f,
                              2.4375f,
                              0x1p25f,
                              0x1p60f,
                              std::numeric_limits<float>::max(),
                              kInfinity,
                              std::numeric_limits<float>::quiet_NaN()};
/// Where the arc tangent changes its reduction, and the library it is compared with its branch.
constexpr float kBranches[] = {0.4375f, 0.6875f, 1.1875f,  2.4375f, 0x1p25f,
                               0x1p26f, 0x1p34f, 0x1p-12f, 0x1p-29f};

/// Runs `work(i)` for i below `count` on all processors.
template <class Work>
void OnAllProcessors(std::uint64_t count, const Work& work) {
  std::atomic<std::uint64_t> next{0};
  std::vector<std::thread> threads;
  for (unsigned int i = 0; i < std::max(1u, std::thread::hardware_concurrency()); ++i)
    threads.emplace_back([&] {
      for (std::uint64_t i = next++; i < count; i = next++) work(i);
    });
  for (std::thread& thread : threads) thread.join();
}

class Trigonometry : public ::testing::Test {
 protected:
  void SetUp() override {
#ifdef __GLIBC__
    const std::string version = gnu_get_libc_version();
    if (version != "2.36") GTEST_SKIP() << "the oracle is the GNU C library 2.36, this one is " << version;
#else
    GTEST_SKIP() << "the oracle is the GNU C library 2.36";
#endif
  }
};

class TrigonometryExhaustive : public Trigonometry {
 protected:
  void SetUp() override {
    Trigonometry::SetUp();
    if (std::getenv("GRIDMILL_EXHAUSTIVE") == nullptr) GTEST_SKIP() << "GRIDMILL_EXHAUSTIVE is not set";
  }
};

// ---- samples of the inputs

TEST_F(Trigonometry, AcosIsThePlatformsOnASubsetOfAllInputs) {
  Checker<AcosFunction> checker;
  for (std::uint64_t bits = 0; bits < 1ull << 32; bits += 257) checker.Add(FromBits(bits));
}

TEST_F(Trigonometry, AcosIsThePlatformsAroundItsBranches) {
  Checker<AcosFunction> checker;
  for (const float centre : {0.0f, 0x1p-26f, 0x1p-57f, 0.5f, 1.0f, 0.75f, 0.25f})
    for (const float x : Around(centre, 5000)) checker.Add(x);
  for (const float centre : kSpecial)
    for (const float x : Around(centre, 10)) checker.Add(x);
}

TEST_F(Trigonometry, AtanPositiveIsThePlatformsOnASubsetOfAllInputs) {
  Checker<AtanPositiveFunction> checker;
  for (std::uint64_t bits = 0; bits <= 0x7FC00000u; bits += 127) checker.Add(FromBits(bits));
}

TEST_F(Trigonometry, AtanPositiveIsThePlatformsAroundItsBranches) {
  Checker<AtanPositiveFunction> checker;
  for (const float centre : kBranches)
    for (const float q : Around(centre, 5000)) checker.Add(std::fabs(q));
  for (const float centre : kSpecial)
    for (const float q : Around(centre, 10)) checker.Add(std::fabs(q));
}

TEST_F(Trigonometry, Atan2IsThePlatformsOnAllPairsOfSpecialValues) {
  std::vector<float> values;
  for (const float centre : kSpecial)
    for (const float value : Around(centre, 3)) values.push_back(value);
  Checker<Atan2Function> checker;
  for (const float y : values)
    for (const float x : values) checker.Add(y, x);
}

TEST_F(Trigonometry, Atan2IsThePlatformsWhereTheQuotientIsNearABranch) {
  Checker<Atan2Function> checker;
  std::mt19937 random(7);
  for (int i = 0; i < 2000; ++i) {
    const float x = FromBits(random());
    for (const float branch : kBranches)
      for (const float y : Around(std::fabs(x) * branch, 20)) checker.Add(y, x);
  }
}

TEST_F(Trigonometry, Atan2IsThePlatformsWhereTheQuotientOverflowsOrUnderflows) {
  Checker<Atan2Function> checker;
  std::mt19937 random(8);
  for (int difference = 20; difference <= 160; ++difference) {
    for (int i = 0; i < 1000; ++i) {
      const float mantissa = 1.0f + static_cast<float>(random() >> 9) * 0x1p-23f;
      const int exponent = static_cast<int>(random() % 270) - 140;
      const float large = std::ldexp(mantissa, exponent + difference);
      const float small = std::ldexp(1.0f, exponent);
      for (const float sign : {1.0f, -1.0f}) {
        checker.Add(large, sign * small);
        checker.Add(-small, sign * large);
      }
    }
  }
}

/// Pairs of random bits, and pairs of like size, whose quotients meet every reduction.
void AddRandomPairs(std::uint64_t seed, int count) {
  Checker<Atan2Function> checker;
  std::mt19937_64 random(seed);
  for (int i = 0; i < count; ++i) {
    const std::uint64_t bits = random();
    checker.Add(FromBits(bits >> 32), FromBits(bits));
    const std::uint64_t like = random();
    const auto sized = [](std::uint64_t v) { return FromBits((v & 0x80FFFFFFu) + 0x3F000000u); };
    checker.Add(sized(like >> 32), sized(like));
  }
}

TEST_F(Trigonometry, Atan2IsThePlatformsOnRandomPairs) { AddRandomPairs(9, 2'000'000); }

// ---- all inputs

constexpr std::uint64_t kPart = 1ull << 20;

TEST_F(TrigonometryExhaustive, AcosIsThePlatformsOnEveryInput) {
  OnAllProcessors((1ull << 32) / kPart, [](std::uint64_t part) {
    Checker<AcosFunction> checker;
    for (std::uint64_t i = 0; i < kPart; ++i) checker.Add(FromBits(part * kPart + i));
  });
}

TEST_F(TrigonometryExhaustive, AtanPositiveIsThePlatformsOnEveryInputThatIsNotNegative) {
  OnAllProcessors((1ull << 31) / kPart, [](std::uint64_t part) {
    Checker<AtanPositiveFunction> checker;
    for (std::uint64_t i = 0; i < kPart; ++i) checker.Add(FromBits(part * kPart + i));
  });
}

TEST_F(TrigonometryExhaustive, Atan2IsThePlatformsOnABillionPairs) {
  OnAllProcessors(1000, [](std::uint64_t part) { AddRandomPairs(1000 + part, 500'000); });
}

}  // namespace
}  // namespace orvik::kernels
