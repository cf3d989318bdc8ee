#include "edit/project/cookie_allocator.h"

#include "edit/project/project_details.h"
#include "platform/services/atomic_batch.h"
#include "support/every_fault.h"
#include "support/recording_log.h"
#include "support/temporary_folder.h"

#include <filesystem>
#include <gtest/gtest.h>
#include <set>
#include <thread>

namespace {

using test::Fault;
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

TEST(CookieAllocator, NoFaultHandsOutANumberTwice) {
    const test::TemporaryFolder folder;
    CookieAllocator allocator(folder.path());
    Cookies out;
    ASSERT_TRUE(allocator.allocate(1, out));
    for (const Fault& fault : {Fault{Fault::Fails, EIO}, Fault{Fault::Killed}}) {
        const auto allocate = [&](const Cookies& had, const auto& arm) {
            arm();
            out = had;
            return allocator.allocate(1, out);
        };
        const auto check = [&](const Cookies& had, const test::Met& met) {
            if (fault.kind == Fault::Fails) {
                EXPECT_EQ(out.size(), had.size() + (met.done ? 1 : 0)) << "a failure hands out nothing";
                EXPECT_TRUE(!met.done || !met.isMet || met.operation.find("Project.lock") != String::npos)
                    << "only the name in the lock's file is a courtesy";
                EXPECT_EQ(folder.numNames(), 2u);
            }
            const cookie next = allocator.allocateOne();
            EXPECT_GT(next, out.back());
            out.push_back(next);
        };
        EXPECT_GT(test::everyFault(
                      fault, [&] { return out; }, allocate, check),
                  4u);
    }
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
