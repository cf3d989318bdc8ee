#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"

#include "platform/services/files.h"

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <memory>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>
#include <vector>

namespace {

/// An example, where the program is installed or else where it was built.
Qx::Status findExample(const char* name, String& path) {
    std::error_code code;
    const std::filesystem::path program = std::filesystem::read_symlink("/proc/self/exe", code);
    std::vector<std::filesystem::path> folders;
    if (!code) {
        folders.push_back(program.parent_path().parent_path() / "share" / "quillmarch" / "examples");
    }
    folders.emplace_back(QMEDIT_EXAMPLES_IN_TREE);
    for (const std::filesystem::path& folder : folders) {
        path = (folder / name).string();
        if (Qx::askFile(path).isRegular()) {
            return {};
        }
    }
    return Qx::Status::failure("the example " + String(name) + " is neither in " + folders.front().string() +
                               " nor in the source tree; install qmedit again with its share folder");
}

/// A fresh folder for the demo's project.
Qx::Status makeFolder(String& folder) {
    std::error_code code;
    const std::filesystem::path base = std::filesystem::temp_directory_path(code);
    std::string name = ((code ? std::filesystem::path("/tmp") : base) / "quillmarch-demo-XXXXXX").string();
    if (::mkdtemp(name.data()) == nullptr) {
        return Qx::Status::failure("cannot make a folder for the demo like " + name +
                                   "; name one with --project DIR");
    }
    folder = name;
    return {};
}

/// Runs this program once more, as a user would, with the command written above what it says.
int runStep(const std::vector<String>& arguments) {
    String shown = "\n$ qmedit";
    std::vector<char*> words;
    String program = "qmedit";
    words.push_back(program.data());
    std::vector<String> kept = arguments;
    for (String& argument : kept) {
        shown += " " + argument;
        words.push_back(argument.data());
    }
    words.push_back(nullptr);
    writeOut(shown + "\n");
    std::fflush(stdout);
    pid_t child = 0;
    int status = 0;
    if (::posix_spawn(&child, "/proc/self/exe", nullptr, nullptr, words.data(), environ) != 0 ||
        ::waitpid(child, &status, 0) != child) {
        return failed(Qx::Status::failure("the program could not be started for the next step of the demo"));
    }
    return WIFEXITED(status) ? WEXITSTATUS(status) : static_cast<int>(kFailed);
}

/// Imports one of the examples and says so.
int importExample(const char* name, const String& project, cookie& item) {
    ImportOptions importing;
    importing.project = project;
    String file;
    if (const Qx::Status found = findExample(name, file); !found) {
        return failed(found);
    }
    importing.files = {file};
    reportProgress("Importing " + file);
    const int code = importFile(importing, item);
    if (code == kDone) {
        reportProgress("Saved as edit " + item.asString() + " in " + project);
    }
    return code;
}

/// The typical request: material of one edit replaces a span of another and comes in by a wipe, which is kept,
/// taken back and brought again, and goes out to other tools.
int runDemo(String project) {
    if (project.empty()) {
        if (const Qx::Status made = makeFolder(project); !made) {
            return failed(made);
        }
    }
    cookie day;
    cookie evening;
    int code = importExample("market_day.edl", project, day);
    if (code == kDone) {
        code = importExample("market_evening.edl", project, evening);
    }
    ::setenv("QMEDIT_PROJECT", project.c_str(), 1);
    const String list = Qx::joinPath(project, "market_day_recut.edl");
    const std::vector<std::vector<String>> steps = {
        {"show", day.asString()},
        {"show", evening.asString()},
        {"apply", "replace", "--from", evening.asString() + "@5s-9s", "--to", day.asString() + "@01:00:42:00",
         "--channels", "V"},
        {"transition", "add", day.asString() + "@01:00:42:00", "--kind", "wipe:1", "--length", "1s",
         "--align", "end"},
        {"show", day.asString()},
        {"flush"},
        {"undo", day.asString()},
        {"redo", day.asString()},
        {"history", day.asString()},
        {"export", day.asString(), list},
    };
    for (const std::vector<String>& step : steps) {
        if (code == kDone) {
            code = runStep(step);
        }
    }
    if (code != kDone) {
        return code;
    }
    writeOut("\nThe project is kept in " + project + ". To look further:\n" +
             "  export QMEDIT_PROJECT=" + project + "\n  qmedit list\n  qmedit show " + day.asString() +
             " --events\n  qmedit show " + day.asString() + " --json\n");
    return kDone;
}

} // namespace

Command demoCommand() {
    const auto project = std::make_shared<String>();
    return {"demo",
            "Import two examples, cut one into the other, lay a wipe, undo, redo, export",
            {projectOption(*project)},
            "Example:\n  qmedit demo\n\n"
            "Without --project a fresh folder is made for temporary files; it is kept, and named at the end.",
            [project] { return runDemo(*project); }};
}
