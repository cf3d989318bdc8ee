#pragma once

#include "edit/inspect/edit_report.h"
#include "platform/store/taggable.h"

/// What is seen and heard at a time, from the top down to the material, as plain values. Times are seconds.

/// What a place of the graph is.
enum class SeenKind {
    Source,     ///< an item that is no edit, or that could not be opened; the walk ends there
    Nested,     ///< an edit, whose content follows as its only input
    Effect,     ///< over its inputs
    Transition, ///< between its inputs
    Unknown,    ///< an effect that this program cannot look into
    Black,      ///< a black event, or nothing at all
    Unwired,    ///< an input that names nothing
    TooDeep     ///< not followed further: a loop, or more levels than are followed
};

struct SeenNode {
    SeenKind kind = SeenKind::Black;
    int parent = -1;    ///< index into `SeenReport::nodes`; -1 for a root
    unsigned depth = 0; ///< levels below the root
    int input = -1;     ///< the parent's input that this is; -1 for a root and what a nested edit shows
    double share = 1; ///< how much of the input its parent shows, 0 to 1 (`EffectInstance::getInputShareAt`)
    double opacity = 1;  ///< of an effect
    double progress = 0; ///< of a transition, 0 only what goes out to 1 only what comes in
    String name;         ///< of an effect or a source, any bytes
    TagTypeId type;      ///< of an effect

    cookie edit;     ///< in which the event lies
    String place;    ///< `ChannelReport::place` of its channel there; empty without an event
    double time = 0; ///< in `edit`
    double in = 0;   ///< of the event, in `edit`
    double out = 0;
    String timecode; ///< of `time`

    SourceReport source;   ///< of a source and of a nested edit
    double sourceTime = 0; ///< in the source
    String sourceTimecode;
};

struct SeenReport {
    cookie item;
    double time = 0;
    bool isWhole = true;         ///< false where there was more than `kMostSeenNodes`
    std::vector<SeenNode> nodes; ///< each before its inputs, these in their order
};

/// The most that a report holds, and the most levels below a root.
inline constexpr size_t kMostSeenNodes = 10'000;
inline constexpr unsigned kMostSeenLevels = 100;

/// What is seen on a channel, or with a null stamp on every channel that no other shows. `namer` names the sources
/// and may be empty. Opens the edits that are nested; changes nothing.
[[nodiscard]] QM_API SeenReport seenAt(const EditPtr& edit, double time, const IdStamp& track,
                                       const SourceNamer& namer);

/// A word for the kind: "source", "edit", "effect", "transition", "unknown effect", "black", "not wired", "too
/// deep".
[[nodiscard]] QM_API const char* seenKindText(SeenKind kind);

/// A line for each node, indented by its depth:
///
///     FX1  Key  01:00:04:12
///       1.0  V1  "Market"  E0001003  01:00:04:12  plays 00:01:40:12
///       0.5  V2  Dissolve 25 %  01:00:04:12
///
/// with the share, the channel, what it is, the time in the edit and that in the source.
[[nodiscard]] QM_API String seenText(const SeenReport& report);
