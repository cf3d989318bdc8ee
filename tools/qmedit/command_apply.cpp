#include "tools/qmedit/channel_choice.h"
#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/edit_diff_text.h"
#include "tools/qmedit/edit_place.h"
#include "tools/qmedit/managed_edit.h"
#include "tools/qmedit/project_session.h"
#include "tools/qmedit/spare_room.h"
#include "tools/qmedit/suggestion.h"

#include "edit/editing/editor.h"
#include "edit/manager/edit_manager.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/files.h"

#include <cmath>
#include <memory>

namespace {

struct ApplyOptions {
    std::string operation;
    std::string to;
    std::string from;
    std::string channels;
    String project;
    bool dryRun = false;
};

/// One side of the operation.
struct Side {
    EditPlace place;
    EditPtr edit;
    EditModule module;
};

/// Marks a module as its place says. Only without any time it has a current time, its start: a region is
/// never measured from a time that nobody named.
Qx::Status markModule(Side& side) {
    const EditReport report = reportOf(*side.edit, {});
    side.module = EditModule(side.edit);
    side.module.setCurTime(side.place.in.empty() && side.place.out.empty() ? 0 : Qx::kNoTime);
    for (const auto& [text, type] : {std::pair(side.place.in, Qx::MarkTypes::InMark),
                                     std::pair(side.place.out, Qx::MarkTypes::OutMark)}) {
        double seconds = 0;
        if (text.empty()) {
            continue;
        }
        if (Qx::Status read = parseEditTime(text, report, seconds); !read) {
            return read;
        }
        side.module.markAllAt(seconds, type);
    }
    return {};
}

void reportResult(const Edit& edit, const EditReport& before, const EditReport& after, edit_operation op,
                  const Editor::Result& result) {
    const EditDiff diff = diffOf(before, after);
    writeOut(String(editOperationName(op)) + (diff.same() ? ": nothing looks different\n" : ":\n"));
    writeOut(diffText(diff, after));
    if (!result.notice().empty()) {
        writeOut("Note: " + result.notice() + ".\n");
    }
    if (!result.syncLoss()) {
        return;
    }
    for (int i = 0; i < edit.getNumChans(); ++i) {
        const double loss = edit.getSyncLoss(edit.getId(i));
        if (loss != 0) {
            writeOut(edit.getChanDisplayName(edit.getId(i)) + "  is " + after.lengthText(std::abs(loss)) +
                     (loss > 0 ? " later" : " earlier") + " than the picture\n");
        }
    }
}

Qx::Status readSides(ProjectSession& session, bool managed, bool hasSource, Side& to, Side& from) {
    for (Side* side : {&to, &from}) {
        if (side == &from && !hasSource) {
            continue;
        }
        if (Qx::Status found = session.findItem(side->place.name, side->place.item); !found) {
            return found;
        }
        const cookie& item = side->place.item;
        // The file is looked at first, so that one that does not read stays as it is. One that is away comes
        // back when the edit is opened.
        const bool isAway = managed && Qx::askFile(getFilenameForCookie(item)).isMissing() &&
                            !edit_manager::getEditFiles(item).empty();
        if (Qx::Status read = isAway ? Qx::Status() : session.readEdit(item, side->edit); !read) {
            return read;
        }
        bool wasRestored = false;
        if (managed) {
            side->edit.invalidate();
            static_cast<void>(openManaged(item, side->edit, wasRestored));
        } else if (side == &from && to.place.item == from.place.item) {
            side->edit = to.edit;
        }
        if (!side->edit.valid()) {
            return Qx::Status::failure("the edit " + side->place.item.asString() + " does not open");
        }
        if (Qx::Status marked = markModule(*side); !marked) {
            return marked;
        }
    }
    return {};
}

/// Takes the room that the changed edit can need at most, with the clipboard's.
Qx::Status takeRoom(SpareRoom& room, const Side& to, const Side& from) {
    constexpr uint64_t kMore = 65536;
    const auto sizeOf = [](const cookie& item) {
        return Qx::askFile(getFilenameForCookie(item)).info().size;
    };
    const uint64_t source = from.edit.valid() ? sizeOf(from.place.item) : 0;
    return room.take(getFilenameForCookie(to.place.item), 2 * sizeOf(to.place.item) + source + kMore);
}

/// Lets go of everything after a failure, with the files of the edit and the clipboard under their names.
String letGo(const cookie& item, Side& to, Side& from) {
    from = {};
    to.module = {};
    EditPtr clipboard;
    static_cast<void>(putFileBack(clipboard_cookie, clipboard));
    return putFileBack(item, to.edit);
}

int applyOperation(ProjectSession& session, const ApplyOptions& options, edit_operation op,
                   const ChannelChoice& channels, Side& to, Side& from) {
    if (Qx::Status read = readSides(session, !options.dryRun, !options.from.empty(), to, from); !read) {
        return failed(read);
    }
    if (!channels.isEmpty()) {
        if (const Qx::Status there = channels.check({to.edit, from.edit}); !there) {
            return failed(there);
        }
        channels.select(to.module);
        if (from.edit.valid()) {
            channels.select(from.module);
        }
    }
    const cookie item = to.place.item;
    SpareRoom room;
    if (const Qx::Status taken = options.dryRun ? Qx::Status() : takeRoom(room, to, from); !taken) {
        return failed(Qx::Status::failure("nothing was changed: " + taken.reason()));
    }
    const EditReport before = reportOf(*to.edit, session.sourceNamer());
    const unsigned flags = options.dryRun ? Editor::NoBackup : 0u;
    const Editor::Result result = Editor::apply(from.module, to.module, op, flags);
    if (!result.valid()) {
        return failed(Qx::Status::failure(result.reason() +
                                          (options.dryRun ? String() : "; " + letGo(item, to, from))));
    }
    room.giveBack();
    if (!options.dryRun && !edit_manager::flush_changes()) {
        const String cause = to.edit->lastFileError();
        return failed(Qx::Status::failure(getFilenameForCookie(item) + " could not be written" +
                                          (cause.empty() ? String() : ": " + cause) + "; " +
                                          letGo(item, to, from)));
    }
    if (!options.dryRun) {
        setOutcome(item.asString() + " was changed by " + String(editOperationName(op)));
    }
    const EditReport after = reportOf(*to.edit, session.sourceNamer());
    reportResult(*to.edit, before, after, op, result);
    drawEdit(after);
    if (options.dryRun) {
        writeOut("Nothing was changed: this was a trial.\n");
        return kDone;
    }
    return kDone;
}

int runApply(const ApplyOptions& options) {
    edit_operation op = edit_operation::NoOperation;
    Side to;
    Side from;
    if (!editOperationFromText(options.operation, op) || op == edit_operation::NoOperation) {
        std::vector<String> names;
        String all;
        for (int i = 1; i < kNumEditOperations; ++i) {
            names.emplace_back(editOperationName(static_cast<edit_operation>(i)));
            all += (all.empty() ? "" : ", ") + names.back();
        }
        reportError("'" + options.operation + "' is no operation" +
                    didYouMean(options.operation, names, "; the operations are " + all));
        return kWrongUsage;
    }
    for (const auto& [text, side] : {std::pair(&options.to, &to), std::pair(&options.from, &from)}) {
        const Qx::Status read = text->empty() ? Qx::Status() : parsePlace(*text, side->place);
        if (!read) {
            reportError(read.reason());
            return kWrongUsage;
        }
    }
    ChannelChoice channels;
    if (const Qx::Status read = ChannelChoice::parse(options.channels, channels); !read) {
        reportError(read.reason());
        return kWrongUsage;
    }
    if (editOpRequiresSourceAndDest(op) && options.from.empty()) {
        reportError(String(editOperationName(op)) + " needs a source; name it with --from COOKIE");
        return kWrongUsage;
    }
    ProjectSession session(options.project);
    if (const Qx::Status opened = session.openExisting(); !opened) {
        return failed(opened);
    }
    if (options.dryRun) {
        return applyOperation(session, options, op, channels, to, from);
    }
    if (const Qx::Status created = session.create(); !created) {
        return failed(created);
    }
    // Held until the edits are written: what another program does meanwhile comes before or after.
    if (const Qx::Status locked = session.lockForWriting(); !locked) {
        return failed(locked);
    }
    session.manage();
    const int code = applyOperation(session, options, op, channels, to, from);
    // The edits are let go before the manager closes them.
    to = {};
    from = {};
    return code;
}

} // namespace

Command applyCommand() {
    const auto options = std::make_shared<ApplyOptions>();
    return {"apply",
            "Perform an editing operation on an edit",
            {{.name = "OPERATION",
              .value = &options->operation,
              .help = "Its name or number: replace, insert, remove, lift, ...",
              .required = true,
              .completes = Completes::Operations},
             {.name = "--to",
              .value = &options->to,
              .help = "The edit that is changed, with its marks",
              .form = "COOKIE[@IN[-OUT]]",
              .required = true,
              .completes = Completes::Items},
             {.name = "--from",
              .value = &options->from,
              .help = "The source, with its marks; all of it without",
              .form = "COOKIE[@IN-OUT]",
              .completes = Completes::Items},
             {.name = "--channels",
              .value = &options->channels,
              .help = "The channels of both edits that take part, else all",
              .form = "VA1A2"},
             projectOption(options->project),
             dryRunOption(options->dryRun)},
            "Example:\n  qmedit apply insert --from E0002000@5s-8s --to E0001000@10:00:05:00\n\n"
            "A time is record timecode, frames (125f) or seconds (5s) from the edit's beginning. The edit "
            "is backed up before.",
            [options] { return runApply(*options); }};
}
