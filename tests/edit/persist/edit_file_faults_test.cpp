#include "edit_samples.h"
#include "support/every_fault.h"
#include "support/temporary_folder.h"

#include <cstring>
#include <gtest/gtest.h>

namespace {

using test::Fault;
using test::stateOf;

/// An old edit in its file, and what a save makes of it.
class EditFileFaultsTest : public testing::Test {
protected:
    void SetUp() override {
        Edit edit;
        test::fillAtRandom(edit, 12);
        edit.init_dirty();
        ASSERT_TRUE(edit.write_file(path())) << edit.lastFileError();
        oldBytes = folder.read(kName);
        oldState = stateOf(edit);
    }
    [[nodiscard]] WString path() const { return Qx::widen(folder.path(kName)); }
    /// The old edit in its file again, open, with a change that a file shows.
    [[nodiscard]] std::unique_ptr<Edit> changed() const {
        for (const auto& entry : std::filesystem::directory_iterator(folder.path().c_str())) {
            std::filesystem::remove(entry.path()); // with what a dead process left
        }
        folder.write(kName, oldBytes);
        auto edit = std::make_unique<Edit>(path(), eOpenExisting);
        edit->setName("changed");
        std::mt19937 random(1);
        test::addPairs(*edit, 0, 40, random);
        return edit;
    }
    /// What the file holds: "old", or the name of the edit in it.
    [[nodiscard]] String contents() const {
        const Edit read(path(), eOpenExisting);
        return read.isBad()                ? "bad: " + read.lastFileError()
               : stateOf(read) == oldState ? "old"
                                           : read.getName();
    }
    void expectReason(const Edit& edit, int code) const {
        EXPECT_NE(edit.lastFileError().find(folder.path()), String::npos) << edit.lastFileError();
        EXPECT_NE(edit.lastFileError().find(std::strerror(code)), String::npos) << edit.lastFileError();
    }

    static constexpr const char* kName = "E0001000.qme";
    test::TemporaryFolder folder;
    std::string oldBytes;
    std::string oldState;
};

TEST_F(EditFileFaultsTest, ASaveLosesNothing) {
    for (const Fault& fault : {Fault{Fault::Killed}, Fault{Fault::Fails, EIO}, Fault{Fault::Fails, ENOSPC},
                               Fault{Fault::Fails, EACCES}, Fault{Fault::Fails, EINTR}}) {
        std::set<String> seen;
        const auto save = [&](const std::unique_ptr<Edit>& edit, const auto& arm) {
            arm();
            return edit->write_file(path());
        };
        const auto check = [&](const std::unique_ptr<Edit>& edit, const test::Met& met) {
            const String now = contents();
            seen.insert(now);
            EXPECT_TRUE(now == "changed" || (now == "old" && !met.done)) << now;
            if (fault.kind == Fault::Killed) {
                return;
            }
            EXPECT_EQ(folder.numNames(), 1U) << "a temporary file stayed behind";
            EXPECT_EQ(edit->isDirty(true), !met.done);
            EXPECT_EQ(edit->lastFileError().empty(), met.done);
            if (!met.done) {
                expectReason(*edit, fault.code);
            }
            edit->init_dirty();
            ASSERT_TRUE(edit->write_file(path())) << edit->lastFileError();
            EXPECT_EQ(stateOf(Edit(path(), eOpenExisting)), stateOf(*edit));
        };
        EXPECT_GT(test::everyFault(
                      fault, [this] { return changed(); }, save, check),
                  3U);
        EXPECT_EQ(seen.size(), fault.code == EINTR ? 1U : 2U);
    }
}

TEST_F(EditFileFaultsTest, AFullDiskOrShortWritesLoseNothing) {
    for (const size_t room : {0, 1, 64, 500, 3000}) {
        const auto edit = changed();
        test::FaultyFileSystem faulty;
        faulty.fullAfter(room);
        EXPECT_FALSE(edit->write_file(path())) << room;
        expectReason(*edit, ENOSPC);
        EXPECT_EQ(folder.read(kName), oldBytes);
        EXPECT_EQ(folder.numNames(), 1U);
        faulty.reset();
        faulty.shortTransfers(7);
        EXPECT_TRUE(edit->write_file(path())) << edit->lastFileError();
        EXPECT_EQ(contents(), "changed");
    }
}

TEST_F(EditFileFaultsTest, AReadThatFailsAnywhereSaysWhy) {
    for (const int code : {EIO, EACCES, EINTR}) {
        const auto read = [&](const std::unique_ptr<Edit>& edit, const auto& arm) {
            arm();
            return edit->readFile(path(), eOpenExisting) == Edit::kReadOk;
        };
        const auto check = [&](const std::unique_ptr<Edit>& edit, const test::Met& met) {
            EXPECT_TRUE(met.done || code != EINTR) << "an interruption is no failure";
            if (met.done) {
                EXPECT_EQ(stateOf(*edit), oldState);
            } else {
                EXPECT_EQ(edit->getNumChans(), 0);
                expectReason(*edit, code);
            }
        };
        EXPECT_GT(test::everyFault(
                      {Fault::Fails, code}, [] { return std::make_unique<Edit>(); }, read, check),
                  2U);
    }
}

} // namespace
