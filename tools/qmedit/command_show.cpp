#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/edit_json.h"
#include "tools/qmedit/event_numbers.h"
#include "tools/qmedit/event_table.h"
#include "tools/qmedit/label_table.h"
#include "tools/qmedit/project_session.h"
#include "tools/qmedit/track_picture.h"

#include <memory>

namespace {

/// One warning for the shots that could not be read, naming the first.
void reportMissingShots(const EditReport& report) {
    size_t count = 0;
    const SourceReport* first = nullptr;
    for (const SourceReport& source : report.sources) {
        if (!source.problem.empty() && count++ == 0) {
            first = &source;
        }
    }
    if (first == nullptr) {
        return;
    }
    const String more = count > 1 ? String::format(" (and %zu more)", count - 1) : String();
    reportWarning("the shot " + first->strip.asString() + more + " has no name here: " + first->problem);
}

} // namespace

int showEdit(const ShowOptions& options) {
    ProjectSession session(options.project);
    if (const Qx::Status opened = session.openExisting(); !opened) {
        return failed(opened);
    }
    cookie item;
    if (const Qx::Status found = session.findItem(options.item, item); !found) {
        return failed(found);
    }
    EditPtr edit;
    if (const Qx::Status read = session.readEdit(item, edit); !read) {
        return failed(read);
    }
    EditReport report = reportOf(*edit, session.sourceNamer());
    addEventNumbers(report, *edit);
    reportMissingShots(report);
    if (!options.labels.empty() || !options.burnIn.empty()) {
        EventLabels labels(*edit, [&session](const cookie& strip) {
            EditPtr source;
            return session.readEdit(strip, source) ? source : EditPtr();
        });
        return showLabels(report, options, labels);
    }
    if (options.json) {
        writeOut(editJson(report));
        return kDone;
    }
    const Console console = Console::forStandardOutput(options.console);
    writeOut("\n" + editSummary(report, console) + "\n");
    writeOut(trackPicture(report, console));
    writeOut(eventTable(report, console, options.allEvents));
    writeOut("\n");
    return kDone;
}

void drawEdit(const EditReport& report) {
    const Console console = Console::forStandardOutput();
    writeOut("\n" + editSummary(report, console) + "\n" + trackPicture(report, console) + "\n");
}

Command showCommand() {
    const auto options = std::make_shared<ShowOptions>();
    std::vector<CommandOption> given = {
        cookieOption(options->item),
        projectOption(options->project),
        jsonOption(options->json, "Write JSON: every pair of every channel"),
        {.name = "--events",
         .value = &options->allEvents,
         .help = "List every event, however many there are, with its number in an imported list and its reel",
         .excludes = "--json"},
        {.name = "--label",
         .value = &options->labels,
         .help = "List the events with these labels at their ends: KeyKode, 24P_Timecode, reelid, ...",
         .form = "NAME"},
        {.name = "--burnin",
         .value = &options->burnIn,
         .help = "What a burnt-in display reads at this timecode",
         .form = "TIMECODE"}};
    for (CommandOption& option : options->console.options()) {
        given.push_back(std::move(option));
    }
    return {"show", "Draw the tracks of an edit and list its events", std::move(given),
            "Example:\n  qmedit show E0001000 --events --colour always | less -R\n\n"
            "On a terminal, and with --width or --colour always, lines are no longer than the width.",
            [options] { return showEdit(*options); }};
}
