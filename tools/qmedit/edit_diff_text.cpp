#include "tools/qmedit/edit_diff_text.h"

#include "interchange/marker_colour.h"
#include "platform/base/num_range.h"
#include "tools/qmedit/event_table.h"
#include "tools/qmedit/track_picture.h"

#include <charconv>

using Qx::kTimeTolerance;

const char* diffKindText(DiffKind kind) {
    return kind == DiffKind::Added ? "added" : kind == DiffKind::Removed ? "removed" : "changed";
}

String levelText(float level) {
    char text[32];
    const auto [end, error] = std::to_chars(text, text + sizeof text, level);
    return error == std::errc() ? String(text, end) : String();
}

namespace {

String channelText(const ChannelDiff& channel, const EditReport& after) {
    String text = channel.name + "  " + diffKindText(channel.kind);
    for (const ChannelDiff::Span& span : channel.spans) {
        text += "  " + after.recordTimecode(span.from) + "-" + after.recordTimecode(span.to);
    }
    if (channel.kind == DiffKind::Added) {
        text += ", " + after.lengthText(channel.endAfter) + " long";
    } else if (channel.kind == DiffKind::Changed) {
        if (channel.spans.empty()) {
            text += "  only in its cuts, fades and levels";
        }
        if (std::abs(channel.endAfter - channel.endBefore) > kTimeTolerance) {
            text += "; " + after.lengthText(channel.endBefore) + " long before, " +
                    after.lengthText(channel.endAfter) + " after";
        }
    }
    return text + "\n";
}

/// What else the events of a pair keep, where it is not the usual.
String endNotes(const PairReport& pair) {
    const auto note = [](const char* what, const String& begin, const String& end) {
        return String(" (") + what + " " + begin + (begin != end ? "-" + end : String()) + ")";
    };
    const auto whole = [](int number) { return String(std::to_string(number)); };
    const PairReport::End& a = pair.begin;
    const PairReport::End& b = pair.end;
    String notes;
    if (a.level != 1 || b.level != 1) {
        notes += note("level", levelText(a.level), levelText(b.level));
    }
    if (a.curve != 0 || b.curve != 0) {
        notes += note("curve", whole(a.curve), whole(b.curve));
    }
    if (a.code != 0 || b.code != 0) {
        notes += note("code", whole(a.code), whole(b.code));
    }
    return notes;
}

String pairText(char sign, const PairReport& pair, const EditReport& report, const Console& console) {
    const SourceReport& source = report.sources[pair.source];
    String text =
        String("  ") + sign + " " + report.recordTimecode(pair.in) + "-" + report.recordTimecode(pair.out);
    if (source.kind != SourceKind::Black) {
        text += "  from " + report.sourceTimecode(source, pair.stripIn);
    }
    return text + "  " + sourceLabel(source, console) + pairNotes(report, pair) + endNotes(pair) + "\n";
}

String movedLine(const MovedRun<PairReport>& run, const EditReport& before, const Console& console) {
    const bool isNamed = run.count == 1;
    return "  > " + movedText(run, "clip", before) +
           (isNamed ? "  " + sourceLabel(before.sources[run.first.source], console) : String()) + "\n";
}

String cuesText(const EditDiff& diff) {
    return diff.cuesDiffer()
               ? String::format("cues  changed; %zu before, %zu after\n", diff.cuesBefore, diff.cuesAfter)
               : String();
}

String cueText(char sign, const CueReport& cue, const EditReport& report, const Console& console) {
    String text = String("  ") + sign + " " + report.recordTimecode(cue.time);
    if (cue.length > kTimeTolerance) {
        text += "-" + report.recordTimecode(cue.time + cue.length);
    }
    const String colour(interchange::markerColourName(cue.code));
    return text + "  " + console.safe(cue.text) + (colour.empty() ? "" : " (" + colour.lower() + ")") + "\n";
}

/// Each marker that went, came or moved.
String cueLines(const EditDiff& diff, const EditReport& before, const EditReport& after,
                const Console& console) {
    String text = cuesText(diff);
    for (const CueReport& cue : diff.cuesRemoved) {
        text += cueText('-', cue, before, console);
    }
    for (const CueReport& cue : diff.cuesAdded) {
        text += cueText('+', cue, after, console);
    }
    for (const MovedRun<CueReport>& run : diff.cuesMoved) {
        text += "  > " + movedText(run, "marker", before) +
                (run.count == 1 ? "  " + console.safe(run.first.text) : String()) + "\n";
    }
    return text;
}

} // namespace

String diffText(const EditDiff& diff, const EditReport& after) {
    String text;
    for (const ChannelDiff& channel : diff.channels) {
        text += channelText(channel, after);
    }
    return text + cuesText(diff);
}

String diffPairsText(const EditDiff& diff, const EditReport& before, const EditReport& after,
                     const Console& console) {
    String text;
    for (const ChannelDiff& channel : diff.channels) {
        text += channelText(channel, after);
        for (const PairReport& pair : channel.removed) {
            text += pairText('-', pair, before, console);
        }
        for (const PairReport& pair : channel.added) {
            text += pairText('+', pair, after, console);
        }
        for (const MovedRun<PairReport>& run : channel.moved) {
            text += movedLine(run, before, console);
        }
    }
    return text + cueLines(diff, before, after, console);
}
