#include "platform/notify/notifier.h"
#include "platform/notify/val_server.h"

#include <gtest/gtest.h>
#include <stdexcept>
#include <vector>

namespace {

const NotifyMsgType kChanged("test.changed");
const NotifyMsgType kDeleted("test.deleted");

TEST(Notifier, OneMayRemoveItselfAndKeepsWhatItHoldsUntilItReturns) {
    Notifier notifier;
    Qx::Ptr<Qx::Guard> guard;
    auto held = std::make_shared<int>(5);
    const std::weak_ptr<int> watched = held;
    int seen = 0;
    guard = notifier.addListener(kChanged, [&guard, &seen, held](const NotifyMsg&) {
        guard.reset();
        seen += *held;
    });
    held.reset();
    notifier.notify({kChanged, ""});
    notifier.notify({kChanged, ""});
    EXPECT_EQ(seen, 5);
    EXPECT_TRUE(watched.expired());
}

TEST(Notifier, OneMayNotifyAgain) {
    Notifier notifier;
    String heard;
    const auto a = notifier.addListener(kChanged, [&](const NotifyMsg& m) {
        heard += "a" + m.text();
        if (m.text() == "1") {
            notifier.notify({kChanged, "2"});
        }
    });
    const auto b = notifier.addListener(kChanged, [&](const NotifyMsg& m) { heard += "b" + m.text(); });
    notifier.notify({kChanged, "1"});
    EXPECT_EQ(heard, "a1a2b2b1");
}

TEST(Notifier, OneMayDestroyIt) {
    auto notifier = std::make_unique<Notifier>();
    int heard = 0;
    auto guard = notifier->addListener(kChanged, [&](const NotifyMsg&) { notifier.reset(); });
    auto other = notifier->addListener(kChanged, [&](const NotifyMsg&) { ++heard; });
    notifier->notify({kChanged, ""});
    EXPECT_EQ(heard, 0) << "the one that was not told yet";
    guard.reset();
    other.reset();
}

TEST(Notifier, AThrowingListenerLeavesItInOrder) {
    Notifier notifier;
    auto guard =
        notifier.addListener(kChanged, [](const NotifyMsg&) { throw std::runtime_error("listener"); });
    EXPECT_THROW(notifier.notify({kChanged, ""}), std::runtime_error);
    guard.reset();
    EXPECT_NO_THROW(notifier.notify({kChanged, ""}));
    const auto empty = notifier.addListener(kChanged, nullptr);
    EXPECT_NO_THROW(notifier.notify({kDeleted, ""}));
}

TEST(ValServer, EveryValueReachesEveryObserver) {
    ValServer<String> server("start");
    String heard;
    const auto a = server.addListener([&](const String& value) {
        heard += "a" + value;
        if (value == "1") {
            server.setValue("2");
            EXPECT_EQ(value, "1") << "an observer's value is its own";
        }
    });
    const auto b = server.addListener([&](const String& value) { heard += "b" + value; });
    EXPECT_EQ(server.getValue(), "start");
    server.setValue("1");
    EXPECT_EQ(heard, "a1a2b2b1");
    EXPECT_EQ(server.getValue(), "2");
    server.setValueSilently("3");
    EXPECT_EQ(heard, "a1a2b2b1");
    EXPECT_EQ(server.getValue(), "3");
}

TEST(ValServer, AnObserverMayDestroyIt) {
    auto server = std::make_unique<ValServer<std::vector<int>>>();
    size_t seen = 0;
    const auto guard = server->addListener([&](const std::vector<int>& value) {
        server.reset();
        seen = value.size();
    });
    server->setValue(std::vector<int>(1000));
    EXPECT_EQ(seen, 1000u);
}

} // namespace
