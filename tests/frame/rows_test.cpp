#include "processes/gridmill/frame/rows.h"

#include <cstddef>
#include <cstdint>
#include <set>
#include <thread>
#include <vector>

#include <gtest/gtest.h>
#include <omp.h>

namespace orvik::frame {
namespace {

/// Sets the size of the teams for the life of the object.
class TeamOf {
 public:
  explicit TeamOf(int threads) : before_(omp_get_max_threads()) { omp_set_num_threads(threads); }
  TeamOf(const TeamOf&) = delete;
  TeamOf& operator=(const TeamOf&) = delete;
  ~TeamOf() { omp_set_num_threads(before_); }

 private:
  int before_;
};

/// What happened to one row. Rows are written disjointly.
struct Visit {
  int calls = 0;
  int thread = -1;
  std::thread::id id;
  std::uint32_t previous = 0;  ///< the row that the same thread had before, its own for the first
};

std::vector<Visit> VisitInParallel(std::uint32_t height, std::uint64_t rowSamples) {
  std::vector<Visit> visits(height);
  std::vector<std::int64_t> last(64, -1);
  ParallelRows(height, rowSamples, [&](std::uint32_t y) {
    Visit& visit = visits.at(y);
    visit.thread = omp_get_thread_num();
    visit.id = std::this_thread::get_id();
    std::int64_t& before = last[static_cast<std::size_t>(visit.thread)];
    visit.previous = before < 0 ? y : static_cast<std::uint32_t>(before);
    before = y;
    ++visit.calls;
  });
  return visits;
}

constexpr int kTeams[] = {1, 2, 7};
constexpr std::uint32_t kHeights[] = {0, 1, 2, 3, 6, 7, 8, 13, 14, 15, 100, 701};

TEST(ParallelRows, CallsEachRowOnce) {
  for (const int team : kTeams) {
    const TeamOf threads(team);
    for (const std::uint32_t height : kHeights)
      for (const Visit& visit : VisitInParallel(height, kParallelSamples)) EXPECT_EQ(visit.calls, 1);
  }
}

TEST(ParallelRows, GivesEachThreadOneContiguousBlockInRowOrder) {
  for (const int team : kTeams) {
    const TeamOf threads(team);
    for (const std::uint32_t height : kHeights) {
      const std::vector<Visit> visits = VisitInParallel(height, kParallelSamples);
      std::set<int> seen;
      for (std::uint32_t y = 0; y < height; ++y) {
        const bool first = seen.insert(visits[y].thread).second;
        EXPECT_EQ(visits[y].previous, first ? y : y - 1) << team << " threads, row " << y << " of " << height;
      }
    }
  }
}

TEST(ParallelRows, GivesEveryThreadOfTheTeamABlock) {
  for (const int team : kTeams) {
    const TeamOf threads(team);
    std::set<int> seen;
    for (const Visit& visit : VisitInParallel(701, kParallelSamples)) seen.insert(visit.thread);
    EXPECT_EQ(seen.size(), static_cast<std::size_t>(team));
  }
}

TEST(ParallelRows, BlocksDifferByAtMostOneRow) {
  const TeamOf threads(7);
  std::vector<int> rows(7);
  for (const Visit& visit : VisitInParallel(100, kParallelSamples))
    ++rows[static_cast<std::size_t>(visit.thread)];
  for (const int count : rows) EXPECT_TRUE(count == 14 || count == 15) << count;
}

TEST(ParallelRows, SmallImagesRunOnTheCallersThread) {
  const TeamOf threads(7);
  const auto expectOnCaller = [](const std::vector<Visit>& visits) {
    for (const Visit& visit : visits) EXPECT_EQ(visit.id, std::this_thread::get_id());
  };
  expectOnCaller(VisitInParallel(7, (kParallelSamples - 1) / 7));
  expectOnCaller(VisitInParallel(1, kParallelSamples));
  expectOnCaller(VisitInParallel(100, 0));
}

TEST(ParallelRows, TheBoundIsOnTheSamplesOfTheWholeImage) {
  const TeamOf threads(2);
  EXPECT_EQ(VisitInParallel(2, kParallelSamples / 2).back().thread, 1);
  EXPECT_EQ(VisitInParallel(2, kParallelSamples / 2 - 1).back().thread, 0);
}

TEST(SerialRows, CallsEachRowOnceInOrderOnTheCallersThread) {
  const TeamOf threads(7);
  for (const std::uint32_t height : kHeights) {
    std::vector<std::uint32_t> rows;
    SerialRows(height, [&](std::uint32_t y) {
      EXPECT_EQ(omp_in_parallel(), 0);
      rows.push_back(y);
    });
    ASSERT_EQ(rows.size(), height);
    for (std::uint32_t y = 0; y < height; ++y) EXPECT_EQ(rows[y], y);
  }
}

}  // namespace
}  // namespace orvik::frame
