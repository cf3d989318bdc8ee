// A process that is killed at any of its file operations, or to which any of them fails, leaves a project
// that opens, with every revision in reach; so does a file system that loses the order of names.

#include "edit/manager/edit_manager.h"
#include "platform/services/config_int.h"
#include "tests/edit/manager/managed_project.h"
#include "tests/support/child_process.h"
#include "tests/support/faulty_file_system.h"

#include <gtest/gtest.h>

#include <functional>
#include <map>
#include <set>

namespace {

using test::kEdit;
using test::ManagedProject;
using Files = std::map<std::string, std::string>;
using Names = std::set<String>;

void saveRevision(const char* name) {
    ASSERT_TRUE(edit_manager::backup_edit(kEdit));
    ASSERT_TRUE(ManagedProject::save(name));
}

/// The edit files after saving "0", "1", "2" with backups between, and `undos` steps back.
Files prepare(int undos) {
    ManagedProject project;
    ManagedProject::save("0");
    saveRevision("1");
    saveRevision("2");
    for (int i = 0; i < undos; ++i) {
        EXPECT_TRUE(edit_manager::undoRequest(kEdit));
    }
    ManagedProject::stopManager();
    Files files;
    for (const auto& entry : std::filesystem::directory_iterator(std::filesystem::path(project.folder()))) {
        const std::string name = entry.path().filename().string();
        if (name.starts_with("E0001000.qme")) {
            files[name] = project.read(name);
        }
    }
    return files;
}

/// Every revision that undo and redo reach.
Names reachable() {
    Names names;
    do {
        names.insert(ManagedProject::nameOf());
    } while (edit_manager::undoRequest(kEdit));
    do {
        names.insert(ManagedProject::nameOf());
    } while (edit_manager::redoRequest(kEdit));
    return names;
}

bool includes(const Names& all, const Names& some) {
    return std::includes(all.begin(), all.end(), some.begin(), some.end());
}

struct Killing {
    const char* what;
    int undos; ///< in the preparation
    bool changes;
    std::function<bool()> action;
    Names survive; ///< what must be reached afterwards
    Names opened;  ///< what the edit may be when it opens next
    int depth = 10;
    bool damaged = false; ///< the edit file is, before the action
};

bool backUp() {
    return edit_manager::backup_edit(kEdit);
}
bool undo() {
    return edit_manager::undoRequest(kEdit);
}
bool redo() {
    return edit_manager::redoRequest(kEdit);
}
bool openAgain() {
    return ManagedProject::nameOf() == "1";
}
bool deleteIt() {
    return edit_manager::delete_edit_file_and_backups(kEdit, true);
}
bool flush() {
    return edit_manager::flush_changes();
}

class Killed : public testing::TestWithParam<Killing> {};

TEST_P(Killed, AtAnyFileOperationLosesNoRevision) {
    const Killing& killing = GetParam();
    const Files files = prepare(killing.undos);
    Qx::setConfigInt("mods_per_milestone", 1);
    Qx::setConfigInt("backup_depth", killing.depth);
    test::ChildEnd end = test::ChildEnd::Killed;
    size_t at = 1;
    for (; end == test::ChildEnd::Killed && at < 200; ++at) {
        SCOPED_TRACE(testing::Message() << killing.what << " killed at write operation " << at);
        const ManagedProject project(false);
        for (const auto& [name, bytes] : files) {
            project.write(name, killing.damaged && name == "E0001000.qme" ? bytes.substr(0, 99) : bytes);
        }
        end = test::runInChild([&] {
            ManagedProject::startManager();
            if (!killing.damaged && ManagedProject::nameOf() == "(null)") {
                return false;
            }
            if (killing.changes) {
                ManagedProject::change("new");
            }
            test::FaultyFileSystem system;
            system.killAtWrite(at);
            return killing.action();
        });
        ASSERT_NE(end, test::ChildEnd::Failed);
        ManagedProject::startManager();
        const String opened = ManagedProject::nameOf();
        EXPECT_TRUE(killing.opened.contains(opened)) << opened;
        for (const auto& entry :
             std::filesystem::directory_iterator(std::filesystem::path(project.folder()))) {
            const bool setAside = entry.path().string().find("CORRUPT") != std::string::npos;
            EXPECT_TRUE(killing.damaged || !setAside) << entry.path();
        }
        EXPECT_TRUE(includes(reachable(), killing.survive)) << testing::PrintToString(reachable());
    }
    Qx::clearConfigInt("mods_per_milestone");
    Qx::clearConfigInt("backup_depth");
    EXPECT_EQ(end, test::ChildEnd::Succeeded);
    EXPECT_GT(at, 4U) << "the action writes";
}

TEST_P(Killed, OrWithAFailureAtAnyFileOperationIsDoneOrIsAsBefore) {
    const Killing& killing = GetParam();
    const Files files = prepare(killing.undos);
    Qx::setConfigInt("backup_depth", killing.depth);
    bool failed = true;
    for (size_t at = 1; failed && at < 300; ++at) {
        SCOPED_TRACE(testing::Message() << killing.what << " with a failure at operation " << at);
        const ManagedProject project(false);
        for (const auto& [name, bytes] : files) {
            project.write(name, killing.damaged && name == "E0001000.qme" ? bytes.substr(0, 99) : bytes);
        }
        ManagedProject::startManager();
        const String before = killing.damaged ? String("1") : ManagedProject::nameOf();
        if (killing.changes) {
            ManagedProject::change("new");
        }
        bool done = false;
        {
            test::FaultyFileSystem system;
            system.failAt(at, EIO);
            done = killing.action();
            failed = system.numOperations() >= at;
            EXPECT_TRUE(done || failed);
        }
        edit_manager::close_all_edits();
        edit_manager::invalidateCache(kEdit);
        ManagedProject::startManager();
        const String opened = ManagedProject::nameOf();
        EXPECT_TRUE(killing.opened.contains(opened)) << opened;
        if (!done) {
            EXPECT_EQ(opened, killing.changes ? String("new") : before);
        }
        EXPECT_TRUE(includes(reachable(), killing.survive)) << testing::PrintToString(reachable());
    }
    Qx::clearConfigInt("backup_depth");
    EXPECT_FALSE(failed);
}

/// What a folder may hold after a crash: the names as they were at the last sync, and any of the moves and
/// deletions since.
std::set<Files> crashStates(const Files& before, const std::vector<String>& operations) {
    std::set<Files> states{before};
    std::vector<String> since;
    Files synced = before;
    const auto apply = [](Files& files, const String& operation) {
        const size_t space = operation.find(' ');
        const size_t next = operation.find(' ', space + 1);
        const auto moved = files.extract(operation.substr(space + 1, next - space - 1));
        if (!moved.empty() && next != String::npos) {
            files[operation.substr(next + 1)] = moved.mapped();
        }
    };
    for (const String& operation : operations) {
        if (operation == "sync folder") {
            for (const String& done : since) {
                apply(synced, done);
            }
            since.clear();
        } else if (operation.find("E0001000.qme") != String::npos &&
                   (operation.starts_with("rename") || operation.starts_with("remove"))) {
            since.push_back(operation);
            EXPECT_LT(since.size(), 8U);
            for (unsigned subset = 0; subset < 1U << since.size(); ++subset) {
                Files files = synced;
                for (size_t i = 0; i < since.size(); ++i) {
                    if ((subset >> i & 1U) != 0) {
                        apply(files, since[i]);
                    }
                }
                states.insert(std::move(files));
            }
        }
    }
    return states;
}

TEST(Reordered, NamesNeverLoseTheEdit) {
    const struct {
        const char* what;
        int undos;
        std::function<bool()> action;
        Names opened;
    } steps[] = {
        {"backup", 0, backUp, {"2"}},
        {"undo", 0, undo, {"1", "2"}},
        {"second undo", 1, undo, {"0", "1"}},
        {"redo", 2, redo, {"0", "1"}},
        {"delete", 0, deleteIt, {"2", "(null)"}},
        {"recovery",
         0,
         [] {
             return std::filesystem::remove(Qx::currentProject().folder() + "/E0001000.qme") &&
                    ManagedProject::nameOf() == "1";
         },
         {"0", "1"}},
    };
    for (const auto& [what, undos, action, allowed] : steps) {
        const Files files = prepare(undos);
        std::vector<String> operations;
        {
            const ManagedProject project(false);
            for (const auto& [name, bytes] : files) {
                project.write(name, bytes);
            }
            ManagedProject::startManager();
            test::FaultyFileSystem system;
            ASSERT_TRUE(action());
            operations = system.operations();
        }
        Files before = files;
        if (String(what) == "recovery") {
            before.erase("E0001000.qme");
        }
        for (const Files& state : crashStates(before, operations)) {
            std::string names;
            const ManagedProject project(false);
            for (const auto& [name, bytes] : state) {
                project.write(name, bytes);
                names += name + " ";
            }
            ManagedProject::startManager();
            const String opened = ManagedProject::nameOf();
            EXPECT_TRUE(allowed.contains(opened)) << what << ": " << opened << " of " << names;
        }
    }
}

INSTANTIATE_TEST_SUITE_P(
    Manager, Killed,
    testing::Values(Killing{"backup", 0, false, backUp, {"0", "1", "2"}, {"2"}},
                    Killing{"backup of a changed edit", 0, true, backUp, {"0", "1"}, {"2", "new"}},
                    Killing{"backup of a full chain", 0, false, backUp, {"1", "2"}, {"2"}, 2},
                    Killing{"undo", 0, false, undo, {"0", "1", "2"}, {"1", "2"}},
                    Killing{"undo of a changed edit", 0, true, undo, {"0", "1"}, {"1", "2", "new"}},
                    Killing{"second undo", 1, false, undo, {"0", "1", "2"}, {"0", "1"}},
                    Killing{"redo", 1, false, redo, {"0", "1", "2"}, {"0", "1", "2"}},
                    Killing{"redo with more to come", 2, false, redo, {"0", "1", "2"}, {"0", "1"}},
                    Killing{"recovery", 0, false, openAgain, {"0", "1"}, {"1"}, 10, true},
                    Killing{"deletion", 0, false, deleteIt, {}, {"2", "(null)"}},
                    Killing{"flush with a milestone", 0, true, flush, {"0", "1"}, {"2", "new"}}));

} // namespace
