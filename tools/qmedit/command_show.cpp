#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/edit_json.h"
#include "tools/qmedit/event_table.h"
#include "tools/qmedit/label_table.h"
#include "tools/qmedit/project_session.h"
#include "tools/qmedit/track_picture.h"

#include <limits>
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
    EditPtr edit;
    if (const Qx::Status read = session.readEdit(options.item, edit); !read) {
        return failed(read);
    }
    const EditReport report = reportOf(*edit, session.sourceNamer());
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
    const Console console = Console::forStandardOutput();
    EventTableOptions table;
    table.fitToWidth = console.terminal();
    if (options.allEvents) {
        table.eventsPerChannel = std::numeric_limits<size_t>::max();
    }
    writeOut("\n" + editSummary(report, console) + "\n");
    writeOut(trackPicture(report, console));
    writeOut(eventTable(report, console, table));
    writeOut("\n");
    return kDone;
}

void drawEdit(const EditReport& report) {
    const Console console = Console::forStandardOutput();
    writeOut("\n" + editSummary(report, console) + "\n" + trackPicture(report, console) + "\n");
}

Command showCommand() {
    const auto options = std::make_shared<ShowOptions>();
    const auto text = std::make_shared<std::string>();
    return {"show",
            "Draw the tracks of an edit and list its events",
            {cookieOption(*text),
             projectOption(options->project),
             jsonOption(options->json, "Write JSON: every pair of every channel"),
             {.name = "--events",
              .value = &options->allEvents,
              .help = "List every event, however many there are",
              .excludes = "--json"},
             {.name = "--label",
              .value = &options->labels,
              .help = "List the events with these labels at their ends: KeyKode, 24P_Timecode, reelid, ...",
              .form = "NAME"},
             {.name = "--burnin",
              .value = &options->burnIn,
              .help = "What a burnt-in display reads at this timecode",
              .form = "TIMECODE"}},
            "Example:\n  qmedit show E0001000 --events | less -R\n\n"
            "The picture is as wide as the terminal, or as $COLUMNS says.",
            [options, text] {
                return readCookie(*text, options->item) ? showEdit(*options) : static_cast<int>(kWrongUsage);
            }};
}
