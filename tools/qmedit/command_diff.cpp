#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/edit_diff_json.h"
#include "tools/qmedit/edit_diff_text.h"
#include "tools/qmedit/event_numbers.h"
#include "tools/qmedit/project_session.h"

#include "platform/services/edit_filenames.h"
#include "platform/services/files.h"

#include <memory>

namespace {

struct DiffOptions {
    std::string before;
    std::string after;
    String project;
    bool json = false;
};

/// Reads an edit of the project by its cookie or name, one of its states as "COOKIE.U1", or a file by its
/// path, whatever its name: backups, milestones and copies are edit files too. `store` becomes its file, and
/// empty where that is legacy text.
Qx::Status readItem(ProjectSession& session, const String& name, bool hasProject, EditPtr& edit,
                    String& store) {
    const bool isFile = Qx::askFile(name).isRegular();
    cookie item(name, true);
    if (hasProject && (item.isStorable() || !isFile) && session.findItem(name, item)) {
        store = ProjectSession::fileOf(item);
        return session.readEdit(item, edit);
    }
    String path = name;
    // A name may have dots too, and so has "CORRUPT.1".
    for (size_t dot = name.find('.'); hasProject && !isFile && dot != String::npos;
         dot = name.find('.', dot + 1)) {
        if (session.findItem(name.substr(0, dot), item)) {
            path = getFilenameForCookie(item) + String(name.substr(dot)).upper();
            break;
        }
    }
    if (!Qx::askFile(path).isRegular()) {
        return Qx::Status::failure("'" + name +
                                   "' is neither an edit of the project, nor a state of one such as "
                                   "E0001000.U1, nor a file");
    }
    if (getEditFileTypeFromFileName(Qx::widen(path)) == kLegacyTextFile) {
        EditPtr read(new Edit);
        if (!read->readFromLegacyFile(Qx::widen(path))) {
            return Qx::Status::failure(read->lastFileError());
        }
        edit = read;
        return {};
    }
    EditPtr read;
    if (Qx::Status status = ProjectSession::readRevision(path, read); !status) {
        return status;
    }
    const String file = Qx::fileNameOf(path);
    read->set_cookie(cookie(std::string_view(file).substr(0, file.find('.')), true));
    edit = read;
    store = path;
    return {};
}

/// Warns of the shots that are there and whose names are not known; one that is missing is told of as such
/// where it is played.
void reportUnreadable(const EditReport& report) {
    for (const SourceReport& source : report.sources) {
        if (!source.problem.empty() && !Qx::askFile(ProjectSession::fileOf(source.strip)).isMissing()) {
            reportWarning("the shot " + source.strip.asString() + " could not be read: " + source.problem);
        }
    }
}

int runDiff(const DiffOptions& options) {
    ProjectSession session(options.project);
    const bool hasProject = session.exists();
    if (const Qx::FileAnswer folder = Qx::askFile(session.folder() + "/."); folder.isUnknown()) {
        return failed(Qx::Status::failure(folder.obstacle("look at").text()));
    }
    if (hasProject) {
        if (const Qx::Status opened = session.openExisting(); !opened) {
            return failed(opened);
        }
    }
    EditPtr edits[2];
    const String names[2] = {options.before, options.after};
    EditReport reports[2];
    EditContent contents[2];
    for (size_t i = 0; i < 2; ++i) {
        String store;
        if (Qx::Status read = readItem(session, names[i], hasProject, edits[i], store); !read) {
            return failed(read);
        }
        reports[i] = reportOf(*edits[i], hasProject ? session.sourceNamer() : SourceNamer());
        addEventNumbers(reports[i], *edits[i]);
        reportUnreadable(reports[i]);
        contents[i] = contentOf(*edits[i], reports[i]);
        const Qx::Status added = store.empty() ? Qx::Status() : addObjects(contents[i], reports[i], store);
        if (!added) {
            return failed(added);
        }
    }
    const EditDiff diff = diffOf(reports[0], reports[1]);
    const ContentDiff content = contentDiffOf(contents[0], contents[1]);
    const Console console = Console::forStandardOutput();
    if (options.json) {
        writeOut(diffJson(diff, content, reports[0], reports[1]));
    } else if (diff.same() && content.same()) {
        writeOut("the same\n");
    } else {
        writeOut(diffPairsText(diff, reports[0], reports[1], console) +
                 contentDiffText(content, reports[0], reports[1], console));
    }
    return kDone;
}

} // namespace

Command diffCommand() {
    const auto options = std::make_shared<DiffOptions>();
    return {
        "diff",
        "Tell where two edits differ",
        {{.name = "BEFORE",
          .value = &options->before,
          .help = "An edit of the project, or an edit file",
          .form = "COOKIE|FILE",
          .required = true,
          .completes = Completes::Items},
         {.name = "AFTER",
          .value = &options->after,
          .help = "The edit to compare with it",
          .form = "COOKIE|FILE",
          .required = true,
          .completes = Completes::Items},
         projectOption(options->project),
         jsonOption(options->json, "Write JSON")},
        "Example:\n  qmedit diff E0001000 /backup/E0001000.qme\n\n"
        "Channels are compared by kind and place: V2 with V2. Header properties that every save changes are "
        "left out. The exit code is 0 whether they differ or "
        "not; the output is 'the same' when they do not.",
        [options] { return runDiff(*options); }};
}
