#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/edit_json.h"
#include "tools/qmedit/managed_edit.h"
#include "tools/qmedit/revisions.h"
#include "tools/qmedit/safe_text.h"

#include <CLI/CLI.hpp>

#include <algorithm>
#include <memory>

namespace {

struct HistoryArguments : EditArguments {
    bool json = false;
};

std::vector<String> cells(const Revision& revision, const Console& console) {
    return {console.safe(revision.which), localTimeText(revision.time), String(std::to_string(revision.size)),
            revision.isSound() ? String(std::to_string(revision.modifications)) : String("-"),
            revision.isSound() ? (revision.change.empty() ? String("-") : console.safe(revision.change))
                               : "damaged: " + console.safe(revision.damage)};
}

int runHistory(const HistoryArguments& arguments) {
    cookie item;
    if (!readCookie(arguments.item, item)) {
        return kWrongUsage;
    }
    ProjectSession session(arguments.project);
    if (const Qx::Status opened = session.openExisting(); !opened) {
        return failed(opened);
    }
    session.manage();
    const std::vector<Revision> revisions = revisionsOf(item);
    if (revisions.empty()) {
        return failed(Qx::Status::failure("there is no edit " + item.asString() + " in the project " +
                                          session.root() + "; 'qmedit list' shows those there are"));
    }
    writeOut(arguments.json ? historyJson(item, revisions)
                            : revisionTable(revisions, Console::forStandardOutput()));
    return kDone;
}

} // namespace

String revisionTable(const std::vector<Revision>& revisions, const Console& console) {
    constexpr bool rightAligned[] = {false, false, true, true, false};
    std::vector<std::vector<String>> rows = {{"which", "changed", "bytes", "count", "last change"}};
    for (const Revision& revision : revisions) {
        rows.push_back(cells(revision, console));
    }
    std::vector<int> widths(rows.front().size());
    for (const auto& row : rows) {
        for (size_t i = 0; i + 1 < row.size(); ++i) {
            widths[i] = std::max(widths[i], safe_text::columns(row[i]));
        }
    }
    String out;
    for (size_t r = 0; r < rows.size(); ++r) {
        String line;
        for (size_t i = 0; i + 1 < widths.size(); ++i) {
            line += safe_text::padded(rows[r][i], widths[i], "", rightAligned[i]) + "  ";
        }
        line += rows[r].back();
        const bool damaged = r > 0 && !revisions[r - 1].isSound();
        const bool itself = r > 0 && revisions[r - 1].kind == Revision::Itself;
        out += console.inked(r == 0    ? Console::Ink::Dim
                             : damaged ? Console::Ink::Warning
                             : itself  ? Console::Ink::Bold
                                       : Console::Ink::None,
                             line) +
               "\n";
    }
    return out;
}

void addHistoryCommand(CLI::App& app, CommandWork& work) {
    const auto arguments = std::make_shared<HistoryArguments>();
    CLI::App* command =
        app.add_subcommand("history", "List the states of an edit: its backups, milestones, damaged files");
    addEditArguments(*command, *arguments);
    command->add_flag("--json", arguments->json, "Write JSON: an object with the states");
    command->footer("Example:\n  qmedit history E0001000\n\n"
                    "Newest first: what redo brings back (R), the edit, what undo goes back to (U), then "
                    "milestones (M) and what was set aside as CORRUPT. 'qmedit recover' takes one of them.");
    command->callback([arguments, &work] { work = [arguments] { return runHistory(*arguments); }; });
}
