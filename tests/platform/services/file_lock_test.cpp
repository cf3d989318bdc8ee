#include "platform/services/file_lock.h"

#include "support/child_process.h"
#include "support/faulty_file_system.h"
#include "support/temporary_folder.h"

#include <gtest/gtest.h>

namespace {

TEST(FileLock, ARefusalSaysWhoHoldsIt) {
    const test::TemporaryFolder folder;
    Qx::FileLock mine(folder.path("lock"));
    ASSERT_TRUE(mine.take(false));
    EXPECT_TRUE(mine.take(false)) << "held already";
    Qx::FileLock other(folder.path("lock"));
    const Qx::Status refused = other.take(false);
    ASSERT_FALSE(refused);
    EXPECT_EQ(refused.code(), Qx::StatusCode::Locked);
    EXPECT_FALSE(other.isHeld());
    const String process =
        String::format("platform_services_test, process %ld", static_cast<long>(::getpid()));
    EXPECT_NE(refused.reason().find(process.substr(0, 8)), String::npos) << refused.reason();
    EXPECT_NE(refused.reason().find(String::format("process %ld", static_cast<long>(::getpid()))),
              String::npos)
        << refused.reason();
    mine.release();
    EXPECT_EQ(Qx::FileLock::holder(folder.path("lock")), "");
    EXPECT_TRUE(other.take(false));
}

TEST(FileLock, DiesWithItsProcess) {
    const test::TemporaryFolder folder;
    const String path = folder.path("lock");
    const auto end = test::runInChild([&] {
        Qx::FileLock lock(path);
        if (lock.take()) {
            ::kill(::getpid(), SIGKILL);
        }
        return false;
    });
    ASSERT_EQ(end, test::ChildEnd::Killed);
    Qx::FileLock lock(path);
    EXPECT_TRUE(lock.take(false));
}

TEST(FileLock, FaultsAreToldAndInterruptionsAreNot) {
    const test::TemporaryFolder folder;
    test::FaultyFileSystem disk;
    disk.failWhere("lock lock", ENOLCK);
    Qx::FileLock lock(folder.path("lock"));
    const auto status = lock.take();
    ASSERT_FALSE(status);
    EXPECT_NE(status.reason().find(folder.path("lock")), String::npos) << status.reason();
    disk.reset();
    disk.failAt(2, EINTR);
    EXPECT_TRUE(lock.take());
    lock.release();
    disk.reset();
    disk.failWhere("write", ENOSPC);
    EXPECT_TRUE(lock.take()) << "the holder's name is a courtesy";
    EXPECT_FALSE(Qx::FileLock(folder.path("missing/lock")).take(false));
}

TEST(FileLock, AForeignTextIsNoHolder) {
    const test::TemporaryFolder folder;
    for (const std::string& text :
         {std::string("\x1b[31mred"), std::string("\xff\xfe"), std::string(5000, 'x')}) {
        EXPECT_EQ(Qx::FileLock::holder(folder.write("lock", text)), "");
    }
}

} // namespace
