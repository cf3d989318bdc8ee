#include "tools/qmedit/column_table.h"
#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/edit_json.h"
#include "tools/qmedit/edit_place.h"
#include "tools/qmedit/managed_edit.h"

#include "edit/model/cue_list.h"
#include "edit/model/edit.h"
#include "interchange/marker_colour.h"

#include <algorithm>
#include <memory>
#include <numeric>

namespace {

/// Of all the actions; each takes its own.
struct MarkerArguments {
    std::string place; ///< COOKIE, or COOKIE@IN[-OUT]
    std::string text;
    std::string colour;
    std::vector<std::string> numbers;
    String project;
    bool attach = false;
    bool json = false;
};

/// The places in the edit's list of the markers, in the order in which they are numbered: by time.
std::vector<size_t> inOrder(const Edit& edit) {
    const cue_list& cues = edit.get_cues();
    std::vector<size_t> places(cues.get_num_cue_points(0));
    std::iota(places.begin(), places.end(), size_t{0});
    std::stable_sort(places.begin(), places.end(), [&](size_t a, size_t b) {
        return *cues.get_cue_point(a, 0) < *cues.get_cue_point(b, 0);
    });
    return places;
}

/// Reads the numbers of markers; `places` gets their places in the edit's list.
Qx::Status readNumbers(const MarkerArguments& arguments, const Edit& edit, std::vector<size_t>& places) {
    const std::vector<size_t> all = inOrder(edit);
    for (const std::string& text : arguments.numbers) {
        int number = 0;
        if (!Qx::textToInt(text, number) || number < 1 || static_cast<size_t>(number) > all.size()) {
            return Qx::Status::failure(
                Qx::StatusCode::NotFound,
                "there is no marker '" + String(text) + "' in " + edit.get_cookie_str() + ", which has " +
                    std::to_string(all.size()) + "; 'qmedit marker list' numbers them");
        }
        places.push_back(all[static_cast<size_t>(number) - 1]);
    }
    return {};
}

/// The times of a place in an edit; one of a moment has them equal.
Qx::Status readTimes(const EditPlace& place, const Edit& edit, double& in, double& out) {
    const EditReport report = reportOf(edit, {});
    if (place.in.empty()) {
        return Qx::Status::failure(Qx::StatusCode::BadArgument,
                                   "a marker needs a time; write COOKIE@IN, or COOKIE@IN-OUT for a span");
    }
    if (Qx::Status read = parseEditTime(place.in, report, in); !read) {
        return read;
    }
    out = in;
    if (Qx::Status read = place.out.empty() ? Qx::Status() : parseEditTime(place.out, report, out); !read) {
        return read;
    }
    if (out < in) {
        std::swap(in, out);
    }
    return {};
}

Vector<cel*> celsOf(Edit& edit) {
    Vector<cel*> cels;
    for (int i = 0; i < edit.getNumChans(); ++i) {
        cels.push_back(edit.get_edit_cel_p(i));
    }
    return cels;
}

/// "01:00:05:00 first words".
String markerText(const Edit& edit, const cue_point& cue) {
    return reportOf(edit, {}).recordTimecode(cue.editTime()) + " " +
           Console::forStandardOutput().safe(cue.text());
}

/// Runs an action on a managed edit. `prepare` works out the change, with every reason to refuse, and the
/// line that tells of it.
using Change = std::function<void(Edit&)>;
int changeMarkers(const MarkerArguments& arguments,
                  const std::function<Qx::Status(Edit&, const EditPlace&, Change&, String&)>& prepare) {
    EditPlace place;
    if (const Qx::Status read = parsePlace(arguments.place, place); !read) {
        reportError(read.reason());
        return kWrongUsage;
    }
    const EditArguments which{place.name, arguments.project};
    ManagedEdit managed(which);
    if (const int code = managed.prepare(); code != kDone) {
        return code;
    }
    EditPtr edit;
    if (!managed.open(edit)) {
        return kFailed;
    }
    Change change;
    String told;
    const String cookie = managed.item().asString();
    if (const Qx::Status prepared = prepare(*edit, place, change, told); !prepared) {
        return failed(prepared);
    }
    const std::optional<size_t> numRedo = managed.numRedo();
    const auto described = [&change](Edit& changed) {
        change(changed);
        changed.setChangeDescription(kCuesChanged, true);
    };
    if (const Qx::Status changed = managed.change(edit, "no marker of " + cookie + " was changed", described);
        !changed) {
        return failed(changed);
    }
    writeOut(cookie + ": " + told + undoText(managed, numRedo) + "\n");
    return kDone;
}

int addMarker(const MarkerArguments& arguments) {
    return changeMarkers(arguments, [&](Edit& edit, const EditPlace& place, Change& change, String& told) {
        double in = 0;
        double out = 0;
        if (Qx::Status read = readTimes(place, edit, in, out); !read) {
            return read;
        }
        cue_point cue(arguments.text.c_str(), in, kAnyCueChan,
                      interchange::markerColourCode(arguments.colour), celsOf(edit), arguments.attach);
        if (arguments.attach && !cue.attached()) {
            return Qx::Status::failure(Qx::StatusCode::NotFound,
                                       "there is no clip at " + place.in +
                                           " that the marker could follow; leave out --attach");
        }
        cue.setSecondTime(out);
        told = "marker added at " + markerText(edit, cue);
        change = [cue](Edit& changed) { changed.get_cues().add_cue_point(cue); };
        return Qx::Status();
    });
}

int moveMarker(const MarkerArguments& arguments) {
    return changeMarkers(arguments, [&](Edit& edit, const EditPlace& place, Change& change, String& told) {
        double in = 0;
        double out = 0;
        std::vector<size_t> places;
        if (Qx::Status read = readTimes(place, edit, in, out); !read) {
            return read;
        }
        if (Qx::Status read = readNumbers(arguments, edit, places); !read) {
            return read;
        }
        const cue_point& old = *edit.get_cues().get_cue_point(places.front(), 0);
        // One that follows a clip follows the clip that it lies on then.
        cue_point cue(old.text().c_str(), in, old.channel(), old.code(), celsOf(edit), old.attached());
        constexpr int kOfPlace = CueFlag::kAttached | CueFlag::kInside;
        cue.setFlags((old.flags() & ~kOfPlace) | (cue.flags() & kOfPlace));
        cue.setSecondTime(place.out.empty() ? in + old.secondTime() - old.editTime() : out);
        told = "marker moved from " + markerText(edit, old) + " to " + reportOf(edit, {}).recordTimecode(in);
        change = [cue, at = places.front()](Edit& changed) {
            *changed.get_cues().get_cue_point(at, 0) = cue;
        };
        return Qx::Status();
    });
}

int removeMarkers(const MarkerArguments& arguments) {
    return changeMarkers(arguments, [&](Edit& edit, const EditPlace&, Change& change, String& told) {
        std::vector<size_t> places;
        if (Qx::Status read = readNumbers(arguments, edit, places); !read) {
            return read;
        }
        told = "marker removed: " + markerText(edit, *edit.get_cues().get_cue_point(places.front(), 0)) +
               (places.size() > 1 ? String::format(" and %zu more", places.size() - 1) : String());
        change = [places](Edit& changed) {
            changed.get_cues().delete_cues_if([&](size_t at, const cue_point&) {
                return std::find(places.begin(), places.end(), at) != places.end();
            });
        };
        return Qx::Status();
    });
}

String markerTable(const EditReport& report, const Console& console) {
    constexpr bool rightAligned[] = {true, false, true, false, false, false};
    ColumnTable table({"number", "time", "length", "colour", "follows", "text"}, rightAligned);
    int number = 0;
    for (const CueReport& cue : report.cues) {
        const String colour(interchange::markerColourName(cue.code));
        table.add({String(std::to_string(++number)), report.recordTimecode(cue.time),
                   cue.length > 0 ? report.lengthText(cue.length) : String("-"),
                   colour.empty() ? String("-") : colour.lower(), cue.attached ? "clip" : "-",
                   console.safe(cue.text)},
                  Console::Ink::None);
    }
    return table.text(console, true);
}

int listMarkers(const MarkerArguments& arguments) {
    ProjectSession session(arguments.project);
    cookie item;
    EditPtr edit;
    Qx::Status status = session.openExisting();
    if (status) {
        status = session.findItem(arguments.place, item);
    }
    if (status) {
        status = session.readEdit(item, edit);
    }
    if (!status) {
        return failed(status);
    }
    const EditReport report = reportOf(*edit, {});
    if (arguments.json) {
        writeOut(markersJson(report));
    } else if (report.cues.empty()) {
        reportProgress(item.asString() + " has no marker");
    } else {
        writeOut(markerTable(report, Console::forStandardOutput()));
    }
    return kDone;
}

Command addAction(const std::shared_ptr<MarkerArguments>& arguments) {
    return {"add",
            "Add a marker",
            {{.name = "PLACE",
              .value = &arguments->place,
              .help = "The edit and the time: COOKIE@IN, or COOKIE@IN-OUT for a span",
              .required = true,
              .completes = Completes::Items},
             {.name = "TEXT", .value = &arguments->text, .help = "What it says", .required = true},
             projectOption(arguments->project),
             {.name = "--colour",
              .value = &arguments->colour,
              .help = "Its colour: red, green, blue, ...",
              .form = "COLOUR",
              .check =
                  [](const std::string& name) {
                      return interchange::markerColourCode(name) != 0
                                 ? String()
                                 : "'" + name + "' is no colour of markers";
                  },
              .completes = Completes::Colours},
             {.name = "--attach",
              .value = &arguments->attach,
              .help = "It follows the clip that it lies on when that moves"}},
            "Example:\n  qmedit marker add E0001000@10:00:05:00 'look here' --colour red\n\n"
            "'qmedit undo' takes it away.",
            [arguments] { return addMarker(*arguments); }};
}

Command moveAction(const std::shared_ptr<MarkerArguments>& arguments) {
    return {"move",
            "Move a marker",
            {{.name = "PLACE",
              .value = &arguments->place,
              .help = "The edit and where the marker goes: COOKIE@IN, or COOKIE@IN-OUT to give it a length",
              .required = true,
              .completes = Completes::Items},
             {.name = "NUMBER",
              .value = &arguments->numbers.emplace_back(),
              .help = "The marker, as 'qmedit marker list' numbers it",
              .required = true},
             projectOption(arguments->project)},
            "Example:\n  qmedit marker move E0001000@10:00:07:00 2\n\n"
            "'qmedit undo' moves it back.",
            [arguments] { return moveMarker(*arguments); }};
}

} // namespace

Command markerCommand() {
    const auto list = std::make_shared<MarkerArguments>();
    const auto remove = std::make_shared<MarkerArguments>();
    const Command listAction{"list",
                             "List the markers of an edit",
                             {cookieOption(list->place), projectOption(list->project),
                              jsonOption(list->json, "Write JSON: an array of markers")},
                             "Example:\n  qmedit marker list E0001000",
                             [list] { return listMarkers(*list); }};
    const Command removeAction{"remove",
                               "Remove markers",
                               {cookieOption(remove->place),
                                {.name = "NUMBER",
                                 .value = &remove->numbers,
                                 .help = "The markers, as 'qmedit marker list' numbers them",
                                 .required = true},
                                projectOption(remove->project)},
                               "Example:\n  qmedit marker remove E0001000 2 3\n\n"
                               "'qmedit undo' brings them back.",
                               [remove] { return removeMarkers(*remove); }};
    return {"marker",
            "List, add, move and remove markers",
            {},
            "Example:\n  qmedit marker add E0001000@10:00:05:00 'look here'\n\n"
            "'qmedit help marker add' tells all of an action.",
            {},
            {listAction, addAction(std::make_shared<MarkerArguments>()),
             moveAction(std::make_shared<MarkerArguments>()), removeAction}};
}
