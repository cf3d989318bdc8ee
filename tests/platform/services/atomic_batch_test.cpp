#include "platform/services/atomic_batch.h"

#include "platform/services/atomic_file.h"
#include "support/every_fault.h"
#include "support/temporary_folder.h"

#include <filesystem>
#include <gtest/gtest.h>
#include <thread>

namespace {

using test::Fault;

Qx::FileError store(const String& path, std::string_view text) {
    Qx::AtomicFile file(path);
    if (auto error = file.write(text)) {
        return error;
    }
    return file.commit();
}

/// A folder with files "0" to "4" holding "old", and a batch in which they hold "new".
class AtomicBatchTest : public testing::Test {
protected:
    static constexpr int kFiles = 5;

    void fill() {
        for (int i = 0; i < kFiles; ++i) {
            folder.write(std::to_string(i), "old");
        }
    }
    Qx::FileError storeAll(Qx::AtomicBatch& batch) {
        for (int i = 0; i < kFiles; ++i) {
            if (auto error = store(folder.path(std::to_string(i)), "new")) {
                return error;
            }
        }
        return batch.commit();
    }
    [[nodiscard]] std::string contents() const {
        std::string all;
        for (int i = 0; i < kFiles; ++i) {
            all += folder.read(std::to_string(i)) + " ";
        }
        return all;
    }

    test::TemporaryFolder folder;
};

TEST_F(AtomicBatchTest, OneSyncServesAllFiles) {
    fill();
    test::FaultyFileSystem disk;
    Qx::AtomicBatch batch;
    ASSERT_FALSE(storeAll(batch));
    EXPECT_EQ(contents(), "new new new new new ");
    EXPECT_EQ(batch.numReplaced(), 5u);
    EXPECT_EQ(disk.count("sync all"), 1u);
    EXPECT_EQ(disk.count("sync folder"), 1u);
    EXPECT_EQ(disk.count("sync *.tmp"), 0u);
    const auto steps = disk.operations();
    const auto sync = std::find(steps.begin(), steps.end(), "sync all");
    for (int i = 0; i < kFiles; ++i) {
        EXPECT_EQ(*(sync + 1 + i), "rename *.tmp " + std::to_string(i)) << "in the order of enrolment";
    }
}

TEST_F(AtomicBatchTest, EachFolderIsSyncedOnce) {
    std::filesystem::create_directory(folder.path("sub").c_str());
    test::FaultyFileSystem disk;
    Qx::AtomicBatch batch;
    for (const char* name : {"a", "sub/b", "c", "sub/d"}) {
        ASSERT_FALSE(store(folder.path(name), "new"));
    }
    ASSERT_FALSE(batch.commit());
    EXPECT_EQ(disk.count("sync all"), 2u);
    EXPECT_EQ(disk.count("sync folder"), 2u);
    EXPECT_EQ(folder.read("sub/d"), "new");
}

TEST_F(AtomicBatchTest, WithoutACommitNothingChanges) {
    fill();
    {
        const Qx::AtomicBatch batch;
        Qx::AtomicFile file(folder.path("0"));
        ASSERT_FALSE(file.write("new"));
        ASSERT_FALSE(file.commit());
        EXPECT_FALSE(file.replaced());
        EXPECT_EQ(batch.size(), 1u);
        EXPECT_EQ(folder.read("0"), "old");
    }
    EXPECT_EQ(contents(), "old old old old old ");
    EXPECT_EQ(folder.numNames(), 5u);
    ASSERT_FALSE(store(folder.path("0"), "new"));
    EXPECT_EQ(folder.read("0"), "new") << "the thread has no batch any more";
}

TEST_F(AtomicBatchTest, AnyFaultLeavesEachFileOldOrNewInTheOrderOfEnrolment) {
    size_t replaced = 0;
    Qx::FileError error;
    const auto setUp = [&] { return fill(), 0; };
    const auto act = [&](int, const auto& arm) {
        arm();
        Qx::AtomicBatch batch;
        error = storeAll(batch);
        replaced = batch.numReplaced();
        return !error;
    };
    for (const Fault& fault : {Fault{Fault::Fails, EIO}, Fault{Fault::Killed}}) {
        const auto check = [&](int, const test::Met& met) {
            const std::string found = contents();
            const size_t numNew = static_cast<size_t>(std::count(found.begin(), found.end(), 'n'));
            std::string expected;
            for (size_t i = 0; i < kFiles; ++i) {
                expected += i < numNew ? "new " : "old ";
            }
            EXPECT_EQ(found, expected);
            if (fault.kind == Fault::Killed) {
                return;
            }
            EXPECT_EQ(numNew, replaced);
            EXPECT_EQ(folder.numNames(), 5u) << "a temporary file was left";
            if (met.operation.starts_with("rename")) {
                EXPECT_NE(error.text().find(String::format("(%zu of 5 files hold", replaced)), String::npos)
                    << error.text();
            } else {
                EXPECT_EQ(replaced, met.done || met.operation == "sync folder" ? 5u : 0u);
            }
        };
        EXPECT_GT(test::everyFault(fault, setUp, act, check), 15u);
    }
}

TEST_F(AtomicBatchTest, AnInnerBatchHandsItsFilesOver) {
    fill();
    Qx::AtomicBatch outer;
    {
        Qx::AtomicBatch inner;
        ASSERT_FALSE(store(folder.path("0"), "kept"));
        ASSERT_FALSE(inner.commit());
        ASSERT_FALSE(store(folder.path("1"), "dropped"));
    }
    EXPECT_EQ(outer.size(), 1u);
    EXPECT_EQ(contents(), "old old old old old ");
    ASSERT_FALSE(outer.commit());
    EXPECT_EQ(contents(), "kept old old old old ");
    EXPECT_EQ(folder.numNames(), 5u);
}

TEST_F(AtomicBatchTest, AnotherThreadAndAPauseAreOutsideOfIt) {
    fill();
    const Qx::AtomicBatch batch;
    std::thread([&] { EXPECT_FALSE(store(folder.path("0"), "new")); }).join();
    {
        const Qx::AtomicBatch::Pause pause;
        ASSERT_FALSE(store(folder.path("1"), "new"));
    }
    ASSERT_FALSE(store(folder.path("2"), "new"));
    EXPECT_EQ(contents(), "new new old old old ");
    EXPECT_EQ(batch.size(), 1u);
}

} // namespace
