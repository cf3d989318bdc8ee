#include "edit/manager/milestone_ring.h"
#include "edit/project/permissions_manager.h"
#include "platform/services/config_int.h"
#include "tests/edit/manager/managed_project.h"
#include "tests/support/edit_state.h"
#include "tests/support/faulty_file_system.h"

#include <gtest/gtest.h>

#include <fstream>
#include <random>

namespace {

using test::kEdit;
using test::ManagedProject;

/// A setting while it lives.
class Setting {
public:
    Setting(const char* name, int value) : m_name(name) { Qx::setConfigInt(name, value); }
    ~Setting() { Qx::clearConfigInt(m_name); }
    Setting(const Setting&) = delete;
    Setting& operator=(const Setting&) = delete;

private:
    const char* m_name;
};

void randomChange(std::mt19937& random, int number) {
    const EditPtr edit(kEdit, eOpenExisting);
    const std::lock_guard<criticalSection> hold(edit->section());
    switch (random() % 4) {
    case 0:
        edit->addChan(AudioChan);
        break;
    case 1:
        edit->set_current_time(0, 1.0 + number);
        break;
    case 2:
        edit->get_edit_cel_p(0)->appendEventPair(cookie(Cookie_Type::Material, number + 1, 0), number,
                                                 edit->getEndTime(), 2.5);
        edit->setChangeDescription(kOpInsert, true);
        break;
    default:
        break;
    }
    edit->setName(String::format("revision %d", number));
}

TEST(Undo, GoesBackToTheStartAndOnToTheEnd) {
    for (unsigned seed = 1; seed <= 3; ++seed) {
        SCOPED_TRACE(testing::Message() << "seed " << seed);
        std::mt19937 random(seed);
        ManagedProject project;
        std::vector<std::string> revisions;
        std::vector<String> contents;
        const auto content = [] { return test::contentState(*EditPtr(kEdit, eOpenExisting)); };
        ManagedProject::save("start");
        constexpr int kSteps = 10;
        for (int i = 0; i < kSteps; ++i) {
            revisions.push_back(project.read("E0001000.qme"));
            contents.push_back(content());
            ASSERT_TRUE(edit_manager::backup_edit(kEdit));
            EXPECT_FALSE(project.has("E0001000.qme"));
            randomChange(random, i);
            ASSERT_TRUE(edit_manager::flush_changes());
            // The backup is the file itself; what was read of the bytes before it holds.
            EXPECT_EQ(project.read("E0001000.qme.U1"), revisions.back());
        }
        revisions.push_back(project.read("E0001000.qme"));
        contents.push_back(content());
        const auto check = [&](int at, bool untold) {
            // The file is the revision's, until what is said of the step is written.
            if (untold) {
                EXPECT_EQ(project.read("E0001000.qme"), revisions[static_cast<size_t>(at)]) << at;
            }
            const EditPtr edit(kEdit, eOpenExisting);
            ASSERT_TRUE(edit.valid());
            EXPECT_TRUE(edit->isDirty(true));
            EXPECT_EQ(test::contentState(*edit), contents[static_cast<size_t>(at)]);
            EXPECT_EQ(edit->getName(), at == 0 ? String("start") : String::format("revision %d", at - 1));
            EXPECT_EQ(edit_manager::undoExists(kEdit), at > 0);
            EXPECT_EQ(edit_manager::redoExists(kEdit), at < kSteps);
        };
        for (int round = 0; round < 2; ++round) {
            for (int at = kSteps - 1; at >= 0; --at) {
                ASSERT_TRUE(edit_manager::undoRequest(kEdit));
                check(at, round == 0);
            }
            EXPECT_EQ(edit_manager::undoRequest(kEdit).code(), Qx::StatusCode::NotFound);
            for (int at = 1; at <= kSteps; ++at) {
                ASSERT_TRUE(edit_manager::redoRequest(kEdit));
                check(at, false);
            }
            EXPECT_FALSE(edit_manager::redoRequest(kEdit));
        }
        // A backup after an undo ends what could be redone.
        ASSERT_TRUE(edit_manager::undoRequest(kEdit));
        ASSERT_TRUE(edit_manager::backup_edit(kEdit));
        EXPECT_FALSE(edit_manager::redoExists(kEdit));
    }
}

TEST(Undo, TellsThoseWhoHoldTheEditAndThoseWhoOpenItAgain) {
    ManagedProject project;
    ManagedProject::save("a");
    ASSERT_TRUE(edit_manager::backup_edit(kEdit));
    ManagedProject::save("b");
    const EditPtr held(kEdit, eOpenExisting);
    std::vector<String> heard;
    const auto watch = [&](const EditPtr& edit, const char* who) {
        return edit->addListener({}, [&heard, who](const NotifyMsg& message) {
            heard.push_back(String(who) + message.type().name() + " " + message.text());
        });
    };
    const auto guard = watch(held, "");
    std::vector<Qx::Ptr<Qx::Guard>> guards;
    EditPtr reopened;
    const auto follow = edit_manager::registerNotification(
        edit_manager::invalidateCacheMsgType(),
        [&](const NotifyMsg& message) { heard.push_back(message.text()); });
    held->set_cel_cues_loaded(true);
    held->setOwner("bert", false);
    ASSERT_TRUE(edit_manager::undoRequest(kEdit));
    reopened = EditPtr(kEdit, eOpenExisting);
    EXPECT_NE(static_cast<Edit*>(reopened), static_cast<Edit*>(held));
    EXPECT_EQ(heard,
              (std::vector<String>{"impendingRevChange E0001000 2", "E0001000", "revChange E0001000 2"}));
    EXPECT_TRUE(reopened->get_cel_cues_loaded());
    EXPECT_EQ(reopened->getOwner(), "bert");
    EXPECT_EQ(reopened->getChangeDescription(), EditModification(kNameChanged).invert());
    EXPECT_EQ(edit_manager::numDirty(), 1U) << "what is said of the step reaches the file";
    const uint64_t count = reopened->getModificationCount();
    // What is done to the object that was left behind does not reach the file.
    held->setName("stale");
    EXPECT_TRUE(edit_manager::flush_changes());
    edit_manager::close_all_edits();
    EXPECT_EQ(ManagedProject::nameOf(), "a");
    const EditPtr stored(kEdit, eOpenExisting);
    EXPECT_EQ(stored->getOwner(), "bert");
    EXPECT_EQ(stored->getChangeDescription(), EditModification(kNameChanged).invert());
    EXPECT_EQ(stored->getModificationCount(), count);
    ASSERT_TRUE(edit_manager::redoRequest(kEdit));
    EXPECT_EQ(EditPtr(kEdit, eOpenExisting)->getChangeDescription(), EditModification(kNameChanged));
}

TEST(Undo, TheClipboardGoesWithTheRevisionThatUsedIt) {
    for (const bool follows : {true, false}) {
        const Setting setting("undo_clipboard", follows ? 1 : 0);
        ManagedProject project;
        ManagedProject::save("edit before");
        ManagedProject::save("clip before", clipboard_cookie);
        ASSERT_TRUE(edit_manager::backup_edit(kEdit));
        ASSERT_TRUE(edit_manager::backup_edit(clipboard_cookie));
        ManagedProject::save("clip after", clipboard_cookie);
        EditPtr(kEdit, eOpenExisting)->Opts().setInt("CLIPBOARD_USED", 1);
        ManagedProject::save("edit after");
        ASSERT_TRUE(edit_manager::undoRequest(kEdit));
        EXPECT_EQ(ManagedProject::nameOf(), "edit before");
        EXPECT_EQ(ManagedProject::nameOf(clipboard_cookie), follows ? "clip before" : "clip after");
        ASSERT_TRUE(edit_manager::redoRequest(kEdit));
        EXPECT_EQ(ManagedProject::nameOf(clipboard_cookie), "clip after");
        ASSERT_TRUE(edit_manager::backup_edit(kEdit));
        EXPECT_EQ(EditPtr(kEdit, eOpenExisting)->Opts().getInt("CLIPBOARD_USED", 7), 0);
    }
}

TEST(Undo, KeepsToTheDepthAndToReadOnlyMarks) {
    for (const int depth : {-3, 1, 2}) {
        const Setting setting("backup_depth", depth);
        ManagedProject project;
        for (int i = 0; i < 4; ++i) {
            ManagedProject::save(String::format("%d", i));
            ASSERT_TRUE(edit_manager::backup_edit(kEdit));
        }
        EXPECT_EQ(edit_manager::backupDepth(), std::max(depth, 1));
        EXPECT_TRUE(project.has("E0001000.qme.U1"));
        EXPECT_EQ(project.has("E0001000.qme.U2"), depth == 2);
        EXPECT_FALSE(project.has("E0001000.qme.U3"));
    }
    ManagedProject project;
    ManagedProject::save("a");
    ASSERT_TRUE(PermissionsManager::setReadOnly(kEdit, true));
    EXPECT_EQ(edit_manager::backup_edit(kEdit).code(), Qx::StatusCode::ReadOnly);
    EXPECT_TRUE(project.log.contains("Attempt to backup read-only edit\n"));
    EXPECT_FALSE(project.has("E0001000.qme.U1"));
    EXPECT_FALSE(edit_manager::backup_edit(cookie("E0009000"))) << "there is none";
}

TEST(Undo, WhatDoesNotOpenIsNeverSteppedTo) {
    const std::string bad = "This is not an edit.";
    for (const bool redo : {false, true}) {
        for (const bool oneBehindIsSound : {false, true}) {
            SCOPED_TRACE(testing::Message() << "redo " << redo << ", one behind it " << oneBehindIsSound);
            ManagedProject project;
            for (const char* const name : {"a", "b"}) {
                ManagedProject::save(name);
                ASSERT_TRUE(edit_manager::backup_edit(kEdit));
            }
            ManagedProject::save("c");
            if (redo) {
                ASSERT_TRUE(edit_manager::undoRequest(kEdit) && edit_manager::undoRequest(kEdit));
                ASSERT_TRUE(edit_manager::flush_changes());
            }
            const std::string chain = redo ? "E0001000.qme.R" : "E0001000.qme.U";
            project.write(chain + "1", bad);
            if (!oneBehindIsSound) {
                project.write(chain + "2", bad.substr(1));
            }
            const std::string file = project.read("E0001000.qme");
            EXPECT_EQ((redo ? edit_manager::redoRequest(kEdit) : edit_manager::undoRequest(kEdit)).isOk(),
                      oneBehindIsSound);
            EXPECT_EQ(ManagedProject::nameOf(), redo == oneBehindIsSound ? "c" : "a");
            if (oneBehindIsSound) {
                EXPECT_EQ(project.read("E0001000.qme.CORRUPT"), bad);
                EXPECT_TRUE(redo ? edit_manager::undoRequest(kEdit) : edit_manager::redoRequest(kEdit));
                EXPECT_EQ(ManagedProject::nameOf(), redo ? "a" : "c");
            } else {
                EXPECT_EQ(project.read("E0001000.qme"), file);
                EXPECT_EQ(project.read(chain + "1"), bad);
                EXPECT_EQ(project.read(chain + "2"), bad.substr(1));
            }
        }
    }
}

TEST(Undo, ABackupIsWhatTheEditIsWhateverBecameOfItsFile) {
    const std::string theirs = [] {
        ManagedProject project;
        ManagedProject::save("theirs");
        return project.read("E0001000.qme");
    }();
    for (const std::string& became : {std::string("This is not an edit."), theirs, std::string()}) {
        for (const bool unnoticed : {false, true}) {
            ManagedProject project;
            ManagedProject::save("mine");
            const std::filesystem::path file((project.folder() + "/E0001000.qme").c_str());
            const std::string whole = project.read("E0001000.qme");
            const auto time = std::filesystem::last_write_time(file);
            std::string put = became;
            if (unnoticed) {
                put = whole;
                put[put.size() / 2] = static_cast<char>(put[put.size() / 2] ^ 1);
            }
            std::ofstream(file, std::ios::binary) << put;
            if (unnoticed) {
                std::filesystem::last_write_time(file, time);
            }
            ASSERT_TRUE(edit_manager::backup_edit(kEdit));
            ManagedProject::stopManager();
            std::filesystem::remove(file);
            ManagedProject::startManager();
            EXPECT_EQ(ManagedProject::nameOf(), "mine");
            EXPECT_EQ(edit_manager::undoExists(kEdit), put == theirs) << "bad bytes are no backup";
        }
    }
}

TEST(Undo, AFullDiskLeavesTheEditUnderItsName) {
    ManagedProject project;
    ManagedProject::save("a");
    ASSERT_TRUE(edit_manager::backup_edit(kEdit));
    ManagedProject::save("b");
    ASSERT_TRUE(edit_manager::undoRequest(kEdit));
    ASSERT_TRUE(edit_manager::flush_changes());
    ManagedProject::change("new");
    for (const char* const what : {"write", "rename E0001000.qme E0001000.qme.U1", "sync folder"}) {
        test::FaultyFileSystem system;
        system.failWhere(what, ENOSPC);
        EXPECT_EQ(edit_manager::backup_edit(kEdit).code(), Qx::StatusCode::Full) << what;
        EXPECT_TRUE(project.has("E0001000.qme"));
        EXPECT_TRUE(project.log.contains("E0001000.qme") && project.log.contains("No space left"));
        EXPECT_TRUE(edit_manager::redoExists(kEdit) || String(what) == "sync folder");
    }
    EXPECT_TRUE(edit_manager::backup_edit(kEdit));
    EXPECT_EQ(ManagedProject::nameOf(), "new");
}

TEST(Undo, AnswersForTheStepItMadeWhereverOneCallFails) {
    for (size_t n = 1, made = n; made >= n; ++n) {
        ManagedProject project;
        ManagedProject::save("a");
        ASSERT_TRUE(edit_manager::backup_edit(kEdit));
        ManagedProject::change("b");
        bool done = false;
        {
            test::FaultyFileSystem system;
            system.failAt(n, EMFILE);
            done = edit_manager::undoRequest(kEdit).isOk();
            made = system.operations().size();
        }
        EXPECT_EQ(ManagedProject::nameOf(), done ? "a" : "b") << "call " << n;
    }
}

TEST(Milestones, AreDueByCountAndGoRoundTheSlots) {
    const struct {
        unsigned mods;
        unsigned perEdit;
        uint64_t count;
        int64_t last;
        bool due;
        uint64_t slot;
    } cases[] = {
        {10, 10, 25, 10, true, 2}, {10, 10, 19, 10, false, 1}, {10, 10, 20, 10, true, 2},
        {10, 10, 99, 0, true, 9},  {10, 10, 100, 0, true, 0},  {10, 10, 9, 0, false, 0},
        {5, 4, 19, 0, true, 4},    {0, 10, 25, 0, false, 0},   {10, 0, 25, 0, false, 0},
        {1, 1, 7, 6, true, 0},
    };
    for (const auto& [mods, perEdit, count, last, due, slot] : cases) {
        const MilestoneRing ring(mods, perEdit);
        const EditPtr edit(new Edit);
        edit->Opts().setInt64("MOD_COUNT", static_cast<int64_t>(count));
        edit->Opts().setInt64("MILESTONE", last);
        EXPECT_EQ(ring.isMilestoneBackupRequired(edit), due) << count << " after " << last;
        EXPECT_EQ(ring.slot(count), slot) << count;
        edit->set_cookie(clipboard_cookie);
        EXPECT_FALSE(ring.isMilestoneBackupRequired(edit));
    }
}

TEST(Milestones, AreCopiesOfTheFileMadeWhileFlushing) {
    ManagedProject project;
    const auto slot = [&](int number) {
        return project.root().read("P0001000/Milestones/E0001000/E0001000." + std::to_string(number));
    };
    for (int i = 1; i <= 9; ++i) {
        ManagedProject::change(String::format("%d", i));
    }
    EXPECT_TRUE(edit_manager::flush_changes());
    EXPECT_EQ(slot(0), "(missing)");
    ManagedProject::change("ten");
    EXPECT_TRUE(edit_manager::flush_changes());
    EXPECT_EQ(slot(1), project.read("E0001000.qme"));
    EXPECT_EQ(EditPtr(kEdit, eOpenExisting)->Opts().getInt64("MILESTONE"), 10);
    ManagedProject::change("eleven");
    EXPECT_TRUE(edit_manager::flush_changes());
    EXPECT_NE(slot(1), project.read("E0001000.qme"));
    EXPECT_EQ(slot(1).size() > 100, true);
    EXPECT_EQ(slot(2), "(missing)");
}

} // namespace
