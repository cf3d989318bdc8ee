#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"

#include "platform/services/files.h"

#include <CLI/CLI.hpp>

#include <cstdlib>
#include <filesystem>
#include <memory>
#include <vector>

namespace {

constexpr const char* kExample = "market_day.edl";

/// The example, where the program is installed or else where it was built.
Qx::Status findExample(String& path) {
    std::error_code code;
    const std::filesystem::path program = std::filesystem::read_symlink("/proc/self/exe", code);
    std::vector<std::filesystem::path> folders;
    if (!code) {
        folders.push_back(program.parent_path().parent_path() / "share" / "quillmarch" / "examples");
    }
    folders.emplace_back(QMEDIT_EXAMPLES_IN_TREE);
    for (const std::filesystem::path& folder : folders) {
        path = (folder / kExample).string();
        if (Qx::fileExists(path)) {
            return {};
        }
    }
    return Qx::Status::failure("the example " + String(kExample) + " is neither in " +
                               folders.front().string() +
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

int runDemo(String project) {
    ImportOptions importing;
    if (const Qx::Status found = findExample(importing.file); !found) {
        return failed(found);
    }
    if (project.empty()) {
        if (const Qx::Status made = makeFolder(project); !made) {
            return failed(made);
        }
    }
    importing.project = project;

    reportProgress("Importing " + importing.file);
    ShowOptions showing;
    if (const int code = importFile(importing, showing.item); code != kDone) {
        return code;
    }
    showing.project = project;
    reportProgress("Saved as edit " + showing.item.asString() + " in " + project + "; read back from there:");
    if (const int code = showEdit(showing); code != kDone) {
        return code;
    }
    writeOut("The project is kept in " + project +
             ". To look further:\n"
             "  qmedit list --project " +
             project +
             "\n"
             "  qmedit show " +
             showing.item.asString() + " --events --project " + project +
             "\n"
             "  qmedit show " +
             showing.item.asString() + " --json --project " + project + "\n");
    return kDone;
}

} // namespace

void addDemoCommand(CLI::App& app, CommandWork& work) {
    const auto project = std::make_shared<String>();
    CLI::App* command = app.add_subcommand("demo", "Import an example, save it, read it back and show it");
    addProjectOption(*command, *project);
    command->footer(
        "Example:\n  qmedit demo\n\n"
        "Without --project a fresh folder is made for temporary files; it is kept, and named at the end.");
    command->callback([project, &work] { work = [project] { return runDemo(*project); }; });
}
