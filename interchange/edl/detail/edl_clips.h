#pragma once

#include "edit/model/channel_event.h"
#include "interchange/edl/detail/edl_sources.h"
#include "interchange/edl/edl_reader.h"
#include "interchange/edl/edl_records.h"

#include <compare>
#include <optional>

namespace interchange::detail {

inline constexpr size_t kNoRecord = SIZE_MAX;
/// In the place of a source: black.
inline constexpr size_t kNoSource = SIZE_MAX;

/// A transition of an edit as a list says it.
struct ExportTransition {
    EdlType type = EdlType::Cut;
    int wipe = 0;
    int64_t length = 0;          ///< frames
    size_t outgoing = kNoSource; ///< the source of what gives way
    int64_t outgoingFrame = 0;   ///< of it, where the transition begins
    auto operator<=>(const ExportTransition&) const = default;
};

/// A span of an edit that one event line shows: a pair of one track with the transition before it, or copies of it
/// on several. Record times
/// are frames from the edit's start, source times frames from midnight.
struct ExportClip {
    EdlChannels channels = 0;
    int64_t recordIn = 0;
    int64_t recordOut = 0;
    int64_t sourceIn = 0; ///< the first frame shown
    double velocity = 1;
    size_t source = 0;
    size_t record = kNoRecord;   ///< the line of an imported list that it came from
    ExportTransition transition; ///< at its start; a cut for none

    /// The source frame that would follow the last one shown.
    [[nodiscard]] int64_t sourceNext() const;
};

/// Takes from an edit what a list can hold.
class EdlClips {
public:
    EdlClips(const Edit& edit, Qx::FrameRate rate, bool drop, int64_t start, LossReport& report);

    /// The clips of the first picture track, of A1 to A4 and of the foregrounds of keys on the second picture
    /// track, in the order of an edit list. What is left out is reported.
    [[nodiscard]] std::vector<ExportClip> collect(const std::vector<EdlRecord>& records, EdlSources& sources);

    /// A record time for a message.
    [[nodiscard]] String timeText(int64_t position) const;

private:
    /// A transition that waits for the clip to which it leads.
    struct Waiting {
        ExportTransition transition;
        int64_t recordIn = 0;
        int64_t recordOut = 0;
        double seconds = 0; ///< its length
    };

    void collectChannel(int chan, EdlChannels channel, EdlSources& sources);
    bool takePair(int chan, const channel_event& in, const channel_event& out, ExportClip& clip,
                  EdlSources& sources, const Waiting* waiting);
    [[nodiscard]] std::optional<Waiting> takeTransition(int chan, const channel_event& in,
                                                        const channel_event& out);
    void toBlack(const Waiting& waiting, EdlChannels channel, EdlSources& sources);
    void sayAsListed(ExportClip& clip) const;
    [[nodiscard]] bool leadsFrom(const cel& content, int event) const;
    [[nodiscard]] String whereIs(int chan, const channel_event& in) const;
    [[nodiscard]] bool canShow(const channel_event& in, const String& where);
    void reportEvent(const channel_event& in, const channel_event& out, const String& where);
    void reportOtherChannels(const std::vector<int>& written);
    void reportChannel(int chan);
    void reportGroups();
    int64_t frames(double seconds, const String& where, const char* what);
    void merge();

    const Edit& m_edit;
    Qx::FrameRate m_rate;
    bool m_drop;
    int64_t m_start;
    LossReport& m_report;
    const std::vector<EdlRecord>* m_records = nullptr;
    std::unordered_map<IdStamp, size_t> m_recordOf;
    std::vector<ExportClip> m_clips;
};

} // namespace interchange::detail
