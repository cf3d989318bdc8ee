#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/edit_diff.h"
#include "tools/qmedit/project_session.h"

#include "platform/services/files.h"

#include <CLI/CLI.hpp>

#include <memory>

namespace {

struct DiffOptions {
    std::string before;
    std::string after;
    String project;
    bool json = false;
};

/// Reads an edit by its cookie from the project, else a file by its path.
Qx::Status readItem(const ProjectSession& session, const String& name, bool hasProject, EditPtr& edit) {
    const cookie item(name, true);
    if (item.isStorable() && hasProject) {
        return session.readEdit(item, edit);
    }
    if (!Qx::fileExists(name)) {
        return Qx::Status::failure("'" + name + "' is neither a cookie of the project nor a file");
    }
    const WString path = Qx::widen(name);
    EditPtr read(new Edit);
    const QxEditFileType type = getEditFileTypeFromFileName(path);
    const bool named = cookie(Qx::withoutExtension(Qx::fileNameOf(name)), true).isStorable();
    if (type == kUnknownFile || (type != kLegacyTextFile && !named)) {
        return Qx::Status::failure("'" + name +
                                   "' is not named as an edit file is: a cookie and .qme, .ED3 or .ED2");
    }
    if (!(type == kLegacyTextFile ? read->readFromLegacyFile(path)
                                  : read->readFile(path, eOpenExisting) == Edit::kReadOk)) {
        return Qx::Status::failure(read->lastFileError());
    }
    edit = read;
    return {};
}

int runDiff(const DiffOptions& options) {
    ProjectSession session(options.project);
    const bool hasProject = session.exists();
    if (hasProject) {
        if (const Qx::Status opened = session.openExisting(); !opened) {
            return failed(opened);
        }
    }
    EditPtr edits[2];
    const String names[2] = {options.before, options.after};
    EditReport reports[2];
    for (size_t i = 0; i < 2; ++i) {
        if (const Qx::Status read = readItem(session, names[i], hasProject, edits[i]); !read) {
            return failed(read);
        }
        reports[i] = reportOf(*edits[i], {});
    }
    const EditDiff diff = diffOf(reports[0], reports[1]);
    if (options.json) {
        writeOut(diffJson(diff, reports[0], reports[1]));
    } else {
        writeOut(diff.same() ? String("the same\n") : diffText(diff, reports[1]));
    }
    return kDone;
}

} // namespace

void addDiffCommand(CLI::App& app, CommandWork& work) {
    const auto options = std::make_shared<DiffOptions>();
    CLI::App* command = app.add_subcommand("diff", "Tell where two edits differ");
    command->add_option("BEFORE", options->before, "An edit of the project, or an edit file")
        ->required()
        ->type_name("COOKIE|FILE");
    command->add_option("AFTER", options->after, "The edit to compare with it")
        ->required()
        ->type_name("COOKIE|FILE");
    addProjectOption(*command, options->project);
    command->add_flag("--json", options->json, "Write JSON");
    command->footer(
        "Example:\n  qmedit diff E0001000 /backup/E0001000.qme\n\n"
        "Channels are compared by kind and place: V2 with V2. The exit code is 0 whether they differ or "
        "not; the output is 'the same' when they do not.");
    command->callback([options, &work] { work = [options] { return runDiff(*options); }; });
}
