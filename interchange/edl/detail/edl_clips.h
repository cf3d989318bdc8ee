#pragma once

#include "edit/model/channel_event.h"
#include "interchange/edl/detail/edl_sources.h"
#include "interchange/edl/edl_reader.h"
#include "interchange/edl/edl_records.h"

namespace interchange::detail {

inline constexpr size_t kNoRecord = SIZE_MAX;

/// A span of an edit that one event line shows: a pair of one track, or copies of it on several. Record times
/// are frames from the edit's start, source times frames from midnight.
struct ExportClip {
    EdlChannels channels = 0;
    int64_t recordIn = 0;
    int64_t recordOut = 0;
    int64_t sourceIn = 0; ///< the first frame shown
    double velocity = 1;
    size_t source = 0;
    size_t record = kNoRecord; ///< the line of an imported list that it came from

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
    void collectChannel(int chan, EdlChannels channel, EdlSources& sources);
    bool takePair(int chan, const channel_event& in, const channel_event& out, ExportClip& clip,
                  EdlSources& sources);
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
    std::unordered_map<IdStamp, size_t> m_recordOf;
    std::vector<ExportClip> m_clips;
};

} // namespace interchange::detail
