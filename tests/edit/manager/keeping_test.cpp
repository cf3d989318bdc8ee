#include "edit/manager/edit_manager.h"
#include "edit/manager/edit_manager_lock.h"
#include "platform/store/configb.h"
#include "support/memory_meter.h"
#include "tests/edit/manager/managed_project.h"
#include "tests/support/child_process.h"
#include "tests/support/faulty_file_system.h"
#include "tests/support/run_program.h"

#include <gtest/gtest.h>

#include <chrono>
#include <cstdlib>
#include <thread>

// What must not be lost, whatever fails or comes in between.

namespace {

using test::kEdit;
using test::ManagedProject;

TEST(Keeping, WhatIsNoFileIsRefusedByName) {
    for (const bool isLink : {true, false}) {
        const ManagedProject project;
        ManagedProject::save("sound");
        ASSERT_TRUE(edit_manager::backup_edit(kEdit));
        edit_manager::close_all_edits();
        const std::filesystem::path file((project.folder() + "/E0001000.qme").c_str());
        const std::filesystem::path away((project.folder() + "/elsewhere").c_str());
        std::filesystem::rename(file, away);
        isLink ? std::filesystem::create_symlink(away, file)
               : static_cast<void>(std::filesystem::create_directory(file));
        for (const auto behaviour : {eOpenExisting, eOpenOrCreate}) {
            EXPECT_FALSE(EditPtr(kEdit, behaviour).valid());
        }
        EXPECT_TRUE(project.log.contains(isLink ? "It is a symbolic link" : "Is a directory"));
        EXPECT_TRUE(isLink ? std::filesystem::is_symlink(file) : std::filesystem::is_directory(file));
        std::filesystem::remove(file);
        EXPECT_EQ(ManagedProject::nameOf(), "sound") << "and was not remembered as a failure";
    }
}

TEST(Keeping, AFileThatIsAwayForAnInstantIsFound) {
    const ManagedProject project;
    ManagedProject::save("0");
    edit_manager::close_all_edits();
    const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(2);
    const pid_t writer = ::fork();
    if (writer == 0) {
        for (int i = 1; std::chrono::steady_clock::now() < end; ++i) {
            ManagedProject::save(String::format("%d", i));
            static_cast<void>(edit_manager::backup_edit(kEdit).isOk());
        }
        ::_exit(0);
    }
    while (std::chrono::steady_clock::now() < end) {
        for (const auto behaviour : {eOpenExisting, eOpenOrCreate}) {
            const EditPtr edit(kEdit, behaviour);
            ASSERT_TRUE(edit.valid()) << project.log.log();
            EXPECT_FALSE(edit->getName().empty());
            edit_manager::invalidateCache(kEdit);
        }
    }
    int status = 0;
    ASSERT_EQ(::waitpid(writer, &status, 0), writer);
    EXPECT_FALSE(project.has("E0001000.qme.CORRUPT"));
}

TEST(Keeping, ClosingPutsBackTheFileThatBecameABackup) {
    for (const bool evicts : {false, true}) {
        const ManagedProject project;
        ManagedProject::save("whole");
        ASSERT_TRUE(edit_manager::backup_edit(kEdit));
        EXPECT_FALSE(project.has("E0001000.qme"));
        evicts ? edit_manager::limitEditCache(0) : ManagedProject::stopManager();
        EXPECT_TRUE(project.has("E0001000.qme") && project.has("E0001000.qme.U1"));
    }
    // A fresh edit without changes leaves none.
    const ManagedProject project;
    ASSERT_TRUE(EditPtr(kEdit, eOpenOrCreate).valid());
    ManagedProject::stopManager();
    EXPECT_FALSE(project.has("E0001000.qme"));
}

TEST(Keeping, WhatCouldNotBeWrittenWaitsToBe) {
    for (const bool byItself : {false, true}) {
        const ManagedProject project;
        ManagedProject::save("before");
        ASSERT_TRUE(edit_manager::backup_edit(kEdit));
        const EditPtr edit(kEdit, eOpenExisting);
        if (byItself) {
            edit->init_dirty();
        }
        {
            test::FaultyFileSystem system;
            system.fullAfter(100);
            EXPECT_FALSE(byItself ? edit->write_file() : edit_manager::backup_edit(kEdit).isOk());
            ManagedProject::change("changed later");
            EXPECT_EQ(edit_manager::numDirty(), 1U);
            EXPECT_FALSE(edit_manager::flush_changes());
        }
        EXPECT_TRUE(edit_manager::flush_changes());
        EXPECT_EQ(edit_manager::numDirty(), 0U);
        EXPECT_NE(project.read("E0001000.qme").find("changed later"), std::string::npos);
    }
}

TEST(Keeping, AFailedAllocationCostsNoChange) {
    bool isDone = false;
    for (size_t n = 1; !isDone; n += 1 + n / 12) {
        SCOPED_TRACE(testing::Message() << "allocation " << n);
        const ManagedProject project;
        ManagedProject::save("before");
        ManagedProject::change("after");
        {
            const test::FailingAllocations memory(n);
            try {
                edit_manager::flush_changes();
            } catch (const std::bad_alloc&) {
                // allowed
            }
            isDone = !memory.hasFailed();
        }
        EXPECT_TRUE(edit_manager::flush_changes()) << project.log.log();
        EXPECT_NE(project.read("E0001000.qme").find("after"), std::string::npos);
        // Reading: what memory kept from being read is not damaged.
        edit_manager::close_all_edits();
        {
            const test::FailingAllocations memory(n);
            try {
                static_cast<void>(EditPtr(kEdit, eOpenOrCreate).valid());
            } catch (const std::bad_alloc&) {
                // allowed
            }
            isDone = isDone && !memory.hasFailed();
        }
        EXPECT_EQ(ManagedProject::nameOf(), "after");
        EXPECT_FALSE(project.has("E0001000.qme.CORRUPT"));
        // Shutting down ends, and does not throw, without any memory from there on.
        ManagedProject::change("unsaved");
        const test::FailingAllocations memory(n, true);
        ManagedProject::stopManager();
    }
}

TEST(Keeping, AProgramThatJustEndsLosesNothing) {
    if (const char* const root = std::getenv("QUILLMARCH_TEST_FOLDER")) {
        Qx::CurrentProject current;
        current.rootFolder = root;
        Qx::setCurrentProject(current);
        ASSERT_EQ(edit_manager::theEditManager(), nullptr);
        ManagedProject::change("kept");
        EXPECT_NE(edit_manager::theEditManager(), nullptr) << "made when it was first needed";
        const pid_t copy = ::fork();
        if (copy == 0) {
            ManagedProject::change("of a copy of the process");
            std::exit(0);
        }
        int status = 0;
        EXPECT_EQ(::waitpid(copy, &status, 0), copy);
        return;
    }
    const ManagedProject project(false);
    const test::ProgramResult ended =
        test::runProgram(std::filesystem::read_symlink("/proc/self/exe").string(),
                         {"--gtest_filter=Keeping.AProgramThatJustEndsLosesNothing"},
                         {{"QUILLMARCH_TEST_FOLDER=" + project.root().path()}, {}});
    ASSERT_EQ(ended.code, 0) << ended.out << ended.err;
    EXPECT_NE(project.read("E0001000.qme").find("kept"), std::string::npos);
}

TEST(Keeping, AnotherProcessThatWritesHoldsUpOnlyWhoMoves) {
    const ManagedProject project;
    ManagedProject::save("sound");
    edit_manager::close_all_edits();
    int ready[2];
    ASSERT_EQ(::pipe(ready), 0);
    const pid_t holder = ::fork();
    if (holder == 0) {
        EditManagerLock lock;
        const bool taken = lock.take(true).isOk();
        static_cast<void>(::write(ready[1], "x", 1));
        std::this_thread::sleep_for(std::chrono::seconds(3));
        ::_exit(taken ? 0 : 1);
    }
    char byte = 0;
    ASSERT_EQ(::read(ready[0], &byte, 1), 1);
    const auto start = std::chrono::steady_clock::now();
    EXPECT_EQ(ManagedProject::nameOf(), "sound");
    EXPECT_EQ(ManagedProject::nameOf(cookie("E0002000")), "(null)");
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(2));
    ManagedProject::change("waits");
    EXPECT_TRUE(edit_manager::flush_changes());
    EXPECT_TRUE(project.log.contains("edit_manager: waiting to write: "));
    int status = 0;
    ASSERT_EQ(::waitpid(holder, &status, 0), holder);
    EXPECT_EQ(status, 0);
}

} // namespace
