#pragma once

#include "interchange/edl/detail/edl_bad_lines.h"
#include "interchange/edl/detail/edl_line.h"
#include "interchange/edl/detail/edl_note.h"
#include "platform/media/timecode.h"

namespace interchange::detail {

/// One reading of one list, line by line. Used once and thrown away.
class EdlReader {
public:
    EdlReader(Qx::FrameRate rate, LossReport& report, BadLines bad) : m_report(report), m_bad(bad) {
        m_list.rate = rate;
    }

    Qx::Status read(std::string_view text);
    [[nodiscard]] EdlList& list() { return m_list; }

private:
    /// A warning that a list deserves once, however often its cause occurs.
    enum Once { kNotUtf8, kNoDropFrame, kSourceTable, kOnceCount };

    Qx::Status readLine(std::string_view whole);
    Qx::Status readEvent(std::string_view line);
    Qx::Status readTimes(const EdlLine& parsed, EdlEvent& event);
    Qx::Status readTime(std::string_view text, Qx::TimecodeFields& fields, int64_t& count);
    [[nodiscard]] bool resolveDrop(bool dropSeparator, bool nonDropSeparator);
    void pairWithLineBefore(EdlEvent& event);
    bool readStatement(std::string_view line);

    void readNote(std::string_view line);
    void applyNote(const Note& note);
    void keepNote(std::string_view line);
    void nameFrom(std::string_view name);
    void nameTo(std::string_view name);
    void applySourceFile(std::string_view name);
    void applyFullReel(std::string_view value);
    void applyAudio(std::string_view value);
    void applySpeed(std::string_view value);
    void applyMarker(std::string_view value);
    void placeSpeeds();
    void giveSpeed(EdlEvent& event, EdlSpeed speed);

    Qx::Status finish();
    Qx::Status finishEvent(EdlEvent& event);
    void dropEvents(const std::vector<bool>& isBad);
    void checkSplits();

    [[nodiscard]] bool paired() const;
    [[nodiscard]] EdlEvent& last() { return m_list.events.back(); }
    [[nodiscard]] EdlEvent& outgoing() { return m_list.events[m_list.events.size() - 2]; }
    [[nodiscard]] Qx::Status failure(int line, const String& what) const;
    void warnOnce(Once once, const String& what);

    struct Split {
        int line;
        size_t event;
        String value;
    };

    LossReport& m_report;
    BadLines m_bad;
    EdlBadLines m_badLines;
    EdlList m_list;
    int m_line = 0;
    bool m_titleSeen = false;
    bool m_dropFrame = false; ///< what the last FCM set
    bool m_inSourceTable = false;
    bool m_skipsNotes = false; ///< below a line that cannot be read
    bool m_warned[kOnceCount] = {};
    bool m_nameIsFrom = false;        ///< the B side bears the name of a FROM note, for want of a TO
    bool m_sourceForIncoming = false; ///< the next SOURCE FILE is the B side's
    std::vector<EdlSpeed> m_speeds;   ///< of the pair being read
    std::vector<Split> m_splits;
    size_t m_splitsPlaced = 0; ///< how many stand with the event below them
    std::vector<std::string_view> m_fields;
    String m_converted; ///< the line being read, where it is not UTF-8
};

} // namespace interchange::detail
