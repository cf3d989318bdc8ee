#include "platform/services/files.h"

#include "support/faulty_file_system.h"
#include "support/temporary_folder.h"

#include <fcntl.h>
#include <filesystem>
#include <gtest/gtest.h>
#include <sys/stat.h>

namespace {

using Qx::FileKind;
using Qx::OpenMode;

TEST(MachineFileSystem, OpensRegularFilesOnlyAndNeverWaits) {
    const test::TemporaryFolder folder;
    folder.write("file", "x");
    std::filesystem::create_symlink("file", folder.path("link").c_str());
    std::filesystem::create_directory(folder.path("folder").c_str());
    ASSERT_EQ(::mkfifo(folder.path("fifo").c_str(), 0600), 0);
    std::unique_ptr<Qx::OpenFile> file;
    for (const OpenMode mode : {OpenMode::Read, OpenMode::ReadWrite, OpenMode::Append}) {
        for (const char* name : {"link", "folder", "fifo"}) {
            const auto error = Qx::fileSystem().open(folder.path(name), mode, file);
            EXPECT_TRUE(error) << name;
            EXPECT_EQ(file, nullptr) << name;
        }
        EXPECT_TRUE(Qx::fileSystem().open("/dev/null", mode, file));
    }
    EXPECT_TRUE(Qx::fileSystem().open(folder.path("file"), OpenMode::CreateNew, file));
    EXPECT_TRUE(Qx::fileSystem().open(folder.path("link"), OpenMode::CreateNew, file));
    String hidden = folder.path("file");
    hidden.append(std::string_view("\0.qme", 5));
    EXPECT_TRUE(Qx::fileSystem().open(hidden, OpenMode::Read, file));
    EXPECT_EQ(folder.read("file"), "x");
}

TEST(MachineFileSystem, TellsKindsWithoutFollowingLinks) {
    const test::TemporaryFolder folder;
    folder.write("file", "12345");
    std::filesystem::create_symlink("file", folder.path("link").c_str());
    ASSERT_EQ(::mkfifo(folder.path("fifo").c_str(), 0600), 0);
    const std::pair<const char*, FileKind> cases[] = {
        {"file", FileKind::Regular}, {"link", FileKind::Link},    {"fifo", FileKind::Other},
        {"", FileKind::Folder},      {"none", FileKind::Missing}, {"file/x", FileKind::Missing}};
    for (const auto& [name, kind] : cases) {
        Qx::FileInfo info;
        ASSERT_FALSE(Qx::fileSystem().info(folder.path(name), info)) << name;
        EXPECT_EQ(info.kind, kind) << name;
        const Qx::FileAnswer answer = Qx::askFile(folder.path(name));
        EXPECT_EQ(answer.kind(), kind) << name;
        const bool isUsable = kind == FileKind::Regular || kind == FileKind::Missing;
        EXPECT_EQ(!answer.obstacle(), isUsable) << name;
    }
    // What the system cannot tell is neither there nor missing, whatever lies there.
    for (const int code : {EIO, ESTALE, EACCES}) {
        test::FaultyFileSystem system;
        for (const char* const name : {"file", "none"}) {
            system.reset();
            system.failQuestion(1, code);
            const Qx::FileAnswer answer = Qx::askFile(folder.path(name));
            EXPECT_TRUE(answer.isUnknown() && !answer.isMissing() && !answer.isRegular()) << name;
            EXPECT_EQ(answer.obstacle().code, code) << name;
            EXPECT_FALSE(Qx::isSameFile(answer.info(), answer.info())) << name;
        }
    }
    Qx::FileInfo info;
    ASSERT_FALSE(Qx::fileSystem().info(folder.path("file"), info));
    EXPECT_EQ(info.size, 5u);
    EXPECT_EQ(info.links, 1);
}

TEST(MachineFileSystem, TouchSetsTheTimesAskedFor) {
    const test::TemporaryFolder folder;
    const String path = folder.write("file", "x");
    const timespec old[2] = {{1000, 0}, {2000, 0}};
    ASSERT_EQ(::utimensat(AT_FDCWD, path.c_str(), old, 0), 0);
    Qx::FileInfo info;
    ASSERT_FALSE(Qx::fileSystem().touch(path, true));
    ASSERT_FALSE(Qx::fileSystem().info(path, info));
    EXPECT_EQ(info.modifiedNs, 2000 * int64_t{1000000000});
    EXPECT_GT(info.accessedNs, 3000 * int64_t{1000000000});
    ASSERT_FALSE(Qx::fileSystem().touch(path, false));
    ASSERT_FALSE(Qx::fileSystem().info(path, info));
    EXPECT_GT(info.modifiedNs, 3000 * int64_t{1000000000});
}

TEST(FileErrors, AreOutcomesOfAKindThatKeepTheNumber) {
    using Code = Qx::StatusCode;
    const std::pair<int, Code> cases[] = {
        {0, Code::Ok},           {ENOENT, Code::NotFound}, {ENOSPC, Code::Full},   {EDQUOT, Code::Full},
        {EROFS, Code::ReadOnly}, {EACCES, Code::Refused},  {EBUSY, Code::Refused}, {EIO, Code::Refused},
    };
    for (const auto& [number, kind] : cases) {
        const Qx::FileError error{number, "write", "/a"};
        const Qx::Status status = error.status();
        EXPECT_EQ(status.code(), kind) << number;
        EXPECT_EQ(status.systemError(), number);
        EXPECT_EQ(status.reason(), number == 0 ? String() : error.text());
        const Qx::Status retold = status.retold("otherwise");
        EXPECT_EQ(retold.code(), kind);
        EXPECT_EQ(retold.systemError(), number);
        EXPECT_EQ(retold.reason(), number == 0 ? "" : "otherwise");
    }
}

TEST(WholeFile, ReadsThroughShortAndInterruptedReads) {
    const test::TemporaryFolder folder;
    const std::string text = "some bytes\0 and more" + std::string(100, 'z');
    const String path = folder.write("file", text);
    test::FaultyFileSystem disk;
    String read;
    for (size_t n = 1; n < 10; ++n) {
        disk.reset();
        disk.shortTransfers(7);
        disk.failAt(n, EINTR);
        ASSERT_FALSE(Qx::readWholeFile(path, read, 1000));
        EXPECT_EQ(read, text);
    }
    for (size_t n = 1; n <= 4; ++n) {
        disk.reset();
        disk.failAt(n, EIO);
        std::vector<std::byte> bytes{std::byte{1}};
        EXPECT_EQ(Qx::readWholeFile(path, bytes, 1000).code, EIO) << n;
        EXPECT_TRUE(bytes.empty());
    }
}

TEST(WholeFile, TheLimitHoldsBeforeAnythingIsRead) {
    const test::TemporaryFolder folder;
    const String path = folder.write("file", "12345");
    test::FaultyFileSystem disk;
    String text;
    EXPECT_FALSE(Qx::readWholeFile(path, text, 5));
    disk.reset();
    const auto error = Qx::readWholeFile(path, text, 4);
    EXPECT_EQ(error.code, EFBIG);
    EXPECT_EQ(error.text(), "cannot read " + path + ": It is larger than is accepted");
    EXPECT_EQ(disk.count("read"), 0u);
    EXPECT_EQ(text, "");
    // The system says size 0 of a file that has bytes nevertheless.
    EXPECT_FALSE(Qx::readWholeFile("/proc/self/stat", text, 4096));
    EXPECT_FALSE(text.empty());
    EXPECT_EQ(Qx::readWholeFile("/proc/self/stat", text, 4).code, EFBIG);
}

TEST(CopyFile, CopiesWholeOrNotAtAll) {
    const test::TemporaryFolder folder;
    const std::string bytes(3000000, 'q');
    const String from = folder.write("from", bytes);
    folder.write("to", "old");
    test::FaultyFileSystem disk;
    disk.fullAfter(2000000);
    EXPECT_EQ(Qx::copyFile(from, folder.path("to")).code, ENOSPC);
    EXPECT_EQ(folder.read("to"), "old");
    disk.reset();
    ASSERT_FALSE(Qx::copyFile(from, folder.path("to")));
    EXPECT_EQ(folder.read("to"), bytes);
    EXPECT_EQ(Qx::copyFile(folder.path("none"), folder.path("to")).code, ENOENT);
    EXPECT_EQ(folder.read("to"), bytes);
    EXPECT_EQ(folder.numNames(), 2u);
}

} // namespace
