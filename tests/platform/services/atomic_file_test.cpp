#include "platform/services/atomic_file.h"

#include "platform/services/clock.h"
#include "support/every_fault.h"
#include "support/temporary_folder.h"

#include <filesystem>
#include <gtest/gtest.h>
#include <sys/stat.h>

namespace {

using test::Fault;

const std::string kOld = "the old edit";
const std::string kNew = "the new edit, which is longer than the old one";

/// Replaces a file in the way that a writer of a file with a table does.
Qx::FileError store(const String& path) {
    Qx::AtomicFile file(path);
    if (auto error = file.write("the ??? edit, ")) {
        return error;
    }
    if (auto error = file.write("which is longer than the old one")) {
        return error;
    }
    if (auto error = file.overwrite(4, "new", 3)) {
        return error;
    }
    return file.commit();
}

TEST(AtomicFile, SyncsTheBytesBeforeTheNameAndTheFolderAfterIt) {
    const test::TemporaryFolder folder;
    ASSERT_EQ(::chmod(folder.write("a.qme", kOld).c_str(), 0640), 0);
    test::FaultyFileSystem disk;
    ASSERT_FALSE(store(folder.path("a.qme")));
    const auto steps = disk.operations();
    Qx::FileInfo info;
    ASSERT_FALSE(Qx::fileSystem().info(folder.path("a.qme"), info));
    EXPECT_EQ(info.permissions, 0640u);
    const auto at = [&](std::string_view text) {
        return std::find(steps.begin(), steps.end(), text) - steps.begin();
    };
    EXPECT_LT(at("sync *.tmp"), at("close *.tmp"));
    EXPECT_LT(at("close *.tmp"), at("rename *.tmp a.qme"));
    EXPECT_EQ(steps.back(), "sync folder");
    EXPECT_EQ(steps[steps.size() - 2], "rename *.tmp a.qme");
}

TEST(AtomicFile, NothingIsTouchedWithoutACommit) {
    const test::TemporaryFolder folder;
    const String path = folder.write("a.qme", kOld);
    {
        Qx::AtomicFile idle(path);
        Qx::AtomicFile file(path);
        ASSERT_FALSE(file.write("half"));
        EXPECT_EQ(folder.read("a.qme"), kOld);
        EXPECT_EQ(folder.numNames(), 2u);
    }
    EXPECT_EQ(folder.read("a.qme"), kOld);
    EXPECT_EQ(folder.numNames(), 1u);
}

TEST(AtomicFile, OverwriteStaysInsideWhatWasWritten) {
    const test::TemporaryFolder folder;
    for (const uint64_t offset : {uint64_t{6}, uint64_t{5}, UINT64_MAX}) {
        Qx::AtomicFile file(folder.path("a"));
        ASSERT_FALSE(file.write("12345"));
        EXPECT_TRUE(file.overwrite(offset, "xy", 2)) << offset;
        EXPECT_TRUE(file.commit()) << "the first failure stays";
    }
    EXPECT_EQ(folder.numNames(), 0u);
}

TEST(AtomicFile, WhatIsNoRegularFileIsRefusedAndLeftAlone) {
    const test::TemporaryFolder folder;
    folder.write("target", kOld);
    std::filesystem::create_symlink("target", folder.path("link").c_str());
    std::filesystem::create_symlink("nowhere", folder.path("dangling").c_str());
    std::filesystem::create_directory(folder.path("folder").c_str());
    ASSERT_EQ(::mkfifo(folder.path("fifo").c_str(), 0600), 0);
    for (const char* name : {"link", "dangling", "folder", "fifo", "", ".", "..", "missing/a"}) {
        Qx::AtomicFile file(folder.path(name));
        EXPECT_TRUE(file.write("x")) << name;
        EXPECT_TRUE(file.commit()) << name;
    }
    // Also when it comes there between the first write and the commit.
    Qx::AtomicFile late(folder.path("late"));
    ASSERT_FALSE(late.write("x"));
    std::filesystem::create_symlink("target", folder.path("late").c_str());
    EXPECT_EQ(late.commit().code, ELOOP);
    EXPECT_EQ(folder.read("target"), kOld);
    EXPECT_TRUE(std::filesystem::is_symlink(folder.path("late").c_str()));
    EXPECT_EQ(folder.numNames(), 6u);
}

TEST(AtomicFile, ATakenTemporaryNameIsLeftAlone) {
    const test::TemporaryFolder folder;
    test::FaultyFileSystem disk;
    disk.failAt(2, EEXIST);
    ASSERT_FALSE(store(folder.path("a.qme")));
    EXPECT_EQ(disk.count("open new"), 2u);
    EXPECT_EQ(disk.count("remove"), 0u);
    EXPECT_EQ(folder.read("a.qme"), kNew);
}

TEST(AtomicFile, AnyFaultLeavesTheOldFileOrTheNew) {
    const test::TemporaryFolder folder;
    const String path = folder.path("a.qme");
    const auto setUp = [&] { return folder.write("a.qme", kOld); };
    const auto act = [](const String& file, const auto& arm) {
        arm();
        return !store(file);
    };
    for (const Fault& fault : {Fault{Fault::Fails, EIO}, Fault{Fault::Fails, EINTR}, Fault{Fault::Killed}}) {
        const auto check = [&](const String&, const test::Met& met) {
            const std::string found = folder.read("a.qme");
            EXPECT_TRUE(found == kNew || (found == kOld && !met.done)) << found;
            if (fault.kind == Fault::Fails) {
                EXPECT_TRUE(met.done || fault.code != EINTR);
                EXPECT_EQ(found == kNew, met.done || met.operation == "sync folder");
                EXPECT_EQ(folder.numNames(), 1u) << "a temporary file was left";
            }
            // What a dead process left is known for what it is, and does not stand in the way.
            for (const auto& entry : std::filesystem::directory_iterator(folder.path().c_str())) {
                const std::string name = entry.path().filename().string();
                EXPECT_TRUE(name == "a.qme" || Qx::isTemporaryName(name)) << name;
            }
            EXPECT_FALSE(store(path));
            EXPECT_EQ(folder.read("a.qme"), kNew);
        };
        EXPECT_GE(test::everyFault(fault, setUp, act, check), 7u);
    }
    folder.write(".a.qme.1-0123456789abcdef.tmp", "of who knows whom");
    EXPECT_GE(Qx::removeStaleTemporaries(folder.path()), 4u) << "those of a process that is gone";
    EXPECT_EQ(Qx::removeStaleTemporaries(folder.path()), 0u) << "the other is young";
    const auto before = Qx::setClock([] { return INT64_MAX; });
    EXPECT_GT(Qx::removeStaleTemporaries(folder.path()), 0u);
    Qx::setClock(before);
    EXPECT_EQ(folder.numNames(), 1u);
}

TEST(AtomicFile, ShortWritesAreFinishedAndADiskMayFillUpAtAnyByte) {
    const test::TemporaryFolder folder;
    test::FaultyFileSystem disk;
    for (const size_t most : {1u, 7u}) {
        disk.reset();
        disk.shortTransfers(most);
        ASSERT_FALSE(store(folder.path(std::string(255, 'n'))));
        EXPECT_EQ(folder.read(std::string(255, 'n')), kNew);
    }
    std::filesystem::remove(folder.path(std::string(255, 'n')).c_str());
    for (size_t room = 0; room < kNew.size(); ++room) {
        folder.write("a.qme", kOld);
        disk.reset();
        disk.fullAfter(room);
        EXPECT_EQ(store(folder.path("a.qme")).code, ENOSPC) << room;
        EXPECT_EQ(folder.read("a.qme"), kOld) << room;
        EXPECT_EQ(folder.numNames(), 1u) << room;
    }
}

TEST(AtomicFile, OtherNamesAreNotTemporary) {
    for (const char* name :
         {"", ".tmp", "..tmp", "a.tmp", ".a.12-0123456789abcdef", "a.12-0123456789abcdef.tmp",
          ".12-0123456789abcdef.tmp", ".a.x-0123456789abcdef.tmp", ".a.12-0123456789abcde.tmp",
          ".a.12-0123456789abcdeg.tmp", ".a.-0123456789abcdef.tmp"}) {
        EXPECT_FALSE(Qx::isTemporaryName(name)) << name;
    }
    EXPECT_TRUE(Qx::isTemporaryName(".a.qme.12-0123456789abcdef.tmp"));
}

} // namespace
