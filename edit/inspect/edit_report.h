#pragma once

#include "edit/model/edit.h"
#include "platform/media/frame_rate.h"

#include <functional>
#include <vector>

/// What one edit shows, taken out of it once as plain values, from which pictures, tables and texts are made.
/// The values do not change when the edit does. Times are seconds.

/// What a pair plays.
enum class SourceKind {
    Shot,  ///< an item of the project, with a file and a name of its own
    Media, ///< picture or sound itself, as a shot plays it
    Black,
    Effect,
    Alias, ///< another channel of the edit
    Input,
    Magic ///< another magic item
};

/// One source that the pairs of an edit name.
struct SourceReport {
    cookie strip;
    SourceKind kind = SourceKind::Shot;
    String name;            ///< the item's own name, any bytes; empty for what has none
    String problem;         ///< why the name could not be read; empty if it could
    bool dropFrame = false; ///< its timecode is counted in drop frame
    String reel;            ///< the tape or file it was taken from, any bytes; empty where none is known
    String place;           ///< of an alias: `ChannelReport::place` of the channel it shows
};

/// How a pair begins where another one ends.
enum class TransitionKind { Cut, Dissolve, Wipe, Dip, CrossFade, Other };

/// One pair of a channel.
struct PairReport {
    double in = 0;
    double out = 0;
    double stripIn = 0;
    double stripOut = 0;
    double velocity = 1;
    double fadeIn = 0;  ///< length of the fade at the in point
    double fadeOut = 0; ///< and at the out point
    size_t source = 0;  ///< index into `EditReport::sources`

    /// What else an event keeps.
    struct End {
        float level = 1; ///< gain or opacity
        int code = 0;
        int curve = 0; ///< of the fade
        bool operator==(const End&) const = default;
    };
    End begin;
    End end;
    IdStamp id; ///< of its in event; it stays through trims and moves
    /// How it comes in; of a pair that is a transition itself, what it is.
    TransitionKind transition = TransitionKind::Cut;
    unsigned wipe = 0; ///< code of the pattern of a wipe
    bool isTransition = false;
    String effect; ///< of a pair that shows an effect, the name of its kind; empty for one that is not known
    String event;  ///< its number in the list that it was imported from; empty where there is none
};

struct QM_API ChannelReport {
    IdStamp id;
    String name;  ///< any bytes
    String place; ///< kind and place among those of the kind: "V1", "FX1"; "A2 levels" for A2's levels
    Edit_Chan_Type type = NoChan;
    Edit_Chan_SubType subtype = Edit_Chan_SubType::INVALID;
    std::vector<PairReport> pairs;

    [[nodiscard]] char letter() const;
    /// An audio levels channel, which has a place among the channels but no pairs.
    [[nodiscard]] bool isLevels() const { return type == NoChan; }
};

struct CueReport {
    double time = 0;
    double length = 0;
    String text; ///< any bytes
    int code = 0;
    int channel = -1; ///< index into `EditReport::channels`; -1 for any channel
    bool attached = false;
};

struct GroupReport {
    unsigned type = 0;
    std::vector<IdStamp> channels;
};

struct QM_API EditReport {
    cookie item;
    String name; ///< any bytes
    edit_log_type_t type = kLogNone;
    Qx::FrameRate rate;
    bool dropFrame = false;
    double origin = 0; ///< timecode, from midnight, of edit time 0
    double start = 0;  ///< edit time of the first event
    double end = 0;    ///< edit time at which the last event ends
    int64_t modified = 0;
    std::vector<ChannelReport> channels;
    std::vector<SourceReport> sources;
    std::vector<CueReport> cues;
    std::vector<GroupReport> groups;

    [[nodiscard]] double duration() const { return end - start; }
    /// Frames of a length or an edit time; 0 for what is not finite.
    [[nodiscard]] int64_t frames(double seconds) const;
    /// Timecode text of an edit time, of a time of a source, and of a length.
    [[nodiscard]] String recordTimecode(double editTime) const;
    [[nodiscard]] String sourceTimecode(const SourceReport& source, double stripTime) const;
    [[nodiscard]] String lengthText(double seconds) const;
};

/// Looks up what its own file says of a source: fills `name`, `dropFrame` and `reel`, or `problem`. Asked once
/// a source.
using SourceNamer = std::function<void(SourceReport&)>;

/// Takes out everything. `namer` may be empty: then no name is looked up. The edit is not changed; who shares
/// it with other threads holds its section.
[[nodiscard]] QM_API EditReport reportOf(const Edit& edit, const SourceNamer& namer);

/// "cut", "dissolve", "wipe 201", "dip", "cross-fade", "transition".
[[nodiscard]] QM_API String transitionText(const PairReport& pair);

/// `ChannelReport::place` of every channel, by index.
[[nodiscard]] QM_API std::vector<String> placesOf(const Edit& edit);
/// What an item is by its cookie; an alias, which the event tells, is left out.
[[nodiscard]] QM_API SourceKind sourceKindOf(const cookie& strip);
/// A word for the kind: "shot", "media", "black", "effect", "alias", "input", "magic".
[[nodiscard]] QM_API const char* sourceKindText(SourceKind kind);
