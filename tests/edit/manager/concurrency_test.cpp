#include "edit/manager/edit_info.h"
#include "platform/services/config_int.h"
#include "platform/store/configb.h"
#include "support/faulty_file_system.h"
#include "tests/edit/manager/managed_project.h"

#include <gtest/gtest.h>

#include <array>
#include <atomic>
#include <barrier>
#include <chrono>
#include <cstdlib>
#include <future>
#include <random>
#include <thread>

namespace {

using test::ManagedProject;

constexpr int kThreads = 32;

/// A number that a longer run gives in the environment; else the suite's own.
int setting(const char* name, int usual) {
    const char* const text = std::getenv(name);
    int value = usual;
    return text != nullptr && Qx::textToInt(text, value) && value > 0 ? value : usual;
}

const int kItems = setting("QUILLMARCH_STRESS_EDITS", 50);
const int kSeconds = setting("QUILLMARCH_STRESS_SECONDS", 3);
/// The first items are counters: they are changed, written and evicted only, so no change may be lost.
constexpr int kCounters = 10;

cookie itemAt(int i) {
    return {Cookie_Type::Edit, i + 1, 0};
}

void addOne(const cookie& item) {
    const EditPtr edit(item, eOpenExisting);
    const std::lock_guard<criticalSection> hold(edit->section());
    edit->Opts().setInt("COUNT", edit->Opts().getInt("COUNT") + 1);
    edit->setChangeDescription(kPropertiesChanged, true);
}

/// One action of a user on one of the other items.
void actOn(const cookie& item, unsigned action) {
    switch (action % 16) {
    case 0:
        static_cast<void>(edit_manager::backup_edit(item).isOk());
        break;
    case 1:
        static_cast<void>(edit_manager::undoRequest(item).isOk());
        break;
    case 2:
        static_cast<void>(edit_manager::redoRequest(item).isOk());
        break;
    case 3:
        edit_manager::reloadRequest(item, true);
        break;
    case 4:
        edit_manager::flush_changes();
        break;
    case 5: {
        const EditInfo info(item, eOpenExisting);
        EXPECT_EQ(info.getLogType(), kLogEdit);
        EXPECT_TRUE(info.getFlags() == 0 && !info.hasAudioTracks());
        break;
    }
    case 6:
    case 7:
        edit_manager::flush_edit(item);
        break;
    default:
        ManagedProject::change(String::format("%u", action), item);
        break;
    }
}

TEST(Concurrency, ThirtyTwoThreadsLoseNothing) {
    const ManagedProject project;
    for (int i = 0; i < kItems; ++i) {
        ManagedProject::save("0", itemAt(i));
    }
    std::array<std::atomic<int>, kCounters> counts{};
    const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(kSeconds);
    const auto work = [&](unsigned seed) {
        std::mt19937 random(seed);
        while (std::chrono::steady_clock::now() < end) {
            const int i = static_cast<int>(random() % static_cast<unsigned>(kItems));
            const unsigned action = static_cast<unsigned>(random());
            if (i >= kCounters) {
                actOn(itemAt(i), action);
            } else {
                addOne(itemAt(i));
                ++counts[static_cast<size_t>(i)];
                if (action % 4 == 0) {
                    edit_manager::flush_edit(itemAt(i));
                }
            }
            if (action % 64 == 0) {
                edit_manager::limitEditCache(0);
            }
        }
    };
    std::vector<std::thread> threads;
    for (unsigned t = 0; t < kThreads; ++t) {
        threads.emplace_back(work, t + 1);
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    edit_manager::close_all_edits();
    EXPECT_EQ(edit_manager::numCached(), 0U);
    for (int i = 0; i < kItems; ++i) {
        const EditPtr edit(itemAt(i), eOpenExisting);
        ASSERT_TRUE(edit.valid()) << i;
        if (i < kCounters) {
            EXPECT_EQ(edit->Opts().getInt("COUNT"), counts[static_cast<size_t>(i)].load()) << i;
        }
    }
    for (const auto& entry : std::filesystem::directory_iterator(std::filesystem::path(project.folder()))) {
        EXPECT_EQ(entry.path().string().find("CORRUPT"), std::string::npos) << entry.path();
    }
    EXPECT_FALSE(project.log.contains("could not be")) << project.log.log();
}

/// A disk whose sync of a folder ends when it is let go.
class StuckDisk : public test::FaultyFileSystem {
public:
    Qx::FileError syncFolder(const String& path) override {
        if (!m_wasStuck.exchange(true)) {
            m_stuck.set_value();
            m_go.get_future().wait();
        }
        return FaultyFileSystem::syncFolder(path);
    }
    void waitUntilStuck() { m_stuck.get_future().wait(); }
    void letGo() { m_go.set_value(); }

private:
    std::atomic<bool> m_wasStuck{false};
    std::promise<void> m_stuck;
    std::promise<void> m_go;
};

TEST(Concurrency, OpeningWhatIsCachedWaitsForNoWriter) {
    Qx::setConfigInt("edit_cache_size", 1); // with a limit, which no opening waits for either
    const ManagedProject project;
    const EditPtr held(itemAt(1), eOpenOrCreate);
    const EditPtr heldToo(itemAt(0), eOpenOrCreate);
    ManagedProject::change("written", itemAt(0));
    StuckDisk disk;
    std::thread writer([] { EXPECT_TRUE(edit_manager::flush_edit(itemAt(0))); });
    disk.waitUntilStuck();
    // In a thread of its own: what waited for the writer would wait for ever.
    std::future<bool> opened = std::async(std::launch::async, [] {
        const EditPtr written(itemAt(0), eOpenExisting);
        const EditPtr other(itemAt(1), eOpenExisting);
        return written.valid() && other.valid();
    });
    EXPECT_EQ(opened.wait_for(std::chrono::seconds(60)), std::future_status::ready);
    disk.letGo();
    EXPECT_TRUE(opened.get());
    writer.join();
    Qx::clearConfigInt("edit_cache_size");
    EXPECT_EQ(ManagedProject::nameOf(itemAt(0)), "written");
}

TEST(Concurrency, WhatIsOpenedWhileItIsBeingDroppedStays) {
    const ManagedProject project;
    ManagedProject::save("before", itemAt(0));
    ManagedProject::change("written", itemAt(0));
    StuckDisk disk;
    std::thread dropper([] { edit_manager::limitEditCache(0); });
    disk.waitUntilStuck();
    const EditPtr opened(itemAt(0), eOpenExisting);
    disk.letGo();
    dropper.join();
    ASSERT_TRUE(edit_manager::get_present(itemAt(0)));
    EXPECT_EQ(EditPtr(itemAt(0), eOpenExisting), opened);
}

TEST(Concurrency, ThreadsInsideEditsThatNeedEachOthersGoOn) {
    const ManagedProject project;
    const auto needOther = [](int other, unsigned action) {
        switch (action) {
        case 0:
            edit_manager::flush_edit(itemAt(other));
            break;
        case 1:
            static_cast<void>(edit_manager::backup_edit(itemAt(other)).isOk());
            break;
        case 2:
            edit_manager::reloadRequest(itemAt(other), true);
            break;
        default:
            edit_manager::flush_changes();
            break;
        }
    };
    constexpr int kRing = 3;
    std::array<EditPtr, kRing> edits;
    std::vector<std::future<void>> ends;
    std::atomic<int> round{0};
    std::barrier inside(kRing);
    for (int i = 0; i < kRing; ++i) {
        ManagedProject::change("0", itemAt(i));
        edits[static_cast<size_t>(i)] = EditPtr(itemAt(i), eOpenExisting);
    }
    for (int i = 0; i < kRing; ++i) {
        ends.push_back(std::async(std::launch::async, [&, i] {
            for (unsigned action = 0; action < 4; ++action) {
                {
                    const std::lock_guard<criticalSection> hold(edits[static_cast<size_t>(i)]->section());
                    inside.arrive_and_wait();
                    needOther((i + 1) % kRing, action);
                }
                inside.arrive_and_wait();
            }
        }));
    }
    for (std::future<void>& end : ends) {
        if (end.wait_for(std::chrono::seconds(60)) != std::future_status::ready) {
            std::fputs("the threads wait for each other for ever\n", stderr);
            std::abort();
        }
    }
    EXPECT_TRUE(project.log.contains("waits for this one"));
    EXPECT_TRUE(edit_manager::flush_changes());
}

TEST(Concurrency, AnEditOfOneProjectIsNeverFoundInAnother) {
    const ManagedProject project;
    const cookie projects[] = {cookie("P0001000"), cookie("P0002000")};
    for (const cookie& each : projects) {
        ASSERT_EQ(edit_manager::set_current_project(each, eOpenOrCreate), eStatus::Ok);
        ManagedProject::save(each.asString());
    }
    std::atomic<bool> goesOn{true};
    std::vector<std::thread> openers;
    for (int t = 0; t < 4; ++t) {
        openers.emplace_back([&] {
            for (int i = 0; goesOn; ++i) {
                const EditPtr edit(test::kEdit, eOpenExisting);
                if (edit.valid() && i % 4 == 0) {
                    const std::lock_guard<criticalSection> hold(edit->section());
                    edit->Opts().setInt("COUNT", i);
                }
                edit_manager::limitEditCache(0);
            }
        });
    }
    for (int i = 0; i < 40; ++i) {
        const cookie& wanted = projects[i % 2];
        ASSERT_EQ(edit_manager::set_current_project(wanted, eOpenExisting), eStatus::Ok);
        for (int look = 0; look < 10; ++look) {
            EXPECT_EQ(ManagedProject::nameOf(), wanted.asString()) << i;
        }
    }
    goesOn = false;
    for (std::thread& opener : openers) {
        opener.join();
    }
    for (const cookie& each : projects) {
        ASSERT_EQ(edit_manager::set_current_project(each, eOpenExisting), eStatus::Ok);
        EXPECT_EQ(ManagedProject::nameOf(), each.asString());
    }
}

TEST(Concurrency, NoChangeIsLostToADrop) {
    const ManagedProject project;
    constexpr int kItemsDropped = 4;
    constexpr int kChanges = 500;
    for (int i = 0; i < kItemsDropped; ++i) {
        ManagedProject::save("0", itemAt(i));
    }
    std::atomic<int> changing{kThreads};
    std::vector<std::thread> threads;
    for (int t = 0; t < kThreads; ++t) {
        threads.emplace_back([&, t] {
            for (int i = 0; i < kChanges; ++i) {
                addOne(itemAt(t % kItemsDropped));
                std::this_thread::yield();
            }
            --changing;
        });
        threads.emplace_back([&] {
            while (changing > 0) {
                edit_manager::limitEditCache(0);
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    for (int i = 0; i < kItemsDropped; ++i) {
        EXPECT_EQ(EditPtr(itemAt(i), eOpenExisting)->Opts().getInt("COUNT"),
                  kThreads / kItemsDropped * kChanges);
    }
}

} // namespace
