#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <new>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>
#include <omp.h>

#include "tests/attack/allocations.h"
#include "tests/attack/operators.h"

// Every request for memory of a call fails in turn: the caller is told, nothing leaks, and the object works.
namespace orvik::attack {
namespace {

using tessel::DataType;

/// What a call leaves.
struct Outcome {
  std::vector<unsigned char> bytes;
  std::vector<double> collected;

  friend bool operator==(const Outcome&, const Outcome&) = default;
};

/// A call, and one before it with other types or none.
struct Calls {
  const Operator& op;
  Scene* before;
  Scene& scene;
  std::uint32_t channels;

  std::unique_ptr<Object> Prepared() const {
    const Silence silence;
    std::unique_ptr<Object> object = op.make(channels);
    if (before != nullptr) object->Process(before->Get());
    return object;
  }

  Outcome Finished(Object& object) const {
    const Silence silence;
    object.Process(scene.Get());
    return {scene.Bytes(2), object.Collected()};
  }

  /// Blocks that the contract leaves behind: `MirrorImg` does not delete the processor that it replaces.
  std::size_t LeftBehind() const {
    return before != nullptr && std::string_view(op.name).starts_with("MirrorImg") ? 1 : 0;
  }
};

enum class Seen { kOver, kThrown, kSwallowed, kWritten };

/// What becomes of a call whose n-th request fails: `kOver` if it makes fewer.
Seen FailAt(std::size_t n, bool andLater, const Calls& calls, Object& object) {
  const Silence silence;
  const Call call = calls.scene.Get();
  bool isThrown = false;
  allocations::FailAt(n, andLater);
  try {
    object.Process(call);
  } catch (const std::bad_alloc&) {
    isThrown = true;
  }
  if (!allocations::EndFailures()) return Seen::kOver;
  if (!isThrown) return Seen::kSwallowed;
  return calls.scene.IsUntouched() ? Seen::kThrown : Seen::kWritten;
}

/// One failure, after which the object is used again or destroyed as it is. Returns false if the call makes
/// fewer requests.
bool FailOnce(std::size_t n, bool andLater, bool isReused, const Calls& calls, const Outcome& wanted) {
  bool isSame = true;
  Seen seen;
  const std::size_t live = allocations::Live();
  {
    const std::unique_ptr<Object> object = calls.Prepared();
    calls.scene.Clear();
    seen = FailAt(n, andLater, calls, *object);
    if (seen == Seen::kOver) return false;
    if (isReused) isSame = calls.Finished(*object) == wanted;
  }
  const std::size_t left = allocations::Live() - live;
  EXPECT_EQ(left, calls.LeftBehind()) << "blocks leak";
  EXPECT_NE(seen, Seen::kSwallowed) << "nothing was thrown";
  EXPECT_NE(seen, Seen::kWritten) << "the output was written";
  EXPECT_TRUE(isSame) << "the next call has other results than that of a new object";
  return true;
}

/// Fails each request of a call in turn. Returns how many there were.
std::size_t FailEach(const Calls& calls) {
  calls.scene.Clear();
  const Outcome wanted = calls.Finished(*calls.Prepared());
  for (std::size_t n = 1;; ++n) {
    for (const bool andLater : {false, true}) {
      for (const bool isReused : {false, true}) {
        SCOPED_TRACE(testing::Message() << "request " << n << (andLater ? " and all later ones" : "")
                                        << (isReused ? ", used again" : ", destroyed"));
        if (!FailOnce(n, andLater, isReused, calls, wanted)) return n - 1;
      }
    }
    if (testing::Test::HasFailure()) return n;
  }
}

Shape ShapeOf(const Operator& op) {
  // Enough samples for what operators make when it is worth it.
  Shape shape{.width = 24, .height = 13, .channels = std::max(3u, op.least), .margin = 2};
  shape.moreOut = 1;
  shape.isMasked = true;
  return shape;
}

const Types kBytes = {tessel::eDT_8U, tessel::eDT_8U, tessel::eDT_8U};
const Types kWider = {tessel::eDT_8U, tessel::eDT_8U, tessel::eDT_32F};
const Types kFloats = {tessel::eDT_32F, tessel::eDT_32F, tessel::eDT_32F};
const Types kComplex = {DataType(tessel::eDT_32F, true), DataType(tessel::eDT_32F, true), tessel::eDT_32F};

class Failures : public testing::TestWithParam<Operator> {};
INSTANTIATE_TEST_SUITE_P(Attack, Failures, testing::ValuesIn(Operators()));

TEST_P(Failures, OfAFirstCallReachTheCaller) {
  const Operator& op = GetParam();
  const Shape shape = ShapeOf(op);
  for (const Types& types : {kBytes, kWider, kFloats, kComplex}) {
    if (types.in.isComplex && op.complex == Complex::kRefused) continue;
    Scene scene(op, shape, types);
    // None would mean that the library's requests do not come here.
    EXPECT_GT(FailEach({op, nullptr, scene, shape.channels}), 0u);
  }
}

TEST_P(Failures, OfALaterCallWithAnotherTypeReachTheCaller) {
  const Operator& op = GetParam();
  const Shape shape = ShapeOf(op);
  Scene before(op, shape, kFloats);
  for (const Types& types : {kWider, kComplex}) {
    if (types.in.isComplex && op.complex == Complex::kRefused) continue;
    Scene scene(op, shape, types);
    // A real type and its complex variant may have one processor, which has all that it needs.
    const std::size_t requests = FailEach({op, &before, scene, shape.channels});
    if (!types.in.isComplex) {
      EXPECT_GT(requests, 0u);
    }
  }
}

TEST_P(Failures, OfACallInParallelReachTheCaller) {
  const Operator& op = GetParam();
  if (!op.isParallel) return;
  const int threads = omp_get_max_threads();
  const Shape shape{.width = 256, .height = 160, .channels = 2, .isMasked = true};
  Scene before(op, shape, kFloats);
  for (const Types& types : {kWider, kComplex}) {
    Scene scene(op, shape, types);
    for (const int team : {1, 4}) {
      omp_set_num_threads(team);
      EXPECT_GT(FailEach({op, nullptr, scene, shape.channels}), 0u);
      EXPECT_GT(FailEach({op, &before, scene, shape.channels}), 0u);
    }
  }
  omp_set_num_threads(threads);
}

TEST(PlainMemory, IntenPercentTakesPlainMemoryThatIsWatchedToo) {
  const auto percent = std::find_if(Operators().begin(), Operators().end(), [](const Operator& op) {
    return std::string_view(op.name) == "IntenPercent";
  });
  Scene scene(*percent, {}, kBytes);
  const std::unique_ptr<Object> object = percent->make(3);
  for (const std::size_t blocks : {9u, 0u}) {
    const std::size_t before = allocations::Cleared();
    object->Process(scene.Get());
    EXPECT_EQ(allocations::Cleared() - before, blocks);
  }
}

}  // namespace
}  // namespace orvik::attack
