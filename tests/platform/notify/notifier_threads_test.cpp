#include "platform/notify/notifier.h"
#include "platform/notify/val_server.h"

#include <atomic>
#include <chrono>
#include <gtest/gtest.h>
#include <latch>
#include <thread>
#include <vector>

namespace {

using namespace std::chrono_literals;

const NotifyMsgType kTick("test.tick");

TEST(NotifierThreads, WhatAListenerHeldIsLetGoWithItsGuard) {
    Notifier notifier;
    std::latch running(1);
    std::atomic<bool> finished{false};
    auto held = std::make_shared<int>(0);
    const std::weak_ptr<int> watched = held;
    auto guard = notifier.addListener(kTick, [&running, &finished, held](const NotifyMsg&) {
        running.count_down();
        std::this_thread::sleep_for(50ms);
        finished = true;
    });
    held.reset();
    std::thread teller([&] { notifier.notify({kTick, ""}); });
    running.wait();
    guard.reset();
    EXPECT_TRUE(finished) << "a guard waits for its listener on another thread";
    EXPECT_TRUE(watched.expired());
    teller.join();
}

/// Threads each inside a listener end the next one's subscription: none may wait for ever.
TEST(NotifierThreads, ListenersThatEndEachOtherInACircleAllGoOn) {
    for (const size_t threads : {2u, 3u, 5u}) {
        for (int round = 0; round < 20; ++round) {
            std::vector<std::unique_ptr<Notifier>> notifiers;
            std::vector<Qx::Ptr<Qx::Guard>> guards(threads);
            std::latch inside(static_cast<std::ptrdiff_t>(threads));
            for (size_t i = 0; i < threads; ++i) {
                notifiers.push_back(std::make_unique<Notifier>());
                guards[i] = notifiers[i]->addListener(kTick, [&, i](const NotifyMsg&) {
                    inside.arrive_and_wait();
                    guards[(i + 1) % threads].reset();
                });
            }
            std::vector<std::thread> tellers;
            for (size_t i = 0; i < threads; ++i) {
                tellers.emplace_back([&, i] { notifiers[i]->notify({kTick, ""}); });
            }
            for (auto& teller : tellers) {
                teller.join();
            }
            for (const auto& notifier : notifiers) {
                EXPECT_EQ(notifier->numListeners(), 0u);
            }
        }
    }
}

TEST(NotifierThreads, AnEndFromInsideWaitsForTheOtherThreadsInTheSameListener) {
    Notifier notifier;
    Qx::Ptr<Qx::Guard> guard;
    std::latch both(2);
    std::atomic<bool> first{true};
    std::atomic<bool> otherLeft{false};
    guard = notifier.addListener(kTick, [&](const NotifyMsg&) {
        both.arrive_and_wait();
        if (first.exchange(false)) {
            guard.reset();
            EXPECT_TRUE(otherLeft);
        } else {
            std::this_thread::sleep_for(20ms);
            otherLeft = true;
        }
    });
    std::thread teller([&] { notifier.notify({kTick, ""}); });
    notifier.notify({kTick, ""});
    teller.join();
    EXPECT_EQ(notifier.numListeners(), 0u);
}

/// Subscribers come and go while several threads tell. What a listener uses is destroyed right after its
/// guard, without a lock of its own: a call that comes too late is a use of freed memory or a race.
TEST(NotifierThreads, NoCallComesAfterTheGuard) {
    Notifier notifier;
    std::atomic<bool> stop{false};
    std::atomic<int> calls{0};
    std::vector<std::thread> tellers;
    for (int t = 0; t < 2; ++t) {
        tellers.emplace_back([&] {
            while (!stop) {
                notifier.notify({kTick, "text"});
            }
        });
    }
    std::vector<std::thread> subscribers;
    for (int t = 0; t < 3; ++t) {
        subscribers.emplace_back([&] {
            for (int i = 0; i < 300; ++i) {
                auto counter = std::make_unique<std::atomic<int>>(0);
                auto* used = counter.get();
                auto guard = notifier.addListener(kTick, [used, &calls](const NotifyMsg& m) {
                    used->fetch_add(static_cast<int>(m.text().size()));
                    ++calls;
                });
                std::this_thread::yield();
                guard.reset();
                counter.reset();
            }
        });
    }
    for (auto& subscriber : subscribers) {
        subscriber.join();
    }
    stop = true;
    for (auto& teller : tellers) {
        teller.join();
    }
    EXPECT_EQ(notifier.numListeners(), 0u);
    EXPECT_GT(calls, 0);
}

TEST(ValServerThreads, ValuesAreReadWhole) {
    ValServer<std::vector<int>> server(std::vector<int>(100, 0));
    std::atomic<bool> torn{false};
    const auto whole = [&](const std::vector<int>& value) {
        for (const int number : value) {
            torn = torn || number != value.front();
        }
    };
    const auto guard = server.addListener(whole);
    std::vector<std::thread> threads;
    for (int t = 0; t < 3; ++t) {
        threads.emplace_back([&, t] {
            for (int i = 0; i < 200; ++i) {
                server.setValue(std::vector<int>(100, t * 1000 + i));
                whole(server.getValue());
            }
        });
    }
    for (auto& thread : threads) {
        thread.join();
    }
    EXPECT_FALSE(torn);
}

} // namespace
