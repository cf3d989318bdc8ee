#include "tools/qmedit/command_line.h"
#include "tools/qmedit/commands.h"
#include "tools/qmedit/edit_place.h"
#include "tools/qmedit/managed_edit.h"

#include "edit/editing/editor.h"
#include "edit/editing/transition_editor.h"
#include "platform/effects/special_effects.h"
#include "platform/services/edit_filenames.h"

#include <memory>

namespace {

/// Of all the actions; each takes its own.
struct TransitionArguments {
    std::string place; ///< COOKIE@TIME
    std::string kind;
    std::string length;
    std::string align;
    std::string channel = "V1";
    String project;
    bool withoutHandles = false;
    bool dryRun = false;
};

using Operation = std::function<TransitionEditor::Result(const EditPtr&, const IdStamp&, double, unsigned)>;

constexpr const char* kKinds = "dissolve, dip or wipe:CODE, as in wipe:1";

/// The effect that a kind means, on a channel of pictures or of sound; null for a text that is none.
std::unique_ptr<EffectInstance> effectOf(const String& kind, bool isSound) {
    constexpr std::string_view wipe = "wipe:";
    const String text = kind.lower();
    if (text == "dissolve") {
        return Fx::makeEffect(isSound ? Fx::kCrossFade : Fx::kDissolve);
    }
    if (text == "dip") {
        return Fx::makeEffect(Fx::kDip);
    }
    int code = 0;
    if (!text.starts_with(wipe) || !Qx::textToInt(text.substr(wipe.size()), code) || code < 0 ||
        !Wipe::Patterns::isKnown(static_cast<uint32_t>(code))) {
        return nullptr;
    }
    auto effect = Fx::makeEffect(Fx::kWipe);
    if (auto* const textured = dynamic_cast<TextureWipeEffect*>(effect.get())) {
        textured->setPatternCode(static_cast<uint32_t>(code));
    }
    return effect;
}

String checkKind(const std::string& kind) {
    return effectOf(String(kind), false) != nullptr
               ? String()
               : "'" + kind + "' is no kind of transition; write " + kKinds + ", with a code of SMPTE 258M";
}

TransitionAlign alignOf(const TransitionArguments& arguments) {
    TransitionAlign align = TransitionAlign::Centre;
    static_cast<void>(transitionAlignFromText(arguments.align, align));
    return align;
}

/// Reads "24f" or "1.5s"; 0 seconds for an empty text.
Qx::Status readLength(const String& text, const EditReport& report, double& seconds) {
    seconds = 0;
    if (text.empty()) {
        return {};
    }
    const bool hasUnit = text.back() == 'f' || text.back() == 's';
    const Qx::Status read = hasUnit ? parseEditTime(text, report, seconds) : Qx::Status();
    seconds -= report.type == kLogShot ? report.start : 0;
    if (hasUnit && read && report.frames(seconds) > 0) {
        return {};
    }
    return Qx::Status::failure(Qx::StatusCode::BadArgument,
                               "'" + text +
                                   "' is no length; write frames (24f) or seconds (1s), at least a frame");
}

/// "dissolve of 1:00 at 01:00:04:00 on V1".
String transitionLine(const EditReport& report, const ChannelReport& channel, const cel::Range& range,
                      const String& kind) {
    return kind + " of " + report.lengthText(range.length()) + " at " + report.recordTimecode(range.start()) +
           " on " + channel.place;
}

/// The transition of a channel that lies at a time; null if none does.
const PairReport* transitionAt(const ChannelReport* channel, double time) {
    for (size_t i = 0; channel != nullptr && i < channel->pairs.size(); ++i) {
        const PairReport& pair = channel->pairs[i];
        if (pair.isTransition && pair.in <= time + Qx::kTimeTolerance && time < pair.out) {
            return &pair;
        }
    }
    return nullptr;
}

/// What was done, and the edit as it is then.
struct Told {
    String line;
    EditReport after;
};

/// Performs an operation on an open edit.
Qx::Status perform(const TransitionArguments& arguments, const EditPlace& place, const char* verb,
                   const Operation& operation, const EditPtr& edit, const SourceNamer& namer, Told& told) {
    const EditReport before = reportOf(*edit, {});
    double at = 0;
    if (Qx::Status read = parseEditTime(place.in, before, at); !read) {
        return read;
    }
    const ChannelReport* const channel = findChannel(before, arguments.channel);
    if (channel == nullptr) {
        return Qx::Status::failure(Qx::StatusCode::NotFound,
                                   before.item.asString() + " has no channel '" + arguments.channel + "'");
    }
    const unsigned flags = (arguments.dryRun ? Editor::NoBackup : 0U) |
                           (arguments.withoutHandles ? TransitionEditor::WithoutHandles : 0U);
    const TransitionEditor::Result result = operation(edit, channel->id, at, flags);
    if (!result.done) {
        return Qx::Status::failure(result.reason);
    }
    told.after = reportOf(*edit, namer);
    const PairReport* pair = transitionAt(findChannel(told.after, arguments.channel), result.range.start());
    pair = pair != nullptr ? pair : transitionAt(channel, result.range.start());
    told.line = transitionLine(before, *channel, result.range,
                               pair != nullptr ? transitionText(*pair) : String("transition")) +
                " " + verb;
    if (!result.notice.empty()) {
        reportProgress(result.notice);
    }
    return {};
}

int changeTransition(const TransitionArguments& arguments, const char* verb, const Operation& operation) {
    EditPlace place;
    Qx::Status read = parsePlace(arguments.place, place);
    if (read && (place.in.empty() || !place.out.empty())) {
        read = Qx::Status::failure("a transition needs the time of its cut; write COOKIE@TIME");
    }
    if (!read) {
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
    const cookie item = managed.item();
    const std::optional<size_t> numRedo = managed.numRedo();
    Told told;
    const Qx::Status done =
        perform(arguments, place, verb, operation, edit, managed.session().sourceNamer(), told);
    if (arguments.dryRun) {
        // What was tried on the open edit goes with it.
        edit.invalidate();
        edit_manager::invalidateCache(item);
    }
    if (!done) {
        return failed(done);
    }
    if (arguments.dryRun) {
        writeOut(told.line + "\n");
        drawEdit(told.after);
        writeOut("Nothing was changed: this was a trial.\n");
        return kDone;
    }
    if (!edit_manager::flush_edit(item)) {
        const String cause = edit->lastFileError();
        return failed(Qx::Status::failure(getFilenameForCookie(item) + " could not be written: " + cause +
                                          "; " + putFileBack(item, edit)));
    }
    writeOut(item.asString() + ": " + told.line + undoText(managed, numRedo) + "\n");
    return kDone;
}

/// The effect and the length that the options name: null and 0 for those that are not there.
Qx::Status readOptions(const TransitionArguments& arguments, const EditPtr& edit, const IdStamp& chan,
                       std::unique_ptr<EffectInstance>& effect, double& length) {
    const bool isSound = edit->getChanType(edit->getIdx(chan)) == AudioChan;
    effect = arguments.kind.empty() ? nullptr : effectOf(String(arguments.kind), isSound);
    return readLength(String(arguments.length), reportOf(*edit, {}), length);
}

TransitionEditor::Result refused(const Qx::Status& status) {
    TransitionEditor::Result result;
    result.reason = status.reason();
    return result;
}

int addTransition(const TransitionArguments& arguments) {
    return changeTransition(
        arguments, "added", [&](const EditPtr& edit, const IdStamp& chan, double at, unsigned flags) {
            std::unique_ptr<EffectInstance> effect;
            double length = 0;
            if (Qx::Status read = readOptions(arguments, edit, chan, effect, length); !read) {
                return refused(read);
            }
            return TransitionEditor::add(edit, chan, at, *effect, length, alignOf(arguments), flags);
        });
}

int setTransition(const TransitionArguments& arguments) {
    if (arguments.kind.empty() && arguments.length.empty() && arguments.align.empty()) {
        reportError("say what is to change: --kind, --length or --align");
        return kWrongUsage;
    }
    return changeTransition(
        arguments, "set", [&](const EditPtr& edit, const IdStamp& chan, double at, unsigned flags) {
            std::unique_ptr<EffectInstance> effect;
            double length = 0;
            if (Qx::Status read = readOptions(arguments, edit, chan, effect, length); !read) {
                return refused(read);
            }
            return TransitionEditor::set(edit, chan, at, effect.get(), length, alignOf(arguments), flags);
        });
}

int removeTransition(const TransitionArguments& arguments) {
    return changeTransition(arguments, "removed",
                            [](const EditPtr& edit, const IdStamp& chan, double at, unsigned flags) {
                                return TransitionEditor::remove(edit, chan, at, flags);
                            });
}

using Arguments = std::shared_ptr<TransitionArguments>;

/// The options of an action: what every one has, and with `changes` what a transition is made of.
std::vector<CommandOption> optionsOf(const Arguments& arguments, bool changes, bool required) {
    std::vector<CommandOption> options = {
        {.name = "PLACE",
         .value = &arguments->place,
         .help = "The edit and the time of the cut, or a time within the transition: COOKIE@TIME",
         .required = true,
         .completes = Completes::Items}};
    if (changes) {
        options.push_back({.name = "--kind",
                           .value = &arguments->kind,
                           .help = String("What it is: ") + kKinds,
                           .form = "KIND",
                           .required = required,
                           .check = checkKind});
        options.push_back({.name = "--length",
                           .value = &arguments->length,
                           .help = "How long it is: frames (24f) or seconds (1s)",
                           .form = "LENGTH",
                           .required = required});
        options.push_back({.name = "--align",
                           .value = &arguments->align,
                           .help = "Where it lies about the cut: start, centre or end there (else centre)",
                           .form = "ALIGN",
                           .choices = {"start", "centre", "end"}});
    }
    if (changes) {
        options.push_back({.name = "--without-handles",
                           .value = &arguments->withoutHandles,
                           .help = "Do not ask whether the clips' shots hold the material that it needs"});
    }
    options.push_back({.name = "--channel",
                       .value = &arguments->channel,
                       .help = "The channel, as V1 or A2 (else V1)",
                       .form = "CHANNEL"});
    options.push_back(projectOption(arguments->project));
    options.push_back(dryRunOption(arguments->dryRun));
    return options;
}

} // namespace

Command transitionCommand() {
    const auto add = std::make_shared<TransitionArguments>();
    const auto set = std::make_shared<TransitionArguments>();
    const auto remove = std::make_shared<TransitionArguments>();
    const Command addAction{
        "add", "Lay a transition over a cut", optionsOf(add, true, true),
        "Example:\n  qmedit transition add E0001000@10:00:05:00 --kind dissolve --length 24f\n\n"
        "A cut is meant from any time within half a frame of it. What the clips' material does not suffice "
        "for is "
        "refused. A shot that a list made holds what the list plays, though its material may have more: then "
        "--without-handles helps.",
        [add] { return addTransition(*add); }};
    const Command setAction{"set", "Change the transition at a time", optionsOf(set, true, false),
                            "Example:\n  qmedit transition set E0001000@10:00:05:00 --kind wipe:1\n\n"
                            "What is not named stays.",
                            [set] { return setTransition(*set); }};
    const Command removeAction{"remove", "Take out the transition at a time", optionsOf(remove, false, false),
                               "Example:\n  qmedit transition remove E0001000@10:00:05:00\n\n"
                               "Its clips meet in its middle.",
                               [remove] { return removeTransition(*remove); }};
    return {"transition",
            "Add, change and remove transitions between clips",
            {},
            "Example:\n  qmedit transition add E0001000@10:00:05:00 --kind dissolve --length 24f\n\n"
            "'qmedit help transition add' tells all of an action. 'qmedit undo' takes each back.",
            {},
            {addAction, setAction, removeAction}};
}
