#include "edit/manager/leftovers.h"
#include "edit/manager/recovery.h"
#include "tests/edit/manager/managed_project.h"
#include "tests/support/faulty_file_system.h"

#include <gtest/gtest.h>

namespace {

using test::kEdit;
using test::ManagedProject;

/// The states in one text, each as far as a person sees it.
String textOf(const RevisionList& list) {
    String text;
    for (const Revision& its : list.revisions) {
        text += its.which + " " + its.name + " " + std::to_string(its.modifications) + " " + its.change +
                String::format(" %lld ", static_cast<long long>(its.time)) + its.damage + "\n";
    }
    return text;
}

/// An edit "c" with the undo backups "b" and "a", a milestone of "a" and a damaged file set aside.
void makeStates(const ManagedProject& project) {
    for (const char* name : {"a", "b", "c"}) {
        ASSERT_TRUE(ManagedProject::save(name) && (*name == 'c' || edit_manager::backup_edit(kEdit)));
    }
    edit_manager::close_all_edits();
    std::filesystem::create_directories((project.folder() + "/Milestones/E0001000").c_str());
    project.write("Milestones/E0001000/E0001000.3", project.read("E0001000.qme.U2"));
    project.write("E0001000.qme.CORRUPT", "This is not an edit.");
    project.write("E0001000.qme.RECOVERY", "half");
}

TEST(Revisions, WhatTheSystemCouldNotTellIsTold) {
    const ManagedProject project;
    makeStates(project);
    const String whole = textOf(revisionsOf(kEdit));
    ASSERT_EQ(std::count(whole.begin(), whole.end(), '\n'), 5) << whole;
    test::FaultyFileSystem disk;
    std::vector<Leftover> leftovers;
    for (size_t n = 1;; ++n) {
        disk.reset();
        disk.failAt(n, EIO);
        const RevisionList list = revisionsOf(kEdit);
        if (disk.numOperations() < n) {
            break;
        }
        SCOPED_TRACE(disk.operations()[n - 1]);
        bool isTold = !list.unanswered.empty();
        for (const Revision& revision : list.revisions) {
            const bool failed = revision.refused && !revision.isSound();
            isTold = isTold || failed;
            // What could not be read is never taken for damaged.
            EXPECT_TRUE(failed || revision.isSound() || revision.kind == Revision::Corrupt);
        }
        EXPECT_TRUE(isTold || textOf(list) == whole) << textOf(list);
    }
    for (const char* folder : {"list P0001000", "list Milestones", "list E0001000"}) {
        disk.reset();
        disk.failWhere(folder, EIO);
        EXPECT_FALSE(findLeftovers(project.folder(), leftovers)) << folder;
    }
    disk.reset();
    leftovers.clear();
    EXPECT_TRUE(findLeftovers(project.folder(), leftovers));
    ASSERT_EQ(leftovers.size(), 1U);
    EXPECT_EQ(leftovers[0].kind, Leftover::RecoveryCopy);
}

TEST(Revisions, ARecoveryKeepsWhatItReplacesAndRefusesWhatIsInUseOrChanged) {
    const ManagedProject project;
    makeStates(project);
    const auto recover = [](const RevisionList& list, const char* which, String& kept) {
        for (const Revision& revision : list.revisions) {
            if (revision.which == which) {
                return recoverEdit(kEdit, list, revision, kept);
            }
        }
        return Qx::Status::failure("there is no such state");
    };
    String kept;
    const RevisionList list = revisionsOf(kEdit);
    {
        const EditPtr held(kEdit, eOpenExisting);
        EXPECT_FALSE(recover(list, "M3", kept));
    }
    EXPECT_FALSE(recover(list, "CORRUPT", kept));
    ASSERT_TRUE(recover(list, "M3", kept)) << recover(list, "M3", kept).reason();
    EXPECT_EQ(Qx::fileNameOf(kept), "E0001000.qme.U1");
    EXPECT_EQ(ManagedProject::nameOf(), "a"); // not the one that was in the cache
    EXPECT_FALSE(recover(list, "U2", kept));  // another file has that name by now
    EXPECT_EQ(ManagedProject::nameOf(), "a");

    project.write("E0001000.qme", "torn");
    ASSERT_TRUE(recover(revisionsOf(kEdit), "U1", kept));
    EXPECT_EQ(Qx::fileNameOf(kept), "E0001000.qme.CORRUPT.1");
    edit_manager::close_all_edits();
    EXPECT_EQ(ManagedProject::nameOf(), "c");
}

} // namespace
