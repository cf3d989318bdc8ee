#include "edit_samples.h"
#include "support/child_process.h"
#include "support/faulty_file_system.h"
#include "support/temporary_folder.h"

#include <chrono>
#include <cstring>
#include <gtest/gtest.h>
#include <thread>

namespace {

using test::stateOf;

// An old edit in its file, and what a save makes of it.
class EditFileFaultsTest : public testing::Test {
protected:
    void SetUp() override {
        Edit edit;
        test::fillAtRandom(edit, 12);
        edit.init_dirty();
        ASSERT_TRUE(edit.write_file(path())) << edit.lastFileError();
        oldBytes = test::bytesOf(folder.path(kName));
        oldState = stateOf(edit);
    }
    [[nodiscard]] WString path() const { return Qx::widen(folder.path(kName)); }
    // The edit of the file with a change that a file shows.
    void change(Edit& edit) const {
        edit.setName("changed");
        std::mt19937 random(1);
        test::addPairs(edit, 0, 40, random);
    }
    // What the file holds: the name of the edit in it.
    [[nodiscard]] String contents(String* state = nullptr) const {
        const Edit read(path(), eOpenExisting);
        if (read.isBad()) {
            return "bad: " + read.lastFileError();
        }
        if (state != nullptr) {
            *state = stateOf(read);
        }
        return read.getName().empty() ? String("old") : read.getName();
    }

    static constexpr const char* kName = "E0001000.qme";
    test::TemporaryFolder folder;
    std::string oldBytes;
    std::string oldState;
};

TEST_F(EditFileFaultsTest, ASaveThatFailsAnywhereLosesNothing) {
    size_t operations = 0;
    {
        Edit edit(path(), eOpenExisting);
        change(edit);
        test::FaultyFileSystem faulty;
        ASSERT_TRUE(edit.write_file(path()));
        operations = faulty.numOperations();
    }
    ASSERT_GT(operations, 5U);
    for (const int code : {EIO, ENOSPC, EACCES, EROFS, EINTR}) {
        for (size_t n = 1; n <= operations; ++n) {
            SCOPED_TRACE(String::format("error %d at operation %zu", code, n));
            std::filesystem::remove(folder.path(kName));
            folder.write(kName, oldBytes);
            Edit edit(path(), eOpenExisting);
            change(edit);
            test::FaultyFileSystem faulty;
            faulty.failAt(n, code);
            const bool stored = edit.write_file(path());
            SCOPED_TRACE(n <= faulty.numOperations() ? faulty.operations()[n - 1] : String("never reached"));
            faulty.reset();
            if (stored) {
                EXPECT_EQ(contents(), "changed");
                EXPECT_FALSE(edit.isDirty(true));
                EXPECT_EQ(edit.lastFileError(), "");
            } else {
                EXPECT_TRUE(test::bytesOf(folder.path(kName)) == oldBytes || contents() == "changed");
                EXPECT_TRUE(edit.isDirty(false));
                EXPECT_NE(edit.lastFileError().find(folder.path()), String::npos) << edit.lastFileError();
                EXPECT_NE(edit.lastFileError().find(std::strerror(code)), String::npos)
                    << edit.lastFileError();
            }
            EXPECT_EQ(folder.numNames(), 1U) << "a temporary file stayed behind";
            edit.init_dirty();
            ASSERT_TRUE(edit.write_file(path())) << edit.lastFileError();
            String state;
            EXPECT_EQ(contents(&state), "changed");
            EXPECT_EQ(std::string(state), stateOf(edit));
        }
    }
}

TEST_F(EditFileFaultsTest, ADiskThatGoesOrFillsUpLosesNothing) {
    for (const size_t room : {0, 1, 64, 500, 3000}) {
        SCOPED_TRACE(room);
        Edit edit(path(), eOpenExisting);
        change(edit);
        test::FaultyFileSystem faulty;
        faulty.fullAfter(room);
        EXPECT_FALSE(edit.write_file(path()));
        EXPECT_NE(edit.lastFileError().find(std::strerror(ENOSPC)), String::npos) << edit.lastFileError();
        EXPECT_EQ(test::bytesOf(folder.path(kName)), oldBytes);
        EXPECT_TRUE(edit.isDirty(false));
        EXPECT_EQ(folder.numNames(), 1U);
    }
    Edit edit(path(), eOpenExisting);
    change(edit);
    test::FaultyFileSystem faulty;
    faulty.failFrom(1, EIO);
    EXPECT_FALSE(edit.write_file(path()));
    faulty.reset();
    EXPECT_EQ(test::bytesOf(folder.path(kName)), oldBytes);
    faulty.shortTransfers(7);
    EXPECT_TRUE(edit.write_file(path())) << edit.lastFileError();
    EXPECT_EQ(contents(), "changed");
}

TEST_F(EditFileFaultsTest, AReadThatFailsAnywhereSaysWhy) {
    size_t operations = 0;
    {
        test::FaultyFileSystem faulty;
        ASSERT_EQ(contents(), "old");
        operations = faulty.numOperations();
    }
    for (const int code : {EIO, EACCES, EINTR}) {
        for (size_t n = 1; n <= operations; ++n) {
            test::FaultyFileSystem faulty;
            faulty.failAt(n, code);
            const Edit edit(path(), eOpenExisting);
            SCOPED_TRACE(faulty.operations()[n - 1] + ", " + std::strerror(code));
            if (!edit.isBad()) {
                EXPECT_EQ(stateOf(edit), oldState);
                continue;
            }
            EXPECT_NE(code, EINTR) << "an interruption is no failure";
            EXPECT_EQ(edit.getNumChans(), 0);
            EXPECT_NE(edit.lastFileError().find(folder.path(kName)), String::npos) << edit.lastFileError();
            EXPECT_NE(edit.lastFileError().find(std::strerror(code)), String::npos) << edit.lastFileError();
        }
    }
    test::FaultyFileSystem faulty;
    faulty.shortTransfers(7);
    EXPECT_EQ(contents(), "old");
}

TEST_F(EditFileFaultsTest, DeathAtAnyWriteLeavesTheOldEditOrTheNewOne) {
    size_t writes = 0;
    {
        Edit edit(path(), eOpenExisting);
        change(edit);
        test::FaultyFileSystem faulty;
        ASSERT_TRUE(edit.write_file(path()));
        writes = faulty.numWrites();
    }
    ASSERT_GT(writes, 3U);
    bool sawOld = false;
    bool sawNew = false;
    for (size_t n = 1; n <= writes; ++n) {
        SCOPED_TRACE(n);
        std::filesystem::remove(folder.path(kName));
        folder.write(kName, oldBytes);
        const auto end = test::runInChild([&] {
            Edit edit(path(), eOpenExisting);
            change(edit);
            test::FaultyFileSystem faulty;
            faulty.killAtWrite(n);
            return edit.write_file(path());
        });
        EXPECT_EQ(end, test::ChildEnd::Killed);
        const String now = contents();
        sawOld = sawOld || now == "old";
        sawNew = sawNew || now == "changed";
        EXPECT_TRUE(now == "old" || now == "changed") << now;
    }
    EXPECT_TRUE(sawOld && sawNew);
}

TEST_F(EditFileFaultsTest, DeathAtAnyMomentOfManySavesLeavesAnEdit) {
    std::mt19937 random(99);
    const auto until = std::chrono::steady_clock::now() + std::chrono::seconds(3);
    int rounds = 0;
    for (; std::chrono::steady_clock::now() < until; ++rounds) {
        const pid_t child = ::fork();
        ASSERT_GE(child, 0);
        if (child == 0) {
            Edit edit(path(), eOpenExisting);
            for (int i = 0;; ++i) {
                edit.setName("save " + std::to_string(i));
                edit.init_dirty(); // the name may be that of the last save already
                if (!edit.write_file(path())) {
                    ::_exit(1);
                }
            }
        }
        std::this_thread::sleep_for(std::chrono::microseconds(2000 + random() % 40000));
        ::kill(child, SIGKILL);
        int status = 0;
        ASSERT_EQ(::waitpid(child, &status, 0), child);
        ASSERT_TRUE(WIFSIGNALED(status)) << "a save failed";
        const String now = contents();
        ASSERT_TRUE(now == "old" || now.starts_with("save ")) << now;
    }
    EXPECT_GT(rounds, 5);
}

} // namespace
