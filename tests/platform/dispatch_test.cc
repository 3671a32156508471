// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <future>
#include <mutex>
#include <thread>
#include <vector>

#include "platform/dispatch.h"

namespace {

using namespace std::chrono_literals;

TEST(DispatchQueue, RunsWorkInOrderOnOneThread) {
  dispatch::queue q("vorntool.queue");
  EXPECT_FALSE(q.isCurrent());
  std::vector<int> order;
  std::vector<std::thread::id> threads;
  dispatch::group done;
  for (int i = 0; i < 100; ++i) {
    done.enter();
    q.async([&, i] {
      order.push_back(i);  // serial: no lock needed
      threads.push_back(std::this_thread::get_id());
      EXPECT_TRUE(q.isCurrent());
      done.leave();
    });
  }
  ASSERT_TRUE(done.wait(10s));
  ASSERT_EQ(order.size(), 100u);
  for (int i = 0; i < 100; ++i) EXPECT_EQ(order[i], i);
  for (auto& id : threads) EXPECT_EQ(id, threads.front());
  EXPECT_NE(threads.front(), std::this_thread::get_id());
}

TEST(DispatchQueue, WorkQueuedWhenTheLastHandleGoesStillRunsInOrder) {
  std::vector<int> ran;  // the queues' threads write it; read once they are done
  {
    // Released from another thread: the release returns once the work ran.
    std::promise<void> gate;
    dispatch::queue q("released.elsewhere");
    q.async([opened = gate.get_future().share()] { opened.wait(); });
    for (int i = 0; i < 3; ++i) q.async([&ran, i] { ran.push_back(i); });
    std::thread opener([&gate] { gate.set_value(); });
    q = dispatch::queue();
    opener.join();
    EXPECT_EQ(ran, (std::vector<int>{0, 1, 2}));
  }
  // Released by its own work, on its own thread: what was queued behind it
  // runs all the same.
  dispatch::group done;
  done.enter();
  {
    std::promise<void> gate;
    dispatch::queue q("released.on.itself");
    q.async([q, opened = gate.get_future().share()]() mutable {
      opened.wait();
      q = dispatch::queue();
    });
    for (int i = 3; i < 6; ++i) q.async([&ran, i] { ran.push_back(i); });
    q.async([done] { done.leave(); });
    q = dispatch::queue();
    gate.set_value();
  }
  ASSERT_TRUE(done.wait(10s));
  EXPECT_EQ(ran, (std::vector<int>{0, 1, 2, 3, 4, 5}));
}

TEST(DispatchGroup, WaitEndsWhenEmptyOrAtTheDeadline) {
  dispatch::group g;
  EXPECT_TRUE(g.wait(0ns));
  g.enter();
  EXPECT_FALSE(g.wait(20ms));
  std::thread t([g] { g.leave(); });
  g.wait();
  t.join();
  EXPECT_TRUE(g.wait(0ns));
  g.leave();  // unbalanced: ignored, the group stays empty
  g.enter();
  EXPECT_FALSE(g.wait(0ns));
}

TEST(GroupMembership, EntersPerCopyAndLeavesPerDestruction) {
  dispatch::group g;
  {
    GroupMembership a(g);
    EXPECT_FALSE(g.wait(0ns));
    GroupMembership b = a;
    GroupMembership moved = std::move(a);
    { GroupMembership c = b; }
    GroupMembership empty;
    GroupMembership emptyCopy = empty;
    b = GroupMembership();
    EXPECT_FALSE(g.wait(0ns));  // `moved` still holds it
  }
  EXPECT_TRUE(g.wait(0ns));
}

}  // namespace
