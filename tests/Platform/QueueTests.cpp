#include "Platform/Queue.h"

#include <gtest/gtest.h>

#include <QEventLoop>
#include <atomic>
#include <thread>
#include <vector>

#include "QtTestSupport.h"
#include "TestSupport.h"

namespace {

TEST(Queue, SerialBlocksRunInOrderOneAtATime) {
    std::vector<int> order;
    std::atomic<int> running = 0;
    std::atomic<bool> overlapped = false;
    {
        auto queue = platform::makeSerialQueue("test");
        for (int i = 0; i < 500; ++i)
            queue->async([&, i] {
                if (++running != 1) overlapped = true;
                order.push_back(i);
                --running;
            });
    }  // waits
    ASSERT_EQ(order.size(), 500u);
    EXPECT_FALSE(overlapped);
    for (int i = 0; i < 500; ++i) EXPECT_EQ(order[static_cast<size_t>(i)], i);
}

TEST(Queue, SerialQueueTakesBlocksFromManyThreads) {
    std::vector<int> perThread(4, -1);
    bool inOrder = true;
    int count = 0;
    {
        auto queue = platform::makeSerialQueue("test");
        std::vector<std::thread> threads;
        for (size_t t = 0; t < 4; ++t)
            threads.emplace_back([&, t] {
                for (int i = 0; i < 200; ++i)
                    queue->async([&, t, i] {
                        inOrder = inOrder && perThread[t] == i - 1;
                        perThread[t] = i;
                        ++count;
                    });
            });
        for (auto& thread : threads) thread.join();
    }
    EXPECT_TRUE(inOrder);
    EXPECT_EQ(count, 800);
}

TEST(Queue, ConcurrentBlocksRunSideBySide) {
    auto queue = platform::makeConcurrentQueue("test");
    test::Promise<int> first, second, done;
    // Each waits for the other: one after the other would never end.
    queue->async([&] {
        first.set(1);
        done.set(second.wait().value_or(0));
    });
    queue->async([&] {
        first.wait();
        second.set(2);
    });
    EXPECT_EQ(done.wait(), 2);
}

TEST(Queue, QueueThatGoesInItsOwnBlockDoesNotWaitForItself) {
    test::Promise<int> done;
    auto queue = platform::makeSerialQueue("test");
    auto* raw = queue.get();
    test::Promise<bool> mayGo;
    raw->async([&mayGo, held = std::move(queue)]() mutable {
        mayGo.wait();
        held.reset();
    });
    raw->async([&done] { done.set(7); });
    mayGo.set(true);
    EXPECT_EQ(done.wait(), 7);
}

TEST(Queue, WorkersThatWaitForQueuesDoNotStarveThem) {
    // More waiting blocks than there are worker threads.
    constexpr int count = 64;
    std::atomic<int> ran = 0;
    {
        auto outer = platform::makeConcurrentQueue("outer");
        for (int i = 0; i < count; ++i)
            outer->async([&] {
                auto inner = platform::makeSerialQueue("inner");
                inner->async([&] { ++ran; });
            });
    }
    EXPECT_EQ(ran, count);
}

TEST(Queue, MainQueueRunsInOrderOnTheMainThreadFromTheEventLoop) {
    std::vector<int> order;
    bool onMain = true;
    platform::mainQueue().async([&] { order.push_back(0); });
    EXPECT_TRUE(order.empty());  // never at once, even from the main thread
    std::thread worker([&] {
        EXPECT_FALSE(platform::isMainThread());
        for (int i = 1; i <= 100; ++i)
            platform::mainQueue().async([&, i] {
                onMain = onMain && platform::isMainThread();
                order.push_back(i);
            });
    });
    worker.join();
    ASSERT_TRUE(test::waitUntil([&] { return order.size() == 101; }));
    EXPECT_TRUE(onMain);
    EXPECT_TRUE(std::is_sorted(order.begin(), order.end()));
}

TEST(Queue, BlockWithAnEventLoopDoesNotHoldUpTheNext) {
    bool inner = false, returned = false;
    QEventLoop loop;
    platform::mainQueue().async([&] {
        loop.exec();
        returned = true;
    });
    platform::mainQueue().async([&] {
        inner = true;
        loop.quit();
    });
    ASSERT_TRUE(test::waitUntil([&] { return returned; }));
    EXPECT_TRUE(inner);
}

}  // namespace
