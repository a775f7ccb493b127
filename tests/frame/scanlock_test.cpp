#include "processes/gridmill/frame/scanlock.h"

#include <atomic>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

namespace orvik::frame {
namespace {

TEST(ScanLock, IsHeldByOneThreadAtATime) {
  constexpr int kThreads = 2, kTurns = 100;
  std::atomic<int> holders = 0, meetings = 0, turns = 0;
  std::vector<std::thread> threads;
  for (int thread = 0; thread < kThreads; ++thread) {
    threads.emplace_back([&] {
      for (int turn = 0; turn < kTurns; ++turn) {
        const ScanLock lock;
        if (holders.fetch_add(1) != 0) ++meetings;
        std::this_thread::yield();
        ++turns;
        --holders;
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(meetings, 0);
  EXPECT_EQ(turns, kThreads * kTurns);
}

}  // namespace
}  // namespace orvik::frame
