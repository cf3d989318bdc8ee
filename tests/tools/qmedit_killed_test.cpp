#include "tests/support/faulty_file_system.h"
#include "tests/tools/qmedit_fixture.h"
#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"

#include "edit/manager/edit_manager.h"
#include "platform/services/current_project.h"

#include <fcntl.h>
#include <filesystem>
#include <sys/wait.h>
#include <unistd.h>

namespace fs = std::filesystem;

namespace {

using Words = std::vector<std::string>;

/// Commands over a file system that signals, kills or fills up at a chosen operation. Each attack starts from
/// the same project: an edit with an undo and a redo backup, and its two shots.
class QmeditKilled : public Qmedit {
protected:
    struct End {
        int code = 0; ///< as of `ProgramResult`
        String out;
        String err;
        size_t operations = 0;
        size_t writes = 0;
    };
    using Plan = std::function<void(test::FaultyFileSystem&)>;

    void SetUp() override {
        m_item = imported(kShortList);
        for (const char* name : {"Second", "Third"}) {
            inProject([&] {
                ASSERT_TRUE(edit_manager::backup_edit(cookie(m_item)));
                edit_manager::openEdit(cookie(m_item), eOpenExisting)->setName(name);
                ASSERT_TRUE(edit_manager::flush_changes());
            });
        }
        ASSERT_EQ(run({"undo", m_item}).code, 0);
        fs::rename(project().c_str(), pristine());
        m_commands = {{"apply", "remove", "--to", m_item + "@1s-2s"},
                      {"backup", m_item},
                      {"undo", m_item},
                      {"redo", m_item},
                      {"recover", m_item, "--from", "U1"},
                      {"delete", m_item},
                      {"import", folder.path("list.edl"), "--new-shots"}};
    }

    void restart() {
        fs::remove_all(project().c_str());
        fs::copy(pristine(), project().c_str(), fs::copy_options::recursive);
    }

    /// Runs a command in a child process over a file system with a plan.
    End attacked(Words words, const Plan& plan) {
        words.insert(words.begin(), "qmedit");
        words.insert(words.end(), {"--project", project()});
        const std::string base = folder.path("child");
        std::fflush(nullptr);
        const pid_t child = ::fork();
        if (child == 0) {
            for (const auto& [stream, name] : {std::pair(stdout, ".out"), std::pair(stderr, ".err")}) {
                if (std::freopen((base + name).c_str(), "w", stream) == nullptr) {
                    ::_exit(99);
                }
            }
            std::setvbuf(stderr, nullptr, _IONBF, 0);
            test::FaultyFileSystem disk;
            plan(disk);
            routeLibraryLog();
            const int code = runCommandLine(allCommands(), static_cast<int>(words.size()),
                                            test::detail::pointers(words).data());
            std::ofstream(base + ".count") << disk.numOperations() << ' ' << disk.numWrites();
            ::_exit(code);
        }
        int status = 0;
        ::waitpid(child, &status, 0);
        End end;
        end.code = WIFEXITED(status) ? WEXITSTATUS(status) : 1000 + WTERMSIG(status);
        end.out = folder.read("child.out");
        end.err = folder.read("child.err");
        std::ifstream(base + ".count") >> end.operations >> end.writes;
        return end;
    }
    End plain(const Words& words) {
        return attacked(words, [](test::FaultyFileSystem&) {});
    }

    /// The edits of the project, but for the clipboard, with what tells their states apart; a mark at each
    /// that does not read.
    std::string state() {
        std::string text;
        inProject([&] {
            for (const fs::path& path : files(".qme")) {
                const String name(path.stem().string());
                if (cookie(std::string_view(name)).isClipboard()) {
                    continue;
                }
                EditPtr edit(new Edit);
                const bool reads =
                    edit->read_file(cookie(std::string_view(name)), eOpenExisting) == Edit::kReadOk;
                text +=
                    name + (reads ? String::format(" %s %.3f; ", edit->getName().c_str(), edit->getEndTime())
                                  : String(" UNREADABLE; "));
            }
        });
        return text;
    }
    std::vector<fs::path> files(const std::string& extension) const {
        std::vector<fs::path> found;
        for (const auto& entry : fs::directory_iterator(fs::path(project().c_str()) / "P0001000")) {
            if (entry.path().extension() == extension) {
                found.push_back(entry.path());
            }
        }
        std::sort(found.begin(), found.end());
        return found;
    }
    [[nodiscard]] size_t numLeftovers() const {
        return files(".tmp").size() + files(".pending").size() + files(".RECOVERY").size();
    }

    template <class Work>
    void inProject(const Work& work) {
        Qx::CurrentProject current = Qx::currentProject();
        current.rootFolder = project();
        current.project = cookie("P0001000");
        Qx::setCurrentProject(current);
        const auto manager = std::make_unique<edit_manager>();
        work();
    }
    [[nodiscard]] std::string pristine() const { return folder.path("pristine"); }

    String m_item;
    std::vector<Words> m_commands;
};

TEST_F(QmeditKilled, ASignalAtAnyOperationLeavesTheStateBeforeOrAfter) {
    for (const Words& command : m_commands) {
        restart();
        const std::string before = state();
        const size_t operations = plain(command).operations;
        const std::string after = state();
        ASSERT_GT(operations, 10u);
        size_t finished = 0;
        for (size_t n = 1; n <= operations; ++n) {
            restart();
            const End end =
                attacked(command, [n](test::FaultyFileSystem& disk) { disk.signalAt(n, SIGTERM); });
            const std::string found = state();
            const std::string where =
                command[0] + " signalled at operation " + std::to_string(n) + ": " + end.err;
            EXPECT_EQ(end.code, 128 + SIGTERM) << where;
            EXPECT_TRUE(end.err.find("interrupted") != String::npos) << where;
            ASSERT_TRUE(found == before || found == after) << where << found;
            EXPECT_EQ(numLeftovers(), 0u) << where;
            finished += found == after ? 1 : 0;
        }
        EXPECT_GT(finished, 0u) << command[0];
    }
}

TEST_F(QmeditKilled, WhatAKilledCommandLeftIsGoneAfterTheNextThatWrites) {
    for (const Words& command : m_commands) {
        restart();
        const std::string before = state();
        const size_t writes = plain(command).writes;
        const std::string after = state();
        for (size_t n = 1; n <= writes; ++n) {
            restart();
            const End end = attacked(command, [n](test::FaultyFileSystem& disk) { disk.killAtWrite(n); });
            ASSERT_EQ(end.code, 1000 + SIGKILL);
            const End next = plain({"backup", command[0] == "delete" ? "E0001000" : m_item});
            const std::string found = state();
            const std::string where = command[0] + " killed at write operation " + std::to_string(n) + ": ";
            EXPECT_EQ(next.code, 0) << where << next.err;
            ASSERT_TRUE(found == before || found == after) << where << found;
            EXPECT_EQ(numLeftovers(), 0u) << where;
        }
    }
}

TEST_F(QmeditKilled, AFullDiskIsARefusalThatNamesFileAndCause) {
    for (const Words& command : {m_commands[0], m_commands[1]}) {
        size_t refused = 0;
        for (size_t room = 0;; room += 4096) {
            restart();
            const std::string before = state();
            const End end = attacked(command, [room](test::FaultyFileSystem& disk) { disk.fullAfter(room); });
            if (end.code == 0) {
                break;
            }
            const std::string where = command[0] + " with room for " + std::to_string(room) + ": " + end.err;
            ++refused;
            EXPECT_TRUE(end.err.find(m_item + ".qme: No space left") != String::npos) << where;
            ASSERT_EQ(state(), before) << where;
            EXPECT_EQ(files(".R1").size(), 1u) << where;
            EXPECT_EQ(files(".U1").size(), 1u) << where;
            EXPECT_EQ(plain(command).code, 0) << where;
        }
        EXPECT_GT(refused, 2u) << command[0];
    }
}

TEST_F(QmeditKilled, AFileThatIsAwayIsReadFromItsBackupAndRestoredByWhatWrites) {
    restart();
    const fs::path file = fs::path(project().c_str()) / "P0001000" / (m_item + ".qme").c_str();
    fs::rename(file, file.string() + ".U1");
    for (const Words& command : {Words{"list"}, Words{"show", m_item}, Words{"header", m_item, "NAME"}}) {
        const End end = plain(command);
        EXPECT_EQ(end.code, 0) << end.err;
        EXPECT_TRUE(end.out.find("Second") != String::npos && end.out.find("damaged") == String::npos)
            << end.out;
        EXPECT_TRUE(lines(end.err) == 1 && end.err.find("undo backup 1") != String::npos) << end.err;
        EXPECT_FALSE(fs::exists(file)) << "nothing is moved";
    }
    const End end = plain(m_commands[0]);
    EXPECT_EQ(end.code, 0) << end.err;
    EXPECT_TRUE(fs::exists(file)) << end.err;
    EXPECT_EQ(plain({"undo", m_item}).code, 0);
    EXPECT_TRUE(state().find("Second 10.000") != std::string::npos) << state();
}

TEST_F(QmeditKilled, VerifyTellsOfLeftoversAndCleansThem) {
    restart();
    const size_t writes = plain(m_commands.back()).writes;
    size_t cleaned = 0;
    for (size_t n = 1; n <= writes; ++n) {
        restart();
        const std::string before = state();
        static_cast<void>(
            attacked(m_commands.back(), [n](test::FaultyFileSystem& disk) { disk.killAtWrite(n); }));
        const size_t left = numLeftovers();
        const std::string found = state();
        const End told = plain({"verify"});
        EXPECT_EQ(told.err.find("left over: ") != String::npos, left > 0) << told.err;
        EXPECT_EQ(state(), found) << "telling changes nothing";
        const End clean = plain({"verify", "--clean"});
        EXPECT_EQ(clean.code, 0) << clean.err;
        EXPECT_EQ(numLeftovers(), 0u) << n;
        cleaned += found != before && state() == before ? 1 : 0;
    }
    EXPECT_GT(cleaned, 0u) << "shots without a sequence were there";
}

} // namespace
