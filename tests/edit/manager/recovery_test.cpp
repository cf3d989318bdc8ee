#include "edit/manager/edit_manager.h"
#include "tests/edit/manager/managed_project.h"
#include "tests/support/faulty_file_system.h"

#include <cstring>
#include <gtest/gtest.h>

#define XXH_INLINE_ALL
#include <xxhash.h>

namespace {

using test::kEdit;
using test::ManagedProject;

/// The bytes of an edit file of a given name.
std::string editBytes(const String& name) {
    ManagedProject project;
    ManagedProject::save(name);
    return project.read("E0001000.qme");
}

/// What a letter of a drawing stands for: a sound edit of that name, '!' a truncated one, '?' no edit at all.
std::string bytesFor(char letter) {
    switch (letter) {
    case '!': {
        const std::string whole = editBytes("cut");
        return whole.substr(0, whole.size() / 2);
    }
    case '?':
        return "This is not an edit.";
    default:
        return editBytes(String(1, letter));
    }
}

/// The names of the project's folder in a row: the edit file, undo 1 to 3, redo 1.
const char* const kNames[] = {"E0001000.qme", "E0001000.qme.U1", "E0001000.qme.U2", "E0001000.qme.U3",
                              "E0001000.qme.R1"};

const char* const kNoneUsable = "edit_manager::open( E0001000 ) - No usable backups found\n";

/// A sound store in which one object has a revision of the future.
std::string withNewerObject(std::string bytes, const std::string& object) {
    uint64_t table[2]; // where it is, and its length
    std::memcpy(table, bytes.data() + 24, sizeof table);
    const size_t layer = bytes.find(object, table[0]) + object.size();
    uint32_t layerLength = 0;
    std::memcpy(&layerLength, bytes.data() + layer, 4);
    bytes[layer + 4 + layerLength] = 99;
    for (const auto& [at, from, length] :
         {std::tuple<size_t, size_t, size_t>(40, table[0], table[1]), {56, 0, 56}}) {
        const uint64_t checksum = XXH3_64bits(bytes.data() + from, length);
        std::memcpy(bytes.data() + at, &checksum, 8);
    }
    return bytes;
}

TEST(Recovery, WhatALaterVersionWroteIsRefusedAndStays) {
    for (const char* const object : {"EditHeader", "Celid0"}) {
        SCOPED_TRACE(object);
        ManagedProject project;
        ManagedProject::save("older");
        ASSERT_TRUE(edit_manager::backup_edit(kEdit));
        ManagedProject::save("newer");
        edit_manager::close_all_edits();
        const std::string known = project.read(kNames[0]);
        const std::string later = withNewerObject(known, object);
        project.write(kNames[0], later);
        OpenReport report;
        EXPECT_FALSE(edit_manager::openEdit(kEdit, eOpenOrCreate, report).valid());
        EXPECT_EQ(report.status.code(), Qx::StatusCode::Newer) << report.status.reason();
        EXPECT_EQ(project.read(kNames[0]), later);
        EXPECT_TRUE(report.setAside.empty() && !project.has("E0001000.qme.CORRUPT"));
        // Nor is it stepped to.
        project.write(kNames[0], known);
        project.write(kNames[1], later);
        EXPECT_EQ(edit_manager::undoRequest(kEdit).code(), Qx::StatusCode::Refused);
        EXPECT_EQ(project.read(kNames[1]), later);
        EXPECT_EQ(ManagedProject::nameOf(), "newer");
    }
}

TEST(Recovery, EveryStateOfTheFilesOpensAsFarAsItCan) {
    const struct {
        const char* files;  ///< edit, U1, U2, U3, R1; '-' for none
        const char* opened; ///< the name of the edit that opens; null for none
        const char* left;   ///< the files afterwards
        int corrupt;        ///< how many files were set aside
        const char* logged;
    } cases[] = {
        {"E----", "E", "E----", 0, ""},
        {"EabcR", "E", "EabcR", 0, ""},
        {"-----", nullptr, "-----", 0, ""},
        {"----R", nullptr, "----R", 0, ""},
        {"-abcR", "a", "abc-R", 0, "open( E0001000 ) - missing, trying backup 1 \n"},
        {"--bc-", "b", "bc---", 0, "open( E0001000 ) - missing, trying backup 2 \n"},
        {"!a---", "a", "a----", 1, "trying backup 1\n"},
        {"?abcR", "a", "abc-R", 1, "trying backup 1\n"},
        {"!!b--", "b", "b----", 2, "trying backup 2\n"},
        {"?!?c-", "c", "c----", 3, "trying backup 3\n"},
        {"-!b--", "b", "b----", 1, "trying backup 1\n"},
        {"!-b--", "b", "b----", 1, "trying backup 1\n"},
        {"?----", nullptr, "-----", 1, ""},
        {"!?!?R", nullptr, "----R", 4, kNoneUsable},
    };
    for (const auto& [files, opened, left, corrupt, logged] : cases) {
        SCOPED_TRACE(files);
        std::string bytes[5];
        for (size_t i = 0; i < 5; ++i) {
            bytes[i] = files[i] == '-' ? "" : bytesFor(files[i]);
        }
        ManagedProject project;
        for (size_t i = 0; i < 5; ++i) {
            if (files[i] != '-') {
                project.write(kNames[i], bytes[i]);
            }
        }
        // The report, by where the letter that opens stands in the drawing.
        using Source = OpenReport::Source;
        const size_t from = opened == nullptr ? 0 : std::string_view(files).find(*opened);
        const bool isDamaged = opened == nullptr && corrupt > 0;
        for (const bool again : {false, true}) {
            OpenReport report;
            const EditPtr edit = edit_manager::openEdit(kEdit, eOpenExisting, report);
            EXPECT_EQ(edit.valid() ? edit->getName() : String("(null)"),
                      opened == nullptr ? "(null)" : opened);
            EXPECT_EQ(report.status.code(), isDamaged           ? Qx::StatusCode::Damaged
                                            : opened == nullptr ? Qx::StatusCode::NotFound
                                                                : Qx::StatusCode::Ok);
            if (again && opened != nullptr) {
                EXPECT_EQ(report.source, Source::Cache);
                break;
            }
            EXPECT_EQ(report.source, opened == nullptr ? Source::None
                                     : from == 0       ? Source::File
                                                       : Source::Backup);
            EXPECT_EQ(report.backup, opened == nullptr && corrupt > 1 ? corrupt - 1 : static_cast<int>(from));
            EXPECT_EQ(report.wasMissing, files[0] == '-');
            EXPECT_EQ(static_cast<int>(report.setAside.size()), corrupt);
            for (const OpenReport::SetAside& aside : report.setAside) {
                EXPECT_TRUE(std::filesystem::exists(aside.path.c_str()));
                EXPECT_EQ(aside.why.code(), Qx::StatusCode::Damaged);
            }
        }
        EXPECT_TRUE(project.log.contains(logged)) << project.log.log();
        EXPECT_EQ(project.log.standardOutput(), logged == kNoneUsable ? kNoneUsable : "");
        std::string found;
        for (size_t i = 0; i < 5; ++i) {
            const std::string now = project.read(kNames[i]);
            size_t origin = 0;
            while (origin < 5 && (files[origin] == '-' || bytes[origin] != now)) {
                ++origin;
            }
            found += now == "(missing)" ? '-' : origin < 5 ? files[origin] : '#';
        }
        EXPECT_EQ(found, left);
        // What does not read is kept, each under a name of its own.
        int setAside = 0;
        for (const auto& entry :
             std::filesystem::directory_iterator(std::filesystem::path(project.folder()))) {
            setAside += entry.path().string().find(".CORRUPT") != std::string::npos ? 1 : 0;
        }
        EXPECT_EQ(setAside, corrupt);
        if (corrupt > 0 && files[0] != '-') {
            EXPECT_EQ(project.read("E0001000.qme.CORRUPT"), bytes[0]);
        }
    }
}

TEST(Recovery, KeepsTheFirstThatWasSetAside) {
    ManagedProject project;
    for (const char* const bytes : {"first", "second", "third"}) {
        project.write("E0001000.qme", bytes);
        EXPECT_EQ(ManagedProject::nameOf(), "(null)");
        edit_manager::invalidateCache(kEdit);
    }
    EXPECT_EQ(project.read("E0001000.qme.CORRUPT"), "first");
    EXPECT_EQ(project.read("E0001000.qme.CORRUPT.1"), "second");
    EXPECT_EQ(project.read("E0001000.qme.CORRUPT.2"), "third");
    // Nothing in the depth can be restored, which is told.
    project.write("E0001000.qme.U11", "behind it");
    EXPECT_EQ(ManagedProject::nameOf(), "(null)");
    EXPECT_TRUE(project.log.contains("open( E0001000 ) - missing, trying backup 0 \n"));
}

TEST(Recovery, AFailureIsRememberedUntilItIsForgottenOrReplaced) {
    ManagedProject project;
    EXPECT_EQ(ManagedProject::nameOf(), "(null)");
    EXPECT_EQ(edit_manager::numCached(), 1U);
    EXPECT_FALSE(edit_manager::get_present(kEdit));
    const std::string sound = [] { return bytesFor('E'); }();
    Qx::CurrentProject again;
    again.rootFolder = project.root().path();
    Qx::setCurrentProject(again);
    ManagedProject::startManager();
    EXPECT_EQ(ManagedProject::nameOf(), "(null)");
    project.write("E0001000.qme", sound);
    test::FaultyFileSystem system;
    EXPECT_EQ(ManagedProject::nameOf(), "(null)");
    EXPECT_EQ(system.numOperations(), 0U) << "a remembered failure asks nothing of the disk";
    EXPECT_TRUE(edit_manager::invalidateCache(kEdit));
    EXPECT_FALSE(edit_manager::invalidateCache(kEdit));
    EXPECT_EQ(ManagedProject::nameOf(), "E");

    const cookie other("E0002000");
    EXPECT_FALSE(EditPtr(other, eOpenExisting).valid());
    EXPECT_FALSE(EditPtr(other, static_cast<eEditOpenBehaviour>(3)).valid());
    EXPECT_TRUE(EditPtr(other, eOpenNew).valid());
}

TEST(Recovery, WhatTheSystemRefusesIsNotSetAside) {
    ManagedProject project;
    ManagedProject::save("sound");
    ASSERT_TRUE(edit_manager::backup_edit(kEdit));
    ManagedProject::save("sound too");
    edit_manager::close_all_edits();
    {
        test::FaultyFileSystem system;
        system.failWhere("open read E0001000.qme", EMFILE);
        for (const auto behaviour : {eOpenExisting, eOpenOrCreate}) {
            EXPECT_FALSE(EditPtr(kEdit, behaviour).valid());
            edit_manager::invalidateCache(kEdit);
        }
        EXPECT_EQ(system.count("rename"), 0U);
    }
    EXPECT_EQ(ManagedProject::nameOf(), "sound too");
}

TEST(Recovery, AFileOfAnotherProgramIsKeptAsABackup) {
    const std::string theirs = bytesFor('T');
    ManagedProject project;
    ManagedProject::save("mine");
    ManagedProject::change("mine, changed");
    project.write("E0001000.qme", theirs);
    EXPECT_TRUE(edit_manager::flush_changes());
    EXPECT_EQ(project.read("E0001000.qme.U1"), theirs);
    EXPECT_TRUE(project.log.contains("changed by another program"));
    // Another process that opens an edit between a backup and the next write puts the backup back.
    ASSERT_TRUE(edit_manager::backup_edit(kEdit));
    const std::string kept = project.read("E0001000.qme.U1");
    std::filesystem::rename(std::filesystem::path(project.folder() + "/E0001000.qme.U1"),
                            std::filesystem::path(project.folder() + "/E0001000.qme"));
    EXPECT_TRUE(ManagedProject::save("more"));
    EXPECT_EQ(project.read("E0001000.qme.U1"), kept);
    // An edit that is started afresh does not bury the one that is there.
    edit_manager::close_all_edits();
    const std::string old = project.read("E0001000.qme");
    const EditPtr fresh(kEdit, eOpenNew);
    fresh->setName("fresh");
    EXPECT_TRUE(edit_manager::flush_changes());
    EXPECT_EQ(project.read("E0001000.qme.U1"), old);
}

} // namespace
