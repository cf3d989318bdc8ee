#include "tests/tools/qmedit_fixture.h"

#include "edit/manager/edit_manager.h"
#include "edit/manager/edit_manager_lock.h"
#include "edit/project/permissions_manager.h"
#include "platform/services/current_project.h"

#include <csignal>
#include <filesystem>
#include <future>
#include <sys/wait.h>
#include <unistd.h>

namespace fs = std::filesystem;

namespace {

class QmeditRevisions : public Qmedit {
protected:
    [[nodiscard]] fs::path projectFolder() const { return fs::path(project().c_str()) / "P0001000"; }
    [[nodiscard]] fs::path fileOf(const String& item, const std::string& more = {}) const {
        return projectFolder() / (item + ".qme" + more).c_str();
    }
    static std::string bytesOf(const fs::path& path) {
        std::ifstream file(path, std::ios::binary);
        return {std::istreambuf_iterator<char>(file), {}};
    }
    static void put(const fs::path& path, const std::string& bytes) {
        fs::create_directories(path.parent_path());
        std::ofstream(path, std::ios::binary) << bytes;
    }

    /// Does what an editor does with the edits of the project, as a process of its own would.
    template <class Work>
    void edited(const Work& work) {
        Qx::CurrentProject current = Qx::currentProject();
        current.rootFolder = project();
        current.project = cookie("P0001000");
        Qx::setCurrentProject(current);
        const auto manager = std::make_unique<edit_manager>();
        work();
    }
    /// Keeps the edit as a backup, then gives it another name.
    void renamed(const String& item, const String& name) {
        edited([&] {
            ASSERT_TRUE(edit_manager::backup_edit(cookie(item)));
            edit_manager::openEdit(cookie(item), eOpenExisting)->setName(name);
            ASSERT_TRUE(edit_manager::flush_changes());
        });
    }
    String nameOf(const String& item) { return shown(item).at("name").get<std::string>(); }

    /// The line that a command which has to work prints.
    String done(std::vector<std::string> arguments) {
        const test::ProgramResult result = run(std::move(arguments));
        EXPECT_EQ(result.code, 0) << result.err;
        return result.out;
    }
    /// The error of a command that has to fail.
    String refused(std::vector<std::string> arguments) {
        const test::ProgramResult result = run(std::move(arguments));
        EXPECT_EQ(result.code, 1) << result.out;
        EXPECT_EQ(result.out, "");
        return result.err;
    }
    std::vector<nlohmann::json> history(const String& item) {
        return nlohmann::json::parse(done({"history", item, "--json"})).at("revisions");
    }
    std::string whiches(const String& item) {
        std::string text;
        for (const auto& revision : history(item)) {
            text += (text.empty() ? "" : " ") + revision.at("which").get<std::string>() +
                    (revision.at("damaged").is_null() ? "" : "!");
        }
        return text;
    }
};

bool has(const String& text, const std::string& part) {
    return text.find(part) != String::npos;
}

TEST_F(QmeditRevisions, UndoAndRedoStepThroughTheChanges) {
    const String item = imported(kShortList);
    EXPECT_TRUE(has(refused({"undo", item}), "qmedit backup " + item)) << "says what makes a backup";
    EXPECT_TRUE(has(refused({"redo", item}), "nothing to redo"));
    renamed(item, "Second");
    renamed(item, "Third");
    EXPECT_EQ(whiches(item), "edit U1 U2");
    EXPECT_EQ(history(item)[0].at("change"), "name");
    EXPECT_EQ(history(item)[1].at("name"), "Second");

    String line = done({"undo", item});
    EXPECT_TRUE(has(line, "undid 'name'") && has(line, "1 to undo, 1 to redo")) << line;
    EXPECT_EQ(lines(line), 1u);
    EXPECT_EQ(nameOf(item), "Second");
    done({"undo", item});
    EXPECT_EQ(nameOf(item), "Short");
    EXPECT_EQ(whiches(item), "R2 R1 edit");
    done({"redo", item});
    line = done({"redo", item});
    EXPECT_TRUE(has(line, "redid 'name'") && has(line, "2 to undo, 0 to redo")) << line;
    EXPECT_EQ(nameOf(item), "Third");
}

TEST_F(QmeditRevisions, UndoTellsWhichOperationItTookBack) {
    const String item = imported(kShortList);
    const auto before = shown(item).at("channels");
    done({"apply", "remove", "--to", item + "@1s-2s"});
    EXPECT_NE(shown(item).at("channels"), before);
    EXPECT_TRUE(has(done({"undo", item}), "undid 'remove'"));
    EXPECT_EQ(shown(item).at("channels"), before);
    EXPECT_TRUE(has(done({"redo", item}), "redid 'remove'"));
}

TEST_F(QmeditRevisions, ABackupLeavesTheEditInItsPlace) {
    const String item = imported(kShortList);
    renamed(item, "Second");
    done({"undo", item});
    const std::string before = bytesOf(fileOf(item));
    const String line = done({"backup", item});
    EXPECT_TRUE(has(line, "1 redo backup went")) << line;
    EXPECT_EQ(whiches(item), "edit U1");
    EXPECT_EQ(bytesOf(fileOf(item, ".U1")), before);
    EXPECT_EQ(nameOf(item), "Short");
    done({"undo", item});
    EXPECT_EQ(nameOf(item), "Short");
}

TEST_F(QmeditRevisions, AnUnreadableEditIsOpenedFromItsBackupAndTheUserIsTold) {
    const String item = imported(kShortList);
    renamed(item, "Second");
    renamed(item, "Third");
    put(fileOf(item), "no edit");
    const String told = refused({"undo", item});
    EXPECT_TRUE(has(told, item + ".qme.CORRUPT; undo backup 1 was opened in its place")) << told;
    EXPECT_TRUE(has(told, "nothing was undone")) << "that was a step back already\n" << told;
    EXPECT_EQ(nameOf(item), "Second");
    EXPECT_EQ(whiches(item), "edit U1 CORRUPT!");

    fs::remove(fileOf(item, ".U1"));
    put(fileOf(item), "no edit");
    EXPECT_TRUE(has(refused({"backup", item}), "no undo backup of it can be read"));
    EXPECT_TRUE(has(done({"list"}), "qmedit history " + item)) << "what is left of it is listed";
    EXPECT_TRUE(has(refused({"recover", item}), "qmedit salvage"));
    EXPECT_EQ(bytesOf(fileOf(item, ".CORRUPT.1")), "no edit");
    fs::remove(fileOf(item, ".CORRUPT"));
    fs::remove(fileOf(item, ".CORRUPT.1"));
    for (const std::string command : {"undo", "redo", "backup", "recover", "history", "delete"}) {
        EXPECT_TRUE(has(refused({command, item}), "qmedit list")) << command;
    }
}

TEST_F(QmeditRevisions, RecoverTakesTheNewestSoundStateAndKeepsWhatItReplaces) {
    const String item = imported(kShortList);
    const std::string first = bytesOf(fileOf(item));
    const fs::path milestone = projectFolder() / "Milestones" / item.c_str() / (item + ".3").c_str();
    put(milestone, first);
    put(milestone.parent_path() / (item + ".4").c_str(), first.substr(0, first.size() / 2));
    renamed(item, "Second");
    renamed(item, "Third");
    const std::string third = bytesOf(fileOf(item));
    const auto before = snapshot();

    const test::ProgramResult listed = run({"recover", item});
    EXPECT_EQ(listed.code, 0);
    EXPECT_TRUE(has(listed.out, "M3") && !has(listed.out, "M4") && has(listed.err, "nothing was changed"));
    EXPECT_TRUE(has(refused({"recover", item, "--from", "M4"}), "damaged"));
    EXPECT_TRUE(has(refused({"recover", item, "--from", "U7"}), "qmedit history"));
    auto after = snapshot();
    after.erase("P0001000/Edits.lock");
    auto expected = before;
    expected.erase("P0001000/Edits.lock");
    EXPECT_EQ(after, expected);

    done({"recover", item, "--from", "m3"});
    EXPECT_EQ(bytesOf(fileOf(item)), first);
    EXPECT_EQ(bytesOf(fileOf(item, ".U1")), third) << "what it was";
    EXPECT_EQ(bytesOf(milestone), first);
    done({"recover", item, "--from", "U1"});
    EXPECT_EQ(nameOf(item), "Third");

    put(fileOf(item), "no edit");
    put(fileOf(item, ".CORRUPT"), "an earlier one");
    EXPECT_TRUE(has(done({"recover", item}), "recovered from U"));
    EXPECT_EQ(nameOf(item), "Third");
    EXPECT_EQ(bytesOf(fileOf(item, ".CORRUPT.1")), "no edit");
    EXPECT_EQ(bytesOf(fileOf(item, ".CORRUPT")), "an earlier one");
    EXPECT_FALSE(fs::exists(fileOf(item, ".RECOVERY")));
}

TEST_F(QmeditRevisions, WhatMayNotBeReadOrChangedStaysAsItIs) {
    const String item = imported(kShortList);
    renamed(item, "Second");
    edited([&] { ASSERT_TRUE(PermissionsManager::setReadOnly(cookie(item), true)); });
    const std::string whole = bytesOf(fileOf(item));
    for (const std::string command : {"backup", "undo", "redo", "recover", "delete"}) {
        EXPECT_TRUE(has(refused({command, item}), "read-only")) << command;
    }
    EXPECT_TRUE(has(refused({"delete", item, "--force"}), "read-only"));
    EXPECT_EQ(whiches(item), "edit U1");
    EXPECT_EQ(bytesOf(fileOf(item)), whole);

    // A link is not followed, and not replaced either.
    edited([&] { ASSERT_TRUE(PermissionsManager::setReadOnly(cookie(item), false)); });
    fs::rename(fileOf(item), folder.path("elsewhere.qme").c_str());
    fs::create_symlink(folder.path("elsewhere.qme").c_str(), fileOf(item));
    EXPECT_TRUE(has(refused({"recover", item}), "cannot be read here"));
    EXPECT_TRUE(has(refused({"recover", item, "--from", "U1"}), "cannot be read here"));
    EXPECT_TRUE(fs::is_symlink(fileOf(item)));
}

TEST_F(QmeditRevisions, DeleteRefusesWhatAnEditPlaysAndTellsWhatGoes) {
    const String item = imported(kShortList);
    renamed(item, "Second");
    const fs::path milestone = projectFolder() / "Milestones" / item.c_str() / (item + ".3").c_str();
    put(milestone, bytesOf(fileOf(item)));
    EXPECT_TRUE(has(refused({"delete", "E0001000"}), "played by " + item));
    done({"delete", "E0001000", "--force"});
    EXPECT_FALSE(fs::exists(fileOf("E0001000")));

    const std::string whole = bytesOf(fileOf(item));
    put(fileOf(item), "no edit");
    EXPECT_TRUE(has(refused({"delete", "E0002000"}), item + " (which cannot be read")) << "it may play it";
    put(fileOf(item), whole);

    const test::ProgramResult result = run({"delete", item});
    EXPECT_EQ(result.code, 0) << result.err;
    EXPECT_TRUE(has(result.err, "'Second'") && has(result.err, ".qme.U1")) << result.err;
    EXPECT_FALSE(fs::exists(fileOf(item)) || fs::exists(fileOf(item, ".U1")));
    done({"recover", item});
    EXPECT_EQ(nameOf(item), "Second") << "from its milestone";
}

TEST_F(QmeditRevisions, TheRecordOfTheProjectChangesNoListing) {
    const String item = imported(kShortList);
    renamed(item, "Second");
    const fs::path record = projectFolder() / "Project.db";
    const auto listings = [&] { return std::pair(done({"list"}), done({"list", "--json"})); };
    fs::remove(record);
    const auto expected = listings();
    EXPECT_FALSE(fs::exists(record)) << "a listing makes no record";

    EXPECT_EQ(done({"flush"}), "3 edits recorded\n");
    EXPECT_EQ(listings(), expected);
    put(record, "no record at all, but long enough to be looked at");
    const test::ProgramResult result = run({"list"});
    EXPECT_TRUE(has(result.err, "Project.db.DAMAGED")) << result.err;
    EXPECT_EQ(result.out, expected.first);
    EXPECT_EQ(listings(), expected);

    // What changed, came or went since is told as the files have it.
    fs::copy_file(fileOf(item), fileOf("E0009000"));
    put(fileOf("E0001000"), "no edit");
    fs::remove(fileOf("E0002000"));
    const auto changed = listings();
    EXPECT_EQ(listings(), changed);
    fs::remove(record);
    EXPECT_EQ(listings(), changed);
    EXPECT_EQ(lines(changed.first), 4u);
    fs::create_directory(record);
    EXPECT_EQ(listings(), changed) << "no record can be had";
    EXPECT_TRUE(has(refused({"flush"}), "Project.db"));
}

TEST_F(QmeditRevisions, TwoProcessesLoseNothingOfEachOther) {
    const String item = imported(kShortList);
    const int64_t length = shown(item).at("duration");
    // Each takes a frame out of the edit, four times over.
    const auto shortened = [&] {
        int made = 0;
        for (int i = 0; i < 4; ++i) {
            made += run({"apply", "remove", "--to", item + "@5f-6f"}).code == 0 ? 1 : 0;
        }
        return made;
    };
    auto other = std::async(std::launch::async, shortened);
    const int made = shortened() + other.get();
    EXPECT_GT(made, 0);
    EXPECT_EQ(shown(item).at("duration"), length - made) << "each change that was told of is there";
    EXPECT_EQ(history(item).size(), static_cast<size_t>(made) + 1) << "and the state before each";
    EXPECT_EQ(run({"verify"}).code, 0);
}

TEST_F(QmeditRevisions, AHolderOfTheLockIsNamedAndADeadOneDoesNotBlock) {
    const String item = imported(kShortList);
    int ready[2];
    ASSERT_EQ(::pipe(ready), 0);
    const pid_t holder = ::fork();
    if (holder == 0) {
        EditManagerLock lock((String(projectFolder().string())));
        const char taken = lock.take() ? 'y' : 'n';
        static_cast<void>(!::write(ready[1], &taken, 1));
        for (;;) {
            ::pause();
        }
    }
    char taken = 0;
    ASSERT_EQ(::read(ready[0], &taken, 1), 1);
    ASSERT_EQ(taken, 'y');
    const std::vector<std::vector<std::string>> writers = {
        {"backup", item}, {"delete", item}, {"recover", item}, {"apply", "remove", "--to", item + "@1s-2s"}};
    for (const std::vector<std::string>& writer : writers) {
        const String error = refused(writer);
        EXPECT_TRUE(has(error, "process " + std::to_string(holder)) && has(error, "try again")) << error;
    }
    EXPECT_TRUE(has(done({"list"}), item)) << "reading needs no lock";
    ::kill(holder, SIGKILL);
    ::waitpid(holder, nullptr, 0);
    ::close(ready[0]);
    ::close(ready[1]);
    done({"backup", item});
}

} // namespace
