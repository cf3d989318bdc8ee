#include "interchange/edl/edl_writer.h"

#include "platform/media/timecode.h"

#include <cmath>

namespace interchange {

namespace {

constexpr const char* kDropMode = "FCM: DROP FRAME";
constexpr const char* kNonDropMode = "FCM: NON-DROP FRAME";
constexpr EdlChannels kInField = kEdlPicture | edlAudio(1) | edlAudio(2);

class EdlWriter {
public:
    EdlWriter(const EdlList& list, const EdlTextOptions& options)
        : m_list(list), m_lineEnd(options.crlf ? "\r\n" : "\n") {}

    String write() {
        addLine("TITLE: " + m_list.title);
        bool drop = !m_list.events.empty() && m_list.events.front().recordDrop;
        addLine(drop ? kDropMode : kNonDropMode);
        addLines(m_list.notes);
        for (const EdlEvent& event : m_list.events) {
            if (event.recordDrop != drop) {
                drop = event.recordDrop;
                addLine(drop ? kDropMode : kNonDropMode);
            }
            addEvent(event);
        }
        return std::move(m_text);
    }

private:
    void addLine(std::string_view line) {
        m_text += line;
        m_text += m_lineEnd;
    }

    void addLines(std::string_view lines) {
        while (!lines.empty()) {
            const size_t end = lines.find('\n');
            addLine(lines.substr(0, end));
            lines.remove_prefix(end == std::string_view::npos ? lines.size() : end + 1);
        }
    }

    void addEvent(const EdlEvent& event) {
        std::string_view notes = event.notes;
        while (notes.starts_with("SPLIT")) {
            const size_t end = notes.find('\n');
            addLine(notes.substr(0, end));
            notes.remove_prefix(end == std::string_view::npos ? notes.size() : end + 1);
        }
        String type = event.typeText();
        String duration;
        if (const size_t blank = type.find_last_of(' ');
            blank != String::npos && type.find_first_not_of("0123456789", blank + 1) == String::npos) {
            duration = type.substr(blank + 1);
            type.resize(blank);
        }
        if (event.fade) {
            type += " (F)";
        }
        String line =
            String::format("%-3s  %-8s %-5s %-4s %-3s", event.number.c_str(), event.reel.c_str(),
                           String(edlChannelText(event.channels)).c_str(), type.c_str(), duration.c_str());
        line += " " + sourceTime(event, event.sourceIn) + " " + sourceTime(event, event.sourceOut);
        line += " " + Qx::timecodeText(event.recordIn, m_list.rate, event.recordDrop);
        line += " " + Qx::timecodeText(event.recordOut, m_list.rate, event.recordDrop);
        addLine(line);
        addLines(notes);
    }

    [[nodiscard]] String sourceTime(const EdlEvent& event, int64_t frames) const {
        String text = Qx::timecodeText(frames, m_list.rate, event.sourceDrop);
        if (event.recordDrop && !event.sourceDrop) {
            text[text.size() - 3] = '.';
        }
        return text;
    }

    const EdlList& m_list;
    std::string_view m_lineEnd;
    String m_text;
};

} // namespace

String edlText(const EdlList& list, const EdlTextOptions& options) {
    return EdlWriter(list, options).write();
}

std::string_view edlChannelText(EdlChannels channels) {
    constexpr struct {
        EdlChannels channels;
        std::string_view text;
    } codes[] = {
        {kEdlPicture, "V"},
        {edlAudio(1), "A"},
        {edlAudio(2), "A2"},
        {edlAudio(1) | edlAudio(2), "AA"},
        {kEdlPicture | edlAudio(1), "B"},
        {kEdlPicture | edlAudio(2), "A2/V"},
        {kInField, "AA/V"},
    };
    for (const auto& code : codes) {
        if (code.channels == (channels & kInField)) {
            return code.text;
        }
    }
    return "NONE";
}

String edlAudioNote(EdlChannels channels) {
    String note;
    for (int number = 3; number <= kMaxEdlAudio; ++number) {
        if ((channels & edlAudio(number)) != 0) {
            note += (note.empty() ? "AUD  " : "    ") + std::to_string(number);
        }
    }
    return note;
}

String edlSpeedNote(const String& reel, const String& digits, int64_t at, Qx::FrameRate rate, bool drop) {
    return String::format("M2   %-8s      %6s                %s", reel.c_str(), digits.c_str(),
                          Qx::timecodeText(at, rate, drop).c_str());
}

String edlSpeedDigits(double velocity, Qx::FrameRate rate) {
    const long long tenths = std::llround(std::abs(velocity) * rate.nominal() * 10);
    return String::format("%s%03lld.%lld", velocity < 0 && tenths > 0 ? "-" : "", tenths / 10, tenths % 10);
}

} // namespace interchange
