#include "tools/qmedit/column_table.h"
#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/edit_json.h"
#include "tools/qmedit/project_session.h"
#include "tools/qmedit/revision_text.h"

#include "platform/media/timecode.h"
#include "platform/services/files.h"

#include <algorithm>
#include <memory>

namespace {

/// So many files take long enough to be read that a record is worth a word.
constexpr size_t kManyFiles = 2000;

struct ListOptions {
    String project;
    String type;
    bool json = false;
};

/// The rows of the table, each with one text a column; a damaged edit has its reason in the last.
std::vector<String> cells(const ListedEdit& edit, const Console& console) {
    if (!edit.damage.empty()) {
        return {edit.item.asString(), "damaged", "-", "-", "-", "-", console.safe(edit.damage)};
    }
    return {edit.item.asString(),
            edit.type.empty() ? "-" : edit.type,
            edit.rate.valid() ? edit.rate.asString() : "-",
            Qx::durationText(edit.rate.toFrames(edit.duration), edit.rate, false),
            String(std::to_string(edit.channels)),
            localTimeText(edit.modified),
            console.safe(edit.name)};
}

String listTable(const std::vector<ListedEdit>& edits, const Console& console) {
    constexpr bool rightAligned[] = {false, false, true, true, true, false, false};
    ColumnTable table({"cookie", "type", "rate", "duration", "chans", "modified", "name"}, rightAligned);
    for (const ListedEdit& edit : edits) {
        table.add(cells(edit, console), edit.damage.empty() ? Console::Ink::None : Console::Ink::Warning);
    }
    return table.text(console, true);
}

int runList(const ListOptions& options) {
    ProjectSession session(options.project);
    if (const Qx::Status opened = session.openExisting(); !opened) {
        return failed(opened);
    }
    std::vector<ListedEdit> edits;
    std::vector<String> others;
    if (const Qx::Status listed = session.list(edits, others); !listed) {
        return failed(listed);
    }
    for (const String& name : others) {
        reportWarning(Qx::joinPath(session.folder(), name) + " is passed over: its name is no cookie");
    }
    if (Console::errorsToTerminal() && session.numRead() >= kManyFiles) {
        reportProgress(String::format("%zu files were read; 'qmedit flush' makes a record of them, so that "
                                      "the next listing is quick",
                                      session.numRead()));
    }
    if (!options.type.empty()) {
        std::erase_if(
            edits, [&](const ListedEdit& edit) { return edit.damage.empty() && edit.type != options.type; });
    }
    if (options.json) {
        writeOut(listJson(edits));
    } else if (!edits.empty()) {
        writeOut(listTable(edits, Console::forStandardOutput()));
    } else {
        reportProgress("the project " + session.root() + " holds no edit" +
                       (options.type.empty() ? "" : " of that type"));
    }
    return kDone;
}

} // namespace

Command listCommand() {
    const auto options = std::make_shared<ListOptions>();
    return {"list",
            "List the edits of a project",
            {projectOption(options->project),
             jsonOption(options->json, "Write JSON"),
             {.name = "--type",
              .value = &options->type,
              .help = "Only items of a type, and damaged files",
              .form = "TYPE",
              .choices = {"edit", "shot", "ghost", "magic", "reel", "FXT"}}},
            "Example:\n  qmedit list --project ~/feature --type edit\n\n"
            "A file that cannot be read is listed as damaged, with the reason.",
            [options] { return runList(*options); }};
}
