#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/edit_json.h"
#include "tools/qmedit/event_table.h"
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
    cookie item;
    if (const Qx::Status found = session.findItem(options.item, item); !found) {
        return failed(found);
    }
    EditPtr edit;
    if (const Qx::Status read = session.readEdit(item, edit); !read) {
        return failed(read);
    }
    const EditReport report = reportOf(*edit, session.sourceNamer());
    reportMissingShots(report);
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
    return {"show",
            "Draw the tracks of an edit and list its events",
            {cookieOption(options->item),
             projectOption(options->project),
             jsonOption(options->json, "Write JSON: every pair of every channel"),
             {.name = "--events",
              .value = &options->allEvents,
              .help = "List every event, however many there are",
              .excludes = "--json"}},
            "Example:\n  qmedit show E0001000 --events | less -R\n\n"
            "The picture is as wide as the terminal, or as $COLUMNS says.",
            [options] { return showEdit(*options); }};
}
