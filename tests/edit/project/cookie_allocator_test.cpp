#include "edit/project/cookie_allocator.h"

#include "edit/project/project_details.h"
#include "platform/services/atomic_batch.h"
#include "support/child_process.h"
#include "support/faulty_file_system.h"
#include "support/recording_log.h"
#include "support/temporary_folder.h"

#include <filesystem>
#include <gtest/gtest.h>
#include <set>
#include <thread>

namespace {

using Cookies = std::vector<cookie>;

cookie edit(int number) {
    return cookie(Cookie_Type::Edit, number, 0);
}

TEST(CookieAllocator, CountsFromOneForOneLockAndOneWrite) {
    const test::TemporaryFolder folder;
    CookieAllocator allocator(folder.path());
    Cookies out;
    ASSERT_TRUE(allocator.allocate(2, out));
    ASSERT_TRUE(allocator.allocate(0, out));
    EXPECT_EQ(out, (Cookies{edit(1), edit(2)}));

    test::FaultyFileSystem disk;
    ASSERT_TRUE(CookieAllocator(folder.path()).allocate(1000, out)) << "another object goes on";
    EXPECT_EQ(out.size(), 1002u);
    EXPECT_EQ(out.back(), edit(1002));
    EXPECT_EQ(disk.count("lock"), 1u);
    EXPECT_EQ(disk.count("rename"), 1u);
    EXPECT_EQ(disk.count("sync *.tmp"), 1u) << "durable before it is handed out";
}

TEST(CookieAllocator, WhateverNamesAnEditTakesItsNumber) {
    const struct {
        const char* name;
        bool takes;
    } names[] = {
        {"E0002000.qme", true},
        {"E0002000.qme.U7", true},
        {"E0002000.qme.CORRUPT.1", true},
        {"E0002000.ED2", true},
        {"Milestones/E0002000/x", true},
        {"E0002000.txt", false},
        {"M0002000.qme", false},
        {"E0002001.qme", false},
        {"E0002.qme", false},
        {"Milestones/E0002000.qme/x", false},
    };
    for (const auto& [name, takes] : names) {
        SCOPED_TRACE(name);
        const test::TemporaryFolder folder;
        const test::RecordingLog log;
        CookieAllocator allocator(folder.path());
        ASSERT_EQ(allocator.allocateOne(), edit(1));
        folder.write(name, "");
        EXPECT_EQ(allocator.allocateOne(), edit(takes ? 3 : 2));
        EXPECT_EQ(log.log(), takes ? "new_edit() Skipped 1 pre-existing cookies\n" : "");
        // Without the count nothing is handed out that edits could play.
        folder.write("E0009000.qme", "");
        std::filesystem::remove(folder.path("Project.txt").c_str());
        EXPECT_EQ(allocator.allocateOne(), edit(10));
        folder.write("EZZZZ000.qme", "");
        std::filesystem::remove(folder.path("Project.txt").c_str());
        EXPECT_EQ(allocator.allocateOne(), edit(1)) << "nothing is left behind the last";
    }
    const test::TemporaryFolder folder;
    std::filesystem::create_symlink("nowhere", folder.path("E0001000.qme").c_str());
    EXPECT_EQ(CookieAllocator(folder.path()).allocateOne(), edit(2));
}

TEST(CookieAllocator, WhatACallerSaysToBeTakenStaysTaken) {
    const test::TemporaryFolder folder;
    Cookies out;
    const Cookies taken{edit(7), edit(2), cookie("EZZZZ000"), edit(4), edit(3), edit(2), cookie("M0001000")};
    ASSERT_TRUE(CookieAllocator(folder.path()).allocate(1, out, taken));
    EXPECT_NE(folder.read("Project.txt").find("TAKEN_EDITS:string 2-4 7 1679615"), std::string::npos);
    ASSERT_TRUE(CookieAllocator(folder.path()).allocate(4, out, Cookies{edit(6)}));
    EXPECT_EQ(out, (Cookies{edit(1), edit(5), edit(8), edit(9), edit(10)}));
    EXPECT_NE(folder.read("Project.txt").find("TAKEN_EDITS:string 1679615"), std::string::npos);
    ASSERT_TRUE(CookieAllocator(folder.path()).allocate(0, out, Cookies{edit(11)}));
    EXPECT_EQ(CookieAllocator(folder.path()).allocateOne(), edit(12));
}

TEST(CookieAllocator, NoNumberTwiceForThreadsAndProcesses) {
    const test::TemporaryFolder folder;
    std::vector<Cookies> handed(4);
    std::vector<std::thread> threads;
    for (Cookies& mine : handed) {
        threads.emplace_back([&] {
            CookieAllocator allocator(folder.path());
            for (int i = 0; i < 10; ++i) {
                EXPECT_TRUE(allocator.allocate(3, mine));
            }
        });
    }
    for (auto& thread : threads) {
        thread.join();
    }
    std::set<cookie> all;
    for (const Cookies& some : handed) {
        all.insert(some.begin(), some.end());
    }
    EXPECT_EQ(all.size(), 120u);
    // Another process, which writes nothing for what it got.
    ASSERT_EQ(test::runInChild([&] {
                  Cookies out;
                  return CookieAllocator(folder.path()).allocate(5, out) && out.front() == edit(121);
              }),
              test::ChildEnd::Succeeded);
    EXPECT_EQ(CookieAllocator(folder.path()).allocateOne(), edit(126));
}

TEST(CookieAllocator, IsDurableAtOnceInsideABatch) {
    const test::TemporaryFolder folder;
    {
        const Qx::AtomicBatch dropped;
        EXPECT_EQ(CookieAllocator(folder.path()).allocateOne(), edit(1));
    }
    EXPECT_EQ(CookieAllocator(folder.path()).allocateOne(), edit(2));
}

TEST(CookieAllocator, AProcessMayDieAtAnyOperation) {
    const test::TemporaryFolder folder;
    int last = 0;
    for (size_t n = 1; n < 60; ++n) {
        const auto end = test::runInChild([&] {
            test::FaultyFileSystem disk;
            disk.killAtWrite(n);
            Cookies out;
            return bool(CookieAllocator(folder.path()).allocate(1, out));
        });
        ASSERT_NE(end, test::ChildEnd::Failed);
        const cookie next = CookieAllocator(folder.path()).allocateOne();
        ASSERT_TRUE(next.is_valid());
        EXPECT_GT(static_cast<int>(next.word(0)), last);
        last = static_cast<int>(next.word(0));
        if (end == test::ChildEnd::Succeeded) {
            EXPECT_GT(n, 4u);
            return;
        }
    }
    FAIL() << "the allocation never ended";
}

TEST(CookieAllocator, AFailureHandsOutNothing) {
    const test::TemporaryFolder folder;
    test::FaultyFileSystem disk;
    Cookies out;
    CookieAllocator allocator(folder.path());
    ASSERT_TRUE(allocator.allocate(1, out));
    disk.reset();
    ASSERT_TRUE(allocator.allocate(1, out));
    const auto steps = disk.operations();
    for (size_t n = 1; n <= steps.size(); ++n) {
        SCOPED_TRACE(steps[n - 1]);
        const std::string before = folder.read("Project.txt");
        const Cookies had = out;
        disk.reset();
        disk.failAt(n, EIO);
        if (allocator.allocate(1, out)) {
            // Only the name in the lock's file is a courtesy.
            EXPECT_TRUE(steps[n - 1].find("Project.lock") != String::npos);
            EXPECT_EQ(out.size(), had.size() + 1);
        } else {
            EXPECT_EQ(out, had);
            EXPECT_TRUE(folder.read("Project.txt") == before || steps[n - 1] == "sync folder");
        }
        disk.reset();
        const cookie next = allocator.allocateOne();
        EXPECT_GT(next, had.back());
        out.push_back(next);
    }
    EXPECT_EQ(folder.numNames(), 2u);
}

TEST(CookieAllocator, RefusesDamageAndTheEndOfTheNumbers) {
    const test::TemporaryFolder folder;
    const auto setNext = [&](const std::string& line) {
        folder.write("Project.txt", "PROJECT\n" + line + "\nEND_PROJECT\n");
    };
    const test::RecordingLog log;
    CookieAllocator allocator(folder.path());
    Cookies out;
    for (const char* line : {"NEXT_EDIT:int 0", "NEXT_EDIT:int -4", "NEXT_EDIT:int 1679617",
                             "NEXT_EDIT:int x", "NEXT_EDIT:string 5", "TAKEN_EDITS:string 5 3",
                             "TAKEN_EDITS:string 0-1", "TAKEN_EDITS:string 5-9999999"}) {
        setNext(line);
        const auto status = allocator.allocate(1, out);
        ASSERT_FALSE(status) << line;
        EXPECT_NE(status.reason().find("Project.txt"), String::npos) << status.reason();
    }
    setNext("NEXT_EDIT:int 1679614");
    EXPECT_FALSE(allocator.allocate(3, out));
    EXPECT_TRUE(out.empty());
    ASSERT_TRUE(allocator.allocate(2, out)) << "the failure used no number";
    EXPECT_EQ(out.back().asString(), "EZZZZ000");
    EXPECT_FALSE(allocator.allocateOne().is_valid());
    EXPECT_TRUE(log.contains("used up"));
    EXPECT_FALSE(CookieAllocator("").allocate(1, out));
    EXPECT_FALSE(CookieAllocator(folder.path("none")).allocate(1, out));
}

} // namespace
