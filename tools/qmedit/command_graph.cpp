#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/edit_place.h"
#include "tools/qmedit/project_session.h"
#include "tools/qmedit/seen_text.h"

#include <memory>

namespace {

struct GraphArguments {
    std::string place; ///< COOKIE@TIME
    std::string channel;
    String project;
    bool json = false;
    bool dot = false;
};

/// The stamp of a channel by its place ("V1", in any case); the null stamp for no name.
Qx::Status readChannel(const EditReport& report, const String& place, IdStamp& track) {
    if (place.empty()) {
        return {};
    }
    if (const ChannelReport* const channel = findChannel(report, place)) {
        track = channel->id;
        return {};
    }
    return Qx::Status::failure(Qx::StatusCode::NotFound,
                               report.item.asString() + " has no channel '" + place + "'");
}

/// With names as a terminal may have them.
SeenReport printable(SeenReport seen) {
    const Console console = Console::forStandardOutput();
    for (SeenNode& node : seen.nodes) {
        node.name = console.safe(node.name);
        node.source.name = console.safe(node.source.name);
    }
    return seen;
}

int runGraph(const GraphArguments& arguments) {
    EditPlace place;
    Qx::Status read = parsePlace(arguments.place, place);
    if (read && (place.in.empty() || !place.out.empty())) {
        read = Qx::Status::failure(Qx::StatusCode::BadArgument,
                                   "'" + arguments.place + "' names no time; write COOKIE@TIME");
    }
    if (!read) {
        reportError(read.reason());
        return kWrongUsage;
    }
    ProjectSession session(arguments.project);
    if (Qx::Status opened = session.openExisting(); !opened) {
        return failed(opened);
    }
    EditPtr edit;
    IdStamp track;
    double time = 0;
    read = session.findItem(place.name, place.item);
    read = read ? session.readEdit(place.item, edit) : read;
    if (!read) {
        return failed(read);
    }
    const EditReport report = reportOf(*edit, {});
    read = parseEditTime(place.in, report, time);
    read = read ? readChannel(report, arguments.channel, track) : read;
    if (!read) {
        return failed(read);
    }
    session.manage(); // nested edits are opened by their cookies
    const SeenReport seen = seenAt(edit, time, track, session.sourceNamer());
    if (!seen.isWhole) {
        reportWarning(String::format("only the first %zu places are shown", kMostSeenNodes));
    }
    writeOut(arguments.json ? seenJson(seen) : arguments.dot ? seenDot(seen) : seenText(printable(seen)));
    return kDone;
}

} // namespace

Command graphCommand() {
    const auto arguments = std::make_shared<GraphArguments>();
    return {"graph",
            "Tell what is seen and heard at a time, down to the material",
            {{.name = "COOKIE@TIME",
              .value = &arguments->place,
              .help = "The edit, by cookie or name, and the time: a timecode, frames (24f) or seconds (1s)",
              .required = true,
              .completes = Completes::Items},
             {.name = "--channel",
              .value = &arguments->channel,
              .help = "Only what this channel shows, such as V1",
              .form = "CHANNEL"},
             projectOption(arguments->project),
             jsonOption(arguments->json, "Write JSON: an array of places, each before its inputs"),
             {.name = "--dot",
              .value = &arguments->dot,
              .help = "Write a graph for Graphviz",
              .excludes = "--json"}},
            "Example:\n  qmedit graph E0001000@01:00:04:12 --channel V1",
            [arguments] { return runGraph(*arguments); }};
}
