// Promises of the access queue: one holder a key, first come first served, direct hand-over, and no key waits
// for another.

#include "edit/manager/multiple_access_queue.h"

#include "platform/base/cookie.h"

#include <gtest/gtest.h>

#include <atomic>
#include <thread>
#include <vector>

namespace {

using Queue = Qx::MultipleAccessQueue<cookie>;

cookie key(int number) {
    return {Cookie_Type::Edit, number, 0};
}

void waitUntilWaiting(const Queue& queue, const cookie& item, size_t threads) {
    while (queue.numWaiting(item) < threads) {
        std::this_thread::yield();
    }
}

TEST(MultipleAccessQueue, ServesWaitersInTheOrderOfAsking) {
    Queue queue;
    queue.beginAccess(key(1));
    std::vector<int> served;
    std::vector<std::thread> threads;
    for (int i = 0; i < 8; ++i) {
        threads.emplace_back([&queue, &served, i] {
            const Qx::AccessScope<cookie> scope(queue, key(1));
            served.push_back(i); // guarded by the access itself
        });
        waitUntilWaiting(queue, key(1), static_cast<size_t>(i) + 1);
    }
    queue.endAccess(key(1));
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(served, (std::vector<int>{0, 1, 2, 3, 4, 5, 6, 7}));
    EXPECT_EQ(queue.numAccessed(), 0u);
}

TEST(MultipleAccessQueue, HandsOverWithoutLettingAThirdIn) {
    Queue queue;
    queue.beginAccess(key(1));
    std::atomic<bool> waiterRan{false};
    std::thread waiter([&] {
        queue.beginAccess(key(1));
        waiterRan = true;
        queue.endAccess(key(1));
    });
    waitUntilWaiting(queue, key(1), 1);
    queue.endAccess(key(1));
    // The key went to the waiter: whoever asks after the hand-over runs after it.
    queue.beginAccess(key(1));
    EXPECT_TRUE(waiterRan);
    queue.endAccess(key(1));
    waiter.join();
}

TEST(MultipleAccessQueue, RefusesTheEndOfWhatNobodyHolds) {
    Queue queue;
    queue.beginAccess(key(2));
    try {
        queue.endAccess(key(1));
        FAIL() << "nothing was thrown";
    } catch (const Qx::Exception::RuntimeError& error) {
        EXPECT_STREQ(error.what(), "Uncontrolled object passed to endAccess");
        EXPECT_EQ(error.source(), "MultipleAccessQueue");
        EXPECT_EQ(error.line(), 136);
    }
    EXPECT_EQ(queue.numAccessed(), 1u);
    queue.endAccess(key(2));
    EXPECT_THROW(queue.endAccess(key(2)), Qx::Exception::RuntimeError);
}

} // namespace
