// A process that is killed at any of its file operations, or to which any of them fails or any question about
// a name stays unanswered, leaves a project that opens, with every revision in reach; so does a file system
// that loses the order of names.

#include "edit/manager/edit_manager.h"
#include "platform/services/config_int.h"
#include "tests/edit/manager/managed_project.h"
#include "tests/support/every_fault.h"

#include <gtest/gtest.h>

#include <functional>
#include <map>
#include <set>

namespace {

using test::Fault;
using test::kEdit;
using test::ManagedProject;
using Files = std::map<std::string, std::string>;
using Names = std::set<String>;

std::vector<std::string> namesIn(const String& folder) {
    std::vector<std::string> names;
    for (const auto& entry : std::filesystem::directory_iterator(folder.c_str())) {
        names.push_back(entry.path().filename().string());
    }
    return names;
}

/// The edit files after saving "0", "1", "2" with backups between, and `undos` steps back.
Files prepare(int undos) {
    ManagedProject project;
    for (const char* const name : {"0", "1", "2"}) {
        EXPECT_TRUE(*name == '0' || edit_manager::backup_edit(kEdit));
        EXPECT_TRUE(ManagedProject::save(name));
    }
    for (int i = 0; i < undos; ++i) {
        EXPECT_TRUE(edit_manager::undoRequest(kEdit));
    }
    ManagedProject::stopManager();
    Files files;
    for (const std::string& name : namesIn(project.folder())) {
        if (name.starts_with("E0001000.qme")) {
            files[name] = project.read(name);
        }
    }
    return files;
}

std::unique_ptr<ManagedProject> projectOf(const Files& files) {
    auto project = std::make_unique<ManagedProject>(false);
    for (const auto& [name, bytes] : files) {
        project->write(name, bytes);
    }
    return project;
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

enum class File { Sound, Cut, Missing };

struct Action {
    const char* what;
    int undos; ///< in the preparation
    bool changes;
    std::function<bool()> act;
    Names survive; ///< what must be reached afterwards
    Names opened;  ///< what the edit may be when it opens next
    File file = File::Sound;
    int depth = 10;
    bool withQuestions = false; ///< tried with unanswered questions too
    bool withFailures = true;   ///< tried with calls that fail or kill
};

bool backUp() {
    return bool(edit_manager::backup_edit(kEdit));
}
bool undo() {
    return bool(edit_manager::undoRequest(kEdit));
}
bool redo() {
    return bool(edit_manager::redoRequest(kEdit));
}
bool openAgain() {
    return ManagedProject::nameOf() == "1";
}
bool openOrCreate() {
    const EditPtr edit(kEdit, eOpenOrCreate);
    return edit.valid() && edit->getName() == "1";
}
bool deleteIt() {
    return edit_manager::delete_edit_file_and_backups(kEdit, true);
}
bool flush() {
    return edit_manager::flush_changes();
}
bool close() {
    const bool done = backUp();
    edit_manager::close_all_edits();
    return done;
}

const Action kActions[] = {
    {"backup", 0, false, backUp, {"0", "1", "2"}, {"2"}, File::Sound, 10, true},
    {"backup of a changed edit", 0, true, backUp, {"0", "1"}, {"2", "new"}},
    {"backup of a full chain", 0, false, backUp, {"1", "2"}, {"2"}, File::Sound, 2},
    {"undo", 0, false, undo, {"0", "1", "2"}, {"1", "2"}, File::Sound, 10, true},
    {"undo of a changed edit", 0, true, undo, {"0", "1"}, {"1", "2", "new"}},
    {"second undo", 1, false, undo, {"0", "1", "2"}, {"0", "1"}},
    {"redo", 1, false, redo, {"0", "1", "2"}, {"0", "1", "2"}},
    {"redo with more to come", 2, false, redo, {"0", "1", "2"}, {"0", "1"}},
    {"recovery of a damaged file", 0, false, openAgain, {"0", "1"}, {"1"}, File::Cut},
    {"recovery of a missing file", 0, false, openAgain, {"0", "1"}, {"1"}, File::Missing, 10, true, false},
    {"recovery instead of a fresh edit",
     0,
     false,
     openOrCreate,
     {"0", "1"},
     {"1"},
     File::Missing,
     10,
     true,
     false},
    {"deletion", 0, false, deleteIt, {}, {"2", "(null)"}},
    {"closing after a backup", 0, false, close, {"0", "1", "2"}, {"2"}, File::Sound, 10, true, false},
    {"flush with a milestone", 0, true, flush, {"0", "1"}, {"2", "new"}, File::Sound, 10, true},
};

class FaultyStep : public testing::TestWithParam<Fault> {};

TEST_P(FaultyStep, LosesNoRevision) {
    const Fault fault = GetParam();
    for (const Action& action : kActions) {
        if (!(fault.kind == Fault::Unanswered ? action.withQuestions : action.withFailures)) {
            continue;
        }
        SCOPED_TRACE(action.what);
        Files files = prepare(action.undos);
        if (action.file == File::Cut) {
            files["E0001000.qme"].resize(99);
        } else if (action.file == File::Missing) {
            files.erase("E0001000.qme");
        }
        Qx::setConfigInt("mods_per_milestone", fault.kind == Fault::Killed ? 1 : 10);
        Qx::setConfigInt("backup_depth", action.depth);
        String before = "1";
        const auto act = [&](const auto& /*project*/, const auto& arm) {
            ManagedProject::startManager();
            before = action.file == File::Sound ? ManagedProject::nameOf() : before;
            if (action.changes) {
                ManagedProject::change("new");
            }
            arm();
            return before != "(null)" && action.act();
        };
        const auto check = [&](const auto& project, const test::Met& met) {
            if (fault.kind != Fault::Killed) {
                edit_manager::close_all_edits();
                edit_manager::invalidateCache(kEdit);
            }
            ManagedProject::startManager();
            const String opened = ManagedProject::nameOf();
            EXPECT_TRUE(action.opened.contains(opened)) << opened;
            if (!met.done && fault.kind != Fault::Killed) {
                EXPECT_EQ(opened, action.changes ? String("new") : before);
            }
            for (const std::string& name : namesIn(project->folder())) {
                EXPECT_TRUE(action.file == File::Cut || name.find("CORRUPT") == std::string::npos) << name;
            }
            if (fault.kind == Fault::Unanswered && met.done) {
                return;
            }
            const Names names = reachable();
            EXPECT_TRUE(
                std::includes(names.begin(), names.end(), action.survive.begin(), action.survive.end()))
                << testing::PrintToString(names);
        };
        const size_t met = test::everyFault(
            fault, [&] { return projectOf(files); }, act, check);
        EXPECT_GT(met, fault.kind == Fault::Unanswered ? 0U : 3U);
        Qx::clearConfigInt("mods_per_milestone");
        Qx::clearConfigInt("backup_depth");
    }
}

INSTANTIATE_TEST_SUITE_P(Manager, FaultyStep,
                         testing::Values(Fault{Fault::Killed}, Fault{Fault::Fails},
                                         Fault{Fault::Unanswered, ESTALE}));

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
    for (const Action& action : kActions) {
        if (action.changes || action.file == File::Cut) {
            continue;
        }
        Files files = prepare(action.undos);
        if (action.file == File::Missing) {
            files.erase("E0001000.qme");
        }
        std::vector<String> operations;
        {
            const auto project = projectOf(files);
            ManagedProject::startManager();
            test::FaultyFileSystem system;
            ASSERT_TRUE(action.act()) << action.what;
            operations = system.operations();
        }
        Names allowed = action.opened;
        allowed.insert(action.file == File::Missing ? "0" : *action.opened.begin());
        for (const Files& state : crashStates(files, operations)) {
            const auto project = projectOf(state);
            ManagedProject::startManager();
            const String opened = ManagedProject::nameOf();
            EXPECT_TRUE(allowed.contains(opened)) << action.what << ": " << opened;
        }
    }
}

} // namespace
