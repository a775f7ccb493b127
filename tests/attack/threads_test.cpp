#include <barrier>
#include <cstddef>
#include <memory>
#include <thread>
#include <vector>

#include <gtest/gtest.h>
#include <omp.h>

#include "tests/attack/operators.h"

// Objects on several threads give what they give one after the other.
namespace orvik::attack {
namespace {

struct Result {
  std::vector<unsigned char> out;
  std::vector<double> collected;

  friend bool operator==(const Result&, const Result&) = default;
};

const Types kWider = {tessel::eDT_8U, tessel::eDT_8U, tessel::eDT_32F};
const Types kFloats = {tessel::eDT_32F, tessel::eDT_32F, tessel::eDT_8U};

Shape ShapeOf(const Operator& op) {
  Shape shape{.width = 33, .height = 9, .channels = 4};
  if (op.isParallel) shape = {.width = 256, .height = 160, .channels = 2};
  shape.isMasked = true;
  return shape;
}

/// An object, called a few times.
Result ResultOf(const Operator& op, Scene& scene, std::uint32_t channels) {
  const std::unique_ptr<Object> object = op.make(channels);
  for (int call = 0; call < 5; ++call) object->Process(scene.Get());
  return {scene.Bytes(2), object->Collected()};
}

/// Runs both at once.
template <class First, class Second>
void AtOnce(First first, Second second) {
  const Silence silence;
  std::barrier start(2);
  std::thread other([&] {
    start.arrive_and_wait();
    second();
  });
  start.arrive_and_wait();
  first();
  other.join();
}

class Threads : public testing::TestWithParam<Operator> {};
INSTANTIATE_TEST_SUITE_P(Attack, Threads, testing::ValuesIn(Operators()));

TEST_P(Threads, TwoObjectsAtOnceGiveWhatEachGivesAlone) {
  const Operator& op = GetParam();
  const Shape shape = ShapeOf(op);
  Scene first(op, shape, kWider), second(op, shape, kFloats);
  Result wantedFirst, wantedSecond;
  {
    const Silence silence;
    wantedFirst = ResultOf(op, first, shape.channels);
    wantedSecond = ResultOf(op, second, shape.channels);
  }
  for (int round = 0; round < 3; ++round) {
    Result firstResult, secondResult;
    first.Clear();
    second.Clear();
    AtOnce([&] { firstResult = ResultOf(op, first, shape.channels); },
           [&] { secondResult = ResultOf(op, second, shape.channels); });
    EXPECT_TRUE(firstResult == wantedFirst);
    EXPECT_TRUE(secondResult == wantedSecond);
  }
}

TEST_P(Threads, TwoObjectsReadOneInputAndOneMask) {
  const Operator& op = GetParam();
  const Shape shape = ShapeOf(op);
  Scene scene(op, shape, kWider), other(op, shape, kWider);
  Result wanted;
  {
    const Silence silence;
    wanted = ResultOf(op, scene, shape.channels);
  }
  scene.Clear();
  Call shared = scene.Get();
  shared.out = other.Get().out;
  const std::unique_ptr<Object> object = op.make(shape.channels);
  Result result;
  AtOnce([&] { result = ResultOf(op, scene, shape.channels); },
         [&] {
           for (int call = 0; call < 5; ++call) object->Process(shared);
         });
  EXPECT_TRUE(result == wanted);
  EXPECT_TRUE((Result{other.Bytes(2), object->Collected()}) == wanted);
}

TEST(AllThreads, AllOperatorsRunAtOnceInTwoOrders) {
  const std::vector<Operator>& all = Operators();
  std::vector<Result> forwards(all.size()), backwards(all.size());
  const auto run = [&](std::size_t i, std::vector<Result>& results) {
    const Shape shape = ShapeOf(all[i]);
    Scene scene(all[i], shape, kWider);
    results[i] = ResultOf(all[i], scene, shape.channels);
  };
  AtOnce(
      [&] {
        for (std::size_t i = 0; i < all.size(); ++i) run(i, forwards);
      },
      [&] {
        for (std::size_t i = all.size(); i-- > 0;) run(i, backwards);
      });
  for (std::size_t i = 0; i < all.size(); ++i) EXPECT_TRUE(forwards[i] == backwards[i]) << all[i];
}

/// The threads of a parallel region that this thread enters.
int TeamSize() {
  int size = 0;
#pragma omp parallel
#pragma omp single
  size = omp_get_num_threads();
  return size;
}

TEST_P(Threads, TeamsOfAnySizeGiveTheSameBits) {
  const Operator& op = GetParam();
  if (!op.isParallel) return;
  const int threads = omp_get_max_threads();
  for (const Shape& shape : {ShapeOf(op), Shape{.width = 9001, .height = 5, .isMasked = true}}) {
    Scene scene(op, shape, kWider);
    omp_set_num_threads(1);
    const Result wanted = ResultOf(op, scene, shape.channels);
    for (int team = 1; team <= 8; ++team) {
      omp_set_num_threads(team);
      EXPECT_EQ(TeamSize(), team);
      scene.Clear();
      EXPECT_TRUE(ResultOf(op, scene, shape.channels) == wanted) << team << " threads";
    }
  }
  omp_set_num_threads(threads);
}

TEST_P(Threads, TwoObjectsAtOnceHaveTeamsOfAnySize) {
  const Operator& op = GetParam();
  if (!op.isParallel) return;
  const int threads = omp_get_max_threads();
  const Shape shape = ShapeOf(op);
  Scene first(op, shape, kWider), second(op, shape, kFloats);
  omp_set_num_threads(1);
  const Result wantedFirst = ResultOf(op, first, shape.channels);
  const Result wantedSecond = ResultOf(op, second, shape.channels);
  for (int team = 1; team <= 8; ++team) {
    const auto run = [&](Scene& scene, int size) {
      omp_set_num_threads(size);  // of this thread
      return ResultOf(op, scene, shape.channels);
    };
    Result firstResult, secondResult;
    first.Clear();
    second.Clear();
    AtOnce([&] { firstResult = run(first, team); }, [&] { secondResult = run(second, 9 - team); });
    EXPECT_TRUE(firstResult == wantedFirst) << team << " threads";
    EXPECT_TRUE(secondResult == wantedSecond) << 9 - team << " threads";
  }
  omp_set_num_threads(threads);
}

}  // namespace
}  // namespace orvik::attack
