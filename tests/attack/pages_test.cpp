#include <cstdint>
#include <cstdio>
#include <cstring>
#include <memory>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>
#include <signal.h>
#include <unistd.h>

#include "tests/attack/allocations.h"
#include "tests/attack/guardedpages.h"
#include "tests/attack/operators.h"
#include "tests/support/pixeltypes.h"

// Buffers at memory without access: nothing outside of them is read or written.
namespace orvik::attack {
namespace {

using tessel::DataType;

constexpr std::size_t kLargest = 4 << 20;

// What is called, for the message that an access outside leaves.
char place[256];

#ifdef GRIDMILL_ATTACK_ALLOCATIONS
extern "C" void TellPlace(int) {
  const char start[] = "an access outside of the buffers: ";
  if (write(2, start, sizeof(start) - 1) < 0 || write(2, place, std::strlen(place)) < 0) _exit(1);
  _exit(1);
}
#endif

struct Result {
  std::vector<unsigned char> out;
  std::vector<double> collected;

  friend bool operator==(const Result&, const Result&) = default;
};

class Pages : public testing::TestWithParam<Operator> {
 public:
  Pages() {
    // A sanitizer tells of it by itself.
#ifdef GRIDMILL_ATTACK_ALLOCATIONS
    signal(SIGSEGV, TellPlace);
    signal(SIGBUS, TellPlace);
#endif
  }
  ~Pages() override {
    signal(SIGSEGV, SIG_DFL);
    signal(SIGBUS, SIG_DFL);
  }

 protected:
  /// The result of a new object on `scene`, after a call on `before` if there is one. The inputs stay.
  Result Run(Scene& scene, std::uint32_t channels, Scene* before) {
    const Silence silence;
    const std::vector<unsigned char> in = scene.Bytes(0), reference = scene.Bytes(1);
    const std::unique_ptr<Object> object = op.make(channels);
    if (before != nullptr) object->Process(before->Get());
    object->Process(scene.Get());
    areInputsKept = areInputsKept && scene.Bytes(0) == in && scene.Bytes(1) == reference;
    return {scene.Bytes(2), object->Collected()};
  }

  void Try(const Shape& shape, const Types& types, Scene* before = nullptr) {
    std::snprintf(place, sizeof(place), "%s, %s to %s%s, %u x %u x %u, margin %u%s%s\n", op.name,
                  tests::NameOf(types.in), tests::NameOf(types.out), types.in.isComplex ? ", complex" : "",
                  shape.width, shape.height, shape.channels, shape.margin, shape.isMasked ? ", masked" : "",
                  before != nullptr ? ", a later call" : "");
    SCOPED_TRACE(place);
    Scene plain(op, shape, types);
    const Result wanted = Run(plain, shape.channels, before);
    EXPECT_TRUE(plain.IsMarginUntouched());
    EXPECT_EQ(plain.IsUntouched(), op.collects);
    for (const bool atEnd : {true, false}) {
      allocations::PlaceAt(atEnd ? allocations::Edge::kEnd : allocations::Edge::kBegin);
      Scene guarded(op, shape, types,
                    [&](std::size_t raster, std::size_t bytes) { return pages[raster].Place(bytes, atEnd); });
      allocations::PlaceAt(allocations::Edge::kNone);
      EXPECT_TRUE(Run(guarded, shape.channels, before) == wanted) << (atEnd ? "at the end" : "at the start");
    }
    EXPECT_TRUE(areInputsKept);
  }

  const Operator& op = GetParam();
  bool areInputsKept = true;
  static inline const GuardedPages pages[3] = {GuardedPages(kLargest), GuardedPages(kLargest),
                                               GuardedPages(kLargest)};
};
INSTANTIATE_TEST_SUITE_P(Attack, Pages, testing::ValuesIn(Operators()));

struct Extent {
  std::uint32_t width, height;
};
constexpr Extent kExtents[] = {{1, 1}, {2, 3}, {7, 2}, {16, 4}, {33, 3}, {70, 9}, {259, 2}};

/// What the last pixel of an output takes behind it if it is written in elements of the type `kept`.
std::size_t RoomBehind(const Shape& shape, const Operator& op, const DataType& kept, const Types& types) {
  if (kept.sizeBits <= types.out.sizeBits) return 0;
  const std::size_t elements = op.outFixed + std::size_t{op.outEach} * shape.channels;
  return elements * (kept.sizeBits - types.out.sizeBits) / 8;
}

/// Calls `visit(shape)` for all sizes and numbers of channels, with each margin and mask for some of them.
template <class Visit>
void ForEachShape(const Operator& op, Visit visit) {
  std::uint32_t turn = 0;
  for (const Extent& extent : kExtents) {
    for (const std::uint32_t channels : {1u, 3u, 4u, 5u}) {
      if (channels < op.least) continue;
      for (const bool isMasked : {false, true}) {
        Shape shape{.width = extent.width, .height = extent.height, .channels = channels};
        shape.margin = turn % 3;
        shape.moreOut = turn / 3 % 2;
        shape.isMasked = isMasked;
        visit(shape);
        ++turn;
      }
      ++turn;
    }
  }
}

TEST_P(Pages, NothingOutsideOfTheBuffersIsTouched) {
  for (const Types& types : TypesOf(op)) {
    ForEachShape(op, [&](const Shape& shape) {
      if (!HasFailure()) Try(shape, types);
    });
  }
}

TEST_P(Pages, NothingOutsideOfALaterInputOfAnotherTypeIsRead) {
  if (!op.isKept) return;
  const DataType out = tessel::eDT_32F;
  for (const Types& first : {Types{tessel::eDT_64F, {}, out}, Types{tessel::eDT_8U, {}, out},
                             Types{DataType(tessel::eDT_64S, true), {}, out}}) {
    for (const Types& later : {Types{tessel::eDT_8U, {}, out}, Types{tessel::eDT_32F, {}, out},
                               Types{DataType(tessel::eDT_16S, true), {}, out}}) {
      ForEachShape(op, [&](const Shape& shape) {
        Scene before(op, shape, first);
        if (!HasFailure()) Try(shape, later, &before);
      });
    }
  }
}

TEST_P(Pages, NothingOutsideOfLongRowsAndManyChannelsIsTouched) {
  const std::vector<Types> all = TypesOf(op);
  for (std::size_t i = 0; i < 5; ++i) {
    for (const std::uint32_t channels : {1u, 2u, 6u, 7u, 17u, 64u}) {
      const Shape shape{.width = 2053, .height = 1, .channels = channels, .isMasked = channels % 2 == 0};
      if (channels >= op.least && !HasFailure()) Try(shape, all[i]);
    }
  }
}

/// Their room is what the elements of the first output take behind the last pixel, and no more.
TEST_P(Pages, NothingOutsideOfALaterOutputOfAnotherTypeIsTouched) {
  const std::string_view name = op.name;
  if (op.collects || !(op.isKept || name == "BitmapFiltering" || name == "IntenPercent")) return;
  const DataType in = tessel::eDT_8U;
  for (const tessel::ElementType first : {tessel::eDT_64F, tessel::eDT_16S, tessel::eDT_8U}) {
    for (const tessel::ElementType out : {tessel::eDT_8U, tessel::eDT_32F, tessel::eDT_64F}) {
      ForEachShape(op, [&](Shape shape) {
        shape.moreOut = 0;
        const Types types = {in, in, out};
        const std::size_t room = RoomBehind(shape, op, first, types);
        Scene before(op, shape, {in, in, first});
        Result results[2];
        for (const bool atEnd : {true, false}) {
          Scene scene(op, shape, types, [&](std::size_t raster, std::size_t bytes) {
            return pages[raster].Place(bytes + (raster == 2 ? room : 0), atEnd);
          });
          results[atEnd] = Run(scene, shape.channels, &before);
        }
        EXPECT_TRUE(results[0] == results[1]);
      });
    }
  }
}

}  // namespace
}  // namespace orvik::attack
